#include "processes/qrdfilters/kernels/flagrow.h"

#include <gtest/gtest.h>
#include <hwy/tests/hwy_gtest.h>

#include <cmath>
#include <limits>
#include <vector>

#include "tests/support/conversionreference.h"

namespace kor::filters::kernels
{
namespace
{

using test::Random;

using Flags = std::vector<unsigned char>;

class FlagRows : public hwy::TestWithParamTarget
{
};

HWY_TARGET_INSTANTIATE_TEST_SUITE_P(FlagRows);

template <class T>
Flags IntegersFlagged(const std::vector<T>& vSamples, const IntegerRange& oRange)
{
    Flags vFlags(vSamples.size(), 9);
    FlagIntegers(vSamples.data(), sizeof(T), oRange, vFlags);
    return vFlags;
}

TEST_P(FlagRows, IntegersCountFromTheLowestOnAndWrapAround)
{
    const std::vector<std::uint8_t> vSamples = {0, 1, 9, 10, 11, 14, 15, 254, 255};
    EXPECT_EQ(IntegersFlagged(vSamples, {10, 4}), (Flags{0, 0, 0, 1, 1, 1, 0, 0, 0}));
    EXPECT_EQ(IntegersFlagged(vSamples, {10, 4, true}), (Flags{1, 1, 1, 0, 0, 0, 1, 1, 1}));
    // From -2 on three more: the bits of 254, 255, 0 and 1.
    EXPECT_EQ(IntegersFlagged(vSamples, {254, 3}), (Flags{1, 1, 0, 0, 0, 0, 0, 1, 1}));
    EXPECT_EQ(IntegersFlagged(vSamples, {0, 255}), (Flags{1, 1, 1, 1, 1, 1, 1, 1, 1}));
    EXPECT_EQ(IntegersFlagged(vSamples, {0, 255, true}), (Flags{0, 0, 0, 0, 0, 0, 0, 0, 0}));
}

// Up to three of the widest vectors, so that every target meets every remainder.
template <class T>
void ExpectIntegersByDefinition(Random& oRandom)
{
    const IntegerRange oRange = {std::numeric_limits<T>::max() - T(40), 90};
    for (std::size_t nSamples = 0; nSamples <= 192; ++nSamples)
    {
        std::vector<T> vSamples(nSamples);
        Flags vExpected(nSamples);
        for (std::size_t i = 0; i < nSamples; ++i)
        {
            const auto nOffset = static_cast<T>(oRandom() % 180);
            vSamples[i] = static_cast<T>(oRange.mnLowest + nOffset);
            vExpected[i] = nOffset <= oRange.mnSpan ? 1 : 0;
        }
        ASSERT_EQ(IntegersFlagged(vSamples, oRange), vExpected) << sizeof(T) << " bytes";
    }
}

TEST_P(FlagRows, IntegersOfEverySizeGoByTheDefinition)
{
    Random oRandom(51);
    ExpectIntegersByDefinition<std::uint8_t>(oRandom);
    ExpectIntegersByDefinition<std::uint16_t>(oRandom);
    ExpectIntegersByDefinition<std::uint32_t>(oRandom);
    ExpectIntegersByDefinition<std::uint64_t>(oRandom);
}

TEST_P(FlagRows, FloatsCountWithBothLimitsInsideAndOutside)
{
    const float fNaN = std::nanf("");
    const std::vector<float> vfSamples = {0.5F, 1.0F, 1.5F, 2.0F, 2.5F, fNaN};
    Flags vFlags(vfSamples.size());
    FlagFloats(vfSamples.data(), {1.0F, 2.0F}, vFlags);
    EXPECT_EQ(vFlags, (Flags{0, 1, 1, 1, 0, 0}));
    FlagFloats(vfSamples.data(), {1.0F, 2.0F, true}, vFlags);
    EXPECT_EQ(vFlags, (Flags{1, 1, 0, 1, 1, 0}));
    FlagFloats(vfSamples.data(), {fNaN, 2.0F}, vFlags);
    EXPECT_EQ(vFlags, (Flags{0, 0, 0, 0, 0, 0}));
    FlagFloats(vfSamples.data(), {fNaN, 2.0F, true}, vFlags);
    EXPECT_EQ(vFlags, (Flags{0, 0, 0, 1, 1, 0}));
}

TEST_P(FlagRows, FloatsOfRowsOfAnyLengthGoByTheDefinition)
{
    Random oRandom(52);
    for (std::size_t nSamples = 0; nSamples <= 192; ++nSamples)
    {
        std::vector<float> vfSamples(nSamples);
        for (float& fSample : vfSamples)
        {
            fSample = test::RandomSample<float>(test::Samples::Special, oRandom);
        }
        for (const bool bOutside : {false, true})
        {
            const FloatRange oRange = {-20.0F, 30.0F, bOutside};
            Flags vFlags(nSamples, 9);
            FlagFloats(vfSamples.data(), oRange, vFlags);
            for (std::size_t i = 0; i < nSamples; ++i)
            {
                ASSERT_EQ(vFlags[i], oRange.Contains(vfSamples[i]) ? 1 : 0) << vfSamples[i];
            }
        }
    }
}

TEST_P(FlagRows, SquaresAreMadeInTheTypeOfTheParts)
{
    const std::vector<short> vnPairs = {3, 4, 200, 200, 182, 1, -128, 0};
    std::vector<float> vfOut(4);
    SquareMagnitudes(vnPairs.data(), typedispatch::ElementPosition<short>(), vfOut);
    EXPECT_EQ(vfOut, (std::vector<float>{25, 14464, -32411, 16384}));
    const std::vector<double> vdfPairs = {1e19, 0.0, 3.0, 4.0};
    SquareMagnitudes(vdfPairs.data(), typedispatch::ElementPosition<double>(), {vfOut.data(), 2});
    EXPECT_EQ(vfOut[0], 1e38F);
    EXPECT_EQ(vfOut[1], 25.0F);
}

TEST_P(FlagRows, SquaresOfRowsOfAnyLengthGoByTheDefinition)
{
    Random oRandom(53);
    for (std::size_t nSamples = 0; nSamples <= 70; ++nSamples)
    {
        std::vector<float> vfPairs(2 * nSamples);
        std::vector<unsigned short> vnPairs(2 * nSamples);
        for (std::size_t i = 0; i < 2 * nSamples; ++i)
        {
            vfPairs[i] = test::RandomSample<float>(test::Samples::Ordinary, oRandom);
            vnPairs[i] = static_cast<unsigned short>(oRandom());
        }
        std::vector<float> vfOfFloats(nSamples);
        std::vector<float> vfOfShorts(nSamples);
        SquareMagnitudes(vfPairs.data(), typedispatch::ElementPosition<float>(), vfOfFloats);
        SquareMagnitudes(vnPairs.data(), typedispatch::ElementPosition<unsigned short>(),
                         vfOfShorts);
        for (std::size_t i = 0; i < nSamples; ++i)
        {
            const float* const pfPair = &vfPairs[2 * i];
            const std::uint32_t nRe = vnPairs[2 * i];
            const std::uint32_t nIm = vnPairs[2 * i + 1];
            ASSERT_EQ(vfOfFloats[i], pfPair[0] * pfPair[0] + pfPair[1] * pfPair[1]);
            ASSERT_EQ(vfOfShorts[i], static_cast<float>((nRe * nRe + nIm * nIm) % 65536U));
        }
    }
}

}  // namespace
}  // namespace kor::filters::kernels
