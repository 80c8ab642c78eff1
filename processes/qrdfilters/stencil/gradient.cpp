#include "processes/qrdfilters/stencil/gradient.h"

#include "processes/qrdfilters/kernels/gradientrows.h"
#include "processes/qrdfilters/stencil/stencilblock.h"

namespace kor::filters::stencil
{

namespace
{

// Long, since little is done with a sample: three rows of this length stay in the second cache.
constexpr std::size_t kShortestTile = 8192;

}  // namespace

void FilterGradient(const tessel::Raster& oIn, const tessel::Mask* poMaskIn,
                    const tessel::Raster& oOut, const tessel::Mask* poMaskOut,
                    const GradientParameters& oParameters)
{
    StencilBlock oBlock(oIn, poMaskIn, oOut, poMaskOut, Window{1, 1},
                        SampleTypesOf<double, double>(oParameters.mbBGZero));
    oBlock.mnShortestTile = kShortestTile;
    oBlock.mnGroupRows = 1;
    FilterRows(oBlock, 0, oIn.mnHeight,
               [&](const kernels::StencilRows& oRows, const StencilPlace&,
                   std::span<double* const> oResults) {
                   kernels::GradientRows(oRows, oParameters.mdfCentreWeight, oParameters.mdfFactor,
                                         oResults);
               });
}

}  // namespace kor::filters::stencil
