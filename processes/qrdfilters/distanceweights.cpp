#include "processes/qrdfilters/distanceweights.h"

#include <algorithm>
#include <cmath>

#include "processes/qrdfilters/background.h"
#include "processes/qrdfilters/kernels/exponentialrow.h"
#include "processes/qrdfilters/kernels/frostrows.h"
#include "processes/qrdfilters/kernels/windowsums.h"

namespace kor::filters
{

using kernels::kRowPadding;
using kernels::kWeightedSamples;
using kernels::PadRow;

void AppendDistances(const Window& oWindow, std::vector<double>& vdfDistances)
{
    const std::int64_t nHalfX = oWindow.mnHalfX;
    const std::int64_t nHalfY = oWindow.mnHalfY;
    for (std::int64_t dy = -nHalfY; dy <= nHalfY; ++dy)
    {
        for (std::int64_t dx = -nHalfX; dx <= nHalfX; ++dx)
        {
            vdfDistances.push_back(std::sqrt(static_cast<double>(dx * dx + dy * dy)));
        }
    }
}

DistanceWeights::DistanceWeights(const tessel::Raster& oIn, const tessel::Mask* poMaskIn,
                                 const tessel::Mask* poMaskOut, const Window& oWindow,
                                 std::span<const double> vdfDistances, MaskedDistances eMasked,
                                 WeightExponential eExponential)
    : moIn(oIn),
      mpoMaskIn(poMaskIn),
      mpoMaskOut(poMaskOut),
      moWindow(oWindow),
      mnChannels(oIn.mnChannels),
      meMasked(eMasked),
      meExponential(eExponential),
      moValid(poMaskIn, oWindow),
      mvpRows(oWindow.GetHeight())
{
    SortDistances(vdfDistances);
}

void DistanceWeights::SortDistances(std::span<const double> vdfDistances)
{
    mvdfDistances.assign(vdfDistances.begin(), vdfDistances.end());
    std::sort(mvdfDistances.begin(), mvdfDistances.end());
    mvdfDistances.erase(std::unique(mvdfDistances.begin(), mvdfDistances.end()),
                        mvdfDistances.end());
    mvdfWeights.resize(mvdfDistances.size() * kWeightedSamples);
    for (const double dfDistance : vdfDistances)
    {
        const auto itDistance =
            std::lower_bound(mvdfDistances.begin(), mvdfDistances.end(), dfDistance);
        const auto nPlace = static_cast<std::size_t>(itDistance - mvdfDistances.begin());
        mvnWeightOf.push_back(static_cast<std::uint32_t>(nPlace * kWeightedSamples));
    }
}

DistanceWeights::Row& DistanceWeights::GetRow(std::size_t nSamples)
{
    moRow.mvdfCoefficients.resize(nSamples);
    moRow.mvdfFixed.resize(nSamples);
    moRow.mvdfWeighted.resize(nSamples);
    return moRow;
}

void DistanceWeights::Weigh(const WindowStatistics& oStretch, std::span<double> vdfOut)
{
    DropBackground(oStretch);
    moValid.MoveTo(static_cast<std::int64_t>(oStretch.mnFirst / mnChannels), oStretch.mnRow,
                   oStretch.mnSamples / mnChannels);
    if (!moValid.IsAllValid() && meMasked == MaskedDistances::eInPlace)
    {
        ClearMasked(oStretch);
    }
    for (std::size_t i = 0; i < oStretch.mnSamples; i += kWeightedSamples)
    {
        WeighPart(oStretch, i, std::min(kWeightedSamples, oStretch.mnSamples - i), &vdfOut[i]);
    }
}

/// No exponential is spent on what no one sees.
void DistanceWeights::DropBackground(const WindowStatistics& oStretch)
{
    if (mpoMaskIn == nullptr && mpoMaskOut == nullptr)
    {
        return;
    }
    mvComputed.resize(oStretch.mnSamples / mnChannels);
    FindComputedPixels(mpoMaskIn, mpoMaskOut,
                       static_cast<std::int64_t>(oStretch.mnFirst / mnChannels), oStretch.mnRow,
                       mvComputed);
    WriteBackground<double, double>(mvComputed, nullptr, mnChannels, true,
                                    moRow.mvdfWeighted.data());
}

/// Copies the samples in the windows of the stretch, +0.0 in the place of masked ones.
void DistanceWeights::ClearMasked(const WindowStatistics& oStretch)
{
    const std::size_t nPixels = moValid.GetRowPixels();
    const std::size_t nPitch = nPixels * mnChannels + kRowPadding;
    mvdfCleared.resize(moWindow.GetHeight() * nPitch);
    mvnClearedBits.resize(moWindow.GetHeight() * nPitch);
    const auto x = static_cast<std::int64_t>(oStretch.mnFirst / mnChannels) - moWindow.mnHalfX;
    for (std::size_t r = 0; r < moWindow.GetHeight(); ++r)
    {
        const std::int64_t y =
            std::int64_t{oStretch.mnRow} - moWindow.mnHalfY + static_cast<std::int64_t>(r);
        const double* pIn = moIn.GetPixelAs<const double>(x, y);
        const unsigned char* pValid = moValid.GetRow(r);
        double* pCleared = &mvdfCleared[r * nPitch];
        std::uint64_t* pBits = &mvnClearedBits[r * nPitch];
        for (std::size_t i = 0; i < nPixels; ++i)
        {
            for (std::size_t c = 0; c < mnChannels; ++c, ++pIn)
            {
                *pCleared++ = pValid[i] != 0 ? *pIn : 0.0;
                *pBits++ = pValid[i] != 0 ? ~std::uint64_t{0} : 0;
            }
        }
    }
}

void DistanceWeights::WeighPart(const WindowStatistics& oStretch, std::size_t nFirst,
                                std::size_t nSamples, double* pOut)
{
    FindTaken(nFirst, nSamples);
    if (mvnTaken.empty())
    {
        std::copy_n(&moRow.mvdfFixed[nFirst], nSamples, pOut);
        return;
    }
    RaiseWeights(nFirst, nSamples);
    for (std::size_t r = 0; r < mvpRows.size(); ++r)
    {
        const std::int64_t y =
            std::int64_t{oStretch.mnRow} - moWindow.mnHalfY + static_cast<std::int64_t>(r);
        mvpRows[r] = moIn.GetPixelAs<const double>(-std::int64_t{moWindow.mnHalfX}, y) +
                     oStretch.mnFirst + nFirst;
    }
    if (moValid.IsAllValid())
    {
        FindMeans(nFirst, nSamples, pOut);
    }
    else if (meMasked == MaskedDistances::eInPlace)
    {
        FindMeansInPlace(nFirst, nSamples, pOut);
    }
    else
    {
        FindShiftedMeans(nFirst, nSamples, pOut);
    }
}

void DistanceWeights::FindTaken(std::size_t nFirst, std::size_t nSamples)
{
    mvnTaken.clear();
    for (std::size_t i = 0; i < nSamples; ++i)
    {
        if (moRow.mvdfWeighted[nFirst + i] != 0.0)
        {
            mvnTaken.push_back(i);
        }
    }
}

void DistanceWeights::RaiseWeights(std::size_t nFirst, std::size_t nSamples)
{
    const double* pCoefficients = &moRow.mvdfCoefficients[nFirst];
    if (meExponential == WeightExponential::eVector)
    {
        kernels::RaiseWeights({pCoefficients, PadRow(nSamples)}, mvdfDistances, mvdfWeights.data(),
                              kWeightedSamples);
        return;
    }
    double* pWeights = mvdfWeights.data();
    for (const double dfDistance : mvdfDistances)
    {
        for (const std::size_t i : mvnTaken)
        {
            const double dfExponent = -(pCoefficients[i] * dfDistance);
            // exp(0) is 1, and a coefficient that is not finite is not a number times 0.
            pWeights[i] = dfDistance == 0.0 ? 1.0 + dfExponent : std::exp(dfExponent);
        }
        pWeights += kWeightedSamples;
    }
}

/// The means of windows in which all pixels are valid. Whole vectors are read where they lie; what
/// is left at the end is copied first, since behind it the block may end.
void DistanceWeights::FindMeans(std::size_t nFirst, std::size_t nSamples, double* pOut)
{
    const std::size_t nColumns = moWindow.GetWidth();
    const std::size_t nDirect = nSamples / kRowPadding * kRowPadding;
    const double* pFixed = &moRow.mvdfFixed[nFirst];
    const double* pWeighted = &moRow.mvdfWeighted[nFirst];
    const double* pWeights = mvdfWeights.data();
    kernels::FindWeightedMeans({mvpRows, {}, nColumns, mnChannels, mvnWeightOf, pWeights}, pFixed,
                               pWeighted, {pOut, nDirect});
    if (nDirect == nSamples)
    {
        return;
    }
    const std::size_t nLast = (nColumns - 1) * mnChannels;
    const std::size_t nPitch = nLast + kRowPadding;
    mvdfTail.resize(mvpRows.size() * nPitch);
    std::vector<const double*> vpTails;
    for (const double* pRow : mvpRows)
    {
        double* pTail = &mvdfTail[vpTails.size() * nPitch];
        std::copy_n(pRow + nDirect, nSamples - nDirect + nLast, pTail);
        vpTails.push_back(pTail);
    }
    kernels::FindWeightedMeans({vpTails, {}, nColumns, mnChannels, mvnWeightOf, pWeights + nDirect},
                               pFixed + nDirect, pWeighted + nDirect,
                               {pOut + nDirect, kRowPadding});
}

/// The means of windows with masked pixels, each valid one weighted by its own distance.
void DistanceWeights::FindMeansInPlace(std::size_t nFirst, std::size_t nSamples, double* pOut)
{
    const std::size_t nPitch = mvdfCleared.size() / mvpRows.size();
    std::vector<const double*> vpCleared;
    std::vector<const std::uint64_t*> vpBits;
    for (std::size_t r = 0; r < mvpRows.size(); ++r)
    {
        vpCleared.push_back(&mvdfCleared[r * nPitch + nFirst]);
        vpBits.push_back(&mvnClearedBits[r * nPitch + nFirst]);
    }
    kernels::FindWeightedMeans(
        {vpCleared, vpBits, moWindow.GetWidth(), mnChannels, mvnWeightOf, mvdfWeights.data()},
        &moRow.mvdfFixed[nFirst], &moRow.mvdfWeighted[nFirst], {pOut, PadRow(nSamples)});
}

/// The means of windows with masked pixels, the valid ones weighted by the distances in turn.
void DistanceWeights::FindShiftedMeans(std::size_t nFirst, std::size_t nSamples, double* pOut)
{
    const auto oIsWhole = [&](std::size_t i) { return moValid.IsWhole((nFirst + i) / mnChannels); };
    if (std::any_of(mvnTaken.begin(), mvnTaken.end(), oIsWhole))
    {
        FindMeans(nFirst, nSamples, pOut);
    }
    else
    {
        std::copy_n(&moRow.mvdfFixed[nFirst], nSamples, pOut);
    }
    for (const std::size_t i : mvnTaken)
    {
        if (!oIsWhole(i))
        {
            pOut[i] = ShiftedMean(nFirst, i);
        }
    }
}

/// The mean of one window with masked pixels.
double DistanceWeights::ShiftedMean(std::size_t nFirst, std::size_t i) const
{
    double dfSum = 0.0;
    double dfWeights = 0.0;
    const auto* pWeightOf = mvnWeightOf.data();
    for (std::size_t r = 0; r < moWindow.GetHeight(); ++r)
    {
        const unsigned char* pValid = moValid.GetRow(r) + (nFirst + i) / mnChannels;
        const double* pSample = mvpRows[r] + i;
        for (std::size_t k = 0; k < moWindow.GetWidth(); ++k, pSample += mnChannels)
        {
            if (pValid[k] != 0)
            {
                // Meant: the distance goes by the pixels taken and not by the place in the window.
                // See MaskedPixelShiftsTheDistancesBehindIt.
                const double dfWeight = mvdfWeights[*pWeightOf++ + i];
                dfSum += dfWeight * *pSample;
                dfWeights += dfWeight;
            }
        }
    }
    return dfSum / dfWeights;
}

}  // namespace kor::filters
