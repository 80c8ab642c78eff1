#include "processes/qrdfilters/typedfilter.h"

#include <string>

#include "platform/exception/exception.h"
#include "platform/tessel/complexinterpretation.h"

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

RealInput::RealInput(tessel::Raster* poRaster)
    : mpoInterpreted(
          poRaster->moDataType.mbComplex
              ? tessel::ComplexInterpretation().InterpretRaster(poRaster, tessel::eKIT_Magnitude)
              : nullptr),
      mpoRaster(mpoInterpreted != nullptr ? mpoInterpreted.get() : poRaster)
{
}

}  // namespace kor::filters
