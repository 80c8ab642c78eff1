#include "processes/qrdfilters/samplerows.h"

#include "processes/qrdfilters/kernels/convertrows.h"

namespace kor::filters::details
{

void ConvertRow(std::size_t nIn, std::size_t nOut, const void* pIn, void* pOut, std::size_t nCount)
{
    kernels::FindRowConversion(nIn, nOut)(pIn, pOut, nCount);
}

}  // namespace kor::filters::details
