#include "processes/qrdfilters/filtergauss.h"

#include <algorithm>
#include <cmath>
#include <cstdint>
#include <limits>
#include <span>
#include <vector>

#include "platform/exception/exception.h"
#include "platform/system/translate.h"
#include "processes/qrdfilters/blockcontract.h"
#include "processes/qrdfilters/findbyte.h"
#include "processes/qrdfilters/kernels/gaussrows.h"
#include "processes/qrdfilters/requireparameter.h"
#include "processes/qrdfilters/stencil/stencilblock.h"
#include "processes/qrdfilters/validwindows.h"

namespace kor::filters
{

namespace
{

constexpr const char* kSource = "processes/qrdfilters/filtergauss";

// Long, since memory is read fastest in one go: the rows of a window stay in the second cache.
constexpr std::size_t kShortestTile = 4096;

bool IsDefined(double dfSigmasq)
{
    return !(std::fabs(dfSigmasq) < std::numeric_limits<double>::epsilon());
}

bool IsInRange(double dfSigmasq)
{
    return dfSigmasq >= 1.0 && dfSigmasq <= 32.0;
}

void RequireSigma(bool bHolds, const char* pszMessage)
{
    if (!bHolds)
    {
        throw ParameterException("", ParameterException::Type::eInvalidValue, "", "", _(pszMessage),
                                 "", "", 0);
    }
}

/// Meant: sample x of the row for all channels of pixel x.
/// See FilterGauss.GivesSkippedPixelsSampleXOfTheRow.
void WriteRowSamples(std::span<const unsigned char> oComputed, const unsigned char* pRowIn,
                     std::size_t x, std::size_t nChannels, unsigned char* pOut)
{
    const auto* pSamples = reinterpret_cast<const double*>(pRowIn) + x;
    auto* pResults = reinterpret_cast<double*>(pOut);
    for (std::size_t i = 0; i < oComputed.size(); ++i)
    {
        if (oComputed[i] == 0)
        {
            std::fill_n(pResults + i * nChannels, nChannels, pSamples[i]);
        }
    }
}

/// Smooths rows of a tile; windows with a masked pixel one by one.
class GaussCore
{
public:
    GaussCore(const stencil::StencilBlock& oBlock, const kernels::GaussKernels& oKernels)
        : moBlock(oBlock), moKernels(oKernels)
    {
    }

    void operator()(const kernels::StencilRows& oRows, const stencil::StencilPlace& oPlace,
                    std::span<double* const> oResults)
    {
        if (oRows.moValid.empty())
        {
            kernels::SmoothRows(oRows, moKernels, mvdfColumns, oResults, oPlace.mbStreamed);
            return;
        }
        const std::size_t nPixels = oRows.mnSamples / oRows.mnStep;
        for (std::size_t j = 0; j < oResults.size(); ++j)
        {
            kernels::StencilRows oRow = oRows;
            oRow.moSamples = oRows.moSamples.subspan(j, oRows.mnHeight);
            oRow.moValid = oRows.moValid.subspan(j, oRows.mnHeight);
            SmoothRow(oRow, oPlace.x, oPlace.y + static_cast<std::int64_t>(j),
                      oPlace.moComputed.subspan(j * nPixels, nPixels), oResults.subspan(j, 1));
        }
    }

private:
    /// One output row, from pixel (x, y) on.
    void SmoothRow(const kernels::StencilRows& oRow, std::int64_t x, std::int64_t y,
                   std::span<const unsigned char> oComputed, std::span<double* const> oResult)
    {
        mvDirect.resize(oComputed.size());
        FindWholeWindows(*moBlock.mpoValid, moBlock.moWindow.mnHalfX, moBlock.moWindow.mnHalfY, x,
                         y, mvDirect);
        if (FindByte(mvDirect, 0, 1) != mvDirect.size())
        {
            kernels::SmoothRows(oRow, moKernels, mvdfColumns, oResult, false);
        }
        std::transform(mvDirect.begin(), mvDirect.end(), oComputed.begin(), mvDirect.begin(),
                       [](unsigned char nWhole, unsigned char nComputed)
                       { return static_cast<unsigned char>(nComputed & ~nWhole); });
        SmoothDirect(oRow, {oResult[0], oRow.mnSamples});
    }

    /// The pixels where mvDirect is 1.
    void SmoothDirect(const kernels::StencilRows& oRow, std::span<double> vdfOut) const
    {
        const std::size_t nStep = oRow.mnStep;
        std::size_t nFirst = FindByte(mvDirect, 0, 1);
        while (nFirst != mvDirect.size())
        {
            const std::size_t nEnd = FindByte(mvDirect, nFirst, 0);
            kernels::SmoothMasked(oRow, moKernels, nFirst * nStep,
                                  vdfOut.subspan(nFirst * nStep, (nEnd - nFirst) * nStep));
            nFirst = FindByte(mvDirect, nEnd, 1);
        }
    }

    const stencil::StencilBlock& moBlock;
    kernels::GaussKernels moKernels;
    std::vector<double> mvdfColumns;
    std::vector<unsigned char> mvDirect;
};

}  // namespace

FilterGauss::FilterGauss(double dfSigmasq1, double dfSigmasq2)
{
    SetSigma(dfSigmasq1, dfSigmasq2);
}

void FilterGauss::SetSigma(double dfSigmasq1, double dfSigmasq2)
{
    mdfSigmasq1 = dfSigmasq1;
    mdfSigmasq2 = dfSigmasq2;
    ComputeKernel();
}

void FilterGauss::SetFilterSize(int nSizeX, int nSizeY)
{
    moFilterSizeX = nSizeX;
    moFilterSizeY = nSizeY;
}

void FilterGauss::SetFilterSize(boost::optional<int> nSizeX, boost::optional<int> nSizeY)
{
    moFilterSizeX = nSizeX;
    moFilterSizeY = nSizeY;
}

void FilterGauss::SetBGZero(bool bBGZero)
{
    mbBGZero = bBGZero;
}

void FilterGauss::ComputeKernel()
{
    const bool bFirst = IsDefined(mdfSigmasq1);
    const bool bSecond = IsDefined(mdfSigmasq2);
    RequireSigma(bFirst || bSecond, "Neither mdfSigmasq1 or mdfSigmasq2 is defined");
    RequireSigma(!bFirst || IsInRange(mdfSigmasq1),
                 "mdfSigmasq1 must be in the range of 1.0 to 32.0");
    RequireSigma(!bSecond || IsInRange(mdfSigmasq2),
                 "mdfSigmasq2 must be in the range of 1.0 to 32.0");
    RequireSigma(bFirst, "mdfSigmasq2 is defined but mdfSigmasq1 is not defined");
    mbTwoKernels = bSecond;
    mnFilterSize = 2 * static_cast<int>(std::max(mdfSigmasq1, mdfSigmasq2)) + 1;
    RequireSigma(mnFilterSize >= 3, "wrong filter size derived from mdfSigmasq1 or mdfSigmasq2");
    BuildKernel(mdfSigmasq1, madfKernel1);
    if (mbTwoKernels)
    {
        BuildKernel(mdfSigmasq2, madfKernel2);
    }
}

void FilterGauss::BuildKernel(double dfSigmasq, Kernel& adfKernel) const
{
    const auto nSize = static_cast<std::size_t>(mnFilterSize);
    const std::size_t nHalf = nSize / 2;
    const double d = 2.0 * dfSigmasq;
    double dfSum = 0.0;
    for (std::size_t k = 0; k < nSize; ++k)
    {
        const double i = static_cast<double>(k) - static_cast<double>(nHalf);
        adfKernel[k] = k <= nHalf ? std::exp(-(i * i / d)) : adfKernel[nSize - 1 - k];
        dfSum += adfKernel[k];
    }
    double dfSumOfQuotients = 0.0;
    for (std::size_t k = 0; k < nSize; ++k)
    {
        adfKernel[k] /= dfSum;
        dfSumOfQuotients += adfKernel[k];
    }
    adfKernel[nHalf] = 1.0 - dfSumOfQuotients + adfKernel[nHalf];
}

void FilterGauss::Process(tessel::Raster* poRasterIn, tessel::Mask* poMaskIn,
                          tessel::Raster* poRasterOut, tessel::Mask* poMaskOut) const
{
    ProcessBlock(poRasterIn, poMaskIn, poRasterOut, poMaskOut);
}

void FilterGauss::ProcessBlock(tessel::Raster* poRasterIn, tessel::Mask* poMaskIn,
                               tessel::Raster* poRasterOut, tessel::Mask* poMaskOut) const
{
    RequireParameter(mnFilterSize != 0, "mnFilterSize", "The filter size was not set", kSource);
    const auto nHalf = static_cast<std::uint32_t>((mnFilterSize - 1) / 2);
    const Window oWindow{nHalf, nHalf};
    RequireParameter(FitsMargins(oWindow, *poRasterIn), "oRasterIn",
                     "The Margin of the input raster is too small", kSource);
    RequireDoubleBlocks(*poRasterIn, poMaskIn, *poRasterOut, poMaskOut, kSource);

    stencil::SampleTypes oTypes = stencil::SampleTypesOf<double, double>(true);
    oTypes.mpfnBackground = mbBGZero ? nullptr : WriteRowSamples;
    stencil::StencilBlock oBlock(*poRasterIn, poMaskIn, *poRasterOut, poMaskOut, oWindow, oTypes);
    oBlock.mnShortestTile = kShortestTile;
    oBlock.mbCoreStreams = true;
    kernels::GaussKernels oKernels{{madfKernel1.data(), nHalf + 1}, {}};
    if (mbTwoKernels)
    {
        oKernels.moSecond = {madfKernel2.data(), nHalf + 1};
    }
    stencil::FilterRows(oBlock, 0, poRasterIn->mnHeight, GaussCore(oBlock, oKernels));
}

}  // namespace kor::filters
