#include "processes/qrdfilters/filtergamma.h"

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

const FilterGamma kOneLook(1.0, eGF_Intensity);

TEST(FilterGamma, FlatWindowGivesTheMean)
{
    EXPECT_EQ(FilteredCentre(kOneLook, Image<double>{{5, 5, 5}}), 5.0);
    EXPECT_EQ(FilteredCentre(kOneLook, Image<double>{{0, 0, 0}}), 0.0);
}

// mean = 10, var = 1: q = 100 >= v = 1.
TEST(FilterGamma, HomogeneousWindowGivesTheMean)
{
    EXPECT_EQ(FilteredCentre(kOneLook, Image<double>{{9, 11, 10}}), 10.0);
}

// mean = 1, var = 3: q * 2 = 2 <= v = 3.
TEST(FilterGamma, PointTargetIsKept)
{
    EXPECT_EQ(FilteredCentre(kOneLook, Image<double>{{0, 3, 0}}), 3.0);
}

// mean = 1, var = (1 + 9 + 1 - 3) / 2 = 4: v = 2 = q * 2 exactly with half a look.
TEST(FilterGamma, TwiceTheSquaredMeanStillKeepsThePixel)
{
    EXPECT_EQ(FilteredCentre(FilterGamma(0.5, eGF_Intensity), Image<double>{{-1, 3, 1}}), 3.0);
    // A look count that is a little smaller solves the quadratic.
    EXPECT_NE(FilteredCentre(FilterGamma(0.49, eGF_Intensity), Image<double>{{-1, 3, 1}}), 3.0);
}

// mean = 1, var = 4, looks 3 / 8: v = 1.5, a = 1.375 / 0.5 = 2.75, b = 2.75 - 0.375 - 1 = 1.375,
// d = 2.75 * 4 * 0.375 * 3 + 1.375^2 = 14.265625, out = (1.375 + sqrt(d)) / 5.5.
TEST(FilterGamma, SolvesTheQuadraticBetween)
{
    EXPECT_DOUBLE_EQ(FilteredCentre(FilterGamma(0.375, eGF_Intensity), Image<double>{{-1, 3, 1}}),
                     (1.375 + std::sqrt(14.265625)) / 5.5);
}

// The same window with -1 in the middle: d = 2.75 * 4 * 0.375 * -1 + 1.890625 < 0.
TEST(FilterGamma, NegativeDiscriminantDropsTheRootAlone)
{
    EXPECT_EQ(FilteredCentre(FilterGamma(0.375, eGF_Intensity), Image<double>{{3, -1, 1}}),
              1.375 / 5.5);
}

TEST(FilterGamma, FormatChangesNothing)
{
    const Image<double> oImage = {{1, 5, 2, 9, 4, 3}};
    FilterGamma oFilter(2.0, eGF_Intensity);
    const Image<double> oExpected = Filtered(oFilter, oImage, {1, 0});
    oFilter.SetAmplit(eGF_Amplitude);
    EXPECT_EQ(Filtered(oFilter, oImage, {1, 0}), oExpected);
    oFilter.SetParameters(eGF_Amplitude, 3.0);
    EXPECT_EQ(Filtered(oFilter, oImage, {1, 0}),
              Filtered(FilterGamma(3.0, eGF_Intensity), oImage, {1, 0}));
}

// Without looks v is 0, so that every window is homogeneous.
TEST(FilterGamma, LooksAreZeroUntilTheyAreSet)
{
    FilterGamma oFilter;
    EXPECT_EQ(FilteredCentre(oFilter, Image<double>{{0, 3, 0}}), 1.0);
    oFilter.SetLook(1.0);
    EXPECT_EQ(FilteredCentre(oFilter, Image<double>{{0, 3, 0}}), 3.0);
}

TEST(FilterGamma, OneValidSampleIsKept)
{
    const auto poMask = test::MaskOf({{0, 1, 0}}, {1, 0});
    EXPECT_EQ(FilteredCentre(kOneLook, Image<double>{{7, 5, 9}}, poMask.get()), 5.0);
}

TEST(FilterGamma, BackgroundIsZeroAtFirst)
{
    const Image<double> oImage = {{4, 4, 7, 4, 5}};
    const auto poMask = test::MaskOf({{1, 1, 0, 1, 0}}, {1, 0});
    const auto poClip = test::MaskOf({{1, 1, 0}});
    FilterGamma oFilter(1.0, eGF_Intensity);
    EXPECT_EQ(Filtered(oFilter, oImage, {1, 0}, poMask.get(), poClip.get()),
              (Image<double>{{4, 0, 0}}));
    oFilter.SetBGZero(false);
    EXPECT_EQ(Filtered(oFilter, oImage, {1, 0}, poMask.get(), poClip.get()),
              (Image<double>{{4, 7, 4}}));
}

TEST(FilterGamma, SizesCountOnlyTogetherAndAreHalved)
{
    const Image<double> oImage = {{100, 2, 2, 2, 100}};
    FilterGamma oFilter(1.0, eGF_Intensity);
    oFilter.SetFilterSize(3, 1);
    EXPECT_EQ(Filtered(oFilter, oImage, {2, 0}), (Image<double>{{2}}));
    // With one size alone the window is that of the margins.
    oFilter.SetFilterSize(boost::none, 1);
    EXPECT_EQ(Filtered(oFilter, oImage, {2, 0}), Filtered(kOneLook, oImage, {2, 0}));
    EXPECT_NE(Filtered(oFilter, oImage, {2, 0}), (Image<double>{{2}}));
}

TEST(FilterGamma, GivesTheBitsOfTheDefinition)
{
    test::ExpectTheBitsOfThePlainLoop<test::MomentTerms>(
        120,
        [](test::Random& oRandom)
        {
            constexpr double kLooks[] = {1.0, 1.5, 3.0, 0.0, -2.0};
            const double dfLooks = kLooks[oRandom() % std::size(kLooks)];
            return std::pair(FilterGamma(dfLooks, eGF_Amplitude),
                             [dfLooks](const auto& oSums, double x)
                             { return test::Gamma(test::MomentsOf(oSums), x, dfLooks); });
        });
}

}  // namespace
}  // namespace kor::filters
