#pragma once

#include <source_location>

#include "basic/tessel/mask/mask.h"
#include "basic/tessel/raster/raster.h"
#include "processes/qrdfilters/window.h"

/// What a caller promises about the blocks that he hands to a filter. Hardened builds check it, and
/// throw kor::Exception that says what was wrong; others trust him. The exception carries the
/// source path of the filter and the function and line of the call.
namespace kor::filters
{

/// The output has the width and height of the input, the input mask the geometry of the input
/// raster, and the output mask its width and height. The masks may be null.
void RequireMatchingSizes(const tessel::Raster& oRasterIn, const tessel::Mask* poMaskIn,
                          const tessel::Raster& oRasterOut, const tessel::Mask* poMaskOut,
                          const char* pszSource,
                          const std::source_location& oWhere = std::source_location::current());

/// The same, and the output has the channels of the input.
void RequireMatchingBlocks(const tessel::Raster& oRasterIn, const tessel::Mask* poMaskIn,
                           const tessel::Raster& oRasterOut, const tessel::Mask* poMaskOut,
                           const char* pszSource,
                           const std::source_location& oWhere = std::source_location::current());

/// The output has the width and height of the input; its channels are the filter's own matter.
void RequireSameSize(const tessel::Raster& oRasterIn, const tessel::Raster& oRasterOut,
                     const char* pszSource,
                     const std::source_location& oWhere = std::source_location::current());

/// The samples of a block are of type oType. pszName is the parameter as the caller knows it.
void RequireType(const tessel::Raster& oRaster, const tessel::DataType& oType, const char* pszName,
                 const char* pszSource,
                 const std::source_location& oWhere = std::source_location::current());

/// The window around each pixel lies inside the block and its margins, and inside the input mask,
/// which may be null and may have margins of its own.
void RequireWindowInside(const Window& oWindow, const tessel::Raster& oRasterIn,
                         const tessel::Mask* poMaskIn, const char* pszSource,
                         const std::source_location& oWhere = std::source_location::current());

/// What a filter of doubles is promised: two blocks of eDT_64R that match as above.
void RequireDoubleBlocks(const tessel::Raster& oRasterIn, const tessel::Mask* poMaskIn,
                         const tessel::Raster& oRasterOut, const tessel::Mask* poMaskOut,
                         const char* pszSource,
                         const std::source_location& oWhere = std::source_location::current());

}  // namespace kor::filters
