#include "platform/datasources/irasteraccess.h"

#include <algorithm>
#include <string>

#include "platform/exception/exception.h"

namespace kor::datasources
{

namespace
{

constexpr const char* kSource = "platform/datasources/irasteraccess";

}  // namespace

unsigned int IRasterAccess::GetTileWidth() const
{
    return mnTileWidth == 0 ? GetWidth() : std::min(mnTileWidth, GetWidth());
}

unsigned int IRasterAccess::GetTileHeight() const
{
    return mnTileHeight == 0 ? GetHeight() : std::min(mnTileHeight, GetHeight());
}

void IRasterAccess::SetTileSize(unsigned int nWidth, unsigned int nHeight)
{
    if (nWidth == 0 || nHeight == 0)
    {
        throw DataException("A tile of " + std::to_string(nWidth) + " x " +
                                std::to_string(nHeight) + " pixels holds nothing",
                            kSource, __PRETTY_FUNCTION__, __LINE__);
    }
    mnTileWidth = nWidth;
    mnTileHeight = nHeight;
}

void IRasterAccess::SetMargin(unsigned int nX, unsigned int nY, int nEdgeMode)
{
    if (nEdgeMode < eEM_Zeros || nEdgeMode > eEM_Nearest)
    {
        throw DataException("nEdgeMode is " + std::to_string(nEdgeMode) +
                                "; it can be 0 (zeros), 1 (mirrored) or 2 (nearest edge pixel)",
                            kSource, __PRETTY_FUNCTION__, __LINE__);
    }
    mnMarginX = nX;
    mnMarginY = nY;
    mnEdgeMode = nEdgeMode;
}

std::vector<tessel::RasterInfo> IRasterAccess::GetChannelsInfo() const
{
    return std::vector<tessel::RasterInfo>(
        GetChannelCount(), tessel::RasterInfo(GetWidth(), GetHeight(), 1, GetDataType()));
}

const ogc::cs::GeocodingInfo& IRasterAccess::GetGeocodingInfo() const
{
    static const ogc::cs::GeocodingInfo kNowhere;
    return kNowhere;
}

AuxiliaryData IRasterAccess::GetAuxiliaryData() const
{
    return AuxiliaryData();
}

}  // namespace kor::datasources
