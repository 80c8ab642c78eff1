#include "platform/datasources/kordsk/kordskfile.h"

#include <fcntl.h>
#include <unistd.h>

#include <array>
#include <limits>
#include <map>
#include <utility>

#include "platform/datasources/kordsk/crc32.h"
#include "platform/exception/exception.h"

namespace kor::datasources
{

namespace
{

constexpr const char* kSource = "platform/datasources/kordsk/kordskfile";
/// How often a slot may change under a reader while it looks for the directory.
constexpr int kMostAttempts = 100;

constexpr const char* kBrokenSlot = "its checksum does not hold";

using SlotPair = std::array<SlotBytes, kSlotCount>;

[[noreturn]] void ThrowFile(const std::string& oFile, const std::string& oWhat, unsigned int nLine)
{
    throw FileException(oFile + ": " + oWhat, oFile, kSource, __PRETTY_FUNCTION__, nLine);
}

SlotPair ReadSlots(const FileDescriptor& oFile)
{
    if (oFile.GetSize() < kSlotBytes * kSlotCount)
    {
        ThrowFile(oFile.GetFileName(), "the file is damaged: it ends before its two slots",
                  __LINE__);
    }
    SlotPair oSlots;
    for (std::size_t i = 0; i < kSlotCount; ++i)
    {
        oFile.ReadAt(i * kSlotBytes, oSlots[i]);
    }
    return oSlots;
}

std::span<const unsigned char> BytesOf(const std::string& oText)
{
    return {reinterpret_cast<const unsigned char*>(oText.data()), oText.size()};
}

/// Reads the directory that a slot refers to; what is wrong with it goes to oWrong.
std::optional<std::string> ReadDirectory(const FileDescriptor& oFile, const KordskSlot& oSlot,
                                         std::string& oWrong)
{
    const std::uint64_t nFileBytes = oFile.GetSize();
    if (oSlot.mnLength > kLargestDirectory || oSlot.mnOffset < kBlockBytes ||
        oSlot.mnOffset > nFileBytes || oSlot.mnLength > nFileBytes - oSlot.mnOffset)
    {
        oWrong = "its directory, " + std::to_string(oSlot.mnLength) + " bytes from byte " +
                 std::to_string(oSlot.mnOffset) + ", lies outside the file of " +
                 std::to_string(nFileBytes) + " bytes";
        return std::nullopt;
    }
    std::string oText(oSlot.mnLength, '\0');
    oFile.ReadAt(oSlot.mnOffset, {reinterpret_cast<unsigned char*>(oText.data()), oText.size()});
    if (Crc32(BytesOf(oText)) != oSlot.mnDirectoryCrc)
    {
        oWrong = "the checksum of its directory does not hold";
        return std::nullopt;
    }
    return oText;
}

void RequireKnownVersion(const std::string& oFile, const KordskSlot& oSlot)
{
    if (oSlot.mnVersion != kKordskVersion)
    {
        ThrowFile(oFile,
                  "version " + std::to_string(oSlot.mnVersion) +
                      " of the format is not known; version " + std::to_string(kKordskVersion) +
                      " is",
                  __LINE__);
    }
}

/// The files that are open in this process.
class OpenFiles
{
public:
    static OpenFiles& GetInstance()
    {
        static OpenFiles oInstance;
        return oInstance;
    }

    /// The one with this identity, made by oMake where it is not open yet.
    template <class Make>
    std::shared_ptr<KordskFile> Find(const FileIdentity& oIdentity, bool& bMade, const Make& oMake)
    {
        const std::lock_guard oLock(moMutex);
        std::shared_ptr<KordskFile> poFile = moFiles[oIdentity].lock();
        bMade = !poFile;
        if (!poFile)
        {
            std::erase_if(moFiles, [](const auto& oEntry) { return oEntry.second.expired(); });
            poFile = oMake();
            moFiles[oIdentity] = poFile;
        }
        return poFile;
    }

private:
    std::mutex moMutex;
    std::map<FileIdentity, std::weak_ptr<KordskFile>> moFiles;
};

}  // namespace

KordskFile::KordskFile(FileDescriptor oReadFile) : moReadFile(std::move(oReadFile))
{
    moState = Load(moReadFile);
    Publish(moState.mpoDirectory);
}

std::optional<KordskFile::State> KordskFile::TryLoad(const FileDescriptor& oFile,
                                                     const SlotPair& oBytes, std::string& oWrong)
{
    const std::string& oName = oFile.GetFileName();
    State oState{{DecodeSlot(oBytes[0]), DecodeSlot(oBytes[1])}, 0, nullptr};
    const auto& oSlotA = oState.maoSlots[0];
    const auto& oSlotB = oState.maoSlots[1];
    const std::size_t nFirst =
        oSlotB && (!oSlotA || oSlotB->mnSequence > oSlotA->mnSequence) ? 1 : 0;
    std::string aoWrong[kSlotCount] = {kBrokenSlot, kBrokenSlot};
    for (const std::size_t nSlot : {nFirst, 1 - nFirst})
    {
        const auto& oSlot = oState.maoSlots[nSlot];
        if (!oSlot)
        {
            continue;
        }
        RequireKnownVersion(oName, *oSlot);
        const auto oText = ReadDirectory(oFile, *oSlot, aoWrong[nSlot]);
        if (oText)
        {
            auto poDirectory = std::make_shared<KordskDirectory>(ParseDirectory(oName, *oText));
            RequireSoundPlanes(oName, *poDirectory, {oSlot->mnOffset, oSlot->mnLength},
                               oFile.GetSize());
            oState.mnCurrent = nSlot;
            oState.mpoDirectory = std::move(poDirectory);
            return oState;
        }
        // Another process may have gone on meanwhile, and used the directory's room again.
        if (ReadSlots(oFile) != oBytes)
        {
            break;
        }
    }
    oWrong = "slot A: " + aoWrong[0] + "; slot B: " + aoWrong[1];
    return std::nullopt;
}

KordskFile::State KordskFile::Load(const FileDescriptor& oFile)
{
    SlotPair oBytes = ReadSlots(oFile);
    std::string oWrong;
    for (int nAttempt = 0; nAttempt < kMostAttempts; ++nAttempt)
    {
        auto oState = TryLoad(oFile, oBytes, oWrong);
        if (oState)
        {
            return *oState;
        }
        const SlotPair oNow = ReadSlots(oFile);
        if (oNow == oBytes)
        {
            break;
        }
        oBytes = oNow;
    }
    ThrowFile(oFile.GetFileName(), "the file is damaged: " + oWrong, __LINE__);
}

std::shared_ptr<KordskFile> KordskFile::Shared(FileDescriptor oFile)
{
    bool bMade = false;
    const FileIdentity oIdentity = oFile.GetIdentity();
    const auto oMake = [&]
    { return std::shared_ptr<KordskFile>(new KordskFile(std::move(oFile))); };
    std::shared_ptr<KordskFile> poFile = OpenFiles::GetInstance().Find(oIdentity, bMade, oMake);
    if (!bMade)
    {
        poFile->Refresh();
    }
    return poFile;
}

std::shared_ptr<KordskFile> KordskFile::Open(const std::string& oFile)
{
    return Shared(FileDescriptor(oFile, O_RDONLY));
}

std::shared_ptr<KordskFile> KordskFile::Create(const std::string& oFile, bool bTiled)
{
    const FileDescriptor oNew(oFile, O_RDWR | O_CREAT | O_EXCL);
    try
    {
        KordskDirectory oDirectory;
        oDirectory.mbTiled = bTiled;
        const std::string oText = PrintDirectory(oDirectory);
        oNew.Reserve(0, kBlockBytes + oText.size());
        oNew.WriteAt(kBlockBytes, BytesOf(oText));
        oNew.Sync();
        oNew.WriteAt(
            0, EncodeSlot({kKordskVersion, 1, kBlockBytes, oText.size(), Crc32(BytesOf(oText))}));
        oNew.Sync();
        return Open(oFile);
    }
    catch (...)
    {
        unlink(oFile.c_str());
        throw;
    }
}

KordskFile::Snapshot KordskFile::GetSnapshot() const
{
    const std::lock_guard oLock(moSnapshotMutex);
    return mpoSnapshot;
}

void KordskFile::Publish(Snapshot poDirectory)
{
    // References to it are handed out that hold as long as the file is open.
    if (mvpoGeocodings.empty() || mvpoGeocodings.back() != poDirectory->mpoGeocoding)
    {
        mvpoGeocodings.push_back(poDirectory->mpoGeocoding);
    }
    const std::lock_guard oLock(moSnapshotMutex);
    mpoSnapshot = std::move(poDirectory);
}

void KordskFile::Reload()
{
    State oState = Load(moReadFile);
    const bool bSame = oState.maoSlots[oState.mnCurrent] == moState.maoSlots[moState.mnCurrent];
    moState = std::move(oState);
    if (!bSame)
    {
        Publish(moState.mpoDirectory);
    }
}

void KordskFile::Refresh()
{
    const std::lock_guard oLock(moChangeMutex);
    if (mnWriters == 0)
    {
        Reload();
    }
}

void KordskFile::BeginWriting(const std::string& oFile)
{
    const std::lock_guard oLock(moChangeMutex);
    if (mnWriters == 0)
    {
        FileDescriptor oWriteFile(oFile, O_RDWR);
        if (oWriteFile.GetIdentity() != moReadFile.GetIdentity())
        {
            ThrowFile(oFile, "the file was replaced since it was opened", __LINE__);
        }
        if (!oWriteFile.TryLock())
        {
            ThrowFile(oFile, "another process has the file open for changing", __LINE__);
        }
        Reload();
        mbBroken = false;
        moWriteFile = std::move(oWriteFile);
    }
    ++mnWriters;
}

void KordskFile::EndWriting()
{
    const std::lock_guard oLock(moChangeMutex);
    if (--mnWriters == 0)
    {
        moWriteFile = FileDescriptor();
    }
}

void KordskFile::PlacePlanes(KordskDirectory& oDirectory, std::uint64_t nFileBytes) const
{
    constexpr std::uint64_t kLargestFile = std::numeric_limits<std::int64_t>::max() - kBlockBytes;
    const std::uint64_t nBegin = WholeBlocks(nFileBytes);
    std::uint64_t nEnd = nBegin;
    for (auto* poPlanes : {&oDirectory.mvoChannels, &oDirectory.mvoBitmaps})
    {
        for (KordskPlane& oPlane : *poPlanes)
        {
            if (oPlane.mnOffset != 0)
            {
                continue;
            }
            if (nEnd > kLargestFile || oPlane.mnLength > kLargestFile - nEnd)
            {
                throw DataException(
                    GetFileName() + ": the file would become larger than any can be", kSource,
                    __PRETTY_FUNCTION__, __LINE__);
            }
            oPlane.mnOffset = nEnd;
            nEnd = WholeBlocks(nEnd + oPlane.mnLength);
        }
    }
    if (nEnd != nBegin)
    {
        moWriteFile.Reserve(nBegin, nEnd - nBegin);
    }
}

KordskSlot KordskFile::WriteDirectory(const KordskDirectory& oDirectory) const
{
    const std::string oText = PrintDirectory(oDirectory);
    if (oText.size() > kLargestDirectory)
    {
        throw DataException(GetFileName() + ": descriptions and metadata of " +
                                std::to_string(oText.size()) + " bytes are more than the " +
                                std::to_string(kLargestDirectory) + " that a file holds",
                            kSource, __PRETTY_FUNCTION__, __LINE__);
    }
    std::vector<FileExtent> voUsed;
    for (const auto* poPlanes : {&oDirectory.mvoChannels, &oDirectory.mvoBitmaps})
    {
        for (const KordskPlane& oPlane : *poPlanes)
        {
            voUsed.push_back({oPlane.mnOffset, oPlane.mnLength});
        }
    }
    const std::uint64_t nFileBytes = moWriteFile.GetSize();
    for (const auto& oSlot : moState.maoSlots)
    {
        // The one that does not count may be wrong: then there is nothing to keep.
        if (oSlot && oSlot->mnOffset <= nFileBytes && oSlot->mnLength <= nFileBytes)
        {
            voUsed.push_back({oSlot->mnOffset, oSlot->mnLength});
        }
    }
    const std::uint64_t nPlace = FindGap(std::move(voUsed), oText.size());
    moWriteFile.Reserve(nPlace, oText.size());
    moWriteFile.WriteAt(nPlace, BytesOf(oText));
    moWriteFile.Sync();
    return {kKordskVersion, moState.maoSlots[moState.mnCurrent]->mnSequence + 1, nPlace,
            oText.size(), Crc32(BytesOf(oText))};
}

void KordskFile::Change(const std::function<void(KordskDirectory&)>& oEdit)
{
    const std::lock_guard oLock(moChangeMutex);
    if (mbBroken)
    {
        throw IOException(GetFileName() + ": a change failed half way; close the file and open it",
                          kSource, __PRETTY_FUNCTION__, __LINE__);
    }
    if (moState.maoSlots[moState.mnCurrent]->mnSequence ==
        std::numeric_limits<std::uint64_t>::max())
    {
        ThrowFile(GetFileName(), "the file's sequence has come to its end", __LINE__);
    }
    const auto poDirectory = std::make_shared<KordskDirectory>(*moState.mpoDirectory);
    oEdit(*poDirectory);
    const std::uint64_t nFileBytes = moWriteFile.GetSize();
    KordskSlot oSlot;
    try
    {
        PlacePlanes(*poDirectory, nFileBytes);
        oSlot = WriteDirectory(*poDirectory);
    }
    catch (...)
    {
        moWriteFile.CutOff(nFileBytes);
        throw;
    }
    const std::size_t nOther = 1 - moState.mnCurrent;
    mbBroken = true;
    moWriteFile.WriteAt(nOther * kSlotBytes, EncodeSlot(oSlot));
    moWriteFile.Sync();
    mbBroken = false;
    moState.maoSlots[nOther] = oSlot;
    moState.mnCurrent = nOther;
    moState.mpoDirectory = poDirectory;
    Publish(poDirectory);
}

KordskWriteAccess::KordskWriteAccess(std::shared_ptr<KordskFile> poFile, const std::string& oFile)
    : mpoFile(std::move(poFile))
{
    mpoFile->BeginWriting(oFile);
}

KordskWriteAccess::~KordskWriteAccess()
{
    mpoFile->EndWriting();
}

}  // namespace kor::datasources
