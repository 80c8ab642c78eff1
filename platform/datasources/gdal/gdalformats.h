#pragma once

#include <cpl_string.h>
#include <gdal.h>

#include <string>
#include <vector>

namespace kor::datasources
{

/// Registers the drivers that are used without being asked for, one by one: a GDAL may have two
/// hundred, and each is a parser that files can reach.
void RegisterTrustedFormats();

/// Names of the formats whose files may be opened.
std::vector<std::string> AllowedFormats();
/// Adds one; false when GDAL has no such raster format. Throws kor::DataException for VRT.
bool AllowGdalFormat(const std::string& oFormat);

/// True when the driver, which may be null, makes files block by block.
bool CanMakeFiles(GDALDriverH hDriver);

/// The name by which GDAL takes oFile for a file and nothing else. Throws kor::FileException for a
/// name that it would take for a virtual file.
std::string GdalName(const std::string& oFile);

/// A list of texts in GDAL's form.
CPLStringList StringListOf(const std::vector<std::string>& voTexts);

}  // namespace kor::datasources
