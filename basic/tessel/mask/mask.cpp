#include "basic/tessel/mask/mask.h"

#include <algorithm>
#include <cstring>
#include <limits>
#include <memory>
#include <string>

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

void Mask::PackBytes(const unsigned char* pBytes)
{
    for (std::uint32_t nByte = 0; nByte < mnByteCount; ++nByte)
    {
        const unsigned char* pGroup = pBytes + std::size_t{nByte} * 8;
        const std::uint32_t nPixels = std::min<std::uint32_t>(8, mnBitCount - nByte * 8);
        unsigned int nPacked = 0;
        for (std::uint32_t k = 0; k < nPixels; ++k)
        {
            nPacked |= (pGroup[k] != 0 ? 128U : 0U) >> k;
        }
        moBits[nByte] = static_cast<unsigned char>(nPacked);
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
            std::uint64_t{poRaster->mnTotalHeight} * poRaster->mnTotalWidth;
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
