#include "processes/qrdfilters/kernels/modevotes.h"

#include <gtest/gtest.h>
#include <hwy/tests/hwy_gtest.h>

#include <algorithm>
#include <limits>
#include <vector>

#include "tests/support/blocks.h"

namespace kor::filters::kernels
{
namespace
{

using test::Random;

/// Each test runs once for every instruction set that this machine has.
class ModeVotes : public hwy::TestWithParamTarget
{
protected:
    std::size_t Below(std::size_t nEnd) { return static_cast<std::size_t>(moRandom() % nEnd); }

    template <class T>
    std::vector<T> Entries(std::size_t nCount, std::size_t nEnd)
    {
        std::vector<T> vEntries(nCount);
        std::generate(vEntries.begin(), vEntries.end(),
                      [&] { return static_cast<T>(Below(nEnd)); });
        return vEntries;
    }

    Random moRandom{12};
};

HWY_TARGET_INSTANTIATE_TEST_SUITE_P(ModeVotes);

// Arrays are exactly as long as told, so that a sanitizer sees each read that is too far.
TEST_P(ModeVotes, EqualSamplesAreFoundInAllPlanes)
{
    const auto oTest = [&]<class T>()
    {
        for (const std::size_t nSamples : {kModePadding, 3 * kModePadding})
        {
            for (std::size_t nStep = 1; nStep <= 4; ++nStep)
            {
                constexpr std::size_t kPlanes = 5;
                std::vector<T> vValues = {T(0),
                                          T(1),
                                          std::numeric_limits<T>::max(),
                                          std::numeric_limits<T>::lowest(),
                                          -T(0),
                                          std::numeric_limits<T>::infinity(),
                                          std::numeric_limits<T>::quiet_NaN()};
                std::vector<T> vSamples(nSamples);
                std::vector<T> vOthers(nSamples + (kPlanes - 1) * nStep);
                const auto oAny = [&] { return vValues[Below(vValues.size())]; };
                std::generate(vSamples.begin(), vSamples.end(), oAny);
                std::generate(vOthers.begin(), vOthers.end(), oAny);
                const std::size_t nPitch = nSamples + kModePadding;
                std::vector<std::uint8_t> vEqual(kPlanes * nPitch, 77);
                FindEqual(vSamples.data(), vOthers.data(), nStep, nSamples, kPlanes, vEqual.data(),
                          nPitch);
                for (std::size_t i = 0; i < vEqual.size(); ++i)
                {
                    const std::size_t k = i / nPitch;
                    const std::size_t x = i % nPitch;
                    const int nExpected = x >= nSamples                           ? 77
                                          : vSamples[x] == vOthers[x + k * nStep] ? 1
                                                                                  : 0;
                    ASSERT_EQ(vEqual[i], nExpected) << "plane " << k << " at " << x;
                }
            }
        }
    };
    oTest.operator()<std::uint8_t>();
    oTest.operator()<std::uint16_t>();
    oTest.operator()<std::uint32_t>();
    oTest.operator()<float>();
    oTest.operator()<double>();
}

TEST_P(ModeVotes, PlanesAreSummedAlongTheRow)
{
    for (std::size_t nWindow = 1; nWindow <= 9; nWindow += 2)
    {
        const std::size_t nSamples = nWindow % 4 == 1 ? kModePadding : 2 * kModePadding;
        const auto vEqual = Entries<std::uint8_t>((2 * nWindow - 1) * nSamples, 2);
        std::vector<std::uint8_t> vCounts(nWindow * nSamples, 77);
        CountAlongRow(vEqual.data(), nWindow, nSamples, vCounts.data(), nSamples);
        for (std::size_t i = 0; i < vCounts.size(); ++i)
        {
            const std::size_t a = i / nSamples;
            unsigned int nExpected = 0;
            for (std::size_t k = nWindow - 1 - a; k < 2 * nWindow - 1 - a; ++k)
            {
                nExpected += vEqual[k * nSamples + i % nSamples];
            }
            ASSERT_EQ(vCounts[i], nExpected) << "column " << a << " at " << i % nSamples;
        }
    }
}

TEST_P(ModeVotes, RanksAreTwiceTheCountAndOneForTheCentre)
{
    const auto oTest = [&]<class TRank>(std::size_t nHighestCount)
    {
        for (std::size_t nWindow = 1; nWindow <= 9; nWindow += 2)
        {
            const std::size_t nSamples = nWindow % 4 == 1 ? kModePadding : 2 * kModePadding;
            const std::size_t nPitch = nSamples + 3;
            const auto vCounts = Entries<std::uint8_t>((2 * nWindow - 1) * nPitch, nHighestCount);
            const auto vCentre = Entries<std::uint8_t>(nWindow * nSamples, 2);
            std::vector<TRank> vRanks(nWindow * nSamples, 77);
            RankDownColumn(vCounts.data(), nPitch, vCentre.data(), nSamples, nWindow, nSamples,
                           vRanks.data(), nSamples);
            for (std::size_t i = 0; i < vRanks.size(); ++i)
            {
                const std::size_t r = i / nSamples;
                const std::size_t x = i % nSamples;
                unsigned int nCount = 0;
                for (std::size_t q = nWindow - 1 - r; q < 2 * nWindow - 1 - r; ++q)
                {
                    nCount += vCounts[q * nPitch + x];
                }
                const auto nExpected =
                    static_cast<TRank>(2 * nCount + vCentre[(nWindow - 1 - r) * nSamples + x]);
                ASSERT_EQ(vRanks[i], nExpected) << "row " << r << " at " << x;
            }
        }
    };
    oTest.operator()<std::uint8_t>(10);
    oTest.operator()<std::uint16_t>(256);
    // What is counted of rows that no window holds may be anything, and wraps.
    oTest.operator()<std::uint8_t>(256);
}

TEST_P(ModeVotes, HighestRankWinsAndTheFirstOfEqualOnes)
{
    const auto oTest = [&]<class TRank>(std::size_t nHighest)
    {
        for (std::size_t nStep = 1; nStep <= 3; ++nStep)
        {
            constexpr std::size_t kWindow = 5;
            constexpr std::size_t kSamples = 2 * kModePadding;
            const std::size_t nPitch = kSamples + 7;
            const auto vRanks =
                Entries<TRank>((kWindow - 1) * (nPitch + nStep) + kSamples, nHighest);
            auto vBest = Entries<TRank>(kSamples, nHighest);
            auto vIndex = Entries<TRank>(kSamples, 100);
            auto vExpectedBest = vBest;
            auto vExpectedIndex = vIndex;
            for (std::size_t i = 0; i < kSamples * kWindow; ++i)
            {
                const std::size_t x = i / kWindow;
                const std::size_t a = i % kWindow;
                const TRank nRank = vRanks[a * nPitch + x + a * nStep];
                if (nRank > vExpectedBest[x])
                {
                    vExpectedBest[x] = nRank;
                    vExpectedIndex[x] = static_cast<TRank>(110 + a);
                }
            }
            Vote(vRanks.data(), nPitch, nStep, kWindow, 110, kSamples, vBest.data(), vIndex.data());
            EXPECT_EQ(vBest, vExpectedBest);
            EXPECT_EQ(vIndex, vExpectedIndex);
        }
    };
    oTest.operator()<std::uint8_t>(6);
    oTest.operator()<std::uint8_t>(256);
    oTest.operator()<std::uint16_t>(6);
    oTest.operator()<std::uint16_t>(65536);
}

struct Winner
{
    std::size_t mnPosition;
    std::size_t mnFirstCount;
};

Winner ModeOf(std::vector<double> vdfWindow)
{
    const std::size_t nArea = vdfWindow.size();
    vdfWindow.resize((nArea + 7) / 8 * 8, std::numeric_limits<double>::quiet_NaN());
    Winner oWinner{};
    oWinner.mnPosition = FindMode(vdfWindow, nArea, nArea / 2, oWinner.mnFirstCount);
    return oWinner;
}

TEST_P(ModeVotes, OneWindowHasTheWinnerOfTheDefinition)
{
    EXPECT_EQ(ModeOf({4}).mnPosition, 0U);
    EXPECT_EQ(ModeOf({1, 2, 3}).mnPosition, 1U);
    EXPECT_EQ(ModeOf({1, 2, 1}).mnPosition, 0U);
    EXPECT_EQ(ModeOf({1, 1, 2, 2, 3, 3, 4, 4, 5}).mnPosition, 4U);
    EXPECT_EQ(ModeOf({1, 1, 2, 2, 9, 3, 3, 4, 4}).mnPosition, 0U);
    EXPECT_EQ(ModeOf({1, 1, 2, 3, 3, 2, 4, 4, 5}).mnPosition, 3U);
    EXPECT_EQ(ModeOf({1, 2, 3, 4, 5, 6, 7, 8, 8}).mnPosition, 7U);
    EXPECT_EQ(ModeOf({-0.0, 2, 3, 4, 0.0, 6, 7, 7, 8}).mnPosition, 0U);
    const double dfNaN = std::numeric_limits<double>::quiet_NaN();
    EXPECT_EQ(ModeOf({dfNaN, dfNaN, dfNaN, 4, 5, 6, 4, 8, 9}).mnPosition, 3U);
    EXPECT_EQ(ModeOf({dfNaN, dfNaN, dfNaN, 3, dfNaN, 6, 4, 8, 9}).mnPosition, 4U);
}

TEST_P(ModeVotes, OneWindowTellsHowOftenItsFirstSampleIsMet)
{
    EXPECT_EQ(ModeOf({4}).mnFirstCount, 1U);
    EXPECT_EQ(ModeOf({1, 2, 3, 1, 9, 7, 7, 7, 1}).mnFirstCount, 3U);
    EXPECT_EQ(ModeOf(std::vector<double>(49, 2.0)).mnFirstCount, 49U);
    const double dfNaN = std::numeric_limits<double>::quiet_NaN();
    EXPECT_EQ(ModeOf({dfNaN, dfNaN, dfNaN, 4, 5, 6, 4, 8, 9}).mnFirstCount, 1U);
}

// Of the highest rank, the first position; ranks as the header tells them.
TEST_P(ModeVotes, OneWindowHasTheFirstOfTheHighestRank)
{
    for (std::size_t nArea = 3; nArea <= 75; nArea += 2)
    {
        const auto vdfWindow = Entries<double>(nArea, 1 + nArea / 3);
        std::size_t nExpected = nArea / 2;
        std::ptrdiff_t nBest = kLowestRank;
        for (std::size_t i = 0; i < nArea; ++i)
        {
            const auto nCount = std::count(vdfWindow.begin(), vdfWindow.end(), vdfWindow[i]);
            const auto nRank = 2 * nCount + (vdfWindow[i] == vdfWindow[nArea / 2] ? 1 : 0);
            if (nRank > nBest)
            {
                nBest = nRank;
                nExpected = i;
            }
        }
        EXPECT_EQ(ModeOf(vdfWindow).mnPosition, nExpected) << nArea;
    }
}

}  // namespace
}  // namespace kor::filters::kernels
