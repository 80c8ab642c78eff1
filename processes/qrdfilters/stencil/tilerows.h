#pragma once

#include <cstddef>
#include <cstdint>
#include <vector>

#include "processes/qrdfilters/stencil/stencilblock.h"

namespace kor::filters::stencil
{

/// The rows that the windows of a tile cover, a tile being some neighbouring columns of a block.
/// Going down the tile, each row is widened and its validity looked up once.
class TileRows
{
public:
    TileRows(const StencilBlock& oBlock, std::size_t nTilePixels);

    /// Moves to the tile of nPixels columns from x on, whose first output row will be nRow.
    void StartTile(std::size_t x, std::size_t nPixels, std::uint32_t nRow);

    /// The rows around nRows output rows from nRow on. They hold until the next call; output rows
    /// are asked for from above.
    const kernels::StencilRows& Around(std::uint32_t nRow, std::uint32_t nRows);

private:
    void Load(std::int64_t y);
    void PrefetchSamplesOf(std::int64_t y) const;
    void LoadSamplesOf(std::int64_t y, const unsigned char* pValid);
    /// The validity of row y, a byte a sample; null where all are valid.
    const unsigned char* ValidSamples(std::int64_t y);
    void Mark(std::int64_t y, const unsigned char* pValid);
    std::size_t Slot(std::int64_t y) const;

    const StencilBlock& moBlock;
    std::size_t mnChannels;
    std::size_t mnSlots;
    std::size_t mnLength;  ///< samples of the longest row
    bool mbInPlace;        ///< rows are read where they lie
    std::int64_t mnLeft = 0;
    std::size_t mnPixels = 0;  ///< of a row
    std::int64_t mnNext = 0;   ///< row to be loaded next
    std::vector<double> mvdfSamples;
    std::vector<std::uint64_t> mvnWords;
    std::vector<std::uint64_t> mvnAllValid;
    std::vector<unsigned char> mvBytes;
    std::vector<const double*> mvpSamples;       ///< by slot
    std::vector<const std::uint64_t*> mvpWords;  ///< by slot; null where all are valid
    std::vector<const double*> mvpAround;
    std::vector<const std::uint64_t*> mvpValidAround;
    kernels::StencilRows moAround;
};

}  // namespace kor::filters::stencil
