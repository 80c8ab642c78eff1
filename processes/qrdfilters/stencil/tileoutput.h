#pragma once

#include <cstddef>
#include <cstdint>
#include <span>
#include <vector>

#include "processes/qrdfilters/stencil/stencilblock.h"

namespace kor::filters::stencil
{

/// Where a core's results go: into the output, and background where a mask says so.
class TileOutput
{
public:
    TileOutput(const StencilBlock& oBlock, std::size_t nTilePixels);

    /// Makes ready for nRows rows of nPixels pixels from (x, y) on.
    void Start(std::size_t x, std::uint32_t y, std::size_t nPixels, std::uint32_t nRows);
    bool HasComputedPixels() const;
    StencilPlace Place() const;
    /// A row of doubles for each output row.
    std::span<double* const> Rows() const { return mvpRows; }
    /// Stores the rows and writes their background.
    void Finish();

private:
    void FinishRow(std::size_t nRow);
    void WriteRow(std::span<const double> vdfResults, unsigned char* pOut) const;
    /// mvComputed of a row for samples instead of pixels.
    const unsigned char* ComputedSamples(std::span<const unsigned char> oComputed);

    const StencilBlock& moBlock;
    std::size_t mnChannels;
    std::size_t mnLength;  ///< samples of the longest row
    bool mbMasked;
    bool mbStreamed;
    bool mbInPlace;  ///< results are written where they belong
    std::size_t mnX = 0;
    std::uint32_t mnY = 0;
    std::size_t mnPixels = 0;
    std::vector<double> mvdfResults;
    std::vector<unsigned char> mvComputed;
    std::vector<unsigned char> mvComputedSamples;
    std::vector<double*> mvpRows;
};

}  // namespace kor::filters::stencil
