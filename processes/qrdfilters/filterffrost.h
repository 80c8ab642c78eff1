#pragma once

#include <boost/optional.hpp>
#include <memory>
#include <vector>

#include "basic/tessel/mask/mask.h"
#include "basic/tessel/raster/raster.h"
#include "processes/qrdfilters/window.h"

namespace kor::filters
{

/// Frost speckle filter: a mean of the window in which near neighbours weigh most, the more so the
/// more the window varies.
///
///     out = (sum of w * x) / (sum of w);   w = exp(-(A * d));   A = variance / mean^2 * damp
/// x runs over the valid samples of the window in row order, d is a distance in pixels from the
/// window's centre; mean and variance (over n - 1) are those of the n valid samples. A flat area
/// gets its mean, a textured one is hardly touched.
///
/// Input    eDT_64R, meant for intensity (power) or amplitude; channels are filtered one by one.
///          The window is the set size of each axis, halved by integer division (4 and 5 both give
///          5 pixels; a negative size counts as 1), or else the margin. Mean and variance take the
///          set sizes only if both are set, else both margins. The margins must hold the window.
/// Output   eDT_64R, same width, height and channels. Margins are not written.
/// Masks    may be null. A bit cleared in the input mask takes the pixel out of every window. A bit
///          cleared in either mask makes it background: 0, or the input when BGZero is false.
/// Distance of the valid pixel k of a window, counted from 0, is entry k of a table of the whole
///          window in row order: behind a masked pixel all distances are those of the positions
///          before. The first block fixes the table, InitProcessing does so earlier; sizes set
///          later change the window and not the table, and entries behind its end are 0.
/// Corners  n = 1: out = x. damp = 0: the plain mean. A window of zeros: out is not a number.
/// Errors   kor::Exception "Damping factor must be a positive number" (SetDamp);
///          kor::ParameterException, parameter "oRasterIn", "The Margin of the input raster is too
///          small." when the window is a single pixel, before anything is written. Margins that do
///          not hold the window: kor::Exception in hardened builds, else the caller's fault.
/// Threads  works on the calling thread. The first block writes the table: let threads that share
///          an object call InitProcessing first (both sizes set), or give each a copy.
/// Source   V. S. Frost, J. A. Stiles, K. S. Shanmugan, J. C. Holtzman, "A model for radar images
///          and its application to adaptive digital filtering of multiplicative noise", IEEE Trans.
///          PAMI 4(2), 157-166, 1982. The distances beside masked pixels are this filter's own.
class FilterFfrost
{
public:
    /// damp: dimensionless, from 0 up, 0 at first; 0 is the plain mean, 1 a usual value. Throws
    /// kor::Exception for a value below 0, which then is not taken.
    void SetDamp(double dfDamp);
    /// Background is 0 (true) or, as at first, a copy of the input (false).
    void SetBGZero(bool bBGZero);
    /// Window width and height in pixels; an empty size leaves that axis to the margins.
    void SetFilterSize(boost::optional<int> nSizeX, boost::optional<int> nSizeY);
    /// True: weights from the library's own exponential, about three times as fast and the same on
    /// every machine, each at most 1 ulp (2.2e-16 of the weight) off the function's value. False,
    /// as at first: from std::exp.
    void SetFastExponential(bool bFast);

    /// Appends the distances of a window of the set sizes to the table; does nothing while either
    /// size is empty.
    void InitProcessing() const;
    void Process(tessel::Raster* poRasterIn, tessel::Mask* poMaskIn, tessel::Raster* poRasterOut,
                 tessel::Mask* poMaskOut) const;
    /// The same as Process.
    void ProcessBlock(tessel::Raster* poRasterIn, tessel::Mask* poMaskIn,
                      tessel::Raster* poRasterOut, tessel::Mask* poMaskOut) const;

    /// Filters into a new raster with the type, size, offsets and margins of the input; the margins
    /// are not written.
    std::shared_ptr<tessel::Raster> operator()(std::shared_ptr<tessel::Raster> poRasterIn,
                                               std::shared_ptr<tessel::Mask> poMaskIn,
                                               std::shared_ptr<tessel::Mask> poMaskOut) const;

private:
    std::vector<double> DistancesOf(const Window& oWindow) const;

    double mdfDamp = 0.0;
    bool mbBGZero = false;
    boost::optional<int> moFilterSizeX;
    boost::optional<int> moFilterSizeY;
    mutable std::vector<double> moDistances;
    bool mbFastExponential = false;
};

}  // namespace kor::filters
