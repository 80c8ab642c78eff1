#include "platform/datasources/copysamples.h"

#include <cstring>
#include <type_traits>

namespace kor::datasources
{

void CopySamples(std::size_t nBytes, std::size_t nCount, const unsigned char* pIn,
                 std::size_t nInStride, unsigned char* pOut, std::size_t nOutStride)
{
    const auto oCopy = [&](auto nFixedBytes)
    {
        for (std::size_t i = 0; i < nCount; ++i)
        {
            std::memcpy(pOut + i * nOutStride, pIn + i * nInStride, nFixedBytes());
        }
    };
    // A copy of a fixed number of bytes is one move, of a variable number a call.
    switch (nBytes)
    {
        case 1:
            return oCopy(std::integral_constant<std::size_t, 1>());
        case 2:
            return oCopy(std::integral_constant<std::size_t, 2>());
        case 4:
            return oCopy(std::integral_constant<std::size_t, 4>());
        case 8:
            return oCopy(std::integral_constant<std::size_t, 8>());
        default:
            return oCopy(std::integral_constant<std::size_t, 16>());
    }
}

}  // namespace kor::datasources
