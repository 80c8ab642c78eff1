#include "processes/qrdfilters/kernels/arirow.h"

#include <gtest/gtest.h>
#include <hwy/tests/hwy_gtest.h>

#include <vector>

#include "tests/support/blocks.h"

namespace kor::filters::kernels
{
namespace
{

using test::Random;
using test::SameSample;

class AriRows : public hwy::TestWithParamTarget
{
};

HWY_TARGET_INSTANTIATE_TEST_SUITE_P(AriRows);

/// The definition, pixel by pixel.
float Evaluated(const AriRow& oRow, float a, float b)
{
    const float c = oRow.mfConstant;
    switch (oRow.meOperation)
    {
        case AriOperation::eSum:
            return b + a;
        case AriOperation::eSumPlusConstant:
            return b + a + c;
        case AriOperation::eDifference:
            return a - b;
        case AriOperation::eDifferenceConstant:
            return a - b - c;
        case AriOperation::eProduct:
            return b * a;
        case AriOperation::eQuotient:
            return a / b;
        case AriOperation::eAnd:
            return static_cast<float>(CutToInt(b) & CutToInt(a));
        default:
            return static_cast<float>(CutToInt(b) | CutToInt(a));
    }
}

void EvaluateByDefinition(const AriRow& oRow, const std::vector<float>& vfA,
                          const std::vector<float>& vfB, std::vector<float>& vfOut,
                          AriExtremes& oExtremes)
{
    for (std::size_t i = 0; i < vfOut.size(); ++i)
    {
        const double dfDivisor = vfB[i];
        if (oRow.meOperation == AriOperation::eQuotient && dfDivisor > -1e-09 && dfDivisor < 1e-09)
        {
            vfOut[i] = oRow.mfZeroDivision;
            continue;
        }
        float v = Evaluated(oRow, vfA[i], vfB[i]);
        oExtremes.mfMax = v > oExtremes.mfMax ? v : oExtremes.mfMax;
        oExtremes.mfMin = oExtremes.mfMin > v ? v : oExtremes.mfMin;
        if (oRow.mbScales)
        {
            v = (v - oRow.mfFrom) * oRow.mfFactor + oRow.mfLow;
            v = oRow.mfLow > v ? oRow.mfLow : v;
            v = v > oRow.mfHigh ? oRow.mfHigh : v;
        }
        vfOut[i] = v;
    }
}

std::vector<float> RandomRow(std::size_t nSamples, Random& oRandom)
{
    std::vector<float> vfRow(nSamples);
    for (float& fSample : vfRow)
    {
        fSample = test::RandomSample<float>(test::Samples::Special, oRandom);
        if (oRandom() % 8 == 0)
        {
            constexpr float kEdges[] = {1e-09F,        -1e-09F,        1.00000008e-09F, 0.5e-9F,
                                        2147483648.0F, -2147483648.0F, 2147483520.0F,   -3e9F};
            fSample = kEdges[oRandom() % std::size(kEdges)];
        }
    }
    return vfRow;
}

TEST_P(AriRows, GiveTheBitsOfTheDefinition)
{
    Random oRandom(9);
    for (std::size_t nRound = 0; nRound < 32; ++nRound)
    {
        const std::size_t nSamples = (nRound % 4) * kAriPadding;
        AriRow oRow;
        oRow.meOperation = static_cast<AriOperation>(nRound % 8);
        oRow.mfConstant = 17.25F;
        oRow.mfZeroDivision = -4.0F;
        oRow.mbScales = nRound >= 16;
        oRow.mfFrom = -100.0F;
        oRow.mfFactor = 0.1F;
        oRow.mfLow = -10.0F;
        oRow.mfHigh = 200.0F;
        const std::vector<float> vfA = RandomRow(nSamples, oRandom);
        const std::vector<float> vfB = RandomRow(nSamples, oRandom);
        std::vector<float> vfActual(nSamples);
        std::vector<float> vfExpected(nSamples);
        AriExtremes oActual = {1e30F, -1e30F};
        AriExtremes oExpected = oActual;
        EvaluateRow(oRow, vfA.data(), vfB.data(), vfActual, oActual);
        EvaluateByDefinition(oRow, vfA, vfB, vfExpected, oExpected);
        for (std::size_t i = 0; i < nSamples; ++i)
        {
            ASSERT_TRUE(SameSample(vfActual[i], vfExpected[i]))
                << vfActual[i] << " and not " << vfExpected[i] << " of " << vfA[i] << " and "
                << vfB[i] << ", round " << nRound;
        }
        EXPECT_EQ(oActual.mfMin, oExpected.mfMin) << nRound;
        EXPECT_EQ(oActual.mfMax, oExpected.mfMax) << nRound;
    }
}

}  // namespace
}  // namespace kor::filters::kernels
