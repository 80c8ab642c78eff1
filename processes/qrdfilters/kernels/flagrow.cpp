#include "processes/qrdfilters/kernels/flagrow.h"

#include <cstdint>

#include "basic/core/typedispatch/typelist.h"
#include "processes/qrdfilters/kernels/targets.h"
#include "processes/qrdfilters/sampleconversion.h"

#undef HWY_TARGET_INCLUDE
#define HWY_TARGET_INCLUDE "processes/qrdfilters/kernels/flagrow.cpp"
#include <hwy/foreach_target.h>
#include <hwy/highway.h>

// The compiler makes vectors of the target of these loops.
HWY_BEFORE_NAMESPACE();
namespace kor::filters::kernels::HWY_NAMESPACE
{

template <class T>
void FlagWords(const void* pSamples, const IntegerRange& oRange, std::span<unsigned char> oFlags)
{
    const T* const pFrom = static_cast<const T*>(pSamples);
    const T nLowest = static_cast<T>(oRange.mnLowest);
    const T nSpan = static_cast<T>(oRange.mnSpan);
    const unsigned char nIn = oRange.mbInverted ? 0 : 1;
    unsigned char* const pFlags = oFlags.data();
    for (std::size_t i = 0; i < oFlags.size(); ++i)
    {
        const unsigned char nOut = static_cast<unsigned char>(1 - nIn);
        pFlags[i] = static_cast<T>(pFrom[i] - nLowest) <= nSpan ? nIn : nOut;
    }
}

void FlagIntegers(const void* pSamples, std::size_t nBytes, const IntegerRange& oRange,
                  std::span<unsigned char> oFlags)
{
    switch (nBytes)
    {
        case 1:
            return FlagWords<std::uint8_t>(pSamples, oRange, oFlags);
        case 2:
            return FlagWords<std::uint16_t>(pSamples, oRange, oFlags);
        case 4:
            return FlagWords<std::uint32_t>(pSamples, oRange, oFlags);
        default:
            return FlagWords<std::uint64_t>(pSamples, oRange, oFlags);
    }
}

void FlagFloats(const float* pSamples, const FloatRange& oRange, std::span<unsigned char> oFlags)
{
    const float fLow = oRange.mfLow;
    const float fHigh = oRange.mfHigh;
    unsigned char* const pFlags = oFlags.data();
    if (oRange.mbOutside)
    {
        for (std::size_t i = 0; i < oFlags.size(); ++i)
        {
            pFlags[i] = static_cast<unsigned char>((pSamples[i] <= fLow ? 1 : 0) |
                                                   (pSamples[i] >= fHigh ? 1 : 0));
        }
        return;
    }
    for (std::size_t i = 0; i < oFlags.size(); ++i)
    {
        pFlags[i] = static_cast<unsigned char>((pSamples[i] >= fLow ? 1 : 0) &
                                               (pSamples[i] <= fHigh ? 1 : 0));
    }
}

template <class T>
void SquarePairs(const void* pPairs, std::span<float> oOut)
{
    const T* const pFrom = static_cast<const T*>(pPairs);
    float* const pfOut = oOut.data();
    for (std::size_t i = 0; i < oOut.size(); ++i)
    {
        pfOut[i] = ConvertSample<T, float>(IntensitySample<T, T>(pFrom[2 * i], pFrom[2 * i + 1]));
    }
}

void SquareMagnitudes(const void* pPairs, std::size_t nType, std::span<float> oOut)
{
    const auto oVisit = [&]<class T>() { SquarePairs<T>(pPairs, oOut); };
    typedispatch::VisitType<typedispatch::StandardTypeList>(nType, oVisit, [] {});
}

}  // namespace kor::filters::kernels::HWY_NAMESPACE
HWY_AFTER_NAMESPACE();

#if HWY_ONCE
namespace kor::filters::kernels
{

HWY_EXPORT(FlagIntegers);
HWY_EXPORT(FlagFloats);
HWY_EXPORT(SquareMagnitudes);

void FlagIntegers(const void* pSamples, std::size_t nBytes, const IntegerRange& oRange,
                  std::span<unsigned char> oFlags)
{
    HWY_DYNAMIC_DISPATCH(FlagIntegers)(pSamples, nBytes, oRange, oFlags);
}

void FlagFloats(const float* pSamples, const FloatRange& oRange, std::span<unsigned char> oFlags)
{
    HWY_DYNAMIC_DISPATCH(FlagFloats)(pSamples, oRange, oFlags);
}

void SquareMagnitudes(const void* pPairs, std::size_t nType, std::span<float> oOut)
{
    HWY_DYNAMIC_DISPATCH(SquareMagnitudes)(pPairs, nType, oOut);
}

}  // namespace kor::filters::kernels
#endif
