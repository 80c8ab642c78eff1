#pragma once

#include <functional>
#include <string>

#include "basic/tessel/raster/raster.h"
#include "platform/datasources/ichannelio.h"

namespace kor::datasources
{

/// Reads all channels of a block for a window of the image, each sample of a bit as a byte.
using ReadWindow = std::function<void(const PixelWindow& oWindow, unsigned char* pSamples,
                                      const SampleStrides& oStrides)>;
using WriteWindow = std::function<void(const PixelWindow& oWindow, const unsigned char* pSamples,
                                       const SampleStrides& oStrides)>;

/// Size of an image, in pixels.
struct ImageSize
{
    std::uint32_t mnWidth = 0;
    std::uint32_t mnHeight = 0;
};

/// Checks a block that was handed to a reader or writer of oType and nChannels. Throws
/// kor::DataException that names the file and both sides.
void RequireFittingRaster(const tessel::Raster* poRaster, const tessel::DataType& oType,
                          unsigned int nChannels, const std::string& oFile);

/// Fills a block, margins included: what lies in the image by one call of oRead, the rest by the
/// edge mode. oRead asks for no pixel twice and for none that the block does not show.
void ReadBlock(tessel::Raster& oRaster, const ImageSize& oSize, int nEdgeMode,
               const ReadWindow& oRead);

/// Hands the part of the block's inner area that lies in the image to oWrite, if there is any.
void WriteBlock(const tessel::Raster& oRaster, const ImageSize& oSize, const WriteWindow& oWrite);

}  // namespace kor::datasources
