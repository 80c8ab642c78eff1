#include "processes/qrdfilters/filternoise.h"

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

FilterNoise FailingWith(double dfFailValue)
{
    FilterNoise oFilter;
    oFilter.SetFailValue(dfFailValue);
    return oFilter;
}

// m = 1, variance 9. At the 9: 64 > 27. At a 0: 1 is not.
TEST(FilterNoise, MarksASampleThatStandsOutAndSmoothsItsNeighbours)
{
    const Image<double> oImage = {
        {0, 0, 0, 0, 0}, {0, 0, 0, 0, 0}, {0, 0, 9, 0, 0}, {0, 0, 0, 0, 0}, {0, 0, 0, 0, 0},
    };
    EXPECT_EQ(Filtered(FailingWith(-1), oImage, {1, 1}), (Image<double>{
                                                             {1, 1, 1},
                                                             {1, -1, 1},
                                                             {1, 1, 1},
                                                         }));
}

// m = 5, d * d = 25, variance 50: no noise at either.
TEST(FilterNoise, GivesTheMeanOfTwoSamples)
{
    const auto poMask = MaskOf({{0, 1, 1, 0}}, {1, 0});
    EXPECT_EQ(Filtered(FailingWith(-1), {{7, 0, 10, 7}}, {1, 0}, poMask.get()),
              (Image<double>{{5, 5}}));
}

TEST(FilterNoise, GivesASampleAloneInItsWindowItsOwnValue)
{
    const auto poMask = MaskOf({{0, 1, 0}}, {1, 0});
    EXPECT_EQ(Filtered(FailingWith(-1), {{7, -2.5, 7}}, {1, 0}, poMask.get()),
              (Image<double>{{-2.5}}));
    const Image<double> oImage = {{1, -2.5}, {3e300, INFINITY}};
    EXPECT_EQ(Filtered(FailingWith(-1), oImage, {0, 0}), oImage);
}

// 4 among 0 0 0 1: m = 1, Q = 17, 3 * (17 - 5) / 4 = 9 = d * d. 5 among four zeros: 16 of 15.
TEST(FilterNoise, MarksNothingAtExactlyThreeVariances)
{
    EXPECT_EQ(Filtered(FailingWith(-1), {{0, 0, 4, 0, 1}}, {2, 0}), (Image<double>{{1}}));
    EXPECT_EQ(Filtered(FailingWith(-1), {{0, 0, 5, 0, 0}}, {2, 0}), (Image<double>{{-1}}));
}

TEST(FilterNoise, GivesAConstantBlockBack)
{
    const Image<double> oImage(9, std::vector<double>(81, 4.0));
    EXPECT_EQ(Filtered(FailingWith(-1), oImage, {2, 2}),
              Image<double>(5, std::vector<double>(25, 4.0)));
}

TEST(FilterNoise, StartsWithAFailValueOfZeroAndABackgroundOfTheInput)
{
    const auto poClip = MaskOf({{1, 1, 0}});
    EXPECT_EQ(Filtered(FilterNoise(), {{0, 0, 0, 0, 5, 0, 0}}, {2, 0}, nullptr, poClip.get()),
              (Image<double>{{1, 1, 5}}));
    EXPECT_EQ(Filtered(FilterNoise(), {{0, 0, 5, 0, 0}}, {2, 0}), (Image<double>{{0}}));
}

TEST(FilterNoise, BackgroundIsZeroOrTheInput)
{
    const Image<double> oImage = {{1, 2, 3, 4, 5}};
    const auto poMask = MaskOf({{1, 1, 0, 1, 1}}, {1, 0});
    const auto poClip = MaskOf({{1, 1, 0}});
    FilterNoise oFilter;
    EXPECT_EQ(Filtered(oFilter, oImage, {1, 0}, poMask.get(), poClip.get()),
              (Image<double>{{1.5, 3, 4}}));
    oFilter.SetBGZero(true);
    EXPECT_EQ(Filtered(oFilter, oImage, {1, 0}, poMask.get(), poClip.get()),
              (Image<double>{{1.5, 0, 0}}));
}

TEST(FilterNoise, WritesTheBackgroundOfAllChannels)
{
    const Image<double> oImage = {{1, 2, 3, 4, 5, 6, 7, 14}};
    const auto poClip = MaskOf({{0, 1}});
    FilterNoise oFilter;
    EXPECT_EQ(Filtered(oFilter, oImage, {1, 0}, nullptr, poClip.get(), 2),
              (Image<double>{{3, 4, 5, 8}}));
    oFilter.SetBGZero(true);
    EXPECT_EQ(Filtered(oFilter, oImage, {1, 0}, nullptr, poClip.get(), 2),
              (Image<double>{{0, 0, 5, 8}}));
}

TEST(FilterNoise, LeavesMaskedPixelsOutOfEveryWindow)
{
    const auto poMask = MaskOf({{1, 1, 0, 1, 1}}, {1, 0});
    EXPECT_EQ(Filtered(FilterNoise(), {{1, 3, NAN, 7, 11}}, {1, 0}, poMask.get()).Samples()[2],
              9.0);
}

TEST(FilterNoise, CountsPixelsClearedInTheOutputMaskAlone)
{
    const auto poClip = MaskOf({{1, 0}});
    EXPECT_EQ(Filtered(FilterNoise(), {{1, 3, 5, 70}}, {1, 0}, nullptr, poClip.get()),
              (Image<double>{{3, 5}}));
}

const Image<double> kRamp = {
    {0, 1, 2, 3, 4},      {10, 11, 12, 13, 14}, {20, 21, 22, 23, 24},
    {30, 31, 32, 33, 34}, {40, 41, 42, 43, 99},
};

// The window decides whether the 99 in the corner is seen: the other samples have a mean of 22.
TEST(FilterNoise, TakesItsWindowFromTheMarginsWhileEitherSizeIsUnset)
{
    const double dfFive = (25 * 22 + 55) / 25.0;
    FilterNoise oFilter;
    EXPECT_EQ(Filtered(oFilter, kRamp, {2, 2}), (Image<double>{{dfFive}}));
    oFilter.SetFilterSize(3, boost::none);
    EXPECT_EQ(Filtered(oFilter, kRamp, {2, 2}), (Image<double>{{dfFive}}));
    oFilter.SetFilterSize(boost::none, 3);
    EXPECT_EQ(Filtered(oFilter, kRamp, {2, 2}), (Image<double>{{dfFive}}));
    oFilter.SetFilterSize(3, 3);
    EXPECT_EQ(Filtered(oFilter, kRamp, {2, 2}), (Image<double>{{22}}));
    oFilter.SetFilterSize(boost::none, boost::none);
    EXPECT_EQ(Filtered(oFilter, kRamp, {2, 2}), (Image<double>{{dfFive}}));
}

TEST(FilterNoise, HalvesItsSizes)
{
    const double dfFive = (25 * 22 + 55) / 25.0;
    FilterNoise oFilter;
    oFilter.SetFilterSize(4, 4);
    EXPECT_EQ(Filtered(oFilter, kRamp, {2, 2}), (Image<double>{{dfFive}}));
    oFilter.SetFilterSize(boost::optional<int>(2), boost::optional<int>(3));
    EXPECT_EQ(Filtered(oFilter, kRamp, {2, 2}), (Image<double>{{22}}));
    oFilter.SetFilterSize(1, 5);
    EXPECT_EQ(Filtered(oFilter, kRamp, {2, 2}), (Image<double>{{22}}));
    for (const int nSize : {-7, -1, 0, 1})
    {
        oFilter.SetFilterSize(nSize, nSize);
        EXPECT_EQ(Filtered(oFilter, {{1, 2}, {3, 5}}, {0, 0}), (Image<double>{{1, 2}, {3, 5}}));
    }
}

TEST(FilterNoise, TreatsChannelsByThemselves)
{
    EXPECT_EQ(
        Filtered(FailingWith(-1), {{0, 1, 0, 1, 5, 1, 0, 1, 0, 1}}, {2, 0}, nullptr, nullptr, 2),
        (Image<double>{{-1, 1}}));
}

TEST(FilterNoise, ProcessBlockIsTheSame)
{
    const auto poIn = RasterOf(Image<double>{{1, 3, 5}}, {1, 0});
    const auto poOut = BlankRaster(1, 1, 1, tessel::eDT_64R);
    FilterNoise().ProcessBlock(poIn.get(), nullptr, poOut.get(), nullptr);
    EXPECT_EQ(ImageOf<double>(*poOut), (Image<double>{{3}}));
}

TEST(FilterNoise, CopiesKeepTheParameters)
{
    FilterNoise oFilter = FailingWith(-7);
    oFilter.SetBGZero(true);
    oFilter.SetFilterSize(5, 1);
    const FilterNoise oCopy(oFilter);
    FilterNoise oAssigned;
    oAssigned = oFilter;
    const auto poClip = MaskOf({{1, 0}});
    for (const FilterNoise* poFilter : {&oCopy, static_cast<const FilterNoise*>(&oAssigned)})
    {
        EXPECT_EQ(Filtered(*poFilter, {{9, 0, 0, 5, 0, 0, 9, 9}}, {3, 0}, nullptr, poClip.get()),
                  (Image<double>{{-7, 0}}));
    }
}

TEST(FilterNoise, AcceptsBlocksWithoutPixels)
{
    const auto poNoRows = BlankRaster(4, 0, 1, tessel::eDT_64R, {2, 2});
    const auto poNoColumns = BlankRaster(0, 4, 1, tessel::eDT_64R, {2, 2});
    EXPECT_NO_THROW(FilterNoise().Process(poNoRows.get(), nullptr, poNoRows.get(), nullptr));
    EXPECT_NO_THROW(FilterNoise().Process(poNoColumns.get(), nullptr, poNoColumns.get(), nullptr));
}

TEST(FilterNoise, RefusesAWindowAboveTheMarginsInHardenedBuilds)
{
    if (!kHardened)
    {
        GTEST_SKIP() << "blocks are checked in hardened builds alone";
    }
    const auto poIn = BlankRaster(2, 2, 1, tessel::eDT_64R, {1, 1});
    const auto poOut = BlankRaster(2, 2, 1, tessel::eDT_64R);
    FilterNoise oFilter;
    oFilter.SetFilterSize(5, 5);
    EXPECT_EQ(
        MessageOf<Exception>([&] { oFilter.Process(poIn.get(), nullptr, poOut.get(), nullptr); }),
        "The window of 5 x 5 pixels needs margins of 2 and 2, poRasterIn has 2 x 2 pixels "
        "with margins 1 and 1");
}

TEST(FilterNoise, OneObjectServesSeveralThreads)
{
    const FilterNoise oFilter = FailingWith(-1);
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

double MeanOrFail(const PlainSums& oSums, double dfFailValue)
{
    const double n = oSums.mdfCount;
    const double m = oSums.mdfSum / n;
    const double d = oSums.mdfCentre - m;
    const bool bNoise = n >= 2.0 && d * d > 3.0 * (oSums.mdfSquares - m * n * m) / (n - 1.0);
    return bNoise ? dfFailValue : m;
}

TEST(FilterNoise, GivesTheBitsOfTheDefinition)
{
    Random oRandom(22);
    for (unsigned int i = 0; i < 160; ++i)
    {
        const RandomBlock oBlock(oRandom);
        const bool bBGZero = oRandom() % 2 == 0;
        FilterNoise oFilter = FailingWith(-12345.0);
        oFilter.SetBGZero(bBGZero);
        Window oWindow = WindowOfMargins(*oBlock.mpoIn);
        if (oRandom() % 2 == 0)
        {
            oWindow.mnHalfX = static_cast<std::uint32_t>(oRandom() % (oWindow.mnHalfX + 1));
            oWindow.mnHalfY = static_cast<std::uint32_t>(oRandom() % (oWindow.mnHalfY + 1));
            oFilter.SetFilterSize(static_cast<int>(oWindow.GetWidth()),
                                  static_cast<int>(oWindow.GetHeight()));
        }
        const auto poActual = oBlock.Blank();
        const auto poExpected = oBlock.Blank();
        oFilter.Process(oBlock.mpoIn.get(), oBlock.MaskIn(i), poActual.get(), oBlock.MaskOut(i));
        PlainWindows(*oBlock.mpoIn, oBlock.MaskIn(i), oWindow)
            .Filter(
                bBGZero, [](const PlainSums& oSums) { return MeanOrFail(oSums, -12345.0); },
                *poExpected, oBlock.MaskOut(i));
        ASSERT_TRUE(SameBits(*poActual, *poExpected)) << "block " << i;
    }
}

}  // namespace
}  // namespace kor::filters
