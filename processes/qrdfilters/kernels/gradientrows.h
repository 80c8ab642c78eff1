#pragma once

#include <span>

#include "processes/qrdfilters/kernels/stencil.h"

namespace kor::filters::kernels
{

/// Each sample of each output row: sqrt(Gy * Gy + Gx * Gx) * dfFactor over its window of 3 x 3
/// pixels, with w = dfCentreWeight and the neighbours by compass, y growing downwards:
///
///     Gx = NE - NW - w * W + w * E - SW + SE,   Gy = w * N + NW + NE - SW - w * S - SE
/// Each is added from the left. A neighbour masked in oRows.moValid takes the centre's value.
void GradientRows(const StencilRows& oRows, double dfCentreWeight, double dfFactor,
                  std::span<double* const> oOut);

}  // namespace kor::filters::kernels
