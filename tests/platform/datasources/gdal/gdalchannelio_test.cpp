#include "platform/datasources/gdal/gdalchannelio.h"

#include <gdal.h>
#include <gtest/gtest.h>

#include <algorithm>
#include <cstring>

#include "processes/qrdfilters/datacopy.h"
#include "processes/qrdfilters/parallelio/filteriodriver.h"
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

class GdalChannelIOTest : public test::GdalFilesTest
{
};

/// GDAL's cache at a size at which blocks leave it at once.
class SmallCache
{
public:
    SmallCache() : mnFormer(GDALGetCacheMax64()) { GDALSetCacheMax64(4096); }
    SmallCache(const SmallCache&) = delete;
    SmallCache& operator=(const SmallCache&) = delete;
    ~SmallCache() { GDALSetCacheMax64(mnFormer); }

private:
    GIntBig mnFormer;
};

struct Layout
{
    std::string moFormat;
    std::string moOptions;
    unsigned int mnTileWidth;  ///< of an image of 83 x 59 pixels
    unsigned int mnTileHeight;
};

const std::vector<Layout> kLayouts = {
    {"GTiff", "BLOCKYSIZE=1", 83, 1},
    {"GTiff", "BLOCKYSIZE=7", 83, 7},
    {"GTiff", "BLOCKYSIZE=7 INTERLEAVE=BAND COMPRESS=LZW", 83, 7},
    {"GTiff", "BLOCKYSIZE=59 COMPRESS=DEFLATE PREDICTOR=2", 83, 59},
    {"GTiff", "BLOCKYSIZE=100 COMPRESS=PACKBITS", 83, 59},
    {"GTiff", "TILED=YES BLOCKXSIZE=16 BLOCKYSIZE=16", 16, 16},
    {"GTiff", "TILED=YES BLOCKXSIZE=16 BLOCKYSIZE=48 INTERLEAVE=BAND", 16, 48},
    {"GTiff", "TILED=YES BLOCKXSIZE=48 BLOCKYSIZE=16 COMPRESS=DEFLATE", 48, 16},
    {"GTiff", "TILED=YES BLOCKXSIZE=32 BLOCKYSIZE=32 COMPRESS=LZW SPARSE_OK=YES", 32, 32},
    {"GTiff", "TILED=YES BLOCKXSIZE=32 BLOCKYSIZE=32 COMPRESS=DEFLATE BIGTIFF=YES", 32, 32},
    {"GTiff", "TILED=YES", 83, 59},
    {"HFA", "BLOCKSIZE=32", 32, 32},
    {"HFA", "COMPRESSED=YES", 64, 59},
    {"ENVI", "INTERLEAVE=BSQ", 83, 1},
    {"ENVI", "INTERLEAVE=BIL", 83, 1},
    {"EHdr", "", 83, 1}};

/// Writes the block of oWhole of that size at (nX, nY), as far as it lies in it.
void WriteBlockOf(const tessel::Raster& oWhole, BasicWriter& oWriter, std::uint32_t nX,
                  std::uint32_t nY, std::uint32_t nWidth, std::uint32_t nHeight)
{
    tessel::Raster oBlock({nWidth, nHeight, oWhole.mnChannels, oWhole.moDataType}, {1, 2, nX, nY});
    std::memset(oBlock.mpBuffer, 0x5A, oBlock.mnBufferSize);
    const std::size_t nPixelBytes = oWhole.moDataType.GetSampleBytes() * oWhole.mnChannels;
    for (std::uint32_t y = 0; y < std::min(nHeight, oWhole.mnHeight - nY); ++y)
    {
        std::memcpy(oBlock.GetPixel(0, y), oWhole.GetPixel(nX, nY + y),
                    std::min(nWidth, oWhole.mnWidth - nX) * nPixelBytes);
    }
    oWriter.WriteRaster(&oBlock);
}

TEST_F(GdalChannelIOTest, ReadersAndWritersTakeTheFilesTiles)
{
    for (const Layout& oLayout : kLayouts)
    {
        const std::string oFile = File("x.img");
        const std::string oName = oLayout.moFormat + " " + oLayout.moOptions;
        {
            const auto poDataset = New(oFile, oLayout.moFormat, oLayout.moOptions);
            poDataset->CreateChannels({83, 59, 2, tessel::eDT_16S});
            const BasicWriter oWriter(poDataset.get(), {1, 2});
            EXPECT_EQ(oWriter.GetTileWidth(), oLayout.mnTileWidth) << oName;
            EXPECT_EQ(oWriter.GetTileHeight(), oLayout.mnTileHeight) << oName;
        }
        const BasicReader oReader(oFile, {2}, 0);
        EXPECT_EQ(oReader.GetTileWidth(), oLayout.mnTileWidth) << oName;
        EXPECT_EQ(oReader.GetTileHeight(), oLayout.mnTileHeight) << oName;
        moDirectory.Clear();
    }
}

TEST_F(GdalChannelIOTest, PixelsNeverWrittenAreZeroInEveryLayout)
{
    for (const Layout& oLayout : kLayouts)
    {
        const std::string oFile = File("x.img");
        New(oFile, oLayout.moFormat, oLayout.moOptions)
            ->CreateChannels({83, 59, 2, tessel::eDT_16S});
        const auto poZeros = ReadFile(oFile);
        EXPECT_EQ(std::count(poZeros->mpBuffer, poZeros->mpBuffer + poZeros->mnBufferSize, 0),
                  static_cast<std::ptrdiff_t>(poZeros->mnBufferSize))
            << oLayout.moFormat << " " << oLayout.moOptions;
        moDirectory.Clear();
    }
}

// Blocks that cut tiles in pieces, in any order, so that each tile is written many times; now and
// then all is flushed or pushed out of the cache in between.
TEST_F(GdalChannelIOTest, BlocksOfAnyShapeMakeTheImageInEveryLayout)
{
    Random oRandom(51);
    for (const Layout& oLayout : kLayouts)
    {
        for (const bool bSmallCache : {false, true})
        {
            const std::unique_ptr<SmallCache> poCache(bSmallCache ? new SmallCache : nullptr);
            const std::string oFile = File("x.img");
            const auto poWhole =
                RandomRaster(83, 59, 2, tessel::eDT_16S, {}, Samples::Ordinary, oRandom);
            const auto poDataset = New(oFile, oLayout.moFormat, oLayout.moOptions);
            poDataset->CreateChannels({83, 59, 2, tessel::eDT_16S});
            BasicWriter oWriter(poDataset.get(), {1, 2});
            std::vector<std::pair<std::uint32_t, std::uint32_t>> voCorners;
            for (std::uint32_t nY = 0; nY < 59; nY += 13)
            {
                for (std::uint32_t nX = 0; nX < 83; nX += 21)
                {
                    voCorners.emplace_back(nX, nY);
                }
            }
            std::shuffle(voCorners.begin(), voCorners.end(), oRandom);
            for (std::size_t i = 0; i < voCorners.size(); ++i)
            {
                WriteBlockOf(*poWhole, oWriter, voCorners[i].first, voCorners[i].second, 21, 13);
                if (i % 8 == 7)
                {
                    oWriter.Flush();
                }
            }
            poDataset->Flush();
            EXPECT_TRUE(SameBits(*ReadFile(oFile), *poWhole))
                << oLayout.moFormat << " " << oLayout.moOptions;
            moDirectory.Clear();
        }
    }
}

TEST_F(GdalChannelIOTest, FileThatIsThereIsChangedBlockByBlock)
{
    Random oRandom(52);
    for (const Layout& oLayout : kLayouts)
    {
        const std::string oFile = File("x.img");
        const auto poWhole = MakeFile(oFile, oLayout.moFormat, oLayout.moOptions,
                                      {83, 59, 2, tessel::eDT_16S}, oRandom);
        for (int i = 0; i < 3; ++i)
        {
            const auto nX = static_cast<std::uint32_t>(oRandom() % 60);
            const auto nY = static_cast<std::uint32_t>(oRandom() % 40);
            const auto poPatch =
                RandomRaster(20, 17, 2, tessel::eDT_16S, {}, Samples::Ordinary, oRandom);
            poPatch->mnOffsetX = nX;
            poPatch->mnOffsetY = nY;
            const auto poDataset = Open(oFile, true);
            BasicWriter oWriter(poDataset.get(), {1, 2});
            oWriter.WriteRaster(poPatch.get());
            oWriter.Flush();
            for (std::uint32_t y = 0; y < 17; ++y)
            {
                std::memcpy(poWhole->GetPixel(nX, nY + y), poPatch->GetPixel(0, y), 20 * 4);
            }
        }
        EXPECT_TRUE(SameBits(*ReadFile(oFile), *poWhole))
            << oLayout.moFormat << " " << oLayout.moOptions;
        moDirectory.Clear();
    }
}

// One channel at a time into tiles that hold both.
TEST_F(GdalChannelIOTest, ChannelsOfOneTileAreWrittenOneByOne)
{
    Random oRandom(53);
    const auto poWhole = RandomRaster(83, 59, 2, tessel::eDT_32R, {}, Samples::Special, oRandom);
    {
        const auto poDataset =
            New(File("x.tif"), "GTiff", "TILED=YES BLOCKXSIZE=32 BLOCKYSIZE=16 COMPRESS=DEFLATE");
        poDataset->CreateChannels({83, 59, 2, tessel::eDT_32R});
        for (unsigned int nChannel = 1; nChannel <= 2; ++nChannel)
        {
            tessel::Raster oOne({83, 59, 1, tessel::eDT_32R}, {});
            for (std::uint32_t i = 0; i < 83 * 59; ++i)
            {
                oOne.GetPixelAs<float>(0, 0)[i] =
                    poWhole->GetPixelAs<float>(0, 0)[2 * i + nChannel - 1];
            }
            BasicWriter oWriter(poDataset.get(), {nChannel});
            oWriter.WriteRaster(&oOne);
            oWriter.Flush();
        }
    }
    EXPECT_TRUE(SameBits(*ReadFile(File("x.tif")), *poWhole));
}

TEST_F(GdalChannelIOTest, ImagesOfOneRowColumnAndPixelHoldTheirSamples)
{
    Random oRandom(54);
    const std::vector<std::pair<unsigned int, unsigned int>> voSizes = {{1, 1}, {300, 1}, {1, 300}};
    for (const auto& [nWidth, nHeight] : voSizes)
    {
        for (const std::string oOptions :
             {"", "TILED=YES BLOCKXSIZE=16 BLOCKYSIZE=16 COMPRESS=DEFLATE"})
        {
            const std::string oFile = File("x.tif");
            const auto poWritten =
                MakeFile(oFile, "GTiff", oOptions, {nWidth, nHeight, 3, tessel::eDT_16U}, oRandom);
            EXPECT_TRUE(SameBits(*ReadFile(oFile), *poWritten)) << nWidth << " " << oOptions;
            std::filesystem::remove(oFile);
        }
    }
}

TEST_F(GdalChannelIOTest, SamplesOfMoreBitsThanTheChannelHasAreRefused)
{
    const auto oMessage =
        [&]<class T>(const std::string& oFormat, const std::string& oBits, T nFits, T nMore)
    {
        moDirectory.Clear();
        const auto poDataset = New(File("x.img"), oFormat, "NBITS=" + oBits);
        const auto poFitting = test::RasterOf(test::Image<T>{{0, nFits}});
        poDataset->CreateChannels(*poFitting);
        BasicWriter oWriter(poDataset.get(), {1});
        oWriter.WriteRaster(poFitting.get());
        const auto poTooLarge = test::RasterOf(test::Image<T>{{0, nMore}});
        const std::string oText =
            MessageOf<IOException>([&] { oWriter.WriteRaster(poTooLarge.get()); });
        poDataset->Flush();
        EXPECT_TRUE(SameBits(*ReadFile(File("x.img")), *poFitting)) << oFormat << " " << oBits;
        return oText;
    };
    EXPECT_EQ(oMessage("GTiff", "1", std::uint8_t{1}, std::uint8_t{2}),
              File("x.img") + ": channel 1 has 1 bits a sample (NBITS) and cannot hold 2");
    EXPECT_EQ(oMessage("HFA", "4", std::uint8_t{15}, std::uint8_t{16}),
              File("x.img") + ": channel 1 has 4 bits a sample (NBITS) and cannot hold 16");
    EXPECT_EQ(oMessage("GTiff", "12", std::uint16_t{4095}, std::uint16_t{4096}),
              File("x.img") + ": channel 1 has 12 bits a sample (NBITS) and cannot hold 4096");
    EXPECT_EQ(oMessage("GTiff", "24", std::uint32_t{0xFFFFFF}, std::uint32_t{0x1000000}),
              File("x.img") + ": channel 1 has 24 bits a sample (NBITS) and cannot hold 16777216");
}

TEST_F(GdalChannelIOTest, FloatsOfFewerBitsAreNotWritten)
{
    const auto poDataset = New(File("x.tif"), "GTiff", "NBITS=16");
    poDataset->CreateChannels({2, 1, 1, tessel::eDT_32R});
    BasicWriter oWriter(poDataset.get(), {1});
    const auto poRaster = test::RasterOf(test::Image<float>{{0, 1}});
    EXPECT_EQ(MessageOf<IOException>([&] { oWriter.WriteRaster(poRaster.get()); }),
              File("x.tif") +
                  ": channel 1 has 16 bits a sample (NBITS), too few for floating "
                  "point to be written as it is");
}

// The block driver, with so little memory that blocks are a few tiles or rows, from each layout to
// each other.
TEST_F(GdalChannelIOTest, BlockDriverCopiesBetweenAllLayouts)
{
    Random oRandom(55);
    const std::vector<std::pair<std::string, std::string>> voLayouts = {
        {"GTiff", "BLOCKYSIZE=7"},
        {"GTiff", "TILED=YES BLOCKXSIZE=16 BLOCKYSIZE=32 COMPRESS=DEFLATE"},
        {"ENVI", ""},
        {"KORDSK", ""}};
    for (const auto& [oInFormat, oInOptions] : voLayouts)
    {
        const auto poWhole =
            MakeFile(File("in"), oInFormat, oInOptions, {83, 59, 2, tessel::eDT_16S}, oRandom);
        for (const auto& [oOutFormat, oOutOptions] : voLayouts)
        {
            {
                const auto poIn = Open(File("in"), false);
                const auto poOut = New(File("out"), oOutFormat, oOutOptions);
                poOut->CreateChannels({83, 59, 2, tessel::eDT_16S});
                BasicReader oReader(poIn.get(), {1, 2});
                BasicWriter oWriter(poOut.get(), {1, 2});
                parallelio::FilterIODriver<filters::QRDDataCopyAlgorithm,
                                           parallelio::DefaultAccessPolicy,
                                           parallelio::DefaultUpdateStrategy>
                    oDriver;
                oDriver.SetMemoryBudget(16 * 1024);
                oDriver.Run(&oReader, &oWriter);
                oWriter.Flush();
            }
            EXPECT_TRUE(SameBits(*ReadFile(File("out")), *poWhole))
                << oInFormat << " " << oInOptions << " to " << oOutFormat << " " << oOutOptions;
            moDirectory.Clear("out");
        }
        moDirectory.Clear();
    }
}

}  // namespace
}  // namespace kor::datasources
