#pragma once

#include <cstddef>

namespace kor::filters::kernels
{

/// Converts nCount samples from pIn to pOut.
using RowConversion = void (*)(const void* pIn, void* pOut, std::size_t nCount);

/// The row function of ConvertSample for the element types at the positions nIn and nOut of
/// StandardTypeList, both below ten, as this processor runs it best. Input and output may overlap
/// only where the types are equal.
RowConversion FindRowConversion(std::size_t nIn, std::size_t nOut);

}  // namespace kor::filters::kernels
