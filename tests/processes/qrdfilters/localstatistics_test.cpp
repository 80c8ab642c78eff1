#include "processes/qrdfilters/localstatistics.h"

#include <gtest/gtest.h>

#include <cmath>
#include <memory>

#include "tests/support/blocks.h"
#include "tests/support/localstatisticsreference.h"

namespace kor::filters
{
namespace
{

using namespace kor::test;
using tessel::eDT_64R;

std::unique_ptr<tessel::Raster> Statistics(const LocalStatisticsConfig& oConfig,
                                           const tessel::Raster& oIn,
                                           const tessel::Mask* poMaskIn = nullptr,
                                           const tessel::Mask* poMaskOut = nullptr)
{
    return std::unique_ptr<tessel::Raster>(
        BuildLocalStatistics(oConfig, &oIn, poMaskIn, poMaskOut));
}

// 1 2 3: mean 2, variance 1; 2 3 7: mean 4, variance (4 + 1 + 9) / 2.
TEST(BuildLocalStatistics, HoldsCountMeanAndVariance)
{
    const auto poIn = RasterOf(Image<double>{{1, 2, 3, 7}}, Margins{1, 0});
    EXPECT_EQ(ImageOf<double>(*Statistics({}, *poIn)), (Image<double>{{3, 2, 1, 3, 4, 7}}));
}

TEST(BuildLocalStatistics, KeepsTheChannelsApart)
{
    const auto poIn = RasterOf(Image<double>{{1, 30, 2, 20, 3, 10}}, Margins{1, 0}, 2);
    const auto poStatistics = Statistics({}, *poIn);
    EXPECT_EQ(poStatistics->mnChannels, 6U);
    EXPECT_EQ(ImageOf<double>(*poStatistics), (Image<double>{{3, 2, 1, 3, 20, 100}}));
}

TEST(BuildLocalStatistics, HasTheInputsSizeAndOffsetsAndNoMargins)
{
    tessel::Raster oIn(tessel::RasterInfo(3, 2, 1, eDT_64R), tessel::RasterContext(2, 1, 40, 50));
    std::fill_n(oIn.GetPixelAs<double>(-2, -1), 28, 4.0);
    const auto poStatistics = Statistics({}, oIn);
    EXPECT_EQ(poStatistics->mnWidth, 3U);
    EXPECT_EQ(poStatistics->mnHeight, 2U);
    EXPECT_EQ(poStatistics->moDataType, eDT_64R);
    EXPECT_EQ(poStatistics->mnMarginX, 0U);
    EXPECT_EQ(poStatistics->mnMarginY, 0U);
    EXPECT_EQ(poStatistics->mnOffsetX, 40U);
    EXPECT_EQ(poStatistics->mnOffsetY, 50U);
    EXPECT_EQ(*poStatistics->GetPixelAs<double>(2, 1), 15.0);
}

TEST(BuildLocalStatistics, TakesTheSetSizesOnlyTogether)
{
    const auto poIn = RasterOf(Image<double>{{1, 2, 3, 4, 90}}, Margins{2, 0});
    EXPECT_EQ(*Statistics({3, boost::none, false}, *poIn)->GetPixelAs<double>(0, 0), 5.0);
    EXPECT_EQ(*Statistics({boost::none, 3, false}, *poIn)->GetPixelAs<double>(0, 0), 5.0);
    EXPECT_EQ(ImageOf<double>(*Statistics({3, 1, false}, *poIn)), (Image<double>{{3, 3, 1}}));
}

TEST(BuildLocalStatistics, EvenSizeActsAsTheNextLowerOddOneOfTheHalf)
{
    const auto poIn = RasterOf(Image<double>{{1, 2, 3, 4, 90}}, Margins{2, 0});
    EXPECT_EQ(*Statistics({4, 0, false}, *poIn)->GetPixelAs<double>(0, 0), 5.0);
    EXPECT_EQ(*Statistics({2, 1, false}, *poIn)->GetPixelAs<double>(0, 0), 3.0);
}

TEST(BuildLocalStatistics, LeavesMaskedPixelsOut)
{
    const auto poIn = RasterOf(Image<double>{{1, 2, INFINITY, 5}}, Margins{1, 0});
    const auto poMask = MaskOf({{1, 1, 0, 1}}, Margins{1, 0});
    EXPECT_EQ(ImageOf<double>(*Statistics({}, *poIn, poMask.get())),
              (Image<double>{{2, 1.5, 0.5, 0, 0, 0}}));
}

// A single valid pixel: the mean is the pixel, 0 / 0 the variance.
TEST(BuildLocalStatistics, DividesBySampleCountLessOneWithoutGuard)
{
    const auto poIn = RasterOf(Image<double>{{1, 2, 3}}, Margins{1, 0});
    const auto poMask = MaskOf({{0, 1, 0}}, Margins{1, 0});
    const Image<double> oStatistics = ImageOf<double>(*Statistics({}, *poIn, poMask.get()));
    EXPECT_EQ(oStatistics.Samples()[0], 1.0);
    EXPECT_EQ(oStatistics.Samples()[1], 2.0);
    EXPECT_TRUE(std::isnan(oStatistics.Samples()[2]));
}

TEST(BuildLocalStatistics, BackgroundPixelsHaveZerosWhateverTheFlag)
{
    const auto poIn = RasterOf(Image<double>{{1, 2, 3, 4, 5}}, Margins{1, 0});
    const auto poMaskIn = MaskOf({{1, 0, 1, 1, 1}}, Margins{1, 0});
    const auto poMaskOut = MaskOf({{1, 0, 1}});
    for (const bool bBGZero : {false, true})
    {
        EXPECT_EQ(ImageOf<double>(*Statistics({boost::none, boost::none, bBGZero}, *poIn,
                                              poMaskIn.get(), poMaskOut.get())),
                  (Image<double>{{0, 0, 0, 0, 0, 0, 3, 4, 1}}));
    }
}

TEST(BuildLocalStatistics, AcceptsAnEmptyBlock)
{
    const auto poIn = BlankRaster(0, 3, 1, eDT_64R, Margins{1, 1});
    EXPECT_EQ(Statistics({}, *poIn)->mnBufferSize, 0U);
}

TEST(BuildLocalStatistics, GivesTheBitsOfTheDefinition)
{
    Random oRandom(31);
    for (int i = 0; i < 60; ++i)
    {
        const auto nWidth = 1 + static_cast<std::uint32_t>(oRandom() % 300);
        const auto nHeight = 1 + static_cast<std::uint32_t>(oRandom() % 20);
        const auto nChannels = 1 + static_cast<std::uint32_t>(oRandom() % 4);
        const Margins oMargins{static_cast<std::uint32_t>(oRandom() % 4),
                               static_cast<std::uint32_t>(oRandom() % 4)};
        const auto poIn = RandomRaster(nWidth, nHeight, nChannels, eDT_64R, oMargins,
                                       i % 2 == 0 ? Samples::Ordinary : Samples::Special, oRandom);
        const auto poMask = RandomMask(nWidth, nHeight, oMargins, 0.8, oRandom);
        const auto* poMaskIn = i % 3 == 0 ? nullptr : poMask.get();
        const auto poActual = Statistics({}, *poIn, poMaskIn);
        const auto voExpected =
            LocalStatisticsByDefinition(*poIn, poMaskIn, oMargins.x, oMargins.y);
        for (std::size_t k = 0; k < voExpected.size(); ++k)
        {
            const std::size_t nPixel = k / nChannels;
            if (IsValid(poMaskIn, static_cast<std::int64_t>(nPixel % nWidth),
                        static_cast<std::int64_t>(nPixel / nWidth)))
            {
                const double* pActual = poActual->GetPixelAs<double>(0, 0) + 3 * k;
                ASSERT_TRUE(SameSample(pActual[0], voExpected[k].n));
                ASSERT_TRUE(SameSample(pActual[1], voExpected[k].dfMean));
                ASSERT_TRUE(SameSample(pActual[2], voExpected[k].dfVariance)) << k;
            }
        }
    }
}

}  // namespace
}  // namespace kor::filters
