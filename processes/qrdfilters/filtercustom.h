#pragma once

#include <vector>

#include "processes/qrdfilters/iprocessor.h"
#include "processes/qrdfilters/typedfilter.h"

namespace kor::filters
{

namespace details
{

/// Parameters of FilterCustom.
class CustomParams
{
public:
    virtual ~CustomParams() = default;

    /// The weights, row by row from the top, for a kernel of nWidth by nHeight pixels. Throws
    /// kor::Exception "The size of the kernel doesn't match the given sizes." where there are not
    /// nWidth * nHeight of them; the new weights then stay beside the old sizes. Counts for
    /// processors made later, see FilterCustom.
    void SetKernel(const std::vector<double>& vdfKernel, unsigned int nWidth, unsigned int nHeight);

    /// Divides the weights by their sum, added in the order of the kernel, so that a flat image
    /// keeps its value. A kernel whose sum is exactly 0.0, one of a single weight and an empty one
    /// stay as they are. Nothing calls this but the caller.
    void ApplyWeight();

    /// True: a pixel that is not computed becomes 0; false, as at first: it keeps the input's
    /// value. Counts for processors made later, see FilterCustom.
    void SetBGZero(bool bBGZero) { mbBGZero = bBGZero; }

protected:
    std::vector<double> mvdfKernel;
    unsigned int mnKernelWidth = 0;
    unsigned int mnKernelHeight = 0;
    bool mbBGZero = false;
};

}  // namespace details

/// Correlates a block with a kernel of the caller's, channel by channel.
///
///     out = sum of s[k] * w[k],   k from the upper left corner of the window, row by row
/// from 0.0 on, in double and in this order. The kernel is not mirrored: the first weight meets the
/// upper left sample.
///
/// Input    any of the ten real types, or a complex one, which is seen as its magnitude. The window
///          reaches (width - 1) / 2 pixels to the left and right and (height - 1) / 2 up and down,
///          by integer division; the margins may be deeper.
/// Output   any of the ten real types; same width, height and channels. The sum is stored by the
///          library's conversion rules. Margins are not written.
/// Masks    may be null. The input mask has the geometry of the input; a pixel that is cleared in
///          it counts as 0.0 in every window, and the other weights make nothing up for it: beside
///          masked pixels a smoothing kernel darkens. A bit cleared in either mask makes the pixel
///          background: 0, or the input's value, converted directly, when BGZero is false.
/// Corners  an even width or height is taken without complaint: the window is one column or row
///          smaller than the kernel, whose weights are still read one after the other, so that they
///          fall out of their rows. That is meant; give kernels of odd sizes.
/// Errors   kor::Exception "poRasterIn is invalid pointer", "poRasterOut is invalid pointer",
///          "Output cannot be complex", "Invalid type requested." (eDT_BIT), and where weights were
///          refused before, "The size of the kernel doesn't match the given sizes.";
///          kor::ParameterException for "poRasterIn", "The Margin of the input raster is too
///          small", also when no kernel was set. All before anything is written. In hardened builds
///          also kor::Exception for blocks whose geometries do not match.
/// Threads  splits the rows among the threads of OpenMP. One object must not be called by two
///          threads at once unless it has worked on the same pair of types before.
/// State    the processor of the last pair of types is kept, and copies of the filter share it.
///          Kernel and BGZero count when a processor is made: a filter that has processed a block
///          keeps those of then until the types change. So a filter that was called before it had
///          a kernel goes on without one.
class FilterCustom : public details::CustomParams, private ProcessorCache<IClipperProcessor>
{
public:
    template <class TIn, class TOut>
    class InnerProcessor;

    void Process(tessel::Raster* poRasterIn, tessel::Mask* poMaskIn, tessel::Raster* poRasterOut,
                 tessel::Mask* poMaskOut) const;
};

}  // namespace kor::filters
