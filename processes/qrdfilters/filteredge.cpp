#include "processes/qrdfilters/filteredge.h"

#include <span>

#include "basic/core/typedispatch/extendtypedispatch.h"
#include "processes/qrdfilters/blockcontract.h"
#include "processes/qrdfilters/kernels/edgerows.h"
#include "processes/qrdfilters/stencil/stencilblock.h"

namespace kor::filters
{

namespace
{

constexpr const char* kSource = "processes/qrdfilters/filteredge";

// Once for all pairs of types.
void FindEdges(const stencil::StencilBlock& oBlock, double dfFactor)
{
    // Meant: the divisor takes no notice of masks. See FilterEdge.IsWeakerBesideMaskedNeighbours.
    const std::size_t nArea = oBlock.moWindow.GetWidth() * oBlock.moWindow.GetHeight();
    const auto dfDivisor = static_cast<double>(nArea - 1);
    stencil::FilterRowsInParallel(
        oBlock, [&](const kernels::StencilRows& oRows, const stencil::StencilPlace&,
                    std::span<double* const> oResults)
        { kernels::MeanDifferenceRows(oRows, dfDivisor, dfFactor, oResults); });
}

}  // namespace

template <class TIn, class TOut>
class FilterEdge::InnerProcessor : public IClipperProcessor, public details::EdgeParams
{
public:
    void Process(tessel::Raster* poRasterIn, tessel::Mask* poMaskIn, tessel::Raster* poRasterOut,
                 tessel::Mask* poMaskOut) const override;
};

template <class TIn, class TOut>
void FilterEdge::InnerProcessor<TIn, TOut>::Process(tessel::Raster* poRasterIn,
                                                    tessel::Mask* poMaskIn,
                                                    tessel::Raster* poRasterOut,
                                                    tessel::Mask* poMaskOut) const
{
    RequireMatchingBlocks(*poRasterIn, poMaskIn, *poRasterOut, poMaskOut, kSource);
    constexpr bool kBGZero = true;
    FindEdges({*poRasterIn, poMaskIn, *poRasterOut, poMaskOut, WindowOfMargins(*poRasterIn),
               stencil::SampleTypesOf<TIn, TOut>(kBGZero)},
              mdfFactor);
}

void FilterEdge::Process(tessel::Raster* poRasterIn, tessel::Mask* poMaskIn,
                         tessel::Raster* poRasterOut, tessel::Mask* poMaskOut) const
{
    RequireRasters(poRasterIn, poRasterOut, kSource);
    RequireRealOutput(*poRasterOut, kSource);

    const RealInput oInput(poRasterIn);
    const IClipperProcessor& oProcessor = SelectProcessor<InnerProcessor, details::EdgeParams>(
        oInput.Get()->moDataType, poRasterOut->moDataType, *this);
    oProcessor.Process(oInput.Get(), poMaskIn, poRasterOut, poMaskOut);
}

}  // namespace kor::filters
