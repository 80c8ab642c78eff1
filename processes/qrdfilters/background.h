#pragma once

#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <span>

#include "basic/tessel/mask/mask.h"
#include "processes/qrdfilters/findbyte.h"
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
    std::size_t nFirst = FindByte(oComputed, 0, 0);
    while (nFirst != oComputed.size())
    {
        const std::size_t nEnd = FindByte(oComputed, nFirst, 1);
        const std::size_t nStart = nFirst * nChannels;
        const std::size_t nCount = (nEnd - nFirst) * nChannels;
        if (bBGZero)
        {
            std::fill_n(pOut + nStart, nCount, TOut(0));
        }
        else
        {
            ConvertSamples<TIn, TOut>(pIn + nStart, pOut + nStart, nCount);
        }
        nFirst = FindByte(oComputed, nEnd, 0);
    }
}

}  // namespace kor::filters
