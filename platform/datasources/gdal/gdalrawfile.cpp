#include "platform/datasources/gdal/gdalrawfile.h"

#include <gdal_priv.h>

#include <algorithm>
#include <filesystem>
#include <system_error>

#include "platform/exception/exception.h"

namespace kor::datasources
{

namespace
{

constexpr const char* kSource = "platform/datasources/gdal/gdalrawfile";

/// Bytes from the first of nCount things to the last.
std::uint64_t Span(GIntBig nStep, int nCount)
{
    return static_cast<std::uint64_t>(std::max<GIntBig>(nStep, 0)) *
           static_cast<std::uint64_t>(std::max(nCount - 1, 0));
}

/// A GeoTIFF may have its samples one behind the other as well, and takes care of them itself.
bool IsTiff(GDALDatasetH hDataset)
{
    return EQUAL(GDALGetDriverShortName(GDALGetDatasetDriver(hDataset)), "GTiff");
}

}  // namespace

std::optional<GdalRawFile> RawFileOf(GDALDatasetH hDataset, const std::string& oFile)
{
    GDALDataset::RawBinaryLayout oRaw;
    const int nBands = GDALGetRasterCount(hDataset);
    if (nBands == 0 || !GDALDataset::FromHandle(hDataset)->GetRawBinaryLayout(oRaw))
    {
        return std::nullopt;
    }
    const int nSampleBytes = GDALGetDataTypeSizeBytes(oRaw.eDataType);
    GdalRawFile oRawFile;
    oRawFile.moName = oRaw.osRawFilename.empty() ? oFile : oRaw.osRawFilename;
    oRawFile.mnBytes = oRaw.nImageOffset + Span(oRaw.nLineOffset, GDALGetRasterYSize(hDataset)) +
                       Span(oRaw.nPixelOffset, GDALGetRasterXSize(hDataset)) +
                       Span(oRaw.nBandOffset, nBands) + static_cast<std::uint64_t>(nSampleBytes);
    oRawFile.mbPixelwise = nBands > 1 && oRaw.nPixelOffset > nSampleBytes;
    return oRawFile;
}

std::string UnwritableRawFile(GDALDatasetH hDataset, const std::string& oFile)
{
    // GDAL 3.6 keeps a line of all channels for each of them and writes it whole, with what the
    // others had when it was read: pixels get lost as soon as its cache is full.
    const auto oRawFile = RawFileOf(hDataset, oFile);
    return oRawFile && oRawFile->mbPixelwise && !IsTiff(hDataset)
               ? std::string("files of the format ") +
                     GDALGetDriverShortName(GDALGetDatasetDriver(hDataset)) +
                     " in which the channels of a pixel stand side by side (INTERLEAVE=BIP) cannot "
                     "be written safely; those of BSQ and BIL can"
               : std::string();
}

void RequireWholeRawFile(GDALDatasetH hDataset, const std::string& oFile)
{
    const auto oRawFile = RawFileOf(hDataset, oFile);
    std::error_code oError;
    const std::uint64_t nBytes =
        oRawFile ? std::filesystem::file_size(oRawFile->moName, oError) : 0;
    if (oRawFile && !oError && nBytes < oRawFile->mnBytes)
    {
        throw FileException(oFile + ": the file is cut off: it has " + std::to_string(nBytes) +
                                " bytes and its header tells of " +
                                std::to_string(oRawFile->mnBytes),
                            oFile, kSource, __PRETTY_FUNCTION__, __LINE__);
    }
}

void CompleteRawFile(GDALDatasetH hDataset, const std::string& oFile)
{
    const auto oRawFile = RawFileOf(hDataset, oFile);
    std::error_code oError;
    if (oRawFile && !IsTiff(hDataset) &&
        std::filesystem::file_size(oRawFile->moName, oError) < oRawFile->mnBytes)
    {
        std::filesystem::resize_file(oRawFile->moName, oRawFile->mnBytes, oError);
    }
    if (oError)
    {
        throw FileException(oFile + ": cannot make the file: " + oError.message(), oFile, kSource,
                            __PRETTY_FUNCTION__, __LINE__);
    }
}

}  // namespace kor::datasources
