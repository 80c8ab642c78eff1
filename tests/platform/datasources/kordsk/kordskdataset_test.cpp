#include "platform/datasources/kordsk/kordskdataset.h"

#include <gtest/gtest.h>

#include <limits>
#include <thread>

#include "tests/support/exceptions.h"
#include "tests/support/kordskfiles.h"
#include "tests/support/temporarydirectory.h"

namespace kor::datasources
{
namespace
{

using test::BlankRaster;
using test::Image;
using test::kAllTypes;
using test::MemoryDataset;
using test::MessageOf;
using test::NewKordsk;
using test::OpenKordsk;
using test::RasterOf;
using test::ReadBlock;
using test::SameBytes;

using Bytes = Image<std::uint8_t>;

class KordskDatasetTest : public ::testing::Test
{
protected:
    test::TemporaryDirectory moDirectory;
    const std::string moFile = moDirectory.File("image.kdk");
};

/// Random blocks of nChannels channels from nFirst on, as both sides read and write them.
void ExchangeRandomBlocks(MemoryDataset& oMemory, KordskDataset& oKordsk, unsigned int nFirst,
                          unsigned int nChannels, test::Random& oRandom)
{
    std::vector<unsigned int> vnChannels;
    for (unsigned int c = 0; c < nChannels; ++c)
    {
        vnChannels.push_back(nFirst + nChannels - 1 - c);
    }
    const auto oUpTo = [&](std::uint32_t n) { return static_cast<std::uint32_t>(oRandom() % n); };
    for (int i = 0; i < 8; ++i)
    {
        const std::uint32_t nX = oUpTo(oMemory.GetWidth());
        const std::uint32_t nY = oUpTo(oMemory.GetHeight());
        const tessel::RasterInfo oSize(1 + oUpTo(oMemory.GetWidth()),
                                       1 + oUpTo(oMemory.GetHeight()), nChannels, {});
        const tessel::RasterContext oContext(oUpTo(4), oUpTo(4), nX, nY);
        const auto poBlock = ReadBlock(oKordsk, vnChannels, oSize, oContext);
        ASSERT_TRUE(SameBytes(*poBlock, *ReadBlock(oMemory, vnChannels, oSize, oContext)))
            << oSize.mnWidth << " x " << oSize.mnHeight << " at " << nX << ", " << nY;
        // The block goes somewhere else.
        poBlock->mnOffsetX = oUpTo(oMemory.GetWidth());
        poBlock->mnOffsetY = oUpTo(oMemory.GetHeight());
        BasicWriter(&oKordsk, vnChannels).WriteRaster(poBlock.get());
        BasicWriter(&oMemory, vnChannels).WriteRaster(poBlock.get());
    }
    const tessel::RasterInfo oWhole(oMemory.GetWidth(), oMemory.GetHeight(), nChannels, {});
    EXPECT_TRUE(SameBytes(*ReadBlock(oKordsk, vnChannels, oWhole),
                          *ReadBlock(oMemory, vnChannels, oWhole)));
}

TEST_F(KordskDatasetTest, AllTypesComeBackFromOneFileInBothLayouts)
{
    test::Random oRandom(1);
    constexpr std::pair<std::uint32_t, std::uint32_t> kSizes[] = {{1, 1}, {259, 30}, {13, 517}};
    int nFile = 0;
    for (const auto& [nWidth, nHeight] : kSizes)
    {
        for (const char* pszLayout : {"BAND", "TILE"})
        {
            MemoryDataset oMemory(nWidth, nHeight, kAllTypes);
            oMemory.FillRandom(oRandom);
            const std::string oFile = moDirectory.File(std::to_string(++nFile));
            test::CopyChannels(oMemory, *NewKordsk(oFile, pszLayout));
            const auto poKordsk = OpenKordsk(oFile);
            ASSERT_EQ(poKordsk->GetChannelCount(), kAllTypes.size());
            for (unsigned int nChannel = 1; nChannel <= kAllTypes.size(); ++nChannel)
            {
                EXPECT_EQ(poKordsk->GetChannelType(nChannel), kAllTypes[nChannel - 1]);
                const tessel::RasterInfo oSize(nWidth, nHeight, 1, {});
                EXPECT_TRUE(SameBytes(*ReadBlock(*poKordsk, {nChannel}, oSize),
                                      *ReadBlock(oMemory, {nChannel}, oSize)))
                    << pszLayout << " " << nWidth << " x " << nHeight << " channel " << nChannel;
            }
        }
    }
}

TEST_F(KordskDatasetTest, RandomBlocksOfSeveralChannelsComeBack)
{
    test::Random oRandom(2);
    int nFile = 0;
    for (const char* pszLayout : {"BAND", "TILE"})
    {
        for (const auto& [nWidth, nHeight] : {std::pair(21U, 18U), std::pair(530U, 300U)})
        {
            std::vector<tessel::DataType> voTypes;
            for (const tessel::DataType& oType : kAllTypes)
            {
                voTypes.insert(voTypes.end(), 3, oType);
            }
            if (nWidth > 100)
            {
                voTypes.resize(6);  // bits and bytes: larger ones add nothing but time
            }
            MemoryDataset oMemory(nWidth, nHeight, voTypes);
            oMemory.FillRandom(oRandom);
            const auto poKordsk = NewKordsk(moDirectory.File(std::to_string(++nFile)), pszLayout);
            test::CopyChannels(oMemory, *poKordsk);
            for (unsigned int nFirst = 1; nFirst <= voTypes.size(); nFirst += 3)
            {
                ExchangeRandomBlocks(oMemory, *poKordsk, nFirst, 1, oRandom);
                ExchangeRandomBlocks(oMemory, *poKordsk, nFirst, 3, oRandom);
            }
        }
    }
}

TEST_F(KordskDatasetTest, PixelsNeverWrittenAreZeros)
{
    const auto poKordsk = NewKordsk(moFile);
    EXPECT_EQ(poKordsk->GetWidth(), 0U);
    EXPECT_EQ(poKordsk->CreateChannels({3, 2, 2, tessel::eDT_8U}), 1U);
    EXPECT_EQ(poKordsk->CreateChannels({3, 2, 1, tessel::eDT_8U}), 3U);
    const auto poRaster = ReadBlock(*poKordsk, {1, 3}, {3, 2, 2, {}});
    EXPECT_EQ(test::ImageOf<std::uint8_t>(*poRaster), Bytes(6, std::vector<std::uint8_t>(12, 0)));
}

TEST_F(KordskDatasetTest, DescriptionsMetadataAndPlaceOfAnyBytesComeBack)
{
    std::string oAllBytes;
    for (int i = 0; i < 256; ++i)
    {
        oAllBytes += static_cast<char>(i);
    }
    AuxiliaryData oData;
    oData.SetFileMetadata({{"", ""}, {"a=b", "c=d\n\r\\"}, {oAllBytes, oAllBytes}});
    oData.SetChannelDescription("two\nlines, \xC3\xBC=\\x41\t\x7F", 1);
    oData.SetChanMetadata({{"offset", "1"}, {"channel", "2"}}, 1);
    oData.SetChannelNoData(-0.1, 1);
    oData.SetChannelDescription(oAllBytes, 2);
    oData.SetChannelNoData(std::numeric_limits<double>::denorm_min(), 2);
    oData.SetChannelNoData(-std::numeric_limits<double>::infinity(), 3);
    ogc::cs::GeocodingInfo oPlace({1e-300, 1.0 / 3.0, -0.0, 4.6e6, 1e300, -10.0});
    oPlace.SetProjection("PROJCS[\"x=y\",\n]");
    {
        const auto poKordsk = NewKordsk(moFile);
        poKordsk->CreateChannels({3, 2, 3, tessel::eDT_8U});
        poKordsk->SetAuxiliaryData(oData);
        poKordsk->SetGeocodingInfo(oPlace);
        EXPECT_EQ(poKordsk->GetAuxiliaryData(), oData);
    }
    const auto poKordsk = OpenKordsk(moFile);
    EXPECT_EQ(poKordsk->GetAuxiliaryData(), oData);
    EXPECT_EQ(poKordsk->GetGeocodingInfo(), oPlace);
}

TEST_F(KordskDatasetTest, WriterChangesItsOwnChannelsAndTheFileMetadata)
{
    const auto poKordsk = NewKordsk(moFile);
    poKordsk->CreateChannels({3, 2, 2, tessel::eDT_8U});
    AuxiliaryData oData;
    oData.SetChannelDescription("first", 1);
    oData.SetChannelDescription("second", 2);
    poKordsk->SetAuxiliaryData(oData);
    BasicWriter oWriter(poKordsk.get(), {2});
    AuxiliaryData oOwn = oWriter.GetAuxiliaryData();
    EXPECT_EQ(oOwn.GetChannelDescription(1), "second");
    oOwn.SetChannelDescription("changed", 1);
    oOwn.SetFileMetadata({{"k", "v"}});
    oWriter.SetAuxiliaryData(oOwn);
    EXPECT_EQ(poKordsk->GetAuxiliaryData().GetChannelDescription(1), "first");
    EXPECT_EQ(poKordsk->GetAuxiliaryData().GetChannelDescription(2), "changed");
    EXPECT_EQ(poKordsk->GetAuxiliaryData().GetFileMetadata(),
              (AuxiliaryData::Metadata{{"k", "v"}}));
}

TEST_F(KordskDatasetTest, PlaceStaysReadableWhenItIsReplaced)
{
    const auto poKordsk = NewKordsk(moFile);
    const ogc::cs::GeocodingInfo& oBefore = poKordsk->GetGeocodingInfo();
    poKordsk->SetGeocodingInfo(ogc::cs::GeocodingInfo(5, 1, 0, -1));
    EXPECT_EQ(oBefore, ogc::cs::GeocodingInfo());
    EXPECT_EQ(poKordsk->GetGeocodingInfo().GetXOffset(), 5);
}

TEST_F(KordskDatasetTest, TileIsTheWholeImageOrOneOfTheTiles)
{
    const auto poBand = NewKordsk(moFile, "BAND");
    poBand->CreateChannels({700, 300, 1, tessel::eDT_8U});
    EXPECT_EQ(BasicReader(poBand.get(), {1}).GetTileWidth(), 700U);
    EXPECT_EQ(BasicWriter(poBand.get(), {1}).GetTileHeight(), 300U);
    const auto poTile = NewKordsk(moDirectory.File("tile"), "TILE");
    poTile->CreateChannels({700, 200, 1, tessel::eDT_8U});
    EXPECT_EQ(BasicReader(poTile.get(), {1}).GetTileWidth(), 256U);
    EXPECT_EQ(BasicWriter(poTile.get(), {1}).GetTileHeight(), 200U);
}

TEST_F(KordskDatasetTest, ChannelsOfAnotherSizeAreRefused)
{
    const auto poKordsk = NewKordsk(moFile);
    EXPECT_EQ(MessageOf<DataException>(
                  [&] {
                      poKordsk->CreateChannels({0, 2, 1, tessel::eDT_8U});
                  }),
              moFile + ": an image of 0 x 2 pixels cannot be made");
    poKordsk->CreateChannels({3, 2, 1, tessel::eDT_8U});
    EXPECT_EQ(MessageOf<DataException>(
                  [&] {
                      poKordsk->CreateChannels({2, 3, 1, tessel::eDT_8U});
                  }),
              moFile + ": 2 x 3 pixels do not fit the image of 3 x 2");
    EXPECT_EQ(MessageOf<DataException>([&] { poKordsk->CreateBitmap(2, 3); }),
              moFile + ": 2 x 3 pixels do not fit the image of 3 x 2");
    EXPECT_EQ(poKordsk->GetChannelCount(), 1U);
    EXPECT_EQ(poKordsk->GetBitmapCount(), 0U);
}

TEST_F(KordskDatasetTest, ChannelsThatNoFileCanHoldAreRefused)
{
    const auto poKordsk = NewKordsk(moFile);
    const std::uint32_t nHuge = 0xFFFFFFFF;
    EXPECT_EQ(MessageOf<DataException>(
                  [&] {
                      poKordsk->CreateChannels({nHuge, nHuge, 1, tessel::eDT_8U});
                  }),
              moFile + ": 4294967295 x 4294967295 pixels of eDT_8U are larger than any file");
    EXPECT_EQ(MessageOf<DataException>(
                  [&] {
                      poKordsk->CreateChannels({nHuge, 0x70000000, 2, tessel::eDT_8U});
                  }),
              moFile + ": the file would become larger than any can be");
    EXPECT_EQ(MessageOf<DataException>(
                  [&] {
                      poKordsk->CreateChannels({1, 1, 65536, tessel::eDT_8U});
                  }),
              moFile + ": 65536 cannot be added to the 0 there are; a file holds up to 65535");
    EXPECT_THROW(poKordsk->CreateChannels({1, 1, 0, tessel::eDT_8U}), DataException);
    const tessel::DataType oComplexByte(8, false, false, 8, 0, true);
    EXPECT_EQ(MessageOf<DataException>(
                  [&] {
                      poKordsk->CreateChannels({1, 1, 1, oComplexByte});
                  }),
              moFile + ": there are no samples of a type of 8 bits, unsigned, complex");
    EXPECT_EQ(poKordsk->GetWidth(), 0U);
}

TEST_F(KordskDatasetTest, DatasetOpenedForReadingRefusesChanges)
{
    {
        const auto poKordsk = NewKordsk(moFile);
        poKordsk->CreateChannels({3, 2, 1, tessel::eDT_8U});
        poKordsk->CreateBitmap(3, 2);
    }
    const std::string oBefore = test::BytesOf(moFile);
    const auto poKordsk = OpenKordsk(moFile, 0);
    EXPECT_EQ(MessageOf<IOException>(
                  [&] {
                      poKordsk->CreateChannels({3, 2, 1, tessel::eDT_8U});
                  }),
              moFile + ": cannot add channels: the file was opened for reading");
    EXPECT_THROW(poKordsk->CreateBitmap(3, 2), IOException);
    EXPECT_THROW(poKordsk->SetAuxiliaryData({}), IOException);
    EXPECT_THROW(poKordsk->SetBitmapAuxiliaryData({}, 1), IOException);
    EXPECT_THROW(poKordsk->SetGeocodingInfo({}), IOException);
    EXPECT_EQ(MessageOf<IOException>([&] { BasicWriter(poKordsk.get(), {1}); }),
              moFile + ": cannot write pixels: the file was opened for reading");
    EXPECT_THROW(BasicWriter(poKordsk.get(), 1), IOException);
    EXPECT_NO_THROW(poKordsk->Flush());
    EXPECT_EQ(test::BytesOf(moFile), oBefore);
}

TEST_F(KordskDatasetTest, ChannelsAndBitmapsThatDoNotExistAreRefused)
{
    const auto poKordsk = NewKordsk(moFile);
    poKordsk->CreateChannels({3, 2, 1, tessel::eDT_8U});
    EXPECT_EQ(MessageOf<IOException>([&] { poKordsk->GetChannelType(2); }),
              moFile + ": there is no channel 2; the file has 1, numbered from 1");
    EXPECT_THROW(poKordsk->GetChannelType(0), IOException);
    EXPECT_EQ(MessageOf<IOException>([&] { poKordsk->OpenBitmap(1, false); }),
              moFile + ": there is no bitmap 1; the file has 0, numbered from 1");
    EXPECT_THROW(poKordsk->GetBitmapAuxiliaryData(1), IOException);
    AuxiliaryData oData;
    oData.SetFileMetadata({{"k", "v"}});
    oData.SetChannelDescription("none", 2);
    EXPECT_THROW(poKordsk->SetAuxiliaryData(oData), IOException);
    EXPECT_TRUE(poKordsk->GetAuxiliaryData().GetFileMetadata().empty());
}

TEST_F(KordskDatasetTest, HandlesOnOneFileShareItsState)
{
    const auto poOne = NewKordsk(moFile);
    const auto poOther = OpenKordsk(moFile, 1);
    std::filesystem::create_symlink(moFile, moDirectory.File("link"));
    const auto poReader = OpenKordsk(moDirectory.File("link"), 0);
    EXPECT_EQ(poReader->GetFileName(), moDirectory.File("link"));
    poOne->CreateChannels({2, 1, 1, tessel::eDT_8U});
    EXPECT_EQ(poOther->CreateChannels({2, 1, 1, tessel::eDT_8U}), 2U);
    EXPECT_EQ(poReader->GetChannelCount(), 2U);
    BasicWriter(poOther.get(), {2}).WriteRaster(RasterOf(Bytes{{7, 8}}).get());
    EXPECT_EQ(test::ImageOf<std::uint8_t>(*ReadBlock(*poReader, {2}, {2, 1, 1, {}})),
              (Bytes{{7, 8}}));
}

TEST_F(KordskDatasetTest, ThreadsReadAndWriteTheirChannelsWhileOthersAreAdded)
{
    constexpr std::uint32_t kWidth = 67;
    constexpr std::uint32_t kHeight = 40;
    constexpr unsigned int kThreads = 4;
    const auto poKordsk = NewKordsk(moFile);
    poKordsk->CreateChannels({kWidth, kHeight, kThreads, tessel::eDT_BIT});
    const auto oWork = [&](unsigned int nThread)
    {
        // Blocks of two threads share bytes of channel 1, and only those are at stake there.
        test::Random oRandom(nThread);
        const auto poMine = nThread % 2 == 0 ? OpenKordsk(moFile, 1) : nullptr;
        BasicWriter oWriter(poMine ? poMine.get() : poKordsk.get(), {nThread});
        BasicWriter oShared(poMine ? poMine.get() : poKordsk.get(), {1});
        for (int i = 0; i < 30; ++i)
        {
            const auto poOwn = BlankRaster(kWidth, kHeight, 1, tessel::eDT_BIT);
            for (std::uint64_t k = 0; k < poOwn->mnBufferSize; ++k)
            {
                poOwn->mpBuffer[k] = static_cast<unsigned char>(oRandom());
            }
            const auto poBack = BlankRaster(kWidth, kHeight, 1, tessel::eDT_BIT);
            if (nThread != 1)
            {
                oWriter.WriteRaster(poOwn.get());
                oWriter.ReadRaster(poBack.get());
                constexpr std::size_t kWholeBytes = kWidth * kHeight / 8;
                EXPECT_EQ(std::memcmp(poBack->mpBuffer, poOwn->mpBuffer, kWholeBytes), 0);
            }
            auto poColumn = BlankRaster(1, kHeight, 1, tessel::eDT_BIT);
            std::memset(poColumn->mpBuffer, i % 2 == 1 ? 0xFF : 0, poColumn->mnBufferSize);
            poColumn->mnOffsetX = nThread;
            oShared.WriteRaster(poColumn.get());
        }
    };
    {
        std::vector<std::jthread> voThreads;
        for (unsigned int nThread = 1; nThread <= kThreads; ++nThread)
        {
            voThreads.emplace_back(oWork, nThread);
        }
        for (int i = 0; i < 10; ++i)
        {
            poKordsk->CreateChannels({kWidth, kHeight, 1, tessel::eDT_8U});
        }
    }
    // 1 in columns 1 to 4 of every row: all threads wrote ones last, and none undid another's.
    const auto poFirst = ReadBlock(*poKordsk, {1}, {8, kHeight, 1, {}});
    for (std::uint32_t y = 0; y < kHeight; ++y)
    {
        EXPECT_EQ(poFirst->mpBuffer[y], 0b01111000);
    }
    EXPECT_EQ(OpenKordsk(moFile)->GetChannelCount(), kThreads + 10U);
}

TEST_F(KordskDatasetTest, FileCutOffWhileItIsOpenIsAnErrorAndNotACrash)
{
    const auto poKordsk = NewKordsk(moFile);
    poKordsk->CreateChannels({1000, 100, 1, tessel::eDT_8U});
    std::filesystem::resize_file(moFile, 50000);
    EXPECT_EQ(MessageOf<IOException>(
                  [&] {
                      ReadBlock(*poKordsk, {1}, {1000, 100, 1, {}});
                  }),
              moFile +
                  ": cannot read the file: the file ends at byte 50000, before what is "
                  "looked for");
}

}  // namespace
}  // namespace kor::datasources
