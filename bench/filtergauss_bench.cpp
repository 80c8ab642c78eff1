#include "processes/qrdfilters/filtergauss.h"

#include <array>
#include <cmath>

#include "bench/stencil.h"

namespace kor::bench
{
namespace
{

/// One or two kernels of side x side pixels; masked: 0 no mask, 1 an eighth of the block, 2
/// scattered pixels.
void BM_FilterGauss(benchmark::State& oState)
{
    const auto nHalf = static_cast<std::uint32_t>(oState.range(0)) / 2;
    const filters::FilterGauss oFilter(nHalf, oState.range(1) == 2 ? 1.0 : 0.0);
    MeasureStencil<double>(oState, kStencilBlock, {nHalf, nHalf}, oState.range(2),
                           [&](tessel::Raster* poIn, tessel::Mask* poMask, tessel::Raster* poOut)
                           { oFilter.Process(poIn, poMask, poOut, nullptr); });
}

void PlainGauss(const tessel::Raster& oIn, const std::vector<double>& vdfKernel,
                const tessel::Raster& oOut)
{
    const auto nHalf = static_cast<std::ptrdiff_t>(vdfKernel.size() / 2);
    const auto nPitch = static_cast<std::ptrdiff_t>(oIn.GetRowSamples());
    const double* pKernel = vdfKernel.data();
    std::array<double, 65> adfColumns{};
    double* const pMiddle = adfColumns.data() + nHalf;
    for (std::int64_t y = 0; y < oIn.mnHeight; ++y)
    {
        for (std::int64_t x = 0; x < oIn.mnWidth; ++x)
        {
            const double* pIn = oIn.GetPixelAs<double>(x, y);
            for (std::ptrdiff_t dx = -nHalf; dx <= nHalf; ++dx)
            {
                double dfColumn = 0.0;
                for (std::ptrdiff_t j = 0; j < nHalf; ++j)
                {
                    const std::ptrdiff_t r = (nHalf - j) * nPitch;
                    dfColumn += (pIn[dx - r] + pIn[dx + r]) * pKernel[j];
                }
                pMiddle[dx] = dfColumn + pKernel[nHalf] * pIn[dx];
            }
            double dfSum = 0.0;
            for (std::ptrdiff_t k = 0; k < nHalf; ++k)
            {
                dfSum += (pMiddle[k - nHalf] + pMiddle[nHalf - k]) * pKernel[k];
            }
            *oOut.GetPixelAs<double>(x, y) = dfSum + pKernel[nHalf] * *pMiddle;
        }
    }
}

/// The definition pixel by pixel, one kernel.
void BM_FilterGaussPlain(benchmark::State& oState)
{
    const auto nHalf = static_cast<std::uint32_t>(oState.range(0)) / 2;
    std::vector<double> vdfKernel(2 * nHalf + 1);
    for (std::size_t k = 0; k < vdfKernel.size(); ++k)
    {
        const double i = static_cast<double>(k) - nHalf;
        vdfKernel[k] = std::exp(-i * i / (2.0 * nHalf)) / std::sqrt(6.2831853 * nHalf);
    }
    MeasureStencil<double>(oState, kPlainBlock, {nHalf, nHalf}, eNoMask,
                           [&](tessel::Raster* poIn, tessel::Mask*, tessel::Raster* poOut)
                           { PlainGauss(*poIn, vdfKernel, *poOut); });
}

void Cases(benchmark::internal::Benchmark* poBenchmark)
{
    poBenchmark->ArgNames({"side", "kernels", "masked"})->UseRealTime();
    poBenchmark->ArgsProduct({{3, 9, 33}, {1, 2}, {0, 1, 2}});
}

BENCHMARK(BM_FilterGauss)->Apply(Cases);
BENCHMARK(BM_FilterGaussPlain)
    ->ArgNames({"side", "kernels", "masked"})
    ->ArgsProduct({{3, 9, 33}, {1}, {0}})
    ->UseRealTime();

}  // namespace
}  // namespace kor::bench
