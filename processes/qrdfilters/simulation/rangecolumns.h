#pragma once

#include <cmath>
#include <limits>
#include <span>
#include <vector>

#include "processes/qrdfilters/simulation/columnestimate.h"
#include "processes/qrdfilters/simulation/projection.h"
#include "processes/qrdfilters/simulation/scanframe.h"

namespace kor::filters::simulation
{

/// Finds the columns of the radar image in which rows of terrain points lie. What depends on the
/// place of a point in its row alone is kept in tables.
template <Division kDivision>
class RangeColumns
{
public:
    RangeColumns(const Projection<kDivision>& oProjection, const RadarGrid& oGrid)
        : moProjection(oProjection),
          moGrid(oGrid),
          moEstimate(oProjection.GetView(), oGrid, oProjection.AnglePerTerm()),
          mbEstimates(moEstimate.IsUsable() && !oProjection.IsAlongChord())
    {
    }

    /// Makes room for so many places, and no more.
    void Reserve(std::size_t nPlaces)
    {
        mvdfTerms.reserve(nPlaces);
        mvdfCosines.reserve(moProjection.IsMeridional() ? nPlaces : 0);
    }

    /// One more place: dfX metres east of the window's left edge.
    void Append(double dfX)
    {
        const double dfTerm = moProjection.ColumnTerm(dfX);
        mvdfTerms.push_back(dfTerm);
        if (moProjection.IsMeridional())
        {
            mvdfCosines.push_back(std::cos(moProjection.EarthAngle(dfTerm, 0.0)));
        }
    }

    /// Of a point at one of the places, dfNorth metres north of the near range point.
    Ranges RangesOf(std::size_t nPlace, double dfNorth, double dfElevation) const
    {
        const double dfCosine = moProjection.IsMeridional()
                                    ? mvdfCosines[nPlace]
                                    : std::cos(moProjection.EarthAngle(mvdfTerms[nPlace], dfNorth));
        const double dfSlant = moProjection.SlantRange(dfCosine, dfElevation);
        return {dfSlant, moProjection.GroundRange(dfSlant)};
    }

    /// Of points at the places from nFirst on. Columns count from 1 in the image; others lie
    /// outside.
    void Find(std::size_t nFirst, double dfNorth, std::span<const double> oElevations,
              std::span<std::int64_t> oColumns)
    {
        mvdfPlaces.resize(oElevations.size());
        mvdfMargins.resize(oElevations.size());  // zeros where nothing is estimated
        if (mbEstimates)
        {
            moEstimate.Find(std::span(mvdfTerms).subspan(nFirst, oElevations.size()),
                            moProjection.IsMeridional() ? 0.0 : dfNorth, oElevations, mvdfPlaces,
                            mvdfMargins);
        }
        for (std::size_t k = 0; k < oElevations.size(); ++k)
        {
            const std::int64_t nColumn =
                mvdfMargins[k] > 0.0
                    ? static_cast<std::int64_t>(mvdfPlaces[k])
                    : ColumnAt(RangesOf(nFirst + k, dfNorth, oElevations[k]).mdfGround);
            oColumns[k] = moGrid.mbMirror ? moGrid.mnPixels - nColumn : nColumn;
        }
    }

private:
    /// Before it is mirrored.
    std::int64_t ColumnAt(double dfGround) const
    {
        return Truncated((dfGround - moGrid.mdfNearRange) * moGrid.mdfPerRange + 1.0 + 0.5);
    }

    Projection<kDivision> moProjection;
    RadarGrid moGrid;
    ColumnEstimate moEstimate;
    bool mbEstimates;
    std::vector<double> mvdfTerms;
    std::vector<double> mvdfCosines;  ///< of the earth central angle, where places tell it
    std::vector<double> mvdfPlaces;
    std::vector<double> mvdfMargins;
};

}  // namespace kor::filters::simulation
