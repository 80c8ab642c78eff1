#include "processes/qrdfilters/filterhom.h"

#include <benchmark/benchmark.h>

#include <cstring>
#include <vector>

#include "bench/support.h"

namespace kor::bench
{
namespace
{

std::vector<int> Table()
{
    std::vector<int> vnTable(256);
    for (std::size_t i = 0; i < vnTable.size(); ++i)
    {
        vnTable[i] = static_cast<int>(i * 37 % 256);
    }
    return vnTable;
}

/// One block of speckle mapped by a table of 256 entries; items are pixels.
template <class TIn, class TOut>
void BM_FilterHOM(benchmark::State& oState)
{
    filters::FilterHOM oFilter;
    oFilter.SetMeanMode(Table());
    const auto poIn = SpeckleRaster<TIn>(kBlock, Margins{0, 0}, kSeed);
    const auto poOut = MakeRaster<TOut>(kBlock, Margins{0, 0});
    for (auto _ : oState)
    {
        oFilter.Process(poIn.get(), nullptr, poOut.get());
    }
    oState.SetItemsProcessed(oState.iterations() * kBlock.Pixels());
}

/// The definition pixel by pixel.
template <class TIn, class TOut>
void BM_FilterHOMPlain(benchmark::State& oState)
{
    const std::vector<int> vnTable = Table();
    const auto poIn = SpeckleRaster<TIn>(kBlock, Margins{0, 0}, kSeed);
    const auto poOut = MakeRaster<TOut>(kBlock, Margins{0, 0});
    for (auto _ : oState)
    {
        const TIn* pIn = reinterpret_cast<const TIn*>(poIn->mpBuffer);
        TOut* pOut = reinterpret_cast<TOut*>(poOut->mpBuffer);
        for (std::int64_t i = 0; i < kBlock.Pixels(); ++i)
        {
            const auto nIndex = static_cast<std::size_t>(static_cast<int>(pIn[i]));
            const double dfValue = nIndex < vnTable.size() ? vnTable[nIndex] + 0.5 : 0.5;
            pOut[i] = static_cast<TOut>(dfValue);
        }
        benchmark::ClobberMemory();
    }
    oState.SetItemsProcessed(oState.iterations() * kBlock.Pixels());
}

/// As many bytes read and written as by the filter from 8 bits to 8 bits.
void BM_CopyHOM(benchmark::State& oState)
{
    const auto poIn = SpeckleRaster<unsigned char>(kBlock, Margins{0, 0}, kSeed);
    const auto poOut = MakeRaster<unsigned char>(kBlock, Margins{0, 0});
    for (auto _ : oState)
    {
        std::memcpy(poOut->mpBuffer, poIn->mpBuffer, poIn->mnBufferSize);
        benchmark::ClobberMemory();
    }
    oState.SetItemsProcessed(oState.iterations() * kBlock.Pixels());
}

BENCHMARK_TEMPLATE(BM_FilterHOM, unsigned char, unsigned char);
BENCHMARK_TEMPLATE(BM_FilterHOMPlain, unsigned char, unsigned char);
BENCHMARK(BM_CopyHOM);
BENCHMARK_TEMPLATE(BM_FilterHOM, unsigned short, short);
BENCHMARK_TEMPLATE(BM_FilterHOMPlain, unsigned short, short);
BENCHMARK_TEMPLATE(BM_FilterHOM, float, float);
BENCHMARK_TEMPLATE(BM_FilterHOMPlain, float, float);

}  // namespace
}  // namespace kor::bench
