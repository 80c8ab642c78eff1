#include "processes/qrdfilters/mosaic/clipdistance.h"

#include <algorithm>

namespace kor::filters
{

ClipDistance::ClipDistance(const tessel::Raster& oBlock, const tessel::Mask* poMask,
                           bool bStepsCount)
    : mnWidth(oBlock.mnWidth),
      mnHeight(oBlock.mnHeight),
      mnRowStep(poMask != nullptr ? mnWidth : 0),
      mvnDistances(poMask != nullptr ? mnWidth * mnHeight : mnWidth)
{
    if (poMask == nullptr || mnWidth == 0 || mnHeight == 0)
    {
        return;
    }
    MarkMasked(*poMask);
    if (bStepsCount)
    {
        const std::uint32_t nCorner = oBlock.mnWidth + oBlock.mnHeight;
        const std::uint32_t nOutside = nCorner + 2 * (oBlock.mnMarginX + oBlock.mnMarginY);
        SpreadDown(nCorner, nOutside);
        SpreadUp(nOutside);
    }
}

/// 1 where a pixel is masked and 0 where it is not.
void ClipDistance::MarkMasked(const tessel::Mask& oMask)
{
    std::vector<unsigned char> vValid(mnWidth);
    for (std::uint32_t y = 0; y < mnHeight; ++y)
    {
        oMask.ExpandRow(0, y, vValid);
        std::transform(vValid.begin(), vValid.end(), Row(y).begin(),
                       [](unsigned char nValid) { return std::uint32_t{1} - nValid; });
    }
}

/// Steps from above and from the left. A masked pixel in the first column is not reached from the
/// left, and the one in the corner is nCorner away.
void ClipDistance::SpreadDown(std::uint32_t nCorner, std::uint32_t nOutside)
{
    const std::vector<std::uint32_t> vnOutside(mnWidth, nOutside);
    std::span<const std::uint32_t> oAbove = vnOutside;
    for (std::uint32_t y = 0; y < mnHeight; ++y)
    {
        const std::span<std::uint32_t> oRow = Row(y);
        // Two loops, of which the first one has no chain from pixel to pixel.
        std::transform(oRow.begin(), oRow.end(), oAbove.begin(), oRow.begin(),
                       [](std::uint32_t nMasked, std::uint32_t nAbove)
                       { return nMasked != 0 ? nAbove + 1 : 0; });
        if (y == 0)
        {
            oRow[0] = std::min(oRow[0], nCorner);
        }
        for (std::size_t x = 1; x < oRow.size(); ++x)
        {
            oRow[x] = std::min(oRow[x], oRow[x - 1] + 1);
        }
        oAbove = oRow;
    }
}

/// Steps from below and from the right.
void ClipDistance::SpreadUp(std::uint32_t nOutside)
{
    const std::vector<std::uint32_t> vnOutside(mnWidth, nOutside);
    std::span<const std::uint32_t> oBelow = vnOutside;
    for (std::uint32_t y = mnHeight; y-- > 0;)
    {
        const std::span<std::uint32_t> oRow = Row(y);
        std::transform(oRow.begin(), oRow.end(), oBelow.begin(), oRow.begin(),
                       [](std::uint32_t nOwn, std::uint32_t nBelow)
                       { return std::min(nOwn, nBelow + 1); });
        std::uint32_t nRight = nOutside;
        for (std::size_t x = oRow.size(); x-- > 0;)
        {
            oRow[x] = std::min(oRow[x], nRight + 1);
            nRight = oRow[x];
        }
        oBelow = oRow;
    }
}

}  // namespace kor::filters
