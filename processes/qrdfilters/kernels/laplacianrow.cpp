#include "processes/qrdfilters/kernels/laplacianrow.h"

#include "processes/qrdfilters/kernels/targets.h"

#undef HWY_TARGET_INCLUDE
#define HWY_TARGET_INCLUDE "processes/qrdfilters/kernels/laplacianrow.cpp"
#include "hwy/foreach_target.h"
#include "hwy/highway.h"

HWY_BEFORE_NAMESPACE();

namespace kor::filters::kernels::HWY_NAMESPACE
{

namespace hn = hwy::HWY_NAMESPACE;

void LaplacianRow(const double* pCentres, const double* pSums, const double* pCounts,
                  std::span<double> oOut)
{
    const hn::CappedTag<double, 8> oTag;
    const auto oOne = hn::Set(oTag, 1.0);
    for (std::size_t i = 0; i < oOut.size(); i += hn::Lanes(oTag))
    {
        const auto oCentre = hn::LoadU(oTag, pCentres + i);
        const auto oCount = hn::LoadU(oTag, pCounts + i);
        const auto oRest = hn::Sub(oCentre, hn::Div(hn::LoadU(oTag, pSums + i), oCount));
        hn::StoreU(hn::IfThenElse(hn::Eq(oCount, oOne), oCentre, oRest), oTag, &oOut[i]);
    }
}

}  // namespace kor::filters::kernels::HWY_NAMESPACE

HWY_AFTER_NAMESPACE();

#if HWY_ONCE

namespace kor::filters::kernels
{

HWY_EXPORT(LaplacianRow);

void LaplacianRow(const double* pCentres, const double* pSums, const double* pCounts,
                  std::span<double> oOut)
{
    HWY_DYNAMIC_DISPATCH(LaplacianRow)(pCentres, pSums, pCounts, oOut);
}

}  // namespace kor::filters::kernels

#endif
