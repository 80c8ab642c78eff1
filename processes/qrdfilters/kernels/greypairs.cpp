#include "processes/qrdfilters/kernels/greypairs.h"

#include <array>

#include "processes/qrdfilters/kernels/targets.h"

#undef HWY_TARGET_INCLUDE
#define HWY_TARGET_INCLUDE "processes/qrdfilters/kernels/greypairs.cpp"
#include <hwy/foreach_target.h>
#include <hwy/highway.h>

// The compiler makes vectors of the target of the loops over columns and over rows.
HWY_BEFORE_NAMESPACE();
namespace kor::filters::kernels::HWY_NAMESPACE
{

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

void SlidePairs(const PairSums* aoRows, std::size_t nWindow, std::size_t nPixels,
                const PairSums* aoWindows)
{
    // Each row is a chain of additions of its own; together they fill the processor.
    std::array<float, kPairRows> afSums{};
    std::array<float, kPairRows> afCounts{};
    for (std::size_t c = 0; c + 1 < nWindow; ++c)
    {
        for (std::size_t k = 0; k < kPairRows; ++k)
        {
            afSums[k] = afSums[k] + aoRows[k].mpfSums[c];
            afCounts[k] = afCounts[k] + aoRows[k].mpfCounts[c];
        }
    }
    for (std::size_t i = 0; i < nPixels; ++i)
    {
        for (std::size_t k = 0; k < kPairRows; ++k)
        {
            const PairSums& oRow = aoRows[k];
            afSums[k] = afSums[k] + oRow.mpfSums[i + nWindow - 1];
            afCounts[k] = afCounts[k] + oRow.mpfCounts[i + nWindow - 1];
            aoWindows[k].mpfSums[i] = afSums[k];
            aoWindows[k].mpfCounts[i] = afCounts[k];
            afSums[k] = afSums[k] - oRow.mpfSums[i];
            afCounts[k] = afCounts[k] - oRow.mpfCounts[i];
        }
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
