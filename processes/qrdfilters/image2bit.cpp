#include "processes/qrdfilters/image2bit.h"

#include <algorithm>
#include <cmath>
#include <cstdint>
#include <cstring>
#include <limits>
#include <optional>
#include <span>

#include "basic/core/typedispatch/extendtypedispatch.h"
#include "processes/qrdfilters/blockcontract.h"
#include "processes/qrdfilters/kernels/flagrow.h"
#include "processes/qrdfilters/sampleconversion.h"
#include "processes/qrdfilters/samplerows.h"

namespace kor::filters
{

using kernels::FloatRange;
using kernels::IntegerRange;
using tessel::DataType;
using tessel::Mask;
using tessel::Raster;

namespace
{

constexpr const char* kSource = "processes/qrdfilters/image2bit";

// Samples that are worked on at a time: they stay in the first-level cache.
constexpr std::size_t kChunkSamples = 4096;

constexpr float kInfinity = std::numeric_limits<float>::infinity();

/// The lowest value above f, not a number where there is none.
float Above(float f)
{
    return f == kInfinity ? std::numeric_limits<float>::quiet_NaN() : std::nextafterf(f, kInfinity);
}

/// The greatest value below f, not a number where there is none.
float Below(float f)
{
    return -Above(-f);
}

/// The values that give 1.
FloatRange RangeOf(const std::vector<float>& vfThresholds, bool bCompMode, bool bComplex)
{
    const float fFirst = vfThresholds.empty() ? 0.0F : vfThresholds[0];
    if (vfThresholds.size() < 2)
    {
        // Meant: real and complex samples have opposite sides.
        if (bComplex)
        {
            return bCompMode ? FloatRange{Above(fFirst), kInfinity}
                             : FloatRange{-kInfinity, fFirst};
        }
        return bCompMode ? FloatRange{-kInfinity, Below(fFirst)} : FloatRange{fFirst, kInfinity};
    }
    const float fSecond = vfThresholds[1];
    if (bCompMode)
    {
        return {fFirst, fSecond, true};
    }
    return bComplex ? FloatRange{Above(fFirst), Below(fSecond)} : FloatRange{fFirst, fSecond};
}

/// The integers of one type in ascending order, numbered from 0.
template <class T>
class Integers
{
public:
    static constexpr std::uint64_t kLast =
        std::numeric_limits<std::make_unsigned_t<Arithmetic<T>>>::max();

    static std::uint64_t BitsOf(std::uint64_t nNumber)
    {
        return nNumber + static_cast<std::uint64_t>(std::numeric_limits<Arithmetic<T>>::min());
    }

    /// The number of the first one that fulfils oCondition as a float; all behind it do as well,
    /// since no conversion reverses an order.
    template <class Condition>
    static std::optional<std::uint64_t> FindFirst(const Condition& oCondition)
    {
        const auto oHolds = [&](std::uint64_t nNumber)
        { return oCondition(ConvertSample<T, float>(static_cast<T>(BitsOf(nNumber)))); };
        if (!oHolds(kLast))
        {
            return std::nullopt;
        }
        std::uint64_t nFirst = 0;
        std::uint64_t nLast = kLast;
        while (nFirst < nLast)
        {
            const std::uint64_t nMiddle = nFirst + (nLast - nFirst) / 2;
            if (oHolds(nMiddle))
            {
                nLast = nMiddle;
            }
            else
            {
                nFirst = nMiddle + 1;
            }
        }
        return nFirst;
    }
};

/// The integers of type T that oRange contains when they are seen as float.
template <class T>
IntegerRange IntegersOf(const FloatRange& oRange)
{
    const auto oAtLow = [&](float v)
    { return oRange.mbOutside ? !(v <= oRange.mfLow) : v >= oRange.mfLow; };
    const auto oAtHigh = [&](float v)
    { return oRange.mbOutside ? v >= oRange.mfHigh : !(v <= oRange.mfHigh); };
    const auto nFirst = Integers<T>::FindFirst(oAtLow);
    const auto nEnd = Integers<T>::FindFirst(oAtHigh);
    if (!nFirst || (nEnd && *nEnd <= *nFirst))
    {
        return {0, Integers<T>::kLast, !oRange.mbOutside};  // none between the limits
    }
    return {Integers<T>::BitsOf(*nFirst), (nEnd ? *nEnd - 1 : Integers<T>::kLast) - *nFirst,
            oRange.mbOutside};
}

/// What all pairs of types share.
class BitProcessor : public IProcessor, public details::ImageToBitParams
{
public:
    void Process(Raster* poRasterIn, Mask* poMaskIn, Raster* poRasterOut) const override;

protected:
    using FindIntegers = IntegerRange (*)(const FloatRange&);

    /// pfnFindIntegers is null for floating-point samples.
    BitProcessor(std::size_t nIn, std::size_t nOut, const DataType& oIn, const DataType& oOut,
                 FindIntegers pfnFindIntegers)
        : mnIn(nIn), mnOut(nOut), moIn(oIn), moOut(oOut), mpfnFindIntegers(pfnFindIntegers)
    {
    }

private:
    class BlockFlags;

    void RequireTypes(const Raster& oIn, const Raster& oOut) const;

    std::size_t mnIn;
    std::size_t mnOut;
    DataType moIn;
    DataType moOut;
    FindIntegers mpfnFindIntegers;
};

/// The comparison of one block.
class BitProcessor::BlockFlags
{
public:
    BlockFlags(const BitProcessor& oProcessor, const Raster& oIn)
        : moProcessor(oProcessor),
          mbComplex(oIn.moDataType.mbComplex),
          moRange(RangeOf(oProcessor.mvfThresholds, oProcessor.mbCompMode, mbComplex)),
          mvfValues(oProcessor.mpfnFindIntegers != nullptr && !mbComplex
                        ? 0
                        : std::max<std::size_t>(kChunkSamples, oIn.mnChannels))
    {
        if (oProcessor.mpfnFindIntegers != nullptr && !mbComplex)
        {
            moIntegers = oProcessor.mpfnFindIntegers(moRange);
        }
    }

    /// Compares oFlags.size() samples.
    void Find(const unsigned char* pIn, std::span<unsigned char> oFlags)
    {
        const std::span<float> oValues(mvfValues.data(), std::min(mvfValues.size(), oFlags.size()));
        if (mbComplex)
        {
            kernels::SquareMagnitudes(pIn, moProcessor.mnIn, oValues);
            kernels::FlagFloats(mvfValues.data(), moRange, oFlags);
        }
        else if (moProcessor.mpfnFindIntegers != nullptr)
        {
            kernels::FlagIntegers(pIn, moProcessor.moIn.GetSampleBytes(), moIntegers, oFlags);
        }
        else
        {
            details::ConvertRow(moProcessor.mnIn, typedispatch::ElementPosition<float>(), pIn,
                                mvfValues.data(), oFlags.size());
            kernels::FlagFloats(mvfValues.data(), moRange, oFlags);
        }
    }

private:
    const BitProcessor& moProcessor;
    bool mbComplex;
    FloatRange moRange;
    IntegerRange moIntegers;
    std::vector<float> mvfValues;
};

/// Clears the flags of all channels of masked pixels.
void ClearMasked(std::span<const unsigned char> oValid, std::size_t nChannels,
                 std::span<unsigned char> oFlags)
{
    for (std::size_t x = 0; x < oValid.size() && nChannels == 1; ++x)
    {
        oFlags[x] = oFlags[x] & oValid[x];
    }
    for (std::size_t i = 0; i < oFlags.size() && nChannels != 1; ++i)
    {
        oFlags[i] = oFlags[i] & oValid[i / nChannels];
    }
}

/// Puts the samples of pixels at pFrom into pixels of another size: those of the channels that both
/// have, and zeros in all channels of masked pixels. oValid has 1 or 0 a pixel.
void SpreadPixels(const unsigned char* pFrom, std::size_t nFromBytes,
                  std::span<const unsigned char> oValid, unsigned char* pOut, std::size_t nOutBytes)
{
    const std::size_t nCopied = std::min(nFromBytes, nOutBytes);
    for (std::size_t x = 0; x < oValid.size() && nOutBytes != 0; ++x)
    {
        if (oValid[x] == 0)
        {
            std::memset(pOut + x * nOutBytes, 0, nOutBytes);
        }
        else if (nCopied != 0)
        {
            std::memcpy(pOut + x * nOutBytes, pFrom + x * nFromBytes, nCopied);
        }
    }
}

void BitProcessor::Process(Raster* poRasterIn, Mask* poMaskIn, Raster* poRasterOut) const
{
    const Raster& oIn = *poRasterIn;
    const Raster& oOut = *poRasterOut;
    RequireMatchingSizes(oIn, poMaskIn, oOut, nullptr, kSource);
    RequireTypes(oIn, oOut);
    const std::size_t nChunk =
        std::max<std::size_t>(kChunkSamples / std::max<std::size_t>(oIn.mnChannels, 1), 1);
    const std::size_t nPixelBytesIn = oIn.mnChannels * oIn.moDataType.GetSampleBytes();
    const std::size_t nStoredBytes = oIn.mnChannels * moOut.GetSampleBytes();
    const std::size_t nPixelBytesOut = oOut.mnChannels * moOut.GetSampleBytes();
    BlockFlags oFlags(*this, oIn);
    std::vector<unsigned char> vFlags(nChunk * oIn.mnChannels);
    std::vector<unsigned char> vValid(nChunk, 1);
    std::vector<unsigned char> vStored(nPixelBytesOut != nStoredBytes ? nChunk * nStoredBytes : 0);
    for (std::uint32_t y = 0; y < oIn.mnHeight; ++y)
    {
        for (std::size_t x = 0; x < oIn.mnWidth; x += nChunk)
        {
            const std::size_t nPixels = std::min(nChunk, oIn.mnWidth - x);
            const std::span<unsigned char> oPart(vFlags.data(), nPixels * oIn.mnChannels);
            oFlags.Find(oIn.GetPixel(0, y) + x * nPixelBytesIn, oPart);
            if (poMaskIn != nullptr)
            {
                poMaskIn->ExpandRow(static_cast<std::int64_t>(x), y, {vValid.data(), nPixels});
                ClearMasked({vValid.data(), nPixels}, oIn.mnChannels, oPart);
            }
            unsigned char* const pOut = oOut.GetPixel(0, y) + x * nPixelBytesOut;
            const bool bSpreads = nPixelBytesOut != nStoredBytes;
            details::ConvertRow(typedispatch::ElementPosition<unsigned char>(), mnOut,
                                vFlags.data(), bSpreads ? vStored.data() : pOut, oPart.size());
            if (bSpreads)
            {
                SpreadPixels(vStored.data(), nStoredBytes, {vValid.data(), nPixels}, pOut,
                             nPixelBytesOut);
            }
        }
    }
}

/// The processor is kept for whatever the object is given, so that another pair of types would be
/// read as the first one.
void BitProcessor::RequireTypes(const Raster& oIn, const Raster& oOut) const
{
    DataType oType = moIn;
    oType.mbComplex = oIn.moDataType.mbComplex;
    RequireType(oIn, oType, "poRasterIn", kSource);
    RequireType(oOut, moOut, "poRasterOut", kSource);
}

template <class TIn>
constexpr auto FindIntegersOf()
{
    IntegerRange (*pfnFind)(const FloatRange&) = nullptr;
    if constexpr (std::is_integral_v<TIn>)
    {
        pfnFind = IntegersOf<TIn>;
    }
    return pfnFind;
}

}  // namespace

template <class TIn, class TOut>
class ImageToBit::InnerProcessor : public BitProcessor
{
public:
    InnerProcessor()
        : BitProcessor(typedispatch::ElementPosition<TIn>(), typedispatch::ElementPosition<TOut>(),
                       typedispatch::RealDataType<TIn>(), typedispatch::RealDataType<TOut>(),
                       FindIntegersOf<TIn>())
    {
    }
};

void ImageToBit::Process(Raster* poRasterIn, Mask* poMaskIn, Raster* poRasterOut) const
{
    RequireRasters(poRasterIn, poRasterOut, kSource);
    RequireRealOutput(*poRasterOut, kSource);
    // Unlike other filters, this one never looks at the types again.
    if (mpoProcessor == nullptr)
    {
        SelectProcessor<InnerProcessor, details::ImageToBitParams>(
            poRasterIn->moDataType, poRasterOut->moDataType, *this, true);
    }
    mpoProcessor->Process(poRasterIn, poMaskIn, poRasterOut);
}

}  // namespace kor::filters
