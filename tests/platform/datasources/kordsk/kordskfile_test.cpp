#include "platform/datasources/kordsk/kordskfile.h"

#include <gtest/gtest.h>
#include <sched.h>
#include <signal.h>
#include <sys/mount.h>
#include <sys/resource.h>
#include <sys/wait.h>
#include <unistd.h>

#include <functional>
#include <iostream>
#include <set>

#include "platform/datasources/bitmapreader.h"
#include "platform/datasources/kordsk/crc32.h"
#include "tests/support/exceptions.h"
#include "tests/support/kordskfiles.h"
#include "tests/support/temporarydirectory.h"

namespace kor::datasources
{
namespace
{

using test::kAllTypes;
using test::MessageOf;
using test::NewKordsk;
using test::OpenKordsk;

class KordskFileTest : public ::testing::Test
{
protected:
    /// A file in whose slot A the channel has the description "new" and in whose slot B none.
    void MakeTwoStates() const
    {
        const auto poKordsk = NewKordsk(moFile);                 // slot A, sequence 1
        poKordsk->CreateChannels({30, 20, 1, tessel::eDT_16U});  // slot B, sequence 2
        Describe(*poKordsk, "new");                              // slot A, sequence 3
    }
    static void Describe(KordskDataset& oKordsk, const std::string& oText)
    {
        AuxiliaryData oData;
        oData.SetChannelDescription(oText, 1);
        oKordsk.SetAuxiliaryData(oData);
    }
    std::string Description() const
    {
        return OpenKordsk(moFile)->GetAuxiliaryData().GetChannelDescription(1);
    }
    void Damage(std::size_t nByte) const
    {
        std::string oBytes = test::BytesOf(moFile);
        oBytes.at(nByte) = static_cast<char>(oBytes[nByte] ^ 0x10);
        moDirectory.Write("image.kdk", oBytes);
    }
    KordskSlot SlotAt(std::size_t nSlot) const
    {
        SlotBytes oBytes;
        std::memcpy(oBytes.data(), test::BytesOf(moFile).data() + nSlot * kSlotBytes, kSlotBytes);
        return DecodeSlot(oBytes).value_or(KordskSlot());
    }
    void SetSlot(std::size_t nSlot, const KordskSlot& oSlot) const
    {
        std::string oBytes = test::BytesOf(moFile);
        std::memcpy(oBytes.data() + nSlot * kSlotBytes, EncodeSlot(oSlot).data(), kSlotBytes);
        moDirectory.Write("image.kdk", oBytes);
    }
    std::string Refusal() const
    {
        return MessageOf<FileException>([&] { OpenKordsk(moFile); });
    }

    test::TemporaryDirectory moDirectory;
    const std::string moFile = moDirectory.File("image.kdk");
};

/// A process that runs oAction and then waits to be killed, which happens at the end of this object
/// at the latest. What it writes into the pipe can be read here.
class ChildProcess
{
public:
    explicit ChildProcess(const std::function<void(int nPipe)>& oAction)
    {
        EXPECT_EQ(pipe(manPipe), 0);
        mnProcess = fork();
        if (mnProcess == 0)
        {
            try
            {
                oAction(manPipe[1]);
            }
            catch (...)
            {
                _exit(1);
            }
            pause();
        }
        close(manPipe[1]);
    }
    ChildProcess(const ChildProcess&) = delete;
    ChildProcess& operator=(const ChildProcess&) = delete;
    ~ChildProcess()
    {
        Kill();
        close(manPipe[0]);
    }

    /// Waits for a number from the child; 0 when none comes any more.
    unsigned int Receive() const
    {
        unsigned int nNumber = 0;
        return read(manPipe[0], &nNumber, sizeof(nNumber)) == sizeof(nNumber) ? nNumber : 0;
    }
    static void Send(int nPipe, unsigned int nNumber)
    {
        if (write(nPipe, &nNumber, sizeof(nNumber)) != sizeof(nNumber))
        {
            _exit(2);
        }
    }
    void Kill()
    {
        if (mnProcess > 0)
        {
            kill(mnProcess, SIGKILL);
            waitpid(mnProcess, nullptr, 0);
            mnProcess = 0;
        }
    }

private:
    int manPipe[2] = {-1, -1};
    pid_t mnProcess = 0;
};

TEST_F(KordskFileTest, SlotsTakeTurns)
{
    MakeTwoStates();
    EXPECT_EQ(SlotAt(0).mnSequence, 3U);
    EXPECT_EQ(SlotAt(1).mnSequence, 2U);
    Describe(*OpenKordsk(moFile, 1), "newer");
    EXPECT_EQ(SlotAt(0).mnSequence, 3U);
    EXPECT_EQ(SlotAt(1).mnSequence, 4U);
    EXPECT_EQ(Description(), "newer");
}

TEST_F(KordskFileTest, DamagedSlotGivesWayToTheOther)
{
    for (const std::size_t nByte : {0U, 8U, 17U, 47U})
    {
        moDirectory.Write("image.kdk", "");
        std::filesystem::remove(moFile);
        MakeTwoStates();
        Damage(nByte);
        EXPECT_EQ(Description(), "") << nByte;
        EXPECT_EQ(OpenKordsk(moFile)->GetChannelCount(), 1U);
    }
    Describe(*OpenKordsk(moFile, 1), "mended");
    EXPECT_EQ(Description(), "mended");
    EXPECT_EQ(SlotAt(0).mnSequence, 3U);
}

TEST_F(KordskFileTest, DamagedSlotThatDoesNotCountChangesNothing)
{
    MakeTwoStates();
    Damage(512 + 20);
    EXPECT_EQ(Description(), "new");
}

TEST_F(KordskFileTest, DamagedDirectoryGivesWayToTheOther)
{
    MakeTwoStates();
    Damage(SlotAt(0).mnOffset + 3);
    EXPECT_EQ(Description(), "");
}

TEST_F(KordskFileTest, FileWithoutAValidSlotIsRefused)
{
    MakeTwoStates();
    Damage(20);
    Damage(SlotAt(1).mnOffset);
    EXPECT_EQ(Refusal(), moFile +
                             ": the file is damaged: slot A: its checksum does not hold; "
                             "slot B: the checksum of its directory does not hold");
    Damage(512 + 40);
    EXPECT_EQ(Refusal(), moFile +
                             ": the file is damaged: slot A: its checksum does not hold; "
                             "slot B: its checksum does not hold");
}

TEST_F(KordskFileTest, DirectoryOutsideTheFileIsRefused)
{
    MakeTwoStates();
    const std::string oSize = std::to_string(std::filesystem::file_size(moFile));
    SetSlot(0, {1, 3, 0xFFFFFFFFFFFFFFFF, 0xFFFFFFFFFFFFFFFF, 0});
    SetSlot(1, {1, 2, 0, 100, 0});
    EXPECT_EQ(Refusal(), moFile +
                             ": the file is damaged: slot A: its directory, "
                             "18446744073709551615 bytes from byte 18446744073709551615, "
                             "lies outside the file of " +
                             oSize +
                             " bytes; slot B: its directory, 100 bytes from byte 0, lies "
                             "outside the file of " +
                             oSize + " bytes");
}

TEST_F(KordskFileTest, WildSlotThatDoesNotCountDoesNotHinderChanges)
{
    MakeTwoStates();
    SetSlot(1, {1, 2, 0xFFFFFFFFFFFFFFFF, 0xFFFFFFFFFFFFFFFF, 0});
    Describe(*OpenKordsk(moFile, 1), "newer");
    EXPECT_EQ(Description(), "newer");
    EXPECT_LT(SlotAt(1).mnOffset, 100000U);
}

TEST_F(KordskFileTest, UnknownVersionIsRefused)
{
    MakeTwoStates();
    KordskSlot oSlot = SlotAt(0);
    oSlot.mnVersion = 2;
    SetSlot(0, oSlot);
    EXPECT_EQ(Refusal(), moFile + ": version 2 of the format is not known; version 1 is");
}

TEST_F(KordskFileTest, SequenceAtItsEndIsReadAndNotChanged)
{
    MakeTwoStates();
    KordskSlot oSlot = SlotAt(0);
    oSlot.mnSequence = 0xFFFFFFFFFFFFFFFF;
    SetSlot(0, oSlot);
    EXPECT_EQ(Description(), "new");
    EXPECT_EQ(MessageOf<FileException>([&] { Describe(*OpenKordsk(moFile, 1), "newer"); }),
              moFile + ": the file's sequence has come to its end");
}

TEST_F(KordskFileTest, FileShorterThanItsPlanesIsRefused)
{
    MakeTwoStates();
    {
        const auto poKordsk = OpenKordsk(moFile, 1);
        Describe(*poKordsk, "");  // leaves a gap for the directory behind this one
        poKordsk->CreateChannels({30, 20, 1, tessel::eDT_16U});
    }
    const std::uint64_t nOffset = OpenKordsk(moFile)->GetDirectory()->mvoChannels[1].mnOffset;
    std::filesystem::resize_file(moFile, nOffset + 1200);
    EXPECT_EQ(OpenKordsk(moFile)->GetChannelCount(), 2U);
    std::filesystem::resize_file(moFile, nOffset + 1199);
    EXPECT_EQ(Refusal(), moFile + ": the file is damaged: channel 2, 1200 bytes from byte " +
                             std::to_string(nOffset) + ", lies outside the file of " +
                             std::to_string(nOffset + 1199) + " bytes");
}

TEST_F(KordskFileTest, FileOfLessThanTwoSlotsIsRefused)
{
    MakeTwoStates();
    std::filesystem::resize_file(moFile, 1023);
    EXPECT_EQ(Refusal(), moFile + ": the file is damaged: it ends before its two slots");
}

TEST_F(KordskFileTest, ManyChangesDoNotMakeTheFileLonger)
{
    MakeTwoStates();
    const auto nBefore = std::filesystem::file_size(moFile);
    const auto poKordsk = OpenKordsk(moFile, 1);
    for (int i = 0; i < 20; ++i)
    {
        Describe(*poKordsk, std::string(3000, 'x') + std::to_string(i));
    }
    EXPECT_LE(std::filesystem::file_size(moFile), nBefore + 2 * kBlockBytes);
    EXPECT_EQ(Description(), std::string(3000, 'x') + "19");
}

TEST_F(KordskFileTest, ExistingFileIsNeverOverwritten)
{
    moDirectory.Write("image.kdk", "precious");
    EXPECT_EQ(MessageOf<FileException>([&] { KordskFile::Create(moFile, false); }),
              moFile + ": cannot make the file: File exists");
    EXPECT_THROW(NewKordsk(moFile), FileException);
    EXPECT_EQ(test::BytesOf(moFile), "precious");
}

TEST_F(KordskFileTest, OneProcessAtATimeChangesTheFile)
{
    MakeTwoStates();
    ChildProcess oChild(
        [&](int nPipe)
        {
            const auto poKordsk = OpenKordsk(moFile, 1);
            Describe(*poKordsk, "of the child");
            ChildProcess::Send(nPipe, 1);
            pause();
        });
    ASSERT_EQ(oChild.Receive(), 1U);
    EXPECT_EQ(MessageOf<FileException>([&] { OpenKordsk(moFile, 1); }),
              moFile + ": another process has the file open for changing");
    const auto poReader = OpenKordsk(moFile, 0);
    EXPECT_EQ(poReader->GetAuxiliaryData().GetChannelDescription(1), "of the child");
    oChild.Kill();
    Describe(*OpenKordsk(moFile, 1), "of the parent");
    EXPECT_EQ(poReader->GetAuxiliaryData().GetChannelDescription(1), "of the parent");
}

TEST_F(KordskFileTest, OpeningSeesWhatAnotherProcessHasChanged)
{
    MakeTwoStates();
    const auto poReader = OpenKordsk(moFile, 0);
    const ChildProcess oChild(
        [&](int nPipe)
        {
            Describe(*OpenKordsk(moFile, 1), "of the child");
            ChildProcess::Send(nPipe, 1);
        });
    ASSERT_EQ(oChild.Receive(), 1U);
    EXPECT_EQ(poReader->GetAuxiliaryData().GetChannelDescription(1), "new");
    EXPECT_EQ(Description(), "of the child");
    EXPECT_EQ(poReader->GetAuxiliaryData().GetChannelDescription(1), "of the child");
}

TEST_F(KordskFileTest, OpeningSucceedsWhileAnotherProcessChangesTheFile)
{
    MakeTwoStates();
    const ChildProcess oChild(
        [&](int nPipe)
        {
            const auto poKordsk = OpenKordsk(moFile, 1);
            ChildProcess::Send(nPipe, 1);
            for (int i = 0;; ++i)
            {
                // Of changing length, so that directories move about and room is used again.
                Describe(*poKordsk, "new" + std::string(i % 3 * 3000, 'x'));
            }
        });
    ASSERT_EQ(oChild.Receive(), 1U);
    for (int i = 0; i < 2000; ++i)
    {
        ASSERT_EQ(Description().substr(0, 3), "new");
    }
}

/// Runs oAction while files of this process cannot grow beyond nBytes.
void WithFilesUpTo(std::uint64_t nBytes, const std::function<void()>& oAction)
{
    rlimit oBefore = {};
    getrlimit(RLIMIT_FSIZE, &oBefore);
    const auto pHandler = signal(SIGXFSZ, SIG_IGN);
    const rlimit oLimit{nBytes, oBefore.rlim_max};
    EXPECT_EQ(setrlimit(RLIMIT_FSIZE, &oLimit), 0);
    oAction();
    setrlimit(RLIMIT_FSIZE, &oBefore);
    signal(SIGXFSZ, pHandler);
}

TEST_F(KordskFileTest, ChannelThatFindsNoRoomLeavesTheStateBefore)
{
    MakeTwoStates();
    const auto poKordsk = OpenKordsk(moFile, 1);
    const std::string oBefore = test::BytesOf(moFile);
    std::string oMessage;
    WithFilesUpTo(1 << 20,
                  [&]
                  {
                      oMessage = MessageOf<IOException>(
                          [&] {
                              poKordsk->CreateChannels({30, 20, 2000, tessel::eDT_16U});
                          });
                  });
    EXPECT_EQ(oMessage.find(moFile + ": cannot take 8192000 bytes on the disk: "), 0U) << oMessage;
    EXPECT_EQ(poKordsk->GetChannelCount(), 1U);
    EXPECT_EQ(test::BytesOf(moFile), oBefore);
    EXPECT_EQ(poKordsk->CreateChannels({30, 20, 2, tessel::eDT_16U}), 2U);
    EXPECT_EQ(OpenKordsk(moFile)->GetChannelCount(), 3U);
}

TEST_F(KordskFileTest, DirectoryThatFindsNoRoomLeavesTheStateBefore)
{
    MakeTwoStates();
    const auto poKordsk = OpenKordsk(moFile, 1);
    const std::string oBefore = test::BytesOf(moFile);
    WithFilesUpTo(1 << 20, [&]
                  { EXPECT_THROW(Describe(*poKordsk, std::string(1 << 20, 'x')), IOException); });
    EXPECT_EQ(test::BytesOf(moFile), oBefore);
    EXPECT_EQ(Description(), "new");
}

/// What a process of its own finds on a disk of 1 MiB that it alone sees; 0 is all right.
int UseFullDisk(const std::string& oMountPoint)
{
    if (unshare(CLONE_NEWNS) != 0 ||
        mount("none", "/", nullptr, MS_REC | MS_PRIVATE, nullptr) != 0 ||
        mount("kor", oMountPoint.c_str(), "tmpfs", 0, "size=1m") != 0)
    {
        return 77;
    }
    const std::string oFile = oMountPoint + "/image.kdk";
    const auto poKordsk = NewKordsk(oFile);
    poKordsk->CreateChannels({100, 100, 1, tessel::eDT_8U});
    const std::string oBefore = test::BytesOf(oFile);
    try
    {
        poKordsk->CreateChannels({100, 100, 200, tessel::eDT_8U});
        return 1;
    }
    catch (const IOException& oError)
    {
        if (oError.GetMessage().find("No space left on device") == std::string::npos)
        {
            return 2;
        }
    }
    if (test::BytesOf(oFile) != oBefore || poKordsk->GetChannelCount() != 1)
    {
        return 3;
    }
    // The last of the room goes; pixels of the channel that is there have theirs.
    std::ofstream(oMountPoint + "/rest") << std::string(1 << 20, 'x');
    const auto poRaster = test::BlankRaster(100, 100, 1, tessel::eDT_8U);
    BasicWriter(poKordsk.get(), {1}).WriteRaster(poRaster.get());
    poKordsk->Flush();
    return test::SameBytes(*test::ReadBlock(*poKordsk, {1}, {100, 100, 1, {}}), *poRaster) ? 0 : 4;
}

TEST_F(KordskFileTest, FullDiskIsAnErrorWhereChannelsAreMadeAndNotWherePixelsAreWritten)
{
    const ChildProcess oChild(
        [&](int nPipe)
        {
            int nResult = 99;
            try
            {
                nResult = UseFullDisk(std::filesystem::path(moFile).parent_path().string());
            }
            catch (const std::exception& oError)
            {
                std::fprintf(stderr, "%s\n", oError.what());
            }
            ChildProcess::Send(nPipe, 1 + static_cast<unsigned int>(nResult));
        });
    const unsigned int nResult = oChild.Receive();
    if (nResult == 1 + 77)
    {
        GTEST_SKIP() << "this process may not mount a file system";
    }
    EXPECT_EQ(nResult, 1U);
}

/// The value of all pixels of a channel, once they are written.
unsigned char PatternOf(unsigned int nChannel)
{
    return static_cast<unsigned char>(nChannel % 251 + 1);
}

constexpr std::uint32_t kSide = 64;

/// Adds channels, writes their pixels, describes them and sends their numbers, without an end.
void WriteUntilKilled(const std::string& oFile, int nPipe)
{
    const auto poKordsk = OpenKordsk(oFile, 1);
    const auto poRaster = test::BlankRaster(kSide, kSide, 1, tessel::eDT_8U);
    while (true)
    {
        const unsigned int nChannel = poKordsk->CreateChannels({kSide, kSide, 1, tessel::eDT_8U});
        std::memset(poRaster->mpBuffer, PatternOf(nChannel), poRaster->mnBufferSize);
        BasicWriter oWriter(poKordsk.get(), {nChannel});
        oWriter.WriteRaster(poRaster.get());
        AuxiliaryData oData = oWriter.GetAuxiliaryData();
        oData.SetChannelDescription("channel " + std::to_string(nChannel), 1);
        oData.SetFileMetadata({{"PAD", std::string(nChannel * 37 % 9000, 'x')}});
        oWriter.SetAuxiliaryData(oData);
        ChildProcess::Send(nPipe, nChannel);
    }
}

/// The confirmed channels hold all that was written; each other one may, or a part of it.
void ExpectWhole(KordskDataset& oKordsk, const std::set<unsigned int>& oConfirmed)
{
    ASSERT_TRUE(oConfirmed.empty() || oKordsk.GetChannelCount() >= *oConfirmed.rbegin());
    const AuxiliaryData oData = oKordsk.GetAuxiliaryData();
    for (unsigned int nChannel = 1; nChannel <= oKordsk.GetChannelCount(); ++nChannel)
    {
        const std::string oText = oData.GetChannelDescription(nChannel);
        const bool bWhole = oConfirmed.contains(nChannel) || !oText.empty();
        EXPECT_EQ(oText, bWhole ? "channel " + std::to_string(nChannel) : "");
        const auto poBlock = test::ReadBlock(oKordsk, {nChannel}, {kSide, kSide, 1, {}});
        for (std::uint64_t i = 0; i < poBlock->mnBufferSize; ++i)
        {
            const unsigned char nSample = poBlock->mpBuffer[i];
            ASSERT_TRUE(nSample == PatternOf(nChannel) || (!bWhole && nSample == 0))
                << "channel " << nChannel << " sample " << i << " is " << +nSample;
        }
    }
}

void KillWriters(const std::string& oFile, unsigned int nRounds, unsigned int nMicroseconds)
{
    test::Random oRandom(nRounds);
    NewKordsk(oFile);
    std::set<unsigned int> oConfirmed;
    unsigned int nChannels = 0;
    for (unsigned int i = 0; i < nRounds && !::testing::Test::HasFailure(); ++i)
    {
        ChildProcess oChild([&](int nPipe) { WriteUntilKilled(oFile, nPipe); });
        usleep(static_cast<unsigned int>(oRandom() % nMicroseconds));
        oChild.Kill();
        while (const unsigned int nChannel = oChild.Receive())
        {
            oConfirmed.insert(nChannel);
        }
        const auto poKordsk = OpenKordsk(oFile);
        EXPECT_GE(poKordsk->GetChannelCount(), nChannels);
        nChannels = poKordsk->GetChannelCount();
        ExpectWhole(*poKordsk, oConfirmed);
    }
    EXPECT_FALSE(oConfirmed.empty());
    std::cout << nRounds << " writers killed, " << nChannels << " channels made, "
              << oConfirmed.size() << " confirmed whole\n";
}

TEST_F(KordskFileTest, KilledWriterLosesNothingThatWasWrittenBefore)
{
    KillWriters(moFile, 30, 40000);
}

// By hand: it takes a while.
TEST_F(KordskFileTest, DISABLED_TwoHundredKilledWritersLoseNothing)
{
    KillWriters(moFile, 200, 200000);
}

/// Gives the directory of the slot that counts other text, and checksums that hold.
void ReplaceDirectory(std::string& oBytes, const KordskSlot& oSlot, const std::string& oText)
{
    KordskSlot oNew = oSlot;
    oNew.mnLength = oText.size();
    oNew.mnDirectoryCrc =
        Crc32({reinterpret_cast<const unsigned char*>(oText.data()), oText.size()});
    oBytes.resize(std::max<std::size_t>(oBytes.size(), oSlot.mnOffset + oText.size()));
    std::copy(oText.begin(), oText.end(), oBytes.begin() + static_cast<long>(oSlot.mnOffset));
    const SlotBytes oSlotBytes = EncodeSlot(oNew);
    std::copy(oSlotBytes.begin(), oSlotBytes.end(), oBytes.begin());
}

/// Changes, takes out or puts in a few bytes, or cuts the text off.
void DamageText(std::string& oText, test::Random& oRandom)
{
    constexpr std::string_view kLikely = "0123456789=\n .-xe\\";
    for (std::uint64_t n = 1 + oRandom() % 3; n > 0 && !oText.empty(); --n)
    {
        const std::size_t nPlace = oRandom() % oText.size();
        const char nByte =
            oRandom() % 4 == 0 ? static_cast<char>(oRandom()) : kLikely[oRandom() % kLikely.size()];
        switch (oRandom() % 8)
        {
            case 0:
                oText.erase(nPlace, 1 + oRandom() % 20);
                break;
            case 1:
                oText.insert(nPlace, 1, nByte);
                break;
            case 2:
                oText.insert(nPlace, oText.substr(oRandom() % oText.size(), 60));
                break;
            default:
                oText[nPlace] = nByte;
        }
    }
    if (oRandom() % 50 == 0)
    {
        oText.resize(oRandom() % (oText.size() + 1));
    }
}

/// Reads something of everything; true when the file could be opened.
bool ReadDamaged(const std::string& oFile, bool bUpdate)
{
    try
    {
        const auto poKordsk = OpenKordsk(oFile, bUpdate ? 1 : 0);
        for (unsigned int nChannel = 1; nChannel <= poKordsk->GetChannelCount(); ++nChannel)
        {
            test::ReadBlock(*poKordsk, {nChannel}, {9, 7, 1, {}}, {2, 2, 3, 1});
        }
        for (unsigned int nBitmap = 1; nBitmap <= poKordsk->GetBitmapCount(); ++nBitmap)
        {
            BitmapReader oReader(poKordsk.get(), nBitmap);
            oReader.SetTileSize(8, 8);
            const std::unique_ptr<tessel::Raster> poTile(oReader.GetRaster(0));
        }
        if (bUpdate)
        {
            poKordsk->CreateBitmap(poKordsk->GetWidth(), poKordsk->GetHeight());
        }
        return true;
    }
    catch (const Exception& oError)
    {
        EXPECT_NE(oError.GetMessage().find(oFile), std::string::npos) << oError.GetMessage();
        return false;
    }
}

/// Opens a sound file with random damage, half of the time with checksums made to hold, again and
/// again. Tells how many were opened all the same.
unsigned int OpenDamagedFiles(const test::TemporaryDirectory& oDirectory, unsigned int nFiles)
{
    test::Random oRandom(nFiles);
    const std::string oFile = oDirectory.File("sound.kdk");
    {
        const auto poKordsk = NewKordsk(oFile, "TILE");
        for (const tessel::DataType& oType : kAllTypes)
        {
            poKordsk->CreateChannels({13, 11, 1, oType});
        }
        poKordsk->CreateBitmap(13, 11);
        AuxiliaryData oData;
        oData.SetFileMetadata({{"a=b", "c\nd"}});
        oData.SetChannel({"description", {{"k", "v"}}, -1.5}, 3);
        poKordsk->SetAuxiliaryData(oData);  // sequence 20, in slot B
        poKordsk->SetGeocodingInfo({});     // sequence 21, in slot A
    }
    const std::string oSound = test::BytesOf(oFile);
    SlotBytes oSlotBytes;
    std::memcpy(oSlotBytes.data(), oSound.data(), kSlotBytes);
    const KordskSlot oSlot = DecodeSlot(oSlotBytes).value();
    EXPECT_EQ(oSlot.mnSequence, 21U);
    unsigned int nOpened = 0;
    for (unsigned int i = 0; i < nFiles; ++i)
    {
        std::string oBytes = oSound;
        if (i % 2 == 0)
        {
            std::string oText = oBytes.substr(oSlot.mnOffset, oSlot.mnLength);
            DamageText(oText, oRandom);
            ReplaceDirectory(oBytes, oSlot, oText);
        }
        else
        {
            for (std::uint64_t n = 1 + oRandom() % 6; n > 0; --n)
            {
                const std::size_t nEnd = oRandom() % 2 == 0 ? 1024 : oBytes.size();
                oBytes[oRandom() % nEnd] = static_cast<char>(oRandom());
            }
            oBytes.resize(oRandom() % 3 == 0 ? oRandom() % oBytes.size() : oBytes.size());
        }
        // Not over the file before, which some file systems bring to the disk then.
        std::filesystem::remove(oDirectory.File("damaged.kdk"));
        nOpened += ReadDamaged(oDirectory.Write("damaged.kdk", oBytes), i % 64 < 2) ? 1 : 0;
    }
    std::cout << nOpened << " of " << nFiles << " damaged files could be opened\n";
    return nOpened;
}

TEST_F(KordskFileTest, DamagedFilesAreReadOrRefusedAndHarmNothing)
{
    const unsigned int nOpened = OpenDamagedFiles(moDirectory, 1000);
    EXPECT_GT(nOpened, 100U);
    EXPECT_LT(nOpened, 900U);
}

// By hand, best under AddressSanitizer.
TEST_F(KordskFileTest, DISABLED_TenThousandDamagedFilesHarmNothing)
{
    EXPECT_GT(OpenDamagedFiles(moDirectory, 10000), 1000U);
}

}  // namespace
}  // namespace kor::datasources
