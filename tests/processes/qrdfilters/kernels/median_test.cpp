#include "processes/qrdfilters/kernels/median.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <cstring>
#include <vector>

// Before the first header of Highway.
#include "processes/qrdfilters/kernels/targets.h"

#include "hwy/highway.h"
#include "hwy/tests/hwy_gtest.h"
#include "tests/support/blocks.h"

namespace kor::filters::kernels
{
namespace
{

using test::Random;
using test::RandomSample;
using test::Samples;

constexpr std::size_t kSides[] = {3, 5, 7};

template <class Visit>
void ForEachLaneType(const Visit& oVisit)
{
    oVisit.template operator()<std::int8_t>();
    oVisit.template operator()<std::uint8_t>();
    oVisit.template operator()<std::int16_t>();
    oVisit.template operator()<std::uint16_t>();
    oVisit.template operator()<std::int32_t>();
    oVisit.template operator()<std::uint32_t>();
    oVisit.template operator()<float>();
    oVisit.template operator()<double>();
    oVisit.template operator()<std::int64_t>();
    oVisit.template operator()<std::uint64_t>();
}

/// Rows of samples without anything behind them, so that a sanitizer sees each read that is too
/// far.
template <class T>
struct Rows
{
    std::size_t nPitch;
    std::vector<T> vSamples;

    Rows(std::size_t nRows, std::size_t nRowSamples, Samples eSamples, Random& oRandom)
        : nPitch(nRowSamples), vSamples(nRows * nRowSamples)
    {
        for (T& x : vSamples)
        {
            x = RandomSample<T>(eSamples, oRandom);
            if constexpr (std::is_integral_v<T>)
            {
                // Among few values ranks meet equal samples.
                x = oRandom() % 2 == 0 ? x : static_cast<T>(x % 3);
            }
        }
    }

    std::vector<T> Window(std::size_t nSide, std::size_t nStep, std::size_t y, std::size_t i) const
    {
        std::vector<T> vWindow;
        for (std::size_t r = 0; r < nSide; ++r)
        {
            for (std::size_t k = 0; k < nSide; ++k)
            {
                vWindow.push_back(vSamples[(y + r) * nPitch + i + k * nStep]);
            }
        }
        return vWindow;
    }

    /// The first nSamples output samples of a row need this many input samples.
    Rows Narrowed(std::size_t nRowSamples) const
    {
        Rows oResult(*this);
        oResult.nPitch = nRowSamples;
        oResult.vSamples.clear();
        for (std::size_t i = 0; i < vSamples.size(); i += nPitch)
        {
            oResult.vSamples.insert(oResult.vSamples.end(), &vSamples[i],
                                    &vSamples[i] + nRowSamples);
        }
        return oResult;
    }
};

/// The medians of rows of nSamples samples, row by row, with a guard of one sample behind each row.
template <class T>
std::vector<T> Selected(const Rows<T>& oRows, std::size_t nSide, std::size_t nStep,
                        std::size_t nRows, std::size_t nSamples, T nGuard)
{
    std::vector<T> vOut(nRows * (nSamples + 1), nGuard);
    MedianBlock<T> oBlock;
    oBlock.pIn = oRows.vSamples.data();
    oBlock.nInPitch = oRows.nPitch;
    oBlock.nStep = nStep;
    oBlock.pOut = vOut.data();
    oBlock.nOutPitch = nSamples + 1;
    oBlock.nSamples = nSamples;
    oBlock.nRows = nRows;
    SelectMedians(nSide, oBlock);
    return vOut;
}

class SelectMediansTest : public hwy::TestWithParamTarget
{
};

HWY_TARGET_INSTANTIATE_TEST_SUITE_P(SelectMediansTest);

// Rows of every length up to three of the widest vectors of this type, and beyond a group of them.
TEST_P(SelectMediansTest, GivesTheUpperMedianForRowsOfAnyLength)
{
    Random oRandom(1);
    const auto oTest = [&]<class T>()
    {
        constexpr std::size_t kRows = 6;
        constexpr std::size_t kLongest = 3 * 64 / sizeof(T) + 5;
        for (const std::size_t nSide : kSides)
        {
            for (const std::size_t nStep : {std::size_t{1}, std::size_t{3}})
            {
                const std::size_t nMore = (nSide - 1) * nStep;
                const Rows<T> oRows(kRows + nSide - 1, kLongest + nMore, Samples::Ordinary,
                                    oRandom);
                std::vector<T> vExpected;
                for (std::size_t i = 0; i < kRows * kLongest; ++i)
                {
                    auto vWindow = oRows.Window(nSide, nStep, i / kLongest, i % kLongest);
                    std::sort(vWindow.begin(), vWindow.end());
                    vExpected.push_back(vWindow[vWindow.size() / 2]);
                }
                for (std::size_t nSamples = nStep; nSamples <= kLongest; ++nSamples)
                {
                    const auto vOut = Selected<T>(oRows.Narrowed(nSamples + nMore), nSide, nStep,
                                                  kRows, nSamples, T(77));
                    for (std::size_t y = 0; y < kRows; ++y)
                    {
                        const T* pRow = &vOut[y * (nSamples + 1)];
                        ASSERT_TRUE(std::equal(pRow, pRow + nSamples, &vExpected[y * kLongest]))
                            << nSide << " step " << nStep << " samples " << nSamples << " row "
                            << y;
                        ASSERT_EQ(pRow[nSamples], T(77)) << "wrote behind the row";
                    }
                }
            }
        }
    };
    ForEachLaneType(oTest);
}

TEST_P(SelectMediansTest, GivesTheUpperMedianForAnyNumberOfRows)
{
    Random oRandom(2);
    const auto oTest = [&]<class T>()
    {
        constexpr std::size_t kSamples = 64 / sizeof(T) * 10 + 1;
        for (const std::size_t nSide : kSides)
        {
            for (std::size_t nRows = 1; nRows <= 9; ++nRows)
            {
                const Rows<T> oRows(nRows + nSide - 1, kSamples + nSide - 1, Samples::Ordinary,
                                    oRandom);
                const auto vOut = Selected<T>(oRows, nSide, 1, nRows, kSamples, T(77));
                // Some samples of each row, those of the last vectors among them.
                for (std::size_t i = kSamples - 1; i < kSamples; i -= 7)
                {
                    for (std::size_t y = 0; y < nRows; ++y)
                    {
                        auto vWindow = oRows.Window(nSide, 1, y, i);
                        std::sort(vWindow.begin(), vWindow.end());
                        ASSERT_EQ(vOut[y * (kSamples + 1) + i], vWindow[vWindow.size() / 2])
                            << nSide << " rows " << nRows << " at " << i << ", " << y;
                    }
                }
            }
        }
    };
    ForEachLaneType(oTest);
}

template <class T>
bool IsOneOf(T x, const std::vector<T>& vSamples)
{
    return std::any_of(vSamples.begin(), vSamples.end(),
                       [&](T a) { return test::SameSample(a, x); });
}

TEST_P(SelectMediansTest, GivesOneOfTheSamplesBesideNaN)
{
    Random oRandom(3);
    const auto oTest = [&]<class T>()
    {
        constexpr std::size_t kSamples = 70;
        constexpr std::size_t kRows = 7;
        for (const std::size_t nSide : kSides)
        {
            const Rows<T> oRows(kRows + nSide - 1, kSamples + nSide - 1, Samples::Special, oRandom);
            const auto vOut = Selected<T>(oRows, nSide, 1, kRows, kSamples, T(77));
            for (std::size_t i = 0; i < kRows * kSamples; ++i)
            {
                auto vWindow = oRows.Window(nSide, 1, i / kSamples, i % kSamples);
                const T xOut = vOut[i / kSamples * (kSamples + 1) + i % kSamples];
                ASSERT_TRUE(IsOneOf(xOut, vWindow)) << nSide << " at " << i;
                if (!std::any_of(vWindow.begin(), vWindow.end(), [](T x) { return x != x; }))
                {
                    std::sort(vWindow.begin(), vWindow.end());
                    ASSERT_EQ(xOut, vWindow[vWindow.size() / 2]) << nSide << " at " << i;
                }
            }
        }
    };
    oTest.operator()<float>();
    oTest.operator()<double>();
}

// Which sample is given beside a NaN, and the sign of a zero, is free, but it does not change with
// the machine.
TEST_P(SelectMediansTest, ChoosesAsAllOtherInstructionSetsDo)
{
    Random oRandom(4);
    const auto oTest = [&]<class T>()
    {
        constexpr std::size_t kSamples = 70;
        constexpr std::size_t kRows = 9;
        for (const std::size_t nSide : kSides)
        {
            const Rows<T> oRows(kRows + nSide - 1, kSamples + nSide - 1, Samples::Special, oRandom);
            hwy::SetSupportedTargetsForTest(GetParam());
            const auto vOut = Selected<T>(oRows, nSide, 1, kRows, kSamples, T(77));
            hwy::SetSupportedTargetsForTest(0);
            const auto vBest = Selected<T>(oRows, nSide, 1, kRows, kSamples, T(77));
            EXPECT_EQ(std::memcmp(vOut.data(), vBest.data(), vOut.size() * sizeof(T)), 0) << nSide;
        }
    };
    oTest.operator()<float>();
    oTest.operator()<double>();
}

TEST(HasMedianNetwork, KnowsThreeSides)
{
    for (std::size_t nSide = 1; nSide < 20; ++nSide)
    {
        EXPECT_EQ(HasMedianNetwork(nSide), nSide == 3 || nSide == 5 || nSide == 7) << nSide;
    }
}

TEST(SelectMedians, WritesNothingWithoutSamplesOrRows)
{
    const std::uint8_t anIn[9] = {};
    std::uint8_t nOut = 77;
    for (const std::size_t nSide : kSides)
    {
        SelectMedians<std::uint8_t>(nSide, {anIn, 3, 1, &nOut, 1, 0, 1});
        SelectMedians<std::uint8_t>(nSide, {anIn, 3, 1, &nOut, 1, 1, 0});
    }
    EXPECT_EQ(nOut, 77);
}

}  // namespace
}  // namespace kor::filters::kernels
