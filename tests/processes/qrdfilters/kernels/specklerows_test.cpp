#include "processes/qrdfilters/kernels/specklerows.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <functional>
#include <vector>

// Before the first header of Highway.
#include "processes/qrdfilters/kernels/targets.h"

#include "hwy/tests/hwy_gtest.h"
#include "processes/qrdfilters/kernels/windowsums.h"
#include "tests/support/blocks.h"
#include "tests/support/speckledefinitions.h"
#include "tests/support/ulps.h"

namespace kor::filters::kernels
{
namespace
{

using test::Moments;
using test::Random;
using test::RandomSample;
using test::Samples;

/// Each test runs once for every instruction set that this machine has.
class SpeckleRows : public hwy::TestWithParamTarget
{
};

HWY_TARGET_INSTANTIATE_TEST_SUITE_P(SpeckleRows);

/// Rows of window sums: of real windows, of flat ones, of single samples and of anything at all.
struct RandomRows
{
    RandomRows(std::size_t nSamples, Random& oRandom)
        : mvdfSums(nSamples), mvdfSquares(nSamples), mvdfCounts(nSamples), mvdfCentres(nSamples)
    {
        std::exponential_distribution<double> oSpeckle(1.0 / 40.0);
        for (std::size_t i = 0; i < nSamples; ++i)
        {
            const auto nKind = oRandom() % 8;
            const double dfFlat = oSpeckle(oRandom);
            mvdfCounts[i] = nKind == 0 ? 1.0 : static_cast<double>(1 + oRandom() % 49);
            for (double n = 0.0; n < mvdfCounts[i]; n += 1.0)
            {
                const double x = nKind == 1   ? dfFlat
                                 : nKind == 2 ? RandomSample<double>(Samples::Special, oRandom)
                                              : oSpeckle(oRandom);
                mvdfSums[i] += x;
                mvdfSquares[i] += x * x;
                mvdfCentres[i] = x;
            }
            if (nKind == 3)
            {
                mvdfSums[i] = RandomSample<double>(Samples::Special, oRandom);
                mvdfSquares[i] = RandomSample<double>(Samples::Special, oRandom);
            }
        }
    }

    MomentRows Rows() const
    {
        return {mvdfSums.data(), mvdfSquares.data(), mvdfCounts.data(), mvdfCentres.data()};
    }

    std::vector<double> mvdfSums;
    std::vector<double> mvdfSquares;
    std::vector<double> mvdfCounts;
    std::vector<double> mvdfCentres;
};

using Kernel = std::function<void(const MomentRows&, std::span<double>)>;
using Definition = std::function<double(const Moments&, double)>;

void ExpectTheDefinition(const Kernel& oKernel, const Definition& oDefinition,
                         std::uint64_t nUlps = 0)
{
    Random oRandom(17);
    for (std::size_t nRun = 0; nRun < 60; ++nRun)
    {
        const std::size_t nSamples = (nRun % 4) * kRowPadding;
        const RandomRows oRows(nSamples, oRandom);
        std::vector<double> vdfOut(nSamples);
        oKernel(oRows.Rows(), vdfOut);
        for (std::size_t i = 0; i < nSamples; ++i)
        {
            const Moments oMoments{oRows.mvdfSquares[i], oRows.mvdfSums[i], oRows.mvdfCounts[i]};
            const double dfExpected = oDefinition(oMoments, oRows.mvdfCentres[i]);
            if (nUlps == 0)
            {
                ASSERT_TRUE(test::SameSample(vdfOut[i], dfExpected))
                    << vdfOut[i] << " and not " << dfExpected;
            }
            ASSERT_LE(test::UlpsBetween(vdfOut[i], dfExpected), nUlps);
        }
    }
}

TEST_P(SpeckleRows, LeeGivesTheBitsOfTheDefinition)
{
    for (const double dfNoise : {0.25, 0.0, 400.0, -1.0, static_cast<double>(NAN)})
    {
        for (const double dfMulMean : {1.0, 1.3})
        {
            const LeeNoise oNoise{3.5, dfMulMean, dfNoise};
            int nModel = 0;
            for (const auto pfnKernel : {LeeAdditiveRow, LeeMultiplicativeRow, LeeMixedRow})
            {
                ++nModel;
                ExpectTheDefinition(
                    [&](const MomentRows& oRows, std::span<double> oOut)
                    { pfnKernel(oRows, oNoise, oOut); },
                    [&](const Moments& oMoments, double x)
                    { return test::Lee(oMoments, x, nModel, 3.5, dfMulMean, dfNoise); });
            }
        }
    }
}

TEST_P(SpeckleRows, KuanGivesTheBitsOfTheDefinition)
{
    for (const double L : {1.0, 2.5, 0.0, -1.0})
    {
        ExpectTheDefinition(
            [L](const MomentRows& oRows, std::span<double> oOut) { KuanRow(oRows, L, oOut); },
            [L](const Moments& oMoments, double x) { return test::Kuan(oMoments, x, L); });
    }
}

TEST_P(SpeckleRows, GammaGivesTheBitsOfTheDefinition)
{
    for (const double L : {1.0, 1.5, 0.0, -1.0})
    {
        ExpectTheDefinition(
            [L](const MomentRows& oRows, std::span<double> oOut) { GammaRow(oRows, L, oOut); },
            [L](const Moments& oMoments, double x) { return test::Gamma(oMoments, x, L); });
    }
}

/// e^-x for each x: windows of mean 1 and variation 1 between 0 and 2, whose pixel is 0, and a
/// damping of x.
double ExpOfMinus(double x)
{
    const std::vector<double> vdfTwos(kRowPadding, 2.0);
    const std::vector<double> vdfSquares(kRowPadding, 3.0);
    const std::vector<double> vdfZeros(kRowPadding, 0.0);
    std::vector<double> vdfOut(kRowPadding);
    EnhancedLeeRow({vdfTwos.data(), vdfSquares.data(), vdfTwos.data(), vdfZeros.data()}, 0.0, 2.0,
                   x, vdfOut);
    return vdfOut[0];
}

TEST_P(SpeckleRows, EnhancedLeeGivesTheBitsOfTheDefinitionWithItsExponential)
{
    for (const double dfDamp : {1.0, 0.0, 30.0})
    {
        ExpectTheDefinition([=](const MomentRows& oRows, std::span<double> oOut)
                            { EnhancedLeeRow(oRows, 0.5, 1.5, dfDamp, oOut); },
                            [=](const Moments& oMoments, double x)
                            {
                                return test::EnhancedLee(oMoments, x, 0.5, 1.5, dfDamp,
                                                         [](double y) { return ExpOfMinus(-y); });
                            });
    }
}

TEST_P(SpeckleRows, ExponentialIsWithinOneUlpOfTheLibrarys)
{
    Random oRandom(3);
    for (const double dfRange : {1e-9, 0.3, 1.0, 30.0, 708.0, 746.0})
    {
        std::uniform_real_distribution<double> oBetween(0.0, dfRange);
        for (int i = 0; i < 4000; ++i)
        {
            const double x = oBetween(oRandom);
            ASSERT_LE(test::UlpsBetween(ExpOfMinus(x), std::exp(-x)), 1U) << x;
            if (x < 709.7)
            {
                ASSERT_LE(test::UlpsBetween(ExpOfMinus(-x), std::exp(x)), 1U) << -x;
            }
        }
    }
}

TEST_P(SpeckleRows, ExponentialOfSpecialValues)
{
    EXPECT_EQ(ExpOfMinus(0.0), 1.0);
    EXPECT_EQ(ExpOfMinus(-0.0), 1.0);
    EXPECT_EQ(ExpOfMinus(INFINITY), 0.0);
    EXPECT_EQ(ExpOfMinus(1e300), 0.0);
    EXPECT_EQ(ExpOfMinus(745.2), 0.0);
    EXPECT_EQ(ExpOfMinus(745.0), 4.9406564584124654e-324);  // the least number that is not 0
    EXPECT_TRUE(std::isnan(ExpOfMinus(NAN)));
    // The mean times e is infinite, the pixel times 1 - e not a number.
    EXPECT_TRUE(std::isnan(ExpOfMinus(-710.0)));
}

TEST_P(SpeckleRows, ExponentialIsTheSameOnEveryTarget)
{
    const std::int64_t nOther = hwy::SupportedAndGeneratedTargets().back();
    Random oRandom(4);
    std::uniform_real_distribution<double> oBetween(-750.0, 750.0);
    for (int i = 0; i < 4000; ++i)
    {
        const double x = oBetween(oRandom);
        hwy::SetSupportedTargetsForTest(nOther);
        const double dfThere = ExpOfMinus(x);
        hwy::SetSupportedTargetsForTest(GetParam());
        const double dfHere = ExpOfMinus(x);
        ASSERT_TRUE(test::SameSample(dfHere, dfThere)) << x;
    }
}

}  // namespace
}  // namespace kor::filters::kernels
