#include "processes/qrdfilters/kernels/greypairs.h"

#include <gtest/gtest.h>
#include <hwy/tests/hwy_gtest.h>

#include <array>
#include <cmath>
#include <vector>

#include "tests/support/blocks.h"

namespace kor::filters::kernels
{
namespace
{

using test::Random;
using test::SameSample;

/// A row with a pixel of padding on both sides.
struct Row
{
    std::vector<float> mvfGrey;
    std::vector<float> mvfValid;
};

Row RandomRow(std::size_t nPixels, int nLevels, Random& oRandom)
{
    Row oRow = {std::vector<float>(nPixels + 2), std::vector<float>(nPixels + 2)};
    for (std::size_t i = 1; i <= nPixels; ++i)
    {
        oRow.mvfGrey[i] = static_cast<float>(oRandom() % static_cast<std::uint64_t>(nLevels));
        oRow.mvfValid[i] = oRandom() % 4 == 0 ? 0.0F : 1.0F;
    }
    return oRow;
}

GreyRows RowsOf(const Row& oRow, const Row& oBelow)
{
    return {&oRow.mvfGrey[1], &oRow.mvfValid[1], &oBelow.mvfGrey[1], &oBelow.mvfValid[1]};
}

/// The pairs of one row added to or subtracted from the columns, one by one.
void TakeByDefinition(const Row& oRow, const Row& oBelow, std::size_t nColumns, bool bAdds,
                      std::vector<float>& vfSums, std::vector<float>& vfCounts)
{
    for (std::size_t c = 0; c < nColumns; ++c)
    {
        const std::array<std::pair<const Row*, std::size_t>, 4> aoNeighbours = {
            {{&oRow, c + 2}, {&oBelow, c + 2}, {&oBelow, c + 1}, {&oBelow, c}}};
        for (const auto& [poRow, i] : aoNeighbours)
        {
            if (oRow.mvfValid[c + 1] == 0.0F || poRow->mvfValid[i] == 0.0F)
            {
                continue;
            }
            const float d = oRow.mvfGrey[c + 1] - poRow->mvfGrey[i];
            const auto fSimilarity = static_cast<float>(1.0 / (static_cast<double>(d * d) + 1.0));
            vfSums[c] = bAdds ? vfSums[c] + fSimilarity : vfSums[c] - fSimilarity;
            vfCounts[c] = bAdds ? vfCounts[c] + 1.0F : vfCounts[c] - 1.0F;
        }
    }
}

class GreyPairs : public hwy::TestWithParamTarget
{
};

HWY_TARGET_INSTANTIATE_TEST_SUITE_P(GreyPairs);

// Up to three of the widest vectors, so that every target meets every remainder. 4096 levels differ
// by 4095 at most, the greatest difference for which single precision is told to do.
TEST_P(GreyPairs, ColumnsTakeTheBitsOfTheDefinition)
{
    Random oRandom(21);
    for (std::size_t nColumns = 0; nColumns <= 48; ++nColumns)
    {
        const int nLevels = nColumns % 3 == 0 ? 65536 : nColumns % 3 == 1 ? 4096 : 5;
        const bool bExact = nLevels <= 4096;
        const Row oTop = RandomRow(nColumns + 1, nLevels, oRandom);
        const Row oMiddle = RandomRow(nColumns + 1, nLevels, oRandom);
        const Row oBottom = RandomRow(nColumns + 1, nLevels, oRandom);
        std::vector<float> vfSums(nColumns);
        std::vector<float> vfCounts(nColumns);
        std::vector<float> vfMovedSums(nColumns);
        std::vector<float> vfMovedCounts(nColumns);
        const PairSums oSums = {vfSums.data(), vfCounts.data()};
        AddPairs(RowsOf(oTop, oMiddle), bExact, nColumns, oSums, oSums);
        std::vector<float> vfExpected(nColumns);
        std::vector<float> vfExpectedCounts(nColumns);
        TakeByDefinition(oTop, oMiddle, nColumns, true, vfExpected, vfExpectedCounts);
        EXPECT_EQ(vfSums, vfExpected);
        EXPECT_EQ(vfCounts, vfExpectedCounts);
        MovePairs(RowsOf(oTop, oMiddle), RowsOf(oMiddle, oBottom), bExact, nColumns, oSums,
                  {vfMovedSums.data(), vfMovedCounts.data()});
        TakeByDefinition(oTop, oMiddle, nColumns, false, vfExpected, vfExpectedCounts);
        TakeByDefinition(oMiddle, oBottom, nColumns, true, vfExpected, vfExpectedCounts);
        EXPECT_EQ(vfMovedSums, vfExpected);
        EXPECT_EQ(vfMovedCounts, vfExpectedCounts);
    }
}

// The claim behind the division in single precision, for every difference that it is made for.
TEST_P(GreyPairs, SinglePrecisionDividesExactDifferencesAlike)
{
    constexpr std::size_t kDifferences = 4096;
    Row oRow = {std::vector<float>(kDifferences + 3), std::vector<float>(kDifferences + 3, 1.0F)};
    const Row oZeros = {std::vector<float>(kDifferences + 3),
                        std::vector<float>(kDifferences + 3, 1.0F)};
    for (std::size_t i = 0; i < kDifferences; ++i)
    {
        oRow.mvfGrey[i + 1] = static_cast<float>(i);
    }
    std::vector<float> vfSums(2 * kDifferences);
    std::vector<float> vfCounts(2 * kDifferences);
    const PairSums oExact = {vfSums.data(), vfCounts.data()};
    const PairSums oWide = {vfSums.data() + kDifferences, vfCounts.data() + kDifferences};
    AddPairs(RowsOf(oRow, oZeros), true, kDifferences, oExact, oExact);
    AddPairs(RowsOf(oRow, oZeros), false, kDifferences, oWide, oWide);
    for (std::size_t i = 0; i < kDifferences; ++i)
    {
        ASSERT_EQ(vfSums[i], vfSums[kDifferences + i]) << i;
    }
}

TEST_P(GreyPairs, WindowsSlideRowByRow)
{
    Random oRandom(22);
    for (const std::size_t nWindow : {1U, 3U, 7U})
    {
        for (const std::size_t nPixels : {1U, 2U, 19U})
        {
            const std::size_t nColumns = nPixels + nWindow - 1;
            std::vector<float> vfColumns(2 * kPairRows * nColumns);
            for (float& fSum : vfColumns)
            {
                fSum = static_cast<float>(oRandom() % 1000) / 7.0F;
            }
            std::vector<float> vfWindows(2 * kPairRows * nPixels);
            std::array<PairSums, kPairRows> aoColumns{};
            std::array<PairSums, kPairRows> aoWindows{};
            for (std::size_t k = 0; k < kPairRows; ++k)
            {
                aoColumns[k] = {&vfColumns[2 * k * nColumns], &vfColumns[(2 * k + 1) * nColumns]};
                aoWindows[k] = {&vfWindows[2 * k * nPixels], &vfWindows[(2 * k + 1) * nPixels]};
            }
            SlidePairs(aoColumns.data(), nWindow, nPixels, aoWindows.data());
            for (std::size_t k = 0; k < 2 * kPairRows; ++k)
            {
                const float* const pfColumns = &vfColumns[k * nColumns];
                float fSum = 0.0F;
                for (std::size_t c = 0; c + 1 < nWindow; ++c)
                {
                    fSum += pfColumns[c];
                }
                for (std::size_t i = 0; i < nPixels; ++i)
                {
                    fSum += pfColumns[i + nWindow - 1];
                    ASSERT_EQ(vfWindows[k * nPixels + i], fSum) << nWindow << ' ' << nPixels;
                    fSum -= pfColumns[i];
                }
            }
        }
    }
}

TEST_P(GreyPairs, MeansAreZeroWhereThePixelIsNotValid)
{
    const std::vector<float> vfSums = {1.0F, 1.0F, 0.0F, 0.0F, 3.0F};
    const std::vector<float> vfCounts = {3.0F, 3.0F, 0.0F, 0.0F, 4.0F};
    const std::vector<float> vfValid = {1.0F, 0.0F, 0.0F, 1.0F, 1.0F};
    std::vector<float> vfOut(5);
    DividePairs(vfSums.data(), vfCounts.data(), vfValid.data(), 5, vfOut.data());
    EXPECT_EQ(vfOut[0], 1.0F / 3.0F);
    EXPECT_EQ(vfOut[1], 0.0F);
    EXPECT_EQ(vfOut[2], 0.0F);
    EXPECT_TRUE(std::isnan(vfOut[3]));
    EXPECT_EQ(vfOut[4], 0.75F);
}

}  // namespace
}  // namespace kor::filters::kernels
