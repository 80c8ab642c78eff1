#pragma once

#include <cstdint>
#include <limits>
#include <type_traits>

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
    // Meant: the largest float below 2^31 or 2^32 is no limit of the integer, so a float is tested
    // against the power of two and a double against the integer's own maximum.
    constexpr bool bPowerOfTwo = std::is_same_v<TIn, float> && sizeof(TOut) == 4;
    constexpr TOut kHighest = std::numeric_limits<TOut>::max();
    constexpr TOut kLowest = std::numeric_limits<TOut>::min();
    constexpr TIn kUpperTest =
        bPowerOfTwo ? static_cast<TIn>(static_cast<double>(kHighest) + 1.0) : TIn(kHighest);
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

/// Integer to a narrower or equally wide integer. The signed 64-bit type is clamped at its upper
/// end alone and else gives its low bits; narrower signed ones lose their negative values on the
/// way to any 64-bit type. Both are meant.
template <class TOut, class TIn>
constexpr TOut ClampInteger(TIn x)
{
    if constexpr (std::is_same_v<TIn, int64> && std::is_same_v<TOut, uint64>)
    {
        return static_cast<TOut>(x);
    }
    else if constexpr (std::is_same_v<TIn, int64>)
    {
        constexpr int64 kHighest{std::numeric_limits<TOut>::max()};
        return x >= kHighest ? std::numeric_limits<TOut>::max() : static_cast<TOut>(x);
    }
    else if constexpr (std::is_same_v<TIn, uint64>)
    {
        constexpr auto kHighest = static_cast<uint64>(std::numeric_limits<TOut>::max());
        return x >= kHighest ? std::numeric_limits<TOut>::max() : static_cast<TOut>(x);
    }
    else
    {
        // 32 bits and less: int64 holds every value of both sides.
        constexpr bool bWide = sizeof(TOut) == 8;
        constexpr int64 kHighest =
            bWide ? std::numeric_limits<int64>::max() : int64(std::numeric_limits<TOut>::max());
        constexpr int64 kLowest = bWide ? 0 : int64(std::numeric_limits<TOut>::min());
        const int64 nValue = x;
        return static_cast<TOut>(nValue < kLowest    ? kLowest
                                 : nValue > kHighest ? kHighest
                                                     : nValue);
    }
}

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

}  // namespace kor::filters
