#pragma once

#include <span>

namespace kor::filters::kernels
{

/// oOut[i] = pCentres[i] - pSums[i] / pCounts[i], or pCentres[i] where pCounts[i] is exactly 1.0.
/// The length is a multiple of kRowPadding.
void LaplacianRow(const double* pCentres, const double* pSums, const double* pCounts,
                  std::span<double> oOut);

}  // namespace kor::filters::kernels
