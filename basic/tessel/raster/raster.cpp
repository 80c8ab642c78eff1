#include "basic/tessel/raster/raster.h"

#include <limits>
#include <string>
#include <utility>

#include "platform/exception/exception.h"

namespace kor::tessel
{

namespace
{

constexpr const char* kSource = "basic/tessel/raster/raster";
constexpr std::uint64_t kLargestBlock = std::numeric_limits<std::uint32_t>::max();

/// Bytes of the block, computed in 32 bits: meant to wrap, as mnBufferSize does.
std::uint32_t WrappedBytes(const Raster& oRaster)
{
    const DataType& oType = oRaster.moDataType;
    return ((oType.mnBits + 7U) >> 3) * (oType.mbComplex ? 2U : 1U) * oRaster.mnTotalHeight *
           oRaster.mnTotalWidth * oRaster.mnChannels;
}

/// True when the block with its margins, computed without any wrap, is below 4 GiB.
bool FitsBelowFourGiB(const RasterInfo& oInfo, const RasterContext& oContext)
{
    std::uint64_t nBytes = oInfo.moDataType.GetSampleBytes();
    const std::uint64_t anFactors[] = {oInfo.mnWidth + 2 * std::uint64_t{oContext.mnMarginX},
                                       oInfo.mnHeight + 2 * std::uint64_t{oContext.mnMarginY},
                                       oInfo.mnChannels};
    for (const std::uint64_t nFactor : anFactors)
    {
        if (nFactor == 0)
        {
            return true;
        }
    }
    for (const std::uint64_t nFactor : anFactors)
    {
        if (nBytes > kLargestBlock / nFactor)
        {
            return false;
        }
        nBytes *= nFactor;
    }
    return true;
}

std::string Describe(const RasterInfo& oInfo, const RasterContext& oContext)
{
    return std::to_string(oInfo.mnWidth) + " x " + std::to_string(oInfo.mnHeight) + " pixels of " +
           std::to_string(oInfo.mnChannels) + " channels with margins " +
           std::to_string(oContext.mnMarginX) + " and " + std::to_string(oContext.mnMarginY);
}

}  // namespace

RasterInfo PartsAsChannels(const RasterInfo& oInfo)
{
    return RasterInfo(oInfo.mnWidth, oInfo.mnHeight, 2 * oInfo.mnChannels,
                      RealPartType(oInfo.moDataType));
}

Raster::Raster(const RasterInfo& oInfo, const RasterContext& oContext)
    : RasterInfo(oInfo),
      RasterContext(oContext),
      mnTotalWidth(mnWidth + 2 * mnMarginX),
      mnTotalHeight(mnHeight + 2 * mnMarginY)
{
    if (!FitsBelowFourGiB(oInfo, oContext))
    {
        throw DataException("A raster of " + Describe(oInfo, oContext) +
                                " takes 4 GiB or more; a block must stay below",
                            kSource,
                            "Raster::Raster(const class kor::tessel::RasterInfo &,"
                            "const class kor::tessel::RasterContext &)",
                            __LINE__);
    }
    mnBufferSize = WrappedBytes(*this);
    mpBuffer = new unsigned char[mnBufferSize];
    mbOwnsBuffer = true;
}

Raster::Raster(const RasterInfo& oInfo, const RasterContext& oContext, unsigned char* pBuffer,
               bool bOwnsBuffer)
    : RasterInfo(oInfo),
      RasterContext(oContext),
      mnTotalWidth(mnWidth + 2 * mnMarginX),
      mnTotalHeight(mnHeight + 2 * mnMarginY),
      mpBuffer(pBuffer),
      mnBufferSize(WrappedBytes(*this)),
      mbOwnsBuffer(bOwnsBuffer)
{
    if (pBuffer == nullptr)
    {
        throw DataException("pBuffer is NULL, cannot create a Raster on NULL", kSource,
                            "Raster::Raster(const class kor::tessel::RasterInfo &,"
                            "const class kor::tessel::RasterContext &,unsigned char *,bool)",
                            52);
    }
}

Raster::Raster(Raster&& oOther) noexcept
    : RasterInfo(std::exchange<RasterInfo>(oOther, RasterInfo())),
      RasterContext(std::exchange<RasterContext>(oOther, RasterContext())),
      mnTotalWidth(std::exchange(oOther.mnTotalWidth, 0)),
      mnTotalHeight(std::exchange(oOther.mnTotalHeight, 0)),
      mpBuffer(std::exchange(oOther.mpBuffer, nullptr)),
      mnBufferSize(std::exchange(oOther.mnBufferSize, 0)),
      mbOwnsBuffer(std::exchange(oOther.mbOwnsBuffer, false))
{
}

Raster& Raster::operator=(Raster&& oOther) noexcept
{
    if (this != &oOther)
    {
        Release();
        RasterInfo::operator=(std::exchange<RasterInfo>(oOther, RasterInfo()));
        RasterContext::operator=(std::exchange<RasterContext>(oOther, RasterContext()));
        mnTotalWidth = std::exchange(oOther.mnTotalWidth, 0);
        mnTotalHeight = std::exchange(oOther.mnTotalHeight, 0);
        mpBuffer = std::exchange(oOther.mpBuffer, nullptr);
        mnBufferSize = std::exchange(oOther.mnBufferSize, 0);
        mbOwnsBuffer = std::exchange(oOther.mbOwnsBuffer, false);
    }
    return *this;
}

Raster::~Raster()
{
    Release();
}

void Raster::Release()
{
    if (mbOwnsBuffer)
    {
        delete[] mpBuffer;
    }
}

unsigned char* Raster::GetPixel(std::int64_t x, std::int64_t y) const
{
    const std::int64_t nPixel =
        (y + std::int64_t{mnMarginY}) * std::int64_t{mnTotalWidth} + x + std::int64_t{mnMarginX};
    // The shift comes last: a bit raster's address lies inside a byte.
    const std::int64_t nBit =
        nPixel * mnChannels * (moDataType.mbComplex ? 2 : 1) * moDataType.mnBits;
    return mpBuffer + (nBit >> 3);
}

}  // namespace kor::tessel
