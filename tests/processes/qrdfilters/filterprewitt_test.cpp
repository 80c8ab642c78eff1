#include "processes/qrdfilters/filterprewitt.h"

#include <gtest/gtest.h>

#include "platform/exception/exception.h"
#include "tests/support/blocks.h"
#include "tests/support/filtered.h"

namespace kor::filters
{
namespace
{

using namespace kor::test;

const Image<double> kColumnStep = {
    {0, 0, 0, 10, 10, 10},
    {0, 0, 0, 10, 10, 10},
    {0, 0, 0, 10, 10, 10},
};

TEST(FilterPrewitt, IsZeroOnAFlatImage)
{
    const Image<double> oImage = {{7, 7, 7, 7}, {7, 7, 7, 7}, {7, 7, 7, 7}};
    EXPECT_EQ(Filtered(FilterPrewitt(), oImage, {1, 1}), (Image<double>{{0, 0}}));
}

TEST(FilterPrewitt, IsThreeTimesAStepOnBothSidesOfIt)
{
    EXPECT_EQ(Filtered(FilterPrewitt(), kColumnStep, {1, 1}), (Image<double>{{0, 30, 30, 0}}));
    const Image<double> oRowStep = {
        {0, 0, 0}, {0, 0, 0}, {0, 0, 0}, {10, 10, 10}, {10, 10, 10}, {10, 10, 10},
    };
    EXPECT_EQ(Filtered(FilterPrewitt(), oRowStep, {1, 1}), (Image<double>{{0}, {30}, {30}, {0}}));
}

// Gx = 3 - 1 - 4 + 6 - 7 + 8 = 5, Gy = 2 + 1 + 3 - 7 - 9 - 8 = -18.
TEST(FilterPrewitt, WeighsAllNeighboursAlike)
{
    const Image<double> oImage = {{1, 2, 3}, {4, 99, 6}, {7, 9, 8}};
    EXPECT_EQ(Filtered(FilterPrewitt(), oImage, {1, 1}), (Image<double>{{std::sqrt(349.0)}}));
}

TEST(FilterPrewitt, MultipliesByTheFactorAndDoesNotClip)
{
    EXPECT_EQ(Filtered(FilterPrewitt(-100.0, true), kColumnStep, {1, 1}),
              (Image<double>{{-0.0, -3000, -3000, -0.0}}));
    FilterPrewitt oFilter;
    oFilter.SetFactor(0.5);
    EXPECT_EQ(Filtered(oFilter, kColumnStep, {1, 1}), (Image<double>{{0, 15, 15, 0}}));
}

TEST(FilterPrewitt, TreatsChannelsByThemselves)
{
    const Image<double> oImage = {
        {0, 5, 0, 5, 10, 5},
        {0, 5, 0, 5, 10, 5},
        {0, 5, 0, 5, 10, 5},
    };
    EXPECT_EQ(Filtered(FilterPrewitt(), oImage, {1, 1}, nullptr, nullptr, 2),
              (Image<double>{{30, 0}}));
}

TEST(FilterPrewitt, ReadsOnePixelOfDeeperMargins)
{
    std::vector<double> vdfSamples(11 * 11, 1e6);
    for (std::size_t i = 0; i < 9; ++i)
    {
        vdfSamples[(4 + i / 3) * 11 + 4 + i % 3] = i % 3 == 2 ? 10 : 0;
    }
    EXPECT_EQ(Filtered(FilterPrewitt(), Image<double>(11, vdfSamples), {5, 5}),
              (Image<double>{{30}}));
}

// Columns 0 0 0 | 10 10 10. Without the masked pixel both sides of the step give 30; beside it the
// upper right 10 counts as the centre's 0, and 10 * 1 of the gradient is gone there: Gx = 20,
// Gy = 0 + 0 + 0 - 0 - 0 - 10 = -10.
TEST(FilterPrewitt, LetsAMaskedNeighbourCountAsTheCentre)
{
    const auto poMask = MaskOf(
        {
            {1, 1, 1, 0, 1, 1},
            {1, 1, 1, 1, 1, 1},
            {1, 1, 1, 1, 1, 1},
        },
        {1, 1});
    // The pixel to the right of the step: its upper neighbour counts as 10, which it is.
    EXPECT_EQ(Filtered(FilterPrewitt(), kColumnStep, {1, 1}, poMask.get()),
              (Image<double>{{0, std::sqrt(500.0), 30, 0}}));
}

TEST(FilterPrewitt, KeepsTheInputWhereNothingIsComputed)
{
    const auto poMaskIn = MaskOf(
        {
            {1, 1, 1, 1, 1, 1},
            {1, 0, 1, 1, 1, 1},
            {1, 1, 1, 1, 1, 1},
        },
        {1, 1});
    const auto poMaskOut = MaskOf({{1, 1, 1, 0}});
    const Image<double> oImage = {
        {0, 0, 0, 10, 10, 10},
        {0, 3, 0, 10, 10, 10},
        {0, 0, 0, 10, 10, 10},
    };
    EXPECT_EQ(Filtered(FilterPrewitt(), oImage, {1, 1}, poMaskIn.get(), poMaskOut.get()),
              (Image<double>{{3, 30, 30, 10}}));
    EXPECT_EQ(Filtered(FilterPrewitt(1.0, true), oImage, {1, 1}, poMaskIn.get(), poMaskOut.get()),
              (Image<double>{{0, 30, 30, 0}}));
}

TEST(FilterPrewitt, WritesTheBackgroundOfAllChannels)
{
    const Image<double> oImage = {
        {0, 5, 0, 6, 10, 5, 10, 5},
        {0, 5, 3, 6, 10, 5, 10, 5},
        {0, 5, 0, 6, 10, 5, 10, 5},
    };
    const auto poMaskOut = MaskOf({{0, 0}});
    EXPECT_EQ(Filtered(FilterPrewitt(1.0, false), oImage, {1, 1}, nullptr, poMaskOut.get(), 2),
              (Image<double>{{3, 6, 10, 5}}));
    EXPECT_EQ(Filtered(FilterPrewitt(1.0, true), oImage, {1, 1}, nullptr, poMaskOut.get(), 2),
              (Image<double>{{0, 0, 0, 0}}));
}

TEST(FilterPrewitt, TakesBothParametersInTheOrderOfSetParameters)
{
    const auto poMaskOut = MaskOf({{1, 1, 1, 0}});
    const Image<double> oExpected = {{0, 60, 60, 10}};
    FilterPrewitt oFilter;
    oFilter.SetParameters(false, 2.0);
    EXPECT_EQ(Filtered(oFilter, kColumnStep, {1, 1}, nullptr, poMaskOut.get()), oExpected);
    EXPECT_EQ(Filtered(FilterPrewitt(2.0, false), kColumnStep, {1, 1}, nullptr, poMaskOut.get()),
              oExpected);
    const FilterPrewitt oCopy(oFilter);
    EXPECT_EQ(Filtered(oCopy, kColumnStep, {1, 1}, nullptr, poMaskOut.get()), oExpected);
    FilterPrewitt oAssigned;
    oAssigned = oFilter;
    EXPECT_EQ(Filtered(oAssigned, kColumnStep, {1, 1}, nullptr, poMaskOut.get()), oExpected);
    oAssigned.SetBGZero(true);
    EXPECT_EQ(Filtered(oAssigned, kColumnStep, {1, 1}, nullptr, poMaskOut.get()),
              (Image<double>{{0, 60, 60, 0}}));
}

TEST(FilterPrewitt, RefusesMarginsOfZeroOnEitherSide)
{
    for (const Margins oMargins : {Margins{0, 1}, {1, 0}, {0, 0}})
    {
        const auto poIn = BlankRaster(3, 3, 1, tessel::eDT_64R, oMargins);
        const auto poOut = BlankRaster(3, 3, 1, tessel::eDT_64R);
        const auto poBefore = BlankRaster(3, 3, 1, tessel::eDT_64R);
        try
        {
            FilterPrewitt().Process(poIn.get(), nullptr, poOut.get(), nullptr);
            FAIL() << "nothing was thrown";
        }
        catch (const ParameterException& oException)
        {
            EXPECT_EQ(oException.GetMessage(), "The Margin of the input raster is too small");
            EXPECT_EQ(oException.GetParameterName(), "oRasterIn");
            EXPECT_EQ(oException.GetType(), ParameterException::Type::eInvalidValue);
            EXPECT_EQ(oException.GetFirstText(), "");
            EXPECT_EQ(oException.GetSecondText(), "");
            EXPECT_EQ(oException.GetFile(), "processes/qrdfilters/filterprewitt");
            EXPECT_NE(oException.GetFunction().find("FilterPrewitt::ProcessBlock("),
                      std::string::npos);
            EXPECT_GT(oException.GetLine(), 0U);
        }
        EXPECT_TRUE(SameBits(*poOut, *poBefore));
    }
}

TEST(FilterPrewitt, AcceptsBlocksWithoutPixels)
{
    const auto poNoRows = BlankRaster(4, 0, 1, tessel::eDT_64R, {1, 1});
    const auto poNoColumns = BlankRaster(0, 4, 1, tessel::eDT_64R, {1, 1});
    EXPECT_NO_THROW(FilterPrewitt().Process(poNoRows.get(), nullptr, poNoRows.get(), nullptr));
    EXPECT_NO_THROW(
        FilterPrewitt().Process(poNoColumns.get(), nullptr, poNoColumns.get(), nullptr));
}

}  // namespace
}  // namespace kor::filters
