#include "processes/qrdfilters/engine/subblocklee.h"

#include <algorithm>
#include <cmath>

namespace kor::filters::engine
{

namespace
{

constexpr double kNearZero = 1e-9;

bool IsNearZero(double dfValue)
{
    return -kNearZero < dfValue && dfValue < kNearZero;
}

}  // namespace

SubBlockLee::SubBlockLee(LeeModel eModel, const kernels::LeeNoise& oNoise, double dfThreshold,
                         int nHalf, const tessel::Raster& oIn, const tessel::Raster* poValid)
    : meModel(eModel),
      moNoise(oNoise),
      mdfThreshold(dfThreshold),
      mbEstimate(eModel != eLM_Multiplicative && oNoise.mdfVariance == 0.0),
      mnHalf(nHalf),
      mnSide(2 * static_cast<std::size_t>(nHalf) + 1),
      moIn(oIn),
      mpoValid(poValid),
      // Sub-blocks of a window of 7 reach behind it, and find zeros there.
      mvdfWindow(std::max(mnSide * mnSide, kLeastWindow))
{
}

double SubBlockLee::Filter(std::int64_t x, std::int64_t y, std::size_t c)
{
    const double dfCentre = moIn.GetPixelAs<const double>(x, y)[c];
    LoadWindow(x, y, c);
    const double n = mdfCount;
    const double dfMean = mdfSum / n;
    if (IsNearZero(dfMean))
    {
        return 0.0;
    }
    if (n == 1.0)
    {
        return dfCentre;
    }
    // Meant: over n, and less 1. See VarianceIsOverTheCountLessOne.
    Moments oMoments{dfMean, (mdfSumOfSquares - n * dfMean * dfMean) / n - 1.0};
    if (oMoments.mdfVariance > mdfThreshold || mbEstimate)
    {
        LookIntoSubBlocks(oMoments);
    }
    return Finish(dfCentre, oMoments);
}

/// Masked pixels leave the entries of the window as they were for the sample before.
void SubBlockLee::LoadWindow(std::int64_t x, std::int64_t y, std::size_t c)
{
    mdfSum = 0.0;
    mdfSumOfSquares = 0.0;
    mdfCount = 0.0;
    if (mpoValid == nullptr)
    {
        return;
    }
    double* pEntry = mvdfWindow.data();
    for (std::int64_t r = y - mnHalf; r <= y + mnHalf; ++r)
    {
        const auto* pValid = mpoValid->GetPixelAs<const unsigned char>(x - mnHalf, r);
        const double* pSample = moIn.GetPixelAs<const double>(x - mnHalf, r) + c;
        for (std::size_t i = 0; i < mnSide; ++i, ++pEntry, pSample += moIn.mnChannels)
        {
            if (pValid[i] != 0)
            {
                *pEntry = *pSample;
                mdfSum += *pSample;
                mdfSumOfSquares += *pSample * *pSample;
                mdfCount += 1.0;
            }
        }
    }
}

void SubBlockLee::LookIntoSubBlocks(Moments& oMoments)
{
    GrowSubBlocks();
    if (mbEstimate)
    {
        // Meant: these five, wherever the edges are. See NoiseIsEstimatedFromTheLastFiveSubBlocks.
        const auto& adfVariances = madfBlockVariances;
        moNoise.mdfVariance = (adfVariances[8] + adfVariances[7] + adfVariances[6] +
                               adfVariances[5] + adfVariances[4]) /
                              5.0;
    }
    if (mdfThreshold > oMoments.mdfVariance)
    {
        oMoments = MomentsOfTriangle();
    }
}

/// Meant: the sums are not cleared, but grow from sample to sample of the block, channels and all.
/// See SubBlockSumsGrowFromPixelToPixel.
void SubBlockLee::GrowSubBlocks()
{
    constexpr std::array<std::size_t, kBlocks> kFirstOf7 = {0, 2, 5, 18, 20, 23, 45, 47, 50};
    constexpr std::array<std::size_t, kBlocks> kFirstOf9 = {0, 3, 6, 27, 30, 33, 54, 57, 60};
    constexpr std::array<std::size_t, 9> kEntries = {0, 1, 2, 9, 10, 11, 18, 19, 20};
    const auto& anFirst = mnSide == 7 ? kFirstOf7 : kFirstOf9;
    for (std::size_t t = 0; t < kBlocks; ++t)
    {
        for (const std::size_t d : kEntries)
        {
            const double dfSample = mvdfWindow[anFirst[t] + d];
            madfBlockSums[t] += dfSample;
            madfBlockSquares[t] += dfSample * dfSample;
        }
        const double dfMean = madfBlockSums[t] / 9.0;
        madfBlockMeans[t] = dfMean;
        madfBlockVariances[t] = (madfBlockSquares[t] - dfMean * 9.0 * dfMean) * 0.125;
    }
}

/// One half of the window, above or below the diagonal: the one whose mean is nearer to that of the
/// middle. Meant: one pair of halves alone, the same divisor for both, although the lower one has
/// fewer entries, and entry mnSide for its first row, which has none.
SubBlockLee::Moments SubBlockLee::MomentsOfTriangle() const
{
    const bool bLower = std::abs(madfBlockMeans[4] - madfBlockMeans[0]) >
                        std::abs(madfBlockMeans[4] - madfBlockMeans[8]);
    const auto dfEntries = static_cast<double>((mnSide / 2 + 1) * mnSide);
    double dfSum = 0.0;
    double dfSumOfSquares = 0.0;
    const auto oAdd = [&](std::size_t nEntry)
    {
        const double dfSample = mvdfWindow[nEntry];
        dfSum += dfSample;
        dfSumOfSquares += dfSample * dfSample;
    };
    if (bLower)
    {
        oAdd(mnSide);
    }
    for (std::size_t r = 0; r < mnSide; ++r)
    {
        const std::size_t nFirst = bLower ? mnSide - r : 0;
        const std::size_t nEnd = bLower ? mnSide : mnSide - r;
        for (std::size_t nColumn = nFirst; nColumn < nEnd; ++nColumn)
        {
            oAdd(r * mnSide + nColumn);
        }
    }
    const double dfMean = dfSum / dfEntries;
    return {dfMean, (dfSumOfSquares - dfEntries * dfMean * dfMean) / (dfEntries - 1.0)};
}

double SubBlockLee::Finish(double dfCentre, const Moments& oMoments) const
{
    const auto [dfMean, dfVariance] = oMoments;
    const double dfNoise = moNoise.mdfVariance;
    const double dfMulMean = moNoise.mdfMulMean;
    if (meModel == eLM_Additive)
    {
        return (dfCentre - dfMean) * (dfVariance / (dfVariance + dfNoise)) + dfMean;
    }
    if (meModel == eLM_Multiplicative)
    {
        const double dfGain =
            IsNearZero(dfVariance) ? 0.0 : 1.0 - dfMean * dfNoise * dfMean / dfVariance;
        return (dfCentre - dfMean * dfMulMean) * (dfGain < 0.0 ? 0.0 : dfGain) + dfMean;
    }
    const double q = dfMean * dfMean;
    const double a = dfMulMean * dfVariance;
    const double dfGain = a / (q * (dfVariance / q) + a * dfMulMean + dfNoise);
    return (dfCentre - dfMulMean * dfMean - moNoise.mdfAddMean) * dfGain + dfMean;
}

}  // namespace kor::filters::engine
