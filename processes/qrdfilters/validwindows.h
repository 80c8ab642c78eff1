#pragma once

#include <cstddef>
#include <cstdint>
#include <span>

#include "basic/tessel/raster/raster.h"

namespace kor::filters
{

/// Finds the pixels whose window of 2 * nHalfX + 1 by 2 * nHalfY + 1 pixels holds no masked pixel,
/// of oWhole.size() pixels from (x, y) to the right: oWhole becomes 1 for them, else 0. oValid
/// holds 0 or 1 a pixel (Mask::CreateRaster) and has margins that hold the windows.
void FindWholeWindows(const tessel::Raster& oValid, std::size_t nHalfX, std::size_t nHalfY,
                      std::int64_t x, std::int64_t y, std::span<unsigned char> oWhole);

}  // namespace kor::filters
