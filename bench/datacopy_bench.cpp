#include "processes/qrdfilters/datacopy.h"

#include <benchmark/benchmark.h>

#include <cstring>
#include <memory>
#include <random>

#include "basic/core/typedispatch/typelist.h"

// One block of 4096 x 4096 samples on one channel. Items are samples; bytes are those read and
// those written, so that copies and memcpy compare.
namespace kor::filters
{
namespace
{

constexpr std::uint32_t kSide = 4096;
constexpr std::size_t kSamples = std::size_t{kSide} * kSide;
constexpr unsigned int kSeed = 1;

template <class T>
std::unique_ptr<tessel::Raster> MakeBlock()
{
    auto poRaster = std::make_unique<tessel::Raster>(
        tessel::RasterInfo(kSide, kSide, 1, typedispatch::RealDataType<T>()),
        tessel::RasterContext());
    std::mt19937_64 oRandom(kSeed);
    T* pSamples = poRaster->GetPixelAs<T>(0, 0);
    for (std::size_t i = 0; i < kSamples; ++i)
    {
        pSamples[i] = static_cast<T>(oRandom() % 1000);
    }
    return poRaster;
}

/// Squares of nSide pixels, each valid with probability one half.
tessel::Mask MakeMask(std::uint32_t nSide)
{
    std::mt19937_64 oRandom(kSeed);
    const std::uint32_t nSquares = (kSide + nSide - 1) / nSide;
    std::vector<unsigned char> vSquares(std::size_t{nSquares} * nSquares);
    for (unsigned char& nSquare : vSquares)
    {
        nSquare = static_cast<unsigned char>(oRandom() & 1U);
    }
    std::vector<unsigned char> vPixels(kSamples);
    for (std::size_t i = 0; i < kSamples; ++i)
    {
        vPixels[i] = vSquares[i / kSide / nSide * nSquares + i % kSide / nSide];
    }
    return tessel::Mask({kSide, kSide, 1, tessel::eDT_8U}, {}, vPixels.data(), false, false);
}

template <class TIn, class TOut>
void Count(benchmark::State& oState)
{
    const auto nSamples = static_cast<std::int64_t>(oState.iterations() * kSamples);
    oState.SetItemsProcessed(nSamples);
    oState.SetBytesProcessed(nSamples * static_cast<std::int64_t>(sizeof(TIn) + sizeof(TOut)));
}

template <class TIn, class TOut>
void BM_QRDDataCopy(benchmark::State& oState)
{
    const auto poIn = MakeBlock<TIn>();
    const auto poOut = MakeBlock<TOut>();
    const QRDDataCopy oCopy;
    for (auto _ : oState)
    {
        oCopy.Process(poIn.get(), nullptr, poOut.get());
    }
    Count<TIn, TOut>(oState);
}

// The argument is the side of the squares that are masked or not.
template <class TIn, class TOut>
void BM_QRDDataCopyMasked(benchmark::State& oState)
{
    const auto poIn = MakeBlock<TIn>();
    const auto poOut = MakeBlock<TOut>();
    tessel::Mask oMask = MakeMask(static_cast<std::uint32_t>(oState.range(0)));
    const QRDDataCopy oCopy;
    for (auto _ : oState)
    {
        oCopy.Process(poIn.get(), &oMask, poOut.get());
    }
    Count<TIn, TOut>(oState);
}

// Moves as many bytes as the copy: half of them are read and half are written.
template <class TIn, class TOut>
void BM_CopyMemcpy(benchmark::State& oState)
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

/// Gives every block the same mask.
class MaskClip : public tessel::IMaskBuilder
{
public:
    tessel::Mask* BuildMask(const tessel::Raster& oRaster) const override
    {
        std::vector<unsigned char> vnBits = moMask.moBits;
        return new tessel::Mask(oRaster, oRaster, vnBits.data(), false, true);
    }

private:
    tessel::Mask moMask = MakeMask(256);
};

// 16 bits onto 16 bits with balanced colours; with a blend width the clip mask and its distances
// are part of the time.
void BM_ExtendedDataCopy(benchmark::State& oState)
{
    const auto poIn = MakeBlock<unsigned short>();
    const auto poOut = MakeBlock<unsigned short>();
    MaskClip oClip;
    ExtendedDataCopy oCopy;
    oCopy.SetBlendWidth(static_cast<int>(oState.range(0)));
    oCopy.SetClipBuilder(oState.range(0) != 0 ? &oClip : nullptr);
    oCopy.SetFixedGain(true);
    oCopy.SetGain(1.25);
    oCopy.SetOffset(3.0);
    oCopy.SetProcessStage(ePS_Apply);
    for (auto _ : oState)
    {
        oCopy.ProcessBlock(poIn.get(), poOut.get());
    }
    Count<unsigned short, unsigned short>(oState);
}

BENCHMARK(BM_QRDDataCopy<unsigned short, unsigned short>)->UseRealTime();
BENCHMARK(BM_CopyMemcpy<unsigned short, unsigned short>)->UseRealTime();
BENCHMARK(BM_QRDDataCopy<unsigned short, float>)->UseRealTime();
BENCHMARK(BM_CopyMemcpy<unsigned short, float>)->UseRealTime();
BENCHMARK(BM_QRDDataCopyMasked<unsigned short, float>)
    ->ArgName("square")
    ->Arg(1)
    ->Arg(64)
    ->UseRealTime();
BENCHMARK(BM_ExtendedDataCopy)->ArgName("blend")->Arg(0)->Arg(8)->UseRealTime();

}  // namespace
}  // namespace kor::filters
