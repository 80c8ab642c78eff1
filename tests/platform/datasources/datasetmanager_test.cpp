#include "platform/datasources/datasetmanager.h"

#include <gtest/gtest.h>
#include <sys/stat.h>

#include "platform/datasources/basicreader.h"
#include "tests/support/exceptions.h"
#include "tests/support/memorydataset.h"
#include "tests/support/temporarydirectory.h"

namespace kor::datasources
{
namespace
{

using test::MessageOf;

/// Opens files that begin with "MEMORY" as an image of 2 x 1 bytes, 5 and 6.
class MemoryDriver : public IDatasetDriver
{
public:
    std::string GetName() const override { return "MEMORY"; }
    bool Recognizes(const std::string& oFile) const override
    {
        return test::BytesOf(oFile).starts_with("MEMORY");
    }
    std::unique_ptr<IDataset> Open(const std::string& /*oFile*/, bool bUpdate) const override
    {
        auto poDataset = std::make_unique<test::MemoryDataset>(2, 1, std::vector{tessel::eDT_8U});
        *poDataset->At(1, 0, 0) = 5;
        *poDataset->At(1, 1, 0) = 6;
        poDataset->mbReadOnly = !bUpdate;
        return poDataset;
    }
    bool HasFormat(const std::string& oFormat) const override { return oFormat == "MEMORY"; }
    std::unique_ptr<IDataset> Create(const std::string& /*oFile*/, const std::string& /*oFormat*/,
                                     const std::string& oOptions) const override
    {
        if (oOptions == "HUGE")
        {
            throw std::bad_alloc();
        }
        return std::make_unique<test::MemoryDataset>();
    }
    bool AllowFormat(const std::string& oFormat) override { return oFormat == "MORE"; }
};

class DatasetManagerTest : public ::testing::Test
{
protected:
    DatasetManagerTest() { DatasetManager::RegisterDriver(std::make_unique<MemoryDriver>()); }

    static std::unique_ptr<IDataset> Open(const std::string& oFile, int nAccess = 0)
    {
        return std::unique_ptr<IDataset>(DatasetManager::GetInstance()->Open(oFile, nAccess));
    }
    static std::unique_ptr<IDataset> New(const std::string& oFile, const std::string& oFormat,
                                         const std::string& oOptions = "")
    {
        return std::unique_ptr<IDataset>(
            DatasetManager::GetInstance()->NewDataset(oFile, oFormat, oOptions));
    }

    test::TemporaryDirectory moDirectory;
};

TEST_F(DatasetManagerTest, OpensAFileByTheDriverThatRecognizesIt)
{
    const std::string oFile = moDirectory.Write("file", "MEMORY");
    const auto poRead = Open(oFile, 0);
    EXPECT_TRUE(dynamic_cast<test::MemoryDataset&>(*poRead).mbReadOnly);
    const auto poUpdate = Open(oFile, 1);
    EXPECT_FALSE(dynamic_cast<test::MemoryDataset&>(*poUpdate).mbReadOnly);
}

TEST_F(DatasetManagerTest, ReaderOpensAFileItself)
{
    const std::string oFile = moDirectory.Write("file", "MEMORY");
    for (const int nFlag : {0, 1})
    {
        BasicReader oReader(oFile, {1}, nFlag);
        const std::unique_ptr<tessel::Raster> poRaster(oReader.GetRaster(0));
        EXPECT_EQ(poRaster->mpBuffer[1], 6);
    }
    EXPECT_EQ(MessageOf<DataException>([&] { BasicReader(oFile, {1}, 2); }),
              oFile + ": nFlag is 2; it can be 0 or 1");
    EXPECT_THROW(BasicReader(moDirectory.File("none"), {1}, 0), FileException);
}

TEST_F(DatasetManagerTest, FileThatNoDriverKnowsIsRefused)
{
    const std::string oFile = moDirectory.Write("file", "something else");
    const std::string oMessage = MessageOf<FileException>([&] { Open(oFile); });
    EXPECT_EQ(oMessage.find(oFile + ": no driver knows this kind of file; drivers: "), 0U);
    EXPECT_NE(oMessage.find("MEMORY"), std::string::npos);
}

TEST_F(DatasetManagerTest, OnlyRegularFilesAreOpened)
{
    const std::string oPipe = moDirectory.File("pipe");
    ASSERT_EQ(mkfifo(oPipe.c_str(), 0600), 0);
    std::filesystem::create_symlink("nowhere", moDirectory.File("dangling"));

    EXPECT_EQ(MessageOf<FileException>([&] { Open(moDirectory.File("none")); }),
              moDirectory.File("none") + ": there is no such file");
    EXPECT_EQ(MessageOf<FileException>([&] { Open(moDirectory.File("dangling")); }),
              moDirectory.File("dangling") + ": there is no such file");
    EXPECT_EQ(MessageOf<FileException>([&] { Open(moDirectory.File("")); }),
              moDirectory.File("") + ": this is a directory and not a file");
    EXPECT_EQ(MessageOf<FileException>([&] { Open(oPipe); }),
              oPipe + ": this is not a regular file");
    EXPECT_EQ(MessageOf<FileException>([&] { Open("/dev/null"); }),
              "/dev/null: this is not a regular file");
}

TEST_F(DatasetManagerTest, NamesOfOtherThingsThanFilesAreRefused)
{
    EXPECT_EQ(MessageOf<FileException>([&] { Open(""); }), ": the file's name is empty");
    EXPECT_EQ(MessageOf<FileException>([&] { Open("http://example.org/x.tif"); }),
              "http://example.org/x.tif: this is a network address and not a file");
    EXPECT_EQ(MessageOf<FileException>([&] { New("s3://bucket/x.tif", "MEMORY"); }),
              "s3://bucket/x.tif: this is a network address and not a file");
    const std::string oVirtual =
        "/vsimem/x.tif: this is the name of a virtual file; only files of the file system are used";
    EXPECT_EQ(MessageOf<FileException>([&] { Open("/vsimem/x.tif"); }), oVirtual);
    EXPECT_EQ(MessageOf<FileException>([&] { New("/vsimem/x.tif", "MEMORY"); }), oVirtual);
    EXPECT_THROW(Open(std::string("a\0b", 3)), FileException);
}

TEST_F(DatasetManagerTest, UnknownAccessIsRefused)
{
    const std::string oFile = moDirectory.Write("file", "MEMORY");
    EXPECT_EQ(MessageOf<DataException>([&] { Open(oFile, 2); }),
              oFile + ": nAccess is 2; it can be 0 (reading) or 1 (changing)");
}

TEST_F(DatasetManagerTest, ExistingFileIsNeverOverwritten)
{
    const std::string oFile = moDirectory.Write("file", "precious");
    EXPECT_EQ(MessageOf<FileException>([&] { New(oFile, "MEMORY"); }),
              oFile + ": this file exists already and is not overwritten");
    EXPECT_EQ(test::BytesOf(oFile), "precious");
}

TEST_F(DatasetManagerTest, MakesFilesOfKnownFormats)
{
    EXPECT_NE(New(moDirectory.File("new"), "MEMORY"), nullptr);
    const std::string oMessage =
        MessageOf<DataException>([&] { New(moDirectory.File("new"), "NOTHING"); });
    EXPECT_EQ(oMessage.find(moDirectory.File("new") +
                            ": no driver knows a format \"NOTHING\"; drivers: "),
              0U);
}

TEST_F(DatasetManagerTest, FailuresOfADriverAreReported)
{
    EXPECT_EQ(MessageOf<IOException>([&] { New(moDirectory.File("new"), "MEMORY", "HUGE"); }),
              moDirectory.File("new") + ": out of memory");
}

TEST_F(DatasetManagerTest, DriverThatKnowsAFormatIsToldToAllowIt)
{
    EXPECT_NO_THROW(DatasetManager::AllowDriver("MORE"));
    EXPECT_EQ(MessageOf<DataException>([] { DatasetManager::AllowDriver("NOTHING"); })
                  .find("No driver knows a format \"NOTHING\"; drivers: "),
              0U);
}

TEST_F(DatasetManagerTest, AddingADriverTwiceIsHarmless)
{
    DatasetManager::RegisterDriver(std::make_unique<MemoryDriver>());
    const std::string oMessage = MessageOf<DataException>([&] { New("x", "NOTHING"); });
    EXPECT_EQ(oMessage.find("MEMORY"), oMessage.rfind("MEMORY"));
}

}  // namespace
}  // namespace kor::datasources
