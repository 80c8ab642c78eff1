#pragma once

#include <boost/optional.hpp>
#include <memory>

#include "basic/tessel/mask/mask.h"
#include "basic/tessel/raster/raster.h"

namespace kor::filters
{

/// Enhanced Frost speckle filter: the mean of flat areas, point targets untouched, and between them
/// a mean in which near neighbours weigh most.
///
///     out = mean                                  where Cu > Ci
///     out = x                                     else where Ci > Cmax
///     out = (sum of w * x) / (sum of w)           else;   w = exp(-(d * A))
///     Ci = sqrt(variance) / mean,   A = (Ci - Cu) * damp / (Cmax - Ci)
///     Cu = 1 / sqrt(L),   Cmax = sqrt(2 / L + 1),   L the number of looks
/// x is a sample, in the second line the one in the middle; d its distance in pixels from the
/// centre; mean and variance (over n - 1) are those of the n valid samples of the window.
///
/// Input    eDT_64R, meant for amplitude or intensity (power); channels are filtered one by one.
///          Mean and variance take the window of both set sizes, halved by integer division (4 and
///          5 both give 5 pixels), or while either is unset that of the margins. The weighted sum
///          takes each set size, or else half the margin, which is meant: without sizes its window
///          is smaller than that of the statistics. The margins must hold both.
/// Output   eDT_64R, same width, height and channels. Margins are not written.
/// Masks    may be null. A bit cleared in the input mask takes the pixel out of every window. A bit
///          cleared in either mask makes it background: 0, or the input when BGZero is false.
/// Corners  n = 1: out = x. Ci = Cmax: out is not a number. Ci = Cu: the plain mean of the smaller
///          window. Mean 0 with a variance above 0: out = x. A variance that rounding left below 0,
///          and a window of zeros: out is not a number.
/// Errors   kor::Exception "Damping factor must be a positive number" (SetDamp), "Number of looks
///          must be a positive number" (SetNLOOK); in hardened builds when a window is larger than
///          the margins.
/// Threads  works on the calling thread; one object may serve many threads.
/// Source   A. Lopes, R. Touzi, E. Nezry, "Adaptive speckle filters and scene heterogeneity", IEEE
///          Trans. Geoscience and Remote Sensing 28(6), 992-1000, 1990.
class FilterFefrost
{
public:
    FilterFefrost() = default;
    FilterFefrost(const FilterFefrost&) = default;
    FilterFefrost& operator=(const FilterFefrost&) = default;
    virtual ~FilterFefrost() = default;

    /// damp: dimensionless, from 0 up, 0 at first; 1 is a usual value. Throws kor::Exception for a
    /// value below 0, which then is not taken.
    void SetDamp(double dfDamp);
    /// The number of looks L, from 0 up, to be set before a block is filtered; 0 makes Cu and Cmax
    /// infinite. Throws kor::Exception for a value below 0, which then is not taken.
    void SetNLOOK(double dfLooks);
    /// Background is 0 (true) or, as at first, a copy of the input (false).
    void SetBGZero(bool bBGZero);
    /// Window width and height in pixels; an empty size leaves that axis to the margins.
    void SetFilterSize(boost::optional<int> nSizeX, boost::optional<int> nSizeY);
    /// True: weights from the library's own exponential, about three times as fast and the same on
    /// every machine, each at most 1 ulp (2.2e-16 of the weight) off the function's value. False,
    /// as at first: from std::exp.
    void SetFastExponential(bool bFast);

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
    double mdfCu = 0.0;
    double mdfCmax = 0.0;
    double mdfDamp = 0.0;
    bool mbBGZero = false;
    boost::optional<int> moFilterSizeX;
    boost::optional<int> moFilterSizeY;
    bool mbFastExponential = false;
};

}  // namespace kor::filters
