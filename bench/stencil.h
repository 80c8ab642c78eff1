#pragma once

#include <benchmark/benchmark.h>

#include <memory>
#include <random>
#include <vector>

#include "basic/tessel/mask/mask.h"
#include "bench/support.h"
#include "platform/system/omp.h"

/// Benchmarks of filters with a window that stands still: the filter, the same beside masks, and
/// the plain loop that defines it, on one thread. Items are pixels.
namespace kor::bench
{

inline constexpr Size kStencilBlock = {4096, 4096};
inline constexpr Size kPlainBlock = {1024, 1024};

/// Clears the left eighth of the block and its first row.
inline std::unique_ptr<tessel::Mask> EdgeMask(const tessel::Raster& oRaster)
{
    std::vector<unsigned char> vValid(std::size_t{oRaster.mnTotalWidth} * oRaster.mnTotalHeight);
    for (std::size_t i = 0; i < vValid.size(); ++i)
    {
        const bool bValid =
            i % oRaster.mnTotalWidth >= oRaster.mnWidth / 8 && i >= oRaster.mnTotalWidth;
        vValid[i] = bValid ? 1 : 0;
    }
    return std::make_unique<tessel::Mask>(oRaster, oRaster, vValid.data(), false, false);
}

/// Clears one pixel of twenty, anywhere: hardly a window is without a masked pixel.
inline std::unique_ptr<tessel::Mask> ScatteredMask(const tessel::Raster& oRaster)
{
    std::mt19937_64 oRandom(kSeed);
    std::bernoulli_distribution oValid(0.95);
    std::vector<unsigned char> vValid(std::size_t{oRaster.mnTotalWidth} * oRaster.mnTotalHeight);
    for (unsigned char& nByte : vValid)
    {
        nByte = oValid(oRandom) ? 1 : 0;
    }
    return std::make_unique<tessel::Mask>(oRaster, oRaster, vValid.data(), false, false);
}

enum MaskKind
{
    eNoMask,
    eEdgeMask,
    eScatteredMask
};

inline std::unique_ptr<tessel::Mask> MakeMask(std::int64_t nKind, const tessel::Raster& oRaster)
{
    return nKind == eNoMask     ? nullptr
           : nKind == eEdgeMask ? EdgeMask(oRaster)
                                : ScatteredMask(oRaster);
}

/// Runs oFilter(in, maskIn, out) on a block of T to T under a mask of the given kind.
template <class T, class Filter>
void MeasureStencil(benchmark::State& oState, Size oSize, Margins oMargins, std::int64_t nMask,
                    const Filter& oFilter)
{
    const OMPThreadCount oOne(1);
    const auto poIn = SpeckleRaster<T>(oSize, oMargins, kSeed);
    const auto poOut = MakeRaster<T>(oSize, Margins{0, 0});
    const auto poMask = MakeMask(nMask, *poIn);
    for (auto _ : oState)
    {
        oFilter(poIn.get(), poMask.get(), poOut.get());
        benchmark::ClobberMemory();
    }
    oState.SetItemsProcessed(oState.iterations() * oSize.Pixels());
}

}  // namespace kor::bench
