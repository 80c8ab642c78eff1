#include "processes/qrdfilters/filtersharp.h"

#include "bench/stencil.h"

namespace kor::bench
{
namespace
{

/// Window of side x side pixels; masked: 0 no mask, 1 an eighth of the block, 2 scattered pixels.
void BM_FilterSharp(benchmark::State& oState)
{
    const auto nHalf = static_cast<std::uint32_t>(oState.range(0)) / 2;
    const filters::FilterSharp oFilter;
    MeasureStencil<double>(oState, kStencilBlock, {nHalf, nHalf}, oState.range(1),
                           [&](tessel::Raster* poIn, tessel::Mask* poMask, tessel::Raster* poOut)
                           { oFilter.Process(poIn, poMask, poOut, nullptr); });
}

void PlainSharp(const tessel::Raster& oIn, const tessel::Raster& oOut)
{
    const std::int64_t nHalf = oIn.mnMarginX;
    const auto nPitch = static_cast<std::ptrdiff_t>(oIn.GetRowSamples());
    const auto dfCount = static_cast<double>((2 * nHalf + 1) * (2 * nHalf + 1));
    for (std::int64_t y = 0; y < oIn.mnHeight; ++y)
    {
        double dfSum = 0.0;
        for (std::int64_t dy = -nHalf; dy <= nHalf; ++dy)
        {
            for (std::int64_t dx = -nHalf; dx <= nHalf; ++dx)
            {
                dfSum += *oIn.GetPixelAs<double>(dx, y + dy);
            }
        }
        const double* pIn = oIn.GetPixelAs<double>(0, y);
        double* pOut = oOut.GetPixelAs<double>(0, y);
        for (std::int64_t x = 0; x < oIn.mnWidth; ++x)
        {
            for (std::int64_t dy = -nHalf; dy <= nHalf && x != 0; ++dy)
            {
                dfSum -= pIn[dy * nPitch + x - 1 - nHalf];
            }
            for (std::int64_t dy = -nHalf; dy <= nHalf && x != 0; ++dy)
            {
                dfSum += pIn[dy * nPitch + x + nHalf];
            }
            pOut[x] = pIn[x] * 2.0 - dfSum / dfCount;
        }
    }
}

/// The definition pixel by pixel.
void BM_FilterSharpPlain(benchmark::State& oState)
{
    const auto nHalf = static_cast<std::uint32_t>(oState.range(0)) / 2;
    MeasureStencil<double>(oState, kPlainBlock, {nHalf, nHalf}, eNoMask,
                           [](tessel::Raster* poIn, tessel::Mask*, tessel::Raster* poOut)
                           { PlainSharp(*poIn, *poOut); });
}

BENCHMARK(BM_FilterSharp)
    ->ArgNames({"side", "masked"})
    ->ArgsProduct({{3, 7, 15}, {0, 1, 2}})
    ->UseRealTime();
BENCHMARK(BM_FilterSharpPlain)
    ->ArgNames({"side", "masked"})
    ->ArgsProduct({{3, 7, 15}, {0}})
    ->UseRealTime();

}  // namespace
}  // namespace kor::bench
