#pragma once

#include <gdal.h>

#include <optional>
#include <string>

#include "platform/datasources/auxiliarydata.h"
#include "platform/geocoding/geocodinginfo.h"

namespace kor::datasources
{

/// Not a number is the same as not a number.
bool SameNoData(const std::optional<double>& dfOne, const std::optional<double>& dfOther);

/// Descriptions, no-data values and metadata of all bands, and the metadata of the file.
AuxiliaryData ReadAuxiliaryData(GDALDatasetH hDataset);
/// Sets what differs from what is there. The channels exist, and the texts can be kept. False when
/// GDAL refuses something. Throws kor::DataException for two no-data values in a GeoTIFF.
bool WriteAuxiliaryData(GDALDatasetH hDataset, const AuxiliaryData& oData,
                        const std::string& oFile);

ogc::cs::GeocodingInfo ReadGeocoding(GDALDatasetH hDataset);
/// False when GDAL refuses it. A place that says nothing is not written into a file without one.
bool WriteGeocoding(GDALDatasetH hDataset, const ogc::cs::GeocodingInfo& oInfo);

}  // namespace kor::datasources
