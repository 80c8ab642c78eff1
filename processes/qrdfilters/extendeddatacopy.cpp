#include <memory>

#include "basic/core/typedispatch/extendtypedispatch.h"
#include "processes/qrdfilters/blockcontract.h"
#include "processes/qrdfilters/datacopy.h"
#include "processes/qrdfilters/hardened.h"
#include "processes/qrdfilters/mosaic/clipdistance.h"
#include "processes/qrdfilters/mosaic/colourbalance.h"
#include "processes/qrdfilters/mosaic/gather.h"
#include "processes/qrdfilters/mosaic/rowwriter.h"
#include "processes/qrdfilters/rowbands.h"

namespace kor::filters
{

using tessel::Mask;
using tessel::Raster;

namespace
{

constexpr const char* kSource = "processes/qrdfilters/datacopy";

constexpr std::uint32_t kBandRows = 64;

/// What all pairs of types share. The state grows in Process, which the interface has const.
class MosaicProcessor : public IProcessor, public details::ExtendedDataCopyParams
{
public:
    void Process(Raster* poRasterIn, Mask* poMaskIn, Raster* poRasterOut) const override
    {
        RequireMatchingBlocks(*poRasterIn, poMaskIn, *poRasterOut, nullptr, kSource);
        const ClipDistance oDistance(*poRasterIn, poMaskIn, mnBlendWidth >= 1);
        if (meProcessStage == ePS_Gather)
        {
            const GatherRules oRules{mnSampleBand, mdfInputNoData, mdfOutputNoData};
            GatherBlock(*poRasterIn, *poRasterOut, oDistance, oRules, moGathered);
        }
        else
        {
            FindLine();
            Adjust();
            Write(*poRasterIn, *poRasterOut, oDistance);
        }
    }

    double GetGain() override
    {
        FindLine();
        return GetLine().mdfGain;
    }
    double GetOffset() override
    {
        FindLine();
        return GetLine().mdfOffset;
    }

protected:
    MosaicProcessor(std::size_t nIn, std::size_t nOut, std::unique_ptr<ISampleList> poIn,
                    std::unique_ptr<ISampleList> poOut)
        : mnIn(nIn), mnOut(nOut), moGathered{std::move(poIn), std::move(poOut), {}}
    {
    }

private:
    BalanceLine GetLine() const { return mbFixedGain ? BalanceLine{mdfGain, mdfOffset} : moLine; }

    void FindLine() const
    {
        if (mbFixedGain || mbLineFound)
        {
            return;
        }
        switch (mnBalanceMode)
        {
            case 1:
                moLine = LineOfPairs(*moGathered.mpoIn, *moGathered.mpoOut);
                break;
            case 2:
                moLine = LineOfPercentiles(mdfLowPercentile, mdfHighPercentile, *moGathered.mpoIn,
                                           *moGathered.mpoOut);
                break;
            case 3:
                moLine = {0.0, 0.0};  // meant: see ModeThreeBlanksTheOutput
                break;
            default:
                moLine = {1.0, 0.0};
        }
        mbLineFound = true;
    }

    void Adjust() const
    {
        if (mbFixedGain || mbAdjusted)
        {
            return;
        }
        const SampleRange oRange = moGathered.mpoIn->GetRange();
        const double dfMiddle =
            oRange.IsEmpty() ? 1.0 : (oRange.mdfLowest + oRange.mdfHighest) / 2.0;
        moLine =
            AdjustLine(moLine, mdfStretchFactor, dfMiddle, mdfOffsetShare, moGathered.moInside);
        mbAdjusted = true;
    }

    void Write(const Raster& oIn, const Raster& oOut, const ClipDistance& oDistance) const
    {
        WriteRules oRules{GetLine(), {}, mnBlendWidth, {}, {}};
        if (mbUseKnee)
        {
            oRules.moKnee = {mdfKneeHigh, mdfKneeLow, mdfKneeStart};
        }
        if (mbUseInputNoData)
        {
            oRules.mfInputNoData = static_cast<float>(mdfInputNoData);
        }
        if (mbUseOutputNoData)
        {
            oRules.mfOutputNoData = static_cast<float>(mdfOutputNoData);
        }
        ForEachRowBand(oIn.mnHeight, kBandRows,
                       [&](std::uint32_t nFirst, std::uint32_t nEnd)
                       {
                           RowWriter oWriter(oRules, mnIn, mnOut, oIn, oOut);
                           for (std::uint32_t y = nFirst; y < nEnd; ++y)
                           {
                               oWriter.WriteRow(y, oDistance.GetRow(y));
                           }
                       });
    }

    std::size_t mnIn;
    std::size_t mnOut;
    mutable Gathered moGathered;
    mutable BalanceLine moLine;
    mutable bool mbLineFound = false;
    mutable bool mbAdjusted = false;
};

}  // namespace

template <class TIn, class TOut>
class ExtendedDataCopy::InnerProcessor : public MosaicProcessor
{
public:
    InnerProcessor()
        : MosaicProcessor(typedispatch::ElementPosition<TIn>(),
                          typedispatch::ElementPosition<TOut>(), MakeSampleList<TIn>(),
                          MakeSampleList<TOut>())
    {
    }
};

void ExtendedDataCopy::ProcessBlock(Raster* poRasterIn, Raster* poRasterOut)
{
    if constexpr (kHardened)
    {
        RequireRasters(poRasterIn, poRasterOut, kSource);
    }
    const IProcessor& oProcessor = SelectProcessor<InnerProcessor, details::ExtendedDataCopyParams>(
        poRasterIn->moDataType, poRasterOut->moDataType, *this);
    const std::unique_ptr<Mask> poClip(
        mpoClipBuilder != nullptr ? mpoClipBuilder->BuildMask(*poRasterIn) : nullptr);
    oProcessor.Process(poRasterIn, poClip.get(), poRasterOut);
}

double ExtendedDataCopy::GetGain()
{
    return mpoProcessor == nullptr
               ? 1.0
               : dynamic_cast<details::ExtendedDataCopyParams&>(*mpoProcessor).GetGain();
}

double ExtendedDataCopy::GetOffset()
{
    return mpoProcessor == nullptr
               ? 0.0
               : dynamic_cast<details::ExtendedDataCopyParams&>(*mpoProcessor).GetOffset();
}

void ExtendedDataCopy::SetProcessStage(ProcessStage eStage)
{
    ExtendedDataCopyParams::SetProcessStage(eStage);
    if (mpoProcessor != nullptr)
    {
        dynamic_cast<details::ExtendedDataCopyParams&>(*mpoProcessor).SetProcessStage(eStage);
    }
}

}  // namespace kor::filters
