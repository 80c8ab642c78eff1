#include <gtest/gtest.h>

#include <memory>
#include <string>

#include "platform/datasources/basicreader.h"
#include "platform/datasources/basicwriter.h"
#include "platform/datasources/datasetmanager.h"
#include "platform/datasources/gdal/gdaldriver.h"
#include "tests/support/blocks.h"
#include "tests/support/program.h"
#include "tests/support/temporarydirectory.h"

namespace kor::test
{
namespace
{

/// filter_file with the filters that look at the whole image first.
class StatisticsFilters : public ::testing::Test
{
protected:
    /// Channel 1 is 1 3 / 3 1, channel 2 is 10 30 / 10 30: means 2 and 20, variances 1 and 100, and
    /// no covariance.
    StatisticsFilters()
    {
        datasources::RegisterGdalDriver();
        const std::unique_ptr<datasources::IDataset> poDataset(
            datasources::DatasetManager::GetInstance()->NewDataset(moIn, "GTiff", ""));
        auto& oImage = dynamic_cast<datasources::IRasterDataset&>(*poDataset);
        oImage.CreateChannels({2, 2, 2, tessel::eDT_8U});
        datasources::AuxiliaryData oData;
        oData.SetChannelDescription("red", 1);
        oImage.SetAuxiliaryData(oData);
        datasources::BasicWriter(&oImage, {1, 2})
            .WriteRaster(
                RasterOf(Image<std::uint8_t>{{1, 10, 3, 30}, {3, 10, 1, 30}}, {}, 2).get());
    }

    ProgramRun Run(const std::string& oWords) const
    {
        return RunExample("filter_file",
                          "'" + moIn + "' '" + moOut + "' " + oWords + " replace=yes");
    }
    template <class T>
    Image<T> Read(unsigned int nChannel) const
    {
        datasources::BasicReader oReader(moOut, {nChannel}, 0);
        const auto poRaster =
            BlankRaster(oReader.GetWidth(), oReader.GetHeight(), 1, oReader.GetDataType());
        oReader.ReadRaster(poRaster.get());
        return ImageOf<T>(*poRaster);
    }

    TemporaryDirectory moFolder;
    std::string moIn = moFolder.File("in.tif");
    std::string moOut = moFolder.File("out.tif");
};

// The vectors are (0, -1) and (-1, 0): component 1 is 20 - x. In 16 signed bits with two
// deviations at the ends -0.5 + 10 * 32767.5 / 20, rounded away from 0.
TEST_F(StatisticsFilters, TransformToPrincipalComponents)
{
    ASSERT_EQ(Run("pca").moComplaint, "");
    EXPECT_EQ(Read<float>(1), (Image<float>{{10, -10}, {10, -10}}));
    EXPECT_EQ(Read<float>(2), (Image<float>{{1, -1}, {-1, 1}}));
    const datasources::BasicReader oReader(moOut, {1}, 0);
    EXPECT_EQ(oReader.GetAuxiliaryData().GetChannelDescription(1), "");
    ASSERT_EQ(Run("pca type=16S deviations=2 components=1").moComplaint, "");
    EXPECT_EQ(Read<std::int16_t>(1), (Image<std::int16_t>{{16383, -16384}, {16383, -16384}}));
    ASSERT_EQ(Run("pca channels=2 window=0,0,1,2").moComplaint, "");
    EXPECT_EQ(Read<float>(1), (Image<float>{{0, -20}, {0, -20}}));
}

// Channel 2 as classes: those of 10 have 1 and 3, those of 30 have 3 and 1.
TEST_F(StatisticsFilters, HomogeniseClasses)
{
    ASSERT_EQ(Run("homogenise channels=2").moComplaint, "");
    EXPECT_EQ(Read<std::int32_t>(1), (Image<std::int32_t>{{2, 2}, {2, 2}}));
    ASSERT_EQ(Run("homogenise channels=1 values=2 type=8U find=mode").moComplaint, "");
    EXPECT_EQ(Read<std::uint8_t>(1), (Image<std::uint8_t>{{10, 10}, {10, 10}}));
    ASSERT_EQ(Run("homogenise channels=1 values=2 find=mode threshold=0.6 default=9").moComplaint,
              "");
    EXPECT_EQ(Read<std::int32_t>(1), (Image<std::int32_t>{{9, 9}, {9, 9}}));
}

TEST_F(StatisticsFilters, RefuseWhatTheyCannotUse)
{
    EXPECT_EQ(Run("homogenise").moComplaint,
              "filter_file: homogenise takes one channel, of classes, such as channels=2; not 2\n");
    for (const char* pszWords : {"homogenise channels=2 values=3", "pca components=3",
                                 "pca window=1,2", "homogenise channels=2 find=median"})
    {
        EXPECT_EQ(Run(pszWords).mnStatus, 2) << pszWords;
    }
    EXPECT_EQ(Run("pca window=9,9,1,1").mnStatus, 1);
    EXPECT_EQ(moFolder.Names(), (std::set<std::string>{"in.tif"}));
}

TEST_F(StatisticsFilters, TellTheirParameters)
{
    EXPECT_NE(RunExample("filter_file", "help pca").moSaid.find("deviations=3"), std::string::npos);
    EXPECT_NE(RunExample("filter_file", "help homogenise").moSaid.find("threshold=0"),
              std::string::npos);
}

}  // namespace
}  // namespace kor::test
