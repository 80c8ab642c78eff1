// What the kernels of windows that stand still have in common, for one instruction set. Their units
// include it once for each, which is why it has no guard.

#include <algorithm>
#include <type_traits>

#include "hwy/highway.h"
#include "processes/qrdfilters/kernels/stencil.h"

HWY_BEFORE_NAMESPACE();

namespace kor::filters::kernels::HWY_NAMESPACE
{

namespace hn = hwy::HWY_NAMESPACE;

template <std::size_t kCount>
using Count = std::integral_constant<std::size_t, kCount>;

// Vector registers: 32, or 16.
inline constexpr bool kManyRegisters = HWY_TARGET == HWY_AVX3 || HWY_TARGET == HWY_AVX3_DL;

/// Vectors of one output row that are worked on together: in four rows as many as fill the
/// registers.
inline constexpr std::size_t kManyVectors = kManyRegisters ? 4 : 3;

/// Samples for several uses. With many registers they stay in one: compilers would read them from
/// memory for each use, and wide vectors that lie across cache lines are read at half the speed.
template <class D>
HWY_INLINE hn::Vec<D> LoadForManyUses(D oTag, const double* pSamples)
{
    auto oSamples = hn::LoadU(oTag, pSamples);
#if HWY_ARCH_X86
    if constexpr (kManyRegisters)
    {
        asm("" : "+v"(oSamples.raw));
    }
#endif
    return oSamples;
}

/// oBody(oTag, Count<n>(), i) for all of nSamples samples, n vectors from sample i on at a time:
/// kMost where the row is long enough, else one. The last call ends with the row, and so repeats
/// samples of the one before: output and input must not be the same.
template <std::size_t kMost = 2, class Body>
HWY_INLINE void ForEachVector(std::size_t nSamples, const Body& oBody)
{
    const hn::ScalableTag<double> oTag;
    const std::size_t nLanes = hn::Lanes(oTag);
    if (nSamples >= kMost * nLanes)
    {
        for (std::size_t i = 0; i < nSamples; i += kMost * nLanes)
        {
            oBody(oTag, Count<kMost>(), std::min(i, nSamples - kMost * nLanes));
        }
    }
    else if (nSamples >= nLanes)
    {
        for (std::size_t i = 0; i < nSamples; i += nLanes)
        {
            oBody(oTag, Count<1>(), std::min(i, nSamples - nLanes));
        }
    }
    else
    {
        for (std::size_t i = 0; i < nSamples; ++i)
        {
            oBody(hn::CappedTag<double, 1>(), Count<1>(), i);
        }
    }
}

/// Sums of one output row j, or four, that are built side by side, so that all have the use of a
/// sample loaded once; each is added in the order of the window, row by row. Loops over them are
/// unrolled by order: else the compiler keeps the sums in memory from row to row.
template <class D, std::size_t kRows, std::size_t kVectors>
struct WindowSums
{
    hn::Vec<D> aoSums[kRows][kVectors];
};

/// Adds a row of the windows to the sums of the output rows kFirst to kLast, for which it is row
/// r - j of the window.
template <std::size_t kFirst, std::size_t kLast, class D, class Terms, std::size_t kRows,
          std::size_t kVectors>
HWY_INLINE void AddWindowRow(D oTag, const StencilRows& oRows, const Terms& oTerms, std::size_t r,
                             std::size_t i, WindowSums<D, kRows, kVectors>& oSums)
{
    for (std::size_t dx = 0; dx < oRows.mnWidth; ++dx, i += oRows.mnStep)
    {
        decltype(oTerms.Load(oTag, r, i)) aoSamples[kVectors];
        HWY_UNROLL(8)
        for (std::size_t v = 0; v < kVectors; ++v)
        {
            aoSamples[v] = oTerms.Load(oTag, r, i + v * hn::Lanes(oTag));
        }
        HWY_UNROLL(8)
        for (std::size_t j = kFirst; j <= kLast; ++j)
        {
            HWY_UNROLL(8)
            for (std::size_t v = 0; v < kVectors; ++v)
            {
                oSums.aoSums[j][v] =
                    hn::Add(oSums.aoSums[j][v], oTerms.Term(oTag, aoSamples[v], j, v, (r - j), dx));
            }
        }
    }
}

/// The sums of oTerms over the windows of sample i and those behind it, from +0.0 on. Four output
/// rows need windows of three rows or more.
template <std::size_t kRows, std::size_t kVectors, class D, class Terms>
HWY_INLINE WindowSums<D, kRows, kVectors> SumTerms(D oTag, const StencilRows& oRows,
                                                   const Terms& oTerms, std::size_t i)
{
    WindowSums<D, kRows, kVectors> oSums;
    HWY_UNROLL(8)
    for (std::size_t j = 0; j < kRows; ++j)
    {
        HWY_UNROLL(8)
        for (std::size_t v = 0; v < kVectors; ++v)
        {
            oSums.aoSums[j][v] = hn::Zero(oTag);
        }
    }
    const std::size_t nHeight = oRows.mnHeight;
    if constexpr (kRows == 1)
    {
        for (std::size_t r = 0; r < nHeight; ++r)
        {
            AddWindowRow<0, 0>(oTag, oRows, oTerms, r, i, oSums);
        }
    }
    else
    {
        static_assert(kRows == 4);
        AddWindowRow<0, 0>(oTag, oRows, oTerms, 0, i, oSums);
        AddWindowRow<0, 1>(oTag, oRows, oTerms, 1, i, oSums);
        AddWindowRow<0, 2>(oTag, oRows, oTerms, 2, i, oSums);
        for (std::size_t r = 3; r < nHeight; ++r)
        {
            AddWindowRow<0, 3>(oTag, oRows, oTerms, r, i, oSums);
        }
        AddWindowRow<1, 3>(oTag, oRows, oTerms, nHeight, i, oSums);
        AddWindowRow<2, 3>(oTag, oRows, oTerms, nHeight + 1, i, oSums);
        AddWindowRow<3, 3>(oTag, oRows, oTerms, nHeight + 2, i, oSums);
    }
    return oSums;
}

/// Writes oFinish(sum) of all sums to the output rows from sample i on.
template <class D, std::size_t kRows, std::size_t kVectors, class Finish>
HWY_INLINE void StoreSums(D oTag, const WindowSums<D, kRows, kVectors>& oSums,
                          const Finish& oFinish, double* const* apOut, std::size_t i)
{
    HWY_UNROLL(8)
    for (std::size_t j = 0; j < kRows; ++j)
    {
        HWY_UNROLL(8)
        for (std::size_t v = 0; v < kVectors; ++v)
        {
            hn::StoreU(oFinish.Of(oTag, oSums.aoSums[j][v]), oTag,
                       apOut[j] + i + v * hn::Lanes(oTag));
        }
    }
}

/// oWork(Count<n>(), oPart, oOut) for all output rows, n of them at a time: four where that can be,
/// else one.
template <class Work>
HWY_INLINE void ForEachRowGroup(const StencilRows& oRows, std::span<double* const> oOut,
                                const Work& oWork)
{
    const std::size_t nRows = oRows.GetRows();
    StencilRows oPart = oRows;
    for (std::size_t j = 0; j < nRows;)
    {
        const bool bFour = oRows.mnHeight >= 3 && nRows - j >= 4;
        const std::size_t nCovered = oRows.mnHeight + (bFour ? 3 : 0);
        oPart.moSamples = oRows.moSamples.subspan(j, nCovered);
        oPart.moValid = oRows.moValid.empty() ? oRows.moValid : oRows.moValid.subspan(j, nCovered);
        if (bFour)
        {
            oWork(Count<4>(), oPart, oOut.data() + j);
        }
        else
        {
            oWork(Count<1>(), oPart, oOut.data() + j);
        }
        j += bFour ? 4 : 1;
    }
}

}  // namespace kor::filters::kernels::HWY_NAMESPACE

HWY_AFTER_NAMESPACE();
