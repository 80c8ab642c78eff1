#include "processes/qrdfilters/window.h"

#include <algorithm>

namespace kor::filters
{

namespace
{

std::uint32_t HalfOf(const WindowSize& nSize, std::uint32_t nMargin)
{
    return nSize ? static_cast<std::uint32_t>(std::max(0, *nSize / 2)) : nMargin;
}

}  // namespace

Window WindowOfMargins(const tessel::Raster& oRaster)
{
    return {oRaster.mnMarginX, oRaster.mnMarginY};
}

Window WindowOfBothSizes(const WindowSize& nSizeX, const WindowSize& nSizeY,
                         const tessel::Raster& oRaster)
{
    return nSizeX && nSizeY ? WindowOfEachSize(nSizeX, nSizeY, oRaster) : WindowOfMargins(oRaster);
}

Window WindowOfEachSize(const WindowSize& nSizeX, const WindowSize& nSizeY,
                        const tessel::Raster& oRaster)
{
    return {HalfOf(nSizeX, oRaster.mnMarginX), HalfOf(nSizeY, oRaster.mnMarginY)};
}

bool FitsMargins(const Window& oWindow, const tessel::RasterContext& oContext)
{
    return oWindow.mnHalfX <= oContext.mnMarginX && oWindow.mnHalfY <= oContext.mnMarginY;
}

}  // namespace kor::filters
