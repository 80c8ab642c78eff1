#include "platform/datasources/gdal/gdalchannelio.h"

#include "platform/exception/exception.h"

namespace kor::datasources
{

GdalLayout LayoutOf(GDALDatasetH hDataset)
{
    GdalLayout oLayout{GDALGetRasterXSize(hDataset), GDALGetRasterYSize(hDataset), {}};
    for (int nBand = 1; nBand <= GDALGetRasterCount(hDataset); ++nBand)
    {
        oLayout.mveTypes.push_back(GDALGetRasterDataType(GDALGetRasterBand(hDataset, nBand)));
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
                          "platform/datasources/gdal/gdalchannelio", __PRETTY_FUNCTION__, __LINE__);
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

void GdalChannelIO::Write(std::span<const unsigned int> oChannels, const PixelWindow& oWindow,
                          const unsigned char* pSamples, const SampleStrides& oStrides)
{
    // GDAL takes one kind of pointer for both directions and does not write through this one.
    // NOLINTNEXTLINE(cppcoreguidelines-pro-type-const-cast)
    auto* pSource = const_cast<unsigned char*>(pSamples);
    mpoFile->Do("cannot write pixels", [&](GDALDatasetH hDataset)
                { return Transfer(hDataset, GF_Write, oChannels, oWindow, pSource, oStrides); });
}

}  // namespace kor::datasources
