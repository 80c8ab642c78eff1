// The sliding-window engine by its plainest filter, beside the plain loop.

#include "bench/windowfilters.h"
#include "processes/qrdfilters/filteraverage.h"

namespace kor::bench
{
namespace
{

template <class TSample>
void BM_FilterAverage(benchmark::State& oState)
{
    MeasureFilter<TSample>(oState, filters::FilterAverage());
}

template <class TSample>
void BM_FilterAveragePlain(benchmark::State& oState)
{
    MeasurePlainFilter<TSample, test::SumTerm>(oState, [](const auto& oSums, double /*dfCentre*/)
                                               { return oSums.moValues[0] / oSums.mdfCount; });
}

BENCHMARK(BM_FilterAverage<double>)->Apply(OneAndThreeChannels);
BENCHMARK(BM_FilterAveragePlain<double>)->Apply(OneAndThreeChannels);
BENCHMARK(BM_FilterAverage<float>)->Apply(OneChannel);
BENCHMARK(BM_FilterAveragePlain<float>)->Apply(OneChannel);

}  // namespace
}  // namespace kor::bench
