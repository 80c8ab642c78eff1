#pragma once

#include <span>

#include "processes/qrdfilters/simulation/projection.h"
#include "processes/qrdfilters/simulation/scanframe.h"

namespace kor::filters::simulation
{

/// Finds most columns of the radar image without the C library's cosine and arc cosine.
///
/// With h = 1 - cos(c), the cosine q of the ground range's angle a follows without the slant range:
///
///     1 - q = h - z (1/R - 1/O - h/R) + z^2 / (2 R O),   a = 2 asin(sqrt((1 - q) / 2))
///
/// h and asin by their series. The formula as it stands rounds q by less than 1e-13, and so do the
/// series where they are used. The column is certain where the place is farther from the border
/// between two columns than ten times as much can move it; the others are the caller's to compute.
class ColumnEstimate
{
public:
    /// dfAnglePerTerm: that of Projection.
    ColumnEstimate(const Viewpoint& oView, const RadarGrid& oGrid, double dfAnglePerTerm);

    /// False for views in which the formula's roundings are not known to be small.
    bool IsUsable() const { return mbUsable; }

    /// Places along the line, which are cut to columns before those are mirrored. oMargins: above 0
    /// where the column is certain.
    /// oTerms and dfNorth are those of Projection::EarthAngle, dfNorth 0 where the distance across
    /// the track depends on the column alone.
    void Find(std::span<const double> oTerms, double dfNorth, std::span<const double> oElevations,
              std::span<double> oPlaces, std::span<double> oMargins) const;

private:
    double mdfOrbitRadius;
    double mdfNearAngle;
    double mdfAnglePerTerm;
    double mdfColumnsPerAngle;
    double mdfColumnShift;
    double mdfUncertainty;
    bool mbUsable;
};

}  // namespace kor::filters::simulation
