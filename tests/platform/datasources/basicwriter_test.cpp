#include "platform/datasources/basicwriter.h"

#include <gtest/gtest.h>

#include "platform/datasources/basicreader.h"
#include "tests/support/exceptions.h"
#include "tests/support/memorydataset.h"

namespace kor::datasources
{
namespace
{

using test::BlankRaster;
using test::Image;
using test::MemoryDataset;
using test::MessageOf;
using test::RasterOf;

using Bytes = Image<std::uint8_t>;

/// A channel of bytes as it lies.
Bytes ChannelOf(MemoryDataset& oDataset, unsigned int nChannel)
{
    const unsigned char* pFirst = oDataset.At(nChannel, 0, 0);
    return Bytes(oDataset.GetWidth(),
                 std::vector<std::uint8_t>(
                     pFirst, pFirst + std::size_t{oDataset.GetWidth()} * oDataset.GetHeight()));
}

void WriteAt(BasicWriter& oWriter, const Bytes& oImage, std::uint32_t nX, std::uint32_t nY)
{
    const auto poRaster = RasterOf(oImage);
    poRaster->mnOffsetX = nX;
    poRaster->mnOffsetY = nY;
    oWriter.WriteRaster(poRaster.get());
}

TEST(BasicWriter, WritesTheInnerAreaAtItsOffset)
{
    MemoryDataset oDataset(3, 2, {tessel::eDT_8U});
    BasicWriter oWriter(&oDataset, {1});
    const auto poRaster = RasterOf(Bytes{{9, 9, 9, 9}, {9, 1, 2, 9}, {9, 9, 9, 9}}, {1, 1});
    poRaster->mnOffsetX = 1;
    poRaster->mnOffsetY = 1;
    oWriter.WriteRaster(poRaster.get());
    EXPECT_EQ(ChannelOf(oDataset, 1), (Bytes{{0, 0, 0}, {0, 1, 2}}));
}

TEST(BasicWriter, DropsRowsAndColumnsOutsideTheImage)
{
    MemoryDataset oDataset(3, 2, {tessel::eDT_8U});
    BasicWriter oWriter(&oDataset, {1});
    WriteAt(oWriter, {{1, 2, 3}, {4, 5, 6}}, 2, 1);
    WriteAt(oWriter, {{7, 7, 7}}, 0, 2);
    WriteAt(oWriter, {{7, 7, 7}, {7, 7, 7}}, 0, 0xFFFFFFFF);
    WriteAt(oWriter, {{7}}, 3, 0);
    WriteAt(oWriter, {{7, 7}}, 0xFFFFFFFF, 0);
    EXPECT_EQ(ChannelOf(oDataset, 1), (Bytes{{0, 0, 0}, {0, 0, 1}}));
}

TEST(BasicWriter, BlockLargerThanTheImageIsCutOff)
{
    MemoryDataset oDataset(2, 1, {tessel::eDT_8U});
    BasicWriter oWriter(&oDataset, {1});
    WriteAt(oWriter, {{1, 2, 3}, {4, 5, 6}, {7, 8, 9}}, 0, 0);
    EXPECT_EQ(ChannelOf(oDataset, 1), (Bytes{{1, 2}}));
}

TEST(BasicWriter, ChannelsOfThePixelGoToTheChannelsOfTheList)
{
    MemoryDataset oDataset(2, 1, {tessel::eDT_8U, tessel::eDT_8U, tessel::eDT_8U});
    BasicWriter oWriter(&oDataset, {3, 1});
    const auto poRaster = RasterOf(Bytes{{1, 2, 3, 4}}, {}, 2);
    oWriter.WriteRaster(poRaster.get());
    EXPECT_EQ(ChannelOf(oDataset, 1), (Bytes{{2, 4}}));
    EXPECT_EQ(ChannelOf(oDataset, 2), (Bytes{{0, 0}}));
    EXPECT_EQ(ChannelOf(oDataset, 3), (Bytes{{1, 3}}));
}

TEST(BasicWriter, ReadsBackWhatItHasWritten)
{
    MemoryDataset oDataset(3, 1, {tessel::eDT_8U});
    BasicWriter oWriter(&oDataset, {1});
    WriteAt(oWriter, {{1, 2, 3}}, 0, 0);
    oWriter.SetMargin(0, 0, 1);
    const auto poRaster = BlankRaster(3, 1, 1, tessel::eDT_8U, {1, 0});
    oWriter.ReadRaster(poRaster.get());
    EXPECT_EQ(Bytes(5, std::vector(poRaster->mpBuffer, poRaster->mpBuffer + 5)),
              (Bytes{{2, 1, 2, 3, 2}}));
}

TEST(BasicWriter, BitsAreTakenPacked)
{
    MemoryDataset oDataset(3, 2, {tessel::eDT_BIT, tessel::eDT_BIT});
    BasicWriter oWriter(&oDataset, {1, 2});
    const auto poRaster = BlankRaster(3, 2, 2, tessel::eDT_BIT, {1, 0});
    // Pixels of two bits, five in a row with the margins: 11|10 01 00|11 and 00|01 10 11|00.
    poRaster->mpBuffer[0] = 0b11100100;
    poRaster->mpBuffer[1] = 0b11000110;
    poRaster->mpBuffer[2] = 0b11000000;
    oWriter.WriteRaster(poRaster.get());
    EXPECT_EQ(ChannelOf(oDataset, 1), (Bytes{{1, 0, 0}, {0, 1, 1}}));
    EXPECT_EQ(ChannelOf(oDataset, 2), (Bytes{{0, 1, 0}, {1, 0, 1}}));
}

TEST(BasicWriter, RandomBlocksOfAllTypesComeBack)
{
    test::Random oRandom(2);
    test::ForEachElementType(
        [&]<class T>()
        {
            for (int i = 0; i < 20; ++i)
            {
                const tessel::DataType oType = typedispatch::RealDataType<T>();
                MemoryDataset oDataset(7, 5, {oType, oType});
                BasicWriter oWriter(&oDataset, {2, 1});
                const auto poOut = test::RandomRaster(7, 5, 2, oType,
                                                      {static_cast<std::uint32_t>(oRandom() % 3),
                                                       static_cast<std::uint32_t>(oRandom() % 3)},
                                                      test::Samples::Special, oRandom);
                oWriter.WriteRaster(poOut.get());
                BasicReader oReader(&oDataset, {2, 1});
                const std::unique_ptr<tessel::Raster> poBack(oReader.GetRaster(0));
                for (std::uint32_t y = 0; y < 5; ++y)
                {
                    ASSERT_EQ(
                        std::memcmp(poBack->GetPixel(0, y), poOut->GetPixel(0, y), 14 * sizeof(T)),
                        0);
                }
            }
        });
}

TEST(BasicWriter, RasterOfAnotherKindIsRefused)
{
    MemoryDataset oDataset(3, 1, {tessel::eDT_8U});
    BasicWriter oWriter(&oDataset, {1});
    const auto poShorts = BlankRaster(2, 2, 1, tessel::eDT_16S);
    EXPECT_EQ(MessageOf<DataException>([&] { oWriter.WriteRaster(poShorts.get()); }),
              "memory: the raster has samples of eDT_16S, its channels have eDT_8U");
    const auto poTwo = BlankRaster(2, 2, 2, tessel::eDT_8U);
    EXPECT_EQ(MessageOf<DataException>([&] { oWriter.WriteRaster(poTwo.get()); }),
              "memory: the raster has 2 channels and not 1");
    EXPECT_THROW(oWriter.WriteRaster(nullptr), DataException);
}

TEST(BasicWriter, DatasetOpenedForReadingIsRefused)
{
    MemoryDataset oDataset(3, 1, {tessel::eDT_8U});
    oDataset.mbReadOnly = true;
    EXPECT_EQ(MessageOf<IOException>([&] { BasicWriter(&oDataset, {1}); }),
              "memory: opened for reading");
}

TEST(BasicWriter, ChannelsHaveToExistAndToHaveOneType)
{
    MemoryDataset oDataset(3, 1, {tessel::eDT_8U, tessel::eDT_8S});
    EXPECT_THROW(BasicWriter(&oDataset, {3}), IOException);
    EXPECT_THROW(BasicWriter(&oDataset, {1, 2}), DataException);
    EXPECT_THROW(BasicWriter(&oDataset, {}), DataException);
    EXPECT_THROW(BasicWriter(nullptr, {1}), DataException);
}

TEST(BasicWriter, FailuresOfTheDatasetAreReported)
{
    MemoryDataset oDataset(1, 1, {tessel::eDT_8U});
    BasicWriter oWriter(&oDataset, {1});
    oDataset.mbBroken = true;
    EXPECT_EQ(MessageOf<IOException>([&] { WriteAt(oWriter, {{1}}, 0, 0); }), "memory: broken");
    oDataset.mbOutOfMemory = true;
    EXPECT_EQ(MessageOf<IOException>([&] { WriteAt(oWriter, {{1}}, 0, 0); }),
              "memory: out of memory");
}

TEST(BasicWriter, AuxiliaryDataChangeItsOwnChannelsAndTheFileMetadata)
{
    MemoryDataset oDataset(1, 1, {tessel::eDT_8U, tessel::eDT_8U, tessel::eDT_8U});
    AuxiliaryData oBefore;
    oBefore.SetChannelDescription("one", 1);
    oBefore.SetChannelDescription("two", 2);
    oDataset.SetAuxiliaryData(oBefore);

    BasicWriter oWriter(&oDataset, {3, 2});
    AuxiliaryData oData = oWriter.GetAuxiliaryData();
    EXPECT_EQ(oData.GetChannelDescription(2), "two");
    oData.SetChannelDescription("new third", 1);
    oData.SetChannelDescription("new second", 2);
    oData.SetFileMetadata({{"key", "value"}});
    oWriter.SetAuxiliaryData(oData);

    EXPECT_EQ(oDataset.GetAuxiliaryData().GetChannelDescription(1), "one");
    EXPECT_EQ(oDataset.GetAuxiliaryData().GetChannelDescription(2), "new second");
    EXPECT_EQ(oDataset.GetAuxiliaryData().GetChannelDescription(3), "new third");
    EXPECT_EQ(oDataset.GetAuxiliaryData().GetFileMetadata(),
              (AuxiliaryData::Metadata{{"key", "value"}}));
    oData.SetChannelDescription("none", 3);
    EXPECT_EQ(MessageOf<IOException>([&] { oWriter.SetAuxiliaryData(oData); }),
              "memory: the auxiliary data have an entry for channel 3 of 2");
}

TEST(BasicWriter, FlushReachesTheDataset)
{
    MemoryDataset oDataset(1, 1, {tessel::eDT_8U});
    BasicWriter oWriter(&oDataset, {1});
    oWriter.Flush();
    EXPECT_EQ(oDataset.mnFlushes, 1);
}

}  // namespace
}  // namespace kor::datasources
