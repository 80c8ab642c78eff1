#pragma once

#include <array>
#include <string>

namespace kor::ogc::cs
{

/// Where an image lies on the map: an affine transform from raster to map coordinates, and the
/// coordinate system that the map coordinates are meant in.
///
///     X = XOffset + col * XPerCol + row * XPerRow
///     Y = YOffset + col * YPerCol + row * YPerRow
/// (col, row) = (0, 0) is the outer corner of the first pixel, (0.5, 0.5) its centre. X and Y are
/// in the unit of the coordinate system (metres, degrees); without one they are just numbers.
///
/// The default, 0, 1, 0, -1 without a coordinate system, is what an image has that does not say
/// where it lies. A plain value: reading one object from several threads is safe.
class GeocodingInfo
{
public:
    /// XOffset, XPerCol, XPerRow, YOffset, YPerCol, YPerRow.
    using Transform = std::array<double, 6>;

    GeocodingInfo() = default;
    /// An image whose rows run along X and whose columns run along Y; dfYPerRow is negative where
    /// north is up.
    GeocodingInfo(double dfXOffset, double dfXPerCol, double dfYOffset, double dfYPerRow);
    /// The full form, for images that are turned or sheared.
    explicit GeocodingInfo(const Transform& oTransform);

    double GetXOffset() const { return moTransform[0]; }
    double GetXPerCol() const { return moTransform[1]; }
    double GetXPerRow() const { return moTransform[2]; }
    double GetYOffset() const { return moTransform[3]; }
    double GetYPerCol() const { return moTransform[4]; }
    double GetYPerRow() const { return moTransform[5]; }
    const Transform& GetTransform() const { return moTransform; }

    void RasterToMap(double dfCol, double dfRow, double& dfX, double& dfY) const;
    /// The inverse. Throws kor::DataException when the transform has none (a pixel without area).
    void MapToRaster(double dfX, double dfY, double& dfCol, double& dfRow) const;

    /// The coordinate system as WKT text, empty where it is not known. The text is not checked.
    const std::string& GetProjection() const { return moProjection; }
    void SetProjection(const std::string& oWkt) { moProjection = oWkt; }

    bool operator==(const GeocodingInfo&) const = default;

private:
    Transform moTransform{0.0, 1.0, 0.0, 0.0, 0.0, -1.0};
    std::string moProjection;
};

}  // namespace kor::ogc::cs
