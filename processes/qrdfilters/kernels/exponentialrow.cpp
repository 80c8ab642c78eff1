#include "processes/qrdfilters/kernels/exponentialrow.h"

#include "processes/qrdfilters/kernels/targets.h"

#include <array>

#undef HWY_TARGET_INCLUDE
#define HWY_TARGET_INCLUDE "processes/qrdfilters/kernels/exponentialrow.cpp"
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

HWY_INLINE Vector Constant(double dfValue)
{
    return hn::Set(kTag, dfValue);
}

// 1.5 * 2^52: a small number added to it is rounded to an integer, which stands in its low bits.
constexpr double kInteger = 6755399441055744.0;

/// The integer next to x, and 2 to its power.
struct Power
{
    Vector moExponent;
    Vector moValue;
};

/// |x| is at most 1000.
HWY_INLINE Power PowerOfTwo(Vector x)
{
    const Vector oShifted = hn::Add(x, Constant(kInteger));
    const hn::RebindToUnsigned<Doubles> oBits;
    const auto oBiased = hn::Add(hn::BitCast(oBits, oShifted), hn::Set(oBits, 1023));
    return {hn::Sub(oShifted, Constant(kInteger)), hn::BitCast(kTag, hn::ShiftLeft<52>(oBiased))};
}

constexpr std::array<double, 14> InverseFactorials()
{
    std::array<double, 14> adfResult{};
    double dfFactorial = 1.0;  // exact up to 18!
    for (std::size_t n = 0; n < adfResult.size(); ++n)
    {
        dfFactorial = n == 0 ? 1.0 : dfFactorial * static_cast<double>(n);
        adfResult[n] = 1.0 / dfFactorial;
    }
    return adfResult;
}

/// exp(r) - 1 - r for |r| <= ln(2) / 2, where the first term left out, r^14 / 14!, is below
/// 2^-57. Pairs of terms are added first: fewer steps wait for each other.
HWY_INLINE Vector BeyondLinear(Vector r)
{
    static constexpr std::array<double, 14> kTerms = InverseFactorials();
    const auto oPair = [r](std::size_t n)
    { return hn::Add(Constant(kTerms[n]), hn::Mul(Constant(kTerms[n + 1]), r)); };
    const Vector r2 = hn::Mul(r, r);
    const Vector r4 = hn::Mul(r2, r2);
    const Vector r8 = hn::Mul(r4, r4);
    const Vector o2 = hn::Add(oPair(2), hn::Mul(oPair(4), r2));
    const Vector o6 = hn::Add(oPair(6), hn::Mul(oPair(8), r2));
    const Vector o10 = hn::Add(oPair(10), hn::Mul(oPair(12), r2));
    return hn::Mul(r2, hn::Add(hn::Add(o2, hn::Mul(o6, r4)), hn::Mul(o10, r8)));
}

/// exp(x) = 2^k * exp(r), x = k * ln(2) + r.
struct Parts
{
    Vector moShiftedK;  ///< k + kInteger
    Vector moExpR;
};

/// |x| is at most 1000.
HWY_INLINE Parts Split(Vector x)
{
    const Vector oShifted =
        hn::Add(hn::Mul(x, Constant(1.44269504088896338700e+00)), Constant(kInteger));
    const Vector k = hn::Sub(oShifted, Constant(kInteger));
    // ln(2) in two parts; the first has 32 bits, so that its product with k is exact, and so is
    // what it leaves of x.
    const Vector oHigh = hn::Sub(x, hn::Mul(k, Constant(6.93147180369123816490e-01)));
    const Vector oLow = hn::Mul(k, Constant(1.90821492927058770002e-10));
    const Vector r = hn::Sub(oHigh, oLow);
    const Vector oRest = hn::Sub(hn::Sub(oHigh, r), oLow);  // of r

    const Vector oOne = Constant(1.0);
    const Vector oLinear = hn::Add(oOne, r);
    const Vector oLinearRest = hn::Sub(r, hn::Sub(oLinear, oOne));
    const Vector oSmall = hn::Add(BeyondLinear(r), hn::Mul(oRest, oLinear));
    return {oShifted, hn::Add(oLinear, hn::Add(oLinearRest, oSmall))};
}

/// For any argument. 2^k itself may be no double where the result is one: it is multiplied in two
/// steps, of which the second alone rounds.
HWY_NOINLINE Vector AnyExponential(Vector oArgument)
{
    // Beyond these the result is 0 or infinite. A NaN may become anything here.
    const Vector x = hn::Min(hn::Max(oArgument, Constant(-760.0)), Constant(720.0));
    const Parts oParts = Split(x);
    const Vector k = hn::Sub(oParts.moShiftedK, Constant(kInteger));
    const Power oFirst = PowerOfTwo(hn::Mul(k, Constant(0.5)));
    const Power oSecond = PowerOfTwo(hn::Sub(k, oFirst.moExponent));
    const Vector oResult = hn::Mul(hn::Mul(oParts.moExpR, oFirst.moValue), oSecond.moValue);
    return hn::IfThenElse(hn::Eq(oArgument, oArgument), oResult, oArgument);
}

HWY_INLINE Vector Exponential(Vector oArgument)
{
    // From -708 to 708 all results are normal: k is added to their exponent.
    const auto oUsual = hn::Lt(hn::Abs(oArgument), Constant(708.0));
    if (HWY_UNLIKELY(!hn::AllTrue(kTag, oUsual)))
    {
        return AnyExponential(oArgument);
    }
    const Parts oParts = Split(oArgument);
    const hn::RebindToUnsigned<Doubles> oBits;
    const auto oExponent = hn::ShiftLeft<52>(hn::BitCast(oBits, oParts.moShiftedK));
    return hn::BitCast(kTag, hn::Add(hn::BitCast(oBits, oParts.moExpR), oExponent));
}

/// Distance 0 without the way through the exponential.
HWY_INLINE void RaiseCentre(std::span<const double> oCoefficients, double* pWeights)
{
    for (std::size_t i = 0; i < oCoefficients.size(); i += kLanes)
    {
        // 1, or not a number where the coefficient is not finite.
        const Vector oProduct = hn::Mul(hn::LoadU(kTag, &oCoefficients[i]), hn::Zero(kTag));
        hn::StoreU(hn::Sub(Constant(1.0), oProduct), kTag, pWeights + i);
    }
}

void RaiseWeights(std::span<const double> oCoefficients, std::span<const double> oDistances,
                  double* pWeights, std::size_t nPitch)
{
    for (const double dfDistance : oDistances)
    {
        if (dfDistance == 0.0)
        {
            RaiseCentre(oCoefficients, pWeights);
        }
        else
        {
            const Vector oDistance = Constant(-dfDistance);
            for (std::size_t i = 0; i < oCoefficients.size(); i += kLanes)
            {
                const Vector oCoefficient = hn::LoadU(kTag, &oCoefficients[i]);
                hn::StoreU(Exponential(hn::Mul(oCoefficient, oDistance)), kTag, pWeights + i);
            }
        }
        pWeights += nPitch;
    }
}

}  // namespace kor::filters::kernels::HWY_NAMESPACE
HWY_AFTER_NAMESPACE();

#if HWY_ONCE
namespace kor::filters::kernels
{

HWY_EXPORT(RaiseWeights);

void RaiseWeights(std::span<const double> oCoefficients, std::span<const double> oDistances,
                  double* pWeights, std::size_t nPitch)
{
    HWY_DYNAMIC_DISPATCH(RaiseWeights)(oCoefficients, oDistances, pWeights, nPitch);
}

}  // namespace kor::filters::kernels
#endif
