#include "processes/qrdfilters/filterkuan.h"

#include <gtest/gtest.h>

#include <cmath>

#include "tests/support/speckledefinitions.h"
#include "tests/support/windowfilters.h"

namespace kor::filters
{
namespace
{

using test::Filtered;
using test::FilteredCentre;
using test::Image;

// mean = 1, var = (81 - 9) / 8 = 9, w = (1 - 1 / 9) / 2 = 4 / 9: 5 / 9 of the mean, 4 / 9 of 9.
TEST(FilterKuan, MixesThePixelAndTheMean)
{
    const Image<double> oWindow = {{0, 0, 0}, {0, 9, 0}, {0, 0, 0}};
    EXPECT_DOUBLE_EQ(FilteredCentre(FilterKuan(), oWindow), 41.0 / 9.0);
}

// The same with 3 looks: w = (3 - 1 / 9) / 4 = 13 / 18.
TEST(FilterKuan, MoreLooksKeepMoreOfThePixel)
{
    const Image<double> oWindow = {{0, 0, 0}, {0, 9, 0}, {0, 0, 0}};
    FilterKuan oFilter;
    oFilter.SetLook(3.0);
    EXPECT_DOUBLE_EQ(FilteredCentre(oFilter, oWindow), 5.0 / 18.0 + 13.0 / 18.0 * 9.0);
    EXPECT_EQ(FilteredCentre(FilterKuan(false, 3), oWindow), FilteredCentre(oFilter, oWindow));
}

TEST(FilterKuan, FlatWindowGivesTheMean)
{
    EXPECT_EQ(FilteredCentre(FilterKuan(), Image<double>{{5, 5, 5}, {5, 5, 5}, {5, 5, 5}}), 5.0);
}

TEST(FilterKuan, WindowOfZerosIsNotANumber)
{
    EXPECT_TRUE(std::isnan(FilteredCentre(FilterKuan(), Image<double>{{0, 0, 0}})));
}

// w comes near to L / (L + 1), here 1 / 2, and not to 1.
TEST(FilterKuan, PixelIsNeverFullyKept)
{
    std::vector<double> vdfRow(201, 0.0);
    vdfRow[100] = 201.0;
    // mean = 1, var = (201^2 - 201) / 200 = 201.
    const double w = (1.0 - 1.0 / 201.0) / 2.0;
    EXPECT_DOUBLE_EQ(FilteredCentre(FilterKuan(), Image<double>(201, vdfRow)),
                     (1.0 - w) + w * 201.0);
}

// mean = 10, var = 1: w < 0.
TEST(FilterKuan, NegativeWeightGivesTheMean)
{
    EXPECT_EQ(FilteredCentre(FilterKuan(), Image<double>{{9, 11, 10}}), 10.0);
}

// (-1 - mean^2 / var) / 0 is minus infinity.
TEST(FilterKuan, MinusOneLookGivesTheMean)
{
    FilterKuan oFilter;
    oFilter.SetLook(-1.0);
    EXPECT_EQ(FilteredCentre(oFilter, Image<double>{{0, 3, 0}}), 1.0);
}

TEST(FilterKuan, OneValidSampleIsKept)
{
    const auto poMask = test::MaskOf({{0, 1, 0}}, {1, 0});
    EXPECT_EQ(FilteredCentre(FilterKuan(), Image<double>{{7, 5, 9}}, poMask.get()), 5.0);
    // A window of one pixel has one sample everywhere.
    EXPECT_EQ(Filtered(FilterKuan(), Image<double>{{7, 5, 9}}, {0, 0}), (Image<double>{{7, 5, 9}}));
}

TEST(FilterKuan, BackgroundIsTheInputAtFirst)
{
    const Image<double> oImage = {{4, 4, 7, 4, 5}};
    const auto poMask = test::MaskOf({{1, 1, 0, 1, 0}}, {1, 0});
    const auto poClip = test::MaskOf({{1, 1, 0}});
    EXPECT_EQ(Filtered(FilterKuan(), oImage, {1, 0}, poMask.get(), poClip.get()),
              (Image<double>{{4, 7, 4}}));
    EXPECT_EQ(Filtered(FilterKuan(true), oImage, {1, 0}, poMask.get(), poClip.get()),
              (Image<double>{{4, 0, 0}}));
}

TEST(FilterKuan, SizesCountOnlyTogetherAndAreHalved)
{
    const Image<double> oImage = {{100, 2, 2, 2, 100}};
    FilterKuan oFilter;
    oFilter.SetFilterSize(3, 1);
    EXPECT_EQ(Filtered(oFilter, oImage, {2, 0}), (Image<double>{{2}}));
    oFilter.SetFilterSize(2, 1);
    EXPECT_EQ(Filtered(oFilter, oImage, {2, 0}), (Image<double>{{2}}));
    oFilter.SetFilterSize(3, boost::none);
    EXPECT_NE(Filtered(oFilter, oImage, {2, 0}), (Image<double>{{2}}));
}

TEST(FilterKuan, CallOperatorKeepsTheGeometry)
{
    test::ExpectCallOperatorKeepsTheGeometry(FilterKuan());
}

TEST(FilterKuan, GivesTheBitsOfTheDefinition)
{
    test::ExpectTheBitsOfThePlainLoop<test::MomentTerms>(
        120,
        [](test::Random& oRandom)
        {
            constexpr double kLooks[] = {1.0, 3.5, 0.0, -1.0, 1e300};
            const double dfLooks = kLooks[oRandom() % std::size(kLooks)];
            FilterKuan oFilter;
            oFilter.SetLook(dfLooks);
            return std::pair(oFilter, [dfLooks](const auto& oSums, double x)
                             { return test::Kuan(test::MomentsOf(oSums), x, dfLooks); });
        });
}

}  // namespace
}  // namespace kor::filters
