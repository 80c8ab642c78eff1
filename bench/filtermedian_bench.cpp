#include <benchmark/benchmark.h>

#include <vector>

#include "bench/support.h"
#include "platform/system/omp.h"
#include "processes/qrdfilters/filtermedian.h"

namespace kor::bench
{
namespace
{

/// FilterMedian on one block of speckle, T to T; items are pixels.
template <class T>
void BM_FilterMedian(benchmark::State& oState)
{
    const auto nHalf = static_cast<std::uint32_t>(oState.range(0)) / 2;
    const OMPThreadCount oThreads(static_cast<int>(oState.range(1)));
    const filters::FilterMedian oFilter;
    const auto poIn = SpeckleRaster<T>(kBlock, Margins{nHalf, nHalf}, kSeed);
    const auto poOut = MakeRaster<T>(kBlock, Margins{0, 0});
    for (auto _ : oState)
    {
        oFilter.Process(poIn.get(), nullptr, poOut.get(), nullptr);
    }
    oState.SetItemsProcessed(oState.iterations() * kBlock.Pixels());
}

/// The definition: the samples of the window as doubles, and the one in the middle.
template <class T>
T PlainMedian(const tessel::Raster& oIn, std::int64_t x, std::int64_t y)
{
    const auto nHalf = std::int64_t{oIn.mnMarginX};
    std::vector<double> vdfWindow;
    for (std::int64_t r = y - nHalf; r <= y + nHalf; ++r)
    {
        const T* pRow = oIn.GetPixelAs<T>(x - nHalf, r);
        vdfWindow.insert(vdfWindow.end(), pRow, pRow + 2 * nHalf + 1);
    }
    const auto itMiddle = vdfWindow.begin() + static_cast<std::ptrdiff_t>(vdfWindow.size() / 2);
    std::nth_element(vdfWindow.begin(), itMiddle, vdfWindow.end());
    return static_cast<T>(*itMiddle);
}

/// The definition pixel by pixel, on a smaller block and one thread; items are pixels.
template <class T>
void BM_PlainMedian(benchmark::State& oState)
{
    constexpr Size kSmallBlock = {256, 256};
    const auto nHalf = static_cast<std::uint32_t>(oState.range(0)) / 2;
    const auto poIn = SpeckleRaster<T>(kSmallBlock, Margins{nHalf, nHalf}, kSeed);
    const std::unique_ptr<tessel::Raster> poOut = MakeRaster<T>(kSmallBlock, Margins{0, 0});
    for (auto _ : oState)
    {
        T* pOut = reinterpret_cast<T*>(poOut->mpBuffer);
        for (std::uint32_t y = 0; y < kSmallBlock.nHeight; ++y)
        {
            for (std::uint32_t x = 0; x < kSmallBlock.nWidth; ++x)
            {
                *pOut++ = PlainMedian<T>(*poIn, x, y);
            }
        }
        benchmark::ClobberMemory();
    }
    oState.SetItemsProcessed(oState.iterations() * kSmallBlock.Pixels());
}

void SidesAndThreads(benchmark::internal::Benchmark* poBenchmark)
{
    poBenchmark->ArgNames({"side", "threads"})->UseRealTime();
    poBenchmark->ArgsProduct({{3, 5, 7, 9}, {1, OMPGetMaxThreads()}});
}

BENCHMARK_TEMPLATE(BM_FilterMedian, unsigned char)->Apply(SidesAndThreads);
BENCHMARK_TEMPLATE(BM_FilterMedian, unsigned short)->Apply(SidesAndThreads);
BENCHMARK_TEMPLATE(BM_FilterMedian, float)->Apply(SidesAndThreads);
BENCHMARK_TEMPLATE(BM_FilterMedian, double)->Apply(SidesAndThreads);
BENCHMARK_TEMPLATE(BM_PlainMedian, unsigned char)->ArgName("side")->Arg(3)->Arg(5)->Arg(7);
BENCHMARK_TEMPLATE(BM_PlainMedian, unsigned short)->ArgName("side")->Arg(3)->Arg(5)->Arg(7);
BENCHMARK_TEMPLATE(BM_PlainMedian, float)->ArgName("side")->Arg(3)->Arg(5)->Arg(7);
BENCHMARK_TEMPLATE(BM_PlainMedian, double)->ArgName("side")->Arg(3)->Arg(5)->Arg(7);

}  // namespace
}  // namespace kor::bench
