#include "processes/qrdfilters/filtersobel.h"

#include <cmath>

#include "bench/stencil.h"

namespace kor::bench
{
namespace
{

/// masked: 0 no mask, 1 an eighth of the block, 2 scattered pixels.
void BM_FilterSobel(benchmark::State& oState)
{
    const filters::FilterSobel oFilter;
    MeasureStencil<double>(oState, kStencilBlock, {1, 1}, oState.range(0),
                           [&](tessel::Raster* poIn, tessel::Mask* poMask, tessel::Raster* poOut)
                           { oFilter.Process(poIn, poMask, poOut, nullptr); });
}

void PlainSobel(const tessel::Raster& oIn, const tessel::Raster& oOut)
{
    const auto nPitch = static_cast<std::ptrdiff_t>(oIn.GetRowSamples());
    for (std::int64_t y = 0; y < oIn.mnHeight; ++y)
    {
        for (std::int64_t x = 0; x < oIn.mnWidth; ++x)
        {
            const double* p = oIn.GetPixelAs<double>(x, y);
            const double dfX = p[1 - nPitch] - p[-1 - nPitch] - 2.0 * p[-1] + 2.0 * p[1] -
                               p[nPitch - 1] + p[nPitch + 1];
            const double dfY = 2.0 * p[-nPitch] + p[-1 - nPitch] + p[1 - nPitch] - p[nPitch - 1] -
                               2.0 * p[nPitch] - p[nPitch + 1];
            *oOut.GetPixelAs<double>(x, y) = std::sqrt(dfY * dfY + dfX * dfX) * 1.0;
        }
    }
}

/// The definition pixel by pixel.
void BM_FilterSobelPlain(benchmark::State& oState)
{
    MeasureStencil<double>(oState, kStencilBlock, {1, 1}, eNoMask,
                           [](tessel::Raster* poIn, tessel::Mask*, tessel::Raster* poOut)
                           { PlainSobel(*poIn, *poOut); });
}

BENCHMARK(BM_FilterSobel)->ArgName("masked")->DenseRange(0, 2)->UseRealTime();
BENCHMARK(BM_FilterSobelPlain)->ArgName("masked")->Arg(0)->UseRealTime();

}  // namespace
}  // namespace kor::bench
