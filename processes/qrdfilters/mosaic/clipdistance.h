#pragma once

#include <cstdint>
#include <span>
#include <vector>

#include "basic/tessel/mask/mask.h"
#include "basic/tessel/raster/raster.h"

namespace kor::filters
{

/// Distance of each pixel of a block from its valid area, in steps along rows and columns: 0 for
/// valid pixels. What lies outside the block, its margins too, counts as W + H + 2 * (mx + my)
/// away from anything valid, W and H being the block's size and mx and my its margins.
class ClipDistance
{
public:
    /// poMask may be null: all pixels are valid. With bStepsCount false every masked pixel has the
    /// distance 1.
    ClipDistance(const tessel::Raster& oBlock, const tessel::Mask* poMask, bool bStepsCount);

    /// The distances of the pixels in row y of the block.
    std::span<const std::uint32_t> GetRow(std::uint32_t y) const
    {
        return {mvnDistances.data() + y * mnRowStep, mnWidth};
    }

private:
    std::span<std::uint32_t> Row(std::uint32_t y)
    {
        return {mvnDistances.data() + y * mnRowStep, mnWidth};
    }
    void MarkMasked(const tessel::Mask& oMask);
    void SpreadDown(std::uint32_t nCorner, std::uint32_t nOutside);
    void SpreadUp(std::uint32_t nOutside);

    std::size_t mnWidth;
    std::uint32_t mnHeight;
    std::size_t mnRowStep;  ///< 0 without a mask: one row of zeros serves all
    std::vector<std::uint32_t> mvnDistances;
};

}  // namespace kor::filters
