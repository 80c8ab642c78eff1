#pragma once

#include <boost/optional.hpp>

#include "basic/tessel/mask/mask.h"
#include "basic/tessel/raster/raster.h"

namespace kor::filters
{

/// Noise filter: smooths by the mean of a rectangular window, and marks the pixels that stand out
/// from it by more than the square root of 3 standard deviations.
///
///     out = fail value where n >= 2 and d * d > 3 * (Q - m * n * m) / (n - 1),   else m
///     m = S / n,   d = s - m
/// s is the centre sample, n the number of valid samples of the window, itself included, S their
/// sum and Q the sum of their squares, channel by channel.
///
/// Input    eDT_64R, any number of channels, which are filtered one by one.
/// Window   the set sizes, halved by integer division (4 and 5 both give 5 pixels), or the margins
///          of the input while either size is unset. The margins must hold the window.
/// Output   eDT_64R, same width, height and channels. Margins are not written.
/// Masks    may be null. A bit cleared in the input mask takes the pixel out of every window. A bit
///          cleared in either mask makes it background: 0, or the input when BGZero is false.
/// Corners  one valid sample: out = s. A square of exactly three variances is no noise; neither is
///          anything beside a sum that is not a number.
/// Errors   none; in hardened builds kor::Exception when the window is larger than the margins, and
///          for blocks of another type or of sizes that do not match.
/// Numbers  sums in double, updated along columns and rows, so the cost does not grow with the
///          window; the last bits depend on where a block begins.
/// Threads  works on the calling thread; one object may serve many threads.
/// Source   F. E. Grubbs, "Procedures for detecting outlying observations in samples",
///          Technometrics 11(1), 1-21, 1969: his test, with one bound for all sample sizes.
class FilterNoise
{
public:
    FilterNoise() = default;
    virtual ~FilterNoise() = default;
    FilterNoise(const FilterNoise&) = default;
    FilterNoise& operator=(const FilterNoise&) = default;

    /// What is written for a pixel found to be noise, in the units of the samples; 0 at first.
    void SetFailValue(double dfFailValue);
    /// Background is 0 (true) or, as at first, a copy of the input (false).
    void SetBGZero(bool bBGZero);
    /// Window width and height in pixels; a value below 2 means one pixel.
    void SetFilterSize(int nSizeX, int nSizeY);
    /// The same; while either is empty, the margins tell both.
    void SetFilterSize(boost::optional<int> nSizeX, boost::optional<int> nSizeY);

    void Process(tessel::Raster* poRasterIn, tessel::Mask* poMaskIn, tessel::Raster* poRasterOut,
                 tessel::Mask* poMaskOut) const;
    /// The same as Process.
    void ProcessBlock(tessel::Raster* poRasterIn, tessel::Mask* poMaskIn,
                      tessel::Raster* poRasterOut, tessel::Mask* poMaskOut) const;

private:
    double mdfFailValue = 0.0;
    bool mbBGZero = false;
    boost::optional<int> moFilterSizeX;
    boost::optional<int> moFilterSizeY;
};

}  // namespace kor::filters
