#include "processes/qrdfilters/kernels/arirow.h"

#include <cstdint>

#include "processes/qrdfilters/kernels/targets.h"

#undef HWY_TARGET_INCLUDE
#define HWY_TARGET_INCLUDE "processes/qrdfilters/kernels/arirow.cpp"
#include <hwy/foreach_target.h>
#include <hwy/highway.h>

HWY_BEFORE_NAMESPACE();
namespace kor::filters::kernels::HWY_NAMESPACE
{

namespace hn = hwy::HWY_NAMESPACE;

using Tag = hn::CappedTag<float, kAriPadding>;
using Values = hn::Vec<Tag>;

/// CutToInt.
HWY_INLINE hn::Vec<hn::RebindToSigned<Tag>> CutToInts(Values oX)
{
    const Tag oTag;
    const hn::RebindToSigned<Tag> oIntTag;
    const auto oFits = hn::And(hn::Ge(oX, hn::Set(oTag, -2147483648.0F)),
                               hn::Lt(oX, hn::Set(oTag, 2147483648.0F)));
    const auto oCut = hn::ConvertTo(oIntTag, hn::IfThenElseZero(oFits, oX));
    return hn::IfThenElse(hn::RebindMask(oIntTag, oFits), oCut,
                          hn::Set(oIntTag, std::int32_t{-2147483647 - 1}));
}

template <AriOperation eOperation>
HWY_INLINE Values Evaluate(Values oA, Values oB, [[maybe_unused]] Values oConstant)
{
    const Tag oTag;
    switch (eOperation)
    {
        case AriOperation::eSum:
            return hn::Add(oB, oA);
        case AriOperation::eSumPlusConstant:
            return hn::Add(hn::Add(oB, oA), oConstant);
        case AriOperation::eDifference:
            return hn::Sub(oA, oB);
        case AriOperation::eDifferenceConstant:
            return hn::Sub(hn::Sub(oA, oB), oConstant);
        case AriOperation::eProduct:
            return hn::Mul(oB, oA);
        case AriOperation::eQuotient:
            return hn::Div(oA, oB);
        case AriOperation::eAnd:
            return hn::ConvertTo(oTag, hn::And(CutToInts(oB), CutToInts(oA)));
        default:
            return hn::ConvertTo(oTag, hn::Or(CutToInts(oB), CutToInts(oA)));
    }
}

/// The smallest and the greatest lane.
HWY_INLINE void Reduce(Values oMin, Values oMax, AriExtremes& oExtremes)
{
    const Tag oTag;
    HWY_ALIGN float afMin[kAriPadding];
    HWY_ALIGN float afMax[kAriPadding];
    hn::Store(oMin, oTag, afMin);
    hn::Store(oMax, oTag, afMax);
    for (std::size_t i = 0; i < hn::Lanes(oTag); ++i)
    {
        oExtremes.mfMin = oExtremes.mfMin > afMin[i] ? afMin[i] : oExtremes.mfMin;
        oExtremes.mfMax = afMax[i] > oExtremes.mfMax ? afMax[i] : oExtremes.mfMax;
    }
}

template <AriOperation eOperation, bool bScales>
void EvaluateAll(const AriRow& oRow, const float* pA, const float* pB, std::span<float> oOut,
                 AriExtremes& oExtremes)
{
    const Tag oTag;
    constexpr bool kDivides = eOperation == AriOperation::eQuotient;
    const auto oLow = hn::Set(oTag, oRow.mfLow);
    const auto oHigh = hn::Set(oTag, oRow.mfHigh);
    auto oMin = hn::Set(oTag, oExtremes.mfMin);
    auto oMax = hn::Set(oTag, oExtremes.mfMax);
    for (std::size_t i = 0; i < oOut.size(); i += hn::Lanes(oTag))
    {
        const auto oB = hn::LoadU(oTag, pB + i);
        const auto oResult =
            Evaluate<eOperation>(hn::LoadU(oTag, pA + i), oB, hn::Set(oTag, oRow.mfConstant));
        auto oAbove = hn::Gt(oResult, oMax);
        auto oBelow = hn::Gt(oMin, oResult);
        const auto oNoDivision = hn::Le(hn::Abs(oB), hn::Set(oTag, kAlmostZero));
        if constexpr (kDivides)
        {
            oAbove = hn::AndNot(oNoDivision, oAbove);
            oBelow = hn::AndNot(oNoDivision, oBelow);
        }
        // No minimum or maximum of vectors: those treat what is not a number in their own way.
        oMax = hn::IfThenElse(oAbove, oResult, oMax);
        oMin = hn::IfThenElse(oBelow, oResult, oMin);
        auto oStored = oResult;
        if constexpr (bScales)
        {
            oStored = hn::Add(
                hn::Mul(hn::Sub(oResult, hn::Set(oTag, oRow.mfFrom)), hn::Set(oTag, oRow.mfFactor)),
                oLow);
            oStored = hn::IfThenElse(hn::Gt(oLow, oStored), oLow, oStored);
            oStored = hn::IfThenElse(hn::Gt(oStored, oHigh), oHigh, oStored);
        }
        if constexpr (kDivides)
        {
            oStored = hn::IfThenElse(oNoDivision, hn::Set(oTag, oRow.mfZeroDivision), oStored);
        }
        hn::StoreU(oStored, oTag, &oOut[i]);
    }
    Reduce(oMin, oMax, oExtremes);
}

template <AriOperation eOperation>
void EvaluateAs(const AriRow& oRow, const float* pA, const float* pB, std::span<float> oOut,
                AriExtremes& oExtremes)
{
    const auto pfnEvaluate =
        oRow.mbScales ? EvaluateAll<eOperation, true> : EvaluateAll<eOperation, false>;
    pfnEvaluate(oRow, pA, pB, oOut, oExtremes);
}

void EvaluateRow(const AriRow& oRow, const float* pA, const float* pB, std::span<float> oOut,
                 AriExtremes& oExtremes)
{
    using Operation = decltype(&EvaluateAs<AriOperation::eSum>);
    static constexpr Operation kOperations[] = {
        EvaluateAs<AriOperation::eSum>,        EvaluateAs<AriOperation::eSumPlusConstant>,
        EvaluateAs<AriOperation::eDifference>, EvaluateAs<AriOperation::eDifferenceConstant>,
        EvaluateAs<AriOperation::eProduct>,    EvaluateAs<AriOperation::eQuotient>,
        EvaluateAs<AriOperation::eAnd>,        EvaluateAs<AriOperation::eOr>};
    kOperations[static_cast<std::size_t>(oRow.meOperation)](oRow, pA, pB, oOut, oExtremes);
}

}  // namespace kor::filters::kernels::HWY_NAMESPACE
HWY_AFTER_NAMESPACE();

#if HWY_ONCE
namespace kor::filters::kernels
{

HWY_EXPORT(EvaluateRow);

void EvaluateRow(const AriRow& oRow, const float* pA, const float* pB, std::span<float> oOut,
                 AriExtremes& oExtremes)
{
    HWY_DYNAMIC_DISPATCH(EvaluateRow)(oRow, pA, pB, oOut, oExtremes);
}

}  // namespace kor::filters::kernels
#endif
