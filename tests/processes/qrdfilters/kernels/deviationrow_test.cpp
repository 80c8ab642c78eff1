#include "processes/qrdfilters/kernels/deviationrow.h"

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

class DeviationRowTest : public hwy::TestWithParamTarget
{
};

HWY_TARGET_INSTANTIATE_TEST_SUITE_P(DeviationRowTest);

// Any sums at all, also such as no window has: counts of 0 and 1, squares below the square of the
// sum, not a number. A fused multiply-add would show here.
TEST_P(DeviationRowTest, GivesTheBitsOfTheDefinition)
{
    Random oRandom(1);
    for (std::size_t nSamples = 8; nSamples <= 64; nSamples += 8)
    {
        std::vector<double> vdfSums(nSamples), vdfSquares(nSamples), vdfCounts(nSamples),
            vdfCentres(nSamples), vdfOut(nSamples);
        for (std::size_t i = 0; i < nSamples; ++i)
        {
            const auto eSamples = oRandom() % 4 == 0 ? Samples::Special : Samples::Ordinary;
            vdfSums[i] = test::RandomSample<double>(eSamples, oRandom);
            vdfSquares[i] = 1000 * test::RandomSample<double>(eSamples, oRandom);
            vdfCentres[i] = test::RandomSample<double>(eSamples, oRandom);
            vdfCounts[i] = static_cast<double>(oRandom() % 10);
        }
        WindowStatistics oStatistics;
        oStatistics.mnSamples = nSamples;
        oStatistics.mapSums = {vdfSums.data(), vdfSquares.data()};
        oStatistics.mpCounts = vdfCounts.data();
        oStatistics.mpCentres = vdfCentres.data();
        DeviationRow(oStatistics, vdfOut);
        for (std::size_t i = 0; i < nSamples; ++i)
        {
            const double n = vdfCounts[i];
            const double m = vdfSums[i] / n;
            const double dfExpected =
                n == 1.0 ? vdfCentres[i] : std::sqrt((vdfSquares[i] - m * n * m) / (n - 1.0));
            EXPECT_TRUE(test::SameSample(vdfOut[i], dfExpected))
                << vdfOut[i] << " and not " << dfExpected << " of " << vdfSquares[i] << ", "
                << vdfSums[i] << ", " << n;
        }
    }
}

}  // namespace
}  // namespace kor::filters::kernels
