#include "processes/qrdfilters/filtermedian.h"

#include <algorithm>
#include <array>
#include <span>
#include <vector>

#include "basic/core/typedispatch/extendtypedispatch.h"
#include "processes/qrdfilters/background.h"
#include "processes/qrdfilters/blockcontract.h"
#include "processes/qrdfilters/medianselection.h"
#include "processes/qrdfilters/rowbands.h"
#include "processes/qrdfilters/samplerows.h"

namespace kor::filters
{

namespace
{

constexpr const char* kSource = "processes/qrdfilters/filtermedian";

// Rows that are worked on together: enough to make light of the window's rows above them.
constexpr std::uint32_t kBandRows = 64;

/// True where a direct conversion gives what the way through double gives: the types that double
/// holds exactly, but for float to integers, where the direct way would round in single precision.
template <class TIn, class TOut>
constexpr bool kDirectStore =
    std::is_same_v<TIn, TOut>
        ? sizeof(TIn) < 8 || std::is_same_v<TIn, double>
        : sizeof(TIn) < 4 || std::is_same_v<TIn, int> || std::is_same_v<TIn, unsigned int> ||
              std::is_same_v<TIn, double>;

/// Stores selected samples by way of double.
template <class TIn, class TOut>
void StoreSelected(std::span<const TIn> oSelected, TOut* pOut)
{
    if constexpr (kDirectStore<TIn, TOut>)
    {
        ConvertSamples<TIn, TOut>(oSelected.data(), pOut, oSelected.size());
    }
    else
    {
        std::array<double, 512> adfSamples;
        while (!oSelected.empty())
        {
            const std::size_t nCount = std::min(oSelected.size(), adfSamples.size());
            LoadSamples<TIn>(oSelected.data(), {adfSamples.data(), nCount});
            StoreSamples<TOut>({adfSamples.data(), nCount}, pOut);
            oSelected = oSelected.subspan(nCount);
            pOut += nCount;
        }
    }
}

}  // namespace

template <class TIn, class TOut>
class FilterMedian::InnerProcessor : public IClipperProcessor, public details::MedianParams
{
public:
    void Process(tessel::Raster* poRasterIn, tessel::Mask* poMaskIn, tessel::Raster* poRasterOut,
                 tessel::Mask* poMaskOut) const override;

private:
    /// Selects the medians of a band of rows and stores them.
    static void WriteMedians(const MedianSelection<TIn>& oMedians, std::uint32_t nFirst,
                             std::uint32_t nEnd, std::span<const unsigned char> oComputed,
                             const tessel::Raster& oRasterOut);
};

template <class TIn, class TOut>
void FilterMedian::InnerProcessor<TIn, TOut>::Process(tessel::Raster* poRasterIn,
                                                      tessel::Mask* poMaskIn,
                                                      tessel::Raster* poRasterOut,
                                                      tessel::Mask* poMaskOut) const
{
    RequireMatchingBlocks(*poRasterIn, poMaskIn, *poRasterOut, poMaskOut, kSource);
    const std::unique_ptr<tessel::Raster> poValid(poMaskIn ? poMaskIn->CreateRaster() : nullptr);
    const MedianSelection<TIn> oMedians(*poRasterIn, poValid.get());
    const bool bAllComputed = poMaskIn == nullptr && poMaskOut == nullptr;
    const std::size_t nWidth = poRasterIn->mnWidth;
    const auto oBand = [&](std::uint32_t nFirst, std::uint32_t nEnd)
    {
        std::vector<unsigned char> vComputed(bAllComputed ? 0 : (nEnd - nFirst) * nWidth);
        const auto oRow = [&](std::uint32_t y)
        { return std::span(vComputed).subspan((y - nFirst) * nWidth, nWidth); };
        for (std::uint32_t y = nFirst; y < nEnd && !bAllComputed; ++y)
        {
            FindComputedPixels(poMaskIn, poMaskOut, 0, y, oRow(y));
        }
        WriteMedians(oMedians, nFirst, nEnd, vComputed, *poRasterOut);
        for (std::uint32_t y = nFirst; y < nEnd && !bAllComputed; ++y)
        {
            WriteBackground(oRow(y), poRasterIn->GetPixelAs<const TIn>(0, y),
                            poRasterIn->mnChannels, mbBGZero, poRasterOut->GetPixelAs<TOut>(0, y));
        }
    };
    ForEachRowBand(poRasterIn->mnHeight, kBandRows, oBand);
}

template <class TIn, class TOut>
void FilterMedian::InnerProcessor<TIn, TOut>::WriteMedians(const MedianSelection<TIn>& oMedians,
                                                           std::uint32_t nFirst, std::uint32_t nEnd,
                                                           std::span<const unsigned char> oComputed,
                                                           const tessel::Raster& oRasterOut)
{
    if constexpr (std::is_same_v<TIn, TOut> && kDirectStore<TIn, TOut>)
    {
        oMedians.SelectRows(nFirst, nEnd, oComputed, oRasterOut.GetPixelAs<TOut>(0, nFirst),
                            oRasterOut.GetRowSamples());
    }
    else
    {
        const std::size_t nSamples = oMedians.RowSamples();
        std::vector<TIn> vSelected((nEnd - nFirst) * nSamples);
        oMedians.SelectRows(nFirst, nEnd, oComputed, vSelected.data(), nSamples);
        for (std::uint32_t y = nFirst; y < nEnd; ++y)
        {
            StoreSelected<TIn, TOut>(
                std::span(vSelected).subspan((y - nFirst) * nSamples, nSamples),
                oRasterOut.GetPixelAs<TOut>(0, y));
        }
    }
}

void FilterMedian::Process(tessel::Raster* poRasterIn, tessel::Mask* poMaskIn,
                           tessel::Raster* poRasterOut, tessel::Mask* poMaskOut) const
{
    RequireRasters(poRasterIn, poRasterOut, kSource);
    RequireRealOutput(*poRasterOut, kSource);

    const RealInput oInput(poRasterIn);
    const IClipperProcessor& oProcessor = SelectProcessor<InnerProcessor, details::MedianParams>(
        oInput.Get()->moDataType, poRasterOut->moDataType, *this);
    oProcessor.Process(oInput.Get(), poMaskIn, poRasterOut, poMaskOut);
}

}  // namespace kor::filters
