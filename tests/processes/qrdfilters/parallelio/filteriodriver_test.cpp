#include "processes/qrdfilters/parallelio/filteriodriver.h"

#include <gtest/gtest.h>

#include <omp.h>

#include <atomic>
#include <functional>
#include <set>
#include <thread>

#include "platform/datasources/basicreader.h"
#include "platform/datasources/basicwriter.h"
#include "platform/exception/exception.h"
#include "tests/support/blocks.h"
#include "tests/support/memorydataset.h"

namespace kor::parallelio
{
namespace
{

using tessel::eDT_16U;
using tessel::eDT_8U;
using tessel::Raster;
using test::MemoryDataset;

/// Copies the block; what else it does is the test's.
class CopyBlock
{
public:
    void SetMaskBuilder(tessel::IMaskBuilder* poBuilder) { mpoBuilder = poBuilder; }
    tessel::IMaskBuilder* GetMaskBuilder() const { return mpoBuilder; }

    void Process(Raster* poRasterIn, tessel::Mask* poMaskIn, Raster* poRasterOut)
    {
        ++mnBlocks;
        if (moOnBlock)
        {
            moOnBlock(poRasterIn, poMaskIn, poRasterOut);
        }
        for (std::uint32_t y = 0; poRasterIn != nullptr && y < poRasterOut->mnHeight; ++y)
        {
            std::memcpy(poRasterOut->GetPixel(0, y), poRasterIn->GetPixel(0, y),
                        poRasterOut->mnWidth * poRasterOut->mnChannels *
                            poRasterOut->moDataType.GetSampleBytes());
        }
    }

    int mnBlocks = 0;
    std::function<void(Raster*, tessel::Mask*, Raster*)> moOnBlock;

private:
    tessel::IMaskBuilder* mpoBuilder = nullptr;
};

/// Notes the progress and cancels when it is told to.
class Noting : public DefaultUpdateStrategy
{
public:
    bool IsCancelled() override { return mbCancelled; }
    void SetProgress(float fFraction) override
    {
        mvfProgress.push_back(fFraction);
        if (mfCancelAt >= 0 && fFraction >= mfCancelAt)
        {
            mbCancelled = true;
        }
    }

    std::vector<float> mvfProgress;
    float mfCancelAt = -1.0F;
    std::atomic<bool> mbCancelled = false;
};

using Driver = FilterIODriver<CopyBlock, DefaultAccessPolicy, Noting>;

/// Counts what it hands on and fails at the call that it is told.
class Reader : public datasources::BasicReader
{
public:
    using BasicReader::BasicReader;
    void ReadRaster(Raster* poRaster) override
    {
        if (++mnCalls == mnFailAt)
        {
            throw IOException("reading failed", "", "", 7);
        }
        BasicReader::ReadRaster(poRaster);
    }
    int mnCalls = 0;
    int mnFailAt = -1;
};

class Writer : public datasources::BasicWriter
{
public:
    using BasicWriter::BasicWriter;
    void WriteRaster(const Raster* poRaster) override
    {
        if (++mnCalls == mnFailAt)
        {
            throw IOException("writing failed", "", "", 8);
        }
        BasicWriter::WriteRaster(poRaster);
    }
    int mnCalls = 0;
    int mnFailAt = -1;
};

std::string MessageOfRun(Driver& oDriver, Reader& oReader, Writer& oWriter)
{
    try
    {
        oDriver.Run(&oReader, &oWriter);
    }
    catch (const Exception& oError)
    {
        return oError.GetMessage();
    }
    return "no error";
}

/// Ten rows of two bytes, a block a row.
class FilterIODriverTest : public ::testing::Test
{
protected:
    static constexpr std::uint32_t kRows = 10;

    FilterIODriverTest()
    {
        for (std::uint32_t y = 0; y < kRows; ++y)
        {
            moIn.Sample<unsigned char>(1, 0, y) = static_cast<unsigned char>(10 * y + 1);
            moIn.Sample<unsigned char>(1, 1, y) = static_cast<unsigned char>(10 * y + 2);
        }
        // Two bytes a pixel of input and output, twice, for two pixels.
        moDriver.SetMemoryBudget(8);
    }

    int RowsWritten()
    {
        int nRows = 0;
        for (std::uint32_t y = 0; y < kRows; ++y)
        {
            nRows += moOut.Sample<unsigned char>(1, 1, y) == 10 * y + 2 ? 1 : 0;
        }
        return nRows;
    }

    MemoryDataset moIn{2, kRows, {eDT_8U}};
    MemoryDataset moOut{2, kRows, {eDT_8U}};
    Reader moReader{&moIn, {1}};
    Writer moWriter{&moOut, {1}};
    Driver moDriver;
};

TEST_F(FilterIODriverTest, EveryBlockIsReadProcessedAndWrittenOnce)
{
    moDriver.Run(&moReader, &moWriter);
    EXPECT_EQ(moReader.mnCalls, 10);
    EXPECT_EQ(moDriver.mnBlocks, 10);
    EXPECT_EQ(moWriter.mnCalls, 10);
    EXPECT_EQ(RowsWritten(), 10);
    ASSERT_EQ(moDriver.mvfProgress.size(), 11U);
    EXPECT_EQ(moDriver.mvfProgress[0], 0.0F);
    EXPECT_EQ(moDriver.mvfProgress[3], 3.0F / 10.0F);
    EXPECT_EQ(moDriver.mvfProgress[10], 1.0F);
}

TEST_F(FilterIODriverTest, SmallImageIsOneBlockWrittenAfterTheLoop)
{
    moDriver.SetMemoryBudget(0x10000000);
    moDriver.Run(&moReader, &moWriter);
    EXPECT_EQ(moReader.mnCalls, 1);
    EXPECT_EQ(moDriver.mnBlocks, 1);
    EXPECT_EQ(moWriter.mnCalls, 1);
    EXPECT_EQ(moDriver.mvfProgress, (std::vector<float>{0.0F, 1.0F}));
    EXPECT_EQ(RowsWritten(), 10);
}

TEST_F(FilterIODriverTest, BlocksOfTilesCoverTheImageFromTheTopAndTheLeft)
{
    MemoryDataset oIn(5, 3, {eDT_8U});
    oIn.mnTileWidth = 2;
    oIn.mnTileHeight = 2;
    datasources::BasicReader oReader(&oIn, {1});
    oReader.SetMargin(3, 1, 0);
    moDriver.SetMemoryBudget(8);
    std::vector<BlockRecord> voBlocks;
    moDriver.BuildBlocks(voBlocks, &oReader, nullptr);
    std::vector<std::vector<std::uint32_t>> vvnBlocks;
    for (const BlockRecord& oBlock : voBlocks)
    {
        vvnBlocks.push_back({oBlock.moInputContext.mnOffsetX, oBlock.moInputContext.mnOffsetY,
                             oBlock.moInputInfo.mnWidth, oBlock.moInputInfo.mnHeight});
        EXPECT_EQ(oBlock.moInputContext.mnMarginX, 3U);
        EXPECT_EQ(oBlock.moInputContext.mnMarginY, 1U);
        EXPECT_EQ(oBlock.moOutputContext.mnMarginX, 0U);
        EXPECT_EQ(oBlock.moOutputContext.mnOffsetX, oBlock.moInputContext.mnOffsetX);
        EXPECT_EQ(oBlock.moOutputInfo.moDataType, eDT_8U);
        EXPECT_EQ(oBlock.mpoRaster, nullptr);
    }
    EXPECT_EQ(
        vvnBlocks,
        (std::vector<std::vector<std::uint32_t>>{
            {0, 0, 2, 2}, {2, 0, 2, 2}, {4, 0, 1, 2}, {0, 2, 2, 1}, {2, 2, 2, 1}, {4, 2, 1, 1}}));
    moDriver.SetKeepOutputMargins(true);
    moDriver.BuildBlocks(voBlocks, &oReader, nullptr);
    EXPECT_EQ(voBlocks[0].moOutputContext.mnMarginX, 3U);
    EXPECT_EQ(voBlocks[0].moOutputContext.mnMarginY, 1U);
}

TEST_F(FilterIODriverTest, OutputBlocksHaveTheWritersShape)
{
    MemoryDataset oOut(2, kRows, {eDT_16U, eDT_16U});
    datasources::BasicWriter oWriter(&oOut, {1, 2});
    std::vector<BlockRecord> voBlocks;
    moDriver.BuildBlocks(voBlocks, &moReader, &oWriter);
    EXPECT_EQ(voBlocks[0].moInputInfo.mnChannels, 1U);
    EXPECT_EQ(voBlocks[0].moInputInfo.moDataType, eDT_8U);
    EXPECT_EQ(voBlocks[0].moOutputInfo.mnChannels, 2U);
    EXPECT_EQ(voBlocks[0].moOutputInfo.moDataType, eDT_16U);
}

TEST_F(FilterIODriverTest, MaxPixelsCountInputAndOutputTwice)
{
    DefaultAccessPolicy oPolicy;
    unsigned int nPixels = 0;
    EXPECT_EQ(oPolicy.GetMaxPixels(100, &moReader, &moWriter, nPixels), 25U);
    EXPECT_EQ(nPixels, 25U);
    EXPECT_EQ(oPolicy.GetMaxPixels(100, &moReader, nullptr, nPixels), 50U);
    EXPECT_EQ(oPolicy.GetMaxPixels(103, nullptr, &moWriter, nPixels), 51U);
}

TEST_F(FilterIODriverTest, PixelOfLessThanAByteCountsAsOne)
{
    MemoryDataset oBits(9, 1, {tessel::eDT_BIT});
    datasources::BasicReader oReader(&oBits, {1});
    unsigned int nPixels = 0;
    EXPECT_EQ(DefaultAccessPolicy().GetMaxPixels(100, &oReader, nullptr, nPixels), 50U);
}

TEST_F(FilterIODriverTest, BudgetBeyondThirtyTwoBitsIsClamped)
{
    moDriver.SetMemoryBudget(std::uint64_t{1} << 32);
    std::vector<BlockRecord> voBlocks;
    moDriver.BuildBlocks(voBlocks, &moReader, &moWriter);
    EXPECT_EQ(voBlocks.size(), 1U);
}

TEST_F(FilterIODriverTest, GeneratorRunsWithoutAReader)
{
    moDriver.moOnBlock = [](Raster* poIn, tessel::Mask* poMask, Raster* poOut)
    {
        EXPECT_EQ(poIn, nullptr);
        EXPECT_EQ(poMask, nullptr);
        for (std::uint32_t x = 0; x < 2; ++x)
        {
            *poOut->GetPixel(x, 0) = static_cast<unsigned char>(10 * poOut->mnOffsetY + x + 1);
        }
    };
    moDriver.SetMemoryBudget(4);
    moDriver.Run(nullptr, &moWriter);
    EXPECT_EQ(moDriver.mnBlocks, 10);
    EXPECT_EQ(RowsWritten(), 10);
}

TEST_F(FilterIODriverTest, ResultsAreDroppedWithoutAWriter)
{
    int nSum = 0;
    moDriver.moOnBlock = [&nSum](Raster* poIn, tessel::Mask*, Raster* poOut)
    {
        EXPECT_EQ(poOut->mnChannels, 1U);
        nSum += *poIn->GetPixel(0, 0);
    };
    moDriver.SetMemoryBudget(4);
    moDriver.Run(&moReader, nullptr);
    EXPECT_EQ(nSum, 460);
}

TEST_F(FilterIODriverTest, MaskBuilderMakesAMaskOfEachBlock)
{
    class FirstPixel : public tessel::IMaskBuilder
    {
    public:
        tessel::Mask* BuildMask(const Raster& oRaster) const override
        {
            unsigned char anValid[] = {1, 0};
            return new tessel::Mask(oRaster, oRaster, anValid, false, false);
        }
    };
    FirstPixel oBuilder;
    moDriver.SetMaskBuilder(&oBuilder);
    int nMasks = 0;
    moDriver.moOnBlock = [&nMasks](Raster*, tessel::Mask* poMask, Raster*)
    {
        ASSERT_NE(poMask, nullptr);
        EXPECT_EQ(poMask->moBits[0], 128U);
        ++nMasks;
    };
    moDriver.Run(&moReader, &moWriter);
    EXPECT_EQ(nMasks, 10);
}

TEST_F(FilterIODriverTest, OutputIsReadBeforeItIsProcessedWhereAsked)
{
    moOut.Sample<unsigned char>(1, 1, 4) = 99;
    moDriver.SetPreloadOutput(true);
    moDriver.moOnBlock = [](Raster* poIn, tessel::Mask*, Raster* poOut)
    { EXPECT_EQ(*poOut->GetPixel(1, 0), poIn->mnOffsetY == 4 ? 99 : 0); };
    moDriver.Run(&moReader, &moWriter);
    EXPECT_EQ(RowsWritten(), 10);
}

// Read, process and write of a step run on three threads, and a filter may open a region of its own
// within its stage.
TEST_F(FilterIODriverTest, StagesWorkAtTheSameTimeAndMayOpenRegions)
{
    const int nLevels = omp_get_max_active_levels();
    std::atomic<int> nTeam = 0;
    moDriver.moOnBlock = [&nTeam](Raster*, tessel::Mask*, Raster*)
    {
#pragma omp parallel num_threads(2)
        {
#pragma omp single
            nTeam = omp_get_num_threads();
        }
    };
    moDriver.Run(&moReader, &moWriter);
    EXPECT_EQ(nTeam, 2);
    EXPECT_EQ(omp_get_max_active_levels(), nLevels);
    EXPECT_GT(moDriver.GetTimes().mdfTotal, 0.0);
}

TEST_F(FilterIODriverTest, ImageWithoutPixelsIsRefusedBeforeAnythingIsRead)
{
    class Empty : public Reader
    {
    public:
        using Reader::Reader;
        unsigned int GetWidth() const override { return 0; }
    };
    Empty oReader(&moIn, {1});
    EXPECT_EQ(MessageOfRun(moDriver, oReader, moWriter), "Raster size is 0!");
    EXPECT_EQ(oReader.mnCalls, 0);
}

TEST_F(FilterIODriverTest, CancelledRunWritesNothingMore)
{
    moDriver.mfCancelAt = 0.4F;  // seen in step 4: rows 0 to 2 are written
    moDriver.Run(&moReader, &moWriter);
    EXPECT_EQ(RowsWritten(), 3);
    EXPECT_EQ(moDriver.mvfProgress.back(), 4.0F / 10.0F);
}

TEST_F(FilterIODriverTest, RunCancelledAtTheStartReadsOneBlockAndReportsNothing)
{
    moDriver.mbCancelled = true;
    moDriver.Run(&moReader, &moWriter);
    EXPECT_EQ(moReader.mnCalls, 1);
    EXPECT_EQ(moWriter.mnCalls, 0);
    EXPECT_TRUE(moDriver.mvfProgress.empty());
}

TEST_F(FilterIODriverTest, CancelWhileTheLastBlockIsProcessedLosesIt)
{
    moDriver.moOnBlock = [this](Raster* poIn, tessel::Mask*, Raster*)
    { moDriver.mbCancelled = poIn->mnOffsetY == 9; };
    moDriver.Run(&moReader, &moWriter);
    EXPECT_LE(RowsWritten(), 9);
    EXPECT_NE(moDriver.mvfProgress.back(), 1.0F);
}

// First, middle and last block of each stage: what was written before stays, nothing leaks.
TEST_F(FilterIODriverTest, ErrorsOfReadingEndTheRun)
{
    for (const int nFailAt : {1, 2, 5, 10})
    {
        Reader oReader(&moIn, {1});
        oReader.mnFailAt = nFailAt;
        EXPECT_EQ(MessageOfRun(moDriver, oReader, moWriter), "reading failed");
        EXPECT_EQ(oReader.mnCalls, nFailAt);
    }
    EXPECT_GE(RowsWritten(), 7);
    EXPECT_LE(RowsWritten(), 8);
}

TEST_F(FilterIODriverTest, ErrorsOfProcessingEndTheRun)
{
    for (const std::uint32_t nFailAt : {0U, 5U, 9U})
    {
        moDriver.moOnBlock = [nFailAt](Raster* poIn, tessel::Mask*, Raster*)
        {
            if (poIn->mnOffsetY == nFailAt)
            {
                throw ParameterException("size", ParameterException::Type::eInvalidValue, "", "",
                                         "processing failed", "", "", 9);
            }
        };
        EXPECT_EQ(MessageOfRun(moDriver, moReader, moWriter), "processing failed");
    }
    EXPECT_GE(RowsWritten(), 8);
    EXPECT_LE(RowsWritten(), 9);
}

TEST_F(FilterIODriverTest, ErrorsOfWritingEndTheRun)
{
    for (const int nFailAt : {1, 5, 10})
    {
        Writer oWriter(&moOut, {1});
        oWriter.mnFailAt = nFailAt;
        EXPECT_EQ(MessageOfRun(moDriver, moReader, oWriter), "writing failed");
        EXPECT_EQ(oWriter.mnCalls, nFailAt);
    }
    EXPECT_EQ(RowsWritten(), 9);
}

// Blocks lend their memory to those after them; those cut off at the right side have another shape.
TEST_F(FilterIODriverTest, MemoryOfBlocksIsUsedAgain)
{
    MemoryDataset oIn(5, 8, {eDT_8U});
    MemoryDataset oOut(5, 8, {eDT_8U});
    oIn.mnTileWidth = oIn.mnTileHeight = oOut.mnTileWidth = oOut.mnTileHeight = 2;
    Reader oReader(&oIn, {1});
    Writer oWriter(&oOut, {1});
    moDriver.SetMemoryBudget(16);
    std::set<const unsigned char*> opBuffers;
    moDriver.moOnBlock = [&](const Raster* poIn, auto*, const Raster* poOut)
    {
        EXPECT_TRUE(poIn->mbOwnsBuffer);
        opBuffers.insert(poIn->mpBuffer);
        opBuffers.insert(poOut->mpBuffer);
    };
    moDriver.Run(&oReader, &oWriter);
    EXPECT_EQ(moDriver.mnBlocks, 12);
    EXPECT_LE(opBuffers.size(), 12U);
    EXPECT_EQ(oOut.Sample<unsigned char>(1, 4, 7), oIn.Sample<unsigned char>(1, 4, 7));
}

// Such an error says its words by what(); its message is empty.
TEST_F(FilterIODriverTest, ErrorsKeepTheirWordsOnTheWay)
{
    moDriver.moOnBlock = [](auto*, auto*, auto*)
    {
        throw ParameterException("mnFilterSize", ParameterException::Type::eInvalidValue,
                                 "The filter size was not set", "", "", "source", "function", 12);
    };
    try
    {
        moDriver.Run(&moReader, &moWriter);
        FAIL() << "nothing was thrown";
    }
    catch (const Exception& oError)
    {
        EXPECT_EQ(oError.GetMessage(), "mnFilterSize: The filter size was not set");
        EXPECT_EQ(oError.GetFile(), "source");
        EXPECT_EQ(oError.GetFunction(), "function");
        EXPECT_EQ(oError.GetLine(), 12U);
    }
}

TEST_F(FilterIODriverTest, DriverRunsAgainAfterAnError)
{
    moReader.mnFailAt = 3;
    EXPECT_EQ(MessageOfRun(moDriver, moReader, moWriter), "reading failed");
    moReader.mnFailAt = -1;
    EXPECT_EQ(MessageOfRun(moDriver, moReader, moWriter), "no error");
    EXPECT_EQ(RowsWritten(), 10);
}

TEST_F(FilterIODriverTest, BlockThatMemoryCannotHoldIsAnError)
{
    class Huge : public DefaultAccessPolicy
    {
    public:
        tessel::RasterContext GetReadContext(const tessel::RasterContext& /*oContext*/,
                                             const tessel::RasterInfo& /*oInfo*/) override
        {
            return tessel::RasterContext(100000, 100000, 0, 0);
        }
    };
    FilterIODriver<CopyBlock, Huge> oDriver;
    EXPECT_THROW(oDriver.Run(&moReader, &moWriter), Exception);
}

}  // namespace
}  // namespace kor::parallelio
