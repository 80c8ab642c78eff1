#include "processes/qrdfilters/kernels/exponentialrow.h"

#include <gtest/gtest.h>
#include <hwy/tests/hwy_gtest.h>

#include <bit>
#include <cmath>
#include <limits>
#include <vector>

#include "tests/support/blocks.h"

namespace kor::filters::kernels
{
namespace
{

using namespace kor::test;

constexpr double kInfinity = std::numeric_limits<double>::infinity();

/// Each test runs once for every instruction set that this machine has.
class ExponentialRow : public hwy::TestWithParamTarget
{
};

HWY_TARGET_INSTANTIATE_TEST_SUITE_P(ExponentialRow);

/// exp of each argument: the negative of a coefficient, at distance 1.
std::vector<double> Exponentials(std::vector<double> vdfArguments)
{
    const std::size_t nCount = vdfArguments.size();
    for (double& x : vdfArguments)
    {
        x = -x;
    }
    vdfArguments.resize((nCount + 7) / 8 * 8);
    std::vector<double> vdfResults(vdfArguments.size());
    RaiseWeights(vdfArguments, std::vector<double>{1.0}, vdfResults.data(), vdfResults.size());
    vdfResults.resize(nCount);
    return vdfResults;
}

/// How far a result is off, in units of its last place.
double Error(double dfResult, double x)
{
    static_assert(std::numeric_limits<long double>::digits >= 64);
    const long double fValue = std::exp(static_cast<long double>(x));
    const double dfNear = static_cast<double>(fValue);
    const double dfUlp = std::nextafter(dfNear, kInfinity) - dfNear;
    return static_cast<double>(std::fabs((static_cast<long double>(dfResult) - fValue) / dfUlp));
}

double WorstError(double dfFrom, double dfTo, std::size_t nCount, Random& oRandom)
{
    std::uniform_real_distribution<double> oArgument(dfFrom, dfTo);
    std::vector<double> vdfArguments(nCount);
    for (double& x : vdfArguments)
    {
        x = oArgument(oRandom);
    }
    const std::vector<double> vdfResults = Exponentials(vdfArguments);
    double dfWorst = 0.0;
    for (std::size_t i = 0; i < nCount; ++i)
    {
        dfWorst = std::max(dfWorst, Error(vdfResults[i], vdfArguments[i]));
    }
    return dfWorst;
}

// Measured over 20 million arguments: 0.68 ulp, and 0.78 where results begin to be subnormal.
TEST_P(ExponentialRow, IsWithinOneUlpOfTheFunction)
{
    Random oRandom(61);
    EXPECT_LE(WorstError(-1.0, 1.0, 40000, oRandom), 0.8);
    EXPECT_LE(WorstError(-20.0, 0.0, 40000, oRandom), 0.8);
    EXPECT_LE(WorstError(-708.0, 709.7, 40000, oRandom), 0.8);
    // Arguments of every size down to the smallest double.
    for (double dfSize = 512.0; dfSize > 0.0; dfSize /= 2.0)
    {
        ASSERT_LE(WorstError(-dfSize, dfSize, 40, oRandom), 0.8) << dfSize;
    }
}

TEST_P(ExponentialRow, IsWithinOneUlpWhereResultsAreSubnormal)
{
    Random oRandom(62);
    EXPECT_LE(WorstError(-745.2, -708.3, 40000, oRandom), 0.8);
}

// Where the nearest integer number of powers of two changes, the rest is at its largest.
TEST_P(ExponentialRow, IsWithinOneUlpWhereThePowerOfTwoChanges)
{
    std::vector<double> vdfArguments;
    for (int k = -1075; k < 1024; ++k)
    {
        double x = (k + 0.5) * 0.6931471805599453;
        for (int i = 0; i < 4; ++i)
        {
            vdfArguments.push_back(x);
            x = std::nextafter(x, kInfinity);
        }
    }
    const std::vector<double> vdfResults = Exponentials(vdfArguments);
    for (std::size_t i = 0; i < vdfArguments.size(); ++i)
    {
        ASSERT_LE(Error(vdfResults[i], vdfArguments[i]), 0.8) << vdfArguments[i];
    }
}

TEST_P(ExponentialRow, EndsAtZeroAndInfinity)
{
    const double dfLast = 709.78271289338397;    // ln of the largest double
    const double dfFirst = -745.13321910194122;  // ln of half the smallest one
    const double dfSmallest = std::numeric_limits<double>::denorm_min();
    EXPECT_EQ(Exponentials({0.0, -0.0, 5e-324, -5e-324}), (std::vector<double>{1, 1, 1, 1}));
    EXPECT_LT(Exponentials({dfLast})[0], kInfinity);
    EXPECT_EQ(Exponentials({std::nextafter(dfLast, 1e3), 720.0, 1e5, 1e300, kInfinity}),
              std::vector<double>(5, kInfinity));
    EXPECT_EQ(Exponentials({-745.1, -745.0, -744.5}),
              (std::vector<double>{dfSmallest, dfSmallest, dfSmallest}));
    EXPECT_EQ(Exponentials({std::nextafter(dfFirst, -1e3), -746.0, -760.0, -1e300, -kInfinity}),
              std::vector<double>(5, 0.0));
    EXPECT_TRUE(std::isnan(Exponentials({std::nan("")})[0]));
}

// No target fuses what another one does in two steps.
TEST_P(ExponentialRow, GivesTheSameBitsOnEveryTarget)
{
    Random oRandom(63);
    std::uniform_real_distribution<double> oArgument(-746.0, 710.0);
    std::vector<double> vdfArguments(4096);
    for (double& x : vdfArguments)
    {
        x = oArgument(oRandom);
    }
    std::uint64_t nHash = 0;
    for (const double dfResult : Exponentials(vdfArguments))
    {
        nHash = (nHash ^ std::bit_cast<std::uint64_t>(dfResult)) * 0x9E3779B97F4A7C15U;
    }
    static std::uint64_t nFirstHash = nHash;
    EXPECT_EQ(nHash, nFirstHash);
}

TEST_P(ExponentialRow, FillsARowForEachDistance)
{
    std::vector<double> vdfWeights(3 * 16, -1.0);
    const std::vector<double> vdfCoefficients = {0, 1, 2, 3, 4, kInfinity, std::nan(""), -1};
    RaiseWeights(vdfCoefficients, std::vector<double>{0.0, 1.0, 2.5}, vdfWeights.data(), 16);
    EXPECT_EQ(vdfWeights[3], 1.0);
    EXPECT_TRUE(std::isnan(vdfWeights[5]));  // infinity times 0
    EXPECT_EQ(vdfWeights[8], -1.0);
    EXPECT_DOUBLE_EQ(vdfWeights[16 + 2], std::exp(-2.0));
    EXPECT_EQ(vdfWeights[16 + 5], 0.0);
    EXPECT_TRUE(std::isnan(vdfWeights[16 + 6]));
    EXPECT_DOUBLE_EQ(vdfWeights[32 + 4], std::exp(-10.0));
    EXPECT_DOUBLE_EQ(vdfWeights[32 + 7], std::exp(2.5));
}

}  // namespace
}  // namespace kor::filters::kernels
