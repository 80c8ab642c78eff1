#include "processes/qrdfilters/mosaic/clipdistance.h"

#include <gtest/gtest.h>

#include "tests/support/blocks.h"

namespace kor::filters
{
namespace
{

using test::BlankRaster;
using test::Image;
using test::Margins;
using test::Random;

using Distances = Image<std::uint32_t>;

Distances DistancesOf(const tessel::Mask* poMask, std::uint32_t nWidth, std::uint32_t nHeight,
                      Margins oMargins = {}, bool bStepsCount = true)
{
    const ClipDistance oDistance(*BlankRaster(nWidth, nHeight, 1, tessel::eDT_8U, oMargins), poMask,
                                 bStepsCount);
    std::vector<std::uint32_t> vnDistances;
    for (std::uint32_t y = 0; y < nHeight; ++y)
    {
        const auto oRow = oDistance.GetRow(y);
        vnDistances.insert(vnDistances.end(), oRow.begin(), oRow.end());
    }
    return Distances(nWidth, vnDistances);
}

TEST(ClipDistance, CountsStepsAlongRowsAndColumns)
{
    const auto poMask = test::MaskOf({
        {0, 0, 0, 0, 0},
        {0, 0, 1, 0, 0},
        {0, 0, 0, 0, 1},
    });
    EXPECT_EQ(DistancesOf(poMask.get(), 5, 3), (Distances{
                                                   {3, 2, 1, 2, 2},
                                                   {2, 1, 0, 1, 1},
                                                   {3, 2, 1, 1, 0},
                                               }));
}

TEST(ClipDistance, IsZeroWithoutAMask)
{
    EXPECT_EQ(DistancesOf(nullptr, 3, 2), (Distances{{0, 0, 0}, {0, 0, 0}}));
}

TEST(ClipDistance, IsOneEverywhereOutsideWhereStepsDoNotCount)
{
    const auto poMask = test::MaskOf({{1, 0, 0, 0, 1}});
    EXPECT_EQ(DistancesOf(poMask.get(), 5, 1, {}, false), (Distances{{0, 1, 1, 1, 0}}));
}

// Nothing is valid: the corner is W + H = 5 away, and what lies outside also is without margins.
TEST(ClipDistance, TakesWhatLiesOutsideAsFarAway)
{
    const auto poMask = test::MaskOf({{0, 0, 0}, {0, 0, 0}});
    EXPECT_EQ(DistancesOf(poMask.get(), 3, 2), (Distances{{5, 6, 6}, {6, 6, 6}}));
}

// With margins of 2 and 1 the outside is 3 + 2 + 2 * (2 + 1) = 11 away, so that the corner counts.
TEST(ClipDistance, TakesMarginsAsFartherAway)
{
    const auto poMask = test::MaskOf(Image<int>(7, std::vector<int>(28)), Margins{2, 1});
    EXPECT_EQ(DistancesOf(poMask.get(), 3, 2, Margins{2, 1}), (Distances{{5, 6, 7}, {6, 7, 8}}));
}

TEST(ClipDistance, DoesNotLookIntoTheMarginsOfTheMask)
{
    const auto poMask = test::MaskOf({{1, 1, 1}, {1, 0, 1}, {1, 1, 1}}, Margins{1, 1});
    EXPECT_EQ(DistancesOf(poMask.get(), 1, 1, Margins{1, 1}), (Distances{{2}}));
}

/// The two passes pixel by pixel, on an array with one more entry on each side.
Distances TransformByDefinition(const tessel::Mask& oMask)
{
    const auto nWidth = static_cast<std::int64_t>(oMask.mnWidth);
    const auto nHeight = static_cast<std::int64_t>(oMask.mnHeight);
    const std::uint32_t nFar = oMask.mnWidth + oMask.mnHeight;
    const std::uint32_t nOutside = nFar + 2 * (oMask.mnMarginX + oMask.mnMarginY);
    std::vector<std::uint32_t> vn(static_cast<std::size_t>((nWidth + 2) * (nHeight + 2)), nOutside);
    const auto oAt = [&](std::int64_t x, std::int64_t y) -> std::uint32_t&
    { return vn[static_cast<std::size_t>((y + 1) * (nWidth + 2) + x + 1)]; };
    for (std::int64_t y = 0; y < nHeight; ++y)
    {
        for (std::int64_t x = 0; x < nWidth; ++x)
        {
            if (test::IsValid(&oMask, x, y))
            {
                oAt(x, y) = 0;
            }
            else if (x == 0)
            {
                oAt(x, y) = y == 0 ? nFar : oAt(x, y - 1) + 1;
            }
            else
            {
                oAt(x, y) = std::min(oAt(x - 1, y) + 1, oAt(x, y - 1) + 1);
            }
        }
    }
    std::vector<std::uint32_t> vnResult(static_cast<std::size_t>(nWidth * nHeight));
    for (std::int64_t y = nHeight - 1; y >= 0; --y)
    {
        for (std::int64_t x = nWidth - 1; x >= 0; --x)
        {
            oAt(x, y) = std::min({oAt(x, y), oAt(x + 1, y) + 1, oAt(x, y + 1) + 1});
            vnResult[static_cast<std::size_t>(y * nWidth + x)] = oAt(x, y);
        }
    }
    return Distances(oMask.mnWidth, vnResult);
}

TEST(ClipDistance, IsThatOfTheTwoPassesOnRandomMasks)
{
    Random oRandom(5);
    for (int i = 0; i < 600; ++i)
    {
        const auto nWidth = static_cast<std::uint32_t>(1 + oRandom() % 19);
        const auto nHeight = static_cast<std::uint32_t>(1 + oRandom() % 13);
        const Margins oMargins{static_cast<std::uint32_t>(oRandom() % 3),
                               static_cast<std::uint32_t>(oRandom() % 3)};
        const double dfValid = i % 3 == 0 ? 0.5 : i % 3 == 1 ? 0.03 : 0.0;
        const auto poMask = test::RandomMask(nWidth, nHeight, oMargins, dfValid, oRandom);
        ASSERT_EQ(DistancesOf(poMask.get(), nWidth, nHeight, oMargins),
                  TransformByDefinition(*poMask));
    }
}

TEST(ClipDistance, TakesBlocksWithoutPixels)
{
    EXPECT_EQ(DistancesOf(nullptr, 3, 0).Rows(), 0U);
    const auto poMask = test::MaskOf(Image<int>(2, std::vector<int>(8)), Margins{1, 1});
    EXPECT_TRUE(DistancesOf(poMask.get(), 0, 2, Margins{1, 1}).Samples().empty());
}

}  // namespace
}  // namespace kor::filters
