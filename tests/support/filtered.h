#pragma once

#include "basic/tessel/mask/mask.h"
#include "tests/support/blocks.h"

namespace kor::test
{

/// What a filter of doubles makes of an image that is drawn with its margins.
template <class Filter>
Image<double> Filtered(const Filter& oFilter, const Image<double>& oImage, Margins oMargins,
                       tessel::Mask* poMaskIn = nullptr, tessel::Mask* poMaskOut = nullptr,
                       std::uint32_t nChannels = 1)
{
    const auto poIn = RasterOf(oImage, oMargins, nChannels);
    const auto poOut = BlankRaster(poIn->mnWidth, poIn->mnHeight, nChannels, tessel::eDT_64R);
    oFilter.Process(poIn.get(), poMaskIn, poOut.get(), poMaskOut);
    return ImageOf<double>(*poOut);
}

}  // namespace kor::test
