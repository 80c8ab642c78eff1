#include "processes/qrdfilters/simulation/scanframe.h"

#include <cmath>
#include <limits>

#include "platform/system/memory.h"
#include "processes/qrdfilters/simulation/linemaxima.h"

namespace kor::filters::simulation
{

double RoundedToSingle(double dfValue)
{
    return static_cast<float>(dfValue);
}

std::uint32_t ChannelBits(const datasources::IRasterReader& oReader, const char* pszSource)
{
    const std::vector<tessel::RasterInfo> voChannels = oReader.GetChannelsInfo();
    if (voChannels.empty())
    {
        throw Exception("The reader of elevations has no channel", pszSource, __PRETTY_FUNCTION__,
                        __LINE__);
    }
    return voChannels.front().moDataType.mnBits;
}

void RequireWindow(const DemWindow& oWindow, const datasources::IRasterReader& oReader,
                   const char* pszSource)
{
    const bool bHoldsPixels = oWindow.mnWidth > 0 && oWindow.mnHeight > 0;
    const bool bRowsInside =
        oWindow.mnY >= 0 && oWindow.mnY + oWindow.mnHeight <= std::int64_t{oReader.GetHeight()};
    if (!bHoldsPixels || !bRowsInside)
    {
        const std::string oSize =
            std::to_string(oWindow.mnWidth) + " x " + std::to_string(oWindow.mnHeight) + " pixels";
        const std::string oRows =
            "the image has rows 0 to " + std::to_string(std::int64_t{oReader.GetHeight()} - 1);
        throw ParameterException("Dbiw", ParameterException::Type::eInvalidValue, oSize, oRows,
                                 "Dbiw asks for " + oSize + " from row " +
                                     std::to_string(oWindow.mnY) + "; " +
                                     (bHoldsPixels ? oRows : "a window holds one pixel at least"),
                                 pszSource, __PRETTY_FUNCTION__, __LINE__);
    }
}

void RequireRowMemory(const DemWindow& oWindow, std::size_t nBytes)
{
    RequireMemory(LineMaxima::GetBytes(oWindow.mnWidth) +
                      static_cast<double>(nBytes) * static_cast<double>(oWindow.mnWidth),
                  "A DEM window of " + std::to_string(oWindow.mnWidth) + " columns");
}

ScanOrder::ScanOrder(double dfHeading, const DemWindow& oWindow)
    : mnFirstRow(oWindow.mnY + 1),
      mnLastRow(oWindow.mnY + oWindow.mnHeight),
      mnRowStep(1),
      mnFirstCol(1),
      mnLastCol(oWindow.mnWidth),
      mnColStep(1)
{
    if (dfHeading >= 180.0)
    {
        std::swap(mnFirstRow, mnLastRow);
        mnRowStep = -1;
    }
    // Meant: at exactly 90 the columns run as below 90, while the corners are those above.
    if (dfHeading > 90.0 && dfHeading < 270.0)
    {
        std::swap(mnFirstCol, mnLastCol);
        mnColStep = -1;
    }
}

ScanFrame::ScanFrame(double dfHeading, double dfRadians, double dfXSize, double dfYSize)
    : mdfSinHead(std::sin(dfRadians)),
      mdfCosHead(std::cos(dfRadians)),
      // Meant: neither bound of the mirrored headings is that of the side.
      mfSideSign(dfHeading >= 180.0 && dfHeading < 360.0 ? -1.0F : 1.0F),
      mbMirror((dfHeading > 0.0 && dfHeading < 270.0) || (dfHeading > 270.0 && dfHeading < 360.0))
{
    struct Corners
    {
        Corner oStart, oEnd, oNear, oFar;
    };
    const Corner oUpperLeft{0.0, 0.0};
    const Corner oUpperRight{dfXSize, 0.0};
    const Corner oLowerLeft{0.0, dfYSize};
    const Corner oLowerRight{dfXSize, dfYSize};
    Corners oCorners{oUpperRight, oLowerLeft, oLowerRight, oUpperLeft};  // 180 to 270
    if (dfHeading >= 270.0)
    {
        oCorners = {oLowerRight, oUpperLeft, oLowerLeft, oUpperRight};
    }
    else if (dfHeading < 90.0)
    {
        oCorners = {oLowerLeft, oUpperRight, oUpperLeft, oLowerRight};
    }
    else if (dfHeading < 180.0)
    {
        oCorners = {oUpperLeft, oLowerRight, oUpperRight, oLowerLeft};
    }
    const auto oAlong = [this](const Corner& oCorner)
    { return oCorner.x * mdfSinHead - oCorner.y * mdfCosHead; };
    mdfStart = oAlong(oCorners.oStart);
    mdfEnd = oAlong(oCorners.oEnd);
    moNear = oCorners.oNear;
    moFar = oCorners.oFar;
}

std::int64_t ImageSize(double dfSize, const char* pszUnit, const char* pszSource)
{
    if (!(dfSize >= 1.0 && dfSize <= std::numeric_limits<int>::max()))
    {
        throw Exception("These parameters give a radar image of " + std::to_string(dfSize) + " " +
                            pszUnit + "; it can have 1 to 2147483647",
                        pszSource, __PRETTY_FUNCTION__, __LINE__);
    }
    return static_cast<std::int64_t>(dfSize);
}

}  // namespace kor::filters::simulation
