#include "processes/qrdfilters/filterclr.h"

#include <algorithm>
#include <cstring>
#include <span>

#include "basic/core/typedispatch/extendtypedispatch.h"
#include "platform/exception/exception.h"
#include "processes/qrdfilters/blockcontract.h"
#include "processes/qrdfilters/cutsample.h"
#include "processes/qrdfilters/findbyte.h"
#include "processes/qrdfilters/rowbands.h"

namespace kor::filters
{

using tessel::Mask;
using tessel::Raster;

namespace
{

constexpr const char* kSource = "processes/qrdfilters/filterclr";

constexpr const char* kNoValues = "You have to Set the values before calling Process.";

constexpr std::uint32_t kBandRows = 64;
// Bytes that are copied at a time: they stay in the first-level cache.
constexpr std::size_t kBrushBytes = 4096;

void Require(bool bHolds, const char* pszMessage, const char* pszFunction, unsigned int nLine)
{
    if (!bHolds)
    {
        throw Exception(pszMessage, kSource, pszFunction, nLine);
    }
}

/// Cuts nCount samples of one type to another one.
using CutRow = void (*)(const void* pIn, void* pOut, std::size_t nCount);

template <class TIn, class TOut>
void CutSamples(const void* pIn, void* pOut, std::size_t nCount)
{
    if constexpr (std::is_same_v<TIn, TOut>)
    {
        if (nCount != 0)
        {
            std::memmove(pOut, pIn, nCount * sizeof(TOut));
        }
    }
    else
    {
        const auto* const pFrom = static_cast<const TIn*>(pIn);
        auto* const pTo = static_cast<TOut*>(pOut);
        for (std::size_t i = 0; i < nCount; ++i)
        {
            pTo[i] = CutSample<TIn, TOut>(pFrom[i]);
        }
    }
}

/// The value of each of nChannels channels.
std::vector<double> ValuesOfChannels(const std::vector<double>& vdfValues, std::size_t nChannels)
{
    std::vector<double> vdfChannels(vdfValues);
    vdfChannels.resize(nChannels, vdfValues.empty() ? 0.0 : vdfValues.back());
    return vdfChannels;
}

/// Fills runs of pixels with copies of one pixel.
class Brush
{
public:
    explicit Brush(std::span<const unsigned char> oPixel)
        : mbUniform(std::all_of(oPixel.begin(), oPixel.end(),
                                [&](unsigned char nByte) { return nByte == oPixel.front(); }))
    {
        const std::size_t nPixels = oPixel.empty() ? 0 : 1 + kBrushBytes / oPixel.size();
        for (std::size_t i = 0; i < nPixels; ++i)
        {
            mvBytes.insert(mvBytes.end(), oPixel.begin(), oPixel.end());
        }
    }

    /// nBytes is a multiple of the pixel's size.
    void Fill(unsigned char* pOut, std::size_t nBytes) const
    {
        if (mbUniform && nBytes != 0)
        {
            std::memset(pOut, mvBytes.front(), nBytes);
            return;
        }
        while (nBytes != 0)
        {
            const std::size_t nPart = std::min(nBytes, mvBytes.size());
            std::memcpy(pOut, mvBytes.data(), nPart);
            pOut += nPart;
            nBytes -= nPart;
        }
    }

private:
    bool mbUniform;
    std::vector<unsigned char> mvBytes;
};

/// What all pairs of types share.
class ClrProcessor : public IProcessor, public details::ClrParams
{
public:
    void Process(Raster* poRasterIn, Mask* poMask, Raster* poRasterOut) const override
    {
        const Raster& oOut = *poRasterOut;
        std::vector<unsigned char> vPixel(oOut.mnChannels * oOut.moDataType.GetSampleBytes());
        mpfnCutValues(ValuesOfChannels(mvdfValues, oOut.mnChannels).data(), vPixel.data(),
                      oOut.mnChannels);
        const Brush oBrush(vPixel);
        if (poMask != nullptr)
        {
            RequireMatchingBlocks(*poRasterIn, poMask, oOut, nullptr, kSource);
        }
        const auto oBand = [&](std::uint32_t nFirst, std::uint32_t nEnd)
        {
            std::vector<unsigned char> vCleared(oOut.mnWidth, 1);
            for (std::uint32_t y = nFirst; y < nEnd; ++y)
            {
                if (poMask != nullptr)
                {
                    poMask->ExpandRow(0, y, vCleared);
                }
                ClearRow(*poRasterIn, vCleared, oBrush, oOut, y);
            }
        };
        ForEachRowBand(oOut.mnHeight, kBandRows, oBand);
    }

protected:
    ClrProcessor(CutRow pfnCutValues, CutRow pfnCutInput)
        : mpfnCutValues(pfnCutValues), mpfnCutInput(pfnCutInput)
    {
    }

private:
    /// oCleared has 1 where a pixel gets the constant and 0 where it gets the input.
    void ClearRow(const Raster& oIn, std::span<const unsigned char> oCleared, const Brush& oBrush,
                  const Raster& oOut, std::uint32_t y) const
    {
        const std::size_t nBytes = oOut.mnChannels * oOut.moDataType.GetSampleBytes();
        for (std::size_t x = 0; x < oCleared.size();)
        {
            const std::size_t nKept = FindByte(oCleared, x, 0);
            oBrush.Fill(oOut.GetPixel(static_cast<std::int64_t>(x), y), (nKept - x) * nBytes);
            x = FindByte(oCleared, nKept, 1);
            const auto nFirst = static_cast<std::int64_t>(nKept);
            if (x != nKept)
            {
                mpfnCutInput(oIn.GetPixel(nFirst, y), oOut.GetPixel(nFirst, y),
                             (x - nKept) * oOut.mnChannels);
            }
        }
    }

    CutRow mpfnCutValues;
    CutRow mpfnCutInput;
};

}  // namespace

template <class TIn, class TOut>
class FilterClr::InnerProcessor : public ClrProcessor
{
public:
    InnerProcessor() : ClrProcessor(CutSamples<double, TOut>, CutSamples<TIn, TOut>) {}
};

FilterClr::FilterClr(std::vector<double> vdfValues)
{
    mvdfValues = std::move(vdfValues);
}

void FilterClr::Process(Raster* poRasterIn, Mask* poMask, Raster* poRasterOut) const
{
    Require(poRasterOut != nullptr, "poRasterOut is NULL", __PRETTY_FUNCTION__, __LINE__);
    Raster* const poInput = poRasterIn != nullptr ? poRasterIn : poRasterOut;
    SelectProcessor<InnerProcessor, details::ClrParams>(poInput->moDataType,
                                                        poRasterOut->moDataType, *this)
        .Process(poInput, poMask, poRasterOut);
}

void CLRAlgorithm::SetValues(std::vector<double> vdfValues)
{
    mpoFilter = std::make_shared<FilterClr>(std::move(vdfValues));
}

void CLRAlgorithm::ProcessBlock(Raster* poRasterIn, Raster* poRasterOut) const
{
    Require(mpoFilter != nullptr, kNoValues, __PRETTY_FUNCTION__, __LINE__);
    std::unique_ptr<Mask> poMask;
    if (mpoMaskBuilder != nullptr && poRasterIn != nullptr)
    {
        poMask.reset(mpoMaskBuilder->BuildMask(*poRasterIn));
    }
    Process(poRasterIn, poMask.get(), poRasterOut);
}

void CLRAlgorithm::Process(Raster* poRasterIn, Mask* poMask, Raster* poRasterOut) const
{
    Require(mpoFilter != nullptr, kNoValues, __PRETTY_FUNCTION__, __LINE__);
    mpoFilter->Process(poRasterIn, poMask, poRasterOut);
}

}  // namespace kor::filters
