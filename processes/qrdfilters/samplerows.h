#pragma once

#include <cstddef>
#include <span>

namespace kor::filters
{

/// Loader: samples of element type TIn, widened to double. Exists for the ten element types.
template <class TIn>
void LoadSamples(const TIn* pIn, std::span<double> vdfOut);

/// Storer: doubles converted to element type TOut by the rules of ConvertSample<double, TOut>.
/// Exists for the ten element types.
template <class TOut>
void StoreSamples(std::span<const double> vdfIn, TOut* pOut);

/// nCount samples converted by the rules of ConvertSample<TIn, TOut>; equal types are copied.
/// Exists for the hundred pairs. Input and output may overlap only where the types are equal.
template <class TIn, class TOut>
void ConvertSamples(const TIn* pIn, TOut* pOut, std::size_t nCount);

}  // namespace kor::filters
