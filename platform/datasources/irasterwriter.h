#pragma once

#include "platform/datasources/irasteraccess.h"

namespace kor::datasources
{

/// A sink of blocks. It can read back what it has written, by ReadRaster.
class IRasterWriter : public virtual IRasterAccess
{
public:
    /// Writes the raster's inner area, without its margins, at its offset. Rows and columns outside
    /// the image are dropped. Throws kor::DataException when the raster is null or is not of this
    /// writer's type and channel count, kor::IOException when writing fails. A failure of the disk
    /// may show only at Flush.
    virtual void WriteRaster(const tessel::Raster* poRaster) = 0;

    /// Changes the entries of this writer's own channels, numbered in its own list, and the file
    /// metadata. The default throws kor::IOException: there is no place for them.
    virtual void SetAuxiliaryData(const AuxiliaryData& oData);

    /// Brings everything written so far into the file, see IDataset::Flush. The default has nothing
    /// to do.
    virtual void Flush() {}
};

}  // namespace kor::datasources
