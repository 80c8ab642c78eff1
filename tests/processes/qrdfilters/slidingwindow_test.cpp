#include "processes/qrdfilters/slidingwindow.h"

#include <gtest/gtest.h>

#include <cmath>
#include <vector>

#include "tests/support/blocks.h"
#include "tests/support/plainwindow.h"

namespace kor::filters
{
namespace
{

using tessel::eDT_32R;
using tessel::eDT_64R;
using tessel::Mask;
using tessel::Raster;
using test::Margins;
using test::Random;
using test::Samples;

/// A finishing function that shows every field: different weights tell them apart.
double Finish(double dfSquares, double dfSum, double dfCount, double dfCentre)
{
    return dfSquares * 0.5 + dfSum / dfCount - dfCentre * 0.25;
}

template <class TSample>
void RunEngine(const Raster& oIn, const Mask* poMaskIn, const Window& oWindow, bool bBGZero,
               Raster& oOut, const Mask* poMaskOut)
{
    constexpr WindowTerm kTerms[] = {kSumTerm, kSumOfSquaresTerm};
    FilterWindowRows<TSample>(
        oIn, poMaskIn, oWindow, kTerms, bBGZero,
        [](const WindowStatistics& oStatistics, std::span<double> vdfOut)
        {
            ASSERT_EQ(vdfOut.size(), oStatistics.GetPadded());
            for (std::size_t i = 0; i < vdfOut.size(); ++i)
            {
                vdfOut[i] = Finish(oStatistics.mapSums[1][i], oStatistics.mapSums[0][i],
                                   oStatistics.mpCounts[i], oStatistics.mpCentres[i]);
            }
        },
        oOut, poMaskOut);
}

struct Shape
{
    std::uint32_t mnWidth;
    std::uint32_t mnHeight;
    std::uint32_t mnChannels;
    Margins moMargins;
    Window moWindow;
};

std::ostream& operator<<(std::ostream& oStream, const Shape& oShape)
{
    return oStream << oShape.mnWidth << " x " << oShape.mnHeight << " x " << oShape.mnChannels
                   << ", margins " << oShape.moMargins.x << " and " << oShape.moMargins.y
                   << ", half window " << oShape.moWindow.mnHalfX << " and "
                   << oShape.moWindow.mnHalfY;
}

/// Both masks, one or none; both backgrounds; ordinary and special samples.
template <class TSample>
void CompareWithPlainEngine(const Shape& oShape, const tessel::DataType& oType, Random& oRandom)
{
    for (unsigned int nCase = 0; nCase < 8; ++nCase)
    {
        const Samples eSamples = nCase % 2 == 0 ? Samples::Ordinary : Samples::Special;
        const bool bBGZero = oRandom() % 2 == 0;
        const Margins oOutMargins{static_cast<std::uint32_t>(oRandom() % 3),
                                  static_cast<std::uint32_t>(oRandom() % 3)};
        const auto poIn = test::RandomRaster(oShape.mnWidth, oShape.mnHeight, oShape.mnChannels,
                                             oType, oShape.moMargins, eSamples, oRandom);
        const double dfValid = oRandom() % 2 == 0 ? 0.9 : 0.2;
        const auto poMaskIn =
            test::RandomMask(oShape.mnWidth, oShape.mnHeight, oShape.moMargins, dfValid, oRandom);
        const auto poMaskOut =
            test::RandomMask(oShape.mnWidth, oShape.mnHeight, oOutMargins, dfValid, oRandom);
        const Mask* poIgnored = (nCase & 2U) != 0 ? poMaskIn.get() : nullptr;
        const Mask* poClipped = (nCase & 4U) != 0 ? poMaskOut.get() : nullptr;
        const auto poActual = test::BlankRaster(oShape.mnWidth, oShape.mnHeight, oShape.mnChannels,
                                                oType, oOutMargins);
        const auto poExpected = test::BlankRaster(oShape.mnWidth, oShape.mnHeight,
                                                  oShape.mnChannels, oType, oOutMargins);
        RunEngine<TSample>(*poIn, poIgnored, oShape.moWindow, bBGZero, *poActual, poClipped);
        test::FilterPlainly<TSample, test::MomentTerms>(
            *poIn, poIgnored, oShape.moWindow, bBGZero,
            [](const auto& oSums, double dfCentre)
            { return Finish(oSums.moValues[0], oSums.moValues[1], oSums.mdfCount, dfCentre); },
            *poExpected, poClipped);
        ASSERT_TRUE(test::SameBits(*poActual, *poExpected)) << oShape << ", case " << nCase;
    }
}

Shape RandomShape(std::uint32_t nMostPixels, Random& oRandom)
{
    Shape oShape{};
    oShape.mnWidth = 1 + static_cast<std::uint32_t>(oRandom() % nMostPixels);
    oShape.mnHeight = 1 + static_cast<std::uint32_t>(oRandom() % 27);
    oShape.mnChannels = 1 + static_cast<std::uint32_t>(oRandom() % 5);
    oShape.moWindow = {static_cast<std::uint32_t>(oRandom() % 5),
                       static_cast<std::uint32_t>(oRandom() % 5)};
    oShape.moMargins = {oShape.moWindow.mnHalfX + static_cast<std::uint32_t>(oRandom() % 3),
                        oShape.moWindow.mnHalfY + static_cast<std::uint32_t>(oRandom() % 3)};
    return oShape;
}

TEST(SlidingWindow, GivesTheBitsOfThePlainLoop)
{
    Random oRandom(1);
    for (int i = 0; i < 60; ++i)
    {
        CompareWithPlainEngine<double>(RandomShape(40, oRandom), eDT_64R, oRandom);
        CompareWithPlainEngine<float>(RandomShape(40, oRandom), eDT_32R, oRandom);
    }
}

// Rows longer than a stretch, whose running sums and columns are carried over.
TEST(SlidingWindow, GivesTheBitsOfThePlainLoopOnLongRows)
{
    Random oRandom(2);
    for (int i = 0; i < 8; ++i)
    {
        CompareWithPlainEngine<double>(RandomShape(900, oRandom), eDT_64R, oRandom);
        CompareWithPlainEngine<float>(RandomShape(900, oRandom), eDT_32R, oRandom);
    }
}

TEST(SlidingWindow, GivesTheBitsOfThePlainLoopForLargeWindows)
{
    Random oRandom(3);
    CompareWithPlainEngine<double>({300, 20, 1, {40, 33}, {40, 32}}, eDT_64R, oRandom);
    CompareWithPlainEngine<double>({30, 9, 3, {150, 5}, {150, 5}}, eDT_64R, oRandom);
}

TEST(SlidingWindow, BlockWithoutPixelsOrChannelsIsNoWork)
{
    for (const Shape& oShape : {Shape{0, 4, 1, {1, 1}, {1, 1}}, Shape{4, 0, 1, {1, 1}, {1, 1}},
                                Shape{4, 4, 0, {1, 1}, {1, 1}}})
    {
        const auto poIn = test::BlankRaster(oShape.mnWidth, oShape.mnHeight, oShape.mnChannels,
                                            eDT_64R, oShape.moMargins);
        int nVisits = 0;
        constexpr WindowTerm kTerms[] = {kSumTerm};
        ScanWindows<double>(*poIn, nullptr, oShape.moWindow, kTerms,
                            [&nVisits](const WindowStatistics&) { ++nVisits; });
        EXPECT_EQ(nVisits, 0);
    }
}

// A term may sum something made of the sample, and masked samples add nothing even then.
TEST(SlidingWindow, TransformedSamplesAreSummed)
{
    const auto poIn = test::RasterOf(test::Image<double>{{4, 9, 16, 25}}, {1, 0});
    const auto poMask = test::MaskOf({{1, 1, 1, 0}}, {1, 0});
    const WindowTerm aoTerms[] = {{[](std::span<double> vdfSamples)
                                   {
                                       for (double& dfSample : vdfSamples)
                                       {
                                           dfSample = std::sqrt(dfSample) + 1.0;
                                       }
                                   },
                                   false},
                                  kSumTerm};
    std::vector<double> vdfRoots;
    std::vector<double> vdfSums;
    ScanWindows<double>(*poIn, poMask.get(), {1, 0}, aoTerms,
                        [&](const WindowStatistics& oStatistics)
                        {
                            const auto* const* apSums = oStatistics.mapSums.data();
                            vdfRoots.assign(apSums[0], apSums[0] + oStatistics.mnSamples);
                            vdfSums.assign(apSums[1], apSums[1] + oStatistics.mnSamples);
                        });
    EXPECT_EQ(vdfRoots, (std::vector<double>{3 + 4 + 5, 4 + 5}));
    EXPECT_EQ(vdfSums, (std::vector<double>{4 + 9 + 16, 9 + 16}));
}

}  // namespace
}  // namespace kor::filters
