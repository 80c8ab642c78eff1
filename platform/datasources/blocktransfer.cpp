#include "platform/datasources/blocktransfer.h"

#include <algorithm>
#include <cstring>
#include <memory>
#include <vector>

#include "platform/datasources/datatypename.h"
#include "platform/datasources/irasteraccess.h"
#include "platform/exception/exception.h"

namespace kor::datasources
{

namespace
{

constexpr std::int64_t kNothing = -1;  ///< in place of an image position: the sample is 0

/// The position in an image of n pixels that a position i, inside or outside, shows.
std::int64_t ShownPosition(std::int64_t i, std::int64_t n, int nEdgeMode)
{
    if (i >= 0 && i < n)
    {
        return i;
    }
    if (n == 0 || nEdgeMode == eEM_Zeros)
    {
        return kNothing;
    }
    if (nEdgeMode == eEM_Nearest || n == 1)
    {
        return std::clamp<std::int64_t>(i, 0, n - 1);
    }
    // Reflected at both edges again and again: a path of this period, there and back.
    const std::int64_t nPeriod = 2 * (n - 1);
    const std::int64_t nPhase = ((i % nPeriod) + nPeriod) % nPeriod;
    return std::min(nPhase, nPeriod - nPhase);
}

/// One direction of a block: which image position each of its columns (or rows) shows. The
/// positions shown, without kNothing, are a gapless range, since the reflected path has no jumps.
class Axis
{
public:
    Axis(std::uint32_t nOffset, std::uint32_t nMargin, std::uint32_t nTotal, std::uint32_t nImage,
         int nEdgeMode)
        : mnStart(std::int64_t{nOffset} - nMargin),
          mnImage(nImage),
          mnEdgeMode(nEdgeMode),
          mnTotal(nTotal),
          mnInsideBegin(static_cast<std::uint32_t>(std::clamp<std::int64_t>(-mnStart, 0, mnTotal))),
          mnInsideEnd(static_cast<std::uint32_t>(
              std::clamp<std::int64_t>(mnImage - mnStart, mnInsideBegin, mnTotal)))
    {
        // Those in the image show themselves: only the first and last have to be looked at.
        TakeShown(0, mnInsideBegin);
        TakeShown(mnInsideBegin, std::min(mnInsideBegin + 1, mnInsideEnd));
        TakeShown(std::max(mnInsideEnd, mnInsideBegin + 1) - 1, mnInsideEnd);
        TakeShown(mnInsideEnd, mnTotal);
    }

    std::uint32_t Total() const { return mnTotal; }
    std::uint32_t First() const { return static_cast<std::uint32_t>(mnFirst); }
    std::uint32_t Count() const
    {
        return mnFirst == kNothing ? 0 : static_cast<std::uint32_t>(mnLast - mnFirst + 1);
    }
    /// The columns that lie in the image.
    std::uint32_t InsideBegin() const { return mnInsideBegin; }
    std::uint32_t InsideEnd() const { return mnInsideEnd; }
    /// True when the columns in the image show all that the others show as well.
    bool InsideShowsAll() const { return mnInsideEnd - mnInsideBegin == Count(); }
    /// What column i shows, counted from First(); kNothing for a zero.
    std::int64_t Shown(std::uint32_t i) const
    {
        const std::int64_t nShown = ShownPosition(mnStart + i, mnImage, mnEdgeMode);
        return nShown == kNothing ? kNothing : nShown - mnFirst;
    }

private:
    void TakeShown(std::uint32_t nBegin, std::uint32_t nEnd)
    {
        for (std::uint32_t i = nBegin; i < nEnd; ++i)
        {
            const std::int64_t nShown = ShownPosition(mnStart + i, mnImage, mnEdgeMode);
            if (nShown != kNothing)
            {
                mnFirst = mnFirst == kNothing ? nShown : std::min(mnFirst, nShown);
                mnLast = std::max(mnLast, nShown);
            }
        }
    }

    std::int64_t mnStart;  ///< the position of column 0
    std::int64_t mnImage;
    int mnEdgeMode;
    std::uint32_t mnTotal;
    std::uint32_t mnInsideBegin;
    std::uint32_t mnInsideEnd;
    std::int64_t mnFirst = kNothing;  ///< of those shown
    std::int64_t mnLast = kNothing;
};

/// Samples of a rectangle in memory, the channels of a pixel side by side.
struct PixelArray
{
    PixelArray(unsigned char* pFirst, std::size_t nWidth, std::size_t nChannels,
               std::size_t nSampleBytes)
        : mpFirst(pFirst), moStrides{nSampleBytes, nSampleBytes * nChannels, 0}
    {
        moStrides.mnLine = moStrides.mnPixel * nWidth;
    }

    unsigned char* Row(std::size_t y) const { return mpFirst + y * moStrides.mnLine; }
    std::size_t PixelBytes() const { return moStrides.mnPixel; }
    std::size_t RowBytes() const { return moStrides.mnLine; }

    unsigned char* mpFirst;
    SampleStrides moStrides;
};

/// Fills columns nBegin to nEnd of a row with what they show of pShown.
void FillColumns(const Axis& oColumns, std::uint32_t nBegin, std::uint32_t nEnd,
                 const unsigned char* pShown, unsigned char* pRow, std::size_t nPixelBytes)
{
    for (std::uint32_t x = nBegin; x < nEnd; ++x)
    {
        unsigned char* pPixel = pRow + x * nPixelBytes;
        const std::int64_t nShown = oColumns.Shown(x);
        if (nShown == kNothing)
        {
            std::memset(pPixel, 0, nPixelBytes);
        }
        else
        {
            std::memcpy(pPixel, pShown + static_cast<std::size_t>(nShown) * nPixelBytes,
                        nPixelBytes);
        }
    }
}

/// Fills the block from a copy of the window that it shows.
void FillFrom(const PixelArray& oShown, const Axis& oColumns, const Axis& oRows,
              const PixelArray& oBlock)
{
    for (std::uint32_t y = 0; y < oRows.Total(); ++y)
    {
        const std::int64_t nShown = oRows.Shown(y);
        if (nShown == kNothing)
        {
            std::memset(oBlock.Row(y), 0, oBlock.RowBytes());
        }
        else
        {
            FillColumns(oColumns, 0, oColumns.Total(), oShown.Row(static_cast<std::size_t>(nShown)),
                        oBlock.Row(y), oBlock.PixelBytes());
        }
    }
}

/// Fills what lies outside the image; what lies inside is in the block already and shows all.
void FillOutside(const Axis& oColumns, const Axis& oRows, const PixelArray& oBlock)
{
    for (std::uint32_t y = oRows.InsideBegin(); y < oRows.InsideEnd(); ++y)
    {
        unsigned char* pRow = oBlock.Row(y);
        const unsigned char* pShown = pRow + oColumns.InsideBegin() * oBlock.PixelBytes();
        FillColumns(oColumns, 0, oColumns.InsideBegin(), pShown, pRow, oBlock.PixelBytes());
        FillColumns(oColumns, oColumns.InsideEnd(), oColumns.Total(), pShown, pRow,
                    oBlock.PixelBytes());
    }
    for (std::uint32_t y = 0; y < oRows.Total(); ++y)
    {
        if (y >= oRows.InsideBegin() && y < oRows.InsideEnd())
        {
            continue;
        }
        const std::int64_t nShown = oRows.Shown(y);
        if (nShown == kNothing)
        {
            std::memset(oBlock.Row(y), 0, oBlock.RowBytes());
        }
        else
        {
            std::memcpy(oBlock.Row(y),
                        oBlock.Row(oRows.InsideBegin() + static_cast<std::size_t>(nShown)),
                        oBlock.RowBytes());
        }
    }
}

/// Fills a block whose samples are whole bytes.
void ReadBytes(const PixelArray& oBlock, const Axis& oColumns, const Axis& oRows,
               const ReadWindow& oRead)
{
    if (oColumns.Count() == 0 || oRows.Count() == 0)
    {
        std::memset(oBlock.mpFirst, 0, oBlock.RowBytes() * oRows.Total());
        return;
    }
    const PixelWindow oWindow{oColumns.First(), oRows.First(), oColumns.Count(), oRows.Count()};
    if (oColumns.InsideShowsAll() && oRows.InsideShowsAll())
    {
        oRead(oWindow,
              oBlock.Row(oRows.InsideBegin()) + oColumns.InsideBegin() * oBlock.PixelBytes(),
              oBlock.moStrides);
        FillOutside(oColumns, oRows, oBlock);
        return;
    }
    const std::size_t nShownBytes =
        oBlock.PixelBytes() * oWindow.mnWidth * std::size_t{oWindow.mnHeight};
    const auto paShown = std::make_unique_for_overwrite<unsigned char[]>(nShownBytes);
    const PixelArray oShown(paShown.get(), oWindow.mnWidth,
                            oBlock.moStrides.mnPixel / oBlock.moStrides.mnChannel,
                            oBlock.moStrides.mnChannel);
    oRead(oWindow, oShown.mpFirst, oShown.moStrides);
    FillFrom(oShown, oColumns, oRows, oBlock);
}

/// Bytes that are 0 or not to bits, the first in the most significant bit.
void PackBits(const unsigned char* pBytes, std::size_t nCount, unsigned char* pBits)
{
    for (std::size_t i = 0; i < nCount; i += 8)
    {
        unsigned int nPacked = 0;
        for (std::size_t k = 0; k < std::min<std::size_t>(8, nCount - i); ++k)
        {
            nPacked |= (pBytes[i + k] != 0 ? 128U : 0U) >> k;
        }
        pBits[i >> 3] = static_cast<unsigned char>(nPacked);
    }
}

}  // namespace

void RequireFittingRaster(const tessel::Raster* poRaster, const tessel::DataType& oType,
                          unsigned int nChannels, const std::string& oFile)
{
    constexpr const char* kSource = "platform/datasources/blocktransfer";
    if (poRaster == nullptr)
    {
        throw DataException(oFile + ": poRaster is invalid pointer", kSource, __PRETTY_FUNCTION__,
                            __LINE__);
    }
    if (poRaster->moDataType != oType)
    {
        throw DataException(oFile + ": the raster has samples of " +
                                DataTypeName(poRaster->moDataType) + ", its channels have " +
                                DataTypeName(oType),
                            kSource, __PRETTY_FUNCTION__, __LINE__);
    }
    if (poRaster->mnChannels != nChannels)
    {
        throw DataException(oFile + ": the raster has " + std::to_string(poRaster->mnChannels) +
                                " channels and not " + std::to_string(nChannels),
                            kSource, __PRETTY_FUNCTION__, __LINE__);
    }
}

void ReadBlock(tessel::Raster& oRaster, const ImageSize& oSize, int nEdgeMode,
               const ReadWindow& oRead)
{
    const Axis oColumns(oRaster.mnOffsetX, oRaster.mnMarginX, oRaster.mnTotalWidth, oSize.mnWidth,
                        nEdgeMode);
    const Axis oRows(oRaster.mnOffsetY, oRaster.mnMarginY, oRaster.mnTotalHeight, oSize.mnHeight,
                     nEdgeMode);
    const std::size_t nSampleBytes = oRaster.moDataType.GetSampleBytes();
    if (oRaster.moDataType != tessel::eDT_BIT)
    {
        ReadBytes({oRaster.mpBuffer, oRaster.mnTotalWidth, oRaster.mnChannels, nSampleBytes},
                  oColumns, oRows, oRead);
        return;
    }
    const std::size_t nSamples =
        std::size_t{oRaster.mnTotalWidth} * oRaster.mnTotalHeight * oRaster.mnChannels;
    const auto paBytes = std::make_unique_for_overwrite<unsigned char[]>(nSamples);
    ReadBytes({paBytes.get(), oRaster.mnTotalWidth, oRaster.mnChannels, nSampleBytes}, oColumns,
              oRows, oRead);
    PackBits(paBytes.get(), nSamples, oRaster.mpBuffer);
}

void WriteBlock(const tessel::Raster& oRaster, const ImageSize& oSize, const WriteWindow& oWrite)
{
    if (oRaster.mnOffsetX >= oSize.mnWidth || oRaster.mnOffsetY >= oSize.mnHeight ||
        oRaster.mnWidth == 0 || oRaster.mnHeight == 0)
    {
        return;
    }
    const PixelWindow oWindow{oRaster.mnOffsetX, oRaster.mnOffsetY,
                              std::min(oRaster.mnWidth, oSize.mnWidth - oRaster.mnOffsetX),
                              std::min(oRaster.mnHeight, oSize.mnHeight - oRaster.mnOffsetY)};
    const std::size_t nSampleBytes = oRaster.moDataType.GetSampleBytes();
    if (oRaster.moDataType != tessel::eDT_BIT)
    {
        const PixelArray oBlock(oRaster.mpBuffer, oRaster.mnTotalWidth, oRaster.mnChannels,
                                nSampleBytes);
        oWrite(oWindow, oRaster.GetPixel(0, 0), oBlock.moStrides);
        return;
    }
    const std::size_t nRowSamples = std::size_t{oWindow.mnWidth} * oRaster.mnChannels;
    std::vector<unsigned char> vnBytes(nRowSamples * oWindow.mnHeight);
    for (std::uint32_t y = 0; y < oWindow.mnHeight; ++y)
    {
        const std::size_t nFirst =
            ((std::size_t{y} + oRaster.mnMarginY) * oRaster.mnTotalWidth + oRaster.mnMarginX) *
            oRaster.mnChannels;
        for (std::size_t i = 0; i < nRowSamples; ++i)
        {
            const std::size_t nBit = nFirst + i;
            vnBytes[y * nRowSamples + i] = (oRaster.mpBuffer[nBit >> 3] >> (7 - (nBit & 7))) & 1U;
        }
    }
    const PixelArray oBytes(vnBytes.data(), oWindow.mnWidth, oRaster.mnChannels, nSampleBytes);
    oWrite(oWindow, oBytes.mpFirst, oBytes.moStrides);
}

}  // namespace kor::datasources
