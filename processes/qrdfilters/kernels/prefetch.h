#pragma once

#include <span>

namespace kor::filters::kernels
{

/// Asks for the cache lines of these bytes, which will be read soon.
void PrefetchBytes(std::span<const unsigned char> oBytes);

}  // namespace kor::filters::kernels
