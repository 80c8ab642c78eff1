#include "processes/qrdfilters/kernels/modevotes.h"

#include <algorithm>

#include "processes/qrdfilters/kernels/targets.h"

#undef HWY_TARGET_INCLUDE
#define HWY_TARGET_INCLUDE "processes/qrdfilters/kernels/modevotes.cpp"
#include <hwy/foreach_target.h>
#include <hwy/highway.h>

HWY_BEFORE_NAMESPACE();
namespace kor::filters::kernels::HWY_NAMESPACE
{

namespace hn = hwy::HWY_NAMESPACE;

/// 1 where equal, as bytes: the comparison is made in lanes of T, and cut.
template <class T>
HWY_INLINE void FindEqualOf(const T* pSamples, const T* pOthers, std::size_t nStep,
                            std::size_t nSamples, std::size_t nPlanes, std::uint8_t* pEqual,
                            std::size_t nPitch)
{
    const hn::ScalableTag<T> oTag;
    const hn::RebindToUnsigned<decltype(oTag)> oWide;
    const hn::Rebind<std::uint8_t, decltype(oTag)> oBytes;
    const auto oOne = hn::Set(oWide, 1);
    for (std::size_t k = 0; k < nPlanes; ++k, pOthers += nStep, pEqual += nPitch)
    {
        for (std::size_t i = 0; i < nSamples; i += hn::Lanes(oTag))
        {
            const auto bEqual = hn::Eq(hn::LoadU(oTag, pSamples + i), hn::LoadU(oTag, pOthers + i));
            const auto oEqual = hn::IfThenElseZero(hn::RebindMask(oWide, bEqual), oOne);
            if constexpr (sizeof(T) == 1)
            {
                hn::StoreU(oEqual, oBytes, pEqual + i);
            }
            else
            {
                hn::StoreU(hn::TruncateTo(oBytes, oEqual), oBytes, pEqual + i);
            }
        }
    }
}

void FindEqualU8(const std::uint8_t* pSamples, const std::uint8_t* pOthers, std::size_t nStep,
                 std::size_t nSamples, std::size_t nPlanes, std::uint8_t* pEqual,
                 std::size_t nPitch)
{
    FindEqualOf(pSamples, pOthers, nStep, nSamples, nPlanes, pEqual, nPitch);
}

void FindEqualU16(const std::uint16_t* pSamples, const std::uint16_t* pOthers, std::size_t nStep,
                  std::size_t nSamples, std::size_t nPlanes, std::uint8_t* pEqual,
                  std::size_t nPitch)
{
    FindEqualOf(pSamples, pOthers, nStep, nSamples, nPlanes, pEqual, nPitch);
}

void FindEqualU32(const std::uint32_t* pSamples, const std::uint32_t* pOthers, std::size_t nStep,
                  std::size_t nSamples, std::size_t nPlanes, std::uint8_t* pEqual,
                  std::size_t nPitch)
{
    FindEqualOf(pSamples, pOthers, nStep, nSamples, nPlanes, pEqual, nPitch);
}

void FindEqualF32(const float* pSamples, const float* pOthers, std::size_t nStep,
                  std::size_t nSamples, std::size_t nPlanes, std::uint8_t* pEqual,
                  std::size_t nPitch)
{
    FindEqualOf(pSamples, pOthers, nStep, nSamples, nPlanes, pEqual, nPitch);
}

void FindEqualF64(const double* pSamples, const double* pOthers, std::size_t nStep,
                  std::size_t nSamples, std::size_t nPlanes, std::uint8_t* pEqual,
                  std::size_t nPitch)
{
    FindEqualOf(pSamples, pOthers, nStep, nSamples, nPlanes, pEqual, nPitch);
}

void CountAlongRow(const std::uint8_t* pEqual, std::size_t nWindow, std::size_t nSamples,
                   std::uint8_t* pCounts, std::size_t nPitch)
{
    const hn::CappedTag<std::uint8_t, kModePadding> oTag;
    for (std::size_t i = 0; i < nSamples; i += hn::Lanes(oTag))
    {
        const auto oEqual = [&](std::size_t k) { return hn::LoadU(oTag, pEqual + k * nPitch + i); };
        auto oSum = oEqual(nWindow - 1);
        for (std::size_t k = nWindow; k < 2 * nWindow - 1; ++k)
        {
            oSum = hn::Add(oSum, oEqual(k));
        }
        hn::StoreU(oSum, oTag, pCounts + i);
        for (std::size_t a = 1; a < nWindow; ++a)
        {
            oSum = hn::Sub(hn::Add(oSum, oEqual(nWindow - 1 - a)), oEqual(2 * nWindow - 1 - a));
            hn::StoreU(oSum, oTag, pCounts + a * nPitch + i);
        }
    }
}

template <class TRank>
HWY_INLINE void RankDownColumnOf(const std::uint8_t* pCounts, std::size_t nCountsPitch,
                                 const std::uint8_t* pCentre, std::size_t nCentrePitch,
                                 std::size_t nWindow, std::size_t nSamples, TRank* pRanks,
                                 std::size_t nRanksPitch)
{
    const hn::CappedTag<TRank, kModePadding> oTag;
    const hn::Rebind<std::uint8_t, decltype(oTag)> oBytes;
    const auto oLoad = [&](const std::uint8_t* pBytes)
    {
        if constexpr (sizeof(TRank) == 1)
        {
            return hn::LoadU(oTag, pBytes);
        }
        else
        {
            return hn::PromoteTo(oTag, hn::LoadU(oBytes, pBytes));
        }
    };
    for (std::size_t i = 0; i < nSamples; i += hn::Lanes(oTag))
    {
        const auto oCounts = [&](std::size_t q) { return oLoad(pCounts + q * nCountsPitch + i); };
        const auto oStore = [&](std::size_t r, hn::Vec<decltype(oTag)> oSum)
        {
            const auto oCentre = oLoad(pCentre + (nWindow - 1 - r) * nCentrePitch + i);
            hn::StoreU(hn::Add(hn::Add(oSum, oSum), oCentre), oTag, pRanks + r * nRanksPitch + i);
        };
        auto oSum = oCounts(nWindow - 1);
        for (std::size_t q = nWindow; q < 2 * nWindow - 1; ++q)
        {
            oSum = hn::Add(oSum, oCounts(q));
        }
        oStore(0, oSum);
        for (std::size_t r = 1; r < nWindow; ++r)
        {
            oSum = hn::Sub(hn::Add(oSum, oCounts(nWindow - 1 - r)), oCounts(2 * nWindow - 1 - r));
            oStore(r, oSum);
        }
    }
}

void RankDownColumnU8(const std::uint8_t* pCounts, std::size_t nCountsPitch,
                      const std::uint8_t* pCentre, std::size_t nCentrePitch, std::size_t nWindow,
                      std::size_t nSamples, std::uint8_t* pRanks, std::size_t nRanksPitch)
{
    RankDownColumnOf(pCounts, nCountsPitch, pCentre, nCentrePitch, nWindow, nSamples, pRanks,
                     nRanksPitch);
}

void RankDownColumnU16(const std::uint8_t* pCounts, std::size_t nCountsPitch,
                       const std::uint8_t* pCentre, std::size_t nCentrePitch, std::size_t nWindow,
                       std::size_t nSamples, std::uint16_t* pRanks, std::size_t nRanksPitch)
{
    RankDownColumnOf(pCounts, nCountsPitch, pCentre, nCentrePitch, nWindow, nSamples, pRanks,
                     nRanksPitch);
}

template <class TRank>
HWY_INLINE void VoteOf(const TRank* pRanks, std::size_t nPitch, std::size_t nStep,
                       std::size_t nWindow, std::size_t nFirst, std::size_t nSamples, TRank* pBest,
                       TRank* pIndex)
{
    const hn::CappedTag<TRank, kModePadding> oTag;
    for (std::size_t i = 0; i < nSamples; i += hn::Lanes(oTag))
    {
        auto oBest = hn::LoadU(oTag, pBest + i);
        auto oIndex = hn::LoadU(oTag, pIndex + i);
        for (std::size_t a = 0; a < nWindow; ++a)
        {
            const auto oRank = hn::LoadU(oTag, pRanks + a * nPitch + a * nStep + i);
            const auto bAbove = hn::Gt(oRank, oBest);
            oIndex = hn::IfThenElse(bAbove, hn::Set(oTag, static_cast<TRank>(nFirst + a)), oIndex);
            oBest = hn::Max(oRank, oBest);
        }
        hn::StoreU(oBest, oTag, pBest + i);
        hn::StoreU(oIndex, oTag, pIndex + i);
    }
}

void VoteU8(const std::uint8_t* pRanks, std::size_t nPitch, std::size_t nStep, std::size_t nWindow,
            std::size_t nFirst, std::size_t nSamples, std::uint8_t* pBest, std::uint8_t* pIndex)
{
    VoteOf(pRanks, nPitch, nStep, nWindow, nFirst, nSamples, pBest, pIndex);
}

void VoteU16(const std::uint16_t* pRanks, std::size_t nPitch, std::size_t nStep,
             std::size_t nWindow, std::size_t nFirst, std::size_t nSamples, std::uint16_t* pBest,
             std::uint16_t* pIndex)
{
    VoteOf(pRanks, nPitch, nStep, nWindow, nFirst, nSamples, pBest, pIndex);
}

std::size_t CountEqual(std::span<const double> oWindow, double dfSample)
{
    const hn::CappedTag<double, 8> oTag;
    const auto oSample = hn::Set(oTag, dfSample);
    std::size_t nCount = 0;
    for (std::size_t j = 0; j < oWindow.size(); j += hn::Lanes(oTag))
    {
        nCount += hn::CountTrue(oTag, hn::Eq(hn::LoadU(oTag, &oWindow[j]), oSample));
    }
    return nCount;
}

std::size_t FindMode(std::span<const double> oWindow, std::size_t nArea, std::size_t nCentre,
                     std::size_t& nFirstCount)
{
    const double dfCentre = oWindow[nCentre];
    std::size_t nMode = nCentre;
    std::size_t nBest = kLowestRank;
    nFirstCount = 1;
    // A value that is met first at i occurs at most nArea - i times.
    for (std::size_t i = 0; 2 * (nArea - i) + 1 > nBest && i < nArea; ++i)
    {
        if (i != 0 && oWindow[i] == oWindow[i - 1])
        {
            continue;
        }
        const std::size_t nCount = CountEqual(oWindow, oWindow[i]);
        const std::size_t nRank = 2 * nCount + (oWindow[i] == dfCentre ? 1 : 0);
        if (i == 0)
        {
            nFirstCount = std::max<std::size_t>(nCount, 1);
        }
        if (nRank > nBest)
        {
            nBest = nRank;
            nMode = i;
        }
    }
    return nMode;
}

}  // namespace kor::filters::kernels::HWY_NAMESPACE
HWY_AFTER_NAMESPACE();

#if HWY_ONCE
namespace kor::filters::kernels
{

HWY_EXPORT(FindEqualU8);
HWY_EXPORT(FindEqualU16);
HWY_EXPORT(FindEqualU32);
HWY_EXPORT(FindEqualF32);
HWY_EXPORT(FindEqualF64);
HWY_EXPORT(CountAlongRow);
HWY_EXPORT(RankDownColumnU8);
HWY_EXPORT(RankDownColumnU16);
HWY_EXPORT(VoteU8);
HWY_EXPORT(VoteU16);
HWY_EXPORT(FindMode);

template <>
void FindEqual(const std::uint8_t* pSamples, const std::uint8_t* pOthers, std::size_t nStep,
               std::size_t nSamples, std::size_t nPlanes, std::uint8_t* pEqual, std::size_t nPitch)
{
    HWY_DYNAMIC_DISPATCH(FindEqualU8)(pSamples, pOthers, nStep, nSamples, nPlanes, pEqual, nPitch);
}

template <>
void FindEqual(const std::uint16_t* pSamples, const std::uint16_t* pOthers, std::size_t nStep,
               std::size_t nSamples, std::size_t nPlanes, std::uint8_t* pEqual, std::size_t nPitch)
{
    HWY_DYNAMIC_DISPATCH(FindEqualU16)(pSamples, pOthers, nStep, nSamples, nPlanes, pEqual, nPitch);
}

template <>
void FindEqual(const std::uint32_t* pSamples, const std::uint32_t* pOthers, std::size_t nStep,
               std::size_t nSamples, std::size_t nPlanes, std::uint8_t* pEqual, std::size_t nPitch)
{
    HWY_DYNAMIC_DISPATCH(FindEqualU32)(pSamples, pOthers, nStep, nSamples, nPlanes, pEqual, nPitch);
}

template <>
void FindEqual(const float* pSamples, const float* pOthers, std::size_t nStep, std::size_t nSamples,
               std::size_t nPlanes, std::uint8_t* pEqual, std::size_t nPitch)
{
    HWY_DYNAMIC_DISPATCH(FindEqualF32)(pSamples, pOthers, nStep, nSamples, nPlanes, pEqual, nPitch);
}

template <>
void FindEqual(const double* pSamples, const double* pOthers, std::size_t nStep,
               std::size_t nSamples, std::size_t nPlanes, std::uint8_t* pEqual, std::size_t nPitch)
{
    HWY_DYNAMIC_DISPATCH(FindEqualF64)(pSamples, pOthers, nStep, nSamples, nPlanes, pEqual, nPitch);
}

void CountAlongRow(const std::uint8_t* pEqual, std::size_t nWindow, std::size_t nSamples,
                   std::uint8_t* pCounts, std::size_t nPitch)
{
    HWY_DYNAMIC_DISPATCH(CountAlongRow)(pEqual, nWindow, nSamples, pCounts, nPitch);
}

template <>
void RankDownColumn(const std::uint8_t* pCounts, std::size_t nCountsPitch,
                    const std::uint8_t* pCentre, std::size_t nCentrePitch, std::size_t nWindow,
                    std::size_t nSamples, std::uint8_t* pRanks, std::size_t nRanksPitch)
{
    HWY_DYNAMIC_DISPATCH(RankDownColumnU8)
    (pCounts, nCountsPitch, pCentre, nCentrePitch, nWindow, nSamples, pRanks, nRanksPitch);
}

template <>
void RankDownColumn(const std::uint8_t* pCounts, std::size_t nCountsPitch,
                    const std::uint8_t* pCentre, std::size_t nCentrePitch, std::size_t nWindow,
                    std::size_t nSamples, std::uint16_t* pRanks, std::size_t nRanksPitch)
{
    HWY_DYNAMIC_DISPATCH(RankDownColumnU16)
    (pCounts, nCountsPitch, pCentre, nCentrePitch, nWindow, nSamples, pRanks, nRanksPitch);
}

template <>
void Vote(const std::uint8_t* pRanks, std::size_t nPitch, std::size_t nStep, std::size_t nWindow,
          std::size_t nFirst, std::size_t nSamples, std::uint8_t* pBest, std::uint8_t* pIndex)
{
    HWY_DYNAMIC_DISPATCH(VoteU8)(pRanks, nPitch, nStep, nWindow, nFirst, nSamples, pBest, pIndex);
}

template <>
void Vote(const std::uint16_t* pRanks, std::size_t nPitch, std::size_t nStep, std::size_t nWindow,
          std::size_t nFirst, std::size_t nSamples, std::uint16_t* pBest, std::uint16_t* pIndex)
{
    HWY_DYNAMIC_DISPATCH(VoteU16)(pRanks, nPitch, nStep, nWindow, nFirst, nSamples, pBest, pIndex);
}

std::size_t FindMode(std::span<const double> oWindow, std::size_t nArea, std::size_t nCentre,
                     std::size_t& nFirstCount)
{
    return HWY_DYNAMIC_DISPATCH(FindMode)(oWindow, nArea, nCentre, nFirstCount);
}

}  // namespace kor::filters::kernels
#endif
