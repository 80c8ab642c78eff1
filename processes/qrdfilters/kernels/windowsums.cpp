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

ColumnSums From(const ColumnSums& oSums, std::size_t i)
{
    return oSums.mpSums == nullptr ? oSums : ColumnSums{oSums.mpSums + i, oSums.mpoBatch + i};
}

/// Bits of kLanes samples from sample i on, which is a multiple of kLanes, in the lowest place.
HWY_INLINE unsigned char LaneBits(const unsigned char* pValid, std::size_t i)
{
    return static_cast<unsigned char>(pValid[i / 8] >> (i % 8));
}

/// kLanes samples from sample i on, but +0.0 where they are masked.
template <bool kMasked>
HWY_INLINE Vector Samples(const double* pRow, const unsigned char* pValid, std::size_t i)
{
    const Vector oSamples = hn::LoadU(kTag, pRow + i);
    if constexpr (kMasked)
    {
        const unsigned char nBits = LaneBits(pValid, i);
        return hn::IfThenElseZero(hn::LoadMaskBits(kTag, &nBits), oSamples);
    }
    return oSamples;
}

/// The sums of kLanes columns on their way through the rows of a batch.
class ColumnGroup
{
public:
    HWY_INLINE ColumnGroup(const ColumnSums& oSums, std::size_t i)
        : mpSums(oSums.mpSums + i), mpoBatch(oSums.mpoBatch + i), moSum(hn::LoadU(kTag, mpSums))
    {
    }

    HWY_INLINE void Move(std::size_t k, Vector oLeaving, Vector oEntering)
    {
        moSum = hn::Add(hn::Sub(moSum, oLeaving), oEntering);
        maoAfter[k] = moSum;
    }

    HWY_INLINE void StoreRows(std::size_t nGroup)
    {
        Transpose(maoAfter);
        for (std::size_t k = 0; k < kLanes; ++k)
        {
            hn::StoreU(maoAfter[k], kTag, &mpoBatch[k].madfRows[nGroup * kLanes]);
        }
    }

    HWY_INLINE void StoreSums() const { hn::StoreU(moSum, kTag, mpSums); }

private:
    double* mpSums;
    BatchColumn* mpoBatch;
    Vector moSum;
    Vector maoAfter[kLanes];
};

enum class Wanted
{
    Sums,
    Squares,
    Both
};

/// kLanes columns from column nFirst + i of the rows on.
template <bool kMasked, Wanted kWanted>
HWY_INLINE void SlideColumnGroup(const BatchRows& oRows, std::size_t nFirst, std::size_t i,
                                 const ColumnSums& oSums, const ColumnSums& oSquares)
{
    // Far enough ahead for the latency of memory: eight cache lines.
    constexpr std::size_t kAhead = 64;
    const std::size_t nColumn = nFirst + i;
    ColumnGroup oSum(kWanted == Wanted::Squares ? oSquares : oSums, i);
    ColumnGroup oSquare(kWanted == Wanted::Sums ? oSums : oSquares, i);
    for (std::size_t nGroup = 0; nGroup < kGroups; ++nGroup)
    {
        for (std::size_t k = 0; k < kLanes; ++k)
        {
            const std::size_t r = nGroup * kLanes + k;
            hwy::Prefetch(oRows.mapEntering[r] + nColumn + kAhead);
            const Vector oLeaving =
                Samples<kMasked>(oRows.mapLeaving[r], oRows.mapLeavingValid[r], nColumn);
            const Vector oEntering =
                Samples<kMasked>(oRows.mapEntering[r], oRows.mapEnteringValid[r], nColumn);
            if constexpr (kWanted != Wanted::Squares)
            {
                oSum.Move(k, oLeaving, oEntering);
            }
            if constexpr (kWanted != Wanted::Sums)
            {
                oSquare.Move(k, hn::Mul(oLeaving, oLeaving), hn::Mul(oEntering, oEntering));
            }
        }
        if constexpr (kWanted != Wanted::Squares)
        {
            oSum.StoreRows(nGroup);
        }
        if constexpr (kWanted != Wanted::Sums)
        {
            oSquare.StoreRows(nGroup);
        }
    }
    if constexpr (kWanted != Wanted::Squares)
    {
        oSum.StoreSums();
    }
    if constexpr (kWanted != Wanted::Sums)
    {
        oSquare.StoreSums();
    }
}

/// Copies of the rows of a batch and of sums behind its last whole vector, which can be read and
/// written to the end.
class LastColumns
{
public:
    LastColumns(const BatchRows& oRows, bool bMasked, std::size_t nFirst, std::size_t nCount)
        : mnCount(nCount)
    {
        for (std::size_t r = 0; r < kBatchRows; ++r)
        {
            moRows.mapLeaving[r] = Copy(oRows.mapLeaving[r] + nFirst, madfRows[r]);
            moRows.mapEntering[r] = Copy(oRows.mapEntering[r] + nFirst, madfRows[kBatchRows + r]);
            if (bMasked)
            {
                manValid[r] = LaneBits(oRows.mapLeavingValid[r], nFirst);
                manValid[kBatchRows + r] = LaneBits(oRows.mapEnteringValid[r], nFirst);
            }
            moRows.mapLeavingValid[r] = &manValid[r];
            moRows.mapEnteringValid[r] = &manValid[kBatchRows + r];
        }
    }
    LastColumns(const LastColumns&) = delete;
    LastColumns& operator=(const LastColumns&) = delete;

    const BatchRows& Rows() const { return moRows; }

    /// pCopy holds kLanes sums.
    ColumnSums Open(const ColumnSums& oSums, double* pCopy) const
    {
        if (oSums.mpSums != nullptr)
        {
            Copy(oSums.mpSums, pCopy);
        }
        return {pCopy, oSums.mpoBatch};
    }

    void Close(const double* pCopy, const ColumnSums& oSums) const
    {
        if (oSums.mpSums != nullptr)
        {
            std::copy_n(pCopy, mnCount, oSums.mpSums);
        }
    }

private:
    const double* Copy(const double* pFrom, double* pTo) const
    {
        std::copy_n(pFrom, mnCount, pTo);
        return pTo;
    }

    std::size_t mnCount;
    BatchRows moRows{};
    double madfRows[2 * kBatchRows][kLanes] = {};
    unsigned char manValid[2 * kBatchRows] = {};
};

template <bool kMasked, Wanted kWanted>
void SlideColumnsOf(const BatchRows& oRows, std::size_t nFirst, std::size_t nCount,
                    const ColumnSums& oSums, const ColumnSums& oSquares)
{
    std::size_t i = 0;
    for (; i + kLanes <= nCount; i += kLanes)
    {
        SlideColumnGroup<kMasked, kWanted>(oRows, nFirst, i, oSums, oSquares);
    }
    if (i < nCount)
    {
        const LastColumns oLast(oRows, kMasked, nFirst + i, nCount - i);
        const ColumnSums oLastSums = From(oSums, i);
        const ColumnSums oLastSquares = From(oSquares, i);
        double adfSums[kLanes] = {};
        double adfSquares[kLanes] = {};
        SlideColumnGroup<kMasked, kWanted>(oLast.Rows(), 0, 0, oLast.Open(oLastSums, adfSums),
                                           oLast.Open(oLastSquares, adfSquares));
        oLast.Close(adfSums, oLastSums);
        oLast.Close(adfSquares, oLastSquares);
    }
}

template <bool kMasked>
void SlideWantedColumns(const BatchRows& oRows, std::size_t nFirst, std::size_t nCount,
                        const ColumnSums& oSums, const ColumnSums& oSquares)
{
    if (oSquares.mpSums == nullptr)
    {
        SlideColumnsOf<kMasked, Wanted::Sums>(oRows, nFirst, nCount, oSums, oSquares);
    }
    else if (oSums.mpSums == nullptr)
    {
        SlideColumnsOf<kMasked, Wanted::Squares>(oRows, nFirst, nCount, oSums, oSquares);
    }
    else
    {
        SlideColumnsOf<kMasked, Wanted::Both>(oRows, nFirst, nCount, oSums, oSquares);
    }
}

void SlideColumns(const BatchRows& oRows, std::size_t nFirst, std::size_t nCount,
                  const ColumnSums& oSums, const ColumnSums& oSquares)
{
    oRows.mapEnteringValid[0] == nullptr
        ? SlideWantedColumns<false>(oRows, nFirst, nCount, oSums, oSquares)
        : SlideWantedColumns<true>(oRows, nFirst, nCount, oSums, oSquares);
}

template <bool kMasked>
void AddRowOf(const double* pRow, const unsigned char* pValid, double* pSums, double* pSquares,
              std::size_t nCount)
{
    for (std::size_t i = 0; i < nCount; i += kLanes)
    {
        double adfLast[kLanes] = {};
        const std::size_t nLeft = std::min(kLanes, nCount - i);
        const double* pSamples = pRow + i;
        if (nLeft < kLanes)
        {
            std::copy_n(pSamples, nLeft, adfLast);
            pSamples = adfLast;
        }
        Vector oSamples = hn::LoadU(kTag, pSamples);
        if constexpr (kMasked)
        {
            const unsigned char nBits = LaneBits(pValid, i);
            oSamples = hn::IfThenElseZero(hn::LoadMaskBits(kTag, &nBits), oSamples);
        }
        if (pSums != nullptr)
        {
            hn::StoreU(hn::Add(hn::LoadU(kTag, pSums + i), oSamples), kTag, pSums + i);
        }
        if (pSquares != nullptr)
        {
            hn::StoreU(hn::Add(hn::LoadU(kTag, pSquares + i), hn::Mul(oSamples, oSamples)), kTag,
                       pSquares + i);
        }
    }
}

void AddRow(const double* pRow, const unsigned char* pValid, double* pSums, double* pSquares,
            std::size_t nCount)
{
    pValid == nullptr ? AddRowOf<false>(pRow, pValid, pSums, pSquares, nCount)
                      : AddRowOf<true>(pRow, pValid, pSums, pSquares, nCount);
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

/// kLanes samples from sample i on.
template <bool kOneChannel>
HWY_INLINE void SlideWindowGroup(const WindowTrack& oTrack, std::size_t nSpan, std::size_t i,
                                 RunningSums<kOneChannel>& oSums)
{
    Vector aaoSquares[kGroups][kLanes];
    const BatchColumn* poColumns = oTrack.mpoColumns + i;
    for (std::size_t k = 0; k < kLanes; ++k)
    {
        oSums.Move(poColumns[k], poColumns[k + nSpan]);
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
            hn::StoreU(aaoSquares[g][k], kTag, oTrack.mapRows[g * kLanes + k] + i);
        }
    }
}

/// The samples behind the last whole vector.
template <bool kOneChannel>
void SlideLastWindows(const WindowTrack& oTrack, std::size_t nSpan, std::size_t nFirst,
                      std::size_t nSamples, RunningSums<kOneChannel>& oSums)
{
    for (std::size_t i = nFirst; i < nSamples; ++i)
    {
        BatchColumn oLast;
        oSums.Move(oTrack.mpoColumns[i], oTrack.mpoColumns[i + nSpan]);
        oSums.StoreTo(oLast);
        for (std::size_t r = 0; r < kBatchRows; ++r)
        {
            oTrack.mapRows[r][i] = oLast.madfRows[r];
        }
    }
    if (kOneChannel)
    {
        oSums.StoreTo(*oTrack.mpoSums);
    }
}

template <bool kOneChannel>
void SlideWindowsOf(std::span<const WindowTrack> oTracks, std::size_t nSpan, std::size_t nSamples,
                    std::size_t nChannels)
{
    RunningSums<kOneChannel> oFirst(oTracks.front().mpoSums, nChannels);
    RunningSums<kOneChannel> oSecond(oTracks.back().mpoSums, nChannels);
    const bool bTwo = oTracks.size() == 2;
    std::size_t i = 0;
    for (; i + kLanes <= nSamples; i += kLanes)
    {
        // Two chains of additions that wait for themselves, but not for each other.
        SlideWindowGroup(oTracks.front(), nSpan, i, oFirst);
        if (bTwo)
        {
            SlideWindowGroup(oTracks.back(), nSpan, i, oSecond);
        }
    }
    SlideLastWindows(oTracks.front(), nSpan, i, nSamples, oFirst);
    if (bTwo)
    {
        SlideLastWindows(oTracks.back(), nSpan, i, nSamples, oSecond);
    }
}

void SlideWindows(std::span<const WindowTrack> oTracks, std::size_t nSpan, std::size_t nSamples,
                  std::size_t nChannels)
{
    nChannels == 1 ? SlideWindowsOf<true>(oTracks, nSpan, nSamples, nChannels)
                   : SlideWindowsOf<false>(oTracks, nSpan, nSamples, nChannels);
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

void PackValid(const unsigned char* pValid, std::size_t nSamples, unsigned char* pBits)
{
    const hn::CappedTag<std::uint8_t, 64> oTag;
    const std::size_t nLanes = hn::Lanes(oTag);
    std::size_t i = 0;
    for (; nLanes >= 8 && i + nLanes <= nSamples; i += nLanes)
    {
        const auto oValid = hn::Ne(hn::LoadU(oTag, pValid + i), hn::Zero(oTag));
        hn::StoreMaskBits(oTag, oValid, pBits + i / 8);
    }
    for (; i < nSamples; i += 8)
    {
        unsigned int nBits = 0;
        for (std::size_t k = 0; k < std::min<std::size_t>(8, nSamples - i); ++k)
        {
            nBits |= (pValid[i + k] != 0 ? 1U : 0U) << k;
        }
        pBits[i / 8] = static_cast<unsigned char>(nBits);
    }
}

/// pOut[i] = oFunction(i) up to a whole vector.
template <class D, class Function>
HWY_INLINE void FillCounts(D oTag, std::int32_t* pOut, std::size_t nCounts,
                           const Function& oFunction)
{
    for (std::size_t i = 0; i < nCounts; i += hn::Lanes(oTag))
    {
        hn::StoreU(oFunction(i), oTag, pOut + i);
    }
}

void CountValid(const unsigned char* pValid, std::size_t nCount, std::size_t nStep,
                std::int32_t* pScratch, std::span<std::int32_t> oCounts)
{
    const hn::CappedTag<std::int32_t, kCountPadding> oTag;
    const hn::Rebind<std::uint8_t, decltype(oTag)> oByteTag;
    // The window is cut into stretches as long as its binary digits say: pScratch[i] counts the
    // valid samples in a stretch of nLength from i on.
    std::size_t nScratch = oCounts.size() + (nCount - 1) * nStep;
    FillCounts(oTag, pScratch, nScratch,
               [&](std::size_t i) HWY_ATTR
               { return hn::PromoteTo(oTag, hn::LoadU(oByteTag, pValid + i)); });
    std::fill(oCounts.begin(), oCounts.end(), 0);
    std::size_t nDone = 0;
    for (std::size_t nLength = 1; nLength <= nCount; nLength *= 2)
    {
        if ((nCount & nLength) != 0)
        {
            const std::int32_t* pStretch = pScratch + nDone * nStep;
            FillCounts(
                oTag, oCounts.data(), oCounts.size(),
                [&](std::size_t i) HWY_ATTR
                { return hn::Add(hn::LoadU(oTag, &oCounts[i]), hn::LoadU(oTag, pStretch + i)); });
            nDone += nLength;
        }
        if (2 * nLength <= nCount)
        {
            nScratch -= nLength * nStep;
            const std::int32_t* pNext = pScratch + nLength * nStep;
            FillCounts(
                oTag, pScratch, nScratch,
                [&](std::size_t i) HWY_ATTR
                { return hn::Add(hn::LoadU(oTag, pScratch + i), hn::LoadU(oTag, pNext + i)); });
        }
    }
}

void AddCounts(const std::int32_t* pRow, std::span<std::int32_t> oCounts)
{
    for (std::size_t i = 0; i < oCounts.size(); ++i)
    {
        oCounts[i] += pRow[i];
    }
}

void SlideCounts(const std::int32_t* pLeaving, const std::int32_t* pEntering, std::int32_t* pCounts,
                 std::span<double> oCounts)
{
    const hn::Rebind<std::int32_t, Doubles> oIntTag;
    for (std::size_t i = 0; i < oCounts.size(); i += kLanes)
    {
        const auto oLess =
            hn::Sub(hn::LoadU(oIntTag, pCounts + i), hn::LoadU(oIntTag, pLeaving + i));
        const auto oAfter = hn::Add(oLess, hn::LoadU(oIntTag, pEntering + i));
        hn::StoreU(oAfter, oIntTag, pCounts + i);
        hn::StoreU(hn::PromoteTo(kTag, oAfter), kTag, &oCounts[i]);
    }
}

void LoadCounts(const std::int32_t* pCounts, std::span<double> oCounts)
{
    const hn::Rebind<std::int32_t, Doubles> oIntTag;
    for (std::size_t i = 0; i < oCounts.size(); i += kLanes)
    {
        hn::StoreU(hn::PromoteTo(kTag, hn::LoadU(oIntTag, pCounts + i)), kTag, &oCounts[i]);
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
HWY_EXPORT(PackValid);
HWY_EXPORT(CountValid);
HWY_EXPORT(SlideCounts);
HWY_EXPORT(AddCounts);
HWY_EXPORT(LoadCounts);

void AddRow(const double* pRow, const unsigned char* pValid, double* pSums, double* pSquares,
            std::size_t nCount)
{
    HWY_DYNAMIC_DISPATCH(AddRow)(pRow, pValid, pSums, pSquares, nCount);
}

void SlideColumns(const BatchRows& oRows, std::size_t nFirst, std::size_t nCount,
                  const ColumnSums& oSums, const ColumnSums& oSquares)
{
    HWY_DYNAMIC_DISPATCH(SlideColumns)(oRows, nFirst, nCount, oSums, oSquares);
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

void SlideWindows(std::span<const WindowTrack> oTracks, std::size_t nSpan, std::size_t nSamples,
                  std::size_t nChannels)
{
    HWY_DYNAMIC_DISPATCH(SlideWindows)(oTracks, nSpan, nSamples, nChannels);
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

void PackValid(const unsigned char* pValid, std::size_t nSamples, unsigned char* pBits)
{
    HWY_DYNAMIC_DISPATCH(PackValid)(pValid, nSamples, pBits);
}

void CountValid(const unsigned char* pValid, std::size_t nCount, std::size_t nStep,
                std::int32_t* pScratch, std::span<std::int32_t> oCounts)
{
    HWY_DYNAMIC_DISPATCH(CountValid)(pValid, nCount, nStep, pScratch, oCounts);
}

void SlideCounts(const std::int32_t* pLeaving, const std::int32_t* pEntering, std::int32_t* pCounts,
                 std::span<double> oCounts)
{
    HWY_DYNAMIC_DISPATCH(SlideCounts)(pLeaving, pEntering, pCounts, oCounts);
}

void AddCounts(const std::int32_t* pRow, std::span<std::int32_t> oCounts)
{
    HWY_DYNAMIC_DISPATCH(AddCounts)(pRow, oCounts);
}

void LoadCounts(const std::int32_t* pCounts, std::span<double> oCounts)
{
    HWY_DYNAMIC_DISPATCH(LoadCounts)(pCounts, oCounts);
}

}  // namespace kor::filters::kernels
#endif
