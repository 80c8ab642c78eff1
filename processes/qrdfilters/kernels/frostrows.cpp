#include "processes/qrdfilters/kernels/frostrows.h"

#include "processes/qrdfilters/kernels/targets.h"

#undef HWY_TARGET_INCLUDE
#define HWY_TARGET_INCLUDE "processes/qrdfilters/kernels/frostrows.cpp"
#include <hwy/foreach_target.h>
#include <hwy/highway.h>

HWY_BEFORE_NAMESPACE();
namespace kor::filters::kernels::HWY_NAMESPACE
{

namespace hn = hwy::HWY_NAMESPACE;

using Doubles = hn::CappedTag<double, 8>;
using Vector = hn::Vec<Doubles>;
constexpr Doubles kTag;
constexpr std::size_t kLanes = hn::MaxLanes(kTag);

struct LocalMoments
{
    Vector moMean;
    Vector moVariance;
};

HWY_INLINE LocalMoments FindMoments(const WindowMoments& oMoments, std::size_t i)
{
    const Vector oCount = hn::LoadU(kTag, oMoments.mpCounts + i);
    const Vector oMean = hn::Div(hn::LoadU(kTag, oMoments.mpSums + i), oCount);
    const Vector oSquare = hn::Mul(hn::Mul(oMean, oCount), oMean);
    const Vector oDeviations = hn::Sub(hn::LoadU(kTag, oMoments.mpSumsOfSquares + i), oSquare);
    return {oMean, hn::Div(oDeviations, hn::Sub(oCount, hn::Set(kTag, 1.0)))};
}

void FindFrostCoefficients(const WindowMoments& oMoments, double dfDamp, std::size_t nSamples,
                           const WeightingRow& oRow)
{
    const Vector oOne = hn::Set(kTag, 1.0);
    const Vector oDamp = hn::Set(kTag, dfDamp);
    for (std::size_t i = 0; i < nSamples; i += kLanes)
    {
        const LocalMoments oLocal = FindMoments(oMoments, i);
        const Vector oSquare = hn::Mul(oLocal.moMean, oLocal.moMean);
        hn::StoreU(hn::Mul(hn::Div(oLocal.moVariance, oSquare), oDamp), kTag,
                   oRow.mpCoefficients + i);
        hn::StoreU(hn::LoadU(kTag, oMoments.mpCentres + i), kTag, oRow.mpFixed + i);
        const auto oSingle = hn::Eq(hn::LoadU(kTag, oMoments.mpCounts + i), oOne);
        hn::StoreU(hn::IfThenZeroElse(oSingle, oOne), kTag, oRow.mpWeighted + i);
    }
}

void FindEnhancedFrostCoefficients(const WindowMoments& oMoments,
                                   const EnhancedFrostLimits& oLimits, std::size_t nSamples,
                                   const WeightingRow& oRow)
{
    const Vector oOne = hn::Set(kTag, 1.0);
    const Vector oCu = hn::Set(kTag, oLimits.mdfCu);
    const Vector oCmax = hn::Set(kTag, oLimits.mdfCmax);
    const Vector oDamp = hn::Set(kTag, oLimits.mdfDamp);
    for (std::size_t i = 0; i < nSamples; i += kLanes)
    {
        const LocalMoments oLocal = FindMoments(oMoments, i);
        const Vector oCi = hn::Div(hn::Sqrt(oLocal.moVariance), oLocal.moMean);
        const Vector oAboveCu = hn::Mul(hn::Sub(oCi, oCu), oDamp);
        hn::StoreU(hn::Div(oAboveCu, hn::Sub(oCmax, oCi)), kTag, oRow.mpCoefficients + i);

        // Comparisons with a Ci that is not a number are false, which leaves the weighted mean.
        const auto oFlat = hn::Gt(oCu, oCi);
        const auto oSingle = hn::Eq(hn::LoadU(kTag, oMoments.mpCounts + i), oOne);
        const auto oKept = hn::Or(hn::Gt(oCi, oCmax), oSingle);
        const Vector oCentre = hn::LoadU(kTag, oMoments.mpCentres + i);
        hn::StoreU(hn::IfThenElse(oFlat, oLocal.moMean, oCentre), kTag, oRow.mpFixed + i);
        hn::StoreU(hn::IfThenZeroElse(hn::Or(oFlat, oKept), oOne), kTag, oRow.mpWeighted + i);
    }
}

/// The means of kVectors vectors of windows: as many sums under way hide the time of an addition.
template <std::size_t kVectors, bool kMasked>
HWY_INLINE void WeightVectors(const WeightedWindows& oWindows, std::size_t i, Vector* poMeans)
{
    Vector aoSums[kVectors];
    Vector aoWeights[kVectors];
    for (std::size_t v = 0; v < kVectors; ++v)
    {
        aoSums[v] = hn::Zero(kTag);
        aoWeights[v] = hn::Zero(kTag);
    }
    const std::uint32_t* pWeightOf = oWindows.moWeightOf.data();
    for (std::size_t r = 0; r < oWindows.moRows.size(); ++r)
    {
        const double* pSample = oWindows.moRows[r] + i;
        const std::uint64_t* pValid = kMasked ? oWindows.moValid[r] + i : nullptr;
        for (std::size_t k = 0; k < oWindows.mnColumns; ++k, pSample += oWindows.mnStep)
        {
            const double* pWeight = oWindows.mpWeights + *pWeightOf++ + i;
            for (std::size_t v = 0; v < kVectors; ++v)
            {
                Vector oWeight = hn::LoadU(kTag, pWeight + v * kLanes);
                if constexpr (kMasked)
                {
                    const hn::RebindToUnsigned<Doubles> oBits;
                    const auto oValid = hn::LoadU(oBits, pValid + k * oWindows.mnStep + v * kLanes);
                    oWeight = hn::And(oWeight, hn::BitCast(kTag, oValid));
                }
                const Vector oSample = hn::LoadU(kTag, pSample + v * kLanes);
                aoSums[v] = hn::Add(aoSums[v], hn::Mul(oWeight, oSample));
                aoWeights[v] = hn::Add(aoWeights[v], oWeight);
            }
        }
    }
    for (std::size_t v = 0; v < kVectors; ++v)
    {
        poMeans[v] = hn::Div(aoSums[v], aoWeights[v]);
    }
}

template <bool kMasked>
void WeightWindows(const WeightedWindows& oWindows, const double* pFixed, const double* pWeighted,
                   std::span<double> oOut)
{
    const auto oStore = [&](Vector oMean, std::size_t i)
    {
        const auto oFixed = hn::Eq(hn::LoadU(kTag, pWeighted + i), hn::Zero(kTag));
        hn::StoreU(hn::IfThenElse(oFixed, hn::LoadU(kTag, pFixed + i), oMean), kTag, &oOut[i]);
    };
    Vector aoMeans[4];
    std::size_t i = 0;
    for (; i + 4 * kLanes <= oOut.size(); i += 4 * kLanes)
    {
        WeightVectors<4, kMasked>(oWindows, i, aoMeans);
        for (std::size_t v = 0; v < 4; ++v)
        {
            oStore(aoMeans[v], i + v * kLanes);
        }
    }
    for (; i < oOut.size(); i += kLanes)
    {
        WeightVectors<1, kMasked>(oWindows, i, aoMeans);
        oStore(aoMeans[0], i);
    }
}

void FindWeightedMeans(const WeightedWindows& oWindows, const double* pFixed,
                       const double* pWeighted, std::span<double> oOut)
{
    oWindows.moValid.empty() ? WeightWindows<false>(oWindows, pFixed, pWeighted, oOut)
                             : WeightWindows<true>(oWindows, pFixed, pWeighted, oOut);
}

}  // namespace kor::filters::kernels::HWY_NAMESPACE
HWY_AFTER_NAMESPACE();

#if HWY_ONCE
namespace kor::filters::kernels
{

HWY_EXPORT(FindFrostCoefficients);
HWY_EXPORT(FindEnhancedFrostCoefficients);
HWY_EXPORT(FindWeightedMeans);

void FindFrostCoefficients(const WindowMoments& oMoments, double dfDamp, std::size_t nSamples,
                           const WeightingRow& oRow)
{
    HWY_DYNAMIC_DISPATCH(FindFrostCoefficients)(oMoments, dfDamp, nSamples, oRow);
}

void FindEnhancedFrostCoefficients(const WindowMoments& oMoments,
                                   const EnhancedFrostLimits& oLimits, std::size_t nSamples,
                                   const WeightingRow& oRow)
{
    HWY_DYNAMIC_DISPATCH(FindEnhancedFrostCoefficients)(oMoments, oLimits, nSamples, oRow);
}

void FindWeightedMeans(const WeightedWindows& oWindows, const double* pFixed,
                       const double* pWeighted, std::span<double> oOut)
{
    HWY_DYNAMIC_DISPATCH(FindWeightedMeans)(oWindows, pFixed, pWeighted, oOut);
}

}  // namespace kor::filters::kernels
#endif
