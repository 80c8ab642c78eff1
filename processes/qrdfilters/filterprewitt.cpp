#include "processes/qrdfilters/filterprewitt.h"

#include "processes/qrdfilters/blockcontract.h"
#include "processes/qrdfilters/requireparameter.h"
#include "processes/qrdfilters/stencil/gradient.h"

namespace kor::filters
{

namespace
{

constexpr const char* kSource = "processes/qrdfilters/filterprewitt";
constexpr double kCentreWeight = 1.0;

}  // namespace

FilterPrewitt::FilterPrewitt() : FilterPrewitt(1.0, false) {}

FilterPrewitt::FilterPrewitt(double dfFactor, bool bBGZero) : mbBGZero(bBGZero), mdfFactor(dfFactor)
{
}

void FilterPrewitt::SetFactor(double dfFactor)
{
    mdfFactor = dfFactor;
}

void FilterPrewitt::SetBGZero(bool bBGZero)
{
    mbBGZero = bBGZero;
}

void FilterPrewitt::SetParameters(bool bBGZero, double dfFactor)
{
    SetBGZero(bBGZero);
    SetFactor(dfFactor);
}

void FilterPrewitt::Process(tessel::Raster* poRasterIn, tessel::Mask* poMaskIn,
                            tessel::Raster* poRasterOut, tessel::Mask* poMaskOut) const
{
    ProcessBlock(poRasterIn, poMaskIn, poRasterOut, poMaskOut);
}

void FilterPrewitt::ProcessBlock(tessel::Raster* poRasterIn, tessel::Mask* poMaskIn,
                                 tessel::Raster* poRasterOut, tessel::Mask* poMaskOut) const
{
    RequireParameter(poRasterIn->mnMarginX != 0 && poRasterIn->mnMarginY != 0, "oRasterIn",
                     "The Margin of the input raster is too small", kSource);
    RequireDoubleBlocks(*poRasterIn, poMaskIn, *poRasterOut, poMaskOut, kSource);
    stencil::FilterGradient(*poRasterIn, poMaskIn, *poRasterOut, poMaskOut,
                            {kCentreWeight, mdfFactor}, mbBGZero);
}

}  // namespace kor::filters
