#include "processes/qrdfilters/kernels/greypairs.h"

#include "processes/qrdfilters/kernels/targets.h"

#undef HWY_TARGET_INCLUDE
#define HWY_TARGET_INCLUDE "processes/qrdfilters/kernels/greypairs.cpp"
#include <hwy/foreach_target.h>
#include <hwy/highway.h>

// The compiler makes vectors of the target of the loops over columns.
HWY_BEFORE_NAMESPACE();
namespace kor::filters::kernels::HWY_NAMESPACE
{

namespace hn = hwy::HWY_NAMESPACE;

/// Sums of one column while a row's pairs are added (fSign 1) or subtracted (-1). T is the type of
/// the division. A pair that does not count adds 0, which changes no sum: none is ever -0.
template <class T>
struct ColumnSums
{
    float mfSum;
    float mfCount;

    HWY_INLINE void Take(float fGrey, float fOther, float fCounts, float fSign)
    {
        const float d = fGrey - fOther;
        const float fSimilarity = static_cast<float>(T(1) / (static_cast<T>(d * d) + T(1)));
        mfSum = mfSum + fSign * (fCounts * fSimilarity);
        mfCount = mfCount + fSign * fCounts;
    }

    HWY_INLINE void TakeRow(const float* pfGrey, const float* pfValid, const float* pfGreyBelow,
                            const float* pfValidBelow, std::size_t c, float fSign)
    {
        const float fGrey = pfGrey[c];
        const float fValid = pfValid[c];
        Take(fGrey, pfGrey[c + 1], fValid * pfValid[c + 1], fSign);
        Take(fGrey, pfGreyBelow[c + 1], fValid * pfValidBelow[c + 1], fSign);
        Take(fGrey, pfGreyBelow[c], fValid * pfValidBelow[c], fSign);
        Take(fGrey, pfGreyBelow[c - 1], fValid * pfValidBelow[c - 1], fSign);
    }
};

template <class T, bool bMoves>
void UpdateColumns(const GreyRows& oLeaving, const GreyRows& oEntering, std::size_t nColumns,
                   const PairSums& oFrom, const PairSums& oTo)
{
    const float* const pfFromSums = oFrom.mpfSums;
    const float* const pfFromCounts = oFrom.mpfCounts;
    float* const pfToSums = oTo.mpfSums;
    float* const pfToCounts = oTo.mpfCounts;
    const GreyRows oOut = oLeaving;
    const GreyRows oIn = oEntering;
    // The rows of sums are the same or do not touch one another, and the levels are never written.
#pragma GCC ivdep
    for (std::size_t c = 0; c < nColumns; ++c)
    {
        ColumnSums<T> oColumn = {pfFromSums[c], pfFromCounts[c]};
        if constexpr (bMoves)
        {
            oColumn.TakeRow(oOut.mpfGrey, oOut.mpfValid, oOut.mpfGreyBelow, oOut.mpfValidBelow, c,
                            -1.0F);
        }
        oColumn.TakeRow(oIn.mpfGrey, oIn.mpfValid, oIn.mpfGreyBelow, oIn.mpfValidBelow, c, 1.0F);
        pfToSums[c] = oColumn.mfSum;
        pfToCounts[c] = oColumn.mfCount;
    }
}

void AddPairs(const GreyRows& oEntering, bool bExact, std::size_t nColumns, const PairSums& oFrom,
              const PairSums& oTo)
{
    const auto pfnUpdate = bExact ? UpdateColumns<float, false> : UpdateColumns<double, false>;
    pfnUpdate(oEntering, oEntering, nColumns, oFrom, oTo);
}

void MovePairs(const GreyRows& oLeaving, const GreyRows& oEntering, bool bExact,
               std::size_t nColumns, const PairSums& oFrom, const PairSums& oTo)
{
    const auto pfnUpdate = bExact ? UpdateColumns<float, true> : UpdateColumns<double, true>;
    pfnUpdate(oLeaving, oEntering, nColumns, oFrom, oTo);
}

// Rows are chains of additions of their own: lanes are rows.
constexpr hn::CappedTag<float, 4> kTag;
constexpr std::size_t kLanes = hn::MaxLanes(kTag);
using Vector = hn::Vec<decltype(kTag)>;

/// kLanes vectors seen as a square are mirrored at the diagonal.
HWY_INLINE void Transpose([[maybe_unused]] Vector* poRows)
{
#if HWY_TARGET != HWY_SCALAR
    const Vector oLower01 = hn::InterleaveLower(kTag, poRows[0], poRows[1]);
    const Vector oUpper01 = hn::InterleaveUpper(kTag, poRows[0], poRows[1]);
    const Vector oLower23 = hn::InterleaveLower(kTag, poRows[2], poRows[3]);
    const Vector oUpper23 = hn::InterleaveUpper(kTag, poRows[2], poRows[3]);
    poRows[0] = hn::ConcatLowerLower(kTag, oLower23, oLower01);
    poRows[1] = hn::ConcatUpperUpper(kTag, oLower23, oLower01);
    poRows[2] = hn::ConcatLowerLower(kTag, oUpper23, oUpper01);
    poRows[3] = hn::ConcatUpperUpper(kTag, oUpper23, oUpper01);
#endif
}

/// The sums, or the counts, of the windows of kLanes rows on their way along the rows.
class WindowTrack
{
public:
    HWY_INLINE WindowTrack(const PairSums* aoRows, const PairSums* aoWindows,
                           float* PairSums::*pMember)
        : moSum(hn::Zero(kTag))
    {
        for (std::size_t k = 0; k < kLanes; ++k)
        {
            mapfColumns[k] = aoRows[k].*pMember;
            mapfWindows[k] = aoWindows[k].*pMember;
        }
    }

    HWY_INLINE void Add(std::size_t c) { moSum = hn::Add(moSum, Column(c)); }

    /// One pixel, the columns of which go from i to i + nSpan.
    HWY_INLINE void Slide(std::size_t i, std::size_t nSpan)
    {
        HWY_ALIGN float afSums[kLanes];
        Add(i + nSpan);
        hn::Store(moSum, kTag, afSums);
        for (std::size_t k = 0; k < kLanes; ++k)
        {
            mapfWindows[k][i] = afSums[k];
        }
        moSum = hn::Sub(moSum, Column(i));
    }

    /// kLanes pixels from i on.
    HWY_INLINE void SlideSquare(std::size_t i, std::size_t nSpan)
    {
        Vector aoEntering[kLanes];
        Vector aoLeaving[kLanes];
        for (std::size_t k = 0; k < kLanes; ++k)
        {
            aoEntering[k] = hn::LoadU(kTag, mapfColumns[k] + i + nSpan);
            aoLeaving[k] = hn::LoadU(kTag, mapfColumns[k] + i);
        }
        Transpose(aoEntering);
        Transpose(aoLeaving);
        Vector aoSums[kLanes];
        for (std::size_t x = 0; x < kLanes; ++x)
        {
            aoSums[x] = hn::Add(moSum, aoEntering[x]);
            moSum = hn::Sub(aoSums[x], aoLeaving[x]);
        }
        Transpose(aoSums);
        for (std::size_t k = 0; k < kLanes; ++k)
        {
            hn::StoreU(aoSums[k], kTag, mapfWindows[k] + i);
        }
    }

private:
    HWY_INLINE Vector Column(std::size_t c) const
    {
        HWY_ALIGN float afColumn[kLanes];
        for (std::size_t k = 0; k < kLanes; ++k)
        {
            afColumn[k] = mapfColumns[k][c];
        }
        return hn::Load(kTag, afColumn);
    }

    const float* mapfColumns[kLanes];
    float* mapfWindows[kLanes];
    Vector moSum;
};

/// Slides the sums and the counts of kLanes rows.
void SlideRows(const PairSums* aoRows, std::size_t nWindow, std::size_t nPixels,
               const PairSums* aoWindows)
{
    WindowTrack oSums(aoRows, aoWindows, &PairSums::mpfSums);
    WindowTrack oCounts(aoRows, aoWindows, &PairSums::mpfCounts);
    const std::size_t nSpan = nWindow - 1;
    for (std::size_t c = 0; c < nSpan; ++c)
    {
        oSums.Add(c);
        oCounts.Add(c);
    }
    std::size_t i = 0;
    for (; i + kLanes <= nPixels; i += kLanes)
    {
        oSums.SlideSquare(i, nSpan);
        oCounts.SlideSquare(i, nSpan);
    }
    for (; i < nPixels; ++i)
    {
        oSums.Slide(i, nSpan);
        oCounts.Slide(i, nSpan);
    }
}

void SlidePairs(const PairSums* aoRows, std::size_t nWindow, std::size_t nPixels,
                const PairSums* aoWindows)
{
    for (std::size_t k = 0; k < kPairRows; k += kLanes)
    {
        SlideRows(aoRows + k, nWindow, nPixels, aoWindows + k);
    }
}

void DividePairs(const float* pfSums, const float* pfCounts, const float* pfValid,
                 std::size_t nPixels, float* pfOut)
{
    for (std::size_t i = 0; i < nPixels; ++i)
    {
        const float fMean = pfSums[i] / pfCounts[i];
        pfOut[i] = pfValid[i] != 0.0F ? fMean : 0.0F;
    }
}

}  // namespace kor::filters::kernels::HWY_NAMESPACE
HWY_AFTER_NAMESPACE();

#if HWY_ONCE
namespace kor::filters::kernels
{

HWY_EXPORT(AddPairs);
HWY_EXPORT(MovePairs);
HWY_EXPORT(SlidePairs);
HWY_EXPORT(DividePairs);

void AddPairs(const GreyRows& oEntering, bool bExact, std::size_t nColumns, const PairSums& oFrom,
              const PairSums& oTo)
{
    HWY_DYNAMIC_DISPATCH(AddPairs)(oEntering, bExact, nColumns, oFrom, oTo);
}

void MovePairs(const GreyRows& oLeaving, const GreyRows& oEntering, bool bExact,
               std::size_t nColumns, const PairSums& oFrom, const PairSums& oTo)
{
    HWY_DYNAMIC_DISPATCH(MovePairs)(oLeaving, oEntering, bExact, nColumns, oFrom, oTo);
}

void SlidePairs(const PairSums* aoRows, std::size_t nWindow, std::size_t nPixels,
                const PairSums* aoWindows)
{
    HWY_DYNAMIC_DISPATCH(SlidePairs)(aoRows, nWindow, nPixels, aoWindows);
}

void DividePairs(const float* pfSums, const float* pfCounts, const float* pfValid,
                 std::size_t nPixels, float* pfOut)
{
    HWY_DYNAMIC_DISPATCH(DividePairs)(pfSums, pfCounts, pfValid, nPixels, pfOut);
}

}  // namespace kor::filters::kernels
#endif
