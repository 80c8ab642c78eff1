#pragma once

#include <string>

#include "platform/datasources/auxiliarydata.h"
#include "platform/geocoding/geocodinginfo.h"

namespace kor::datasources
{

/// Throws kor::DataException for texts that no format keeps as they are, in any place.
void RequireKeepableTexts(const AuxiliaryData& oData, const std::string& oFile);

/// Some formats take what they cannot hold without an error. These tell what of oAsked did not come
/// back (oNow) from a file that held oBefore, such as "the no-data value of channel 1: none comes
/// back for 7"; empty when all did. What a format adds by itself does not count.
std::string NotKept(const AuxiliaryData& oAsked, const AuxiliaryData& oBefore,
                    const AuxiliaryData& oNow);
/// The place counts as kept when no corner of the image, nWidth x nHeight pixels, moves by more
/// than a millionth of a pixel: some formats hold numbers of 15 digits, or the centre of a pixel.
std::string NotKept(const ogc::cs::GeocodingInfo& oAsked, const ogc::cs::GeocodingInfo& oBefore,
                    const ogc::cs::GeocodingInfo& oNow, unsigned int nWidth, unsigned int nHeight);

}  // namespace kor::datasources
