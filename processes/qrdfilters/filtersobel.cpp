#include "processes/qrdfilters/filtersobel.h"

#include "processes/qrdfilters/blockcontract.h"
#include "processes/qrdfilters/requireparameter.h"
#include "processes/qrdfilters/stencil/gradient.h"

namespace kor::filters
{

namespace
{

constexpr const char* kSource = "processes/qrdfilters/filtersobel";
constexpr double kCentreWeight = 2.0;

}  // namespace

FilterSobel::FilterSobel(double dfFactor, bool bBGZero) : mdfFactor(dfFactor), mbBGZero(bBGZero) {}

void FilterSobel::SetFactor(double dfFactor)
{
    mdfFactor = dfFactor;
}

void FilterSobel::SetBGZero(bool bBGZero)
{
    mbBGZero = bBGZero;
}

void FilterSobel::SetParameters(bool bBGZero, double dfFactor)
{
    SetBGZero(bBGZero);
    SetFactor(dfFactor);
}

void FilterSobel::Process(tessel::Raster* poRasterIn, tessel::Mask* poMaskIn,
                          tessel::Raster* poRasterOut, tessel::Mask* poMaskOut) const
{
    ProcessBlock(poRasterIn, poMaskIn, poRasterOut, poMaskOut);
}

void FilterSobel::ProcessBlock(tessel::Raster* poRasterIn, tessel::Mask* poMaskIn,
                               tessel::Raster* poRasterOut, tessel::Mask* poMaskOut) const
{
    RequireParameter(poRasterIn->mnMarginX != 0 && poRasterIn->mnMarginY != 0, "oRasterIn",
                     "The Margin of the input raster is too small", kSource);
    RequireDoubleBlocks(*poRasterIn, poMaskIn, *poRasterOut, poMaskOut, kSource);
    stencil::FilterGradient(*poRasterIn, poMaskIn, *poRasterOut, poMaskOut,
                            {kCentreWeight, mdfFactor}, mbBGZero);
}

}  // namespace kor::filters
