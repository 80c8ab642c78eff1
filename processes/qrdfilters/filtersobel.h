#pragma once

#include "basic/tessel/mask/mask.h"
#include "basic/tessel/raster/raster.h"

namespace kor::filters
{

/// Sobel filter: the magnitude of the gradient, from differences over 3 x 3 pixels.
///
///     out = sqrt(Gy^2 + Gx^2) * factor
///     Gx = NE - NW - 2 W + 2 E - SW + SE,   Gy = 2 N + NW + NE - SW - 2 S - SE
/// NE is the neighbour to the upper right, W the one to the left, and so on; the sums are formed
/// in double, added in this order; a step of height h between two columns gives 4 * h on both
/// its sides. Channels are filtered one by one.
///
/// Input    eDT_64R, with margins of at least one pixel on each axis; deeper ones are not read.
/// Output   eDT_64R, same width, height and channels, not clipped. Margins are not written.
/// Masks    may be null. A neighbour whose bit is cleared in the input mask counts as a copy of the
///          centre: it adds no gradient of its own. A bit cleared in either mask makes the pixel
///          background: 0, or the input when BGZero is false.
/// Corners  a flat window gives 0. A NaN or an infinity beside the pixel gives NaN or infinity.
/// Errors   kor::ParameterException for "oRasterIn", "The Margin of the input raster is too small",
///          when a margin is 0, before anything is written. In hardened builds kor::Exception for
///          samples of another type and for blocks whose geometries do not match.
/// Threads  works on the calling thread; one object may serve many threads.
/// Source   R. O. Duda, P. E. Hart, "Pattern Classification and Scene Analysis", Wiley, 1973, pages
///          271-272, after I. Sobel, G. Feldman, 1968.
class FilterSobel
{
public:
    explicit FilterSobel(double dfFactor = 1.0, bool bBGZero = true);
    virtual ~FilterSobel() = default;
    FilterSobel(const FilterSobel&) = default;
    FilterSobel& operator=(const FilterSobel&) = default;

    /// Multiplier of the magnitude, dimensionless, any value; 1.0 at first.
    void SetFactor(double dfFactor);
    /// Background is 0 (true, as at first) or a copy of the input (false).
    void SetBGZero(bool bBGZero);
    /// Both. Mind the order, which is not that of the constructor.
    void SetParameters(bool bBGZero, double dfFactor);

    void Process(tessel::Raster* poRasterIn, tessel::Mask* poMaskIn, tessel::Raster* poRasterOut,
                 tessel::Mask* poMaskOut) const;
    /// The same as Process.
    void ProcessBlock(tessel::Raster* poRasterIn, tessel::Mask* poMaskIn,
                      tessel::Raster* poRasterOut, tessel::Mask* poMaskOut) const;

private:
    double mdfFactor;
    bool mbBGZero;
};

}  // namespace kor::filters
