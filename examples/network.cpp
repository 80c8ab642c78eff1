// A small network of filters: what two averages of an image differ in.
//
//     network IN OUT [key=value ...]
//
// The first channel of IN is read once. Two average filters, a small and a large one, read it side
// by side on two threads; OUT is the small mean less the large one, which shows detail of the sizes
// between the two. All of the image is in memory.

#include <iostream>
#include <memory>
#include <string>
#include <vector>

#include "basic/tessel/mask/mask.h"
#include "examples/filterfile/arguments.h"
#include "examples/filterfile/outputfile.h"
#include "examples/filterfile/program.h"
#include "examples/filterfile/terminal.h"
#include "platform/datasources/basicreader.h"
#include "platform/datasources/basicwriter.h"
#include "platform/datasources/gdal/gdaldriver.h"
#include "platform/network/genericprocessor.h"
#include "processes/qrdfilters/addaveragefilter.h"

namespace
{

using namespace kor;
using RasterPointer = std::shared_ptr<tessel::Raster>;
using MaskPointer = std::shared_ptr<tessel::Mask>;

constexpr const char* kUsage =
    "Usage: network IN OUT [key=value ...]\n"
    "\n"
    "  small=3           window of the small average, an odd number of pixels\n"
    "  large=15          that of the large one\n"
    "  format=           KORDSK or GDAL's name of a format; else by OUT's suffix\n"
    "  options=          of the format, such as \"TILED=YES COMPRESS=DEFLATE\"\n"
    "  replace=no        yes: an older OUT is replaced\n";

/// Reads a whole channel, with margins that repeat its edge.
struct ReadChannel
{
    RasterPointer operator()(const std::string& oFile) const
    {
        datasources::BasicReader oReader(oFile, {1}, 0);
        oReader.SetMargin(mnMargin, mnMargin, 2);
        auto poRaster = std::make_shared<tessel::Raster>(
            tessel::RasterInfo(oReader.GetWidth(), oReader.GetHeight(), 1, oReader.GetDataType()),
            tessel::RasterContext(mnMargin, mnMargin, 0, 0));
        oReader.ReadRaster(poRaster.get());
        return poRaster;
    }

    std::uint32_t mnMargin;
};

/// The first raster less the second, both of doubles.
struct Subtract
{
    RasterPointer operator()(const RasterPointer& poLeft, const RasterPointer& poRight) const
    {
        auto poOut = std::make_shared<tessel::Raster>(
            tessel::RasterInfo(poLeft->mnWidth, poLeft->mnHeight, 1, tessel::eDT_64R),
            tessel::RasterContext());
        for (std::int32_t y = 0; y < static_cast<std::int32_t>(poOut->mnHeight); ++y)
        {
            const double* pLeft = poLeft->GetPixelAs<double>(0, y);
            const double* pRight = poRight->GetPixelAs<double>(0, y);
            double* pOut = poOut->GetPixelAs<double>(0, y);
            for (std::uint32_t x = 0; x < poOut->mnWidth; ++x)
            {
                pOut[x] = pLeft[x] - pRight[x];
            }
        }
        return poOut;
    }
};

using ReadNode = GenericProcessor::Function<ReadChannel, RasterPointer, std::string>;
using SubtractNode =
    GenericProcessor::Function<Subtract, RasterPointer, RasterPointer, RasterPointer>;

/// Builds the network and runs it: the difference as 32-bit floats.
RasterPointer DetailOf(const std::string& oFile, int nSmall, int nLarge,
                       const tessel::DataType& oType)
{
    GenericProcessor oNetwork;
    const auto nMargin = static_cast<std::uint32_t>(std::max(nSmall, nLarge) / 2);
    const auto nFile = oNetwork.AddValue(oFile, "File " + oFile);
    const auto nImage = oNetwork.Add(ReadNode({nMargin}), {nFile}, "Read channel 1");
    const auto nNoMask = oNetwork.AddValue(MaskPointer(), "No mask");
    const auto oAverage = [&](int nSize)
    {
        return filters::AddAverageFilter(oNetwork, nImage, nNoMask, nNoMask, nSize, nSize, true,
                                         oType, tessel::eDT_64R);
    };
    const auto nDifference =
        oNetwork.Add(SubtractNode({}), {oAverage(nSmall), oAverage(nLarge)}, "Subtract");
    using NarrowNode =
        GenericProcessor::Function<filters::ConvertRasterToType, RasterPointer, RasterPointer>;
    const auto nResult = oNetwork.Add(NarrowNode(filters::ConvertRasterToType(tessel::eDT_32R)),
                                      {nDifference}, "Convert to 32-bit floats");
    const auto poResult = boost::any_cast<RasterPointer>(oNetwork.Evaluate(nResult));
    for (std::uint64_t i = 0; i < oNetwork.GetNodeCount(); ++i)
    {
        std::cout << i << "  " << oNetwork.GetNode(i).moDescription;
        for (const std::uint64_t nInput : oNetwork.GetNode(i).moInputs)
        {
            std::cout << (nInput == oNetwork.GetNode(i).moInputs.front() ? "  <- " : ", ")
                      << nInput;
        }
        std::cout << '\n';
    }
    return poResult;
}

int OddSize(examples::Arguments& oArguments, const std::string& oKey, int nDefault)
{
    constexpr int kLargest = 1001;
    const int nSize = oArguments.TakeInteger(oKey, nDefault, 1, kLargest);
    if (nSize % 2 == 0)
    {
        throw examples::Arguments::Refusal(oKey, std::to_string(nSize), "an odd number");
    }
    return nSize;
}

void RunNetwork(const std::string& oIn, const std::string& oOut, examples::Arguments oArguments)
{
    const int nSmall = OddSize(oArguments, "small", 3);
    const int nLarge = OddSize(oArguments, "large", 15);
    const std::string oFormat = oArguments.TakeText("format", "");
    const std::string oOptions = oArguments.TakeText("options", "");
    const bool bReplace = oArguments.TakeFlag("replace", false);
    oArguments.RequireNothingLeft();

    datasources::RegisterGdalDriver();
    const datasources::BasicReader oReader(oIn, {1}, 0);
    examples::OutputFile oFile(oOut, oFormat, oOptions, bReplace);
    const RasterPointer poDetail = DetailOf(oIn, nSmall, nLarge, oReader.GetDataType());
    oFile.GetDataset().CreateChannels(*poDetail);
    oFile.GetDataset().SetGeocodingInfo(oReader.GetGeocodingInfo());
    {
        datasources::BasicWriter oWriter(&oFile.GetDataset(), {1});
        oWriter.WriteRaster(poDetail.get());
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
        std::cerr << kUsage;
        return examples::kMisused;
    }
    return examples::RunProgram(
        "network", oWords[2],
        [&] { RunNetwork(oWords[1], oWords[2], examples::Arguments(oWords.subspan(3))); });
}
