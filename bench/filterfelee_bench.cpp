#include "processes/qrdfilters/filterfelee.h"

#include "bench/windowfilters.h"
#include "tests/support/speckledefinitions.h"

namespace kor::bench
{
namespace
{

// Of one look, as the samples are, so that all three cases come up.
constexpr double kLooks = 1.0;
constexpr double kDamp = 1.0;

void BM_FilterFelee(benchmark::State& oState)
{
    filters::FilterFelee oFilter;
    oFilter.SetNLook(kLooks);
    oFilter.SetDamp(kDamp);
    oFilter.SetBGZero(true);
    MeasureFilter<double>(oState, oFilter);
}

void BM_FilterFeleePlain(benchmark::State& oState)
{
    const double Cu = 1.0 / std::sqrt(kLooks);
    const double Cmax = std::sqrt(2.0 / kLooks + 1.0);
    MeasurePlainFilter<double, test::MomentTerms>(
        oState,
        [=](const auto& oSums, double x)
        {
            return test::EnhancedLee(test::MomentsOf(oSums), x, Cu, Cmax, kDamp,
                                     [](double y) { return std::exp(y); });
        });
}

BENCHMARK(BM_FilterFelee)->Apply(OneAndThreeChannels);
BENCHMARK(BM_FilterFeleePlain)->Apply(OneAndThreeChannels);

}  // namespace
}  // namespace kor::bench
