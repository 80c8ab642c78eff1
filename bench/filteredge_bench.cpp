#include "processes/qrdfilters/filteredge.h"

#include <cmath>

#include "bench/stencil.h"
#include "processes/qrdfilters/sampleconversion.h"

namespace kor::bench
{
namespace
{

/// Window of side x side pixels, T to T; masked: 0 no mask, 1 an eighth of the block, 2 scattered
/// pixels.
template <class T>
void BM_FilterEdge(benchmark::State& oState)
{
    const auto nHalf = static_cast<std::uint32_t>(oState.range(0)) / 2;
    const filters::FilterEdge oFilter;
    MeasureStencil<T>(oState, kStencilBlock, {nHalf, nHalf}, oState.range(1),
                      [&](tessel::Raster* poIn, tessel::Mask* poMask, tessel::Raster* poOut)
                      { oFilter.Process(poIn, poMask, poOut, nullptr); });
}

template <class T>
void PlainEdge(const tessel::Raster& oIn, const tessel::Raster& oOut)
{
    const std::int64_t nHalf = oIn.mnMarginX;
    const auto dfDivisor = static_cast<double>((2 * nHalf + 1) * (2 * nHalf + 1) - 1);
    for (std::int64_t y = 0; y < oIn.mnHeight; ++y)
    {
        for (std::int64_t x = 0; x < oIn.mnWidth; ++x)
        {
            double dfSum = 0.0;
            const auto dfCentre = static_cast<double>(*oIn.GetPixelAs<T>(x, y));
            for (std::int64_t dy = -nHalf; dy <= nHalf; ++dy)
            {
                const T* pRow = oIn.GetPixelAs<T>(x, y + dy);
                for (std::int64_t dx = -nHalf; dx <= nHalf; ++dx)
                {
                    dfSum += std::fabs(static_cast<double>(pRow[dx]) - dfCentre);
                }
            }
            const bool bFlat = dfSum > -1e-9 && dfSum < 1e-9;
            *oOut.GetPixelAs<T>(x, y) =
                filters::ConvertSample<double, T>(bFlat ? 0.0 : dfSum / dfDivisor);
        }
    }
}

/// The definition pixel by pixel.
template <class T>
void BM_FilterEdgePlain(benchmark::State& oState)
{
    const auto nHalf = static_cast<std::uint32_t>(oState.range(0)) / 2;
    MeasureStencil<T>(oState, kPlainBlock, {nHalf, nHalf}, eNoMask,
                      [](tessel::Raster* poIn, tessel::Mask*, tessel::Raster* poOut)
                      { PlainEdge<T>(*poIn, *poOut); });
}

void Cases(benchmark::internal::Benchmark* poBenchmark)
{
    poBenchmark->ArgNames({"side", "masked"})->ArgsProduct({{3, 5, 9}, {0, 2}})->UseRealTime();
}

void PlainCases(benchmark::internal::Benchmark* poBenchmark)
{
    poBenchmark->ArgNames({"side", "masked"})->ArgsProduct({{3, 5, 9}, {0}})->UseRealTime();
}

BENCHMARK_TEMPLATE(BM_FilterEdge, unsigned char)->Apply(Cases);
BENCHMARK_TEMPLATE(BM_FilterEdge, double)->Apply(Cases);
BENCHMARK_TEMPLATE(BM_FilterEdgePlain, unsigned char)->Apply(PlainCases);
BENCHMARK_TEMPLATE(BM_FilterEdgePlain, double)->Apply(PlainCases);

}  // namespace
}  // namespace kor::bench
