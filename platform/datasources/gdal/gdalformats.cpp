#include "platform/datasources/gdal/gdalformats.h"

#include <gdal_frmts.h>

#include <algorithm>
#include <mutex>

#include "platform/datasources/gdal/gdalerrors.h"
#include "platform/exception/exception.h"

// A GDAL can be built without these; a weak name is null then.
#pragma weak GDALRegister_JP2OpenJPEG
#pragma weak GDALRegister_PNG
#pragma weak GDALRegister_JPEG

namespace kor::datasources
{

namespace
{

constexpr const char* kSource = "platform/datasources/gdal/gdalformats";

/// The formats that may be opened, and the lock on them.
struct Allowed
{
    std::mutex moMutex;
    std::vector<std::string> mvoNames{"GTiff",   "COG",     "ENVI",        "EHdr", "HFA",
                                      "AAIGrid", "SRTMHGT", "JP2OpenJPEG", "PNG",  "JPEG"};
};

Allowed& TheAllowed()
{
    static Allowed oAllowed;
    return oAllowed;
}

}  // namespace

void RegisterTrustedFormats()
{
    const GdalErrors oErrors;
    GDALRegister_GTiff();
    GDALRegister_COG();
    GDALRegister_ENVI();
    GDALRegister_EHdr();
    GDALRegister_HFA();
    GDALRegister_AAIGrid();
    GDALRegister_SRTMHGT();
    GDALRegister_MEM();
    for (void (*const pRegister)() :
         {&GDALRegister_JP2OpenJPEG, &GDALRegister_PNG, &GDALRegister_JPEG})
    {
        if (pRegister != nullptr)
        {
            pRegister();
        }
    }
}

std::vector<std::string> AllowedFormats()
{
    Allowed& oAllowed = TheAllowed();
    const std::lock_guard oLock(oAllowed.moMutex);
    return oAllowed.mvoNames;
}

bool AllowGdalFormat(const std::string& oFormat)
{
    if (EQUAL(oFormat.c_str(), "VRT"))
    {
        throw DataException("VRT files refer to other files and are never opened", kSource,
                            __PRETTY_FUNCTION__, __LINE__);
    }
    const GdalErrors oErrors;
    GDALDriverH hDriver = GDALGetDriverByName(oFormat.c_str());
    if (hDriver == nullptr)
    {
        GDALAllRegister();
        hDriver = GDALGetDriverByName(oFormat.c_str());
    }
    if (hDriver == nullptr || GDALGetMetadataItem(hDriver, GDAL_DCAP_RASTER, nullptr) == nullptr)
    {
        return false;
    }
    const std::string oName = GDALGetDriverShortName(hDriver);
    Allowed& oAllowed = TheAllowed();
    const std::lock_guard oLock(oAllowed.moMutex);
    if (std::find(oAllowed.mvoNames.begin(), oAllowed.mvoNames.end(), oName) ==
        oAllowed.mvoNames.end())
    {
        oAllowed.mvoNames.push_back(oName);
    }
    return true;
}

bool CanMakeFiles(GDALDriverH hDriver)
{
    return hDriver != nullptr && GDALGetMetadataItem(hDriver, GDAL_DCAP_CREATE, nullptr) != nullptr;
}

std::string GdalName(const std::string& oFile)
{
    if (oFile.starts_with("/vsi"))
    {
        throw FileException(oFile + ": this is the name of a virtual file", oFile, kSource,
                            __PRETTY_FUNCTION__, __LINE__);
    }
    // With a directory in front no prefix of a driver ("GTIFF_DIR:", "JPEG_SUBFILE:") is left.
    return oFile.starts_with('/') ? oFile : "./" + oFile;
}

CPLStringList StringListOf(const std::vector<std::string>& voTexts)
{
    CPLStringList oList;
    for (const std::string& oText : voTexts)
    {
        oList.AddString(oText.c_str());
    }
    return oList;
}

}  // namespace kor::datasources
