#include "processes/qrdfilters/filterffrost.h"

#include <gtest/gtest.h>

#include <cmath>
#include <functional>
#include <string>
#include <thread>
#include <vector>

#include "platform/exception/exception.h"
#include "processes/qrdfilters/kernels/exponentialrow.h"
#include "processes/qrdfilters/kernels/windowsums.h"
#include "tests/support/blocks.h"
#include "tests/support/filtered.h"
#include "tests/support/localstatisticsreference.h"

namespace kor::filters
{
namespace
{

using namespace kor::test;
using tessel::eDT_64R;

FilterFfrost Frost(double dfDamp, bool bBGZero = false)
{
    FilterFfrost oFilter;
    oFilter.SetDamp(dfDamp);
    oFilter.SetBGZero(bBGZero);
    return oFilter;
}

/// The weighted mean of samples in the order given, and the same over exp(-(A * d)).
struct Weighted
{
    double dfSample;
    double dfDistance;
};

double WeightedMean(double dfA, const std::vector<Weighted>& voSamples)
{
    double dfSum = 0.0;
    double dfWeights = 0.0;
    for (const Weighted& o : voSamples)
    {
        const double w = std::exp(-(dfA * o.dfDistance));
        dfSum += w * o.dfSample;
        dfWeights += w;
    }
    return dfSum / dfWeights;
}

// 1 2 3: mean 2, variance 1, so A = 1 / 4 * 2.
TEST(FilterFfrost, WeighsNeighboursByTheirDistance)
{
    const double w = std::exp(-0.5);
    EXPECT_EQ(Filtered(Frost(2.0), {{1, 2, 3}}, Margins{1, 0}),
              (Image<double>{{(w * 1.0 + 2.0 + w * 3.0) / (w + 1.0 + w)}}));
}

// Sum 18, squares 80: mean 2, variance (80 - 36) / 8 = 5.5, A = 5.5 / 4.
TEST(FilterFfrost, CornersOfTheWindowAreFartherThanItsSides)
{
    const double r = std::sqrt(2.0);
    const double dfExpected = WeightedMean(
        1.375, {{8, r}, {1, 1}, {1, r}, {1, 1}, {1, 0}, {1, 1}, {1, r}, {1, 1}, {3, r}});
    EXPECT_EQ(Filtered(Frost(1.0), {{8, 1, 1}, {1, 1, 1}, {1, 1, 3}}, Margins{1, 1}),
              (Image<double>{{dfExpected}}));
}

TEST(FilterFfrost, TreatsChannelsByThemselves)
{
    const double w = std::exp(-0.5);
    const double v = std::exp(-2.0);  // 0 20 40: mean 20, variance 400, A = 2
    EXPECT_EQ(Filtered(Frost(2.0), {{1, 0, 2, 20, 3, 40}}, Margins{1, 0}, nullptr, nullptr, 2),
              (Image<double>{
                  {(w * 1.0 + 2.0 + w * 3.0) / (w + 1.0 + w), (20.0 + v * 40.0) / (v + 1.0 + v)}}));
}

TEST(FilterFfrost, WithoutDampingIsThePlainMean)
{
    EXPECT_EQ(Filtered(Frost(0.0), {{1, 2, 6}, {7, 8, 3}, {4, 5, 9}}, Margins{1, 1}),
              (Image<double>{{5}}));
    const auto poMask = MaskOf({{1, 1, 1}, {0, 1, 1}, {1, 1, 0}}, Margins{1, 1});
    EXPECT_EQ(Filtered(Frost(0.0), {{1, 2, 6}, {NAN, 8, 3}, {4, 4, -INFINITY}}, Margins{1, 1},
                       poMask.get()),
              (Image<double>{{4}}));
}

TEST(FilterFfrost, PixelAloneInItsWindowIsKept)
{
    const auto poMask = MaskOf({{0, 0, 0}, {0, 1, 0}, {0, 0, 0}}, Margins{1, 1});
    EXPECT_EQ(
        Filtered(Frost(1.0), {{1, 2, 3}, {4, 5.25, 6}, {7, 8, 9}}, Margins{1, 1}, poMask.get()),
        (Image<double>{{5.25}}));
}

TEST(FilterFfrost, WindowOfZerosIsNotANumber)
{
    EXPECT_TRUE(std::isnan(Filtered(Frost(1.0), {{0, 0, 0}}, Margins{1, 0}).Samples()[0]));
    // Without damping too: 0 / 0 * 0.
    EXPECT_TRUE(std::isnan(Filtered(Frost(0.0), {{0, 0, 0}}, Margins{1, 0}).Samples()[0]));
}

// Mean 0 with a variance above 0: A is infinite, the neighbours weigh 0 and the centre, at
// distance 0, is not a number.
TEST(FilterFfrost, MeanOfZeroIsNotANumber)
{
    EXPECT_TRUE(std::isnan(Filtered(Frost(1.0), {{-1, 0, 1}}, Margins{1, 0}).Samples()[0]));
}

// Without the masked pixel the window is 1 2 4 5 at the distances 0 1 2 of a 5 x 1 window's table
// 2 1 0 1 2: pixel 1 takes 2, pixel 2 takes 1, the centre 4 takes 0, pixel 5 takes 1.
TEST(FilterFfrost, MaskedPixelShiftsTheDistancesBehindIt)
{
    // Mean 3, variance (1 + 4 + 16 + 25 - 36) / 3 = 10 / 3.
    const double dfA = 10.0 / 3.0 / 9.0 * 1.0;
    const auto poBehind = MaskOf({{1, 1, 1, 0, 1}}, Margins{2, 0});
    EXPECT_EQ(Filtered(Frost(1.0), {{1, 2, 4, NAN, 5}}, Margins{2, 0}, poBehind.get()),
              (Image<double>{{WeightedMean(dfA, {{1, 2}, {2, 1}, {4, 0}, {5, 1}})}}));
    // In front of the centre: the centre itself takes the distance of the pixel before it.
    const auto poBefore = MaskOf({{0, 1, 1, 1, 1}}, Margins{2, 0});
    EXPECT_EQ(Filtered(Frost(1.0), {{NAN, 1, 2, 4, 5}}, Margins{2, 0}, poBefore.get()),
              (Image<double>{{WeightedMean(dfA, {{1, 2}, {2, 1}, {4, 0}, {5, 1}})}}));
}

TEST(FilterFfrost, PixelsClippedFromTheOutputStillFeedTheirNeighbours)
{
    const auto poClip = MaskOf({{0, 1}});
    EXPECT_EQ(Filtered(Frost(0.0), {{3, 30, 300, 3000}}, Margins{1, 0}, nullptr, poClip.get()),
              (Image<double>{{30, 1110}}));
}

TEST(FilterFfrost, BackgroundIsZeroOrTheInputInAllChannels)
{
    const Image<double> oImage = {{1, 10, 2, 20, 3, 30, 4, 40, 5, 50}};
    const auto poMask = MaskOf({{1, 1, 0, 1, 1}}, Margins{1, 0});
    const auto poClip = MaskOf({{1, 1, 0}});
    EXPECT_EQ(Filtered(Frost(0.0, true), oImage, Margins{1, 0}, poMask.get(), poClip.get(), 2),
              (Image<double>{{1.5, 15, 0, 0, 0, 0}}));
    EXPECT_EQ(Filtered(Frost(0.0, false), oImage, Margins{1, 0}, poMask.get(), poClip.get(), 2),
              (Image<double>{{1.5, 15, 3, 30, 4, 40}}));
    EXPECT_EQ(Filtered(FilterFfrost(), oImage, Margins{1, 0}, poMask.get(), poClip.get(), 2),
              (Image<double>{{1.5, 15, 3, 30, 4, 40}}));
}

TEST(FilterFfrost, OneSizeAloneCountsForTheWeightsButNotForTheStatistics)
{
    FilterFfrost oFilter = Frost(1.0);
    oFilter.SetFilterSize(3, boost::none);
    // Mean 3 and variance 2.5 of all five; the weights are those of the middle three.
    EXPECT_EQ(Filtered(oFilter, {{1, 2, 3, 4, 5}}, Margins{2, 0}),
              (Image<double>{{WeightedMean(2.5 / 9.0, {{2, 1}, {3, 0}, {4, 1}})}}));
}

TEST(FilterFfrost, EvenSizesAreHalved)
{
    FilterFfrost oEven = Frost(1.0);
    oEven.SetFilterSize(4, 1);
    EXPECT_EQ(Filtered(oEven, {{1, 2, 3, 4, 5}}, Margins{2, 0}),
              (Image<double>{{WeightedMean(2.5 / 9.0, {{1, 2}, {2, 1}, {3, 0}, {4, 1}, {5, 2}})}}));
}

TEST(FilterFfrost, WindowOfOnePixelIsRefused)
{
    FilterFfrost oFilter = Frost(1.0);
    oFilter.SetFilterSize(1, 1);
    const auto poIn = BlankRaster(2, 2, 1, eDT_64R, Margins{1, 1});
    const auto poOut = BlankRaster(2, 2, 1, eDT_64R);
    const auto poBefore = BlankRaster(2, 2, 1, eDT_64R);
    const auto poBare = BlankRaster(2, 2, 1, eDT_64R);
    for (const tessel::Raster* poRaster : {poIn.get(), poBare.get()})
    {
        try
        {
            oFilter.Process(const_cast<tessel::Raster*>(poRaster), nullptr, poOut.get(), nullptr);
            FAIL() << "nothing was thrown";
        }
        catch (const ParameterException& oException)
        {
            EXPECT_EQ(oException.GetMessage(), "The Margin of the input raster is too small.");
            EXPECT_EQ(oException.GetParameterName(), "oRasterIn");
            EXPECT_EQ(oException.GetType(), ParameterException::Type::eInvalidValue);
            EXPECT_EQ(oException.GetFirstText(), "");
            EXPECT_EQ(oException.GetSecondText(), "");
            EXPECT_EQ(oException.GetFile(), "processes/qrdfilters/filterffrost");
            EXPECT_NE(oException.GetFunction().find("FilterFfrost::ProcessBlock"),
                      std::string::npos)
                << oException.GetFunction();
        }
        EXPECT_TRUE(SameBits(*poOut, *poBefore));
        oFilter.SetFilterSize(boost::none, boost::none);
    }
}

TEST(FilterFfrost, WindowOfOneRowOrOneColumnIsFiltered)
{
    FilterFfrost oFilter = Frost(0.0);
    oFilter.SetFilterSize(3, 1);
    EXPECT_EQ(Filtered(oFilter, {{9, 9, 9}, {1, 2, 6}, {9, 9, 9}}, Margins{1, 1}),
              (Image<double>{{3}}));
    FilterFfrost oColumn = Frost(0.0);
    oColumn.SetFilterSize(1, 3);
    EXPECT_EQ(Filtered(oColumn, {{9, 1, 9}, {9, 2, 9}, {9, 6, 9}}, Margins{1, 1}),
              (Image<double>{{3}}));
}

TEST(FilterFfrost, NegativeDampingIsRefusedAndNotTaken)
{
    FilterFfrost oFilter = Frost(2.0);
    for (const double dfDamp : {-1.0, -1e-300, -HUGE_VAL})
    {
        try
        {
            oFilter.SetDamp(dfDamp);
            FAIL() << "nothing was thrown";
        }
        catch (const Exception& oException)
        {
            EXPECT_EQ(oException.GetMessage(), "Damping factor must be a positive number");
            EXPECT_EQ(oException.GetFile(), "");
            EXPECT_EQ(oException.GetFunction(), "");
            EXPECT_EQ(oException.GetLine(), 0U);
        }
    }
    EXPECT_EQ(Filtered(oFilter, {{1, 2, 3}}, Margins{1, 0}),
              Filtered(Frost(2.0), {{1, 2, 3}}, Margins{1, 0}));
    EXPECT_NO_THROW(oFilter.SetDamp(0.0));
    EXPECT_NO_THROW(oFilter.SetDamp(-0.0));
}

// The first block had a window of 3 pixels: a later one of 5 has no distance for its last two,
// which count as 0.
TEST(FilterFfrost, FirstBlockFixesTheDistances)
{
    const FilterFfrost oFilter = Frost(1.0);
    Filtered(oFilter, {{1, 2, 3}}, Margins{1, 0});
    const Image<double> oExpected = {
        {WeightedMean(2.5 / 9.0, {{1, 1}, {2, 0}, {3, 1}, {4, 0}, {5, 0}})}};
    EXPECT_EQ(Filtered(oFilter, {{1, 2, 3, 4, 5}}, Margins{2, 0}), oExpected);
    const FilterFfrost oCopy(oFilter);
    EXPECT_EQ(Filtered(oCopy, {{1, 2, 3, 4, 5}}, Margins{2, 0}), oExpected);
    FilterFfrost oAssigned;
    oAssigned = oFilter;
    EXPECT_EQ(Filtered(oAssigned, {{1, 2, 3, 4, 5}}, Margins{2, 0}), oExpected);
}

TEST(FilterFfrost, DistancesOfALargerWindowStayInForce)
{
    FilterFfrost oFilter = Frost(1.0);
    oFilter.SetFilterSize(5, 1);
    oFilter.InitProcessing();
    oFilter.SetFilterSize(3, 1);
    // 2 3 4: mean 3, variance 1; the table begins 2 1 0.
    EXPECT_EQ(Filtered(oFilter, {{1, 2, 3, 4, 5}}, Margins{2, 0}),
              (Image<double>{{WeightedMean(1.0 / 9.0, {{2, 2}, {3, 1}, {4, 0}})}}));
}

TEST(FilterFfrost, InitProcessingAppendsToTheTable)
{
    FilterFfrost oFilter = Frost(1.0);
    oFilter.SetFilterSize(3, 1);
    oFilter.InitProcessing();
    oFilter.InitProcessing();
    oFilter.SetFilterSize(5, 1);
    // 1 0 1, and then 1 0.
    EXPECT_EQ(Filtered(oFilter, {{1, 2, 3, 4, 5}}, Margins{2, 0}),
              (Image<double>{{WeightedMean(2.5 / 9.0, {{1, 1}, {2, 0}, {3, 1}, {4, 1}, {5, 0}})}}));
}

TEST(FilterFfrost, InitProcessingDoesNothingWithoutBothSizes)
{
    FilterFfrost oFilter = Frost(1.0);
    oFilter.InitProcessing();
    oFilter.SetFilterSize(9, boost::none);
    oFilter.InitProcessing();
    oFilter.SetFilterSize(boost::none, boost::none);
    EXPECT_EQ(Filtered(oFilter, {{1, 2, 3}}, Margins{1, 0}),
              Filtered(Frost(1.0), {{1, 2, 3}}, Margins{1, 0}));
}

TEST(FilterFfrost, ObjectServesSeveralThreadsOnceItHasItsTable)
{
    FilterFfrost oFilter = Frost(1.0);
    oFilter.SetFilterSize(3, 3);
    oFilter.InitProcessing();
    const Image<double> oImage = {{8, 1, 1, 5}, {1, 1, 1, 2}, {1, 1, 3, 7}};
    const Image<double> oExpected = Filtered(oFilter, oImage, Margins{1, 1});
    std::vector<Image<double>> voResults(4, Image<double>{{0}});
    std::vector<std::thread> voThreads;
    for (Image<double>& oResult : voResults)
    {
        voThreads.emplace_back([&] { oResult = Filtered(oFilter, oImage, Margins{1, 1}); });
    }
    for (std::thread& oThread : voThreads)
    {
        oThread.join();
    }
    EXPECT_EQ(voResults, (std::vector<Image<double>>(4, oExpected)));
}

TEST(FilterFfrost, CallOperatorKeepsMarginsAndOffsets)
{
    auto poIn = std::make_shared<tessel::Raster>(tessel::RasterInfo(1, 1, 1, eDT_64R),
                                                 tessel::RasterContext(1, 2, 40, 50));
    std::fill_n(poIn->GetPixelAs<double>(-1, -2), 15, 4.0);
    const auto poOut = Frost(1.0)(poIn, nullptr, nullptr);
    EXPECT_EQ(poOut->mnMarginX, 1U);
    EXPECT_EQ(poOut->mnMarginY, 2U);
    EXPECT_EQ(poOut->mnOffsetX, 40U);
    EXPECT_EQ(poOut->mnOffsetY, 50U);
    EXPECT_EQ(poOut->moDataType, eDT_64R);
    EXPECT_EQ(ImageOf<double>(*poOut), (Image<double>{{4}}));
}

using Exponential = std::function<double(double)>;

/// The filter as it is defined, one exponential for each pixel of each window.
void FrostByDefinition(const Exponential& oExponential, const tessel::Raster& oIn,
                       const tessel::Mask* poMaskIn, const boost::optional<int>& nSizeX,
                       const boost::optional<int>& nSizeY, double dfDamp, bool bBGZero,
                       const tessel::Raster& oOut, const tessel::Mask* poMaskOut)
{
    const int nMarginX = static_cast<int>(oIn.mnMarginX);
    const int nMarginY = static_cast<int>(oIn.mnMarginY);
    const auto voStatistics =
        LocalStatisticsByDefinition(oIn, poMaskIn, nSizeX && nSizeY ? *nSizeX / 2 : nMarginX,
                                    nSizeX && nSizeY ? *nSizeY / 2 : nMarginY);
    const int hx = nSizeX ? *nSizeX / 2 : nMarginX;
    const int hy = nSizeY ? *nSizeY / 2 : nMarginY;
    std::vector<double> vdfDistances;
    for (double dy = -hy; dy <= hy; dy += 1.0)
    {
        for (double dx = -hx; dx <= hx; dx += 1.0)
        {
            vdfDistances.push_back(std::sqrt(dx * dx + dy * dy));
        }
    }
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
                const double A = dfVariance / (dfMean * dfMean) * dfDamp;
                std::size_t k = 0;
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
                        const double w = oExponential(-(A * vdfDistances[k]));
                        dfSum += w * oIn.GetPixelAs<double>(x + dx, y + dy)[c];
                        dfWeights += w;
                        k += 1;
                    }
                }
                dfOut = n == 1.0 ? dfCentre : dfSum / dfWeights;
            }
        }
    }
}

double LibraryExponential(double x)
{
    return std::exp(x);
}

double FastExponential(double x)
{
    const std::vector<double> vdfCoefficients(kernels::kRowPadding, -x);
    std::vector<double> vdfWeights(kernels::kRowPadding);
    kernels::RaiseWeights(vdfCoefficients, std::vector<double>{1.0}, vdfWeights.data(),
                          kernels::kRowPadding);
    return vdfWeights[0];
}

void CompareWithDefinition(std::uint32_t nMostWidth, Samples eSamples, Random& oRandom)
{
    const auto nWidth = 1 + static_cast<std::uint32_t>(oRandom() % nMostWidth);
    const auto nHeight = 1 + static_cast<std::uint32_t>(oRandom() % 12);
    const auto nChannels = 1 + static_cast<std::uint32_t>(oRandom() % 4);
    const Margins oMargins{static_cast<std::uint32_t>(1 + oRandom() % 4),
                           static_cast<std::uint32_t>(oRandom() % 4)};
    boost::optional<int> nSizeX;
    boost::optional<int> nSizeY;
    if (oRandom() % 2 == 0)
    {
        nSizeX = static_cast<int>(2 + oRandom() % (2 * oMargins.x));
    }
    if (oRandom() % 2 == 0)
    {
        nSizeY = static_cast<int>(oRandom() % (2 * oMargins.y + 2));
    }
    const double dfDamp = static_cast<double>(oRandom() % 5) / 2.0;
    FilterFfrost oFilter = Frost(dfDamp, oRandom() % 2 == 0);
    const bool bBGZero = oRandom() % 2 == 0;
    oFilter.SetBGZero(bBGZero);
    oFilter.SetFilterSize(nSizeX, nSizeY);
    const auto poIn =
        RandomRaster(nWidth, nHeight, nChannels, eDT_64R, oMargins, eSamples, oRandom);
    const double adfValid[] = {0.999, 0.95, 0.5, 0.1};
    const double dfValid = adfValid[oRandom() % 4];
    const auto poMask = RandomMask(nWidth, nHeight, oMargins, dfValid, oRandom);
    const auto poClip = RandomMask(nWidth, nHeight, Margins{0, 2}, 0.8, oRandom);
    tessel::Mask* poMaskIn = oRandom() % 2 == 0 ? poMask.get() : nullptr;
    tessel::Mask* poMaskOut = oRandom() % 2 == 0 ? poClip.get() : nullptr;
    const auto poActual = BlankRaster(nWidth, nHeight, nChannels, eDT_64R, Margins{1, 2});
    const auto poExpected = BlankRaster(nWidth, nHeight, nChannels, eDT_64R, Margins{1, 2});
    const bool bFast = oRandom() % 4 == 0;
    oFilter.SetFastExponential(bFast);
    oFilter.Process(poIn.get(), poMaskIn, poActual.get(), poMaskOut);
    FrostByDefinition(bFast ? FastExponential : LibraryExponential, *poIn, poMaskIn, nSizeX, nSizeY,
                      dfDamp, bBGZero, *poExpected, poMaskOut);
    ASSERT_TRUE(SameBits(*poActual, *poExpected))
        << nWidth << " x " << nHeight << " x " << nChannels << ", valid " << dfValid;
}

// Positive samples: a weight that is 1 ulp off moves the mean by as little.
TEST(FilterFfrost, FastExponentialMovesTheResultByLittle)
{
    Random oRandom(42);
    const auto poIn = RandomRaster(90, 20, 1, eDT_64R, Margins{3, 3}, Samples::Ordinary, oRandom);
    for (std::size_t i = 0; i < poIn->mnBufferSize / sizeof(double); ++i)
    {
        double& dfSample = reinterpret_cast<double*>(poIn->mpBuffer)[i];
        dfSample = std::fabs(dfSample);
    }
    const auto poExact = BlankRaster(90, 20, 1, eDT_64R);
    const auto poFast = BlankRaster(90, 20, 1, eDT_64R);
    FilterFfrost oFilter = Frost(1.0);
    oFilter.Process(poIn.get(), nullptr, poExact.get(), nullptr);
    oFilter.SetFastExponential(true);
    oFilter.Process(poIn.get(), nullptr, poFast.get(), nullptr);
    const std::vector<double> vdfExact = ImageOf<double>(*poExact).Samples();
    const std::vector<double> vdfFast = ImageOf<double>(*poFast).Samples();
    EXPECT_NE(vdfExact, vdfFast);
    for (std::size_t i = 0; i < vdfExact.size(); ++i)
    {
        ASSERT_NEAR(vdfFast[i], vdfExact[i], 2e-15 * vdfExact[i]);
    }
}

TEST(FilterFfrost, GivesTheBitsOfTheDefinition)
{
    Random oRandom(41);
    for (int i = 0; i < 40; ++i)
    {
        CompareWithDefinition(200, i % 3 == 0 ? Samples::Special : Samples::Ordinary, oRandom);
    }
    for (int i = 0; i < 60; ++i)
    {
        CompareWithDefinition(12, i % 3 == 0 ? Samples::Special : Samples::Ordinary, oRandom);
    }
}

}  // namespace
}  // namespace kor::filters
