#pragma once

#include <algorithm>
#include <cstdint>
#include <span>

#include "basic/tessel/mask/mask.h"
#include "processes/qrdfilters/samplerows.h"

namespace kor::filters
{

/// Which pixels of a row are computed: oComputed.size() pixels from (x, y) to the right become 1,
/// or 0 where one of the masks has a cleared bit and the pixel is background. Both masks may be
/// null; each is read with its own margins.
void FindComputedPixels(const tessel::Mask* poMaskIn, const tessel::Mask* poMaskOut, std::int64_t x,
                        std::int64_t y, std::span<unsigned char> oComputed);

/// Writes the background over a row of pixels of nChannels samples where oComputed is 0: zeros, or
/// with bBGZero false the samples of pIn, converted.
template <class TIn, class TOut>
void WriteBackground(std::span<const unsigned char> oComputed, const TIn* pIn,
                     std::size_t nChannels, bool bBGZero, TOut* pOut)
{
    auto itFirst = std::find(oComputed.begin(), oComputed.end(), 0);
    while (itFirst != oComputed.end())
    {
        const auto itEnd = std::find(itFirst, oComputed.end(), 1);
        const auto nStart = static_cast<std::size_t>(itFirst - oComputed.begin()) * nChannels;
        const auto nCount = static_cast<std::size_t>(itEnd - itFirst) * nChannels;
        if (bBGZero)
        {
            std::fill_n(pOut + nStart, nCount, TOut(0));
        }
        else
        {
            ConvertSamples<TIn, TOut>(pIn + nStart, pOut + nStart, nCount);
        }
        itFirst = std::find(itEnd, oComputed.end(), 0);
    }
}

}  // namespace kor::filters
