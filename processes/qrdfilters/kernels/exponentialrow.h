#pragma once

#include <cstddef>
#include <span>

namespace kor::filters::kernels
{

/// Row k of the weights, nPitch samples behind the one before: weight i = exp(-(A * d)) for
/// coefficient i and distance k. The length is a multiple of kRowPadding.
///
/// The exponential is at most 1 ulp off the function's value over its whole range, subnormal
/// results too, and has the same bits on every target: exp(0) is 1, what is too large or too small
/// for a double becomes infinite or 0, not a number stays so.
void RaiseWeights(std::span<const double> oCoefficients, std::span<const double> oDistances,
                  double* pWeights, std::size_t nPitch);

}  // namespace kor::filters::kernels
