#include "processes/qrdfilters/kernels/specklerows.h"

#include <cstddef>

#include "processes/qrdfilters/kernels/targets.h"

#undef HWY_TARGET_INCLUDE
#define HWY_TARGET_INCLUDE "processes/qrdfilters/kernels/specklerows.cpp"
#include <hwy/foreach_target.h>
#include <hwy/highway.h>

#include "processes/qrdfilters/kernels/explog-inl.h"

HWY_BEFORE_NAMESPACE();
namespace kor::filters::kernels::HWY_NAMESPACE
{

using Doubles = hn::CappedTag<double, 8>;
using Vector = hn::Vec<Doubles>;
constexpr Doubles kTag;

HWY_INLINE Vector Same(double dfValue)
{
    return hn::Set(kTag, dfValue);
}

/// What a filter reads of the windows of one vector of pixels.
struct Moments
{
    Vector moCentre;
    Vector moMean;
    Vector moVariance;
};

/// oOut = oFinish(moments), but the centre where it is the only valid sample.
template <class Finish>
HWY_INLINE void FinishRow(const MomentRows& oRows, std::span<double> oOut, const Finish& oFinish)
{
    const Vector oOne = Same(1.0);
    for (std::size_t i = 0; i < oOut.size(); i += hn::Lanes(kTag))
    {
        const Vector oCount = hn::LoadU(kTag, oRows.mpCounts + i);
        const Vector oMean = hn::Div(hn::LoadU(kTag, oRows.mpSums + i), oCount);
        const Vector oSquares =
            hn::Sub(hn::LoadU(kTag, oRows.mpSquares + i), hn::Mul(hn::Mul(oMean, oCount), oMean));
        const Vector oCentre = hn::LoadU(kTag, oRows.mpCentres + i);
        const Vector oResult =
            oFinish(Moments{oCentre, oMean, hn::Div(oSquares, hn::Sub(oCount, oOne))});
        hn::StoreU(hn::IfThenElse(hn::Eq(oCount, oOne), oCentre, oResult), kTag, &oOut[i]);
    }
}

void LeeAdditiveRow(const MomentRows& oRows, const LeeNoise& oNoise, std::span<double> oOut)
{
    const Vector oNoiseVariance = Same(oNoise.mdfVariance);
    FinishRow(oRows, oOut,
              [&](const Moments& o) HWY_ATTR
              {
                  const Vector oGain = hn::Div(o.moVariance, hn::Add(o.moVariance, oNoiseVariance));
                  return hn::Add(hn::Mul(hn::Sub(o.moCentre, o.moMean), oGain), o.moMean);
              });
}

void LeeMultiplicativeRow(const MomentRows& oRows, const LeeNoise& oNoise, std::span<double> oOut)
{
    const Vector oNoiseVariance = Same(oNoise.mdfVariance);
    const Vector oMulMean = Same(oNoise.mdfMulMean);
    const Vector oZero = hn::Zero(kTag);
    FinishRow(oRows, oOut,
              [&](const Moments& o) HWY_ATTR
              {
                  const Vector oNoiseOfMean = hn::Mul(hn::Mul(o.moMean, oNoiseVariance), o.moMean);
                  Vector oGain = hn::Sub(Same(1.0), hn::Div(oNoiseOfMean, o.moVariance));
                  // Not a maximum: a gain that is not a number stays.
                  oGain = hn::IfThenElse(hn::Gt(oZero, oGain), oZero, oGain);
                  const Vector oDeviation = hn::Sub(o.moCentre, hn::Mul(o.moMean, oMulMean));
                  return hn::Add(hn::Mul(oDeviation, oGain), o.moMean);
              });
}

void LeeMixedRow(const MomentRows& oRows, const LeeNoise& oNoise, std::span<double> oOut)
{
    const Vector oNoiseVariance = Same(oNoise.mdfVariance);
    const Vector oMulMean = Same(oNoise.mdfMulMean);
    const Vector oAddMean = Same(oNoise.mdfAddMean);
    FinishRow(oRows, oOut,
              [&](const Moments& o) HWY_ATTR
              {
                  const Vector a = hn::Mul(o.moVariance, oMulMean);
                  const Vector oAll =
                      hn::Add(hn::Add(hn::Mul(a, oMulMean), o.moVariance), oNoiseVariance);
                  const Vector oDeviation =
                      hn::Sub(hn::Sub(o.moCentre, hn::Mul(o.moMean, oMulMean)), oAddMean);
                  return hn::Add(hn::Mul(oDeviation, hn::Div(a, oAll)), o.moMean);
              });
}

void EnhancedLeeRow(const MomentRows& oRows, double dfLowest, double dfHighest, double dfDamp,
                    std::span<double> oOut)
{
    const Vector oLowest = Same(dfLowest);
    const Vector oHighest = Same(dfHighest);
    const Vector oDamp = Same(dfDamp);
    FinishRow(oRows, oOut,
              [&](const Moments& o) HWY_ATTR
              {
                  const Vector oVariation = hn::Div(hn::Sqrt(o.moVariance), o.moMean);
                  const Vector oFall = hn::Div(hn::Mul(hn::Sub(oVariation, oLowest), oDamp),
                                               hn::Sub(oHighest, oVariation));
                  const Vector e = Exp(kTag, hn::Neg(oFall));
                  const Vector oMixed =
                      hn::Add(hn::Mul(hn::Sub(Same(1.0), e), o.moCentre), hn::Mul(e, o.moMean));
                  const Vector oNotFlat =
                      hn::IfThenElse(hn::Ge(oVariation, oHighest), o.moCentre, oMixed);
                  return hn::IfThenElse(hn::Ge(oLowest, oVariation), o.moMean, oNotFlat);
              });
}

void KuanRow(const MomentRows& oRows, double dfLooks, std::span<double> oOut)
{
    const Vector oLooks = Same(dfLooks);
    const Vector oMoreLooks = Same(dfLooks + 1.0);
    FinishRow(oRows, oOut,
              [&](const Moments& o) HWY_ATTR
              {
                  const Vector oRatio = hn::Div(hn::Mul(o.moMean, o.moMean), o.moVariance);
                  const Vector w = hn::Div(hn::Sub(oLooks, oRatio), oMoreLooks);
                  const Vector oMixed =
                      hn::Add(hn::Mul(hn::Sub(Same(1.0), w), o.moMean), hn::Mul(w, o.moCentre));
                  return hn::IfThenElse(hn::Ge(hn::Zero(kTag), w), o.moMean, oMixed);
              });
}

void GammaRow(const MomentRows& oRows, double dfLooks, std::span<double> oOut)
{
    const Vector oLooks = Same(dfLooks);
    const Vector oMoreLooks = Same(dfLooks + 1.0);
    FinishRow(oRows, oOut,
              [&](const Moments& o) HWY_ATTR
              {
                  const Vector q = hn::Mul(o.moMean, o.moMean);
                  const Vector v = hn::Mul(oLooks, o.moVariance);
                  const Vector a = hn::Div(hn::Mul(oMoreLooks, q), hn::Sub(v, q));
                  const Vector b = hn::Sub(hn::Sub(a, oLooks), Same(1.0));
                  const Vector oCross = hn::Mul(hn::Mul(hn::Mul(a, Same(4.0)), oLooks), o.moMean);
                  const Vector d = hn::Add(hn::Mul(oCross, o.moCentre), hn::Mul(hn::Mul(b, q), b));
                  const Vector oBase = hn::Mul(b, o.moMean);
                  const Vector t =
                      hn::IfThenElse(hn::Gt(d, hn::Zero(kTag)), hn::Add(oBase, hn::Sqrt(d)), oBase);
                  const Vector oRoot = hn::Div(t, hn::Mul(a, Same(2.0)));
                  const Vector oNotFlat =
                      hn::IfThenElse(hn::Ge(v, hn::Mul(q, Same(2.0))), o.moCentre, oRoot);
                  return hn::IfThenElse(hn::Ge(q, v), o.moMean, oNotFlat);
              });
}

}  // namespace kor::filters::kernels::HWY_NAMESPACE
HWY_AFTER_NAMESPACE();

#if HWY_ONCE
namespace kor::filters::kernels
{

HWY_EXPORT(LeeAdditiveRow);
HWY_EXPORT(LeeMultiplicativeRow);
HWY_EXPORT(LeeMixedRow);
HWY_EXPORT(EnhancedLeeRow);
HWY_EXPORT(KuanRow);
HWY_EXPORT(GammaRow);

void LeeAdditiveRow(const MomentRows& oRows, const LeeNoise& oNoise, std::span<double> oOut)
{
    HWY_DYNAMIC_DISPATCH(LeeAdditiveRow)(oRows, oNoise, oOut);
}

void LeeMultiplicativeRow(const MomentRows& oRows, const LeeNoise& oNoise, std::span<double> oOut)
{
    HWY_DYNAMIC_DISPATCH(LeeMultiplicativeRow)(oRows, oNoise, oOut);
}

void LeeMixedRow(const MomentRows& oRows, const LeeNoise& oNoise, std::span<double> oOut)
{
    HWY_DYNAMIC_DISPATCH(LeeMixedRow)(oRows, oNoise, oOut);
}

void EnhancedLeeRow(const MomentRows& oRows, double dfLowest, double dfHighest, double dfDamp,
                    std::span<double> oOut)
{
    HWY_DYNAMIC_DISPATCH(EnhancedLeeRow)(oRows, dfLowest, dfHighest, dfDamp, oOut);
}

void KuanRow(const MomentRows& oRows, double dfLooks, std::span<double> oOut)
{
    HWY_DYNAMIC_DISPATCH(KuanRow)(oRows, dfLooks, oOut);
}

void GammaRow(const MomentRows& oRows, double dfLooks, std::span<double> oOut)
{
    HWY_DYNAMIC_DISPATCH(GammaRow)(oRows, dfLooks, oOut);
}

}  // namespace kor::filters::kernels
#endif
