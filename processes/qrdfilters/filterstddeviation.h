#pragma once

#include <boost/optional.hpp>
#include <memory>

#include "basic/tessel/mask/mask.h"
#include "basic/tessel/raster/raster.h"

namespace kor::filters
{

/// Standard deviation filter: the spread of the samples in a rectangular window around each pixel.
///
///     out = sqrt((Q - m * n * m) / (n - 1)),   m = S / n
/// n is the number of valid samples of the window, S their sum, Q the sum of their squares, channel
/// by channel: the sample deviation, in the units of the samples.
///
/// Input    eDT_64R, any number of channels, which are filtered one by one.
/// Window   2 * margin + 1 pixels on each axis, always: the margins of the input alone tell its
///          size, and their samples count like all others.
/// Output   eDT_64R, same width, height and channels. Margins are not written.
/// Masks    may be null. A bit cleared in the input mask takes the pixel out of every window. A bit
///          cleared in either mask makes it background, which is 0, always.
/// Corners  one valid sample in the window: that sample, not 0 (so margins of 0 give the input). A
///          flat window: 0 up to rounding, and not a number where rounding leaves Q - m * n * m
///          below 0.
/// Errors   none; in hardened builds kor::Exception for blocks of another type or of sizes that do
///          not match.
/// Numbers  sums in double, updated along columns and rows, so the cost does not grow with the
///          window; the last bits depend on where a block begins.
/// Threads  works on the calling thread; one object may serve many threads.
/// Source   the one-pass form of the sample variance; T. F. Chan, G. H. Golub, R. J. LeVeque,
///          "Algorithms for computing the sample variance", The American Statistician 37(3),
///          242-247, 1983, tell what it loses when the mean is large beside the deviation.
class FilterStdDeviation
{
public:
    explicit FilterStdDeviation(bool bBGZero = false);

    /// Kept without effect: background is always 0.
    void SetBGZero(bool bBGZero);
    /// The same as SetBGZero.
    void SetParameters(bool bBGZero);
    /// Kept without effect: the margins always tell the window.
    void SetFilterSize(boost::optional<int> nSizeX, boost::optional<int> nSizeY);

    void Process(tessel::Raster* poRasterIn, tessel::Mask* poMaskIn, tessel::Raster* poRasterOut,
                 tessel::Mask* poMaskOut) const;
    /// The same as Process.
    void ProcessBlock(tessel::Raster* poRasterIn, tessel::Mask* poMaskIn,
                      tessel::Raster* poRasterOut, tessel::Mask* poMaskOut) const;

    /// Filters into a new raster of the input's type, size and offsets without margins.
    std::shared_ptr<tessel::Raster> operator()(std::shared_ptr<tessel::Raster> poRasterIn,
                                               std::shared_ptr<tessel::Mask> poMaskIn,
                                               std::shared_ptr<tessel::Mask> poMaskOut) const;

private:
    bool mbBGZero;
    boost::optional<int> moFilterSizeX;
    boost::optional<int> moFilterSizeY;
};

}  // namespace kor::filters
