#include "platform/datasources/gdal/gdalkept.h"

#include <gtest/gtest.h>

#include <cmath>

#include "tests/platform/datasources/gdal/gdalfiles.h"

namespace kor::datasources
{
namespace
{

using ogc::cs::GeocodingInfo;
using test::MessageOf;
using test::Random;
using test::SameBits;

const std::string kUtm =
    "PROJCS[\"WGS 84 / UTM zone 32N\",GEOGCS[\"WGS 84\",DATUM[\"WGS_1984\",SPHEROID[\"WGS 84\","
    "6378137,298.257223563,AUTHORITY[\"EPSG\",\"7030\"]],AUTHORITY[\"EPSG\",\"6326\"]],PRIMEM["
    "\"Greenwich\",0],UNIT[\"degree\",0.0174532925199433],AUTHORITY[\"EPSG\",\"4326\"]],PROJECTION["
    "\"Transverse_Mercator\"],PARAMETER[\"latitude_of_origin\",0],PARAMETER[\"central_meridian\",9]"
    ",PARAMETER[\"scale_factor\",0.9996],PARAMETER[\"false_easting\",500000],PARAMETER["
    "\"false_northing\",0],UNIT[\"metre\",1],AUTHORITY[\"EPSG\",\"32632\"]]";
const std::string kDegrees =
    "GEOGCS[\"WGS 84\",DATUM[\"WGS_1984\",SPHEROID[\"WGS 84\",6378137,298.257223563]],"
    "PRIMEM[\"Greenwich\",0],UNIT[\"degree\",0.0174532925199433],AUTHORITY[\"EPSG\",\"4326\"]]";

GeocodingInfo Place(const GeocodingInfo::Transform& oTransform, const std::string& oWkt)
{
    GeocodingInfo oInfo(oTransform);
    oInfo.SetProjection(oWkt);
    return oInfo;
}

const GeocodingInfo kPlace = Place({500000.1, 10.5, 0.0, 5600000.3, 0.0, -10.25}, kUtm);
const GeocodingInfo kOtherPlace = Place({9.0, 0.001, 0.0, 50.0, 0.0, -0.002}, kDegrees);
const GeocodingInfo kTurned = Place({500000.0, 10.0, 0.5, 5600000.0, -0.25, -20.0}, kUtm);

AuxiliaryData SomeData(double dfNoData)
{
    AuxiliaryData oData;
    oData.SetChannel({"first {a}, b", {{"unit", "dB"}}, dfNoData}, 1);
    oData.SetChannel({"zweiter \xc3\xbc", {{"unit", "m"}, {"LOOKS", "4"}}, dfNoData}, 2);
    oData.SetFileMetadata({{"sensor", "radar <X>"}});
    return oData;
}

class GdalKeptTest : public test::GdalFilesTest
{
protected:
    /// A file of two channels of eDT_16S and 9 x 7 pixels.
    std::unique_ptr<tessel::Raster> Make(const std::string& oFormat)
    {
        Random oRandom(41);
        return MakeFile(File("x.img"), oFormat, "", {9, 7, 2, tessel::eDT_16S}, oRandom);
    }
    void Set(const AuxiliaryData& oData) const
    {
        const auto poDataset = Open(File("x.img"), true);
        poDataset->SetAuxiliaryData(oData);
        poDataset->Flush();
    }
    void Set(const GeocodingInfo& oInfo) const
    {
        const auto poDataset = Open(File("x.img"), true);
        poDataset->SetGeocodingInfo(oInfo);
        poDataset->Flush();
    }
    AuxiliaryData Data() const { return Open(File("x.img"), false)->GetAuxiliaryData(); }
    GeocodingInfo Geocoding() const { return Open(File("x.img"), false)->GetGeocodingInfo(); }
    /// Why the format refuses it.
    template <class Value>
    std::string Refusal(const std::string& oFormat, const Value& oValue) const
    {
        const std::string oMessage = MessageOf<DataException>([&] { Set(oValue); });
        const std::string oStart = File("x.img") + ": the format " + oFormat + " does not keep ";
        EXPECT_EQ(oMessage.substr(0, oStart.size()), oStart);
        return oMessage.substr(std::min(oMessage.size(), oStart.size()));
    }
    void ExpectPlace(const GeocodingInfo& oExpected, const std::string& oFormat) const
    {
        const GeocodingInfo oInfo = Geocoding();
        for (std::size_t i = 0; i < 6; ++i)
        {
            const double dfTerm = oExpected.GetTransform()[i];
            EXPECT_NEAR(oInfo.GetTransform()[i], dfTerm, 1e-12 * std::abs(dfTerm)) << oFormat;
        }
        // Before the comma stand the kind of system and its name.
        EXPECT_EQ(oInfo.GetProjection().substr(0, 16), oExpected.GetProjection().substr(0, 16))
            << oFormat;
    }
};

const std::vector<std::string> kFormats = {"GTiff", "ENVI", "EHdr", "HFA"};

TEST_F(GdalKeptTest, AllIsSetAndChangedInFilesThatAreThere)
{
    for (const std::string& oFormat : kFormats)
    {
        const auto poPixels = Make(oFormat);
        for (const double dfNoData : {-99.0, oFormat == "EHdr" ? -99.0 : 7.0})
        {
            AuxiliaryData oData = SomeData(dfNoData);
            oData.SetChannelDescription("for " + std::to_string(dfNoData), 1);
            Set(oData);
            const AuxiliaryData oBack = Data();
            for (unsigned int nChannel = 1; nChannel <= 2; ++nChannel)
            {
                EXPECT_EQ(oBack.GetChannelDescription(nChannel),
                          oData.GetChannelDescription(nChannel))
                    << oFormat;
                EXPECT_EQ(oBack.GetChannelNoData(nChannel), dfNoData) << oFormat;
                EXPECT_EQ(oBack.GetChanMetadata(nChannel).at("unit"),
                          oData.GetChanMetadata(nChannel).at("unit"))
                    << oFormat;
            }
            EXPECT_EQ(oBack.GetFileMetadata().at("sensor"), "radar <X>") << oFormat;
        }
        for (const GeocodingInfo& oPlace : {kPlace, kOtherPlace})
        {
            Set(oPlace);
            ExpectPlace(oPlace, oFormat);
        }
        EXPECT_TRUE(SameBits(*ReadFile(File("x.img")), *poPixels)) << oFormat;
        moDirectory.Clear();
    }
}

TEST_F(GdalKeptTest, AllIsSetBeforeThePixelsAreWritten)
{
    Random oRandom(42);
    const auto poPixels =
        test::RandomRaster(9, 7, 2, tessel::eDT_16S, {}, test::Samples::Ordinary, oRandom);
    for (const std::string& oFormat : kFormats)
    {
        {
            const auto poDataset = New(File("x.img"), oFormat);
            poDataset->CreateChannels({9, 7, 2, tessel::eDT_16S});
            poDataset->SetAuxiliaryData(SomeData(7.0));
            poDataset->SetGeocodingInfo(kPlace);
            BasicWriter oWriter(poDataset.get(), {1, 2});
            oWriter.WriteRaster(poPixels.get());
            oWriter.Flush();
        }
        EXPECT_EQ(Data().GetChannelDescription(2), "zweiter \xc3\xbc") << oFormat;
        EXPECT_EQ(Data().GetChannelNoData(1), 7.0) << oFormat;
        ExpectPlace(kPlace, oFormat);
        EXPECT_TRUE(SameBits(*ReadFile(File("x.img")), *poPixels)) << oFormat;
        moDirectory.Clear();
    }
}

// A raster read from one file and written to another brings along what formats add by themselves.
TEST_F(GdalKeptTest, WhatAFileOfOneFormatSaysGoesIntoEveryOther)
{
    for (const std::string& oFrom : kFormats)
    {
        Make(oFrom);
        const AuxiliaryData oData = Data();
        const GeocodingInfo oInfo = Geocoding();
        moDirectory.Clear();
        for (const std::string& oTo : kFormats)
        {
            Make(oTo);
            Set(oData);
            Set(oInfo);
            EXPECT_EQ(Data().GetChannelNoData(1), std::nullopt) << oFrom << " to " << oTo;
            moDirectory.Clear();
        }
    }
}

TEST_F(GdalKeptTest, ValueThatAFormatDoesNotTakeBackIsRefusedAndTheOldOneStays)
{
    const AuxiliaryData oBlank = []
    {
        AuxiliaryData oData;
        oData.SetChannel({}, 1);
        return oData;
    }();
    AuxiliaryData oNoNoData = SomeData(7.0);
    oNoNoData.SetChannelNoData(std::nullopt, 1);
    AuxiliaryData oNoItem = SomeData(7.0);
    oNoItem.SetChanMetadata({}, 1);

    Make("ENVI");
    Set(SomeData(7.0));
    EXPECT_EQ(Refusal("ENVI", oNoNoData), "the no-data value of channel 1: 7 comes back for none");
    moDirectory.Clear();

    Make("EHdr");
    Set(SomeData(7.0));
    EXPECT_EQ(Refusal("EHdr", SomeData(8.0)), "the no-data value of channel 1: 7 comes back for 8");
    moDirectory.Clear();

    Make("HFA");
    Set(SomeData(7.0));
    EXPECT_EQ(Refusal("HFA", oBlank),
              "the description of channel 1: \"first {a}, b\" comes back for \"\"");
    EXPECT_EQ(Refusal("HFA", oNoItem),
              "the metadata item \"unit\" of channel 1: \"dB\" comes back for none");
    EXPECT_EQ(Data().GetChannelDescription(1), "first {a}, b");
    EXPECT_EQ(Data().GetChannelNoData(1), 7.0);
    EXPECT_EQ(Data().GetChanMetadata(1).at("unit"), "dB");
}

TEST_F(GdalKeptTest, PlaceThatAFormatCannotSayIsRefusedAndTheOldOneStays)
{
    Make("GTiff");
    Set(kTurned);
    ExpectPlace(kTurned, "GTiff");
    moDirectory.Clear();
    for (const std::string oFormat : {"ENVI", "EHdr", "HFA"})
    {
        const auto poPixels = Make(oFormat);
        Set(kPlace);
        EXPECT_TRUE(Refusal(oFormat, kTurned)
                        .starts_with("the place of the image, whose corner at column "))
            << oFormat;
        ExpectPlace(kPlace, oFormat);
        EXPECT_TRUE(SameBits(*ReadFile(File("x.img")), *poPixels)) << oFormat;
        moDirectory.Clear();
    }
}

// GDAL writes the centre of the upper left pixel as if rows always ran to the south.
TEST_F(GdalKeptTest, RowsThatRunNorthAreRefusedByEHdr)
{
    Make("EHdr");
    EXPECT_EQ(Refusal("EHdr", Place({1.0, 2.0, 0.0, 3.0, 0.0, 2.0}, "")),
              "the place of the image, whose corner at column 0, row 0 lies at (X, Y): 1, 5 comes "
              "back for 1, 3");
    EXPECT_EQ(Geocoding(), GeocodingInfo());
}

TEST_F(GdalKeptTest, CoordinateSystemThatStaysIsReported)
{
    Make("EHdr");
    Set(kPlace);
    EXPECT_EQ(Refusal("EHdr", Place(kPlace.GetTransform(), "")),
              "the coordinate system: another comes back");
    ExpectPlace(kPlace, "EHdr");
}

TEST_F(GdalKeptTest, HeaderThatGrowsTooLongIsPutBack)
{
    Make("ENVI");
    Set(SomeData(7.0));
    AuxiliaryData oLong = SomeData(7.0);
    oLong.SetChannelDescription(std::string(70000, 'x'), 1);
    EXPECT_TRUE(MessageOf<IOException>([&] { Set(oLong); }).starts_with(File("x.img") + ": "));
    EXPECT_EQ(Data().GetChannelDescription(1), "first {a}, b");
}

TEST_F(GdalKeptTest, TextsThatNoFormatKeepsAreRefused)
{
    Make("GTiff");
    const std::string oBytes = test::BytesOf(File("x.img"));
    for (const std::string oText : {" x", "\tx", "\nx", "x\x01", "\x1b[0m"})
    {
        AuxiliaryData oDescription;
        oDescription.SetChannelDescription(oText, 2);
        EXPECT_EQ(MessageOf<DataException>([&] { Set(oDescription); }),
                  File("x.img") +
                      ": the description of channel 2 begins with a blank or has a "
                      "control character in it");
        AuxiliaryData oItem;
        oItem.SetFileMetadata({{"key", oText}});
        EXPECT_EQ(MessageOf<DataException>([&] { Set(oItem); }),
                  File("x.img") +
                      ": the value of the metadata item \"key\" begins with a blank or "
                      "has a control character in it");
    }
    for (const std::string oName : {"", "a=b", "a:b", "a ", " a", "KEY"})
    {
        AuxiliaryData oItem;
        oItem.SetChanMetadata({{"key", "1"}, {oName, "2"}}, 1);
        EXPECT_EQ(MessageOf<DataException>([&] { Set(oItem); }),
                  File("x.img") + ": \"" + oName +
                      "\" cannot be the name of a metadata item beside the others");
    }
    EXPECT_EQ(test::BytesOf(File("x.img")), oBytes);
}

TEST_F(GdalKeptTest, OtherTextsComeBackLetterByLetter)
{
    for (const std::string& oFormat : kFormats)
    {
        Make(oFormat);
        const std::vector<std::string> voTexts = {"trailing ", "a\nb", "a\tb",     "a\r\nb", "a  b",
                                                  "<&>\"'",    "]]>",  "\xc3\xbc", "\x7f"};
        for (const std::string& oText : voTexts)
        {
            AuxiliaryData oData;
            oData.SetChannel({oText, {{"a b", oText}}, {}}, 1);
            oData.SetFileMetadata({{"a b", oText}});
            Set(oData);
            EXPECT_EQ(Data().GetChannelDescription(1), oText) << oFormat;
            EXPECT_EQ(Data().GetChanMetadata(1).at("a b"), oText) << oFormat;
            EXPECT_EQ(Data().GetFileMetadata().at("a b"), oText) << oFormat;
        }
        moDirectory.Clear();
    }
}

TEST(GdalKept, NamesTheFirstDifferenceAlone)
{
    const AuxiliaryData oAsked = SomeData(7.0);
    EXPECT_EQ(NotKept(oAsked, AuxiliaryData(), oAsked), "");
    AuxiliaryData oNow = oAsked;
    oNow.SetFileMetadata({{"AREA_OR_POINT", "Area"}, {"Band_1", "x"}});
    EXPECT_EQ(NotKept(oAsked, AuxiliaryData(), oNow),
              "the metadata item \"sensor\": none comes back for \"radar <X>\"");
    oNow.SetChannelNoData(std::nan(""), 2);
    EXPECT_EQ(NotKept(oAsked, AuxiliaryData(), oNow),
              "the no-data value of channel 2: nan comes back for 7");
}

TEST(GdalKept, NotANumberIsKeptByNotANumber)
{
    AuxiliaryData oAsked;
    oAsked.SetChannelNoData(std::nan(""), 1);
    EXPECT_EQ(NotKept(oAsked, AuxiliaryData(), oAsked), "");
}

TEST(GdalKept, ChannelWithoutDescriptionMayComeBackNumbered)
{
    AuxiliaryData oAsked;
    oAsked.SetChannel({}, 2);
    AuxiliaryData oNow;
    oNow.SetChannelDescription("Band 2", 2);
    EXPECT_EQ(NotKept(oAsked, AuxiliaryData(), oNow), "");
    oNow.SetChannelDescription("Band 1", 2);
    EXPECT_EQ(NotKept(oAsked, AuxiliaryData(), oNow),
              "the description of channel 2: \"Band 1\" comes back for \"\"");
}

// A pixel is 10 wide: a millionth of it is 1e-5.
TEST(GdalKept, CornersMayMoveByAMillionthOfAPixel)
{
    const GeocodingInfo oAsked(1000.0, 10.0, 2000.0, -10.0);
    const GeocodingInfo oNear(1000.0 + 9e-6, 10.0, 2000.0, -10.0);
    const GeocodingInfo oFar(1000.0 + 11e-6, 10.0, 2000.0, -10.0);
    EXPECT_EQ(NotKept(oAsked, oAsked, oNear, 100, 100), "");
    EXPECT_NE(NotKept(oAsked, oAsked, oFar, 100, 100), "");
    // 2e-7 for each pixel is 2e-5 at the hundredth column.
    const GeocodingInfo oWider(1000.0, 10.0 + 2e-7, 2000.0, -10.0);
    EXPECT_EQ(NotKept(oAsked, oAsked, oWider, 40, 100), "");
    EXPECT_EQ(NotKept(oAsked, oAsked, oWider, 100, 100),
              "the place of the image, whose corner at column 100, row 0 lies at (X, Y): "
              "2000.00002, 2000 comes back for 2000, 2000");
    const GeocodingInfo oNone(std::nan(""), 10.0, 2000.0, -10.0);
    EXPECT_NE(NotKept(oNone, oAsked, oNone, 100, 100), "");
}

TEST(GdalKept, ImageThatSaysNothingMayBeSeenGdalsWay)
{
    EXPECT_EQ(NotKept(GeocodingInfo(), kPlace, GeocodingInfo(0, 1, 0, 1), 9, 7), "");
    EXPECT_NE(NotKept(GeocodingInfo(), kPlace, GeocodingInfo(0, 2, 0, 1), 9, 7), "");
}

TEST(GdalKept, CoordinateSystemMayComeBackInOtherWords)
{
    const GeocodingInfo::Transform oTransform = kPlace.GetTransform();
    const GeocodingInfo oOtherWords = Place(oTransform, "PROJCS[\"unnamed\"]");
    const GeocodingInfo oLocal = Place(oTransform, "LOCAL_CS[\"Arbitrary\"]");
    const GeocodingInfo oNone = Place(oTransform, "");
    const std::string oLost = "the coordinate system: another comes back";
    EXPECT_EQ(NotKept(kPlace, oNone, oOtherWords, 9, 7), "");
    EXPECT_EQ(NotKept(kPlace, oNone, oNone, 9, 7), oLost);
    EXPECT_EQ(NotKept(kPlace, oOtherWords, oOtherWords, 9, 7), oLost);
    EXPECT_EQ(NotKept(kPlace, kPlace, kPlace, 9, 7), "");
    EXPECT_EQ(NotKept(oNone, kPlace, oLocal, 9, 7), "");
    EXPECT_EQ(NotKept(oNone, kPlace, kPlace, 9, 7), oLost);
}

}  // namespace
}  // namespace kor::datasources
