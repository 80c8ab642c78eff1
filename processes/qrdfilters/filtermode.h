#pragma once

#include <utility>
#include <vector>

#include "processes/qrdfilters/iprocessor.h"
#include "processes/qrdfilters/typedfilter.h"

namespace kor::filters
{

namespace details
{

/// Parameters of FilterMode. They count for processors made later, see FilterMode.
class ModeParams
{
public:
    ModeParams() = default;
    ModeParams(std::vector<float> vfKeepValues, bool bThinLine)
        : mvfKeepValues(std::move(vfKeepValues)), mbThinLine(bThinLine)
    {
    }
    virtual ~ModeParams() = default;
    ModeParams(const ModeParams&) = default;
    ModeParams& operator=(const ModeParams&) = default;

    /// Values that are never changed, in the units of the samples; none at first. A sample is kept
    /// if, as a single-precision number, it lies within 1e-9 of one of them.
    void SetKeepValues(std::vector<float> vfKeepValues) { mvfKeepValues = std::move(vfKeepValues); }
    /// True: thin line mode, see FilterMode; false at first.
    void SetThinLine(bool bThinLine) { mbThinLine = bThinLine; }
    /// True: a pixel that is not computed becomes 0; false, as at first: it keeps the input's
    /// value.
    void SetBGZero(bool bBGZero) { mbBGZero = bBGZero; }

protected:
    std::vector<float> mvfKeepValues;
    bool mbThinLine = false;
    bool mbBGZero = false;
};

}  // namespace details

/// Mode filter: the most frequent value of the window around each pixel, channel by channel.
///
///     out = the value that occurs most often in the window; a value that occurs once never wins
/// Of values that occur equally often the pixel's own wins, or else the one that comes first in row
/// order from the upper left. Where all differ, the pixel keeps its own. Values are compared as
/// doubles, exactly.
///
/// Input    any of the ten real types, or a complex one, which is seen as its magnitude. The window
///          is 2 * margin + 1 pixels on each axis: the margins alone tell its size, and their
///          samples count like all others.
/// Thin     line mode: the window is 3 x 3 whatever the margins, and a pixel whose upper left
///          neighbour's value fills three or more of the nine places keeps its own.
/// Keep     list: a sample that, as a single-precision number, lies within 1e-9 of a listed value,
///          is not changed, only converted; it still counts for its neighbours. Integers beyond
///          2^24 may be kept by the value beside them: 16777216 keeps 16777217.
/// Output   any of the ten real types; same width, height and channels. The mode is stored as a
///          double by the library's conversion rules, so that 64-bit integers above 2^53 lose their
///          low bits and negative ones become 0. Margins are not written.
/// Masks    may be null. The input mask has the geometry of the input. A bit cleared in either mask
///          makes the pixel background: 0, or the input's value, converted directly, when BGZero is
///          false. In a window the input mask speaks for whole rows: where the bit of a row's first
///          column is cleared, the pixel's own value stands for all samples of that row; the bits
///          of the other columns are not looked at. A pixel that is cleared in the output mask
///          alone still counts for its neighbours.
/// Corners  margins of 0: the input, through double. Not a number equals nothing, so it never wins,
///          and a pixel of it keeps it where no other value occurs twice. Zeros are equal whatever
///          their sign, and the first of the window is given.
/// Errors   kor::Exception "poRasterIn is invalid pointer", "poRasterOut is invalid pointer",
///          "Output cannot be complex", "Invalid type requested." (eDT_BIT);
///          kor::ParameterException "Filter size must be 3x3" in thin line mode with a margin of 0;
///          all before anything is written; in hardened builds also for blocks whose geometries do
///          not match.
/// Threads  splits the rows among the threads of OpenMP. One object must not be called by two
///          threads at once unless it has worked on the same pair of types before.
/// State    the processor of the last pair of types is kept, and copies of the filter share it. The
///          parameters count when a processor is made: a filter that has processed a block keeps
///          the values of then until the types change.
/// Source   E. R. Davies, "On the noise suppression and image enhancement characteristics of the
///          median, truncated median and mode filters", Pattern Recognition Letters 7(2), 87-97,
///          1988; here the mode of the samples themselves, not of a smoothed histogram.
class FilterMode : public details::ModeParams, private ProcessorCache<IClipperProcessor>
{
public:
    template <class TIn, class TOut>
    class InnerProcessor;

    FilterMode() = default;
    FilterMode(std::vector<float> vfKeepValues, bool bThinLine);

    void Process(tessel::Raster* poRasterIn, tessel::Mask* poMaskIn, tessel::Raster* poRasterOut,
                 tessel::Mask* poMaskOut) const;
};

}  // namespace kor::filters
