#include "platform/datasources/gdal/gdalfile.h"

#include <cpl_string.h>

#include <cstring>
#include <filesystem>
#include <limits>
#include <system_error>

#include "platform/datasources/datatypename.h"
#include "platform/datasources/gdal/gdalformats.h"
#include "platform/datasources/gdal/gdalrawfile.h"
#include "platform/datasources/gdal/gdaltypes.h"
#include "platform/exception/exception.h"
#include "platform/fileio/file.h"

namespace kor::datasources
{

namespace
{

constexpr const char* kSource = "platform/datasources/gdal/gdalfile";
constexpr unsigned int kMostChannels = 65535;

[[noreturn]] void ThrowData(const std::string& oFile, const std::string& oText,
                            const std::string& oFunction, unsigned int nLine)
{
    throw DataException(oFile + ": " + oText, kSource, oFunction, nLine);
}

OwnedGdalDataset OpenHandle(const std::string& oFile, bool bUpdate,
                            const std::vector<std::string>& voFormats)
{
    const CPLStringList oFormats = StringListOf(voFormats);
    const auto nFlags = static_cast<unsigned int>(GDAL_OF_RASTER | GDAL_OF_VERBOSE_ERROR |
                                                  (bUpdate ? GDAL_OF_UPDATE : GDAL_OF_READONLY));
    return OwnedGdalDataset(
        GDALOpenEx(GdalName(oFile).c_str(), nFlags, oFormats.List(), nullptr, nullptr));
}

/// Files beside the one that a format is told to make: an older one would be lost or taken for part
/// of the new file.
std::vector<std::string> CompanionsOf(const std::string& oFile, const std::string& oFormat,
                                      const std::vector<std::string>& voOptions)
{
    std::vector<std::string> voEndings;
    if (oFormat == "ENVI")
    {
        voEndings = {"hdr"};
    }
    if (oFormat == "EHdr")
    {
        voEndings = {"hdr", "prj", "stx", "clr"};
    }
    if (oFormat == "HFA")
    {
        voEndings = {"ige", "rrd"};
    }
    if (oFormat == "GTiff")
    {
        for (const std::string& oOption : voOptions)
        {
            if (oOption.starts_with("TFW=") || oOption.starts_with("WORLDFILE="))
            {
                voEndings = {"tfw", "wld"};
            }
        }
    }
    std::vector<std::string> voCompanions;
    for (const std::string& oEnding : voEndings)
    {
        voCompanions.push_back(std::filesystem::path(oFile).replace_extension(oEnding).string());
        voCompanions.push_back(oFile + "." + oEnding);
    }
    // GDAL would take these for the new file's own.
    for (const char* pszEnding : {".aux.xml", ".msk", ".ovr"})
    {
        voCompanions.push_back(oFile + pszEnding);
    }
    return voCompanions;
}

/// False where the driver would make another type of it or has no way to say it. That a driver
/// lists a type or not tells little: GTiff makes 64-bit integers without listing them.
bool MayHold(GDALDriverH hDriver, const tessel::DataType& oType)
{
    if (!NeedsSignedByteOption(oType))
    {
        return GdalTypeOf(oType) != GDT_Unknown;
    }
    const char* pszOptions = GDALGetMetadataItem(hDriver, GDAL_DMD_CREATIONOPTIONLIST, nullptr);
    return pszOptions != nullptr && std::strstr(pszOptions, "'PIXELTYPE'") != nullptr;
}

/// True when the driver says that it makes files of this type.
bool ListsType(GDALDriverH hDriver, const tessel::DataType& oType)
{
    const char* pszTypes = GDALGetMetadataItem(hDriver, GDAL_DMD_CREATIONDATATYPES, nullptr);
    const CPLStringList oTypes(CSLTokenizeString2(pszTypes == nullptr ? "" : pszTypes, " ", 0));
    return oTypes.FindString(GDALGetDataTypeName(GdalTypeOf(oType))) >= 0;
}

std::string CannotHold(GDALDriverH hDriver, const tessel::DataType& oType)
{
    return std::string("the format ") + GDALGetDriverShortName(hDriver) +
           " cannot hold samples of " + DataTypeName(oType);
}

/// What can be told before the file is made.
void RequireCreatable(const std::string& oFile, GDALDriverH hDriver,
                      const std::vector<std::string>& voCompanions, const tessel::RasterInfo& oInfo)
{
    constexpr std::uint32_t kLargestSide = std::numeric_limits<int>::max();
    if (oInfo.mnWidth == 0 || oInfo.mnHeight == 0 || oInfo.mnWidth > kLargestSide ||
        oInfo.mnHeight > kLargestSide)
    {
        ThrowData(oFile,
                  "an image of " + std::to_string(oInfo.mnWidth) + " x " +
                      std::to_string(oInfo.mnHeight) + " pixels cannot be made",
                  __PRETTY_FUNCTION__, __LINE__);
    }
    if (oInfo.mnChannels == 0 || oInfo.mnChannels > kMostChannels)
    {
        ThrowData(oFile,
                  std::to_string(oInfo.mnChannels) + " channels cannot be made; 1 to " +
                      std::to_string(kMostChannels) + " can",
                  __PRETTY_FUNCTION__, __LINE__);
    }
    if (!MayHold(hDriver, oInfo.moDataType))
    {
        ThrowData(oFile, CannotHold(hDriver, oInfo.moDataType), __PRETTY_FUNCTION__, __LINE__);
    }
    for (const std::string& oCompanion : voCompanions)
    {
        if (core::fileio::File::Exists(oCompanion))
        {
            throw FileException(oFile + ": the file " + oCompanion +
                                    ", which belongs to it, exists already and is not overwritten",
                                oCompanion, kSource, __PRETTY_FUNCTION__, __LINE__);
        }
    }
}

/// Empty when all bands have the type that was asked for. An option may have changed it, and some
/// drivers make bytes of a type that they do not know, without an error.
std::string UnexpectedType(GDALDriverH hDriver, GDALDatasetH hDataset,
                           const tessel::DataType& oType)
{
    for (int nBand = 1; nBand <= GDALGetRasterCount(hDataset); ++nBand)
    {
        const auto oMade = TypeOfBand(GDALGetRasterBand(hDataset, nBand));
        if (!oMade || *oMade != oType)
        {
            return ListsType(hDriver, oType)
                       ? "the options make channels of " +
                             DataTypeName(oMade.value_or(tessel::DataType())) +
                             " out of channels of " + DataTypeName(oType)
                       : CannotHold(hDriver, oType);
        }
    }
    return std::string();
}

void RemoveFiles(const std::vector<std::string>& voCompanions)
{
    std::error_code oIgnored;
    for (const std::string& oCompanion : voCompanions)
    {
        std::filesystem::remove(oCompanion, oIgnored);
    }
}

/// The format of a file that can be made as a whole alone, empty when it is another. Some drivers
/// let such a file be opened for changing and fail, or lose what was changed, later.
std::string UnchangeableFormatOf(const std::string& oFile)
{
    GDALDriverH hDriver = GDALIdentifyDriverEx(GdalName(oFile).c_str(), GDAL_OF_RASTER,
                                               StringListOf(AllowedFormats()).List(), nullptr);
    return hDriver == nullptr || CanMakeFiles(hDriver) ? std::string()
                                                       : GDALGetDriverShortName(hDriver);
}

}  // namespace

void CloseGdalDataset::operator()(void* hDataset) const
{
    const GdalErrors oErrors;
    GDALClose(hDataset);
}

GdalFile::GdalFile(OwnedGdalDataset poDataset, std::string oFile, bool bUpdate)
    : mpoDataset(std::move(poDataset)),
      moFile(std::move(oFile)),
      moFormat(GDALGetDriverShortName(GDALGetDatasetDriver(mpoDataset.get()))),
      mbUpdate(bUpdate)
{
}

std::shared_ptr<GdalFile> GdalFile::Open(const std::string& oFile, bool bUpdate)
{
    const GdalErrors oErrors;
    const std::string oUnchangeable = bUpdate ? UnchangeableFormatOf(oFile) : std::string();
    OwnedGdalDataset poDataset;
    if (oUnchangeable.empty())
    {
        poDataset = OpenHandle(oFile, bUpdate, AllowedFormats());
    }
    if (!poDataset)
    {
        throw FileException(
            oFile + ": cannot open the file" + (bUpdate ? " for changing" : "") + ": " +
                (oUnchangeable.empty() ? oErrors.GetText()
                                       : "files of the format " + oUnchangeable +
                                             " can be read but not changed block by block"),
            oFile, kSource, __PRETTY_FUNCTION__, __LINE__);
    }
    return std::shared_ptr<GdalFile>(new GdalFile(std::move(poDataset), oFile, bUpdate));
}

std::shared_ptr<GdalFile> GdalFile::Create(const std::string& oFile, const std::string& oFormat,
                                           const std::vector<std::string>& voOptions,
                                           const tessel::RasterInfo& oInfo)
{
    const GdalErrors oErrors;
    GDALDriverH hDriver = GDALGetDriverByName(oFormat.c_str());
    const auto voCompanions = CompanionsOf(oFile, oFormat, voOptions);
    RequireCreatable(oFile, hDriver, voCompanions, oInfo);
    CPLStringList oOptions = StringListOf(voOptions);
    if (NeedsSignedByteOption(oInfo.moDataType))
    {
        oOptions.SetNameValue("PIXELTYPE", "SIGNEDBYTE");
    }
    if (oFormat == "GTiff" && oOptions.FetchNameValue("ALPHA") == nullptr)
    {
        // GDAL would take the last of four 8-bit channels for opacities and hide pixels by it.
        oOptions.SetNameValue("ALPHA", "NO");
    }
    OwnedGdalDataset poDataset(
        GDALCreate(hDriver, GdalName(oFile).c_str(), static_cast<int>(oInfo.mnWidth),
                   static_cast<int>(oInfo.mnHeight), static_cast<int>(oInfo.mnChannels),
                   GdalTypeOf(oInfo.moDataType), oOptions.List()));
    if (!poDataset)
    {
        RemoveFiles(voCompanions);
        if (!ListsType(hDriver, oInfo.moDataType))
        {
            ThrowData(oFile, CannotHold(hDriver, oInfo.moDataType) + ": " + oErrors.GetText(),
                      __PRETTY_FUNCTION__, __LINE__);
        }
        throw FileException(oFile + ": cannot make the file: " + oErrors.GetText(), oFile, kSource,
                            __PRETTY_FUNCTION__, __LINE__);
    }
    std::string oUnexpected = UnexpectedType(hDriver, poDataset.get(), oInfo.moDataType);
    if (oUnexpected.empty())
    {
        oUnexpected = UnwritableRawFile(poDataset.get(), oFile);
    }
    if (!oUnexpected.empty())
    {
        poDataset.reset();
        RemoveFiles(voCompanions);
        ThrowData(oFile, oUnexpected, __PRETTY_FUNCTION__, __LINE__);
    }
    CompleteRawFile(poDataset.get(), oFile);
    return std::shared_ptr<GdalFile>(new GdalFile(std::move(poDataset), oFile, true));
}

void GdalFile::Throw(const std::string& oTask, const GdalErrors& oErrors) const
{
    throw IOException(moFile + ": " + oTask + ": " + oErrors.GetText(), kSource,
                      __PRETTY_FUNCTION__, __LINE__);
}

void GdalFile::Do(const std::string& oTask, const std::function<bool(GDALDatasetH)>& oAction)
{
    const std::lock_guard oLock(moMutex);
    const GdalErrors oErrors;
    if (!mpoDataset)
    {
        mpoDataset = OpenHandle(moFile, mbUpdate, {moFormat});
        if (!mpoDataset)
        {
            Throw("cannot open the file anew", oErrors);
        }
    }
    if (!oAction(mpoDataset.get()) || oErrors.Failed())
    {
        Throw(oTask, oErrors);
    }
}

void GdalFile::Flush()
{
    const std::lock_guard oLock(moMutex);
    if (!mpoDataset || !mbUpdate)
    {
        return;
    }
    const GdalErrors oErrors;
    GDALFlushCache(mpoDataset.get());
    // Not reset(): its deleter would keep the errors of closing for itself.
    GDALClose(mpoDataset.release());
    if (oErrors.Failed())
    {
        Throw("cannot write the file", oErrors);
    }
}

}  // namespace kor::datasources
