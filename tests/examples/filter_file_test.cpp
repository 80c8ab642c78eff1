#include <gtest/gtest.h>
#include <pty.h>
#include <signal.h>
#include <sys/wait.h>
#include <unistd.h>

#include <chrono>
#include <cstdint>
#include <cstring>
#include <filesystem>
#include <memory>
#include <numeric>
#include <optional>
#include <thread>
#include <vector>

#include "platform/datasources/basicreader.h"
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

using datasources::DatasetManager;

/// The program, in a folder of its own.
class FilterFile : public ::testing::Test
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
    ProgramRun Run(const std::string& oIn, const std::string& oOut, const std::string& oWords) const
    {
        return RunExample("filter_file", "'" + oIn + "' '" + moFolder.File(oOut) + "' " + oWords);
    }
    template <class T>
    Image<T> Read(const std::string& oName, unsigned int nChannel = 1) const
    {
        datasources::BasicReader oReader(moFolder.File(oName), {nChannel}, 0);
        const auto poRaster =
            BlankRaster(oReader.GetWidth(), oReader.GetHeight(), 1, oReader.GetDataType());
        oReader.ReadRaster(poRaster.get());
        return ImageOf<T>(*poRaster);
    }
    std::optional<double> NoDataOf(const std::string& oName) const
    {
        return datasources::BasicReader(moFolder.File(oName), {1}, 0)
            .GetAuxiliaryData()
            .GetChannelNoData(1);
    }
    /// A KORDSK file of one block.
    std::string MakeFile(const std::string& oName, const tessel::Raster& oPixels) const
    {
        const std::unique_ptr<datasources::IDataset> poDataset(
            DatasetManager::GetInstance()->NewDataset(moFolder.File(oName), "KORDSK", ""));
        auto& oImage = dynamic_cast<datasources::IRasterDataset&>(*poDataset);
        oImage.CreateChannels(oPixels);
        std::vector<unsigned int> vnChannels(oPixels.mnChannels);
        std::iota(vnChannels.begin(), vnChannels.end(), 1U);
        datasources::BasicWriter(&oImage, vnChannels).WriteRaster(&oPixels);
        return moFolder.File(oName);
    }
    /// A KORDSK file of zeros in 16 bits.
    std::string MakeZeros(const std::string& oName, std::uint32_t nWidth, std::uint32_t nHeight,
                          std::uint32_t nChannels = 1) const
    {
        const std::unique_ptr<datasources::IDataset> poDataset(
            DatasetManager::GetInstance()->NewDataset(moFolder.File(oName), "KORDSK", ""));
        dynamic_cast<datasources::IRasterDataset&>(*poDataset)
            .CreateChannels({nWidth, nHeight, nChannels, tessel::eDT_16U});
        return moFolder.File(oName);
    }

    TemporaryDirectory moFolder;
};

// The upper left pixel's window, the edge continued, holds nine 1, three each of 2, 3, 4 and 7, and
// one each of 6, 8 and 90; the hole counts nowhere. Middle one of 24: 3. Mean: 161 / 24 = 6.7.
TEST_F(FilterFile, SmoothsAroundNoDataAndLeavesItWhereItIs)
{
    const std::string oGrid = WriteGrid();
    const ProgramRun oMedian = Run(oGrid, "median.tif", "median window=5");
    const ProgramRun oAverage = Run(oGrid, "average.tif", "average window=5");
    ASSERT_EQ(oMedian.mnStatus, 0) << oMedian.moComplaint;
    ASSERT_EQ(oAverage.mnStatus, 0) << oAverage.moComplaint;
    EXPECT_EQ(Read<std::int32_t>("median.tif").Samples()[0], 3);
    EXPECT_EQ(Read<std::int32_t>("average.tif").Samples()[0], 7);
    EXPECT_EQ(Read<std::int32_t>("median.tif").Samples()[4], -9999);
    EXPECT_EQ(Read<std::int32_t>("average.tif").Samples()[4], -9999);
    EXPECT_EQ(oMedian.moComplaint, "");  // no progress bar where there is no terminal
    EXPECT_NE(oMedian.moSaid.find("3 x 3 pixels, 1 channel of type 32S"), std::string::npos)
        << oMedian.moSaid;
    EXPECT_EQ(moFolder.Names(), (std::set<std::string>{"average.tif", "grid.asc", "median.tif"}));
}

// Windows of three in a row, the edge continued and the hole left out: means 4/3, 2, 8/3; 4, 6;
// 22/3, 35, 188/3.
TEST_F(FilterFile, SharpensInTheTypeOfTheInput)
{
    const std::string oGrid = WriteGrid();
    const ProgramRun oRun = Run(oGrid, "sharp.tif", "sharp window=3x1");
    ASSERT_EQ(oRun.mnStatus, 0) << oRun.moComplaint;
    EXPECT_EQ(Read<std::int32_t>("sharp.tif"),
              (Image<std::int32_t>{{1, 2, 3}, {4, -9999, 6}, {7, -19, 117}}));
    ASSERT_EQ(Run(oGrid, "zero.tif", "sharp window=3x1 background=zero").mnStatus, 0);
    EXPECT_EQ(Read<std::int32_t>("zero.tif").Samples()[4], 0);
    const ProgramRun oSmall = Run(oGrid, "small.tif", "sharp window=1");
    EXPECT_EQ(oSmall.mnStatus, 2);
    EXPECT_NE(oSmall.moComplaint.find("sharp takes more than one pixel"), std::string::npos)
        << oSmall.moComplaint;
}

TEST_F(FilterFile, StoresTheLaplacianAsDoubles)
{
    const std::string oGrid = WriteGrid();
    const ProgramRun oRun = Run(oGrid, "laplacian.tif", "laplacian window=3x1");
    ASSERT_EQ(oRun.mnStatus, 0) << oRun.moComplaint;
    EXPECT_EQ(Read<double>("laplacian.tif"),
              (Image<double>{{1.0 - 4.0 / 3.0, 0, 3.0 - 8.0 / 3.0},
                             {0, 0, 0},
                             {7.0 - 22.0 / 3.0, -27, 90.0 - 188.0 / 3.0}}));
}

TEST_F(FilterFile, KeepsNoDataAndGeoreference)
{
    ASSERT_EQ(Run(WriteGrid(), "out.tif", "median").mnStatus, 0);
    const datasources::BasicReader oReader(moFolder.File("out.tif"), {1}, 0);
    EXPECT_EQ(oReader.GetAuxiliaryData().GetChannelNoData(1), -9999.0);
    EXPECT_EQ(oReader.GetGeocodingInfo().GetXOffset(), 100.0);
    EXPECT_EQ(oReader.GetGeocodingInfo().GetYOffset(), 230.0);
    EXPECT_EQ(oReader.GetGeocodingInfo().GetXPerCol(), 10.0);
    EXPECT_EQ(oReader.GetGeocodingInfo().GetYPerRow(), -10.0);
}

TEST_F(FilterFile, TakesTypeBackgroundNoDataAndEdge)
{
    const std::string oGrid = WriteGrid();
    // Beyond the edge 0, which is valid; the hole becomes 0.
    const ProgramRun oZero =
        Run(oGrid, "zero.tif", "average window=3x1 edge=zero type=8U background=zero");
    ASSERT_EQ(oZero.mnStatus, 0) << oZero.moComplaint;
    EXPECT_EQ(Read<std::uint8_t>("zero.tif"),
              (Image<std::uint8_t>{{1, 2, 2}, {2, 0, 3}, {5, 35, 33}}));
    EXPECT_NE(oZero.moComplaint.find("cannot hold the no-data value -9999 of channel 1"),
              std::string::npos);

    ASSERT_EQ(Run(oGrid, "none.tif", "average window=1x3 edge=mirror nodata=none").mnStatus, 0);
    EXPECT_EQ(Read<std::int32_t>("none.tif"),
              (Image<std::int32_t>{{3, -6665, 5}, {4, -3330, 33}, {5, -6663, 34}}));

    ASSERT_EQ(Run(oGrid, "own.tif", "average window=3x1 nodata=7,90 type=32S").mnStatus, 0);
    EXPECT_EQ(Read<std::int32_t>("own.tif"),
              (Image<std::int32_t>{{1, 2, 3}, {-3330, -3330, -3329}, {7, 8, 90}}));
}

TEST_F(FilterFile, TakesChannelsInTheOrderGiven)
{
    const std::string oFile = MakeZeros("four.kordsk", 2, 1, 4);
    {
        const std::unique_ptr<datasources::IDataset> poDataset(
            DatasetManager::GetInstance()->Open(oFile, 1));
        datasources::BasicWriter oWriter(
            dynamic_cast<datasources::IRasterDataset*>(poDataset.get()), {1, 2, 3, 4});
        auto poPixels = RasterOf(Image<std::uint16_t>{{1, 2, 3, 4, 1, 2, 3, 4}}, {}, 4);
        oWriter.WriteRaster(poPixels.get());
    }
    const ProgramRun oRun = Run(oFile, "out.kordsk", "median channels=4,1-2 window=1");
    ASSERT_EQ(oRun.mnStatus, 0) << oRun.moComplaint;
    EXPECT_EQ(Read<std::uint16_t>("out.kordsk", 1), (Image<std::uint16_t>{{4, 4}}));
    EXPECT_EQ(Read<std::uint16_t>("out.kordsk", 2), (Image<std::uint16_t>{{1, 1}}));
    EXPECT_EQ(Read<std::uint16_t>("out.kordsk", 3), (Image<std::uint16_t>{{2, 2}}));
}

TEST_F(FilterFile, RefusesWhatItCannotUseAndSaysWhatItCan)
{
    const std::string oGrid = WriteGrid();
    moFolder.Write("old.tif", "older");
    const std::pair<const char*, const char*> kCases[] = {
        {"median window=4", "window=4 cannot be used; it takes odd numbers of pixels"},
        {"median windwo=3", "\"windwo\" means nothing here; there are background"},
        {"median window=3 window=5", "\"window\" is given twice"},
        {"median window", "\"window\" is not of the form key=value"},
        {"medain", "there is no filter \"medain\"; there are average"},
        {"median channels=2", "channels=2 cannot be used; it takes numbers from 1 to 1"},
        {"median type=12U", "type=12U cannot be used; it takes one of 8U, 8S,"},
        {"median memory=1", "memory=1 cannot be used; it takes numbers from 8 to"},
        {"median memory=20.5", "memory=20.5 cannot be used; it takes a whole number"},
        {"median nodata=1,x", "nodata=1,x cannot be used; it takes numbers"},
        {"median replace=maybe", "replace=maybe cannot be used; it takes one of yes, no"},
    };
    for (const auto& [pszWords, pszComplaint] : kCases)
    {
        const ProgramRun oRun = Run(oGrid, "new.tif", pszWords);
        EXPECT_EQ(oRun.mnStatus, 2) << pszWords;
        EXPECT_NE(oRun.moComplaint.find(pszComplaint), std::string::npos) << oRun.moComplaint;
    }
    EXPECT_EQ(Run(oGrid, "old.tif", "median").mnStatus, 2);
    EXPECT_EQ(Run(oGrid, "new.xyz", "median").mnStatus, 2);
    EXPECT_EQ(Run(oGrid, "new.tif", "median mask=1").mnStatus, 1);
    EXPECT_EQ(Run(moFolder.File("nowhere"), "new.tif", "median").mnStatus, 1);
    EXPECT_EQ(BytesOf(moFolder.File("old.tif")), "older");
    EXPECT_EQ(moFolder.Names(), (std::set<std::string>{"grid.asc", "old.tif"}));
}

TEST_F(FilterFile, ReplacesAnOlderFileWhenAskedEvenTheInput)
{
    const std::string oGrid = WriteGrid();
    ASSERT_EQ(Run(oGrid, "out.tif", "average window=1 type=16S").mnStatus, 0);
    ASSERT_EQ(Run(moFolder.File("out.tif"), "out.tif", "average window=3x1 replace=yes").mnStatus,
              0);
    EXPECT_EQ(Read<std::int16_t>("out.tif"),
              (Image<std::int16_t>{{1, 2, 3}, {4, -9999, 6}, {7, 35, 63}}));
}

TEST_F(FilterFile, LeavesNothingWhenTheInputIsDamaged)
{
    ASSERT_EQ(Run(WriteGrid(), "whole.tif", "median").mnStatus, 0);
    const std::string oDamaged =
        moFolder.Write("damaged.tif", BytesOf(moFolder.File("whole.tif")).substr(0, 100));
    EXPECT_EQ(Run(oDamaged, "out.tif", "median").mnStatus, 1);
    EXPECT_EQ(moFolder.Names(), (std::set<std::string>{"damaged.tif", "grid.asc", "whole.tif"}));
}

TEST_F(FilterFile, BringsTheFilesThatAFormatPutsBesideTheImage)
{
    const ProgramRun oRun = Run(WriteGrid(), "out.envi", "median window=3");
    ASSERT_EQ(oRun.mnStatus, 0) << oRun.moComplaint;
    EXPECT_TRUE(moFolder.Names().contains("out.envi"));
    EXPECT_TRUE(moFolder.Names().contains("out.hdr"));
    EXPECT_EQ(Read<std::int32_t>("out.envi").Samples()[0], 2);  // of 1 1 1 1 2 2 4 4
}

TEST_F(FilterFile, TellsItsFiltersAndTheirParameters)
{
    const ProgramRun oUsage = RunExample("filter_file", "");
    EXPECT_EQ(oUsage.mnStatus, 2);
    EXPECT_NE(oUsage.moComplaint.find("median"), std::string::npos);
    const ProgramRun oHelp = RunExample("filter_file", "help median");
    EXPECT_EQ(oHelp.mnStatus, 0);
    EXPECT_NE(oHelp.moSaid.find("window=7"), std::string::npos) << oHelp.moSaid;
}

TEST_F(FilterFile, ComputesWithOneChannelAndNamesWhatItFillsHolesWith)
{
    const std::string oGrid = WriteGrid();
    const ProgramRun oRun =
        Run(oGrid, "product.tif", "arithmetic operator=multiply constant=2.5 fill=-1");
    ASSERT_EQ(oRun.mnStatus, 0) << oRun.moComplaint;
    EXPECT_EQ(Read<float>("product.tif"),
              (Image<float>{{2.5F, 5, 7.5F}, {10, -1, 15}, {17.5F, 20, 225}}));
    EXPECT_EQ(NoDataOf("product.tif"), -1.0);

    ASSERT_EQ(Run(oGrid, "bits.tif", "arithmetic operator=and constant=6").mnStatus, 0);
    EXPECT_EQ(Read<std::int32_t>("bits.tif"),
              (Image<std::int32_t>{{0, 2, 2}, {4, 0, 6}, {6, 0, 2}}));
    EXPECT_EQ(NoDataOf("bits.tif"), std::nullopt);
}

// Quotients 4, 2, 1.5 and 9; the zero divisor is left out of the range and of the scale. The last
// one is cut at the range of the third run.
TEST_F(FilterFile, ScalesResultsToTheRangeThatTheyHave)
{
    const auto poPixels = RasterOf(Image<std::uint16_t>{{8, 2, 8, 4, 3, 2, 9, 1, 5, 0}}, {}, 2);
    const std::string oFile = MakeFile("two.kordsk", *poPixels);
    const std::string oDivide = "arithmetic operator=divide zerodiv=7 ";
    ASSERT_EQ(Run(oFile, "plain.kordsk", oDivide).mnStatus, 0);
    EXPECT_EQ(Read<float>("plain.kordsk"), (Image<float>{{4, 2, 1.5F, 9, 7}}));
    const ProgramRun oRun = Run(oFile, "scaled.tif", oDivide + "scale=0,150 type=8U");
    ASSERT_EQ(oRun.mnStatus, 0) << oRun.moComplaint;
    EXPECT_EQ(Read<std::uint8_t>("scaled.tif"), (Image<std::uint8_t>{{50, 10, 0, 150, 7}}));
    ASSERT_EQ(Run(oFile, "range.tif", oDivide + "scale=0,200 range=0,8 type=8U").mnStatus, 0);
    EXPECT_EQ(Read<std::uint8_t>("range.tif"), (Image<std::uint8_t>{{100, 50, 38, 200, 7}}));
}

TEST_F(FilterFile, ScalesWhatComplexSamplesAreSeenAs)
{
    const auto poPixels = BlankRaster(2, 1, 1, tessel::eDT_C32R);
    const float afParts[] = {3.0F, 4.0F, 0.0F, -2.0F};
    std::memcpy(poPixels->mpBuffer, afParts, sizeof(afParts));
    const ProgramRun oRun = Run(MakeFile("complex.kordsk", *poPixels), "out.tif",
                                "arithmetic operator=add constant=1 scale=20,80");
    ASSERT_EQ(oRun.mnStatus, 0) << oRun.moComplaint;
    EXPECT_EQ(Read<float>("out.tif"), (Image<float>{{80, 20}}));
}

TEST_F(FilterFile, ClearsValidPixelsOrMaskedOnes)
{
    const std::string oGrid = WriteGrid();
    ASSERT_EQ(Run(oGrid, "valid.tif", "clear values=5").mnStatus, 0);
    EXPECT_EQ(Read<std::int32_t>("valid.tif"),
              (Image<std::int32_t>{{5, 5, 5}, {5, -9999, 5}, {5, 5, 5}}));
    ASSERT_EQ(Run(oGrid, "masked.tif", "clear where=masked values=5").mnStatus, 0);
    EXPECT_EQ(Read<std::int32_t>("masked.tif"),
              (Image<std::int32_t>{{1, 2, 3}, {4, 5, 6}, {7, 8, 90}}));
    const auto poPixels = RasterOf(Image<std::uint8_t>{{1, 2, 3, 4, 5, 6}}, {}, 3);
    const std::string oFile = MakeFile("three.kordsk", *poPixels);
    ASSERT_EQ(Run(oFile, "all.kordsk", "clear values=300.7,-1").mnStatus, 0);
    EXPECT_EQ(Read<std::uint8_t>("all.kordsk", 1), (Image<std::uint8_t>{{255, 255}}));
    EXPECT_EQ(Read<std::uint8_t>("all.kordsk", 3), (Image<std::uint8_t>{{0, 0}}));
    ASSERT_EQ(Run(oFile, "none.kordsk", "clear where=masked").mnStatus, 0);
    EXPECT_EQ(Read<std::uint8_t>("none.kordsk", 2), (Image<std::uint8_t>{{2, 5}}));
}

// Columns of two levels side by side: of the four neighbours one is alike and three are half
// alike. The pixels below the last row have their neighbours to the east alone, those left of the
// first column none to the south-west, and those right of the last column none at all.
TEST_F(FilterFile, MeasuresHomogeneityOnLevelsOfTheWholeImage)
{
    const Image<std::uint16_t> oStripes = {
        {0, 90, 0, 90}, {0, 90, 0, 90}, {0, 90, 0, 90}, {0, 90, 0, 90}};
    const ProgramRun oRun = Run(MakeFile("stripes.kordsk", *RasterOf(oStripes)), "out.tif",
                                "homogeneity window=3 levels=2 edge=mirror");
    ASSERT_EQ(oRun.mnStatus, 0) << oRun.moComplaint;
    const float f = 2.5F / 4;
    const float fBelow = (6 * 2.5F + 3 * 0.5F) / (6 * 4 + 3);
    const float fLeft = (2.0F + 2 * 2.5F) / (3 + 2 * 4);
    const float fCorner = (2 * (2.0F + 2 * 2.5F) + 3 * 0.5F) / (2 * (3 + 2 * 4) + 3);
    EXPECT_EQ(Read<float>("out.tif"), (Image<float>{{fLeft, f, f, f},
                                                    {fLeft, f, f, f},
                                                    {fLeft, f, f, f},
                                                    {fCorner, fBelow, fBelow, fBelow}}));
    // One level: the hole is 0, and its neighbours are alike without it.
    ASSERT_EQ(Run(WriteGrid(), "grid.tif", "homogeneity window=1 levels=1").mnStatus, 0);
    EXPECT_EQ(Read<float>("grid.tif").Samples()[4], 0.0F);
    EXPECT_EQ(Read<float>("grid.tif").Samples()[0], 1.0F);
    EXPECT_EQ(NoDataOf("grid.tif"), std::nullopt);
}

TEST_F(FilterFile, MarksSamplesByThresholds)
{
    const std::string oGrid = WriteGrid();
    const auto oMarked = [&](const std::string& oWords)
    {
        const ProgramRun oRun = Run(oGrid, "out.tif", "threshold replace=yes " + oWords);
        EXPECT_EQ(oRun.mnStatus, 0) << oRun.moComplaint;
        return Read<std::uint8_t>("out.tif");
    };
    using Bytes = Image<std::uint8_t>;
    EXPECT_EQ(oMarked("thresholds=6"), (Bytes{{0, 0, 0}, {0, 0, 1}, {1, 1, 1}}));
    EXPECT_EQ(oMarked("thresholds=6 ones=below"), (Bytes{{1, 1, 1}, {1, 0, 0}, {0, 0, 0}}));
    EXPECT_EQ(oMarked("thresholds=2,6"), (Bytes{{0, 1, 1}, {1, 0, 1}, {0, 0, 0}}));
    EXPECT_EQ(oMarked("thresholds=2,6 ones=outside"), (Bytes{{1, 1, 0}, {0, 0, 1}, {1, 1, 1}}));
    EXPECT_EQ(NoDataOf("out.tif"), std::nullopt);
}

TEST_F(FilterFile, SaysWhatItsTransformsNeed)
{
    const std::string oGrid = WriteGrid();
    const std::string oThree = MakeZeros("three.kordsk", 2, 1, 3);
    const auto oComplaint = [&](const std::string& oIn, const std::string& oWords)
    {
        const ProgramRun oRun = Run(oIn, "new.tif", oWords);
        EXPECT_EQ(oRun.mnStatus, 2) << oWords;
        return oRun.moComplaint;
    };
    const std::pair<const char*, const char*> kCases[] = {
        {"arithmetic", "operator= cannot be used; it takes one of add, subtract"},
        {"arithmetic operator=add scale=5,1",
         "scale=5,1 cannot be used; it takes two numbers, the lower one first"},
        {"arithmetic operator=add scale=", "scale= cannot be used; it takes numbers"},
        {"arithmetic operator=add range=0,1", "range= says what is scaled; it needs scale="},
        {"clear values=1,2", "values= has 2 numbers for 1 channels"},
        {"homogeneity window=3x5", "window=3x5 cannot be used; it takes one number"},
        {"homogeneity levels=256", "levels=256 cannot be used; it takes numbers from 1 to 255"},
        {"threshold", "threshold needs thresholds=: one number, or two"},
        {"threshold thresholds=1,2,3", "threshold needs thresholds=: one number, or two"},
        {"threshold thresholds=1 ones=inside", "ones=inside cannot be used; it takes one of below"},
    };
    for (const auto& [pszWords, pszComplaint] : kCases)
    {
        EXPECT_NE(oComplaint(oGrid, pszWords).find(pszComplaint), std::string::npos) << pszWords;
    }
    EXPECT_NE(oComplaint(oThree, "arithmetic operator=add").find("takes one or two channels"),
              std::string::npos);
    EXPECT_NE(oComplaint(oThree, "homogeneity").find("takes one channel"), std::string::npos);
    const auto poComplex = BlankRaster(2, 1, 1, tessel::eDT_C32R);
    EXPECT_NE(
        oComplaint(MakeFile("complex.kordsk", *poComplex), "homogeneity").find("real samples"),
        std::string::npos);
    EXPECT_FALSE(moFolder.Names().contains("new.tif"));
}

/// Starts the program behind a terminal of its own.
pid_t StartBehindTerminal(const std::string& oIn, const std::string& oOut, int& nTerminal,
                          const char* pszFilter = "average")
{
    const pid_t nProcess = forkpty(&nTerminal, nullptr, nullptr, nullptr);
    if (nProcess == 0)
    {
        const std::string oProgram = std::string(KOR_EXAMPLES_FOLDER) + "/filter_file";
        execl(oProgram.c_str(), oProgram.c_str(), oIn.c_str(), oOut.c_str(), pszFilter, "window=31",
              "memory=8", nullptr);
        _exit(127);
    }
    return nProcess;
}

/// All that the program writes until its end.
std::string ReadAll(int nTerminal)
{
    std::string oText;
    char acPiece[4096];
    for (ssize_t nRead = 0; (nRead = read(nTerminal, acPiece, sizeof(acPiece))) > 0;)
    {
        oText.append(acPiece, static_cast<std::size_t>(nRead));
    }
    return oText;
}

TEST_F(FilterFile, ShowsItsProgressOnATerminal)
{
    int nTerminal = -1;
    const pid_t nProcess = StartBehindTerminal(MakeZeros("in.kordsk", 1000, 1000),
                                               moFolder.File("out.kordsk"), nTerminal);
    ASSERT_GT(nProcess, 0);
    const std::string oText = ReadAll(nTerminal);
    int nStatus = 0;
    waitpid(nProcess, &nStatus, 0);
    close(nTerminal);
    EXPECT_EQ(nStatus, 0) << oText;
    EXPECT_NE(oText.find("]   0 %"), std::string::npos) << oText;
    EXPECT_NE(oText.find("##] 100 %"), std::string::npos) << oText;
}

TEST_F(FilterFile, EndsAtCtrlCAndLeavesNoFile)
{
    int nTerminal = -1;
    const pid_t nProcess = StartBehindTerminal(MakeZeros("in.kordsk", 10000, 10000),
                                               moFolder.File("out.kordsk"), nTerminal);
    ASSERT_GT(nProcess, 0);
    // The first character of the bar: the run has begun.
    char cFirst = 0;
    ASSERT_EQ(read(nTerminal, &cFirst, 1), 1);
    ASSERT_EQ(write(nTerminal, "\x03", 1), 1);  // what Ctrl-C sends
    const std::string oText = ReadAll(nTerminal);
    int nStatus = 0;
    waitpid(nProcess, &nStatus, 0);
    close(nTerminal);
    EXPECT_TRUE(WIFEXITED(nStatus) && WEXITSTATUS(nStatus) == 130) << oText;
    EXPECT_NE(oText.find("interrupted"), std::string::npos) << oText;
    EXPECT_EQ(moFolder.Names(), (std::set<std::string>{"in.kordsk"}));
}

// The bar begins while the image is looked at, long before the first block.
TEST_F(FilterFile, EndsAtCtrlCWhileItLooksAtTheImage)
{
    int nTerminal = -1;
    const pid_t nProcess =
        StartBehindTerminal(MakeZeros("in.kordsk", 10000, 10000), moFolder.File("out.kordsk"),
                            nTerminal, "homogeneity");
    ASSERT_GT(nProcess, 0);
    char cFirst = 0;
    ASSERT_EQ(read(nTerminal, &cFirst, 1), 1);
    ASSERT_EQ(write(nTerminal, "\x03", 1), 1);
    const std::string oText = ReadAll(nTerminal);
    int nStatus = 0;
    waitpid(nProcess, &nStatus, 0);
    close(nTerminal);
    EXPECT_TRUE(WIFEXITED(nStatus) && WEXITSTATUS(nStatus) == 130) << oText;
    EXPECT_NE(oText.find("interrupted; "), std::string::npos) << oText;
    EXPECT_EQ(oText.find("100 %"), std::string::npos) << oText;
    EXPECT_EQ(moFolder.Names(), (std::set<std::string>{"in.kordsk"}));
}

}  // namespace
}  // namespace kor::test
