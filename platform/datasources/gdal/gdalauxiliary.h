#pragma once

#include <gdal.h>

#include <string>

#include "platform/datasources/auxiliarydata.h"
#include "platform/geocoding/geocodinginfo.h"

namespace kor::datasources
{

/// Descriptions, no-data values and metadata of all bands, and the metadata of the file.
AuxiliaryData ReadAuxiliaryData(GDALDatasetH hDataset);
/// Sets what differs from what is there. The channels exist. False when GDAL refuses something.
/// Throws kor::DataException for what the file cannot hold.
bool WriteAuxiliaryData(GDALDatasetH hDataset, const AuxiliaryData& oData,
                        const std::string& oFile);

ogc::cs::GeocodingInfo ReadGeocoding(GDALDatasetH hDataset);
/// False when GDAL refuses it. A place that says nothing is not written into a file without one.
bool WriteGeocoding(GDALDatasetH hDataset, const ogc::cs::GeocodingInfo& oInfo);

}  // namespace kor::datasources
