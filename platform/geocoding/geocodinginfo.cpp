#include "platform/geocoding/geocodinginfo.h"

#include "platform/exception/exception.h"

namespace kor::ogc::cs
{

GeocodingInfo::GeocodingInfo(double dfXOffset, double dfXPerCol, double dfYOffset, double dfYPerRow)
    : moTransform{dfXOffset, dfXPerCol, 0.0, dfYOffset, 0.0, dfYPerRow}
{
}

GeocodingInfo::GeocodingInfo(const Transform& oTransform) : moTransform(oTransform) {}

void GeocodingInfo::RasterToMap(double dfCol, double dfRow, double& dfX, double& dfY) const
{
    dfX = GetXOffset() + dfCol * GetXPerCol() + dfRow * GetXPerRow();
    dfY = GetYOffset() + dfCol * GetYPerCol() + dfRow * GetYPerRow();
}

void GeocodingInfo::MapToRaster(double dfX, double dfY, double& dfCol, double& dfRow) const
{
    const double dfPixelArea = GetXPerCol() * GetYPerRow() - GetXPerRow() * GetYPerCol();
    if (!(dfPixelArea < 0.0 || dfPixelArea > 0.0))
    {
        throw DataException("The transform from raster to map has no inverse: a pixel has no area",
                            "platform/geocoding/geocodinginfo", __PRETTY_FUNCTION__, __LINE__);
    }
    const double dfEast = dfX - GetXOffset();
    const double dfNorth = dfY - GetYOffset();
    if (GetXPerRow() == 0.0 && GetYPerCol() == 0.0)
    {
        // One division each: the general form would round three times and miss whole pixels.
        dfCol = dfEast / GetXPerCol();
        dfRow = dfNorth / GetYPerRow();
        return;
    }
    dfCol = (dfEast * GetYPerRow() - dfNorth * GetXPerRow()) / dfPixelArea;
    dfRow = (dfNorth * GetXPerCol() - dfEast * GetYPerCol()) / dfPixelArea;
}

}  // namespace kor::ogc::cs
