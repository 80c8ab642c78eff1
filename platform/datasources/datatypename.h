#pragma once

#include <string>

#include "basic/tessel/raster/datatype.h"

namespace kor::datasources
{

/// The type's constant, "eDT_16S", or its fields where it has none: for error messages.
std::string DataTypeName(const tessel::DataType& oType);

}  // namespace kor::datasources
