#include "platform/datasources/irasterreader.h"

#include <algorithm>
#include <limits>
#include <memory>
#include <string>

#include "platform/datasources/guard.h"

namespace kor::datasources
{

namespace
{

constexpr const char* kSource = "platform/datasources/irasterreader";

/// How the tiles of a reader lie: the right and lower ones are cut off.
struct TileGrid
{
    explicit TileGrid(const IRasterAccess& oAccess)
        : mnWidth(oAccess.GetWidth()),
          mnHeight(oAccess.GetHeight()),
          mnTileWidth(std::max(1U, oAccess.GetTileWidth())),
          mnTileHeight(std::max(1U, oAccess.GetTileHeight())),
          mnAcross((std::uint64_t{mnWidth} + mnTileWidth - 1) / mnTileWidth),
          mnDown((std::uint64_t{mnHeight} + mnTileHeight - 1) / mnTileHeight)
    {
    }

    std::uint64_t Count() const { return mnAcross * mnDown; }

    unsigned int mnWidth;
    unsigned int mnHeight;
    unsigned int mnTileWidth;
    unsigned int mnTileHeight;
    std::uint64_t mnAcross;
    std::uint64_t mnDown;
};

}  // namespace

tessel::Raster* IRasterReader::GetRaster(unsigned int nTile)
{
    const TileGrid oGrid(*this);
    if (nTile >= oGrid.Count())
    {
        throw DataException("There is no tile " + std::to_string(nTile) +
                                "; the image has tiles 0 to " +
                                std::to_string(static_cast<std::int64_t>(oGrid.Count()) - 1),
                            kSource, __PRETTY_FUNCTION__, __LINE__);
    }
    const auto nX = static_cast<unsigned int>(nTile % oGrid.mnAcross) * oGrid.mnTileWidth;
    const auto nY = static_cast<unsigned int>(nTile / oGrid.mnAcross) * oGrid.mnTileHeight;
    const tessel::RasterInfo oInfo(std::min(oGrid.mnTileWidth, oGrid.mnWidth - nX),
                                   std::min(oGrid.mnTileHeight, oGrid.mnHeight - nY),
                                   GetChannelCount(), GetDataType());
    const tessel::RasterContext oContext(GetMarginX(), GetMarginY(), nX, nY);
    return Guarded("Tile " + std::to_string(nTile),
                   [&]
                   {
                       auto poRaster = std::make_unique<tessel::Raster>(oInfo, oContext);
                       ReadRaster(poRaster.get());
                       return poRaster.release();
                   });
}

RasterIterator IRasterReader::Begin()
{
    return RasterIterator(this, 0);
}

RasterIterator IRasterReader::End()
{
    const std::uint64_t nCount = TileGrid(*this).Count();
    if (nCount > std::numeric_limits<unsigned int>::max())
    {
        throw DataException("The image has " + std::to_string(nCount) +
                                " tiles, more than can be numbered; larger tiles are needed",
                            kSource, __PRETTY_FUNCTION__, __LINE__);
    }
    return RasterIterator(this, static_cast<unsigned int>(nCount));
}

tessel::Raster* RasterIterator::operator*() const
{
    return mpoReader->GetRaster(mnTile);
}

}  // namespace kor::datasources
