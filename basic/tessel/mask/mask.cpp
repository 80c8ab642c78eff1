#include "basic/tessel/mask/mask.h"

#include <algorithm>
#include <bit>
#include <cstring>
#include <limits>
#include <memory>
#include <string>
#include <utility>

#include "platform/exception/exception.h"

namespace kor::tessel
{

namespace
{

constexpr const char* kSource = "basic/tessel/mask/mask";
constexpr const char* kConstructor =
    "Mask::Mask(const class kor::tessel::RasterInfo &,const class kor::tessel::RasterContext &,"
    "unsigned char *,bool,bool)";

constexpr std::array<unsigned char, 2048> MakeBitTable()
{
    std::array<unsigned char, 2048> anTable{};
    for (unsigned int nByte = 0; nByte < 256; ++nByte)
    {
        for (unsigned int k = 0; k < 8; ++k)
        {
            anTable[nByte * 8 + k] = static_cast<unsigned char>((nByte >> (7 - k)) & 1U);
        }
    }
    return anTable;
}

/// Eight bytes as eight bits, 1 where the byte is not 0, the first one in the most significant bit.
unsigned char PackGroup(const unsigned char* pBytes)
{
    constexpr std::uint64_t kLowSeven = 0x7F7F7F7F7F7F7F7FU;
    std::uint64_t nBytes = 0;
    std::memcpy(&nBytes, pBytes, 8);
    if constexpr (std::endian::native == std::endian::big)
    {
        nBytes = __builtin_bswap64(nBytes);
    }
    // The sum carries into the top bit of a byte with any low bit; the top bit itself is added by
    // or.
    const std::uint64_t nTopBits = (((nBytes & kLowSeven) + kLowSeven) | nBytes) & ~kLowSeven;
    // Each of the factor's bits moves one byte's bit to its place in the highest byte.
    return static_cast<unsigned char>(((nTopBits >> 7) * 0x8040201008040201U) >> 56);
}

}  // namespace

const std::array<unsigned char, 2048> kMaskBitTable = MakeBitTable();

Mask::Mask(const RasterInfo& oInfo, const RasterContext& oContext, unsigned char* pBuffer,
           bool bDeleteBuffer, bool bPacked)
    : RasterInfo(oInfo.mnWidth, oInfo.mnHeight, 1, eDT_BIT),
      RasterContext(oContext),
      mnTotalWidth(mnWidth + 2 * mnMarginX),
      mnTotalHeight(mnHeight + 2 * mnMarginY)
{
    const std::unique_ptr<unsigned char[]> poOwned(bDeleteBuffer ? pBuffer : nullptr);
    if (pBuffer == nullptr)
    {
        throw DataException("pBuffer is NULL, cannot create a Mask on NULL", kSource, kConstructor,
                            __LINE__);
    }
    const std::uint64_t nTrueWidth = mnWidth + 2 * std::uint64_t{mnMarginX};
    const std::uint64_t nTrueHeight = mnHeight + 2 * std::uint64_t{mnMarginY};
    if (nTrueHeight != 0 && nTrueWidth > std::numeric_limits<std::uint32_t>::max() / nTrueHeight)
    {
        throw DataException("A mask of " + std::to_string(nTrueWidth) + " x " +
                                std::to_string(nTrueHeight) +
                                " pixels with its margins holds 2^32 pixels or more",
                            kSource, kConstructor, __LINE__);
    }
    mnBitCount = mnTotalWidth * mnTotalHeight;
    mnByteCount = static_cast<std::uint32_t>((std::uint64_t{mnBitCount} + 7) >> 3);
    moBits.resize(mnByteCount);
    if (bPacked)
    {
        std::copy_n(pBuffer, mnByteCount, moBits.begin());
        if ((mnBitCount & 7U) != 0)
        {
            moBits.back() &= static_cast<unsigned char>(0xFF00U >> (mnBitCount & 7U));
        }
    }
    else
    {
        PackBytes(pBuffer);
    }
}

Mask::Mask(Mask&& oOther) noexcept
    : RasterInfo(std::exchange<RasterInfo>(oOther, RasterInfo(0, 0, 1, eDT_BIT))),
      RasterContext(std::exchange<RasterContext>(oOther, RasterContext())),
      mnTotalWidth(std::exchange(oOther.mnTotalWidth, 0)),
      mnTotalHeight(std::exchange(oOther.mnTotalHeight, 0)),
      moBits(std::exchange(oOther.moBits, {})),
      mnBitCount(std::exchange(oOther.mnBitCount, 0)),
      mnByteCount(std::exchange(oOther.mnByteCount, 0))
{
}

Mask& Mask::operator=(Mask&& oOther) noexcept
{
    if (this != &oOther)
    {
        RasterInfo::operator=(std::exchange<RasterInfo>(oOther, RasterInfo(0, 0, 1, eDT_BIT)));
        RasterContext::operator=(std::exchange<RasterContext>(oOther, RasterContext()));
        mnTotalWidth = std::exchange(oOther.mnTotalWidth, 0);
        mnTotalHeight = std::exchange(oOther.mnTotalHeight, 0);
        moBits = std::exchange(oOther.moBits, {});
        mnBitCount = std::exchange(oOther.mnBitCount, 0);
        mnByteCount = std::exchange(oOther.mnByteCount, 0);
    }
    return *this;
}

void Mask::PackBytes(const unsigned char* pBytes)
{
    const std::uint32_t nWholeBytes = mnBitCount >> 3;
    for (std::uint32_t nByte = 0; nByte < nWholeBytes; ++nByte)
    {
        moBits[nByte] = PackGroup(pBytes + std::size_t{nByte} * 8);
    }
    if (nWholeBytes < mnByteCount)
    {
        std::array<unsigned char, 8> anLast{};
        std::copy_n(pBytes + std::size_t{nWholeBytes} * 8, mnBitCount & 7U, anLast.begin());
        moBits.back() = PackGroup(anLast.data());
    }
}

void Mask::RetrieveRaster(Raster* poRaster) const
{
    if (poRaster->moDataType == eDT_BIT)
    {
        std::memcpy(poRaster->mpBuffer, moBits.data(),
                    std::min<std::uint64_t>(mnByteCount, poRaster->mnBufferSize));
        return;
    }
    if (poRaster->moDataType == eDT_8U)
    {
        // A raster of another extent than told keeps its own bounds, and finds 0 behind the mask.
        const std::uint64_t nPixels =
            std::min(std::uint64_t{poRaster->mnTotalHeight} * poRaster->mnTotalWidth,
                     poRaster->mnBufferSize);
        const std::uint64_t nKnown = std::min<std::uint64_t>(nPixels, mnBitCount);
        ExpandBits(0, {poRaster->mpBuffer, nKnown});
        std::fill(poRaster->mpBuffer + nKnown, poRaster->mpBuffer + nPixels,
                  static_cast<unsigned char>(0));
        return;
    }
    throw DataException("We can only rasterize into a eDT_BIT or eDT_8U Raster", kSource,
                        "void Mask::RetrieveRaster(class kor::tessel::Raster *) const", 233);
}

Raster* Mask::CreateRaster() const
{
    auto poRaster = std::make_unique<Raster>(RasterInfo(mnWidth, mnHeight, 1, eDT_8U),
                                             static_cast<const RasterContext&>(*this));
    RetrieveRaster(poRaster.get());
    return poRaster.release();
}

void Mask::ExpandRow(std::int64_t x, std::int64_t y, std::span<unsigned char> oBytes) const
{
    const std::int64_t nFirst =
        (y + std::int64_t{mnMarginY}) * std::int64_t{mnTotalWidth} + x + std::int64_t{mnMarginX};
    ExpandBits(static_cast<std::uint64_t>(nFirst), oBytes);
}

void Mask::ExpandBits(std::uint64_t nFirst, std::span<unsigned char> oBytes) const
{
    const unsigned int nShift = nFirst & 7U;
    const unsigned char* pBits = moBits.data() + (nFirst >> 3);
    std::size_t i = 0;
    for (; i + 8 <= oBytes.size(); i += 8, ++pBits)
    {
        // Eight pixels that start inside a byte end in the next one; with no shift that byte may
        // not exist and is not read.
        unsigned int nByte = *pBits;
        if (nShift != 0)
        {
            nByte = ((nByte << nShift) | (pBits[1] >> (8 - nShift))) & 0xFFU;
        }
        std::memcpy(&oBytes[i], &kMaskBitTable[std::size_t{nByte} * 8], 8);
    }
    for (std::uint64_t nBit = nFirst + i; i < oBytes.size(); ++i, ++nBit)
    {
        oBytes[i] = kMaskBitTable[std::size_t{moBits[nBit >> 3]} * 8 + (nBit & 7U)];
    }
}

}  // namespace kor::tessel
