#include "processes/qrdfilters/filtersharp.h"

#include <algorithm>
#include <memory>

#include "processes/qrdfilters/blockcontract.h"
#include "processes/qrdfilters/requireparameter.h"
#include "processes/qrdfilters/rowbands.h"
#include "processes/qrdfilters/stencil/sharpband.h"

namespace kor::filters
{

namespace
{

constexpr const char* kSource = "processes/qrdfilters/filtersharp";

/// Meant: the set size is the half size. See FilterSharp.TakesASetSizeAsTheHalfSize.
std::uint32_t HalfSize(const boost::optional<int>& nSize, std::uint32_t nMargin)
{
    return nSize ? static_cast<std::uint32_t>(std::max(*nSize, 0)) : nMargin;
}

}  // namespace

void FilterSharp::SetBGZero(bool bBGZero)
{
    mbBGZero = bBGZero;
}

void FilterSharp::SetFilterSize(int nSizeX, int nSizeY)
{
    moFilterSizeX = nSizeX;
    moFilterSizeY = nSizeY;
}

void FilterSharp::SetFilterSize(boost::optional<int> nSizeX, boost::optional<int> nSizeY)
{
    moFilterSizeX = nSizeX;
    moFilterSizeY = nSizeY;
}

void FilterSharp::Process(tessel::Raster* poRasterIn, tessel::Mask* poMaskIn,
                          tessel::Raster* poRasterOut, tessel::Mask* poMaskOut) const
{
    ProcessBlock(poRasterIn, poMaskIn, poRasterOut, poMaskOut);
}

void FilterSharp::ProcessBlock(tessel::Raster* poRasterIn, tessel::Mask* poMaskIn,
                               tessel::Raster* poRasterOut, tessel::Mask* poMaskOut) const
{
    // Meant: one margin above 0 is enough. See FilterSharp.WorksWithOneMarginOfZero.
    RequireParameter(poRasterIn->mnMarginX != 0 || poRasterIn->mnMarginY != 0, "oRasterIn",
                     "The Margin of the input raster is too small.", kSource);
    const Window oWindow{HalfSize(moFilterSizeX, poRasterIn->mnMarginX),
                         HalfSize(moFilterSizeY, poRasterIn->mnMarginY)};
    RequireDoubleBlocks(*poRasterIn, poMaskIn, *poRasterOut, poMaskOut, kSource);
    RequireWindowInside(oWindow, *poRasterIn, poMaskIn, kSource);
    if (poRasterIn->mnWidth == 0 || poRasterIn->mnChannels == 0)
    {
        return;
    }
    const std::unique_ptr<tessel::Raster> poValid(poMaskIn ? poMaskIn->CreateRaster() : nullptr);
    const stencil::SharpBlock oBlock{*poRasterIn, poMaskIn, poValid.get(), *poRasterOut,
                                     poMaskOut,   oWindow,  mbBGZero};
    ForEachRowBand(poRasterIn->mnHeight, stencil::SharpBand::kMostRows,
                   [&](std::uint32_t nFirst, std::uint32_t nEnd)
                   { stencil::SharpBand(oBlock, nFirst, nEnd).Sharpen(); });
}

}  // namespace kor::filters
