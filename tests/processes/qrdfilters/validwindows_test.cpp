#include "processes/qrdfilters/validwindows.h"

#include <gtest/gtest.h>

#include <vector>

#include "tests/support/blocks.h"

namespace kor::filters
{
namespace
{

using namespace kor::test;

std::vector<int> WholeWindows(const tessel::Raster& oValid, std::size_t nHalfX, std::size_t nHalfY,
                              std::int64_t y)
{
    std::vector<unsigned char> vWhole(oValid.mnWidth, 7);
    FindWholeWindows(oValid, nHalfX, nHalfY, 0, y, vWhole);
    return std::vector<int>(vWhole.begin(), vWhole.end());
}

TEST(FindWholeWindows, FindsTheWindowsWithoutAMaskedPixel)
{
    const auto poMask = MaskOf(
        {
            {1, 1, 1, 1, 1, 1, 0},
            {1, 1, 1, 1, 1, 1, 1},
            {1, 1, 0, 1, 1, 1, 1},
            {1, 1, 1, 1, 1, 1, 1},
        },
        Margins{1, 1});
    const std::unique_ptr<tessel::Raster> poValid(poMask->CreateRaster());
    EXPECT_EQ(WholeWindows(*poValid, 1, 1, 0), (std::vector<int>{0, 0, 0, 1, 0}));
    EXPECT_EQ(WholeWindows(*poValid, 1, 1, 1), (std::vector<int>{0, 0, 0, 1, 1}));
    EXPECT_EQ(WholeWindows(*poValid, 0, 1, 0), (std::vector<int>{1, 0, 1, 1, 1}));
    EXPECT_EQ(WholeWindows(*poValid, 1, 0, 0), (std::vector<int>{1, 1, 1, 1, 1}));
    EXPECT_EQ(WholeWindows(*poValid, 0, 0, 1), (std::vector<int>{1, 0, 1, 1, 1}));
}

TEST(FindWholeWindows, BeginsAtAnyPixelOfTheRow)
{
    const auto poMask = MaskOf({{1, 1, 1, 0, 1, 1, 1}}, Margins{1, 0});
    const std::unique_ptr<tessel::Raster> poValid(poMask->CreateRaster());
    std::vector<unsigned char> vWhole(2, 7);
    FindWholeWindows(*poValid, 1, 0, 3, 0, vWhole);
    EXPECT_EQ(vWhole, (std::vector<unsigned char>{0, 1}));
}

TEST(FindWholeWindows, AgreesWithLookingAtEachPixel)
{
    Random oRandom(5);
    for (std::uint32_t nHalf = 0; nHalf <= 4; ++nHalf)
    {
        const Margins oMargins{nHalf, 4 - nHalf};
        const auto poMask = RandomMask(130, 3, oMargins, 0.97, oRandom);
        const std::unique_ptr<tessel::Raster> poValid(poMask->CreateRaster());
        for (std::int64_t y = 0; y < 3; ++y)
        {
            std::vector<int> vExpected(130, 1);
            for (std::int64_t x = 0; x < 130; ++x)
            {
                for (std::int64_t r = y - oMargins.y; r <= y + oMargins.y; ++r)
                {
                    for (std::int64_t k = x - oMargins.x; k <= x + oMargins.x; ++k)
                    {
                        vExpected[static_cast<std::size_t>(x)] &= IsValid(poMask.get(), k, r);
                    }
                }
            }
            EXPECT_EQ(WholeWindows(*poValid, oMargins.x, oMargins.y, y), vExpected);
        }
    }
}

}  // namespace
}  // namespace kor::filters
