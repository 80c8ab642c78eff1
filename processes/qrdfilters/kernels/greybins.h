#pragma once

#include <cstddef>
#include <limits>
#include <span>

namespace kor::filters::kernels
{

/// How sample values are cut into bins.
struct GreyScale
{
    double mdfMin = 0.0;
    double mdfRange = 0.0;
    bool mbByValue = false;  ///< the value itself is the bin
    double mdfEnd = 0.0;     ///< number of bins
    /// Values outside of these limits have no bin, nor has not a number.
    double mdfLowest = -std::numeric_limits<double>::infinity();
    double mdfHighest = std::numeric_limits<double>::infinity();
};

/// Position of the bin of x, or -1 where it has none.
inline int FindBin(const GreyScale& oScale, double x)
{
    const double dfBin = oScale.mbByValue ? x : (x - oScale.mdfMin) * 65535.0 / oScale.mdfRange;
    const bool bHasBin =
        x >= oScale.mdfLowest && x <= oScale.mdfHighest && dfBin > -1.0 && dfBin < oScale.mdfEnd;
    return static_cast<int>(bHasBin ? dfBin : -1.0);
}

/// The same for each of a row of samples.
void FindBins(const GreyScale& oScale, std::span<const double> vdfSamples, int* pnBins);

}  // namespace kor::filters::kernels
