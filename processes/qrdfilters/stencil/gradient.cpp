#include "processes/qrdfilters/stencil/gradient.h"

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
                    const kernels::GradientScale& oScale, bool bBGZero)
{
    StencilBlock oBlock(oIn, poMaskIn, oOut, poMaskOut, Window{1, 1},
                        SampleTypesOf<double, double>(bBGZero));
    oBlock.mnShortestTile = kShortestTile;
    oBlock.mbCoreStreams = true;
    FilterRows(oBlock, 0, oIn.mnHeight,
               [&](const kernels::StencilRows& oRows, const StencilPlace& oPlace,
                   std::span<double* const> oResults)
               { kernels::GradientRows(oRows, oScale, oResults, oPlace.mbStreamed); });
}

}  // namespace kor::filters::stencil
