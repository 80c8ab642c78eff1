#pragma once

#include <vector>

#include "basic/tessel/raster/raster.h"
#include "platform/datasources/irasterreader.h"
#include "platform/datasources/irasterwriter.h"

namespace kor::parallelio
{

/// One block of a run.
struct BlockRecord
{
    tessel::RasterInfo moInputInfo;
    tessel::RasterInfo moOutputInfo;
    tessel::RasterContext moInputContext;
    tessel::RasterContext moOutputContext;
    /// The block while it is in the pipeline, owned by it: the input once it is read, the output
    /// once it is processed; null otherwise.
    tessel::Raster* mpoRaster = nullptr;
};

/// What the pipeline asks of a run.
class IBlockWork
{
public:
    virtual ~IBlockWork() = default;
    /// Makes the output block of the input block, which is null without a reader.
    virtual void ProcessBlock(tessel::Raster* poRasterIn, tessel::Raster* poRasterOut) = 0;
    /// True when output blocks start with what the writer's image holds.
    virtual bool PreloadsOutput() const = 0;
    virtual bool IsCancelled() = 0;
    virtual void SetProgress(float fFraction) = 0;
};

/// Where the time of a run went, in seconds. The three stages overlap: their sum is more than the
/// total where they do.
struct StageTimes
{
    double mdfRead = 0.0;
    double mdfProcess = 0.0;
    double mdfWrite = 0.0;
    double mdfTotal = 0.0;
};

/// Moves all blocks through three stages that work at the same time, each on a thread of its own:
/// while block i is processed, block i + 1 is read and block i - 1 written. At most four blocks are
/// in memory. poReader and poWriter may be null: nothing is read, or results are dropped.
///
/// Cancellation ends the run at the next step; blocks that are not written then are lost without an
/// error. A kor::Exception in a stage ends the run after the step and is thrown again, the first
/// one where two stages fail; other exceptions in a stage end the program. Blocks written before
/// stay written.
StageTimes RunBlocks(std::vector<BlockRecord>& voBlocks, datasources::IRasterReader* poReader,
                     datasources::IRasterWriter* poWriter, IBlockWork& oWork);

}  // namespace kor::parallelio
