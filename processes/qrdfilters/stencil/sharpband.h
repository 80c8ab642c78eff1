#pragma once

#include <cstddef>
#include <cstdint>
#include <span>
#include <vector>

#include "basic/tessel/mask/mask.h"
#include "basic/tessel/raster/raster.h"
#include "processes/qrdfilters/window.h"

namespace kor::filters::stencil
{

/// What a sharpening filter works on. The masks may be null; mpoValid is the input mask with a byte
/// 0 or 1 a pixel, null as that is.
struct SharpBlock
{
    const tessel::Raster& moIn;
    const tessel::Mask* mpoMaskIn;
    const tessel::Raster* mpoValid;
    const tessel::Raster& moOut;
    const tessel::Mask* mpoMaskOut;
    Window moWindow;
    bool mbBGZero;
};

/// A few neighbouring rows of a block, sharpened together: out = 2 * x - mean. Along a row the
/// window's sum moves on sample by sample, and begins anew behind each background pixel; so the
/// rows stand side by side, and lanes run over them.
class SharpBand
{
public:
    /// Rows that make a band worth its while.
    static constexpr std::uint32_t kMostRows = 32;

    /// The rows nFirst to nEnd - 1, kMostRows at most.
    SharpBand(const SharpBlock& oBlock, std::uint32_t nFirst, std::uint32_t nEnd);

    void Sharpen();

private:
    void SharpenTile(std::size_t x, std::size_t nPixels);
    void LoadColumns(std::size_t x, std::size_t nPixels);
    void FindFreshWindows(std::size_t x, std::size_t nPixels);
    void MoveWindows(std::size_t x, std::size_t nPixels);
    void StartCounts(std::size_t x, std::size_t nPixels);
    void SlideCounts(std::size_t x, std::int64_t y, std::size_t nPixels);
    void CountRow(std::size_t x, std::size_t nRow, std::size_t nPixels);
    void WriteRow(std::size_t x, std::size_t nRow, std::size_t nPixels);
    /// The computed pixels of a row of the tile.
    unsigned char* Computed(std::size_t nRow);
    /// The valid pixels of row y from the first window's left end on.
    const unsigned char* ValidFrom(std::size_t x, std::int64_t y) const;
    /// Bytes of pixels as bytes of samples, until the next call.
    const unsigned char* ForSamples(std::span<const unsigned char> oPixels);

    const SharpBlock& moBlock;
    std::uint32_t mnFirst;
    std::size_t mnRows;
    std::size_t mnPaddedRows;
    std::size_t mnChannels;
    std::size_t mnTilePixels;
    std::size_t mnPitch;  ///< from a column to the next
    bool mbMasked;
    std::vector<double> mvdfColumns;  ///< from the pixel before the first window on
    std::vector<double> mvdfSums;     ///< from the pixel before the tile on
    std::vector<std::uint64_t> mvnFresh;
    std::vector<unsigned char> mvComputed;  ///< from the pixel before the tile on, row by row
    std::vector<unsigned char> mvSampleBytes;
    std::vector<double> mvdfRow;
    std::vector<std::int32_t> mvnColumnCounts;
    std::vector<double> mvdfPixelCounts;
    std::vector<double> mvdfCounts;  ///< valid pixels of each sample's window
};

}  // namespace kor::filters::stencil
