#pragma once

#include <span>

#include "processes/qrdfilters/kernels/stencil.h"

namespace kor::filters::kernels
{

/// Each sample of each output row: d / dfDivisor * dfFactor, where d is the sum over its window of
/// |sample - centre|, from +0.0 on, row by row from the window's upper left corner. Samples masked
/// in oRows.moValid are left out. Where d is below 1e-9 it gives 0, and a factor of exactly 1.0
/// multiplies nothing.
void MeanDifferenceRows(const StencilRows& oRows, double dfDivisor, double dfFactor,
                        std::span<double* const> oOut);

}  // namespace kor::filters::kernels
