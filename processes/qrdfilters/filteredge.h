#pragma once

#include "processes/qrdfilters/iprocessor.h"
#include "processes/qrdfilters/typedfilter.h"

namespace kor::filters
{

namespace details
{

/// Parameters of FilterEdge.
class EdgeParams
{
public:
    virtual ~EdgeParams() = default;

    /// Multiplier of the edge strength, dimensionless, any value; 1.0 at first and then without a
    /// multiplication. Counts for processors made later, see FilterEdge.
    void SetFactor(double dfFactor) { mdfFactor = dfFactor; }

protected:
    double mdfFactor = 1.0;
};

}  // namespace details

/// Edge strength: the mean absolute difference between a pixel and the others of its window.
///
///     out = (sum of |s - x|) / (n - 1) * factor
/// x is the centre sample, s runs over the valid samples of the window, row by row, and n is the
/// number of its pixels, valid or not. Channels are filtered one by one, in double.
///
/// Input    any of the ten real types, or a complex one, which is seen as its magnitude; 64-bit
///          integers above 2^53 lose their low bits. The window is 2 * margin + 1 pixels on each
///          axis: the margins alone tell its size.
/// Output   any of the ten real types; same width, height and channels. The strength is stored by
///          the library's conversion rules. Margins are not written.
/// Masks    may be null. The input mask has the geometry of the input; a pixel cleared in it is
///          left out of every window, while the divisor stays: beside masked pixels edges are
///          weaker. That is meant. A bit cleared in either mask makes the pixel 0; nothing is ever
///          kept.
/// Corners  a sum below 1e-9 gives 0; margins of 0 give 0. A NaN in the window gives NaN, 0 in
///          integers.
/// Errors   kor::Exception "poRasterIn is invalid pointer", "poRasterOut is invalid pointer",
///          "Output cannot be complex", "Invalid type requested." (eDT_BIT), all before anything is
///          written; in hardened builds also for blocks whose geometries do not match.
/// Threads  splits the rows among the threads of OpenMP. One object must not be called by two
///          threads at once unless it has worked on the same pair of types before.
/// State    the processor of the last pair of types is kept, and copies of the filter share it.
///          SetFactor counts when a processor is made: a filter that has processed a block keeps
///          the factor of then until the types change.
class FilterEdge : public details::EdgeParams, private ProcessorCache<IClipperProcessor>
{
public:
    explicit FilterEdge(double dfFactor = 1.0) { SetFactor(dfFactor); }

    template <class TIn, class TOut>
    class InnerProcessor;

    void Process(tessel::Raster* poRasterIn, tessel::Mask* poMaskIn, tessel::Raster* poRasterOut,
                 tessel::Mask* poMaskOut) const;
};

}  // namespace kor::filters
