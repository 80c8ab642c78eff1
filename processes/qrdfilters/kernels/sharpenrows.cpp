#include "processes/qrdfilters/kernels/sharpenrows.h"

#include "processes/qrdfilters/kernels/targets.h"

#undef HWY_TARGET_INCLUDE
#define HWY_TARGET_INCLUDE "processes/qrdfilters/kernels/sharpenrows.cpp"
#include "hwy/foreach_target.h"
#include "hwy/highway.h"

HWY_BEFORE_NAMESPACE();

namespace kor::filters::kernels::HWY_NAMESPACE
{

namespace hn = hwy::HWY_NAMESPACE;

using Doubles = hn::CappedTag<double, 8>;
using Vector = hn::Vec<Doubles>;
constexpr Doubles kTag;

/// A window from scratch, for the rows from r on.
HWY_INLINE Vector SumWindow(const MovingWindows& oWindows, const double* pFirst)
{
    auto oSum = hn::Zero(kTag);
    for (std::size_t dy = 0; dy < oWindows.mnHeight; ++dy)
    {
        for (std::size_t dx = 0; dx < oWindows.mnWidth; ++dx)
        {
            const double* pColumn = pFirst + dx * oWindows.mnStep * oWindows.mnPitch;
            oSum = hn::Add(oSum, hn::LoadU(kTag, pColumn + dy));
        }
    }
    return oSum;
}

/// The windows of one sample.
HWY_INLINE void MoveColumn(const MovingWindows& oWindows, const double* pColumn,
                           const std::uint64_t* pFresh, double* pSums)
{
    const hn::RebindToUnsigned<Doubles> oWordTag;
    const std::size_t nPixel = oWindows.mnStep * oWindows.mnPitch;
    for (std::size_t r = 0; r < oWindows.mnRows; r += hn::Lanes(kTag))
    {
        const double* pLeaving = pColumn - nPixel + r;
        const double* pEntering = pColumn + (oWindows.mnWidth - 1) * nPixel + r;
        auto oSum = hn::LoadU(kTag, pSums - oWindows.mnStep * oWindows.mnRows + r);
        for (std::size_t dy = 0; dy < oWindows.mnHeight; ++dy)
        {
            oSum = hn::Sub(oSum, hn::LoadU(kTag, pLeaving + dy));
        }
        for (std::size_t dy = 0; dy < oWindows.mnHeight; ++dy)
        {
            oSum = hn::Add(oSum, hn::LoadU(kTag, pEntering + dy));
        }
        const auto oFresh = hn::MaskFromVec(hn::BitCast(kTag, hn::LoadU(oWordTag, pFresh + r)));
        if (!hn::AllFalse(kTag, oFresh))
        {
            oSum = hn::IfThenElse(oFresh, SumWindow(oWindows, pColumn + r), oSum);
        }
        hn::StoreU(oSum, kTag, pSums + r);
    }
}

void MoveWindows(const MovingWindows& oWindows)
{
    const double* pColumn = oWindows.mpColumns;
    double* pSums = oWindows.mpSums;
    for (std::size_t x = 0; x < oWindows.mnPixels; ++x)
    {
        const std::uint64_t* pFresh = oWindows.mpFresh + x * oWindows.mnRows;
        for (std::size_t c = 0; c < oWindows.mnStep; ++c)
        {
            MoveColumn(oWindows, pColumn, pFresh, pSums);
            pColumn += oWindows.mnPitch;
            pSums += oWindows.mnRows;
        }
    }
}

void SharpenRow(const double* pIn, const double* pSums, const double* pCounts,
                std::span<double> oOut)
{
    std::size_t i = 0;
    for (; i + hn::Lanes(kTag) <= oOut.size(); i += hn::Lanes(kTag))
    {
        const auto oMean = hn::Div(hn::LoadU(kTag, pSums + i), hn::LoadU(kTag, pCounts + i));
        const auto oTwice = hn::Mul(hn::LoadU(kTag, pIn + i), hn::Set(kTag, 2.0));
        hn::StoreU(hn::Sub(oTwice, oMean), kTag, &oOut[i]);
    }
    for (; i < oOut.size(); ++i)
    {
        oOut[i] = pIn[i] * 2.0 - pSums[i] / pCounts[i];
    }
}

}  // namespace kor::filters::kernels::HWY_NAMESPACE

HWY_AFTER_NAMESPACE();

#if HWY_ONCE

namespace kor::filters::kernels
{

HWY_EXPORT(MoveWindows);
HWY_EXPORT(SharpenRow);

void MoveWindows(const MovingWindows& oWindows)
{
    HWY_DYNAMIC_DISPATCH(MoveWindows)(oWindows);
}

void SharpenRow(const double* pIn, const double* pSums, const double* pCounts,
                std::span<double> oOut)
{
    HWY_DYNAMIC_DISPATCH(SharpenRow)(pIn, pSums, pCounts, oOut);
}

}  // namespace kor::filters::kernels

#endif
