#pragma once

#include <cstdint>

#include "platform/datasources/irasterreader.h"
#include "platform/datasources/irasterwriter.h"

namespace kor::parallelio
{

/// The rectangle that a run covers, in image pixels. A width or height of 0 means the whole image.
struct ProcessWindow
{
    std::uint32_t mnX = 0;
    std::uint32_t mnY = 0;
    std::uint32_t mnWidth = 0;
    std::uint32_t mnHeight = 0;
};

/// Chooses the block shape for a run: at most nMaxPixels pixels, or the least that can be moved.
/// The whole image where that fits; else groups of whole tiles, as square as can be, where input
/// and output are tiled; else strips of the output's full width, of whole tile rows where one of
/// the two is tiled.
///
/// poReader  may be null, then the writer tells the input's geometry; poWriter may be null, then
/// the
///           reader tells the output's. One of them is needed.
/// Errors    kor::Exception "Raster size is 0!".
void FindOptimalRasterSize(datasources::IRasterReader* poReader,
                           datasources::IRasterWriter* poWriter, unsigned int nMaxPixels,
                           unsigned int& nWidth, unsigned int& nHeight,
                           const ProcessWindow& oWindow);

}  // namespace kor::parallelio
