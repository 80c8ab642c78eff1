#include <benchmark/benchmark.h>

#include <cstring>

#include "bench/support.h"
#include "processes/qrdfilters/filterari.h"

namespace kor::bench
{
namespace
{

constexpr unsigned int kAdd = 1;
constexpr unsigned int kDivide = 4;
constexpr unsigned int kScaled = 3;

/// FilterARI on one block of speckle, T to T on one thread; bytes are those read and written.
template <class T>
void BM_FilterAri(benchmark::State& oState)
{
    const auto nChannels = static_cast<std::uint32_t>(oState.range(0));
    filters::FilterARI oFilter;
    oFilter.SetOper({static_cast<unsigned int>(oState.range(1))});
    oFilter.SetConst({3.0F});
    oFilter.SetZeroDiv({0.0F});
    oFilter.SetAutoScale({static_cast<unsigned int>(oState.range(2))});
    oFilter.SetRVal({0.0F, 80.0F, 0.0F, 255.0F});
    const auto poIn = SpeckleRaster<T>(kBlock, Margins{0, 0}, kSeed, nChannels);
    const auto poOut = MakeRaster<T>(kBlock, Margins{0, 0});
    for (auto _ : oState)
    {
        oFilter.Process(poIn.get(), nullptr, poOut.get());
    }
    oState.SetBytesProcessed(oState.iterations() * kBlock.Pixels() * (nChannels + 1) *
                             static_cast<std::int64_t>(sizeof(T)));
}

/// memcpy of a block of one channel, beside which an evaluation of one channel stands; bytes are
/// those read and written.
template <class T>
void BM_CopyBesideFilterAri(benchmark::State& oState)
{
    const auto poIn = SpeckleRaster<T>(kBlock, Margins{0, 0}, kSeed);
    const auto poOut = MakeRaster<T>(kBlock, Margins{0, 0});
    for (auto _ : oState)
    {
        std::memcpy(poOut->mpBuffer, poIn->mpBuffer, poIn->mnBufferSize);
        benchmark::ClobberMemory();
    }
    oState.SetBytesProcessed(oState.iterations() * kBlock.Pixels() * 2 *
                             static_cast<std::int64_t>(sizeof(T)));
}

void ChannelsAndOperators(benchmark::internal::Benchmark* poBenchmark)
{
    poBenchmark->ArgNames({"channels", "operator", "scaling"})->UseRealTime();
    poBenchmark->Args({1, kAdd, 0})->Args({1, kAdd, kScaled});
    poBenchmark->Args({2, kDivide, 0})->Args({2, kDivide, kScaled})->Args({4, kDivide, 0});
}

BENCHMARK_TEMPLATE(BM_FilterAri, unsigned char)->Apply(ChannelsAndOperators);
BENCHMARK_TEMPLATE(BM_FilterAri, unsigned short)->Apply(ChannelsAndOperators);
BENCHMARK_TEMPLATE(BM_FilterAri, float)->Apply(ChannelsAndOperators);
BENCHMARK_TEMPLATE(BM_FilterAri, double)->Apply(ChannelsAndOperators);
BENCHMARK_TEMPLATE(BM_CopyBesideFilterAri, unsigned char)->UseRealTime();
BENCHMARK_TEMPLATE(BM_CopyBesideFilterAri, unsigned short)->UseRealTime();
BENCHMARK_TEMPLATE(BM_CopyBesideFilterAri, float)->UseRealTime();
BENCHMARK_TEMPLATE(BM_CopyBesideFilterAri, double)->UseRealTime();

}  // namespace
}  // namespace kor::bench
