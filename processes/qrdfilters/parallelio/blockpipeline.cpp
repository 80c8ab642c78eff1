#include "processes/qrdfilters/parallelio/blockpipeline.h"

#include <algorithm>
#include <atomic>
#include <chrono>
#include <memory>
#include <mutex>
#include <new>
#include <optional>
#include <utility>

#include "platform/exception/exception.h"
#include "platform/system/omp.h"

namespace kor::parallelio
{

using tessel::Raster;

namespace
{

/// Adds the time that it lives to a stage.
class StageClock
{
public:
    explicit StageClock(double& dfSeconds) : mdfSeconds(dfSeconds) {}
    ~StageClock()
    {
        mdfSeconds +=
            std::chrono::duration<double>(std::chrono::steady_clock::now() - moStart).count();
    }
    StageClock(const StageClock&) = delete;
    StageClock& operator=(const StageClock&) = delete;

private:
    double& mdfSeconds;
    std::chrono::steady_clock::time_point moStart = std::chrono::steady_clock::now();
};

/// The first error of the stages, carried out of them.
class StageError
{
public:
    void Keep(const Exception& oError)
    {
        const std::lock_guard oLock(moMutex);
        if (!moError)
        {
            // what() and not the message: kinds of errors that keep their words elsewhere say them.
            moError.emplace(oError.what(), oError.GetFile(), oError.GetFunction(),
                            oError.GetLine());
        }
        mbRaised = true;
    }
    bool IsRaised() const { return mbRaised; }
    void Rethrow() const { throw Exception(*moError); }

private:
    std::mutex moMutex;
    std::optional<Exception> moError;
    std::atomic<bool> mbRaised = false;
};

std::unique_ptr<Raster> NewBlock(const tessel::RasterInfo& oInfo,
                                 const tessel::RasterContext& oContext)
{
    try
    {
        return std::make_unique<Raster>(oInfo, oContext);
    }
    catch (const std::bad_alloc&)
    {
        throw Exception("There is no memory for a block of " + std::to_string(oInfo.mnWidth) +
                            " x " + std::to_string(oInfo.mnHeight) + " pixels of " +
                            std::to_string(oInfo.mnChannels) + " channels",
                        "processes/qrdfilters/parallelio/blockpipeline", __PRETTY_FUNCTION__,
                        __LINE__);
    }
}

/// Blocks that are through, for those to come of the same shape: new memory for each would be
/// cleared by the system page by page, which takes a quarter of the time of a copy.
class BlockStore
{
public:
    std::unique_ptr<Raster> Take(const tessel::RasterInfo& oInfo,
                                 const tessel::RasterContext& oContext)
    {
        std::unique_ptr<Raster> poBlock = Find(oInfo, oContext);
        if (poBlock == nullptr)
        {
            return NewBlock(oInfo, oContext);
        }
        poBlock->mnOffsetX = oContext.mnOffsetX;
        poBlock->mnOffsetY = oContext.mnOffsetY;
        return poBlock;
    }
    void Return(std::unique_ptr<Raster> poBlock)
    {
        const std::lock_guard oLock(moMutex);
        mvpoBlocks.push_back(std::move(poBlock));
    }

private:
    std::unique_ptr<Raster> Find(const tessel::RasterInfo& oInfo,
                                 const tessel::RasterContext& oContext)
    {
        const std::lock_guard oLock(moMutex);
        const auto oFound =
            std::find_if(mvpoBlocks.begin(), mvpoBlocks.end(),
                         [&](const auto& poBlock) { return IsOfShape(*poBlock, oInfo, oContext); });
        if (oFound == mvpoBlocks.end())
        {
            if (!mvpoBlocks.empty())  // one goes where a new one comes: four are enough
            {
                mvpoBlocks.erase(mvpoBlocks.begin());
            }
            return nullptr;
        }
        std::unique_ptr<Raster> poBlock = std::move(*oFound);
        mvpoBlocks.erase(oFound);
        return poBlock;
    }
    static bool IsOfShape(const Raster& oBlock, const tessel::RasterInfo& oInfo,
                          const tessel::RasterContext& oContext)
    {
        return oBlock.mpBuffer != nullptr && oBlock.mnWidth == oInfo.mnWidth &&
               oBlock.mnHeight == oInfo.mnHeight && oBlock.mnChannels == oInfo.mnChannels &&
               oBlock.moDataType == oInfo.moDataType && oBlock.mnMarginX == oContext.mnMarginX &&
               oBlock.mnMarginY == oContext.mnMarginY;
    }

    std::mutex moMutex;
    std::vector<std::unique_ptr<Raster>> mvpoBlocks;
};

class Pipeline
{
public:
    Pipeline(std::vector<BlockRecord>& voBlocks, datasources::IRasterReader* poReader,
             datasources::IRasterWriter* poWriter, IBlockWork& oWork)
        : mvoBlocks(voBlocks), mpoReader(poReader), mpoWriter(poWriter), moWork(oWork)
    {
    }
    Pipeline(const Pipeline&) = delete;
    Pipeline& operator=(const Pipeline&) = delete;

    /// Blocks left over by an error or a cancellation.
    ~Pipeline()
    {
        for (BlockRecord& oBlock : mvoBlocks)
        {
            Put(oBlock, nullptr);
        }
    }

    StageTimes Run()
    {
        {
            const StageClock oClock(moTimes.mdfTotal);
            RunAll();
        }
        return moTimes;
    }

private:
    void RunAll()
    {
        const OMPNested oNested(true);
        if (!mvoBlocks.empty() && RunSteps())
        {
            WriteBlock(mvoBlocks.size() - 1);
            moWork.SetProgress(1.0F);
        }
    }

    /// False when the run was cancelled.
    bool RunSteps()
    {
        ReadBlock(0);
        for (std::size_t i = 0; i < mvoBlocks.size(); ++i)
        {
            if (moWork.IsCancelled())
            {
                return false;
            }
            moWork.SetProgress(static_cast<float>(i) / static_cast<float>(mvoBlocks.size()));
            if (moWork.IsCancelled())
            {
                return false;
            }
            RunStep(i);
            if (moError.IsRaised())
            {
                moError.Rethrow();
            }
        }
        return !moWork.IsCancelled();
    }

    void RunStep(std::size_t i)
    {
#pragma omp parallel sections num_threads(3)
        {
#pragma omp section
            RunStage([&] { ReadBlock(i + 1); });
#pragma omp section
            RunStage([&] { ProcessBlock(i); });
#pragma omp section
            RunStage(
                [&]
                {
                    if (i > 0)
                    {
                        WriteBlock(i - 1);
                    }
                });
        }
    }

    template <class Stage>
    void RunStage(const Stage& oStage)
    {
        if (moError.IsRaised() || moWork.IsCancelled())
        {
            return;
        }
        try
        {
            oStage();
        }
        catch (const Exception& oError)
        {
            moError.Keep(oError);
        }
    }

    void ReadBlock(std::size_t i)
    {
        if (i >= mvoBlocks.size() || mpoReader == nullptr)
        {
            return;
        }
        const StageClock oClock(moTimes.mdfRead);
        BlockRecord& oBlock = mvoBlocks[i];
        Put(oBlock, moStore.Take(oBlock.moInputInfo, oBlock.moInputContext));
        mpoReader->ReadRaster(oBlock.mpoRaster);
    }

    void ProcessBlock(std::size_t i)
    {
        const StageClock oClock(moTimes.mdfProcess);
        BlockRecord& oBlock = mvoBlocks[i];
        auto poOut = moStore.Take(oBlock.moOutputInfo, oBlock.moOutputContext);
        if (moWork.PreloadsOutput() && mpoWriter != nullptr)
        {
            mpoWriter->ReadRaster(poOut.get());
        }
        moWork.ProcessBlock(oBlock.mpoRaster, poOut.get());
        Put(oBlock, std::move(poOut));
    }

    void WriteBlock(std::size_t i)
    {
        const StageClock oClock(moTimes.mdfWrite);
        BlockRecord& oBlock = mvoBlocks[i];
        if (mpoWriter != nullptr && oBlock.mpoRaster != nullptr)
        {
            mpoWriter->WriteRaster(oBlock.mpoRaster);
        }
        Put(oBlock, nullptr);
    }

    /// The block that was there before is through.
    void Put(BlockRecord& oBlock, std::unique_ptr<Raster> poRaster)
    {
        if (oBlock.mpoRaster != nullptr)
        {
            moStore.Return(std::unique_ptr<Raster>(oBlock.mpoRaster));
        }
        oBlock.mpoRaster = poRaster.release();
    }

    std::vector<BlockRecord>& mvoBlocks;
    datasources::IRasterReader* mpoReader;
    datasources::IRasterWriter* mpoWriter;
    IBlockWork& moWork;
    BlockStore moStore;
    StageError moError;
    StageTimes moTimes;
};

}  // namespace

StageTimes RunBlocks(std::vector<BlockRecord>& voBlocks, datasources::IRasterReader* poReader,
                     datasources::IRasterWriter* poWriter, IBlockWork& oWork)
{
    return Pipeline(voBlocks, poReader, poWriter, oWork).Run();
}

}  // namespace kor::parallelio
