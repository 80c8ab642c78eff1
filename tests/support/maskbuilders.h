#pragma once

#include <memory>
#include <vector>

#include "basic/tessel/mask/imaskbuilder.h"

/// Mask builders for tests.
namespace kor::test
{

/// Makes valid what is above a threshold in the first channel, margins included, and counts its
/// calls. For blocks of 8 bits.
class AboveMaskBuilder : public tessel::IMaskBuilder
{
public:
    explicit AboveMaskBuilder(unsigned char nThreshold) : mnThreshold(nThreshold) {}

    tessel::Mask* BuildMask(const tessel::Raster& oRaster) const override
    {
        ++mnCalls;
        const std::size_t nPixels = std::size_t{oRaster.mnTotalWidth} * oRaster.mnTotalHeight;
        std::vector<unsigned char> vBytes(nPixels);
        for (std::size_t i = 0; i < nPixels; ++i)
        {
            vBytes[i] = oRaster.mpBuffer[i * oRaster.mnChannels] > mnThreshold ? 1 : 0;
        }
        return new tessel::Mask(oRaster, oRaster, vBytes.data(), false, false);
    }

    mutable int mnCalls = 0;

private:
    unsigned char mnThreshold;
};

}  // namespace kor::test
