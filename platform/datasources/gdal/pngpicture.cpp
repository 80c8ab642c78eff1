#include <cpl_conv.h>
#include <gdal.h>
#include <unistd.h>

#include <atomic>
#include <cerrno>
#include <cstdio>
#include <filesystem>
#include <system_error>

#include "platform/datasources/datatypename.h"
#include "platform/datasources/gdal/gdaldriver.h"
#include "platform/datasources/gdal/gdalfile.h"
#include "platform/datasources/gdal/gdalformats.h"
#include "platform/exception/exception.h"

namespace kor::datasources
{

namespace
{

constexpr const char* kSource = "platform/datasources/gdal/pngpicture";

void RequirePicture(const std::string& oFile, const tessel::Raster& oRaster)
{
    if (oRaster.moDataType != tessel::eDT_8U)
    {
        throw DataException(oFile + ": a picture is made of samples of eDT_8U and not of " +
                                DataTypeName(oRaster.moDataType),
                            kSource, __PRETTY_FUNCTION__, __LINE__);
    }
    if ((oRaster.mnChannels != 1 && oRaster.mnChannels != 3) || oRaster.mnWidth == 0 ||
        oRaster.mnHeight == 0)
    {
        throw DataException(oFile + ": a picture cannot be made of " +
                                std::to_string(oRaster.mnWidth) + " x " +
                                std::to_string(oRaster.mnHeight) + " pixels of " +
                                std::to_string(oRaster.mnChannels) +
                                " channels; it has 1 channel (grey) or 3 (red, green, blue)",
                            kSource, __PRETTY_FUNCTION__, __LINE__);
    }
}

/// The raster's inner area as a dataset in memory, with its samples copied; null on failure.
OwnedGdalDataset InMemory(const tessel::Raster& oRaster)
{
    const auto nWidth = static_cast<int>(oRaster.mnWidth);
    const auto nHeight = static_cast<int>(oRaster.mnHeight);
    const auto nChannels = static_cast<int>(oRaster.mnChannels);
    OwnedGdalDataset poMemory(
        GDALCreate(GDALGetDriverByName("MEM"), "", nWidth, nHeight, nChannels, GDT_Byte, nullptr));
    if (!poMemory || GDALDatasetRasterIOEx(
                         poMemory.get(), GF_Write, 0, 0, nWidth, nHeight, oRaster.GetPixel(0, 0),
                         nWidth, nHeight, GDT_Byte, nChannels, nullptr, nChannels,
                         GSpacing{nChannels} * oRaster.mnTotalWidth, 1, nullptr) != CE_None)
    {
        return nullptr;
    }
    return poMemory;
}

/// Takes a file away at the end, unless it was renamed by then.
class TemporaryFile
{
public:
    explicit TemporaryFile(std::string oName) : moName(std::move(oName)) {}
    TemporaryFile(const TemporaryFile&) = delete;
    TemporaryFile& operator=(const TemporaryFile&) = delete;
    ~TemporaryFile() { std::remove(moName.c_str()); }

    const std::string& GetName() const { return moName; }

private:
    std::string moName;
};

}  // namespace

void WritePng(const std::string& oFile, const tessel::Raster& oRaster)
{
    RequirePicture(oFile, oRaster);
    RegisterTrustedFormats();
    const auto oFail = [&](const std::string& oReason)
    {
        throw FileException(oFile + ": cannot write the picture: " + oReason, oFile, kSource,
                            "void WritePng(const std::string&, const tessel::Raster&)", __LINE__);
    };
    GDALDriverH hPng = GDALGetDriverByName("PNG");
    if (hPng == nullptr)
    {
        oFail("this GDAL has no driver for PNG");
    }
    static std::atomic<unsigned int> nPictures = 0;
    const TemporaryFile oWhole(GdalName(oFile) + "." + std::to_string(getpid()) + "-" +
                               std::to_string(++nPictures) + ".part");
    const GdalErrors oErrors;
    const OwnedGdalDataset poMemory = InMemory(oRaster);
    if (!poMemory)
    {
        oFail(oErrors.GetText());
    }
    GDALDatasetH hPicture = GDALCreateCopy(hPng, oWhole.GetName().c_str(), poMemory.get(), TRUE,
                                           nullptr, nullptr, nullptr);
    if (hPicture != nullptr)
    {
        GDALClose(hPicture);
    }
    if (hPicture == nullptr || oErrors.Failed())
    {
        oFail(oErrors.GetText());
    }
    if (std::rename(oWhole.GetName().c_str(), oFile.c_str()) != 0)
    {
        oFail(std::generic_category().message(errno));
    }
}

}  // namespace kor::datasources
