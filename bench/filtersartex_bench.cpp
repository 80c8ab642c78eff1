#include "processes/qrdfilters/filtersartex.h"

#include <cmath>

#include "bench/windowfilters.h"

namespace kor::bench
{
namespace
{

using filters::SarTextureType;

template <SarTextureType kTexture>
void BM_FilterSartex(benchmark::State& oState)
{
    filters::FilterSartex oFilter;
    oFilter.SetTextures({kTexture});
    MeasureFilter<double>(oState, oFilter);
}

struct RootTerms
{
    static std::array<double, 2> Of(double x) { return {x, std::sqrt(x)}; }
};

struct LogTerms
{
    static std::array<double, 2> Of(double x) { return {x, std::log(x)}; }
};

struct BoundedLogTerms
{
    static std::array<double, 2> Of(double x)
    {
        const double dfLog = x == 0.0 ? -100.0 : std::log(x);
        return {dfLog * dfLog, dfLog};
    }
};

template <SarTextureType kTexture, class Terms, class Finish>
void MeasurePlainTexture(benchmark::State& oState, const Finish& oFinish)
{
    MeasurePlainFilter<double, Terms>(
        oState, [&](const auto& oSums, double /*dfCentre*/)
        { return oFinish(oSums.moValues[0], oSums.moValues[1], oSums.mdfCount); });
}

template <SarTextureType kTexture>
void BM_FilterSartexPlain(benchmark::State& oState)
{
    const auto oVariation = [](double a, double b, double n) { return n * a / (b * b) - 1.0; };
    if constexpr (kTexture == filters::eSarIntensityVariation)
    {
        MeasurePlainTexture<kTexture, test::MomentTerms>(oState, oVariation);
    }
    else if constexpr (kTexture == filters::eSarAmplitudeVariation)
    {
        MeasurePlainTexture<kTexture, RootTerms>(oState, oVariation);
    }
    else if constexpr (kTexture == filters::eSarLogVariance)
    {
        MeasurePlainTexture<kTexture, BoundedLogTerms>(
            oState, [](double q, double l, double n) { return q / n - (l / n) * (l / n); });
    }
    else
    {
        MeasurePlainTexture<kTexture, LogTerms>(
            oState, [](double s, double l, double n) { return l / n - std::log(s / n); });
    }
}

BENCHMARK(BM_FilterSartex<filters::eSarIntensityVariation>)->Apply(OneChannel);
BENCHMARK(BM_FilterSartexPlain<filters::eSarIntensityVariation>)->Apply(OneChannel);
BENCHMARK(BM_FilterSartex<filters::eSarAmplitudeVariation>)->Apply(OneChannel);
BENCHMARK(BM_FilterSartexPlain<filters::eSarAmplitudeVariation>)->Apply(OneChannel);
BENCHMARK(BM_FilterSartex<filters::eSarLogVariance>)->Apply(OneChannel);
BENCHMARK(BM_FilterSartexPlain<filters::eSarLogVariance>)->Apply(OneChannel);
BENCHMARK(BM_FilterSartex<filters::eSarLogMeanRatio>)->Apply(OneChannel);
BENCHMARK(BM_FilterSartexPlain<filters::eSarLogMeanRatio>)->Apply(OneChannel);

}  // namespace
}  // namespace kor::bench
