#include "processes/qrdfilters/filterlaplacian.h"

#include "processes/qrdfilters/kernels/laplacianrow.h"
#include "processes/qrdfilters/slidingwindow.h"

namespace kor::filters
{

FilterLaplacian::FilterLaplacian(bool bBGZero) : mbBGZero(bBGZero) {}

void FilterLaplacian::SetBGZero(bool bBGZero)
{
    mbBGZero = bBGZero;
}

void FilterLaplacian::SetFilterSize(int nSizeX, int nSizeY)
{
    moFilterSizeX = nSizeX;
    moFilterSizeY = nSizeY;
}

void FilterLaplacian::SetFilterSize(boost::optional<int> nSizeX, boost::optional<int> nSizeY)
{
    moFilterSizeX = nSizeX;
    moFilterSizeY = nSizeY;
}

void FilterLaplacian::Process(tessel::Raster* poRasterIn, tessel::Mask* poMaskIn,
                              tessel::Raster* poRasterOut, tessel::Mask* poMaskOut) const
{
    ProcessBlock(poRasterIn, poMaskIn, poRasterOut, poMaskOut);
}

void FilterLaplacian::ProcessBlock(tessel::Raster* poRasterIn, tessel::Mask* poMaskIn,
                                   tessel::Raster* poRasterOut, tessel::Mask* poMaskOut) const
{
    // Meant: no field of the filter is read. See FilterLaplacian.TakesNoNoticeOfItsSetters.
    constexpr bool kBGZero = true;
    constexpr WindowTerm kTerms[] = {kSumTerm};
    FilterWindowRows<double>(
        *poRasterIn, poMaskIn, WindowOfMargins(*poRasterIn), kTerms, kBGZero,
        [](const WindowStatistics& oStatistics, std::span<double> vdfOut)
        {
            kernels::LaplacianRow(oStatistics.mpCentres, oStatistics.mapSums[0],
                                  oStatistics.mpCounts, vdfOut);
        },
        *poRasterOut, poMaskOut);
}

std::shared_ptr<tessel::Raster> FilterLaplacian::operator()(
    std::shared_ptr<tessel::Raster> poRasterIn, std::shared_ptr<tessel::Mask> poMaskIn,
    std::shared_ptr<tessel::Mask> poMaskOut) const
{
    auto poRasterOut = std::make_shared<tessel::Raster>(
        *poRasterIn, tessel::RasterContext(0, 0, poRasterIn->mnOffsetX, poRasterIn->mnOffsetY));
    ProcessBlock(poRasterIn.get(), poMaskIn.get(), poRasterOut.get(), poMaskOut.get());
    return poRasterOut;
}

}  // namespace kor::filters
