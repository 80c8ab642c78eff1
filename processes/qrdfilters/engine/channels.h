#pragma once

#include <algorithm>
#include <cstddef>
#include <span>

namespace kor::filters::engine
{

/// Repeats each entry for the channels of its pixel. The usual numbers of channels get loops of
/// their own, which are several times as fast.
template <std::size_t kChannels, class T>
void RepeatForChannels(std::span<const T> oPixels, T* pSamples)
{
    for (const T nPixel : oPixels)
    {
        for (std::size_t c = 0; c < kChannels; ++c)
        {
            *pSamples++ = nPixel;
        }
    }
}

template <class T>
void RepeatForChannels(std::span<const T> oPixels, std::size_t nChannels, T* pSamples)
{
    switch (nChannels)
    {
        case 2:
            return RepeatForChannels<2>(oPixels, pSamples);
        case 3:
            return RepeatForChannels<3>(oPixels, pSamples);
        case 4:
            return RepeatForChannels<4>(oPixels, pSamples);
        default:
            for (const T nPixel : oPixels)
            {
                pSamples = std::fill_n(pSamples, nChannels, nPixel);
            }
    }
}

}  // namespace kor::filters::engine
