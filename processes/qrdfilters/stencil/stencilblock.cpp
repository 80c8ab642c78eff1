#include "processes/qrdfilters/stencil/stencilblock.h"

#include <algorithm>

#include "processes/qrdfilters/rowbands.h"
#include "processes/qrdfilters/stencil/tileoutput.h"
#include "processes/qrdfilters/stencil/tilerows.h"

namespace kor::filters::stencil
{

namespace
{

/// Whole pixels: as many as let the rows of the windows and of the results stay in the first cache,
/// but many beside those that the windows reach over on both sides.
std::size_t TilePixels(const StencilBlock& oBlock)
{
    constexpr std::size_t kCachedSamples = 3328;
    constexpr std::size_t kVectorSamples = 32;
    const std::size_t nRows = oBlock.moWindow.GetHeight() + 2 * std::size_t{oBlock.mnGroupRows};
    const std::size_t nSamples =
        std::max(oBlock.mnShortestTile, kCachedSamples / nRows / kVectorSamples * kVectorSamples);
    const std::size_t nChannels = oBlock.moIn.mnChannels;
    const std::size_t nPixels = (nSamples + nChannels - 1) / nChannels;
    return std::min<std::size_t>(std::max(nPixels, 4 * oBlock.moWindow.GetWidth()),
                                 oBlock.moIn.mnWidth);
}

// Rows of a thread that are worked on one after the other: many beside those of a window that are
// widened once more for them.
constexpr std::uint32_t kBandRows = 256;

}  // namespace

StencilBlock::StencilBlock(const tessel::Raster& oIn, const tessel::Mask* poMaskIn,
                           const tessel::Raster& oOut, const tessel::Mask* poMaskOut,
                           const Window& oWindow, const SampleTypes& oTypes)
    : moIn(oIn),
      mpoMaskIn(poMaskIn),
      moOut(oOut),
      mpoMaskOut(poMaskOut),
      moWindow(oWindow),
      moTypes(oTypes),
      mpoValid(poMaskIn != nullptr ? poMaskIn->CreateRaster() : nullptr)
{
}

void FilterRows(const StencilBlock& oBlock, std::uint32_t nFirst, std::uint32_t nEnd,
                const StencilCore& oCore)
{
    const std::size_t nWidth = oBlock.moIn.mnWidth;
    if (nFirst == nEnd || nWidth == 0 || oBlock.moIn.mnChannels == 0)
    {
        return;
    }
    const std::size_t nTilePixels = TilePixels(oBlock);
    TileRows oRows(oBlock, nTilePixels);
    TileOutput oOutput(oBlock, nTilePixels);
    for (std::size_t x = 0; x < nWidth; x += nTilePixels)
    {
        const std::size_t nPixels = std::min(nTilePixels, nWidth - x);
        oRows.StartTile(x, nPixels, nFirst);
        for (std::uint32_t y = nFirst; y < nEnd; y += oBlock.mnGroupRows)
        {
            const std::uint32_t nRows = std::min(oBlock.mnGroupRows, nEnd - y);
            oOutput.Start(x, y, nPixels, nRows);
            const kernels::StencilRows& oAround = oRows.Around(y, nRows);
            if (oOutput.HasComputedPixels())
            {
                oCore(oAround, oOutput.Place(), oOutput.Rows());
            }
            oOutput.Finish();
        }
    }
}

void FilterRowsInParallel(const StencilBlock& oBlock, const StencilCore& oCore)
{
    ForEachRowBand(oBlock.moIn.mnHeight, kBandRows,
                   [&](std::uint32_t nFirst, std::uint32_t nEnd)
                   { FilterRows(oBlock, nFirst, nEnd, oCore); });
}

}  // namespace kor::filters::stencil
