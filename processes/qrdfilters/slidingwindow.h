#pragma once

#include <array>
#include <cstddef>
#include <cstdint>
#include <functional>
#include <span>

#include "basic/tessel/mask/mask.h"
#include "basic/tessel/raster/raster.h"
#include "processes/qrdfilters/window.h"

/// The sliding-window statistics engine: sums over a window around each pixel of a block, at a cost
/// that does not grow with the window.
///
/// A filter gives what a sample adds (its terms) and a finishing function on stretches of rows; the
/// engine owns windows, masks, counts, column and running sums, and the background. Columns are
/// summed over the rows of the window and moved down row by row, subtracting the row that leaves
/// before adding the one that enters; along a row, the window's sum starts afresh at the first
/// pixel (at every pixel of the first row) and moves on by subtracting the column that leaves
/// before adding the one that enters. The rounding of exactly these additions in double is part of
/// every result, and the same on every processor.
namespace kor::filters
{

/// What one valid sample adds to its window's sum.
struct WindowTerm
{
    /// Replaces samples by what is summed in their place; null for the samples themselves.
    using Transform = void (*)(std::span<double> vdfSamples);

    Transform mpfnTransform = nullptr;
    bool mbSquared = false;  ///< the square of the (transformed) sample is summed
};

inline constexpr WindowTerm kSumTerm{};
inline constexpr WindowTerm kSumOfSquaresTerm{nullptr, true};
inline constexpr std::size_t kMostWindowTerms = 2;

/// The statistics of a stretch of one row of a block, sample by sample; the channels of a pixel
/// stand side by side. All arrays may be read up to GetPadded() samples, where what lies behind
/// mnSamples means nothing: a finishing function needs no loop for the rest.
struct WindowStatistics
{
    std::uint32_t mnRow = 0;    ///< row in the block
    std::size_t mnFirst = 0;    ///< first sample in the row: its pixel times the channels
    std::size_t mnSamples = 0;  ///< a whole number of pixels
    std::array<const double*, kMostWindowTerms> mapSums{};  ///< one array a term
    const double* mpCounts = nullptr;                       ///< valid pixels of the window
    const double* mpCentres = nullptr;  ///< the sample in the middle of the window

    std::size_t GetPadded() const { return (mnSamples + 7) / 8 * 8; }
};

/// Takes the statistics of one stretch. Called on one thread, stretch by stretch from the left in
/// each row; a few rows take turns.
using VisitWindows = std::function<void(const WindowStatistics& oStatistics)>;

/// Makes the output samples of one stretch: vdfOut holds GetPadded() samples and all of them may be
/// written. What it gives for background pixels is dropped.
using FinishWindows =
    std::function<void(const WindowStatistics& oStatistics, std::span<double> vdfOut)>;

/// Hands out the window statistics of every pixel of oIn, whose samples are of type TSample: float
/// or double. Pixels masked in poMaskIn, which may be null and else has the margins of oIn, enter
/// no window. The margins must hold the window; hardened builds throw kor::Exception where they do
/// not.
template <class TSample>
void ScanWindows(const tessel::Raster& oIn, const tessel::Mask* poMaskIn, const Window& oWindow,
                 std::span<const WindowTerm> oTerms, const VisitWindows& oVisit);

/// Filters oIn into oOut, both of TSample: the finishing function on every pixel, but background
/// (0, or the input with bBGZero false) where a bit of either mask is cleared. Both masks may be
/// null. oOut has the input's size and channels; its margins are not written.
template <class TSample>
void FilterWindowRows(const tessel::Raster& oIn, const tessel::Mask* poMaskIn,
                      const Window& oWindow, std::span<const WindowTerm> oTerms, bool bBGZero,
                      const FinishWindows& oFinish, tessel::Raster& oOut,
                      const tessel::Mask* poMaskOut);

}  // namespace kor::filters
