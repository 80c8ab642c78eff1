#pragma once

#include <array>
#include <functional>
#include <memory>
#include <mutex>
#include <optional>
#include <string>
#include <vector>

#include "platform/datasources/kordsk/filedescriptor.h"
#include "platform/datasources/kordsk/kordskdirectory.h"
#include "platform/datasources/kordsk/kordskslot.h"

namespace kor::datasources
{

/// A KORDSK file, shared by all that have it open in this process, whatever the names they opened
/// it by.
///
/// A change writes a new directory into room that neither slot knows of, and then the slot that
/// does not count at the time; before and after each of the two the file is brought to the disk. A
/// program killed in between leaves the state before, one killed later the state after. Directories
/// that no slot refers to any more are room for later ones; planes always go to the end of the
/// file, since they have to begin as zeros. What a killed program had taken stays in the file.
///
/// Threads  any number. The directory is a snapshot that is never changed, only replaced.
/// Processes  one at a time can hold a KordskWriteAccess; reading needs none.
class KordskFile
{
public:
    using Snapshot = std::shared_ptr<const KordskDirectory>;

    /// The file as it is on the disk now. Throws kor::FileException when it cannot be read or is
    /// damaged.
    static std::shared_ptr<KordskFile> Open(const std::string& oFile);
    /// Makes a file without planes. An existing one is not touched: kor::FileException.
    static std::shared_ptr<KordskFile> Create(const std::string& oFile, bool bTiled);
    KordskFile(const KordskFile&) = delete;
    KordskFile& operator=(const KordskFile&) = delete;

    const std::string& GetFileName() const { return moReadFile.GetFileName(); }
    Snapshot GetSnapshot() const;

    /// Changes the directory by oEdit on a copy of it. Planes that it adds have offset 0 and get a
    /// place here. When anything throws, the state before is kept, in memory and on the disk. Needs
    /// a KordskWriteAccess.
    void Change(const std::function<void(KordskDirectory&)>& oEdit);
    /// Brings all pixels to the disk. Needs a KordskWriteAccess.
    void Sync() const { moWriteFile.Sync(); }

    const FileDescriptor& GetReadFile() const { return moReadFile; }
    /// Usable as long as there is a KordskWriteAccess.
    const FileDescriptor& GetWriteFile() const { return moWriteFile; }
    /// Taken around changing bytes that hold bits of pixels beside the window, too.
    std::mutex& GetBitMutex() { return moBitMutex; }

private:
    friend class KordskWriteAccess;

    /// What the slots of a file say, and the directory of the one that counts.
    struct State
    {
        std::array<std::optional<KordskSlot>, kSlotCount> maoSlots;
        std::size_t mnCurrent = 0;
        Snapshot mpoDirectory;
    };

    explicit KordskFile(FileDescriptor oReadFile);

    static State Load(const FileDescriptor& oFile);
    static std::optional<State> TryLoad(const FileDescriptor& oFile,
                                        const std::array<SlotBytes, kSlotCount>& oBytes,
                                        std::string& oWrong);
    static std::shared_ptr<KordskFile> Shared(FileDescriptor oFile);
    void Refresh();
    void Reload();
    void Publish(Snapshot poDirectory);
    void BeginWriting(const std::string& oFile);
    void EndWriting();
    void PlacePlanes(KordskDirectory& oDirectory, std::uint64_t nFileBytes) const;
    KordskSlot WriteDirectory(const KordskDirectory& oDirectory) const;

    FileDescriptor moReadFile;
    FileDescriptor moWriteFile;  ///< open, and locked, while there are writers
    std::mutex moBitMutex;

    std::mutex moChangeMutex;  ///< guards what follows; held while the file is changed
    unsigned int mnWriters = 0;
    bool mbBroken = false;  ///< a slot may or may not have been written
    State moState;
    std::vector<std::shared_ptr<const ogc::cs::GeocodingInfo>> mvpoGeocodings;  ///< all there were

    mutable std::mutex moSnapshotMutex;  ///< guards what follows
    Snapshot mpoSnapshot;
};

/// The right to change a file, held by each dataset opened for that and each writer. All holders in
/// this process share the lock that keeps other processes from changing the file.
class KordskWriteAccess
{
public:
    /// oFile is the name to open the file by. Throws kor::FileException when it cannot be opened
    /// for changing or another process has it.
    KordskWriteAccess(std::shared_ptr<KordskFile> poFile, const std::string& oFile);
    KordskWriteAccess(const KordskWriteAccess&) = delete;
    KordskWriteAccess& operator=(const KordskWriteAccess&) = delete;
    ~KordskWriteAccess();

private:
    std::shared_ptr<KordskFile> mpoFile;
};

}  // namespace kor::datasources
