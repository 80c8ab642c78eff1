// The sliding-window engine on one block of doubles, window 7 x 7, beside the plain loop that
// defines it: the same sums, one pixel after the other. Items are samples (pixels times channels).

#include <benchmark/benchmark.h>

#include <memory>
#include <random>
#include <vector>

#include "processes/qrdfilters/filteraverage.h"

namespace
{

using kor::filters::FilterAverage;
using kor::tessel::eDT_32R;
using kor::tessel::eDT_64R;
using kor::tessel::Mask;
using kor::tessel::Raster;
using kor::tessel::RasterContext;
using kor::tessel::RasterInfo;

constexpr std::uint32_t kSide = 2048;
constexpr std::uint32_t kHalf = 3;

template <class TSample>
struct Block
{
    Block(std::uint32_t nChannels, bool bMasked)
        : moIn(Info(nChannels), RasterContext(kHalf, kHalf, 0, 0)),
          moOut(Info(nChannels), RasterContext())
    {
        std::mt19937_64 oRandom(7);
        std::gamma_distribution<double> oSpeckle(1.0, 100.0);
        auto* pSamples = reinterpret_cast<TSample*>(moIn.mpBuffer);
        for (std::size_t i = 0; i < moIn.GetRowSamples() * moIn.mnTotalHeight; ++i)
        {
            pSamples[i] = static_cast<TSample>(oSpeckle(oRandom));
        }
        if (bMasked)
        {
            std::bernoulli_distribution oValid(0.9);
            std::vector<unsigned char> vValid(std::size_t{moIn.mnTotalWidth} * moIn.mnTotalHeight);
            for (unsigned char& nByte : vValid)
            {
                nByte = oValid(oRandom) ? 1 : 0;
            }
            mpoMask = std::make_unique<Mask>(moIn, moIn, vValid.data(), false, false);
        }
    }

    static RasterInfo Info(std::uint32_t nChannels)
    {
        return RasterInfo(kSide, kSide, nChannels, sizeof(TSample) == 4 ? eDT_32R : eDT_64R);
    }

    std::int64_t Samples() const { return std::int64_t{kSide} * kSide * moIn.mnChannels; }

    Raster moIn;
    Raster moOut;
    std::unique_ptr<Mask> mpoMask;
};

bool IsValid(const Mask& oMask, std::int64_t x, std::int64_t y)
{
    const std::int64_t i = (y + kHalf) * oMask.mnTotalWidth + x + kHalf;
    return kor::tessel::kMaskBitTable[static_cast<std::size_t>(
               oMask.moBits[static_cast<std::size_t>(i >> 3)] * 8 + (i & 7))] != 0;
}

struct Sums
{
    double mdfSum = 0.0;
    double mdfCount = 0.0;
};

template <class TSample>
void PlainAverage(const Raster& oIn, const Mask* poMask, Raster& oOut)
{
    const std::int64_t nHalf = kHalf;
    const std::int64_t nWidth = oIn.mnWidth;
    const std::int64_t nChannels = oIn.mnChannels;
    std::vector<Sums> vColumns(static_cast<std::size_t>((nWidth + 2 * nHalf) * nChannels));
    std::vector<Sums> vRunning(static_cast<std::size_t>(nChannels));
    const auto oForSums = [&](std::int64_t x, std::int64_t y, const auto& oUpdate)
    {
        if (poMask == nullptr || IsValid(*poMask, x, y))
        {
            const TSample* pIn = oIn.GetPixelAs<const TSample>(x, y);
            Sums* pColumn = &vColumns[static_cast<std::size_t>((x + nHalf) * nChannels)];
            for (std::int64_t c = 0; c < nChannels; ++c)
            {
                oUpdate(pColumn[c], static_cast<double>(pIn[c]));
            }
        }
    };
    const auto oAdd = [&](std::int64_t x, std::int64_t y)
    {
        oForSums(x, y,
                 [](Sums& oColumn, double dfSample)
                 {
                     oColumn.mdfSum += dfSample;
                     oColumn.mdfCount += 1.0;
                 });
    };
    const auto oSubtract = [&](std::int64_t x, std::int64_t y)
    {
        oForSums(x, y,
                 [](Sums& oColumn, double dfSample)
                 {
                     oColumn.mdfSum -= dfSample;
                     oColumn.mdfCount -= 1.0;
                 });
    };
    for (std::int64_t y = -nHalf; y < nHalf; ++y)
    {
        for (std::int64_t x = -nHalf; x < nWidth + nHalf; ++x)
        {
            oAdd(x, y);
        }
    }
    for (std::int64_t y = 0; y < oIn.mnHeight; ++y)
    {
        for (std::int64_t x = -nHalf; x < nWidth + nHalf; ++x)
        {
            if (y > 0)
            {
                oSubtract(x, y - nHalf - 1);
            }
            oAdd(x, y + nHalf);
        }
        std::fill(vRunning.begin(), vRunning.end(), Sums());
        for (std::int64_t x = -2 * nHalf; x < nWidth; ++x)
        {
            for (std::int64_t c = 0; c < nChannels; ++c)
            {
                Sums& oRunning = vRunning[static_cast<std::size_t>(c)];
                if (x > 0)
                {
                    const Sums& oLeaving =
                        vColumns[static_cast<std::size_t>((x - 1) * nChannels + c)];
                    oRunning.mdfSum -= oLeaving.mdfSum;
                    oRunning.mdfCount -= oLeaving.mdfCount;
                }
                const Sums& oEntering =
                    vColumns[static_cast<std::size_t>((x + 2 * nHalf) * nChannels + c)];
                oRunning.mdfSum += oEntering.mdfSum;
                oRunning.mdfCount += oEntering.mdfCount;
            }
            if (x >= 0)
            {
                TSample* pOut = oOut.GetPixelAs<TSample>(x, y);
                const bool bComputed = poMask == nullptr || IsValid(*poMask, x, y);
                for (std::int64_t c = 0; c < nChannels; ++c)
                {
                    const Sums& oRunning = vRunning[static_cast<std::size_t>(c)];
                    pOut[c] = bComputed ? static_cast<TSample>(oRunning.mdfSum / oRunning.mdfCount)
                                        : TSample(0);
                }
            }
        }
    }
}

template <class TSample>
void BM_FilterAverage(benchmark::State& oState)
{
    Block<TSample> oBlock(static_cast<std::uint32_t>(oState.range(0)), oState.range(1) != 0);
    const FilterAverage oFilter;
    for (auto _ : oState)
    {
        oFilter.Process(&oBlock.moIn, oBlock.mpoMask.get(), &oBlock.moOut, nullptr);
    }
    oState.SetItemsProcessed(oState.iterations() * oBlock.Samples());
}

template <class TSample>
void BM_FilterAveragePlain(benchmark::State& oState)
{
    Block<TSample> oBlock(static_cast<std::uint32_t>(oState.range(0)), oState.range(1) != 0);
    for (auto _ : oState)
    {
        PlainAverage<TSample>(oBlock.moIn, oBlock.mpoMask.get(), oBlock.moOut);
    }
    oState.SetItemsProcessed(oState.iterations() * oBlock.Samples());
}

void Cases(benchmark::internal::Benchmark* poBenchmark)
{
    poBenchmark->ArgNames({"channels", "masked"})
        ->ArgsProduct({{1, 3}, {0, 1}})
        ->Unit(benchmark::kMillisecond)
        ->UseRealTime();
}

void SingleChannel(benchmark::internal::Benchmark* poBenchmark)
{
    poBenchmark->ArgNames({"channels", "masked"})
        ->ArgsProduct({{1}, {0, 1}})
        ->Unit(benchmark::kMillisecond)
        ->UseRealTime();
}

BENCHMARK(BM_FilterAverage<double>)->Apply(Cases);
BENCHMARK(BM_FilterAveragePlain<double>)->Apply(Cases);
BENCHMARK(BM_FilterAverage<float>)->Apply(SingleChannel);
BENCHMARK(BM_FilterAveragePlain<float>)->Apply(SingleChannel);

}  // namespace
