#include <benchmark/benchmark.h>

#include <cmath>
#include <memory>
#include <random>
#include <vector>

#include "bench/support.h"
#include "processes/qrdfilters/filterfefrost.h"
#include "processes/qrdfilters/filterffrost.h"
#include "processes/qrdfilters/localstatistics.h"

namespace kor::bench
{
namespace
{

constexpr Size kFrostBlock = {1024, 1024};
constexpr std::uint32_t kHalf = 3;
constexpr Margins kMargins = {kHalf, kHalf};

/// One pixel in ten masked, or no mask.
std::unique_ptr<tessel::Mask> MakeMask(const tessel::Raster& oRaster, bool bMasked)
{
    if (!bMasked)
    {
        return nullptr;
    }
    std::mt19937_64 oRandom(kSeed);
    std::bernoulli_distribution oValid(0.9);
    std::vector<unsigned char> vValid(std::size_t{oRaster.mnTotalWidth} * oRaster.mnTotalHeight);
    std::generate(vValid.begin(), vValid.end(),
                  [&] { return static_cast<unsigned char>(oValid(oRandom) ? 1 : 0); });
    return std::make_unique<tessel::Mask>(oRaster, oRaster, vValid.data(), false, false);
}

template <class Filter>
void Run(benchmark::State& oState, const Filter& oFilter)
{
    const auto poIn = SpeckleRaster<double>(kFrostBlock, kMargins, kSeed);
    const auto poOut = MakeRaster<double>(kFrostBlock, Margins{0, 0});
    const auto poMask = MakeMask(*poIn, oState.range(0) != 0);
    for (auto _ : oState)
    {
        oFilter.Process(poIn.get(), poMask.get(), poOut.get(), nullptr);
    }
    oState.SetItemsProcessed(oState.iterations() * kFrostBlock.Pixels());
}

/// FilterFfrost, 7 x 7, on a block of one-look speckle; items are pixels.
void BM_FilterFfrost(benchmark::State& oState)
{
    filters::FilterFfrost oFilter;
    oFilter.SetDamp(1.0);
    Run(oState, oFilter);
}

/// The same with the library's own exponential.
void BM_FilterFfrostFast(benchmark::State& oState)
{
    filters::FilterFfrost oFilter;
    oFilter.SetDamp(1.0);
    oFilter.SetFastExponential(true);
    Run(oState, oFilter);
}

/// FilterFefrost the same way: of one look, about half of the pixels are weighted.
void BM_FilterFefrost(benchmark::State& oState)
{
    filters::FilterFefrost oFilter;
    oFilter.SetDamp(1.0);
    oFilter.SetNLOOK(1.0);
    oFilter.SetFilterSize(7, 7);
    Run(oState, oFilter);
}

void BM_FilterFefrostFast(benchmark::State& oState)
{
    filters::FilterFefrost oFilter;
    oFilter.SetDamp(1.0);
    oFilter.SetNLOOK(1.0);
    oFilter.SetFilterSize(7, 7);
    oFilter.SetFastExponential(true);
    Run(oState, oFilter);
}

bool IsValid(const tessel::Mask* poMask, std::int64_t x, std::int64_t y)
{
    if (poMask == nullptr)
    {
        return true;
    }
    const std::int64_t i = (y + kHalf) * poMask->mnTotalWidth + x + kHalf;
    return ((poMask->moBits[static_cast<std::size_t>(i >> 3)] << (i & 7)) & 128) != 0;
}

/// The weighted mean of one window, with one exponential for each pixel.
double PlainMean(const tessel::Raster& oIn, const tessel::Mask* poMask, std::int64_t x,
                 std::int64_t y, double A, const std::vector<double>& vdfDistances)
{
    constexpr std::int64_t h = kHalf;
    std::size_t k = 0;
    double dfSum = 0.0;
    double dfWeights = 0.0;
    for (std::int64_t dy = -h; dy <= h; ++dy)
    {
        for (std::int64_t dx = -h; dx <= h; ++dx)
        {
            if (IsValid(poMask, x + dx, y + dy))
            {
                const double w = std::exp(-(A * vdfDistances[k++]));
                dfSum += w * *oIn.GetPixelAs<double>(x + dx, y + dy);
                dfWeights += w;
            }
        }
    }
    return dfSum / dfWeights;
}

/// FilterFfrost pixel by pixel from a raster of local statistics, which are those of the library.
void BM_FilterFfrostPlain(benchmark::State& oState)
{
    const auto poIn = SpeckleRaster<double>(kFrostBlock, kMargins, kSeed);
    const auto poOut = MakeRaster<double>(kFrostBlock, Margins{0, 0});
    const auto poMask = MakeMask(*poIn, oState.range(0) != 0);
    std::vector<double> vdfDistances;
    for (std::int64_t k = 0; k < 49; ++k)
    {
        vdfDistances.push_back(
            std::hypot(static_cast<double>(k / 7 - 3), static_cast<double>(k % 7 - 3)));
    }
    for (auto _ : oState)
    {
        const std::unique_ptr<tessel::Raster> poStatistics(
            filters::BuildLocalStatistics({}, poIn.get(), poMask.get(), nullptr));
        for (std::uint32_t y = 0; y < kFrostBlock.nHeight; ++y)
        {
            for (std::uint32_t x = 0; x < kFrostBlock.nWidth; ++x)
            {
                double& dfOut = *poOut->GetPixelAs<double>(x, y);
                const double* pStatistics = poStatistics->GetPixelAs<double>(x, y);
                const double A = pStatistics[2] / (pStatistics[1] * pStatistics[1]);
                dfOut = *poIn->GetPixelAs<double>(x, y);
                if (IsValid(poMask.get(), x, y) && pStatistics[0] != 1.0)
                {
                    dfOut = PlainMean(*poIn, poMask.get(), x, y, A, vdfDistances);
                }
            }
        }
        benchmark::ClobberMemory();
    }
    oState.SetItemsProcessed(oState.iterations() * kFrostBlock.Pixels());
}

BENCHMARK(BM_FilterFfrost)->ArgName("masked")->Arg(0)->Arg(1)->Unit(benchmark::kMillisecond);
BENCHMARK(BM_FilterFfrostPlain)->ArgName("masked")->Arg(0)->Arg(1)->Unit(benchmark::kMillisecond);
BENCHMARK(BM_FilterFfrostFast)->ArgName("masked")->Arg(0)->Arg(1)->Unit(benchmark::kMillisecond);
BENCHMARK(BM_FilterFefrostFast)->ArgName("masked")->Arg(0)->Arg(1)->Unit(benchmark::kMillisecond);
BENCHMARK(BM_FilterFefrost)->ArgName("masked")->Arg(0)->Arg(1)->Unit(benchmark::kMillisecond);

}  // namespace
}  // namespace kor::bench
