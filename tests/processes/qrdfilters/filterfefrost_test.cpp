#include "processes/qrdfilters/filterfefrost.h"

#include <gtest/gtest.h>

#include <array>
#include <cmath>
#include <functional>
#include <thread>
#include <vector>

#include "platform/exception/exception.h"
#include "tests/support/blocks.h"
#include "tests/support/localstatisticsreference.h"

namespace kor::filters
{
namespace
{

using namespace kor::test;
using tessel::eDT_64R;

FilterFefrost EnhancedFrost(double dfLooks, double dfDamp, bool bBGZero = false)
{
    FilterFefrost oFilter;
    oFilter.SetNLOOK(dfLooks);
    oFilter.SetDamp(dfDamp);
    oFilter.SetBGZero(bBGZero);
    return oFilter;
}

/// Filtered in a window of three pixels by one.
Image<double> Filtered(FilterFefrost oFilter, const Image<double>& oImage,
                       tessel::Mask* poMaskIn = nullptr, tessel::Mask* poMaskOut = nullptr,
                       std::uint32_t nChannels = 1)
{
    const auto poIn = RasterOf(oImage, Margins{1, 0}, nChannels);
    const auto poOut = BlankRaster(poIn->mnWidth, poIn->mnHeight, nChannels, eDT_64R);
    oFilter.SetFilterSize(3, 1);
    oFilter.Process(poIn.get(), poMaskIn, poOut.get(), poMaskOut);
    return ImageOf<double>(*poOut);
}

// 9 10 11: Ci = 1 / 10, below Cu = 1 / sqrt(4).
TEST(FilterFefrost, FlatWindowGivesItsMean)
{
    EXPECT_EQ(Filtered(EnhancedFrost(4, 1), {{9, 11, 10}}), (Image<double>{{10}}));
}

// 0 30 0: mean 10, variance 300, Ci = 1.73; Cmax = sqrt(2 / 4 + 1) = 1.22.
TEST(FilterFefrost, PointTargetIsKept)
{
    EXPECT_EQ(Filtered(EnhancedFrost(4, 1), {{0, 30, 0}}), (Image<double>{{30}}));
}

// 3 8 19: mean 10, variance (49 + 4 + 81) / 2 = 67, Ci = 0.82.
TEST(FilterFefrost, WeighsByDistanceBetweenTheBounds)
{
    const double dfCi = std::sqrt(67.0) / 10.0;
    const double A = (dfCi - 0.5) * 3.0 / (std::sqrt(1.5) - dfCi);
    const double w = std::exp(-A);
    EXPECT_EQ(Filtered(EnhancedFrost(4, 3), {{3, 8, 19}}),
              (Image<double>{{(w * 3.0 + 8.0 + w * 19.0) / (w + 1.0 + w)}}));
}

TEST(FilterFefrost, TreatsChannelsByThemselves)
{
    EXPECT_EQ(Filtered(EnhancedFrost(4, 1), {{9, 0, 11, 30, 10, 0}}, nullptr, nullptr, 2),
              (Image<double>{{10, 30}}));
}

// 6 6 2 2 4: mean 4, variance 4, Ci = 1 / 2 = Cu. One size alone makes the weighted window 6 2 2.
TEST(FilterFefrost, VariationAtTheLowerBoundIsThePlainMeanOfTheWeightedWindow)
{
    const auto poIn = RasterOf(Image<double>{{6, 6, 2, 2, 4}}, Margins{2, 0});
    const auto poOut = BlankRaster(1, 1, 1, eDT_64R);
    FilterFefrost oFilter = EnhancedFrost(4, 5);
    oFilter.SetFilterSize(3, boost::none);
    oFilter.Process(poIn.get(), nullptr, poOut.get(), nullptr);
    EXPECT_EQ(ImageOf<double>(*poOut), (Image<double>{{10.0 / 3.0}}));
}

// 0 and 4: mean 2, variance 8, Ci = sqrt(2) = Cmax of 2 looks.
TEST(FilterFefrost, VariationAtTheUpperBoundIsNotANumber)
{
    const auto poMask = MaskOf({{1, 1, 0}}, Margins{1, 0});
    ASSERT_EQ(std::sqrt(8.0) / 2.0, std::sqrt(2.0 / 2.0 + 1.0));
    EXPECT_TRUE(std::isnan(Filtered(EnhancedFrost(2, 5), {{0, 4, 99}}, poMask.get()).Samples()[0]));
}

TEST(FilterFefrost, MeanOfZeroKeepsThePixel)
{
    EXPECT_EQ(Filtered(EnhancedFrost(4, 1), {{-7, 2, 5}}), (Image<double>{{2}}));
}

TEST(FilterFefrost, WindowOfZerosIsNotANumber)
{
    EXPECT_TRUE(std::isnan(Filtered(EnhancedFrost(4, 1), {{0, 0, 0}}).Samples()[0]));
}

TEST(FilterFefrost, PixelAloneInItsWindowIsKept)
{
    const auto poMask = MaskOf({{0, 1, 0}}, Margins{1, 0});
    EXPECT_EQ(Filtered(EnhancedFrost(4, 1), {{1, 5.25, 3}}, poMask.get()), (Image<double>{{5.25}}));
}

// The window 1 1 x 9 5: without the third pixel mean 4, variance (9 + 9 + 25 + 1) / 3.
TEST(FilterFefrost, MaskedPixelsDoNotShiftTheDistances)
{
    const auto poIn = RasterOf(Image<double>{{1, NAN, 1, 9, 5}}, Margins{2, 0});
    const auto poMask = MaskOf({{1, 0, 1, 1, 1}}, Margins{2, 0});
    const auto poOut = BlankRaster(1, 1, 1, eDT_64R);
    FilterFefrost oFilter = EnhancedFrost(4, 1);
    oFilter.SetFilterSize(5, 1);
    oFilter.Process(poIn.get(), poMask.get(), poOut.get(), nullptr);
    const double dfCi = std::sqrt(44.0 / 3.0) / 4.0;
    const double A = (dfCi - 0.5) / (std::sqrt(1.5) - dfCi);
    const double w1 = std::exp(-A);
    const double w2 = std::exp(-(2.0 * A));
    EXPECT_EQ(ImageOf<double>(*poOut),
              (Image<double>{{(w2 + 1.0 + w1 * 9.0 + w2 * 5.0) / (w2 + 1.0 + w1 + w2)}}));
}

// Margins of 3 and no size: statistics over 7 pixels, weights over 3.
TEST(FilterFefrost, WithoutSizeTheWeightedWindowTakesHalfTheMargin)
{
    const auto poIn = RasterOf(Image<double>{{90, 1, 2, 3, 5, 1, 3}}, Margins{3, 0});
    const auto poOut = BlankRaster(1, 1, 1, eDT_64R);
    // One look: Cu = 1, Cmax = 1.73. Mean 15, squares 8149: variance (8149 - 1575) / 6.
    const double dfCi = std::sqrt((8149.0 - 15.0 * 7.0 * 15.0) / 6.0) / 15.0;
    ASSERT_GT(dfCi, std::sqrt(3.0));
    FilterFefrost oFilter = EnhancedFrost(0.5, 0.0);  // Cmax = 2.236
    ASSERT_LT(dfCi, std::sqrt(5.0));
    oFilter.Process(poIn.get(), nullptr, poOut.get(), nullptr);
    EXPECT_EQ(ImageOf<double>(*poOut), (Image<double>{{10.0 / 3.0}}));
    // One size alone counts for the weights.
    oFilter.SetFilterSize(5, boost::none);
    oFilter.Process(poIn.get(), nullptr, poOut.get(), nullptr);
    EXPECT_EQ(ImageOf<double>(*poOut), (Image<double>{{12.0 / 5.0}}));
}

TEST(FilterFefrost, WorksWithoutMargins)
{
    const auto poIn = RasterOf(Image<double>{{1, 7}});
    const auto poOut = BlankRaster(2, 1, 1, eDT_64R);
    EnhancedFrost(4, 1).Process(poIn.get(), nullptr, poOut.get(), nullptr);
    EXPECT_EQ(ImageOf<double>(*poOut), (Image<double>{{1, 7}}));
}

TEST(FilterFefrost, BackgroundIsZeroOrTheInput)
{
    const Image<double> oImage = {{1, 3, 2, 4, 5}};
    const auto poMask = MaskOf({{1, 1, 0, 1, 1}}, Margins{1, 0});
    const auto poClip = MaskOf({{1, 1, 0}});
    EXPECT_EQ(Filtered(EnhancedFrost(0.5, 1, true), oImage, poMask.get(), poClip.get()),
              (Image<double>{{2, 0, 0}}));
    EXPECT_EQ(Filtered(EnhancedFrost(0.5, 1, false), oImage, poMask.get(), poClip.get()),
              (Image<double>{{2, 2, 4}}));
}

TEST(FilterFefrost, BackgroundIsTheInputAtFirst)
{
    FilterFefrost oFilter;
    oFilter.SetNLOOK(4);
    oFilter.SetDamp(1);
    const auto poMask = MaskOf({{1, 0, 1}}, Margins{1, 0});
    EXPECT_EQ(Filtered(oFilter, {{1, 3, 2}}, poMask.get()), (Image<double>{{3}}));
}

// Without damping: the mean of all three, the clipped one among them.
TEST(FilterFefrost, PixelsClippedFromTheOutputStillFeedTheirNeighbours)
{
    const auto poClip = MaskOf({{0, 1}});
    EXPECT_EQ(Filtered(EnhancedFrost(4, 0, true), {{9, 3, 8, 19}}, nullptr, poClip.get()),
              (Image<double>{{0, 10}}));
}

// No look at all makes both bounds infinite: every finite Ci lies below the lower one.
TEST(FilterFefrost, ZeroLooksGiveTheMean)
{
    EXPECT_EQ(Filtered(EnhancedFrost(0, 1), {{0, 30, 0}}), (Image<double>{{10}}));
}

void ExpectRefusal(const std::function<void()>& oSet, const char* pszMessage)
{
    try
    {
        oSet();
        FAIL() << "nothing was thrown";
    }
    catch (const Exception& oException)
    {
        EXPECT_EQ(oException.GetMessage(), pszMessage);
        EXPECT_EQ(oException.GetFile(), "");
        EXPECT_EQ(oException.GetFunction(), "");
        EXPECT_EQ(oException.GetLine(), 0U);
    }
}

TEST(FilterFefrost, NegativeParametersAreRefusedAndNotTaken)
{
    FilterFefrost oFilter = EnhancedFrost(4, 3);
    ExpectRefusal([&] { oFilter.SetDamp(-0.5); }, "Damping factor must be a positive number");
    ExpectRefusal([&] { oFilter.SetNLOOK(-1); }, "Number of looks must be a positive number");
    EXPECT_EQ(Filtered(oFilter, {{3, 8, 19}}), Filtered(EnhancedFrost(4, 3), {{3, 8, 19}}));
}

TEST(FilterFefrost, CopiesKeepTheParameters)
{
    const FilterFefrost oFilter = EnhancedFrost(4, 3);
    FilterFefrost oAssigned;
    oAssigned = oFilter;
    EXPECT_EQ(Filtered(oAssigned, {{3, 8, 19}}), Filtered(oFilter, {{3, 8, 19}}));
}

TEST(FilterFefrost, CallOperatorKeepsMarginsAndOffsets)
{
    auto poIn = std::make_shared<tessel::Raster>(tessel::RasterInfo(1, 1, 1, eDT_64R),
                                                 tessel::RasterContext(1, 2, 40, 50));
    std::fill_n(poIn->GetPixelAs<double>(-1, -2), 15, 4.0);
    const auto poOut = EnhancedFrost(4, 1)(poIn, nullptr, nullptr);
    EXPECT_EQ(poOut->mnMarginX, 1U);
    EXPECT_EQ(poOut->mnMarginY, 2U);
    EXPECT_EQ(poOut->mnOffsetX, 40U);
    EXPECT_EQ(poOut->mnOffsetY, 50U);
    EXPECT_EQ(ImageOf<double>(*poOut), (Image<double>{{4}}));
}

TEST(FilterFefrost, ObjectServesSeveralThreads)
{
    const FilterFefrost oFilter = EnhancedFrost(4, 3);
    std::vector<Image<double>> voResults(4, Image<double>{{0}});
    std::vector<std::thread> voThreads;
    for (Image<double>& oResult : voResults)
    {
        voThreads.emplace_back([&] { oResult = Filtered(oFilter, {{3, 8, 19}}); });
    }
    for (std::thread& oThread : voThreads)
    {
        oThread.join();
    }
    EXPECT_EQ(voResults, (std::vector<Image<double>>(4, Filtered(oFilter, {{3, 8, 19}}))));
}

// Positive samples: a weight that is 1 ulp off moves the mean by as little.
TEST(FilterFefrost, FastExponentialMovesTheResultByLittle)
{
    Random oRandom(44);
    const auto poIn = RandomRaster(90, 20, 1, eDT_64R, Margins{3, 3}, Samples::Ordinary, oRandom);
    for (std::size_t i = 0; i < poIn->mnBufferSize / sizeof(double); ++i)
    {
        double& dfSample = reinterpret_cast<double*>(poIn->mpBuffer)[i];
        dfSample = std::fabs(dfSample);
    }
    const auto poMask = RandomMask(90, 20, Margins{3, 3}, 0.9, oRandom);
    const auto poExact = BlankRaster(90, 20, 1, eDT_64R);
    const auto poFast = BlankRaster(90, 20, 1, eDT_64R);
    FilterFefrost oFilter = EnhancedFrost(10.0, 1.0);
    oFilter.SetFilterSize(7, 7);
    oFilter.Process(poIn.get(), poMask.get(), poExact.get(), nullptr);
    oFilter.SetFastExponential(true);
    oFilter.Process(poIn.get(), poMask.get(), poFast.get(), nullptr);
    const std::vector<double> vdfExact = ImageOf<double>(*poExact).Samples();
    const std::vector<double> vdfFast = ImageOf<double>(*poFast).Samples();
    EXPECT_NE(vdfExact, vdfFast);
    for (std::size_t i = 0; i < vdfExact.size(); ++i)
    {
        ASSERT_NEAR(vdfFast[i], vdfExact[i], 2e-15 * vdfExact[i]);
    }
}

struct Case
{
    boost::optional<int> nSizeX;
    boost::optional<int> nSizeY;
    double dfLooks = 1.0;
    double dfDamp = 1.0;
    bool bBGZero = false;
};

enum Regime
{
    FLAT,
    POINT,
    WEIGHTED
};

/// The filter as it is defined. Returns how many samples met each regime.
std::array<int, 3> EnhancedFrostByDefinition(const tessel::Raster& oIn,
                                             const tessel::Mask* poMaskIn, const Case& oCase,
                                             const tessel::Raster& oOut,
                                             const tessel::Mask* poMaskOut)
{
    const auto& [nSizeX, nSizeY, dfLooks, dfDamp, bBGZero] = oCase;
    const int nMarginX = static_cast<int>(oIn.mnMarginX);
    const int nMarginY = static_cast<int>(oIn.mnMarginY);
    const auto voStatistics =
        LocalStatisticsByDefinition(oIn, poMaskIn, nSizeX && nSizeY ? *nSizeX / 2 : nMarginX,
                                    nSizeX && nSizeY ? *nSizeY / 2 : nMarginY);
    const int hx = nSizeX ? *nSizeX / 2 : nMarginX / 2;
    const int hy = nSizeY ? *nSizeY / 2 : nMarginY / 2;
    const double dfCu = 1.0 / std::sqrt(dfLooks);
    const double dfCmax = std::sqrt(2.0 / dfLooks + 1.0);
    std::array<int, 3> anRegimes{};
    for (int y = 0; y < static_cast<int>(oIn.mnHeight); ++y)
    {
        for (int x = 0; x < static_cast<int>(oIn.mnWidth); ++x)
        {
            for (std::uint32_t c = 0; c < oIn.mnChannels; ++c)
            {
                const double dfCentre = oIn.GetPixelAs<double>(x, y)[c];
                double& dfOut = oOut.GetPixelAs<double>(x, y)[c];
                if (!IsValid(poMaskIn, x, y) || !IsValid(poMaskOut, x, y))
                {
                    dfOut = bBGZero ? 0.0 : dfCentre;
                    continue;
                }
                const std::size_t nPixel =
                    static_cast<std::size_t>(y) * oIn.mnWidth + static_cast<std::size_t>(x);
                const auto [n, dfMean, dfVariance] = voStatistics[nPixel * oIn.mnChannels + c];
                const double Ci = std::sqrt(dfVariance) / dfMean;
                if (dfCu > Ci)
                {
                    dfOut = dfMean;
                    ++anRegimes[FLAT];
                    continue;
                }
                if (Ci > dfCmax)
                {
                    dfOut = dfCentre;
                    ++anRegimes[POINT];
                    continue;
                }
                ++anRegimes[WEIGHTED];
                const double A = (Ci - dfCu) * dfDamp / (dfCmax - Ci);
                double dfSum = 0.0;
                double dfWeights = 0.0;
                for (int dy = -hy; dy <= hy; ++dy)
                {
                    for (int dx = -hx; dx <= hx; ++dx)
                    {
                        if (!IsValid(poMaskIn, x + dx, y + dy))
                        {
                            continue;
                        }
                        const double d = std::sqrt(static_cast<double>(dy * dy + dx * dx));
                        const double w = std::exp(-(d * A));
                        dfSum += w * oIn.GetPixelAs<double>(x + dx, y + dy)[c];
                        dfWeights += w;
                    }
                }
                dfOut = n == 1.0 ? dfCentre : dfSum / dfWeights;
            }
        }
    }
    return anRegimes;
}

std::array<int, 3> CompareWithDefinition(std::uint32_t nMostWidth, Samples eSamples,
                                         Random& oRandom)
{
    const auto nWidth = 1 + static_cast<std::uint32_t>(oRandom() % nMostWidth);
    const auto nHeight = 1 + static_cast<std::uint32_t>(oRandom() % 12);
    const auto nChannels = 1 + static_cast<std::uint32_t>(oRandom() % 4);
    const Margins oMargins{static_cast<std::uint32_t>(oRandom() % 5),
                           static_cast<std::uint32_t>(oRandom() % 5)};
    Case oCase;
    if (oRandom() % 2 == 0)
    {
        oCase.nSizeX = static_cast<int>(oRandom() % (2 * oMargins.x + 2));
    }
    if (oRandom() % 2 == 0)
    {
        oCase.nSizeY = static_cast<int>(oRandom() % (2 * oMargins.y + 2));
    }
    const double adfLooks[] = {0.5, 1.0, 4.0, 30.0};
    oCase.dfLooks = adfLooks[oRandom() % 4];
    oCase.dfDamp = static_cast<double>(oRandom() % 5) / 2.0;
    oCase.bBGZero = oRandom() % 2 == 0;
    FilterFefrost oFilter = EnhancedFrost(oCase.dfLooks, oCase.dfDamp, oCase.bBGZero);
    oFilter.SetFilterSize(oCase.nSizeX, oCase.nSizeY);
    const auto poIn =
        RandomRaster(nWidth, nHeight, nChannels, eDT_64R, oMargins, eSamples, oRandom);
    if (eSamples == Samples::Ordinary)
    {
        // Positive samples, so that all three regimes come about.
        for (std::size_t i = 0; i < poIn->GetRowSamples() * poIn->mnTotalHeight; ++i)
        {
            double& dfSample = reinterpret_cast<double*>(poIn->mpBuffer)[i];
            dfSample = dfSample * dfSample;
        }
    }
    const double adfValid[] = {0.999, 0.95, 0.5, 0.1};
    const auto poMask = RandomMask(nWidth, nHeight, oMargins, adfValid[oRandom() % 4], oRandom);
    const auto poClip = RandomMask(nWidth, nHeight, Margins{0, 2}, 0.8, oRandom);
    tessel::Mask* poMaskIn = oRandom() % 2 == 0 ? poMask.get() : nullptr;
    tessel::Mask* poMaskOut = oRandom() % 2 == 0 ? poClip.get() : nullptr;
    const auto poActual = BlankRaster(nWidth, nHeight, nChannels, eDT_64R, Margins{1, 2});
    const auto poExpected = BlankRaster(nWidth, nHeight, nChannels, eDT_64R, Margins{1, 2});
    oFilter.Process(poIn.get(), poMaskIn, poActual.get(), poMaskOut);
    const auto anRegimes =
        EnhancedFrostByDefinition(*poIn, poMaskIn, oCase, *poExpected, poMaskOut);
    EXPECT_TRUE(SameBits(*poActual, *poExpected))
        << nWidth << " x " << nHeight << " x " << nChannels;
    return anRegimes;
}

TEST(FilterFefrost, GivesTheBitsOfTheDefinition)
{
    Random oRandom(43);
    std::array<int, 3> anRegimes{};
    for (int i = 0; i < 120; ++i)
    {
        const auto anOfBlock = CompareWithDefinition(
            i % 2 == 0 ? 200 : 12, i % 3 == 0 ? Samples::Special : Samples::Ordinary, oRandom);
        for (std::size_t k = 0; k < anRegimes.size(); ++k)
        {
            anRegimes[k] += anOfBlock[k];
        }
    }
    EXPECT_GT(anRegimes[FLAT], 1000);
    EXPECT_GT(anRegimes[POINT], 1000);
    EXPECT_GT(anRegimes[WEIGHTED], 1000);
}

}  // namespace
}  // namespace kor::filters
