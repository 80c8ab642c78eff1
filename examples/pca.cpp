// Principal components of the channels of an image file:
//
//     pca IN OUT key=value ...
//
// prints the analysis and writes the first components. In whole numbers, the mean of a component
// is in the middle of the type's range and a number of its standard deviations at the ends. OUT
// appears when it is complete, or not at all.

#include <iostream>
#include <memory>
#include <numeric>
#include <span>
#include <stdexcept>
#include <string>
#include <vector>

#include "examples/filterfile/arguments.h"
#include "examples/filterfile/names.h"
#include "examples/filterfile/outputfile.h"
#include "examples/filterfile/principalcomponents.h"
#include "examples/filterfile/program.h"
#include "examples/filterfile/terminal.h"
#include "platform/datasources/basicreader.h"
#include "platform/datasources/basicwriter.h"
#include "platform/datasources/datasetmanager.h"
#include "platform/datasources/gdal/gdaldriver.h"
#include "processes/qrdfilters/parallelio/filteralgorithm.h"

namespace
{

using namespace kor;
using examples::Arguments;
using examples::OutputFile;

constexpr const char* kUsage =
    "Usage: pca IN OUT key=value ...\n"
    "\n"
    "channels=all   numbers and ranges, such as 1,3-5; all of one type\n"
    "type=8U        of OUT: 8U 8S 16U 16S 32U 32S 64U 64S 32R 64R\n"
    "report=short   short, or long with all matrices\n"
    "format= options= replace=no   as of filter_file\n";

std::vector<unsigned int> CountedUpTo(std::size_t nCount)
{
    std::vector<unsigned int> vn(nCount);
    std::iota(vn.begin(), vn.end(), 1U);
    return vn;
}

void WarnOfMissingData(const datasources::IRasterReader& oReader)
{
    const datasources::AuxiliaryData oData = oReader.GetAuxiliaryData();
    for (const auto& [nChannel, oChannel] : oData.GetChannels())
    {
        if (oChannel.mdfNoData)
        {
            std::cerr << "pca: channel " << nChannel << " marks missing data by "
                      << *oChannel.mdfNoData
                      << ", which counts as a value here; window= or bitmap= leave it out of the "
                         "statistics\n";
            return;
        }
    }
}

void Transform(const std::string& oIn, const std::string& oOut, Arguments oArguments)
{
    datasources::RegisterGdalDriver();
    const std::unique_ptr<datasources::IDataset> poInput(
        datasources::DatasetManager::GetInstance()->Open(oIn, 0));
    const auto* poImage = dynamic_cast<const datasources::IRasterDataset*>(poInput.get());
    if (poImage == nullptr || poImage->GetChannelCount() == 0)
    {
        throw std::runtime_error(oIn + " holds no image channels");
    }
    examples::SourceImage oImage{oIn,
                                 oArguments.TakeRanges("channels", poImage->GetChannelCount())};
    if (oImage.mvnChannels.empty())
    {
        oImage.mvnChannels = CountedUpTo(poImage->GetChannelCount());
    }
    examples::PrincipalComponents oComponents(oArguments, oImage.mvnChannels.size());
    const auto oType = oArguments.TakeChoice<tessel::DataType>("type", "8U", examples::kRealTypes);
    constexpr std::pair<std::string_view, const char*> kModes[] = {{"short", "SHORT"},
                                                                   {"long", "LONG"}};
    const auto* const pszMode = oArguments.TakeChoice<const char*>("report", "short", kModes);
    const std::string oFormat = oArguments.TakeText("format", "");
    const std::string oOptions = oArguments.TakeText("options", "");
    const bool bReplace = oArguments.TakeFlag("replace", false);
    oArguments.RequireNothingLeft();

    datasources::BasicReader oReader(poInput.get(), oImage.mvnChannels);
    WarnOfMissingData(oReader);
    OutputFile oFile(oOut, oFormat, oOptions, bReplace);
    oComponents.Analyse(oImage, oType);
    datasources::IRasterDataset& oResult = oFile.GetDataset();
    oResult.CreateChannels({oReader.GetWidth(), oReader.GetHeight(),
                            static_cast<std::uint32_t>(oComponents.GetCount()), oType});
    oResult.SetGeocodingInfo(oReader.GetGeocodingInfo());
    oResult.SetAuxiliaryData(oComponents.Describe());
    {
        datasources::BasicWriter oWriter(&oResult, CountedUpTo(oComponents.GetCount()));
        parallelio::FilterAlgorithm oAlgorithm(oComponents.GetFilter());
        oAlgorithm.SetMasksMissingData(false);  // the transform looks at no mask
        parallelio::FilterDriver<examples::TerminalStatus> oDriver(oAlgorithm);
        oDriver.Run(&oReader, &oWriter);
    }
    examples::EndIfInterrupted();
    oFile.Finish();
    oComponents.Print(pszMode);
}

}  // namespace

int main(int nArguments, char* apszArguments[])
{
    const std::span<char*> oWords(apszArguments, static_cast<std::size_t>(nArguments));
    if (oWords.size() < 3)
    {
        std::cerr << kUsage << examples::PrincipalComponents::kParameters;
        return examples::kMisused;
    }
    return examples::RunProgram(
        "pca", oWords[2], [&] { Transform(oWords[1], oWords[2], Arguments(oWords.subspan(3))); });
}
