#include <gtest/gtest.h>

#include <filesystem>

#include "platform/datasources/basicreader.h"
#include "platform/datasources/gdal/gdaldriver.h"
#include "tests/support/blocks.h"
#include "tests/support/program.h"
#include "tests/support/temporarydirectory.h"

namespace kor::test
{
namespace
{

constexpr const char* kGridHead =
    "ncols 3\nnrows 2\nxllcorner 0\nyllcorner 0\ncellsize 1\nNODATA_value -9999\n";

class Quicklook : public ::testing::Test
{
protected:
    void SetUp() override { datasources::RegisterGdalDriver(); }

    std::string WriteGrid(const std::string& oName, const std::string& oRows) const
    {
        return moFolder.Write(oName, kGridHead + oRows);
    }
    Image<std::uint8_t> ReadPicture(const std::string& oName) const
    {
        datasources::BasicReader oReader(moFolder.File("look/" + oName), {1}, 0);
        const auto poRaster =
            BlankRaster(oReader.GetWidth(), oReader.GetHeight(), 1, oReader.GetDataType());
        oReader.ReadRaster(poRaster.get());
        return ImageOf<std::uint8_t>(*poRaster);
    }

    TemporaryDirectory moFolder;
};

// Of the five valid samples 0, 100, 200, 250 and 400, the 2 % one is the first, the 98 % one the
// fourth.
TEST_F(Quicklook, ShowsFilesOnTheScaleOfTheFirstAndMissingDataInBlack)
{
    const std::string oFirst = WriteGrid("first.asc", "0 100 200\n250 400 -9999\n");
    const std::string oSecond = WriteGrid("second.asc", "250 125 50\n-9999 -9999 0\n");
    const ProgramRun oRun =
        RunExample("quicklook", moFolder.File("look") + " " + oFirst + " " + oSecond);
    ASSERT_EQ(oRun.mnStatus, 0) << oRun.moComplaint;
    EXPECT_EQ(ReadPicture("first.png"), (Image<std::uint8_t>{{0, 102, 204}, {255, 255, 0}}));
    EXPECT_EQ(ReadPicture("second.png"), (Image<std::uint8_t>{{255, 128, 51}, {0, 0, 0}}));
}

TEST_F(Quicklook, EndsInOneLineWhenAFileIsMissing)
{
    const std::string oMissing = moFolder.File("nowhere.tif");
    const ProgramRun oRun = RunExample("quicklook", moFolder.File("look") + " " + oMissing);
    EXPECT_EQ(oRun.mnStatus, 1);
    EXPECT_NE(oRun.moComplaint.find(oMissing), std::string::npos) << oRun.moComplaint;
    EXPECT_EQ(oRun.moComplaint.find('\n'), oRun.moComplaint.size() - 1);
    EXPECT_FALSE(std::filesystem::exists(moFolder.File("look")));
}

}  // namespace
}  // namespace kor::test
