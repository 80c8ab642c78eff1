#pragma once

#include <cstddef>
#include <cstdint>
#include <span>
#include <vector>

namespace kor::filters
{

/// Bins between the smallest and the greatest sample value.
inline constexpr std::size_t kGreyBins = 65536;

/// The bins that sample values fall into.
class GreyBins
{
public:
    GreyBins(double dfMin, double dfMax);

    /// Position of the bin of x in a table of nBins, or -1 where it lies outside.
    int Find(double x, std::size_t nBins) const
    {
        const double dfBin = mbByValue ? x : (x - mdfMin) * 65535.0 / mdfRange;
        return static_cast<int>(dfBin > -1.0 && dfBin < static_cast<double>(nBins) ? dfBin : -1.0);
    }

private:
    double mdfMin;
    double mdfRange;
    bool mbByValue;  ///< too narrow a range to divide by: the value itself is the bin
};

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
    double mdfMin;
    double mdfMax;
    GreyBins moBins;
    std::vector<float> mvfLevels;
    float mfSpan = 0.0F;
};

/// The table that gives each bin of a histogram its level, see FilterHomogeneity. nGrey is above 0.
std::vector<int> MakeGreyTable(std::span<const int> oHistogram, int nCount, int nGrey);

}  // namespace kor::filters
