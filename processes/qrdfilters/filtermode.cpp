#include "processes/qrdfilters/filtermode.h"

#include <algorithm>
#include <span>

#include "basic/core/typedispatch/extendtypedispatch.h"
#include "platform/exception/exception.h"
#include "platform/system/translate.h"
#include "processes/qrdfilters/background.h"
#include "processes/qrdfilters/blockcontract.h"
#include "processes/qrdfilters/modeselection.h"
#include "processes/qrdfilters/rowbands.h"
#include "processes/qrdfilters/samplerows.h"

namespace kor::filters
{

namespace
{

constexpr const char* kSource = "processes/qrdfilters/filtermode";

// Rows that are worked on together: enough to make light of the window's rows above them.
constexpr std::uint32_t kBandRows = 64;

Window ModeWindow(const tessel::Raster& oRaster, bool bThinLine)
{
    if (!bThinLine)
    {
        return WindowOfMargins(oRaster);
    }
    if (oRaster.mnMarginX == 0 || oRaster.mnMarginY == 0)
    {
        throw ParameterException("", ParameterException::Type::eInvalidValue,
                                 _("Filter size must be 3x3"), "", "", "", "", 0);
    }
    return {1, 1};
}

/// Clears the bytes of the samples that are kept. The difference is taken in single precision, for
/// samples of all types.
void FindKeptSamples(std::span<const float> vfSamples, std::span<const float> vfKeepValues,
                     std::span<unsigned char> oChanged)
{
    std::fill(oChanged.begin(), oChanged.end(), static_cast<unsigned char>(1));
    for (const float fKeepValue : vfKeepValues)
    {
        for (std::size_t i = 0; i < oChanged.size(); ++i)
        {
            const double dfDifference = vfSamples[i] - fKeepValue;
            const bool bKept = -1e-9 < dfDifference && dfDifference < 1e-9;
            oChanged[i] &= bKept ? 0 : 1;
        }
    }
}

}  // namespace

template <class TIn, class TOut>
class FilterMode::InnerProcessor : public IClipperProcessor, public details::ModeParams
{
public:
    void Process(tessel::Raster* poRasterIn, tessel::Mask* poMaskIn, tessel::Raster* poRasterOut,
                 tessel::Mask* poMaskOut) const override;

private:
    /// Writes the samples of row y that are kept.
    void WriteKept(const tessel::Raster& oRasterIn, std::uint32_t y,
                   const tessel::Raster& oRasterOut) const;
};

template <class TIn, class TOut>
void FilterMode::InnerProcessor<TIn, TOut>::Process(tessel::Raster* poRasterIn,
                                                    tessel::Mask* poMaskIn,
                                                    tessel::Raster* poRasterOut,
                                                    tessel::Mask* poMaskOut) const
{
    RequireMatchingBlocks(*poRasterIn, poMaskIn, *poRasterOut, poMaskOut, kSource);
    const Window oWindow = ModeWindow(*poRasterIn, mbThinLine);
    const std::unique_ptr<tessel::Raster> poValid(poMaskIn ? poMaskIn->CreateRaster() : nullptr);
    const ModeSelection<TIn> oModes(*poRasterIn, poValid.get(), oWindow, mbThinLine);
    const bool bAllComputed = poMaskIn == nullptr && poMaskOut == nullptr;
    const std::size_t nWidth = poRasterIn->mnWidth;
    const auto oStore = [&](std::uint32_t y, std::size_t nFirst, std::span<const double> vdfModes)
    { StoreSamples<TOut>(vdfModes, poRasterOut->GetPixelAs<TOut>(0, y) + nFirst); };
    const auto oBand = [&](std::uint32_t nFirst, std::uint32_t nEnd)
    {
        std::vector<unsigned char> vComputed(bAllComputed ? 0 : (nEnd - nFirst) * nWidth);
        const auto oRow = [&](std::uint32_t y)
        { return std::span(vComputed).subspan((y - nFirst) * nWidth, nWidth); };
        for (std::uint32_t y = nFirst; y < nEnd && !bAllComputed; ++y)
        {
            FindComputedPixels(poMaskIn, poMaskOut, 0, y, oRow(y));
        }
        oModes.SelectRows(nFirst, nEnd, vComputed, oStore);
        for (std::uint32_t y = nFirst; y < nEnd; ++y)
        {
            if (!mvfKeepValues.empty())
            {
                WriteKept(*poRasterIn, y, *poRasterOut);
            }
            if (!bAllComputed)
            {
                WriteBackground(oRow(y), poRasterIn->GetPixelAs<const TIn>(0, y),
                                poRasterIn->mnChannels, mbBGZero,
                                poRasterOut->GetPixelAs<TOut>(0, y));
            }
        }
    };
    ForEachRowBand(poRasterIn->mnHeight, kBandRows, oBand);
}

template <class TIn, class TOut>
void FilterMode::InnerProcessor<TIn, TOut>::WriteKept(const tessel::Raster& oRasterIn,
                                                      std::uint32_t y,
                                                      const tessel::Raster& oRasterOut) const
{
    const TIn* pIn = oRasterIn.GetPixelAs<const TIn>(0, y);
    std::vector<float> vfSamples(std::size_t{oRasterIn.mnWidth} * oRasterIn.mnChannels);
    ConvertSamples<TIn, float>(pIn, vfSamples.data(), vfSamples.size());
    std::vector<unsigned char> vChanged(vfSamples.size());
    FindKeptSamples(vfSamples, mvfKeepValues, vChanged);
    WriteBackground(vChanged, pIn, 1, false, oRasterOut.GetPixelAs<TOut>(0, y));
}

FilterMode::FilterMode(std::vector<float> vfKeepValues, bool bThinLine)
    : details::ModeParams(std::move(vfKeepValues), bThinLine)
{
}

void FilterMode::Process(tessel::Raster* poRasterIn, tessel::Mask* poMaskIn,
                         tessel::Raster* poRasterOut, tessel::Mask* poMaskOut) const
{
    RequireRasters(poRasterIn, poRasterOut, kSource);
    RequireRealOutput(*poRasterOut, kSource);

    const RealInput oInput(poRasterIn);
    const IClipperProcessor& oProcessor = SelectProcessor<InnerProcessor, details::ModeParams>(
        oInput.Get()->moDataType, poRasterOut->moDataType, *this);
    oProcessor.Process(oInput.Get(), poMaskIn, poRasterOut, poMaskOut);
}

}  // namespace kor::filters
