#pragma once

#include "platform/datasources/irasteraccess.h"
#include "platform/datasources/rasteriterator.h"

namespace kor::datasources
{

/// A source of blocks.
///
/// Tiles are numbered from 0, in row order: the first row of tiles from left to right, then the
/// next. Those at the right and lower edge are cut off at the image.
class IRasterReader : public virtual IRasterAccess
{
public:
    /// Tile number nTile as a new raster with this reader's margins; the caller deletes it. Throws
    /// kor::DataException when there is no such tile or it would take 4 GiB or more (a smaller tile
    /// size then helps), kor::IOException when there is no memory or reading fails.
    virtual tessel::Raster* GetRaster(unsigned int nTile);

    /// All tiles in order: *it is a new raster, which the caller deletes. Margins and tile size are
    /// those at the time of each access; End() counts the tiles at the time of its call and throws
    /// kor::DataException when they are 2^32 or more.
    virtual RasterIterator Begin();
    virtual RasterIterator End();
};

}  // namespace kor::datasources
