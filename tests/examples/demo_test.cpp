#include <gtest/gtest.h>
#include <sys/wait.h>

#include <cstdint>
#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <iterator>
#include <memory>
#include <string>
#include <vector>

#include "platform/datasources/basicreader.h"
#include "platform/datasources/datasetmanager.h"
#include "platform/datasources/gdal/gdaldriver.h"
#include "tests/support/blocks.h"

namespace kor::test
{
namespace
{

namespace fs = std::filesystem;

std::string Contents(const fs::path& oFile)
{
    std::ifstream oStream(oFile, std::ios::binary);
    return {std::istreambuf_iterator<char>(oStream), {}};
}

/// The demo program, run in a folder of its own.
class Demo : public ::testing::Test
{
protected:
    void SetUp() override
    {
        datasources::RegisterGdalDriver();
        moFolder = fs::path(::testing::TempDir()) /
                   ::testing::UnitTest::GetInstance()->current_test_info()->name();
        fs::remove_all(moFolder);
        fs::create_directories(moFolder);
    }
    void TearDown() override { fs::remove_all(moFolder); }

    /// A grid of 3 x 3 cells of 10 x 10 with a hole in the middle.
    fs::path WriteGrid() const
    {
        const fs::path oFile = moFolder / "grid.asc";
        std::ofstream(oFile) << "ncols 3\nnrows 3\nxllcorner 100\nyllcorner 200\ncellsize 10\n"
                                "NODATA_value -9999\n1 2 3\n4 -9999 6\n7 8 90\n";
        return oFile;
    }

    /// Runs the demo on oFile and gives its exit status; what it says goes to "out" and "err".
    int Run(const fs::path& oFile) const
    {
        const std::string oCommand = std::string(KOR_DEMO) + " '" + oFile.string() + "' '" +
                                     Results().string() + "' >'" + (moFolder / "out").string() +
                                     "' 2>'" + (moFolder / "err").string() + "'";
        const int nStatus = std::system(oCommand.c_str());
        return WIFEXITED(nStatus) ? WEXITSTATUS(nStatus) : -1;
    }

    fs::path Results() const { return moFolder / "results"; }
    std::string Said() const { return Contents(moFolder / "out"); }
    std::string Complaint() const { return Contents(moFolder / "err"); }
    std::size_t CountResults() const
    {
        return static_cast<std::size_t>(
            std::distance(fs::directory_iterator(Results()), fs::directory_iterator()));
    }

    Image<std::int32_t> ReadResult(const std::string& oName) const
    {
        datasources::BasicReader oReader((Results() / oName).string(), {1}, 0);
        const auto poRaster =
            BlankRaster(oReader.GetWidth(), oReader.GetHeight(), 1, oReader.GetDataType());
        oReader.ReadRaster(poRaster.get());
        return ImageOf<std::int32_t>(*poRaster);
    }

    fs::path moFolder;
};

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
        const datasources::BasicReader oReader((Results() / pszName).string(), {1}, 0);
        EXPECT_EQ(oReader.GetAuxiliaryData().GetChannelNoData(1), -9999.0) << pszName;
        EXPECT_EQ(oReader.GetGeocodingInfo().GetXOffset(), 100.0) << pszName;
        EXPECT_EQ(oReader.GetGeocodingInfo().GetYOffset(), 230.0) << pszName;
        EXPECT_EQ(oReader.GetGeocodingInfo().GetXPerCol(), 10.0) << pszName;
        EXPECT_EQ(oReader.GetGeocodingInfo().GetYPerRow(), -10.0) << pszName;
    }
}

TEST_F(Demo, ReplacesOlderResultsAndLeavesNothingElse)
{
    fs::create_directories(Results());
    std::ofstream(Results() / "median.tif") << "older";
    std::ofstream(Results() / "before.png") << "older";
    ASSERT_EQ(Run(WriteGrid()), 0) << Complaint();
    EXPECT_EQ(ReadResult("median.tif").Samples()[0], 3);
    EXPECT_EQ(Contents(Results() / "before.png").substr(1, 3), "PNG");
    EXPECT_EQ(CountResults(), 5U);  // two images and three pictures
}

TEST_F(Demo, EndsInOneLineWhenTheFileIsMissing)
{
    const fs::path oMissing = moFolder / "nowhere.tif";
    EXPECT_EQ(Run(oMissing), 1);
    EXPECT_EQ(Said(), "");
    EXPECT_NE(Complaint().find(oMissing.string()), std::string::npos) << Complaint();
    EXPECT_EQ(Complaint().find('\n'), Complaint().size() - 1) << Complaint();
    EXPECT_FALSE(fs::exists(Results()));
}

TEST_F(Demo, KeepsOlderResultsWhenTheFileIsDamaged)
{
    ASSERT_EQ(Run(WriteGrid()), 0) << Complaint();
    const std::string oWhole = Contents(Results() / "median.tif");
    const fs::path oDamaged = moFolder / "damaged.tif";
    std::ofstream(oDamaged, std::ios::binary) << oWhole.substr(0, 100);
    EXPECT_EQ(Run(oDamaged), 1);
    EXPECT_EQ(Complaint().find('\n'), Complaint().size() - 1) << Complaint();
    EXPECT_EQ(Contents(Results() / "median.tif"), oWhole);
    EXPECT_EQ(CountResults(), 5U);
}

}  // namespace
}  // namespace kor::test
