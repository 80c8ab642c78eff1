#include "processes/qrdfilters/kernels/greybins.h"

#include <cstdint>

#include "processes/qrdfilters/kernels/targets.h"

#undef HWY_TARGET_INCLUDE
#define HWY_TARGET_INCLUDE "processes/qrdfilters/kernels/greybins.cpp"
#include <hwy/foreach_target.h>
#include <hwy/highway.h>

HWY_BEFORE_NAMESPACE();
namespace kor::filters::kernels::HWY_NAMESPACE
{

namespace hn = hwy::HWY_NAMESPACE;

template <bool bByValue>
void FindBinsBy(const GreyScale& oScale, std::span<const double> vdfSamples, int* pnBins)
{
    const hn::ScalableTag<double> oTag;
    const hn::Rebind<std::int32_t, decltype(oTag)> oBinTag;
    std::size_t i = 0;
    for (; i + hn::Lanes(oTag) <= vdfSamples.size(); i += hn::Lanes(oTag))
    {
        const auto oX = hn::LoadU(oTag, &vdfSamples[i]);
        auto oBin = oX;
        if constexpr (!bByValue)
        {
            oBin =
                hn::Div(hn::Mul(hn::Sub(oX, hn::Set(oTag, oScale.mdfMin)), hn::Set(oTag, 65535.0)),
                        hn::Set(oTag, oScale.mdfRange));
        }
        const auto oInRange = hn::And(hn::Ge(oX, hn::Set(oTag, oScale.mdfLowest)),
                                      hn::Le(oX, hn::Set(oTag, oScale.mdfHighest)));
        const auto oInTable =
            hn::And(hn::Gt(oBin, hn::Set(oTag, -1.0)), hn::Lt(oBin, hn::Set(oTag, oScale.mdfEnd)));
        const auto oFound = hn::IfThenElse(hn::And(oInRange, oInTable), oBin, hn::Set(oTag, -1.0));
        hn::StoreU(hn::DemoteTo(oBinTag, oFound), oBinTag, pnBins + i);
    }
    for (; i < vdfSamples.size(); ++i)
    {
        pnBins[i] = FindBin(oScale, vdfSamples[i]);
    }
}

void FindBins(const GreyScale& oScale, std::span<const double> vdfSamples, int* pnBins)
{
    const auto pfnFind = oScale.mbByValue ? FindBinsBy<true> : FindBinsBy<false>;
    pfnFind(oScale, vdfSamples, pnBins);
}

}  // namespace kor::filters::kernels::HWY_NAMESPACE
HWY_AFTER_NAMESPACE();

#if HWY_ONCE
namespace kor::filters::kernels
{

HWY_EXPORT(FindBins);

void FindBins(const GreyScale& oScale, std::span<const double> vdfSamples, int* pnBins)
{
    HWY_DYNAMIC_DISPATCH(FindBins)(oScale, vdfSamples, pnBins);
}

}  // namespace kor::filters::kernels
#endif
