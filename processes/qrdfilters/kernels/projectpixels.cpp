#include "processes/qrdfilters/kernels/projectpixels.h"

#include "processes/qrdfilters/kernels/targets.h"

#undef HWY_TARGET_INCLUDE
#define HWY_TARGET_INCLUDE "processes/qrdfilters/kernels/projectpixels.cpp"
#include <hwy/foreach_target.h>
#include <hwy/highway.h>

HWY_BEFORE_NAMESPACE();
namespace kor::filters::kernels::HWY_NAMESPACE
{

namespace hn = hwy::HWY_NAMESPACE;

using Floats = hn::CappedTag<float, kOutputPadding>;
using Vector = hn::Vec<Floats>;
constexpr Floats kTag;
constexpr std::size_t kLanes = hn::MaxLanes(kTag);

// Pixels that are summed at the same time: enough to hide the time that an addition takes.
constexpr std::size_t kGroup = 4;

/// One vector of outputs, from output nFirst on.
class OutputVector
{
public:
    OutputVector(const Projection& oProjection, std::size_t nFirst)
        : moProjection(oProjection),
          mnFirst(nFirst),
          moScale(hn::LoadU(kTag, oProjection.mpScale + nFirst)),
          moMidPoint(hn::LoadU(kTag, oProjection.mpMidPoint + nFirst))
    {
        for (std::size_t p = 0; p < kGroup; ++p)
        {
            maoLowest[p] = hn::LoadU(kTag, oProjection.mpLowest + nFirst);
            maoHighest[p] = hn::LoadU(kTag, oProjection.mpHighest + nFirst);
        }
    }

    void Project(const float* pPixels, std::size_t nPixels, float* pOut)
    {
        const std::size_t nChannels = moProjection.mnChannels;
        const std::size_t nOutputs = moProjection.mnOutputs;
        std::size_t p = 0;
        for (; p + kGroup <= nPixels; p += kGroup)
        {
            ProjectGroup<kGroup>(pPixels + p * nChannels, pOut + p * nOutputs + mnFirst);
        }
        for (; p < nPixels; ++p)
        {
            ProjectGroup<1>(pPixels + p * nChannels, pOut + p * nOutputs + mnFirst);
        }
        for (p = 0; p < kGroup; ++p)
        {
            Lower(maoLowest[p], maoLowest[0]);
            Raise(maoHighest[p], maoHighest[0]);
        }
        hn::StoreU(maoLowest[0], kTag, moProjection.mpLowest + mnFirst);
        hn::StoreU(maoHighest[0], kTag, moProjection.mpHighest + mnFirst);
    }

private:
    template <std::size_t kPixels>
    HWY_INLINE void ProjectGroup(const float* pPixels, float* pOut)
    {
        const std::size_t nChannels = moProjection.mnChannels;
        const std::size_t nRow = PadOutputs(moProjection.mnOutputs);
        Vector aoSums[kPixels];
        for (std::size_t p = 0; p < kPixels; ++p)
        {
            aoSums[p] = hn::Zero(kTag);
        }
        for (std::size_t c = 0; c < nChannels; ++c)
        {
            const auto oWeights = hn::LoadU(kTag, moProjection.mpWeights + c * nRow + mnFirst);
            for (std::size_t p = 0; p < kPixels; ++p)
            {
                const auto oSample = hn::Set(kTag, pPixels[p * nChannels + c]);
                aoSums[p] = hn::Add(aoSums[p], hn::Mul(oSample, oWeights));
            }
        }
        // In the order of pixels: lanes behind a pixel's outputs are the next one's.
        for (std::size_t p = 0; p < kPixels; ++p)
        {
            Lower(aoSums[p], maoLowest[p]);
            Raise(aoSums[p], maoHighest[p]);
            hn::StoreU(hn::Add(hn::Mul(aoSums[p], moScale), moMidPoint), kTag,
                       pOut + p * moProjection.mnOutputs);
        }
    }

    // Compared and chosen, since the minimum of a processor may be a sample that is not a number.
    static HWY_INLINE void Lower(Vector oValue, Vector& oLowest)
    {
        oLowest = hn::IfThenElse(hn::Lt(oValue, oLowest), oValue, oLowest);
    }
    static HWY_INLINE void Raise(Vector oValue, Vector& oHighest)
    {
        oHighest = hn::IfThenElse(hn::Gt(oValue, oHighest), oValue, oHighest);
    }

    const Projection& moProjection;
    std::size_t mnFirst;
    Vector moScale;
    Vector moMidPoint;
    Vector maoLowest[kGroup];
    Vector maoHighest[kGroup];
};

void ProjectPixels(const Projection& oProjection, const float* pPixels, std::size_t nPixels,
                   float* pOut)
{
    // From the last vector to the first: only the last one is stored with lanes that are no outputs
    // of its pixel, and where there are several, these lie in the first one of the next pixel.
    for (std::size_t nEnd = (oProjection.mnOutputs + kLanes - 1) / kLanes * kLanes; nEnd > 0;
         nEnd -= kLanes)
    {
        OutputVector(oProjection, nEnd - kLanes).Project(pPixels, nPixels, pOut);
    }
}

void SubtractMeans(const float* pMeans, std::span<float> oSamples)
{
    const hn::ScalableTag<float> oTag;
    const std::size_t nLanes = hn::Lanes(oTag);
    std::size_t i = 0;
    for (; i + nLanes <= oSamples.size(); i += nLanes)
    {
        hn::StoreU(hn::Sub(hn::LoadU(oTag, &oSamples[i]), hn::LoadU(oTag, pMeans + i)), oTag,
                   &oSamples[i]);
    }
    for (; i < oSamples.size(); ++i)
    {
        oSamples[i] -= pMeans[i];
    }
}

}  // namespace kor::filters::kernels::HWY_NAMESPACE
HWY_AFTER_NAMESPACE();

#if HWY_ONCE
namespace kor::filters::kernels
{

HWY_EXPORT(SubtractMeans);
HWY_EXPORT(ProjectPixels);

void SubtractMeans(const float* pMeans, std::span<float> oSamples)
{
    HWY_DYNAMIC_DISPATCH(SubtractMeans)(pMeans, oSamples);
}

void ProjectPixels(const Projection& oProjection, const float* pPixels, std::size_t nPixels,
                   float* pOut)
{
    HWY_DYNAMIC_DISPATCH(ProjectPixels)(oProjection, pPixels, nPixels, pOut);
}

}  // namespace kor::filters::kernels
#endif
