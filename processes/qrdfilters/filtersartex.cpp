#include "processes/qrdfilters/filtersartex.h"

#include <algorithm>
#include <array>
#include <cstdint>
#include <source_location>
#include <span>

#include "platform/exception/exception.h"
#include "processes/qrdfilters/background.h"
#include "processes/qrdfilters/blockcontract.h"
#include "processes/qrdfilters/kernels/texturerows.h"
#include "processes/qrdfilters/slidingwindow.h"

namespace kor::filters
{

namespace
{

constexpr const char* kSource = "processes/qrdfilters/filtersartex";

void Require(bool bHolds, const char* pszMessage,
             const std::source_location& oWhere = std::source_location::current())
{
    if (!bHolds)
    {
        throw Exception(pszMessage, kSource, oWhere.function_name(), oWhere.line());
    }
}

void RequireSize(unsigned int nSize,
                 const std::source_location& oWhere = std::source_location::current())
{
    constexpr unsigned int kSmallest = 3;
    constexpr unsigned int kLargest = 101;
    Require(nSize % 2 == 1 && nSize >= kSmallest && nSize <= kLargest,
            "the filter size must be odd numbers and must be at least 3 and maximum 101. \n",
            oWhere);
}

/// What a texture sums over its windows, and what it makes of the sums.
struct Texture
{
    SarTextureType meType;
    std::array<WindowTerm, 2> maoTerms;
    void (*mpfnFinish)(const double* pFirst, const double* pSecond, const double* pCounts,
                       std::span<double> vdfOut);
};

constexpr Texture kTextures[] = {
    {eSarIntensityVariation, {kSumOfSquaresTerm, kSumTerm}, kernels::VariationRow},
    {eSarAmplitudeVariation,
     {kSumTerm, WindowTerm{kernels::SquareRootRow, false}},
     kernels::VariationRow},
    {eSarLogVariance,
     {WindowTerm{kernels::BoundedLogRow, true}, WindowTerm{kernels::BoundedLogRow, false}},
     kernels::LogVarianceRow},
    {eSarLogMeanRatio, {kSumTerm, WindowTerm{kernels::LogRow, false}}, kernels::LogMeanRatioRow},
};

/// Writes one texture into channel nChannel of the output, row by row as the sums come.
void WriteTexture(const Texture& oTexture, const tessel::Raster& oIn, const tessel::Mask* poMaskIn,
                  std::size_t nChannel, tessel::Raster& oOut, const tessel::Mask* poMaskOut)
{
    std::vector<double> vdfResults;
    std::vector<unsigned char> vComputed;
    const auto oWrite = [&](const WindowStatistics& oStatistics)
    {
        vdfResults.resize(oStatistics.GetPadded());
        oTexture.mpfnFinish(oStatistics.mapSums[0], oStatistics.mapSums[1], oStatistics.mpCounts,
                            vdfResults);
        vComputed.resize(oStatistics.mnSamples);
        const auto x = static_cast<std::int64_t>(oStatistics.mnFirst);
        FindComputedPixels(poMaskIn, poMaskOut, x, oStatistics.mnRow, vComputed);
        double* pOut = oOut.GetPixelAs<double>(x, oStatistics.mnRow) + nChannel;
        for (std::size_t i = 0; i < oStatistics.mnSamples; ++i)
        {
            pOut[i * oOut.mnChannels] = vComputed[i] != 0 ? vdfResults[i] : 0.0;
        }
    };
    ScanWindows<double>(oIn, poMaskIn, WindowOfMargins(oIn), oTexture.maoTerms, oWrite);
}

}  // namespace

void FilterSartex::SetTextures(const std::vector<SarTextureType>& oTextures)
{
    for (auto itTexture = oTextures.begin(); itTexture != oTextures.end(); ++itTexture)
    {
        Require(std::find(itTexture + 1, oTextures.end(), *itTexture) == oTextures.end(),
                "Duplicate texture in the list of requested textures.");
    }
    moTextures = oTextures;
}

void FilterSartex::SetFilterSizeX(unsigned int nSizeX)
{
    RequireSize(nSizeX);
    mnFilterSizeX = nSizeX;
}

void FilterSartex::SetFilterSizeY(unsigned int nSizeY)
{
    RequireSize(nSizeY);
    mnFilterSizeY = nSizeY;
}

void FilterSartex::SetBGZero(bool bBGZero)
{
    mbBGZero = bBGZero;
}

bool FilterSartex::DoConvertBack() const
{
    return false;
}

void FilterSartex::Process(tessel::Raster* poRasterIn, tessel::Mask* poMaskIn,
                           tessel::Raster* poRasterOut, tessel::Mask* poMaskOut) const
{
    ProcessBlock(poRasterIn, poMaskIn, poRasterOut, poMaskOut);
}

void FilterSartex::ProcessBlock(tessel::Raster* poRasterIn, tessel::Mask* poMaskIn,
                                tessel::Raster* poRasterOut, tessel::Mask* poMaskOut) const
{
    const Window oWindow = WindowOfMargins(*poRasterIn);
    Require(oWindow.GetWidth() >= mnFilterSizeX && oWindow.GetHeight() >= mnFilterSizeY,
            "The margins in the input raster are too small according to the requested filter "
            "size.");
    Require(poRasterIn->mnChannels < 2,
            "The input raster should have only 1 channel to process Sartex");
    Require(poRasterOut->mnChannels == moTextures.size(),
            "The number of output channels don't match the number of requested textures");

    RequireType(*poRasterOut, tessel::eDT_64R, "poRasterOut", kSource);
    RequireMatchingSizes(*poRasterIn, poMaskIn, *poRasterOut, poMaskOut, kSource);

    for (std::size_t i = 0; i < moTextures.size(); ++i)
    {
        const auto* poTexture = std::find_if(std::begin(kTextures), std::end(kTextures),
                                             [&](const Texture& oCandidate)
                                             { return oCandidate.meType == moTextures[i]; });
        Require(poTexture != std::end(kTextures), "Invalid Texture");
        WriteTexture(*poTexture, *poRasterIn, poMaskIn, i, *poRasterOut, poMaskOut);
    }
}

}  // namespace kor::filters
