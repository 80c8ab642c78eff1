#include "platform/datasources/bitmapreader.h"

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
using test::RasterOf;

using Bytes = Image<std::uint8_t>;

class BitmapReaderTest : public ::testing::Test
{
protected:
    test::TemporaryDirectory moDirectory;
    const std::string moFile = moDirectory.File("image.kdk");
};

/// The bitmap's bytes in the file.
std::string StoredBits(const std::string& oFile, const KordskPlane& oPlane)
{
    return test::BytesOf(oFile).substr(oPlane.mnOffset, oPlane.mnLength);
}

TEST_F(BitmapReaderTest, RowsArePackedOnWholeBytesFromTheMostSignificantBitOn)
{
    const auto poKordsk = test::NewKordsk(moFile);
    EXPECT_EQ(poKordsk->CreateBitmap(10, 3), 1U);
    BasicWriter oWriter(poKordsk.get(), 1);
    EXPECT_EQ(oWriter.GetDataType(), tessel::eDT_8U);
    const auto poRaster = RasterOf(Bytes{{1, 0, 2, 0, 0, 0, 0, 255, 0, 7},
                                         {0, 0, 0, 0, 0, 0, 0, 0, 1, 0},
                                         {1, 1, 1, 1, 1, 1, 1, 1, 1, 1}});
    oWriter.WriteRaster(poRaster.get());
    EXPECT_EQ(StoredBits(moFile, poKordsk->GetDirectory()->mvoBitmaps[0]),
              std::string("\xA1\x40\x00\x80\xFF\xC0", 6));

    BitmapReader oReader(poKordsk.get(), 1);
    EXPECT_EQ(oReader.GetDataType(), tessel::eDT_8U);
    const std::unique_ptr<tessel::Raster> poBack(oReader.GetRaster(0));
    EXPECT_EQ(test::ImageOf<std::uint8_t>(*poBack), (Bytes{{1, 0, 1, 0, 0, 0, 0, 1, 0, 1},
                                                           {0, 0, 0, 0, 0, 0, 0, 0, 1, 0},
                                                           {1, 1, 1, 1, 1, 1, 1, 1, 1, 1}}));
}

TEST_F(BitmapReaderTest, BlockInsideBytesLeavesThePixelsBesideIt)
{
    const auto poKordsk = test::NewKordsk(moFile);
    poKordsk->CreateBitmap(12, 2);
    BasicWriter oWriter(poKordsk.get(), 1);
    const auto poOnes = RasterOf(Bytes(12, std::vector<std::uint8_t>(24, 1)));
    oWriter.WriteRaster(poOnes.get());
    const auto poBlock = RasterOf(Bytes{{0, 1, 0, 0, 1, 0}});
    poBlock->mnOffsetX = 3;
    poBlock->mnOffsetY = 1;
    oWriter.WriteRaster(poBlock.get());
    EXPECT_EQ(StoredBits(moFile, poKordsk->GetDirectory()->mvoBitmaps[0]),
              std::string("\xFF\xF0\xE9\x70", 4));
    const auto poBack = test::BlankRaster(5, 1, 1, tessel::eDT_8U);
    poBack->mnOffsetX = 6;
    poBack->mnOffsetY = 1;
    BitmapReader(poKordsk.get(), 1).ReadRaster(poBack.get());
    EXPECT_EQ(test::ImageOf<std::uint8_t>(*poBack), (Bytes{{0, 1, 0, 1, 1}}));
}

TEST_F(BitmapReaderTest, BitmapsStandBesideChannelsWithNumbersOfTheirOwn)
{
    {
        const auto poKordsk = test::NewKordsk(moFile, "TILE");
        EXPECT_EQ(poKordsk->CreateBitmap(2, 1), 1U);
        EXPECT_EQ(poKordsk->CreateChannels({2, 1, 1, tessel::eDT_BIT}), 1U);
        EXPECT_EQ(poKordsk->CreateBitmap(2, 1), 2U);
        BasicWriter(poKordsk.get(), 2).WriteRaster(RasterOf(Bytes{{0, 1}}).get());
        EXPECT_THROW(poKordsk->CreateBitmap(1, 2), DataException);
    }
    const auto poKordsk = test::OpenKordsk(moFile);
    EXPECT_EQ(poKordsk->GetBitmapCount(), 2U);
    const std::unique_ptr<tessel::Raster> poFirst(BitmapReader(poKordsk.get(), 1).GetRaster(0));
    const std::unique_ptr<tessel::Raster> poSecond(BitmapReader(poKordsk.get(), 2).GetRaster(0));
    EXPECT_EQ(test::ImageOf<std::uint8_t>(*poFirst), (Bytes{{0, 0}}));
    EXPECT_EQ(test::ImageOf<std::uint8_t>(*poSecond), (Bytes{{0, 1}}));
}

TEST_F(BitmapReaderTest, DescriptionOfABitmapIsThatOfChannelOneOfItsWriter)
{
    {
        const auto poKordsk = test::NewKordsk(moFile);
        poKordsk->CreateBitmap(2, 1);
        poKordsk->CreateBitmap(2, 1);
        BasicWriter oWriter(poKordsk.get(), 2);
        AuxiliaryData oData = oWriter.GetAuxiliaryData();
        oData.SetChannelDescription("Layover", 1);
        oData.SetChanMetadata({{"k", "v"}}, 1);
        oData.SetFileMetadata({{"SENSOR", "X"}});
        oWriter.SetAuxiliaryData(oData);
        oData.SetChannelDescription("none", 2);
        EXPECT_THROW(oWriter.SetAuxiliaryData(oData), IOException);
    }
    const auto poKordsk = test::OpenKordsk(moFile);
    const AuxiliaryData oData = BitmapReader(poKordsk.get(), 2).GetAuxiliaryData();
    EXPECT_EQ(oData.GetChannelDescription(1), "Layover");
    EXPECT_EQ(oData.GetChanMetadata(1), (AuxiliaryData::Metadata{{"k", "v"}}));
    EXPECT_EQ(oData.GetFileMetadata(), (AuxiliaryData::Metadata{{"SENSOR", "X"}}));
    EXPECT_EQ(BitmapReader(poKordsk.get(), 1).GetAuxiliaryData().GetChannelDescription(1), "");
}

TEST_F(BitmapReaderTest, RasterOfAnotherTypeIsRefused)
{
    const auto poKordsk = test::NewKordsk(moFile);
    poKordsk->CreateBitmap(2, 1);
    const auto poRaster = test::BlankRaster(2, 1, 1, tessel::eDT_BIT);
    EXPECT_THROW(BasicWriter(poKordsk.get(), 1).WriteRaster(poRaster.get()), DataException);
    EXPECT_THROW(BitmapReader(poKordsk.get(), 1).ReadRaster(poRaster.get()), DataException);
}

TEST_F(BitmapReaderTest, BitmapThatDoesNotExistIsRefused)
{
    const auto poKordsk = test::NewKordsk(moFile);
    poKordsk->CreateBitmap(2, 1);
    for (const unsigned int nBitmap : {0U, 2U})
    {
        const std::string oExpected = moFile + ": there is no bitmap " + std::to_string(nBitmap) +
                                      "; the file has 1, numbered from 1";
        EXPECT_EQ(MessageOf<IOException>([&] { BitmapReader(poKordsk.get(), nBitmap); }),
                  oExpected);
        EXPECT_EQ(MessageOf<IOException>([&] { BasicWriter(poKordsk.get(), nBitmap); }), oExpected);
    }
    EXPECT_EQ(MessageOf<DataException>([] { BitmapReader(nullptr, 1); }),
              "poDataset is invalid pointer");
}

}  // namespace
}  // namespace kor::datasources
