#pragma once

#include <cmath>
#include <type_traits>

namespace kor::filters
{

/// The ascending order of samples, in which every sorting gives the same samples on every machine:
/// -0.0 comes before 0.0, and what is not a number after all others.
struct Ascending
{
    template <class T>
    bool operator()(T a, T b) const
    {
        if constexpr (std::is_floating_point_v<T>)
        {
            if (a == b)
            {
                return std::signbit(a) && !std::signbit(b);
            }
            return a < b || (std::isnan(b) && !std::isnan(a));
        }
        else
        {
            return a < b;
        }
    }
};

}  // namespace kor::filters
