#include "platform/datasources/gdal/gdalbitmaps.h"

#include <gdal.h>
#include <gtest/gtest.h>

#include <thread>

#include "basic/tessel/mask/mask.h"
#include "platform/datasources/bitmapmaskbuilder.h"
#include "platform/datasources/bitmapreader.h"
#include "tests/platform/datasources/gdal/gdalfiles.h"

namespace kor::datasources
{
namespace
{

using test::Image;
using test::MessageOf;
using test::Random;
using test::RasterOf;
using test::SameBits;

using Bytes = Image<std::uint8_t>;

class GdalBitmapsTest : public test::GdalFilesTest
{
protected:
    static IBitmapDataset* BitmapsIn(const std::unique_ptr<IRasterDataset>& poDataset)
    {
        auto* poBitmaps = dynamic_cast<IBitmapDataset*>(poDataset.get());
        EXPECT_NE(poBitmaps, nullptr);
        return poBitmaps;
    }

    static std::unique_ptr<tessel::Raster> ReadBitmap(IBitmapDataset* poDataset,
                                                      unsigned int nBitmap)
    {
        BitmapReader oReader(poDataset, nBitmap);
        return std::unique_ptr<tessel::Raster>(oReader.GetRaster(0));
    }

    /// The bitmap of a file opened for reading.
    static Bytes BitmapOf(const std::string& oFile, unsigned int nBitmap)
    {
        const auto poDataset = Open(oFile, false);
        return test::ImageOf<std::uint8_t>(*ReadBitmap(BitmapsIn(poDataset), nBitmap));
    }

    static void WriteBitmap(IBitmapDataset* poDataset, unsigned int nBitmap, const Bytes& oBytes)
    {
        BasicWriter oWriter(poDataset, nBitmap);
        const auto poRaster = RasterOf(oBytes);
        oWriter.WriteRaster(poRaster.get());
    }

    /// A file of the size of kSmall and one channel of eDT_8U.
    std::unique_ptr<IRasterDataset> NewSmall(const std::string& oFormat = "GTiff",
                                             const std::string& oOptions = "",
                                             unsigned int nChannels = 1) const
    {
        auto poDataset = New(File("x.tif"), oFormat, oOptions);
        poDataset->CreateChannels({4, 3, nChannels, tessel::eDT_8U});
        return poDataset;
    }

    /// The samples of a band, or of the mask of the file, as GDAL itself has them.
    static std::vector<int> SamplesByGdal(const std::string& oFile, int nBand)
    {
        GDALDatasetH hDataset = GDALOpen(oFile.c_str(), GA_ReadOnly);
        GDALRasterBandH hFirst = GDALGetRasterBand(hDataset, 1);
        GDALRasterBandH hBand =
            nBand == 0 ? GDALGetMaskBand(hFirst) : GDALGetRasterBand(hDataset, nBand);
        std::vector<int> vnSamples(static_cast<std::size_t>(GDALGetRasterXSize(hDataset)) *
                                   static_cast<std::size_t>(GDALGetRasterYSize(hDataset)));
        EXPECT_EQ(GDALRasterIOEx(hBand, GF_Read, 0, 0, GDALGetRasterXSize(hDataset),
                                 GDALGetRasterYSize(hDataset), vnSamples.data(),
                                 GDALGetRasterXSize(hDataset), GDALGetRasterYSize(hDataset),
                                 GDT_Int32, 0, 0, nullptr),
                  CE_None);
        GDALClose(hDataset);
        return vnSamples;
    }
};

const Bytes kSmall = {{1, 0, 2, 0}, {0, 0, 255, 0}, {7, 7, 0, 1}};
const Bytes kSmallBits = {{1, 0, 1, 0}, {0, 0, 1, 0}, {1, 1, 0, 1}};
const std::vector<int> kSmallMask = {255, 0, 255, 0, 0, 0, 255, 0, 255, 255, 0, 255};

TEST_F(GdalBitmapsTest, FileHasNoneAtFirst)
{
    const auto poDataset = NewSmall();
    EXPECT_EQ(BitmapsIn(poDataset)->GetBitmapCount(), 0U);
    EXPECT_EQ(BitmapsIn(poDataset)->GetBitmapWidth(), 4U);
    EXPECT_EQ(BitmapsIn(poDataset)->GetBitmapHeight(), 3U);
    EXPECT_EQ(MessageOf<IOException>([&] { BitmapReader(BitmapsIn(poDataset), 1); }),
              File("x.tif") + ": there is no bitmap 1; the file has 0, numbered from 1");
    EXPECT_THROW(BitmapsIn(poDataset)->OpenBitmap(0, false), IOException);
}

TEST_F(GdalBitmapsTest, MaskIsMadeInsideTheFile)
{
    {
        const auto poDataset = NewSmall();
        EXPECT_EQ(BitmapsIn(poDataset)->CreateBitmap(4, 3), 1U);
        EXPECT_EQ(BitmapsIn(poDataset)->GetBitmapCount(), 1U);
        WriteBitmap(BitmapsIn(poDataset), 1, kSmall);
        EXPECT_EQ(test::ImageOf<std::uint8_t>(*ReadBitmap(BitmapsIn(poDataset), 1)), kSmallBits);
        poDataset->Flush();
    }
    EXPECT_EQ(BitmapOf(File("x.tif"), 1), kSmallBits);
    EXPECT_EQ(SamplesByGdal(File("x.tif"), 0), kSmallMask);
    EXPECT_EQ(moDirectory.Names(), (std::set<std::string>{"x.tif"}));
}

TEST_F(GdalBitmapsTest, MaskThatWasNeverWrittenHoldsZeros)
{
    {
        const auto poDataset = NewSmall();
        BitmapsIn(poDataset)->CreateBitmap(4, 3);
        const auto poBits = ReadBitmap(BitmapsIn(poDataset), 1);
        EXPECT_EQ(test::ImageOf<std::uint8_t>(*poBits), Bytes(4, std::vector<std::uint8_t>(12, 0)));
    }
    EXPECT_EQ(BitmapOf(File("x.tif"), 1), Bytes(4, std::vector<std::uint8_t>(12, 0)));
}

// In files of all layouts, at the start and when the pixels are there already, whatever is flushed
// in between: neither mask nor pixels lose anything.
TEST_F(GdalBitmapsTest, MaskIsAddedToFilesOfAllLayouts)
{
    Random oRandom(31);
    const std::vector<std::string> voOptions = {
        "", "INTERLEAVE=BAND", "TILED=YES BLOCKXSIZE=16 BLOCKYSIZE=32 COMPRESS=DEFLATE",
        "COMPRESS=LZW PREDICTOR=2 BLOCKYSIZE=7", "BIGTIFF=YES SPARSE_OK=YES"};
    int i = 0;
    for (const std::string& oOptions : voOptions)
    {
        const std::string oFile = File(std::to_string(++i) + ".tif");
        const auto poPixels =
            MakeFile(oFile, "GTiff", oOptions, {53, 47, 2, tessel::eDT_16S}, oRandom);
        const auto poBits =
            test::RandomRaster(53, 47, 1, tessel::eDT_8U, {}, test::Samples::Ordinary, oRandom);
        for (std::uint64_t k = 0; k < poBits->mnBufferSize; ++k)
        {
            poBits->mpBuffer[k] &= 1U;
        }
        const auto poDataset = Open(oFile, true);
        EXPECT_EQ(BitmapsIn(poDataset)->CreateBitmap(53, 47), 1U);
        BasicWriter oWriter(BitmapsIn(poDataset), 1);
        for (std::uint32_t nY = 0; nY < 47; nY += 10)
        {
            tessel::Raster oStrip({53, std::min(10U, 47 - nY), 1, tessel::eDT_8U}, {0, 0, 0, nY},
                                  poBits->GetPixel(0, nY), false);
            oWriter.WriteRaster(&oStrip);
            oWriter.Flush();
        }
        EXPECT_TRUE(SameBits(*ReadBitmap(BitmapsIn(Open(oFile, false)), 1), *poBits)) << oOptions;
        EXPECT_TRUE(SameBits(*ReadFile(oFile), *poPixels)) << oOptions;
    }
    EXPECT_EQ(moDirectory.Names().size(), voOptions.size());
}

TEST_F(GdalBitmapsTest, FileHoldsOneMask)
{
    const auto poDataset = NewSmall();
    BitmapsIn(poDataset)->CreateBitmap(4, 3);
    EXPECT_EQ(
        MessageOf<DataException>([&] { BitmapsIn(poDataset)->CreateBitmap(4, 3); }),
        File("x.tif") + ": the format GTiff holds one mask in a file, and this file has its mask");
}

TEST_F(GdalBitmapsTest, FormatsWithoutMasksRefuseThemAndWriteNothing)
{
    for (const std::string oFormat : {"ENVI", "EHdr", "HFA"})
    {
        const std::string oFile = File(oFormat + ".img");
        const auto poDataset = New(oFile, oFormat);
        poDataset->CreateChannels({4, 3, 1, tessel::eDT_8U});
        const auto oNames = moDirectory.Names();
        EXPECT_EQ(MessageOf<DataException>([&] { BitmapsIn(poDataset)->CreateBitmap(4, 3); }),
                  oFile + ": the format " + oFormat + " has no place for a bitmap in a file");
        EXPECT_EQ(BitmapsIn(poDataset)->GetBitmapCount(), 0U);
        EXPECT_EQ(moDirectory.Names(), oNames);
    }
}

TEST_F(GdalBitmapsTest, BitmapsAreMadeForChangingAndOfTheImagesSize)
{
    {
        const auto poDataset = New(File("x.tif"));
        EXPECT_EQ(BitmapsIn(poDataset)->GetBitmapCount(), 0U);
        EXPECT_EQ(MessageOf<IOException>([&] { BitmapsIn(poDataset)->CreateBitmap(4, 3); }),
                  File("x.tif") + ": cannot add a bitmap: the file has no channels yet");
        poDataset->CreateChannels({4, 3, 1, tessel::eDT_8U});
        EXPECT_EQ(MessageOf<DataException>([&] { BitmapsIn(poDataset)->CreateBitmap(4, 4); }),
                  File("x.tif") + ": a bitmap of 4 x 4 pixels does not fit the image of 4 x 3");
        BitmapsIn(poDataset)->CreateBitmap(4, 3);
    }
    const std::string oBytes = test::BytesOf(File("x.tif"));
    {
        const auto poDataset = Open(File("x.tif"), false);
        EXPECT_EQ(MessageOf<IOException>([&] { BitmapsIn(poDataset)->CreateBitmap(4, 3); }),
                  File("x.tif") + ": cannot add a bitmap: the file was opened for reading");
        EXPECT_EQ(MessageOf<IOException>([&] { BasicWriter(BitmapsIn(poDataset), 1); }),
                  File("x.tif") + ": cannot write a bitmap: the file was opened for reading");
    }
    EXPECT_EQ(test::BytesOf(File("x.tif")), oBytes);
}

TEST_F(GdalBitmapsTest, ChannelOfOneBitIsABitmap)
{
    {
        const auto poDataset = NewSmall("GTiff", "NBITS=1 COMPRESS=CCITTFAX4");
        EXPECT_EQ(poDataset->GetChannelType(1), tessel::eDT_8U);
        EXPECT_EQ(BitmapsIn(poDataset)->GetBitmapCount(), 1U);
        WriteBitmap(BitmapsIn(poDataset), 1, kSmall);
        EXPECT_EQ(BitmapsIn(poDataset)->CreateBitmap(4, 3), 2U);
        WriteBitmap(BitmapsIn(poDataset), 2, Bytes{{0, 0, 0, 1}, {0, 0, 0, 0}, {0, 0, 0, 0}});
    }
    EXPECT_EQ(test::ImageOf<std::uint8_t>(*ReadFile(File("x.tif"))), kSmallBits);
    EXPECT_EQ(BitmapOf(File("x.tif"), 1), kSmallBits);
    EXPECT_EQ(BitmapOf(File("x.tif"), 2), (Bytes{{0, 0, 0, 1}, {0, 0, 0, 0}, {0, 0, 0, 0}}));
}

TEST_F(GdalBitmapsTest, ChannelsOfOneBitOfOtherFormatsAreBitmaps)
{
    {
        const auto poDataset = NewSmall("HFA", "NBITS=1", 2);
        EXPECT_EQ(BitmapsIn(poDataset)->GetBitmapCount(), 2U);
        WriteBitmap(BitmapsIn(poDataset), 2, kSmall);
    }
    EXPECT_EQ(BitmapOf(File("x.tif"), 2), kSmallBits);
    EXPECT_EQ(BitmapOf(File("x.tif"), 1), Bytes(4, std::vector<std::uint8_t>(12, 0)));
}

TEST_F(GdalBitmapsTest, OpacitiesAreABitmapWrittenAtFullOpacity)
{
    for (const bool bWide : {false, true})
    {
        const std::string oFile = File(bWide ? "16.tif" : "8.tif");
        {
            const auto poDataset = New(oFile, "GTiff", "ALPHA=YES");
            poDataset->CreateChannels({4, 3, 2, bWide ? tessel::eDT_16U : tessel::eDT_8U});
            EXPECT_EQ(BitmapsIn(poDataset)->GetBitmapCount(), 1U);
            WriteBitmap(BitmapsIn(poDataset), 1, kSmall);
        }
        std::vector<int> vnOpacities = kSmallMask;
        for (int& nOpacity : vnOpacities)
        {
            nOpacity *= bWide ? 257 : 1;
        }
        EXPECT_EQ(SamplesByGdal(oFile, 2), vnOpacities);
        EXPECT_EQ(SamplesByGdal(oFile, 1), std::vector<int>(12, 0));
        EXPECT_EQ(BitmapOf(oFile, 1), kSmallBits);
    }
}

// 256 has no bit in its lower byte and is an opacity all the same.
TEST_F(GdalBitmapsTest, EveryOpacityButZeroSetsTheBit)
{
    {
        const auto poDataset = New(File("x.tif"), "GTiff", "ALPHA=YES");
        poDataset->CreateChannels({4, 1, 2, tessel::eDT_16U});
        BasicWriter oWriter(poDataset.get(), {2});
        const auto poRaster = RasterOf(Image<std::uint16_t>{{0, 1, 256, 65535}});
        oWriter.WriteRaster(poRaster.get());
    }
    EXPECT_EQ(BitmapOf(File("x.tif"), 1), (Bytes{{0, 1, 1, 1}}));
}

TEST_F(GdalBitmapsTest, FourChannelsHoldNoOpacitiesUnlessAskedFor)
{
    EXPECT_EQ(BitmapsIn(NewSmall("GTiff", "", 4))->GetBitmapCount(), 0U);
    std::filesystem::remove(File("x.tif"));
    EXPECT_EQ(BitmapsIn(NewSmall("GTiff", "ALPHA=YES", 4))->GetBitmapCount(), 1U);
}

TEST_F(GdalBitmapsTest, NoDataIsNoBitmap)
{
    const auto poDataset = NewSmall();
    AuxiliaryData oData;
    oData.SetChannelNoData(0.0, 1);
    poDataset->SetAuxiliaryData(oData);
    EXPECT_EQ(BitmapsIn(poDataset)->GetBitmapCount(), 0U);
    BitmapsIn(poDataset)->CreateBitmap(4, 3);
    EXPECT_EQ(BitmapsIn(poDataset)->GetBitmapCount(), 1U);
    EXPECT_EQ(poDataset->GetAuxiliaryData().GetChannelNoData(1), 0.0);
}

/// A mask in a file beside the image, as GDAL makes it when it is not told otherwise.
void MakeMaskFile(const std::string& oFile)
{
    GDALDatasetH hDataset = GDALOpen(oFile.c_str(), GA_ReadOnly);
    ASSERT_EQ(GDALCreateDatasetMaskBand(hDataset, GMF_PER_DATASET), CE_None);
    std::vector<int> vnMask = kSmallMask;
    ASSERT_EQ(GDALRasterIOEx(GDALGetMaskBand(GDALGetRasterBand(hDataset, 1)), GF_Write, 0, 0, 4, 3,
                             vnMask.data(), 4, 3, GDT_Int32, 0, 0, nullptr),
              CE_None);
    GDALClose(hDataset);
}

TEST_F(GdalBitmapsTest, MaskInAFileOfItsOwnIsReadAndChangedThere)
{
    Random oRandom(32);
    MakeFile(File("x.tif"), "GTiff", "", {4, 3, 1, tessel::eDT_8U}, oRandom);
    MakeMaskFile(File("x.tif"));
    ASSERT_EQ(moDirectory.Names(), (std::set<std::string>{"x.tif", "x.tif.msk"}));
    EXPECT_EQ(BitmapOf(File("x.tif"), 1), kSmallBits);
    {
        const auto poDataset = Open(File("x.tif"), true);
        EXPECT_THROW(BitmapsIn(poDataset)->CreateBitmap(4, 3), DataException);
        WriteBitmap(BitmapsIn(poDataset), 1, Bytes{{0, 1, 0, 0}, {0, 0, 0, 0}, {0, 0, 0, 1}});
        poDataset->Flush();
    }
    EXPECT_EQ(BitmapOf(File("x.tif"), 1), (Bytes{{0, 1, 0, 0}, {0, 0, 0, 0}, {0, 0, 0, 1}}));
}

TEST_F(GdalBitmapsTest, MaskFileOfAFormatThatIsNotAllowedIsNotOpened)
{
    Random oRandom(33);
    MakeFile(File("x.tif"), "GTiff", "", {4, 3, 1, tessel::eDT_8U}, oRandom);
    MakeMaskFile(File("x.tif"));
    const std::string oMoved = File("mask.tif");
    std::filesystem::rename(File("x.tif.msk"), oMoved);
    DatasetManager::AllowDriver("DTED");  // now GDAL knows VRT files as well
    moDirectory.Write("x.tif.msk",
                      "<VRTDataset rasterXSize=\"4\" rasterYSize=\"3\"><Metadata><MDI key=\""
                      "INTERNAL_MASK_FLAGS_1\">2</MDI></Metadata><VRTRasterBand dataType=\"Byte\" "
                      "band=\"1\"><SimpleSource><SourceFilename>" +
                          oMoved + "</SourceFilename></SimpleSource></VRTRasterBand></VRTDataset>");
    EXPECT_EQ(BitmapsIn(Open(File("x.tif"), false))->GetBitmapCount(), 0U);
    EXPECT_THROW(BitmapsIn(Open(File("x.tif"), true))->CreateBitmap(4, 3), DataException);
}

TEST_F(GdalBitmapsTest, MaskBuilderTakesTheBitmapAtTheRastersPlace)
{
    {
        const auto poDataset = NewSmall();
        BitmapsIn(poDataset)->CreateBitmap(4, 3);
        WriteBitmap(BitmapsIn(poDataset), 1, kSmall);
    }
    const auto poDataset = Open(File("x.tif"), false);
    const tessel::Raster oRaster({2, 2, 1, tessel::eDT_32R}, {1, 0, 2, 1});
    for (const bool bInverted : {false, true})
    {
        const BitmapMaskBuilder oBuilder(BitmapsIn(poDataset), 1, bInverted);
        const std::unique_ptr<tessel::Mask> poMask(oBuilder.BuildMask(oRaster));
        std::vector<unsigned char> vnRow(4);
        poMask->ExpandRow(-1, 0, vnRow);
        const unsigned char nOne = bInverted ? 0 : 1;
        const unsigned char nZero = bInverted ? 1 : 0;
        EXPECT_EQ(vnRow, (std::vector<unsigned char>{nZero, nOne, nZero, nZero}));
        poMask->ExpandRow(-1, 1, vnRow);
        EXPECT_EQ(vnRow, (std::vector<unsigned char>{nOne, nZero, nOne, nOne}));
    }
}

TEST_F(GdalBitmapsTest, MaskBuildersMayWorkAtOnce)
{
    {
        const auto poDataset = NewSmall();
        BitmapsIn(poDataset)->CreateBitmap(4, 3);
        WriteBitmap(BitmapsIn(poDataset), 1, kSmall);
    }
    const auto poDataset = Open(File("x.tif"), false);
    const BitmapMaskBuilder oBuilder(BitmapsIn(poDataset), 1, false);
    std::atomic<int> nSame = 0;
    std::vector<std::thread> voThreads;
    for (int i = 0; i < 4; ++i)
    {
        voThreads.emplace_back(
            [&]
            {
                const tessel::Raster oRaster({4, 3, 1, tessel::eDT_8U}, {});
                for (int k = 0; k < 20; ++k)
                {
                    const std::unique_ptr<tessel::Mask> poMask(oBuilder.BuildMask(oRaster));
                    std::vector<unsigned char> vnRow(4);
                    poMask->ExpandRow(0, 2, vnRow);
                    nSame += vnRow == std::vector<unsigned char>{1, 1, 0, 1} ? 1 : 0;
                }
            });
    }
    for (std::thread& oThread : voThreads)
    {
        oThread.join();
    }
    EXPECT_EQ(nSame, 80);
}

TEST_F(GdalBitmapsTest, AuxiliaryDataOfAChannelOfBitsAreThoseOfTheChannel)
{
    const auto poDataset = NewSmall("GTiff", "NBITS=1", 2);
    IBitmapDataset* poBitmaps = BitmapsIn(poDataset);
    AuxiliaryData oData;
    oData.SetChannelDescription("water", 1);
    oData.SetFileMetadata({{"sensor", "X"}});
    poBitmaps->SetBitmapAuxiliaryData(oData, 2);
    EXPECT_EQ(poDataset->GetAuxiliaryData().GetChannelDescription(2), "water");
    EXPECT_EQ(poDataset->GetAuxiliaryData().GetChannelDescription(1), "");
    EXPECT_EQ(poBitmaps->GetBitmapAuxiliaryData(2).GetChannelDescription(1), "water");
    EXPECT_EQ(poBitmaps->GetBitmapAuxiliaryData(1).GetChannelDescription(1), "");
    EXPECT_EQ(poBitmaps->GetBitmapAuxiliaryData(1).GetFileMetadata().at("sensor"), "X");
    EXPECT_THROW(poBitmaps->GetBitmapAuxiliaryData(3), IOException);
}

TEST_F(GdalBitmapsTest, MaskHasNoAuxiliaryDataOfItsOwn)
{
    const auto poDataset = NewSmall();
    IBitmapDataset* poBitmaps = BitmapsIn(poDataset);
    poBitmaps->CreateBitmap(4, 3);
    AuxiliaryData oData;
    oData.SetChannel({}, 1);
    oData.SetFileMetadata({{"sensor", "X"}});
    poBitmaps->SetBitmapAuxiliaryData(oData, 1);
    EXPECT_EQ(poDataset->GetAuxiliaryData().GetFileMetadata().at("sensor"), "X");
    oData.SetChannelDescription("water", 1);
    EXPECT_EQ(MessageOf<DataException>([&] { poBitmaps->SetBitmapAuxiliaryData(oData, 1); }),
              File("x.tif") +
                  ": the mask of a file of the format GTiff has no description, "
                  "no-data value or metadata of its own");
}

TEST_F(GdalBitmapsTest, DamagedFilesDoNoHarm)
{
    Random oRandom(34);
    {
        const auto poDataset =
            New(File("x.tif"), "GTiff", "TILED=YES BLOCKXSIZE=16 BLOCKYSIZE=16 COMPRESS=DEFLATE");
        poDataset->CreateChannels({40, 40, 1, tessel::eDT_8U});
        BitmapsIn(poDataset)->CreateBitmap(40, 40);
        BasicWriter oWriter(BitmapsIn(poDataset), 1);
        const auto poBits =
            test::RandomRaster(40, 40, 1, tessel::eDT_8U, {}, test::Samples::Ordinary, oRandom);
        oWriter.WriteRaster(poBits.get());
    }
    const std::string oWhole = test::BytesOf(File("x.tif"));
    int nRead = 0;
    for (int i = 0; i < 200; ++i)
    {
        std::string oBytes = oWhole;
        for (int k = 0; k < 3; ++k)
        {
            oBytes[oRandom() % oBytes.size()] = static_cast<char>(oRandom());
        }
        if (i % 10 == 9)
        {
            oBytes.resize(oRandom() % oBytes.size());
        }
        const std::string oFile = moDirectory.Write("y.tif", oBytes);
        try
        {
            const auto poDataset = Open(oFile, false);
            for (unsigned int n = 1; n <= BitmapsIn(poDataset)->GetBitmapCount(); ++n)
            {
                BitmapReader oReader(BitmapsIn(poDataset), n);
                oReader.SetTileSize(40, 40);
                delete oReader.GetRaster(0);
                ++nRead;
            }
        }
        catch (const Exception& oError)
        {
            EXPECT_TRUE(std::string(oError.what()).starts_with(oFile)) << oError.what();
        }
    }
    EXPECT_GT(nRead, 0);
}

TEST_F(GdalBitmapsTest, FullDiskIsReportedAtTheLatestByFlush)
{
    const auto poDataset = New(File("x.tif"));
    poDataset->CreateChannels({2000, 2000, 1, tessel::eDT_8U});
    poDataset->Flush();
    const test::FullDisk oFull(std::filesystem::file_size(File("x.tif")));
    EXPECT_TRUE(MessageOf<IOException>(
                    [&]
                    {
                        BitmapsIn(poDataset)->CreateBitmap(2000, 2000);
                        BasicWriter oWriter(BitmapsIn(poDataset), 1);
                        const auto poOnes = test::BlankRaster(2000, 2000, 1, tessel::eDT_8U);
                        oWriter.WriteRaster(poOnes.get());
                        oWriter.Flush();
                    })
                    .starts_with(File("x.tif") + ": cannot "));
}

}  // namespace
}  // namespace kor::datasources
