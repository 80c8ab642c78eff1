// FilterStdDeviation and FilterNoise on one block of doubles, window 7 x 7, beside the plain loop
// that defines them: the same sums, one pixel after the other. Items are samples (pixels times
// channels).

#include <benchmark/benchmark.h>

#include <cmath>
#include <memory>
#include <vector>

#include "bench/support.h"
#include "processes/qrdfilters/filternoise.h"
#include "processes/qrdfilters/filterstddeviation.h"

namespace kor::bench
{
namespace
{

constexpr std::uint32_t kHalf = 3;

struct Sums
{
    double mdfSquares = 0.0;
    double mdfSum = 0.0;
    double mdfCount = 0.0;
    double mdfCentre = 0.0;

    void Add(double dfSample)
    {
        mdfSquares += dfSample * dfSample;
        mdfSum += dfSample;
        mdfCount += 1.0;
    }
    void Subtract(double dfSample)
    {
        mdfSquares -= dfSample * dfSample;
        mdfSum -= dfSample;
        mdfCount -= 1.0;
    }
    void Add(const Sums& oOther)
    {
        mdfSquares += oOther.mdfSquares;
        mdfSum += oOther.mdfSum;
        mdfCount += oOther.mdfCount;
    }
    void Subtract(const Sums& oOther)
    {
        mdfSquares -= oOther.mdfSquares;
        mdfSum -= oOther.mdfSum;
        mdfCount -= oOther.mdfCount;
    }
};

double PlainDeviation(const Sums& oSums)
{
    const double n = oSums.mdfCount;
    if (n == 1.0)
    {
        return oSums.mdfCentre;
    }
    const double m = oSums.mdfSum / n;
    return std::sqrt((oSums.mdfSquares - m * n * m) / (n - 1.0));
}

double PlainMeanOrFail(const Sums& oSums)
{
    const double n = oSums.mdfCount;
    const double m = oSums.mdfSum / n;
    const double d = oSums.mdfCentre - m;
    return n >= 2.0 && d * d > 3.0 * (oSums.mdfSquares - m * n * m) / (n - 1.0) ? 0.0 : m;
}

std::unique_ptr<tessel::Mask> SparseMask(const tessel::Raster& oIn)
{
    std::mt19937_64 oRandom(kSeed);
    std::bernoulli_distribution oValid(0.9);
    std::vector<unsigned char> vValid(std::size_t{oIn.mnTotalWidth} * oIn.mnTotalHeight);
    std::generate(vValid.begin(), vValid.end(),
                  [&] { return static_cast<unsigned char>(oValid(oRandom)); });
    return std::make_unique<tessel::Mask>(oIn, oIn, vValid.data(), false, false);
}

struct Block
{
    explicit Block(const benchmark::State& oState)
        : mpoIn(SpeckleRaster<double>(kBlock, {kHalf, kHalf}, kSeed,
                                      static_cast<std::uint32_t>(oState.range(0)))),
          mpoOut(MakeRaster<double>(kBlock, {}, mpoIn->mnChannels)),
          mpoMask(oState.range(1) != 0 ? SparseMask(*mpoIn) : nullptr)
    {
    }

    std::unique_ptr<tessel::Raster> mpoIn;
    std::unique_ptr<tessel::Raster> mpoOut;
    std::unique_ptr<tessel::Mask> mpoMask;
};

bool IsValid(const tessel::Mask* poMask, std::int64_t x, std::int64_t y)
{
    if (poMask == nullptr)
    {
        return true;
    }
    const std::int64_t i = (y + kHalf) * poMask->mnTotalWidth + x + kHalf;
    return tessel::kMaskBitTable[static_cast<std::size_t>(
               poMask->moBits[static_cast<std::size_t>(i >> 3)] * 8 + (i & 7))] != 0;
}

/// Column sums that move down row by row, and a window that moves along them.
class PlainWindows
{
public:
    explicit PlainWindows(const Block& oBlock)
        : moIn(*oBlock.mpoIn),
          mpoMask(oBlock.mpoMask.get()),
          mvoColumns(moIn.GetRowSamples()),
          mvoRunning(moIn.mnChannels)
    {
    }

    template <class Finish>
    void Run(const Finish& oFinish, const tessel::Raster& oOut)
    {
        constexpr std::int64_t kReach = kHalf;
        const auto oAdd = [](Sums& oColumn, double dfSample) { oColumn.Add(dfSample); };
        const auto oSubtract = [](Sums& oColumn, double dfSample) { oColumn.Subtract(dfSample); };
        for (std::int64_t y = -kReach; y < kReach; ++y)
        {
            ChangeColumns(y, oAdd);
        }
        for (std::int64_t y = 0; y < moIn.mnHeight; ++y)
        {
            if (y > 0)
            {
                ChangeColumns(y - kReach - 1, oSubtract);
            }
            ChangeColumns(y + kReach, oAdd);
            RunRow(y, oFinish, oOut);
        }
    }

private:
    template <class Change>
    void ChangeColumns(std::int64_t y, const Change& oChange)
    {
        const std::int64_t nReach = kHalf;
        Sums* pColumn = mvoColumns.data();
        for (std::int64_t x = -nReach; x < moIn.mnWidth + nReach; ++x, pColumn += moIn.mnChannels)
        {
            if (IsValid(mpoMask, x, y))
            {
                const double* pIn = moIn.GetPixelAs<const double>(x, y);
                for (std::size_t c = 0; c < moIn.mnChannels; ++c)
                {
                    oChange(pColumn[c], pIn[c]);
                }
            }
        }
    }

    template <class Finish>
    void RunRow(std::int64_t y, const Finish& oFinish, const tessel::Raster& oOut)
    {
        const std::size_t nChannels = moIn.mnChannels;
        std::fill(mvoRunning.begin(), mvoRunning.end(), Sums());
        for (std::size_t k = 0; k < 2 * kHalf * nChannels; ++k)
        {
            mvoRunning[k % nChannels].Add(mvoColumns[k]);
        }
        for (std::size_t x = 0; x < moIn.mnWidth; ++x)
        {
            const auto nColumn = static_cast<std::int64_t>(x);
            const bool bComputed = IsValid(mpoMask, nColumn, y);
            for (std::size_t c = 0; c < nChannels; ++c)
            {
                Sums& oRunning = mvoRunning[c];
                if (x > 0)
                {
                    oRunning.Subtract(mvoColumns[(x - 1) * nChannels + c]);
                }
                oRunning.Add(mvoColumns[(x + 2 * kHalf) * nChannels + c]);
                oRunning.mdfCentre = moIn.GetPixelAs<const double>(nColumn, y)[c];
                oOut.GetPixelAs<double>(nColumn, y)[c] = bComputed ? oFinish(oRunning) : 0.0;
            }
        }
    }

    const tessel::Raster& moIn;
    const tessel::Mask* mpoMask;
    std::vector<Sums> mvoColumns;
    std::vector<Sums> mvoRunning;
};

template <class Filter>
void RunFilter(const Filter& oFilter, benchmark::State& oState)
{
    const Block oBlock(oState);
    for (auto _ : oState)
    {
        oFilter.Process(oBlock.mpoIn.get(), oBlock.mpoMask.get(), oBlock.mpoOut.get(), nullptr);
    }
    oState.SetItemsProcessed(oState.iterations() * kBlock.Pixels() * oState.range(0));
}

template <class Finish>
void RunPlain(const Finish& oFinish, benchmark::State& oState)
{
    const Block oBlock(oState);
    for (auto _ : oState)
    {
        PlainWindows(oBlock).Run(oFinish, *oBlock.mpoOut);
        benchmark::ClobberMemory();
    }
    oState.SetItemsProcessed(oState.iterations() * kBlock.Pixels() * oState.range(0));
}

void BM_FilterStdDeviation(benchmark::State& oState)
{
    RunFilter(filters::FilterStdDeviation(), oState);
}

void BM_FilterStdDeviationPlain(benchmark::State& oState)
{
    RunPlain([](const Sums& oSums) { return PlainDeviation(oSums); }, oState);
}

void BM_FilterNoise(benchmark::State& oState)
{
    filters::FilterNoise oFilter;
    oFilter.SetBGZero(true);
    RunFilter(oFilter, oState);
}

void BM_FilterNoisePlain(benchmark::State& oState)
{
    RunPlain([](const Sums& oSums) { return PlainMeanOrFail(oSums); }, oState);
}

void Cases(benchmark::internal::Benchmark* poBenchmark)
{
    poBenchmark->ArgNames({"channels", "masked"})
        ->ArgsProduct({{1, 3}, {0, 1}})
        ->Unit(benchmark::kMillisecond)
        ->UseRealTime();
}

BENCHMARK(BM_FilterStdDeviation)->Apply(Cases);
BENCHMARK(BM_FilterStdDeviationPlain)->Apply(Cases);
BENCHMARK(BM_FilterNoise)->Apply(Cases);
BENCHMARK(BM_FilterNoisePlain)->Apply(Cases);

}  // namespace
}  // namespace kor::bench
