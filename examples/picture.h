#pragma once

#include <algorithm>
#include <cmath>
#include <cstddef>
#include <cstdint>
#include <filesystem>
#include <limits>
#include <string>
#include <utility>
#include <vector>

#include "basic/tessel/mask/mask.h"
#include "basic/tessel/raster/raster.h"
#include "platform/datasources/gdal/gdaldriver.h"

namespace kor::examples
{

/// A thinned-out copy of an image, in one channel or in three.
class Picture
{
public:
    explicit Picture(const tessel::RasterInfo& oImage)
        : mvnChannels(ChannelsShown(oImage.mnChannels)),
          mnStep((std::max(oImage.mnWidth, oImage.mnHeight) + kSide - 1) / kSide),
          mnWidth((oImage.mnWidth + mnStep - 1) / mnStep)
    {
    }

    /// One row and column of so many is taken.
    std::uint32_t GetStep() const { return mnStep; }

    /// Takes its pixels out of the next strip, of doubles. Masked ones are not a number.
    void Add(const tessel::Raster& oStrip, const tessel::Mask* poMask)
    {
        std::vector<unsigned char> vnValid(oStrip.mnWidth, 1);
        for (std::uint32_t y = 0; y < oStrip.mnHeight; ++y)
        {
            if ((oStrip.mnOffsetY + y) % mnStep != 0)
            {
                continue;
            }
            if (poMask != nullptr)
            {
                poMask->ExpandRow(0, y, vnValid);
            }
            for (std::uint32_t x = 0; x < oStrip.mnWidth; x += mnStep)
            {
                for (const unsigned int nChannel : mvnChannels)
                {
                    const double dfSample = oStrip.GetPixelAs<double>(x, y)[nChannel - 1];
                    mvfSamples.push_back(vnValid[x] != 0 ? static_cast<float>(dfSample) : kMasked);
                }
            }
        }
    }

    /// The samples below which 2 % and 98 % of the valid ones of a shown channel lie.
    std::pair<float, float> Limits(std::size_t nShown) const
    {
        std::vector<float> vfValid;
        for (std::size_t i = nShown; i < mvfSamples.size(); i += mvnChannels.size())
        {
            if (std::isfinite(mvfSamples[i]))
            {
                vfValid.push_back(mvfSamples[i]);
            }
        }
        if (vfValid.empty())
        {
            return {0.0F, 1.0F};
        }
        std::sort(vfValid.begin(), vfValid.end());
        return {vfValid[(vfValid.size() - 1) * 2 / 100], vfValid[(vfValid.size() - 1) * 98 / 100]};
    }

    /// Grey or red, green and blue: black at the lower limits of oScale and white at the upper
    /// ones.
    void Write(const std::filesystem::path& oFile, const Picture& oScale) const
    {
        const auto nShown = static_cast<std::uint32_t>(mvnChannels.size());
        tessel::Raster oPixels(
            {mnWidth, static_cast<std::uint32_t>(mvfSamples.size() / nShown / mnWidth), nShown,
             tessel::eDT_8U},
            {0, 0, 0, 0});
        for (std::size_t c = 0; c < nShown; ++c)
        {
            const auto [fLow, fHigh] = oScale.Limits(c);
            for (std::size_t i = c; i < mvfSamples.size(); i += nShown)
            {
                oPixels.mpBuffer[i] = Shade(mvfSamples[i], fLow, fHigh);
            }
        }
        datasources::WritePng(oFile.string(), oPixels);
    }

    std::string Describe() const
    {
        std::string oText = mvnChannels.size() == 1 ? "channel" : "channels";
        for (const unsigned int nChannel : mvnChannels)
        {
            oText.append(" ").append(std::to_string(nChannel));
        }
        return oText + ", each from its 2 % to its 98 % sample" +
               (mnStep > 1 ? ", one row and column of " + std::to_string(mnStep) : "");
    }

private:
    static constexpr std::uint32_t kSide = 1024;  ///< larger images are thinned out
    static constexpr float kMasked = std::numeric_limits<float>::quiet_NaN();

    static unsigned char Shade(float fSample, float fLow, float fHigh)
    {
        if (std::isnan(fSample))
        {
            return 0;
        }
        const float fShare = (fSample - fLow) / (fHigh > fLow ? fHigh - fLow : 1.0F);
        return static_cast<unsigned char>(std::clamp(fShare, 0.0F, 1.0F) * 255.0F + 0.5F);
    }

    /// Red, green and blue where there are as many. Files of more than four channels are mostly
    /// ordered by wavelength, blue first.
    static std::vector<unsigned int> ChannelsShown(unsigned int nChannels)
    {
        if (nChannels < 3)
        {
            return {1};
        }
        return nChannels > 4 ? std::vector<unsigned int>{3, 2, 1}
                             : std::vector<unsigned int>{1, 2, 3};
    }

    std::vector<unsigned int> mvnChannels;
    std::uint32_t mnStep;
    std::uint32_t mnWidth;
    std::vector<float> mvfSamples;
};

}  // namespace kor::examples
