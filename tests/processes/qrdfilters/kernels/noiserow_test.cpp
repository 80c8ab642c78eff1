#include "processes/qrdfilters/kernels/noiserow.h"

#include <gtest/gtest.h>
#include <hwy/tests/hwy_gtest.h>

#include <cmath>
#include <vector>

#include "tests/support/blocks.h"

namespace kor::filters::kernels
{
namespace
{

using test::Random;
using test::Samples;

class NoiseRowTest : public hwy::TestWithParamTarget
{
};

HWY_TARGET_INSTANTIATE_TEST_SUITE_P(NoiseRowTest);

double ByDefinition(double dfSquares, double dfSum, double n, double s, double dfFailValue)
{
    const double m = dfSum / n;
    const double d = s - m;
    return n >= 2.0 && d * d > 3.0 * (dfSquares - m * n * m) / (n - 1.0) ? dfFailValue : m;
}

// Any sums at all, also such as no window has: counts of 0 and 1, squares below the square of the
// sum, not a number.
TEST_P(NoiseRowTest, GivesTheBitsOfTheDefinition)
{
    Random oRandom(2);
    std::size_t nNoise = 0;
    for (std::size_t nSamples = 8; nSamples <= 64; nSamples += 8)
    {
        std::vector<double> vdfSums(nSamples), vdfSquares(nSamples), vdfCounts(nSamples),
            vdfCentres(nSamples), vdfOut(nSamples);
        for (std::size_t i = 0; i < nSamples; ++i)
        {
            const auto eSamples = oRandom() % 4 == 0 ? Samples::Special : Samples::Ordinary;
            vdfSums[i] = test::RandomSample<double>(eSamples, oRandom);
            vdfSquares[i] = 1000 * std::fabs(test::RandomSample<double>(eSamples, oRandom));
            vdfCentres[i] = test::RandomSample<double>(eSamples, oRandom);
            vdfCounts[i] = static_cast<double>(oRandom() % 10);
        }
        WindowStatistics oStatistics;
        oStatistics.mnSamples = nSamples;
        oStatistics.mapSums = {vdfSums.data(), vdfSquares.data()};
        oStatistics.mpCounts = vdfCounts.data();
        oStatistics.mpCentres = vdfCentres.data();
        NoiseRow(oStatistics, -7.0, vdfOut);
        for (std::size_t i = 0; i < nSamples; ++i)
        {
            const double dfExpected =
                ByDefinition(vdfSquares[i], vdfSums[i], vdfCounts[i], vdfCentres[i], -7.0);
            nNoise += dfExpected == -7.0 ? 1 : 0;
            EXPECT_TRUE(test::SameSample(vdfOut[i], dfExpected))
                << vdfOut[i] << " and not " << dfExpected << " of " << vdfSquares[i] << ", "
                << vdfSums[i] << ", " << vdfCounts[i];
        }
    }
    EXPECT_GT(nNoise, 20U);
    EXPECT_LT(nNoise, 268U);
}

// 4 among 0 0 0 1: 9 is not above 9.
TEST_P(NoiseRowTest, TakesEqualityForNoNoise)
{
    const std::vector<double> vdfSums(8, 5.0), vdfSquares(8, 17.0), vdfCounts(8, 5.0),
        vdfCentres(8, 4.0);
    std::vector<double> vdfOut(8);
    WindowStatistics oStatistics;
    oStatistics.mapSums = {vdfSums.data(), vdfSquares.data()};
    oStatistics.mpCounts = vdfCounts.data();
    oStatistics.mpCentres = vdfCentres.data();
    NoiseRow(oStatistics, -7.0, vdfOut);
    EXPECT_EQ(vdfOut, std::vector<double>(8, 1.0));
}

}  // namespace
}  // namespace kor::filters::kernels
