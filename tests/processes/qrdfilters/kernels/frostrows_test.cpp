#include "processes/qrdfilters/kernels/frostrows.h"

#include <gtest/gtest.h>
#include <hwy/tests/hwy_gtest.h>

#include <cmath>
#include <vector>

#include "tests/support/blocks.h"

namespace kor::filters::kernels
{
namespace
{

using namespace kor::test;

/// Each test runs once for every instruction set that this machine has.
class FrostRows : public hwy::TestWithParamTarget
{
protected:
    std::vector<double> RandomRow(std::size_t nSamples)
    {
        std::vector<double> vdfRow(nSamples);
        for (double& dfSample : vdfRow)
        {
            dfSample = RandomSample<double>(
                moRandom() % 8 == 0 ? Samples::Special : Samples::Ordinary, moRandom);
        }
        return vdfRow;
    }

    /// Counts from 0 to 3, so that 1 is common.
    std::vector<double> RandomCounts(std::size_t nSamples)
    {
        std::vector<double> vdfCounts(nSamples);
        for (double& dfCount : vdfCounts)
        {
            dfCount = static_cast<double>(moRandom() % 4);
        }
        return vdfCounts;
    }

    Random moRandom{51};
};

HWY_TARGET_INSTANTIATE_TEST_SUITE_P(FrostRows);

constexpr std::size_t kSamples = 1024;

struct Row
{
    std::vector<double> mvdfCoefficients = std::vector<double>(kSamples);
    std::vector<double> mvdfFixed = std::vector<double>(kSamples);
    std::vector<double> mvdfWeighted = std::vector<double>(kSamples);

    WeightingRow Get() { return {mvdfCoefficients.data(), mvdfFixed.data(), mvdfWeighted.data()}; }
};

TEST_P(FrostRows, FrostCoefficientsAreThoseOfTheDefinition)
{
    const auto S1 = RandomRow(kSamples);
    const auto S2 = RandomRow(kSamples);
    const auto n = RandomCounts(kSamples);
    const auto x = RandomRow(kSamples);
    Row oRow;
    FindFrostCoefficients({S1.data(), S2.data(), n.data(), x.data()}, 1.5, kSamples, oRow.Get());
    for (std::size_t i = 0; i < kSamples; ++i)
    {
        const double mean = S1[i] / n[i];
        const double variance = (S2[i] - mean * n[i] * mean) / (n[i] - 1.0);
        ASSERT_TRUE(SameSample(oRow.mvdfCoefficients[i], variance / (mean * mean) * 1.5));
        ASSERT_TRUE(SameSample(oRow.mvdfFixed[i], x[i]));
        ASSERT_EQ(oRow.mvdfWeighted[i], n[i] == 1.0 ? 0.0 : 1.0);
    }
}

TEST_P(FrostRows, EnhancedCoefficientsAreThoseOfTheDefinition)
{
    const auto S1 = RandomRow(kSamples);
    const auto S2 = RandomRow(kSamples);
    const auto n = RandomCounts(kSamples);
    const auto x = RandomRow(kSamples);
    Row oRow;
    FindEnhancedFrostCoefficients({S1.data(), S2.data(), n.data(), x.data()}, {0.2, 1.1, 1.5},
                                  kSamples, oRow.Get());
    int nWeighted = 0;
    for (std::size_t i = 0; i < kSamples; ++i)
    {
        const double mean = S1[i] / n[i];
        const double variance = (S2[i] - mean * n[i] * mean) / (n[i] - 1.0);
        const double Ci = std::sqrt(variance) / mean;
        if (0.2 > Ci || Ci > 1.1 || n[i] == 1.0)
        {
            ASSERT_EQ(oRow.mvdfWeighted[i], 0.0);
            ASSERT_TRUE(SameSample(oRow.mvdfFixed[i], 0.2 > Ci ? mean : x[i]));
        }
        else
        {
            ++nWeighted;
            ASSERT_EQ(oRow.mvdfWeighted[i], 1.0);
            ASSERT_TRUE(SameSample(oRow.mvdfCoefficients[i], (Ci - 0.2) * 1.5 / (1.1 - Ci)));
        }
    }
    EXPECT_GT(nWeighted, 100);
}

// Windows of 3 x 2 pixels of two channels, two of which share a weight.
TEST_P(FrostRows, MeansAreThoseOfTheDefinition)
{
    constexpr std::size_t kStep = 2;
    constexpr std::size_t kColumns = 3;
    constexpr std::size_t kLength = kWeightedSamples + (kColumns - 1) * kStep;
    const std::vector<std::uint32_t> vnWeightOf = {0, 64, 128, 64, 0, 192};
    for (std::size_t nSamples = 8; nSamples <= kWeightedSamples; nSamples += 8)
    {
        const std::vector<double> vdfWeights = RandomRow(4 * kWeightedSamples);
        std::vector<std::vector<double>> vvdfRows = {RandomRow(kLength), RandomRow(kLength)};
        std::vector<std::vector<std::uint64_t>> vvnBits(2, std::vector<std::uint64_t>(kLength));
        for (std::size_t k = 0; k < 2 * kLength; ++k)
        {
            const bool bValid = moRandom() % 3 != 0;
            vvnBits[k / kLength][k % kLength] = bValid ? ~std::uint64_t{0} : 0;
        }
        for (const bool bMasked : {false, true})
        {
            for (std::size_t k = 0; k < 2 * kLength && bMasked; ++k)
            {
                double& dfSample = vvdfRows[k / kLength][k % kLength];
                dfSample = vvnBits[k / kLength][k % kLength] != 0 ? dfSample : 0.0;
            }
            const std::vector<const double*> vpRows = {vvdfRows[0].data(), vvdfRows[1].data()};
            const std::vector<const std::uint64_t*> vpBits = {vvnBits[0].data(), vvnBits[1].data()};
            std::vector<double> vdfMeans(nSamples);
            WeightedWindows oWindows{vpRows, {}, kColumns, kStep, vnWeightOf, vdfWeights.data()};
            if (bMasked)
            {
                oWindows.moValid = vpBits;
            }
            const std::vector<double> vdfFixed = RandomRow(nSamples);
            const std::vector<double> vdfWeighted = RandomCounts(nSamples);
            FindWeightedMeans(oWindows, vdfFixed.data(), vdfWeighted.data(), vdfMeans);
            for (std::size_t i = 0; i < nSamples; ++i)
            {
                double dfSum = 0.0;
                double dfWeights = 0.0;
                for (std::size_t k = 0; k < 6; ++k)
                {
                    const std::size_t nAt = i + k % 3 * kStep;
                    if (!bMasked || vvnBits[k / 3][nAt] != 0)
                    {
                        const double w = vdfWeights[vnWeightOf[k] + i];
                        dfSum += w * vvdfRows[k / 3][nAt];
                        dfWeights += w;
                    }
                }
                const double dfExpected = vdfWeighted[i] != 0.0 ? dfSum / dfWeights : vdfFixed[i];
                ASSERT_TRUE(SameSample(vdfMeans[i], dfExpected)) << i << " " << bMasked;
            }
        }
    }
}

}  // namespace
}  // namespace kor::filters::kernels
