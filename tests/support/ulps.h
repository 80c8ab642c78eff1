#pragma once

#include <bit>
#include <cmath>
#include <cstdint>
#include <limits>

namespace kor::test
{

/// Doubles between a and b, one of them counted; 0 for two NaNs, the most there is for one.
inline std::uint64_t UlpsBetween(double a, double b)
{
    if (std::isnan(a) || std::isnan(b))
    {
        return std::isnan(a) && std::isnan(b) ? 0 : std::numeric_limits<std::uint64_t>::max();
    }
    // Counted from the lowest number, so that both zeros are neighbours.
    const auto oPlace = [](double x)
    {
        const auto nBits = std::bit_cast<std::uint64_t>(x);
        constexpr std::uint64_t kSign = std::uint64_t{1} << 63;
        return (nBits & kSign) != 0 ? ~nBits : nBits | kSign;
    };
    return oPlace(a) < oPlace(b) ? oPlace(b) - oPlace(a) : oPlace(a) - oPlace(b);
}

}  // namespace kor::test
