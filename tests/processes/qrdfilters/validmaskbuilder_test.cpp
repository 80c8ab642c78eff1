#include "processes/qrdfilters/validmaskbuilder.h"

#include <gtest/gtest.h>

#include <cmath>
#include <limits>
#include <random>
#include <vector>

#include "platform/exception/exception.h"
#include "tests/support/blocks.h"

namespace kor::filters
{
namespace
{

using tessel::Mask;
using tessel::Raster;
using test::Image;

std::vector<int> ValidPixels(const std::vector<double>& vdfNoData, const Raster& oRaster)
{
    const std::unique_ptr<Mask> poMask(ValidMaskBuilder(vdfNoData).BuildMask(oRaster));
    std::vector<int> vnValid;
    for (std::uint32_t i = 0; i < poMask->mnBitCount; ++i)
    {
        vnValid.push_back(test::IsValid(poMask.get(), std::int64_t{i} - poMask->mnMarginX,
                                        -std::int64_t{poMask->mnMarginY})
                              ? 1
                              : 0);
    }
    return vnValid;
}

template <class T>
std::vector<int> Valid(const std::vector<double>& vdfNoData, const Image<T>& oImage,
                       std::uint32_t nChannels = 1)
{
    return ValidPixels(vdfNoData, *test::RasterOf(oImage, {}, nChannels));
}

using Flags = std::vector<int>;

TEST(ValidMaskBuilder, SamplesMustBeFinite)
{
    EXPECT_EQ(Valid<double>({}, {{1, NAN, INFINITY, -INFINITY, 1e308}}), (Flags{1, 0, 0, 0, 1}));
    EXPECT_EQ(Valid<float>({}, {{1, NAN, INFINITY, -INFINITY, -0.0F}}), (Flags{1, 0, 0, 0, 1}));
}

TEST(ValidMaskBuilder, AnyNumberOfNodataValues)
{
    EXPECT_EQ(Valid<unsigned char>({0, 255}, {{0, 1, 254, 255}}), (Flags{0, 1, 1, 0}));
    EXPECT_EQ(Valid<float>({-9999, 0}, {{-9999, 0, -0.0F, 5}}), (Flags{0, 0, 0, 1}));
    EXPECT_EQ(Valid<short>({}, {{-32768, 0}}), (Flags{1, 1}));
}

TEST(ValidMaskBuilder, AllTenTypesFindTheirNodataValue)
{
    test::ForEachElementType(
        [&]<class T>() {
            EXPECT_EQ(Valid<T>({7}, Image<T>{{T(6), T(7), T(8)}}), (Flags{1, 0, 1}));
        });
    EXPECT_EQ(Valid<char>({-7}, {{-7, 7}}), (Flags{0, 1}));
}

TEST(ValidMaskBuilder, ValueThatTheTypeCannotHoldMatchesNothing)
{
    EXPECT_EQ(Valid<unsigned char>({-9999, 256, 0.5, NAN, INFINITY}, {{241, 0, 1, 255}}),
              (Flags{1, 1, 1, 1}));
    EXPECT_EQ(Valid<int64>({0x1p63}, {{std::numeric_limits<int64>::max()}}), (Flags{1}));
    EXPECT_EQ(Valid<int64>({-0x1p63}, {{std::numeric_limits<int64>::min()}}), (Flags{0}));
    EXPECT_EQ(Valid<uint64>({0x1p64}, {{std::numeric_limits<uint64>::max()}}), (Flags{1}));
}

// Files name the lowest float with fewer digits than a double has.
TEST(ValidMaskBuilder, FloatValuesAreNarrowed)
{
    EXPECT_EQ(Valid<float>({-3.4028234663852886e38, 0.1},
                           {{std::numeric_limits<float>::lowest(), 0.1F, 1}}),
              (Flags{0, 0, 1}));
}

TEST(ValidMaskBuilder, OneChannelMasksThePixel)
{
    EXPECT_EQ(Valid<float>({0}, {{1, 1, 1, 0, 1, NAN}}, 2), (Flags{1, 0, 0}));
}

TEST(ValidMaskBuilder, MarginsAreMaskedToo)
{
    const auto poBlock = test::RasterOf(Image<float>{{NAN, 1, 2, NAN}}, {1, 0});
    EXPECT_EQ(ValidPixels({}, *poBlock), (Flags{0, 1, 1, 0}));
}

TEST(ValidMaskBuilder, LongRowsOfAnyNumberOfChannelsAreThoseOfTheDefinition)
{
    constexpr std::uint32_t kPixels = 2500;
    std::mt19937 oRandom(11);
    for (const std::uint32_t nChannels : {1U, 2U, 3U, 17U})
    {
        std::vector<float> vfRow(std::size_t{kPixels} * nChannels);
        std::vector<int> vnExpected(kPixels, 1);
        for (std::size_t i = 0; i < vfRow.size(); ++i)
        {
            const float afDrawn[] = {-9999.0F, std::numeric_limits<float>::infinity(), NAN};
            const std::uint32_t nDrawn = oRandom() % (40 * nChannels);
            vfRow[i] = nDrawn < 3 ? afDrawn[nDrawn] : static_cast<float>(nDrawn);
            vnExpected[i / nChannels] &= nDrawn < 3 ? 0 : 1;
        }
        EXPECT_EQ(Valid({5e5, -9999.0}, Image<float>(vfRow.size(), vfRow), nChannels), vnExpected)
            << nChannels;
    }
}

TEST(ValidMaskBuilder, BothPartsOfComplexSamplesAreLookedAt)
{
    const auto poBlock = test::BlankRaster(3, 1, 1, tessel::eDT_C32R);
    const float afParts[] = {1, 2, NAN, 2, 1, INFINITY};
    std::memcpy(poBlock->mpBuffer, afParts, sizeof(afParts));
    EXPECT_EQ(ValidPixels({}, *poBlock), (Flags{1, 0, 0}));
}

TEST(ValidMaskBuilder, TypeWithoutSamplesIsRefused)
{
    EXPECT_THROW(ValidMaskBuilder().BuildMask(*test::BlankRaster(1, 1, 1, tessel::eDT_BIT)),
                 DataException);
}

TEST(ValidMaskBuilder, BlockWithoutPixelsHasAMask)
{
    const std::unique_ptr<Mask> poMask(
        ValidMaskBuilder().BuildMask(*test::BlankRaster(0, 3, 1, tessel::eDT_8U)));
    EXPECT_EQ(poMask->mnBitCount, 0U);
}

}  // namespace
}  // namespace kor::filters
