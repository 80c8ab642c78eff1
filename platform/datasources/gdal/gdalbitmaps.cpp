#include "platform/datasources/gdal/gdalbitmaps.h"

#include <optional>

#include "platform/datasources/gdal/gdalerrors.h"
#include "platform/datasources/gdal/gdalformats.h"
#include "platform/datasources/gdal/gdaltypes.h"
#include "platform/exception/exception.h"
#include "platform/fileio/file.h"

namespace kor::datasources
{

namespace
{

/// The bitmap that a channel is as well, if it is one.
std::optional<GdalBitmap> BitmapOfBand(GDALRasterBandH hBand)
{
    const int nBand = GDALGetBandNumber(hBand);
    const auto oType = TypeOfBand(hBand);
    const char* pszBits = GDALGetMetadataItem(hBand, "NBITS", "IMAGE_STRUCTURE");
    if (oType == tessel::eDT_8U && pszBits != nullptr && EQUAL(pszBits, "1"))
    {
        return GdalBitmap{nBand, 1};
    }
    if (GDALGetRasterColorInterpretation(hBand) == GCI_AlphaBand)
    {
        if (oType == tessel::eDT_8U)
        {
            return GdalBitmap{nBand, 0xFF};
        }
        if (oType == tessel::eDT_16U)
        {
            return GdalBitmap{nBand, 0xFFFF};
        }
    }
    return std::nullopt;
}

/// GDAL opens a mask that stands in a file of its own as any format it knows. Ours are fewer.
bool HasForeignMaskFile(const std::string& oFile)
{
    const std::string oMask = GdalName(oFile) + ".msk";
    return core::fileio::File::Exists(oMask) &&
           GDALIdentifyDriverEx(oMask.c_str(), GDAL_OF_RASTER,
                                StringListOf(AllowedFormats()).List(), nullptr) == nullptr;
}

/// True when the file has one mask for all channels that is neither one of them nor made of a
/// no-data value.
bool HasMask(GDALDatasetH hDataset, const std::string& oFile)
{
    if (GDALGetRasterCount(hDataset) == 0 || HasForeignMaskFile(oFile))
    {
        return false;
    }
    GDALRasterBandH hBand = GDALGetRasterBand(hDataset, 1);
    if (GDALGetMaskFlags(hBand) != GMF_PER_DATASET)
    {
        return false;
    }
    GDALRasterBandH hMask = GDALGetMaskBand(hBand);
    return GDALGetRasterBandXSize(hMask) == GDALGetRasterXSize(hDataset) &&
           GDALGetRasterBandYSize(hMask) == GDALGetRasterYSize(hDataset);
}

}  // namespace

std::vector<GdalBitmap> BitmapsOf(GDALDatasetH hDataset, const std::string& oFile)
{
    std::vector<GdalBitmap> voBitmaps;
    for (int nBand = 1; nBand <= GDALGetRasterCount(hDataset); ++nBand)
    {
        if (const auto oBitmap = BitmapOfBand(GDALGetRasterBand(hDataset, nBand)))
        {
            voBitmaps.push_back(*oBitmap);
        }
    }
    if (HasMask(hDataset, oFile))
    {
        voBitmaps.emplace_back();
    }
    return voBitmaps;
}

bool AddMask(GDALDatasetH hDataset, const std::string& oFile)
{
    const std::string oFormat = GDALGetDriverShortName(GDALGetDatasetDriver(hDataset));
    const char* pszReason = nullptr;
    if (oFormat != "GTiff")
    {
        pszReason = " has no place for a bitmap in a file";
    }
    else if (HasMask(hDataset, oFile) || core::fileio::File::Exists(GdalName(oFile) + ".msk"))
    {
        pszReason = " holds one mask in a file, and this file has its mask";
    }
    if (pszReason != nullptr)
    {
        throw DataException(oFile + ": the format " + oFormat + pszReason,
                            "platform/datasources/gdal/gdalbitmaps", __PRETTY_FUNCTION__, __LINE__);
    }
    // Without it GDAL would put the mask into a file of its own.
    const GdalOption oInside("GDAL_TIFF_INTERNAL_MASK", "YES");
    return GDALCreateDatasetMaskBand(hDataset, GMF_PER_DATASET) == CE_None;
}

GdalBitmapIO::GdalBitmapIO(std::shared_ptr<GdalFile> poFile, const GdalBitmap& oBitmap)
    : mpoFile(std::move(poFile)), moBitmap(oBitmap)
{
}

GDALRasterBandH GdalBitmapIO::BandIn(GDALDatasetH hDataset) const
{
    return moBitmap.mnBand == 0 ? GDALGetMaskBand(GDALGetRasterBand(hDataset, 1))
                                : GDALGetRasterBand(hDataset, moBitmap.mnBand);
}

void GdalBitmapIO::Read(std::span<const unsigned int> /*oChannels*/, const PixelWindow& oWindow,
                        unsigned char* pSamples, const SampleStrides& oStrides)
{
    const auto nWidth = static_cast<int>(oWindow.mnWidth);
    const auto nHeight = static_cast<int>(oWindow.mnHeight);
    mpoFile->Do("cannot read a bitmap",
                [&](GDALDatasetH hDataset)
                {
                    // Larger samples become 255, so that none that is set is lost.
                    return GDALRasterIOEx(
                               BandIn(hDataset), GF_Read, static_cast<int>(oWindow.mnX),
                               static_cast<int>(oWindow.mnY), nWidth, nHeight, pSamples, nWidth,
                               nHeight, GDT_Byte, static_cast<GSpacing>(oStrides.mnPixel),
                               static_cast<GSpacing>(oStrides.mnLine), nullptr) == CE_None;
                });
    for (std::size_t y = 0; y < oWindow.mnHeight; ++y)
    {
        for (std::size_t x = 0; x < oWindow.mnWidth; ++x)
        {
            unsigned char& nSample = pSamples[y * oStrides.mnLine + x * oStrides.mnPixel];
            nSample = nSample != 0 ? 1 : 0;
        }
    }
}

void GdalBitmapIO::Write(std::span<const unsigned int> /*oChannels*/, const PixelWindow& oWindow,
                         const unsigned char* pSamples, const SampleStrides& oStrides)
{
    const std::size_t nWidth = oWindow.mnWidth;
    std::vector<std::uint16_t> vnSamples(nWidth * oWindow.mnHeight);
    for (std::size_t i = 0; i < vnSamples.size(); ++i)
    {
        const bool bSet =
            pSamples[i / nWidth * oStrides.mnLine + i % nWidth * oStrides.mnPixel] != 0;
        vnSamples[i] = bSet ? moBitmap.mnSet : 0;
    }
    mpoFile->Do("cannot write a bitmap",
                [&](GDALDatasetH hDataset)
                {
                    return GDALRasterIOEx(BandIn(hDataset), GF_Write, static_cast<int>(oWindow.mnX),
                                          static_cast<int>(oWindow.mnY),
                                          static_cast<int>(oWindow.mnWidth),
                                          static_cast<int>(oWindow.mnHeight), vnSamples.data(),
                                          static_cast<int>(oWindow.mnWidth),
                                          static_cast<int>(oWindow.mnHeight), GDT_UInt16, 0, 0,
                                          nullptr) == CE_None;
                });
}

}  // namespace kor::datasources
