#include "processes/qrdfilters/kernels/windowsums.h"

#include <algorithm>
#include <cstring>

#undef HWY_TARGET_INCLUDE
#define HWY_TARGET_INCLUDE "processes/qrdfilters/kernels/windowsums.cpp"
#include <hwy/foreach_target.h>

#include <hwy/cache_control.h>
#include <hwy/highway.h>

HWY_BEFORE_NAMESPACE();
namespace kor::filters::kernels::HWY_NAMESPACE
{

namespace hn = hwy::HWY_NAMESPACE;

// A batch has eight rows: with fewer lanes it takes several vectors, more lanes are not used.
using Doubles = hn::CappedTag<double, kBatchRows>;
using Vector = hn::Vec<Doubles>;
constexpr Doubles kTag;
constexpr std::size_t kLanes = hn::MaxLanes(kTag);
constexpr std::size_t kGroups = kBatchRows / kLanes;

template <bool kSquared>
HWY_INLINE Vector Term(const double* pSample)
{
    const Vector oSample = hn::LoadU(kTag, pSample);
    return kSquared ? hn::Mul(oSample, oSample) : oSample;
}

#if HWY_TARGET == HWY_SCALAR
HWY_INLINE void Transpose(Vector* /*poRows*/) {}
#else
/// kLanes vectors seen as a square are mirrored at the diagonal.
HWY_INLINE void Transpose(Vector* poRows)
{
    if constexpr (kLanes == 2)
    {
        const Vector oFirst = hn::InterleaveLower(kTag, poRows[0], poRows[1]);
        poRows[1] = hn::InterleaveUpper(kTag, poRows[0], poRows[1]);
        poRows[0] = oFirst;
    }
    else if constexpr (kLanes == 4)
    {
        const Vector oEven01 = hn::InterleaveLower(kTag, poRows[0], poRows[1]);
        const Vector oOdd01 = hn::InterleaveUpper(kTag, poRows[0], poRows[1]);
        const Vector oEven23 = hn::InterleaveLower(kTag, poRows[2], poRows[3]);
        const Vector oOdd23 = hn::InterleaveUpper(kTag, poRows[2], poRows[3]);
        poRows[0] = hn::ConcatLowerLower(kTag, oEven23, oEven01);
        poRows[1] = hn::ConcatLowerLower(kTag, oOdd23, oOdd01);
        poRows[2] = hn::ConcatUpperUpper(kTag, oEven23, oEven01);
        poRows[3] = hn::ConcatUpperUpper(kTag, oOdd23, oOdd01);
    }
    else if constexpr (kLanes == 8)
    {
        // Pairs of rows are interleaved; what is left is a square of four by four 128-bit blocks.
        Vector aoPairs[8];
        for (std::size_t k = 0; k < 4; ++k)
        {
            aoPairs[k] = hn::InterleaveLower(kTag, poRows[2 * k], poRows[2 * k + 1]);
            aoPairs[4 + k] = hn::InterleaveUpper(kTag, poRows[2 * k], poRows[2 * k + 1]);
        }
        for (std::size_t k = 0; k < 2; ++k)
        {
            const Vector* poPair = aoPairs + 4 * k;
            const Vector oLow01 = hn::OddEvenBlocks(hn::SwapAdjacentBlocks(poPair[1]), poPair[0]);
            const Vector oHigh01 = hn::OddEvenBlocks(poPair[1], hn::SwapAdjacentBlocks(poPair[0]));
            const Vector oLow23 = hn::OddEvenBlocks(hn::SwapAdjacentBlocks(poPair[3]), poPair[2]);
            const Vector oHigh23 = hn::OddEvenBlocks(poPair[3], hn::SwapAdjacentBlocks(poPair[2]));
            poRows[k] = hn::ConcatLowerLower(kTag, oLow23, oLow01);
            poRows[2 + k] = hn::ConcatLowerLower(kTag, oHigh23, oHigh01);
            poRows[4 + k] = hn::ConcatUpperUpper(kTag, oLow23, oLow01);
            poRows[6 + k] = hn::ConcatUpperUpper(kTag, oHigh23, oHigh01);
        }
    }
}

#endif

template <bool kSquared>
void AddRowOf(const double* pRow, std::span<double> oSums)
{
    std::size_t i = 0;
    for (; i + kLanes <= oSums.size(); i += kLanes)
    {
        hn::StoreU(hn::Add(hn::LoadU(kTag, &oSums[i]), Term<kSquared>(pRow + i)), kTag, &oSums[i]);
    }
    for (; i < oSums.size(); ++i)
    {
        oSums[i] += kSquared ? pRow[i] * pRow[i] : pRow[i];
    }
}

void AddRow(const double* pRow, bool bSquared, std::span<double> oSums)
{
    bSquared ? AddRowOf<true>(pRow, oSums) : AddRowOf<false>(pRow, oSums);
}

/// kLanes columns from column i of the rows on.
template <bool kSquared>
HWY_INLINE void SlideColumnGroup(const BatchRows& oRows, std::size_t i, double* pSums,
                                 BatchColumn* poBatch)
{
    // Far enough ahead for the latency of memory: eight cache lines.
    constexpr std::size_t kAhead = 64;
    Vector oSum = hn::LoadU(kTag, pSums);
    for (std::size_t nGroup = 0; nGroup < kGroups; ++nGroup)
    {
        Vector aoAfter[kLanes];
        for (std::size_t k = 0; k < kLanes; ++k)
        {
            const std::size_t r = nGroup * kLanes + k;
            hwy::Prefetch(oRows.mapEntering[r] + i + kAhead);
            oSum = hn::Sub(oSum, Term<kSquared>(oRows.mapLeaving[r] + i));
            oSum = hn::Add(oSum, Term<kSquared>(oRows.mapEntering[r] + i));
            aoAfter[k] = oSum;
        }
        Transpose(aoAfter);
        for (std::size_t k = 0; k < kLanes; ++k)
        {
            hn::StoreU(aoAfter[k], kTag, &poBatch[k].madfRows[nGroup * kLanes]);
        }
    }
    hn::StoreU(oSum, kTag, pSums);
}

/// The columns behind the last whole group, through buffers that can be read to the end.
template <bool kSquared>
void SlideLastColumns(const BatchRows& oRows, std::size_t nFirst, std::span<double> oSums,
                      BatchColumn* poBatch)
{
    const std::size_t nBytes = oSums.size() * sizeof(double);
    double adfRows[2 * kBatchRows][kLanes] = {};
    double adfSums[kLanes] = {};
    BatchRows oCopies;
    std::memcpy(adfSums, oSums.data(), nBytes);
    for (std::size_t r = 0; r < kBatchRows; ++r)
    {
        std::memcpy(adfRows[r], oRows.mapLeaving[r] + nFirst, nBytes);
        std::memcpy(adfRows[kBatchRows + r], oRows.mapEntering[r] + nFirst, nBytes);
        oCopies.mapLeaving[r] = adfRows[r];
        oCopies.mapEntering[r] = adfRows[kBatchRows + r];
    }
    SlideColumnGroup<kSquared>(oCopies, 0, adfSums, poBatch);
    std::memcpy(oSums.data(), adfSums, nBytes);
}

template <bool kSquared>
void SlideColumnsOf(const BatchRows& oRows, std::size_t nFirst, std::span<double> oSums,
                    BatchColumn* poBatch)
{
    std::size_t i = 0;
    for (; i + kLanes <= oSums.size(); i += kLanes)
    {
        SlideColumnGroup<kSquared>(oRows, nFirst + i, &oSums[i], poBatch + i);
    }
    if (i < oSums.size())
    {
        SlideLastColumns<kSquared>(oRows, nFirst + i, oSums.subspan(i), poBatch + i);
    }
}

void SlideColumns(const BatchRows& oRows, std::size_t nFirst, bool bSquared,
                  std::span<double> oSums, BatchColumn* poBatch)
{
    bSquared ? SlideColumnsOf<true>(oRows, nFirst, oSums, poBatch)
             : SlideColumnsOf<false>(oRows, nFirst, oSums, poBatch);
}

void SumWindows(const double* pColumns, std::size_t nCount, std::size_t nStep,
                std::span<double> oWindows)
{
    for (std::size_t i = 0; i < oWindows.size(); i += kLanes)
    {
        Vector oSum = hn::Zero(kTag);
        for (std::size_t k = 0; k < nCount; ++k)
        {
            oSum = hn::Add(oSum, hn::LoadU(kTag, pColumns + i + k * nStep));
        }
        hn::StoreU(oSum, kTag, &oWindows[i]);
    }
}

void SumBatchWindow(const BatchColumn* poBatch, std::size_t nCount, std::size_t nStep,
                    BatchColumn& oWindow)
{
    for (std::size_t r = 0; r < kBatchRows; r += kLanes)
    {
        Vector oSum = hn::Zero(kTag);
        for (std::size_t k = 0; k < nCount; ++k)
        {
            oSum = hn::Add(oSum, hn::Load(kTag, &poBatch[k * nStep].madfRows[r]));
        }
        hn::Store(oSum, kTag, &oWindow.madfRows[r]);
    }
}

/// One channel: the running sums stay in registers.
void SlideWindowsOfOneChannel(const BatchColumn* poBatch, std::size_t nSpan, std::size_t nSamples,
                              BatchColumn* poWindows)
{
    Vector aoSums[kGroups];
    for (std::size_t g = 0; g < kGroups; ++g)
    {
        aoSums[g] = hn::Load(kTag, &poWindows[-1].madfRows[g * kLanes]);
    }
    for (std::size_t i = 0; i < nSamples; ++i)
    {
        for (std::size_t g = 0; g < kGroups; ++g)
        {
            aoSums[g] = hn::Sub(aoSums[g], hn::Load(kTag, &poBatch[i].madfRows[g * kLanes]));
            aoSums[g] =
                hn::Add(aoSums[g], hn::Load(kTag, &poBatch[i + nSpan].madfRows[g * kLanes]));
            hn::Store(aoSums[g], kTag, &poWindows[i].madfRows[g * kLanes]);
        }
    }
}

void SlideWindows(const BatchColumn* poBatch, std::size_t nSpan, std::size_t nStep,
                  std::size_t nSamples, BatchColumn* poWindows)
{
    if (nStep == 1)
    {
        SlideWindowsOfOneChannel(poBatch, nSpan, nSamples, poWindows);
        return;
    }
    for (std::size_t i = 0; i < nSamples; ++i)
    {
        for (std::size_t r = 0; r < kBatchRows; r += kLanes)
        {
            Vector oSum = hn::Load(kTag, &(poWindows + i - nStep)->madfRows[r]);
            oSum = hn::Sub(oSum, hn::Load(kTag, &poBatch[i].madfRows[r]));
            oSum = hn::Add(oSum, hn::Load(kTag, &poBatch[i + nSpan].madfRows[r]));
            hn::Store(oSum, kTag, &poWindows[i].madfRows[r]);
        }
    }
}

void SplitBatch(const BatchColumn* poWindows, std::size_t nSamples,
                const std::array<double*, kBatchRows>& apRows)
{
    for (std::size_t i = 0; i < nSamples; i += kLanes)
    {
        for (std::size_t nGroup = 0; nGroup < kGroups; ++nGroup)
        {
            Vector aoSums[kLanes];
            for (std::size_t k = 0; k < kLanes; ++k)
            {
                aoSums[k] = hn::Load(kTag, &poWindows[i + k].madfRows[nGroup * kLanes]);
            }
            Transpose(aoSums);
            for (std::size_t k = 0; k < kLanes; ++k)
            {
                hn::StoreU(aoSums[k], kTag, apRows[nGroup * kLanes + k] + i);
            }
        }
    }
}

/// Mask of the lanes whose byte is not 0.
HWY_INLINE hn::Mask<Doubles> ValidLanes(const unsigned char* pValid)
{
    const hn::Rebind<std::uint8_t, Doubles> oByteTag;
    const hn::RebindToUnsigned<Doubles> oWordTag;
    const auto oWords = hn::PromoteTo(
        oWordTag, hn::PromoteTo(hn::Rebind<std::uint32_t, Doubles>(), hn::LoadU(oByteTag, pValid)));
    return hn::RebindMask(kTag, hn::Ne(oWords, hn::Zero(oWordTag)));
}

void ClearMasked(const unsigned char* pValid, const double* pIn, std::span<double> oOut)
{
    std::size_t i = 0;
    for (; i + kLanes <= oOut.size(); i += kLanes)
    {
        hn::StoreU(hn::IfThenElseZero(ValidLanes(pValid + i), hn::LoadU(kTag, pIn + i)), kTag,
                   &oOut[i]);
    }
    for (; i < oOut.size(); ++i)
    {
        oOut[i] = pValid[i] != 0 ? pIn[i] : 0.0;
    }
}

void SelectValid(const unsigned char* pValid, const double* pIn, const double* pElse,
                 std::span<double> oOut)
{
    std::size_t i = 0;
    for (; i + kLanes <= oOut.size(); i += kLanes)
    {
        hn::StoreU(hn::IfThenElse(ValidLanes(pValid + i), hn::LoadU(kTag, pIn + i),
                                  hn::LoadU(kTag, pElse + i)),
                   kTag, &oOut[i]);
    }
    for (; i < oOut.size(); ++i)
    {
        oOut[i] = pValid[i] != 0 ? pIn[i] : pElse[i];
    }
}

void SlideCounts(const unsigned char* pLeaving, const unsigned char* pEntering,
                 std::span<std::int32_t> oCounts)
{
    const hn::ScalableTag<std::int32_t> oTag;
    const hn::Rebind<std::uint8_t, decltype(oTag)> oByteTag;
    const std::size_t nLanes = hn::Lanes(oTag);
    std::size_t i = 0;
    for (; i + nLanes <= oCounts.size(); i += nLanes)
    {
        auto oCount = hn::LoadU(oTag, &oCounts[i]);
        oCount = hn::Add(oCount, hn::PromoteTo(oTag, hn::LoadU(oByteTag, pEntering + i)));
        oCount = hn::Sub(oCount, hn::PromoteTo(oTag, hn::LoadU(oByteTag, pLeaving + i)));
        hn::StoreU(oCount, oTag, &oCounts[i]);
    }
    for (; i < oCounts.size(); ++i)
    {
        oCounts[i] += pEntering[i] - pLeaving[i];
    }
}

/// oOut[i] = pFirst[i] + pSecond[i], whole vectors.
void AddCounts(const std::int32_t* pFirst, const std::int32_t* pSecond, std::size_t nCount,
               std::int32_t* pOut)
{
    const hn::ScalableTag<std::int32_t> oTag;
    for (std::size_t i = 0; i < nCount; i += hn::Lanes(oTag))
    {
        hn::StoreU(hn::Add(hn::LoadU(oTag, pFirst + i), hn::LoadU(oTag, pSecond + i)), oTag,
                   pOut + i);
    }
}

void SumCounts(std::int32_t* pColumns, std::size_t nWindow, std::span<std::int32_t> oScratch,
               std::span<double> oCounts)
{
    // Sums of 1, 2, 4 ... columns in pColumns; the window is put together from those that its
    // length has as binary digits.
    const std::size_t nCounts = oCounts.size();
    std::fill(oScratch.begin(), oScratch.end(), 0);
    std::size_t nOffset = 0;
    for (std::size_t nLength = 1; nLength <= nWindow; nLength *= 2)
    {
        if ((nWindow & nLength) != 0)
        {
            AddCounts(oScratch.data(), pColumns + nOffset, nCounts, oScratch.data());
            nOffset += nLength;
        }
        if (2 * nLength <= nWindow)
        {
            AddCounts(pColumns, pColumns + nLength, nCounts + nWindow - 2 * nLength, pColumns);
        }
    }
    const hn::Rebind<std::int32_t, Doubles> oHalfTag;
    for (std::size_t i = 0; i < nCounts; i += kLanes)
    {
        hn::StoreU(hn::PromoteTo(kTag, hn::LoadU(oHalfTag, &oScratch[i])), kTag, &oCounts[i]);
    }
}

}  // namespace kor::filters::kernels::HWY_NAMESPACE
HWY_AFTER_NAMESPACE();

#if HWY_ONCE
namespace kor::filters::kernels
{

HWY_EXPORT(AddRow);
HWY_EXPORT(SlideColumns);
HWY_EXPORT(SumWindows);
HWY_EXPORT(SumBatchWindow);
HWY_EXPORT(SlideWindows);
HWY_EXPORT(SplitBatch);
HWY_EXPORT(ClearMasked);
HWY_EXPORT(SelectValid);
HWY_EXPORT(SlideCounts);
HWY_EXPORT(SumCounts);

void AddRow(const double* pRow, bool bSquared, std::span<double> oSums)
{
    HWY_DYNAMIC_DISPATCH(AddRow)(pRow, bSquared, oSums);
}

void SlideColumns(const BatchRows& oRows, std::size_t nFirst, bool bSquared,
                  std::span<double> oSums, BatchColumn* poBatch)
{
    HWY_DYNAMIC_DISPATCH(SlideColumns)(oRows, nFirst, bSquared, oSums, poBatch);
}

void SumWindows(const double* pColumns, std::size_t nCount, std::size_t nStep,
                std::span<double> oWindows)
{
    HWY_DYNAMIC_DISPATCH(SumWindows)(pColumns, nCount, nStep, oWindows);
}

void SumBatchWindow(const BatchColumn* poBatch, std::size_t nCount, std::size_t nStep,
                    BatchColumn& oWindow)
{
    HWY_DYNAMIC_DISPATCH(SumBatchWindow)(poBatch, nCount, nStep, oWindow);
}

void SlideWindows(const BatchColumn* poBatch, std::size_t nSpan, std::size_t nStep,
                  std::size_t nSamples, BatchColumn* poWindows)
{
    HWY_DYNAMIC_DISPATCH(SlideWindows)(poBatch, nSpan, nStep, nSamples, poWindows);
}

void SplitBatch(const BatchColumn* poWindows, std::size_t nSamples,
                const std::array<double*, kBatchRows>& apRows)
{
    HWY_DYNAMIC_DISPATCH(SplitBatch)(poWindows, nSamples, apRows);
}

void ClearMasked(const unsigned char* pValid, const double* pIn, std::span<double> oOut)
{
    HWY_DYNAMIC_DISPATCH(ClearMasked)(pValid, pIn, oOut);
}

void SelectValid(const unsigned char* pValid, const double* pIn, const double* pElse,
                 std::span<double> oOut)
{
    HWY_DYNAMIC_DISPATCH(SelectValid)(pValid, pIn, pElse, oOut);
}

void SlideCounts(const unsigned char* pLeaving, const unsigned char* pEntering,
                 std::span<std::int32_t> oCounts)
{
    HWY_DYNAMIC_DISPATCH(SlideCounts)(pLeaving, pEntering, oCounts);
}

void SumCounts(std::int32_t* pColumns, std::size_t nWindow, std::span<std::int32_t> oScratch,
               std::span<double> oCounts)
{
    HWY_DYNAMIC_DISPATCH(SumCounts)(pColumns, nWindow, oScratch, oCounts);
}

}  // namespace kor::filters::kernels
#endif
