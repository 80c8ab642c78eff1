#include "processes/qrdfilters/filternoise.h"

#include "processes/qrdfilters/kernels/noiserow.h"
#include "processes/qrdfilters/slidingwindow.h"

namespace kor::filters
{

void FilterNoise::SetFailValue(double dfFailValue)
{
    mdfFailValue = dfFailValue;
}

void FilterNoise::SetBGZero(bool bBGZero)
{
    mbBGZero = bBGZero;
}

void FilterNoise::SetFilterSize(int nSizeX, int nSizeY)
{
    moFilterSizeX = nSizeX;
    moFilterSizeY = nSizeY;
}

void FilterNoise::SetFilterSize(boost::optional<int> nSizeX, boost::optional<int> nSizeY)
{
    moFilterSizeX = nSizeX;
    moFilterSizeY = nSizeY;
}

void FilterNoise::Process(tessel::Raster* poRasterIn, tessel::Mask* poMaskIn,
                          tessel::Raster* poRasterOut, tessel::Mask* poMaskOut) const
{
    ProcessBlock(poRasterIn, poMaskIn, poRasterOut, poMaskOut);
}

void FilterNoise::ProcessBlock(tessel::Raster* poRasterIn, tessel::Mask* poMaskIn,
                               tessel::Raster* poRasterOut, tessel::Mask* poMaskOut) const
{
    constexpr WindowTerm kTerms[] = {kSumTerm, kSumOfSquaresTerm};
    FilterWindowRows<double>(
        *poRasterIn, poMaskIn, WindowOfBothSizes(moFilterSizeX, moFilterSizeY, *poRasterIn), kTerms,
        mbBGZero,
        [this](const WindowStatistics& oStatistics, std::span<double> vdfOut)
        { kernels::NoiseRow(oStatistics, mdfFailValue, vdfOut); },
        *poRasterOut, poMaskOut);
}

}  // namespace kor::filters
