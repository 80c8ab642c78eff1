#include <gtest/gtest.h>

#include <memory>
#include <string>

#include "platform/datasources/basicreader.h"
#include "platform/datasources/basicwriter.h"
#include "platform/datasources/datasetmanager.h"
#include "platform/datasources/gdal/gdaldriver.h"
#include "platform/exception/exception.h"
#include "tests/support/blocks.h"
#include "tests/support/program.h"
#include "tests/support/temporarydirectory.h"

namespace kor::test
{
namespace
{

class PcaProgram : public ::testing::Test
{
protected:
    /// Channel 1 is 1 3 / 3 1, channel 2 is 10 30 / 10 30: means 2 and 20, variances 1 and 100, and
    /// no covariance.
    PcaProgram()
    {
        datasources::RegisterGdalDriver();
        const std::unique_ptr<datasources::IDataset> poDataset(
            datasources::DatasetManager::GetInstance()->NewDataset(moIn, "GTiff", ""));
        auto& oImage = dynamic_cast<datasources::IRasterDataset&>(*poDataset);
        oImage.CreateChannels({2, 2, 2, tessel::eDT_8U});
        oImage.SetGeocodingInfo(ogc::cs::GeocodingInfo(500, 10, 700, -10));
        datasources::BasicWriter(&oImage, {1, 2})
            .WriteRaster(
                RasterOf(Image<std::uint8_t>{{1, 10, 3, 30}, {3, 10, 1, 30}}, {}, 2).get());
    }

    ProgramRun Run(const std::string& oOut, const std::string& oWords) const
    {
        return RunExample("pca", "'" + moIn + "' '" + moFolder.File(oOut) + "' " + oWords);
    }
    template <class T>
    Image<T> Read(const std::string& oName, unsigned int nChannel) const
    {
        datasources::BasicReader oReader(moFolder.File(oName), {nChannel}, 0);
        const auto poRaster =
            BlankRaster(oReader.GetWidth(), oReader.GetHeight(), 1, oReader.GetDataType());
        oReader.ReadRaster(poRaster.get());
        return ImageOf<T>(*poRaster);
    }

    TemporaryDirectory moFolder;
    std::string moIn = moFolder.File("in.tif");
};

// The vectors are (0, -1) and (-1, 0): component 1 is 20 - x.
TEST_F(PcaProgram, WritesComponentsFromTheStrongest)
{
    const ProgramRun oRun = Run("out.tif", "type=32R");
    ASSERT_EQ(oRun.mnStatus, 0) << oRun.moComplaint;
    EXPECT_EQ(Read<float>("out.tif", 1), (Image<float>{{10, -10}, {10, -10}}));
    EXPECT_EQ(Read<float>("out.tif", 2), (Image<float>{{1, -1}, {-1, 1}}));
    EXPECT_EQ(oRun.moComplaint, "");
    const datasources::BasicReader oReader(moFolder.File("out.tif"), {1, 2}, 0);
    EXPECT_EQ(oReader.GetGeocodingInfo().GetXOffset(), 500.0);
    EXPECT_EQ(oReader.GetAuxiliaryData().GetChannelDescription(1),
              "Principal component 1, 99.01 % of the variance");
    EXPECT_EQ(moFolder.Names(), (std::set<std::string>{"in.tif", "out.tif"}));
}

// One of two deviations is half the way from the middle to the end: 127.5 + 63.75 + 0.5 is cut to
// 191, 127.5 - 63.75 + 0.5 to 64. In 16 bits 32767.5 + 32767.5 / 2 + 0.5 to 49151.
TEST_F(PcaProgram, ScalesByMeanAndDeviation)
{
    ASSERT_EQ(Run("out8.tif", "deviations=2 components=1").mnStatus, 0);
    EXPECT_EQ(Read<std::uint8_t>("out8.tif", 1), (Image<std::uint8_t>{{191, 64}, {191, 64}}));
    EXPECT_THROW(Read<std::uint8_t>("out8.tif", 2), Exception);
    ASSERT_EQ(Run("out16.tif", "deviations=2 type=16U").mnStatus, 0);
    EXPECT_EQ(Read<std::uint16_t>("out16.tif", 1),
              (Image<std::uint16_t>{{49151, 16384}, {49151, 16384}}));
}

TEST_F(PcaProgram, PrintsTheReport)
{
    const ProgramRun oShort = Run("short.tif", "deviations=2");
    EXPECT_EQ(oShort.moSaid.find("PCA\n\n" + moIn + "\n Input  Channels:   1   2\n"), 0U)
        << oShort.moSaid;
    EXPECT_NE(oShort.moSaid.find(" Sample Size      :                4\n"), std::string::npos);
    EXPECT_NE(oShort.moSaid.find("      1                  100             10           99%\n"),
              std::string::npos)
        << oShort.moSaid;
    EXPECT_NE(oShort.moSaid.find(
                  "     1     1          -10           10     2.00      127.500       6.375\n"),
              std::string::npos)
        << oShort.moSaid;
    EXPECT_EQ(oShort.moSaid.find("Covariance"), std::string::npos);
    const ProgramRun oLong = Run("long.tif", "report=long window=0,0,1,2");
    EXPECT_NE(oLong.moSaid.find(" Sampling Window  :    0    0   1    2\n"), std::string::npos)
        << oLong.moSaid;
    EXPECT_NE(oLong.moSaid.find("Covariance Matrix"), std::string::npos);
}

TEST_F(PcaProgram, RefusesWhatItCannotUseAndLeavesNoFile)
{
    for (const char* pszWords : {"type=64X", "components=3", "channels=3", "window=1,2,3",
                                 "window=0,0,1,1.5", "report=no", "deviations=0", "nonsense=1"})
    {
        const ProgramRun oRun = Run("out.tif", pszWords);
        EXPECT_EQ(oRun.mnStatus, 2) << pszWords;
        EXPECT_EQ(oRun.moComplaint.find("pca: "), 0U) << oRun.moComplaint;
    }
    EXPECT_EQ(Run("out.tif", "window=9,9,1,1").mnStatus, 1);
    const ProgramRun oBitmap = Run("out.tif", "bitmap=1");
    EXPECT_EQ(oBitmap.mnStatus, 1);
    EXPECT_NE(oBitmap.moComplaint.find("there is no bitmap 1"), std::string::npos);
    EXPECT_EQ(RunExample("pca", "").mnStatus, 2);
    EXPECT_EQ(moFolder.Names(), (std::set<std::string>{"in.tif"}));
}

}  // namespace
}  // namespace kor::test
