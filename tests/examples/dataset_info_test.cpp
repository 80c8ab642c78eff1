#include <gtest/gtest.h>

#include <memory>
#include <string>

#include "platform/datasources/basicwriter.h"
#include "platform/datasources/datasetmanager.h"
#include "platform/datasources/gdal/gdaldriver.h"
#include "tests/support/blocks.h"
#include "tests/support/program.h"
#include "tests/support/temporarydirectory.h"

namespace kor::test
{
namespace
{

using datasources::AuxiliaryData;
using datasources::IBitmapDataset;
using datasources::IRasterDataset;

/// The program, run on files in a folder of its own.
class DatasetInfo : public ::testing::Test
{
protected:
    void SetUp() override { datasources::RegisterGdalDriver(); }

    int Run(const std::vector<std::string>& voFiles)
    {
        std::string oWords;
        for (const std::string& oFile : voFiles)
        {
            oWords += " '" + oFile + "'";
        }
        moRun = RunExample("dataset_info", oWords);
        return moRun.mnStatus;
    }
    const std::string& Said() const { return moRun.moSaid; }
    const std::string& Complaint() const { return moRun.moComplaint; }
    std::string File(const std::string& oName) const { return moFolder.File(oName); }

    std::unique_ptr<IRasterDataset> New(const std::string& oName, const std::string& oFormat,
                                        const std::string& oOptions) const
    {
        return std::unique_ptr<IRasterDataset>(
            dynamic_cast<IRasterDataset*>(datasources::DatasetManager::GetInstance()->NewDataset(
                File(oName), oFormat, oOptions)));
    }

    TemporaryDirectory moFolder;
    ProgramRun moRun;
};

void Describe(IRasterDataset& oImage)
{
    AuxiliaryData oData;
    oData.SetChannel({"height \"above\" sea", {{"unit", "m"}, {"LOOKS", "4"}}, -9999.0}, 1);
    oData.SetFileMetadata({{"sensor", "radar = X"}});
    oImage.SetAuxiliaryData(oData);
    ogc::cs::GeocodingInfo oPlace({500000.5, 10.0, 0.25, 5600000.0, 0.0, -10.0});
    oPlace.SetProjection(
        "GEOGCS[\"WGS 84\",DATUM[\"WGS_1984\",SPHEROID[\"WGS 84\",6378137,"
        "298.257223563]],PRIMEM[\"Greenwich\",0],"
        "UNIT[\"degree\",0.0174532925199433]]");
    oImage.SetGeocodingInfo(oPlace);
    dynamic_cast<IBitmapDataset&>(oImage).CreateBitmap(40, 33);
    oImage.Flush();
}

TEST_F(DatasetInfo, TellsAllOfAKordskFile)
{
    {
        const auto poImage = New("x.kdk", "KORDSK", "");
        poImage->CreateChannels({40, 33, 1, tessel::eDT_32R});
        poImage->CreateChannels({40, 33, 1, tessel::eDT_C16U});
        Describe(*poImage);
        AuxiliaryData oBitmap;
        oBitmap.SetFileMetadata(poImage->GetAuxiliaryData().GetFileMetadata());
        oBitmap.SetChannelDescription("water\n", 1);
        dynamic_cast<IBitmapDataset&>(*poImage).SetBitmapAuxiliaryData(oBitmap, 1);
    }
    EXPECT_EQ(Run({File("x.kdk")}), 0);
    EXPECT_EQ(Said(), File("x.kdk") + R"(
  size            40 x 33 pixels
  tiles           40 x 33 pixels
  place           X = 500000.5 + column * 10 + row * 0.25
                  Y = 5600000 + column * 0 + row * -10
  coordinates     "WGS 84"
  metadata        "sensor" = "radar = X"
  channel 1       eDT_32R, "height \"above\" sea", no data -9999
    metadata      "LOOKS" = "4"
    metadata      "unit" = "m"
  channel 2       eDT_C16U
  bitmap 1        one bit a pixel, "water\x0A"
)");
    EXPECT_EQ(Complaint(), "");
}

TEST_F(DatasetInfo, TellsAllOfAGeoTiff)
{
    {
        const auto poImage = New("x.tif", "GTiff", "TILED=YES BLOCKXSIZE=16 BLOCKYSIZE=32");
        poImage->CreateChannels({40, 33, 1, tessel::eDT_16S});
        Describe(*poImage);
    }
    const std::string oBytes = BytesOf(File("x.tif"));
    EXPECT_EQ(Run({File("x.tif")}), 0);
    EXPECT_EQ(Said(), File("x.tif") + R"(
  size            40 x 33 pixels
  tiles           16 x 32 pixels
  place           X = 500000.5 + column * 10 + row * 0.25
                  Y = 5600000 + column * 0 + row * -10
  coordinates     "WGS 84"
  metadata        "AREA_OR_POINT" = "Area"
  metadata        "sensor" = "radar = X"
  channel 1       eDT_16S, "height \"above\" sea", no data -9999
    metadata      "LOOKS" = "4"
    metadata      "unit" = "m"
  bitmap 1        one bit a pixel
)");
    EXPECT_EQ(Complaint(), "");
    EXPECT_EQ(BytesOf(File("x.tif")), oBytes);
    EXPECT_EQ(moFolder.Names(), std::set<std::string>{"x.tif"});
}

TEST_F(DatasetInfo, TellsOfFilesThatSayNothing)
{
    New("x.tif", "GTiff", "")->CreateChannels({4, 3, 2, tessel::eDT_8U});
    New("y.kdk", "KORDSK", "").reset();
    EXPECT_EQ(Run({File("x.tif"), File("y.kdk")}), 0);
    EXPECT_EQ(Said(), File("x.tif") + R"(
  size            4 x 3 pixels
  tiles           4 x 3 pixels
  place           not told
  channel 1       eDT_8U
  channel 2       eDT_8U
)" + File("y.kdk") + R"(
  size            0 x 0 pixels
  place           not told
)");
}

TEST_F(DatasetInfo, ReportsAFileItCannotReadAndTellsOfTheOthers)
{
    New("x.tif", "GTiff", "")->CreateChannels({4, 3, 1, tessel::eDT_8U});
    const std::string oWhole = BytesOf(File("x.tif"));
    moFolder.Write("damaged.tif", oWhole.substr(0, 20));
    moFolder.Write("text.txt", "no image");
    EXPECT_EQ(Run({File("missing.tif"), File("damaged.tif"), File("text.txt"), File("x.tif")}), 1);
    EXPECT_EQ(Said().substr(0, File("x.tif").size() + 1), File("x.tif") + "\n");
    const std::string oComplaint = Complaint();
    EXPECT_EQ(std::count(oComplaint.begin(), oComplaint.end(), '\n'), 3) << oComplaint;
    EXPECT_TRUE(oComplaint.starts_with(
        "dataset_info: " + File("missing.tif") +
        ": there is no such file\ndataset_info: " + File("damaged.tif") + ": "))
        << oComplaint;
    EXPECT_NE(oComplaint.find(File("text.txt") + ": no driver knows this kind of file"),
              std::string::npos)
        << oComplaint;
}

TEST_F(DatasetInfo, AsksForAFile)
{
    EXPECT_EQ(Run({}), 1);
    EXPECT_EQ(Said(), "");
    EXPECT_EQ(Complaint(), "Usage: dataset_info FILE...\n");
}

}  // namespace
}  // namespace kor::test
