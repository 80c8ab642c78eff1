#include <algorithm>
#include <cmath>
#include <cstdio>
#include <filesystem>
#include <memory>
#include <string>
#include <vector>

#include "docs/gallery/greyimage.h"
#include "docs/gallery/pages.h"
#include "platform/datasources/basicreader.h"
#include "platform/datasources/bitmapreader.h"
#include "platform/datasources/datasetmanager.h"
#include "platform/datasources/gdal/gdaldriver.h"
#include "platform/datasources/irasterwriter.h"
#include "processes/qrdfilters/sarsim1.h"
#include "processes/qrdfilters/sarsim2.h"

namespace kor::gallery
{

namespace
{

/// Metres. The DEM's are 1/1200 degree, 74 m x 93 m; as squares, each column and each row of theirs
/// has a line of the radar image of its own.
constexpr double kPixel = 83.0;
constexpr int kSide = 240;  ///< pixels of the DEM that are shown, from its left side
constexpr int kTop = 50;    ///< the first row shown
constexpr int kOversampling = 8;
constexpr double kAltitude = 785000.0;
constexpr double kBehindZero = 1e-9;  ///< an offset of exactly 0 would be replaced

/// The DEM in metres around the central meridian; its file tells degrees.
class DemReader : public datasources::BasicReader
{
public:
    explicit DemReader(const std::string& oFile)
        : BasicReader(oFile, {1}, 0), moMap(500000.0 - 0.5 * kSide * kPixel, kPixel, 0.0, -kPixel)
    {
    }
    const ogc::cs::GeocodingInfo& GetGeocodingInfo() const override { return moMap; }

private:
    ogc::cs::GeocodingInfo moMap;
};

/// An image and its masks.
struct Simulation
{
    GreyImage moImage;
    GreyImage moLayover;
    GreyImage moShadow;
};

/// Keeps the rows of one result of the simulation on the map.
class ImageWriter : public datasources::IRasterWriter
{
public:
    ImageWriter(const tessel::DataType& oType, GreyImage& oImage) : moType(oType), moImage(oImage)
    {
        moImage = {kSide, kSide, std::vector<double>(std::size_t{kSide} * kSide)};
    }

    unsigned int GetWidth() const override { return kSide; }
    unsigned int GetHeight() const override { return kSide; }
    unsigned int GetChannelCount() const override { return 1; }
    tessel::DataType GetDataType() const override { return moType; }
    void ReadRaster(tessel::Raster* /*poRaster*/) override {}
    void WriteRaster(const tessel::Raster* poRaster) override
    {
        for (std::uint32_t x = 0; x < kSide; ++x)
        {
            moImage.At(x, poRaster->mnOffsetY - kTop) =
                moType.mbFloat ? static_cast<double>(*poRaster->GetPixelAs<float>(x, 0))
                               : *poRaster->GetPixel(x, 0);
        }
    }

private:
    tessel::DataType moType;
    GreyImage& moImage;
};

Simulation OnTheMap(DemReader& oDem, double dfHeading, double dfLook)
{
    Simulation oResult;
    ImageWriter oImage(tessel::eDT_32R, oResult.moImage);
    ImageWriter oLayover(tessel::eDT_8U, oResult.moLayover);
    ImageWriter oShadow(tessel::eDT_8U, oResult.moShadow);
    filters::Sarsim2 oSimulator({0, kTop, kSide, kSide}, {1.0, kBehindZero}, {kAltitude},
                                {dfHeading}, {dfLook}, {}, {kOversampling}, nullptr);
    oSimulator.Process(&oDem, &oImage, &oLayover, &oShadow);
    return oResult;
}

GreyImage BitmapOf(datasources::IDataset& oDataset, unsigned int nBitmap)
{
    datasources::BitmapReader oReader(dynamic_cast<datasources::IBitmapDataset*>(&oDataset),
                                      nBitmap);
    tessel::Raster oBits({oReader.GetWidth(), oReader.GetHeight(), 1, tessel::eDT_8U}, {});
    oReader.ReadRaster(&oBits);
    return {oBits.mnWidth, oBits.mnHeight, {oBits.mpBuffer, oBits.mpBuffer + oBits.mnBufferSize}};
}

Simulation InRadarGeometry(DemReader& oDem, double dfHeading, double dfLook)
{
    filters::SarSim1 oSimulator({1}, {0, kTop, kSide, kSide}, {1.0, kBehindZero}, {-32768.0},
                                {kPixel, kPixel}, {kAltitude}, {dfHeading}, {dfLook}, {},
                                {kOversampling});
    oSimulator.Process(oDem);
    const std::string oFile =
        (std::filesystem::temp_directory_path() / "kor_gallery.kordsk").string();
    std::filesystem::remove(oFile);
    oSimulator.Output(oFile);
    Simulation oResult;
    {
        const std::unique_ptr<datasources::IDataset> poMade(
            datasources::DatasetManager::GetInstance()->Open(oFile, 0));
        oResult = {ReadChannel(oFile, 1), BitmapOf(*poMade, 1), BitmapOf(*poMade, 2)};
    }
    std::filesystem::remove(oFile);
    return oResult;
}

/// The image in grey, layover in orange, shadow in blue.
void WriteMarked(const std::string& oFile, const Simulation& oResult, const Scale& oScale)
{
    constexpr double kLayover[] = {255.0, 140.0, 0.0};
    constexpr double kShadow[] = {40.0, 110.0, 255.0};
    constexpr double kShare = 0.6;
    const GreyImage& oImage = oResult.moImage;
    tessel::Raster oPixels({oImage.mnWidth, oImage.mnHeight, 3, tessel::eDT_8U}, {});
    for (std::uint32_t y = 0; y < oImage.mnHeight; ++y)
    {
        for (std::uint32_t x = 0; x < oImage.mnWidth; ++x)
        {
            const double dfGrey = 255.0 * std::clamp((oImage.At(x, y) - oScale.mdfBlack) /
                                                         (oScale.mdfWhite - oScale.mdfBlack),
                                                     0.0, 1.0);
            const double* pdfMark = oResult.moLayover.At(x, y) != 0.0  ? kLayover
                                    : oResult.moShadow.At(x, y) != 0.0 ? kShadow
                                                                       : nullptr;
            for (std::uint32_t c = 0; c < 3; ++c)
            {
                const double dfColour =
                    pdfMark == nullptr ? dfGrey : kShare * pdfMark[c] + (1.0 - kShare) * dfGrey;
                oPixels.GetPixel(x, y)[c] = static_cast<unsigned char>(dfColour + 0.5);
            }
        }
    }
    datasources::WritePng(oFile, oPixels);
}

double PerCent(const GreyImage& oMask)
{
    return 100.0 *
           static_cast<double>(
               std::count(oMask.mvdfSamples.begin(), oMask.mvdfSamples.end(), 1.0)) /
           static_cast<double>(oMask.mvdfSamples.size());
}

}  // namespace

void MakeSimulationPage(const std::string& oFile, const std::filesystem::path& oFolder)
{
    const GreyImage oElevations = Crop(ReadChannel(oFile, 1), {0, kTop, kSide, kSide});
    WritePicture((oFolder / "dem.png").string(), oElevations, ScaleOf(oElevations), 1);
    DemReader oDem(oFile);
    // Black to twice the mean, which is flat ground.
    constexpr double kFlat = kOversampling * kOversampling;
    std::printf(
        "| heading | look angle | radar image | layover | shadow |\n|---|---|---|---|---|\n");
    for (const int nLook : {15, 55})
    {
        for (const int nHeading : {0, 90, 180, 270})
        {
            const Simulation oResult = InRadarGeometry(oDem, nHeading, nLook);
            const std::string oName =
                "radar_" + std::to_string(nHeading) + "_" + std::to_string(nLook) + ".png";
            WriteMarked((oFolder / oName).string(), oResult, {0.0, 2.0 * kFlat});
            std::printf("| %d° | %d° | %u x %u | %.2f %% | %.2f %% |\n", nHeading, nLook,
                        oResult.moImage.mnWidth, oResult.moImage.mnHeight,
                        PerCent(oResult.moLayover), PerCent(oResult.moShadow));
        }
    }
    for (const int nHeading : {0, 180})
    {
        WriteMarked((oFolder / ("map_" + std::to_string(nHeading) + ".png")).string(),
                    OnTheMap(oDem, nHeading, 23), {0.0, 2.0 * kFlat});
    }
}

}  // namespace kor::gallery
