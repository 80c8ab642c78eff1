#pragma once

#include <gdal.h>

#include <cstdint>
#include <optional>
#include <string>

namespace kor::datasources
{

/// A file of plain samples behind a dataset.
struct GdalRawFile
{
    std::string moName;
    std::uint64_t mnBytes = 0;  ///< up to the end of the last sample
    bool mbPixelwise = false;   ///< the samples of all channels of a pixel stand side by side
};

/// None where the dataset, known by the name oFile, is of another kind.
std::optional<GdalRawFile> RawFileOf(GDALDatasetH hDataset, const std::string& oFile);

/// Why pixels of such a file cannot be written, empty when they can.
std::string UnwritableRawFile(GDALDatasetH hDataset, const std::string& oFile);

/// Throws kor::FileException when the file ends before its last sample: some drivers read zeros
/// behind the end without an error.
void RequireWholeRawFile(GDALDatasetH hDataset, const std::string& oFile);

/// Makes a new file as long as its samples are, with zeros: a driver may leave it shorter, and then
/// it could not be read as long as the last pixel is not written. Throws kor::FileException.
void CompleteRawFile(GDALDatasetH hDataset, const std::string& oFile);

}  // namespace kor::datasources
