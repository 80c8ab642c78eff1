#pragma once

#include <gdal.h>

#include <optional>

#include "basic/tessel/raster/datatype.h"

namespace kor::datasources
{

/// The type of a band's samples; none where we have no such type.
std::optional<tessel::DataType> TypeOfBand(GDALRasterBandH hBand);

/// GDAL's type for samples of oType; GDT_Unknown where it has none. Before GDAL 3.7 it is GDT_Byte
/// for signed bytes, see NeedsSignedByteOption.
GDALDataType GdalTypeOf(const tessel::DataType& oType);

/// True when a file of oType has to be made with the option PIXELTYPE=SIGNEDBYTE.
bool NeedsSignedByteOption(const tessel::DataType& oType);

}  // namespace kor::datasources
