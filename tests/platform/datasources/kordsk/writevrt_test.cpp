#include "platform/datasources/kordsk/writevrt.h"

#include <gtest/gtest.h>

#include "tests/support/exceptions.h"
#include "tests/support/kordskfiles.h"
#include "tests/support/temporarydirectory.h"

namespace kor::datasources
{
namespace
{

using test::MessageOf;
using test::NewKordsk;

class WriteVrtTest : public ::testing::Test
{
protected:
    test::TemporaryDirectory moDirectory;
    const std::string moFile = moDirectory.File("a&b.kdk");
};

TEST_F(WriteVrtTest, DescribesChannelsAsRawBands)
{
    const auto poKordsk = NewKordsk(moFile);
    poKordsk->CreateChannels({30, 20, 1, tessel::eDT_16U});
    poKordsk->CreateChannels({30, 20, 1, tessel::eDT_8S});
    poKordsk->CreateBitmap(30, 20);
    AuxiliaryData oData;
    oData.SetFileMetadata({{"k<\n", "v\x01\xFF\xC3\xBC"}});
    oData.SetChannel({"\"first\"", {{"UNIT", "dB"}}, 65535.0}, 1);
    oData.SetChannelNoData(-0.5, 2);
    poKordsk->SetAuxiliaryData(oData);
    ogc::cs::GeocodingInfo oPlace({500000, 10, 0.1, 4600000, 0, -10});
    oPlace.SetProjection("LOCAL_CS[\"a\"]");
    poKordsk->SetGeocodingInfo(oPlace);

    EXPECT_EQ(WriteVrt(moFile), moFile + ".vrt");
    const auto& voChannels = poKordsk->GetDirectory()->mvoChannels;
    const std::string oSource =
        "<SourceFilename relativeToVRT=\"1\">a&#38;b.kdk</SourceFilename>\n";
    EXPECT_EQ(test::BytesOf(moFile + ".vrt"),
              "<VRTDataset rasterXSize=\"30\" rasterYSize=\"20\">\n"
              "<SRS>LOCAL_CS[&#34;a&#34;]</SRS>\n"
              "<GeoTransform>500000, 10, 0.1, 4600000, 0, -10</GeoTransform>\n"
              "<Metadata>\n<MDI key=\"k&#60;&#10;\">v??\xC3\xBC</MDI>\n</Metadata>\n"
              "<VRTRasterBand dataType=\"UInt16\" subClass=\"VRTRawRasterBand\">\n"
              "<Description>&#34;first&#34;</Description>\n"
              "<Metadata>\n<MDI key=\"UNIT\">dB</MDI>\n</Metadata>\n"
              "<NoDataValue>65535</NoDataValue>\n" +
                  oSource + "<ImageOffset>" + std::to_string(voChannels[0].mnOffset) +
                  "</ImageOffset>\n<PixelOffset>2</PixelOffset>\n<LineOffset>60</LineOffset>\n"
                  "<ByteOrder>LSB</ByteOrder>\n</VRTRasterBand>\n"
                  "<VRTRasterBand dataType=\"Byte\" subClass=\"VRTRawRasterBand\">\n"
                  "<Metadata domain=\"IMAGE_STRUCTURE\">\n"
                  "<MDI key=\"PIXELTYPE\">SIGNEDBYTE</MDI>\n</Metadata>\n"
                  "<NoDataValue>-0.5</NoDataValue>\n" +
                  oSource + "<ImageOffset>" + std::to_string(voChannels[1].mnOffset) +
                  "</ImageOffset>\n<PixelOffset>1</PixelOffset>\n<LineOffset>30</LineOffset>\n"
                  "<ByteOrder>LSB</ByteOrder>\n</VRTRasterBand>\n</VRTDataset>\n");
}

TEST_F(WriteVrtTest, OlderDescriptionIsReplacedAndNothingElseIsLeft)
{
    moDirectory.Write("a&b.kdk.vrt", "old");
    NewKordsk(moFile)->CreateChannels({30, 20, 1, tessel::eDT_16U});
    WriteVrt(moFile);
    EXPECT_NE(test::BytesOf(moFile + ".vrt"), "old");
    EXPECT_EQ(moDirectory.Names(), (std::set<std::string>{"a&b.kdk", "a&b.kdk.vrt"}));
}

TEST_F(WriteVrtTest, WhatGdalCannotReadThereIsRefused)
{
    const auto poKordsk = NewKordsk(moFile);
    const std::string oBegin = moFile + ": a .vrt file cannot describe ";
    const auto oRefusal = [&] { return MessageOf<DataException>([&] { WriteVrt(moFile); }); };
    EXPECT_EQ(oRefusal(), oBegin + "a file without channels");
    poKordsk->CreateChannels({30, 20, 1, tessel::eDT_8U});
    poKordsk->CreateChannels({30, 20, 1, tessel::eDT_C16U});
    EXPECT_EQ(oRefusal(), oBegin + "channel 2, which has samples of eDT_C16U");
    const std::string oTiled = moDirectory.File("tiled");
    NewKordsk(oTiled, "TILE")->CreateChannels({30, 20, 1, tessel::eDT_8U});
    EXPECT_EQ(MessageOf<DataException>([&] { WriteVrt(oTiled); }),
              oTiled + ": a .vrt file cannot describe channel 1, which is tiled");
    EXPECT_EQ(moDirectory.Names(), (std::set<std::string>{"a&b.kdk", "tiled"}));
}

TEST_F(WriteVrtTest, OtherFilesAreRefused)
{
    EXPECT_THROW(WriteVrt(moDirectory.File("none")), FileException);
    EXPECT_THROW(WriteVrt(moDirectory.Write("text", std::string(2000, 'x'))), FileException);
}

}  // namespace
}  // namespace kor::datasources
