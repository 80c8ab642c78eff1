#include "processes/qrdfilters/datacopy.h"

#include <cstring>
#include <span>

#include "basic/core/typedispatch/extendtypedispatch.h"
#include "platform/exception/exception.h"
#include "processes/qrdfilters/blockcontract.h"
#include "processes/qrdfilters/findbyte.h"
#include "processes/qrdfilters/rowbands.h"
#include "processes/qrdfilters/samplerows.h"

namespace kor::filters
{

using tessel::Mask;
using tessel::Raster;

namespace
{

constexpr const char* kSource = "processes/qrdfilters/datacopy";

constexpr std::uint32_t kBandRows = 64;

void Require(bool bHolds, const char* pszMessage, const char* pszFunction, unsigned int nLine)
{
    if (!bHolds)
    {
        throw Exception(pszMessage, kSource, pszFunction, nLine);
    }
}

/// Copies the pixels of a block whose samples are nParts elements each, of the types at the
/// positions nIn and nOut of StandardTypeList. Nothing here is compiled for a pair of types.
class BlockCopy
{
public:
    BlockCopy(std::size_t nIn, std::size_t nOut, const Raster& oIn, const Raster& oOut,
              std::size_t nParts)
        : mnIn(nIn),
          mnOut(nOut),
          moIn(oIn),
          moOut(oOut),
          mnPixelElements(oIn.mnChannels * nParts),
          mnPixelBytesIn(oIn.mnChannels * oIn.moDataType.GetSampleBytes()),
          mnPixelBytesOut(oIn.mnChannels * oOut.moDataType.GetSampleBytes())
    {
    }

    void CopyAll() const
    {
        ForEachRowBand(moIn.mnHeight, kBandRows,
                       [&](std::uint32_t nFirst, std::uint32_t nEnd)
                       {
                           for (std::uint32_t y = nFirst; y < nEnd; ++y)
                           {
                               CopyPixels(y, 0, moIn.mnWidth);
                           }
                       });
    }

    void CopyValid(const Mask& oMask, bool bKeepOutput) const
    {
        ForEachRowBand(moIn.mnHeight, kBandRows,
                       [&](std::uint32_t nFirst, std::uint32_t nEnd)
                       {
                           std::vector<unsigned char> vValid(moIn.mnWidth);
                           for (std::uint32_t y = nFirst; y < nEnd; ++y)
                           {
                               oMask.ExpandRow(0, y, vValid);
                               CopyRuns(y, vValid, bKeepOutput);
                           }
                       });
    }

private:
    void CopyRuns(std::uint32_t y, std::span<const unsigned char> oValid, bool bKeepOutput) const
    {
        for (std::size_t x = 0; x < oValid.size();)
        {
            const std::size_t nValid = FindByte(oValid, x, 1);
            if (!bKeepOutput)
            {
                // Zero is all zero bytes in each of the types.
                std::memset(moOut.GetPixel(static_cast<std::int64_t>(x), y), 0,
                            (nValid - x) * mnPixelBytesOut);
            }
            x = FindByte(oValid, nValid, 0);
            CopyPixels(y, nValid, x - nValid);
        }
    }

    void CopyPixels(std::uint32_t y, std::size_t x, std::size_t nPixels) const
    {
        details::ConvertRow(mnIn, mnOut, moIn.GetPixel(0, y) + x * mnPixelBytesIn,
                            moOut.GetPixel(0, y) + x * mnPixelBytesOut, nPixels * mnPixelElements);
    }

    std::size_t mnIn;
    std::size_t mnOut;
    const Raster& moIn;
    const Raster& moOut;
    std::size_t mnPixelElements;
    std::size_t mnPixelBytesIn;
    std::size_t mnPixelBytesOut;
};

/// What all pairs of types share.
class CopyProcessor : public IComplexProcessor, public details::QRDDataCopyParams
{
public:
    void Process(Raster* poRasterIn, Mask* poMaskIn, Raster* poRasterOut) const override
    {
        Copy(*poRasterIn, poMaskIn, *poRasterOut, 1);
    }
    void ProcessComplex(Raster* poRasterIn, Mask* poMaskIn, Raster* poRasterOut) const override
    {
        Copy(*poRasterIn, poMaskIn, *poRasterOut, 2);
    }

protected:
    CopyProcessor(std::size_t nIn, std::size_t nOut) : mnIn(nIn), mnOut(nOut) {}

private:
    void Copy(const Raster& oIn, const Mask* poMask, const Raster& oOut, std::size_t nParts) const
    {
        RequireMatchingBlocks(oIn, poMask, oOut, nullptr, kSource);
        const BlockCopy oCopy(mnIn, mnOut, oIn, oOut, nParts);
        if (poMask == nullptr)
        {
            oCopy.CopyAll();
        }
        else
        {
            oCopy.CopyValid(*poMask, mbKeepOutput);
        }
    }

    std::size_t mnIn;
    std::size_t mnOut;
};

}  // namespace

template <class TIn, class TOut>
class QRDDataCopy::InnerProcessor : public CopyProcessor
{
public:
    InnerProcessor()
        : CopyProcessor(typedispatch::ElementPosition<TIn>(), typedispatch::ElementPosition<TOut>())
    {
    }
};

void QRDDataCopy::Process(Raster* poRasterIn, Mask* poMaskIn, Raster* poRasterOut) const
{
    const char* const pszFunction = __PRETTY_FUNCTION__;
    Require(poRasterIn != nullptr, "poRasterIn is invalid pointer", pszFunction, 35);
    Require(poRasterOut != nullptr, "poRasterOut is invalid pointer", pszFunction, 39);
    Require(poRasterIn->moDataType.mbComplex == poRasterOut->moDataType.mbComplex,
            "Cannot copy from/to complex type to/from normal types.", pszFunction, 44);

    SelectProcessor<InnerProcessor, details::QRDDataCopyParams>(
        poRasterIn->moDataType, poRasterOut->moDataType, *this, true);
    // Unlike other filters, the copy takes its parameter anew for each block.
    dynamic_cast<details::QRDDataCopyParams&>(*mpoProcessor) = *this;
    if (moInputType.mbComplex)
    {
        mpoProcessor->ProcessComplex(poRasterIn, poMaskIn, poRasterOut);
    }
    else
    {
        mpoProcessor->Process(poRasterIn, poMaskIn, poRasterOut);
    }
}

void QRDDataCopyAlgorithm::Process(Raster* poRasterIn, Mask* poMaskIn, Raster* poRasterOut) const
{
    moCopy.Process(poRasterIn, poMaskIn, poRasterOut);
}

}  // namespace kor::filters
