#include "processes/qrdfilters/convertraster.h"

#include <memory>
#include <string>

#include "platform/exception/exception.h"
#include "processes/qrdfilters/hardened.h"
#include "processes/qrdfilters/sampleconversion.h"

namespace kor::typedispatch
{

template IConvertTo* DualDispatch<filters::ConvertTo>::Create(const tessel::DataType&,
                                                              const tessel::DataType&);
template IConvertTo* DualDispatch<filters::ConvertToComplex>::Create(const tessel::DataType&,
                                                                     const tessel::DataType&);
template IConvertTo* DualDispatch<filters::ConvertToIntensity>::Create(const tessel::DataType&,
                                                                       const tessel::DataType&);

}  // namespace kor::typedispatch

namespace kor::filters
{

using tessel::Raster;

namespace
{

[[noreturn]] void Throw(const std::string& oMessage, unsigned int nLine)
{
    throw Exception(oMessage, "processes/qrdfilters/convertraster",
                    "void ConvertRaster(const Raster*, Raster*)", nLine);
}

std::size_t PixelCount(const Raster& oRaster)
{
    return std::size_t{oRaster.mnTotalHeight} * oRaster.mnTotalWidth;
}

/// Samples of the whole block, the parts of complex ones counted one by one.
std::size_t PartCount(const Raster& oRaster)
{
    return oRaster.mnTotalHeight * oRaster.GetRowSamples();
}

std::string Describe(const Raster& oRaster)
{
    return std::to_string(oRaster.mnTotalWidth) + " x " + std::to_string(oRaster.mnTotalHeight) +
           " pixels of " + std::to_string(oRaster.mnChannels) + " channels, margins included";
}

/// What the caller promises: no sample is read or written outside the two buffers.
void RequireRoom(const Raster* poIn, const Raster* poOut)
{
    if (poIn == nullptr || poOut == nullptr)
    {
        Throw(poIn == nullptr ? "poIn is invalid pointer" : "poOut is invalid pointer", __LINE__);
    }
    const bool bSameExtent =
        poIn->mnTotalWidth == poOut->mnTotalWidth && poIn->mnTotalHeight == poOut->mnTotalHeight;
    const bool bSameKind = poIn->moDataType.mbComplex == poOut->moDataType.mbComplex;
    const bool bChannels = bSameKind ? poIn->mnChannels <= poOut->mnChannels
                                     : (poIn->mnChannels == 0) == (poOut->mnChannels == 0);
    if (!bSameExtent || !bChannels)
    {
        Throw("poOut has " + Describe(*poOut) + ", poIn has " + Describe(*poIn), __LINE__);
    }
}

/// Runs a conversion of the family on the first nCount elements.
template <template <class, class> class Family>
void Run(const Raster& oIn, Raster& oOut, std::size_t nCount)
{
    const std::unique_ptr<IConvertTo> poConversion(
        typedispatch::DualDispatch<Family>::Create(oIn.moDataType, oOut.moDataType));
    if (poConversion == nullptr)
    {
        Throw("Invalid type to dispatch.", __LINE__);
    }
    (*poConversion)(oIn.mpBuffer, oOut.mpBuffer, nCount);
}

template <class TIn, class TOut>
void IntensityRow(const void* pIn, void* pOut, std::size_t nCount)
{
    const auto* pParts = static_cast<const TIn*>(pIn);
    auto* pTo = static_cast<TOut*>(pOut);
    for (std::size_t k = 0; k < nCount; ++k)
    {
        pTo[k] = IntensitySample<TIn, TOut>(pParts[2 * k], pParts[2 * k + 1]);
    }
}

using Row = void (*)(const void* pIn, void* pOut, std::size_t nCount);

constexpr auto kIntensityRows = typedispatch::MakePairTable<typedispatch::StandardTypeList>(
    []<class TIn, class TOut>() -> Row { return IntensityRow<TIn, TOut>; });

}  // namespace

void details::ConvertIntensityRow(std::size_t nIn, std::size_t nOut, const void* pIn, void* pOut,
                                  std::size_t nCount)
{
    kIntensityRows[nIn][nOut](pIn, pOut, nCount);
}

void ConvertRaster(const Raster* poIn, Raster* poOut)
{
    if (kHardened)
    {
        RequireRoom(poIn, poOut);
    }
    const bool bComplexIn = poIn->moDataType.mbComplex;
    const bool bComplexOut = poOut->moDataType.mbComplex;
    const std::uint64_t nChannelsIn = poIn->mnChannels;
    const std::uint64_t nChannelsOut = poOut->mnChannels;
    if (bComplexIn == bComplexOut)
    {
        Run<ConvertTo>(*poIn, *poOut, PartCount(*poIn));
    }
    else if (bComplexIn && nChannelsOut == 2 * nChannelsIn)
    {
        const Raster oParts(PartsAsChannels(*poIn), *poIn, poIn->mpBuffer, false);
        ConvertRaster(&oParts, poOut);
    }
    else if (bComplexOut && nChannelsIn == 2 * nChannelsOut)
    {
        Raster oParts(PartsAsChannels(*poOut), *poOut, poOut->mpBuffer, false);
        ConvertRaster(poIn, &oParts);
    }
    else if (!bComplexIn)
    {
        Run<ConvertToComplex>(*poIn, *poOut, PixelCount(*poIn));
    }
    else
    {
        Run<ConvertToIntensity>(*poIn, *poOut, PixelCount(*poIn));
    }
}

}  // namespace kor::filters
