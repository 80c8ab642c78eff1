#pragma once

#include "basic/tessel/mask/mask.h"
#include "basic/tessel/raster/raster.h"

namespace kor::filters
{

/// Prewitt filter: the magnitude of the gradient, from differences over 3 x 3 pixels.
///
///     out = sqrt(Gy^2 + Gx^2) * factor
///     Gx = NE - NW - W + E - SW + SE,   Gy = N + NW + NE - SW - S - SE
/// NE is the neighbour to the upper right, W the one to the left, and so on; the sums are formed
/// in double, added in this order; a step of height h between two columns gives 3 * h on both
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
/// Source   J. M. S. Prewitt, "Object enhancement and extraction", in Picture Processing and
///          Psychopictorics, Academic Press, 1970, 75-149.
class FilterPrewitt
{
public:
    /// Unlike FilterSobel this one keeps the input where nothing is computed. That is meant.
    FilterPrewitt();
    FilterPrewitt(double dfFactor, bool bBGZero);
    virtual ~FilterPrewitt() = default;
    FilterPrewitt(const FilterPrewitt&) = default;
    FilterPrewitt& operator=(const FilterPrewitt&) = default;

    /// Multiplier of the magnitude, dimensionless, any value; 1.0 at first.
    void SetFactor(double dfFactor);
    /// Background is 0 (true) or a copy of the input (false, as at first).
    void SetBGZero(bool bBGZero);
    /// Both. Mind the order, which is not that of the constructor.
    void SetParameters(bool bBGZero, double dfFactor);

    void Process(tessel::Raster* poRasterIn, tessel::Mask* poMaskIn, tessel::Raster* poRasterOut,
                 tessel::Mask* poMaskOut) const;
    /// The same as Process.
    void ProcessBlock(tessel::Raster* poRasterIn, tessel::Mask* poMaskIn,
                      tessel::Raster* poRasterOut, tessel::Mask* poMaskOut) const;

private:
    bool mbBGZero;
    double mdfFactor;
};

}  // namespace kor::filters
