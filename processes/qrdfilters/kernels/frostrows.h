#pragma once

#include <cstddef>
#include <cstdint>
#include <span>

/// Row kernels of the Frost filters: coefficients from window sums, and means over windows weighted
/// by distance. All lengths are multiples of kRowPadding.
namespace kor::filters::kernels
{

/// Window sums of a stretch of samples, and the samples in the middle of the windows.
struct WindowMoments
{
    const double* mpSums;
    const double* mpSumsOfSquares;
    const double* mpCounts;
    const double* mpCentres;
};

/// What becomes of each sample of a stretch: the weighted mean of its window with this coefficient
/// where pWeighted is not 0, else the value of pFixed.
struct WeightingRow
{
    double* mpCoefficients;
    double* mpFixed;
    double* mpWeighted;  ///< 1 or 0
};

/// Coefficient variance / (mean * mean) * dfDamp; the centre where the count is 1.
void FindFrostCoefficients(const WindowMoments& oMoments, double dfDamp, std::size_t nSamples,
                           const WeightingRow& oRow);

struct EnhancedFrostLimits
{
    double mdfCu;
    double mdfCmax;
    double mdfDamp;
};

/// With Ci = sqrt(variance) / mean: the mean where dfCu > Ci, else the centre where Ci > dfCmax or
/// the count is 1, else the coefficient (Ci - dfCu) * dfDamp / (dfCmax - Ci).
void FindEnhancedFrostCoefficients(const WindowMoments& oMoments,
                                   const EnhancedFrostLimits& oLimits, std::size_t nSamples,
                                   const WeightingRow& oRow);

/// Samples that are weighted together: the weights of a 7 x 7 window stay in the first-level cache.
inline constexpr std::size_t kWeightedSamples = 64;

/// Windows around a few samples side by side in a row, and their weights.
struct WeightedWindows
{
    std::span<const double* const> moRows;  ///< each from the left end of the first sample's window
    /// All bits set for samples that count, no bit for the others, which are +0.0; empty where all
    /// count.
    std::span<const std::uint64_t* const> moValid;
    std::size_t mnColumns;  ///< of a window
    std::size_t mnStep;     ///< samples from one column to the next
    /// Where the weights of a pixel of the window lie in mpWeights, pixels in row order.
    std::span<const std::uint32_t> moWeightOf;
    const double* mpWeights;  ///< of the first sample; those of the next ones follow
};

/// oOut[i] = (0 + w * x + ...) / (0 + w + ...) over the pixels of window i in row order, or
/// pFixed[i] where pWeighted[i] is 0. At most kWeightedSamples.
void FindWeightedMeans(const WeightedWindows& oWindows, const double* pFixed,
                       const double* pWeighted, std::span<double> oOut);

}  // namespace kor::filters::kernels
