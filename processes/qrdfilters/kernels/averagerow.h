#pragma once

#include <cstddef>
#include <span>

namespace kor::filters::kernels
{

/// oMeans[i] = pSums[i] / pCounts[i]. The length is a multiple of kRowPadding.
void AverageRow(const double* pSums, const double* pCounts, std::span<double> oMeans);

}  // namespace kor::filters::kernels
