#include "processes/qrdfilters/filterffrost.h"

#include <algorithm>
#include <source_location>

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

constexpr const char* kSource = "processes/qrdfilters/filterffrost";

std::uint32_t HalfOf(int nSize)
{
    return static_cast<std::uint32_t>(std::max(0, nSize / 2));
}

void RequireNeighbours(const Window& oWindow,
                       const std::source_location& oWhere = std::source_location::current())
{
    if (oWindow.mnHalfX < 1 && oWindow.mnHalfY < 1)
    {
        throw ParameterException("oRasterIn", ParameterException::Type::eInvalidValue, "", "",
                                 "The Margin of the input raster is too small.", kSource,
                                 oWhere.function_name(), oWhere.line());
    }
}

}  // namespace

void FilterFfrost::SetDamp(double dfDamp)
{
    if (dfDamp < 0.0)
    {
        throw Exception(_("Damping factor must be a positive number"), "", "", 0);
    }
    mdfDamp = dfDamp;
}

void FilterFfrost::SetBGZero(bool bBGZero)
{
    mbBGZero = bBGZero;
}

void FilterFfrost::SetFilterSize(boost::optional<int> nSizeX, boost::optional<int> nSizeY)
{
    moFilterSizeX = nSizeX;
    moFilterSizeY = nSizeY;
}

void FilterFfrost::SetFastExponential(bool bFast)
{
    mbFastExponential = bFast;
}

void FilterFfrost::InitProcessing() const
{
    if (moFilterSizeX && moFilterSizeY)
    {
        AppendDistances({HalfOf(*moFilterSizeX), HalfOf(*moFilterSizeY)}, moDistances);
    }
}

void FilterFfrost::Process(tessel::Raster* poRasterIn, tessel::Mask* poMaskIn,
                           tessel::Raster* poRasterOut, tessel::Mask* poMaskOut) const
{
    ProcessBlock(poRasterIn, poMaskIn, poRasterOut, poMaskOut);
}

void FilterFfrost::ProcessBlock(tessel::Raster* poRasterIn, tessel::Mask* poMaskIn,
                                tessel::Raster* poRasterOut, tessel::Mask* poMaskOut) const
{
    const Window oWindow = WindowOfEachSize(moFilterSizeX, moFilterSizeY, *poRasterIn);
    RequireNeighbours(oWindow);
    RequireWindowInside(oWindow, *poRasterIn, poMaskIn, kSource);

    const std::vector<double> vdfDistances = DistancesOf(oWindow);
    DistanceWeights oWeights(
        *poRasterIn, poMaskIn, poMaskOut, oWindow, vdfDistances, MaskedDistances::eShifted,
        mbFastExponential ? WeightExponential::eVector : WeightExponential::eLibrary);
    const auto oFinish = [&](const WindowStatistics& oStretch, std::span<double> vdfOut)
    {
        DistanceWeights::Row& oRow = oWeights.GetRow(oStretch.GetPadded());
        kernels::FindFrostCoefficients(
            {oStretch.mapSums[0], oStretch.mapSums[1], oStretch.mpCounts, oStretch.mpCentres},
            mdfDamp, oStretch.GetPadded(),
            {oRow.mvdfCoefficients.data(), oRow.mvdfFixed.data(), oRow.mvdfWeighted.data()});
        oWeights.Weigh(oStretch, vdfOut);
    };
    FilterWindowRows<double>(*poRasterIn, poMaskIn,
                             WindowOfBothSizes(moFilterSizeX, moFilterSizeY, *poRasterIn),
                             kLocalStatisticsTerms, mbBGZero, oFinish, *poRasterOut, poMaskOut);
}

/// The table's entries for the pixels of a window, 0 behind its end.
std::vector<double> FilterFfrost::DistancesOf(const Window& oWindow) const
{
    if (moDistances.empty())
    {
        AppendDistances(oWindow, moDistances);
    }
    std::vector<double> vdfDistances(moDistances);
    vdfDistances.resize(oWindow.GetWidth() * oWindow.GetHeight(), 0.0);
    return vdfDistances;
}

std::shared_ptr<tessel::Raster> FilterFfrost::operator()(
    std::shared_ptr<tessel::Raster> poRasterIn, std::shared_ptr<tessel::Mask> poMaskIn,
    std::shared_ptr<tessel::Mask> poMaskOut) const
{
    auto poRasterOut = std::make_shared<tessel::Raster>(*poRasterIn, *poRasterIn);
    ProcessBlock(poRasterIn.get(), poMaskIn.get(), poRasterOut.get(), poMaskOut.get());
    return poRasterOut;
}

}  // namespace kor::filters
