#pragma once

#include <boost/optional.hpp>

#include "basic/tessel/mask/mask.h"
#include "basic/tessel/raster/raster.h"

namespace kor::filters
{

/// Sharpening filter: boosts each pixel against its surroundings.
///
///     out = 2 * x - mean,   mean = (sum of the n valid samples of the window) / n
/// x is the centre sample, which is part of the mean. Channels are filtered one by one.
///
/// Input    eDT_64R, with a margin of at least one pixel on either axis. The window reaches the set
///          size to each side: the value is the half size itself, 3 gives 7 pixels. Where no size
///          is set the margin is the half size, axis by axis. The margins must hold the window.
/// Output   eDT_64R, same width, height and channels, not clipped. Margins are not written.
/// Masks    may be null. A bit cleared in the input mask takes the pixel out of every window. A bit
///          cleared in either mask makes it background: 0, or the input when BGZero is false.
/// Corners  a flat window, or no other valid sample in it: the input. A negative size counts as 0.
/// Errors   kor::ParameterException for "oRasterIn" when both margins are 0, whatever the sizes,
///          before anything is written: "The Margin of the input raster is too small." In hardened
///          builds kor::Exception for samples of another type, for blocks whose geometries do not
///          match and for a window larger than the margins.
/// Numbers  along a row the sum in double moves on by a column that leaves and one that enters; it
///          begins anew at each row's start and behind each background pixel, so that the last bits
///          depend on where these are. A NaN or an infinity stays in the sum until then.
/// Threads  splits the rows among the threads of OpenMP; one object may serve many threads.
/// Source   A. Rosenfeld, A. C. Kak, "Digital Picture Processing", Academic Press, 1976, 6.4:
///          an image minus a fraction of its Laplacian.
class FilterSharp
{
public:
    FilterSharp() = default;
    virtual ~FilterSharp() = default;
    FilterSharp(const FilterSharp&) = default;
    FilterSharp& operator=(const FilterSharp&) = default;

    /// Background is 0 (true) or a copy of the input (false, as at first).
    void SetBGZero(bool bBGZero);
    /// Half the window's width and height in pixels, the centre not counted: 3 gives 7 pixels.
    /// Unlike with other filters the values are not halved. That is meant.
    void SetFilterSize(int nSizeX, int nSizeY);
    /// The same; an empty size leaves that axis to the margins.
    void SetFilterSize(boost::optional<int> nSizeX, boost::optional<int> nSizeY);

    void Process(tessel::Raster* poRasterIn, tessel::Mask* poMaskIn, tessel::Raster* poRasterOut,
                 tessel::Mask* poMaskOut) const;
    /// The same as Process.
    void ProcessBlock(tessel::Raster* poRasterIn, tessel::Mask* poMaskIn,
                      tessel::Raster* poRasterOut, tessel::Mask* poMaskOut) const;

private:
    bool mbBGZero = false;
    boost::optional<int> moFilterSizeX;
    boost::optional<int> moFilterSizeY;
};

}  // namespace kor::filters
