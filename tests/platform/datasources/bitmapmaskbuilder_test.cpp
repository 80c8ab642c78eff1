#include "platform/datasources/bitmapmaskbuilder.h"

#include <gtest/gtest.h>

#include "tests/support/exceptions.h"
#include "tests/support/kordskfiles.h"
#include "tests/support/temporarydirectory.h"

namespace kor::datasources
{
namespace
{

using test::Image;
using test::MessageOf;

using Bytes = Image<std::uint8_t>;

class BitmapMaskBuilderTest : public ::testing::Test
{
protected:
    BitmapMaskBuilderTest()
    {
        mpoKordsk->CreateBitmap(3, 3);
        mpoKordsk->CreateBitmap(3, 3);
        const auto poRaster = test::RasterOf(Bytes{{1, 0, 0}, {0, 1, 0}, {0, 0, 1}});
        BasicWriter(mpoKordsk.get(), 2).WriteRaster(poRaster.get());
    }

    /// All pixels of the mask for a raster of 2 x 1 pixels of two channels.
    Bytes MaskBytes(bool bFlag, const tessel::RasterContext& oContext) const
    {
        const tessel::Raster oRaster({2, 1, 2, tessel::eDT_32R}, oContext);
        const BitmapMaskBuilder oBuilder(mpoKordsk.get(), 2, bFlag);
        const std::unique_ptr<tessel::Mask> poMask(oBuilder.BuildMask(oRaster));
        EXPECT_EQ(poMask->mnWidth, 2U);
        EXPECT_EQ(poMask->mnMarginX, oContext.mnMarginX);
        EXPECT_EQ(poMask->mnOffsetX, oContext.mnOffsetX);
        std::vector<std::uint8_t> vnBytes;
        for (std::uint32_t i = 0; i < poMask->mnBitCount; ++i)
        {
            vnBytes.push_back((poMask->moBits[i >> 3] >> (7 - (i & 7))) & 1U);
        }
        return Bytes(poMask->mnTotalWidth, vnBytes);
    }

    test::TemporaryDirectory moDirectory;
    const test::Kordsk mpoKordsk = test::NewKordsk(moDirectory.File("image.kdk"));
};

TEST_F(BitmapMaskBuilderTest, PixelIsValidWhereItsBitIsSet)
{
    EXPECT_EQ(MaskBytes(false, {0, 0, 0, 1}), (Bytes{{0, 1}}));
    EXPECT_EQ(MaskBytes(false, {1, 1, 1, 1}), (Bytes{{1, 0, 0, 0}, {0, 1, 0, 0}, {0, 0, 1, 1}}));
}

TEST_F(BitmapMaskBuilderTest, FlagInvertsTheSense)
{
    EXPECT_EQ(MaskBytes(true, {0, 0, 0, 1}), (Bytes{{1, 0}}));
    EXPECT_EQ(MaskBytes(true, {1, 1, 1, 1}), (Bytes{{0, 1, 1, 1}, {1, 0, 1, 1}, {1, 1, 0, 0}}));
}

TEST_F(BitmapMaskBuilderTest, BitmapThatDoesNotExistIsRefused)
{
    EXPECT_THROW(BitmapMaskBuilder(mpoKordsk.get(), 3, false), IOException);
    EXPECT_EQ(MessageOf<DataException>([] { BitmapMaskBuilder(nullptr, 1, false); }),
              "poDataset is invalid pointer");
}

}  // namespace
}  // namespace kor::datasources
