// What bench/files.sh needs of the library:
//
//     largeimage make FILE SIDE           a KORDSK file of SIDE x SIDE random 16-bit samples, and
//                                         FILE.vrt, by which GDAL reads the same bytes
//     largeimage verify IN OUT            OUT is the 7 x 7 mean of IN: crops of it are filtered in
//                                         one block each and compared sample by sample
//     largeimage copy IN OUT              CopyBands

#include <algorithm>
#include <cstdint>
#include <cstdio>
#include <cstring>
#include <iostream>
#include <memory>
#include <random>
#include <stdexcept>
#include <string>

#include "platform/datasources/basicreader.h"
#include "platform/datasources/basicwriter.h"
#include "platform/datasources/datasetmanager.h"
#include "platform/datasources/gdal/gdaldriver.h"
#include "platform/datasources/kordsk/writevrt.h"
#include "platform/exception/exception.h"
#include "processes/qrdfilters/convertraster.h"
#include "processes/qrdfilters/datacopy.h"
#include "processes/qrdfilters/filteraverage.h"

namespace
{

using namespace kor;
using tessel::Raster;
using tessel::RasterInfo;

void MakeImage(const std::string& oFile, std::uint32_t nSide)
{
    const std::unique_ptr<datasources::IDataset> poDataset(
        datasources::DatasetManager::GetInstance()->NewDataset(oFile, "KORDSK", ""));
    auto& oImage = dynamic_cast<datasources::IRasterDataset&>(*poDataset);
    oImage.CreateChannels({nSide, nSide, 1, tessel::eDT_16U});
    datasources::BasicWriter oWriter(&oImage, {1});
    std::mt19937_64 oRandom(20240229);
    constexpr std::uint32_t kRows = 100;
    for (std::uint32_t y = 0; y < nSide; y += kRows)
    {
        Raster oStrip({nSide, std::min(kRows, nSide - y), 1, tessel::eDT_16U}, {0, 0, 0, y});
        for (std::size_t i = 0; i + 8 <= oStrip.mnBufferSize; i += 8)
        {
            const std::uint64_t nBits = oRandom();
            std::memcpy(oStrip.mpBuffer + i, &nBits, 8);
        }
        oWriter.WriteRaster(&oStrip);
    }
    oWriter.Flush();
    datasources::WriteVrt(oFile);
}

/// The 7 x 7 mean of a crop, made of one block.
std::unique_ptr<Raster> MeanOf(datasources::BasicReader& oReader, const RasterInfo& oSize,
                               std::uint32_t x, std::uint32_t y)
{
    Raster oBlock(oSize, {3, 3, x, y});
    oReader.ReadRaster(&oBlock);
    const RasterInfo oDoubles(oSize.mnWidth, oSize.mnHeight, 1, tessel::eDT_64R);
    Raster oIn(oDoubles, {3, 3, x, y});
    Raster oOut(oDoubles, {});
    filters::ConvertRaster(&oBlock, &oIn);
    filters::FilterAverage().Process(&oIn, nullptr, &oOut, nullptr);
    auto poMean = std::make_unique<Raster>(oSize, tessel::RasterContext());
    filters::ConvertRaster(&oOut, poMean.get());
    return poMean;
}

void Verify(const std::string& oInFile, const std::string& oOutFile)
{
    datasources::BasicReader oIn(oInFile, {1}, 0);
    datasources::BasicReader oOut(oOutFile, {1}, 0);
    const std::uint32_t nSide = oIn.GetWidth();
    // A full-height column of pixels meets the seams of all strips, a full-width row those of
    // tiles.
    const std::uint32_t nShort = std::min(nSide, 500U);
    const RasterInfo aoSizes[] = {{nShort, nSide, 1, tessel::eDT_16U},
                                  {nSide, nShort, 1, tessel::eDT_16U}};
    std::uint64_t nCompared = 0;
    for (const RasterInfo& oSize : aoSizes)
    {
        for (const std::uint32_t nPlace : {0U, nSide / 3, nSide - nShort})
        {
            const std::uint32_t x = oSize.mnWidth == nSide ? 0 : nPlace;
            const std::uint32_t y = oSize.mnHeight == nSide ? 0 : nPlace;
            const auto poExpected = MeanOf(oIn, oSize, x, y);
            Raster oMade(oSize, {0, 0, x, y});
            oOut.ReadRaster(&oMade);
            if (std::memcmp(oMade.mpBuffer, poExpected->mpBuffer, oMade.mnBufferSize) != 0)
            {
                throw std::runtime_error("the crop at " + std::to_string(x) + ", " +
                                         std::to_string(y) + " differs");
            }
            nCompared += std::uint64_t{oSize.mnWidth} * oSize.mnHeight;
        }
    }
    std::printf("%.0f Mpixel of six crops equal the mean of one block each\n",
                static_cast<double>(nCompared) / 1e6);
}

}  // namespace

int main(int nArguments, char* apszArguments[])
{
    try
    {
        const std::string oJob = nArguments == 4 ? apszArguments[1] : "";
        datasources::RegisterGdalDriver();
        if (oJob == "make")
        {
            MakeImage(apszArguments[2], static_cast<std::uint32_t>(std::stoul(apszArguments[3])));
        }
        else if (oJob == "verify")
        {
            Verify(apszArguments[2], apszArguments[3]);
        }
        else if (oJob == "copy")
        {
            filters::CopyBands(apszArguments[2], apszArguments[3], {});
        }
        else
        {
            std::cerr << "Usage: largeimage make FILE SIDE | verify IN OUT | copy IN OUT\n";
            return 2;
        }
    }
    catch (const std::exception& oError)
    {
        std::cerr << "largeimage: " << oError.what() << '\n';
        return 1;
    }
    return 0;
}
