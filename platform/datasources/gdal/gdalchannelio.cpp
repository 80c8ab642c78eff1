#include "platform/datasources/gdal/gdalchannelio.h"

#include <cstdint>
#include <cstdlib>
#include <cstring>

#include "platform/exception/exception.h"

namespace kor::datasources
{

namespace
{

constexpr const char* kSource = "platform/datasources/gdal/gdalchannelio";

int FewerBitsOf(GDALRasterBandH hBand)
{
    const char* pszBits = GDALGetMetadataItem(hBand, "NBITS", "IMAGE_STRUCTURE");
    const int nBits = pszBits == nullptr ? 0 : std::atoi(pszBits);
    return nBits > 0 && nBits < GDALGetDataTypeSizeBits(GDALGetRasterDataType(hBand)) ? nBits : 0;
}

/// A sample of an unsigned integer, up to 32 bits.
std::uint32_t SampleAt(const unsigned char* pSample, GDALDataType eType)
{
    std::uint16_t nShort = 0;
    std::uint32_t nLong = *pSample;
    if (eType == GDT_UInt16)
    {
        std::memcpy(&nShort, pSample, sizeof(nShort));
        nLong = nShort;
    }
    else if (eType == GDT_UInt32)
    {
        std::memcpy(&nLong, pSample, sizeof(nLong));
    }
    return nLong;
}

}  // namespace

GdalLayout LayoutOf(GDALDatasetH hDataset)
{
    GdalLayout oLayout{GDALGetRasterXSize(hDataset), GDALGetRasterYSize(hDataset), {}, {}};
    for (int nBand = 1; nBand <= GDALGetRasterCount(hDataset); ++nBand)
    {
        GDALRasterBandH hBand = GDALGetRasterBand(hDataset, nBand);
        oLayout.mveTypes.push_back(GDALGetRasterDataType(hBand));
        oLayout.mvnBits.push_back(FewerBitsOf(hBand));
    }
    return oLayout;
}

GdalChannelIO::GdalChannelIO(std::shared_ptr<GdalFile> poFile, GdalLayout oLayout)
    : mpoFile(std::move(poFile)), moLayout(std::move(oLayout))
{
    bool bSame = false;
    mpoFile->Do("cannot look at the channels",
                [&](GDALDatasetH hDataset)
                {
                    bSame = LayoutOf(hDataset) == moLayout;
                    return true;
                });
    if (!bSame)
    {
        throw IOException(mpoFile->GetFileName() + ": the file was replaced since it was opened",
                          kSource, __PRETTY_FUNCTION__, __LINE__);
    }
}

bool GdalChannelIO::Transfer(GDALDatasetH hDataset, GDALRWFlag eDirection,
                             std::span<const unsigned int> oChannels, const PixelWindow& oWindow,
                             unsigned char* pSamples, const SampleStrides& oStrides) const
{
    std::vector<int> vnBands(oChannels.begin(), oChannels.end());
    const auto nWidth = static_cast<int>(oWindow.mnWidth);
    const auto nHeight = static_cast<int>(oWindow.mnHeight);
    return GDALDatasetRasterIOEx(
               hDataset, eDirection, static_cast<int>(oWindow.mnX), static_cast<int>(oWindow.mnY),
               nWidth, nHeight, pSamples, nWidth, nHeight, moLayout.mveTypes[oChannels[0] - 1],
               static_cast<int>(vnBands.size()), vnBands.data(),
               static_cast<GSpacing>(oStrides.mnPixel), static_cast<GSpacing>(oStrides.mnLine),
               static_cast<GSpacing>(oStrides.mnChannel), nullptr) == CE_None;
}

void GdalChannelIO::Read(std::span<const unsigned int> oChannels, const PixelWindow& oWindow,
                         unsigned char* pSamples, const SampleStrides& oStrides)
{
    mpoFile->Do("cannot read pixels", [&](GDALDatasetH hDataset)
                { return Transfer(hDataset, GF_Read, oChannels, oWindow, pSamples, oStrides); });
}

void GdalChannelIO::RequireFittingSamples(unsigned int nChannel, const PixelWindow& oWindow,
                                          const unsigned char* pSamples,
                                          const SampleStrides& oStrides) const
{
    const GDALDataType eType = moLayout.mveTypes[nChannel - 1];
    const int nBits = moLayout.mvnBits[nChannel - 1];
    const std::string oWhere = mpoFile->GetFileName() + ": channel " + std::to_string(nChannel) +
                               " has " + std::to_string(nBits) + " bits a sample (NBITS)";
    if (eType != GDT_Byte && eType != GDT_UInt16 && eType != GDT_UInt32)
    {
        throw IOException(oWhere + ", too few for floating point to be written as it is", kSource,
                          __PRETTY_FUNCTION__, __LINE__);
    }
    for (std::size_t y = 0; y < oWindow.mnHeight; ++y)
    {
        for (std::size_t x = 0; x < oWindow.mnWidth; ++x)
        {
            const std::uint32_t nSample =
                SampleAt(pSamples + y * oStrides.mnLine + x * oStrides.mnPixel, eType);
            if (nSample >> nBits != 0)
            {
                throw IOException(oWhere + " and cannot hold " + std::to_string(nSample), kSource,
                                  __PRETTY_FUNCTION__, __LINE__);
            }
        }
    }
}

void GdalChannelIO::Write(std::span<const unsigned int> oChannels, const PixelWindow& oWindow,
                          const unsigned char* pSamples, const SampleStrides& oStrides)
{
    for (std::size_t c = 0; c < oChannels.size(); ++c)
    {
        if (moLayout.mvnBits[oChannels[c] - 1] != 0)
        {
            RequireFittingSamples(oChannels[c], oWindow, pSamples + c * oStrides.mnChannel,
                                  oStrides);
        }
    }
    // GDAL takes one kind of pointer for both directions and does not write through this one.
    // NOLINTNEXTLINE(cppcoreguidelines-pro-type-const-cast)
    auto* pSource = const_cast<unsigned char*>(pSamples);
    mpoFile->Do("cannot write pixels", [&](GDALDatasetH hDataset)
                { return Transfer(hDataset, GF_Write, oChannels, oWindow, pSource, oStrides); });
}

}  // namespace kor::datasources
