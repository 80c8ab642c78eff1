#pragma once

#include "platform/datasources/basicreader.h"
#include "platform/datasources/ibitmapdataset.h"

namespace kor::datasources
{

/// Reads a bitmap as one channel of eDT_8U, 0 or 1 a pixel. The image is one tile until
/// SetTileSize.
///
/// Errors   the constructor throws kor::DataException when poDataset is null, kor::IOException when
///          there is no such bitmap.
/// Threads  as of BasicReader.
class BitmapReader : public BasicReader
{
public:
    /// nBitmap: number from 1. Borrows the dataset.
    BitmapReader(IBitmapDataset* poDataset, unsigned int nBitmap);
};

}  // namespace kor::datasources
