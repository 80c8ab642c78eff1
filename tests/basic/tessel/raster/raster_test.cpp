#include "basic/tessel/raster/raster.h"

#include <gtest/gtest.h>

#include <array>
#include <string>
#include <type_traits>
#include <utility>

#include "platform/exception/exception.h"

namespace kor::tessel
{
namespace
{

/// A raster over one byte that nobody reads: for sizes and addresses alone.
Raster Outline(const RasterInfo& oInfo, const RasterContext& oContext = RasterContext())
{
    static unsigned char nByte = 0;
    return Raster(oInfo, oContext, &nByte, false);
}

std::ptrdiff_t ByteOf(const Raster& oRaster, std::int64_t x, std::int64_t y)
{
    return oRaster.GetPixel(x, y) - oRaster.mpBuffer;
}

TEST(RasterInfo, MadeByDefaultIsAllZero)
{
    const RasterInfo oInfo;
    EXPECT_EQ(oInfo.mnWidth, 0U);
    EXPECT_EQ(oInfo.mnHeight, 0U);
    EXPECT_EQ(oInfo.mnChannels, 0U);
    EXPECT_EQ(oInfo.moDataType, DataType());
    EXPECT_TRUE(std::has_virtual_destructor_v<RasterInfo>);
}

TEST(RasterContext, MadeByDefaultIsAllZero)
{
    const RasterContext oContext;
    EXPECT_EQ(oContext.mnMarginX, 0U);
    EXPECT_EQ(oContext.mnMarginY, 0U);
    EXPECT_EQ(oContext.mnOffsetX, 0U);
    EXPECT_EQ(oContext.mnOffsetY, 0U);
    EXPECT_FALSE(std::is_polymorphic_v<RasterContext>);
}

TEST(PartsAsChannels, DoublesTheChannelsOfTheRealType)
{
    const RasterInfo oParts = PartsAsChannels(RasterInfo(5, 4, 3, eDT_C64R));
    EXPECT_EQ(oParts.mnWidth, 5U);
    EXPECT_EQ(oParts.mnHeight, 4U);
    EXPECT_EQ(oParts.mnChannels, 6U);
    EXPECT_EQ(oParts.moDataType, eDT_64R);
}

TEST(Raster, HoldsItsInfoAndItsContext)
{
    const Raster oRaster(RasterInfo(5, 4, 3, eDT_16S), RasterContext(2, 1, 70, 80));
    EXPECT_EQ(oRaster.mnWidth, 5U);
    EXPECT_EQ(oRaster.mnHeight, 4U);
    EXPECT_EQ(oRaster.mnChannels, 3U);
    EXPECT_EQ(oRaster.moDataType, eDT_16S);
    EXPECT_EQ(oRaster.mnMarginX, 2U);
    EXPECT_EQ(oRaster.mnMarginY, 1U);
    EXPECT_EQ(oRaster.mnOffsetX, 70U);
    EXPECT_EQ(oRaster.mnOffsetY, 80U);
    EXPECT_EQ(oRaster.mnTotalWidth, 9U);
    EXPECT_EQ(oRaster.mnTotalHeight, 6U);
    EXPECT_EQ(oRaster.mnBufferSize, 2U * 9U * 6U * 3U);
    EXPECT_TRUE(oRaster.mbOwnsBuffer);
    EXPECT_NE(oRaster.mpBuffer, nullptr);
}

TEST(Raster, StartsAtItsFirstByteWithoutMargins)
{
    const Raster oRaster(RasterInfo(7, 3, 1, eDT_32R), RasterContext());
    EXPECT_EQ(oRaster.mnTotalWidth, 7U);
    EXPECT_EQ(oRaster.mnTotalHeight, 3U);
    EXPECT_EQ(oRaster.GetPixel(0, 0), oRaster.mpBuffer);
}

TEST(Raster, StartsBehindItsMargins)
{
    const Raster oRaster = Outline(RasterInfo(5, 4, 3, eDT_16S), RasterContext(2, 1, 0, 0));
    EXPECT_EQ(ByteOf(oRaster, -2, -1), 0);
    EXPECT_EQ(ByteOf(oRaster, 0, 0), (9 + 2) * 3 * 2);
    EXPECT_EQ(ByteOf(oRaster, 4, 3), ((3 + 1) * 9 + 4 + 2) * 3 * 2);
    EXPECT_EQ(ByteOf(oRaster, 6, 4), (6 * 9 - 1) * 3 * 2);  // the last one of all
}

TEST(Raster, KeepsThePartsOfComplexChannelsSideBySide)
{
    const Raster oRaster = Outline(RasterInfo(3, 2, 2, eDT_C32R));
    EXPECT_EQ(oRaster.GetPixelAs<float>(1, 0) - oRaster.GetPixelAs<float>(0, 0), 4);
    EXPECT_EQ(oRaster.GetRowSamples(), 12U);
    EXPECT_EQ(oRaster.GetPixelAs<float>(0, 1) - oRaster.GetPixelAs<float>(0, 0), 12);
}

TEST(Raster, AddressesBitsInsideBytesAndTakesAByteForEach)
{
    const Raster oRaster = Outline(RasterInfo(20, 2, 1, eDT_BIT));
    EXPECT_EQ(oRaster.mnBufferSize, 40U);
    EXPECT_EQ(ByteOf(oRaster, 7, 0), 0);
    EXPECT_EQ(ByteOf(oRaster, 8, 0), 1);
    EXPECT_EQ(ByteOf(oRaster, 3, 1), 2);  // bit 23
    EXPECT_EQ(ByteOf(oRaster, 4, 1), 3);  // bit 24
}

TEST(Raster, AddressesBeyondThirtyTwoBits)
{
    const Raster oRaster = Outline(RasterInfo(60000, 60000, 1, eDT_64R));
    EXPECT_EQ(ByteOf(oRaster, 59999, 59999), (std::int64_t{60000} * 60000 - 1) * 8);
}

TEST(Raster, TakesTheBytesOfItsType)
{
    const std::pair<DataType, std::uint64_t> aoBytes[] = {
        {eDT_BIT, 1},  {eDT_8U, 1},   {eDT_8S, 1},   {eDT_16U, 2},  {eDT_16S, 2},  {eDT_32U, 4},
        {eDT_32S, 4},  {eDT_32R, 4},  {eDT_64U, 8},  {eDT_64S, 8},  {eDT_64R, 8},  {eDT_C16U, 4},
        {eDT_C16S, 4}, {eDT_C32U, 8}, {eDT_C32S, 8}, {eDT_C32R, 8}, {eDT_C64R, 16}};
    for (const auto& [oType, nBytes] : aoBytes)
    {
        const Raster oRaster(RasterInfo(5, 3, 2, oType), RasterContext(1, 2, 0, 0));
        EXPECT_EQ(oRaster.mnBufferSize, 7U * 7U * 2U * nBytes);
    }
}

TEST(Raster, IsEmptyWhereAnyExtentIsZero)
{
    EXPECT_EQ(Raster(RasterInfo(0, 5, 1, eDT_8U), RasterContext()).mnBufferSize, 0U);
    EXPECT_EQ(Raster(RasterInfo(5, 0, 1, eDT_8U), RasterContext()).mnBufferSize, 0U);
    EXPECT_EQ(Raster(RasterInfo(5, 5, 0, eDT_8U), RasterContext()).mnBufferSize, 0U);
    EXPECT_EQ(Raster(RasterInfo(), RasterContext()).mnBufferSize, 0U);
}

// The field is computed in 32 bits: 40000 * 40000 * 3 is 4 800 000 000.
TEST(Raster, WrapsItsBufferSizeAtFourGiB)
{
    EXPECT_EQ(Outline(RasterInfo(40000, 40000, 3, eDT_8U)).mnBufferSize, 505032704U);
    EXPECT_EQ(Outline(RasterInfo(65536, 65536, 1, eDT_8U)).mnBufferSize, 0U);
    EXPECT_EQ(Outline(RasterInfo(65536, 65535, 1, eDT_8U)).mnBufferSize, 4294901760U);
    EXPECT_EQ(Outline(RasterInfo(32768, 32768, 1, eDT_C16S)).mnBufferSize, 0U);
}

void ExpectRefused(const RasterInfo& oInfo, const RasterContext& oContext,
                   const std::string& oMessage)
{
    try
    {
        const Raster oRaster(oInfo, oContext);
        ADD_FAILURE() << "a raster of " << oRaster.mnBufferSize << " bytes was made";
    }
    catch (const DataException& oError)
    {
        EXPECT_EQ(oError.GetMessage(), oMessage);
        EXPECT_EQ(oError.GetFile(), "basic/tessel/raster/raster");
    }
}

TEST(Raster, RefusesToAllocateFourGiBOrMore)
{
    ExpectRefused(RasterInfo(65536, 65536, 1, eDT_8U), RasterContext(),
                  "A raster of 65536 x 65536 pixels of 1 channels with margins 0 and 0 takes 4 GiB "
                  "or more; a block must stay below");
    ExpectRefused(RasterInfo(32766, 32768, 1, eDT_C16S), RasterContext(1, 0, 0, 0),
                  "A raster of 32766 x 32768 pixels of 1 channels with margins 1 and 0 takes 4 GiB "
                  "or more; a block must stay below");
    // Margins that wrap the total width itself.
    ExpectRefused(RasterInfo(4294967295U, 1, 1, eDT_8U), RasterContext(1, 0, 0, 0),
                  "A raster of 4294967295 x 1 pixels of 1 channels with margins 1 and 0 takes 4 "
                  "GiB or more; a block must stay below");
    ExpectRefused(RasterInfo(1, 1, 1, eDT_8U), RasterContext(2147483648U, 0, 0, 0),
                  "A raster of 1 x 1 pixels of 1 channels with margins 2147483648 and 0 takes 4 "
                  "GiB or more; a block must stay below");
}

TEST(Raster, RefusesToWrapNull)
{
    try
    {
        const Raster oRaster(RasterInfo(2, 2, 1, eDT_8U), RasterContext(), nullptr, true);
        ADD_FAILURE() << "a raster on null was made";
    }
    catch (const DataException& oError)
    {
        EXPECT_EQ(oError.GetMessage(), "pBuffer is NULL, cannot create a Raster on NULL");
        EXPECT_EQ(oError.GetFile(), "basic/tessel/raster/raster");
        EXPECT_EQ(oError.GetFunction(),
                  "Raster::Raster(const class kor::tessel::RasterInfo &,const class "
                  "kor::tessel::RasterContext &,unsigned char *,bool)");
        EXPECT_EQ(oError.GetLine(), 52U);
    }
}

TEST(Raster, LeavesABorrowedBufferAlone)
{
    std::array<unsigned char, 4> anBuffer = {1, 2, 3, 4};
    {
        const Raster oRaster(RasterInfo(2, 2, 1, eDT_8U), RasterContext(), anBuffer.data(), false);
        EXPECT_EQ(oRaster.mpBuffer, anBuffer.data());
        EXPECT_FALSE(oRaster.mbOwnsBuffer);
        EXPECT_EQ(*oRaster.GetPixel(1, 1), 4);
    }
    EXPECT_EQ(anBuffer, (std::array<unsigned char, 4>{1, 2, 3, 4}));
}

// Whether it is freed once and as an array is for the address sanitizer to tell.
TEST(Raster, FreesABufferThatItWasGiven)
{
    auto* pBuffer = new unsigned char[4];
    const Raster oRaster(RasterInfo(2, 2, 1, eDT_8U), RasterContext(), pBuffer, true);
    EXPECT_EQ(oRaster.mpBuffer, pBuffer);
    EXPECT_TRUE(oRaster.mbOwnsBuffer);
}

void ExpectEmpty(const Raster& oRaster)
{
    EXPECT_EQ(oRaster.mpBuffer, nullptr);
    EXPECT_EQ(oRaster.mnBufferSize, 0U);
    EXPECT_EQ(oRaster.mnWidth, 0U);
    EXPECT_EQ(oRaster.mnTotalWidth, 0U);
    EXPECT_EQ(oRaster.mnTotalHeight, 0U);
    EXPECT_EQ(oRaster.mnMarginX, 0U);
    EXPECT_FALSE(oRaster.mbOwnsBuffer);
}

TEST(Raster, MovesItsBufferAndLeavesAnEmptyOne)
{
    Raster oFrom(RasterInfo(5, 4, 3, eDT_16S), RasterContext(2, 1, 70, 80));
    const unsigned char* pBuffer = oFrom.mpBuffer;
    const Raster oTo(std::move(oFrom));
    EXPECT_EQ(oTo.mpBuffer, pBuffer);
    EXPECT_EQ(oTo.mnWidth, 5U);
    EXPECT_EQ(oTo.mnTotalWidth, 9U);
    EXPECT_EQ(oTo.mnTotalHeight, 6U);
    EXPECT_EQ(oTo.mnOffsetY, 80U);
    EXPECT_EQ(oTo.moDataType, eDT_16S);
    EXPECT_EQ(oTo.mnBufferSize, 324U);
    EXPECT_TRUE(oTo.mbOwnsBuffer);
    ExpectEmpty(oFrom);
}

TEST(Raster, FreesItsOwnBufferWhenAnotherOneIsMovedIn)
{
    Raster oFrom(RasterInfo(5, 4, 3, eDT_16S), RasterContext(2, 1, 70, 80));
    const unsigned char* pBuffer = oFrom.mpBuffer;
    Raster oTo(RasterInfo(1, 1, 1, eDT_8U), RasterContext());
    oTo = std::move(oFrom);
    EXPECT_EQ(oTo.mpBuffer, pBuffer);
    EXPECT_EQ(oTo.mnTotalWidth, 9U);
    EXPECT_EQ(oTo.mnBufferSize, 324U);
    EXPECT_TRUE(oTo.mbOwnsBuffer);
    ExpectEmpty(oFrom);

    Raster& oSame = oTo;
    oTo = std::move(oSame);
    EXPECT_EQ(oTo.mpBuffer, pBuffer);
    EXPECT_EQ(oTo.mnTotalWidth, 9U);
}

TEST(Raster, CannotBeCopied)
{
    EXPECT_FALSE(std::is_copy_constructible_v<Raster>);
    EXPECT_FALSE(std::is_copy_assignable_v<Raster>);
}

}  // namespace
}  // namespace kor::tessel
