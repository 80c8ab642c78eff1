#pragma once

#include <memory>

#include "platform/datasources/ichannelio.h"
#include "platform/datasources/idataset.h"

namespace kor::datasources
{

/// A dataset with bitmaps: one bit a pixel, numbered from 1 on their own, beside any channels. All
/// have one size, which is that of the channels where there are any.
///
/// Errors   kor::IOException when there is no bitmap of that number.
class IBitmapDataset : public virtual IDataset
{
public:
    /// Pixels; 0 as long as there are neither bitmaps nor channels.
    virtual unsigned int GetBitmapWidth() const = 0;
    virtual unsigned int GetBitmapHeight() const = 0;
    virtual unsigned int GetBitmapCount() const = 0;
    /// Appends a bitmap of zeros and returns its number. Throws kor::DataException when the size is
    /// not that of the bitmaps and channels before.
    virtual unsigned int CreateBitmap(unsigned int nWidth, unsigned int nHeight) = 0;

    /// Description and metadata of a bitmap as those of channel 1, and the metadata of the file.
    virtual AuxiliaryData GetBitmapAuxiliaryData(unsigned int nBitmap) const = 0;
    /// Replaces them; without an entry for channel 1, the bitmap's own stay. Errors as of
    /// IDataset::SetAuxiliaryData.
    virtual void SetBitmapAuxiliaryData(const AuxiliaryData& oData, unsigned int nBitmap) = 0;

    /// A channel I/O object for one reader (bWrite false) or one writer, in which the bitmap is
    /// channel 1 and has samples of eDT_BIT. Throws kor::IOException when bWrite is set and the
    /// dataset was opened for reading.
    virtual std::unique_ptr<IChannelIO> OpenBitmap(unsigned int nBitmap, bool bWrite) = 0;
};

}  // namespace kor::datasources
