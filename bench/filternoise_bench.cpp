#include "processes/qrdfilters/filternoise.h"

#include "bench/windowfilters.h"

namespace kor::bench
{
namespace
{

void BM_FilterNoise(benchmark::State& oState)
{
    filters::FilterNoise oFilter;
    oFilter.SetBGZero(true);
    MeasureFilter<double>(oState, oFilter);
}

void BM_FilterNoisePlain(benchmark::State& oState)
{
    const auto oFinish = [](const test::WindowSums<test::MomentTerms>& oSums, double dfCentre)
    {
        const auto [dfSquares, dfSum] = oSums.moValues;
        const double n = oSums.mdfCount;
        const double m = dfSum / n;
        const double d = dfCentre - m;
        return n >= 2.0 && d * d > 3.0 * (dfSquares - m * n * m) / (n - 1.0) ? 0.0 : m;
    };
    MeasurePlainFilter<double, test::MomentTerms>(oState, oFinish);
}

BENCHMARK(BM_FilterNoise)->Apply(OneAndThreeChannels);
BENCHMARK(BM_FilterNoisePlain)->Apply(OneAndThreeChannels);

}  // namespace
}  // namespace kor::bench
