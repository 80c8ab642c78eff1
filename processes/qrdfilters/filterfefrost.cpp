#include "processes/qrdfilters/filterfefrost.h"

#include <cmath>
#include <vector>

#include "platform/exception/exception.h"
#include "platform/system/translate.h"
#include "processes/qrdfilters/blockcontract.h"
#include "processes/qrdfilters/distanceweights.h"
#include "processes/qrdfilters/kernels/frostrows.h"
#include "processes/qrdfilters/localstatistics.h"

namespace kor::filters
{

namespace
{

constexpr const char* kSource = "processes/qrdfilters/filterfefrost";

/// Axis by axis the set size, or else half the margin.
Window WeightedWindow(const WindowSize& nSizeX, const WindowSize& nSizeY,
                      const tessel::Raster& oRaster)
{
    const Window oWindow = WindowOfEachSize(nSizeX, nSizeY, oRaster);
    return {nSizeX ? oWindow.mnHalfX : oWindow.mnHalfX / 2,
            nSizeY ? oWindow.mnHalfY : oWindow.mnHalfY / 2};
}

}  // namespace

void FilterFefrost::SetDamp(double dfDamp)
{
    if (dfDamp < 0.0)
    {
        throw Exception(_("Damping factor must be a positive number"), "", "", 0);
    }
    mdfDamp = dfDamp;
}

void FilterFefrost::SetNLOOK(double dfLooks)
{
    if (dfLooks < 0.0)
    {
        throw Exception(_("Number of looks must be a positive number"), "", "", 0);
    }
    mdfCu = 1.0 / std::sqrt(dfLooks);
    mdfCmax = std::sqrt(2.0 / dfLooks + 1.0);
}

void FilterFefrost::SetBGZero(bool bBGZero)
{
    mbBGZero = bBGZero;
}

void FilterFefrost::SetFilterSize(boost::optional<int> nSizeX, boost::optional<int> nSizeY)
{
    moFilterSizeX = nSizeX;
    moFilterSizeY = nSizeY;
}

void FilterFefrost::SetFastExponential(bool bFast)
{
    mbFastExponential = bFast;
}

void FilterFefrost::Process(tessel::Raster* poRasterIn, tessel::Mask* poMaskIn,
                            tessel::Raster* poRasterOut, tessel::Mask* poMaskOut) const
{
    ProcessBlock(poRasterIn, poMaskIn, poRasterOut, poMaskOut);
}

void FilterFefrost::ProcessBlock(tessel::Raster* poRasterIn, tessel::Mask* poMaskIn,
                                 tessel::Raster* poRasterOut, tessel::Mask* poMaskOut) const
{
    const Window oWindow = WeightedWindow(moFilterSizeX, moFilterSizeY, *poRasterIn);
    RequireWindowInside(oWindow, *poRasterIn, poMaskIn, kSource);

    std::vector<double> vdfDistances;
    AppendDistances(oWindow, vdfDistances);
    DistanceWeights oWeights(
        *poRasterIn, poMaskIn, poMaskOut, oWindow, vdfDistances, MaskedDistances::eInPlace,
        mbFastExponential ? WeightExponential::eVector : WeightExponential::eLibrary);
    const auto oFinish = [&](const WindowStatistics& oStretch, std::span<double> vdfOut)
    {
        DistanceWeights::Row& oRow = oWeights.GetRow(oStretch.GetPadded());
        kernels::FindEnhancedFrostCoefficients(
            {oStretch.mapSums[0], oStretch.mapSums[1], oStretch.mpCounts, oStretch.mpCentres},
            {mdfCu, mdfCmax, mdfDamp}, oStretch.GetPadded(),
            {oRow.mvdfCoefficients.data(), oRow.mvdfFixed.data(), oRow.mvdfWeighted.data()});
        oWeights.Weigh(oStretch, vdfOut);
    };
    FilterWindowRows<double>(*poRasterIn, poMaskIn,
                             WindowOfBothSizes(moFilterSizeX, moFilterSizeY, *poRasterIn),
                             kLocalStatisticsTerms, mbBGZero, oFinish, *poRasterOut, poMaskOut);
}

std::shared_ptr<tessel::Raster> FilterFefrost::operator()(
    std::shared_ptr<tessel::Raster> poRasterIn, std::shared_ptr<tessel::Mask> poMaskIn,
    std::shared_ptr<tessel::Mask> poMaskOut) const
{
    auto poRasterOut = std::make_shared<tessel::Raster>(*poRasterIn, *poRasterIn);
    ProcessBlock(poRasterIn.get(), poMaskIn.get(), poRasterOut.get(), poMaskOut.get());
    return poRasterOut;
}

}  // namespace kor::filters
