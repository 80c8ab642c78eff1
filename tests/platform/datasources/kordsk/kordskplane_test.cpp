#include "platform/datasources/kordsk/kordskplane.h"

#include <gtest/gtest.h>

namespace kor::datasources
{
namespace
{

KordskPlane Plane(const tessel::DataType& oType, std::uint32_t nTileWidth = 0,
                  std::uint32_t nTileHeight = 0)
{
    KordskPlane oPlane;
    oPlane.moType = oType;
    oPlane.mnOffset = 4096;
    oPlane.mnTileWidth = nTileWidth;
    oPlane.mnTileHeight = nTileHeight;
    return oPlane;
}

TEST(KordskPlane, RowsOfBitsTakeWholeBytes)
{
    EXPECT_EQ(RowBytes(tessel::eDT_BIT, 8), 1U);
    EXPECT_EQ(RowBytes(tessel::eDT_BIT, 9), 2U);
    EXPECT_EQ(RowBytes(tessel::eDT_C64R, 3), 48U);
    EXPECT_EQ(RowBytes(tessel::eDT_C64R, 0xFFFFFFFF), 0xFFFFFFFF0U);
}

TEST(KordskPlane, SizesThatOverflowAreNone)
{
    EXPECT_EQ(PlaneBytes(tessel::eDT_16U, 3, 5), 30U);
    EXPECT_EQ(PlaneBytes(tessel::eDT_8U, 0x80000000, 0xFFFFFFFF), 0x7FFFFFFF80000000U);
    EXPECT_EQ(PlaneBytes(tessel::eDT_8U, 0xFFFFFFFF, 0xFFFFFFFF), std::nullopt);
    EXPECT_EQ(PlaneBytes(tessel::eDT_C64R, 0xFFFFFFFF, 0xFFFFFFFF), std::nullopt);
}

TEST(KordskPlane, WindowOfABandIsOnePiece)
{
    const auto voPieces = PiecesOf(Plane(tessel::eDT_16S), 10, 6, {3, 2, 4, 3});
    ASSERT_EQ(voPieces.size(), 1U);
    EXPECT_EQ(voPieces[0].mnOffset, 4096U + 2 * 20 + 6);
    EXPECT_EQ(voPieces[0].mnPitch, 20U);
    EXPECT_EQ(voPieces[0].mnRowBytes, 8U);
}

TEST(KordskPlane, BitsOfAWindowBeginInsideAByte)
{
    const auto voPieces = PiecesOf(Plane(tessel::eDT_BIT), 20, 2, {11, 1, 6, 1});
    ASSERT_EQ(voPieces.size(), 1U);
    EXPECT_EQ(voPieces[0].mnOffset, 4096U + 3 + 1);
    EXPECT_EQ(voPieces[0].mnFirstBit, 3U);
    EXPECT_EQ(voPieces[0].mnRowBytes, 2U);  // bits 3 to 8
}

// Tiles of 8 x 2 in an image of 11 x 3: 16 and 6 samples in the first row of tiles, 8 and 3 below.
TEST(KordskPlane, WindowOverTilesIsAPieceATile)
{
    const auto voPieces = PiecesOf(Plane(tessel::eDT_8U, 8, 2), 11, 3, {7, 1, 3, 2});
    ASSERT_EQ(voPieces.size(), 4U);
    constexpr std::uint64_t kOffsets[] = {8 + 7, 16 + 3, 22 + 7, 22 + 8};
    constexpr std::uint64_t kPitches[] = {8, 3, 8, 3};
    constexpr std::uint64_t kRowBytes[] = {1, 2, 1, 2};
    for (std::size_t i = 0; i < 4; ++i)
    {
        EXPECT_EQ(voPieces[i].mnOffset, 4096 + kOffsets[i]) << i;
        EXPECT_EQ(voPieces[i].mnPitch, kPitches[i]) << i;
        EXPECT_EQ(voPieces[i].mnRowBytes, kRowBytes[i]) << i;
        EXPECT_EQ(voPieces[i].moWindow.mnHeight, 1U) << i;
    }
    EXPECT_EQ(voPieces[3].moWindow.mnX, 8U);
    EXPECT_EQ(voPieces[3].moWindow.mnY, 2U);
}

TEST(KordskPlane, GapIsTheLowestThatIsLargeEnough)
{
    EXPECT_EQ(FindGap({}, 100), 4096U);
    EXPECT_EQ(FindGap({{4096, 1}}, 100), 8192U);
    EXPECT_EQ(FindGap({{20480, 5000}, {4096, 4096}}, 12288), 8192U);
    EXPECT_EQ(FindGap({{20480, 5000}, {4096, 4097}}, 12288), 28672U);
    EXPECT_EQ(FindGap({{4096, 20000}, {8192, 1}}, 1), 24576U);
}

}  // namespace
}  // namespace kor::datasources
