#include "processes/qrdfilters/kernels/texturerows.h"

#include <algorithm>
#include <cstddef>

#include "processes/qrdfilters/kernels/targets.h"

#undef HWY_TARGET_INCLUDE
#define HWY_TARGET_INCLUDE "processes/qrdfilters/kernels/texturerows.cpp"
#include <hwy/foreach_target.h>
#include <hwy/highway.h>

#include "processes/qrdfilters/kernels/explog-inl.h"

HWY_BEFORE_NAMESPACE();
namespace kor::filters::kernels::HWY_NAMESPACE
{

using Doubles = hn::CappedTag<double, 8>;
using Vector = hn::Vec<Doubles>;
constexpr Doubles kTag;
constexpr std::size_t kLanes = hn::MaxLanes(kTag);

/// The samples behind the last whole vector pass through a buffer.
template <class Function>
HWY_INLINE void TransformRow(std::span<double> oSamples, const Function& oFunction)
{
    std::size_t i = 0;
    for (; i + kLanes <= oSamples.size(); i += kLanes)
    {
        hn::StoreU(oFunction(hn::LoadU(kTag, &oSamples[i])), kTag, &oSamples[i]);
    }
    if (i < oSamples.size())
    {
        double adfLast[kLanes] = {};
        const auto oRest = oSamples.subspan(i);
        std::copy(oRest.begin(), oRest.end(), adfLast);
        hn::StoreU(oFunction(hn::LoadU(kTag, adfLast)), kTag, adfLast);
        std::copy_n(adfLast, oRest.size(), oRest.begin());
    }
}

void SquareRootRow(std::span<double> oSamples)
{
    TransformRow(oSamples, [](Vector x) HWY_ATTR { return hn::Sqrt(x); });
}

void LogRow(std::span<double> oSamples)
{
    TransformRow(oSamples, [](Vector x) HWY_ATTR { return Log(kTag, x); });
}

void BoundedLogRow(std::span<double> oSamples)
{
    TransformRow(
        oSamples, [](Vector x) HWY_ATTR
        { return hn::IfThenElse(hn::Eq(x, hn::Zero(kTag)), hn::Set(kTag, -100.0), Log(kTag, x)); });
}

template <class Finish>
HWY_INLINE void FinishRow(const double* pFirst, const double* pSecond, const double* pCounts,
                          std::span<double> oOut, const Finish& oFinish)
{
    for (std::size_t i = 0; i < oOut.size(); i += kLanes)
    {
        hn::StoreU(oFinish(hn::LoadU(kTag, pFirst + i), hn::LoadU(kTag, pSecond + i),
                           hn::LoadU(kTag, pCounts + i)),
                   kTag, &oOut[i]);
    }
}

void VariationRow(const double* pPowers, const double* pRoots, const double* pCounts,
                  std::span<double> oOut)
{
    FinishRow(pPowers, pRoots, pCounts, oOut,
              [](Vector oPower, Vector oRoot, Vector n) HWY_ATTR {
                  return hn::Sub(hn::Div(hn::Mul(n, oPower), hn::Mul(oRoot, oRoot)),
                                 hn::Set(kTag, 1.0));
              });
}

void LogVarianceRow(const double* pSquares, const double* pLogs, const double* pCounts,
                    std::span<double> oOut)
{
    FinishRow(pSquares, pLogs, pCounts, oOut,
              [](Vector oSquares, Vector oLogs, Vector n) HWY_ATTR
              {
                  const Vector oMean = hn::Div(oLogs, n);
                  return hn::Sub(hn::Div(oSquares, n), hn::Mul(oMean, oMean));
              });
}

void LogMeanRatioRow(const double* pSums, const double* pLogs, const double* pCounts,
                     std::span<double> oOut)
{
    FinishRow(pSums, pLogs, pCounts, oOut,
              [](Vector oSum, Vector oLogs, Vector n) HWY_ATTR
              { return hn::Sub(hn::Div(oLogs, n), Log(kTag, hn::Div(oSum, n))); });
}

}  // namespace kor::filters::kernels::HWY_NAMESPACE
HWY_AFTER_NAMESPACE();

#if HWY_ONCE
namespace kor::filters::kernels
{

HWY_EXPORT(SquareRootRow);
HWY_EXPORT(LogRow);
HWY_EXPORT(BoundedLogRow);
HWY_EXPORT(VariationRow);
HWY_EXPORT(LogVarianceRow);
HWY_EXPORT(LogMeanRatioRow);

void SquareRootRow(std::span<double> oSamples)
{
    HWY_DYNAMIC_DISPATCH(SquareRootRow)(oSamples);
}

void LogRow(std::span<double> oSamples)
{
    HWY_DYNAMIC_DISPATCH(LogRow)(oSamples);
}

void BoundedLogRow(std::span<double> oSamples)
{
    HWY_DYNAMIC_DISPATCH(BoundedLogRow)(oSamples);
}

void VariationRow(const double* pPowers, const double* pRoots, const double* pCounts,
                  std::span<double> oOut)
{
    HWY_DYNAMIC_DISPATCH(VariationRow)(pPowers, pRoots, pCounts, oOut);
}

void LogVarianceRow(const double* pSquares, const double* pLogs, const double* pCounts,
                    std::span<double> oOut)
{
    HWY_DYNAMIC_DISPATCH(LogVarianceRow)(pSquares, pLogs, pCounts, oOut);
}

void LogMeanRatioRow(const double* pSums, const double* pLogs, const double* pCounts,
                     std::span<double> oOut)
{
    HWY_DYNAMIC_DISPATCH(LogMeanRatioRow)(pSums, pLogs, pCounts, oOut);
}

}  // namespace kor::filters::kernels
#endif
