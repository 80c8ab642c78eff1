#include <gtest/gtest.h>

#include <cstdint>
#include <filesystem>
#include <set>
#include <string>

#include "platform/datasources/basicreader.h"
#include "platform/datasources/datasetmanager.h"
#include "platform/datasources/gdal/gdaldriver.h"
#include "tests/support/blocks.h"
#include "tests/support/exampleprogram.h"
#include "tests/support/temporarydirectory.h"

namespace kor::test
{
namespace
{

/// The demo program, run in a folder of its own.
class Demo : public ::testing::Test
{
protected:
    void SetUp() override { datasources::RegisterGdalDriver(); }

    /// A grid of 3 x 3 cells of 10 x 10 with a hole in the middle.
    std::string WriteGrid() const
    {
        return moFolder.Write("grid.asc",
                              "ncols 3\nnrows 3\nxllcorner 100\nyllcorner 200\ncellsize 10\n"
                              "NODATA_value -9999\n1 2 3\n4 -9999 6\n7 8 90\n");
    }

    /// Runs the demo on oFile and gives its exit status; what it says goes to "out" and "err".
    int Run(const std::string& oFile) const { return RunExample({oFile, Result("")}, moFolder); }

    std::string Result(const std::string& oName) const { return moFolder.File("results/" + oName); }
    std::string Said() const { return BytesOf(moFolder.File("out")); }
    std::string Complaint() const { return BytesOf(moFolder.File("err")); }
    std::set<std::string> Results() const
    {
        std::set<std::string> oNames;
        for (const auto& oEntry : std::filesystem::directory_iterator(Result("")))
        {
            oNames.insert(oEntry.path().filename().string());
        }
        return oNames;
    }

    Image<std::int32_t> ReadResult(const std::string& oName) const
    {
        datasources::BasicReader oReader(Result(oName), {1}, 0);
        const auto poRaster =
            BlankRaster(oReader.GetWidth(), oReader.GetHeight(), 1, oReader.GetDataType());
        oReader.ReadRaster(poRaster.get());
        return ImageOf<std::int32_t>(*poRaster);
    }

    TemporaryDirectory moFolder;
};

const std::set<std::string> kAllResults = {"average.tif", "median.tif", "before.png", "average.png",
                                           "median.png"};

// The upper left pixel's window, the edge continued, holds nine 1, three each of 2, 3, 4 and 7, and
// one each of 6, 8 and 90; the hole counts nowhere. Middle one of 24: 3. Mean: 161 / 24 = 6.7.
TEST_F(Demo, SmoothsAroundNoDataAndLeavesItWhereItIs)
{
    ASSERT_EQ(Run(WriteGrid()), 0) << Complaint();
    const Image<std::int32_t> oMedian = ReadResult("median.tif");
    const Image<std::int32_t> oAverage = ReadResult("average.tif");
    ASSERT_EQ(oMedian.Samples().size(), 9U);
    ASSERT_EQ(oAverage.Samples().size(), 9U);
    EXPECT_EQ(oMedian.Samples()[0], 3);
    EXPECT_EQ(oAverage.Samples()[0], 7);
    EXPECT_EQ(oMedian.Samples()[4], -9999);
    EXPECT_EQ(oAverage.Samples()[4], -9999);
    EXPECT_EQ(Complaint(), "");
    EXPECT_NE(Said().find("3 x 3 pixels, 1 channel of type 32S"), std::string::npos) << Said();
}

TEST_F(Demo, KeepsNoDataAndGeoreference)
{
    ASSERT_EQ(Run(WriteGrid()), 0) << Complaint();
    for (const char* pszName : {"average.tif", "median.tif"})
    {
        const datasources::BasicReader oReader(Result(pszName), {1}, 0);
        EXPECT_EQ(oReader.GetAuxiliaryData().GetChannelNoData(1), -9999.0) << pszName;
        EXPECT_EQ(oReader.GetGeocodingInfo().GetXOffset(), 100.0) << pszName;
        EXPECT_EQ(oReader.GetGeocodingInfo().GetYOffset(), 230.0) << pszName;
        EXPECT_EQ(oReader.GetGeocodingInfo().GetXPerCol(), 10.0) << pszName;
        EXPECT_EQ(oReader.GetGeocodingInfo().GetYPerRow(), -10.0) << pszName;
    }
}

TEST_F(Demo, ReplacesOlderResultsAndLeavesNothingElse)
{
    std::filesystem::create_directories(Result(""));
    moFolder.Write("results/median.tif", "older");
    moFolder.Write("results/before.png", "older");
    ASSERT_EQ(Run(WriteGrid()), 0) << Complaint();
    EXPECT_EQ(ReadResult("median.tif").Samples()[0], 3);
    EXPECT_EQ(BytesOf(Result("before.png")).substr(1, 3), "PNG");
    EXPECT_EQ(Results(), kAllResults);
}

TEST_F(Demo, EndsInOneLineWhenTheFileIsMissing)
{
    const std::string oMissing = moFolder.File("nowhere.tif");
    EXPECT_EQ(Run(oMissing), 1);
    EXPECT_EQ(Said(), "");
    EXPECT_NE(Complaint().find(oMissing), std::string::npos) << Complaint();
    EXPECT_EQ(Complaint().find('\n'), Complaint().size() - 1) << Complaint();
    EXPECT_FALSE(std::filesystem::exists(Result("")));
}

TEST_F(Demo, KeepsOlderResultsWhenTheFileIsDamaged)
{
    ASSERT_EQ(Run(WriteGrid()), 0) << Complaint();
    const std::string oWhole = BytesOf(Result("median.tif"));
    EXPECT_EQ(Run(moFolder.Write("damaged.tif", oWhole.substr(0, 100))), 1);
    EXPECT_EQ(Complaint().find('\n'), Complaint().size() - 1) << Complaint();
    EXPECT_EQ(BytesOf(Result("median.tif")), oWhole);
    EXPECT_EQ(Results(), kAllResults);
}

}  // namespace
}  // namespace kor::test
