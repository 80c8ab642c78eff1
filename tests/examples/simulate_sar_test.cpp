#include <gtest/gtest.h>

#include <filesystem>
#include <sstream>

#include "platform/datasources/basicreader.h"
#include "platform/datasources/gdal/gdaldriver.h"
#include "tests/support/blocks.h"
#include "tests/support/program.h"
#include "tests/support/temporarydirectory.h"

namespace kor::test
{
namespace
{

/// A plain of 20 x 12 pixels of 30 m with a wall of 600 m from north to south, 5 pixels wide.
class SimulateSar : public ::testing::Test
{
protected:
    void SetUp() override
    {
        datasources::RegisterGdalDriver();
        std::stringstream oText;
        oText << "ncols 20\nnrows 12\nxllcorner 480000\nyllcorner 5000000\ncellsize 30\n"
                 "NODATA_value -9999\n";
        for (int y = 0; y < 12; ++y)
        {
            for (int x = 0; x < 20; ++x)
            {
                oText << (x >= 8 && x <= 12 ? 600 : 0) << (x == 19 ? '\n' : ' ');
            }
        }
        moDem = moFolder.Write("dem.asc", oText.str());
    }

    ProgramRun Run(const std::string& oWords) const
    {
        return RunExample("simulate_sar", moDem + " " + moFolder.File("out.tif") + " " + oWords);
    }
    Image<std::uint16_t> Channel(unsigned int nChannel) const
    {
        datasources::BasicReader oReader(moFolder.File("out.tif"), {nChannel}, 0);
        const auto poRaster =
            BlankRaster(oReader.GetWidth(), oReader.GetHeight(), 1, oReader.GetDataType());
        oReader.ReadRaster(poRaster.get());
        return ImageOf<std::uint16_t>(*poRaster);
    }

    TemporaryDirectory moFolder;
    std::string moDem;
};

std::size_t Ones(const Image<std::uint16_t>& oImage)
{
    const auto& vnSamples = oImage.Samples();
    EXPECT_EQ(std::count_if(vnSamples.begin(), vnSamples.end(), [](int n) { return n > 1; }), 0);
    return static_cast<std::size_t>(std::count(vnSamples.begin(), vnSamples.end(), 1));
}

TEST_F(SimulateSar, WritesImageLayoverAndShadowOnTheMap)
{
    const ProgramRun oRun = Run("heading=0 look=20");
    ASSERT_EQ(oRun.mnStatus, 0) << oRun.moComplaint;
    EXPECT_NE(oRun.moSaid.find("map geometry: 20 x 12 pixels"), std::string::npos) << oRun.moSaid;
    const Image<std::uint16_t> oImage = Channel(1);
    EXPECT_EQ(oImage.Columns(), 20U);
    EXPECT_EQ(oImage.Rows(), 12U);
    // The plain far from the ridge: 2 x 2 sub-samples a pixel.
    EXPECT_EQ(oImage.Samples()[5 * 20 + 2], 4);
    EXPECT_GT(Ones(Channel(2)), 0U);
    // The sensor is in the west: the shadow lies behind the wall.
    const Image<std::uint16_t> oShadow = Channel(3);
    EXPECT_GT(Ones(oShadow), 0U);
    for (std::size_t i = 0; i < oShadow.Samples().size(); ++i)
    {
        EXPECT_TRUE(i % 20 >= 12 || oShadow.Samples()[i] == 0) << i;
    }
    datasources::BasicReader oReader(moFolder.File("out.tif"), {3}, 0);
    EXPECT_EQ(oReader.GetGeocodingInfo().GetXOffset(), 480000.0);
    EXPECT_EQ(oReader.GetAuxiliaryData().GetChannelDescription(1), "Shadow mask");
}

TEST_F(SimulateSar, WritesTheRadarsOwnGeometry)
{
    const ProgramRun oRun = Run("geometry=radar heading=0 look=20 resolution=15,30");
    ASSERT_EQ(oRun.mnStatus, 0) << oRun.moComplaint;
    const Image<std::uint16_t> oImage = Channel(1);
    EXPECT_EQ(oImage.Rows(), 12U);
    EXPECT_GT(oImage.Columns(), 40U);  // half as wide pixels, and the ridge that falls before all
    EXPECT_GT(Ones(Channel(2)), 0U);
    EXPECT_FALSE(std::filesystem::exists(moFolder.File("out.tif.scratch")));
}

TEST_F(SimulateSar, SaysWhatIsWrongInOneLine)
{
    EXPECT_EQ(RunExample("simulate_sar", moDem).mnStatus, 2);
    const auto oComplaint = [&](const std::string& oWords, int nStatus)
    {
        const ProgramRun oRun = Run(oWords);
        EXPECT_EQ(oRun.mnStatus, nStatus) << oWords;
        EXPECT_EQ(oRun.moComplaint.find('\n'), oRun.moComplaint.size() - 1) << oRun.moComplaint;
        EXPECT_FALSE(std::filesystem::exists(moFolder.File("out.tif")));
        return oRun.moComplaint;
    };
    EXPECT_NE(oComplaint("heading=400", 2).find("heading"), std::string::npos);
    EXPECT_NE(oComplaint("pixel=30", 2).find("two numbers"), std::string::npos);
    EXPECT_NE(oComplaint("speed=3", 2).find("speed"), std::string::npos);
    EXPECT_NE(oComplaint("look=89", 1).find("a radar image of"), std::string::npos);
    EXPECT_NE(oComplaint("geometry=radar resolution=1e-6,1e-6", 1).find("radar image of"),
              std::string::npos);
    moDem = moFolder.File("nowhere.tif");
    EXPECT_NE(oComplaint("", 1).find(moDem), std::string::npos);
}

TEST_F(SimulateSar, AsksForTheSizeOfPixelsInDegrees)
{
    moFolder.Write("dem.prj",
                   "GEOGCS[\"WGS 84\",DATUM[\"WGS_1984\",SPHEROID[\"WGS 84\",6378137,"
                   "298.257223563]],PRIMEM[\"Greenwich\",0],UNIT[\"degree\","
                   "0.0174532925199433]]");
    const ProgramRun oRun = Run("heading=0");
    EXPECT_EQ(oRun.mnStatus, 2);
    EXPECT_NE(oRun.moComplaint.find("pixel=WIDTH,HEIGHT"), std::string::npos) << oRun.moComplaint;
    EXPECT_EQ(Run("heading=0 pixel=74,93").mnStatus, 0);
}

}  // namespace
}  // namespace kor::test
