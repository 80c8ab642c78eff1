#include "processes/qrdfilters/filterfelee.h"

#include <cmath>

#include "platform/exception/exception.h"
#include "platform/system/translate.h"
#include "processes/qrdfilters/engine/momentrows.h"

namespace kor::filters
{

namespace
{

void RequireNotNegative(double dfValue, const char* pszMessage)
{
    if (dfValue < 0.0)
    {
        throw Exception(_(pszMessage), "", "", 0);
    }
}

}  // namespace

void FilterFelee::SetDamp(double dfDamp)
{
    RequireNotNegative(dfDamp, "Damping factor must be a positive number");
    mdfDamp = dfDamp;
}

void FilterFelee::SetNLook(double dfNLook)
{
    RequireNotNegative(dfNLook, "Number of looks must be a positive number");
    mdfCu = 1.0 / std::sqrt(dfNLook);
    mdfCmax = std::sqrt(2.0 / dfNLook + 1.0);
}

void FilterFelee::SetBGZero(bool bBGZero)
{
    mbBGZero = bBGZero;
}

void FilterFelee::SetFilterSize(boost::optional<int> nSizeX, boost::optional<int> nSizeY)
{
    moFilterSizeX = nSizeX;
    moFilterSizeY = nSizeY;
}

void FilterFelee::Process(tessel::Raster* poRasterIn, tessel::Mask* poMaskIn,
                          tessel::Raster* poRasterOut, tessel::Mask* poMaskOut) const
{
    ProcessBlock(poRasterIn, poMaskIn, poRasterOut, poMaskOut);
}

void FilterFelee::ProcessBlock(tessel::Raster* poRasterIn, tessel::Mask* poMaskIn,
                               tessel::Raster* poRasterOut, tessel::Mask* poMaskOut) const
{
    engine::FilterByMoments(
        *poRasterIn, poMaskIn, WindowOfBothSizes(moFilterSizeX, moFilterSizeY, *poRasterIn),
        mbBGZero,
        [this](const kernels::MomentRows& oRows, std::span<double> vdfOut)
        { kernels::EnhancedLeeRow(oRows, mdfCu, mdfCmax, mdfDamp, vdfOut); },
        *poRasterOut, poMaskOut);
}

std::shared_ptr<tessel::Raster> FilterFelee::operator()(
    std::shared_ptr<tessel::Raster> poRasterIn, std::shared_ptr<tessel::Mask> poMaskIn,
    std::shared_ptr<tessel::Mask> poMaskOut) const
{
    auto poRasterOut = std::make_shared<tessel::Raster>(*poRasterIn, *poRasterIn);
    ProcessBlock(poRasterIn.get(), poMaskIn.get(), poRasterOut.get(), poMaskOut.get());
    return poRasterOut;
}

}  // namespace kor::filters
