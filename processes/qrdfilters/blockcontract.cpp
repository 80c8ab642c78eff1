#include "processes/qrdfilters/blockcontract.h"

#include <string>

#include "platform/exception/exception.h"
#include "processes/qrdfilters/hardened.h"

namespace kor::filters
{

namespace
{

void Require(bool bHolds, const std::string& oMessage, const char* pszSource,
             const std::source_location& oWhere)
{
    if (!bHolds)
    {
        throw Exception(oMessage, pszSource, oWhere.function_name(), oWhere.line());
    }
}

std::string Size(const tessel::RasterInfo& oInfo)
{
    return std::to_string(oInfo.mnWidth) + " x " + std::to_string(oInfo.mnHeight) + " pixels";
}

std::string Geometry(const tessel::RasterInfo& oInfo, const tessel::RasterContext& oContext)
{
    return Size(oInfo) + " with margins " + std::to_string(oContext.mnMarginX) + " and " +
           std::to_string(oContext.mnMarginY);
}

bool SameSize(const tessel::RasterInfo& a, const tessel::RasterInfo& b)
{
    return a.mnWidth == b.mnWidth && a.mnHeight == b.mnHeight;
}

bool SameMargins(const tessel::RasterContext& a, const tessel::RasterContext& b)
{
    return a.mnMarginX == b.mnMarginX && a.mnMarginY == b.mnMarginY;
}

}  // namespace

void RequireSameSize(const tessel::Raster& oRasterIn, const tessel::Raster& oRasterOut,
                     const char* pszSource, const std::source_location& oWhere)
{
    if constexpr (kHardened)
    {
        Require(SameSize(oRasterIn, oRasterOut),
                "poRasterOut has " + Size(oRasterOut) + ", poRasterIn " + Size(oRasterIn),
                pszSource, oWhere);
    }
}

void RequireMatchingSizes(const tessel::Raster& oRasterIn, const tessel::Mask* poMaskIn,
                          const tessel::Raster& oRasterOut, const tessel::Mask* poMaskOut,
                          const char* pszSource, const std::source_location& oWhere)
{
    RequireSameSize(oRasterIn, oRasterOut, pszSource, oWhere);
    if constexpr (kHardened)
    {
        Require(poMaskIn == nullptr ||
                    (SameSize(oRasterIn, *poMaskIn) && SameMargins(oRasterIn, *poMaskIn)),
                "poMaskIn has " + (poMaskIn != nullptr ? Geometry(*poMaskIn, *poMaskIn) : "") +
                    ", poRasterIn " + Geometry(oRasterIn, oRasterIn),
                pszSource, oWhere);
        Require(poMaskOut == nullptr || SameSize(oRasterIn, *poMaskOut),
                "poMaskOut has " + (poMaskOut != nullptr ? Size(*poMaskOut) : "") +
                    ", poRasterIn " + Size(oRasterIn),
                pszSource, oWhere);
    }
}

void RequireMatchingBlocks(const tessel::Raster& oRasterIn, const tessel::Mask* poMaskIn,
                           const tessel::Raster& oRasterOut, const tessel::Mask* poMaskOut,
                           const char* pszSource, const std::source_location& oWhere)
{
    if constexpr (kHardened)
    {
        RequireMatchingSizes(oRasterIn, poMaskIn, oRasterOut, poMaskOut, pszSource, oWhere);
        Require(oRasterIn.mnChannels == oRasterOut.mnChannels,
                "poRasterOut has " + std::to_string(oRasterOut.mnChannels) +
                    " channels, poRasterIn " + std::to_string(oRasterIn.mnChannels),
                pszSource, oWhere);
    }
}

void RequireType(const tessel::Raster& oRaster, const tessel::DataType& oType, const char* pszName,
                 const char* pszSource, const std::source_location& oWhere)
{
    if constexpr (kHardened)
    {
        Require(oRaster.moDataType == oType,
                std::string(pszName) + " has samples of " +
                    std::to_string(oRaster.moDataType.mnBits) +
                    " bits of another type than the filter reads",
                pszSource, oWhere);
    }
}

void RequireWindowInside(const Window& oWindow, const tessel::Raster& oRasterIn,
                         const tessel::Mask* poMaskIn, const char* pszSource,
                         const std::source_location& oWhere)
{
    if constexpr (kHardened)
    {
        const std::string oNeed = "The window of " + std::to_string(oWindow.GetWidth()) + " x " +
                                  std::to_string(oWindow.GetHeight()) +
                                  " pixels needs margins of " + std::to_string(oWindow.mnHalfX) +
                                  " and " + std::to_string(oWindow.mnHalfY);
        Require(FitsMargins(oWindow, oRasterIn),
                oNeed + ", poRasterIn has " + Geometry(oRasterIn, oRasterIn), pszSource, oWhere);
        Require(poMaskIn == nullptr ||
                    (SameSize(oRasterIn, *poMaskIn) && FitsMargins(oWindow, *poMaskIn)),
                oNeed + " around " + Size(oRasterIn) + ", poMaskIn has " +
                    (poMaskIn != nullptr ? Geometry(*poMaskIn, *poMaskIn) : ""),
                pszSource, oWhere);
    }
}

void RequireDoubleBlocks(const tessel::Raster& oRasterIn, const tessel::Mask* poMaskIn,
                         const tessel::Raster& oRasterOut, const tessel::Mask* poMaskOut,
                         const char* pszSource, const std::source_location& oWhere)
{
    RequireType(oRasterIn, tessel::eDT_64R, "poRasterIn", pszSource, oWhere);
    RequireType(oRasterOut, tessel::eDT_64R, "poRasterOut", pszSource, oWhere);
    RequireMatchingBlocks(oRasterIn, poMaskIn, oRasterOut, poMaskOut, pszSource, oWhere);
}

}  // namespace kor::filters
