#include "processes/qrdfilters/kernels/correlaterows.h"

#include "processes/qrdfilters/kernels/targets.h"

#undef HWY_TARGET_INCLUDE
#define HWY_TARGET_INCLUDE "processes/qrdfilters/kernels/correlaterows.cpp"
#include "hwy/foreach_target.h"
#include "processes/qrdfilters/kernels/stencil-inl.h"

HWY_BEFORE_NAMESPACE();

namespace kor::filters::kernels::HWY_NAMESPACE
{

struct Products
{
    template <class D>
    HWY_INLINE hn::Vec<D> Load(D oTag, std::size_t r, std::size_t i) const
    {
        return LoadForManyUses(oTag, mapRows[r] + i);
    }

    template <class D>
    HWY_INLINE hn::Vec<D> Term(D oTag, hn::Vec<D> oSample, std::size_t, std::size_t, std::size_t dy,
                               std::size_t dx) const
    {
        return hn::Mul(oSample, hn::Set(oTag, mpKernel[dy * mnWidth + dx]));
    }

    const double* const* mapRows;
    const double* mpKernel;
    std::size_t mnWidth;
};

struct Unchanged
{
    template <class D>
    HWY_INLINE hn::Vec<D> Of(D, hn::Vec<D> oSum) const
    {
        return oSum;
    }
};

void CorrelateRows(const StencilRows& oRows, std::span<const double> oKernel,
                   std::span<double* const> oOut)
{
    const auto oCorrelate = [&](auto kRows, const StencilRows& oPart, double* const* apOut) HWY_ATTR
    {
        const Products oTerms{oPart.moSamples.data(), oKernel.data(), oPart.mnWidth};
        const auto oVectors = [&](auto oTag, auto kVectors, std::size_t i) HWY_ATTR
        {
            const auto oSums = SumTerms<kRows(), kVectors()>(oTag, oPart, oTerms, i);
            StoreSums(oTag, oSums, Unchanged(), apOut, i);
        };
        ForEachVector<kManyVectors>(oPart.mnSamples, oVectors);
    };
    ForEachRowGroup(oRows, oOut, oCorrelate);
}

}  // namespace kor::filters::kernels::HWY_NAMESPACE

HWY_AFTER_NAMESPACE();

#if HWY_ONCE

namespace kor::filters::kernels
{

HWY_EXPORT(CorrelateRows);

void CorrelateRows(const StencilRows& oRows, std::span<const double> oKernel,
                   std::span<double* const> oOut)
{
    HWY_DYNAMIC_DISPATCH(CorrelateRows)(oRows, oKernel, oOut);
}

}  // namespace kor::filters::kernels

#endif
