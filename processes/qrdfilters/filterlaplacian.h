#pragma once

#include <boost/optional.hpp>
#include <memory>

#include "basic/tessel/mask/mask.h"
#include "basic/tessel/raster/raster.h"

namespace kor::filters
{

/// Laplacian filter: what the surroundings of a pixel do not explain.
///
///     out = x - mean,   mean = (sum of the n valid samples of the window) / n;   out = x when n =
///     1
/// x is the centre sample, which is part of the mean. Channels are filtered one by one.
///
/// Input    eDT_64R. The window is 2 * margin + 1 pixels on each axis: the margins alone tell its
///          size.
/// Output   eDT_64R, same width, height and channels, not clipped. Margins are not written.
/// Masks    may be null. A bit cleared in the input mask takes the pixel out of every window. A bit
///          cleared in either mask makes the pixel 0.
/// Corners  margins of 0, or no other valid sample in the window: the input, and not 0.
/// Errors   none; in hardened builds kor::Exception for samples of another type, and for blocks
///          whose geometries do not match.
/// Numbers  sums in double, updated along columns and rows, so the cost does not grow with the
///          window; the last bits depend on where a block begins.
/// Threads  works on the calling thread; one object may serve many threads.
/// Source   A. Rosenfeld, A. C. Kak, "Digital Picture Processing", Academic Press, 1976, 6.4, with
///          the mean of a window in place of that of four neighbours.
class FilterLaplacian
{
public:
    explicit FilterLaplacian(bool bBGZero = true);

    /// Stored, and without effect: background is always 0. That is meant.
    void SetBGZero(bool bBGZero);
    /// Stored, and without effect: the margins tell the window. That is meant.
    void SetFilterSize(int nSizeX, int nSizeY);
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

    /// False: whoever has converted a block to doubles for this filter is to leave the result so.
    bool DoConvertBack() const { return false; }

private:
    bool mbBGZero;
    boost::optional<int> moFilterSizeX;
    boost::optional<int> moFilterSizeY;
};

}  // namespace kor::filters
