#include "docs/gallery/greyimage.h"

#include <algorithm>
#include <cmath>
#include <memory>
#include <stdexcept>

#include "examples/filterfile/filtertable.h"
#include "platform/datasources/basicreader.h"
#include "platform/datasources/gdal/gdaldriver.h"
#include "platform/tessel/complexinterpretation.h"
#include "processes/qrdfilters/convertraster.h"

namespace kor::gallery
{

using tessel::Raster;
using tessel::RasterContext;
using tessel::RasterInfo;

namespace
{

RasterInfo DoublesOf(const GreyImage& oImage, std::uint32_t nChannels = 1)
{
    return {oImage.mnWidth, oImage.mnHeight, nChannels, tessel::eDT_64R};
}

/// The image with margins that repeat the nearest pixel.
std::unique_ptr<Raster> BlockOf(const GreyImage& oImage, const filters::Window& oWindow)
{
    auto poBlock = std::make_unique<Raster>(DoublesOf(oImage),
                                            RasterContext(oWindow.mnHalfX, oWindow.mnHalfY, 0, 0));
    auto* pdfOut = reinterpret_cast<double*>(poBlock->mpBuffer);
    const auto oNearest = [](std::int64_t n, std::uint32_t nSize)
    { return static_cast<std::uint32_t>(std::clamp<std::int64_t>(n, 0, nSize - 1)); };
    for (std::int64_t y = 0; y < poBlock->mnTotalHeight; ++y)
    {
        for (std::int64_t x = 0; x < poBlock->mnTotalWidth; ++x)
        {
            *pdfOut++ = oImage.At(oNearest(x - oWindow.mnHalfX, oImage.mnWidth),
                                  oNearest(y - oWindow.mnHalfY, oImage.mnHeight));
        }
    }
    return poBlock;
}

/// The first channel of a block.
GreyImage ImageOf(const Raster& oBlock)
{
    Raster oDoubles({oBlock.mnWidth, oBlock.mnHeight, oBlock.mnChannels, tessel::eDT_64R}, {});
    filters::ConvertRaster(&oBlock, &oDoubles);
    GreyImage oImage{oBlock.mnWidth, oBlock.mnHeight, {}};
    for (std::uint32_t y = 0; y < oBlock.mnHeight; ++y)
    {
        for (std::uint32_t x = 0; x < oBlock.mnWidth; ++x)
        {
            oImage.mvdfSamples.push_back(*oDoubles.GetPixelAs<double>(x, y));
        }
    }
    return oImage;
}

unsigned char Tone(double dfSample, const Scale& oScale)
{
    const double dfShare = (dfSample - oScale.mdfBlack) / (oScale.mdfWhite - oScale.mdfBlack);
    return static_cast<unsigned char>(
        std::isnan(dfShare) ? 0.0 : std::clamp(dfShare, 0.0, 1.0) * 255.0 + 0.5);
}

}  // namespace

GreyImage Crop(const GreyImage& oImage, const Area& oArea)
{
    if (oArea.x + oArea.mnWidth > oImage.mnWidth || oArea.y + oArea.mnHeight > oImage.mnHeight)
    {
        throw std::runtime_error("the image is smaller than the area that is wanted of it");
    }
    GreyImage oCrop{oArea.mnWidth, oArea.mnHeight, {}};
    for (std::uint32_t y = 0; y < oArea.mnHeight; ++y)
    {
        const auto oRow = oImage.mvdfSamples.begin() +
                          static_cast<std::ptrdiff_t>(std::size_t{oArea.y + y} * oImage.mnWidth) +
                          oArea.x;
        oCrop.mvdfSamples.insert(oCrop.mvdfSamples.end(), oRow, oRow + oArea.mnWidth);
    }
    return oCrop;
}

GreyImage ReadChannel(const std::string& oFile, unsigned int nChannel)
{
    datasources::BasicReader oReader(oFile, {nChannel}, 0);
    Raster oBlock({oReader.GetWidth(), oReader.GetHeight(), 1, oReader.GetDataType()}, {});
    oReader.ReadRaster(&oBlock);
    if (!oBlock.moDataType.mbComplex)
    {
        return ImageOf(oBlock);
    }
    const std::unique_ptr<Raster> poIntensity(
        tessel::ComplexInterpretation().InterpretRaster(&oBlock, tessel::eKIT_Intensity));
    return ImageOf(*poIntensity);
}

GreyImage Filtered(const GreyImage& oImage, const std::string& oFilter,
                   const std::vector<std::string>& voWords)
{
    std::vector<std::string> voCopies = voWords;
    std::vector<char*> vpszWords;
    for (std::string& oWord : voCopies)
    {
        vpszWords.push_back(oWord.data());
    }
    examples::Arguments oArguments(vpszWords);
    const examples::PreparedFilter oPrepared =
        examples::FindFilter(oFilter).mpfnMake(oArguments, DoublesOf(oImage));
    oArguments.RequireNothingLeft();
    const auto poIn =
        BlockOf(oImage, oPrepared.moAlgorithm.GetWindow().value_or(filters::Window()));
    Raster oOut(DoublesOf(oImage, oPrepared.mnChannels.value_or(1)), {});
    oPrepared.moAlgorithm.Process(poIn.get(), nullptr, &oOut);
    return ImageOf(oOut);
}

Scale ScaleOf(const GreyImage& oImage)
{
    std::vector<double> vdfSorted = oImage.mvdfSamples;
    std::sort(vdfSorted.begin(), vdfSorted.end());
    const double dfBlack = vdfSorted[vdfSorted.size() / 100];
    const double dfWhite = vdfSorted[vdfSorted.size() - 1 - vdfSorted.size() / 100];
    return {dfBlack, dfWhite > dfBlack ? dfWhite : dfBlack + 1.0};
}

void WritePicture(const std::string& oFile, const GreyImage& oImage, const Scale& oScale,
                  std::uint32_t nZoom)
{
    Raster oPixels({oImage.mnWidth * nZoom, oImage.mnHeight * nZoom, 1, tessel::eDT_8U}, {});
    for (std::uint32_t y = 0; y < oPixels.mnHeight; ++y)
    {
        for (std::uint32_t x = 0; x < oPixels.mnWidth; ++x)
        {
            *oPixels.GetPixel(x, y) = Tone(oImage.At(x / nZoom, y / nZoom), oScale);
        }
    }
    datasources::WritePng(oFile, oPixels);
}

void WriteComposite(const std::string& oFile, const std::array<Colour, 3>& aoColours)
{
    const GreyImage& oSize = aoColours[0].moImage;
    Raster oPixels({oSize.mnWidth, oSize.mnHeight, 3, tessel::eDT_8U}, {});
    for (std::uint32_t y = 0; y < oPixels.mnHeight; ++y)
    {
        for (std::uint32_t x = 0; x < oPixels.mnWidth; ++x)
        {
            for (std::size_t c = 0; c < 3; ++c)
            {
                oPixels.GetPixel(x, y)[c] =
                    Tone(aoColours[c].moImage.At(x, y), aoColours[c].moScale);
            }
        }
    }
    datasources::WritePng(oFile, oPixels);
}

}  // namespace kor::gallery
