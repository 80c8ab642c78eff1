#include "processes/qrdfilters/filterkuan.h"

#include "processes/qrdfilters/engine/momentrows.h"

namespace kor::filters
{

FilterKuan::FilterKuan(bool bBGZero, int nLook) : mdfNLook(nLook), mbBGZero(bBGZero) {}

void FilterKuan::SetLook(double dfNLook)
{
    mdfNLook = dfNLook;
}

void FilterKuan::SetBGZero(bool bBGZero)
{
    mbBGZero = bBGZero;
}

void FilterKuan::SetFilterSize(int nSizeX, int nSizeY)
{
    moFilterSizeX = nSizeX;
    moFilterSizeY = nSizeY;
}

void FilterKuan::SetFilterSize(boost::optional<int> nSizeX, boost::optional<int> nSizeY)
{
    moFilterSizeX = nSizeX;
    moFilterSizeY = nSizeY;
}

void FilterKuan::Process(tessel::Raster* poRasterIn, tessel::Mask* poMaskIn,
                         tessel::Raster* poRasterOut, tessel::Mask* poMaskOut) const
{
    ProcessBlock(poRasterIn, poMaskIn, poRasterOut, poMaskOut);
}

void FilterKuan::ProcessBlock(tessel::Raster* poRasterIn, tessel::Mask* poMaskIn,
                              tessel::Raster* poRasterOut, tessel::Mask* poMaskOut) const
{
    engine::FilterByMoments(
        *poRasterIn, poMaskIn, WindowOfBothSizes(moFilterSizeX, moFilterSizeY, *poRasterIn),
        mbBGZero,
        [this](const kernels::MomentRows& oRows, std::span<double> vdfOut)
        { kernels::KuanRow(oRows, mdfNLook, vdfOut); },
        *poRasterOut, poMaskOut);
}

std::shared_ptr<tessel::Raster> FilterKuan::operator()(
    std::shared_ptr<tessel::Raster> poRasterIn, std::shared_ptr<tessel::Mask> poMaskIn,
    std::shared_ptr<tessel::Mask> poMaskOut) const
{
    auto poRasterOut = std::make_shared<tessel::Raster>(*poRasterIn, *poRasterIn);
    ProcessBlock(poRasterIn.get(), poMaskIn.get(), poRasterOut.get(), poMaskOut.get());
    return poRasterOut;
}

}  // namespace kor::filters
