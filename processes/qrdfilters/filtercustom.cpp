#include "processes/qrdfilters/filtercustom.h"

#include <cstdint>
#include <numeric>
#include <source_location>
#include <span>

#include "basic/core/typedispatch/extendtypedispatch.h"
#include "platform/exception/exception.h"
#include "processes/qrdfilters/blockcontract.h"
#include "processes/qrdfilters/kernels/correlaterows.h"
#include "processes/qrdfilters/requireparameter.h"
#include "processes/qrdfilters/stencil/stencilblock.h"

namespace kor::filters
{

namespace
{

constexpr const char* kSource = "processes/qrdfilters/filtercustom";

// Once for all pairs of types.
void CorrelateBlock(stencil::StencilBlock oBlock, std::span<const double> oKernel)
{
    oBlock.meMasked = stencil::MaskedSamples::eCleared;
    stencil::FilterRowsInParallel(
        oBlock, [oKernel](const kernels::StencilRows& oRows, const stencil::StencilPlace&,
                          std::span<double* const> oResults)
        { kernels::CorrelateRows(oRows, oKernel, oResults); });
}

}  // namespace

void details::CustomParams::SetKernel(const std::vector<double>& vdfKernel, unsigned int nWidth,
                                      unsigned int nHeight)
{
    mvdfKernel = vdfKernel;
    if (vdfKernel.size() != std::uint64_t{nWidth} * nHeight)
    {
        const auto oHere = std::source_location::current();
        throw Exception("The size of the kernel doesn't match the given sizes.", kSource,
                        oHere.function_name(), oHere.line());
    }
    mnKernelWidth = nWidth;
    mnKernelHeight = nHeight;
}

void details::CustomParams::ApplyWeight()
{
    const double dfSum = std::accumulate(mvdfKernel.begin(), mvdfKernel.end(), 0.0);
    if (dfSum == 0.0 || mvdfKernel.size() == 1)
    {
        return;
    }
    for (double& dfWeight : mvdfKernel)
    {
        dfWeight /= dfSum;
    }
}

template <class TIn, class TOut>
class FilterCustom::InnerProcessor : public IClipperProcessor, public details::CustomParams
{
public:
    void Process(tessel::Raster* poRasterIn, tessel::Mask* poMaskIn, tessel::Raster* poRasterOut,
                 tessel::Mask* poMaskOut) const override;
};

template <class TIn, class TOut>
void FilterCustom::InnerProcessor<TIn, TOut>::Process(tessel::Raster* poRasterIn,
                                                      tessel::Mask* poMaskIn,
                                                      tessel::Raster* poRasterOut,
                                                      tessel::Mask* poMaskOut) const
{
    // Meant: without a kernel the subtraction wraps, and no margin is deep enough.
    const Window oWindow{(mnKernelWidth - 1) / 2, (mnKernelHeight - 1) / 2};
    RequireParameter(FitsMargins(oWindow, *poRasterIn), "poRasterIn",
                     "The Margin of the input raster is too small", kSource);
    RequireMatchingBlocks(*poRasterIn, poMaskIn, *poRasterOut, poMaskOut, kSource);
    CorrelateBlock({*poRasterIn, poMaskIn, *poRasterOut, poMaskOut, oWindow,
                    stencil::SampleTypesOf<TIn, TOut>(mbBGZero)},
                   mvdfKernel);
}

void FilterCustom::Process(tessel::Raster* poRasterIn, tessel::Mask* poMaskIn,
                           tessel::Raster* poRasterOut, tessel::Mask* poMaskOut) const
{
    RequireRasters(poRasterIn, poRasterOut, kSource);
    RequireRealOutput(*poRasterOut, kSource);

    const RealInput oInput(poRasterIn);
    using Factory = typedispatch::Factory2Template<InnerProcessor, IClipperProcessor>;
    const auto oMake = [this](const tessel::DataType& oIn, const tessel::DataType& oOut)
    {
        std::unique_ptr<IClipperProcessor> poProcessor(
            typedispatch::DispatchTypePair<Factory>(oIn, oOut, false));
        // Weights that were refused once are still there, and are refused again.
        dynamic_cast<details::CustomParams&>(*poProcessor)
            .SetKernel(mvdfKernel, mnKernelWidth, mnKernelHeight);
        return poProcessor.release();
    };
    const IClipperProcessor& oProcessor = SelectProcessor<details::CustomParams>(
        oInput.Get()->moDataType, poRasterOut->moDataType, *this, oMake);
    oProcessor.Process(oInput.Get(), poMaskIn, poRasterOut, poMaskOut);
}

}  // namespace kor::filters
