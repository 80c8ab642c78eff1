#include "processes/qrdfilters/kernels/mergenetwork.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <vector>

namespace kor::filters::kernels
{
namespace
{

/// The ranks that the network gives. Its steps do what they say and no more: a half that was left
/// out leaves a value that fits nowhere.
std::vector<int> RanksGiven(const Network& oNetwork, std::vector<int> vValues)
{
    constexpr int kUndefined = -1000;
    for (std::size_t i = 0; i < oNetwork.nExchanges; ++i)
    {
        const Exchange& oExchange = oNetwork.aoExchanges[i];
        const auto [nLow, nHigh] = std::minmax({vValues[oExchange.nLow], vValues[oExchange.nHigh]});
        vValues[oExchange.nLow] = oExchange.bSmaller ? nLow : kUndefined;
        vValues[oExchange.nHigh] = oExchange.bGreater ? nHigh : kUndefined;
    }
    std::vector<int> vResult;
    for (std::size_t i = 0; i < oNetwork.oResult.nCount; ++i)
    {
        vResult.push_back(vValues[oNetwork.oResult.anPlace[i]]);
    }
    return vResult;
}

/// Operations: a step of which one half is asked for counts once.
std::size_t CountOperations(const Network& oNetwork)
{
    std::size_t nCount = 0;
    for (std::size_t i = 0; i < oNetwork.nExchanges; ++i)
    {
        nCount += (oNetwork.aoExchanges[i].bSmaller ? 1U : 0U) +
                  (oNetwork.aoExchanges[i].bGreater ? 1U : 0U);
    }
    return nCount;
}

/// nZeros zeros and then ones, nCount in all. A network that puts all lists of zeros and ones in
/// order does so with all lists.
std::vector<int> ZerosAndOnes(std::size_t nZeros, std::size_t nCount)
{
    std::vector<int> vValues(nCount, 1);
    std::fill_n(vValues.begin(), nZeros, 0);
    return vValues;
}

TEST(SortNetwork, OrdersEveryListOfZerosAndOnes)
{
    for (std::size_t nCount = 1; nCount <= 11; ++nCount)
    {
        const Network oNetwork = SortNetwork(nCount);
        for (unsigned int nBits = 0; nBits < (1U << nCount); ++nBits)
        {
            std::vector<int> vValues;
            for (std::size_t i = 0; i < nCount; ++i)
            {
                vValues.push_back((nBits >> i) & 1U);
            }
            const std::vector<int> vResult = RanksGiven(oNetwork, vValues);
            ASSERT_TRUE(std::is_sorted(vResult.begin(), vResult.end())) << nCount << " " << nBits;
            ASSERT_EQ(vResult.size(), nCount);
        }
    }
}

TEST(SortNetwork, TakesTheKnownNumberOfSteps)
{
    EXPECT_EQ(SortNetwork(1).nExchanges, 0U);
    EXPECT_EQ(SortNetwork(3).nExchanges, 3U);
    EXPECT_EQ(SortNetwork(5).nExchanges, 9U);
    EXPECT_EQ(SortNetwork(7).nExchanges, 16U);
}

TEST(MergeNetwork, GivesEveryRangeOfRanks)
{
    for (const auto& [nA, nB] : {std::pair{1, 1},
                                 {3, 3},
                                 {5, 5},
                                 {10, 10},
                                 {7, 7},
                                 {14, 14},
                                 {22, 14},
                                 {1, 6},
                                 {4, 0},
                                 {0, 4}})
    {
        const auto a = static_cast<std::size_t>(nA);
        const auto b = static_cast<std::size_t>(nB);
        for (std::size_t nFirst = 0; nFirst < a + b; nFirst += 3)
        {
            const std::size_t nEnd = std::min(nFirst + 8, a + b);
            const Network oNetwork = MergeNetwork(a, b, nFirst, nEnd);
            for (std::size_t nZeros = 0; nZeros < (a + 1) * (b + 1); ++nZeros)
            {
                std::vector<int> vValues = ZerosAndOnes(nZeros / (b + 1), a);
                const std::vector<int> vB = ZerosAndOnes(nZeros % (b + 1), b);
                vValues.insert(vValues.end(), vB.begin(), vB.end());
                std::vector<int> vExpected = vValues;
                std::sort(vExpected.begin(), vExpected.end());
                ASSERT_EQ(RanksGiven(oNetwork, vValues),
                          std::vector<int>(vExpected.begin() + static_cast<std::ptrdiff_t>(nFirst),
                                           vExpected.begin() + static_cast<std::ptrdiff_t>(nEnd)))
                    << a << " and " << b << " from " << nFirst << ", " << nZeros;
            }
        }
    }
}

TEST(MergeNetwork, LeavesOutWhatNoOneAsksFor)
{
    EXPECT_EQ(CountOperations(MergeNetwork(1, 1, 0, 2)), 2U);
    EXPECT_EQ(CountOperations(MergeNetwork(1, 1, 0, 1)), 1U);
    // The least of two lists in order is the lesser of their first samples.
    EXPECT_EQ(CountOperations(MergeNetwork(14, 14, 0, 1)), 1U);
}

}  // namespace
}  // namespace kor::filters::kernels
