#pragma once

#include <string>
#include <string_view>
#include <utility>

#include "basic/tessel/raster/datatype.h"

namespace kor::examples
{

/// The real sample types by the names that users give them: bits, and U, S or R.
inline constexpr std::pair<std::string_view, tessel::DataType> kRealTypes[] = {
    {"8U", tessel::eDT_8U},   {"8S", tessel::eDT_8S},   {"16U", tessel::eDT_16U},
    {"16S", tessel::eDT_16S}, {"32U", tessel::eDT_32U}, {"32S", tessel::eDT_32S},
    {"64U", tessel::eDT_64U}, {"64S", tessel::eDT_64S}, {"32R", tessel::eDT_32R},
    {"64R", tessel::eDT_64R},
};

/// "8U", "32R", "C16S".
inline std::string TypeName(const tessel::DataType& oType)
{
    return std::string(oType.mbComplex ? "C" : "") + std::to_string(oType.mnBits) +
           (oType.mbFloat    ? "R"
            : oType.mbSigned ? "S"
                             : "U");
}

}  // namespace kor::examples
