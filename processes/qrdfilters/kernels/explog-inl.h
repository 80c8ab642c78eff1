// Exponential and natural logarithm of doubles for one instruction set. A unit includes it once for
// each, which is why it has no guard.
//
// The same operations in the same order on every target and no fused ones, so that all give the
// same bits. Errors stay below 1 ulp of the true value, subnormal results included, and results
// within 1 ulp of the C library's; see the tests of the kernels that use them.
//
// Source   the argument reductions and polynomials of fdlibm (Sun Microsystems, 1993), written
//          without branches: P. T. P. Tang, "Table-driven implementation of the exponential
//          function in IEEE floating-point arithmetic", ACM TOMS 15(2), 144-157, 1989, tells why
//          such reductions keep the error small.

#include <cstdint>
#include <limits>

#include <hwy/highway.h>

HWY_BEFORE_NAMESPACE();
namespace kor::filters::kernels::HWY_NAMESPACE
{

namespace hn = hwy::HWY_NAMESPACE;

// ln 2 in two parts: the first ends in 21 zero bits, so that its product with an exponent is exact.
constexpr double kLn2High = 6.93147180369123816490e-01;
constexpr double kLn2Low = 1.90821492927058770002e-10;

/// c[0] + x * (c[1] + x * (c[2] + ...)).
template <class D, class V, std::size_t kCount>
HWY_INLINE V Polynomial(D oTag, V x, const double (&adfCoefficients)[kCount])
{
    V oSum = hn::Set(oTag, adfCoefficients[kCount - 1]);
    for (std::size_t k = kCount - 1; k-- > 0;)
    {
        oSum = hn::Add(hn::Set(oTag, adfCoefficients[k]), hn::Mul(x, oSum));
    }
    return oSum;
}

/// 2^k of oShifted = k + 1.5 * 2^52, for k in the range of a normal exponent: the lowest bits of
/// such a sum are those of k.
template <class D, class V>
HWY_INLINE V PowerOfTwo(D oTag, V oShifted)
{
    const hn::RebindToUnsigned<D> oBitsTag;
    const auto oExponent = hn::Add(hn::BitCast(oBitsTag, oShifted), hn::Set(oBitsTag, 1023));
    return hn::BitCast(oTag, hn::ShiftLeft<52>(oExponent));
}

template <class D, class V>
HWY_INLINE V Exp(D oTag, V x)
{
    constexpr double kRound = 6755399441055744.0;  // 1.5 * 2^52: adding it rounds to an integer
    constexpr double kFarEnough = 800.0;           // beyond, the result is 0 or infinite
    constexpr double kCoefficients[] = {1.66666666666666019037e-01, -2.77777777770155933842e-03,
                                        6.61375632143793436117e-05, -1.65339022054652515390e-06,
                                        4.13813679705723846039e-08};
    const V oRound = hn::Set(oTag, kRound);
    const V oOne = hn::Set(oTag, 1.0);
    x = hn::IfThenElse(hn::Gt(x, hn::Set(oTag, kFarEnough)), hn::Set(oTag, kFarEnough), x);
    x = hn::IfThenElse(hn::Lt(x, hn::Set(oTag, -kFarEnough)), hn::Set(oTag, -kFarEnough), x);

    // x = k * ln 2 + r, with r in two parts.
    const V k = hn::Sub(hn::Add(hn::Mul(x, hn::Set(oTag, 1.44269504088896338700)), oRound), oRound);
    const V oHigh = hn::Sub(x, hn::Mul(k, hn::Set(oTag, kLn2High)));
    const V oLow = hn::Mul(k, hn::Set(oTag, kLn2Low));
    const V r = hn::Sub(oHigh, oLow);

    // e^r = 1 + r + r * c / (2 - c), with c = r - r^2 * P(r^2).
    const V oSquare = hn::Mul(r, r);
    const V c = hn::Sub(r, hn::Mul(oSquare, Polynomial(oTag, oSquare, kCoefficients)));
    const V oQuotient = hn::Div(hn::Mul(r, c), hn::Sub(hn::Set(oTag, 2.0), c));
    const V oPower = hn::Sub(oOne, hn::Sub(hn::Sub(oLow, oQuotient), oHigh));

    // Times 2^k in two steps: 2^k itself need not be a normal number, and is rounded in the last.
    const V oHalf = hn::Add(hn::Mul(k, hn::Set(oTag, 0.5)), oRound);
    const V oRest = hn::Add(hn::Sub(k, hn::Sub(oHalf, oRound)), oRound);
    return hn::Mul(hn::Mul(oPower, PowerOfTwo(oTag, oHalf)), PowerOfTwo(oTag, oRest));
}

/// What a logarithm gives where x is no positive finite number.
template <class D, class V>
HWY_INLINE V LogOfSpecial(D oTag, V x)
{
    constexpr double kInfinity = std::numeric_limits<double>::infinity();
    const V oZeroOrNaN = hn::IfThenElse(hn::Eq(x, hn::Zero(oTag)), hn::Set(oTag, -kInfinity),
                                        hn::Set(oTag, std::numeric_limits<double>::quiet_NaN()));
    return hn::IfThenElse(hn::Eq(x, hn::Set(oTag, kInfinity)), x, oZeroOrNaN);
}

template <class D, class V>
HWY_INLINE V Log(D oTag, V x)
{
    constexpr double kInfinity = std::numeric_limits<double>::infinity();
    constexpr double kCoefficients[] = {6.666666666666735130e-01, 3.999999999940941908e-01,
                                        2.857142874366239149e-01, 2.222219843214978396e-01,
                                        1.818357216161805012e-01, 1.531383769920937332e-01,
                                        1.479819860511658591e-01};
    constexpr double kTwoTo52 = 4503599627370496.0;
    constexpr std::uint64_t kRootHalf = 0x3FE6A09E00000000;  // bits of sqrt(1/2), rounded
    const hn::RebindToUnsigned<D> oBitsTag;
    const V oOrdinary =
        hn::IfThenElse(hn::And(hn::Gt(x, hn::Zero(oTag)), hn::Lt(x, hn::Set(oTag, kInfinity))), x,
                       hn::Set(oTag, 1.0));

    // x = 2^k * (1 + f) with 1 + f in sqrt(1/2)..sqrt(2); subnormal numbers are lifted first.
    const auto oSmall = hn::Lt(oOrdinary, hn::Set(oTag, std::numeric_limits<double>::min()));
    const V oLifted =
        hn::IfThenElse(oSmall, hn::Mul(oOrdinary, hn::Set(oTag, kTwoTo52)), oOrdinary);
    const auto oBits =
        hn::Add(hn::BitCast(oBitsTag, oLifted), hn::Set(oBitsTag, 0x3FF0000000000000 - kRootHalf));
    const auto oExponent =
        hn::Or(hn::ShiftRight<52>(oBits), hn::BitCast(oBitsTag, hn::Set(oTag, kTwoTo52)));
    const V oLift = hn::IfThenElse(oSmall, hn::Set(oTag, kTwoTo52 + 1023.0 + 52.0),
                                   hn::Set(oTag, kTwoTo52 + 1023.0));
    const V k = hn::Sub(hn::BitCast(oTag, oExponent), oLift);
    const auto oFraction = hn::And(oBits, hn::Set(oBitsTag, 0x000FFFFFFFFFFFFF));
    const V f = hn::Sub(hn::BitCast(oTag, hn::Add(oFraction, hn::Set(oBitsTag, kRootHalf))),
                        hn::Set(oTag, 1.0));

    // ln(1 + f) = f - f^2 / 2 + s * (f^2 / 2 + R(s^2)), with s = f / (2 + f).
    const V s = hn::Div(f, hn::Add(hn::Set(oTag, 2.0), f));
    const V oSquare = hn::Mul(s, s);
    const V oRemainder = hn::Mul(oSquare, Polynomial(oTag, oSquare, kCoefficients));
    const V oHalfSquare = hn::Mul(hn::Mul(hn::Set(oTag, 0.5), f), f);
    const V oCorrection =
        hn::Add(hn::Mul(s, hn::Add(oHalfSquare, oRemainder)), hn::Mul(k, hn::Set(oTag, kLn2Low)));
    const V oLog =
        hn::Sub(hn::Mul(k, hn::Set(oTag, kLn2High)), hn::Sub(hn::Sub(oHalfSquare, oCorrection), f));
    return hn::IfThenElse(hn::Eq(x, oOrdinary), oLog, LogOfSpecial(oTag, x));
}

}  // namespace kor::filters::kernels::HWY_NAMESPACE
HWY_AFTER_NAMESPACE();
