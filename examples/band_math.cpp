// Computes with the bands of an image file of any size and format:
//
//     band_math IN OUT OPERATION key=value ...
//
// For an output of 8 or 16 bits the image is read twice: once for the smallest and the greatest
// result, and once to scale the results to the whole range of the output. Pixels with missing
// samples, and quotients with (almost) nothing below, become the output's no-data value. OUT
// appears when it is complete, or not at all.

#include <cstdio>
#include <iostream>
#include <limits>
#include <memory>
#include <optional>
#include <span>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

#include "examples/filterfile/arguments.h"
#include "examples/filterfile/outputfile.h"
#include "examples/filterfile/program.h"
#include "examples/filterfile/terminal.h"
#include "platform/datasources/basicwriter.h"
#include "platform/datasources/datasetmanager.h"
#include "platform/datasources/gdal/gdaldriver.h"
#include "platform/datasources/multitypereader.h"
#include "processes/qrdfilters/filterari.h"
#include "processes/qrdfilters/filterclr.h"
#include "processes/qrdfilters/parallelio/filteriodriver.h"
#include "processes/qrdfilters/validmaskbuilder.h"

namespace
{

using namespace kor;
using examples::Arguments;
using examples::UsageError;
using tessel::Mask;
using tessel::Raster;

constexpr double kMost = std::numeric_limits<float>::max();

constexpr const char* kUsage =
    "Usage: band_math IN OUT OPERATION key=value ...\n"
    "\n"
    "Operations, on the bands A and B, or on A and a constant C where B is not given:\n"
    "  sum               A + B + C, or A + C\n"
    "  difference        A - B - C, or A - C\n"
    "  product           A * B, or A * C\n"
    "  ratio             A / B, or A / C\n"
    "  normalised        (A - B) / (A + B), such as a vegetation index\n"
    "\n"
    "Parameters, with what holds without them:\n"
    "  bands=1,2         A and B, or A alone; without this parameter all that there are, if\n"
    "                    these are one or two\n"
    "  constant=0        C\n"
    "  type=32R          of the output: 32R for the results themselves, 8U or 16U for results\n"
    "                    scaled to 1 to 255 or to 65535\n"
    "  range=            MIN,MAX: what is scaled; else the range that the results have, for\n"
    "                    which the image is read twice\n"
    "  nodata=           values of missing data, separated by commas; else those that the file\n"
    "                    names. What is not finite is missing as well\n"
    "  memory=256        MiB for the blocks in memory\n"
    "  format=           KORDSK or GDAL's name of a format; else by OUT's suffix\n"
    "  options=          of the format, such as \"TILED=YES COMPRESS=DEFLATE\"\n"
    "  replace=no        yes: an older OUT is replaced\n"
    "\n"
    "Missing results become 0 in 8U and 16U, which the output names as its no-data value, and\n"
    "not a number in 32R.\n";

struct Operation
{
    std::string_view moName;
    unsigned int mnOperator;  ///< of filters::FilterARI
    bool mbNormalises;
};

const Operation& FindOperation(std::string_view oName)
{
    static constexpr Operation kOperations[] = {
        {"sum", 1, false},   {"difference", 2, false}, {"product", 3, false},
        {"ratio", 4, false}, {"normalised", 4, true},
    };
    std::string oNames;
    for (const Operation& oOperation : kOperations)
    {
        if (oOperation.moName == oName)
        {
            return oOperation;
        }
        oNames.append(" ").append(oOperation.moName);
    }
    throw UsageError("there is no operation \"" + std::string(oName) + "\"; there are" + oNames);
}

/// What the output's samples can be.
struct OutputScale
{
    tessel::DataType moType;
    std::vector<float> mvfLimits;  ///< what the results are scaled to; empty: not at all
    float mfMissing;
};

OutputScale TakeOutputScale(Arguments& oArguments)
{
    constexpr std::pair<std::string_view, int> kTypes[] = {{"32R", 0}, {"8U", 8}, {"16U", 16}};
    switch (oArguments.TakeChoice<int>("type", "32R", kTypes))
    {
        case 8:
            return {tessel::eDT_8U, {1.0F, 255.0F}, 0.0F};
        case 16:
            return {tessel::eDT_16U, {1.0F, 65535.0F}, 0.0F};
        default:
            return {tessel::eDT_32R, {}, std::numeric_limits<float>::quiet_NaN()};
    }
}

/// The two numbers of "range"; none without it.
std::optional<std::pair<float, float>> TakeRange(Arguments& oArguments, const OutputScale& oScale)
{
    const std::vector<double> vdfRange = oArguments.TakeNumbers("range");
    if (!oArguments.Has("range"))
    {
        return std::nullopt;
    }
    if (oScale.mvfLimits.empty())
    {
        throw UsageError("range= says what is scaled; it needs type=8U or type=16U");
    }
    if (vdfRange.size() != 2 || !(vdfRange[0] < vdfRange[1]) || vdfRange[0] < -kMost ||
        vdfRange[1] > kMost)
    {
        throw Arguments::Refusal("range", oArguments.TakeText("range", ""),
                                 "two numbers, the lower one first, such as -1,1");
    }
    return std::pair(static_cast<float>(vdfRange[0]), static_cast<float>(vdfRange[1]));
}

/// The algorithm for the block driver.
class BandMath
{
public:
    BandMath(const Operation& oOperation, float fConstant, float fMissing)
        : moOperation(oOperation),
          mfConstant(fConstant),
          mfMissing(fMissing),
          moClear({static_cast<double>(fMissing)})
    {
        moDifference.SetValues({2}, {0.0F}, {}, {}, {});
        moSum.SetValues({1}, {0.0F}, {}, {}, {});
        Set(kPlain, {});
    }

    /// In the next run only the range of the results counts.
    void CollectRange() { Set(kStatistics, {}); }
    void Scale(const std::pair<float, float>& oRange, const std::vector<float>& vfLimits)
    {
        Set(kScaled, {oRange.first, oRange.second, vfLimits[0], vfLimits[1]});
    }
    /// Of the results of the last run, without missing ones and before they were scaled.
    std::pair<float, float> GetRange() const
    {
        return {moResult.GetMinVal(), moResult.GetMaxVal()};
    }

    void SetMaskBuilder(const tessel::IMaskBuilder* poBuilder) { mpoMaskBuilder = poBuilder; }
    const tessel::IMaskBuilder* GetMaskBuilder() const { return mpoMaskBuilder; }

    void Process(Raster* poRasterIn, Mask* poMask, Raster* poRasterOut) const
    {
        // Channel arithmetic leaves masked pixels alone, and blocks come with old samples in them.
        moClear.Process(nullptr, nullptr, poRasterOut);
        if (!moOperation.mbNormalises)
        {
            moResult.Process(poRasterIn, poMask, poRasterOut);
            return;
        }
        const std::unique_ptr<Raster> poTerms = DifferenceAndSum(poRasterIn);
        moResult.Process(poTerms.get(), poMask, poRasterOut);
    }

private:
    static constexpr unsigned int kPlain = 0;
    static constexpr unsigned int kStatistics = 2;
    static constexpr unsigned int kScaled = 3;

    void Set(unsigned int nMode, std::vector<float> vfRange)
    {
        moResult.SetValues({moOperation.mnOperator}, {mfConstant}, {mfMissing}, {nMode},
                           std::move(vfRange));
    }

    /// A block of two channels.
    std::unique_ptr<Raster> DifferenceAndSum(Raster* poRasterIn) const
    {
        tessel::RasterInfo oInfo = *poRasterIn;
        oInfo.moDataType = tessel::eDT_32R;
        auto poTerms = std::make_unique<Raster>(oInfo, *poRasterIn);
        oInfo.mnChannels = 1;
        Raster oDifference(oInfo, *poRasterIn);
        Raster oSum(oInfo, *poRasterIn);
        moDifference.Process(poRasterIn, nullptr, &oDifference);
        moSum.Process(poRasterIn, nullptr, &oSum);
        const auto* const pfDifference = reinterpret_cast<const float*>(oDifference.mpBuffer);
        const auto* const pfSum = reinterpret_cast<const float*>(oSum.mpBuffer);
        auto* const pfTerms = reinterpret_cast<float*>(poTerms->mpBuffer);
        const std::size_t nPixels =
            std::size_t{poRasterIn->mnTotalWidth} * poRasterIn->mnTotalHeight;
        for (std::size_t i = 0; i < nPixels; ++i)
        {
            pfTerms[2 * i] = pfDifference[i];
            pfTerms[2 * i + 1] = pfSum[i];
        }
        return poTerms;
    }

    Operation moOperation;
    float mfConstant;
    float mfMissing;
    filters::FilterClr moClear;
    filters::ARIAlgorithm moDifference;
    filters::ARIAlgorithm moSum;
    filters::ARIAlgorithm moResult;
    const tessel::IMaskBuilder* mpoMaskBuilder = nullptr;
};

/// The bands of the input, as single precision, in which they are combined.
class Bands
{
public:
    Bands(const std::string& oFile, const Operation& oOperation, Arguments& oArguments)
        : mpoDataset(datasources::DatasetManager::GetInstance()->Open(oFile, 0))
    {
        const auto* poImage = dynamic_cast<const datasources::IRasterDataset*>(mpoDataset.get());
        const unsigned int nChannels = poImage != nullptr ? poImage->GetChannelCount() : 0;
        if (nChannels == 0)
        {
            throw std::runtime_error(oFile + " holds no image channels");
        }
        mvnBands = oArguments.TakeRanges("bands", nChannels);
        for (unsigned int n = 1; n <= nChannels && !oArguments.Has("bands"); ++n)
        {
            mvnBands.push_back(n);
        }
        if (mvnBands.size() > 2)
        {
            throw UsageError(oFile + " has " + std::to_string(nChannels) +
                             " bands; choose one or two of them by bands=");
        }
        if (oOperation.mbNormalises && mvnBands.size() != 2)
        {
            throw UsageError("normalised takes two bands, such as bands=4,3");
        }
        mpoReader = std::make_unique<datasources::MultiTypeReader>(mpoDataset.get(), mvnBands,
                                                                   tessel::eDT_32R);
        std::vector<double> vdfMissing = oArguments.TakeNumbers("nodata");
        if (vdfMissing.empty())
        {
            vdfMissing = mpoReader->GetAuxiliaryData().GetNoDataValues();
        }
        mpoMask = std::make_unique<filters::ValidMaskBuilder>(std::move(vdfMissing));
    }

    datasources::IRasterReader& GetReader() const { return *mpoReader; }
    const tessel::IMaskBuilder* GetMaskBuilder() const { return mpoMask.get(); }
    /// "ratio of bands 4 and 3"
    std::string Describe(const Operation& oOperation) const
    {
        std::string oText = std::string(oOperation.moName) + " of band" +
                            (mvnBands.size() == 1 ? " " : "s ") + std::to_string(mvnBands[0]);
        return mvnBands.size() == 1 ? oText : oText + " and " + std::to_string(mvnBands[1]);
    }

private:
    std::unique_ptr<datasources::IDataset> mpoDataset;
    std::vector<unsigned int> mvnBands;
    std::unique_ptr<datasources::IRasterReader> mpoReader;
    std::unique_ptr<tessel::IMaskBuilder> mpoMask;
};

using Driver =
    parallelio::FilterIODriver<BandMath, parallelio::DefaultAccessPolicy, examples::TerminalStatus>;

void RunOver(Driver& oDriver, const Bands& oBands, datasources::IRasterWriter* poWriter)
{
    oDriver.Run(&oBands.GetReader(), poWriter);
    examples::EndIfInterrupted();
}

/// Describes the output, which has one channel.
void Describe(datasources::IRasterDataset& oImage, const Bands& oBands, const OutputScale& oScale,
              const std::string& oDescription)
{
    oImage.SetGeocodingInfo(oBands.GetReader().GetGeocodingInfo());
    datasources::AuxiliaryData oData;
    oData.SetFileMetadata(oBands.GetReader().GetAuxiliaryData().GetFileMetadata());
    oData.SetChannelDescription(oDescription, 1);
    if (!oScale.mvfLimits.empty())
    {
        oData.SetChannelNoData(oScale.mfMissing, 1);
    }
    oImage.SetAuxiliaryData(oData);
}

void PrintReport(const std::string& oDescription, const std::pair<float, float>& oResults,
                 const std::pair<float, float>& oScaled, const OutputScale& oScale)
{
    if (oResults.first > oResults.second)
    {
        std::printf("%s: no pixel has a result\n", oDescription.c_str());
        return;
    }
    std::printf("%s: from %g to %g\n", oDescription.c_str(), static_cast<double>(oResults.first),
                static_cast<double>(oResults.second));
    if (!oScale.mvfLimits.empty())
    {
        std::printf("scaled: %g is %g, %g is %g\n", static_cast<double>(oScale.mvfLimits[0]),
                    static_cast<double>(oScaled.first), static_cast<double>(oScale.mvfLimits[1]),
                    static_cast<double>(oScaled.second));
    }
}

void ComputeFile(const std::string& oIn, const std::string& oOut, const std::string& oName,
                 Arguments oArguments)
{
    const Operation& oOperation = FindOperation(oName);
    datasources::RegisterGdalDriver();
    const Bands oBands(oIn, oOperation, oArguments);
    const double dfConstant = oArguments.TakeNumber("constant", 0.0, -kMost, kMost);
    const OutputScale oScale = TakeOutputScale(oArguments);
    std::optional<std::pair<float, float>> oRange = TakeRange(oArguments, oScale);
    const int nMegabytes =
        oArguments.TakeInteger("memory", 256, 8, std::numeric_limits<int>::max());
    const std::string oFormat = oArguments.TakeText("format", "");
    const std::string oOptions = oArguments.TakeText("options", "");
    const bool bReplace = oArguments.TakeFlag("replace", false);
    oArguments.RequireNothingLeft();

    const std::string oDescription = oBands.Describe(oOperation);
    examples::OutputFile oFile(oOut, oFormat, oOptions, bReplace);
    datasources::IRasterDataset& oImage = oFile.GetDataset();
    oImage.CreateChannels(
        {oBands.GetReader().GetWidth(), oBands.GetReader().GetHeight(), 1, oScale.moType});
    Describe(oImage, oBands, oScale, oDescription);

    std::pair<float, float> oResults;
    {
        Driver oDriver(BandMath(oOperation, static_cast<float>(dfConstant), oScale.mfMissing));
        oDriver.SetMaskBuilder(oBands.GetMaskBuilder());
        oDriver.SetMemoryBudget(static_cast<std::uint64_t>(nMegabytes) << 20);
        if (!oScale.mvfLimits.empty())
        {
            if (!oRange)
            {
                oDriver.CollectRange();
                RunOver(oDriver, oBands, nullptr);
                oRange = oDriver.GetRange();
            }
            oDriver.Scale(*oRange, oScale.mvfLimits);
        }
        datasources::BasicWriter oWriter(&oImage, {1});
        RunOver(oDriver, oBands, &oWriter);
        oResults = oDriver.GetRange();
    }
    oFile.Finish();
    PrintReport(oDescription, oResults, oRange.value_or(oResults), oScale);
}

}  // namespace

int main(int nArguments, char* apszArguments[])
{
    const std::span<char*> oWords(apszArguments, static_cast<std::size_t>(nArguments));
    if (oWords.size() < 4)
    {
        std::cerr << kUsage;
        return examples::kMisused;
    }
    return examples::RunProgram(
        "band_math", oWords[2],
        [&] { ComputeFile(oWords[1], oWords[2], oWords[3], Arguments(oWords.subspan(4))); });
}
