#include "processes/qrdfilters/kernels/windowsums.h"

#include "processes/qrdfilters/kernels/targets.h"

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

/// The sums of nChannels samples that move on along the row: in registers for one channel, since
/// they depend on each other from sample to sample.
template <bool kOneChannel>
class RunningSums
{
public:
    RunningSums(BatchColumn* poSums, std::size_t nChannels) : mpoSums(poSums), mnChannels(nChannels)
    {
        for (std::size_t g = 0; g < kGroups; ++g)
        {
            maoSums[g] = hn::Load(kTag, &mpoSums->madfRows[g * kLanes]);
        }
    }

    /// The next sample: a column leaves, another one enters.
    HWY_INLINE void Move(const BatchColumn& oLeaving, const BatchColumn& oEntering)
    {
        for (std::size_t g = 0; g < kGroups; ++g)
        {
            double* pSum = &mpoSums[mnChannel].madfRows[g * kLanes];
            const Vector oBefore = kOneChannel ? maoSums[g] : hn::Load(kTag, pSum);
            const Vector oLess = hn::Sub(oBefore, hn::Load(kTag, &oLeaving.madfRows[g * kLanes]));
            maoSums[g] = hn::Add(oLess, hn::Load(kTag, &oEntering.madfRows[g * kLanes]));
            if (!kOneChannel)
            {
                hn::Store(maoSums[g], kTag, pSum);
            }
        }
        if (!kOneChannel)
        {
            mnChannel = mnChannel + 1 == mnChannels ? 0 : mnChannel + 1;
        }
    }

    HWY_INLINE Vector Group(std::size_t g) const { return maoSums[g]; }

    void StoreTo(BatchColumn& oSums) const
    {
        for (std::size_t g = 0; g < kGroups; ++g)
        {
            hn::Store(maoSums[g], kTag, &oSums.madfRows[g * kLanes]);
        }
    }

private:
    BatchColumn* mpoSums;
    std::size_t mnChannels;
    std::size_t mnChannel = 0;
    Vector maoSums[kGroups];
};

template <bool kOneChannel>
void SlideWindowsOf(const BatchColumn* poColumns, std::size_t nSpan, std::size_t nSamples,
                    std::size_t nChannels, BatchColumn* poSums,
                    const std::array<double*, kBatchRows>& apRows)
{
    RunningSums<kOneChannel> oSums(poSums, nChannels);
    std::size_t i = 0;
    for (; i + kLanes <= nSamples; i += kLanes)
    {
        Vector aaoSquares[kGroups][kLanes];
        for (std::size_t k = 0; k < kLanes; ++k)
        {
            oSums.Move(poColumns[i + k], poColumns[i + k + nSpan]);
            for (std::size_t g = 0; g < kGroups; ++g)
            {
                aaoSquares[g][k] = oSums.Group(g);
            }
        }
        for (std::size_t g = 0; g < kGroups; ++g)
        {
            Transpose(aaoSquares[g]);
            for (std::size_t k = 0; k < kLanes; ++k)
            {
                hn::StoreU(aaoSquares[g][k], kTag, apRows[g * kLanes + k] + i);
            }
        }
    }
    for (; i < nSamples; ++i)
    {
        BatchColumn oLast;
        oSums.Move(poColumns[i], poColumns[i + nSpan]);
        oSums.StoreTo(oLast);
        for (std::size_t r = 0; r < kBatchRows; ++r)
        {
            apRows[r][i] = oLast.madfRows[r];
        }
    }
    if (kOneChannel)
    {
        oSums.StoreTo(*poSums);
    }
}

void SlideWindows(const BatchColumn* poColumns, std::size_t nSpan, std::size_t nSamples,
                  std::size_t nChannels, BatchColumn* poSums,
                  const std::array<double*, kBatchRows>& apRows)
{
    nChannels == 1 ? SlideWindowsOf<true>(poColumns, nSpan, nSamples, nChannels, poSums, apRows)
                   : SlideWindowsOf<false>(poColumns, nSpan, nSamples, nChannels, poSums, apRows);
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

void StreamRow(std::span<const double> oIn, double* pOut)
{
    // Partly written cache lines, at both ends, take the ordinary way.
    constexpr std::size_t kLine = 64;
    const std::size_t nBehindLine = reinterpret_cast<std::uintptr_t>(pOut) % kLine;
    const std::size_t nHead = std::min(oIn.size(), (kLine - nBehindLine) % kLine / sizeof(double));
    std::copy_n(oIn.data(), nHead, pOut);
    std::size_t i = nHead;
    for (; i + kRowPadding <= oIn.size(); i += kRowPadding)
    {
        for (std::size_t k = 0; k < kRowPadding; k += kLanes)
        {
            hn::Stream(hn::LoadU(kTag, &oIn[i + k]), kTag, pOut + i + k);
        }
    }
    std::copy(oIn.begin() + static_cast<std::ptrdiff_t>(i), oIn.end(), pOut + i);
}

void SlideCounts(const std::int32_t* pBefore, const unsigned char* pLeaving,
                 const unsigned char* pEntering, std::span<std::int32_t> oAfter)
{
    const hn::ScalableTag<std::int32_t> oTag;
    const hn::Rebind<std::uint8_t, decltype(oTag)> oByteTag;
    const std::size_t nLanes = hn::Lanes(oTag);
    std::size_t i = 0;
    for (; i + nLanes <= oAfter.size(); i += nLanes)
    {
        const auto oMore = hn::Add(hn::LoadU(oTag, pBefore + i),
                                   hn::PromoteTo(oTag, hn::LoadU(oByteTag, pEntering + i)));
        hn::StoreU(hn::Sub(oMore, hn::PromoteTo(oTag, hn::LoadU(oByteTag, pLeaving + i))), oTag,
                   &oAfter[i]);
    }
    for (; i < oAfter.size(); ++i)
    {
        oAfter[i] = pBefore[i] + pEntering[i] - pLeaving[i];
    }
}

void SumCounts(const std::int32_t* pColumns, std::size_t nWindow, std::span<double> oCounts)
{
    const hn::Rebind<std::int32_t, Doubles> oIntTag;
    for (std::size_t i = 0; i < oCounts.size(); i += kLanes)
    {
        auto oSum = hn::LoadU(oIntTag, pColumns + i);
        for (std::size_t k = 1; k < nWindow; ++k)
        {
            oSum = hn::Add(oSum, hn::LoadU(oIntTag, pColumns + i + k));
        }
        hn::StoreU(hn::PromoteTo(kTag, oSum), kTag, &oCounts[i]);
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
HWY_EXPORT(ClearMasked);
HWY_EXPORT(SelectValid);
HWY_EXPORT(StreamRow);
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

void SlideWindows(const BatchColumn* poColumns, std::size_t nSpan, std::size_t nSamples,
                  std::size_t nChannels, BatchColumn* poSums,
                  const std::array<double*, kBatchRows>& apRows)
{
    HWY_DYNAMIC_DISPATCH(SlideWindows)(poColumns, nSpan, nSamples, nChannels, poSums, apRows);
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

void StreamRow(std::span<const double> oIn, double* pOut)
{
    HWY_DYNAMIC_DISPATCH(StreamRow)(oIn, pOut);
}

void SlideCounts(const std::int32_t* pBefore, const unsigned char* pLeaving,
                 const unsigned char* pEntering, std::span<std::int32_t> oAfter)
{
    HWY_DYNAMIC_DISPATCH(SlideCounts)(pBefore, pLeaving, pEntering, oAfter);
}

void SumCounts(const std::int32_t* pColumns, std::size_t nWindow, std::span<double> oCounts)
{
    HWY_DYNAMIC_DISPATCH(SumCounts)(pColumns, nWindow, oCounts);
}

}  // namespace kor::filters::kernels
#endif
