#include "processes/qrdfilters/filteringmaskbuilder.h"

#include <cmath>
#include <cstring>
#include <limits>
#include <memory>
#include <type_traits>

#include "platform/exception/exception.h"

namespace kor::filters
{

using tessel::Raster;

namespace
{

/// A background of one value is the range from it to itself.
std::vector<float> RangeOf(std::vector<float> vfBackground)
{
    if (vfBackground.size() == 1)
    {
        vfBackground.push_back(vfBackground.front());
    }
    return vfBackground;
}

}  // namespace

FilteringMaskBuilder::FilteringMaskBuilder(const std::vector<int>& oWindow,
                                           const std::vector<float>& oBackground,
                                           const std::vector<float>& oFailValues)
    : moWindow(oWindow), moBackground(RangeOf(oBackground)), moFailValues(oFailValues)
{
}

FilteringMaskBuilder::FilteringMaskBuilder(const std::vector<float>& oBackground,
                                           const std::vector<float>& oFailValues)
    : moBackground(RangeOf(oBackground)), moFailValues(oFailValues)
{
}

FilteringMaskBuilder::FilteringMaskBuilder(datasources::IRasterReader* poMaskReader,
                                           const std::vector<float>& oBackground,
                                           const std::vector<float>& oFailValues)
    : moBackground(RangeOf(oBackground)), moFailValues(oFailValues), mpoMaskReader(poMaskReader)
{
}

tessel::Mask* FilteringMaskBuilder::BuildMask(const Raster& oRaster) const
{
    const tessel::RasterInfo oInfo(oRaster.mnWidth, oRaster.mnHeight, 1, tessel::eDT_8U);
    Raster oMask(oInfo, oRaster);
    std::memset(oMask.mpBuffer, 1, oMask.mnBufferSize);
    if (mpoMaskReader != nullptr)
    {
        mpoMaskReader->SetMargin(oRaster.mnMarginX, oRaster.mnMarginY, datasources::eEM_Nearest);
        mpoMaskReader->ReadRaster(&oMask);
    }
    else if (moWindow.size() == 4)
    {
        ApplyWindowMask(oMask);
    }
    ApplyBackgroundAndFail(oRaster, oMask);
    return std::make_unique<tessel::Mask>(oInfo, oRaster, oMask.mpBuffer, false, false).release();
}

void FilteringMaskBuilder::ApplyWindowMask(Raster& oMask) const
{
    // Positions in 64 bits, so that neither offsets nor window ends can wrap.
    const std::int64_t nLeft = moWindow[0];
    const std::int64_t nTop = moWindow[1];
    const std::int64_t nRight = nLeft + moWindow[2];
    const std::int64_t nBottom = nTop + moWindow[3];
    const std::int64_t nMarginX = oMask.mnMarginX;
    const std::int64_t nMarginY = oMask.mnMarginY;
    const auto nOffsetX = static_cast<std::int32_t>(oMask.mnOffsetX);
    const auto nOffsetY = static_cast<std::int32_t>(oMask.mnOffsetY);
    // Meant: a block that misses the window loses its margins too, even where they reach into it.
    if (nOffsetX > nRight || nOffsetY > nBottom || std::int64_t{oMask.mnWidth} + nOffsetX < nLeft ||
        std::int64_t{oMask.mnHeight} + nOffsetY < nTop)
    {
        std::memset(oMask.mpBuffer, 0, oMask.mnBufferSize);
        return;
    }
    for (std::int64_t y = -nMarginY; y < oMask.mnHeight + nMarginY; ++y)
    {
        const bool bInRow = y + nOffsetY >= nTop && y + nOffsetY < nBottom;
        for (std::int64_t x = -nMarginX; x < oMask.mnWidth + nMarginX; ++x)
        {
            if (!bInRow || x + nOffsetX < nLeft || x + nOffsetX >= nRight)
            {
                *oMask.GetPixel(x, y) = 0;
            }
        }
    }
}

template <class TSample>
void FilteringMaskBuilder::ApplyToSamples(const Raster& oRaster, Raster& oMask) const
{
    using Value = std::conditional_t<std::is_same_v<TSample, double>, double, float>;
    constexpr Value kTolerance = std::numeric_limits<float>::epsilon();
    const bool bBackground = !moBackground.empty();
    const bool bFail = !moFailValues.empty();
    if (!bBackground && !bFail)
    {
        return;
    }
    const Value fLow = bBackground ? moBackground[0] : 0.0F;
    const Value fHigh = bBackground ? moBackground[1] : 0.0F;
    const Value fFail = bFail ? moFailValues[0] : 0.0F;
    const auto oFires = [&](TSample xSample)
    {
        const auto fSample = static_cast<Value>(xSample);
        return (bBackground && fSample >= fLow && fSample <= fHigh) ||
               (bFail && std::abs(fSample - fFail) < kTolerance);
    };

    const auto* pSamples = reinterpret_cast<const TSample*>(oRaster.mpBuffer);
    const std::size_t nChannels = oRaster.mnChannels;
    const std::size_t nPixels = std::size_t{oRaster.mnTotalWidth} * oRaster.mnTotalHeight;
    for (std::size_t i = 0; i < nPixels; ++i, pSamples += nChannels)
    {
        for (std::size_t c = 0; c < nChannels; ++c)
        {
            if (oFires(pSamples[c]))
            {
                oMask.mpBuffer[i] = 0;
                break;
            }
        }
    }
}

void FilteringMaskBuilder::ApplyBackgroundAndFail(const Raster& oRaster, Raster& oMask) const
{
    const tessel::DataType& oType = oRaster.moDataType;
    if (oType == tessel::eDT_8U)
    {
        ApplyToSamples<unsigned char>(oRaster, oMask);
    }
    else if (oType == tessel::eDT_16U)
    {
        ApplyToSamples<unsigned short>(oRaster, oMask);
    }
    else if (oType == tessel::eDT_16S)
    {
        ApplyToSamples<short>(oRaster, oMask);
    }
    else if (oType == tessel::eDT_32R)
    {
        ApplyToSamples<float>(oRaster, oMask);
    }
    else if (oType == tessel::eDT_64R)
    {
        ApplyToSamples<double>(oRaster, oMask);
    }
    else
    {
        throw ParameterException(
            "", ParameterException::Type::eInvalidValue,
            "Unknown raster data type contained in provided IRaster input instance.", "", "", "",
            "", 0);
    }
}

}  // namespace kor::filters
