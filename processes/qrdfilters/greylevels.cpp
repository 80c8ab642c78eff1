#include "processes/qrdfilters/greylevels.h"

#include <algorithm>
#include <array>

namespace kor::filters
{

namespace
{

/// Calls oFind for parts of the samples, which writes the bins of a part, and looks up their
/// levels.
template <class Find>
void LookUpBins(std::span<const double> vdfSamples, const std::vector<float>& vfLevels,
                const Find& oFind, float* pfLevels)
{
    std::array<int, 512> anBins;
    while (!vdfSamples.empty())
    {
        const std::size_t nCount = std::min(vdfSamples.size(), anBins.size());
        for (std::size_t i = 0; i < nCount; ++i)
        {
            anBins[i] = oFind(vdfSamples[i]);
        }
        for (std::size_t i = 0; i < nCount; ++i)
        {
            pfLevels[i] = anBins[i] < 0 ? 0.0F : vfLevels[static_cast<std::size_t>(anBins[i])];
        }
        vdfSamples = vdfSamples.subspan(nCount);
        pfLevels += nCount;
    }
}

}  // namespace

GreyBins::GreyBins(double dfMin, double dfMax)
    : mdfMin(dfMin), mdfRange(dfMax - dfMin), mbByValue(mdfRange > -1e-9 && mdfRange < 1e-9)
{
}

GreyLevels::GreyLevels(double dfMin, double dfMax, std::span<const int> oHist2Glev)
    : mdfMin(dfMin),
      mdfMax(dfMax),
      moBins(dfMin, dfMax),
      mvfLevels(oHist2Glev.begin(), oHist2Glev.end())
{
    float fLowest = 0.0F;
    float fHighest = 0.0F;
    for (const float fLevel : mvfLevels)
    {
        fLowest = fLevel < fLowest ? fLevel : fLowest;
        fHighest = fLevel > fHighest ? fLevel : fHighest;
    }
    mfSpan = fHighest - fLowest;
}

void GreyLevels::LookUpInRange(std::span<const double> vdfSamples, float* pfLevels) const
{
    const auto oFind = [&, nBins = mvfLevels.size()](double x)
    {
        const int nBin = moBins.Find(x, nBins);
        return x >= mdfMin && x <= mdfMax ? nBin : -1;
    };
    LookUpBins(vdfSamples, mvfLevels, oFind, pfLevels);
}

void GreyLevels::LookUp(std::span<const double> vdfSamples, float* pfLevels) const
{
    const auto oFind = [&, nBins = mvfLevels.size()](double x) { return moBins.Find(x, nBins); };
    LookUpBins(vdfSamples, mvfLevels, oFind, pfLevels);
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
