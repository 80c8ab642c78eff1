#pragma once

#include <cstdint>
#include <vector>

#include "tests/support/blocks.h"

namespace kor::test
{

/// What a window holds: three doubles that are added and subtracted one by one.
struct StatisticsRecord
{
    double S2 = 0.0;
    double S1 = 0.0;
    double N = 0.0;

    void AddSample(double x)
    {
        S2 += x * x;
        S1 += x;
        N += 1.0;
    }
    void SubtractSample(double x)
    {
        S2 -= x * x;
        S1 -= x;
        N -= 1.0;
    }
    void Add(const StatisticsRecord& o)
    {
        S2 += o.S2;
        S1 += o.S1;
        N += o.N;
    }
    void Subtract(const StatisticsRecord& o)
    {
        S2 -= o.S2;
        S1 -= o.S1;
        N -= o.N;
    }
};

struct LocalStatisticsSample
{
    double n = 0.0;
    double dfMean = 0.0;
    double dfVariance = 0.0;
};

/// Count, mean and variance around each sample, by the plain sliding window: columns, then a
/// running sum along each row. Entry (y * width + x) * channels + c; those of background pixels are
/// not meant to be read.
inline std::vector<LocalStatisticsSample> LocalStatisticsByDefinition(const tessel::Raster& oIn,
                                                                      const tessel::Mask* poMaskIn,
                                                                      std::int64_t hx,
                                                                      std::int64_t hy)
{
    const auto W = static_cast<std::int64_t>(oIn.mnWidth);
    const auto H = static_cast<std::int64_t>(oIn.mnHeight);
    const auto C = static_cast<std::int64_t>(oIn.mnChannels);
    std::vector<StatisticsRecord> voColumns(static_cast<std::size_t>((W + 2 * hx) * C));
    std::vector<LocalStatisticsSample> voResult;
    const auto oColumn = [&](std::int64_t x, std::int64_t c) -> StatisticsRecord&
    { return voColumns[static_cast<std::size_t>((x + hx) * C + c)]; };
    const auto oFinish = [&](const StatisticsRecord& o)
    {
        const double n = o.N;
        const double dfMean = o.S1 / n;
        voResult.push_back({n, dfMean, (o.S2 - dfMean * n * dfMean) / (n - 1)});
    };
    for (std::int64_t y = 0; y < H; ++y)
    {
        for (std::int64_t x = -hx; x < W + hx; ++x)
        {
            for (std::int64_t c = 0; c < C; ++c)
            {
                for (std::int64_t r = -hy; y == 0 && r <= hy; ++r)
                {
                    if (IsValid(poMaskIn, x, r))
                    {
                        oColumn(x, c).AddSample(oIn.GetPixelAs<double>(x, r)[c]);
                    }
                }
                if (y > 0 && IsValid(poMaskIn, x, y - hy - 1))
                {
                    oColumn(x, c).SubtractSample(oIn.GetPixelAs<double>(x, y - hy - 1)[c]);
                }
                if (y > 0 && IsValid(poMaskIn, x, y + hy))
                {
                    oColumn(x, c).AddSample(oIn.GetPixelAs<double>(x, y + hy)[c]);
                }
            }
        }
        std::vector<StatisticsRecord> voRunning(static_cast<std::size_t>(C));
        for (std::int64_t x = 0; x < W; ++x)
        {
            for (std::int64_t c = 0; c < C; ++c)
            {
                StatisticsRecord& oRunning = voRunning[static_cast<std::size_t>(c)];
                if (y == 0 || x == 0)
                {
                    oRunning = StatisticsRecord();
                    for (std::int64_t k = x - hx; k <= x + hx; ++k)
                    {
                        oRunning.Add(oColumn(k, c));
                    }
                }
                else
                {
                    oRunning.Subtract(oColumn(x - hx - 1, c));
                    oRunning.Add(oColumn(x + hx, c));
                }
                oFinish(oRunning);
            }
        }
    }
    return voResult;
}

}  // namespace kor::test
