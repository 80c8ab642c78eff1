#pragma once

#include <cstddef>
#include <span>

namespace kor::filters::kernels
{

/// The farthest that a detector of the Touzi filter looks whatever the margin: 11 pixels.
inline constexpr int kTouziReach = 5;

/// What the decisions of the Touzi filter compare with.
struct TouziThresholds
{
    double mdfCu;        ///< a window with this variation coefficient or less is flat
    double mdfCmax;      ///< one with this or more has a strong scatterer
    double mdfCuLine;    ///< one with this or less has no line
    double mdfContour;   ///< ratio of two means up to which there is a line or an edge
    double mdfGradiant;  ///< change of the variation coefficient below which a window grows
    int mnStartSize;     ///< first window of flat areas, pixels
    int mnMargin;        ///< windows grow up to this half size
};

/// The neighbourhood of a row of one channel. Samples and their squares are rounded to float, in
/// which all sums run.
struct TouziRows
{
    /// Rows -mnReach to mnReach, each at its pixel 0; mnReach pixels can be read in front of it,
    /// and as many behind the results.
    std::span<const float* const> moSamples;
    std::span<const float* const> moSquares;
    int mnReach;  ///< the margin, and kTouziReach at the least
    const double* mpCentres;
};

/// The Touzi filter on one row: where oWanted[i] is 0 the result is 0. Where a pixel turns out to
/// be a strong scatterer, oWanted[i] becomes 0. Both lengths are the same multiple of kRowPadding.
void FilterTouziRow(const TouziRows& oRows, const TouziThresholds& oThresholds,
                    std::span<unsigned char> oWanted, std::span<double> oResults);

}  // namespace kor::filters::kernels
