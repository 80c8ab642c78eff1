#include "processes/qrdfilters/kernels/deviationrow.h"

#include "processes/qrdfilters/kernels/targets.h"

#undef HWY_TARGET_INCLUDE
#define HWY_TARGET_INCLUDE "processes/qrdfilters/kernels/deviationrow.cpp"
#include <hwy/foreach_target.h>
#include <hwy/highway.h>

HWY_BEFORE_NAMESPACE();
namespace kor::filters::kernels::HWY_NAMESPACE
{

namespace hn = hwy::HWY_NAMESPACE;

void DeviationRow(const WindowStatistics& oStatistics, std::span<double> oDeviations)
{
    const hn::CappedTag<double, 8> oTag;
    const auto oOne = hn::Set(oTag, 1.0);
    for (std::size_t i = 0; i < oDeviations.size(); i += hn::Lanes(oTag))
    {
        const auto n = hn::LoadU(oTag, oStatistics.mpCounts + i);
        const auto m = hn::Div(hn::LoadU(oTag, oStatistics.mapSums[0] + i), n);
        const auto oSquares = hn::LoadU(oTag, oStatistics.mapSums[1] + i);
        const auto oSpread = hn::Sub(oSquares, hn::Mul(hn::Mul(m, n), m));
        const auto oDeviation = hn::Sqrt(hn::Div(oSpread, hn::Sub(n, oOne)));
        const auto oCentre = hn::LoadU(oTag, oStatistics.mpCentres + i);
        hn::StoreU(hn::IfThenElse(hn::Eq(n, oOne), oCentre, oDeviation), oTag, &oDeviations[i]);
    }
}

}  // namespace kor::filters::kernels::HWY_NAMESPACE
HWY_AFTER_NAMESPACE();

#if HWY_ONCE
namespace kor::filters::kernels
{

HWY_EXPORT(DeviationRow);

void DeviationRow(const WindowStatistics& oStatistics, std::span<double> oDeviations)
{
    HWY_DYNAMIC_DISPATCH(DeviationRow)(oStatistics, oDeviations);
}

}  // namespace kor::filters::kernels
#endif
