#pragma once

#include <boost/optional.hpp>
#include <memory>

#include "basic/tessel/mask/mask.h"
#include "basic/tessel/raster/raster.h"

namespace kor::filters
{

/// Average filter: the mean of the valid pixels in a rectangular window around each pixel.
///
///     out = (sum of the n valid samples of the window) / n, channel by channel
///
/// Input    one channel of eDT_32R or eDT_64R; several channels of eDT_64R. A single channel of
///          another type is left alone: Process returns and the output keeps its contents.
/// Window   the set size, halved by integer division (4 and 5 both give 5 pixels), or the margins.
///          One channel takes the two axes one by one; several channels take the set sizes only if
///          both are set. Nothing is clipped: margin pixels count like any other.
/// Output   type, size and channels of the input. Margins are not written.
/// Masks    may be null. A bit cleared in the input mask takes the pixel out of every window. A bit
///          cleared in either mask makes it background: 0, or the input when BGZero is false.
/// Errors   one channel: kor::Exception when the window is larger than the margins of the input or
///          of its mask, before anything is written. Several channels: the margins are not tested,
///          but in hardened builds, which throw kor::Exception.
/// Numbers  sums in double, updated along columns and rows, so the cost does not grow with the
///          window; the last bits depend on where a block begins.
/// Threads  works on the calling thread; one object may serve many threads.
/// Source   M. J. McDonnell, "Box-filtering techniques", Computer Graphics and Image Processing
///          17(1), 65-70, 1981.
class FilterAverage
{
public:
    explicit FilterAverage(bool bBGZero = true);
    virtual ~FilterAverage() = default;
    FilterAverage(const FilterAverage&) = default;
    FilterAverage& operator=(const FilterAverage&) = default;

    /// Background is 0 (true) or a copy of the input (false).
    void SetBGZero(bool bBGZero);
    /// The same as SetBGZero.
    void SetParameters(bool bBGZero);
    /// Window width and height in pixels; a value below 2 means one pixel.
    void SetFilterSize(int nSizeX, int nSizeY);
    /// The same; an empty size leaves that axis to the margins.
    void SetFilterSize(boost::optional<int> nSizeX, boost::optional<int> nSizeY);

    void Process(tessel::Raster* poRasterIn, tessel::Mask* poMaskIn, tessel::Raster* poRasterOut,
                 tessel::Mask* poMaskOut) const;
    /// The same as Process.
    void ProcessBlock(tessel::Raster* poRasterIn, tessel::Mask* poMaskIn,
                      tessel::Raster* poRasterOut, tessel::Mask* poMaskOut) const;
    /// The path for one channel.
    void ProcessSingleChanBlock(tessel::Raster* poRasterIn, tessel::Mask* poMaskIn,
                                tessel::Raster* poRasterOut, tessel::Mask* poMaskOut) const;
    /// The path for any number of channels, all samples taken as eDT_64R without a test.
    void ProcessMultiChanBlock(tessel::Raster* poRasterIn, tessel::Mask* poMaskIn,
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
