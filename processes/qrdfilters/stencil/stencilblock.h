#pragma once

#include <cstddef>
#include <cstdint>
#include <functional>
#include <memory>
#include <span>

#include "basic/tessel/mask/mask.h"
#include "basic/tessel/raster/raster.h"
#include "processes/qrdfilters/kernels/stencil.h"
#include "processes/qrdfilters/stencil/sampletypes.h"
#include "processes/qrdfilters/window.h"

/// Filters whose window stands still: each pixel is computed from its own window, without sums that
/// move on. The walk over a block is theirs in common; a filter gives a core on rows of doubles.
namespace kor::filters::stencil
{

/// What becomes of masked samples before a core sees its rows.
enum class MaskedSamples
{
    eCleared,  ///< they are +0.0
    eMarked    ///< they stay, and StencilRows::moValid tells them
};

/// A block to filter, and how. The masks may be null.
struct StencilBlock
{
    StencilBlock(const tessel::Raster& oIn, const tessel::Mask* poMaskIn,
                 const tessel::Raster& oOut, const tessel::Mask* poMaskOut, const Window& oWindow,
                 const SampleTypes& oTypes);

    const tessel::Raster& moIn;
    const tessel::Mask* mpoMaskIn;
    const tessel::Raster& moOut;
    const tessel::Mask* mpoMaskOut;
    Window moWindow;
    SampleTypes moTypes;
    std::unique_ptr<tessel::Raster> mpoValid;  ///< the input mask, 0 or 1 a pixel; null as that is
    MaskedSamples meMasked = MaskedSamples::eMarked;
    std::size_t mnShortestTile = 64;  ///< samples of a row that are worked on together, at least
    std::uint32_t mnGroupRows = 4;    ///< output rows that a core is given at a time
    bool mbCoreStreams = false;       ///< the core can write its results past the caches
};

/// Where a group of output rows stands.
struct StencilPlace
{
    std::int64_t x;
    std::int64_t y;
    /// 0 for background pixels, 1 for the others, row by row; empty where all are computed.
    std::span<const unsigned char> moComputed;
    bool mbStreamed;  ///< the core is to write its results past the caches
};

/// Computes a group of output rows, mnSamples of each; all of moIn may be read and all of oOut
/// written, also for background pixels, whose results are dropped.
using StencilCore = std::function<void(const kernels::StencilRows& oRows,
                                       const StencilPlace& oPlace, std::span<double* const> oOut)>;

/// Filters the rows nFirst to nEnd - 1 of a block, on the calling thread, and writes their
/// background.
void FilterRows(const StencilBlock& oBlock, std::uint32_t nFirst, std::uint32_t nEnd,
                const StencilCore& oCore);

/// Filters all rows of a block, divided among the threads of OpenMP.
void FilterRowsInParallel(const StencilBlock& oBlock, const StencilCore& oCore);

}  // namespace kor::filters::stencil
