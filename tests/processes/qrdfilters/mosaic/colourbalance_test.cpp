#include "processes/qrdfilters/mosaic/colourbalance.h"

#include <gtest/gtest.h>

#include <cmath>
#include <vector>

#include "tests/support/blocks.h"

namespace kor::filters
{
namespace
{

template <class T>
std::unique_ptr<ISampleList> ListOf(const std::vector<T>& vSamples)
{
    auto poList = MakeSampleList<T>();
    for (const T x : vSamples)
    {
        poList->AppendMeans(*test::RasterOf(test::Image<T>{{x, x}, {x, x}}), 0,
                            std::vector<unsigned char>{1});
    }
    return poList;
}

void ExpectLine(const BalanceLine& oLine, double dfGain, double dfOffset)
{
    EXPECT_EQ(oLine.mdfGain, dfGain);
    EXPECT_EQ(oLine.mdfOffset, dfOffset);
}

// i runs over all four, j over 0 and 2. Slopes 2, 4, 0, 2, 5, 8, of which number 3 in ascending
// order is 4; intercepts 0, 0, 4, 0, 0, -12. With all j the slope would be 5.
TEST(ColourBalance, TakesTheMedianOfPairwiseLines)
{
    ExpectLine(LineOfPairs(*ListOf<double>({0, 1, 2, 4}), *ListOf<double>({0, 4, 4, 20})), 4, 0);
}

// Slopes 5, 2, 8, 5, number 2 is 5; intercepts 5, 8, -10, 5, number 2 is 5.
TEST(ColourBalance, TakesTheMedianOfTheInterceptsByItself)
{
    ExpectLine(LineOfPairs(*ListOf<std::uint8_t>({1, 3, 5}), *ListOf<std::int16_t>({10, 14, 30})),
               5, 5);
}

TEST(ColourBalance, IsNeutralWithoutDifferentInputs)
{
    ExpectLine(LineOfPairs(*ListOf<int>({}), *ListOf<int>({})), 1, 0);
    ExpectLine(LineOfPairs(*ListOf<int>({7, 7, 7}), *ListOf<int>({1, 2, 3})), 1, 0);
}

// 250 samples: i steps by 2 and j by 3. On a line that only the samples met by both leave alone,
// the line of the others must not show: odd i that are no multiples of 3 are far off it.
TEST(ColourBalance, ThinsThePairsOfManySamples)
{
    std::vector<double> vdfIn;
    std::vector<double> vdfOut;
    for (int i = 0; i < 250; ++i)
    {
        vdfIn.push_back(i);
        vdfOut.push_back(i % 2 == 0 || i % 3 == 0 ? 2.0 * i + 1.0 : 1e6 * i * i);
    }
    ExpectLine(LineOfPairs(*ListOf(vdfIn), *ListOf(vdfOut)), 2, 1);
}

// The middle one differs from the others and is yet equal as double: both slopes are 1 / 0.
TEST(ColourBalance, ComparesInputsInTheirOwnType)
{
    constexpr uint64 kLarge = uint64{1} << 61;
    const BalanceLine oLine =
        LineOfPairs(*ListOf<uint64>({kLarge, kLarge + 1, kLarge}), *ListOf<int>({0, 1, 0}));
    EXPECT_EQ(oLine.mdfGain, INFINITY);
}

TEST(ColourBalance, RanksSlopesThatAreNotANumberLast)
{
    const float fNaN = std::nanf("");
    // The second sample spoils its three pairs with the first, third and fifth: 9 slopes are left.
    ExpectLine(LineOfPairs(*ListOf<float>({1, 2, 3, 4, 5}), *ListOf<float>({4, fNaN, 10, 13, 16})),
               3, 1);
}

// Slopes -0, 0, -0 and 0, of which number 2 in ascending order is 0.
TEST(ColourBalance, TakesNegativeZerosAsSmaller)
{
    const BalanceLine oLine = LineOfPairs(*ListOf<double>({0, 1, 2}), *ListOf<double>({5, 5, 5}));
    EXPECT_EQ(oLine.mdfGain, 0);
    EXPECT_FALSE(std::signbit(oLine.mdfGain));
}

// Sorted 0 1 2 4 and 4 4 10 20. One sample lies below the low one and one above the high one:
// (1, 4) and (2, 10).
TEST(ColourBalance, MatchesPercentiles)
{
    ExpectLine(
        LineOfPercentiles(0.25, 0.3, *ListOf<double>({4, 0, 1, 2}), *ListOf<int>({10, 4, 4, 20})),
        6, -2);
    ExpectLine(
        LineOfPercentiles(0.0, 0.0, *ListOf<double>({4, 0, 1, 2}), *ListOf<int>({10, 4, 4, 20})), 4,
        4);
}

TEST(ColourBalance, IsNeutralWithoutSamplesToMatch)
{
    ExpectLine(LineOfPercentiles(0.1, 0.1, *ListOf<int>({}), *ListOf<int>({})), 1, 0);
}

// All of the samples are cut off above, so that both high ones read 0: (0 - 5) / (0 - 1).
TEST(ColourBalance, ReadsZeroOutsideTheSamples)
{
    ExpectLine(LineOfPercentiles(0.0, 1.0, *ListOf<int>({1, 2}), *ListOf<int>({5, 6})), 5, 0);
    ExpectLine(LineOfPercentiles(0.0, -9.0, *ListOf<int>({1, 2}), *ListOf<int>({5, 6})), 5, 0);
    // The low ones read 0: 6 / 2.
    ExpectLine(LineOfPercentiles(1.0, 0.0, *ListOf<int>({1, 2}), *ListOf<int>({5, 6})), 3, 0);
    ExpectLine(LineOfPercentiles(1e300, 0.0, *ListOf<int>({1, 2}), *ListOf<int>({5, 6})), 3, 0);
    ExpectLine(LineOfPercentiles(NAN, 0.0, *ListOf<int>({1, 2}), *ListOf<int>({5, 6})), 3, 0);
}

TEST(ColourBalance, GivesNoNumberWhereTheInputsMatchedAreEqual)
{
    const BalanceLine oLine =
        LineOfPercentiles(0.0, 0.0, *ListOf<int>({3, 3}), *ListOf<int>({5, 5}));
    EXPECT_TRUE(std::isnan(oLine.mdfGain));
    EXPECT_TRUE(std::isnan(oLine.mdfOffset));
}

// Gain 0.5 * 4; offset 0.5 * 4 * 3 + 7 + ((4 * 20 + 7) - (4 * 10 + 7)) * 0.25 = 6 + 7 + 10.
TEST(ColourBalance, AdjustsALine)
{
    SampleRange oInside;
    oInside.Widen(20);
    oInside.Widen(10);
    ExpectLine(AdjustLine({4, 7}, 0.5, 3, 0.25, oInside), 2, 23);
}

TEST(ColourBalance, AddsNoRangeWhereNothingWasSeen)
{
    ExpectLine(AdjustLine({4, 7}, 1, 3, 0.25, SampleRange()), 4, 7);
}

}  // namespace
}  // namespace kor::filters
