#pragma once

#include <cstddef>

namespace kor::datasources
{

/// Copies nCount samples of nBytes each, 1, 2, 4, 8 or 16, from places nInStride bytes apart to
/// places nOutStride bytes apart.
void CopySamples(std::size_t nBytes, std::size_t nCount, const unsigned char* pIn,
                 std::size_t nInStride, unsigned char* pOut, std::size_t nOutStride);

}  // namespace kor::datasources
