#include "platform/datasources/basicreader.h"

#include <gtest/gtest.h>

#include <iterator>

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

using Bytes = Image<std::uint8_t>;

/// An image of bytes with one channel.
void Draw(const Bytes& oImage, MemoryDataset& oDataset)
{
    oDataset.CreateChannels({static_cast<std::uint32_t>(oImage.Columns()),
                             static_cast<std::uint32_t>(oImage.Rows()), 1, tessel::eDT_8U});
    std::copy(oImage.Samples().begin(), oImage.Samples().end(), oDataset.At(1, 0, 0));
}

/// All samples of a block of bytes, its margins too.
Bytes Everything(const tessel::Raster& oRaster)
{
    return Bytes(
        oRaster.GetRowSamples(),
        std::vector<std::uint8_t>(
            oRaster.mpBuffer, oRaster.mpBuffer + oRaster.GetRowSamples() * oRaster.mnTotalHeight));
}

tessel::Raster Block(std::uint32_t nWidth, std::uint32_t nHeight,
                     const tessel::RasterContext& oContext)
{
    tessel::Raster oRaster({nWidth, nHeight, 1, tessel::eDT_8U}, oContext);
    std::memset(oRaster.mpBuffer, 0xA5, oRaster.mnBufferSize);
    return oRaster;
}

Bytes Read(IRasterAccess& oReader, std::uint32_t nWidth, std::uint32_t nHeight,
           const tessel::RasterContext& oContext)
{
    tessel::Raster oRaster = Block(nWidth, nHeight, oContext);
    oReader.ReadRaster(&oRaster);
    return Everything(oRaster);
}

/// The drawing from which most tests read.
class BasicReaderTest : public ::testing::Test
{
protected:
    BasicReaderTest()
    {
        Draw({{11, 12, 13, 14}, {21, 22, 23, 24}, {31, 32, 33, 34}}, moDataset);
        mpoReader = std::make_unique<BasicReader>(&moDataset, std::vector{1U});
    }

    Bytes ReadWithMode(int nEdgeMode, std::uint32_t nWidth, std::uint32_t nHeight,
                       const tessel::RasterContext& oContext)
    {
        mpoReader->SetMargin(0, 0, nEdgeMode);
        return Read(*mpoReader, nWidth, nHeight, oContext);
    }

    MemoryDataset moDataset;
    std::unique_ptr<BasicReader> mpoReader;
};

TEST_F(BasicReaderTest, ShowsTheDatasetsGeometryAndType)
{
    EXPECT_EQ(mpoReader->GetWidth(), 4U);
    EXPECT_EQ(mpoReader->GetHeight(), 3U);
    EXPECT_EQ(mpoReader->GetChannelCount(), 1U);
    EXPECT_EQ(mpoReader->GetDataType(), tessel::eDT_8U);
    EXPECT_EQ(mpoReader->GetTileWidth(), 4U);
    EXPECT_EQ(mpoReader->GetTileHeight(), 3U);
    EXPECT_EQ(mpoReader->GetMarginX(), 0U);
    EXPECT_EQ(mpoReader->GetMarginY(), 0U);
    ASSERT_EQ(mpoReader->GetChannelsInfo().size(), 1U);
    EXPECT_EQ(mpoReader->GetChannelsInfo()[0].mnWidth, 4U);
    EXPECT_EQ(mpoReader->GetChannelsInfo()[0].mnHeight, 3U);
    EXPECT_EQ(mpoReader->GetChannelsInfo()[0].mnChannels, 1U);
    EXPECT_EQ(mpoReader->GetChannelsInfo()[0].moDataType, tessel::eDT_8U);
}

TEST_F(BasicReaderTest, MarginsInsideTheImageHoldItsPixels)
{
    EXPECT_EQ(Read(*mpoReader, 2, 1, {1, 1, 1, 1}),
              (Bytes{{11, 12, 13, 14}, {21, 22, 23, 24}, {31, 32, 33, 34}}));
}

TEST_F(BasicReaderTest, OutsideIsTheNearestEdgePixelAsLongAsNoModeIsSet)
{
    EXPECT_EQ(Read(*mpoReader, 2, 1, {1, 1, 0, 0}),
              (Bytes{{11, 11, 12, 13}, {11, 11, 12, 13}, {21, 21, 22, 23}}));
}

TEST_F(BasicReaderTest, ModeZeroFillsTheOutsideWithZeros)
{
    EXPECT_EQ(ReadWithMode(0, 2, 1, {1, 1, 0, 0}),
              (Bytes{{0, 0, 0, 0}, {0, 11, 12, 13}, {0, 21, 22, 23}}));
}

TEST_F(BasicReaderTest, ModeOneMirrorsWithoutRepeatingTheEdgePixel)
{
    EXPECT_EQ(
        ReadWithMode(1, 2, 1, {2, 1, 2, 2}),
        (Bytes{{21, 22, 23, 24, 23, 22}, {31, 32, 33, 34, 33, 32}, {21, 22, 23, 24, 23, 22}}));
}

TEST_F(BasicReaderTest, MirrorGoesToAndFroOverMarginsLargerThanTheImage)
{
    EXPECT_EQ(ReadWithMode(1, 4, 1, {7, 0, 0, 0}),
              (Bytes{{12, 11, 12, 13, 14, 13, 12, 11, 12, 13, 14, 13, 12, 11, 12, 13, 14, 13}}));
}

TEST_F(BasicReaderTest, MirrorOfOnePixelIsThatPixel)
{
    MemoryDataset oDataset;
    Draw({{7}}, oDataset);
    BasicReader oReader(&oDataset, {1});
    oReader.SetMargin(0, 0, 1);
    EXPECT_EQ(Read(oReader, 1, 1, {2, 1, 0, 0}),
              (Bytes{{7, 7, 7, 7, 7}, {7, 7, 7, 7, 7}, {7, 7, 7, 7, 7}}));
}

TEST_F(BasicReaderTest, BlockBeyondTheEdgeIsContinued)
{
    EXPECT_EQ(ReadWithMode(0, 4, 2, {0, 0, 2, 2}), (Bytes{{33, 34, 0, 0}, {0, 0, 0, 0}}));
    EXPECT_EQ(ReadWithMode(1, 4, 2, {0, 0, 2, 2}), (Bytes{{33, 34, 33, 32}, {23, 24, 23, 22}}));
    EXPECT_EQ(ReadWithMode(2, 4, 2, {0, 0, 2, 2}), (Bytes{{33, 34, 34, 34}, {33, 34, 34, 34}}));
}

TEST_F(BasicReaderTest, BlockWhollyOutsideIsContinued)
{
    EXPECT_EQ(ReadWithMode(0, 2, 2, {0, 0, 4, 3}), (Bytes{{0, 0}, {0, 0}}));
    EXPECT_EQ(ReadWithMode(1, 2, 2, {0, 0, 4, 3}), (Bytes{{23, 22}, {13, 12}}));
    EXPECT_EQ(ReadWithMode(2, 2, 2, {0, 0, 4, 3}), (Bytes{{34, 34}, {34, 34}}));
}

// A row offset made from -1 is read as the largest unsigned one.
TEST_F(BasicReaderTest, LargestOffsetLiesBehindTheLowerEdge)
{
    EXPECT_EQ(ReadWithMode(2, 4, 1, {0, 0, 0, 0xFFFFFFFF}), (Bytes{{31, 32, 33, 34}}));
    EXPECT_EQ(ReadWithMode(0, 4, 1, {0, 0, 0, 0xFFFFFFFF}), (Bytes{{0, 0, 0, 0}}));
}

TEST_F(BasicReaderTest, BlockWithoutPixelsIsNotTouched)
{
    EXPECT_NO_THROW(Read(*mpoReader, 0, 0, {0, 0, 0, 0}));
    EXPECT_EQ(moDataset.mnPixelsRead, 0U);
}

TEST_F(BasicReaderTest, EachPixelIsReadOnce)
{
    ReadWithMode(1, 4, 3, {50, 50, 0, 0});
    EXPECT_EQ(moDataset.mnPixelsRead, 12U);
}

TEST_F(BasicReaderTest, RastersMarginsGovernAndNotTheReaders)
{
    mpoReader->SetMargin(9, 9, 0);
    EXPECT_EQ(Read(*mpoReader, 1, 1, {0, 0, 1, 1}), (Bytes{{22}}));
}

/// The sample that a block shows at an image position, found one step at a time.
std::int64_t Reflected(std::int64_t i, std::int64_t n)
{
    while (n > 1 && (i < 0 || i >= n))
    {
        i = i < 0 ? -i : 2 * (n - 1) - i;
    }
    return n == 1 ? 0 : i;
}

template <class T>
void ExpectBlock(MemoryDataset& oDataset, const std::vector<unsigned int>& oChannels, int nMode,
                 const tessel::Raster& oRaster)
{
    const auto nWidth = static_cast<std::int64_t>(oDataset.GetWidth());
    const auto nHeight = static_cast<std::int64_t>(oDataset.GetHeight());
    for (std::int64_t y = 0; y < oRaster.mnTotalHeight; ++y)
    {
        for (std::int64_t x = 0; x < oRaster.mnTotalWidth; ++x)
        {
            std::int64_t nX = x + oRaster.mnOffsetX - oRaster.mnMarginX;
            std::int64_t nY = y + oRaster.mnOffsetY - oRaster.mnMarginY;
            const bool bInside = nX >= 0 && nX < nWidth && nY >= 0 && nY < nHeight;
            nX = nMode == 1 ? Reflected(nX, nWidth) : std::clamp<std::int64_t>(nX, 0, nWidth - 1);
            nY = nMode == 1 ? Reflected(nY, nHeight) : std::clamp<std::int64_t>(nY, 0, nHeight - 1);
            for (std::size_t c = 0; c < oChannels.size(); ++c)
            {
                const T xExpected =
                    nMode == 0 && !bInside
                        ? T(0)
                        : oDataset.Sample<T>(oChannels[c], static_cast<std::size_t>(nX),
                                             static_cast<std::size_t>(nY));
                const T xActual =
                    oRaster.GetPixelAs<T>(x - oRaster.mnMarginX, y - oRaster.mnMarginY)[c];
                ASSERT_TRUE(test::SameSample(xActual, xExpected))
                    << "mode " << nMode << ", pixel " << x << ", " << y << ", channel " << c;
            }
        }
    }
}

TEST(BasicReader, RandomBlocksAgreeWithTheDefinitionForAllTypesAndModes)
{
    test::Random oRandom(1);
    test::ForEachElementType(
        [&]<class T>()
        {
            for (int i = 0; i < 60; ++i)
            {
                const tessel::DataType oType = typedispatch::RealDataType<T>();
                MemoryDataset oDataset(1 + oRandom() % 9, 1 + oRandom() % 9, {oType, oType, oType});
                oDataset.FillRandom(oRandom);
                const std::vector<unsigned int> oChannels =
                    i % 2 == 0 ? std::vector{3U, 1U} : std::vector{2U, 2U, 1U};
                BasicReader oReader(&oDataset, oChannels);
                const int nMode = i % 3;
                oReader.SetMargin(0, 0, nMode);
                tessel::Raster oRaster({static_cast<std::uint32_t>(oRandom() % 12),
                                        static_cast<std::uint32_t>(oRandom() % 12),
                                        static_cast<std::uint32_t>(oChannels.size()), oType},
                                       {static_cast<std::uint32_t>(oRandom() % 25),
                                        static_cast<std::uint32_t>(oRandom() % 25),
                                        static_cast<std::uint32_t>(oRandom() % 12),
                                        static_cast<std::uint32_t>(oRandom() % 12)});
                oReader.ReadRaster(&oRaster);
                ExpectBlock<T>(oDataset, oChannels, nMode, oRaster);
            }
        });
}

TEST(BasicReader, ComplexSamplesComeWhole)
{
    MemoryDataset oDataset(2, 1, {tessel::eDT_C16S});
    const std::int16_t anSamples[] = {1, -2, 3, -4};
    std::memcpy(oDataset.At(1, 0, 0), anSamples, sizeof(anSamples));
    BasicReader oReader(&oDataset, {1});
    const auto poRaster = BlankRaster(2, 1, 1, tessel::eDT_C16S, {1, 0});
    oReader.ReadRaster(poRaster.get());
    const std::int16_t* pSamples = poRaster->GetPixelAs<std::int16_t>(-1, 0);
    EXPECT_EQ(std::vector(pSamples, pSamples + 8),
              (std::vector<std::int16_t>{1, -2, 1, -2, 3, -4, 3, -4}));
}

TEST(BasicReader, BitsArePackedWithoutGapsBetweenRows)
{
    MemoryDataset oDataset(3, 2, {tessel::eDT_BIT});
    oDataset.Sample<unsigned char>(1, 0, 0) = 1;
    oDataset.Sample<unsigned char>(1, 1, 1) = 1;
    oDataset.Sample<unsigned char>(1, 2, 1) = 1;
    BasicReader oReader(&oDataset, {1});
    const auto poRaster = BlankRaster(3, 2, 1, tessel::eDT_BIT, {1, 0});
    oReader.ReadRaster(poRaster.get());
    // 1|100|0 0|011|1, margins by the nearest pixel.
    EXPECT_EQ(poRaster->mpBuffer[0], 0b11000001);
    EXPECT_EQ(poRaster->mpBuffer[1] & 0b11000000, 0b11000000);
    EXPECT_EQ(poRaster->mpBuffer[2], 0xA5) << "two bytes hold all ten bits";
}

TEST(BasicReader, TilesAreNumberedInRowOrderAndCutOffAtTheEdges)
{
    MemoryDataset oDataset;
    Draw({{11, 12, 13}, {21, 22, 23}, {31, 32, 33}}, oDataset);
    BasicReader oReader(&oDataset, {1});
    oReader.SetTileSize(2, 2);
    const std::vector<Bytes> voTiles = {{{11, 12}, {21, 22}}, {{13}, {23}}, {{31, 32}}, {{33}}};
    for (unsigned int nTile = 0; nTile < 4; ++nTile)
    {
        const std::unique_ptr<tessel::Raster> poRaster(oReader.GetRaster(nTile));
        EXPECT_EQ(Everything(*poRaster), voTiles[nTile]);
        EXPECT_EQ(poRaster->mnOffsetX, nTile % 2 * 2);
        EXPECT_EQ(poRaster->mnOffsetY, nTile / 2 * 2);
    }
}

TEST(BasicReader, TilesHaveTheReadersMargins)
{
    MemoryDataset oDataset;
    Draw({{11, 12, 13}, {21, 22, 23}}, oDataset);
    BasicReader oReader(&oDataset, {1});
    oReader.SetTileSize(3, 1);
    oReader.SetMargin(0, 1, 0);
    const std::unique_ptr<tessel::Raster> poRaster(oReader.GetRaster(1));
    EXPECT_EQ(Everything(*poRaster), (Bytes{{11, 12, 13}, {21, 22, 23}, {0, 0, 0}}));
    EXPECT_EQ(poRaster->mnMarginY, 1U);
}

TEST(BasicReader, TilesAreTheFilesUntilTheyAreSet)
{
    MemoryDataset oDataset(100, 50, {tessel::eDT_8U});
    oDataset.mnTileWidth = 64;
    oDataset.mnTileHeight = 16;
    BasicReader oReader(&oDataset, {1});
    EXPECT_EQ(oReader.GetTileWidth(), 64U);
    EXPECT_EQ(oReader.GetTileHeight(), 16U);
    oReader.SetTileSize(1000, 1);
    EXPECT_EQ(oReader.GetTileWidth(), 100U);
    EXPECT_EQ(oReader.GetTileHeight(), 1U);
}

TEST(BasicReader, IteratorsWalkAllTiles)
{
    MemoryDataset oDataset;
    Draw({{11, 12, 13}, {21, 22, 23}}, oDataset);
    BasicReader oReader(&oDataset, {1});
    oReader.SetTileSize(2, 1);
    std::vector<Bytes> voTiles;
    for (RasterIterator itTile = oReader.Begin(); itTile != oReader.End(); ++itTile)
    {
        const std::unique_ptr<tessel::Raster> poRaster(*itTile);
        voTiles.push_back(Everything(*poRaster));
    }
    EXPECT_EQ(voTiles, (std::vector<Bytes>{{{11, 12}}, {{13}}, {{21, 22}}, {{23}}}));
    EXPECT_EQ(std::distance(oReader.Begin(), oReader.End()), 4);
}

TEST(BasicReader, TileNumberBehindTheLastIsAnError)
{
    MemoryDataset oDataset(3, 3, {tessel::eDT_8U});
    BasicReader oReader(&oDataset, {1});
    oReader.SetTileSize(2, 2);
    EXPECT_EQ(MessageOf<DataException>([&] { oReader.GetRaster(4); }),
              "There is no tile 4; the image has tiles 0 to 3");
}

TEST(BasicReader, EmptyTileAndUnknownEdgeModeAreErrors)
{
    MemoryDataset oDataset(3, 3, {tessel::eDT_8U});
    BasicReader oReader(&oDataset, {1});
    EXPECT_EQ(MessageOf<DataException>([&] { oReader.SetTileSize(0, 2); }),
              "A tile of 0 x 2 pixels holds nothing");
    EXPECT_EQ(MessageOf<DataException>([&] { oReader.SetMargin(1, 1, 3); }),
              "nEdgeMode is 3; it can be 0 (zeros), 1 (mirrored) or 2 (nearest edge pixel)");
    EXPECT_THROW(oReader.SetMargin(1, 1, -1), DataException);
}

TEST_F(BasicReaderTest, RasterOfAnotherKindIsRefused)
{
    const auto poShorts = BlankRaster(2, 2, 1, tessel::eDT_16S);
    EXPECT_EQ(MessageOf<DataException>([&] { mpoReader->ReadRaster(poShorts.get()); }),
              "memory: the raster has samples of eDT_16S, its channels have eDT_8U");
    const auto poTwo = BlankRaster(2, 2, 2, tessel::eDT_8U);
    EXPECT_EQ(MessageOf<DataException>([&] { mpoReader->ReadRaster(poTwo.get()); }),
              "memory: the raster has 2 channels and not 1");
    EXPECT_EQ(MessageOf<DataException>([&] { mpoReader->ReadRaster(nullptr); }),
              "memory: poRaster is invalid pointer");
}

TEST(BasicReader, ChannelsOfDifferentTypesAreRefused)
{
    MemoryDataset oDataset(2, 2, {tessel::eDT_8U, tessel::eDT_16S});
    EXPECT_EQ(MessageOf<DataException>(
                  [&] {
                      BasicReader(&oDataset, {1, 2});
                  }),
              "memory: the channels have different types: channel 1 has eDT_8U, channel 2 has "
              "eDT_16S");
}

TEST(BasicReader, ChannelsHaveToExist)
{
    MemoryDataset oDataset(2, 2, {tessel::eDT_8U, tessel::eDT_8U});
    EXPECT_EQ(MessageOf<IOException>(
                  [&] {
                      BasicReader(&oDataset, {1, 3});
                  }),
              "memory: there is no channel 3; the file has 2, numbered from 1");
    EXPECT_THROW(BasicReader(&oDataset, {0}), IOException);
    EXPECT_EQ(MessageOf<DataException>([&] { BasicReader(&oDataset, {}); }),
              "memory: oChannels is empty; one channel at least is needed");
}

/// A dataset of another kind.
class Nothing : public IDataset
{
public:
    std::string GetFileName() const override { return "nothing"; }
    AuxiliaryData GetAuxiliaryData() const override { return {}; }
    void SetAuxiliaryData(const AuxiliaryData& /*oData*/) override {}
    const ogc::cs::GeocodingInfo& GetGeocodingInfo() const override { return moGeocoding; }
    void SetGeocodingInfo(const ogc::cs::GeocodingInfo& /*oInfo*/) override {}

private:
    ogc::cs::GeocodingInfo moGeocoding;
};

TEST(BasicReader, DatasetHasToHaveChannels)
{
    Nothing oNothing;
    EXPECT_EQ(MessageOf<DataException>([&] { BasicReader(&oNothing, {1}); }),
              "nothing: this dataset has no channels of pixels");
    EXPECT_EQ(MessageOf<DataException>([] { BasicReader(nullptr, {1}); }),
              "poDataset is invalid pointer");
}

TEST_F(BasicReaderTest, FailuresOfTheDatasetAreReported)
{
    moDataset.mbBroken = true;
    EXPECT_EQ(MessageOf<IOException>([&] { Read(*mpoReader, 2, 2, {}); }), "memory: broken");
    moDataset.mbOutOfMemory = true;
    EXPECT_EQ(MessageOf<IOException>([&] { Read(*mpoReader, 2, 2, {}); }), "memory: out of memory");
    EXPECT_EQ(MessageOf<IOException>([&] { mpoReader->GetRaster(0); }), "memory: out of memory");
}

TEST(BasicReader, AuxiliaryDataAreThoseOfItsChannels)
{
    MemoryDataset oDataset(2, 2, {tessel::eDT_8U, tessel::eDT_8U, tessel::eDT_8U});
    AuxiliaryData oData;
    oData.SetChannelDescription("first", 1);
    oData.SetChannelDescription("third", 3);
    oData.SetChannelNoData(5.0, 3);
    oData.SetFileMetadata({{"key", "value"}});
    oDataset.SetAuxiliaryData(oData);
    const BasicReader oReader(&oDataset, {3, 2, 1});

    EXPECT_EQ(oReader.GetAuxiliaryData().GetChannelDescription(1), "third");
    EXPECT_EQ(oReader.GetAuxiliaryData().GetChannelNoData(1), 5.0);
    EXPECT_EQ(oReader.GetAuxiliaryData().GetChannelDescription(2), "");
    EXPECT_EQ(oReader.GetAuxiliaryData().GetChannelDescription(3), "first");
    EXPECT_EQ(oReader.GetAuxiliaryData().GetFileMetadata(),
              (AuxiliaryData::Metadata{{"key", "value"}}));
}

TEST(BasicReader, GeocodingIsTheDatasets)
{
    MemoryDataset oDataset(2, 2, {tessel::eDT_8U});
    oDataset.SetGeocodingInfo({1.0, 2.0, 3.0, -4.0});
    EXPECT_EQ(BasicReader(&oDataset, {1}).GetGeocodingInfo(), oDataset.GetGeocodingInfo());
}

/// A source made of the five methods alone: sample (x, y) is x + 10 * y.
class FiveMethods : public IRasterReader
{
public:
    unsigned int GetWidth() const override { return 3; }
    unsigned int GetHeight() const override { return 2; }
    unsigned int GetChannelCount() const override { return 1; }
    tessel::DataType GetDataType() const override { return tessel::eDT_8U; }
    void ReadRaster(tessel::Raster* poRaster) override
    {
        for (std::uint32_t y = 0; y < poRaster->mnHeight; ++y)
        {
            for (std::uint32_t x = 0; x < poRaster->mnWidth; ++x)
            {
                *poRaster->GetPixel(x, y) = static_cast<unsigned char>(
                    x + poRaster->mnOffsetX + 10 * (y + poRaster->mnOffsetY));
            }
        }
    }
};

TEST(IRasterReader, SourceOfFiveMethodsHasTilesAndIterators)
{
    FiveMethods oReader;
    EXPECT_EQ(oReader.GetTileWidth(), 3U);
    EXPECT_EQ(oReader.GetTileHeight(), 2U);
    EXPECT_EQ(oReader.GetEdgeMode(), 2);
    EXPECT_EQ(oReader.GetGeocodingInfo(), ogc::cs::GeocodingInfo());
    EXPECT_EQ(oReader.GetAuxiliaryData(), AuxiliaryData());
    oReader.SetTileSize(3, 1);
    EXPECT_EQ(std::distance(oReader.Begin(), oReader.End()), 2);
    const std::unique_ptr<tessel::Raster> poRaster(oReader.GetRaster(1));
    EXPECT_EQ(Everything(*poRaster), (Bytes{{10, 11, 12}}));
}

/// An image too large for tiles of one pixel to be numbered.
class HugeSource : public FiveMethods
{
public:
    unsigned int GetWidth() const override { return 1U << 20; }
    unsigned int GetHeight() const override { return 1U << 20; }
};

TEST(IRasterReader, TilesThatCannotBeNumberedOrHeldAreErrors)
{
    HugeSource oReader;
    EXPECT_THROW(oReader.GetRaster(0), DataException) << "the whole image takes 1 TiB";
    oReader.SetTileSize(1, 1);
    EXPECT_THROW(oReader.End(), DataException);
}

}  // namespace
}  // namespace kor::datasources
