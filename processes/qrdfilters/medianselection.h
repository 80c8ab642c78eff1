#pragma once

#include <cstddef>
#include <cstdint>
#include <span>

#include "basic/tessel/raster/raster.h"

namespace kor::filters
{

/// Selects the medians of a block in the samples' own type T, one of the ten element types. To
/// widen a sample to double never changes an order, so the sample chosen is the one that a
/// comparison of doubles would choose.
///
/// The window has 2 * margin + 1 pixels on each axis. Of n samples sorted the one at n / 2, counted
/// from 0, is the median: the upper of the two in the middle. A window that holds a NaN gives one
/// of its samples. May be used by several threads at once.
template <class T>
class MedianSelection
{
public:
    /// poValid: null, or 0 or 1 a pixel with the geometry of oIn; a pixel of 0 is in no window.
    MedianSelection(const tessel::Raster& oIn, const tessel::Raster* poValid);

    /// Writes the medians of rows nFirst to nEnd - 1: pOut[(y - nFirst) * nOutPitch + i] gets
    /// sample i of row y. oComputed holds, row by row, 1 for each pixel that is wanted; what is
    /// written for the others has no meaning. A pixel that is wanted is in its own window.
    void SelectRows(std::uint32_t nFirst, std::uint32_t nEnd,
                    std::span<const unsigned char> oComputed, T* pOut, std::size_t nOutPitch) const;

private:
    void SelectByNetwork(std::uint32_t nFirst, std::uint32_t nEnd, T* pOut,
                         std::size_t nOutPitch) const;
    /// Selects pixel by pixel where pWanted is 1 and oWhole, unless it is empty, is 0.
    void SelectPixels(std::uint32_t y, std::span<const unsigned char> oComputed,
                      std::span<const unsigned char> oWhole, std::span<T> oGather, T* pOut) const;
    std::size_t Gather(std::uint32_t x, std::uint32_t y, std::span<T> oGather) const;

    const tessel::Raster& moIn;
    const tessel::Raster* mpoValid;
    std::size_t mnWindowWidth;
    std::size_t mnWindowHeight;
};

}  // namespace kor::filters
