#include "platform/datasources/gdal/gdaldataset.h"

#include <cpl_conv.h>
#include <gdal.h>
#include <gdal_version.h>
#include <gtest/gtest.h>

#include <thread>

#include "platform/datasources/multitypereader.h"
#include "tests/platform/datasources/gdal/gdalfiles.h"

namespace kor::datasources
{
namespace
{

using test::MessageOf;
using test::Random;
using test::RandomRaster;
using test::SameBits;
using test::Samples;

constexpr const char* kTiled = "TILED=YES BLOCKXSIZE=16 BLOCKYSIZE=32 COMPRESS=DEFLATE";

constexpr bool kOldGdal = GDAL_VERSION_NUM < GDAL_COMPUTE_VERSION(3, 7, 0);

class GdalDatasetTest : public test::GdalFilesTest
{
};

bool HasWord(const std::string& oText, const std::string& oWord)
{
    return oText.find(oWord) != std::string::npos;
}

/// The types that a GeoTIFF holds.
const std::vector<tessel::DataType> kTiffTypes = {
    tessel::eDT_8U,   tessel::eDT_8S,   tessel::eDT_16U,  tessel::eDT_16S, tessel::eDT_32U,
    tessel::eDT_32S,  tessel::eDT_32R,  tessel::eDT_64U,  tessel::eDT_64S, tessel::eDT_64R,
    tessel::eDT_C16S, tessel::eDT_C32S, tessel::eDT_C32R, tessel::eDT_C64R};

TEST_F(GdalDatasetTest, SamplesOfAllTypesComeBackToTheBit)
{
    Random oRandom(1);
    for (std::size_t i = 0; i < kTiffTypes.size(); ++i)
    {
        const std::string oFile = File(std::to_string(i) + ".tif");
        const auto poWritten =
            MakeFile(oFile, "GTiff", kTiled, {37, 41, 3, kTiffTypes[i]}, oRandom);
        const auto poRead = ReadFile(oFile);
        EXPECT_EQ(poRead->moDataType, kTiffTypes[i]);
        EXPECT_TRUE(SameBits(*poRead, *poWritten)) << i;
    }
}

TEST_F(GdalDatasetTest, SamplesComeBackThroughEveryFormatThatCanBeMade)
{
    Random oRandom(2);
    const std::vector<std::pair<std::string, std::string>> voFormats = {
        {"GTiff", ""},
        {"GTiff", "INTERLEAVE=BAND"},
        {"GTiff", "COMPRESS=LZW PREDICTOR=2"},
        {"GTiff", "BIGTIFF=YES TILED=YES"},
        {"ENVI", ""},
        {"ENVI", "INTERLEAVE=BIL"},
        {"EHdr", ""},
        {"HFA", ""}};
    for (std::size_t i = 0; i < voFormats.size(); ++i)
    {
        const auto& [oFormat, oOptions] = voFormats[i];
        const std::string oFile = File(std::to_string(i) + (oFormat == "GTiff" ? ".tif" : ".img"));
        const auto poWritten =
            MakeFile(oFile, oFormat, oOptions, {70, 33, 2, tessel::eDT_16S}, oRandom);
        EXPECT_TRUE(SameBits(*ReadFile(oFile), *poWritten)) << oFormat << " " << oOptions;
    }
}

TEST_F(GdalDatasetTest, TypesThatOtherFormatsHaveComeBackToo)
{
    Random oRandom(22);
    const std::vector<std::pair<std::string, tessel::DataType>> voPairs = {
        {"ENVI", tessel::eDT_C32R}, {"ENVI", tessel::eDT_C64R}, {"EHdr", tessel::eDT_8S},
        {"EHdr", tessel::eDT_32R},  {"HFA", tessel::eDT_8S},    {"HFA", tessel::eDT_C32R},
        {"HFA", tessel::eDT_32U}};
    for (std::size_t i = 0; i < voPairs.size(); ++i)
    {
        const std::string oFile = File(std::to_string(i) + ".img");
        const auto poWritten =
            MakeFile(oFile, voPairs[i].first, "", {23, 17, 1, voPairs[i].second}, oRandom);
        EXPECT_TRUE(SameBits(*ReadFile(oFile), *poWritten)) << i;
    }
}

TEST_F(GdalDatasetTest, BlocksWrittenOneByOneMakeTheWholeImage)
{
    Random oRandom(3);
    const auto poWhole = RandomRaster(53, 47, 2, tessel::eDT_32R, {}, Samples::Special, oRandom);
    const auto poDataset = New(File("x.tif"), "GTiff", kTiled);
    poDataset->CreateChannels({53, 47, 2, tessel::eDT_32R});
    BasicWriter oWriter(poDataset.get(), {1, 2});
    for (std::uint32_t nY = 0; nY < 47; nY += 10)
    {
        for (std::uint32_t nX = 0; nX < 53; nX += 9)
        {
            tessel::Raster oBlock({9, 10, 2, tessel::eDT_32R}, {1, 1, nX, nY});
            for (std::uint32_t y = 0; y < std::min(10U, 47 - nY); ++y)
            {
                std::memcpy(oBlock.GetPixel(0, y), poWhole->GetPixel(nX, nY + y),
                            std::min(9U, 53 - nX) * 8);
            }
            oWriter.WriteRaster(&oBlock);
        }
    }
    poDataset->Flush();
    EXPECT_TRUE(SameBits(*ReadFile(File("x.tif")), *poWhole));
}

TEST_F(GdalDatasetTest, MarginsAreReadAcrossTheFilesTiles)
{
    Random oRandom(4);
    const auto poWhole =
        MakeFile(File("x.tif"), "GTiff", kTiled, {45, 67, 2, tessel::eDT_16U}, oRandom);
    const auto poDataset = Open(File("x.tif"), false);
    BasicReader oReader(poDataset.get(), {2, 1});
    EXPECT_EQ(oReader.GetTileWidth(), 16U);
    EXPECT_EQ(oReader.GetTileHeight(), 32U);
    for (int nMode = 0; nMode < 3; ++nMode)
    {
        oReader.SetMargin(5, 3, nMode);
        for (unsigned int nTile = 0; nTile < 9; ++nTile)
        {
            const std::unique_ptr<tessel::Raster> poTile(oReader.GetRaster(nTile));
            ASSERT_EQ(poTile->mnWidth, nTile % 3 == 2 ? 13U : 16U);
            ASSERT_EQ(poTile->mnHeight, nTile / 3 == 2 ? 3U : 32U);
            for (int y = -3; y < static_cast<int>(poTile->mnHeight) + 3; ++y)
            {
                for (int x = -5; x < static_cast<int>(poTile->mnWidth) + 5; ++x)
                {
                    const int nX = x + static_cast<int>(poTile->mnOffsetX);
                    const int nY = y + static_cast<int>(poTile->mnOffsetY);
                    const bool bInside = nX >= 0 && nX < 45 && nY >= 0 && nY < 67;
                    const int nMirrorX = nX < 0 ? -nX : (nX > 44 ? 88 - nX : nX);
                    const int nMirrorY = nY < 0 ? -nY : (nY > 66 ? 132 - nY : nY);
                    const auto* pShown =
                        nMode == 1 ? poWhole->GetPixelAs<std::uint16_t>(nMirrorX, nMirrorY)
                                   : poWhole->GetPixelAs<std::uint16_t>(std::clamp(nX, 0, 44),
                                                                        std::clamp(nY, 0, 66));
                    const auto* pPixel = poTile->GetPixelAs<std::uint16_t>(x, y);
                    const bool bZero = nMode == 0 && !bInside;
                    ASSERT_EQ(pPixel[0], bZero ? 0 : pShown[1]) << nMode << " " << x << " " << y;
                    ASSERT_EQ(pPixel[1], bZero ? 0 : pShown[0]) << nMode << " " << x << " " << y;
                }
            }
        }
    }
}

TEST_F(GdalDatasetTest, IteratorsWalkTheFilesTiles)
{
    Random oRandom(5);
    MakeFile(File("x.tif"), "GTiff", kTiled, {33, 33, 1, tessel::eDT_8U}, oRandom);
    BasicReader oReader(File("x.tif"), {1}, 1);
    std::uint64_t nPixels = 0;
    for (RasterIterator itTile = oReader.Begin(); itTile != oReader.End(); ++itTile)
    {
        const std::unique_ptr<tessel::Raster> poTile(*itTile);
        nPixels += std::uint64_t{poTile->mnWidth} * poTile->mnHeight;
    }
    EXPECT_EQ(nPixels, 33U * 33U);
    EXPECT_EQ(std::distance(oReader.Begin(), oReader.End()), 6);
}

TEST_F(GdalDatasetTest, OneChannelMayStandTwiceInAList)
{
    Random oRandom(6);
    const auto poWritten = MakeFile(File("x.tif"), "GTiff", "", {5, 4, 2, tessel::eDT_8U}, oRandom);
    BasicReader oReader(File("x.tif"), {2, 2, 1}, 0);
    oReader.SetTileSize(5, 4);
    const std::unique_ptr<tessel::Raster> poRaster(oReader.GetRaster(0));
    for (int i = 0; i < 20; ++i)
    {
        EXPECT_EQ(poRaster->mpBuffer[3 * i], poWritten->mpBuffer[2 * i + 1]);
        EXPECT_EQ(poRaster->mpBuffer[3 * i + 1], poWritten->mpBuffer[2 * i + 1]);
        EXPECT_EQ(poRaster->mpBuffer[3 * i + 2], poWritten->mpBuffer[2 * i]);
    }
}

TEST_F(GdalDatasetTest, PixelsNeverWrittenAreZero)
{
    const auto poDataset = New(File("x.tif"), "GTiff", kTiled);
    poDataset->CreateChannels({40, 40, 1, tessel::eDT_32S});
    BasicReader oBefore(poDataset.get(), {1});
    const std::unique_ptr<tessel::Raster> poBefore(oBefore.GetRaster(0));
    EXPECT_EQ(*poBefore->GetPixelAs<int>(3, 3), 0);
    poDataset->Flush();
    const auto poAfter = ReadFile(File("x.tif"));
    for (int i = 0; i < 1600; ++i)
    {
        ASSERT_EQ(poAfter->GetPixelAs<int>(0, 0)[i], 0);
    }
}

TEST_F(GdalDatasetTest, WriterReadsBackBeforeAnythingIsFlushed)
{
    Random oRandom(7);
    const auto poDataset = New(File("x.tif"), "GTiff", kTiled);
    poDataset->CreateChannels({20, 20, 1, tessel::eDT_16S});
    BasicWriter oWriter(poDataset.get(), {1});
    const auto poWritten = RandomRaster(20, 20, 1, tessel::eDT_16S, {}, Samples::Ordinary, oRandom);
    oWriter.WriteRaster(poWritten.get());
    const auto poBack = test::BlankRaster(20, 20, 1, tessel::eDT_16S);
    oWriter.ReadRaster(poBack.get());
    EXPECT_TRUE(SameBits(*poBack, *poWritten));
    BasicReader oReader(poDataset.get(), {1});
    oReader.ReadRaster(poBack.get());
    EXPECT_TRUE(SameBits(*poBack, *poWritten));
}

TEST_F(GdalDatasetTest, WritingGoesOnAfterAFlush)
{
    Random oRandom(8);
    const auto poDataset = New(File("x.tif"), "GTiff", kTiled);
    poDataset->CreateChannels({20, 40, 1, tessel::eDT_8S});
    BasicWriter oWriter(poDataset.get(), {1});
    const auto poWritten = RandomRaster(20, 40, 1, tessel::eDT_8S, {}, Samples::Ordinary, oRandom);
    for (std::uint32_t nY = 0; nY < 40; nY += 10)
    {
        tessel::Raster oStrip({20, 10, 1, tessel::eDT_8S}, {0, 0, 0, nY},
                              poWritten->GetPixel(0, nY), false);
        oWriter.WriteRaster(&oStrip);
        oWriter.Flush();
    }
    EXPECT_TRUE(SameBits(*ReadFile(File("x.tif")), *poWritten));
}

TEST_F(GdalDatasetTest, ReadersOfOneFileMayWorkAtOnce)
{
    Random oRandom(9);
    const auto poWritten =
        MakeFile(File("x.tif"), "GTiff", kTiled, {200, 200, 2, tessel::eDT_16U}, oRandom);
    const auto poDataset = Open(File("x.tif"), false);
    std::vector<std::thread> voThreads;
    std::atomic<int> nSame = 0;
    for (int i = 0; i < 4; ++i)
    {
        auto poReader = std::make_shared<BasicReader>(poDataset.get(), std::vector{1U, 2U});
        voThreads.emplace_back(
            [&, poReader]
            {
                poReader->SetTileSize(200, 200);
                for (int k = 0; k < 10; ++k)
                {
                    const std::unique_ptr<tessel::Raster> poRaster(poReader->GetRaster(0));
                    nSame += SameBits(*poRaster, *poWritten) ? 1 : 0;
                }
            });
    }
    for (std::thread& oThread : voThreads)
    {
        oThread.join();
    }
    EXPECT_EQ(nSame, 40);
}

TEST_F(GdalDatasetTest, ReaderAndWriterOfOneFileMayWorkAtOnce)
{
    const auto poDataset = New(File("x.tif"), "GTiff", kTiled);
    poDataset->CreateChannels({100, 100, 2, tessel::eDT_16U});
    BasicReader oReader(poDataset.get(), {1});
    BasicWriter oWriter(poDataset.get(), {2});
    std::thread oWriting(
        [&]
        {
            const auto poRaster = test::BlankRaster(100, 100, 1, tessel::eDT_16U);
            for (int i = 0; i < 30; ++i)
            {
                oWriter.WriteRaster(poRaster.get());
            }
        });
    for (int i = 0; i < 30; ++i)
    {
        const std::unique_ptr<tessel::Raster> poRaster(oReader.GetRaster(static_cast<unsigned>(i)));
        EXPECT_EQ(*poRaster->GetPixelAs<std::uint16_t>(0, 0), 0);
        i += 7;
    }
    oWriting.join();
    poDataset->Flush();
    EXPECT_EQ(ReadFile(File("x.tif"))->GetPixelAs<std::uint16_t>(99, 99)[1], 0xA5A5);
}

TEST_F(GdalDatasetTest, MixedTypesAreSeenAsOne)
{
    const auto poDataset = New(File("x.tif"));
    poDataset->CreateChannels({2, 1, 1, tessel::eDT_32R});
    {
        BasicWriter oWriter(poDataset.get(), {1});
        const auto poRaster = test::RasterOf(test::Image<float>{{-2.5F, 300.4F}});
        oWriter.WriteRaster(poRaster.get());
    }
    MultiTypeReader oReader(poDataset.get(), {1}, tessel::eDT_8S);
    const std::unique_ptr<tessel::Raster> poRaster(oReader.GetRaster(0));
    EXPECT_EQ(test::ImageOf<char>(*poRaster), (test::Image<char>{{-3, 127}}));
}

TEST_F(GdalDatasetTest, GeoreferencingComesBack)
{
    const ogc::cs::GeocodingInfo::Transform oTurned{500000.0, 10.0, 0.5, 5600000.0, -0.25, -20.0};
    ogc::cs::GeocodingInfo oInfo(oTurned);
    oInfo.SetProjection(
        "GEOGCS[\"WGS 84\",DATUM[\"WGS_1984\",SPHEROID[\"WGS 84\",6378137,298.257223563]],"
        "PRIMEM[\"Greenwich\",0],UNIT[\"degree\",0.0174532925199433],AUTHORITY[\"EPSG\",\"4326\"]"
        "]");
    {
        const auto poDataset = New(File("x.tif"));
        poDataset->CreateChannels({4, 3, 1, tessel::eDT_8U});
        EXPECT_EQ(poDataset->GetGeocodingInfo(), ogc::cs::GeocodingInfo());
        poDataset->SetGeocodingInfo(oInfo);
        EXPECT_EQ(poDataset->GetGeocodingInfo().GetTransform(), oTurned);
    }
    const auto poDataset = Open(File("x.tif"), false);
    EXPECT_EQ(poDataset->GetGeocodingInfo().GetTransform(), oTurned);
    EXPECT_EQ(poDataset->GetGeocodingInfo().GetProjection().find("GEOGCS[\"WGS 84\""), 0U);
    BasicReader oReader(poDataset.get(), {1});
    EXPECT_EQ(oReader.GetGeocodingInfo(), poDataset->GetGeocodingInfo());
    EXPECT_EQ(moDirectory.Names(), (std::set<std::string>{"x.tif"}));
}

TEST_F(GdalDatasetTest, PlaceThatSaysNothingIsNotWritten)
{
    {
        const auto poDataset = New(File("x.tif"));
        poDataset->CreateChannels({4, 3, 1, tessel::eDT_8U});
        poDataset->SetGeocodingInfo(ogc::cs::GeocodingInfo());
    }
    const std::string oBytes = test::BytesOf(File("x.tif"));
    {
        const auto poDataset = New(File("y.tif"));
        poDataset->CreateChannels({4, 3, 1, tessel::eDT_8U});
    }
    EXPECT_EQ(oBytes, test::BytesOf(File("y.tif")));
}

TEST_F(GdalDatasetTest, CoordinateSystemThatIsNoneIsRefused)
{
    const auto poDataset = New(File("x.tif"));
    poDataset->CreateChannels({4, 3, 1, tessel::eDT_8U});
    ogc::cs::GeocodingInfo oInfo;
    oInfo.SetProjection("nonsense");
    EXPECT_TRUE(HasWord(MessageOf<IOException>([&] { poDataset->SetGeocodingInfo(oInfo); }),
                        File("x.tif") + ": cannot set the georeferencing: "));
}

AuxiliaryData SomeData()
{
    AuxiliaryData oData;
    oData.SetChannelDescription("first <channel> & more", 1);
    oData.SetChannelDescription("zweiter Kanal \xc3\xbc", 2);
    oData.SetChanMetadata({{"unit", "dB"}, {"LOOKS", "4"}}, 2);
    oData.SetChannelNoData(-9999.0, 1);
    oData.SetChannelNoData(-9999.0, 2);
    oData.SetFileMetadata({{"sensor", "radar = X"}});
    return oData;
}

void ExpectSomeData(const AuxiliaryData& oData)
{
    EXPECT_EQ(oData.GetChannelDescription(1), "first <channel> & more");
    EXPECT_EQ(oData.GetChannelDescription(2), "zweiter Kanal \xc3\xbc");
    EXPECT_TRUE(oData.GetChanMetadata(1).empty());
    EXPECT_EQ(oData.GetChanMetadata(2).at("unit"), "dB");
    EXPECT_EQ(oData.GetChanMetadata(2).at("LOOKS"), "4");
    EXPECT_EQ(oData.GetChannelNoData(1), -9999.0);
    EXPECT_EQ(oData.GetChannelNoData(2), -9999.0);
    EXPECT_EQ(oData.GetFileMetadata().at("sensor"), "radar = X");
}

TEST_F(GdalDatasetTest, DescriptionsNoDataAndMetadataComeBack)
{
    {
        const auto poDataset = New(File("x.tif"));
        poDataset->CreateChannels({4, 3, 2, tessel::eDT_32R});
        poDataset->SetAuxiliaryData(SomeData());
        ExpectSomeData(poDataset->GetAuxiliaryData());
    }
    const auto poDataset = Open(File("x.tif"), false);
    ExpectSomeData(poDataset->GetAuxiliaryData());
    EXPECT_EQ(BasicReader(poDataset.get(), {2}).GetAuxiliaryData().GetChanMetadata(1).at("unit"),
              "dB");
    EXPECT_EQ(moDirectory.Names(), (std::set<std::string>{"x.tif"}));
}

TEST_F(GdalDatasetTest, AuxiliaryDataMayBeSetWhenThePixelsAreWritten)
{
    Random oRandom(10);
    const auto poWritten =
        MakeFile(File("x.tif"), "GTiff", kTiled, {50, 50, 2, tessel::eDT_32R}, oRandom);
    {
        const auto poDataset = Open(File("x.tif"), true);
        BasicWriter oWriter(poDataset.get(), {1, 2});
        oWriter.SetAuxiliaryData(SomeData());
    }
    ExpectSomeData(Open(File("x.tif"), false)->GetAuxiliaryData());
    EXPECT_TRUE(SameBits(*ReadFile(File("x.tif")), *poWritten));
    {
        const auto poDataset = Open(File("x.tif"), true);
        AuxiliaryData oNone;
        oNone.SetChannelDescription("", 1);
        oNone.SetChannelDescription("", 2);
        poDataset->SetAuxiliaryData(oNone);
    }
    const AuxiliaryData oData = Open(File("x.tif"), false)->GetAuxiliaryData();
    EXPECT_EQ(oData.GetChannelDescription(1), "");
    EXPECT_TRUE(oData.GetChanMetadata(2).empty());
    EXPECT_EQ(oData.GetChannelNoData(1), std::nullopt);
    EXPECT_EQ(oData.GetFileMetadata().count("sensor"), 0U);
}

TEST_F(GdalDatasetTest, NoDataOfEveryTypeComesBack)
{
    for (std::size_t i = 0; i < kTiffTypes.size(); ++i)
    {
        const std::string oFile = File(std::to_string(i) + ".tif");
        {
            const auto poDataset = New(oFile);
            poDataset->CreateChannels({2, 2, 1, kTiffTypes[i]});
            AuxiliaryData oData;
            oData.SetChannelNoData(77.0, 1);
            poDataset->SetAuxiliaryData(oData);
        }
        EXPECT_EQ(Open(oFile, false)->GetAuxiliaryData().GetChannelNoData(1), 77.0) << i;
    }
}

TEST_F(GdalDatasetTest, NotANumberAndTheEndsOf64BitIntegersMayStandForNoData)
{
    const auto oBack = [&](const std::string& oName, const tessel::DataType& oType, double dfNoData)
    {
        {
            const auto poDataset = New(File(oName));
            poDataset->CreateChannels({2, 2, 1, oType});
            AuxiliaryData oData;
            oData.SetChannelNoData(dfNoData, 1);
            poDataset->SetAuxiliaryData(oData);
        }
        return Open(File(oName), false)->GetAuxiliaryData().GetChannelNoData(1).value();
    };
    EXPECT_TRUE(std::isnan(oBack("1.tif", tessel::eDT_32R, std::nan(""))));
    EXPECT_EQ(oBack("2.tif", tessel::eDT_64S, -9223372036854775808.0), -9223372036854775808.0);
    EXPECT_EQ(oBack("3.tif", tessel::eDT_64S, 9223372036854775808.0), 9223372036854775808.0);
    EXPECT_EQ(oBack("4.tif", tessel::eDT_64U, 18446744073709551616.0), 18446744073709551616.0);
    EXPECT_EQ(oBack("5.tif", tessel::eDT_64U, 0.0), 0.0);
}

TEST_F(GdalDatasetTest, SecondNoDataValueOfAGeoTiffIsRefused)
{
    const auto poDataset = New(File("x.tif"));
    poDataset->CreateChannels({2, 2, 2, tessel::eDT_16S});
    AuxiliaryData oData;
    oData.SetChannelNoData(1.0, 1);
    oData.SetChannelNoData(2.0, 2);
    EXPECT_TRUE(HasWord(MessageOf<DataException>([&] { poDataset->SetAuxiliaryData(oData); }),
                        "the format GTiff holds one no-data value for all channels"));
}

TEST_F(GdalDatasetTest, EntryForAChannelThatDoesNotExistIsRefused)
{
    const auto poDataset = New(File("x.tif"));
    poDataset->CreateChannels({2, 2, 2, tessel::eDT_16S});
    AuxiliaryData oData;
    oData.SetChannelDescription("third", 3);
    EXPECT_EQ(MessageOf<IOException>([&] { poDataset->SetAuxiliaryData(oData); }),
              File("x.tif") + ": there is no channel 3; the file has 2, numbered from 1");
    AuxiliaryData oOdd;
    oOdd.SetFileMetadata({{"a=b", "c"}});
    EXPECT_EQ(MessageOf<DataException>([&] { poDataset->SetAuxiliaryData(oOdd); }),
              File("x.tif") + ": \"a=b\" cannot be the name of a metadata item beside the others");
}

TEST_F(GdalDatasetTest, FileOpenedForReadingIsNotChanged)
{
    Random oRandom(11);
    MakeFile(File("x.tif"), "GTiff", "", {4, 3, 1, tessel::eDT_8U}, oRandom);
    const std::string oBytes = test::BytesOf(File("x.tif"));
    {
        const auto poDataset = Open(File("x.tif"), false);
        EXPECT_EQ(MessageOf<IOException>([&] { BasicWriter(poDataset.get(), {1}); }),
                  File("x.tif") + ": cannot write pixels: the file was opened for reading");
        EXPECT_THROW(poDataset->SetAuxiliaryData(AuxiliaryData()), IOException);
        EXPECT_THROW(poDataset->SetGeocodingInfo(ogc::cs::GeocodingInfo()), IOException);
        EXPECT_THROW(poDataset->CreateChannels({4, 3, 1, tessel::eDT_8U}), IOException);
        poDataset->Flush();
        BasicReader oReader(poDataset.get(), {1});
        delete oReader.GetRaster(0);
        poDataset->GetAuxiliaryData();
    }
    EXPECT_EQ(test::BytesOf(File("x.tif")), oBytes);
    EXPECT_EQ(moDirectory.Names(), (std::set<std::string>{"x.tif"}));
}

TEST_F(GdalDatasetTest, ReadingLeavesNoFileBesideThePicturesOfOthers)
{
    tessel::Raster oRaster({9, 7, 3, tessel::eDT_8U}, {});
    std::memset(oRaster.mpBuffer, 77, oRaster.mnBufferSize);
    WritePng(File("x.png"), oRaster);
    EXPECT_TRUE(SameBits(*ReadFile(File("x.png")), oRaster));
    EXPECT_EQ(Open(File("x.png"), false)->GetAuxiliaryData().GetChannelDescription(1), "");
    EXPECT_EQ(moDirectory.Names(), (std::set<std::string>{"x.png"}));
}

TEST_F(GdalDatasetTest, ReplacedFileIsNoticed)
{
    Random oRandom(12);
    MakeFile(File("x.tif"), "GTiff", "", {4, 3, 1, tessel::eDT_8U}, oRandom);
    MakeFile(File("y.tif"), "GTiff", "", {4, 3, 1, tessel::eDT_32R}, oRandom);
    const auto poDataset = Open(File("x.tif"), false);
    std::filesystem::rename(File("y.tif"), File("x.tif"));
    EXPECT_EQ(MessageOf<IOException>([&] { BasicReader(poDataset.get(), {1}); }),
              File("x.tif") + ": the file was replaced since it was opened");
}

TEST_F(GdalDatasetTest, ChannelsHaveToExist)
{
    Random oRandom(13);
    MakeFile(File("x.tif"), "GTiff", "", {4, 3, 2, tessel::eDT_8U}, oRandom);
    EXPECT_EQ(MessageOf<IOException>([&] { BasicReader(File("x.tif"), {3}, 0); }),
              File("x.tif") + ": there is no channel 3; the file has 2, numbered from 1");
    EXPECT_THROW(Open(File("x.tif"), false)->GetChannelType(0), IOException);
}

/// Opens a file and reads all of it.
std::string FailureOfReading(const std::string& oFile)
{
    return MessageOf<IOException>(
        [&]
        {
            BasicReader oReader(oFile, {1}, 0);
            for (RasterIterator itTile = oReader.Begin(); itTile != oReader.End(); ++itTile)
            {
                delete *itTile;
            }
        });
}

TEST_F(GdalDatasetTest, TruncatedFilesAreReported)
{
    struct Kind
    {
        std::string moFormat;
        std::string moOptions;
        tessel::DataType moType;
    };
    const std::vector<Kind> voKinds = {{"GTiff", "", tessel::eDT_32R},
                                       {"GTiff", kTiled, tessel::eDT_32R},
                                       {"GTiff", "COMPRESS=LZW", tessel::eDT_16S},
                                       {"GTiff", "COMPRESS=JPEG TILED=YES", tessel::eDT_8U},
                                       {"ENVI", "", tessel::eDT_16S},
                                       {"EHdr", "", tessel::eDT_16S},
                                       {"HFA", "", tessel::eDT_16S}};
    Random oRandom(14);
    int i = 0;
    for (const Kind& oKind : voKinds)
    {
        const std::string oFile =
            File(std::to_string(++i) + (oKind.moFormat == "GTiff" ? ".tif" : ".img"));
        MakeFile(oFile, oKind.moFormat, oKind.moOptions, {200, 200, 1, oKind.moType}, oRandom);
        const auto nSize = std::filesystem::file_size(oFile);
        for (const auto nLeft :
             {nSize - 1, nSize * 3 / 4, nSize / 2, nSize / 10, std::uintmax_t{9}})
        {
            std::filesystem::resize_file(oFile, nLeft);
            EXPECT_TRUE(HasWord(FailureOfReading(oFile), oFile))
                << oKind.moFormat << " " << oKind.moOptions << " cut to " << nLeft << " of "
                << nSize;
        }
    }
}

/// A file of a format that is made from another file as a whole.
void MakeCopy(const std::string& oFormat, const std::string& oFrom, const std::string& oTo)
{
    GDALDatasetH hFrom = GDALOpen(oFrom.c_str(), GA_ReadOnly);
    GDALDatasetH hTo = GDALCreateCopy(GDALGetDriverByName(oFormat.c_str()), oTo.c_str(), hFrom,
                                      FALSE, nullptr, nullptr, nullptr);
    ASSERT_NE(hTo, nullptr) << oFormat;
    GDALClose(hTo);
    GDALClose(hFrom);
}

TEST_F(GdalDatasetTest, TruncatedFilesThatOthersMadeAreReported)
{
    Random oRandom(21);
    MakeFile(File("x.tif"), "GTiff", "", {200, 200, 1, tessel::eDT_8U}, oRandom);
    for (const std::string oFormat : {"PNG", "JPEG", "AAIGrid", "JP2OpenJPEG"})
    {
        const std::string oFile = File(oFormat);
        MakeCopy(oFormat, File("x.tif"), oFile);
        EXPECT_EQ(ReadFile(oFile)->mnWidth, 200U) << oFormat;
        const auto nSize = std::filesystem::file_size(oFile);
        for (const auto nLeft : {nSize * 3 / 4, nSize / 2, nSize / 10, std::uintmax_t{9}})
        {
            std::filesystem::resize_file(oFile, nLeft);
            EXPECT_TRUE(HasWord(FailureOfReading(oFile), oFile))
                << oFormat << " cut to " << nLeft << " of " << nSize;
        }
    }
}

TEST_F(GdalDatasetTest, GarbageIsRefused)
{
    Random oRandom(15);
    std::string oBytes(5000, ' ');
    for (int i = 0; i < 60; ++i)
    {
        for (char& cByte : oBytes)
        {
            cByte = static_cast<char>(oRandom());
        }
        if (i % 2 == 1)
        {
            oBytes.replace(0, 8, std::string("II*\0\x08\0\0\0", 8));
        }
        const std::string oFile = moDirectory.Write("garbage.tif", oBytes);
        EXPECT_TRUE(HasWord(FailureOfReading(oFile), oFile));
    }
    EXPECT_TRUE(HasWord(FailureOfReading(moDirectory.Write("empty.tif", "")), "no driver knows"));
}

TEST_F(GdalDatasetTest, DamagedFilesDoNoHarm)
{
    Random oRandom(16);
    MakeFile(File("x.tif"), "GTiff", kTiled, {64, 64, 2, tessel::eDT_16U}, oRandom);
    const std::string oWhole = test::BytesOf(File("x.tif"));
    for (int i = 0; i < 100; ++i)
    {
        std::string oBytes = oWhole;
        for (int k = 0; k < 4; ++k)
        {
            // Half of the hits in the first few hundred bytes, where sizes and offsets stand.
            const std::size_t nRange = k % 2 == 0 ? 400 : oBytes.size();
            oBytes[oRandom() % nRange] = static_cast<char>(oRandom());
        }
        const std::string oFile = moDirectory.Write("y.tif", oBytes);
        try
        {
            BasicReader oReader(oFile, {1}, 0);
            oReader.SetTileSize(64, 64);
            delete oReader.GetRaster(0);
        }
        catch (const Exception& oError)
        {
            EXPECT_FALSE(std::string(oError.what()).empty());
        }
    }
}

// A file of a few hundred bytes, of which one tile would take 1.6 GB.
TEST_F(GdalDatasetTest, FileWithHugeTilesIsRefused)
{
    {
        const auto poDataset =
            New(File("x.tif"), "GTiff",
                "TILED=YES BLOCKXSIZE=40000 BLOCKYSIZE=40000 SPARSE_OK=YES COMPRESS=DEFLATE");
        poDataset->CreateChannels({40000, 40000, 1, tessel::eDT_8U});
    }
    EXPECT_LT(std::filesystem::file_size(File("x.tif")), 1000U);
    EXPECT_EQ(
        MessageOf<FileException>([&] { Open(File("x.tif"), false); }),
        File("x.tif") + ": channel 1 has tiles of 40000 x 40000 pixels, more than 1 GiB each");
}

TEST_F(GdalDatasetTest, TextThatDescribesADatasetIsRefused)
{
    Random oRandom(17);
    MakeFile(File("x.tif"), "GTiff", "", {4, 3, 1, tessel::eDT_8U}, oRandom);
    const std::string oVrt =
        "<VRTDataset rasterXSize=\"4\" rasterYSize=\"3\"><VRTRasterBand dataType=\"Byte\" "
        "band=\"1\"><SimpleSource><SourceFilename>" +
        File("x.tif") + "</SourceFilename></SimpleSource></VRTRasterBand></VRTDataset>";
    const std::string oFile = moDirectory.Write("x.vrt", oVrt);
    EXPECT_TRUE(HasWord(MessageOf<FileException>([&] { Open(oFile, false); }), "no driver knows"));
    EXPECT_THROW(Open(oVrt, false), FileException);
    EXPECT_EQ(MessageOf<DataException>([] { DatasetManager::AllowDriver("vrt"); }),
              "VRT files refer to other files and are never opened");
    EXPECT_THROW(Open(oFile, false), FileException);
    EXPECT_THROW(New(File("y.vrt"), "VRT"), DataException);
}

TEST_F(GdalDatasetTest, NamesThatDriversReadOtherwiseAreFiles)
{
    Random oRandom(18);
    const auto poWritten = MakeFile(File("x.tif"), "GTiff", "", {4, 3, 1, tessel::eDT_8U}, oRandom);
    const auto oFormer = std::filesystem::current_path();
    std::filesystem::current_path(File(""));
    EXPECT_TRUE(HasWord(MessageOf<FileException>([] { Open("GTIFF_DIR:1:x.tif", false); }),
                        "there is no such file"));
    std::filesystem::copy("x.tif", "GTIFF_DIR:7:x.tif");
    EXPECT_TRUE(SameBits(*ReadFile("GTIFF_DIR:7:x.tif"), *poWritten));
    EXPECT_TRUE(SameBits(*ReadFile("x.tif"), *poWritten));
    std::filesystem::current_path(oFormer);
}

TEST_F(GdalDatasetTest, FormatIsOpenedOnceItIsAllowed)
{
    const std::string oFile = moDirectory.Write(
        "x.xyz", "0 0 1\n1 0 2\n2 0 3\n0 1 4\n1 1 5\n2 1 6\n0 2 7\n1 2 8\n2 2 9\n");
    EXPECT_THROW(Open(oFile, false), FileException);
    DatasetManager::AllowDriver("xyz");
    EXPECT_EQ(Open(oFile, false)->GetWidth(), 3U);
    EXPECT_THROW(DatasetManager::AllowDriver("no such format"), DataException);
}

TEST_F(GdalDatasetTest, ExistingFileIsNeverOverwritten)
{
    const std::string oFile = moDirectory.Write("x.tif", "precious");
    EXPECT_THROW(New(oFile), FileException);
    EXPECT_EQ(test::BytesOf(oFile), "precious");

    const std::string oHeader = moDirectory.Write("y.hdr", "precious");
    const auto poDataset = New(File("y.img"), "ENVI");
    EXPECT_EQ(MessageOf<FileException>(
                  [&] {
                      poDataset->CreateChannels({4, 3, 1, tessel::eDT_8U});
                  }),
              File("y.img") + ": the file " + oHeader +
                  ", which belongs to it, exists already and is not overwritten");
    EXPECT_EQ(test::BytesOf(oHeader), "precious");
}

TEST_F(GdalDatasetTest, NameIsTakenUntilAnEmptyDatasetGoes)
{
    {
        const auto poFirst = New(File("x.tif"));
        EXPECT_THROW(New(File("x.tif")), FileException);
        EXPECT_EQ(poFirst->GetWidth(), 0U);
        EXPECT_EQ(poFirst->GetChannelCount(), 0U);
        EXPECT_EQ(poFirst->GetAuxiliaryData(), AuxiliaryData());
        poFirst->Flush();
        EXPECT_EQ(MessageOf<IOException>([&] { poFirst->SetAuxiliaryData(AuxiliaryData()); }),
                  File("x.tif") + ": cannot set the metadata: the file has no channels yet");
        EXPECT_THROW(BasicWriter(poFirst.get(), {1}), IOException);
    }
    EXPECT_TRUE(moDirectory.Names().empty());
}

TEST_F(GdalDatasetTest, DirectoryThatIsMissingIsReported)
{
    EXPECT_EQ(MessageOf<FileException>([&] { New(File("none/x.tif")); }),
              File("none/x.tif") + ": cannot make the file: No such file or directory");
}

TEST_F(GdalDatasetTest, FormatsAndOptionsThatCannotBeAreRefusedByName)
{
    EXPECT_EQ(MessageOf<DataException>([&] { New(File("x.png"), "PNG"); }),
              File("x.png") +
                  ": files of the format PNG can be read but not made block by block; "
                  "formats that can: GTiff ENVI EHdr HFA");
    EXPECT_TRUE(HasWord(MessageOf<DataException>([&] { New(File("x"), "Nothing"); }),
                        "no driver knows a format \"Nothing\""));
    EXPECT_TRUE(HasWord(MessageOf<DataException>([&] { New(File("x.tif"), "GTiff", "SPEED=MAX"); }),
                        "SPEED"));
    EXPECT_TRUE(HasWord(
        MessageOf<DataException>([&] { New(File("x.tif"), "GTiff", "COMPRESS=SMALL"); }), "SMALL"));
    EXPECT_EQ(MessageOf<DataException>([&] { New(File("x.tif"), "GTiff", "TILED"); }),
              File("x.tif") + ": the option \"TILED\" is not of the form NAME=VALUE");
    EXPECT_TRUE(moDirectory.Names().empty());
}

TEST_F(GdalDatasetTest, TypesThatAFormatDoesNotHaveAreRefusedByName)
{
    std::vector<std::pair<std::string, tessel::DataType>> voPairs = {
        {"GTiff", tessel::eDT_BIT}, {"GTiff", tessel::eDT_C16U}, {"GTiff", tessel::eDT_C32U},
        {"ENVI", tessel::eDT_8S},   {"EHdr", tessel::eDT_64R},   {"HFA", tessel::eDT_64S}};
    if (kOldGdal)
    {
        voPairs.emplace_back("ENVI", tessel::eDT_64S);  // it makes bytes of them without an error
    }
    for (const auto& [oFormat, oType] : voPairs)
    {
        const auto poDataset = New(File("x"), oFormat);
        EXPECT_TRUE(
            HasWord(MessageOf<DataException>(
                        [&] {
                            poDataset->CreateChannels({4, 3, 1, oType});
                        }),
                    File("x") + ": the format " + oFormat + " cannot hold samples of eDT_"));
    }
    EXPECT_TRUE(moDirectory.Names().empty());
}

TEST_F(GdalDatasetTest, OptionThatChangesTheTypeIsRefused)
{
    if (!kOldGdal)
    {
        GTEST_SKIP() << "this GDAL has a type for signed bytes and no such option";
    }
    const auto poDataset = New(File("x.tif"), "GTiff", "PIXELTYPE=SIGNEDBYTE");
    EXPECT_TRUE(HasWord(MessageOf<DataException>(
                            [&] {
                                poDataset->CreateChannels({4, 3, 1, tessel::eDT_8U});
                            }),
                        "the options make channels of eDT_8S out of channels of eDT_8U"));
}

TEST_F(GdalDatasetTest, ChannelsCannotBeAddedLater)
{
    const auto poDataset = New(File("x.tif"));
    poDataset->CreateChannels({4, 3, 1, tessel::eDT_8U});
    const auto oMessage = [&](const tessel::RasterInfo& oInfo)
    { return MessageOf<DataException>([&] { poDataset->CreateChannels(oInfo); }); };
    EXPECT_EQ(oMessage({4, 3, 1, tessel::eDT_8U}),
              File("x.tif") +
                  ": the format GTiff cannot add channels to a file; make all of them by one call");
    EXPECT_EQ(oMessage({4, 3, 1, tessel::eDT_16S}),
              File("x.tif") +
                  ": the format GTiff cannot hold channels of eDT_16S beside channels of eDT_8U");
    EXPECT_EQ(oMessage({4, 4, 1, tessel::eDT_8U}),
              File("x.tif") + ": channels of 4 x 4 pixels do not fit the image of 4 x 3");
}

TEST_F(GdalDatasetTest, SizesThatCannotBeMadeAreRefused)
{
    const auto oMessage = [&](const tessel::RasterInfo& oInfo)
    {
        const auto poDataset = New(File("x.tif"));
        return MessageOf<DataException>([&] { poDataset->CreateChannels(oInfo); });
    };
    EXPECT_EQ(oMessage({0, 3, 1, tessel::eDT_8U}),
              File("x.tif") + ": an image of 0 x 3 pixels cannot be made");
    EXPECT_EQ(oMessage({4, 0x80000000, 1, tessel::eDT_8U}),
              File("x.tif") + ": an image of 4 x 2147483648 pixels cannot be made");
    EXPECT_EQ(oMessage({4, 3, 70000, tessel::eDT_8U}),
              File("x.tif") + ": 70000 channels cannot be made; 1 to 65535 can");
}

TEST_F(GdalDatasetTest, FullDiskIsReportedAtTheLatestByFlush)
{
    const std::vector<std::pair<std::string, std::string>> voFormats = {
        {"GTiff", ""}, {"GTiff", kTiled}, {"ENVI", ""}, {"EHdr", ""}, {"HFA", ""}};
    Random oRandom(19);
    int i = 0;
    for (const auto& [oFormat, oOptions] : voFormats)
    {
        const std::string oFile = File(std::to_string(++i) + ".img");
        const test::FullDisk oFull(100000);
        const std::string oMessage = MessageOf<IOException>(
            [&]
            {
                const auto poDataset = New(oFile, oFormat, oOptions);
                poDataset->CreateChannels({300, 300, 1, tessel::eDT_32S});
                BasicWriter oWriter(poDataset.get(), {1});
                const auto poRaster =
                    RandomRaster(300, 300, 1, tessel::eDT_32S, {}, Samples::Ordinary, oRandom);
                oWriter.WriteRaster(poRaster.get());
                oWriter.Flush();
            });
        EXPECT_TRUE(HasWord(oMessage, oFile + ": cannot ")) << oFormat << ": " << oMessage;
    }
}

TEST_F(GdalDatasetTest, SettingsOfTheProgramStayAsTheyAre)
{
    const auto nCache = GDALGetCacheMax64();
    Random oRandom(20);
    MakeFile(File("x.tif"), "GTiff", kTiled, {100, 100, 1, tessel::eDT_8U}, oRandom);
    ReadFile(File("x.tif"));
    EXPECT_EQ(GDALGetCacheMax64(), nCache);
    EXPECT_EQ(CPLGetThreadLocalConfigOption("GDAL_ERROR_ON_LIBJPEG_WARNING", nullptr), nullptr);
}

}  // namespace
}  // namespace kor::datasources
