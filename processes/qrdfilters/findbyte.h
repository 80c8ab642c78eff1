#pragma once

#include <cstddef>
#include <span>

namespace kor::filters
{

/// Position of the first byte at nStart or behind it that is nByte; the size of oBytes where there
/// is none. Rows of flags mostly hold long runs of one value, which this passes many at a time.
std::size_t FindByte(std::span<const unsigned char> oBytes, std::size_t nStart,
                     unsigned char nByte);

}  // namespace kor::filters
