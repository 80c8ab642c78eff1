#include "docs/gallery/quality.h"

#include <algorithm>
#include <cmath>
#include <numeric>

namespace kor::gallery
{

namespace
{

double MeanOf(const std::vector<double>& vdfSamples)
{
    return std::accumulate(vdfSamples.begin(), vdfSamples.end(), 0.0) /
           static_cast<double>(vdfSamples.size());
}

std::vector<double> LaplacianOf(const GreyImage& oImage)
{
    std::vector<double> vdfEdges;
    for (std::uint32_t y = 1; y + 1 < oImage.mnHeight; ++y)
    {
        for (std::uint32_t x = 1; x + 1 < oImage.mnWidth; ++x)
        {
            vdfEdges.push_back(4.0 * oImage.At(x, y) - oImage.At(x - 1, y) - oImage.At(x + 1, y) -
                               oImage.At(x, y - 1) - oImage.At(x, y + 1));
        }
    }
    return vdfEdges;
}

double SumOfGradients(const GreyImage& oImage)
{
    double dfSum = 0.0;
    for (std::uint32_t y = 0; y + 1 < oImage.mnHeight; ++y)
    {
        for (std::uint32_t x = 0; x + 1 < oImage.mnWidth; ++x)
        {
            dfSum += std::abs(oImage.At(x + 1, y) - oImage.At(x, y)) +
                     std::abs(oImage.At(x, y + 1) - oImage.At(x, y));
        }
    }
    return dfSum;
}

}  // namespace

double EquivalentLooks(const GreyImage& oImage, const Area& oArea)
{
    const std::vector<double> vdfSamples = Crop(oImage, oArea).mvdfSamples;
    const double dfMean = MeanOf(vdfSamples);
    double dfSquares = 0.0;
    for (const double dfSample : vdfSamples)
    {
        dfSquares += (dfSample - dfMean) * (dfSample - dfMean);
    }
    return dfMean * dfMean / (dfSquares / static_cast<double>(vdfSamples.size() - 1));
}

double MeanRatio(const GreyImage& oImage, const GreyImage& oReference)
{
    return MeanOf(oImage.mvdfSamples) / MeanOf(oReference.mvdfSamples);
}

double PeakSignalToNoise(const GreyImage& oImage, const GreyImage& oTruth)
{
    double dfSquares = 0.0;
    for (std::size_t i = 0; i < oTruth.mvdfSamples.size(); ++i)
    {
        const double dfError = oImage.mvdfSamples[i] - oTruth.mvdfSamples[i];
        dfSquares += dfError * dfError;
    }
    const double dfPeak = *std::max_element(oTruth.mvdfSamples.begin(), oTruth.mvdfSamples.end());
    return 10.0 *
           std::log10(dfPeak * dfPeak * static_cast<double>(oTruth.mvdfSamples.size()) / dfSquares);
}

double EdgeCorrelation(const GreyImage& oImage, const GreyImage& oTruth)
{
    const std::vector<double> vdfImage = LaplacianOf(oImage);
    const std::vector<double> vdfTruth = LaplacianOf(oTruth);
    const double dfImageMean = MeanOf(vdfImage);
    const double dfTruthMean = MeanOf(vdfTruth);
    double dfProducts = 0.0;
    double dfImageSquares = 0.0;
    double dfTruthSquares = 0.0;
    for (std::size_t i = 0; i < vdfImage.size(); ++i)
    {
        const double dfImage = vdfImage[i] - dfImageMean;
        const double dfTruth = vdfTruth[i] - dfTruthMean;
        dfProducts += dfImage * dfTruth;
        dfImageSquares += dfImage * dfImage;
        dfTruthSquares += dfTruth * dfTruth;
    }
    return dfProducts / std::sqrt(dfImageSquares * dfTruthSquares);
}

double GradientRatio(const GreyImage& oImage, const GreyImage& oReference)
{
    return SumOfGradients(oImage) / SumOfGradients(oReference);
}

}  // namespace kor::gallery
