#pragma once

#include <algorithm>
#include <cstdint>
#include <limits>
#include <memory>
#include <utility>
#include <vector>

#include "basic/tessel/mask/imaskbuilder.h"
#include "platform/logging/ialgorithmstatusmanager.h"
#include "processes/qrdfilters/parallelio/blockpipeline.h"
#include "processes/qrdfilters/parallelio/findoptimalrectangle.h"

/// The block driver: runs an algorithm over an image of any size, block by block, while the next
/// block is read and the last one written.
///
///     FilterIODriver<MyAlgorithm, DefaultAccessPolicy, DefaultUpdateStrategy> oDriver;
///     oDriver.Run(&oReader, &oWriter);
namespace kor::parallelio
{

/// What is read for a block: by default the block itself, of the reader's type and channels. An
/// algorithm that needs margins, or other channels, overrides this.
class DefaultAccessPolicy
{
public:
    virtual ~DefaultAccessPolicy() = default;

    /// Margins and offsets to be read for a block at oContext.
    virtual tessel::RasterContext GetReadContext(const tessel::RasterContext& oContext,
                                                 const tessel::RasterInfo& oInfo);
    /// Size, channels and type to be read for a block of oInfo.
    virtual tessel::RasterInfo GetReadInfo(const tessel::RasterContext& oContext,
                                           const tessel::RasterInfo& oInfo);
    /// Called once before the blocks are cut. Either may be null.
    virtual void Init(datasources::IRasterReader* poReader, datasources::IRasterWriter* poWriter);
    /// Pixels of a block for nMemory bytes: one of input and one of output, in each of two stages.
    /// Complex samples count as their real part, fractions of a byte are dropped.
    virtual unsigned int GetMaxPixels(unsigned int nMemory, datasources::IRasterReader* poReader,
                                      datasources::IRasterWriter* poWriter,
                                      unsigned int& nMaxPixels);

protected:
    tessel::DataType moDataType;
    std::uint32_t mnChannels = 0;
};

/// Neither reports nor cancels.
class DefaultUpdateStrategy : public logging::IAlgorithmStatusManager
{
public:
    bool IsCancelled() override { return false; }
    void ReportStage(const std::string& /*oText*/) override {}
    void SetProgress(float /*fFraction*/) override {}
    void ReportMessage(const std::string& /*oText*/) override {}
    void ReportWarning(const std::string& /*oText*/) override {}
    float GetProgressStart() override { return 0.0F; }
    float GetProgressEnd() override { return 1.0F; }
};

namespace details
{

/// The blocks of a run, from the top and from the left, those at the ends cut off.
std::vector<BlockRecord> CutIntoBlocks(DefaultAccessPolicy& oPolicy,
                                       datasources::IRasterReader* poReader,
                                       datasources::IRasterWriter* poWriter,
                                       std::uint64_t nMemoryBudget, bool bKeepOutputMargins);

}  // namespace details

/// Cuts the image into blocks and hands them to the algorithm.
///
/// Algorithm   a class with Process(Raster* poRasterIn, Mask* poMaskIn, Raster* poRasterOut),
/// called
///             from one thread at a time. With an operation GetMaskBuilder() that gives an
///             IMaskBuilder*, each block gets a mask of it; otherwise, where that is null, and
///             without an input block, the mask is null.
template <class Algorithm, class AccessPolicy, class UpdateStrategy>
class DefaultProcessPolicy : public Algorithm, public AccessPolicy, public UpdateStrategy
{
public:
    using Algorithm::Algorithm;
    DefaultProcessPolicy() = default;
    explicit DefaultProcessPolicy(Algorithm oAlgorithm) : Algorithm(std::move(oAlgorithm)) {}
    virtual ~DefaultProcessPolicy() = default;

    /// Bytes for the blocks in memory, 256 MiB at first; above 4 GiB it counts as 4 GiB.
    void SetMemoryBudget(std::uint64_t nBytes) { mnMemoryBudget = nBytes; }
    /// True: an output block holds what the writer's image holds before it is processed. False at
    /// first.
    void SetPreloadOutput(bool bPreload) { mbPreloadOutput = bPreload; }
    /// True: output blocks have the margins of the input blocks. False at first.
    void SetKeepOutputMargins(bool bKeep) { mbKeepOutputMargins = bKeep; }

    virtual void BuildBlocks(std::vector<BlockRecord>& oBlocks,
                             datasources::IRasterReader* poReader,
                             datasources::IRasterWriter* poWriter)
    {
        oBlocks =
            details::CutIntoBlocks(*this, poReader, poWriter, mnMemoryBudget, mbKeepOutputMargins);
    }

protected:
    void ProcessOneBlock(tessel::Raster* poRasterIn, tessel::Raster* poRasterOut)
    {
        std::unique_ptr<tessel::Mask> poMask;
        if constexpr (requires(Algorithm & oAlgorithm) { oAlgorithm.GetMaskBuilder(); })
        {
            const tessel::IMaskBuilder* poBuilder = this->GetMaskBuilder();
            if (poBuilder != nullptr && poRasterIn != nullptr)
            {
                poMask.reset(poBuilder->BuildMask(*poRasterIn));
            }
        }
        Algorithm::Process(poRasterIn, poMask.get(), poRasterOut);
    }

    std::uint64_t mnMemoryBudget = 0x10000000;
    bool mbPreloadOutput = false;
    bool mbKeepOutputMargins = false;
};

/// The loop: blocks through the pipeline.
template <class Algorithm, class AccessPolicy, class ProcessPolicy>
class IODriver : public ProcessPolicy
{
public:
    using ProcessPolicy::ProcessPolicy;

    /// Runs over the whole image. poReader may be null for an algorithm that generates its output,
    /// poWriter where only the processing counts. See RunBlocks for cancellation and errors;
    /// kor::Exception "Raster size is 0!" for an image without pixels.
    void Run(datasources::IRasterReader* poReader, datasources::IRasterWriter* poWriter)
    {
        std::vector<BlockRecord> voBlocks;
        this->BuildBlocks(voBlocks, poReader, poWriter);
        Work oWork(*this);
        moTimes = RunBlocks(voBlocks, poReader, poWriter, oWork);
    }

    /// Where the time of the last complete run went.
    const StageTimes& GetTimes() const { return moTimes; }

private:
    class Work : public IBlockWork
    {
    public:
        explicit Work(IODriver& oDriver) : moDriver(oDriver) {}
        void ProcessBlock(tessel::Raster* poRasterIn, tessel::Raster* poRasterOut) override
        {
            moDriver.ProcessOneBlock(poRasterIn, poRasterOut);
        }
        bool PreloadsOutput() const override { return moDriver.mbPreloadOutput; }
        bool IsCancelled() override { return moDriver.IsCancelled(); }
        void SetProgress(float fFraction) override { moDriver.SetProgress(fFraction); }

    private:
        IODriver& moDriver;
    };

    StageTimes moTimes;
};

/// The driver that a caller makes. It is constructed like the algorithm, or from one.
template <class Algorithm, class AccessPolicy = DefaultAccessPolicy,
          class UpdateStrategy = DefaultUpdateStrategy>
class FilterIODriver
    : public IODriver<Algorithm, AccessPolicy,
                      DefaultProcessPolicy<Algorithm, AccessPolicy, UpdateStrategy>>
{
public:
    using IODriver<Algorithm, AccessPolicy,
                   DefaultProcessPolicy<Algorithm, AccessPolicy, UpdateStrategy>>::IODriver;
};

}  // namespace kor::parallelio
