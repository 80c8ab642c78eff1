#include "basic/tessel/mask/mask.h"

#include <gtest/gtest.h>

#include <memory>
#include <type_traits>
#include <utility>
#include <vector>

#include "platform/exception/exception.h"
#include "tests/support/blocks.h"

namespace kor::tessel
{
namespace
{

using test::BlankRaster;
using test::Image;
using test::ImageOf;
using test::IsValid;
using test::Margins;
using test::MaskOf;
using Bytes = std::vector<unsigned char>;

Mask PackedMask(std::uint32_t nWidth, std::uint32_t nHeight, Bytes vBytes)
{
    return Mask(RasterInfo(nWidth, nHeight, 1, eDT_8U), RasterContext(), vBytes.data(), false,
                true);
}

TEST(Mask, DescribesItselfAsOneChannelOfBits)
{
    Bytes vBytes(9 * 6, 1);
    const Mask oMask(RasterInfo(5, 4, 3, eDT_16S), RasterContext(2, 1, 70, 80), vBytes.data(),
                     false, false);
    EXPECT_EQ(oMask.mnWidth, 5U);
    EXPECT_EQ(oMask.mnHeight, 4U);
    EXPECT_EQ(oMask.mnChannels, 1U);
    EXPECT_EQ(oMask.moDataType, eDT_BIT);
    EXPECT_EQ(oMask.mnMarginX, 2U);
    EXPECT_EQ(oMask.mnMarginY, 1U);
    EXPECT_EQ(oMask.mnOffsetX, 70U);
    EXPECT_EQ(oMask.mnOffsetY, 80U);
    EXPECT_EQ(oMask.mnTotalWidth, 9U);
    EXPECT_EQ(oMask.mnTotalHeight, 6U);
    EXPECT_EQ(oMask.mnBitCount, 54U);
    EXPECT_EQ(oMask.mnByteCount, 7U);
    EXPECT_EQ(oMask.moBits.size(), 7U);
}

TEST(Mask, OfThreeByThreePixelsHoldsNineBitsInTwoBytes)
{
    const auto poMask = MaskOf({{1, 1, 1}, {1, 1, 1}, {1, 1, 1}});
    EXPECT_EQ(poMask->mnBitCount, 9U);
    EXPECT_EQ(poMask->mnByteCount, 2U);
    EXPECT_EQ(poMask->moBits, (Bytes{0xFF, 0x80}));
}

TEST(Mask, PutsTheFirstPixelIntoTheMostSignificantBit)
{
    const auto poMask = MaskOf({{1, 0, 1, 1, 0}, {0, 0, 1, 0, 1}});
    EXPECT_EQ(poMask->moBits, (Bytes{0b10110001, 0b01000000}));
}

TEST(Mask, CountsAnyByteButZeroAsValid)
{
    Bytes vBytes = {0, 1, 2, 4, 8, 16, 32, 64, 128, 255, 0};
    const Mask oMask(RasterInfo(11, 1, 1, eDT_8U), RasterContext(), vBytes.data(), false, false);
    EXPECT_EQ(oMask.moBits, (Bytes{0b01111111, 0b11000000}));
}

TEST(Mask, TakesPackedBitsAsTheyStand)
{
    EXPECT_EQ(PackedMask(4, 4, {0xA5, 0x3C}).moBits, (Bytes{0xA5, 0x3C}));
}

TEST(Mask, ClearsStrayBitsBehindTheLastPixel)
{
    EXPECT_EQ(PackedMask(3, 3, {0xFF, 0xFF}).moBits, (Bytes{0xFF, 0x80}));
    EXPECT_EQ(PackedMask(7, 1, {0xFF}).moBits, (Bytes{0xFE}));
    EXPECT_EQ(PackedMask(1, 1, {0xFF}).moBits, (Bytes{0x80}));
}

TEST(Mask, MayBeEmpty)
{
    unsigned char nByte = 1;
    const Mask oMask(RasterInfo(0, 5, 1, eDT_8U), RasterContext(), &nByte, false, false);
    EXPECT_EQ(oMask.mnBitCount, 0U);
    EXPECT_EQ(oMask.mnByteCount, 0U);
    EXPECT_TRUE(oMask.moBits.empty());
}

// Whether it is freed once and as an array is for the address sanitizer to tell.
TEST(Mask, FreesABufferThatItWasGiven)
{
    for (const bool bPacked : {false, true})
    {
        auto* pBuffer = new unsigned char[8]{1, 1, 1, 1, 1, 1, 1, 1};
        const Mask oMask(RasterInfo(8, 1, 1, eDT_8U), RasterContext(), pBuffer, true, bPacked);
        EXPECT_EQ(oMask.moBits, (bPacked ? Bytes{0x01} : Bytes{0xFF}));
    }
}

TEST(Mask, RefusesNullAndTooManyPixels)
{
    const RasterInfo oInfo(65536, 65536, 1, eDT_8U);
    EXPECT_THROW(Mask(oInfo, RasterContext(), nullptr, false, false), DataException);
    unsigned char nByte = 0;
    try
    {
        const Mask oMask(oInfo, RasterContext(), &nByte, false, true);
        ADD_FAILURE() << "a mask of " << oMask.mnBitCount << " pixels was made";
    }
    catch (const DataException& oError)
    {
        EXPECT_EQ(oError.GetMessage(),
                  "A mask of 65536 x 65536 pixels with its margins holds 2^32 pixels or more");
        EXPECT_EQ(oError.GetFile(), "basic/tessel/mask/mask");
    }
}

TEST(Mask, PacksAndExpandsEveryWidthBitByBit)
{
    test::Random oRandom(1);
    for (std::uint32_t nWidth = 1; nWidth <= 40; ++nWidth)
    {
        Bytes vBytes(std::size_t{nWidth} * 3);
        for (unsigned char& nByte : vBytes)
        {
            nByte = static_cast<unsigned char>(oRandom() % 3 == 0 ? 0 : oRandom());
        }
        const Mask oMask(RasterInfo(nWidth, 3, 1, eDT_8U), RasterContext(), vBytes.data(), false,
                         false);
        for (std::size_t i = 0; i < vBytes.size(); ++i)
        {
            const unsigned int nBit = (oMask.moBits[i >> 3] >> (7 - (i & 7))) & 1U;
            ASSERT_EQ(nBit, vBytes[i] != 0 ? 1U : 0U) << "pixel " << i << " of width " << nWidth;
            vBytes[i] = static_cast<unsigned char>(nBit);
        }
        const std::unique_ptr<Raster> poRaster(oMask.CreateRaster());
        ASSERT_EQ(ImageOf<unsigned char>(*poRaster).Samples(), vBytes) << nWidth;
    }
}

TEST(Mask, CreatesARasterOfItsGeometry)
{
    Bytes vBytes(5 * 5, 1);
    vBytes[0] = 0;
    const Mask oMask(RasterInfo(3, 1, 7, eDT_64R), RasterContext(1, 2, 70, 80), vBytes.data(),
                     false, false);
    const std::unique_ptr<Raster> poRaster(oMask.CreateRaster());
    EXPECT_EQ(poRaster->mnWidth, 3U);
    EXPECT_EQ(poRaster->mnHeight, 1U);
    EXPECT_EQ(poRaster->mnChannels, 1U);
    EXPECT_EQ(poRaster->moDataType, eDT_8U);
    EXPECT_EQ(poRaster->mnMarginX, 1U);
    EXPECT_EQ(poRaster->mnMarginY, 2U);
    EXPECT_EQ(poRaster->mnOffsetX, 70U);
    EXPECT_EQ(poRaster->mnOffsetY, 80U);
    EXPECT_TRUE(poRaster->mbOwnsBuffer);
    EXPECT_EQ(*poRaster->GetPixel(-1, -2), 0);
    EXPECT_EQ(*poRaster->GetPixel(3, 2), 1);
}

TEST(RetrieveRaster, CopiesThePackedBytesIntoABitRaster)
{
    const auto poMask = MaskOf({{1, 0, 1}, {1, 0, 0}, {1, 1, 1}});
    const auto poRaster = BlankRaster(3, 3, 1, eDT_BIT);
    poMask->RetrieveRaster(poRaster.get());
    EXPECT_EQ(Bytes(poRaster->mpBuffer, poRaster->mpBuffer + 9),
              (Bytes{0b10110011, 0b10000000, 0xA5, 0xA5, 0xA5, 0xA5, 0xA5, 0xA5, 0xA5}));
}

TEST(RetrieveRaster, WritesAByteForEachPixelOfAnEightBitRaster)
{
    const auto poMask = MaskOf({{1, 0, 1, 1}, {0, 0, 1, 0}, {1, 1, 1, 0}}, Margins{1, 1});
    const auto poRaster = BlankRaster(2, 1, 1, eDT_8U, Margins{1, 1});
    poMask->RetrieveRaster(poRaster.get());
    EXPECT_EQ(Bytes(poRaster->mpBuffer, poRaster->mpBuffer + 12),
              (Bytes{1, 0, 1, 1, 0, 0, 1, 0, 1, 1, 1, 0}));
}

TEST(RetrieveRaster, StaysInsideARasterOfAnotherExtent)
{
    const auto poMask = MaskOf({{1, 1, 1}, {1, 1, 1}, {1, 1, 1}});
    const auto poSmall = BlankRaster(2, 1, 1, eDT_8U);
    poMask->RetrieveRaster(poSmall.get());
    EXPECT_EQ(ImageOf<unsigned char>(*poSmall), (Image<unsigned char>{{1, 1}}));

    const auto poLarge = BlankRaster(11, 1, 1, eDT_8U);
    poMask->RetrieveRaster(poLarge.get());
    EXPECT_EQ(ImageOf<unsigned char>(*poLarge),
              (Image<unsigned char>{{1, 1, 1, 1, 1, 1, 1, 1, 1, 0, 0}}));

    const auto poBits = BlankRaster(1, 1, 1, eDT_BIT);
    poMask->RetrieveRaster(poBits.get());
    EXPECT_EQ(*poBits->mpBuffer, 0xFF);
}

TEST(RetrieveRaster, RefusesOtherTypesAndWritesNothing)
{
    const auto poMask = MaskOf({{1, 0}, {0, 1}});
    const DataType aoTypes[] = {eDT_16U, eDT_8S, DataType(8, false, false, 8, 0, true),
                                DataType(1, true, false, 1, 0, false)};
    for (const DataType& oType : aoTypes)
    {
        const auto poRaster = BlankRaster(2, 2, 1, oType);
        try
        {
            poMask->RetrieveRaster(poRaster.get());
            ADD_FAILURE() << "a raster of " << oType.mnBits << " bits was taken";
        }
        catch (const DataException& oError)
        {
            EXPECT_EQ(oError.GetMessage(), "We can only rasterize into a eDT_BIT or eDT_8U Raster");
            EXPECT_EQ(oError.GetFile(), "basic/tessel/mask/mask");
            EXPECT_EQ(oError.GetLine(), 233U);
        }
        for (std::uint64_t i = 0; i < poRaster->mnBufferSize; ++i)
        {
            EXPECT_EQ(poRaster->mpBuffer[i], 0xA5);
        }
    }
}

TEST(ExpandRow, ReadsFromEveryBitOffsetAndForEveryLength)
{
    test::Random oRandom(2);
    const auto poMask = test::RandomMask(37, 3, Margins{2, 1}, 0.5, oRandom);
    for (std::int64_t y = -1; y <= 3; ++y)
    {
        for (std::int64_t x = -2; x <= 38; ++x)
        {
            for (std::int64_t nEnd = x; nEnd <= 39; ++nEnd)
            {
                Bytes vExpected;
                for (std::int64_t i = x; i < nEnd; ++i)
                {
                    vExpected.push_back(IsValid(poMask.get(), i, y) ? 1 : 0);
                }
                Bytes vBytes(vExpected.size(), 0xA5);
                poMask->ExpandRow(x, y, vBytes);
                ASSERT_EQ(vBytes, vExpected) << x << " to " << nEnd << " of row " << y;
            }
        }
    }
}

void ExpectEmpty(const Mask& oMask)
{
    EXPECT_TRUE(oMask.moBits.empty());
    EXPECT_EQ(oMask.mnBitCount, 0U);
    EXPECT_EQ(oMask.mnByteCount, 0U);
    EXPECT_EQ(oMask.mnTotalWidth, 0U);
    EXPECT_EQ(oMask.mnHeight, 0U);
    EXPECT_EQ(oMask.mnMarginX, 0U);
    const std::unique_ptr<Raster> poRaster(oMask.CreateRaster());
    EXPECT_EQ(poRaster->mnBufferSize, 0U);
}

TEST(Mask, MovesItsBitsAndLeavesAnEmptyOne)
{
    const auto poFrom = MaskOf({{1, 0, 1, 1}, {0, 0, 1, 0}, {1, 1, 1, 0}}, Margins{1, 1});
    const Bytes vBits = poFrom->moBits;
    Mask oTo(std::move(*poFrom));
    EXPECT_EQ(oTo.moBits, vBits);
    EXPECT_EQ(oTo.mnWidth, 2U);
    EXPECT_EQ(oTo.mnTotalWidth, 4U);
    EXPECT_EQ(oTo.mnBitCount, 12U);
    EXPECT_EQ(oTo.moDataType, eDT_BIT);
    ExpectEmpty(*poFrom);

    const auto poOther = MaskOf({{1}});
    oTo = std::move(*poOther);
    EXPECT_EQ(oTo.moBits, (Bytes{0x80}));
    EXPECT_EQ(oTo.mnTotalWidth, 1U);
    EXPECT_EQ(oTo.mnMarginX, 0U);
    EXPECT_EQ(oTo.mnByteCount, 1U);
    ExpectEmpty(*poOther);

    Mask& oSame = oTo;
    oTo = std::move(oSame);
    EXPECT_EQ(oTo.moBits, (Bytes{0x80}));
}

TEST(Mask, CannotBeCopied)
{
    EXPECT_FALSE(std::is_copy_constructible_v<Mask>);
    EXPECT_FALSE(std::is_copy_assignable_v<Mask>);
}

TEST(MaskBitTable, HoldsTheBitsOfEveryByteFromTheMostSignificantOn)
{
    EXPECT_EQ(kMaskBitTable.size(), 2048U);
    EXPECT_EQ(kMaskBitTable[0x80 * 8 + 0], 1);
    EXPECT_EQ(kMaskBitTable[0x80 * 8 + 1], 0);
    EXPECT_EQ(kMaskBitTable[0x01 * 8 + 7], 1);
    for (unsigned int nByte = 0; nByte < 256; ++nByte)
    {
        unsigned int nSum = 0;
        for (unsigned int k = 0; k < 8; ++k)
        {
            nSum = 2 * nSum + kMaskBitTable[nByte * 8 + k];
        }
        EXPECT_EQ(nSum, nByte);
    }
}

}  // namespace
}  // namespace kor::tessel
