#include "processes/qrdfilters/convertraster.h"

#include <benchmark/benchmark.h>

#include <cstring>
#include <memory>
#include <random>

#include "processes/qrdfilters/sampleconversion.h"

// One block of 4096 x 4096 samples on one thread. Items are samples; bytes are those read and those
// written, so that the three ways compare.
namespace kor::filters
{
namespace
{

constexpr std::uint32_t kSide = 4096;
constexpr std::size_t kSamples = std::size_t{kSide} * kSide;

template <class T>
std::unique_ptr<tessel::Raster> MakeBlock()
{
    auto poRaster = std::make_unique<tessel::Raster>(
        tessel::RasterInfo(kSide, kSide, 1, typedispatch::RealDataType<T>()),
        tessel::RasterContext());
    std::mt19937_64 oRandom(1);
    T* pSamples = poRaster->GetPixelAs<T>(0, 0);
    for (std::size_t i = 0; i < kSamples; ++i)
    {
        // 0 to 255.99: a tenth of it above, where 8 bits are clamped.
        pSamples[i] = static_cast<T>(static_cast<double>(oRandom() % 25600) / 90.0);
    }
    return poRaster;
}

template <class TIn, class TOut>
void Count(benchmark::State& oState)
{
    const auto nSamples = static_cast<std::int64_t>(oState.iterations() * kSamples);
    oState.SetItemsProcessed(nSamples);
    oState.SetBytesProcessed(nSamples * static_cast<std::int64_t>(sizeof(TIn) + sizeof(TOut)));
}

template <class TIn, class TOut>
void BM_ConvertRaster(benchmark::State& oState)
{
    const auto poIn = MakeBlock<TIn>();
    const auto poOut = MakeBlock<TOut>();
    for (auto _ : oState)
    {
        ConvertRaster(poIn.get(), poOut.get());
    }
    Count<TIn, TOut>(oState);
}

template <class TIn, class TOut>
void BM_PlainLoop(benchmark::State& oState)
{
    const auto poIn = MakeBlock<TIn>();
    const auto poOut = MakeBlock<TOut>();
    for (auto _ : oState)
    {
        const TIn* pIn = poIn->template GetPixelAs<TIn>(0, 0);
        TOut* pOut = poOut->template GetPixelAs<TOut>(0, 0);
        for (std::size_t i = 0; i < kSamples; ++i)
        {
            pOut[i] = ConvertSample<TIn, TOut>(pIn[i]);
        }
        benchmark::ClobberMemory();
    }
    Count<TIn, TOut>(oState);
}

// Moves as many bytes as the conversion: half of them are read and half are written.
template <class TIn, class TOut>
void BM_Memcpy(benchmark::State& oState)
{
    constexpr std::size_t kBytes = kSamples * (sizeof(TIn) + sizeof(TOut)) / 2;
    const auto pIn = std::make_unique<unsigned char[]>(kBytes);
    const auto pOut = std::make_unique<unsigned char[]>(kBytes);
    for (auto _ : oState)
    {
        std::memcpy(pOut.get(), pIn.get(), kBytes);
        benchmark::ClobberMemory();
    }
    Count<TIn, TOut>(oState);
}

BENCHMARK(BM_ConvertRaster<double, unsigned char>)->UseRealTime();
BENCHMARK(BM_PlainLoop<double, unsigned char>)->UseRealTime();
BENCHMARK(BM_Memcpy<double, unsigned char>)->UseRealTime();
BENCHMARK(BM_ConvertRaster<unsigned char, double>)->UseRealTime();
BENCHMARK(BM_PlainLoop<unsigned char, double>)->UseRealTime();
BENCHMARK(BM_Memcpy<unsigned char, double>)->UseRealTime();
BENCHMARK(BM_ConvertRaster<float, unsigned short>)->UseRealTime();
BENCHMARK(BM_PlainLoop<float, unsigned short>)->UseRealTime();
BENCHMARK(BM_Memcpy<float, unsigned short>)->UseRealTime();
BENCHMARK(BM_ConvertRaster<unsigned short, float>)->UseRealTime();
BENCHMARK(BM_PlainLoop<unsigned short, float>)->UseRealTime();
BENCHMARK(BM_Memcpy<unsigned short, float>)->UseRealTime();

}  // namespace
}  // namespace kor::filters
