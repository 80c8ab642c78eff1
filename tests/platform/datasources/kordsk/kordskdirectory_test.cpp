#include "platform/datasources/kordsk/kordskdirectory.h"

#include <gtest/gtest.h>

#include "tests/support/exceptions.h"

namespace kor::datasources
{
namespace
{

using test::MessageOf;

constexpr const char* kHead = "width=20\nheight=3\nlayout=band\ntransform=0 1 0 0 0 -1\n";
constexpr const char* kChannel =
    "channel=1\ntype=16 1 0 16 0 0\noffset=8192\nlength=120\nlayout=band\n";

/// An image of 20 x 3 pixels of 16 bits.
KordskDirectory SmallDirectory()
{
    KordskDirectory oDirectory;
    oDirectory.mnWidth = 20;
    oDirectory.mnHeight = 3;
    KordskPlane& oChannel = oDirectory.mvoChannels.emplace_back();
    oChannel.moType = tessel::eDT_16S;
    oChannel.mnOffset = 8192;
    oChannel.mnLength = 120;
    return oDirectory;
}

void AddBitmap(KordskDirectory& oDirectory, std::uint64_t nOffset)
{
    KordskPlane& oBitmap = oDirectory.mvoBitmaps.emplace_back();
    oBitmap.moType = tessel::eDT_BIT;
    oBitmap.mnOffset = nOffset;
    oBitmap.mnLength = 9;
}

/// What is said of a directory text, without the file's name and the words before.
std::string Refusal(const std::string& oText)
{
    const std::string oMessage = MessageOf<FileException>([&] { ParseDirectory("f", oText); });
    const std::string oBefore = "f: the file is damaged: line ";
    EXPECT_EQ(oMessage.find(oBefore), 0U) << oMessage;
    return oMessage.substr(std::min(oBefore.size(), oMessage.size()));
}

std::string Refusal(const KordskDirectory& oDirectory, std::uint64_t nFileBytes = 16384)
{
    const std::string oMessage = MessageOf<FileException>(
        [&] {
            RequireSoundPlanes("f", oDirectory, {4096, 100}, nFileBytes);
        });
    const std::string oBefore = "f: the file is damaged: ";
    EXPECT_EQ(oMessage.find(oBefore), 0U) << oMessage;
    return oMessage.substr(std::min(oBefore.size(), oMessage.size()));
}

TEST(KordskDirectory, PrintsKeysAndValues)
{
    KordskDirectory oDirectory = SmallDirectory();
    oDirectory.mbTiled = true;
    oDirectory.moMetadata = {{"SENSOR", "X"}};
    auto oPlace = ogc::cs::GeocodingInfo({500005, 10, 0.1, 4.6e6, 0, -10});
    oPlace.SetProjection("PROJCS[\"a\"]");
    oDirectory.mpoGeocoding = std::make_shared<ogc::cs::GeocodingInfo>(oPlace);
    oDirectory.mvoChannels[0].moData = {"amplitude\n", {{"UNIT", "dB"}}, -0.5};
    AddBitmap(oDirectory, 12288);
    oDirectory.mvoBitmaps[0].mnTileWidth = 256;
    oDirectory.mvoBitmaps[0].mnTileHeight = 128;
    EXPECT_EQ(PrintDirectory(oDirectory),
              "width=20\nheight=3\nlayout=tile\ntransform=500005 10 0.1 4600000 0 -10\n"
              "projection=PROJCS[\"a\"]\nmetadata.SENSOR=X\n"
              "channel=1\ntype=16 1 0 16 0 0\noffset=8192\nlength=120\nlayout=band\n"
              "description=amplitude\\x0A\nnodata=-0.5\nmetadata.UNIT=dB\n"
              "bitmap=1\ntype=1 0 0 1 0 0\noffset=12288\nlength=9\nlayout=tile 256 128\n");
    const KordskDirectory oBack = ParseDirectory("f", PrintDirectory(oDirectory));
    EXPECT_EQ(oBack.mnWidth, 20U);
    EXPECT_EQ(oBack.mnHeight, 3U);
    EXPECT_TRUE(oBack.mbTiled);
    EXPECT_EQ(*oBack.mpoGeocoding, oPlace);
    EXPECT_EQ(oBack.moMetadata, oDirectory.moMetadata);
    EXPECT_EQ(oBack.mvoChannels, oDirectory.mvoChannels);
    EXPECT_EQ(oBack.mvoBitmaps, oDirectory.mvoBitmaps);
}

TEST(KordskDirectory, LinesThatSayNothingAreRefused)
{
    const std::string oHead = kHead;
    EXPECT_EQ(Refusal(oHead + "x"), "5 of its directory: it has no end");
    EXPECT_EQ(Refusal(oHead + "x\n"), "5 of its directory: it has no =");
    EXPECT_EQ(Refusal(oHead + "colour=red\n"),
              "5 of its directory: there is no such key here: "
              "colour");
    EXPECT_EQ(Refusal(oHead + "width=3\n"), "5 of its directory: width is told twice");
    EXPECT_EQ(Refusal(oHead + "metadata.a=1\nmetadata.a=2\n"),
              "6 of its directory: metadata.a is told twice");
    EXPECT_EQ(Refusal(oHead + "projection=\\n\n"), "5 of its directory: a backslash without \\xHH");
    EXPECT_EQ(Refusal("width=3\nheight=1\nlayout=band\n"),
              "3 of its directory: before it, transform is missing");
    EXPECT_EQ(Refusal(""), "0 of its directory: before it, height is missing");
    EXPECT_EQ(Refusal(oHead + "channel=1\ntype=8 0 0 8 0 0\noffset=1\nchannel=2\n"),
              "8 of its directory: before it, layout is missing");
}

TEST(KordskDirectory, NumbersOutOfRangeAreRefused)
{
    for (const char* pszNumber : {"", "-1", "4294967296", "1x", " 1", "0x10", "+1", "1.5"})
    {
        EXPECT_EQ(Refusal("width=" + std::string(pszNumber) + "\n"),
                  "1 of its directory: not a number in range: " + std::string(pszNumber));
    }
    EXPECT_EQ(Refusal("transform=0 1 0 0 0\n"), "1 of its directory: not 6 numbers");
    EXPECT_EQ(Refusal("transform=0 1 0 0 0 1 1\n"),
              "1 of its directory: not a number in range: 1 1");
    EXPECT_EQ(Refusal(std::string(kHead) + "channel=2\n"),
              "5 of its directory: number 2 after 0; numbers go up to 65535");
}

TEST(KordskDirectory, UnknownTypesAndLayoutsAreRefused)
{
    const std::string oChannel = std::string(kHead) + "channel=1\n";
    for (const char* pszType : {"7 0 0 7 0 0", "8 0 0 8 0 1", "16 2 0 16 0 0", "32 1 1 23 0 0"})
    {
        EXPECT_EQ(
            Refusal(oChannel + "type=" + pszType + "\n"),
            "6 of its directory: there is no such type of samples here: " + std::string(pszType));
    }
    EXPECT_EQ(Refusal(std::string(kHead) + "bitmap=1\ntype=8 0 0 8 0 0\n"),
              "6 of its directory: there is no such type of samples here: 8 0 0 8 0 0");
    EXPECT_EQ(Refusal("layout=heap\n"), "1 of its directory: no layout is called heap");
    EXPECT_EQ(Refusal(oChannel + "layout=heap\n"), "6 of its directory: no layout is called heap");
    for (const char* pszTile : {"0 256", "12 256", "256 0"})
    {
        EXPECT_EQ(Refusal(oChannel + "layout=tile " + pszTile + "\n"),
                  "6 of its directory: there are no tiles of " + std::string(pszTile) + " pixels");
    }
}

TEST(KordskDirectory, MoreThan65535ChannelsAreRefused)
{
    std::string oText = kHead;
    for (int i = 1; i <= 65536; ++i)
    {
        oText += "channel=" + std::to_string(i) +
                 "\ntype=8 0 0 8 0 0\noffset=4096\nlength=60\nlayout=band\n";
    }
    EXPECT_EQ(Refusal(oText),
              "327680 of its directory: number 65536 after 65535; numbers go up to 65535");
}

TEST(KordskDirectory, SoundPlanesPass)
{
    KordskDirectory oDirectory = ParseDirectory("f", std::string(kHead) + kChannel);
    AddBitmap(oDirectory, 12288);
    EXPECT_NO_THROW(RequireSoundPlanes("f", oDirectory, {4096, 100}, 12297));
}

TEST(KordskDirectory, PlanesOfAnotherLengthAreRefused)
{
    KordskDirectory oDirectory = SmallDirectory();
    oDirectory.mvoChannels[0].mnLength = 119;
    EXPECT_EQ(Refusal(oDirectory), "channel 1 has 119 bytes, which does not fit 20 x 3 pixels");
    oDirectory = SmallDirectory();
    oDirectory.mnWidth = 0xFFFFFFFF;
    oDirectory.mnHeight = 0xFFFFFFFF;
    EXPECT_EQ(Refusal(oDirectory),
              "channel 1 has 120 bytes, which does not fit 4294967295 x 4294967295 pixels");
    oDirectory.mnWidth = 0;
    oDirectory.mvoChannels[0].mnLength = 0;
    EXPECT_EQ(Refusal(oDirectory),
              "channel 1 has 0 bytes, which does not fit 0 x 4294967295 pixels");
}

TEST(KordskDirectory, PlanesInTheWrongPlaceAreRefused)
{
    KordskDirectory oDirectory = SmallDirectory();
    EXPECT_EQ(Refusal(oDirectory, 8311),
              "channel 1, 120 bytes from byte 8192, lies outside the file of 8311 bytes");
    oDirectory.mvoChannels[0].mnOffset = 0xFFFFFFFFFFFFF000;
    EXPECT_EQ(Refusal(oDirectory),
              "channel 1, 120 bytes from byte 18446744073709547520, lies "
              "outside the file of 16384 bytes");
    for (const std::uint64_t nOffset : {0U, 512U, 8193U})
    {
        oDirectory.mvoChannels[0].mnOffset = nOffset;
        EXPECT_EQ(Refusal(oDirectory), "channel 1 begins at byte " + std::to_string(nOffset) +
                                           ", where no plane can begin");
    }
}

TEST(KordskDirectory, PlanesOverOneAnotherAreRefused)
{
    KordskDirectory oDirectory = SmallDirectory();
    AddBitmap(oDirectory, 8192);
    EXPECT_EQ(Refusal(oDirectory), "channel 1 and bitmap 1 lie over one another");
    oDirectory = SmallDirectory();
    oDirectory.mvoChannels[0].mnOffset = 4096;
    EXPECT_EQ(Refusal(oDirectory), "the directory and channel 1 lie over one another");
    oDirectory = SmallDirectory();
    oDirectory.mnHeight = 120;
    oDirectory.mvoChannels[0].mnLength = 4800;
    AddBitmap(oDirectory, 12288);
    oDirectory.mvoBitmaps[0].mnLength = 360;
    EXPECT_EQ(Refusal(oDirectory), "channel 1 and bitmap 1 lie over one another");
}

}  // namespace
}  // namespace kor::datasources
