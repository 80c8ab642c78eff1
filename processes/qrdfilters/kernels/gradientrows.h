#pragma once

#include <span>

#include "processes/qrdfilters/kernels/stencil.h"

namespace kor::filters::kernels
{

struct GradientScale
{
    double mdfCentreWeight;  ///< of the neighbours straight above, below and beside
    double mdfFactor;        ///< of the gradient's magnitude
};

/// Each sample of each output row: sqrt(Gy * Gy + Gx * Gx) * factor over its window of 3 x 3
/// pixels, with w the weight of the straight neighbours, all by compass, y growing downwards:
///
///     Gx = NE - NW - w * W + w * E - SW + SE,   Gy = w * N + NW + NE - SW - w * S - SE
///
/// Each is added from the left. A neighbour masked in oRows.moValid takes the centre's value.
/// bStreamed: the results are written past the caches, as far as no sample is masked.
void GradientRows(const StencilRows& oRows, const GradientScale& oScale,
                  std::span<double* const> oOut, bool bStreamed);

}  // namespace kor::filters::kernels
