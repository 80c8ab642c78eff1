#pragma once

#include <gdal.h>

#include <cstdint>
#include <memory>
#include <string>
#include <vector>

#include "platform/datasources/gdal/gdalfile.h"
#include "platform/datasources/ichannelio.h"

namespace kor::datasources
{

/// Where a bitmap of a file stands. A bit is set where the sample is not 0.
struct GdalBitmap
{
    int mnBand = 0;             ///< number of its channel, 0 for the mask of the file
    std::uint16_t mnSet = 255;  ///< the sample that is written for a bit that is set
};

/// The bitmaps of a file in their order: its channels of one bit and of opacities, then its mask.
std::vector<GdalBitmap> BitmapsOf(GDALDatasetH hDataset, const std::string& oFile);

/// Gives a file a mask of zeros, inside it. Throws kor::DataException when it has one or the format
/// has no place for one; false when GDAL refuses it.
bool AddMask(GDALDatasetH hDataset, const std::string& oFile);

/// Windows of one bitmap, which is channel 1, through a handle that others may share.
class GdalBitmapIO : public IChannelIO
{
public:
    GdalBitmapIO(std::shared_ptr<GdalFile> poFile, const GdalBitmap& oBitmap);

    void Read(std::span<const unsigned int> oChannels, const PixelWindow& oWindow,
              unsigned char* pSamples, const SampleStrides& oStrides) override;
    void Write(std::span<const unsigned int> oChannels, const PixelWindow& oWindow,
               const unsigned char* pSamples, const SampleStrides& oStrides) override;

private:
    GDALRasterBandH BandIn(GDALDatasetH hDataset) const;

    std::shared_ptr<GdalFile> mpoFile;
    GdalBitmap moBitmap;
};

}  // namespace kor::datasources
