#include "processes/qrdfilters/filterstddeviation.h"

#include "processes/qrdfilters/kernels/deviationrow.h"
#include "processes/qrdfilters/slidingwindow.h"

namespace kor::filters
{

FilterStdDeviation::FilterStdDeviation(bool bBGZero) : mbBGZero(bBGZero) {}

void FilterStdDeviation::SetBGZero(bool bBGZero)
{
    mbBGZero = bBGZero;
}

void FilterStdDeviation::SetParameters(bool bBGZero)
{
    SetBGZero(bBGZero);
}

void FilterStdDeviation::SetFilterSize(boost::optional<int> nSizeX, boost::optional<int> nSizeY)
{
    moFilterSizeX = nSizeX;
    moFilterSizeY = nSizeY;
}

void FilterStdDeviation::Process(tessel::Raster* poRasterIn, tessel::Mask* poMaskIn,
                                 tessel::Raster* poRasterOut, tessel::Mask* poMaskOut) const
{
    ProcessBlock(poRasterIn, poMaskIn, poRasterOut, poMaskOut);
}

void FilterStdDeviation::ProcessBlock(tessel::Raster* poRasterIn, tessel::Mask* poMaskIn,
                                      tessel::Raster* poRasterOut, tessel::Mask* poMaskOut) const
{
    // Meant: neither the background flag nor the sizes that were set are read.
    // See BackgroundIsZeroWhateverIsSet and MarginsTellTheWindowWhateverIsSet.
    constexpr bool kBGZero = true;
    constexpr WindowTerm kTerms[] = {kSumTerm, kSumOfSquaresTerm};
    FilterWindowRows<double>(*poRasterIn, poMaskIn, WindowOfMargins(*poRasterIn), kTerms, kBGZero,
                             kernels::DeviationRow, *poRasterOut, poMaskOut);
}

std::shared_ptr<tessel::Raster> FilterStdDeviation::operator()(
    std::shared_ptr<tessel::Raster> poRasterIn, std::shared_ptr<tessel::Mask> poMaskIn,
    std::shared_ptr<tessel::Mask> poMaskOut) const
{
    auto poRasterOut = std::make_shared<tessel::Raster>(
        *poRasterIn, tessel::RasterContext(0, 0, poRasterIn->mnOffsetX, poRasterIn->mnOffsetY));
    ProcessBlock(poRasterIn.get(), poMaskIn.get(), poRasterOut.get(), poMaskOut.get());
    return poRasterOut;
}

}  // namespace kor::filters
