#include "examples/filterfile/outputfile.h"

#include <unistd.h>

#include <string_view>
#include <system_error>
#include <utility>
#include <vector>

#include "examples/filterfile/arguments.h"
#include "platform/datasources/datasetmanager.h"

namespace kor::examples
{

namespace
{

namespace fs = std::filesystem;

constexpr std::pair<std::string_view, std::string_view> kFormats[] = {
    {".tif", "GTiff"}, {".tiff", "GTiff"}, {".kordsk", "KORDSK"},
    {".envi", "ENVI"}, {".bil", "EHdr"},   {".img", "HFA"},
};

std::string FormatOf(const fs::path& oFile)
{
    std::string oSuffixes;
    for (const auto& [oSuffix, oFormat] : kFormats)
    {
        if (oFile.extension() == oSuffix)
        {
            return std::string(oFormat);
        }
        oSuffixes.append(" ").append(oSuffix);
    }
    throw UsageError("the format of " + oFile.string() +
                     " is not known: name it by format=..., or end the file's name in one of" +
                     oSuffixes);
}

std::string DefaultOptions(const std::string& oFormat)
{
    return oFormat == "GTiff" ? "COMPRESS=DEFLATE BIGTIFF=IF_SAFER" : "";
}

}  // namespace

OutputFile::OutputFile(fs::path oFile, const std::string& oFormat, const std::string& oOptions,
                       bool bReplace)
    : moFile(std::move(oFile)), moFolder(moFile.string() + "." + std::to_string(getpid()) + ".part")
{
    if (!bReplace && fs::exists(moFile))
    {
        throw UsageError(moFile.string() + " exists already; replace=yes replaces it");
    }
    const std::string oChosen = oFormat.empty() ? FormatOf(moFile) : oFormat;
    fs::create_directories(moFolder);
    try
    {
        mpoDataset.reset(datasources::DatasetManager::GetInstance()->NewDataset(
            (moFolder / moFile.filename()).string(), oChosen,
            oOptions.empty() ? DefaultOptions(oChosen) : oOptions));
    }
    catch (...)
    {
        fs::remove_all(moFolder);
        throw;
    }
}

OutputFile::~OutputFile()
{
    mpoDataset.reset();
    std::error_code oIgnored;  // a folder that cannot be removed is not in the way of anything
    fs::remove_all(moFolder, oIgnored);
}

datasources::IRasterDataset& OutputFile::GetDataset() const
{
    return dynamic_cast<datasources::IRasterDataset&>(*mpoDataset);
}

void OutputFile::Finish()
{
    mpoDataset->Flush();
    mpoDataset.reset();
    // What stands beside the image first: the image never shows without it.
    std::vector<fs::path> voFiles;
    for (const auto& oEntry : fs::directory_iterator(moFolder))
    {
        if (oEntry.path().filename() != moFile.filename())
        {
            voFiles.push_back(oEntry.path());
        }
    }
    voFiles.push_back(moFolder / moFile.filename());
    for (const fs::path& oMade : voFiles)
    {
        fs::rename(oMade, moFile.parent_path() / oMade.filename());
    }
}

}  // namespace kor::examples
