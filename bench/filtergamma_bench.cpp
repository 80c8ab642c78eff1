#include "processes/qrdfilters/filtergamma.h"

#include "bench/windowfilters.h"
#include "tests/support/speckledefinitions.h"

namespace kor::bench
{
namespace
{

// Of one look, as the samples are, so that all three cases come up.
constexpr double kLooks = 1.0;

void BM_FilterGamma(benchmark::State& oState)
{
    MeasureFilter<double>(oState, filters::FilterGamma(kLooks, filters::eGF_Intensity));
}

void BM_FilterGammaPlain(benchmark::State& oState)
{
    MeasurePlainFilter<double, test::MomentTerms>(
        oState,
        [](const auto& oSums, double x) { return test::Gamma(test::MomentsOf(oSums), x, kLooks); });
}

BENCHMARK(BM_FilterGamma)->Apply(OneAndThreeChannels);
BENCHMARK(BM_FilterGammaPlain)->Apply(OneAndThreeChannels);

}  // namespace
}  // namespace kor::bench
