#include "processes/qrdfilters/filterkuan.h"

#include "bench/windowfilters.h"
#include "tests/support/speckledefinitions.h"

namespace kor::bench
{
namespace
{

constexpr double kLooks = 4.0;

void BM_FilterKuan(benchmark::State& oState)
{
    filters::FilterKuan oFilter;
    oFilter.SetLook(kLooks);
    MeasureFilter<double>(oState, oFilter);
}

void BM_FilterKuanPlain(benchmark::State& oState)
{
    MeasurePlainFilter<double, test::MomentTerms>(
        oState,
        [](const auto& oSums, double x) { return test::Kuan(test::MomentsOf(oSums), x, kLooks); });
}

BENCHMARK(BM_FilterKuan)->Apply(OneAndThreeChannels);
BENCHMARK(BM_FilterKuanPlain)->Apply(OneAndThreeChannels);

}  // namespace
}  // namespace kor::bench
