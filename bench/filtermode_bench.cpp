// FilterMode on one block, one thread, beside the definition pixel by pixel. Items are pixels.

#include <benchmark/benchmark.h>

#include <cmath>
#include <vector>

#include "bench/support.h"
#include "platform/system/omp.h"
#include "processes/qrdfilters/filtermode.h"

namespace kor::bench
{
namespace
{

/// Classes 0 to 8 in patches of about 16 pixels, a tenth of the pixels being noise: the map that a
/// mode filter is for. With bNoise, speckle in which hardly a value comes twice.
template <class T>
std::unique_ptr<tessel::Raster> ModeRaster(Size oSize, std::uint32_t nHalf, bool bNoise)
{
    if (bNoise)
    {
        return SpeckleRaster<T>(oSize, Margins{nHalf, nHalf}, kSeed);
    }
    auto poRaster = MakeRaster<T>(oSize, Margins{nHalf, nHalf});
    std::mt19937_64 oRandom(kSeed);
    T* pSample = reinterpret_cast<T*>(poRaster->mpBuffer);
    for (std::uint32_t y = 0; y < poRaster->mnTotalHeight; ++y)
    {
        for (std::uint32_t x = 0; x < poRaster->mnTotalWidth; ++x)
        {
            const std::uint32_t nPatch = (x / 16 * 7919 + y / 16 * 104729) % 9;
            *pSample++ = static_cast<T>(oRandom() % 10 == 0 ? oRandom() % 9 : nPatch);
        }
    }
    return poRaster;
}

std::unique_ptr<tessel::Mask> SparseMask(const tessel::Raster& oIn)
{
    std::mt19937_64 oRandom(kSeed);
    std::vector<unsigned char> vValid(std::size_t{oIn.mnTotalWidth} * oIn.mnTotalHeight);
    for (unsigned char& nByte : vValid)
    {
        nByte = oRandom() % 100 == 0 ? 0 : 1;
    }
    return std::make_unique<tessel::Mask>(oIn, oIn, vValid.data(), false, false);
}

/// masked: an input mask that clears one pixel of a hundred.
template <class T>
void BM_FilterMode(benchmark::State& oState)
{
    const OMPThreadCount oThreads(1);
    const auto nHalf = static_cast<std::uint32_t>(oState.range(0)) / 2;
    const auto poIn = ModeRaster<T>(kBlock, nHalf, oState.range(1) != 0);
    const auto poMask = oState.range(2) != 0 ? SparseMask(*poIn) : nullptr;
    const auto poOut = MakeRaster<T>(kBlock, Margins{0, 0});
    const filters::FilterMode oFilter;
    for (auto _ : oState)
    {
        oFilter.Process(poIn.get(), poMask.get(), poOut.get(), nullptr);
    }
    oState.SetItemsProcessed(oState.iterations() * kBlock.Pixels());
}

/// The definition for one window: each value is counted once, the first time it is met.
double PlainMode(const std::vector<double>& vdfWindow, std::vector<int>& vnCounts,
                 std::vector<int>& vnFlags)
{
    const std::size_t nArea = vdfWindow.size();
    double dfMode = vdfWindow[nArea / 2];
    int nBest = 1;
    std::fill(vnCounts.begin(), vnCounts.end(), 0);
    std::fill(vnFlags.begin(), vnFlags.end(), 0);
    for (std::size_t i = 0; i + 1 < nArea; ++i)
    {
        if (vnFlags[i] != 0)
        {
            continue;
        }
        vnCounts[i] = 1;
        vnFlags[i] = 1;
        for (std::size_t j = i + 1; j < nArea; ++j)
        {
            if (vdfWindow[i] == vdfWindow[j] && vnFlags[j] == 0)
            {
                ++vnCounts[i];
                vnFlags[j] = 1;
            }
        }
        const bool bCentre = vdfWindow[i] == vdfWindow[nArea / 2];
        if (vnCounts[i] > nBest || (vnCounts[i] != 1 && vnCounts[i] == nBest && bCentre))
        {
            dfMode = vdfWindow[i];
            nBest = vnCounts[i];
        }
    }
    return dfMode;
}

/// On a smaller block; the mask is left out.
template <class T>
void BM_FilterModePlain(benchmark::State& oState)
{
    constexpr Size kSmallBlock = {256, 256};
    const auto nHalf = static_cast<std::uint32_t>(oState.range(0)) / 2;
    const std::unique_ptr<tessel::Raster> poIn =
        ModeRaster<T>(kSmallBlock, nHalf, oState.range(1) != 0);
    const auto poOut = MakeRaster<T>(kSmallBlock, Margins{0, 0});
    const std::size_t nSide = 2 * nHalf + 1;
    std::vector<double> vdfWindow(nSide * nSide);
    std::vector<int> vnCounts(vdfWindow.size());
    std::vector<int> vnFlags(vdfWindow.size());
    for (auto _ : oState)
    {
        T* pOut = reinterpret_cast<T*>(poOut->mpBuffer);
        for (std::int64_t i = 0; i < kSmallBlock.Pixels(); ++i)
        {
            double* pWindow = vdfWindow.data();
            for (std::size_t r = 0; r < nSide; ++r)
            {
                const T* pRow = poIn->GetPixelAs<T>(
                    i % kSmallBlock.nWidth - nHalf,
                    i / kSmallBlock.nWidth + static_cast<std::int64_t>(r) - nHalf);
                pWindow = std::copy_n(pRow, nSide, pWindow);
            }
            *pOut++ = static_cast<T>(PlainMode(vdfWindow, vnCounts, vnFlags));
        }
        benchmark::ClobberMemory();
    }
    oState.SetItemsProcessed(oState.iterations() * kSmallBlock.Pixels());
}

void Cases(benchmark::internal::Benchmark* poBenchmark)
{
    poBenchmark->ArgNames({"side", "noise", "masked"})->Unit(benchmark::kMillisecond);
    poBenchmark->UseRealTime()->ArgsProduct({{3, 5, 7, 11, 15}, {0, 1}, {0}});
    poBenchmark->Args({7, 0, 1});
}

void PlainCases(benchmark::internal::Benchmark* poBenchmark)
{
    poBenchmark->ArgNames({"side", "noise", "masked"})->Unit(benchmark::kMillisecond);
    poBenchmark->UseRealTime()->ArgsProduct({{3, 5, 7, 11, 15}, {0, 1}, {0}});
}

BENCHMARK_TEMPLATE(BM_FilterMode, unsigned char)->Apply(Cases);
BENCHMARK_TEMPLATE(BM_FilterMode, unsigned short)->Apply(Cases);
BENCHMARK_TEMPLATE(BM_FilterMode, float)->Apply(Cases);
BENCHMARK_TEMPLATE(BM_FilterMode, double)->Apply(Cases);
BENCHMARK_TEMPLATE(BM_FilterModePlain, unsigned char)->Apply(PlainCases);
BENCHMARK_TEMPLATE(BM_FilterModePlain, unsigned short)->Apply(PlainCases);
BENCHMARK_TEMPLATE(BM_FilterModePlain, float)->Apply(PlainCases);
BENCHMARK_TEMPLATE(BM_FilterModePlain, double)->Apply(PlainCases);

}  // namespace
}  // namespace kor::bench
