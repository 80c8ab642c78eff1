// Gives all pixels of a class one value:
//
//     homogenise IN OUT values=N classes=N key=value ...
//
// finds the mean or the mode of channel "values" in each class of channel "classes", and writes
// the classes with that in their place. OUT appears when it is complete, or not at all.

#include <iostream>
#include <limits>
#include <memory>
#include <span>
#include <stdexcept>
#include <string>
#include <vector>

#include "examples/filterfile/arguments.h"
#include "examples/filterfile/classvalues.h"
#include "examples/filterfile/names.h"
#include "examples/filterfile/outputfile.h"
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
using tessel::DataType;

constexpr const char* kUsage =
    "Usage: homogenise IN OUT key=value ...\n"
    "\n"
    "classes=2      number of the channel with the classes: 8U, 16U, 16S or 32R, but not 16U\n"
    "               with values of 8U. Classes count from 0, up to 255, 32766 in 16S, 65535 in\n"
    "               16U and 32R\n"
    "type=          of OUT; else that of the values\n"
    "format= options= replace=no   as of filter_file\n";

/// Throws UsageError for numbers of channels that the image does not have.
unsigned int RequireChannel(const std::string& oKey, unsigned int nChannel, unsigned int nCount)
{
    if (nChannel > nCount)
    {
        throw Arguments::Refusal(oKey, std::to_string(nChannel),
                                 "numbers from 1 to " + std::to_string(nCount));
    }
    return nChannel;
}

void Homogenise(const std::string& oIn, const std::string& oOut, Arguments oArguments)
{
    datasources::RegisterGdalDriver();
    const std::unique_ptr<datasources::IDataset> poInput(
        datasources::DatasetManager::GetInstance()->Open(oIn, 0));
    const auto* poImage = dynamic_cast<const datasources::IRasterDataset*>(poInput.get());
    if (poImage == nullptr || poImage->GetChannelCount() == 0)
    {
        throw std::runtime_error(oIn + " holds no image channels");
    }
    const unsigned int nCount = poImage->GetChannelCount();
    const int nClasses = oArguments.TakeInteger("classes", 2, 1, std::numeric_limits<int>::max());
    const unsigned int nClassChannel =
        RequireChannel("classes", static_cast<unsigned int>(nClasses), nCount);
    const examples::ClassValues oValues(oArguments);
    const DataType oValueType =
        poImage->GetChannelType(RequireChannel("values", oValues.GetValueChannel(), nCount));
    const DataType oType = oArguments.TakeChoice<DataType>("type", examples::TypeName(oValueType),
                                                           examples::kRealTypes);
    const std::string oFormat = oArguments.TakeText("format", "");
    const std::string oOptions = oArguments.TakeText("options", "");
    const bool bReplace = oArguments.TakeFlag("replace", false);
    oArguments.RequireNothingLeft();

    datasources::BasicReader oReader(poInput.get(), {nClassChannel});
    OutputFile oFile(oOut, oFormat, oOptions, bReplace);
    const filters::FilterHOM oFilter = oValues.Find(oIn, nClassChannel);
    datasources::IRasterDataset& oResult = oFile.GetDataset();
    oResult.CreateChannels({oReader.GetWidth(), oReader.GetHeight(), 1, oType});
    oResult.SetGeocodingInfo(oReader.GetGeocodingInfo());
    {
        datasources::BasicWriter oWriter(&oResult, {1});
        parallelio::FilterAlgorithm oAlgorithm(oFilter);
        oAlgorithm.SetMasksMissingData(false);  // every pixel is mapped
        parallelio::FilterDriver<examples::TerminalStatus> oDriver(oAlgorithm);
        oDriver.Run(&oReader, &oWriter);
    }
    examples::EndIfInterrupted();
    oFile.Finish();
}

}  // namespace

int main(int nArguments, char* apszArguments[])
{
    const std::span<char*> oWords(apszArguments, static_cast<std::size_t>(nArguments));
    if (oWords.size() < 3)
    {
        std::cerr << kUsage << examples::ClassValues::kParameters;
        return examples::kMisused;
    }
    return examples::RunProgram(
        "homogenise", oWords[2],
        [&] { Homogenise(oWords[1], oWords[2], Arguments(oWords.subspan(3))); });
}
