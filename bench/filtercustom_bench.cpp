#include "processes/qrdfilters/filtercustom.h"

#include "bench/stencil.h"
#include "processes/qrdfilters/sampleconversion.h"

namespace kor::bench
{
namespace
{

std::vector<double> Weights(std::uint32_t nSide)
{
    std::vector<double> vdfKernel(std::size_t{nSide} * nSide);
    for (std::size_t k = 0; k < vdfKernel.size(); ++k)
    {
        vdfKernel[k] = 1.0 / static_cast<double>(k + vdfKernel.size());
    }
    return vdfKernel;
}

/// side x side weights, T to T; masked: 0 no mask, 1 an eighth of the block, 2 scattered pixels.
template <class T>
void BM_FilterCustom(benchmark::State& oState)
{
    const auto nSide = static_cast<std::uint32_t>(oState.range(0));
    filters::FilterCustom oFilter;
    oFilter.SetKernel(Weights(nSide), nSide, nSide);
    MeasureStencil<T>(oState, kStencilBlock, {nSide / 2, nSide / 2}, oState.range(1),
                      [&](tessel::Raster* poIn, tessel::Mask* poMask, tessel::Raster* poOut)
                      { oFilter.Process(poIn, poMask, poOut, nullptr); });
}

template <class T>
void PlainCorrelation(const tessel::Raster& oIn, const std::vector<double>& vdfKernel,
                      const tessel::Raster& oOut)
{
    const std::int64_t nHalf = oIn.mnMarginX;
    for (std::int64_t y = 0; y < oIn.mnHeight; ++y)
    {
        for (std::int64_t x = 0; x < oIn.mnWidth; ++x)
        {
            double dfSum = 0.0;
            const double* pWeight = vdfKernel.data();
            for (std::int64_t dy = -nHalf; dy <= nHalf; ++dy)
            {
                const T* pRow = oIn.GetPixelAs<T>(x, y + dy);
                for (std::int64_t dx = -nHalf; dx <= nHalf; ++dx)
                {
                    dfSum += static_cast<double>(pRow[dx]) * *pWeight++;
                }
            }
            *oOut.GetPixelAs<T>(x, y) = filters::ConvertSample<double, T>(dfSum);
        }
    }
}

/// The definition pixel by pixel.
template <class T>
void BM_FilterCustomPlain(benchmark::State& oState)
{
    const auto nSide = static_cast<std::uint32_t>(oState.range(0));
    const std::vector<double> vdfKernel = Weights(nSide);
    MeasureStencil<T>(oState, kPlainBlock, {nSide / 2, nSide / 2}, eNoMask,
                      [&](tessel::Raster* poIn, tessel::Mask*, tessel::Raster* poOut)
                      { PlainCorrelation<T>(*poIn, vdfKernel, *poOut); });
}

void Cases(benchmark::internal::Benchmark* poBenchmark)
{
    poBenchmark->ArgNames({"side", "masked"})->ArgsProduct({{3, 5, 9}, {0, 2}})->UseRealTime();
}

void PlainCases(benchmark::internal::Benchmark* poBenchmark)
{
    poBenchmark->ArgNames({"side", "masked"})->ArgsProduct({{3, 5, 9}, {0}})->UseRealTime();
}

BENCHMARK_TEMPLATE(BM_FilterCustom, unsigned char)->Apply(Cases);
BENCHMARK_TEMPLATE(BM_FilterCustom, float)->Apply(Cases);
BENCHMARK_TEMPLATE(BM_FilterCustom, double)->Apply(Cases);
BENCHMARK_TEMPLATE(BM_FilterCustomPlain, unsigned char)->Apply(PlainCases);
BENCHMARK_TEMPLATE(BM_FilterCustomPlain, float)->Apply(PlainCases);
BENCHMARK_TEMPLATE(BM_FilterCustomPlain, double)->Apply(PlainCases);

}  // namespace
}  // namespace kor::bench
