#include "processes/qrdfilters/filteraverage.h"

#include "platform/exception/exception.h"
#include "platform/system/translate.h"
#include "processes/qrdfilters/kernels/averagerow.h"
#include "processes/qrdfilters/slidingwindow.h"

namespace kor::filters
{

namespace
{

void RequireMargins(const Window& oWindow, const tessel::RasterContext& oContext,
                    const char* pszMessage)
{
    if (!FitsMargins(oWindow, oContext))
    {
        throw Exception(_(pszMessage), "", "", 0);
    }
}

template <class TSample>
void AverageWindows(const tessel::Raster& oIn, const tessel::Mask* poMaskIn, const Window& oWindow,
                    bool bBGZero, tessel::Raster& oOut, const tessel::Mask* poMaskOut)
{
    constexpr WindowTerm kTerms[] = {kSumTerm};
    FilterWindowRows<TSample>(
        oIn, poMaskIn, oWindow, kTerms, bBGZero,
        [](const WindowStatistics& oStatistics, std::span<double> vdfOut)
        { kernels::AverageRow(oStatistics.mapSums[0], oStatistics.mpCounts, vdfOut); },
        oOut, poMaskOut);
}

}  // namespace

FilterAverage::FilterAverage(bool bBGZero) : mbBGZero(bBGZero) {}

void FilterAverage::SetBGZero(bool bBGZero)
{
    mbBGZero = bBGZero;
}

void FilterAverage::SetParameters(bool bBGZero)
{
    SetBGZero(bBGZero);
}

void FilterAverage::SetFilterSize(int nSizeX, int nSizeY)
{
    moFilterSizeX = nSizeX;
    moFilterSizeY = nSizeY;
}

void FilterAverage::SetFilterSize(boost::optional<int> nSizeX, boost::optional<int> nSizeY)
{
    moFilterSizeX = nSizeX;
    moFilterSizeY = nSizeY;
}

void FilterAverage::Process(tessel::Raster* poRasterIn, tessel::Mask* poMaskIn,
                            tessel::Raster* poRasterOut, tessel::Mask* poMaskOut) const
{
    ProcessBlock(poRasterIn, poMaskIn, poRasterOut, poMaskOut);
}

void FilterAverage::ProcessBlock(tessel::Raster* poRasterIn, tessel::Mask* poMaskIn,
                                 tessel::Raster* poRasterOut, tessel::Mask* poMaskOut) const
{
    if (poRasterIn->mnChannels != 1)
    {
        ProcessMultiChanBlock(poRasterIn, poMaskIn, poRasterOut, poMaskOut);
    }
    else
    {
        ProcessSingleChanBlock(poRasterIn, poMaskIn, poRasterOut, poMaskOut);
    }
}

void FilterAverage::ProcessSingleChanBlock(tessel::Raster* poRasterIn, tessel::Mask* poMaskIn,
                                           tessel::Raster* poRasterOut,
                                           tessel::Mask* poMaskOut) const
{
    const bool bFloat = poRasterIn->moDataType == tessel::eDT_32R;
    if (!bFloat && poRasterIn->moDataType != tessel::eDT_64R)
    {
        // Meant: other types are left alone without an error.
        // See SingleChannelOfAnotherTypeIsLeftAlone.
        return;
    }
    const Window oWindow = WindowOfEachSize(moFilterSizeX, moFilterSizeY, *poRasterIn);
    RequireMargins(oWindow, *poRasterIn,
                   "Input raster's margins are not large enough for filter size requested.");
    if (poMaskIn != nullptr)
    {
        RequireMargins(oWindow, *poMaskIn,
                       "Input mask's margins are not large enough for filter size requested.");
    }
    const auto pfnAverage = bFloat ? AverageWindows<float> : AverageWindows<double>;
    pfnAverage(*poRasterIn, poMaskIn, oWindow, mbBGZero, *poRasterOut, poMaskOut);
}

void FilterAverage::ProcessMultiChanBlock(tessel::Raster* poRasterIn, tessel::Mask* poMaskIn,
                                          tessel::Raster* poRasterOut,
                                          tessel::Mask* poMaskOut) const
{
    AverageWindows<double>(*poRasterIn, poMaskIn,
                           WindowOfBothSizes(moFilterSizeX, moFilterSizeY, *poRasterIn), mbBGZero,
                           *poRasterOut, poMaskOut);
}

std::shared_ptr<tessel::Raster> FilterAverage::operator()(
    std::shared_ptr<tessel::Raster> poRasterIn, std::shared_ptr<tessel::Mask> poMaskIn,
    std::shared_ptr<tessel::Mask> poMaskOut) const
{
    auto poRasterOut = std::make_shared<tessel::Raster>(
        *poRasterIn, tessel::RasterContext(0, 0, poRasterIn->mnOffsetX, poRasterIn->mnOffsetY));
    ProcessBlock(poRasterIn.get(), poMaskIn.get(), poRasterOut.get(), poMaskOut.get());
    return poRasterOut;
}

}  // namespace kor::filters
