#pragma once

#include <memory>

#include "basic/tessel/raster/raster.h"
#include "platform/datasources/ichannelio.h"
#include "platform/datasources/idataset.h"

namespace kor::datasources
{

/// A dataset with channels of pixels: all of one size, each of a type of its own, numbered from 1.
class IRasterDataset : public virtual IDataset
{
public:
    /// Pixels; 0 as long as there are no channels.
    virtual unsigned int GetWidth() const = 0;
    virtual unsigned int GetHeight() const = 0;
    virtual unsigned int GetChannelCount() const = 0;
    /// Throws kor::IOException when there is no such channel.
    virtual tessel::DataType GetChannelType(unsigned int nChannel) const = 0;

    /// Appends oInfo.mnChannels channels of oInfo's size and type and returns the first one's
    /// number. Their pixels are 0 until written. Throws kor::DataException when the size is not
    /// that of the channels before, when the file's format cannot hold such channels or cannot add
    /// them to those it has, and kor::IOException when the dataset is open for reading or the disk
    /// full.
    virtual unsigned int CreateChannels(const tessel::RasterInfo& oInfo) = 0;

    /// The tile in which the file stores its pixels, at most the image's size. Readers and writers
    /// take it as their own. The default is the whole image.
    virtual unsigned int GetTileWidth() const { return GetWidth(); }
    virtual unsigned int GetTileHeight() const { return GetHeight(); }

    /// A channel I/O object for one reader (bWrite false) or one writer. Throws kor::IOException
    /// when bWrite is set and the dataset was opened for reading, or when the file is gone.
    virtual std::unique_ptr<IChannelIO> OpenChannels(bool bWrite) = 0;
};

}  // namespace kor::datasources
