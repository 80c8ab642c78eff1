#pragma once

#include <cstddef>
#include <vector>

/// Vectors that a caller sizes and that are used by index: what lies outside reads as 0 and is not
/// written.
namespace kor::filters
{

template <class T>
T ElementOf(const std::vector<T>& vElements, std::size_t nIndex)
{
    return nIndex < vElements.size() ? vElements[nIndex] : T(0);
}

template <class T>
void SetElement(std::vector<T>& vElements, std::size_t nIndex, T xValue)
{
    if (nIndex < vElements.size())
    {
        vElements[nIndex] = xValue;
    }
}

}  // namespace kor::filters
