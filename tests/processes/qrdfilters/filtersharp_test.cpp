#include "processes/qrdfilters/filtersharp.h"

#include <gtest/gtest.h>

#include "platform/exception/exception.h"
#include "platform/system/omp.h"
#include "processes/qrdfilters/hardened.h"
#include "tests/support/filtercomparison.h"
#include "tests/support/filtered.h"

namespace kor::filters
{
namespace
{

using namespace kor::test;

const Image<double> kSinglePixel = {
    {0, 0, 0, 0, 0}, {0, 0, 0, 0, 0}, {0, 0, 9, 0, 0}, {0, 0, 0, 0, 0}, {0, 0, 0, 0, 0},
};

TEST(FilterSharp, KeepsAFlatImage)
{
    const Image<double> oImage = {{7, 7, 7, 7}, {7, 7, 7, 7}, {7, 7, 7, 7}};
    EXPECT_EQ(Filtered(FilterSharp(), oImage, {1, 1}), (Image<double>{{7, 7}}));
}

TEST(FilterSharp, BoostsAPixelAgainstItsSurroundings)
{
    EXPECT_EQ(Filtered(FilterSharp(), kSinglePixel, {1, 1}),
              (Image<double>{{-1, -1, -1}, {-1, 17, -1}, {-1, -1, -1}}));
}

TEST(FilterSharp, WorksWithOneMarginOfZero)
{
    // Means 3, 6, 3 of three pixels in a row or in a column.
    EXPECT_EQ(Filtered(FilterSharp(), Image<double>{{0, 0, 9, 9, 0}}, {1, 0}),
              (Image<double>{{-3, 12, 12}}));
    EXPECT_EQ(Filtered(FilterSharp(), Image<double>{{0}, {0}, {9}, {9}, {0}}, {0, 1}),
              (Image<double>{{-3}, {12}, {12}}));
}

// 5 x 5 and 3 x 3 pixels: the mean of the window around the 9 is 9 / 25 or 1.
TEST(FilterSharp, TakesASetSizeAsTheHalfSize)
{
    FilterSharp oFilter;
    EXPECT_EQ(Filtered(oFilter, kSinglePixel, {2, 2}), (Image<double>{{18.0 - 9.0 / 25.0}}));
    oFilter.SetFilterSize(1, 1);
    EXPECT_EQ(Filtered(oFilter, kSinglePixel, {2, 2}), (Image<double>{{17}}));
    oFilter.SetFilterSize(2, 2);
    EXPECT_EQ(Filtered(oFilter, kSinglePixel, {2, 2}), (Image<double>{{18.0 - 9.0 / 25.0}}));
}

TEST(FilterSharp, LeavesAnAxisWithoutASizeToTheMargins)
{
    FilterSharp oFilter;
    oFilter.SetFilterSize(boost::optional<int>(1), boost::none);
    EXPECT_EQ(Filtered(oFilter, kSinglePixel, {2, 2}), (Image<double>{{18.0 - 9.0 / 15.0}}));
    oFilter.SetFilterSize(boost::none, boost::optional<int>(0));
    EXPECT_EQ(Filtered(oFilter, kSinglePixel, {2, 2}), (Image<double>{{18.0 - 9.0 / 5.0}}));
    oFilter.SetFilterSize(boost::none, boost::none);
    EXPECT_EQ(Filtered(oFilter, kSinglePixel, {2, 2}), (Image<double>{{18.0 - 9.0 / 25.0}}));
}

TEST(FilterSharp, TakesNegativeSizesAsZero)
{
    FilterSharp oFilter;
    oFilter.SetFilterSize(-3, -1);
    EXPECT_EQ(Filtered(oFilter, kSinglePixel, {1, 1}),
              (Image<double>{{0, 0, 0}, {0, 9, 0}, {0, 0, 0}}));
}

TEST(FilterSharp, TreatsChannelsByThemselves)
{
    EXPECT_EQ(
        Filtered(FilterSharp(), Image<double>{{0, 7, 9, 7, 0, 7}}, {1, 0}, nullptr, nullptr, 2),
        (Image<double>{{15, 7}}));
}

// The mean of 9 and 3 valid zeros, and of the 9 alone.
TEST(FilterSharp, LeavesMaskedPixelsOutOfTheMean)
{
    const Image<double> oImage = {{0, 500, 0}, {0, 9, 500}, {500, 500, 500}};
    const auto poMask = MaskOf({{1, 0, 1}, {1, 1, 0}, {0, 0, 0}}, {1, 1});
    EXPECT_EQ(Filtered(FilterSharp(), oImage, {1, 1}, poMask.get()), (Image<double>{{15.75}}));
    const auto poAlone = MaskOf({{0, 0, 0}, {0, 1, 0}, {0, 0, 0}}, {1, 1});
    EXPECT_EQ(Filtered(FilterSharp(), oImage, {1, 1}, poAlone.get()), (Image<double>{{9}}));
}

TEST(FilterSharp, WritesBackgroundWhereNothingIsComputed)
{
    const auto poMaskIn = MaskOf({{1, 0, 1, 1, 1}}, {1, 0});
    const auto poMaskOut = MaskOf({{1, 1, 0}});
    const Image<double> oImage = {{6, 5, 9, 3, 6}};
    FilterSharp oFilter;
    EXPECT_EQ(Filtered(oFilter, oImage, {1, 0}, poMaskIn.get(), poMaskOut.get()),
              (Image<double>{{5, 12, 3}}));
    oFilter.SetBGZero(true);
    EXPECT_EQ(Filtered(oFilter, oImage, {1, 0}, poMaskIn.get(), poMaskOut.get()),
              (Image<double>{{0, 12, 0}}));
    const FilterSharp oCopy(oFilter);
    EXPECT_EQ(Filtered(oCopy, oImage, {1, 0}, poMaskIn.get(), poMaskOut.get()),
              (Image<double>{{0, 12, 0}}));
}

TEST(FilterSharp, WritesTheBackgroundOfAllChannels)
{
    const auto poMaskOut = MaskOf({{0, 1}});
    const Image<double> oImage = {{1, 2, 3, 4, 5, 6, 7, 14}};
    FilterSharp oFilter;
    EXPECT_EQ(Filtered(oFilter, oImage, {1, 0}, nullptr, poMaskOut.get(), 2),
              (Image<double>{{3, 4, 5, 4}}));
    oFilter.SetBGZero(true);
    EXPECT_EQ(Filtered(oFilter, oImage, {1, 0}, nullptr, poMaskOut.get(), 2),
              (Image<double>{{0, 0, 5, 4}}));
}

// Beside 2^53 a 1 is lost: a sum that slides on from there is one too small for good, and one that
// begins anew behind the background pixel is not.
TEST(FilterSharp, BeginsItsSumsAnewBehindABackgroundPixel)
{
    const Image<double> oImage = {{0x1p53, 1, 0, 2, 0, 3}};
    // Windows (2^53, 1, 0), (1, 0, 2), (0, 2, 0), (2, 0, 3); sums 2^53, 2, 1, 4.
    EXPECT_EQ(Filtered(FilterSharp(), oImage, {1, 0}).Samples()[1], 0.0 - 2.0 / 3.0);
    EXPECT_EQ(Filtered(FilterSharp(), oImage, {1, 0}).Samples()[2], 4.0 - 1.0 / 3.0);
    const auto poMaskOut = MaskOf({{1, 0, 1, 1}});
    const Image<double> oOut = Filtered(FilterSharp(), oImage, {1, 0}, nullptr, poMaskOut.get());
    EXPECT_EQ(oOut.Samples()[1], 0.0);
    EXPECT_EQ(oOut.Samples()[2], 4.0 - 2.0 / 3.0);
    EXPECT_EQ(oOut.Samples()[3], 0.0 - 5.0 / 3.0);
}

TEST(FilterSharp, RefusesBlocksWithoutMargins)
{
    FilterSharp oSet;
    oSet.SetFilterSize(0, 0);
    for (const FilterSharp& oFilter : {FilterSharp(), oSet})
    {
        const auto poIn = BlankRaster(3, 3, 1, tessel::eDT_64R);
        const auto poOut = BlankRaster(3, 3, 1, tessel::eDT_64R);
        const auto poBefore = BlankRaster(3, 3, 1, tessel::eDT_64R);
        try
        {
            oFilter.Process(poIn.get(), nullptr, poOut.get(), nullptr);
            FAIL() << "nothing was thrown";
        }
        catch (const ParameterException& oException)
        {
            EXPECT_EQ(oException.GetMessage(), "The Margin of the input raster is too small.");
            EXPECT_EQ(oException.GetParameterName(), "oRasterIn");
            EXPECT_EQ(oException.GetType(), ParameterException::Type::eInvalidValue);
            EXPECT_EQ(oException.GetFile(), "processes/qrdfilters/filtersharp");
            EXPECT_NE(oException.GetFunction().find("FilterSharp::ProcessBlock("),
                      std::string::npos);
            EXPECT_GT(oException.GetLine(), 0U);
        }
        EXPECT_TRUE(SameBits(*poOut, *poBefore));
    }
}

TEST(FilterSharp, RefusesAWindowLargerThanTheMarginsWhenHardened)
{
    if (!kHardened)
    {
        GTEST_SKIP() << "only hardened builds look";
    }
    FilterSharp oFilter;
    oFilter.SetFilterSize(2, 1);
    EXPECT_THROW(Filtered(oFilter, kSinglePixel, {1, 1}), Exception);
}

TEST(FilterSharp, AcceptsBlocksWithoutPixels)
{
    const auto poNoRows = BlankRaster(4, 0, 1, tessel::eDT_64R, {1, 1});
    const auto poNoColumns = BlankRaster(0, 4, 1, tessel::eDT_64R, {1, 1});
    EXPECT_NO_THROW(FilterSharp().Process(poNoRows.get(), nullptr, poNoRows.get(), nullptr));
    EXPECT_NO_THROW(FilterSharp().Process(poNoColumns.get(), nullptr, poNoColumns.get(), nullptr));
}

// ---- The definition.

struct Sharp
{
    std::int64_t mnHalfX;
    std::int64_t mnHalfY;
    bool mbBGZero;
};

/// Adds or subtracts column nColumn of the windows of row y.
void UpdateByColumn(const tessel::Raster& oIn, const tessel::Mask* poMaskIn, std::int64_t nColumn,
                    std::int64_t y, std::int64_t nHalfY, double dfSign,
                    std::vector<double>& vdfSums, int& nCount)
{
    for (std::size_t c = 0; c < oIn.mnChannels; ++c)
    {
        for (std::int64_t dy = -nHalfY; dy <= nHalfY; ++dy)
        {
            if (IsValid(poMaskIn, nColumn, y + dy))
            {
                const double dfSample = oIn.GetPixelAs<double>(nColumn, y + dy)[c];
                vdfSums[c] = dfSign < 0 ? vdfSums[c] - dfSample : vdfSums[c] + dfSample;
                nCount += c == 0 ? static_cast<int>(dfSign) : 0;
            }
        }
    }
}

void SumFromScratch(const tessel::Raster& oIn, const tessel::Mask* poMaskIn, std::int64_t x,
                    std::int64_t y, const Sharp& oSharp, std::vector<double>& vdfSums, int& nCount)
{
    std::fill(vdfSums.begin(), vdfSums.end(), 0.0);
    nCount = 0;
    for (std::size_t c = 0; c < oIn.mnChannels; ++c)
    {
        for (std::int64_t dy = -oSharp.mnHalfY; dy <= oSharp.mnHalfY; ++dy)
        {
            for (std::int64_t dx = -oSharp.mnHalfX; dx <= oSharp.mnHalfX; ++dx)
            {
                if (IsValid(poMaskIn, x + dx, y + dy))
                {
                    vdfSums[c] += oIn.GetPixelAs<double>(x + dx, y + dy)[c];
                    nCount += c == 0 ? 1 : 0;
                }
            }
        }
    }
}

void FilterByDefinition(const tessel::Raster& oIn, const tessel::Mask* poMaskIn,
                        const tessel::Raster& oOut, const tessel::Mask* poMaskOut,
                        const Sharp& oSharp)
{
    for (std::int64_t y = 0; y < oIn.mnHeight; ++y)
    {
        std::vector<double> vdfSums(oIn.mnChannels);
        int nCount = 0;
        bool bReset = true;
        for (std::int64_t x = 0; x < oIn.mnWidth; ++x)
        {
            const double* pIn = oIn.GetPixelAs<double>(x, y);
            double* pOut = oOut.GetPixelAs<double>(x, y);
            const bool bComputed = IsValid(poMaskIn, x, y) && IsValid(poMaskOut, x, y);
            if (bComputed && bReset)
            {
                SumFromScratch(oIn, poMaskIn, x, y, oSharp, vdfSums, nCount);
            }
            else if (bComputed)
            {
                UpdateByColumn(oIn, poMaskIn, x - 1 - oSharp.mnHalfX, y, oSharp.mnHalfY, -1.0,
                               vdfSums, nCount);
                UpdateByColumn(oIn, poMaskIn, x + oSharp.mnHalfX, y, oSharp.mnHalfY, 1.0, vdfSums,
                               nCount);
            }
            bReset = !bComputed;
            for (std::size_t c = 0; c < oIn.mnChannels; ++c)
            {
                pOut[c] = bComputed ? pIn[c] * 2.0 - vdfSums[c] / static_cast<double>(nCount)
                          : oSharp.mbBGZero ? 0.0
                                            : pIn[c];
            }
        }
    }
}

void Compare(const Sharp& oSharp, bool bSetSize, const Shape& oShape, double dfValid,
             Random& oRandom)
{
    FilterSharp oFilter;
    oFilter.SetBGZero(oSharp.mbBGZero);
    if (bSetSize)
    {
        oFilter.SetFilterSize(static_cast<int>(oSharp.mnHalfX), static_cast<int>(oSharp.mnHalfY));
    }
    const auto eSamples = oRandom() % 4 == 0 ? Samples::Special : Samples::Ordinary;
    CompareWithDefinition<double, double>(
        oShape, eSamples, dfValid, oRandom,
        [&](auto poIn, auto poMaskIn, auto poOut, auto poMaskOut)
        { oFilter.Process(poIn, poMaskIn, poOut, poMaskOut); },
        [&](auto poIn, auto poMaskIn, auto poOut, auto poMaskOut)
        { FilterByDefinition(*poIn, poMaskIn, *poOut, poMaskOut, oSharp); });
}

TEST(FilterSharp, FollowsTheDefinitionForAllShapes)
{
    const OMPThreadCount oOne(1);
    Random oRandom(5);
    const auto oCompareAll = [&](const Sharp& oSharp, bool bSetSize, Margins oMargins)
    {
        ForEachShape(oMargins, [&](const Shape& oShape, double dfValid)
                     { Compare(oSharp, bSetSize, oShape, dfValid, oRandom); });
    };
    oCompareAll({1, 1, false}, false, {1, 1});
    oCompareAll({2, 0, true}, false, {2, 0});
    oCompareAll({1, 3, false}, true, {3, 4});
    oCompareAll({0, 0, true}, true, {1, 0});
}

// Bands of 32 rows and tiles of four windows or more.
TEST(FilterSharp, FollowsTheDefinitionAcrossBandsAndTiles)
{
    const OMPThreadCount oTwo(2);
    Random oRandom(6);
    Compare({2, 2, false}, false, {150, 71, 1, {2, 2}}, 0.97, oRandom);
    Compare({1, 1, true}, false, {70, 33, 3, {1, 1}}, 0.9, oRandom);
    Compare({20, 6, false}, true, {340, 37, 2, {20, 7}}, 0.995, oRandom);
}

}  // namespace
}  // namespace kor::filters
