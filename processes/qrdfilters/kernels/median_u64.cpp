#include "processes/qrdfilters/kernels/targets.h"

#undef HWY_TARGET_INCLUDE
#define HWY_TARGET_INCLUDE "processes/qrdfilters/kernels/median_u64.cpp"
#include "hwy/foreach_target.h"
#include "processes/qrdfilters/kernels/median-inl.h"

HWY_BEFORE_NAMESPACE();

namespace kor::filters::kernels::HWY_NAMESPACE
{

void SelectMediansU64(std::size_t nSide, const MedianBlock<std::uint64_t>& oBlock)
{
    SelectMediansOf(nSide, oBlock);
}

}  // namespace kor::filters::kernels::HWY_NAMESPACE

HWY_AFTER_NAMESPACE();

#if HWY_ONCE

namespace kor::filters::kernels
{

HWY_EXPORT(SelectMediansU64);

template <>
void SelectMedians(std::size_t nSide, const MedianBlock<std::uint64_t>& oBlock)
{
    HWY_DYNAMIC_DISPATCH(SelectMediansU64)(nSide, oBlock);
}

}  // namespace kor::filters::kernels

#endif
