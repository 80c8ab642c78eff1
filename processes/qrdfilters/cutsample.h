#pragma once

#include <limits>
#include <type_traits>
#include <utility>

#include "processes/qrdfilters/sampleconversion.h"

namespace kor::filters
{

/// One sample converted without rounding and without wrapping: a value outside the range of TOut
/// gives the limit, floating point is cut towards zero, not a number gives 0 in an integer. An
/// infinity in double becomes the greatest finite float. Unlike ConvertSample it has no rules of
/// its own for 64-bit integers.
template <class TIn, class TOut>
constexpr TOut CutSample(TIn xIn)
{
    using AIn = Arithmetic<TIn>;
    using AOut = Arithmetic<TOut>;
    using Out = std::numeric_limits<AOut>;
    const AIn x = static_cast<AIn>(xIn);
    if constexpr (std::is_same_v<AIn, AOut>)
    {
        return xIn;
    }
    else if constexpr (std::is_integral_v<AIn> && std::is_floating_point_v<AOut>)
    {
        return details::ToFloatingPoint<AOut>(x);
    }
    else if constexpr (std::is_integral_v<AIn>)
    {
        return static_cast<TOut>(std::cmp_less(x, Out::min())      ? Out::min()
                                 : std::cmp_greater(x, Out::max()) ? Out::max()
                                                                   : static_cast<AOut>(x));
    }
    else if constexpr (std::is_same_v<AOut, double>)
    {
        return x;
    }
    else
    {
        // The upper limits of wide integers are powers of two here, one more than they hold.
        const double dfX = x;
        if (std::is_integral_v<AOut> && dfX != dfX)  // NOLINT(misc-redundant-expression)
        {
            return 0;
        }
        return static_cast<TOut>(dfX < static_cast<double>(Out::lowest()) ? Out::lowest()
                                 : dfX >= static_cast<double>(Out::max()) ? Out::max()
                                                                          : static_cast<AOut>(dfX));
    }
}

}  // namespace kor::filters
