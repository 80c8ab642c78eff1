// The median of square windows for one instruction set. The units median_<type>.cpp include it once
// for each, which is why it has no guard.
//
// Two output rows, one above the other, have all rows of their windows in common but the uppermost
// of the first and the lowest of the second. So the samples that a window has in a row are sorted
// once and serve all windows that hold them; sorted rows are merged in pairs; the pairs that two
// output rows have in common are merged once, as far as the few ranks in the middle that the median
// can have; and each output row adds the row that is its own. Lanes run along the row: no sample
// ever changes its lane, and channels need no care. Minima and maxima for a sample: 16 for 3 x 3,
// 59 for 5 x 5, 128 for 7 x 7.
//
// Source   A. Adams, "Fast median filters using separable sorting networks", ACM Transactions on
//          Graphics 40(4), 70, 2021; here with tiles one sample wide.

#include <algorithm>
#include <utility>

#include "hwy/cache_control.h"
#include "hwy/highway.h"
#include "processes/qrdfilters/kernels/median.h"
#include "processes/qrdfilters/kernels/mergenetwork.h"

HWY_BEFORE_NAMESPACE();

namespace kor::filters::kernels::HWY_NAMESPACE
{

namespace hn = hwy::HWY_NAMESPACE;

template <class T>
using Vector = hn::Vec<hn::ScalableTag<T>>;

template <std::size_t nCount>
inline constexpr Network kSort = SortNetwork(nCount);
template <std::size_t nA, std::size_t nB, std::size_t nFirst, std::size_t nEnd>
inline constexpr Network kMerge = MergeNetwork(nA, nB, nFirst, nEnd);

// Of two samples of which one is not a number both give the second, as vectors do: then all
// instruction sets choose alike.
template <class V>
HWY_INLINE V Smaller(V a, V b)
{
#if HWY_TARGET == HWY_SCALAR
    return V(a.raw < b.raw ? a.raw : b.raw);
#else
    return hn::Min(a, b);
#endif
}

template <class V>
HWY_INLINE V Greater(V a, V b)
{
#if HWY_TARGET == HWY_SCALAR
    return V(a.raw > b.raw ? a.raw : b.raw);
#else
    return hn::Max(a, b);
#endif
}

template <Exchange kExchange, class V>
HWY_INLINE void Apply(V* HWY_RESTRICT pPlaces)
{
    const V a = pPlaces[kExchange.nLow];
    const V b = pPlaces[kExchange.nHigh];
    if constexpr (kExchange.bSmaller)
    {
        pPlaces[kExchange.nLow] = Smaller(a, b);
    }
    if constexpr (kExchange.bGreater)
    {
        pPlaces[kExchange.nHigh] = Greater(a, b);
    }
}

// Loops over places are written as folds: only then are the places sure to be registers.
template <const Network& kNetwork, class V, std::size_t... i>
HWY_INLINE void ApplyAll(V* HWY_RESTRICT pPlaces, std::index_sequence<i...>)
{
    (Apply<kNetwork.aoExchanges[i]>(pPlaces), ...);
}

template <class V, std::size_t... i>
HWY_INLINE void Copy(const V* HWY_RESTRICT pFrom, V* HWY_RESTRICT pTo, std::index_sequence<i...>)
{
    ((pTo[i] = pFrom[i]), ...);
}

template <const Network& kNetwork, class V, std::size_t... i>
HWY_INLINE void TakeResult(const V* HWY_RESTRICT pPlaces, V* HWY_RESTRICT pOut,
                           std::index_sequence<i...>)
{
    ((pOut[i] = pPlaces[kNetwork.oResult.anPlace[i]]), ...);
}

template <const Network& kNetwork, class V>
HWY_INLINE void RunNetwork(V* HWY_RESTRICT pPlaces, V* HWY_RESTRICT pOut)
{
    ApplyAll<kNetwork>(pPlaces, std::make_index_sequence<kNetwork.nExchanges>());
    TakeResult<kNetwork>(pPlaces, pOut, std::make_index_sequence<kNetwork.oResult.nCount>());
}

/// Ranks nFirst to nEnd - 1 of the union of nA samples in order and nB samples in order.
template <std::size_t nA, std::size_t nB, std::size_t nFirst, std::size_t nEnd, class V>
HWY_INLINE void Merge(const V* HWY_RESTRICT pA, const V* HWY_RESTRICT pB, V* HWY_RESTRICT pOut)
{
    V aoPlaces[nA + nB];
    Copy(pA, aoPlaces, std::make_index_sequence<nA>());
    Copy(pB, aoPlaces + nA, std::make_index_sequence<nB>());
    RunNetwork<kMerge<nA, nB, nFirst, nEnd>>(aoPlaces, pOut);
}

template <class T, std::size_t... k>
HWY_INLINE void LoadSorted(const T* HWY_RESTRICT pIn, std::size_t nStep,
                           Vector<T>* HWY_RESTRICT pOut, std::index_sequence<k...>)
{
    const hn::ScalableTag<T> oTag;
    Vector<T> aoPlaces[] = {hn::LoadU(oTag, pIn + k * nStep)...};
    RunNetwork<kSort<sizeof...(k)>>(aoPlaces, pOut);
}

/// The median of n + 1 samples in order and n samples in order: the least of what can stand at rank
/// n, each candidate being the greater of the last samples taken from either side.
template <class V, std::size_t... i>
HWY_INLINE V MedianOfUnion(const V* HWY_RESTRICT pMore, const V* HWY_RESTRICT pLess,
                           std::index_sequence<i...>)
{
    constexpr std::size_t n = sizeof...(i);
    V oLeast = pMore[n];
    ((oLeast = Smaller(oLeast, Greater(pMore[i], pLess[n - 1 - i]))), ...);
    return oLeast;
}

/// What the next two output rows of a column of vectors are made from. With h half the window's
/// side, output rows 2s and 2s + 1 have the window rows 2s + 1 to 2s + 2h in common: the pairs s to
/// s + h - 1, pair q being the rows 2q + 1 and 2q + 2. Row 2s is the upper one's own, row
/// 2s + 2h + 1 the lower one's.
template <class T, std::size_t kHalf>
class MedianColumn
{
public:
    static constexpr std::size_t kSide = 2 * kHalf + 1;

    /// Goes to the first output row, at sample i of the row.
    HWY_INLINE void Start(const MedianBlock<T>& oBlock, std::size_t i)
    {
        mpoBlock = &oBlock;
        mnFirst = i;
        LoadRow(0, Own(0));
        for (std::size_t q = 0; q < kHalf; ++q)
        {
            LoadPair(q);
        }
    }

    /// Writes output rows 2s and 2s + 1; s counts from 0, call by call.
    HWY_INLINE void Step(std::size_t s)
    {
        LoadPair(s + kHalf);
        V aoCommon[kSide + 1];
        MergeCommon(s, aoCommon);
        Store(2 * s, aoCommon, Own(s));
        Store(2 * s + 1, aoCommon, maoLower);
    }

private:
    using V = Vector<T>;
    // Ranks that a median can have in a pair: all but the first and last one of 3 x 3.
    static constexpr std::size_t kPairFirst = kHalf == 1 ? 1 : 0;
    static constexpr std::size_t kPairRanks = 2 * kSide - 2 * kPairFirst;
    // A column jumps from row to row, which no processor foresees.
    static constexpr std::size_t kRowsAhead = 4;

    V* Pair(std::size_t q) { return maaoPairs[q % (kHalf + 1)]; }
    V* Own(std::size_t s) { return maaoOwn[s % (kHalf + 2)]; }

    /// Rows behind the last window are needed for no result; the last row stands in for them.
    const T* Input(std::size_t nRow) const
    {
        const std::size_t nKnown = std::min(nRow, mpoBlock->nRows + kSide - 2);
        return mpoBlock->pIn + nKnown * mpoBlock->nInPitch + mnFirst;
    }

    T* Output(std::size_t nRow) const
    {
        const std::size_t nKnown = std::min(nRow, mpoBlock->nRows - 1);
        return mpoBlock->pOut + nKnown * mpoBlock->nOutPitch + mnFirst;
    }

    HWY_INLINE void LoadRow(std::size_t nRow, V* HWY_RESTRICT pOut)
    {
        hwy::Prefetch(Input(nRow + kRowsAhead) + hn::Lanes(hn::ScalableTag<T>()) - 1);
        LoadSorted<T>(Input(nRow), mpoBlock->nStep, pOut, std::make_index_sequence<kSide>());
    }

    HWY_INLINE void LoadPair(std::size_t q)
    {
        LoadRow(2 * q + 1, maoLower);
        LoadRow(2 * q + 2, Own(q + 1));
        Merge<kSide, kSide, kPairFirst, kPairFirst + kPairRanks>(maoLower, Own(q + 1), Pair(q));
    }

    HWY_INLINE void MergeCommon(std::size_t s, V* HWY_RESTRICT pCommon)
    {
        if constexpr (kHalf == 1)
        {
            Copy(Pair(s), pCommon, std::make_index_sequence<4>());
        }
        else if constexpr (kHalf == 2)
        {
            Merge<10, 10, 7, 13>(Pair(s), Pair(s + 1), pCommon);
        }
        else
        {
            // Four output rows have two pairs in common. Ranks 3 to 24 of their 28 samples matter,
            // and with the third pair ranks 17 to 24 of 42, 14 to 21 without the three left out.
            if (s % 2 == 0)
            {
                Merge<14, 14, 3, 25>(Pair(s + 1), Pair(s + 2), maoShared);
            }
            Merge<22, 14, 14, 22>(maoShared, Pair(s % 2 == 0 ? s : s + 2), pCommon);
        }
    }

    HWY_INLINE void Store(std::size_t nRow, const V* HWY_RESTRICT pCommon,
                          const V* HWY_RESTRICT pOwn)
    {
        if (nRow < mpoBlock->nRows)
        {
            hwy::Prefetch(Output(nRow + kRowsAhead));
            const V oMedian = MedianOfUnion(pCommon, pOwn, std::make_index_sequence<kSide>());
            hn::StoreU(oMedian, hn::ScalableTag<T>(), Output(nRow));
        }
    }

    const MedianBlock<T>* mpoBlock;
    std::size_t mnFirst;
    V maaoPairs[kHalf + 1][kPairRanks];
    V maaoOwn[kHalf + 2][kSide];
    V maoLower[kSide];
    V maoShared[22];
};

/// Columns that go down the rows side by side: whole cache lines of a row, as many as the
/// first-level cache holds what the columns keep.
template <std::size_t kHalf>
inline constexpr std::size_t kColumns = kHalf == 1   ? 8
                                        : kHalf == 2 ? 4
                                                     : 2;

/// All rows of up to kColumns vectors, the first of them at sample i.
template <class T, std::size_t kHalf>
HWY_NOINLINE void SelectColumns(const MedianBlock<T>& oBlock, std::size_t i)
{
    const std::size_t nLanes = hn::Lanes(hn::ScalableTag<T>());
    MedianColumn<T, kHalf> aoColumns[kColumns<kHalf>];
    std::size_t nColumns = 0;
    for (; nColumns < kColumns<kHalf> && i < oBlock.nSamples; ++nColumns, i += nLanes)
    {
        // The last vector of a row overlaps the last but one.
        aoColumns[nColumns].Start(oBlock, std::min(i, oBlock.nSamples - nLanes));
    }
    for (std::size_t s = 0; 2 * s < oBlock.nRows; ++s)
    {
        for (std::size_t n = 0; n < nColumns; ++n)
        {
            aoColumns[n].Step(s);
        }
    }
}

/// Rows shorter than a vector: a few rows at a time pass through buffers that are long enough.
template <class T, std::size_t kHalf>
HWY_NOINLINE void SelectNarrow(const MedianBlock<T>& oBlock)
{
    constexpr std::size_t kLanes = HWY_LANES(T);
    constexpr std::size_t kRows = 4;
    constexpr std::size_t kPitch = (2 * kHalf + 1) * kLanes;  // a step is not above kLanes
    T aIn[(kRows + 2 * kHalf) * kPitch] = {};
    T aOut[kRows * kLanes];
    for (std::size_t y = 0; y < oBlock.nRows; y += kRows)
    {
        const std::size_t nRows = std::min(kRows, oBlock.nRows - y);
        for (std::size_t r = 0; r < nRows + 2 * kHalf; ++r)
        {
            std::copy_n(oBlock.pIn + (y + r) * oBlock.nInPitch,
                        oBlock.nSamples + 2 * kHalf * oBlock.nStep, aIn + r * kPitch);
        }
        SelectColumns<T, kHalf>({aIn, kPitch, oBlock.nStep, aOut, kLanes, kLanes, nRows}, 0);
        for (std::size_t r = 0; r < nRows; ++r)
        {
            std::copy_n(aOut + r * kLanes, oBlock.nSamples,
                        oBlock.pOut + (y + r) * oBlock.nOutPitch);
        }
    }
}

template <class T, std::size_t kHalf>
void SelectBlock(const MedianBlock<T>& oBlock)
{
    const std::size_t nLanes = hn::Lanes(hn::ScalableTag<T>());
    if (oBlock.nSamples < nLanes)
    {
        SelectNarrow<T, kHalf>(oBlock);
        return;
    }
    for (std::size_t i = 0; i < oBlock.nSamples; i += kColumns<kHalf> * nLanes)
    {
        SelectColumns<T, kHalf>(oBlock, i);
    }
}

template <class T>
void SelectMediansOf(std::size_t nSide, const MedianBlock<T>& oBlock)
{
    if (oBlock.nSamples == 0 || oBlock.nRows == 0)
    {
        return;
    }
    switch (nSide)
    {
        case 3:
            SelectBlock<T, 1>(oBlock);
            break;
        case 5:
            SelectBlock<T, 2>(oBlock);
            break;
        case 7:
            SelectBlock<T, 3>(oBlock);
            break;
    }
}

}  // namespace kor::filters::kernels::HWY_NAMESPACE

HWY_AFTER_NAMESPACE();
