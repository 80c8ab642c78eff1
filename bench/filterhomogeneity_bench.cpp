#include <benchmark/benchmark.h>

#include <vector>

#include "bench/support.h"
#include "processes/qrdfilters/filterhomogeneity.h"

namespace kor::bench
{
namespace
{

constexpr int kLevels = 64;
constexpr double kRange = 400.0;

int LevelOfBin(int nBin)
{
    return nBin * kLevels / 65536;
}

/// FilterHomogeneity on one block of 16-bit speckle, 64 levels, one thread; items are pixels.
void BM_Homogeneity(benchmark::State& oState)
{
    const auto nHalf = static_cast<std::uint32_t>(oState.range(0)) / 2;
    std::vector<int> vnTable;
    for (int i = 0; i < 65536; ++i)
    {
        vnTable.push_back(LevelOfBin(i));
    }
    filters::FilterHomogeneity oFilter;
    oFilter.SetMinMax(0.0, kRange);
    oFilter.SetHist2Glev(vnTable);
    const auto poIn = SpeckleRaster<unsigned short>(kBlock, Margins{nHalf, nHalf}, kSeed);
    const auto poOut = MakeRaster<float>(kBlock, Margins{0, 0});
    for (auto _ : oState)
    {
        oFilter.Process(poIn.get(), nullptr, poOut.get());
    }
    oState.SetItemsProcessed(oState.iterations() * kBlock.Pixels());
}

float Level(const tessel::Raster& oIn, std::int64_t x, std::int64_t y)
{
    const double dfSample = *oIn.GetPixelAs<unsigned short>(x, y);
    return dfSample > kRange
               ? 0.0F
               : static_cast<float>(LevelOfBin(static_cast<int>(dfSample * 65535.0 / kRange)));
}

/// The direct computation: for each pixel all pairs of its window, on levels that are looked up
/// before, on a smaller block and one thread; items are pixels.
void BM_HomogeneityPlain(benchmark::State& oState)
{
    constexpr Size kSmallBlock = {256, 256};
    const std::int64_t nHalf = oState.range(0) / 2;
    const std::int64_t nFrame = nHalf + 1;  // one more for the neighbours
    const auto nMargin = static_cast<std::uint32_t>(nFrame);
    const auto poIn = SpeckleRaster<unsigned short>(kSmallBlock, Margins{nMargin, nMargin}, kSeed);
    const std::unique_ptr<tessel::Raster> poOut = MakeRaster<float>(kSmallBlock, Margins{0, 0});
    const std::int64_t nWidth = poIn->mnTotalWidth;
    std::vector<float> vfLevels(poIn->mnBufferSize / sizeof(unsigned short));
    for (auto _ : oState)
    {
        for (std::int64_t i = 0; i < static_cast<std::int64_t>(vfLevels.size()); ++i)
        {
            vfLevels[static_cast<std::size_t>(i)] =
                Level(*poIn, i % nWidth - nFrame, i / nWidth - nFrame);
        }
        for (std::int64_t y = 0; y < kSmallBlock.nHeight; ++y)
        {
            for (std::int64_t x = 0; x < kSmallBlock.nWidth; ++x)
            {
                float fSum = 0.0F;
                for (std::int64_t r = y - nHalf; r <= y + nHalf; ++r)
                {
                    for (std::int64_t c = x - nHalf; c <= x + nHalf; ++c)
                    {
                        const float* const p =
                            &vfLevels[static_cast<std::size_t>((r + nFrame) * nWidth + c + nFrame)];
                        for (const float fOther : {p[1], p[nWidth + 1], p[nWidth], p[nWidth - 1]})
                        {
                            const float d = *p - fOther;
                            const float fSquare = d * d;
                            fSum += static_cast<float>(1.0 / (fSquare + 1.0));
                        }
                    }
                }
                const auto nSide = static_cast<float>(2 * nHalf + 1);
                *poOut->GetPixelAs<float>(x, y) = fSum / (4.0F * nSide * nSide);
            }
        }
        benchmark::ClobberMemory();
    }
    oState.SetItemsProcessed(oState.iterations() * kSmallBlock.Pixels());
}

BENCHMARK(BM_Homogeneity)->ArgName("side")->Arg(3)->Arg(7)->Arg(15)->UseRealTime();
BENCHMARK(BM_HomogeneityPlain)->ArgName("side")->Arg(3)->Arg(7)->Arg(15)->UseRealTime();

}  // namespace
}  // namespace kor::bench
