#include "processes/qrdfilters/stretchvalidity.h"

#include <gtest/gtest.h>

#include "tests/support/blocks.h"

namespace kor::filters
{
namespace
{

using namespace kor::test;

TEST(StretchValidity, WithoutAMaskAllIsValid)
{
    StretchValidity oValidity(nullptr, {1, 1});
    oValidity.MoveTo(3, 4, 100);
    EXPECT_TRUE(oValidity.IsAllValid());
}

TEST(StretchValidity, HoldsTheRowsOfTheWindows)
{
    const auto poMask = MaskOf(
        {
            {1, 1, 1, 1, 1, 1},
            {1, 1, 1, 1, 0, 1},
            {1, 1, 1, 1, 1, 1},
            {0, 1, 1, 1, 1, 1},
        },
        Margins{1, 1});
    StretchValidity oValidity(poMask.get(), {1, 1});
    oValidity.MoveTo(1, 0, 3);
    EXPECT_FALSE(oValidity.IsAllValid());
    EXPECT_EQ(oValidity.GetRowPixels(), 5U);
    const std::vector<unsigned char> vMiddle(oValidity.GetRow(1), oValidity.GetRow(1) + 5);
    EXPECT_EQ(vMiddle, (std::vector<unsigned char>{1, 1, 1, 0, 1}));
    EXPECT_TRUE(oValidity.IsWhole(0));
    EXPECT_FALSE(oValidity.IsWhole(1));
    EXPECT_FALSE(oValidity.IsWhole(2));
    oValidity.MoveTo(0, 1, 1);
    EXPECT_FALSE(oValidity.IsAllValid());
    oValidity.MoveTo(0, 0, 2);
    EXPECT_TRUE(oValidity.IsAllValid());
}

TEST(StretchValidity, FindsWholeWindowsLikeTheDefinition)
{
    Random oRandom(3);
    for (int i = 0; i < 50; ++i)
    {
        const Window oWindow{static_cast<std::uint32_t>(oRandom() % 4),
                             static_cast<std::uint32_t>(oRandom() % 4)};
        const auto poMask = RandomMask(40, 3, Margins{4, 5}, 0.97, oRandom);
        const auto x = static_cast<std::int64_t>(oRandom() % 20);
        const auto y = static_cast<std::int64_t>(oRandom() % 3);
        StretchValidity oValidity(poMask.get(), oWindow);
        oValidity.MoveTo(x, y, 20);
        bool bAllWhole = true;
        for (std::int64_t k = 0; k < 20; ++k)
        {
            bool bWhole = true;
            for (std::int64_t dy = -std::int64_t{oWindow.mnHalfY}; dy <= oWindow.mnHalfY; ++dy)
            {
                for (std::int64_t dx = -std::int64_t{oWindow.mnHalfX}; dx <= oWindow.mnHalfX; ++dx)
                {
                    bWhole = bWhole && IsValid(poMask.get(), x + k + dx, y + dy);
                }
            }
            bAllWhole = bAllWhole && bWhole;
            if (!oValidity.IsAllValid())
            {
                ASSERT_EQ(oValidity.IsWhole(static_cast<std::size_t>(k)), bWhole);
            }
        }
        ASSERT_EQ(oValidity.IsAllValid(), bAllWhole);
    }
}

}  // namespace
}  // namespace kor::filters
