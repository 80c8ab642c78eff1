#pragma once

#include "processes/qrdfilters/iprocessor.h"
#include "processes/qrdfilters/typedfilter.h"

namespace kor::filters
{

namespace details
{

/// Parameters of FilterMedian.
class MedianParams
{
public:
    virtual ~MedianParams() = default;

    /// True: a pixel that is not computed becomes 0; false, as at first: it keeps the input's
    /// value. Counts for processors made later, see FilterMedian.
    void SetBGZero(bool bBGZero) { mbBGZero = bBGZero; }

protected:
    bool mbBGZero = false;
};

}  // namespace details

/// Median filter: the middle sample of the window around each pixel, channel by channel.
///
///     out = s[n / 2],   s the n valid samples of the window in ascending order, counted from 0
/// For an even n this is the upper of the two in the middle, never their mean: 1, 2, 3, 4 give 3.
///
/// Input    any of the ten real types, or a complex one, which is seen as its magnitude. The window
///          is 2 * margin + 1 pixels on each axis: the margins alone tell its size, and their
///          samples count like all others.
/// Output   any of the ten real types; same width, height and channels. The sample selected is
///          widened to double and stored by the library's conversion rules, so that 64-bit integers
///          above 2^53 lose their low bits. Margins are not written.
/// Masks    may be null. The input mask has the geometry of the input; a bit cleared in it takes
///          the pixel out of every window. A bit cleared in either mask makes the pixel background:
///          0, or the input's value, converted directly, when BGZero is false. A pixel that is
///          cleared in the output mask alone still counts for its neighbours.
/// Corners  margins of 0: the input, through double. One valid sample in the window: that sample.
///          A window that holds a NaN gives one of its samples; of zeros either sign.
/// Errors   kor::Exception "poRasterIn is invalid pointer", "poRasterOut is invalid pointer",
///          "Output cannot be complex", "Invalid type requested." (eDT_BIT), all before anything is
///          written; in hardened builds also for blocks whose geometries do not match.
/// Threads  splits the rows among the threads of OpenMP. One object must not be called by two
///          threads at once unless it has worked on the same pair of types before.
/// State    the processor of the last pair of types is kept, and copies of the filter share it.
///          SetBGZero counts when a processor is made: a filter that has processed a block keeps
///          the value of then until the types change.
/// Source   J. W. Tukey, "Exploratory Data Analysis", Addison-Wesley, 1977.
class FilterMedian : public details::MedianParams, private ProcessorCache<IClipperProcessor>
{
public:
    template <class TIn, class TOut>
    class InnerProcessor;

    void Process(tessel::Raster* poRasterIn, tessel::Mask* poMaskIn, tessel::Raster* poRasterOut,
                 tessel::Mask* poMaskOut) const;
};

}  // namespace kor::filters
