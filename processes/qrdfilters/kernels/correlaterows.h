#pragma once

#include <span>

#include "processes/qrdfilters/kernels/stencil.h"

namespace kor::filters::kernels
{

/// Each sample of each output row: the sum over its window of sample * weight, from +0.0 on, row by
/// row from the window's upper left corner. oKernel holds the weights in that order, one for each
/// pixel of the window; oOut has a pointer for each output row.
void CorrelateRows(const StencilRows& oRows, std::span<const double> oKernel,
                   std::span<double* const> oOut);

}  // namespace kor::filters::kernels
