// Smooths an image file by the mean and by the median of 5 x 5 pixels, and shows the result.
//
//     demo FILE FOLDER
//
// writes to FOLDER average.tif and median.tif, which keep the file's type, georeference, channel
// descriptions and no-data value, and before.png, average.png and median.png to look at. The image
// goes through memory in strips, so that its size does not matter.

#include <unistd.h>

#include <algorithm>
#include <chrono>
#include <cstdint>
#include <cstdio>
#include <filesystem>
#include <iostream>
#include <memory>
#include <numeric>
#include <stdexcept>
#include <string>
#include <system_error>
#include <utility>
#include <vector>

#include "basic/tessel/mask/mask.h"
#include "basic/tessel/raster/raster.h"
#include "examples/picture.h"
#include "platform/datasources/basicreader.h"
#include "platform/datasources/basicwriter.h"
#include "platform/datasources/datasetmanager.h"
#include "platform/datasources/gdal/gdaldriver.h"
#include "platform/exception/exception.h"
#include "platform/tessel/complexinterpretation.h"
#include "processes/qrdfilters/convertraster.h"
#include "processes/qrdfilters/filteraverage.h"
#include "processes/qrdfilters/filtermedian.h"
#include "processes/qrdfilters/validmaskbuilder.h"

namespace
{

using namespace kor;
using examples::Picture;
using tessel::Mask;
using tessel::Raster;
using tessel::RasterContext;
using tessel::RasterInfo;

constexpr std::uint32_t kHalfWindow = 2;  // a window of 5 x 5 pixels
constexpr std::uint64_t kStripBytes = 64 << 20;

std::vector<unsigned int> ChannelsUpTo(unsigned int nCount)
{
    std::vector<unsigned int> vnChannels(nCount);
    std::iota(vnChannels.begin(), vnChannels.end(), 1U);
    return vnChannels;
}

/// The same block with another type.
std::unique_ptr<Raster> Converted(const Raster& oRaster, const tessel::DataType& oType)
{
    RasterInfo oInfo = oRaster;
    oInfo.moDataType = oType;
    auto poConverted = std::make_unique<Raster>(oInfo, RasterContext(oRaster));
    filters::ConvertRaster(&oRaster, poConverted.get());
    return poConverted;
}

/// A block without margins for what becomes of oRaster.
std::unique_ptr<Raster> InnerBlock(const Raster& oRaster)
{
    return std::make_unique<Raster>(RasterInfo(oRaster),
                                    RasterContext(0, 0, oRaster.mnOffsetX, oRaster.mnOffsetY));
}

/// The image to be smoothed, read strip by strip.
class Source
{
public:
    explicit Source(const std::string& oFile)
        : mpoDataset(datasources::DatasetManager::GetInstance()->Open(oFile, 0)),
          moReader(mpoDataset.get(), ChannelsUpTo(CountChannels(*mpoDataset, oFile))),
          moType(ReadStrip(0, 1)->moDataType)
    {
    }

    /// Rows nFirst to nFirst + nRows - 1 with the margins of the window. Complex samples are seen
    /// as their magnitudes.
    std::unique_ptr<Raster> ReadStrip(std::uint32_t nFirst, std::uint32_t nRows)
    {
        auto poStrip =
            std::make_unique<Raster>(RasterInfo(moReader.GetWidth(), nRows,
                                                moReader.GetChannelCount(), moReader.GetDataType()),
                                     RasterContext(kHalfWindow, kHalfWindow, 0, nFirst));
        moReader.ReadRaster(poStrip.get());
        if (poStrip->moDataType.mbComplex)
        {
            poStrip.reset(tessel::ComplexInterpretation().InterpretRaster(poStrip.get(),
                                                                          tessel::eKIT_Magnitude));
        }
        return poStrip;
    }

    std::uint32_t StripRows() const
    {
        const std::uint64_t nRowBytes =
            std::uint64_t{moReader.GetWidth()} * moReader.GetChannelCount() * sizeof(double);
        const std::uint64_t nRows = kStripBytes / std::max<std::uint64_t>(nRowBytes, 1);
        return static_cast<std::uint32_t>(
            std::clamp<std::uint64_t>(nRows, 1, moReader.GetHeight()));
    }

    /// Size, channels and type of the results.
    RasterInfo GetInfo() const
    {
        return {moReader.GetWidth(), moReader.GetHeight(), moReader.GetChannelCount(), moType};
    }
    const datasources::BasicReader& GetReader() const { return moReader; }
    /// The values that the file names for missing data, of whichever channel.
    std::vector<double> GetNoData() const
    {
        const datasources::AuxiliaryData oData = moReader.GetAuxiliaryData();
        std::vector<double> vdfNoData;
        for (const auto& [nChannel, oChannel] : oData.GetChannels())
        {
            if (oChannel.mdfNoData)
            {
                vdfNoData.push_back(*oChannel.mdfNoData);
            }
        }
        return vdfNoData;
    }

private:
    static unsigned int CountChannels(const datasources::IDataset& oDataset,
                                      const std::string& oFile)
    {
        const auto* poImage = dynamic_cast<const datasources::IRasterDataset*>(&oDataset);
        if (poImage == nullptr || poImage->GetChannelCount() == 0)
        {
            throw std::runtime_error(oFile + " holds no image channels");
        }
        return poImage->GetChannelCount();
    }

    std::unique_ptr<datasources::IDataset> mpoDataset;
    datasources::BasicReader moReader;
    tessel::DataType moType;
};

/// A GeoTIFF that comes under its name only when it is complete.
class Target
{
public:
    Target(std::filesystem::path oFile, const Source& oSource)
        : moFile(std::move(oFile)),
          moUnfinished(moFile.string() + "." + std::to_string(getpid()) + ".part")
    {
        mpoDataset.reset(datasources::DatasetManager::GetInstance()->NewDataset(
            moUnfinished.string(), "GTiff", "COMPRESS=DEFLATE BIGTIFF=IF_SAFER"));
        auto& oImage = dynamic_cast<datasources::IRasterDataset&>(*mpoDataset);
        oImage.CreateChannels(oSource.GetInfo());
        oImage.SetGeocodingInfo(oSource.GetReader().GetGeocodingInfo());
        oImage.SetAuxiliaryData(oSource.GetReader().GetAuxiliaryData());
        mpoWriter = std::make_unique<datasources::BasicWriter>(
            &oImage, ChannelsUpTo(oSource.GetInfo().mnChannels));
    }
    Target(const Target&) = delete;
    Target& operator=(const Target&) = delete;
    ~Target()
    {
        mpoWriter.reset();
        mpoDataset.reset();
        std::error_code oIgnored;  // nothing is left of it after Finish
        std::filesystem::remove(moUnfinished, oIgnored);
    }

    void Write(const Raster& oStrip) { mpoWriter->WriteRaster(&oStrip); }

    void Finish()
    {
        mpoWriter->Flush();
        mpoWriter.reset();
        mpoDataset.reset();
        std::filesystem::rename(moUnfinished, moFile);
    }

private:
    std::filesystem::path moFile;
    std::filesystem::path moUnfinished;
    std::unique_ptr<datasources::IDataset> mpoDataset;
    std::unique_ptr<datasources::BasicWriter> mpoWriter;
};

/// One filter's share of the demo: what it writes, and the time it took.
class Result
{
public:
    Result(const std::filesystem::path& oFolder, const std::string& oName, const Source& oSource)
        : moName(oName),
          moPictureFile(oFolder / (oName + ".png")),
          moTarget(oFolder / (oName + ".tif"), oSource),
          moPicture(oSource.GetInfo())
    {
    }

    /// Runs the filter from oIn to a new block of the same type. The fastest of three runs counts:
    /// the first one pays for threads and fresh memory.
    template <class Filter>
    std::unique_ptr<Raster> Run(const Filter& oFilter, Raster& oIn, Mask* poMask)
    {
        using Clock = std::chrono::steady_clock;
        auto poOut = InnerBlock(oIn);
        auto oFastest = Clock::duration::max();
        for (int i = 0; i < 3; ++i)
        {
            const Clock::time_point oStart = Clock::now();
            oFilter.Process(&oIn, poMask, poOut.get(), nullptr);
            oFastest = std::min(oFastest, Clock::now() - oStart);
        }
        moTime += oFastest;
        return poOut;
    }

    void Take(const Raster& oStrip, const Raster& oDoubles, const Mask* poMask)
    {
        moTarget.Write(oStrip);
        moPicture.Add(oDoubles, poMask);
    }

    void Finish(const Picture& oScale)
    {
        moTarget.Finish();
        moPicture.Write(moPictureFile, oScale);
    }

    void Report(const RasterInfo& oImage, const char* pszSamples) const
    {
        const double dfPixels = static_cast<double>(oImage.mnWidth) * oImage.mnHeight;
        std::printf("%-14s5 x 5 pixels, %s: %.1f ms, %.1f Mpixel/s of %u channel%s\n",
                    moName.c_str(), pszSamples, moTime.count() * 1e3,
                    dfPixels / moTime.count() / 1e6, oImage.mnChannels,
                    oImage.mnChannels == 1 ? "" : "s");
    }

private:
    std::string moName;
    std::filesystem::path moPictureFile;
    Target moTarget;
    Picture moPicture;
    std::chrono::duration<double> moTime{0};
};

std::string TypeName(const tessel::DataType& oType)
{
    return std::string(oType.mbComplex ? "C" : "") + std::to_string(oType.mnBits) +
           (oType.mbFloat    ? "R"
            : oType.mbSigned ? "S"
                             : "U");
}

/// The first name in the text of a coordinate system.
std::string SystemName(const std::string& oWkt)
{
    const std::size_t nOpen = oWkt.find('"');
    const std::size_t nClose = oWkt.find('"', nOpen + 1);
    return nClose == std::string::npos ? "no coordinate system"
                                       : oWkt.substr(nOpen + 1, nClose - nOpen - 1);
}

void ReportSource(const std::string& oFile, const Source& oSource)
{
    const datasources::BasicReader& oReader = oSource.GetReader();
    const ogc::cs::GeocodingInfo& oPlace = oReader.GetGeocodingInfo();
    std::printf("%s\n", oFile.c_str());
    std::printf("%-14s%u x %u pixels, %u channel%s of type %s\n", "image", oReader.GetWidth(),
                oReader.GetHeight(), oReader.GetChannelCount(),
                oReader.GetChannelCount() == 1 ? "" : "s", TypeName(oReader.GetDataType()).c_str());
    std::printf("%-14s%s; corner at %.12g, %.12g; a pixel is %.6g by %.6g\n", "georeference",
                SystemName(oPlace.GetProjection()).c_str(), oPlace.GetXOffset(),
                oPlace.GetYOffset(), oPlace.GetXPerCol(), oPlace.GetYPerRow());
    const std::vector<double> vdfNoData = oSource.GetNoData();
    if (vdfNoData.empty())
    {
        std::printf("%-14s%s\n", "no data",
                    oSource.GetInfo().moDataType.mbFloat
                        ? "no value named; only samples that are not finite are masked"
                        : "no value named, so every pixel counts");
        return;
    }
    std::printf("%-14s%g: pixels with it in any channel enter no window and stay as they are\n",
                "no data", vdfNoData.front());
}

void Smooth(const std::string& oFile, const std::filesystem::path& oFolder)
{
    Source oSource(oFile);
    const RasterInfo oImage = oSource.GetInfo();
    ReportSource(oFile, oSource);

    std::filesystem::create_directories(oFolder);
    Result oAverage(oFolder, "average", oSource);
    Result oMedian(oFolder, "median", oSource);
    Picture oBefore(oImage);
    const filters::FilterAverage oAverageFilter(false);  // masked pixels keep their values
    filters::FilterMedian oMedianFilter;
    oMedianFilter.SetBGZero(false);
    const filters::ValidMaskBuilder oMaskBuilder(oSource.GetNoData());
    const bool bMasked = oImage.moDataType.mbFloat || !oSource.GetNoData().empty();

    for (std::uint32_t y = 0; y < oImage.mnHeight; y += oSource.StripRows())
    {
        const auto poStrip =
            oSource.ReadStrip(y, std::min(oSource.StripRows(), oImage.mnHeight - y));
        const auto poDoubles = Converted(*poStrip, tessel::eDT_64R);
        const std::unique_ptr<Mask> poMask(bMasked ? oMaskBuilder.BuildMask(*poStrip) : nullptr);
        oBefore.Add(*poDoubles, poMask.get());

        // The average works on doubles, the median on samples of any type.
        const auto poMean = oAverage.Run(oAverageFilter, *poDoubles, poMask.get());
        oAverage.Take(*Converted(*poMean, oImage.moDataType), *poMean, poMask.get());

        const auto poMiddle = oMedian.Run(oMedianFilter, *poStrip, poMask.get());
        oMedian.Take(*poMiddle, *Converted(*poMiddle, tessel::eDT_64R), poMask.get());
    }

    oAverage.Finish(oBefore);
    oMedian.Finish(oBefore);
    oBefore.Write(oFolder / "before.png", oBefore);
    oAverage.Report(oImage, "doubles");
    oMedian.Report(oImage, TypeName(oImage.moDataType).c_str());
    std::printf("%-14s%s\n", "pictures", oBefore.Describe().c_str());
    std::printf("%-14s%s: average.tif median.tif before.png average.png median.png\n", "written to",
                oFolder.c_str());
}

}  // namespace

int main(int nArguments, char* apszArguments[])
{
    if (nArguments != 3)
    {
        std::cerr << "Usage: demo FILE FOLDER\n";
        return 1;
    }
    try
    {
        datasources::RegisterGdalDriver();
        Smooth(apszArguments[1], apszArguments[2]);
    }
    catch (const std::exception& oError)
    {
        std::cerr << "demo: " << oError.what() << '\n';
        return 1;
    }
    return 0;
}
