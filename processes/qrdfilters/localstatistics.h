#pragma once

#include <array>

#include "basic/tessel/mask/mask.h"
#include "basic/tessel/raster/raster.h"
#include "processes/qrdfilters/slidingwindow.h"
#include "processes/qrdfilters/window.h"

namespace kor::filters
{

/// How BuildLocalStatistics takes its windows.
struct LocalStatisticsConfig
{
    WindowSize moFilterSizeX;  ///< pixels, halved by integer division; used if both are set
    WindowSize moFilterSizeY;
    bool mbBGZero = false;  ///< of the filter; background pixels have no statistics either way
};

/// The terms whose window sums the local statistics are made of.
inline constexpr std::array<WindowTerm, 2> kLocalStatisticsTerms = {kSumTerm, kSumOfSquaresTerm};

/// Count, mean and variance of the valid pixels in the window around each pixel.
///
///     mean = (sum of x) / n;   variance = ((sum of x^2) - mean * n * mean) / (n - 1)
///
/// Input    eDT_64R. The window is that of both set sizes (4 and 5 both give 5 pixels), or of the
///          margins while either size is unset. The margins must hold the window.
/// Result   eDT_64R, width and height of the input, no margins. For channel c of the input, its
///          channels 3c, 3c + 1 and 3c + 2 hold n, mean and variance. The caller deletes it.
/// Masks    may be null. A bit cleared in the input mask takes the pixel out of every window.
///          Pixels with a bit cleared in either mask have no statistics: three zeros.
/// Corners  n = 1: the variance is not finite, which is meant; look at n first.
/// Errors   kor::DataException when the result would take 4 GiB or more; in hardened builds
///          kor::Exception when the window is larger than the margins.
/// Numbers  running sums, see slidingwindow.h: a flat window may have a variance below 0.
tessel::Raster* BuildLocalStatistics(const LocalStatisticsConfig& oConfig,
                                     const tessel::Raster* poRasterIn, const tessel::Mask* poMaskIn,
                                     const tessel::Mask* poMaskOut);

}  // namespace kor::filters
