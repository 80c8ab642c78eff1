#pragma once

#include <sys/types.h>
#include <sys/uio.h>

#include <compare>
#include <cstddef>
#include <cstdint>
#include <span>
#include <string>

namespace kor::datasources
{

/// Which file it is, whatever its names are.
struct FileIdentity
{
    std::uint64_t mnDevice = 0;
    std::uint64_t mnNode = 0;

    auto operator<=>(const FileIdentity&) const = default;
};

/// Rows of bytes in a file.
struct FileRows
{
    std::uint64_t mnOffset = 0;  ///< of the first one
    std::uint64_t mnPitch = 0;   ///< from one to the next
    std::size_t mnBytes = 0;     ///< of each
    std::size_t mnCount = 0;
};

/// An open file that is closed at the end. Reading and writing do all that was asked for or throw
/// kor::IOException with the file's name and the reason.
///
/// Files are not mapped: when another process cuts a mapped file off, or the disk fails, touching
/// the pages ends the program, while a read returns an error.
class FileDescriptor
{
public:
    /// A file that is closed already.
    FileDescriptor() = default;
    /// nFlags as for open(2). Throws kor::FileException when the file cannot be opened or is not a
    /// regular file.
    FileDescriptor(const std::string& oFile, int nFlags);
    FileDescriptor(FileDescriptor&& oOther) noexcept;
    FileDescriptor& operator=(FileDescriptor&& oOther) noexcept;
    ~FileDescriptor();

    const std::string& GetFileName() const { return moFile; }
    FileIdentity GetIdentity() const;
    std::uint64_t GetSize() const;

    void ReadAt(std::uint64_t nOffset, std::span<unsigned char> oBytes) const;
    void WriteAt(std::uint64_t nOffset, std::span<const unsigned char> oBytes) const;
    /// Row r to or from pMemory + r * nMemoryPitch.
    void ReadRows(const FileRows& oRows, unsigned char* pMemory, std::size_t nMemoryPitch) const;
    void WriteRows(const FileRows& oRows, const unsigned char* pMemory,
                   std::size_t nMemoryPitch) const;

    /// Takes room on the disk, making the file longer where needed by zeros.
    void Reserve(std::uint64_t nOffset, std::uint64_t nBytes) const;
    /// Makes the file shorter as far as that is possible.
    void CutOff(std::uint64_t nBytes) const noexcept;
    /// Brings everything to the disk.
    void Sync() const;
    /// Takes the lock that one open file of all processes can have. False when another has it.
    bool TryLock() const;

private:
    using VectorCall = ssize_t (*)(int, const iovec*, int, off_t);

    [[noreturn]] void Throw(const std::string& oWhat, int nError) const;
    void TransferVectors(VectorCall pCall, const char* pszWhat, std::uint64_t nOffset,
                         std::span<iovec> oVectors) const;
    void TransferRows(VectorCall pCall, const char* pszWhat, const FileRows& oRows,
                      unsigned char* pMemory, std::size_t nMemoryPitch) const;

    std::string moFile;
    int mnFile = -1;
};

}  // namespace kor::datasources
