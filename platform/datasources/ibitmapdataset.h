#pragma once

#include "platform/datasources/idataset.h"

namespace kor::datasources
{

/// A dataset with bitmaps: one bit a pixel, numbered from 1 on their own, beside any channels.
class IBitmapDataset : public virtual IDataset
{
public:
    virtual unsigned int GetBitmapCount() const = 0;
    /// Appends a bitmap of zeros and returns its number. Throws kor::DataException when the size is
    /// not that of the bitmaps and channels before.
    virtual unsigned int CreateBitmap(unsigned int nWidth, unsigned int nHeight) = 0;
};

}  // namespace kor::datasources
