#include "processes/qrdfilters/parallelio/blockpipeline.h"

#include <atomic>
#include <chrono>
#include <memory>
#include <mutex>
#include <new>
#include <optional>

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
        Put(oBlock, NewBlock(oBlock.moInputInfo, oBlock.moInputContext).release());
        mpoReader->ReadRaster(oBlock.mpoRaster);
    }

    void ProcessBlock(std::size_t i)
    {
        const StageClock oClock(moTimes.mdfProcess);
        BlockRecord& oBlock = mvoBlocks[i];
        auto poOut = NewBlock(oBlock.moOutputInfo, oBlock.moOutputContext);
        if (moWork.PreloadsOutput() && mpoWriter != nullptr)
        {
            mpoWriter->ReadRaster(poOut.get());
        }
        moWork.ProcessBlock(oBlock.mpoRaster, poOut.get());
        Put(oBlock, poOut.release());
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

    static void Put(BlockRecord& oBlock, Raster* poRaster)
    {
        const std::unique_ptr<Raster> poFormer(oBlock.mpoRaster);
        oBlock.mpoRaster = poRaster;
    }

    std::vector<BlockRecord>& mvoBlocks;
    datasources::IRasterReader* mpoReader;
    datasources::IRasterWriter* mpoWriter;
    IBlockWork& moWork;
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
