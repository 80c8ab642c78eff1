#include "processes/qrdfilters/filterfle.h"

#include "bench/windowfilters.h"
#include "tests/support/speckledefinitions.h"

namespace kor::bench
{
namespace
{

constexpr double kNoiseVariance = 0.25;

// noise: 0 additive, 1 multiplicative, 2 both.
template <int kNoise>
void BM_FilterFle(benchmark::State& oState)
{
    constexpr const char* kNoises[] = {"ADDI", "MULT", "BOTH"};
    filters::FilterFle oFilter;
    oFilter.SetNoise(kNoises[kNoise]);
    oFilter.SetNoiseVar({kNoiseVariance});
    MeasureFilter<double>(oState, oFilter);
}

template <int kNoise>
void BM_FilterFlePlain(benchmark::State& oState)
{
    MeasurePlainFilter<double, test::MomentTerms>(
        oState, [](const auto& oSums, double x)
        { return test::Lee(test::MomentsOf(oSums), x, kNoise + 1, 0.0, 1.0, kNoiseVariance); });
}

// The path with sub-blocks, which needs an input mask.
void BM_FilterFleEnhanced(benchmark::State& oState)
{
    filters::FilterFle oFilter;
    oFilter.SetNoise("MULT");
    oFilter.SetNoiseVar({kNoiseVariance});
    oFilter.SetThrVar(1000.0);
    MeasureFilter<double>(oState, oFilter);
}

BENCHMARK(BM_FilterFle<0>)->Apply(OneChannel);
BENCHMARK(BM_FilterFlePlain<0>)->Apply(OneChannel);
BENCHMARK(BM_FilterFle<1>)->Apply(OneAndThreeChannels);
BENCHMARK(BM_FilterFlePlain<1>)->Apply(OneAndThreeChannels);
BENCHMARK(BM_FilterFle<2>)->Apply(OneChannel);
BENCHMARK(BM_FilterFlePlain<2>)->Apply(OneChannel);
BENCHMARK(BM_FilterFleEnhanced)
    ->ArgNames({"channels", "masked"})
    ->Args({1, 1})
    ->Unit(benchmark::kMillisecond);

}  // namespace
}  // namespace kor::bench
