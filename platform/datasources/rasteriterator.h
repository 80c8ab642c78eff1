#pragma once

#include <cstddef>
#include <iterator>

#include "basic/tessel/raster/raster.h"

namespace kor::datasources
{

class IRasterReader;

/// Walks the tiles of a reader: an input iterator. Reading happens in operator*, each time anew;
/// its result is a new raster that the caller deletes. Errors are those of
/// IRasterReader::GetRaster.
class RasterIterator
{
public:
    using iterator_category = std::input_iterator_tag;
    using value_type = tessel::Raster*;
    using difference_type = std::ptrdiff_t;
    using pointer = tessel::Raster**;
    using reference = tessel::Raster*;

    RasterIterator() = default;
    RasterIterator(IRasterReader* poReader, unsigned int nTile) : mpoReader(poReader), mnTile(nTile)
    {
    }

    tessel::Raster* operator*() const;
    RasterIterator& operator++()
    {
        ++mnTile;
        return *this;
    }
    RasterIterator operator++(int)
    {
        const RasterIterator oHere = *this;
        ++mnTile;
        return oHere;
    }
    bool operator==(const RasterIterator&) const = default;

private:
    IRasterReader* mpoReader = nullptr;
    unsigned int mnTile = 0;
};

}  // namespace kor::datasources
