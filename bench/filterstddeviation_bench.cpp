#include "processes/qrdfilters/filterstddeviation.h"

#include <cmath>

#include "bench/windowfilters.h"

namespace kor::bench
{
namespace
{

void BM_FilterStdDeviation(benchmark::State& oState)
{
    MeasureFilter<double>(oState, filters::FilterStdDeviation());
}

void BM_FilterStdDeviationPlain(benchmark::State& oState)
{
    const auto oFinish = [](const test::WindowSums<test::MomentTerms>& oSums, double dfCentre)
    {
        const auto [dfSquares, dfSum] = oSums.moValues;
        const double n = oSums.mdfCount;
        const double m = dfSum / n;
        return n == 1.0 ? dfCentre : std::sqrt((dfSquares - m * n * m) / (n - 1.0));
    };
    MeasurePlainFilter<double, test::MomentTerms>(oState, oFinish);
}

BENCHMARK(BM_FilterStdDeviation)->Apply(OneAndThreeChannels);
BENCHMARK(BM_FilterStdDeviationPlain)->Apply(OneAndThreeChannels);

}  // namespace
}  // namespace kor::bench
