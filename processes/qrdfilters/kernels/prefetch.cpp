#include "processes/qrdfilters/kernels/prefetch.h"

#include <hwy/cache_control.h>
#include <cstddef>

namespace kor::filters::kernels
{

void PrefetchBytes(std::span<const unsigned char> oBytes)
{
    constexpr std::size_t kLine = 64;
    for (std::size_t i = 0; i < oBytes.size(); i += kLine)
    {
        hwy::Prefetch(&oBytes[i]);
    }
}

}  // namespace kor::filters::kernels
