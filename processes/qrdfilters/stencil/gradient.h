#pragma once

#include "basic/tessel/mask/mask.h"
#include "basic/tessel/raster/raster.h"
#include "processes/qrdfilters/kernels/gradientrows.h"

namespace kor::filters::stencil
{

/// The magnitude of the gradient over 3 x 3 pixels, as kernels::GradientRows has it, of a block of
/// doubles with margins of one pixel or more. The masks may be null.
void FilterGradient(const tessel::Raster& oIn, const tessel::Mask* poMaskIn,
                    const tessel::Raster& oOut, const tessel::Mask* poMaskOut,
                    const kernels::GradientScale& oScale, bool bBGZero);

}  // namespace kor::filters::stencil
