#include "processes/qrdfilters/kernels/averagerow.h"

#include "processes/qrdfilters/kernels/targets.h"

#undef HWY_TARGET_INCLUDE
#define HWY_TARGET_INCLUDE "processes/qrdfilters/kernels/averagerow.cpp"
#include <hwy/foreach_target.h>
#include <hwy/highway.h>

HWY_BEFORE_NAMESPACE();
namespace kor::filters::kernels::HWY_NAMESPACE
{

namespace hn = hwy::HWY_NAMESPACE;

void AverageRow(const double* pSums, const double* pCounts, std::span<double> oMeans)
{
    const hn::CappedTag<double, 8> oTag;
    for (std::size_t i = 0; i < oMeans.size(); i += hn::Lanes(oTag))
    {
        hn::StoreU(hn::Div(hn::LoadU(oTag, pSums + i), hn::LoadU(oTag, pCounts + i)), oTag,
                   &oMeans[i]);
    }
}

}  // namespace kor::filters::kernels::HWY_NAMESPACE
HWY_AFTER_NAMESPACE();

#if HWY_ONCE
namespace kor::filters::kernels
{

HWY_EXPORT(AverageRow);

void AverageRow(const double* pSums, const double* pCounts, std::span<double> oMeans)
{
    HWY_DYNAMIC_DISPATCH(AverageRow)(pSums, pCounts, oMeans);
}

}  // namespace kor::filters::kernels
#endif
