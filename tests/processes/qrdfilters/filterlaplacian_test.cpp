#include "processes/qrdfilters/filterlaplacian.h"

#include <gtest/gtest.h>

#include "tests/support/filtercomparison.h"
#include "tests/support/filtered.h"
#include "tests/support/plainwindow.h"

namespace kor::filters
{
namespace
{

using namespace kor::test;

const Image<double> kSinglePixel = {
    {0, 0, 0, 0, 0}, {0, 0, 0, 0, 0}, {0, 0, 9, 0, 0}, {0, 0, 0, 0, 0}, {0, 0, 0, 0, 0},
};

TEST(FilterLaplacian, IsZeroOnAFlatImage)
{
    const Image<double> oImage = {{7, 7, 7, 7}, {7, 7, 7, 7}, {7, 7, 7, 7}};
    EXPECT_EQ(Filtered(FilterLaplacian(), oImage, {1, 1}), (Image<double>{{0, 0}}));
}

TEST(FilterLaplacian, IsThePixelMinusTheMeanOfItsWindow)
{
    EXPECT_EQ(Filtered(FilterLaplacian(), kSinglePixel, {1, 1}),
              (Image<double>{{-1, -1, -1}, {-1, 8, -1}, {-1, -1, -1}}));
}

TEST(FilterLaplacian, IsTheInputWithoutMargins)
{
    const Image<double> oImage = {{1.5, -2}, {1e300, 0}};
    EXPECT_EQ(Filtered(FilterLaplacian(), oImage, {0, 0}), oImage);
}

TEST(FilterLaplacian, TreatsChannelsByThemselves)
{
    EXPECT_EQ(
        Filtered(FilterLaplacian(), Image<double>{{0, 7, 9, 7, 0, 7}}, {1, 0}, nullptr, nullptr, 2),
        (Image<double>{{6, 0}}));
}

TEST(FilterLaplacian, LeavesMaskedPixelsOutOfTheMean)
{
    const Image<double> oImage = {{0, 500, 0}, {0, 9, 500}, {500, 500, 500}};
    const auto poMask = MaskOf({{1, 0, 1}, {1, 1, 0}, {0, 0, 0}}, {1, 1});
    EXPECT_EQ(Filtered(FilterLaplacian(), oImage, {1, 1}, poMask.get()), (Image<double>{{6.75}}));
}

// Not 0, which is what 9 - 9 / 1 would give.
TEST(FilterLaplacian, KeepsAPixelWithoutValidNeighbours)
{
    const Image<double> oImage = {{1, 1, 1}, {1, 9, 1}, {1, 1, 1}};
    const auto poMask = MaskOf({{0, 0, 0}, {0, 1, 0}, {0, 0, 0}}, {1, 1});
    EXPECT_EQ(Filtered(FilterLaplacian(), oImage, {1, 1}, poMask.get()), (Image<double>{{9}}));
}

TEST(FilterLaplacian, TakesNoNoticeOfItsSetters)
{
    const auto poMaskIn = MaskOf({{1, 0, 1, 1, 1}}, {1, 0});
    const auto poMaskOut = MaskOf({{1, 1, 0}});
    const Image<double> oImage = {{6, 5, 9, 3, 6}};
    const Image<double> oExpected = {{0, 3, 0}};
    FilterLaplacian oFilter(false);
    EXPECT_EQ(Filtered(oFilter, oImage, {1, 0}, poMaskIn.get(), poMaskOut.get()), oExpected);
    oFilter.SetBGZero(false);
    oFilter.SetFilterSize(1, 1);
    EXPECT_EQ(Filtered(oFilter, oImage, {1, 0}, poMaskIn.get(), poMaskOut.get()), oExpected);
    oFilter.SetFilterSize(3, 3);
    EXPECT_EQ(Filtered(oFilter, kSinglePixel, {2, 2}), (Image<double>{{9.0 - 9.0 / 25.0}}));
    oFilter.SetFilterSize(boost::optional<int>(3), boost::none);
    EXPECT_EQ(Filtered(oFilter, kSinglePixel, {2, 2}), (Image<double>{{9.0 - 9.0 / 25.0}}));
}

TEST(FilterLaplacian, SaysThatItsResultsStayDoubles)
{
    EXPECT_FALSE(FilterLaplacian().DoConvertBack());
}

TEST(FilterLaplacian, ReturnsANewRasterWithoutMargins)
{
    std::shared_ptr<tessel::Raster> poIn = RasterOf(kSinglePixel, {2, 1});
    poIn->mnOffsetX = 17;
    poIn->mnOffsetY = 4;
    const auto poOut = FilterLaplacian()(poIn, nullptr, nullptr);
    EXPECT_EQ(poOut->mnMarginX, 0U);
    EXPECT_EQ(poOut->mnMarginY, 0U);
    EXPECT_EQ(poOut->mnOffsetX, 17U);
    EXPECT_EQ(poOut->mnOffsetY, 4U);
    EXPECT_EQ(poOut->moDataType, tessel::eDT_64R);
    EXPECT_EQ(ImageOf<double>(*poOut), (Image<double>{{-0.6}, {8.4}, {-0.6}}));
}

TEST(FilterLaplacian, FollowsTheDefinitionForAllShapes)
{
    Random oRandom(5);
    const auto oFinish = [](const WindowSums<SumTerm>& oSums, double dfCentre)
    { return oSums.mdfCount == 1.0 ? dfCentre : dfCentre - oSums.moValues[0] / oSums.mdfCount; };
    for (const Margins oMargins : {Margins{0, 0}, {1, 1}, {3, 0}, {2, 4}})
    {
        const auto oCompare = [&](const Shape& oShape, double dfValid)
        {
            const auto eSamples = oRandom() % 4 == 0 ? Samples::Special : Samples::Ordinary;
            CompareWithDefinition<double, double>(
                oShape, eSamples, dfValid, oRandom,
                [](auto poIn, auto poMaskIn, auto poOut, auto poMaskOut)
                { FilterLaplacian().Process(poIn, poMaskIn, poOut, poMaskOut); },
                [&](auto poIn, auto poMaskIn, auto poOut, auto poMaskOut)
                {
                    FilterPlainly<double, SumTerm>(*poIn, poMaskIn, {oMargins.x, oMargins.y}, true,
                                                   oFinish, *poOut, poMaskOut);
                });
        };
        ForEachShape(oMargins, oCompare);
    }
}

}  // namespace
}  // namespace kor::filters
