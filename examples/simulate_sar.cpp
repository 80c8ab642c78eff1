// Simulates the image that a side-looking radar would take of a terrain:
//
//     simulate_sar DEM OUT key=value ...
//
// OUT has three channels: the image, the layover mask and the shadow mask. It lies on the map like
// the DEM, or in radar geometry, where columns run in ground range and lines along the track. OUT
// appears when it is complete, or not at all.

#include <chrono>
#include <cmath>
#include <cstdio>
#include <filesystem>
#include <iostream>
#include <limits>
#include <memory>
#include <optional>
#include <string>
#include <vector>

#include "examples/filterfile/arguments.h"
#include "examples/filterfile/outputfile.h"
#include "examples/filterfile/program.h"
#include "examples/filterfile/terminal.h"
#include "platform/datasources/basicreader.h"
#include "platform/datasources/basicwriter.h"
#include "platform/datasources/bitmapreader.h"
#include "platform/datasources/datasetmanager.h"
#include "platform/datasources/gdal/gdaldriver.h"
#include "processes/qrdfilters/convertraster.h"
#include "processes/qrdfilters/sarsim1.h"
#include "processes/qrdfilters/sarsim2.h"

namespace
{

using namespace kor;
using examples::Arguments;
using ogc::cs::GeocodingInfo;

constexpr const char* kUsage =
    "Usage: simulate_sar DEM OUT key=value ...\n"
    "\n"
    "Writes three channels: how much terrain falls into each pixel, layover (1) and shadow (1).\n"
    "The first channel of DEM holds elevations. The sensor looks to the right of its track.\n"
    "\n"
    "  geometry=map      map: on the DEM's pixels; radar: ground range by track\n"
    "  heading=13        of the track, degrees clockwise from north, 0 to 360\n"
    "  look=30           angle from nadir at the near range point, degrees\n"
    "  altitude=785000   of the sensor, metres\n"
    "  oversampling=2    points along each side of a DEM cell\n"
    "  near=             x,y of the near range point on the map; else the upper left corner\n"
    "  pixel=            width,height of a DEM pixel in metres, where DEM tells degrees\n"
    "  scale=1 offset=0  elevation in metres is (sample + offset) * scale; whole numbers in\n"
    "                    radar geometry\n"
    "  resolution=       radar pixel in metres: in range,along the track; else the DEM's pixel\n"
    "  background=       sample that is no elevation; else what DEM names. Both for radar "
    "geometry\n"
    "  flip=no           yes: lines of the radar image from last to first\n"
    "  format=           KORDSK or GDAL's name of a format; else by OUT's suffix\n"
    "  options=          of the format, such as \"TILED=YES COMPRESS=DEFLATE\"\n"
    "  replace=no        yes: an older OUT is replaced\n";

/// What the user wants.
struct View
{
    bool mbRadar = false;
    double mdfHeading = 0.0;
    double mdfLook = 0.0;
    double mdfAltitude = 0.0;
    int mnOversampling = 0;
    std::vector<double> mvdfNear;
    std::vector<double> mvdfPixel;
    std::vector<double> mvdfScale;
    std::vector<double> mvdfResolution;
    std::optional<double> mdfBackground;
    bool mbFlip = false;
};

/// None or two numbers.
std::vector<double> TakePair(Arguments& oArguments, const std::string& oKey)
{
    std::vector<double> vdfPair = oArguments.TakeNumbers(oKey);
    if (!vdfPair.empty() && vdfPair.size() != 2)
    {
        throw Arguments::Refusal(oKey, std::to_string(vdfPair.size()) + " numbers", "two numbers");
    }
    return vdfPair;
}

/// None or two lengths.
std::vector<double> TakeLengths(Arguments& oArguments, const std::string& oKey)
{
    std::vector<double> vdfPair = TakePair(oArguments, oKey);
    for (const double dfLength : vdfPair)
    {
        if (!(dfLength > 0.0))
        {
            throw Arguments::Refusal(oKey, std::to_string(dfLength), "metres above 0");
        }
    }
    return vdfPair;
}

View TakeView(Arguments& oArguments)
{
    constexpr double kLargest = 1e9;
    constexpr std::pair<std::string_view, bool> kGeometries[] = {{"map", false}, {"radar", true}};
    View oView;
    oView.mbRadar = oArguments.TakeChoice<bool>("geometry", "map", kGeometries);
    oView.mdfHeading = oArguments.TakeNumber("heading", 13.0, 0.0, 360.0);
    oView.mdfLook = oArguments.TakeNumber("look", 30.0, 0.0, 90.0);
    oView.mdfAltitude = oArguments.TakeNumber("altitude", 785000.0, 1.0, kLargest);
    oView.mnOversampling = oArguments.TakeInteger("oversampling", 2, 1, 1000);
    oView.mvdfNear = TakePair(oArguments, "near");
    oView.mvdfPixel = TakeLengths(oArguments, "pixel");
    const double dfScale = oArguments.TakeNumber("scale", 1.0, -kLargest, kLargest);
    const double dfOffset = oArguments.TakeNumber("offset", 0.0, -kLargest, kLargest);
    // An offset of exactly 0 would be replaced by the DEM's lowest elevation.
    oView.mvdfScale = {dfScale, dfOffset == 0.0 ? 1e-9 : dfOffset};
    oView.mvdfResolution = TakeLengths(oArguments, "resolution");
    if (oArguments.Has("background"))
    {
        oView.mdfBackground = oArguments.TakeNumber("background", 0.0, -kLargest, kLargest);
    }
    oView.mbFlip = oArguments.TakeFlag("flip", false);
    return oView;
}

/// Reads the DEM, tells the progress of rows read, and lies where the user says.
class DemReader : public datasources::BasicReader
{
public:
    /// vdfPixel: metres; empty goes by the file.
    DemReader(const std::string& oFile, const std::vector<double>& vdfPixel)
        : BasicReader(oFile, {1}, 0), moMap(BasicReader::GetGeocodingInfo())
    {
        if (!vdfPixel.empty())
        {
            // Around the central meridian.
            constexpr double kCentralMeridian = 500000.0;
            moMap = GeocodingInfo(kCentralMeridian - 0.5 * GetWidth() * vdfPixel[0], vdfPixel[0],
                                  0.0, -vdfPixel[1]);
        }
        else if (BasicReader::GetGeocodingInfo().GetProjection().starts_with("GEOG"))
        {
            throw examples::UsageError("the pixels of " + oFile +
                                       " are degrees; tell their size by pixel=WIDTH,HEIGHT in "
                                       "metres");
        }
    }

    const GeocodingInfo& GetGeocodingInfo() const override { return moMap; }
    /// That of the file.
    const GeocodingInfo& GetMap() const { return BasicReader::GetGeocodingInfo(); }
    tessel::Raster* GetRaster(unsigned int nRow) override
    {
        if (moStatus.IsCancelled())
        {
            throw examples::Interrupted();
        }
        if (mbTellsRows)
        {
            moStatus.SetProgress(static_cast<float>(++mnRows) / static_cast<float>(GetHeight()));
        }
        return BasicReader::GetRaster(nRow);
    }

    /// From now on. Rows sampled before the scan make it end early by that much.
    void TellRows() { mbTellsRows = true; }

private:
    GeocodingInfo moMap;
    examples::TerminalStatus moStatus;
    bool mbTellsRows = false;
    unsigned int mnRows = 0;
};

/// Progress of the simulation in map geometry.
class Progress : public parallelio::IUpdateHandler
{
public:
    void Update(float fFraction) override { moStatus.SetProgress(fFraction); }
    bool IsCancelled() override { return moStatus.IsCancelled(); }

private:
    examples::TerminalStatus moStatus;
};

constexpr const char* kChannels[] = {"Simulated SAR image", "Layover mask", "Shadow mask"};

/// Makes the three channels. Counts and marks share a type, since many formats know one alone.
void CreateChannels(std::uint32_t nWidth, std::uint32_t nHeight,
                    datasources::IRasterDataset& oImage)
{
    oImage.CreateChannels({nWidth, nHeight, 3, tessel::eDT_16U});
    datasources::AuxiliaryData oData;
    for (unsigned int c = 0; c < 3; ++c)
    {
        oData.SetChannelDescription(kChannels[c], c + 1);
    }
    oImage.SetAuxiliaryData(oData);
}

void CopyRows(datasources::IRasterReader& oReader, datasources::IRasterDataset& oImage,
              unsigned int nChannel)
{
    datasources::BasicWriter oWriter(&oImage, {nChannel});
    for (std::uint32_t y = 0; y < oReader.GetHeight(); ++y)
    {
        const tessel::RasterContext oPlace(0, 0, 0, y);
        tessel::Raster oRow({oReader.GetWidth(), 1, 1, oReader.GetDataType()}, oPlace);
        tessel::Raster oCounts({oReader.GetWidth(), 1, 1, tessel::eDT_16U}, oPlace);
        oReader.ReadRaster(&oRow);
        filters::ConvertRaster(&oRow, &oCounts);
        oWriter.WriteRaster(&oCounts);
    }
}

void SimulateMap(DemReader& oDem, const View& oView, datasources::IRasterDataset& oImage)
{
    CreateChannels(oDem.GetWidth(), oDem.GetHeight(), oImage);
    oImage.SetGeocodingInfo(oDem.GetMap());
    datasources::BasicWriter oCounts(&oImage, {1});
    datasources::BasicWriter oLayover(&oImage, {2});
    datasources::BasicWriter oShadow(&oImage, {3});
    Progress oProgress;
    filters::Sarsim2 oSimulator({0, 0, oDem.GetWidth(), oDem.GetHeight()}, oView.mvdfScale,
                                {oView.mdfAltitude}, {oView.mdfHeading}, {oView.mdfLook},
                                oView.mvdfNear, {oView.mnOversampling}, &oProgress);
    oSimulator.Process(&oDem, &oCounts, &oLayover, &oShadow);
    examples::EndIfInterrupted();
}

/// oScratch: a file that the image goes through, since its masks are bitmaps.
void SimulateRadar(DemReader& oDem, const View& oView, const std::string& oScratch,
                   datasources::IRasterDataset& oImage)
{
    const GeocodingInfo& oMap = oDem.GetGeocodingInfo();
    // Else a sample that 16 bits do not have.
    const double dfBackground =
        oView.mdfBackground.value_or(oDem.GetAuxiliaryData().GetChannelNoData(1).value_or(1e9));
    filters::SarSim1 oSimulator(
        {1}, {0, 0, static_cast<int>(oDem.GetWidth()), static_cast<int>(oDem.GetHeight())},
        oView.mvdfScale, {dfBackground},
        oView.mvdfResolution.empty()
            ? std::vector<double>{std::fabs(oMap.GetXPerCol()), std::fabs(oMap.GetYPerRow())}
            : oView.mvdfResolution,
        {oView.mdfAltitude}, {oView.mdfHeading}, {oView.mdfLook}, oView.mvdfNear,
        {oView.mnOversampling});
    oSimulator.SetFlip(oView.mbFlip);
    oDem.TellRows();
    oSimulator.Process(oDem);
    oSimulator.Output(oScratch);
    const std::unique_ptr<datasources::IDataset> poMade(
        datasources::DatasetManager::GetInstance()->Open(oScratch, 0));
    auto* poBitmaps = dynamic_cast<datasources::IBitmapDataset*>(poMade.get());
    CreateChannels(static_cast<std::uint32_t>(oSimulator.GetSarpix()),
                   static_cast<std::uint32_t>(oSimulator.GetSarlin()), oImage);
    datasources::BasicReader oCounts(poMade.get(), {1});
    datasources::BitmapReader oLayover(poBitmaps, 1);
    datasources::BitmapReader oShadow(poBitmaps, 2);
    CopyRows(oCounts, oImage, 1);
    CopyRows(oLayover, oImage, 2);
    CopyRows(oShadow, oImage, 3);
}

/// A file's name in a folder beside OUT that goes with this object.
class Scratch
{
public:
    explicit Scratch(const std::string& oOut) : moFolder(oOut + ".scratch")
    {
        std::filesystem::create_directories(moFolder);
    }
    Scratch(const Scratch&) = delete;
    Scratch& operator=(const Scratch&) = delete;
    ~Scratch()
    {
        std::error_code oIgnored;
        std::filesystem::remove_all(moFolder, oIgnored);
    }
    std::string GetFile() const { return (moFolder / "radar.kordsk").string(); }

private:
    std::filesystem::path moFolder;
};

void Simulate(const std::string& oIn, const std::string& oOut, Arguments oArguments)
{
    const View oView = TakeView(oArguments);
    const std::string oFormat = oArguments.TakeText("format", "");
    const std::string oOptions = oArguments.TakeText("options", "");
    const bool bReplace = oArguments.TakeFlag("replace", false);
    oArguments.RequireNothingLeft();

    const auto oStart = std::chrono::steady_clock::now();
    datasources::RegisterGdalDriver();
    DemReader oDem(oIn, oView.mvdfPixel);
    examples::OutputFile oFile(oOut, oFormat, oOptions, bReplace);
    if (oView.mbRadar)
    {
        const Scratch oScratch(oOut);
        SimulateRadar(oDem, oView, oScratch.GetFile(), oFile.GetDataset());
    }
    else
    {
        SimulateMap(oDem, oView, oFile.GetDataset());
    }
    const unsigned int nWidth = oFile.GetDataset().GetWidth();
    const unsigned int nHeight = oFile.GetDataset().GetHeight();
    oFile.Finish();
    const std::chrono::duration<double> oTaken = std::chrono::steady_clock::now() - oStart;
    std::printf("%s geometry: %u x %u pixels of a DEM of %u x %u in %.2f s\n",
                oView.mbRadar ? "radar" : "map", nWidth, nHeight, oDem.GetWidth(), oDem.GetHeight(),
                oTaken.count());
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
    return examples::RunProgram("simulate_sar", oWords[2],
                                [&]
                                { Simulate(oWords[1], oWords[2], Arguments(oWords.subspan(3))); });
}
