#pragma once

#include <array>
#include <boost/optional.hpp>

#include "basic/tessel/mask/mask.h"
#include "basic/tessel/raster/raster.h"

namespace kor::filters
{

/// Gaussian filter: smooths with a separable, normalised Gaussian kernel, or with two variances
/// gives the absolute difference of two such smoothings, a band-pass.
///
///     K[k] = exp(-(k - m)^2 / (2 * variance)), k = 0 .. 2m, divided by the sum of all
///     A(x) = sum over the window's rows of s(x, y) * K[y]
///     out = sum over its columns of A(x) * K[x]
/// m is the greater variance, cut to an integer. Mirrored samples are added before they are
/// multiplied, from the ends of the window to its middle, in double; the weight in the middle is
/// set so that a kernel sums to exactly 1.
///
/// Input    eDT_64R; channels are filtered one by one. The window is 2m + 1 pixels wide and high:
///          it follows from the variance itself, 4.7 gives 9 pixels and 32.0 gives 65. The margins
///          must hold it, and may be deeper.
/// Output   eDT_64R, same width, height and channels. Margins are not written.
/// Masks    may be null. A neighbour whose bit is cleared in the input mask counts as a copy of the
///          centre; weights are not renormalised. A bit cleared in either mask makes the pixel
///          background: 0 when BGZero is true. Else all its channels get sample number x of the
///          input's row, channels counted like pixels, where x is the pixel's column: in a
///          single-channel block that is the pixel's own value. That is meant.
/// Corners  two equal variances give 0 everywhere. Of two kernels both have the length of the
///          longer. A NaN or an infinity in the window gives NaN or infinity.
/// Errors   kor::ParameterException of the setters, see SetSigma; for "mnFilterSize", "The filter
///          size was not set", without a successful SetSigma; for "oRasterIn", "The Margin of the
///          input raster is too small"; both before anything is written. In hardened builds
///          kor::Exception for samples of another type and for blocks whose geometries do not
///          match.
/// Threads  works on the calling thread; one object may serve many threads.
/// Source   D. Marr, E. Hildreth, "Theory of edge detection", Proc. Royal Society of London B
///          207(1167), 187-217, 1980, for the difference of two Gaussians.
class FilterGauss
{
public:
    FilterGauss() = default;
    /// As SetSigma.
    FilterGauss(double dfSigmasq1, double dfSigmasq2);
    virtual ~FilterGauss() = default;
    FilterGauss(const FilterGauss&) = default;
    FilterGauss& operator=(const FilterGauss&) = default;

    /// The variances, in pixels squared: from 1.0 to 32.0, or 0 for a second one that is not
    /// wanted. Throws kor::ParameterException, of two faults the first:
    /// "Neither mdfSigmasq1 or mdfSigmasq2 is defined", "mdfSigmasq1 must be in the range of 1.0 to
    /// 32.0", "mdfSigmasq2 must be in the range of 1.0 to 32.0", "mdfSigmasq2 is defined but
    /// mdfSigmasq1 is not defined". The filter then keeps the kernels of before.
    void SetSigma(double dfSigmasq1, double dfSigmasq2);
    /// Stored, and without effect: the variances tell the window. That is meant.
    void SetFilterSize(int nSizeX, int nSizeY);
    void SetFilterSize(boost::optional<int> nSizeX, boost::optional<int> nSizeY);
    /// Background is 0 (true) or a sample of the input, see above (false, as at first).
    void SetBGZero(bool bBGZero);

    void Process(tessel::Raster* poRasterIn, tessel::Mask* poMaskIn, tessel::Raster* poRasterOut,
                 tessel::Mask* poMaskOut) const;
    /// The same as Process.
    void ProcessBlock(tessel::Raster* poRasterIn, tessel::Mask* poMaskIn,
                      tessel::Raster* poRasterOut, tessel::Mask* poMaskOut) const;

protected:
    /// Makes the kernels of the variances.
    void ComputeKernel();

private:
    static constexpr int kLongestKernel = 65;
    using Kernel = std::array<double, kLongestKernel>;

    void BuildKernel(double dfSigmasq, Kernel& adfKernel) const;

    double mdfSigmasq1 = 0.0;
    double mdfSigmasq2 = 0.0;
    int mnFilterSize = 0;
    bool mbTwoKernels = false;
    Kernel madfKernel1{};
    bool mbBGZero = false;
    boost::optional<int> moFilterSizeX;
    boost::optional<int> moFilterSizeY;
    Kernel madfKernel2{};
};

}  // namespace kor::filters
