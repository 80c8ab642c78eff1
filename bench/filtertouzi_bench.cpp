#include <benchmark/benchmark.h>

#include <vector>

#include "bench/support.h"
#include "processes/qrdfilters/filtertouzi.h"
#include "tests/support/touzireference.h"

namespace kor::bench
{
namespace
{

constexpr Size kTouziBlock = {512, 512};

/// Windows up to 7 x 7 or 11 x 11 on a block of one-look speckle or on a flat one with a tenth of
/// its contrast.
struct Scene
{
    explicit Scene(const benchmark::State& oState)
        : mnMargin(static_cast<std::uint32_t>(oState.range(0)) / 2),
          mpoIn(SpeckleRaster<double>(kTouziBlock, Margins{mnMargin, mnMargin}, kSeed)),
          mpoOut(MakeRaster<double>(kTouziBlock, Margins{0, 0}))
    {
        if (oState.range(1) != 0)
        {
            for (std::size_t i = 0; i < mpoIn->mnBufferSize / sizeof(double); ++i)
            {
                double& dfSample = reinterpret_cast<double*>(mpoIn->mpBuffer)[i];
                dfSample = 40.0 + (dfSample - 40.0) * 0.1;
            }
        }
    }

    std::uint32_t mnMargin;
    std::unique_ptr<tessel::Raster> mpoIn;
    std::unique_ptr<tessel::Raster> mpoOut;
};

/// FilterTouzi, doubles of intensity to doubles, one look; items are pixels.
void BM_FilterTouzi(benchmark::State& oState)
{
    const Scene oScene(oState);
    filters::FilterTouzi oFilter(1.0);
    oFilter.SetAmplit(1);
    for (auto _ : oState)
    {
        oFilter.Process(oScene.mpoIn.get(), nullptr, oScene.mpoOut.get());
    }
    oState.SetItemsProcessed(oState.iterations() * kTouziBlock.Pixels());
}

/// The definition, pixel by pixel and sum by sum.
void BM_FilterTouziPlain(benchmark::State& oState)
{
    const Scene oScene(oState);
    test::TouziReference oReference;
    oReference.dfLooks = 1.0;
    oReference.nAmplit = 1;
    for (auto _ : oState)
    {
        oReference.Process<double, double>(*oScene.mpoIn, nullptr, *oScene.mpoOut);
    }
    oState.SetItemsProcessed(oState.iterations() * kTouziBlock.Pixels());
}

void SidesAndScenes(benchmark::internal::Benchmark* poBenchmark)
{
    poBenchmark->ArgNames({"side", "flat"})
        ->ArgsProduct({{7, 11}, {0, 1}})
        ->Unit(benchmark::kMillisecond);
}

BENCHMARK(BM_FilterTouzi)->Apply(SidesAndScenes);
BENCHMARK(BM_FilterTouziPlain)->Apply(SidesAndScenes);

}  // namespace
}  // namespace kor::bench
