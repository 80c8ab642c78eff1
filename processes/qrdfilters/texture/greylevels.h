#pragma once

#include <cstddef>
#include <cstdint>
#include <span>
#include <vector>

#include "processes/qrdfilters/kernels/greybins.h"

namespace kor::filters
{

/// Bins between the smallest and the greatest sample value.
inline constexpr std::size_t kGreyBins = 65536;

/// How the values of a range fall into nBins bins. mdfLowest and mdfHighest are left open.
kernels::GreyScale ScaleOf(double dfMin, double dfMax, std::size_t nBins);

/// Turns sample values into grey levels by a table, of which it keeps a copy.
class GreyLevels
{
public:
    GreyLevels(double dfMin, double dfMax, std::span<const int> oHist2Glev);

    /// pfLevels[i] = level of vdfSamples[i], 0 outside the range or the table.
    void LookUpInRange(std::span<const double> vdfSamples, float* pfLevels) const;
    /// The same without a look at the range.
    void LookUp(std::span<const double> vdfSamples, float* pfLevels) const;

    /// The greatest difference of two levels, that of bins that are not there included.
    float GetSpan() const { return mfSpan; }

private:
    kernels::GreyScale moRange;
    kernels::GreyScale moOpen;
    std::vector<float> mvfLevels;  ///< behind that of what has no bin
    float mfSpan = 0.0F;
};

/// The table that gives each bin of a histogram its level, see FilterHomogeneity. nGrey is above 0.
std::vector<int> MakeGreyTable(std::span<const int> oHistogram, int nCount, int nGrey);

}  // namespace kor::filters
