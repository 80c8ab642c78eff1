#include "platform/datasources/gdal/gdalkept.h"

#include <cpl_port.h>

#include <algorithm>
#include <cmath>
#include <cstdio>
#include <optional>

#include "platform/datasources/gdal/gdalauxiliary.h"
#include "platform/exception/exception.h"

namespace kor::datasources
{

namespace
{

using ogc::cs::GeocodingInfo;

constexpr const char* kSource = "platform/datasources/gdal/gdalkept";
constexpr double kSameCorner = 1e-6;  ///< pixels

bool IsBlank(char nLetter)
{
    return nLetter == ' ' || nLetter == '\t' || nLetter == '\n' || nLetter == '\r';
}

/// XML, in which most formats keep texts, has no other control characters, and GDAL's reader drops
/// blanks in front.
bool IsKeepable(const std::string& oText)
{
    return (oText.empty() || !IsBlank(oText.front())) &&
           std::none_of(oText.begin(), oText.end(),
                        [](char nLetter)
                        { return static_cast<unsigned char>(nLetter) < ' ' && !IsBlank(nLetter); });
}

/// GDAL takes a colon for the end of a name as well, drops blanks behind one, and does not tell
/// capital letters from small ones.
bool IsKeepableName(const std::string& oName, const AuxiliaryData::Metadata& oMetadata)
{
    const auto nAlike =
        std::count_if(oMetadata.begin(), oMetadata.end(),
                      [&](const auto& oItem) { return EQUAL(oItem.first.c_str(), oName.c_str()); });
    return !oName.empty() && oName.find_first_of("=:") == std::string::npos &&
           !IsBlank(oName.back()) && IsKeepable(oName) && nAlike == 1;
}

void RequireKeepable(const AuxiliaryData::Metadata& oMetadata, const std::string& oFile)
{
    for (const auto& [oName, oValue] : oMetadata)
    {
        if (!IsKeepableName(oName, oMetadata))
        {
            throw DataException(oFile + ": \"" + oName +
                                    "\" cannot be the name of a metadata item beside the others",
                                kSource, __PRETTY_FUNCTION__, __LINE__);
        }
        if (!IsKeepable(oValue))
        {
            throw DataException(oFile + ": the value of the metadata item \"" + oName +
                                    "\" begins with a blank or has a control character in it",
                                kSource, __PRETTY_FUNCTION__, __LINE__);
        }
    }
}

std::string TextOf(double dfNumber)
{
    char szDigits[32];
    std::snprintf(szDigits, sizeof(szDigits), "%.15g", dfNumber);
    return szDigits;
}

std::string TextOf(const std::optional<double>& dfNumber)
{
    return dfNumber ? TextOf(*dfNumber) : "none";
}

std::string Difference(const std::string& oWhat, const std::string& oAsked, const std::string& oNow)
{
    return oWhat + ": " + oNow + " comes back for " + oAsked;
}

std::optional<std::string> ValueIn(const AuxiliaryData::Metadata& oMetadata,
                                   const std::string& oName)
{
    const auto itItem = oMetadata.find(oName);
    return itItem == oMetadata.end() ? std::nullopt : std::optional(itItem->second);
}

std::string Quoted(const std::optional<std::string>& oValue)
{
    return oValue ? "\"" + *oValue + "\"" : "none";
}

/// Items that formats make themselves, out of what else they hold.
bool IsMadeByFormat(const std::string& oName)
{
    return oName == "AREA_OR_POINT" || oName == "LAYER_TYPE" || oName.starts_with("Band_");
}

/// oOwner stands behind the item's name: " of channel 1".
std::string NotKept(const AuxiliaryData::Metadata& oAsked, const AuxiliaryData::Metadata& oBefore,
                    const AuxiliaryData::Metadata& oNow, const std::string& oOwner)
{
    AuxiliaryData::Metadata oAll = oAsked;
    oAll.insert(oBefore.begin(), oBefore.end());
    for (const auto& [oName, oAnyValue] : oAll)
    {
        const auto oWanted = ValueIn(oAsked, oName);
        const auto oFound = ValueIn(oNow, oName);
        if (oWanted != oFound && (oWanted || !IsMadeByFormat(oName)))
        {
            return Difference("the metadata item \"" + oName + "\"" + oOwner, Quoted(oWanted),
                              Quoted(oFound));
        }
    }
    return std::string();
}

/// Formats name channels that have no description by their numbers.
bool IsNumberedName(const std::string& oText, const std::string& oNumber)
{
    return oText == "Band " + oNumber || oText == "Layer_" + oNumber;
}

/// What an image has that does not say where it lies, in our way or in GDAL's.
bool SaysNothing(const GeocodingInfo::Transform& oTransform)
{
    return oTransform == GeocodingInfo().GetTransform() ||
           oTransform == GeocodingInfo(0.0, 1.0, 0.0, 1.0).GetTransform();
}

/// ENVI makes a system of its own for an image that has a place and no system.
bool IsNoSystem(const std::string& oWkt)
{
    return oWkt.empty() || oWkt.starts_with("LOCAL_CS[");
}

}  // namespace

void RequireKeepableTexts(const AuxiliaryData& oData, const std::string& oFile)
{
    RequireKeepable(oData.GetFileMetadata(), oFile);
    for (const auto& [nChannel, oChannel] : oData.GetChannels())
    {
        RequireKeepable(oChannel.moMetadata, oFile);
        if (!IsKeepable(oChannel.moDescription))
        {
            throw DataException(oFile + ": the description of channel " + std::to_string(nChannel) +
                                    " begins with a blank or has a control character in it",
                                kSource, __PRETTY_FUNCTION__, __LINE__);
        }
    }
}

std::string NotKept(const AuxiliaryData& oAsked, const AuxiliaryData& oBefore,
                    const AuxiliaryData& oNow)
{
    for (const auto& [nChannel, oChannel] : oAsked.GetChannels())
    {
        const std::string oNumber = std::to_string(nChannel);
        const std::string oText = oNow.GetChannelDescription(nChannel);
        if (oText != oChannel.moDescription &&
            !(oChannel.moDescription.empty() && IsNumberedName(oText, oNumber)))
        {
            return Difference("the description of channel " + oNumber,
                              Quoted(oChannel.moDescription), Quoted(oText));
        }
        const auto dfNoData = oNow.GetChannelNoData(nChannel);
        if (!SameNoData(dfNoData, oChannel.mdfNoData))
        {
            return Difference("the no-data value of channel " + oNumber, TextOf(oChannel.mdfNoData),
                              TextOf(dfNoData));
        }
        std::string oItem = NotKept(oChannel.moMetadata, oBefore.GetChanMetadata(nChannel),
                                    oNow.GetChanMetadata(nChannel), " of channel " + oNumber);
        if (!oItem.empty())
        {
            return oItem;
        }
    }
    return NotKept(oAsked.GetFileMetadata(), oBefore.GetFileMetadata(), oNow.GetFileMetadata(), "");
}

std::string NotKept(const GeocodingInfo& oAsked, const GeocodingInfo& oBefore,
                    const GeocodingInfo& oNow, unsigned int nWidth, unsigned int nHeight)
{
    const bool bNowhere = SaysNothing(oAsked.GetTransform()) && SaysNothing(oNow.GetTransform());
    const double dfPixel = std::max(std::hypot(oAsked.GetXPerCol(), oAsked.GetYPerCol()),
                                    std::hypot(oAsked.GetXPerRow(), oAsked.GetYPerRow()));
    for (int nCorner = 0; nCorner < 4 && !bNowhere; ++nCorner)
    {
        const double dfCol = (nCorner & 1) != 0 ? nWidth : 0.0;
        const double dfRow = (nCorner & 2) != 0 ? nHeight : 0.0;
        double dfX = 0.0, dfY = 0.0, dfXNow = 0.0, dfYNow = 0.0;
        oAsked.RasterToMap(dfCol, dfRow, dfX, dfY);
        oNow.RasterToMap(dfCol, dfRow, dfXNow, dfYNow);
        if (!(std::hypot(dfXNow - dfX, dfYNow - dfY) <= kSameCorner * dfPixel))
        {
            return Difference("the place of the image, whose corner at column " + TextOf(dfCol) +
                                  ", row " + TextOf(dfRow) + " lies at (X, Y)",
                              TextOf(dfX) + ", " + TextOf(dfY),
                              TextOf(dfXNow) + ", " + TextOf(dfYNow));
        }
    }
    // The same system may come back in other words, so that texts are not compared.
    const bool bLost =
        IsNoSystem(oAsked.GetProjection())
            ? !IsNoSystem(oNow.GetProjection())
            : oNow.GetProjection().empty() || (oAsked.GetProjection() != oBefore.GetProjection() &&
                                               oNow.GetProjection() == oBefore.GetProjection());
    return bLost ? "the coordinate system: another comes back" : std::string();
}

}  // namespace kor::datasources
