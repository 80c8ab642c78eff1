#include "platform/datasources/gdal/gdaldriver.h"

#include <gdal.h>

#include <mutex>
#include <sstream>

#include "platform/datasources/datasetmanager.h"
#include "platform/datasources/gdal/gdaldataset.h"
#include "platform/datasources/gdal/gdalformats.h"
#include "platform/exception/exception.h"

namespace kor::datasources
{

namespace
{

constexpr const char* kSource = "platform/datasources/gdal/gdaldriver";

class GdalDriver : public IDatasetDriver
{
public:
    std::string GetName() const override
    {
        std::string oFormats;
        for (const std::string& oFormat : AllowedFormats())
        {
            oFormats += (oFormats.empty() ? "" : " ") + oFormat;
        }
        return "GDAL (" + oFormats + ")";
    }

    bool Recognizes(const std::string& oFile) const override
    {
        const GdalErrors oErrors;
        const CPLStringList oFormats = StringListOf(AllowedFormats());
        return GDALIdentifyDriverEx(GdalName(oFile).c_str(), GDAL_OF_RASTER, oFormats.List(),
                                    nullptr) != nullptr;
    }

    std::unique_ptr<IDataset> Open(const std::string& oFile, bool bUpdate) const override
    {
        return std::make_unique<GdalDataset>(oFile, bUpdate);
    }

    bool HasFormat(const std::string& oFormat) const override
    {
        return StringListOf(AllowedFormats()).FindString(oFormat.c_str()) >= 0;
    }

    std::unique_ptr<IDataset> Create(const std::string& oFile, const std::string& oFormat,
                                     const std::string& oOptions) const override;

    bool AllowFormat(const std::string& oFormat) override { return AllowGdalFormat(oFormat); }
};

/// Each behind a blank.
std::string FormatsThatCanBeMade()
{
    std::string oFormats;
    for (const std::string& oFormat : AllowedFormats())
    {
        oFormats += CanMakeFiles(GDALGetDriverByName(oFormat.c_str())) ? " " + oFormat : "";
    }
    return oFormats;
}

std::vector<std::string> SplitOptions(const std::string& oFile, const std::string& oOptions)
{
    std::vector<std::string> voOptions;
    std::istringstream oWords(oOptions);
    for (std::string oWord; oWords >> oWord;)
    {
        if (oWord.find('=') == std::string::npos)
        {
            throw DataException(
                oFile + ": the option \"" + oWord + "\" is not of the form NAME=VALUE", kSource,
                __PRETTY_FUNCTION__, __LINE__);
        }
        voOptions.push_back(oWord);
    }
    return voOptions;
}

std::unique_ptr<IDataset> GdalDriver::Create(const std::string& oFile, const std::string& oFormat,
                                             const std::string& oOptions) const
{
    const GdalErrors oErrors;
    GDALDriverH hDriver = GDALGetDriverByName(oFormat.c_str());
    if (!CanMakeFiles(hDriver))
    {
        throw DataException(oFile + ": files of the format " + oFormat +
                                " can be read but not made block by block; formats that can:" +
                                FormatsThatCanBeMade(),
                            kSource, __PRETTY_FUNCTION__, __LINE__);
    }
    const auto voOptions = SplitOptions(oFile, oOptions);
    if (!GDALValidateCreationOptions(hDriver, StringListOf(voOptions).List()))
    {
        throw DataException(oFile + ": " + oErrors.GetText(), kSource, __PRETTY_FUNCTION__,
                            __LINE__);
    }
    return std::make_unique<GdalDataset>(oFile, GDALGetDriverShortName(hDriver), voOptions);
}

}  // namespace

void RegisterGdalDriver()
{
    static std::once_flag oOnce;
    std::call_once(oOnce,
                   []
                   {
                       RegisterTrustedFormats();
                       DatasetManager::RegisterDriver(std::make_unique<GdalDriver>());
                   });
}

}  // namespace kor::datasources
