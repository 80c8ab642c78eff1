#pragma once

#include <cstddef>
#include <span>

#include "basic/core/typedispatch/typelist.h"

namespace kor::filters
{

namespace details
{

/// ConvertSamples for the element types at the positions nIn and nOut of StandardTypeList.
void ConvertRow(std::size_t nIn, std::size_t nOut, const void* pIn, void* pOut, std::size_t nCount);

}  // namespace details

/// nCount samples converted by the rules of ConvertSample<TIn, TOut>; equal types are copied.
/// Exists for the hundred pairs of element types. Input and output may overlap only where the types
/// are equal.
template <class TIn, class TOut>
void ConvertSamples(const TIn* pIn, TOut* pOut, std::size_t nCount)
{
    details::ConvertRow(typedispatch::ElementPosition<TIn>(), typedispatch::ElementPosition<TOut>(),
                        pIn, pOut, nCount);
}

/// Loader: samples of element type TIn, widened to double.
template <class TIn>
void LoadSamples(const TIn* pIn, std::span<double> vdfOut)
{
    ConvertSamples<TIn, double>(pIn, vdfOut.data(), vdfOut.size());
}

/// Storer: doubles converted to element type TOut by the rules of ConvertSample<double, TOut>.
template <class TOut>
void StoreSamples(std::span<const double> vdfIn, TOut* pOut)
{
    ConvertSamples<double, TOut>(vdfIn.data(), pOut, vdfIn.size());
}

}  // namespace kor::filters
