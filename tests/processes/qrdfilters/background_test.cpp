#include "processes/qrdfilters/background.h"

#include <gtest/gtest.h>

#include <vector>

#include "tests/support/blocks.h"

namespace kor::filters
{
namespace
{

using test::Margins;
using test::MaskOf;
using Bytes = std::vector<unsigned char>;

Bytes Computed(const tessel::Mask* poMaskIn, const tessel::Mask* poMaskOut, std::int64_t x,
               std::int64_t y, std::size_t nPixels)
{
    Bytes vComputed(nPixels, 0xA5);
    FindComputedPixels(poMaskIn, poMaskOut, x, y, vComputed);
    return vComputed;
}

TEST(FindComputedPixels, ComputesAllWithoutMasks)
{
    EXPECT_EQ(Computed(nullptr, nullptr, 0, 0, 3), (Bytes{1, 1, 1}));
}

TEST(FindComputedPixels, LeavesOutWhatEitherMaskLeavesOut)
{
    const auto poIn = MaskOf({{1, 1, 0, 0}, {1, 0, 1, 0}});
    const auto poOut = MaskOf({{0, 0, 0, 0}, {1, 1, 0, 0}});
    EXPECT_EQ(Computed(poIn.get(), nullptr, 0, 1, 4), (Bytes{1, 0, 1, 0}));
    EXPECT_EQ(Computed(nullptr, poOut.get(), 0, 1, 4), (Bytes{1, 1, 0, 0}));
    EXPECT_EQ(Computed(poIn.get(), poOut.get(), 0, 1, 4), (Bytes{1, 0, 0, 0}));
    EXPECT_EQ(Computed(poIn.get(), poOut.get(), 1, 1, 2), (Bytes{0, 0}));
}

TEST(FindComputedPixels, ReadsEachMaskWithItsOwnMargins)
{
    const auto poIn = MaskOf({{0, 0, 0, 0}, {0, 1, 1, 0}, {0, 0, 0, 0}}, Margins{1, 1});
    const auto poOut = MaskOf({{0, 1}});
    EXPECT_EQ(Computed(poIn.get(), poOut.get(), 0, 0, 2), (Bytes{0, 1}));
    EXPECT_EQ(Computed(poIn.get(), nullptr, -1, 0, 4), (Bytes{0, 1, 1, 0}));
}

TEST(FindComputedPixels, JoinsLongRowsPixelByPixel)
{
    test::Random oRandom(11);
    const auto poIn = test::RandomMask(1500, 2, Margins{3, 1}, 0.7, oRandom);
    const auto poOut = test::RandomMask(1500, 2, Margins{0, 0}, 0.7, oRandom);
    const Bytes vComputed = Computed(poIn.get(), poOut.get(), 5, 1, 1495);
    for (std::size_t i = 0; i < vComputed.size(); ++i)
    {
        const auto x = static_cast<std::int64_t>(i) + 5;
        const bool bExpected = test::IsValid(poIn.get(), x, 1) && test::IsValid(poOut.get(), x, 1);
        ASSERT_EQ(vComputed[i], bExpected ? 1 : 0) << i;
    }
}

TEST(FindByte, FindsTheFirstOneFromAPositionOn)
{
    const Bytes vBytes = {1, 0, 1, 0};
    EXPECT_EQ(FindByte(vBytes, 0, 0), 1U);
    EXPECT_EQ(FindByte(vBytes, 1, 0), 1U);
    EXPECT_EQ(FindByte(vBytes, 2, 0), 3U);
    EXPECT_EQ(FindByte(vBytes, 3, 1), 4U);
    EXPECT_EQ(FindByte(vBytes, 4, 0), 4U);
    EXPECT_EQ(FindByte({}, 0, 0), 0U);
}

TEST(WriteBackground, WritesZerosOverPixelsThatAreNotComputed)
{
    const std::vector<double> vdfIn(6, 7.7);
    std::vector<short> vOut = {1, 2, 3, 4, 5, 6};
    WriteBackground<double, short>(Bytes{0, 1, 0}, vdfIn.data(), 2, true, vOut.data());
    EXPECT_EQ(vOut, (std::vector<short>{0, 0, 3, 4, 0, 0}));
}

TEST(WriteBackground, CopiesTheInputByTheRulesOfConversion)
{
    const std::vector<double> vdfIn = {-0.7, 1.5, 2, 3, 300, 254.4, 9, 9};
    std::vector<unsigned char> vOut = {1, 2, 3, 4, 5, 6, 7, 8};
    WriteBackground<double, unsigned char>(Bytes{0, 1, 0, 1}, vdfIn.data(), 2, false, vOut.data());
    EXPECT_EQ(vOut, (std::vector<unsigned char>{0, 2, 3, 4, 255, 254, 7, 8}));
}

TEST(WriteBackground, LeavesARowAloneThatIsAllComputed)
{
    std::vector<float> vOut = {1, 2, 3};
    WriteBackground<int, float>(Bytes{1, 1, 1}, nullptr, 1, false, vOut.data());
    WriteBackground<int, float>({}, nullptr, 1, false, vOut.data());
    EXPECT_EQ(vOut, (std::vector<float>{1, 2, 3}));
}

TEST(WriteBackground, CoversARowThatIsAllBackground)
{
    const std::vector<int> vIn = {-1, 2, 3};
    std::vector<float> vOut(3, 9);
    WriteBackground<int, float>(Bytes{0, 0, 0}, vIn.data(), 1, false, vOut.data());
    EXPECT_EQ(vOut, (std::vector<float>{-1, 2, 3}));
}

}  // namespace
}  // namespace kor::filters
