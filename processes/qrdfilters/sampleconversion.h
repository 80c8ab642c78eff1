#pragma once

#include <algorithm>
#include <limits>
#include <type_traits>
#include <utility>

#include "basic/core/typedispatch/typelist.h"

namespace kor::filters
{

/// The type in which samples of element type T are computed: signed char for char, else T.
template <class T>
using Arithmetic = std::conditional_t<std::is_same_v<T, char>, signed char, T>;

namespace details
{

/// Floating point to an integer of 32 bits or less: half away from zero for signed targets, plus
/// one half for unsigned ones, in the precision of the source; then clamped, then cut.
template <class TOut, class TIn>
constexpr TOut RoundAndClamp(TIn x)
{
    constexpr TOut kHighest = std::numeric_limits<TOut>::max();
    constexpr TOut kLowest = std::numeric_limits<TOut>::min();
    // Meant: float cannot hold 2^31 - 1 nor 2^32 - 1, so that its test is against the power of two.
    constexpr auto kUpperTest = static_cast<TIn>(kHighest);
    constexpr TIn kHalf = TIn(0.5);

    if (x != x)  // NOLINT(misc-redundant-expression): not a number, in a constant expression too
    {
        return 0;
    }
    const TIn r = std::is_unsigned_v<TOut> || x >= TIn(0) ? x + kHalf : x - kHalf;
    if (r >= kUpperTest)
    {
        return kHighest;
    }
    if (std::is_unsigned_v<TOut> ? r <= TIn(0) : r < TIn(kLowest))
    {
        return kLowest;
    }
    return static_cast<TOut>(r);
}

/// Floating point to a 64-bit integer: no rounding, and a negative value becomes 0, for the signed
/// type too. Both are meant.
template <class TOut, class TIn>
constexpr TOut CutPositive(TIn x)
{
    constexpr TIn kUpperTest =
        std::is_signed_v<TOut> ? TIn(9223372036854775808.0) : TIn(18446744073709551616.0);
    if (!(x > TIn(0)))
    {
        return 0;
    }
    return x >= kUpperTest ? std::numeric_limits<TOut>::max() : static_cast<TOut>(x);
}

/// Integer to another integer type. The signed 64-bit type is clamped at its upper end alone and
/// else gives its low bits; narrower signed ones lose their negative values on the way to any
/// 64-bit type. Both are meant.
template <class TOut, class TIn>
constexpr TOut ClampInteger(TIn x)
{
    using In = std::numeric_limits<TIn>;
    using Out = std::numeric_limits<TOut>;
    // Limits in the source's own type: in a wider one the compiler finds no vectors for the loops.
    constexpr TIn kHighest = std::in_range<TIn>(Out::max()) ? TIn(Out::max()) : In::max();
    constexpr TIn kTargetsLowest = std::in_range<TIn>(Out::min()) ? TIn(Out::min()) : In::min();
    constexpr TIn kLowest = std::is_same_v<TIn, int64> ? In::min()
                            : sizeof(TOut) == 8        ? TIn(0)
                                                       : kTargetsLowest;
    return static_cast<TOut>(std::clamp(x, kLowest, kHighest));
}

/// Unsigned 64-bit integers are read as signed ones, and 2^64 is added where that gave a negative
/// value, both in the target's precision: a value of more bits than that may be rounded twice.
template <class TOut, class TIn>
constexpr TOut ToFloatingPoint(TIn x)
{
    if constexpr (std::is_same_v<TIn, uint64>)
    {
        const auto nSigned = static_cast<int64>(x);
        const TOut fSigned = static_cast<TOut>(nSigned);
        return nSigned < 0 ? fSigned + TOut(18446744073709551616.0) : fSigned;
    }
    else
    {
        return static_cast<TOut>(x);
    }
}

}  // namespace details

/// One sample converted by the library's rules. Integers clamp rather than wrap; floating point is
/// rounded half away from zero for signed targets, x + 0.5 is cut for unsigned ones; not a number
/// gives 0. 64-bit integers have rules of their own, see the functions above.
template <class TIn, class TOut>
constexpr TOut ConvertSample(TIn xIn)
{
    using AIn = Arithmetic<TIn>;
    using AOut = Arithmetic<TOut>;
    const AIn x = static_cast<AIn>(xIn);
    if constexpr (std::is_same_v<AIn, AOut>)
    {
        return xIn;
    }
    else if constexpr (std::is_floating_point_v<AOut>)
    {
        return details::ToFloatingPoint<AOut>(x);
    }
    else if constexpr (std::is_integral_v<AIn>)
    {
        return static_cast<TOut>(details::ClampInteger<AOut>(x));
    }
    else if constexpr (sizeof(AOut) == 8)
    {
        return static_cast<TOut>(details::CutPositive<AOut>(x));
    }
    else
    {
        return static_cast<TOut>(details::RoundAndClamp<AOut>(x));
    }
}

/// re * re + im * im in the type of such a product (32-bit integers for narrower ones), cut to TOut
/// without rounding or clamping. Integers wrap, and lose their high bits in a narrower TOut. So do
/// floating-point sums, through the signed 64-bit type, in which what it cannot hold is -2^63; only
/// the unsigned 64-bit type takes them by ConvertSample.
template <class TIn, class TOut>
constexpr TOut IntensitySample(TIn xRe, TIn xIm)
{
    using Part = Arithmetic<TIn>;
    using Sum = decltype(Part() * Part());
    const auto re = static_cast<Part>(xRe);
    const auto im = static_cast<Part>(xIm);
    if constexpr (std::is_integral_v<Sum>)
    {
        using Wrapping = std::make_unsigned_t<Sum>;
        const auto nRe = static_cast<Wrapping>(re);
        const auto nIm = static_cast<Wrapping>(im);
        const auto nSum = static_cast<Sum>(nRe * nRe + nIm * nIm);
        if constexpr (std::is_floating_point_v<TOut>)
        {
            return details::ToFloatingPoint<TOut>(nSum);
        }
        else
        {
            return static_cast<TOut>(nSum);
        }
    }
    else if constexpr (std::is_floating_point_v<TOut> || std::is_same_v<TOut, uint64>)
    {
        return ConvertSample<Sum, TOut>(re * re + im * im);
    }
    else
    {
        constexpr Sum kLimit = 9223372036854775808.0;
        const Sum dfSum = re * re + im * im;
        return static_cast<TOut>(dfSum < kLimit ? static_cast<int64>(dfSum)
                                                : std::numeric_limits<int64>::min());
    }
}

}  // namespace kor::filters
