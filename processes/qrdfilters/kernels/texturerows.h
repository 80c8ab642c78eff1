#pragma once

#include <span>

/// Texture measures of radar images from the sums of windows, and what is summed for them.
/// Products and quotients are formed from the left.
namespace kor::filters::kernels
{

/// Samples are replaced by their square roots.
void SquareRootRow(std::span<double> oSamples);

/// Samples are replaced by their natural logarithms, at most 1 ulp off the C library's.
void LogRow(std::span<double> oSamples);

/// The same, with -100 for the logarithm of 0.
void BoundedLogRow(std::span<double> oSamples);

/// oOut[i] = n * pPowers[i] / (pRoots[i] * pRoots[i]) - 1, where pPowers are sums of the squares of
/// what pRoots sums. Lengths here and below are multiples of kRowPadding; pCounts holds the n.
void VariationRow(const double* pPowers, const double* pRoots, const double* pCounts,
                  std::span<double> oOut);

/// oOut[i] = pSquares[i] / n - (pLogs[i] / n)^2.
void LogVarianceRow(const double* pSquares, const double* pLogs, const double* pCounts,
                    std::span<double> oOut);

/// oOut[i] = pLogs[i] / n - ln(pSums[i] / n).
void LogMeanRatioRow(const double* pSums, const double* pLogs, const double* pCounts,
                     std::span<double> oOut);

}  // namespace kor::filters::kernels
