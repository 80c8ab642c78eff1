#include <gtest/gtest.h>

#include <cmath>
#include <cstdint>
#include <string>

#include "platform/datasources/basicreader.h"
#include "platform/datasources/gdal/gdaldriver.h"
#include "tests/support/blocks.h"
#include "tests/support/kordskfiles.h"
#include "tests/support/program.h"
#include "tests/support/temporarydirectory.h"

namespace kor::test
{
namespace
{

using Bytes = Image<std::uint8_t>;
using Floats = Image<float>;

class BandMath : public ::testing::Test
{
protected:
    void SetUp() override { datasources::RegisterGdalDriver(); }

    /// Red and near infrared of five pixels, the fourth of which has no light at all.
    std::string WriteBands() const
    {
        const Kordsk poFile = NewKordsk(moFolder.File("bands.kordsk"));
        poFile->CreateChannels({5, 1, 1, tessel::eDT_8U});
        poFile->CreateChannels({5, 1, 1, tessel::eDT_16U});
        datasources::BasicWriter(poFile.get(), {1})
            .WriteRaster(RasterOf(Bytes{{10, 20, 30, 0, 60}}).get());
        datasources::BasicWriter(poFile.get(), {2})
            .WriteRaster(RasterOf(Image<std::uint16_t>{{30, 20, 10, 0, 20}}).get());
        return moFolder.File("bands.kordsk");
    }
    std::string WriteGrid() const
    {
        return moFolder.Write("grid.asc",
                              "ncols 3\nnrows 2\nxllcorner 100\nyllcorner 200\ncellsize 10\n"
                              "NODATA_value -9999\n1 2 3\n4 -9999 6\n");
    }
    ProgramRun Run(const std::string& oIn, const std::string& oOut, const std::string& oWords) const
    {
        return RunExample("band_math", "'" + oIn + "' '" + moFolder.File(oOut) + "' " + oWords);
    }
    template <class T>
    Image<T> Read(const std::string& oName) const
    {
        datasources::BasicReader oReader(moFolder.File(oName), {1}, 0);
        const auto poRaster =
            BlankRaster(oReader.GetWidth(), oReader.GetHeight(), 1, oReader.GetDataType());
        oReader.ReadRaster(poRaster.get());
        return ImageOf<T>(*poRaster);
    }

    TemporaryDirectory moFolder;
};

// 0.5, 0, -0.5, nothing, -0.5; of -0.5 to 0.5 the ends become 1 and 255.
TEST_F(BandMath, MakesANormalisedDifferenceOfTwoBands)
{
    const std::string oBands = WriteBands();
    const ProgramRun oPlain = Run(oBands, "plain.tif", "normalised bands=2,1");
    ASSERT_EQ(oPlain.mnStatus, 0) << oPlain.moComplaint;
    const std::vector<float> vfPlain = Read<float>("plain.tif").Samples();
    EXPECT_EQ(std::vector<float>(vfPlain.begin(), vfPlain.begin() + 3),
              (std::vector<float>{0.5F, 0.0F, -0.5F}));
    EXPECT_TRUE(std::isnan(vfPlain[3]));
    EXPECT_EQ(oPlain.moSaid, "normalised of bands 2 and 1: from -0.5 to 0.5\n");
    EXPECT_EQ(oPlain.moComplaint, "");  // no progress bar where there is no terminal

    const ProgramRun oScaled = Run(oBands, "scaled.tif", "normalised bands=2,1 type=8U");
    ASSERT_EQ(oScaled.mnStatus, 0) << oScaled.moComplaint;
    EXPECT_EQ(Read<std::uint8_t>("scaled.tif"), (Bytes{{255, 128, 1, 0, 1}}));
    EXPECT_EQ(oScaled.moSaid,
              "normalised of bands 2 and 1: from -0.5 to 0.5\nscaled: 1 is -0.5, 255 is 0.5\n");
    const datasources::BasicReader oReader(moFolder.File("scaled.tif"), {1}, 0);
    EXPECT_EQ(oReader.GetAuxiliaryData().GetChannelNoData(1), 0.0);
    EXPECT_EQ(oReader.GetAuxiliaryData().GetChannelDescription(1), "normalised of bands 2 and 1");
    EXPECT_EQ(moFolder.Names(), (std::set<std::string>{"bands.kordsk", "plain.tif", "scaled.tif"}));
}

// 1 / 3, 1, 3, nothing, 3: of a range of 0 to 2 what lies above is cut.
TEST_F(BandMath, ScalesAGivenRangeTo16Bits)
{
    const ProgramRun oRun = Run(WriteBands(), "out.kordsk", "ratio type=16U range=0,2");
    ASSERT_EQ(oRun.mnStatus, 0) << oRun.moComplaint;
    EXPECT_EQ(Read<std::uint16_t>("out.kordsk"),
              (Image<std::uint16_t>{{10923, 32768, 65535, 0, 65535}}));
    EXPECT_EQ(oRun.moSaid,
              "ratio of bands 1 and 2: from 0.333333 to 3\nscaled: 1 is 0, 65535 is 2\n");
}

TEST_F(BandMath, ComputesWithTwoBandsAndWithAConstant)
{
    const std::string oBands = WriteBands();
    const std::pair<const char*, std::vector<float>> kCases[] = {
        {"sum constant=0.5", {40.5F, 40.5F, 40.5F, 0.5F, 80.5F}},
        {"difference bands=2,1 constant=1", {19, -1, -21, -1, -41}},
        {"product", {300, 400, 300, 0, 1200}},
        {"sum bands=1 constant=-10", {0, 10, 20, -10, 50}},
        {"difference bands=1 constant=10", {0, 10, 20, -10, 50}},
        {"product bands=2 constant=0.5", {15, 10, 5, 0, 10}},
        {"ratio bands=2 constant=4", {7.5F, 5, 2.5F, 0, 5}},
    };
    for (const auto& [pszWords, vfExpected] : kCases)
    {
        const ProgramRun oRun = Run(oBands, "out.tif", std::string(pszWords) + " replace=yes");
        ASSERT_EQ(oRun.mnStatus, 0) << oRun.moComplaint;
        EXPECT_EQ(Read<float>("out.tif").Samples(), vfExpected) << pszWords;
    }
}

TEST_F(BandMath, LeavesMissingDataOutAndKeepsThePlace)
{
    const ProgramRun oRun = Run(WriteGrid(), "out.tif", "product constant=2 type=8U");
    ASSERT_EQ(oRun.mnStatus, 0) << oRun.moComplaint;
    // 2 to 12 become 1 to 255: 25.4 a step, half of it rounded up.
    EXPECT_EQ(Read<std::uint8_t>("out.tif"), (Bytes{{1, 52, 103}, {153, 0, 255}}));
    const datasources::BasicReader oReader(moFolder.File("out.tif"), {1}, 0);
    EXPECT_EQ(oReader.GetGeocodingInfo().GetXOffset(), 100.0);
    EXPECT_EQ(oReader.GetGeocodingInfo().GetYOffset(), 220.0);

    ASSERT_EQ(Run(WriteGrid(), "own.tif", "sum nodata=1,6,-9999 type=16U").mnStatus, 0);
    EXPECT_EQ(Read<std::uint16_t>("own.tif"), (Image<std::uint16_t>{{0, 1, 32768}, {65535, 0, 0}}));
    const ProgramRun oNothing = Run(WriteGrid(), "no.tif", "sum nodata=1,2,3,4,6,-9999 type=8U");
    EXPECT_EQ(oNothing.moSaid, "sum of band 1: no pixel has a result\n");
    EXPECT_EQ(Read<std::uint8_t>("no.tif"), (Bytes{{0, 0, 0}, {0, 0, 0}}));
}

// The range is that of all blocks, however many there are.
TEST_F(BandMath, GivesTheSameInBlocksOfAnySize)
{
    Random oRandom(61);
    const auto poPixels =
        RandomRaster(1000, 1500, 2, tessel::eDT_16U, {}, Samples::Ordinary, oRandom);
    const Kordsk poFile = NewKordsk(moFolder.File("large.kordsk"));
    poFile->CreateChannels(*poPixels);
    datasources::BasicWriter(poFile.get(), {1, 2}).WriteRaster(poPixels.get());
    const std::string oWords = "normalised type=16U memory=";
    ASSERT_EQ(Run(moFolder.File("large.kordsk"), "small.kordsk", oWords + "8").mnStatus, 0);
    ASSERT_EQ(Run(moFolder.File("large.kordsk"), "whole.kordsk", oWords + "1000").mnStatus, 0);
    EXPECT_TRUE(Read<std::uint16_t>("small.kordsk") == Read<std::uint16_t>("whole.kordsk"));
}

TEST_F(BandMath, RefusesWhatItCannotUseAndSaysWhatItCan)
{
    const std::string oBands = WriteBands();
    moFolder.Write("old.tif", "older");
    const std::pair<const char*, const char*> kCases[] = {
        {"ration", "there is no operation \"ration\"; there are sum difference product ratio"},
        {"ratio bands=3", "bands=3 cannot be used; it takes numbers from 1 to 2"},
        {"ratio bands=1,2,1", "choose one or two of them by bands="},
        {"normalised bands=1", "normalised takes two bands, such as bands=4,3"},
        {"ratio type=32S", "type=32S cannot be used; it takes one of 32R, 8U, 16U"},
        {"ratio range=0,1", "range= says what is scaled; it needs type=8U or type=16U"},
        {"ratio type=8U range=1,0", "range=1,0 cannot be used; it takes two numbers"},
        {"ratio constant=x", "constant=x cannot be used; it takes numbers"},
        {"ratio band=1", "\"band\" means nothing here; there are bands"},
    };
    for (const auto& [pszWords, pszComplaint] : kCases)
    {
        const ProgramRun oRun = Run(oBands, "new.tif", pszWords);
        EXPECT_EQ(oRun.mnStatus, 2) << pszWords;
        EXPECT_NE(oRun.moComplaint.find(pszComplaint), std::string::npos) << oRun.moComplaint;
    }
    EXPECT_EQ(Run(oBands, "old.tif", "ratio").mnStatus, 2);
    const ProgramRun oMissing = Run(moFolder.File("nowhere.tif"), "new.tif", "ratio");
    EXPECT_EQ(oMissing.mnStatus, 1);
    EXPECT_NE(oMissing.moComplaint.find("nowhere.tif"), std::string::npos);
    EXPECT_EQ(BytesOf(moFolder.File("old.tif")), "older");
    EXPECT_EQ(moFolder.Names(), (std::set<std::string>{"bands.kordsk", "old.tif"}));
}

TEST_F(BandMath, TellsItsOperationsAndParameters)
{
    const ProgramRun oUsage = RunExample("band_math", "");
    EXPECT_EQ(oUsage.mnStatus, 2);
    for (const char* pszWord : {"Usage: band_math IN OUT", "normalised", "bands=1,2", "range="})
    {
        EXPECT_NE(oUsage.moComplaint.find(pszWord), std::string::npos) << pszWord;
    }
}

}  // namespace
}  // namespace kor::test
