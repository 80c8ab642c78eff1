#include "processes/qrdfilters/parallelio/findoptimalrectangle.h"

#include <gtest/gtest.h>

#include <utility>

#include "platform/exception/exception.h"

namespace kor::parallelio
{
namespace
{

/// An image of which only the shape matters.
class Shaped : public datasources::IRasterReader, public datasources::IRasterWriter
{
public:
    Shaped(unsigned int nWidth, unsigned int nHeight, unsigned int nTileWidth,
           unsigned int nTileHeight)
        : mnWidth(nWidth), mnHeight(nHeight), mnTileWidth(nTileWidth), mnTileHeight(nTileHeight)
    {
    }
    Shaped(unsigned int nWidth, unsigned int nHeight) : Shaped(nWidth, nHeight, nWidth, nHeight) {}

    unsigned int GetWidth() const override { return mnWidth; }
    unsigned int GetHeight() const override { return mnHeight; }
    unsigned int GetChannelCount() const override { return 1; }
    tessel::DataType GetDataType() const override { return tessel::eDT_8U; }
    void ReadRaster(tessel::Raster* /*poRaster*/) override {}
    void WriteRaster(const tessel::Raster* /*poRaster*/) override {}
    unsigned int GetTileWidth() const override { return mnTileWidth; }
    unsigned int GetTileHeight() const override { return mnTileHeight; }

private:
    unsigned int mnWidth;
    unsigned int mnHeight;
    unsigned int mnTileWidth;
    unsigned int mnTileHeight;
};

using Size = std::pair<unsigned int, unsigned int>;

Size Optimal(Shaped* poReader, Shaped* poWriter, unsigned int nMaxPixels,
             const ProcessWindow& oWindow = {})
{
    Size oSize(77, 77);
    FindOptimalRasterSize(poReader, poWriter, nMaxPixels, oSize.first, oSize.second, oWindow);
    return oSize;
}

TEST(FindOptimalRasterSize, ImageBelowTheBudgetIsOneBlock)
{
    Shaped oImage(100, 50, 16, 16);
    EXPECT_EQ(Optimal(&oImage, &oImage, 5001), Size(100, 50));
    EXPECT_NE(Optimal(&oImage, &oImage, 5000), Size(100, 50));
}

TEST(FindOptimalRasterSize, OneRowBeyondTheBudgetIsOneBlockOfOneRow)
{
    Shaped oRow(1000, 1);
    EXPECT_EQ(Optimal(&oRow, &oRow, 500), Size(1000, 1));
    EXPECT_EQ(Optimal(&oRow, nullptr, 500), Size(1000, 1));
}

TEST(FindOptimalRasterSize, PlainImagesAreCutIntoStrips)
{
    Shaped oImage(100, 1000);
    EXPECT_EQ(Optimal(&oImage, &oImage, 1050), Size(100, 10));
    EXPECT_EQ(Optimal(&oImage, nullptr, 1050), Size(100, 10));
    EXPECT_EQ(Optimal(nullptr, &oImage, 1050), Size(100, 10));
    EXPECT_EQ(Optimal(&oImage, &oImage, 100), Size(100, 1));
    EXPECT_EQ(Optimal(&oImage, &oImage, 0), Size(100, 1));
}

TEST(FindOptimalRasterSize, TiledImagesAreCutIntoSquareGroupsOfTiles)
{
    Shaped oImage(1000, 1000, 10, 10);
    // 950 / 100 = 9 tiles, three by three.
    EXPECT_EQ(Optimal(&oImage, &oImage, 950), Size(30, 30));
    EXPECT_EQ(Optimal(&oImage, nullptr, 950), Size(30, 30));
    // 7 tiles: two down, three across.
    EXPECT_EQ(Optimal(&oImage, &oImage, 700), Size(30, 20));
}

TEST(FindOptimalRasterSize, GroupsOfTilesAreNoWiderThanTheImage)
{
    Shaped oImage(25, 10000, 10, 10);
    // 100 tiles, ten by ten, but three tiles cover the width: 33 down.
    EXPECT_EQ(Optimal(&oImage, &oImage, 10000), Size(30, 330));
}

TEST(FindOptimalRasterSize, GroupsFollowTheGreaterTile)
{
    Shaped oSmall(1000, 1000, 10, 10);
    Shaped oGreat(1000, 1000, 20, 20);
    // 400 pixels a tile either way: 4 tiles, two by two, of the output's size.
    EXPECT_EQ(Optimal(&oSmall, &oGreat, 1600), Size(40, 40));
    EXPECT_EQ(Optimal(&oGreat, &oSmall, 1600), Size(20, 20));
    // Less than one input tile: one output tile.
    EXPECT_EQ(Optimal(&oGreat, &oSmall, 300), Size(10, 10));
}

TEST(FindOptimalRasterSize, TileBeyondTheBudgetIsCutIntoStrips)
{
    Shaped oImage(1000, 1000, 100, 100);
    EXPECT_EQ(Optimal(&oImage, &oImage, 350), Size(100, 3));
    EXPECT_EQ(Optimal(&oImage, &oImage, 50), Size(100, 1));
}

TEST(FindOptimalRasterSize, StripsAreWholeTileRowsWhereOneSideIsTiled)
{
    Shaped oPlain(100, 1000);
    Shaped oTiled(100, 1000, 10, 16);
    EXPECT_EQ(Optimal(&oPlain, &oTiled, 5050), Size(100, 48));
    EXPECT_EQ(Optimal(&oTiled, &oPlain, 5050), Size(100, 48));
    // A strip lower than a tile stays as it is.
    EXPECT_EQ(Optimal(&oPlain, &oTiled, 1500), Size(100, 15));
    EXPECT_EQ(Optimal(&oTiled, &oPlain, 1500), Size(100, 15));
}

TEST(FindOptimalRasterSize, OutputOfAnotherWidthChangesTheHeightOfStrips)
{
    Shaped oIn(200, 1000);
    Shaped oOut(100, 1000);
    // 10 rows of the wider image; half of them for the narrower output.
    EXPECT_EQ(Optimal(&oIn, &oOut, 2000), Size(100, 5));
    EXPECT_EQ(Optimal(&oOut, &oIn, 2000), Size(200, 10));
    // 1 row, halved to 0, is still one.
    EXPECT_EQ(Optimal(&oIn, &oOut, 201), Size(100, 1));
}

TEST(FindOptimalRasterSize, WindowLimitsTheInput)
{
    Shaped oImage(100, 1000);
    EXPECT_EQ(Optimal(&oImage, nullptr, 1050, {0, 0, 50, 500}), Size(50, 21));
    EXPECT_EQ(Optimal(&oImage, nullptr, 100000, {0, 0, 50, 500}), Size(50, 500));
    EXPECT_EQ(Optimal(&oImage, nullptr, 1000000, {0, 0, 500, 5000}), Size(100, 1000));
}

TEST(FindOptimalRasterSize, WindowWithoutWidthOrHeightIsIgnored)
{
    Shaped oImage(100, 1000);
    EXPECT_EQ(Optimal(&oImage, nullptr, 1050, {0, 0, 0, 500}), Size(100, 10));
    EXPECT_EQ(Optimal(&oImage, nullptr, 1050, {0, 0, 50, 0}), Size(100, 10));
}

TEST(FindOptimalRasterSize, ProductsDoNotWrap)
{
    Shaped oHuge(4000000000U, 4000000000U);
    EXPECT_EQ(Optimal(&oHuge, &oHuge, 4294967295U), Size(4000000000U, 1));
    Shaped oTiled(4000000000U, 4000000000U, 100000, 100000);
    EXPECT_EQ(Optimal(&oTiled, &oTiled, 4294967295U), Size(100000, 42949));
}

TEST(FindOptimalRasterSize, TileSizeOfZeroCountsAsOne)
{
    Shaped oImage(100, 100, 0, 0);
    EXPECT_EQ(Optimal(&oImage, &oImage, 100), Size(10, 10));
}

void ExpectNoSize(Shaped* poReader, Shaped* poWriter)
{
    try
    {
        Optimal(poReader, poWriter, 100);
        FAIL() << "nothing was thrown";
    }
    catch (const Exception& oError)
    {
        EXPECT_EQ(oError.GetMessage(), "Raster size is 0!");
        EXPECT_EQ(oError.GetFile(), "processes/qrdfilters/parallelio/findoptimalrectangle");
        EXPECT_EQ(oError.GetLine(), 46U);
    }
}

TEST(FindOptimalRasterSize, ImageWithoutPixelsIsRefused)
{
    Shaped oFull(10, 10);
    Shaped oNoWidth(0, 10);
    Shaped oNoHeight(10, 0);
    ExpectNoSize(&oNoWidth, &oFull);
    ExpectNoSize(&oNoHeight, nullptr);
    ExpectNoSize(&oFull, &oNoWidth);
    ExpectNoSize(nullptr, &oNoHeight);
}

}  // namespace
}  // namespace kor::parallelio
