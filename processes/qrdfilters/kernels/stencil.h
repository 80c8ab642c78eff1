#pragma once

#include <cstddef>
#include <cstdint>
#include <span>

namespace kor::filters::kernels
{

/// The samples that the windows of a few output rows cover, as doubles; the channels of a pixel
/// stand side by side. Sample i of output row j has in its window, column dx and row dy counted
/// from the window's upper left corner, the sample moSamples[j + dy][i + dx * mnStep].
///
/// Nothing is read behind the windows of the last sample.
struct StencilRows
{
    std::size_t GetRows() const { return moSamples.size() - mnHeight + 1; }
    /// From a window's first sample to the one in its middle.
    std::size_t GetCentre() const { return mnWidth / 2 * mnStep; }

    /// Rows of the windows of all output rows.
    std::span<const double* const> moSamples;
    /// The same rows: all bits set for valid samples, none for masked ones. Empty where all are
    /// valid, or where the kernel has nothing to ask.
    std::span<const std::uint64_t* const> moValid;
    std::size_t mnSamples = 0;  ///< of an output row
    std::size_t mnStep = 0;     ///< from a pixel to the next: its channels
    std::size_t mnWidth = 0;    ///< of the window, in pixels
    std::size_t mnHeight = 0;
};

}  // namespace kor::filters::kernels
