#include <gtest/gtest.h>
#include <pty.h>
#include <signal.h>
#include <sys/wait.h>
#include <unistd.h>

#include <chrono>
#include <cstdint>
#include <filesystem>
#include <memory>
#include <thread>

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

/// Starts the program behind a terminal of its own.
pid_t StartBehindTerminal(const std::string& oIn, const std::string& oOut, int& nTerminal)
{
    const pid_t nProcess = forkpty(&nTerminal, nullptr, nullptr, nullptr);
    if (nProcess == 0)
    {
        const std::string oProgram = std::string(KOR_EXAMPLES_FOLDER) + "/filter_file";
        execl(oProgram.c_str(), oProgram.c_str(), oIn.c_str(), oOut.c_str(), "average", "window=31",
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

}  // namespace
}  // namespace kor::test
