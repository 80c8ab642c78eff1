#pragma once

#include <benchmark/benchmark.h>

#include <memory>
#include <random>
#include <vector>

#include "basic/tessel/mask/mask.h"
#include "bench/support.h"
#include "processes/qrdfilters/window.h"
#include "tests/support/plainwindow.h"

/// What the benchmarks of filters on windows share: a window of 7 x 7 on one block of speckle, on
/// one thread, with and without an input mask, and the same by the plain loop that defines it.
namespace kor::bench
{

inline constexpr std::uint32_t kHalfWindow = 3;

/// A block for a state with the arguments channels and masked. A tenth of the pixels is masked.
template <class TSample>
struct WindowBlock
{
    explicit WindowBlock(const benchmark::State& oState)
        : mnChannels(static_cast<std::uint32_t>(oState.range(0))),
          mpoIn(SpeckleRaster<TSample>(kBlock, kMargins, kSeed, mnChannels)),
          mpoOut(MakeRaster<TSample>(kBlock, Margins{}, mnChannels))
    {
        if (oState.range(1) != 0)
        {
            std::mt19937_64 oRandom(kSeed);
            std::bernoulli_distribution oValid(0.9);
            std::vector<unsigned char> vValid(std::size_t{mpoIn->mnTotalWidth} *
                                              mpoIn->mnTotalHeight);
            std::generate(vValid.begin(), vValid.end(),
                          [&] { return static_cast<unsigned char>(oValid(oRandom) ? 1 : 0); });
            mpoMask = std::make_unique<tessel::Mask>(*mpoIn, *mpoIn, vValid.data(), false, false);
        }
    }

    static constexpr Margins kMargins = {kHalfWindow, kHalfWindow};

    std::uint32_t mnChannels;
    std::unique_ptr<tessel::Raster> mpoIn;
    std::unique_ptr<tessel::Raster> mpoOut;
    std::unique_ptr<tessel::Mask> mpoMask;
};

/// Items are samples, pixels times channels.
template <class TSample, class Filter>
void MeasureFilter(benchmark::State& oState, const Filter& oFilter)
{
    const WindowBlock<TSample> oBlock(oState);
    for (auto _ : oState)
    {
        oFilter.Process(oBlock.mpoIn.get(), oBlock.mpoMask.get(), oBlock.mpoOut.get(), nullptr);
    }
    oState.SetItemsProcessed(oState.iterations() * kBlock.Pixels() * oBlock.mnChannels);
}

/// The same by plain loops; oFinish(sums, centre) makes the result from WindowSums<Terms>.
template <class TSample, class Terms, class Finish>
void MeasurePlainFilter(benchmark::State& oState, const Finish& oFinish)
{
    const WindowBlock<TSample> oBlock(oState);
    for (auto _ : oState)
    {
        test::FilterPlainly<TSample, Terms>(*oBlock.mpoIn, oBlock.mpoMask.get(),
                                            {kHalfWindow, kHalfWindow}, true, oFinish,
                                            *oBlock.mpoOut, nullptr);
    }
    oState.SetItemsProcessed(oState.iterations() * kBlock.Pixels() * oBlock.mnChannels);
}

inline void OneChannel(benchmark::internal::Benchmark* poBenchmark)
{
    poBenchmark->ArgNames({"channels", "masked"})
        ->ArgsProduct({{1}, {0, 1}})
        ->Unit(benchmark::kMillisecond);
}

inline void OneAndThreeChannels(benchmark::internal::Benchmark* poBenchmark)
{
    poBenchmark->ArgNames({"channels", "masked"})
        ->ArgsProduct({{1, 3}, {0, 1}})
        ->Unit(benchmark::kMillisecond);
}

}  // namespace kor::bench
