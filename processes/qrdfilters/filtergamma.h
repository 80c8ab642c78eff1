#pragma once

#include <boost/optional.hpp>

#include "basic/tessel/mask/mask.h"
#include "basic/tessel/raster/raster.h"

namespace kor::filters
{

/// What the samples of a radar image are.
enum GammaFormat
{
    eGF_Intensity = 0,
    eGF_Amplitude = 1
};

/// Gamma MAP speckle filter: the maximum a posteriori estimate of a scene whose reflectivity has a
/// Gamma distribution.
///
///     out = mean                                     where mean^2 >= L * var (homogeneous)
///     out = x                                        where L * var >= 2 * mean^2 (a point target)
///     out = (b * mean + sqrt(d)) / (2 * a)           elsewhere, with
///     a = (L + 1) * mean^2 / (L * var - mean^2),  b = a - L - 1,
///     d = 4 * a * L * mean * x + b^2 * mean^2
/// x is the centre sample, L the number of looks, mean and var (over n - 1) those of the n valid
/// samples of the window. The tests are made in this order; unless d > 0, the root is left out.
///
/// Input    eDT_64R, meant for intensity (power); channels are filtered one by one. The window is
///          the set size, halved by integer division (4 and 5 both give 5 pixels), or the margins
///          while either size is unset. The margins must hold the window.
/// Output   eDT_64R, same width, height and channels. Margins are not written.
/// Masks    may be null. A bit cleared in the input mask takes the pixel out of every window. A bit
///          cleared in either mask makes it background: 0, or the input when BGZero is false.
/// Corners  one valid sample: out = x. Flat window, zeros included: out = mean.
/// Errors   none; in hardened builds kor::Exception when the window is larger than the margins.
/// Threads  works on the calling thread; one object may serve many threads.
/// Source   A. Lopes, E. Nezry, R. Touzi, H. Laur, "Structure detection and statistical adaptive
///          speckle filtering in SAR images", Int. J. Remote Sensing 14(9), 1735-1758, 1993. Here
///          the upper bound of the variation is twice the speckle's variance, and the format of the
///          image is kept without a use.
class FilterGamma
{
public:
    /// The number of looks is 0 until it is set.
    FilterGamma() = default;
    FilterGamma(double dfNLook, GammaFormat eAmplit);

    /// Number of looks, dimensionless, 1 for a single-look image.
    void SetLook(double dfNLook);
    /// The format of the image; no result depends on it.
    void SetAmplit(GammaFormat eAmplit);
    /// Format and number of looks.
    void SetParameters(GammaFormat eAmplit, double dfNLook);
    /// Background is 0 (true, as at first) or a copy of the input (false).
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

private:
    double mdfNLook = 0.0;
    GammaFormat meAmplit = eGF_Intensity;
    bool mbBGZero = true;
    boost::optional<int> moFilterSizeX;
    boost::optional<int> moFilterSizeY;
};

}  // namespace kor::filters
