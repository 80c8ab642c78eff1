#include "platform/datasources/gdal/gdalfile.h"

#include <gdal.h>
#include <gdal_version.h>
#include <gtest/gtest.h>

#include <algorithm>

#include "platform/datasources/datatypename.h"
#include "tests/platform/datasources/gdal/gdalfiles.h"
#include "tests/support/kordskfiles.h"

namespace kor::datasources
{
namespace
{

using test::MessageOf;
using test::Random;
using test::SameBits;

constexpr bool kInt8InFiles = GDAL_VERSION_NUM >= GDAL_COMPUTE_VERSION(3, 7, 0);

class GdalFileTest : public test::GdalFilesTest
{
protected:
    /// A file of a format that is made from another one as a whole, by GDAL.
    std::string MakeCopy(const std::string& oFormat, const std::string& oName) const
    {
        Random oRandom(71);
        // The one size that SRTMHGT has.
        const unsigned int nSide = oFormat == "SRTMHGT" ? 1201 : 64;
        const tessel::DataType oType = oFormat == "SRTMHGT" ? tessel::eDT_16S : tessel::eDT_8U;
        MakeFile(File("from.tif"), "GTiff", "", {nSide, nSide, 1, oType}, oRandom);
        GDALDatasetH hFrom = GDALOpen(File("from.tif").c_str(), GA_ReadOnly);
        double adfPlace[6] = {11.0 - 0.5 / 1200, 1.0 / 1200, 0.0,
                              49.0 + 0.5 / 1200, 0.0,        -1.0 / 1200};
        GDALDatasetH hPlaced =
            GDALCreateCopy(GDALGetDriverByName("MEM"), "", hFrom, FALSE, nullptr, nullptr, nullptr);
        GDALSetGeoTransform(hPlaced, adfPlace);
        GDALSetProjection(hPlaced,
                          "GEOGCS[\"WGS 84\",DATUM[\"WGS_1984\",SPHEROID[\"WGS 84\","
                          "6378137,298.257223563]],PRIMEM[\"Greenwich\",0],"
                          "UNIT[\"degree\",0.0174532925199433]]");
        GDALDatasetH hTo = GDALCreateCopy(GDALGetDriverByName(oFormat.c_str()), File(oName).c_str(),
                                          hPlaced, FALSE, nullptr, nullptr, nullptr);
        EXPECT_NE(hTo, nullptr) << oFormat;
        GDALClose(hTo);
        GDALClose(hPlaced);
        GDALClose(hFrom);
        moDirectory.Clear("from");
        return File(oName);
    }
};

struct Holding
{
    std::string moFormat;
    std::vector<tessel::DataType> mvoTypes;
};

/// What each format holds of the seventeen types.
std::vector<Holding> Holdings()
{
    using namespace tessel;
    std::vector<Holding> voHoldings = {
        {"GTiff",
         {eDT_8U, eDT_8S, eDT_16U, eDT_16S, eDT_32U, eDT_32S, eDT_32R, eDT_64U, eDT_64S, eDT_64R,
          eDT_C16S, eDT_C32S, eDT_C32R, eDT_C64R}},
        {"ENVI",
         {eDT_8U, eDT_16U, eDT_16S, eDT_32U, eDT_32S, eDT_32R, eDT_64R, eDT_C32R, eDT_C64R}},
        {"EHdr", {eDT_8U, eDT_8S, eDT_16U, eDT_16S, eDT_32U, eDT_32S, eDT_32R}},
        {"HFA",
         {eDT_8U, eDT_8S, eDT_16U, eDT_16S, eDT_32U, eDT_32S, eDT_32R, eDT_64R, eDT_C32R,
          eDT_C64R}}};
    if (kInt8InFiles)
    {
        voHoldings[1].mvoTypes.insert(voHoldings[1].mvoTypes.end(), {eDT_64U, eDT_64S});
    }
    return voHoldings;
}

TEST_F(GdalFileTest, TypesThatAFormatHoldsComeBackAndOthersAreRefusedByName)
{
    Random oRandom(72);
    for (const Holding& oHolding : Holdings())
    {
        for (const tessel::DataType& oType : test::kAllTypes)
        {
            const std::string oCase = oHolding.moFormat + " " + DataTypeName(oType);
            if (std::find(oHolding.mvoTypes.begin(), oHolding.mvoTypes.end(), oType) !=
                oHolding.mvoTypes.end())
            {
                const auto poWritten =
                    MakeFile(File("x.img"), oHolding.moFormat, "", {23, 17, 2, oType}, oRandom);
                EXPECT_TRUE(SameBits(*ReadFile(File("x.img")), *poWritten)) << oCase;
                moDirectory.Clear();
                continue;
            }
            const std::string oMessage = MessageOf<DataException>(
                [&] {
                    New(File("x.img"), oHolding.moFormat)->CreateChannels({23, 17, 2, oType});
                });
            EXPECT_TRUE(oMessage.starts_with(File("x.img") + ": the format " + oHolding.moFormat +
                                             " cannot hold samples of " + DataTypeName(oType)))
                << oCase << ": " << oMessage;
            EXPECT_TRUE(moDirectory.Names().empty()) << oCase;
        }
    }
}

TEST_F(GdalFileTest, FormatsThatAreMadeAsAWholeAreRefusedWithThoseThatAreNot)
{
    for (const std::string oFormat : {"COG", "AAIGrid", "SRTMHGT", "JP2OpenJPEG", "PNG", "JPEG"})
    {
        EXPECT_TRUE(MessageOf<DataException>([&] { New(File("x"), oFormat); })
                        .starts_with(File("x") + ": files of the format " + oFormat +
                                     " can be read but not made block by block; formats that can: "
                                     "GTiff ENVI EHdr HFA"));
    }
    EXPECT_TRUE(moDirectory.Names().empty());
}

TEST_F(GdalFileTest, FormatsThatCannotBeChangedAreRefusedOnOpeningAndStayAsTheyAre)
{
    const std::vector<std::pair<std::string, std::string>> voFormats = {{"AAIGrid", "x.asc"},
                                                                        {"SRTMHGT", "N48E011.hgt"},
                                                                        {"JP2OpenJPEG", "x.jp2"},
                                                                        {"PNG", "x.png"},
                                                                        {"JPEG", "x.jpg"}};
    for (const auto& [oFormat, oName] : voFormats)
    {
        const std::string oFile = MakeCopy(oFormat, oName);
        const std::string oBytes = test::BytesOf(oFile);
        const auto oNames = moDirectory.Names();
        EXPECT_EQ(MessageOf<FileException>([&] { Open(oFile, true); }),
                  oFile + ": cannot open the file for changing: files of the format " + oFormat +
                      " can be read but not changed block by block");
        EXPECT_NE(ReadFile(oFile), nullptr);
        EXPECT_EQ(test::BytesOf(oFile), oBytes) << oFormat;
        EXPECT_EQ(moDirectory.Names(), oNames) << oFormat;
        moDirectory.Clear();
    }
}

TEST_F(GdalFileTest, ChannelsCannotBeAddedToAFileThatIsThere)
{
    Random oRandom(74);
    for (const Holding& oHolding : Holdings())
    {
        const std::string oFile = File("x.img");
        const auto poWritten =
            MakeFile(oFile, oHolding.moFormat, "", {9, 7, 1, tessel::eDT_8U}, oRandom);
        {
            const auto poDataset = Open(oFile, true);
            EXPECT_EQ(MessageOf<DataException>(
                          [&] {
                              poDataset->CreateChannels({9, 7, 1, tessel::eDT_8U});
                          }),
                      oFile + ": the format " + oHolding.moFormat +
                          " cannot add channels to a file; make all of them by one call");
            EXPECT_EQ(MessageOf<DataException>(
                          [&] {
                              poDataset->CreateChannels({9, 7, 1, tessel::eDT_32R});
                          }),
                      oFile + ": the format " + oHolding.moFormat +
                          " cannot hold channels of eDT_32R beside channels of eDT_8U");
            EXPECT_EQ(poDataset->GetChannelCount(), 1U);
        }
        EXPECT_TRUE(SameBits(*ReadFile(oFile), *poWritten)) << oHolding.moFormat;
        moDirectory.Clear();
    }
}

// An older image's companions would be read as the new one's: its no-data value, its mask.
TEST_F(GdalFileTest, FilesLeftByAnOlderImageAreNotTakenForTheNewOnes)
{
    for (const std::string oEnding : {".aux.xml", ".msk", ".ovr"})
    {
        for (const std::string oFormat : {"GTiff", "ENVI"})
        {
            const std::string oLeft = moDirectory.Write("x.img" + oEnding, "precious");
            EXPECT_EQ(
                MessageOf<FileException>(
                    [&] {
                        New(File("x.img"), oFormat)->CreateChannels({9, 7, 1, tessel::eDT_8U});
                    }),
                File("x.img") + ": the file " + oLeft +
                    ", which belongs to it, exists already and is not overwritten");
            EXPECT_EQ(test::BytesOf(oLeft), "precious");
            EXPECT_EQ(moDirectory.Names(), (std::set<std::string>{"x.img" + oEnding}));
            moDirectory.Clear();
        }
    }
}

TEST_F(GdalFileTest, CogIsReadAndChangedAsTheGeoTiffThatItIs)
{
    const std::string oFile = MakeCopy("COG", "x.tif");
    const auto poPixels = ReadFile(oFile);
    poPixels->mpBuffer[65] = static_cast<unsigned char>(~poPixels->mpBuffer[65]);
    {
        const auto poDataset = Open(oFile, true);
        BasicWriter oWriter(poDataset.get(), {1});
        oWriter.WriteRaster(poPixels.get());
        oWriter.Flush();
    }
    EXPECT_TRUE(SameBits(*ReadFile(oFile), *poPixels));
}

}  // namespace
}  // namespace kor::datasources
