#pragma once

#include <vector>

#include "processes/qrdfilters/iprocessor.h"
#include "processes/qrdfilters/typedfilter.h"

namespace kor::filters
{

namespace details
{

/// Parameters of ImageToBit. They count as long as the filter has not processed a block, see there.
class ImageToBitParams
{
public:
    /// One value, or a lower and an upper limit, in sample values (for complex samples: in squares
    /// of them); more are ignored. None at all count as one threshold of 0.
    void SetThreshold(const std::vector<float>& vfThresholds) { mvfThresholds = vfThresholds; }
    /// Which side of the thresholds gives 1, see the table of ImageToBit; true at first.
    void SetCompMode(bool bCompMode) { mbCompMode = bCompMode; }

protected:
    std::vector<float> mvfThresholds;
    bool mbCompMode = true;
};

}  // namespace details

/// Threshold: turns each sample into 1 or 0, whatever the output's type is.
///
///     Samples   thresholds   1 with CompMode true    1 with CompMode false
///     real      one          v < T0                  v >= T0
///     real      two          v <= T0 or v >= T1      T0 <= v <= T1
///     complex   one          v > T0                  v <= T0
///     complex   two          v <= T0 or v >= T1      T0 < v < T1
/// v is the sample in single precision, for complex samples re * re + im * im. Meant: the sides of
/// one threshold are opposite for real and complex samples, and the interval between two is closed
/// for real and open for complex ones.
///
/// Input    any of the ten real types, or a complex one of such parts. re * re + im * im has the
///          type of the parts, in which integers wrap: parts of 16 bits give a v of 16 bits.
/// Output   any of the ten real types, which hold 1 or 0; same width and height, and the channels
///          of the input. Channels that only one of both has are left alone. Margins are not
///          written.
/// Mask     may be null. It has the geometry of the input. Masked pixels become 0 in all channels
///          of the output, on whichever side of the thresholds they are.
/// Corners  not a number is on neither side and gives 0. 32-bit and 64-bit integers and doubles are
///          rounded before they are compared: 16777217 counts as 16777216.
/// Errors   kor::Exception "poRasterIn is invalid pointer", "poRasterOut is invalid pointer",
///          "Output cannot be complex", "Invalid type requested." (eDT_BIT), all before anything is
///          written; in hardened builds also for blocks whose geometries do not match and for types
///          other than those of the first block.
/// Threads  works on the calling thread. One object may be called by several threads at once when
///          it has processed a block before.
/// State    one object serves one pair of types with one set of parameters: its processor is made
///          by the first block and kept, and copies share it. Blocks of other types than those of
///          the first one must not be given to it.
class ImageToBit : public details::ImageToBitParams, private ProcessorCache<IProcessor>
{
public:
    template <class TIn, class TOut>
    class InnerProcessor;

    void Process(tessel::Raster* poRasterIn, tessel::Mask* poMaskIn,
                 tessel::Raster* poRasterOut) const;
};

}  // namespace kor::filters
