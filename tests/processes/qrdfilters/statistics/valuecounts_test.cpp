#include "processes/qrdfilters/statistics/valuecounts.h"

#include <gtest/gtest.h>

#include <map>

#include "tests/support/blocks.h"

namespace kor::filters
{
namespace
{

void ExpectMode(const ValueCounts& oCounts, std::uint32_t nValue, std::uint32_t nCount)
{
    EXPECT_EQ(oCounts.FindMode().mnValue, nValue);
    EXPECT_EQ(oCounts.FindMode().mnCount, nCount);
}

TEST(ValueCounts, FindTheLowestOfTheValuesMetMostOften)
{
    ValueCounts oCounts;
    ExpectMode(oCounts, 0, 0);
    oCounts.Add(65535);
    ExpectMode(oCounts, 65535, 1);
    oCounts.Add(9);
    ExpectMode(oCounts, 9, 1);
    oCounts.Add(0);
    ExpectMode(oCounts, 0, 1);
    oCounts.Add(9);
    oCounts.Add(7);
    oCounts.Add(7);
    ExpectMode(oCounts, 7, 2);
}

TEST(ValueCounts, HoldAllValues)
{
    ValueCounts oCounts;
    for (std::uint32_t nValue = 0; nValue < 65536; ++nValue)
    {
        oCounts.Add(static_cast<std::uint16_t>(nValue));
    }
    ExpectMode(oCounts, 0, 1);
    EXPECT_EQ(oCounts.GetBytes(), 65536U * 8);
    oCounts.Add(40000);
    ExpectMode(oCounts, 40000, 2);
}

// Beyond three quarters the table doubles.
TEST(ValueCounts, TakeMemoryByTheNumberOfDifferentValues)
{
    ValueCounts oCounts;
    EXPECT_EQ(oCounts.GetBytes(), 0U);
    for (std::uint32_t nValue = 0; nValue < 6; ++nValue)
    {
        oCounts.Add(static_cast<std::uint16_t>(nValue * 4096));
        oCounts.Add(static_cast<std::uint16_t>(nValue * 4096));
    }
    EXPECT_EQ(oCounts.GetBytes(), 8U * 8);
    oCounts.Add(1);
    EXPECT_EQ(oCounts.GetBytes(), 16U * 8);
    ExpectMode(oCounts, 0, 2);
}

// Distances between the values from 1 to 4096, and up to 3000 different ones.
TEST(ValueCounts, CountAsAMapDoes)
{
    test::Random oRandom(5);
    for (std::uint32_t nStep = 1; nStep <= 4096; nStep *= 4)
    {
        ValueCounts oCounts;
        std::map<std::uint32_t, std::uint32_t> oExpected;
        for (int i = 0; i < 9000; ++i)
        {
            const auto nValue = static_cast<std::uint16_t>(oRandom() % 3000 * nStep);
            oCounts.Add(nValue);
            ++oExpected[nValue];
        }
        ValueCounts::Mode oMode;
        for (const auto& [nValue, nCount] : oExpected)
        {
            oMode = nCount > oMode.mnCount ? ValueCounts::Mode{nValue, nCount} : oMode;
        }
        ExpectMode(oCounts, oMode.mnValue, oMode.mnCount);
    }
}

}  // namespace
}  // namespace kor::filters
