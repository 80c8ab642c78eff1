#include "processes/qrdfilters/filterlaplacian.h"

#include "bench/windowfilters.h"

namespace kor::bench
{
namespace
{

void BM_FilterLaplacian(benchmark::State& oState)
{
    MeasureFilter<double>(oState, filters::FilterLaplacian());
}

void BM_FilterLaplacianPlain(benchmark::State& oState)
{
    const auto oFinish = [](const test::WindowSums<test::SumTerm>& oSums, double dfCentre)
    { return oSums.mdfCount == 1.0 ? dfCentre : dfCentre - oSums.moValues[0] / oSums.mdfCount; };
    MeasurePlainFilter<double, test::SumTerm>(oState, oFinish);
}

BENCHMARK(BM_FilterLaplacian)->Apply(OneAndThreeChannels);
BENCHMARK(BM_FilterLaplacianPlain)->Apply(OneAndThreeChannels);

}  // namespace
}  // namespace kor::bench
