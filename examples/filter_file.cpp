// Filters an image file of any size and format:
//
//     filter_file IN OUT FILTER key=value ...
//
// The image goes through memory in blocks: the next one is read and the last one written while one
// is filtered. OUT appears when it is complete, or not at all.

#include <malloc.h>

#include <chrono>
#include <cmath>
#include <cstdio>
#include <cstdlib>
#include <iostream>
#include <limits>
#include <memory>
#include <numeric>
#include <stdexcept>
#include <string>
#include <vector>

#include "examples/filterfile/arguments.h"
#include "examples/filterfile/filtertable.h"
#include "examples/filterfile/names.h"
#include "examples/filterfile/outputfile.h"
#include "examples/filterfile/program.h"
#include "examples/filterfile/stripreader.h"
#include "examples/filterfile/terminal.h"
#include "platform/datasources/basicreader.h"
#include "platform/datasources/basicwriter.h"
#include "platform/datasources/bitmapmaskbuilder.h"
#include "platform/datasources/datasetmanager.h"
#include "platform/datasources/gdal/gdaldriver.h"
#include "platform/datasources/multitypereader.h"
#include "processes/qrdfilters/parallelio/filteralgorithm.h"
#include "processes/qrdfilters/validmaskbuilder.h"

namespace
{

using namespace kor;
using examples::Arguments;
using examples::OutputFile;
using examples::PreparedFilter;
using examples::TypeName;
using tessel::DataType;
using tessel::RasterInfo;

constexpr const char* kUsage =
    "Usage: filter_file IN OUT FILTER key=value ...\n"
    "       filter_file help FILTER\n"
    "\n"
    "Parameters of all filters, with what holds without them:\n"
    "  channels=all      numbers and ranges, such as 1,3-5\n"
    "  type=             of the output: 8U 8S 16U 16S 32U 32S 64U 64S 32R 64R; else the\n"
    "                    input's, or what the filter needs\n"
    "  nodata=           values of missing data, separated by commas; none masks nothing. Else\n"
    "                    those that the file names, and what is not finite\n"
    "  mask=             number of a bitmap of the file that says which pixels are valid\n"
    "  edge=nearest      beyond the image's edge: nearest (pixel), mirror or zero\n"
    "  complex=magnitude what complex samples are seen as: magnitude, intensity, phase, real,\n"
    "                    imaginary or decibel\n"
    "  memory=256        MiB for the blocks in memory\n"
    "  format=           KORDSK or GDAL's name of a format; else by OUT's suffix\n"
    "  options=          of the format, such as \"TILED=YES COMPRESS=DEFLATE\"\n"
    "  replace=no        yes: an older OUT is replaced\n";

void PrintUsage(std::ostream& oStream)
{
    oStream << kUsage;
    for (const examples::FilterGroup& oGroup : examples::GetFilterGroups())
    {
        oStream << '\n' << oGroup.moTitle << ":\n";
        for (const examples::FilterEntry& oFilter : oGroup.moFilters)
        {
            oStream << "  " << oFilter.moName << std::string(18 - oFilter.moName.size(), ' ')
                    << oFilter.moSummary << '\n';
        }
    }
}

void PrintHelp(const examples::FilterEntry& oFilter)
{
    std::cout << oFilter.moName << ": " << oFilter.moSummary << '\n' << oFilter.moParameters;
}

std::vector<unsigned int> ChannelsUpTo(unsigned int nCount)
{
    std::vector<unsigned int> vnChannels(nCount);
    std::iota(vnChannels.begin(), vnChannels.end(), 1U);
    return vnChannels;
}

/// The image to be filtered.
class Source
{
public:
    Source(const std::string& oFile, Arguments& oArguments)
        : mpoDataset(datasources::DatasetManager::GetInstance()->Open(oFile, 0))
    {
        const auto* poImage = dynamic_cast<const datasources::IRasterDataset*>(mpoDataset.get());
        if (poImage == nullptr || poImage->GetChannelCount() == 0)
        {
            throw std::runtime_error(oFile + " holds no image channels");
        }
        std::vector<unsigned int>& vnChannels = moImage.mvnChannels;
        moImage.moFile = oFile;
        vnChannels = oArguments.TakeRanges("channels", poImage->GetChannelCount());
        if (vnChannels.empty())
        {
            vnChannels = ChannelsUpTo(poImage->GetChannelCount());
        }
        bool bOneType = true;
        for (const unsigned int nChannel : vnChannels)
        {
            bOneType = bOneType &&
                       poImage->GetChannelType(nChannel) == poImage->GetChannelType(vnChannels[0]);
        }
        if (bOneType)
        {
            mpoReader = std::make_unique<datasources::BasicReader>(mpoDataset.get(), vnChannels);
        }
        else
        {
            mpoReader = std::make_unique<datasources::MultiTypeReader>(mpoDataset.get(), vnChannels,
                                                                       tessel::eDT_64R);
        }
        constexpr std::pair<std::string_view, int> kEdges[] = {
            {"zero", 0}, {"mirror", 1}, {"nearest", 2}};
        mpoReader->SetMargin(0, 0, oArguments.TakeChoice<int>("edge", "nearest", kEdges));
        ChooseMask(oArguments);
        ChooseComplex(oArguments);
    }

    datasources::IRasterReader& GetReader() const { return *mpoReader; }
    tessel::IMaskBuilder* GetMaskBuilder() const { return mpoMask.get(); }
    const examples::SourceImage& GetImage() const { return moImage; }
    /// Size, channels and type as filters see them: complex samples as real ones.
    RasterInfo GetInfo() const
    {
        return {mpoReader->GetWidth(), mpoReader->GetHeight(), mpoReader->GetChannelCount(),
                moType};
    }

    /// Hands on how the user wants the image to be seen.
    void Prepare(PreparedFilter& oFilter)
    {
        parallelio::FilterAlgorithm& oAlgorithm = oFilter.moAlgorithm;
        oAlgorithm.SetMasksMissingData(!mbNoMask);
        std::vector<double> vdfNoData = mpoReader->GetAuxiliaryData().GetNoDataValues();
        // Who looks at the image by himself has to see what the run would mask by itself.
        const bool bMasksForLook = oFilter.mfnLook != nullptr && !mbNoMask &&
                                   (mpoReader->GetDataType().mbFloat || !vdfNoData.empty());
        if (mpoMask == nullptr && (oFilter.mbNeedsMask || bMasksForLook))
        {
            mpoMask = std::make_unique<filters::ValidMaskBuilder>(std::move(vdfNoData));
        }
        oAlgorithm.SetMaskBuilder(mpoMask.get());
        if (mpoReader->GetDataType().mbComplex)
        {
            oAlgorithm.SetComplexInterpretation(meComplex);
        }
    }

private:
    void ChooseMask(Arguments& oArguments)
    {
        auto* poBitmaps = dynamic_cast<datasources::IBitmapDataset*>(mpoDataset.get());
        const int nBitmap = oArguments.TakeInteger("mask", 0, 1, std::numeric_limits<int>::max());
        if (nBitmap != 0)
        {
            if (poBitmaps == nullptr)
            {
                throw std::runtime_error(mpoDataset->GetFileName() + " holds no bitmaps");
            }
            mpoMask = std::make_unique<datasources::BitmapMaskBuilder>(
                poBitmaps, static_cast<unsigned int>(nBitmap), false);
        }
        if (oArguments.TakeText("nodata", "") == "none")
        {
            mbNoMask = true;
            return;
        }
        std::vector<double> vdfNoData = oArguments.TakeNumbers("nodata");
        if (!vdfNoData.empty() && mpoMask == nullptr)
        {
            mpoMask = std::make_unique<filters::ValidMaskBuilder>(std::move(vdfNoData));
        }
        else if (!vdfNoData.empty())
        {
            throw examples::UsageError("mask and nodata cannot be given together");
        }
    }

    void ChooseComplex(Arguments& oArguments)
    {
        constexpr std::pair<std::string_view, tessel::KORInterpretationTypes> kViews[] = {
            {"magnitude", tessel::eKIT_Magnitude}, {"intensity", tessel::eKIT_Intensity},
            {"phase", tessel::eKIT_Phase},         {"real", tessel::eKIT_Real},
            {"imaginary", tessel::eKIT_Imaginary}, {"decibel", tessel::eKIT_IntensityDb},
        };
        meComplex =
            oArguments.TakeChoice<tessel::KORInterpretationTypes>("complex", "magnitude", kViews);
        moType = mpoReader->GetDataType();
        if (moType.mbComplex)
        {
            tessel::Raster oPixel({1, 1, 1, moType}, {});
            const std::unique_ptr<tessel::Raster> poSeen(
                tessel::ComplexInterpretation().InterpretRaster(&oPixel, meComplex));
            moType = poSeen->moDataType;
        }
    }

    examples::SourceImage moImage;
    std::unique_ptr<datasources::IDataset> mpoDataset;
    std::unique_ptr<datasources::IRasterReader> mpoReader;
    std::unique_ptr<tessel::IMaskBuilder> mpoMask;
    bool mbNoMask = false;
    tessel::KORInterpretationTypes meComplex = tessel::eKIT_Magnitude;
    DataType moType;
};

class FirstLook : public examples::IFirstLook
{
public:
    FirstLook(const Source& oSource, const PreparedFilter& oFilter, const DataType& oOutput,
              std::uint64_t nBudget)
        : moSource(oSource),
          moFilter(oFilter),
          moOutput(oOutput),
          mnBudget(nBudget),
          moStrips(oSource.GetReader(), nBudget)
    {
    }

    const examples::SourceImage& GetImage() const override { return moSource.GetImage(); }
    DataType GetOutputType() const override { return moOutput; }
    datasources::IRasterReader& GetReader() override { return moStrips; }
    tessel::IMaskBuilder* GetMaskBuilder() override { return moSource.GetMaskBuilder(); }
    void RunFilter() override
    {
        parallelio::FilterDriver<examples::TerminalStatus> oDriver(moFilter.moAlgorithm);
        oDriver.SetMemoryBudget(mnBudget);
        oDriver.Run(&moSource.GetReader(), nullptr);
        examples::EndIfInterrupted();
    }

private:
    const Source& moSource;
    const PreparedFilter& moFilter;
    DataType moOutput;
    std::uint64_t mnBudget;
    examples::StripReader moStrips;
};

/// True when a sample of the type can have the value.
bool CanHold(const DataType& oType, double dfValue)
{
    if (oType.mbFloat)
    {
        return true;
    }
    const int nValueBits = static_cast<int>(oType.mnBits) - (oType.mbSigned ? 1 : 0);
    const double dfEnd = std::ldexp(1.0, nValueBits);
    return dfValue == std::floor(dfValue) && dfValue < dfEnd &&
           dfValue >= (oType.mbSigned ? -dfEnd : 0.0);
}

/// What the input says about itself, as far as it holds for the output.
datasources::AuxiliaryData DataFor(const RasterInfo& oOut, const PreparedFilter& oFilter,
                                   const datasources::IRasterReader& oReader)
{
    const datasources::AuxiliaryData oData = oReader.GetAuxiliaryData();
    datasources::AuxiliaryData oKept;
    oKept.SetFileMetadata(oData.GetFileMetadata());
    if (!oFilter.mbNewChannels && oOut.mnChannels == oReader.GetChannelCount())
    {
        for (const auto& [nChannel, oChannel] : oData.GetChannels())
        {
            oKept.SetChannel(oChannel, nChannel);
        }
    }
    for (unsigned int nChannel = 1; nChannel <= oOut.mnChannels; ++nChannel)
    {
        std::optional<double> dfNoData =
            oFilter.mdfNoData ? oFilter.mdfNoData : oKept.GetChannelNoData(nChannel);
        if (dfNoData && !CanHold(oOut.moDataType, *dfNoData))
        {
            std::cerr << "filter_file: the output's type cannot hold the no-data value "
                      << *dfNoData << " of channel " << nChannel << "; the output names none\n";
            dfNoData.reset();
        }
        oKept.SetChannelNoData(dfNoData, nChannel);
    }
    return oKept;
}

RasterInfo OutputInfo(const RasterInfo& oIn, const PreparedFilter& oFilter, Arguments& oArguments)
{
    RasterInfo oOut = oIn;
    oOut.mnChannels = oFilter.mnChannels.value_or(oIn.mnChannels);
    DataType oDefault = oFilter.moType.value_or(oIn.moDataType);
    if (!oFilter.moAlgorithm.DoConvertBack())
    {
        oDefault = tessel::eDT_64R;
    }
    oOut.moDataType = oArguments.Has("type")
                          ? oArguments.TakeChoice<DataType>("type", "", examples::kRealTypes)
                          : oDefault;
    oArguments.TakeText("type", "");
    return oOut;
}

void PrintReport(const std::string& oFilter, const RasterInfo& oIn, const RasterInfo& oOut,
                 const parallelio::StageTimes& oTimes, double dfClosing)
{
    std::printf("%s: %u x %u pixels, %u channel%s of type %s to %u of type %s\n", oFilter.c_str(),
                oIn.mnWidth, oIn.mnHeight, oIn.mnChannels, oIn.mnChannels == 1 ? "" : "s",
                TypeName(oIn.moDataType).c_str(), oOut.mnChannels,
                TypeName(oOut.moDataType).c_str());
    const double dfMegapixels = static_cast<double>(oIn.mnWidth) * oIn.mnHeight / 1e6;
    std::printf(
        "%.2f s, %.1f Mpixel/s; side by side read %.2f s, process %.2f s, write %.2f s; then %.2f "
        "s to close the file\n",
        oTimes.mdfTotal, dfMegapixels / oTimes.mdfTotal, oTimes.mdfRead, oTimes.mdfProcess,
        oTimes.mdfWrite, dfClosing);
}

/// Blocks go back to the system when they are freed: what the allocator of the C library keeps of
/// them for its threads would come on top of the memory that the user grants.
void KeepNoFreedBlocks()
{
    constexpr int kBlockBytes = 1 << 20;
    mallopt(M_MMAP_THRESHOLD, kBlockBytes);
}

/// The shares of the memory that the user grants: most goes to blocks, the rest to the cache of
/// GDAL, which would else grow with the machine's memory. Who sets GDAL_CACHEMAX keeps his cache.
std::uint64_t SplitMemory(int nMegabytes)
{
    const int nCache = std::max(nMegabytes / 8, 1);
    setenv("GDAL_CACHEMAX", std::to_string(nCache).c_str(), 0);
    return static_cast<std::uint64_t>(nMegabytes - nCache) << 20;
}

void FilterFile(const std::string& oIn, const std::string& oOut, const std::string& oName,
                Arguments oArguments)
{
    const examples::FilterEntry& oEntry = examples::FindFilter(oName);
    const std::uint64_t nBudget =
        SplitMemory(oArguments.TakeInteger("memory", 256, 8, std::numeric_limits<int>::max()));
    datasources::RegisterGdalDriver();
    Source oSource(oIn, oArguments);
    PreparedFilter oFilter = oEntry.mpfnMake(oArguments, oSource.GetInfo());
    oSource.Prepare(oFilter);
    const RasterInfo oInfo = OutputInfo(oSource.GetInfo(), oFilter, oArguments);
    const std::string oFormat = oArguments.TakeText("format", "");
    const std::string oOptions = oArguments.TakeText("options", "");
    const bool bReplace = oArguments.TakeFlag("replace", false);
    oArguments.RequireNothingLeft();

    OutputFile oFile(oOut, oFormat, oOptions, bReplace);
    datasources::IRasterDataset& oImage = oFile.GetDataset();
    oImage.CreateChannels(oInfo);
    oImage.SetGeocodingInfo(oSource.GetReader().GetGeocodingInfo());
    oImage.SetAuxiliaryData(DataFor(oInfo, oFilter, oSource.GetReader()));
    if (oFilter.mfnLook)
    {
        FirstLook oLook(oSource, oFilter, oInfo.moDataType, nBudget);
        oFilter.mfnLook(oLook);
    }

    parallelio::StageTimes oTimes;
    {
        datasources::BasicWriter oWriter(&oImage, ChannelsUpTo(oInfo.mnChannels));
        parallelio::FilterDriver<examples::TerminalStatus> oDriver(oFilter.moAlgorithm);
        oDriver.SetMemoryBudget(nBudget);
        oDriver.Run(&oSource.GetReader(), &oWriter);
        oTimes = oDriver.GetTimes();
    }
    examples::EndIfInterrupted();
    const auto oClosing = std::chrono::steady_clock::now();
    oFile.Finish();
    const std::chrono::duration<double> oClosed = std::chrono::steady_clock::now() - oClosing;
    PrintReport(oName, oSource.GetInfo(), oInfo, oTimes, oClosed.count());
}

}  // namespace

int main(int nArguments, char* apszArguments[])
{
    const std::span<char*> oWords(apszArguments, static_cast<std::size_t>(nArguments));
    if (oWords.size() == 3 && std::string(oWords[1]) == "help")
    {
        return examples::RunProgram("filter_file", "",
                                    [&] { PrintHelp(examples::FindFilter(oWords[2])); });
    }
    if (oWords.size() < 4)
    {
        PrintUsage(std::cerr);
        return examples::kMisused;
    }
    KeepNoFreedBlocks();
    return examples::RunProgram(
        "filter_file", oWords[2],
        [&] { FilterFile(oWords[1], oWords[2], oWords[3], Arguments(oWords.subspan(4))); });
}
