#include "processes/qrdfilters/kernels/texturerows.h"

#include <gtest/gtest.h>

#include <cmath>
#include <vector>

// Before the first header of Highway.
#include "processes/qrdfilters/kernels/targets.h"

#include "hwy/tests/hwy_gtest.h"
#include "processes/qrdfilters/kernels/windowsums.h"
#include "tests/support/blocks.h"
#include "tests/support/ulps.h"

namespace kor::filters::kernels
{
namespace
{

using test::Random;
using test::SameSample;
using test::Samples;
using test::UlpsBetween;

/// Each test runs once for every instruction set that this machine has.
class TextureRows : public hwy::TestWithParamTarget
{
protected:
    std::vector<double> RandomRow(std::size_t nSamples, Samples eSamples = Samples::Special)
    {
        std::vector<double> vdfRow(nSamples);
        for (double& dfSample : vdfRow)
        {
            dfSample = test::RandomSample<double>(eSamples, moRandom);
        }
        return vdfRow;
    }

    /// Any positive number at all, the smallest ones included.
    double RandomPositive()
    {
        double x = 0.0;
        while (!(x > 0.0 && x < INFINITY))
        {
            x = std::bit_cast<double>(moRandom() >> 1);
        }
        return x;
    }

    Random moRandom{9};
};

HWY_TARGET_INSTANTIATE_TEST_SUITE_P(TextureRows);

// Up to three of the widest vectors, so that every target meets every remainder.
constexpr std::size_t kMostSamples = 24;

double Log(double x)
{
    LogRow({&x, 1});
    return x;
}

TEST_P(TextureRows, SquareRoots)
{
    for (std::size_t nSamples = 0; nSamples <= kMostSamples; ++nSamples)
    {
        const std::vector<double> vdfIn = RandomRow(nSamples);
        std::vector<double> vdfOut = vdfIn;
        SquareRootRow(vdfOut);
        for (std::size_t i = 0; i < nSamples; ++i)
        {
            EXPECT_TRUE(SameSample(vdfOut[i], std::sqrt(vdfIn[i])));
        }
    }
}

TEST_P(TextureRows, LogarithmIsTheSameAtEveryPlaceInARow)
{
    for (std::size_t nSamples = 0; nSamples <= kMostSamples; ++nSamples)
    {
        const std::vector<double> vdfIn = RandomRow(nSamples);
        std::vector<double> vdfLogs = vdfIn;
        std::vector<double> vdfBounded = vdfIn;
        LogRow(vdfLogs);
        BoundedLogRow(vdfBounded);
        for (std::size_t i = 0; i < nSamples; ++i)
        {
            EXPECT_TRUE(SameSample(vdfLogs[i], Log(vdfIn[i])));
            EXPECT_TRUE(SameSample(vdfBounded[i], vdfIn[i] == 0.0 ? -100.0 : Log(vdfIn[i])));
        }
    }
}

TEST_P(TextureRows, LogarithmIsWithinOneUlpOfTheLibrarys)
{
    std::uniform_real_distribution<double> oAroundOne(0.5, 2.0);
    std::exponential_distribution<double> oSpeckle(1.0 / 40.0);
    for (int i = 0; i < 20000; ++i)
    {
        for (const double x : {RandomPositive(), oAroundOne(moRandom), oSpeckle(moRandom),
                               1.0 + 1e-6 * oSpeckle(moRandom), 1.0 - 1e-9 * oAroundOne(moRandom)})
        {
            ASSERT_LE(UlpsBetween(Log(x), std::log(x)), 1U) << x;
        }
    }
}

TEST_P(TextureRows, LogarithmOfSpecialValues)
{
    EXPECT_TRUE(SameSample(Log(1.0), 0.0));
    EXPECT_EQ(Log(0.0), -INFINITY);
    EXPECT_EQ(Log(-0.0), -INFINITY);
    EXPECT_EQ(Log(INFINITY), INFINITY);
    EXPECT_TRUE(std::isnan(Log(-1.0)));
    EXPECT_TRUE(std::isnan(Log(-INFINITY)));
    EXPECT_TRUE(std::isnan(Log(NAN)));
    EXPECT_EQ(Log(4.9406564584124654e-324), std::log(4.9406564584124654e-324));
    EXPECT_EQ(Log(2.2250738585072009e-308), std::log(2.2250738585072009e-308));
    EXPECT_EQ(Log(1.7976931348623157e308), std::log(1.7976931348623157e308));
}

TEST_P(TextureRows, LogarithmIsTheSameOnEveryTarget)
{
    const std::int64_t nOther = hwy::SupportedAndGeneratedTargets().back();
    for (int i = 0; i < 4000; ++i)
    {
        const double x = RandomPositive();
        hwy::SetSupportedTargetsForTest(nOther);
        const double dfThere = Log(x);
        hwy::SetSupportedTargetsForTest(GetParam());
        const double dfHere = Log(x);
        ASSERT_TRUE(SameSample(dfHere, dfThere)) << x;
    }
}

TEST_P(TextureRows, TexturesAreMadeOfTheirSums)
{
    for (const Samples eSamples : {Samples::Ordinary, Samples::Special})
    {
        const std::vector<double> vdfA = RandomRow(kMostSamples, eSamples);
        const std::vector<double> vdfB = RandomRow(kMostSamples, eSamples);
        const std::vector<double> vdfN = RandomRow(kMostSamples, eSamples);
        std::vector<double> vdfVariations(kMostSamples);
        std::vector<double> vdfVariances(kMostSamples);
        std::vector<double> vdfRatios(kMostSamples);
        VariationRow(vdfA.data(), vdfB.data(), vdfN.data(), vdfVariations);
        LogVarianceRow(vdfA.data(), vdfB.data(), vdfN.data(), vdfVariances);
        LogMeanRatioRow(vdfA.data(), vdfB.data(), vdfN.data(), vdfRatios);
        for (std::size_t i = 0; i < kMostSamples; ++i)
        {
            const double a = vdfA[i];
            const double b = vdfB[i];
            const double n = vdfN[i];
            EXPECT_TRUE(SameSample(vdfVariations[i], n * a / (b * b) - 1.0));
            EXPECT_TRUE(SameSample(vdfVariances[i], a / n - (b / n) * (b / n)));
            EXPECT_TRUE(SameSample(vdfRatios[i], b / n - Log(a / n)));
        }
    }
}

}  // namespace
}  // namespace kor::filters::kernels
