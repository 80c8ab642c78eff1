#pragma once

#include <boost/optional.hpp>
#include <cstddef>
#include <cstdint>

#include "basic/tessel/raster/raster.h"

namespace kor::filters
{

/// Size of a filter window as a caller sets it, in pixels; empty means that the margins tell.
using WindowSize = boost::optional<int>;

/// A window around a pixel: always of odd extent, 2 * half + 1 pixels on each axis.
struct Window
{
    std::uint32_t mnHalfX = 0;
    std::uint32_t mnHalfY = 0;

    std::size_t GetWidth() const { return 2 * std::size_t{mnHalfX} + 1; }
    std::size_t GetHeight() const { return 2 * std::size_t{mnHalfY} + 1; }
};

/// The window that the margins of oRaster hold.
Window WindowOfMargins(const tessel::Raster& oRaster);
/// The set sizes, halved by integer division, if both are set; else the window of the margins.
Window WindowOfBothSizes(const WindowSize& nSizeX, const WindowSize& nSizeY,
                         const tessel::Raster& oRaster);
/// Axis by axis: the set size, halved by integer division, or else the margin.
Window WindowOfEachSize(const WindowSize& nSizeX, const WindowSize& nSizeY,
                        const tessel::Raster& oRaster);

/// True when the window around each pixel of a block with these margins lies inside the block.
bool FitsMargins(const Window& oWindow, const tessel::RasterContext& oContext);

}  // namespace kor::filters
