#include "processes/qrdfilters/kernels/noiserow.h"

#include "processes/qrdfilters/kernels/targets.h"

#undef HWY_TARGET_INCLUDE
#define HWY_TARGET_INCLUDE "processes/qrdfilters/kernels/noiserow.cpp"
#include <hwy/foreach_target.h>
#include <hwy/highway.h>

HWY_BEFORE_NAMESPACE();
namespace kor::filters::kernels::HWY_NAMESPACE
{

namespace hn = hwy::HWY_NAMESPACE;

void NoiseRow(const WindowStatistics& oStatistics, double dfFailValue, std::span<double> oResults)
{
    const hn::CappedTag<double, 8> oTag;
    const auto oOne = hn::Set(oTag, 1.0);
    const auto oTwo = hn::Set(oTag, 2.0);
    const auto oThree = hn::Set(oTag, 3.0);
    const auto oFail = hn::Set(oTag, dfFailValue);
    for (std::size_t i = 0; i < oResults.size(); i += hn::Lanes(oTag))
    {
        const auto n = hn::LoadU(oTag, oStatistics.mpCounts + i);
        const auto m = hn::Div(hn::LoadU(oTag, oStatistics.mapSums[0] + i), n);
        const auto d = hn::Sub(hn::LoadU(oTag, oStatistics.mpCentres + i), m);
        const auto oSquares = hn::LoadU(oTag, oStatistics.mapSums[1] + i);
        const auto oSpread = hn::Sub(oSquares, hn::Mul(hn::Mul(m, n), m));
        const auto oBound = hn::Div(hn::Mul(oThree, oSpread), hn::Sub(n, oOne));
        const auto bNoise = hn::And(hn::Ge(n, oTwo), hn::Gt(hn::Mul(d, d), oBound));
        hn::StoreU(hn::IfThenElse(bNoise, oFail, m), oTag, &oResults[i]);
    }
}

}  // namespace kor::filters::kernels::HWY_NAMESPACE
HWY_AFTER_NAMESPACE();

#if HWY_ONCE
namespace kor::filters::kernels
{

HWY_EXPORT(NoiseRow);

void NoiseRow(const WindowStatistics& oStatistics, double dfFailValue, std::span<double> oResults)
{
    HWY_DYNAMIC_DISPATCH(NoiseRow)(oStatistics, dfFailValue, oResults);
}

}  // namespace kor::filters::kernels
#endif
