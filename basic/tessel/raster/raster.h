#pragma once

#include <cstdint>

#include "basic/tessel/raster/datatype.h"

namespace kor::tessel
{

/// Description of a block of pixels: its size without margins, and its samples.
struct RasterInfo
{
    RasterInfo() = default;
    RasterInfo(std::uint32_t nWidth, std::uint32_t nHeight, std::uint32_t nChannels,
               const DataType& oType)
        : mnWidth(nWidth), mnHeight(nHeight), mnChannels(nChannels), moDataType(oType)
    {
    }
    RasterInfo(const RasterInfo&) = default;
    RasterInfo& operator=(const RasterInfo&) = default;
    virtual ~RasterInfo() = default;

    std::uint32_t mnWidth = 0;     ///< pixels
    std::uint32_t mnHeight = 0;    ///< pixels
    std::uint32_t mnChannels = 0;  ///< samples of one pixel
    DataType moDataType;
};

/// Where a block stands in its image, and how deep its frame of neighbouring pixels is.
struct RasterContext
{
    RasterContext() = default;
    RasterContext(std::uint32_t nMarginX, std::uint32_t nMarginY, std::uint32_t nOffsetX,
                  std::uint32_t nOffsetY)
        : mnMarginX(nMarginX), mnMarginY(nMarginY), mnOffsetX(nOffsetX), mnOffsetY(nOffsetY)
    {
    }

    std::uint32_t mnMarginX = 0;  ///< extra pixels on the left and as many on the right
    std::uint32_t mnMarginY = 0;  ///< extra pixels above and as many below
    std::uint32_t mnOffsetX = 0;  ///< image column of the first pixel that is not a margin
    std::uint32_t mnOffsetY = 0;  ///< image row of the first pixel that is not a margin
};

/// The info of a complex block seen as twice as many real channels on the same bytes.
RasterInfo PartsAsChannels(const RasterInfo& oInfo);

/// A block of an image with its margins: samples row after row from the top, pixels from the left
/// without gaps, the channels of a pixel side by side, the real part of a complex sample before the
/// imaginary one. Filters compute addresses from the public fields; nothing checks coordinates.
///
/// Can be moved, not copied; the raster moved from is empty. A second raster over the same bytes is
/// made with the wrapping constructor. Reading one raster from several threads is safe, as is
/// writing distinct rows.
class Raster : public RasterInfo, public RasterContext
{
public:
    /// Allocates a buffer, uninitialised, and owns it. Throws kor::DataException when the block
    /// with its margins would take 4 GiB or more.
    Raster(const RasterInfo& oInfo, const RasterContext& oContext);
    /// Wraps the caller's buffer, which is not touched; bOwnsBuffer says whether the destructor
    /// frees it by delete[]. Throws kor::DataException when pBuffer is null.
    Raster(const RasterInfo& oInfo, const RasterContext& oContext, unsigned char* pBuffer,
           bool bOwnsBuffer);
    Raster(Raster&& oOther) noexcept;
    Raster& operator=(Raster&& oOther) noexcept;
    ~Raster() override;

    /// Address of the first sample of pixel (x, y), counted from the first pixel that is no margin;
    /// both may be negative down to minus the margin.
    unsigned char* GetPixel(std::int64_t x, std::int64_t y) const;
    /// The same as a pointer to samples (to parts of samples, for a complex raster).
    template <class T>
    T* GetPixelAs(std::int64_t x, std::int64_t y) const
    {
        return reinterpret_cast<T*>(GetPixel(x, y));
    }
    /// Samples from one row to the next, parts of complex samples counted one by one.
    std::size_t GetRowSamples() const
    {
        return std::size_t{mnTotalWidth} * mnChannels * (moDataType.mbComplex ? 2U : 1U);
    }

    std::uint32_t mnTotalWidth = 0;   ///< mnWidth + 2 * mnMarginX
    std::uint32_t mnTotalHeight = 0;  ///< mnHeight + 2 * mnMarginY
    unsigned char* mpBuffer = nullptr;
    std::uint64_t mnBufferSize = 0;  ///< bytes; computed in 32 bits, so it wraps at 4 GiB
    bool mbOwnsBuffer = false;

private:
    void Release();
};

}  // namespace kor::tessel
