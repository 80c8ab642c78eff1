#include "platform/datasources/kordsk/filedescriptor.h"

#include <fcntl.h>
#include <sys/file.h>
#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>
#include <array>
#include <cerrno>
#include <system_error>
#include <utility>

#include "platform/exception/exception.h"

namespace kor::datasources
{

namespace
{

constexpr const char* kSource = "platform/datasources/kordsk/filedescriptor";
constexpr int kNewFileMode = 0666;
constexpr std::size_t kMostVectors = 512;  ///< of one call; half of what Linux takes

std::string ReasonOf(int nError)
{
    return std::generic_category().message(nError);
}

struct stat StatusOf(int nFile)
{
    struct stat oStatus = {};
    if (fstat(nFile, &oStatus) != 0)
    {
        oStatus.st_mode = 0;
    }
    return oStatus;
}

/// Takes nBytes off the front of the vectors.
std::span<iovec> Advance(std::span<iovec> oVectors, std::size_t nBytes)
{
    while (!oVectors.empty() && nBytes >= oVectors.front().iov_len)
    {
        nBytes -= oVectors.front().iov_len;
        oVectors = oVectors.subspan(1);
    }
    if (!oVectors.empty())
    {
        iovec& oFirst = oVectors.front();
        oFirst.iov_base = static_cast<unsigned char*>(oFirst.iov_base) + nBytes;
        oFirst.iov_len -= nBytes;
    }
    return oVectors;
}

}  // namespace

FileDescriptor::FileDescriptor(const std::string& oFile, int nFlags)
    // Without O_NONBLOCK, opening a pipe would wait for its other end.
    : moFile(oFile), mnFile(open(oFile.c_str(), nFlags | O_CLOEXEC | O_NONBLOCK, kNewFileMode))
{
    const int nError = errno;
    if (mnFile < 0 || !S_ISREG(StatusOf(mnFile).st_mode))
    {
        const std::string oReason = mnFile < 0 ? ReasonOf(nError) : "this is not a regular file";
        if (mnFile >= 0)
        {
            close(mnFile);
        }
        throw FileException(
            oFile + ": cannot " + ((nFlags & O_CREAT) != 0 ? "make" : "open") + " the file" +
                ((nFlags & (O_CREAT | O_RDWR)) == O_RDWR ? " for changing" : "") + ": " + oReason,
            oFile, kSource, __PRETTY_FUNCTION__, __LINE__);
    }
}

FileDescriptor::FileDescriptor(FileDescriptor&& oOther) noexcept
    : moFile(std::exchange(oOther.moFile, std::string())), mnFile(std::exchange(oOther.mnFile, -1))
{
}

FileDescriptor& FileDescriptor::operator=(FileDescriptor&& oOther) noexcept
{
    std::swap(moFile, oOther.moFile);
    std::swap(mnFile, oOther.mnFile);
    return *this;
}

FileDescriptor::~FileDescriptor()
{
    if (mnFile >= 0)
    {
        close(mnFile);
    }
}

void FileDescriptor::Throw(const std::string& oWhat, int nError) const
{
    throw IOException(moFile + ": " + oWhat + ": " + ReasonOf(nError), kSource, __PRETTY_FUNCTION__,
                      __LINE__);
}

FileIdentity FileDescriptor::GetIdentity() const
{
    const struct stat oStatus = StatusOf(mnFile);
    return {oStatus.st_dev, oStatus.st_ino};
}

std::uint64_t FileDescriptor::GetSize() const
{
    return static_cast<std::uint64_t>(StatusOf(mnFile).st_size);
}

void FileDescriptor::TransferVectors(VectorCall pCall, const char* pszWhat, std::uint64_t nOffset,
                                     std::span<iovec> oVectors) const
{
    oVectors = Advance(oVectors, 0);
    while (!oVectors.empty())
    {
        const ssize_t nDone = pCall(mnFile, oVectors.data(), static_cast<int>(oVectors.size()),
                                    static_cast<off_t>(nOffset));
        if (nDone < 0 && errno == EINTR)
        {
            continue;
        }
        if (nDone < 0)
        {
            Throw(pszWhat, errno);
        }
        if (nDone == 0)
        {
            throw IOException(moFile + ": " + pszWhat + ": the file ends at byte " +
                                  std::to_string(GetSize()) + ", before what is looked for",
                              kSource, __PRETTY_FUNCTION__, __LINE__);
        }
        nOffset += static_cast<std::uint64_t>(nDone);
        oVectors = Advance(oVectors, static_cast<std::size_t>(nDone));
    }
}

void FileDescriptor::TransferRows(VectorCall pCall, const char* pszWhat, const FileRows& oRows,
                                  unsigned char* pMemory, std::size_t nMemoryPitch) const
{
    std::array<iovec, kMostVectors> aoVectors;
    const bool bGapless = oRows.mnPitch == oRows.mnBytes;
    if (bGapless && nMemoryPitch == oRows.mnBytes)
    {
        aoVectors[0] = {pMemory, oRows.mnBytes * oRows.mnCount};
        TransferVectors(pCall, pszWhat, oRows.mnOffset, std::span(aoVectors).first(1));
        return;
    }
    const std::size_t nRowsAtOnce = bGapless ? kMostVectors : 1;
    for (std::size_t nRow = 0; nRow < oRows.mnCount; nRow += nRowsAtOnce)
    {
        const std::size_t nRows = std::min(nRowsAtOnce, oRows.mnCount - nRow);
        for (std::size_t i = 0; i < nRows; ++i)
        {
            aoVectors[i] = {pMemory + (nRow + i) * nMemoryPitch, oRows.mnBytes};
        }
        TransferVectors(pCall, pszWhat, oRows.mnOffset + nRow * oRows.mnPitch,
                        std::span(aoVectors).first(nRows));
    }
}

void FileDescriptor::ReadAt(std::uint64_t nOffset, std::span<unsigned char> oBytes) const
{
    ReadRows({nOffset, oBytes.size(), oBytes.size(), 1}, oBytes.data(), oBytes.size());
}

void FileDescriptor::WriteAt(std::uint64_t nOffset, std::span<const unsigned char> oBytes) const
{
    WriteRows({nOffset, oBytes.size(), oBytes.size(), 1}, oBytes.data(), oBytes.size());
}

void FileDescriptor::ReadRows(const FileRows& oRows, unsigned char* pMemory,
                              std::size_t nMemoryPitch) const
{
    TransferRows(preadv, "cannot read the file", oRows, pMemory, nMemoryPitch);
}

void FileDescriptor::WriteRows(const FileRows& oRows, const unsigned char* pMemory,
                               std::size_t nMemoryPitch) const
{
    // The system takes one kind of vector for both directions and does not write through this one.
    TransferRows(pwritev, "cannot write the file", oRows, const_cast<unsigned char*>(pMemory),
                 nMemoryPitch);
}

void FileDescriptor::Reserve(std::uint64_t nOffset, std::uint64_t nBytes) const
{
    int nError = EINTR;
    while (nError == EINTR)
    {
        nError = posix_fallocate(mnFile, static_cast<off_t>(nOffset), static_cast<off_t>(nBytes));
    }
    if (nError != 0)
    {
        Throw("cannot take " + std::to_string(nBytes) + " bytes on the disk", nError);
    }
}

void FileDescriptor::CutOff(std::uint64_t nBytes) const noexcept
{
    static_cast<void>(!ftruncate(mnFile, static_cast<off_t>(nBytes)));
}

void FileDescriptor::Sync() const
{
    if (fsync(mnFile) != 0)
    {
        Throw("cannot bring the file to the disk", errno);
    }
}

bool FileDescriptor::TryLock() const
{
    int nResult = -1;
    do
    {
        nResult = flock(mnFile, LOCK_EX | LOCK_NB);
    } while (nResult != 0 && errno == EINTR);
    if (nResult != 0 && errno != EWOULDBLOCK)
    {
        Throw("cannot lock the file", errno);
    }
    return nResult == 0;
}

}  // namespace kor::datasources
