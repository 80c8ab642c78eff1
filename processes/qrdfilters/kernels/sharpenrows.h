#pragma once

#include <cstddef>
#include <cstdint>
#include <span>

namespace kor::filters::kernels
{

/// Some rows of windows that move along their row sample by sample, all rows side by side: a column
/// holds what stands one below the other. Rows are a multiple of kRowPadding.
struct MovingWindows
{
    /// Column of the first sample of window 0. The pixel before it can be read as well. Row r of a
    /// column is the window's uppermost sample for row r; mnRows + mnHeight - 1 can be read.
    const double* mpColumns = nullptr;
    std::size_t mnPitch = 0;  ///< from a column to the next
    /// For each pixel all bits of row r where its window is summed from scratch, or none.
    const std::uint64_t* mpFresh = nullptr;
    /// Receives the sums of each sample, row by row. The sums of the pixel before stand before
    /// them.
    double* mpSums = nullptr;
    std::size_t mnRows = 0;
    std::size_t mnPixels = 0;
    std::size_t mnStep = 0;   ///< from a pixel to the next: its channels
    std::size_t mnWidth = 0;  ///< of the window, in pixels
    std::size_t mnHeight = 0;
};

/// Moves the sums along the row: of the sum of the pixel before, the samples of the column that
/// leaves the window are subtracted from above, then those of the one that enters are added. A sum
/// from scratch begins at +0.0 and adds the window row by row.
void MoveWindows(const MovingWindows& oWindows);

/// oOut[i] = pIn[i] * 2.0 - pSums[i] / pCounts[i]. oOut may be pSums.
void SharpenRow(const double* pIn, const double* pSums, const double* pCounts,
                std::span<double> oOut);

}  // namespace kor::filters::kernels
