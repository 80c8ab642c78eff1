#pragma once

#include <boost/optional.hpp>
#include <memory>

#include "basic/tessel/mask/mask.h"
#include "basic/tessel/raster/raster.h"

namespace kor::filters
{

/// Kuan speckle filter: a weighted mean of each pixel and its window.
///
///     out = (1 - w) * mean + w * x,   w = (L - mean^2 / var) / (L + 1);   out = mean where w <= 0
/// x is the centre sample, L the number of looks, mean and var (over n - 1) those of the n valid
/// samples of the window. w never exceeds L / (L + 1) and is not clamped above.
///
/// Input    eDT_64R, meant for intensity (power); channels are filtered one by one. The window is
///          the set size, halved by integer division (4 and 5 both give 5 pixels), or the margins
///          while either size is unset. The margins must hold the window.
/// Output   eDT_64R, same width, height and channels. Margins are not written.
/// Masks    may be null. A bit cleared in the input mask takes the pixel out of every window. A bit
///          cleared in either mask makes it background: 0, or the input when BGZero is false.
/// Corners  one valid sample: out = x. Flat window: out = mean. All zeros: out is not a number.
/// Errors   none; in hardened builds kor::Exception when the window is larger than the margins.
/// Threads  works on the calling thread; one object may serve many threads.
/// Source   D. T. Kuan, A. A. Sawchuk, T. C. Strand, P. Chavel, "Adaptive noise smoothing filter
///          for images with signal-dependent noise", IEEE Trans. PAMI 7(2), 165-177, 1985.
class FilterKuan
{
public:
    explicit FilterKuan(bool bBGZero = false, int nLook = 1);

    /// Number of looks, dimensionless, 1 for a single-look image. -1 divides by zero.
    void SetLook(double dfNLook);
    /// Background is 0 (true) or a copy of the input (false).
    void SetBGZero(bool bBGZero);
    /// Window width and height in pixels; a value below 2 means one pixel.
    void SetFilterSize(int nSizeX, int nSizeY);
    /// The same; while either is empty the margins are the window.
    void SetFilterSize(boost::optional<int> nSizeX, boost::optional<int> nSizeY);

    void Process(tessel::Raster* poRasterIn, tessel::Mask* poMaskIn, tessel::Raster* poRasterOut,
                 tessel::Mask* poMaskOut) const;
    /// The same as Process.
    void ProcessBlock(tessel::Raster* poRasterIn, tessel::Mask* poMaskIn,
                      tessel::Raster* poRasterOut, tessel::Mask* poMaskOut) const;

    /// Filters into a new raster of the input's type, size, margins and offsets; its margins hold
    /// nothing.
    std::shared_ptr<tessel::Raster> operator()(std::shared_ptr<tessel::Raster> poRasterIn,
                                               std::shared_ptr<tessel::Mask> poMaskIn,
                                               std::shared_ptr<tessel::Mask> poMaskOut) const;

private:
    double mdfNLook;
    bool mbBGZero;
    boost::optional<int> moFilterSizeX;
    boost::optional<int> moFilterSizeY;
};

}  // namespace kor::filters
