#include "processes/qrdfilters/localstatistics.h"

#include <memory>
#include <vector>

#include "processes/qrdfilters/background.h"

namespace kor::filters
{

namespace
{

/// Writes n, mean and variance of a stretch of samples.
void WriteStatistics(const WindowStatistics& oStatistics, double* pOut)
{
    for (std::size_t i = 0; i < oStatistics.mnSamples; ++i)
    {
        const double n = oStatistics.mpCounts[i];
        const double dfMean = oStatistics.mapSums[0][i] / n;
        *pOut++ = n;
        *pOut++ = dfMean;
        *pOut++ = (oStatistics.mapSums[1][i] - dfMean * n * dfMean) / (n - 1.0);
    }
}

}  // namespace

tessel::Raster* BuildLocalStatistics(const LocalStatisticsConfig& oConfig,
                                     const tessel::Raster* poRasterIn, const tessel::Mask* poMaskIn,
                                     const tessel::Mask* poMaskOut)
{
    const std::size_t nChannels = poRasterIn->mnChannels;
    auto poStatistics = std::make_unique<tessel::Raster>(
        tessel::RasterInfo(poRasterIn->mnWidth, poRasterIn->mnHeight, 3 * poRasterIn->mnChannels,
                           tessel::eDT_64R),
        tessel::RasterContext(0, 0, poRasterIn->mnOffsetX, poRasterIn->mnOffsetY));
    std::vector<unsigned char> vComputed;
    const auto oVisit = [&](const WindowStatistics& oStatistics)
    {
        const auto nPixel = static_cast<std::int64_t>(oStatistics.mnFirst / nChannels);
        double* pOut = poStatistics->GetPixelAs<double>(nPixel, oStatistics.mnRow);
        WriteStatistics(oStatistics, pOut);
        vComputed.resize(oStatistics.mnSamples / nChannels);
        FindComputedPixels(poMaskIn, poMaskOut, nPixel, oStatistics.mnRow, vComputed);
        WriteBackground<double, double>(vComputed, nullptr, 3 * nChannels, true, pOut);
    };
    ScanWindows<double>(
        *poRasterIn, poMaskIn,
        WindowOfBothSizes(oConfig.moFilterSizeX, oConfig.moFilterSizeY, *poRasterIn),
        kLocalStatisticsTerms, oVisit);
    return poStatistics.release();
}

}  // namespace kor::filters
