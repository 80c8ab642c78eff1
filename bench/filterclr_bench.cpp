#include <benchmark/benchmark.h>

#include <cstring>

#include "bench/support.h"
#include "platform/system/omp.h"
#include "processes/qrdfilters/filterclr.h"

namespace kor::bench
{
namespace
{

/// FilterClr in place on one block of three channels and one thread; bytes are those written.
/// uniform 1: one value, whose bytes are all alike; 0: a value a channel.
template <class T>
void BM_FilterClr(benchmark::State& oState)
{
    const OMPThreadCount oThreads(1);
    const bool bUniform = oState.range(0) != 0;
    const filters::FilterClr oFilter(bUniform ? std::vector<double>{0}
                                              : std::vector<double>{1, 2, 3});
    const auto poOut = MakeRaster<T>(kBlock, Margins{0, 0}, 3);
    for (auto _ : oState)
    {
        oFilter.Process(nullptr, nullptr, poOut.get());
    }
    oState.SetBytesProcessed(oState.iterations() * static_cast<std::int64_t>(poOut->mnBufferSize));
}

/// The same with a mask that keeps squares of 64 pixels of the input; bytes are those written.
template <class T>
void BM_FilterClrMasked(benchmark::State& oState)
{
    const OMPThreadCount oThreads(1);
    const filters::FilterClr oFilter({1, 2, 3});
    const auto poIn = SpeckleRaster<T>(kBlock, Margins{0, 0}, kSeed, 3);
    const auto poOut = MakeRaster<T>(kBlock, Margins{0, 0}, 3);
    std::vector<unsigned char> vCleared(static_cast<std::size_t>(kBlock.Pixels()));
    for (std::size_t i = 0; i < vCleared.size(); ++i)
    {
        vCleared[i] = (i / 64 + i / kBlock.nWidth / 64) % 2 == 0 ? 1 : 0;
    }
    tessel::Mask oMask(*poIn, *poIn, vCleared.data(), false, false);
    for (auto _ : oState)
    {
        oFilter.Process(poIn.get(), &oMask, poOut.get());
    }
    oState.SetBytesProcessed(oState.iterations() * static_cast<std::int64_t>(poOut->mnBufferSize));
}

/// memcpy of as many bytes.
template <class T>
void BM_CopyBesideFilterClr(benchmark::State& oState)
{
    const auto poIn = SpeckleRaster<T>(kBlock, Margins{0, 0}, kSeed, 3);
    const auto poOut = MakeRaster<T>(kBlock, Margins{0, 0}, 3);
    for (auto _ : oState)
    {
        std::memcpy(poOut->mpBuffer, poIn->mpBuffer, poIn->mnBufferSize);
        benchmark::ClobberMemory();
    }
    oState.SetBytesProcessed(oState.iterations() * static_cast<std::int64_t>(poOut->mnBufferSize));
}

BENCHMARK_TEMPLATE(BM_FilterClr, unsigned char)->ArgName("uniform")->Arg(0)->Arg(1)->UseRealTime();
BENCHMARK_TEMPLATE(BM_FilterClr, float)->ArgName("uniform")->Arg(0)->Arg(1)->UseRealTime();
BENCHMARK_TEMPLATE(BM_FilterClrMasked, unsigned char)->UseRealTime();
BENCHMARK_TEMPLATE(BM_FilterClrMasked, float)->UseRealTime();
BENCHMARK_TEMPLATE(BM_CopyBesideFilterClr, unsigned char)->UseRealTime();
BENCHMARK_TEMPLATE(BM_CopyBesideFilterClr, float)->UseRealTime();

}  // namespace
}  // namespace kor::bench
