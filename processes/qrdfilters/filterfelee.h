#pragma once

#include <boost/optional.hpp>
#include <memory>

#include "basic/tessel/mask/mask.h"
#include "basic/tessel/raster/raster.h"

namespace kor::filters
{

/// Enhanced Lee speckle filter: each pixel blended with its window mean, by a weight that falls as
/// the local variation coefficient leaves the level of pure speckle.
///
///     out = mean                        where Ci <= Cu (homogeneous)
///     out = x                           where Ci >= Cmax (a point target)
///     out = (1 - e) * x + e * mean      elsewhere, e = exp(-(Ci - Cu) * K / (Cmax - Ci))
///     Ci = sqrt(var) / mean,   Cu = 1 / sqrt(L),   Cmax = sqrt(1 + 2 / L)
/// x is the centre sample, L the number of looks, K the damping factor, mean and var (over n - 1)
/// those of the n valid samples of the window.
///
/// Input    eDT_64R, meant for intensity (power); channels are filtered one by one. The window is
///          the set size, halved by integer division (4 and 5 both give 5 pixels), or the margins
///          while either size is unset. The margins must hold the window.
/// Output   eDT_64R, same width, height and channels. Margins are not written.
/// Masks    may be null. A bit cleared in the input mask takes the pixel out of every window. A bit
///          cleared in either mask makes it background: 0, or the input when BGZero is false.
/// Corners  one valid sample: out = x. A mean of 0: out = x where the samples differ, else not a
///          number. K = 0: out = mean wherever out is not x.
/// Errors   the setters throw kor::Exception on negative values; in hardened builds kor::Exception
///          when the window is larger than the margins.
/// Numbers  e is within 1 ulp of the C library's exp, and the same on every processor.
/// Threads  works on the calling thread; one object may serve many threads.
/// Source   A. Lopes, R. Touzi, E. Nezry, "Adaptive speckle filters and scene heterogeneity", IEEE
///          Trans. Geoscience and Remote Sensing 28(6), 992-1000, 1990.
class FilterFelee
{
public:
    /// Looks and damping must be set before use: they are 0 until then. Background is a copy of the
    /// input.
    FilterFelee() = default;

    /// Damping factor, dimensionless, 0 or more; the larger, the nearer to the pixel itself. A
    /// negative value throws kor::Exception and changes nothing.
    void SetDamp(double dfDamp);
    /// Number of looks, dimensionless, 1 for a single-look image. A negative value throws
    /// kor::Exception and changes nothing.
    void SetNLook(double dfNLook);
    /// Background is 0 (true) or a copy of the input (false).
    void SetBGZero(bool bBGZero);
    /// Window width and height in pixels; a value below 2 means one pixel, and while either is
    /// empty the margins are the window.
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
    double mdfCu = 0.0;
    double mdfCmax = 0.0;
    double mdfDamp = 0.0;
    bool mbBGZero = false;
    boost::optional<int> moFilterSizeX;
    boost::optional<int> moFilterSizeY;
};

}  // namespace kor::filters
