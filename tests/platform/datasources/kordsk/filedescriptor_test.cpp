#include "platform/datasources/kordsk/filedescriptor.h"

#include <fcntl.h>
#include <gtest/gtest.h>
#include <sys/stat.h>

#include <array>
#include <cstring>
#include <vector>

#include "tests/support/exceptions.h"
#include "tests/support/temporarydirectory.h"

namespace kor::datasources
{
namespace
{

using test::MessageOf;

class FileDescriptorTest : public ::testing::Test
{
protected:
    test::TemporaryDirectory moDirectory;
    const std::string moFile = moDirectory.File("file");
};

unsigned char ByteAt(std::uint64_t nPlace)
{
    return static_cast<unsigned char>((nPlace * 2654435761U) >> 16);
}

// Rows without gaps, with gaps that are read and with gaps that are left out, gathered and not;
// 600 rows are more than one call takes.
TEST_F(FileDescriptorTest, RowsGoWhereTheyBelong)
{
    constexpr std::uint64_t kFirst = 7;
    constexpr std::size_t kRows = 600;
    const FileDescriptor oFile(moFile, O_RDWR | O_CREAT | O_EXCL);
    for (const std::uint64_t nPitch : {5U, 6U, 4101U, 4102U})
    {
        for (const std::size_t nMemoryPitch : {5U, 9U})
        {
            oFile.CutOff(0);
            std::vector<unsigned char> vnOut(nMemoryPitch * kRows);
            for (std::size_t i = 0; i < vnOut.size(); ++i)
            {
                vnOut[i] = ByteAt(i);
            }
            const FileRows oRows{kFirst, nPitch, 5, kRows};
            oFile.WriteRows(oRows, vnOut.data(), nMemoryPitch);
            EXPECT_EQ(oFile.GetSize(), kFirst + nPitch * (kRows - 1) + 5);
            const std::string oBytes = test::BytesOf(moFile);
            std::vector<unsigned char> vnBack(vnOut.size());
            oFile.ReadRows(oRows, vnBack.data(), nMemoryPitch);
            for (std::size_t y = 0; y < kRows; ++y)
            {
                const unsigned char* pRow = vnOut.data() + y * nMemoryPitch;
                ASSERT_EQ(std::memcmp(oBytes.data() + kFirst + y * nPitch, pRow, 5), 0) << y;
                ASSERT_EQ(std::memcmp(vnBack.data() + y * nMemoryPitch, pRow, 5), 0) << y;
            }
            if (nMemoryPitch > 5)
            {
                EXPECT_EQ(vnBack[5], 0);  // between the rows nothing is written
            }
        }
    }
}

TEST_F(FileDescriptorTest, ReadingBehindTheEndIsAnError)
{
    moDirectory.Write("file", "12345");
    const FileDescriptor oFile(moFile, O_RDONLY);
    std::array<unsigned char, 4> anBytes{};
    oFile.ReadAt(1, anBytes);
    EXPECT_EQ(anBytes[3], '5');
    EXPECT_NO_THROW(oFile.ReadAt(100, std::span(anBytes).first(0)));
    EXPECT_EQ(
        MessageOf<IOException>([&] { oFile.ReadAt(2, anBytes); }),
        moFile + ": cannot read the file: the file ends at byte 5, before what is looked for");
    EXPECT_EQ(MessageOf<IOException>([&] { oFile.WriteAt(0, anBytes); }),
              moFile + ": cannot write the file: Bad file descriptor");
}

TEST_F(FileDescriptorTest, ReservedBytesAreZerosAndKeepWhatIsThere)
{
    moDirectory.Write("file", "12345");
    const FileDescriptor oFile(moFile, O_RDWR);
    oFile.Reserve(2, 6);
    EXPECT_EQ(test::BytesOf(moFile), std::string("12345\0\0\0", 8));
    EXPECT_THROW(oFile.Reserve(8, 1ULL << 62), IOException);
}

TEST_F(FileDescriptorTest, OneOpenFileHasTheLock)
{
    moDirectory.Write("file", "");
    const FileDescriptor oSecond(moFile, O_RDWR);
    {
        const FileDescriptor oFirst(moFile, O_RDWR);
        EXPECT_EQ(oFirst.GetIdentity(), oSecond.GetIdentity());
        EXPECT_TRUE(oFirst.TryLock());
        EXPECT_TRUE(oFirst.TryLock());
        EXPECT_FALSE(oSecond.TryLock());
    }
    EXPECT_TRUE(oSecond.TryLock());
}

TEST_F(FileDescriptorTest, OtherThingsThanFilesAreRefused)
{
    ASSERT_EQ(mkfifo(moFile.c_str(), 0600), 0);
    EXPECT_EQ(MessageOf<FileException>([&] { FileDescriptor(moFile, O_RDONLY); }),
              moFile + ": cannot open the file: this is not a regular file");
    const std::string oNone = moDirectory.File("none");
    EXPECT_EQ(MessageOf<FileException>([&] { FileDescriptor(oNone, O_RDWR); }),
              oNone + ": cannot open the file for changing: No such file or directory");
}

}  // namespace
}  // namespace kor::datasources
