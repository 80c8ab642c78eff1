#include <benchmark/benchmark.h>

#include <cstring>

#include "bench/support.h"
#include "processes/qrdfilters/image2bit.h"

namespace kor::bench
{
namespace
{

/// ImageToBit on one block of speckle, T to 8 bits on one thread; bytes are those read.
template <class T>
void BM_ImageToBit(benchmark::State& oState)
{
    filters::ImageToBit oFilter;
    oFilter.SetThreshold(oState.range(0) == 1 ? std::vector<float>{40.0F}
                                              : std::vector<float>{20.0F, 60.0F});
    const auto poIn = SpeckleRaster<T>(kBlock, Margins{0, 0}, kSeed);
    const auto poOut = MakeRaster<unsigned char>(kBlock, Margins{0, 0});
    for (auto _ : oState)
    {
        oFilter.Process(poIn.get(), nullptr, poOut.get());
    }
    oState.SetBytesProcessed(oState.iterations() * static_cast<std::int64_t>(poIn->mnBufferSize));
}

/// memcpy of as many bytes.
template <class T>
void BM_CopyBesideImageToBit(benchmark::State& oState)
{
    const auto poIn = SpeckleRaster<T>(kBlock, Margins{0, 0}, kSeed);
    const auto poOut = MakeRaster<T>(kBlock, Margins{0, 0});
    for (auto _ : oState)
    {
        std::memcpy(poOut->mpBuffer, poIn->mpBuffer, poIn->mnBufferSize);
        benchmark::ClobberMemory();
    }
    oState.SetBytesProcessed(oState.iterations() * static_cast<std::int64_t>(poIn->mnBufferSize));
}

void Thresholds(benchmark::internal::Benchmark* poBenchmark)
{
    poBenchmark->ArgName("thresholds")->Arg(1)->Arg(2)->UseRealTime();
}

BENCHMARK_TEMPLATE(BM_ImageToBit, unsigned char)->Apply(Thresholds);
BENCHMARK_TEMPLATE(BM_ImageToBit, unsigned short)->Apply(Thresholds);
BENCHMARK_TEMPLATE(BM_ImageToBit, int)->Apply(Thresholds);
BENCHMARK_TEMPLATE(BM_ImageToBit, float)->Apply(Thresholds);
BENCHMARK_TEMPLATE(BM_ImageToBit, double)->Apply(Thresholds);
BENCHMARK_TEMPLATE(BM_ImageToBit, uint64)->Apply(Thresholds);
BENCHMARK_TEMPLATE(BM_CopyBesideImageToBit, unsigned char)->UseRealTime();
BENCHMARK_TEMPLATE(BM_CopyBesideImageToBit, unsigned short)->UseRealTime();
BENCHMARK_TEMPLATE(BM_CopyBesideImageToBit, float)->UseRealTime();
BENCHMARK_TEMPLATE(BM_CopyBesideImageToBit, double)->UseRealTime();

}  // namespace
}  // namespace kor::bench
