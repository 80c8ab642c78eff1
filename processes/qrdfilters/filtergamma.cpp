#include "processes/qrdfilters/filtergamma.h"

#include "processes/qrdfilters/engine/momentrows.h"

namespace kor::filters
{

FilterGamma::FilterGamma(double dfNLook, GammaFormat eAmplit) : mdfNLook(dfNLook), meAmplit(eAmplit)
{
}

void FilterGamma::SetLook(double dfNLook)
{
    mdfNLook = dfNLook;
}

void FilterGamma::SetAmplit(GammaFormat eAmplit)
{
    meAmplit = eAmplit;
}

void FilterGamma::SetParameters(GammaFormat eAmplit, double dfNLook)
{
    SetAmplit(eAmplit);
    SetLook(dfNLook);
}

void FilterGamma::SetBGZero(bool bBGZero)
{
    mbBGZero = bBGZero;
}

void FilterGamma::SetFilterSize(int nSizeX, int nSizeY)
{
    moFilterSizeX = nSizeX;
    moFilterSizeY = nSizeY;
}

void FilterGamma::SetFilterSize(boost::optional<int> nSizeX, boost::optional<int> nSizeY)
{
    moFilterSizeX = nSizeX;
    moFilterSizeY = nSizeY;
}

void FilterGamma::Process(tessel::Raster* poRasterIn, tessel::Mask* poMaskIn,
                          tessel::Raster* poRasterOut, tessel::Mask* poMaskOut) const
{
    ProcessBlock(poRasterIn, poMaskIn, poRasterOut, poMaskOut);
}

void FilterGamma::ProcessBlock(tessel::Raster* poRasterIn, tessel::Mask* poMaskIn,
                               tessel::Raster* poRasterOut, tessel::Mask* poMaskOut) const
{
    engine::FilterByMoments(
        *poRasterIn, poMaskIn, WindowOfBothSizes(moFilterSizeX, moFilterSizeY, *poRasterIn),
        mbBGZero,
        [this](const kernels::MomentRows& oRows, std::span<double> vdfOut)
        { kernels::GammaRow(oRows, mdfNLook, vdfOut); },
        *poRasterOut, poMaskOut);
}

}  // namespace kor::filters
