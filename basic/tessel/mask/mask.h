#pragma once

#include <array>
#include <cstddef>
#include <cstdint>
#include <span>
#include <vector>

#include "basic/tessel/raster/raster.h"

namespace kor::tessel
{

/// Which pixels of a block are valid: one bit a pixel, 1 valid, margins included, rows without
/// gaps, the first pixel in the most significant bit. Bits behind the last pixel are 0.
///
/// It describes itself as one channel of eDT_BIT, whatever the info it was made from says. Can be
/// moved, not copied; the mask moved from is empty. Filters only read it, from any number of
/// threads.
class Mask : public RasterInfo, public RasterContext
{
public:
    /// Packs pBuffer, which holds packed bits (bPacked) or one byte a pixel, not 0 meaning valid.
    /// bDeleteBuffer: pBuffer is freed by delete[] when all is done. Throws kor::DataException when
    /// pBuffer is null or the mask would hold 2^32 pixels or more.
    Mask(const RasterInfo& oInfo, const RasterContext& oContext, unsigned char* pBuffer,
         bool bDeleteBuffer, bool bPacked);
    Mask(Mask&& oOther) noexcept;
    Mask& operator=(Mask&& oOther) noexcept;
    ~Mask() override = default;

    /// Fills a raster of the same total extent, margins included: an eDT_BIT one with the packed
    /// bytes, an eDT_8U one with a byte 0 or 1 a pixel. Throws kor::DataException for other types.
    void RetrieveRaster(Raster* poRaster) const;
    /// The mask as a new eDT_8U raster of the same geometry with 0 or 1 a pixel; the caller deletes
    /// it.
    Raster* CreateRaster() const;

    /// Expands the bits of a row to bytes 0 or 1: oBytes.size() pixels from (x, y) to the right.
    /// All of them lie in the mask.
    void ExpandRow(std::int64_t x, std::int64_t y, std::span<unsigned char> oBytes) const;

    std::uint32_t mnTotalWidth = 0;   ///< mnWidth + 2 * mnMarginX
    std::uint32_t mnTotalHeight = 0;  ///< mnHeight + 2 * mnMarginY
    std::vector<unsigned char> moBits;
    std::uint32_t mnBitCount = 0;   ///< pixels, margins included
    std::uint32_t mnByteCount = 0;  ///< bytes in moBits

private:
    void PackBytes(const unsigned char* pBytes);
    void ExpandBits(std::uint64_t nFirst, std::span<unsigned char> oBytes) const;
};

/// Entry [b * 8 + k] is bit k of byte b, counted from the most significant bit, as 0 or 1.
extern const std::array<unsigned char, 2048> kMaskBitTable;

}  // namespace kor::tessel
