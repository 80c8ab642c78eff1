#pragma once

#include <vector>

#include "basic/tessel/raster/raster.h"
#include "platform/datasources/auxiliarydata.h"
#include "platform/geocoding/geocodinginfo.h"

namespace kor::datasources
{

/// How a block is continued outside the image.
enum EdgeMode : int
{
    eEM_Zeros = 0,   ///< zeros
    eEM_Mirror = 1,  ///< mirrored at the edge pixel, which is not repeated: c b | a b c | b a
    eEM_Nearest = 2  ///< the nearest pixel of the edge: a a | a b c | c c
};

/// What readers and writers share: geometry, and reading a block.
///
/// GetWidth, GetHeight, GetChannelCount, GetDataType and ReadRaster are pure; all others have a
/// default, so that a source of one's own is five methods.
///
/// Threads  one object serves one thread at a time; different objects are independent.
class IRasterAccess
{
public:
    IRasterAccess() = default;
    IRasterAccess(const IRasterAccess&) = delete;
    IRasterAccess& operator=(const IRasterAccess&) = delete;
    virtual ~IRasterAccess() = default;

    virtual unsigned int GetWidth() const = 0;  ///< pixels
    virtual unsigned int GetHeight() const = 0;
    virtual unsigned int GetChannelCount() const = 0;
    virtual tessel::DataType GetDataType() const = 0;

    /// Fills a raster, margins included, as its own context says: the pixel at (x, y) gets the
    /// image's pixel (mnOffsetX + x, mnOffsetY + y), and what lies outside the image is continued
    /// by the edge mode. A block may lie partly or wholly outside. Offsets are unsigned: one made
    /// from -1 lies far behind the right or lower edge. Throws kor::DataException when the raster
    /// is null or is not of this object's type and channel count, kor::IOException when reading
    /// fails; the raster's contents are then not told.
    virtual void ReadRaster(tessel::Raster* poRaster) = 0;

    /// The tiles in which GetRaster and the iterators walk the image, in pixels, never larger than
    /// the image. As long as they are not set: the file's own tiles, or the whole image.
    virtual unsigned int GetTileWidth() const;
    virtual unsigned int GetTileHeight() const;
    /// Takes effect at once. Throws kor::DataException when one of them is 0.
    virtual void SetTileSize(unsigned int nWidth, unsigned int nHeight);

    /// Margins that GetRaster gives its rasters, in pixels; 0 at first.
    virtual unsigned int GetMarginX() const { return mnMarginX; }
    virtual unsigned int GetMarginY() const { return mnMarginY; }
    /// An EdgeMode; eEM_Nearest as long as it is not set.
    virtual int GetEdgeMode() const { return mnEdgeMode; }
    /// nEdgeMode is an EdgeMode; kor::DataException for any other value. Takes effect at once.
    virtual void SetMargin(unsigned int nX, unsigned int nY, int nEdgeMode);

    /// One entry for each channel: the image's size, one channel, the type.
    virtual std::vector<tessel::RasterInfo> GetChannelsInfo() const;
    /// Valid as long as the object and its dataset live. The default lies nowhere.
    virtual const ogc::cs::GeocodingInfo& GetGeocodingInfo() const;
    /// Of this object's channels, numbered from 1 in its own list. The default is empty.
    virtual AuxiliaryData GetAuxiliaryData() const;

private:
    unsigned int mnTileWidth = 0;  ///< 0 as long as it is not set
    unsigned int mnTileHeight = 0;
    unsigned int mnMarginX = 0;
    unsigned int mnMarginY = 0;
    int mnEdgeMode = eEM_Nearest;
};

}  // namespace kor::datasources
