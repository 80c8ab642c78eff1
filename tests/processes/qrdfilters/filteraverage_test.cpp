#include "processes/qrdfilters/filteraverage.h"

#include <gtest/gtest.h>

#include <cmath>
#include <thread>

#include "platform/exception/exception.h"
#include "tests/support/blocks.h"

namespace kor::filters
{
namespace
{

using tessel::eDT_16U;
using tessel::eDT_32R;
using tessel::eDT_64R;
using tessel::Mask;
using tessel::Raster;
using test::Image;
using test::Margins;
using test::Random;
using test::Samples;

template <class T>
Image<T> Filtered(const FilterAverage& oFilter, const Image<T>& oImage, Margins oMargins,
                  Mask* poMaskIn = nullptr, Mask* poMaskOut = nullptr, std::uint32_t nChannels = 1)
{
    const auto poIn = test::RasterOf(oImage, oMargins, nChannels);
    const auto poOut =
        test::BlankRaster(poIn->mnWidth, poIn->mnHeight, nChannels, poIn->moDataType);
    oFilter.Process(poIn.get(), poMaskIn, poOut.get(), poMaskOut);
    return test::ImageOf<T>(*poOut);
}

/// 7 x 7 samples; the block of a frame of depth n begins at (n, n).
const Image<double> kRamp = {
    {0, 1, 2, 3, 4, 5, 6},        {10, 11, 12, 13, 14, 15, 16}, {20, 21, 22, 23, 24, 25, 26},
    {30, 31, 32, 33, 34, 35, 36}, {40, 41, 42, 43, 44, 45, 46}, {50, 51, 52, 53, 54, 55, 56},
    {60, 61, 62, 63, 64, 65, 66},
};

TEST(FilterAverage, IsTheMeanOfTheWindow)
{
    const Image<double> oImage = {
        {1, 2, 3, 100},
        {4, 5, 6, 100},
        {7, 8, 9, 100},
    };
    EXPECT_EQ(Filtered(FilterAverage(), oImage, {1, 1}), (Image<double>{{5, 37}}));
}

TEST(FilterAverage, WorksOnFloatWithSumsInDouble)
{
    // 16777216 + 1 + 1 needs more digits than a float has; the mean is that of the exact sum.
    const Image<float> oImage = {{16777216.0F, 1.0F, 1.0F}};
    EXPECT_EQ(Filtered(FilterAverage(), oImage, {1, 0}), (Image<float>{{16777218.0F / 3.0F}}));
}

TEST(FilterAverage, SingleChannelOfAnotherTypeIsLeftAlone)
{
    const auto poIn = test::RasterOf(Image<unsigned short>{{1, 2, 3}}, {1, 0});
    const auto poOut = test::RasterOf(Image<unsigned short>{{777}});
    FilterAverage().Process(poIn.get(), nullptr, poOut.get(), nullptr);
    EXPECT_EQ(test::ImageOf<unsigned short>(*poOut), (Image<unsigned short>{{777}}));
}

// The type comes before the margins: nothing is thrown either.
TEST(FilterAverage, SingleChannelOfAnotherTypeIsLeftAloneWithSmallMarginsToo)
{
    FilterAverage oFilter;
    oFilter.SetFilterSize(9, 9);
    const auto poIn = test::RasterOf(Image<unsigned short>{{1, 2, 3}}, {1, 0});
    const auto poOut = test::RasterOf(Image<unsigned short>{{777}});
    EXPECT_NO_THROW(oFilter.Process(poIn.get(), nullptr, poOut.get(), nullptr));
    EXPECT_EQ(test::ImageOf<unsigned short>(*poOut), (Image<unsigned short>{{777}}));
}

TEST(FilterAverage, WithoutSizeTheMarginsAreTheWindow)
{
    // Margins 2 and 1: 5 by 3 around (2..4, 1..5); pixel (2, 1) covers columns 0..4 of rows 0..2.
    const Image<double> oOut = Filtered(FilterAverage(), kRamp, {2, 1});
    ASSERT_EQ(oOut.Columns(), 3U);
    ASSERT_EQ(oOut.Rows(), 5U);
    EXPECT_EQ(oOut.Samples().front(), 12.0);
    EXPECT_EQ(oOut.Samples().back(), 54.0);
}

TEST(FilterAverage, SingleChannelTakesTheAxesOneByOne)
{
    FilterAverage oFilter;
    oFilter.SetFilterSize(3, boost::none);
    // 1 in the middle of the window column: margins of 2 give the height, the size the width.
    const Image<double> oImage = {
        {9, 1, 1, 1, 9}, {9, 1, 1, 1, 9}, {9, 1, 16, 1, 9}, {9, 1, 1, 1, 9}, {9, 1, 1, 1, 9},
    };
    EXPECT_EQ(Filtered(oFilter, oImage, {2, 2}), (Image<double>{{2}}));  // (14 + 16) / 15
}

TEST(FilterAverage, SeveralChannelsTakeTheSizesOnlyTogether)
{
    FilterAverage oFilter;
    oFilter.SetFilterSize(3, boost::none);
    // Two channels, margins 2 and 0: the window is 5 by 1, not 3 by 1.
    const Image<double> oImage = {{10, 0, 1, 0, 1, 0, 1, 0, 2, 5}};
    EXPECT_EQ(Filtered(oFilter, oImage, {2, 0}, nullptr, nullptr, 2), (Image<double>{{3, 1}}));
    oFilter.SetFilterSize(3, 3);
    const auto poIn = test::RasterOf(Image<double>{{10, 0, 1, 0, 1, 0, 1, 0, 2, 5},
                                                   {10, 0, 1, 0, 4, 9, 1, 0, 2, 5},
                                                   {10, 0, 1, 0, 1, 0, 1, 0, 2, 5}},
                                     {2, 1}, 2);
    const auto poOut = test::BlankRaster(1, 1, 2, eDT_64R);
    oFilter.Process(poIn.get(), nullptr, poOut.get(), nullptr);
    EXPECT_EQ(test::ImageOf<double>(*poOut), (Image<double>{{12.0 / 9.0, 1}}));
}

TEST(FilterAverage, EvenSizeActsAsTheNextOddOne)
{
    FilterAverage oFilter;
    oFilter.SetFilterSize(4, 4);
    FilterAverage oOdd;
    oOdd.SetFilterSize(5, 5);
    EXPECT_EQ(Filtered(oFilter, kRamp, {2, 2}), Filtered(oOdd, kRamp, {2, 2}));
    EXPECT_EQ(Filtered(oFilter, kRamp, {2, 2}).Samples().front(), 22.0);
}

TEST(FilterAverage, NegativeAndSmallSizesAreOnePixel)
{
    FilterAverage oFilter;
    for (const int nSize : {-7, -1, 0, 1})
    {
        oFilter.SetFilterSize(nSize, nSize);
        EXPECT_EQ(Filtered(oFilter, Image<double>{{1, 2}, {3, 5}}, {0, 0}),
                  (Image<double>{{1, 2}, {3, 5}}));
    }
}

void ExpectMarginMessage(const FilterAverage& oFilter, Margins oMargins, Margins oMaskMargins,
                         const char* pszMessage)
{
    const auto poIn = test::BlankRaster(4, 4, 1, eDT_64R, oMargins);
    const auto poOut = test::BlankRaster(4, 4, 1, eDT_64R);
    const auto poBefore = test::BlankRaster(4, 4, 1, eDT_64R);
    Random oRandom(1);
    const auto poMask = test::RandomMask(4, 4, oMaskMargins, 1.0, oRandom);
    try
    {
        oFilter.Process(poIn.get(), poMask.get(), poOut.get(), nullptr);
        FAIL() << "nothing was thrown";
    }
    catch (const Exception& oException)
    {
        EXPECT_EQ(oException.GetMessage(), pszMessage);
        EXPECT_EQ(oException.GetFile(), "");
        EXPECT_EQ(oException.GetFunction(), "");
        EXPECT_EQ(oException.GetLine(), 0U);
    }
    EXPECT_TRUE(test::SameBits(*poOut, *poBefore));
}

TEST(FilterAverage, WindowLargerThanTheMarginsIsRefused)
{
    FilterAverage oFilter;
    oFilter.SetFilterSize(4, 4);
    constexpr const char* kMessage =
        "Input raster's margins are not large enough for filter size requested.";
    ExpectMarginMessage(oFilter, {1, 1}, {2, 2}, kMessage);
    ExpectMarginMessage(oFilter, {2, 1}, {2, 2}, kMessage);
    ExpectMarginMessage(oFilter, {1, 2}, {2, 2}, kMessage);
    // The raster is tested first.
    ExpectMarginMessage(oFilter, {1, 1}, {0, 0}, kMessage);
}

TEST(FilterAverage, WindowLargerThanTheMarginsOfTheMaskIsRefused)
{
    FilterAverage oFilter;
    oFilter.SetFilterSize(4, 4);
    constexpr const char* kMessage =
        "Input mask's margins are not large enough for filter size requested.";
    ExpectMarginMessage(oFilter, {2, 2}, {1, 2}, kMessage);
    ExpectMarginMessage(oFilter, {2, 2}, {2, 1}, kMessage);
    ExpectMarginMessage(FilterAverage(), {2, 2}, {0, 0}, kMessage);
}

TEST(FilterAverage, MarginsOfTheOutputMaskAreNotTested)
{
    const auto poClip = test::MaskOf({{1}});
    EXPECT_EQ(Filtered(FilterAverage(), Image<double>{{1, 2, 3}, {4, 5, 6}, {7, 8, 9}}, {1, 1},
                       nullptr, poClip.get()),
              (Image<double>{{5}}));
}

TEST(FilterAverage, MaskedPixelReducesTheCount)
{
    const Image<double> oImage = {{1, 2, 3}, {4, 5, 6}, {7, 8, 999}};
    const auto poMask = test::MaskOf({{1, 1, 1}, {1, 1, 1}, {1, 1, 0}}, {1, 1});
    EXPECT_EQ(Filtered(FilterAverage(), oImage, {1, 1}, poMask.get()),
              (Image<double>{{36.0 / 8.0}}));
}

TEST(FilterAverage, MaskedNotANumberDoesNotPoisonTheSums)
{
    const Image<double> oImage = {
        {1, NAN, 1, 1, 1, 1},
        {1, INFINITY, 1, 1, 7, 1},
        {1, 1, 1, 1, 1, 1},
        {1, 1, 1, 1, 1, 1},
    };
    const auto poMask = test::MaskOf(
        {{1, 0, 1, 1, 1, 1}, {1, 0, 1, 1, 1, 1}, {1, 1, 1, 1, 1, 1}, {1, 1, 1, 1, 1, 1}}, {1, 1});
    EXPECT_EQ(Filtered(FilterAverage(), oImage, {1, 1}, poMask.get()),
              (Image<double>{{0, 1, 15.0 / 9.0, 15.0 / 9.0}, {1, 1, 15.0 / 9.0, 15.0 / 9.0}}));
}

TEST(FilterAverage, PixelsClippedFromTheOutputStillFeedTheirNeighbours)
{
    const Image<double> oImage = {{3, 30, 300, 3000}};
    const auto poClip = test::MaskOf({{0, 1}});
    EXPECT_EQ(Filtered(FilterAverage(), oImage, {1, 0}, nullptr, poClip.get()),
              (Image<double>{{0, 1110}}));
}

TEST(FilterAverage, BackgroundIsZeroOrTheInput)
{
    const Image<double> oImage = {{1, 2, 3, 4, 5}};
    const auto poMask = test::MaskOf({{1, 1, 0, 1, 1}}, {1, 0});
    const auto poClip = test::MaskOf({{1, 1, 0}});
    FilterAverage oFilter;  // the flag starts as true
    EXPECT_EQ(Filtered(oFilter, oImage, {1, 0}, poMask.get(), poClip.get()),
              (Image<double>{{1.5, 0, 0}}));
    oFilter.SetBGZero(false);
    EXPECT_EQ(Filtered(oFilter, oImage, {1, 0}, poMask.get(), poClip.get()),
              (Image<double>{{1.5, 3, 4}}));
    oFilter.SetParameters(true);
    EXPECT_EQ(Filtered(oFilter, oImage, {1, 0}, poMask.get(), poClip.get()),
              (Image<double>{{1.5, 0, 0}}));
}

TEST(FilterAverage, BackgroundCoversAllChannelsOfAPixel)
{
    const Image<double> oImage = {{1, 10, 2, 20, 3, 30, 4, 40}};
    const auto poMask = test::MaskOf({{1, 1, 0, 1}}, {1, 0});
    EXPECT_EQ(Filtered(FilterAverage(false), oImage, {1, 0}, poMask.get(), nullptr, 2),
              (Image<double>{{1.5, 15, 3, 30}}));
    EXPECT_EQ(Filtered(FilterAverage(true), oImage, {1, 0}, poMask.get(), nullptr, 2),
              (Image<double>{{1.5, 15, 0, 0}}));
}

TEST(FilterAverage, BlockOfOneColumnOrOneRow)
{
    EXPECT_EQ(Filtered(FilterAverage(), Image<double>{{1, 2, 3}, {4, 5, 6}, {7, 8, 9}}, {1, 0}),
              (Image<double>{{2}, {5}, {8}}));
    EXPECT_EQ(Filtered(FilterAverage(), Image<double>{{1, 2, 3}, {4, 5, 6}, {7, 8, 9}}, {0, 1}),
              (Image<double>{{4, 5, 6}}));
}

// Running sums keep their rounding: adding and subtracting 1e17 swallows the ones beside it, while
// the first pixel of the next row starts afresh.
TEST(FilterAverage, RoundingOfTheRunningSumsIsPartOfTheResult)
{
    const Image<double> oImage = {
        {1, 1, 1, 1, 1},
        {1e17, 1, 1, 1, 1},
    };
    // Row 0 sums every window from scratch; row 1 starts at 1e17 + 1 + 1 = 1e17, and what leaves
    // with 1e17 leaves 0, to which 1 is added.
    EXPECT_EQ(Filtered(FilterAverage(), oImage, {1, 0}),
              (Image<double>{{1, 1, 1}, {1e17 / 3, 1.0 / 3, 1.0 / 3}}));
}

TEST(FilterAverage, ObjectServesSeveralThreads)
{
    FilterAverage oFilter;
    oFilter.SetFilterSize(3, 3);
    const Image<double> oExpected = Filtered(oFilter, kRamp, {2, 2});
    std::vector<Image<double>> voResults(4, oExpected);
    std::vector<std::thread> voThreads;
    for (Image<double>& oResult : voResults)
    {
        voThreads.emplace_back([&] { oResult = Filtered(oFilter, kRamp, {2, 2}); });
    }
    for (std::thread& oThread : voThreads)
    {
        oThread.join();
    }
    EXPECT_EQ(voResults, (std::vector<Image<double>>(4, oExpected)));
}

TEST(FilterAverage, CallOperatorMakesARasterWithoutMargins)
{
    auto poIn = std::make_shared<Raster>(tessel::RasterInfo(1, 1, 2, eDT_64R),
                                         tessel::RasterContext(1, 1, 40, 50));
    std::fill_n(reinterpret_cast<double*>(poIn->mpBuffer), 18, 4.0);
    const auto poOut = FilterAverage()(poIn, nullptr, nullptr);
    EXPECT_EQ(poOut->mnMarginX, 0U);
    EXPECT_EQ(poOut->mnMarginY, 0U);
    EXPECT_EQ(poOut->mnOffsetX, 40U);
    EXPECT_EQ(poOut->mnOffsetY, 50U);
    EXPECT_EQ(poOut->moDataType, eDT_64R);
    EXPECT_EQ(test::ImageOf<double>(*poOut), (Image<double>{{4, 4}}));
}

TEST(FilterAverage, CallOperatorPassesExceptionsOn)
{
    FilterAverage oFilter;
    oFilter.SetFilterSize(3, 3);
    const std::shared_ptr<Raster> poIn = test::RasterOf(Image<float>{{1, 2, 3}}, {1, 0});
    EXPECT_THROW(oFilter(poIn, nullptr, nullptr), Exception);
    EXPECT_EQ(poIn.use_count(), 1);
}

TEST(FilterAverage, CopiesKeepTheParameters)
{
    FilterAverage oFilter(false);
    oFilter.SetFilterSize(1, 1);
    const FilterAverage oCopy(oFilter);
    FilterAverage oAssigned;
    oAssigned = oFilter;
    for (const FilterAverage* poFilter : {&oCopy, static_cast<const FilterAverage*>(&oAssigned)})
    {
        const auto poMask = test::MaskOf({{1, 0, 1}}, {1, 0});
        EXPECT_EQ(Filtered(*poFilter, Image<double>{{1, 2, 3}}, {1, 0}, poMask.get()),
                  (Image<double>{{2}}));
    }
}

/// The definition for one channel: integer counts, column sums, a running window.
template <class TSample>
void AverageByDefinition(const Raster& oIn, const Mask* poMaskIn, int nHalfX, int nHalfY,
                         bool bBGZero, Raster& oOut, const Mask* poMaskOut)
{
    const int nWidth = static_cast<int>(oIn.mnWidth);
    std::vector<double> vdfSums(oIn.mnTotalWidth, 0.0);
    std::vector<int> vnCounts(oIn.mnTotalWidth, 0);
    const auto oUpdate = [&](int x, int y, int nSign)
    {
        if (test::IsValid(poMaskIn, x, y))
        {
            const double dfSample = static_cast<double>(*oIn.GetPixelAs<TSample>(x, y));
            double& dfSum = vdfSums[static_cast<std::size_t>(x + nHalfX)];
            dfSum = nSign > 0 ? dfSum + dfSample : dfSum - dfSample;
            vnCounts[static_cast<std::size_t>(x + nHalfX)] += nSign;
        }
    };
    for (int x = -nHalfX; x < nWidth + nHalfX; ++x)
    {
        for (int y = -nHalfY; y <= nHalfY; ++y)
        {
            oUpdate(x, y, 1);
        }
    }
    for (int y = 0; y < static_cast<int>(oIn.mnHeight); ++y)
    {
        for (int x = -nHalfX; y > 0 && x < nWidth + nHalfX; ++x)
        {
            oUpdate(x, y - nHalfY - 1, -1);
            oUpdate(x, y + nHalfY, 1);
        }
        double dfSum = 0.0;
        int nCount = 0;
        for (int x = 0; x < nWidth; ++x)
        {
            const auto nFirst = static_cast<std::size_t>(x);
            const std::size_t nLast = nFirst + 2 * static_cast<std::size_t>(nHalfX);
            if (x == 0 || y == 0)
            {
                dfSum = 0.0;
                nCount = 0;
                for (std::size_t i = nFirst; i <= nLast; ++i)
                {
                    dfSum += vdfSums[i];
                    nCount += vnCounts[i];
                }
            }
            else
            {
                dfSum = dfSum - vdfSums[nFirst - 1] + vdfSums[nLast];
                nCount = nCount - vnCounts[nFirst - 1] + vnCounts[nLast];
            }
            TSample& oResult = *oOut.GetPixelAs<TSample>(x, y);
            if (test::IsValid(poMaskIn, x, y) && test::IsValid(poMaskOut, x, y))
            {
                oResult = static_cast<TSample>(dfSum / static_cast<double>(nCount));
            }
            else
            {
                oResult = bBGZero ? TSample(0) : *oIn.GetPixelAs<TSample>(x, y);
            }
        }
    }
}

template <class TSample>
void CompareWithDefinition(const tessel::DataType& oType, Random& oRandom)
{
    const auto nWidth = 1 + static_cast<std::uint32_t>(oRandom() % 300);
    const auto nHeight = 1 + static_cast<std::uint32_t>(oRandom() % 20);
    const Margins oMargins{static_cast<std::uint32_t>(oRandom() % 4),
                           static_cast<std::uint32_t>(oRandom() % 4)};
    const bool bBGZero = oRandom() % 2 == 0;
    FilterAverage oFilter(bBGZero);
    int nHalfX = static_cast<int>(oMargins.x);
    const int nHalfY = static_cast<int>(oMargins.y);
    if (oRandom() % 2 == 0)
    {
        nHalfX = static_cast<int>(oRandom() % (oMargins.x + 1));
        oFilter.SetFilterSize(2 * nHalfX + 1, boost::none);
    }
    const auto poIn =
        test::RandomRaster(nWidth, nHeight, 1, oType, oMargins,
                           oRandom() % 2 == 0 ? Samples::Ordinary : Samples::Special, oRandom);
    const Margins oMaskMargins{oMargins.x + static_cast<std::uint32_t>(oRandom() % 3), oMargins.y};
    const auto poMask = test::RandomMask(nWidth, nHeight, oMaskMargins, 0.8, oRandom);
    const auto poClip = test::RandomMask(nWidth, nHeight, {0, 2}, 0.8, oRandom);
    Mask* poMaskIn = oRandom() % 2 == 0 ? poMask.get() : nullptr;
    Mask* poMaskOut = oRandom() % 2 == 0 ? poClip.get() : nullptr;
    const auto poActual = test::BlankRaster(nWidth, nHeight, 1, oType, {1, 2});
    const auto poExpected = test::BlankRaster(nWidth, nHeight, 1, oType, {1, 2});
    oFilter.Process(poIn.get(), poMaskIn, poActual.get(), poMaskOut);
    AverageByDefinition<TSample>(*poIn, poMaskIn, nHalfX, nHalfY, bBGZero, *poExpected, poMaskOut);
    ASSERT_TRUE(test::SameBits(*poActual, *poExpected)) << nWidth << " x " << nHeight;
}

TEST(FilterAverage, GivesTheBitsOfTheDefinition)
{
    Random oRandom(11);
    for (int i = 0; i < 60; ++i)
    {
        CompareWithDefinition<float>(eDT_32R, oRandom);
        CompareWithDefinition<double>(eDT_64R, oRandom);
    }
}

// Large outputs are written past the caches, which changes no bit.
TEST(FilterAverage, LargeBlockGivesTheBitsOfTheDefinition)
{
    Random oRandom(12);
    const auto poIn =
        test::RandomRaster(2113, 1001, 1, eDT_64R, {1, 1}, Samples::Ordinary, oRandom);
    const auto poActual = test::BlankRaster(2113, 1001, 1, eDT_64R, {1, 0});
    const auto poExpected = test::BlankRaster(2113, 1001, 1, eDT_64R, {1, 0});
    FilterAverage().Process(poIn.get(), nullptr, poActual.get(), nullptr);
    AverageByDefinition<double>(*poIn, nullptr, 1, 1, true, *poExpected, nullptr);
    EXPECT_TRUE(test::SameBits(*poActual, *poExpected));
}

}  // namespace
}  // namespace kor::filters
