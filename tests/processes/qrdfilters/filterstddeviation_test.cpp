#include "processes/qrdfilters/filterstddeviation.h"

#include <gtest/gtest.h>

#include <cmath>
#include <thread>

#include "platform/exception/exception.h"
#include "processes/qrdfilters/hardened.h"
#include "tests/support/exceptions.h"
#include "tests/support/filtered.h"
#include "tests/support/plainwindows.h"

namespace kor::filters
{
namespace
{

using namespace kor::test;
using tessel::Mask;
using tessel::Raster;

// m = 1, Q = 81, variance (81 - 9) / 8 = 9.
TEST(FilterStdDeviation, GivesThreeWhereverTheWindowSeesOneNineAmongZeros)
{
    const Image<double> oImage = {
        {0, 0, 0, 0, 0, 0, 0}, {0, 0, 0, 0, 0, 0, 0}, {0, 0, 0, 0, 0, 0, 0}, {0, 0, 0, 9, 0, 0, 0},
        {0, 0, 0, 0, 0, 0, 0}, {0, 0, 0, 0, 0, 0, 0}, {0, 0, 0, 0, 0, 0, 0},
    };
    EXPECT_EQ(Filtered(FilterStdDeviation(), oImage, {1, 1}), (Image<double>{
                                                                  {0, 0, 0, 0, 0},
                                                                  {0, 3, 3, 3, 0},
                                                                  {0, 3, 3, 3, 0},
                                                                  {0, 3, 3, 3, 0},
                                                                  {0, 0, 0, 0, 0},
                                                              }));
}

// Samples 1, 3: m = 2, Q = 10, (10 - 8) / 1. Over n it would be 1.
TEST(FilterStdDeviation, DividesByTheCountLessOne)
{
    const auto poMask = MaskOf({{1, 1, 0}}, {1, 0});
    EXPECT_EQ(Filtered(FilterStdDeviation(), {{1, 3, 90}}, {1, 0}, poMask.get()),
              (Image<double>{{std::sqrt(2.0)}}));
}

TEST(FilterStdDeviation, GivesASampleAloneInItsWindowItsOwnValue)
{
    const auto poMask = MaskOf({{0, 0, 0}, {0, 1, 0}, {0, 0, 0}}, {1, 1});
    EXPECT_EQ(
        Filtered(FilterStdDeviation(), {{1, 2, 3}, {4, -7.5, 6}, {7, 8, 9}}, {1, 1}, poMask.get()),
        (Image<double>{{-7.5}}));
}

TEST(FilterStdDeviation, GivesTheInputWithoutMargins)
{
    const Image<double> oImage = {{1, -2.5, 3e300}, {4, -0.0, INFINITY}};
    EXPECT_EQ(Filtered(FilterStdDeviation(), oImage, {0, 0}), oImage);
}

TEST(FilterStdDeviation, GivesZeroForAConstantBlock)
{
    const Image<double> oImage(9, std::vector<double>(81, 4.0));
    EXPECT_EQ(Filtered(FilterStdDeviation(), oImage, {2, 2}),
              Image<double>(5, std::vector<double>(25, 0.0)));
}

// Q is the sum of three times 0.1 * 0.1, and m * n * m a last bit more. Nothing guards the root.
TEST(FilterStdDeviation, IsNotANumberWhereRoundingMakesTheVarianceNegative)
{
    const double m = (0.1 + 0.1 + 0.1) / 3.0;
    ASSERT_LT(0.1 * 0.1 + 0.1 * 0.1 + 0.1 * 0.1 - m * 3.0 * m, 0.0);
    EXPECT_TRUE(std::isnan(Filtered(FilterStdDeviation(), {{0.1, 0.1, 0.1}}, {1, 0}).Samples()[0]));
}

TEST(FilterStdDeviation, BackgroundIsZeroWhateverIsSet)
{
    const auto poMask = MaskOf({{1, 1, 0, 1, 1}}, {1, 0});
    const auto poClip = MaskOf({{1, 1, 0}});
    FilterStdDeviation oFilter(false);
    // The left window holds 1 and 3 alone, its right neighbour is masked, and the last clipped.
    const Image<double> oExpected = {{std::sqrt(2.0), 0, 0}};
    const Image<double> oImage = {{1, 3, 5, 7, 9}};
    EXPECT_EQ(Filtered(oFilter, oImage, {1, 0}, poMask.get(), poClip.get()), oExpected);
    oFilter.SetBGZero(false);
    EXPECT_EQ(Filtered(oFilter, oImage, {1, 0}, poMask.get(), poClip.get()), oExpected);
    oFilter.SetParameters(false);
    EXPECT_EQ(Filtered(oFilter, oImage, {1, 0}, poMask.get(), poClip.get()), oExpected);
    oFilter.SetBGZero(true);
    EXPECT_EQ(Filtered(oFilter, oImage, {1, 0}, poMask.get(), poClip.get()), oExpected);
}

TEST(FilterStdDeviation, MarginsTellTheWindowWhateverIsSet)
{
    const Image<double> oImage = {{0, 0, 0, 1}, {0, 9, 0, 1}, {0, 0, 0, 1}};
    FilterStdDeviation oFilter;
    const Image<double> oExpected = Filtered(oFilter, oImage, {1, 1});
    EXPECT_EQ(oExpected.Samples()[0], 3.0);
    oFilter.SetFilterSize(1, 1);
    EXPECT_EQ(Filtered(oFilter, oImage, {1, 1}), oExpected);
    oFilter.SetFilterSize(99, 99);
    EXPECT_EQ(Filtered(oFilter, oImage, {1, 1}), oExpected);
    oFilter.SetFilterSize(boost::none, 1);
    EXPECT_EQ(Filtered(oFilter, oImage, {1, 1}), oExpected);
    // 3 columns by 1 row.
    EXPECT_EQ(Filtered(oFilter, Image<double>{{1, 3, 5}}, {1, 0}), (Image<double>{{2}}));
}

TEST(FilterStdDeviation, TreatsChannelsByThemselves)
{
    EXPECT_EQ(Filtered(FilterStdDeviation(), {{1, 10, 3, 20, 5, 30}}, {1, 0}, nullptr, nullptr, 2),
              (Image<double>{{2, 10}}));
}

TEST(FilterStdDeviation, LeavesMaskedPixelsOutOfEveryWindow)
{
    const auto poMask = MaskOf({{1, 1, 0, 1, 1}}, {1, 0});
    EXPECT_EQ(Filtered(FilterStdDeviation(), {{1, 3, NAN, 7, 11}}, {1, 0}, poMask.get()),
              (Image<double>{{std::sqrt(2.0), 0, std::sqrt(8.0)}}));
}

TEST(FilterStdDeviation, CountsPixelsClearedInTheOutputMaskAlone)
{
    const auto poClip = MaskOf({{1, 0}});
    EXPECT_EQ(Filtered(FilterStdDeviation(), {{1, 3, 5, 70}}, {1, 0}, nullptr, poClip.get()),
              (Image<double>{{2, 0}}));
}

TEST(FilterStdDeviation, ProcessBlockIsTheSame)
{
    const auto poIn = RasterOf(Image<double>{{1, 3, 5}}, {1, 0});
    const auto poOut = BlankRaster(1, 1, 1, tessel::eDT_64R);
    FilterStdDeviation().ProcessBlock(poIn.get(), nullptr, poOut.get(), nullptr);
    EXPECT_EQ(ImageOf<double>(*poOut), (Image<double>{{2}}));
}

TEST(FilterStdDeviation, CallOperatorMakesARasterWithoutMargins)
{
    const auto poIn = std::make_shared<Raster>(tessel::RasterInfo(1, 1, 2, tessel::eDT_64R),
                                               tessel::RasterContext(1, 0, 40, 50));
    const double adfSamples[] = {1, 10, 3, 20, 5, 30};
    std::copy_n(adfSamples, 6, reinterpret_cast<double*>(poIn->mpBuffer));
    const auto poOut = FilterStdDeviation()(poIn, nullptr, nullptr);
    EXPECT_EQ(poOut->mnMarginX, 0U);
    EXPECT_EQ(poOut->mnMarginY, 0U);
    EXPECT_EQ(poOut->mnOffsetX, 40U);
    EXPECT_EQ(poOut->mnOffsetY, 50U);
    EXPECT_EQ(ImageOf<double>(*poOut), (Image<double>{{2, 10}}));
    const std::shared_ptr<Mask> poMask = MaskOf({{1, 1, 0}}, {1, 0});
    EXPECT_EQ(ImageOf<double>(*FilterStdDeviation()(poIn, poMask, nullptr)),
              (Image<double>{{std::sqrt(2.0), std::sqrt(50.0)}}));
    const std::shared_ptr<Mask> poClip = MaskOf({{0}});
    EXPECT_EQ(ImageOf<double>(*FilterStdDeviation()(poIn, nullptr, poClip)),
              (Image<double>{{0, 0}}));
}

TEST(FilterStdDeviation, AcceptsBlocksWithoutPixels)
{
    const auto poNoRows = BlankRaster(4, 0, 1, tessel::eDT_64R, {2, 2});
    const auto poNoColumns = BlankRaster(0, 4, 1, tessel::eDT_64R, {2, 2});
    EXPECT_NO_THROW(FilterStdDeviation().Process(poNoRows.get(), nullptr, poNoRows.get(), nullptr));
    EXPECT_NO_THROW(
        FilterStdDeviation().Process(poNoColumns.get(), nullptr, poNoColumns.get(), nullptr));
}

TEST(FilterStdDeviation, RefusesBlocksOfAnotherTypeInHardenedBuilds)
{
    if (!kHardened)
    {
        GTEST_SKIP() << "blocks are checked in hardened builds alone";
    }
    const auto poIn = BlankRaster(2, 2, 1, tessel::eDT_32R, {1, 1});
    const auto poOut = BlankRaster(2, 2, 1, tessel::eDT_64R);
    const auto oFilter = [&]
    { FilterStdDeviation().Process(poIn.get(), nullptr, poOut.get(), nullptr); };
    EXPECT_EQ(MessageOf<Exception>(oFilter),
              "poRasterIn has samples of 32 bits of another type than the filter reads");
}

TEST(FilterStdDeviation, OneObjectServesSeveralThreads)
{
    const FilterStdDeviation oFilter;
    Random oRandom(3);
    const auto poIn = RandomRaster(50, 20, 1, tessel::eDT_64R, {2, 2}, Samples::Ordinary, oRandom);
    std::vector<std::unique_ptr<Raster>> vpoOut;
    std::vector<std::thread> voThreads;
    for (int i = 0; i < 4; ++i)
    {
        vpoOut.push_back(BlankRaster(50, 20, 1, tessel::eDT_64R));
        voThreads.emplace_back([&, poOut = vpoOut.back().get()]
                               { oFilter.Process(poIn.get(), nullptr, poOut, nullptr); });
    }
    for (std::thread& oThread : voThreads)
    {
        oThread.join();
    }
    const auto poExpected = BlankRaster(50, 20, 1, tessel::eDT_64R);
    oFilter.Process(poIn.get(), nullptr, poExpected.get(), nullptr);
    for (const auto& poOut : vpoOut)
    {
        EXPECT_TRUE(SameBits(*poOut, *poExpected));
    }
}

double Deviation(const PlainSums& oSums)
{
    const double n = oSums.mdfCount;
    if (n == 1.0)
    {
        return oSums.mdfCentre;
    }
    const double m = oSums.mdfSum / n;
    return std::sqrt((oSums.mdfSquares - m * n * m) / (n - 1.0));
}

TEST(FilterStdDeviation, GivesTheBitsOfTheDefinition)
{
    Random oRandom(21);
    for (unsigned int i = 0; i < 120; ++i)
    {
        const RandomBlock oBlock(oRandom);
        FilterStdDeviation oFilter(oRandom() % 2 == 0);
        if (oRandom() % 2 == 0)
        {
            oFilter.SetFilterSize(static_cast<int>(oRandom() % 9), static_cast<int>(oRandom() % 9));
        }
        const auto poActual = oBlock.Blank();
        const auto poExpected = oBlock.Blank();
        oFilter.Process(oBlock.mpoIn.get(), oBlock.MaskIn(i), poActual.get(), oBlock.MaskOut(i));
        PlainWindows(*oBlock.mpoIn, oBlock.MaskIn(i), WindowOfMargins(*oBlock.mpoIn))
            .Filter(true, Deviation, *poExpected, oBlock.MaskOut(i));
        ASSERT_TRUE(SameBits(*poActual, *poExpected)) << "block " << i;
    }
}

}  // namespace
}  // namespace kor::filters
