#pragma once

#include <gdal.h>

#include <memory>
#include <vector>

#include "platform/datasources/gdal/gdalfile.h"
#include "platform/datasources/ichannelio.h"

namespace kor::datasources
{

/// What is known of a file's channels since it was opened. A handle opened later is held against
/// it: the file may have been replaced.
struct GdalLayout
{
    int mnWidth = 0;
    int mnHeight = 0;
    std::vector<GDALDataType> mveTypes;
    std::vector<int> mvnBits;  ///< of a sample in the file where it has fewer there, else 0

    bool operator==(const GdalLayout&) const = default;
};

GdalLayout LayoutOf(GDALDatasetH hDataset);

/// Windows of a file's channels, in the bands' own types, so that GDAL converts nothing.
class GdalChannelIO : public IChannelIO
{
public:
    /// Throws kor::IOException when the file has another layout by now.
    GdalChannelIO(std::shared_ptr<GdalFile> poFile, GdalLayout oLayout);

    void Read(std::span<const unsigned int> oChannels, const PixelWindow& oWindow,
              unsigned char* pSamples, const SampleStrides& oStrides) override;
    void Write(std::span<const unsigned int> oChannels, const PixelWindow& oWindow,
               const unsigned char* pSamples, const SampleStrides& oStrides) override;

private:
    /// Throws kor::IOException when a sample has more bits than its channel: GDAL would write
    /// another.
    void RequireFittingSamples(unsigned int nChannel, const PixelWindow& oWindow,
                               const unsigned char* pSamples, const SampleStrides& oStrides) const;
    bool Transfer(GDALDatasetH hDataset, GDALRWFlag eDirection,
                  std::span<const unsigned int> oChannels, const PixelWindow& oWindow,
                  unsigned char* pSamples, const SampleStrides& oStrides) const;

    std::shared_ptr<GdalFile> mpoFile;
    GdalLayout moLayout;
};

}  // namespace kor::datasources
