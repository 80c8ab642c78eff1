#include "processes/qrdfilters/filteringmaskbuilder.h"

#include <gtest/gtest.h>

#include <cmath>

#include "platform/datasources/basicreader.h"
#include "platform/exception/exception.h"
#include "tests/support/blocks.h"
#include "tests/support/memorydataset.h"

namespace kor::filters
{
namespace
{

using tessel::Mask;
using tessel::Raster;
using test::Image;
using test::Margins;

/// The mask as bytes, margins included.
Image<unsigned char> Drawn(const Mask& oMask)
{
    const std::unique_ptr<Raster> poBytes(oMask.CreateRaster());
    return Image<unsigned char>(
        poBytes->mnTotalWidth,
        std::vector<unsigned char>(poBytes->mpBuffer, poBytes->mpBuffer + poBytes->mnBufferSize));
}

Image<unsigned char> MaskOfRaster(const tessel::IMaskBuilder& oBuilder, const Raster& oRaster)
{
    const std::unique_ptr<Mask> poMask(oBuilder.BuildMask(oRaster));
    EXPECT_EQ(poMask->mnOffsetX, oRaster.mnOffsetX);
    EXPECT_EQ(poMask->mnOffsetY, oRaster.mnOffsetY);
    EXPECT_EQ(poMask->mnMarginX, oRaster.mnMarginX);
    EXPECT_EQ(poMask->mnMarginY, oRaster.mnMarginY);
    return Drawn(*poMask);
}

std::unique_ptr<Raster> BlockAt(std::uint32_t nX, std::uint32_t nY, std::uint32_t nWidth,
                                std::uint32_t nHeight, Margins oMargins)
{
    auto poBlock = std::make_unique<Raster>(tessel::RasterInfo(nWidth, nHeight, 1, tessel::eDT_8U),
                                            tessel::RasterContext(oMargins.x, oMargins.y, nX, nY));
    std::memset(poBlock->mpBuffer, 7, poBlock->mnBufferSize);
    return poBlock;
}

template <class T>
Image<unsigned char> ByValue(const std::vector<float>& vfBackground,
                             const std::vector<float>& vfFail, const Image<T>& oImage,
                             std::uint32_t nChannels = 1)
{
    return MaskOfRaster(FilteringMaskBuilder(vfBackground, vfFail),
                        *test::RasterOf(oImage, {}, nChannels));
}

TEST(FilteringMaskBuilder, WindowMasksByImagePositionMarginsIncluded)
{
    // The block covers columns 3..5 and rows 10..11, its margins reach columns 2..6.
    const FilteringMaskBuilder oBuilder({4, 10, 3, 1}, {}, {});
    EXPECT_EQ(MaskOfRaster(oBuilder, *BlockAt(3, 10, 3, 2, {1, 0})),
              (Image<unsigned char>{{0, 0, 1, 1, 1}, {0, 0, 0, 0, 0}}));
}

TEST(FilteringMaskBuilder, BlockOutsideTheWindowIsMaskedMarginsIncluded)
{
    // The margin reaches column 9, inside the window, but the block itself misses it by more than
    // a column.
    const FilteringMaskBuilder oBuilder({0, 0, 10, 10}, {}, {});
    EXPECT_EQ(MaskOfRaster(oBuilder, *BlockAt(11, 0, 2, 1, {2, 0})),
              (Image<unsigned char>{{0, 0, 0, 0, 0, 0}}));
}

// The test for a missed window is inclusive, and then the position of each pixel decides.
TEST(FilteringMaskBuilder, MarginOfABlockThatTouchesTheWindowIsValid)
{
    const FilteringMaskBuilder oBuilder({0, 0, 10, 10}, {}, {});
    EXPECT_EQ(MaskOfRaster(oBuilder, *BlockAt(10, 0, 2, 1, {0, 0})),
              (Image<unsigned char>{{0, 0}}));
    EXPECT_EQ(MaskOfRaster(oBuilder, *BlockAt(10, 0, 2, 1, {1, 0})),
              (Image<unsigned char>{{1, 0, 0, 0}}));
    const FilteringMaskBuilder oRight({5, 5, 10, 10}, {}, {});
    EXPECT_EQ(MaskOfRaster(oRight, *BlockAt(3, 5, 2, 1, {1, 0})),
              (Image<unsigned char>{{0, 0, 0, 1}}));
    EXPECT_EQ(MaskOfRaster(oRight, *BlockAt(2, 5, 2, 1, {2, 0})),
              (Image<unsigned char>{{0, 0, 0, 0, 0, 0}}));
    EXPECT_EQ(MaskOfRaster(oRight, *BlockAt(5, 3, 1, 2, {0, 1})),
              (Image<unsigned char>{{0}, {0}, {0}, {1}}));
}

TEST(FilteringMaskBuilder, WindowWithoutFourEntriesIsOff)
{
    for (const std::vector<int>& vnWindow :
         {std::vector<int>{}, std::vector<int>{0, 0, 0}, std::vector<int>{0, 0, 0, 0, 0}})
    {
        EXPECT_EQ(MaskOfRaster(FilteringMaskBuilder(vnWindow, {}, {}), *BlockAt(0, 0, 2, 1, {})),
                  (Image<unsigned char>{{1, 1}}));
    }
    EXPECT_EQ(MaskOfRaster(FilteringMaskBuilder({0, 0, 0, 0}, {}, {}), *BlockAt(0, 0, 2, 1, {})),
              (Image<unsigned char>{{0, 0}}));
}

TEST(FilteringMaskBuilder, WindowAtTheEndOfTheNumbersDoesNotWrap)
{
    const FilteringMaskBuilder oBuilder({2147483640, 0, 100, 1}, {}, {});
    EXPECT_EQ(MaskOfRaster(oBuilder, *BlockAt(2147483639, 0, 3, 1, {})),
              (Image<unsigned char>{{0, 1, 1}}));
}

TEST(FilteringMaskBuilder, BackgroundRangeIncludesItsEnds)
{
    EXPECT_EQ(ByValue<unsigned char>({250, 260}, {}, {{249, 250, 255}}),
              (Image<unsigned char>{{1, 0, 0}}));
    EXPECT_EQ(ByValue<short>({-2, 3}, {}, {{-3, -2, 0, 3, 4}}),
              (Image<unsigned char>{{1, 0, 0, 0, 1}}));
}

TEST(FilteringMaskBuilder, OneBackgroundValueIsARangeOfItself)
{
    EXPECT_EQ(ByValue<unsigned short>({7}, {}, {{6, 7, 8}}), (Image<unsigned char>{{1, 0, 1}}));
    EXPECT_EQ(ByValue<unsigned char>({0, 0}, {}, {{0, 1}}), (Image<unsigned char>{{0, 1}}));
}

TEST(FilteringMaskBuilder, MoreThanTwoBackgroundValuesAreLikeTheFirstTwo)
{
    EXPECT_EQ(ByValue<unsigned char>({1, 2, 9}, {}, {{1, 2, 3, 9}}),
              (Image<unsigned char>{{0, 0, 1, 1}}));
}

TEST(FilteringMaskBuilder, OnlyTheFirstFailValueCounts)
{
    EXPECT_EQ(ByValue<unsigned char>({}, {5, 6}, {{5, 6}}), (Image<unsigned char>{{0, 1}}));
}

TEST(FilteringMaskBuilder, FailValueIsMetWithinTheFloatEpsilon)
{
    // 2^-23 is 1.1920928955078125e-07; the difference must be smaller.
    EXPECT_EQ(ByValue<double>({}, {0}, {{0x1p-23, 0x1.fffffp-24, -0x1p-24}}),
              (Image<unsigned char>{{1, 0, 0}}));
    EXPECT_EQ(ByValue<float>({}, {0}, {{0x1p-23F, 0x1p-24F}}), (Image<unsigned char>{{1, 0}}));
}

TEST(FilteringMaskBuilder, DoublesAreComparedAsDoubles)
{
    // As float both samples would be 16777216.
    EXPECT_EQ(ByValue<double>({16777216}, {}, {{16777216.0, 16777216.5}}),
              (Image<unsigned char>{{0, 1}}));
}

TEST(FilteringMaskBuilder, NotANumberFiresNoTest)
{
    EXPECT_EQ(ByValue<float>({-1e30F, 1e30F}, {0}, {{NAN, 1}}), (Image<unsigned char>{{1, 0}}));
}

TEST(FilteringMaskBuilder, OneChannelMasksThePixel)
{
    EXPECT_EQ(ByValue<unsigned char>({}, {9}, {{1, 9, 1, 1, 1, 1}}, 3),
              (Image<unsigned char>{{0, 1}}));
}

TEST(FilteringMaskBuilder, WithoutTestsAllPixelsOfTheFiveTypesAreValid)
{
    EXPECT_EQ(ByValue<unsigned char>({}, {}, {{0}}), (Image<unsigned char>{{1}}));
    EXPECT_EQ(ByValue<unsigned short>({}, {}, {{0}}), (Image<unsigned char>{{1}}));
    EXPECT_EQ(ByValue<short>({}, {}, {{0}}), (Image<unsigned char>{{1}}));
    EXPECT_EQ(ByValue<float>({}, {}, {{NAN}}), (Image<unsigned char>{{1}}));
    EXPECT_EQ(ByValue<double>({}, {}, {{NAN}}), (Image<unsigned char>{{1}}));
}

TEST(FilteringMaskBuilder, OtherTypesAreRefusedEvenWithoutTests)
{
    for (const tessel::DataType& oType :
         {tessel::eDT_8S, tessel::eDT_32U, tessel::eDT_32S, tessel::eDT_64S, tessel::eDT_64U,
          tessel::eDT_C32R, tessel::eDT_BIT})
    {
        try
        {
            const std::vector<float> vfNone;
            FilteringMaskBuilder(vfNone, vfNone).BuildMask(*test::BlankRaster(1, 1, 1, oType));
            ADD_FAILURE() << "nothing was thrown";
        }
        catch (const ParameterException& oError)
        {
            EXPECT_EQ(oError.GetParameterName(), "");
            EXPECT_EQ(static_cast<int>(oError.GetType()), 1);
            EXPECT_EQ(oError.GetFirstText(),
                      "Unknown raster data type contained in provided IRaster input instance.");
            EXPECT_EQ(oError.GetSecondText(), "");
            EXPECT_EQ(oError.GetMessage(), "");
            EXPECT_EQ(oError.GetFile(), "");
            EXPECT_EQ(oError.GetFunction(), "");
            EXPECT_EQ(oError.GetLine(), 0U);
        }
    }
}

TEST(FilteringMaskBuilder, BitmapIsReadWithTheBlocksMarginsAndContinuedAtTheEdge)
{
    test::MemoryDataset oBitmap(3, 1, {tessel::eDT_8U});
    oBitmap.Sample<unsigned char>(1, 0, 0) = 2;
    oBitmap.Sample<unsigned char>(1, 1, 0) = 0;
    oBitmap.Sample<unsigned char>(1, 2, 0) = 1;
    datasources::BasicReader oReader(&oBitmap, {1});
    const FilteringMaskBuilder oBuilder(&oReader, {}, {});
    EXPECT_EQ(MaskOfRaster(oBuilder, *BlockAt(0, 0, 2, 1, {1, 1})),
              (Image<unsigned char>{{1, 1, 0, 1}, {1, 1, 0, 1}, {1, 1, 0, 1}}));
    EXPECT_EQ(oReader.GetMarginX(), 1U);
    EXPECT_EQ(oReader.GetMarginY(), 1U);
    EXPECT_EQ(oReader.GetEdgeMode(), 2);
}

TEST(FilteringMaskBuilder, ValuesOnlyRemovePixelsOfTheBitmap)
{
    test::MemoryDataset oBitmap(3, 1, {tessel::eDT_8U});
    oBitmap.Sample<unsigned char>(1, 0, 0) = 1;
    oBitmap.Sample<unsigned char>(1, 1, 0) = 0;
    oBitmap.Sample<unsigned char>(1, 2, 0) = 1;
    datasources::BasicReader oReader(&oBitmap, {1});
    const FilteringMaskBuilder oBuilder(&oReader, {5}, {});
    EXPECT_EQ(MaskOfRaster(oBuilder, *test::RasterOf(Image<unsigned char>{{5, 6, 6}})),
              (Image<unsigned char>{{0, 0, 1}}));
}

TEST(FilteringMaskBuilder, ErrorOfTheReaderIsPassedOn)
{
    test::MemoryDataset oBitmap(3, 1, {tessel::eDT_8U});
    datasources::BasicReader oReader(&oBitmap, {1});
    oBitmap.mbBroken = true;
    EXPECT_THROW(FilteringMaskBuilder(&oReader, {}, {}).BuildMask(*BlockAt(0, 0, 2, 1, {})),
                 IOException);
}

TEST(FilteringMaskBuilder, CopiesKeepTheTests)
{
    const FilteringMaskBuilder oBuilder({0, 0, 1, 1}, {}, {});
    const FilteringMaskBuilder oCopy(oBuilder);
    EXPECT_EQ(MaskOfRaster(oCopy, *BlockAt(0, 0, 2, 1, {})), (Image<unsigned char>{{1, 0}}));
}

}  // namespace
}  // namespace kor::filters
