#include "processes/qrdfilters/texture/greylevels.h"

#include <algorithm>
#include <array>

namespace kor::filters
{

namespace
{

/// vfLevels holds the level of what has no bin, and behind it those of the bins.
void LookUpBins(const kernels::GreyScale& oScale, std::span<const double> vdfSamples,
                const std::vector<float>& vfLevels, float* pfLevels)
{
    std::array<int, 512> anBins;
    while (!vdfSamples.empty())
    {
        const std::size_t nCount = std::min(vdfSamples.size(), anBins.size());
        kernels::FindBins(oScale, vdfSamples.first(nCount), anBins.data());
        for (std::size_t i = 0; i < nCount; ++i)
        {
            pfLevels[i] = vfLevels[static_cast<std::size_t>(anBins[i] + 1)];
        }
        vdfSamples = vdfSamples.subspan(nCount);
        pfLevels += nCount;
    }
}

}  // namespace

kernels::GreyScale ScaleOf(double dfMin, double dfMax, std::size_t nBins)
{
    const double dfRange = dfMax - dfMin;
    // Too narrow a range to divide by: the value itself is the bin.
    const bool bByValue = dfRange > -1e-9 && dfRange < 1e-9;
    return {dfMin, dfRange, bByValue, static_cast<double>(nBins)};
}

GreyLevels::GreyLevels(double dfMin, double dfMax, std::span<const int> oHist2Glev)
    : moRange(ScaleOf(dfMin, dfMax, oHist2Glev.size())), moOpen(moRange), mvfLevels(1)
{
    moRange.mdfLowest = dfMin;
    moRange.mdfHighest = dfMax;
    mvfLevels.insert(mvfLevels.end(), oHist2Glev.begin(), oHist2Glev.end());
    const auto [itLowest, itHighest] = std::minmax_element(mvfLevels.begin(), mvfLevels.end());
    mfSpan = *itHighest - *itLowest;
}

void GreyLevels::LookUpInRange(std::span<const double> vdfSamples, float* pfLevels) const
{
    LookUpBins(moRange, vdfSamples, mvfLevels, pfLevels);
}

void GreyLevels::LookUp(std::span<const double> vdfSamples, float* pfLevels) const
{
    LookUpBins(moOpen, vdfSamples, mvfLevels, pfLevels);
}

std::vector<int> MakeGreyTable(std::span<const int> oHistogram, int nCount, int nGrey)
{
    const std::int64_t nStep = nCount / nGrey;
    std::int64_t nTarget = nStep;
    std::int64_t nNext = 1;
    std::int64_t nSum = 0;
    std::vector<int> vnTable;
    vnTable.reserve(oHistogram.size());
    for (const int nPixels : oHistogram)
    {
        vnTable.push_back(static_cast<int>(nNext - 1));
        nSum += nPixels;
        // Meant: one level a bin at most, however many shares the bin holds. See
        // AHeavyBinAdvancesTheLevelByOne.
        if (nSum >= nTarget)
        {
            ++nNext;
            nTarget = nStep * nNext;
        }
    }
    return vnTable;
}

}  // namespace kor::filters
