#include "processes/qrdfilters/typedfilter.h"

#include <string>

#include "platform/exception/exception.h"
#include "platform/tessel/complexinterpretation.h"
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

void RequireRasters(const tessel::Raster* poRasterIn, const tessel::Raster* poRasterOut,
                    const char* pszSource, const std::source_location& oWhere)
{
    Require(poRasterIn != nullptr, "poRasterIn is invalid pointer", pszSource, oWhere);
    Require(poRasterOut != nullptr, "poRasterOut is invalid pointer", pszSource, oWhere);
}

void RequireRealOutput(const tessel::Raster& oRasterOut, const char* pszSource,
                       const std::source_location& oWhere)
{
    Require(!oRasterOut.moDataType.mbComplex, "Output cannot be complex", pszSource, oWhere);
}

void RequireMatchingBlocks(const tessel::Raster& oRasterIn, const tessel::Mask* poMaskIn,
                           const tessel::Raster& oRasterOut, const tessel::Mask* poMaskOut,
                           const char* pszSource, const std::source_location& oWhere)
{
    if constexpr (kHardened)
    {
        Require(SameSize(oRasterIn, oRasterOut),
                "poRasterOut has " + Size(oRasterOut) + ", poRasterIn " + Size(oRasterIn),
                pszSource, oWhere);
        Require(oRasterIn.mnChannels == oRasterOut.mnChannels,
                "poRasterOut has " + std::to_string(oRasterOut.mnChannels) +
                    " channels, poRasterIn " + std::to_string(oRasterIn.mnChannels),
                pszSource, oWhere);
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

RealInput::RealInput(tessel::Raster* poRaster)
    : mpoInterpreted(
          poRaster->moDataType.mbComplex
              ? tessel::ComplexInterpretation().InterpretRaster(poRaster, tessel::eKIT_Magnitude)
              : nullptr),
      mpoRaster(mpoInterpreted != nullptr ? mpoInterpreted.get() : poRaster)
{
}

}  // namespace kor::filters
