#pragma once

#include <cmath>
#include <cstdint>

namespace kor::filters::simulation
{

// Meant: these digits and no more, here and in the reciprocals, which are not those of the others.
inline constexpr double kPi = 3.14159265358979;
inline constexpr double kInvPi = 0.318309886183791;
inline constexpr double kInv180 = 1.0 / 180.0;
inline constexpr double kEarthRadius = 6370000.0;                  ///< metres
inline constexpr double kInvEarthRadius = 1.5698587127158556e-07;  ///< 1 / metres
/// At exactly this altitude, in metres, ground range is measured along the chord of a fixed swath.
inline constexpr double kChordAltitude = 800000.0;
inline constexpr double kSwathWidth = 97000.0;  ///< metres along the ground
/// Map x of the central meridian of the grid, in metres.
inline constexpr double kFalseEasting = 500000.0;

/// The orbit above the sphere, and the DEM below it.
struct Viewpoint
{
    double mdfOrbitRadius = 0.0;  ///< metres
    double mdfNearAngle =
        0.0;  ///< radians at the earth's centre, from nadir to the near range point
    double mdfNearSlant = 0.0;   ///< metres; for kChordAltitude alone
    double mdfChordAngle = 0.0;  ///< radians; for kChordAltitude alone
    double mdfPixelX = 0.0;      ///< metres
    double mdfPixelY = 0.0;
    std::int64_t mnNearCol = 0;  ///< the near range point in pixels from the window's corner
    std::int64_t mnNearRow = 0;
    float mfSideSign = 0.0F;     ///< 1 or -1
    float mfWindowLeftX = 0.0F;  ///< map x of the window's first column, metres
};

/// Sets the four fields of the orbit. dfMinLook: look angle at the near range point, radians.
void SetOrbit(double dfAltitude, double dfMinLook, Viewpoint& oView);

/// Of a point, metres.
struct Ranges
{
    double mdfSlant = 0.0;
    double mdfGround = 0.0;
};

/// How the formulas divide: the last bits differ.
enum class Division
{
    eQuotient,   ///< a / (b * c)
    eReciprocal  ///< a * (1 / b) * (1 / c)
};

/// Projects points of the terrain to the radar. What depends on the column alone (ColumnTerm), and
/// all that is constant, is formed once; the order of operations is that of the whole formula:
///
///     c = InvR * d + near angle,   d the distance of the point across the track
///     r = sqrt((R + z)^2 + O^2 - cos(c) * 2 (R + z) O)       slant range
///     ground range = (acos((R^2 + O^2 - r^2) / (2 R O)) - near angle) * R
///     look angle = acos((O^2 + r^2 - (R + z)^2) / (2 O r)) in degrees
template <Division kDivision>
class Projection
{
public:
    /// Metres and degrees. A heading of exactly 0, 180 or 360 takes the arc from west to east as
    /// the distance.
    Projection(const Viewpoint& oView, double dfAltitude, double dfHeading)
        : moView(oView),
          mbMeridional(dfHeading == 0.0 || dfHeading == 360.0 || dfHeading == 180.0),
          mbChord(dfAltitude == kChordAltitude),
          mdfTangent(std::tan((450.0 - dfHeading) * kPi * kInv180)),
          mdfRoot(std::sqrt(mdfTangent * mdfTangent + 1.0)),
          mdfOrbitSquare(oView.mdfOrbitRadius * oView.mdfOrbitRadius),
          mdfSquares(kEarthRadius * kEarthRadius + mdfOrbitSquare),
          mdfTwoRadii(kEarthRadius * 2.0 * oView.mdfOrbitRadius),
          mdfTwoOrbits(oView.mdfOrbitRadius * 2.0),
          mdfInvOrbit(1.0 / oView.mdfOrbitRadius),
          mdfPiLessChord(kPi - oView.mdfChordAngle),
          mdfSinChord(std::sin(oView.mdfChordAngle)),
          mdfSinChordNear(mdfSinChord * oView.mdfNearSlant),
          mdfSinRest(std::sin(mdfPiLessChord)),
          mdfSinRestNear(mdfSinRest * oView.mdfNearSlant)
    {
    }

    const Viewpoint& GetView() const { return moView; }
    /// True when the distance across the track depends on the column alone.
    bool IsMeridional() const { return mbMeridional; }
    bool IsAlongChord() const { return mbChord; }

    /// The part of the distance that depends on the column: dfX metres east of the window's left
    /// edge.
    double ColumnTerm(double dfX) const
    {
        const double dfNear = static_cast<double>(moView.mnNearCol) * moView.mdfPixelX;
        const double dfEast = moView.mfWindowLeftX + dfX - moView.mdfPixelX - kFalseEasting;
        const double dfArc = (std::atan(kInvEarthRadius * dfEast) -
                              std::atan((dfEast - (dfX - dfNear)) * kInvEarthRadius)) *
                             kEarthRadius;
        return (mbMeridional ? moView.mfSideSign : mdfTangent) * dfArc;
    }

    /// What EarthAngle adds, to a rounding, for one unit of the term; for one of dfNorth less.
    double AnglePerTerm() const
    {
        return kInvEarthRadius * (mbMeridional ? 1.0 : moView.mfSideSign / mdfRoot);
    }

    /// Earth central angle from nadir; dfNorth metres north of the near range point.
    double EarthAngle(double dfColumnTerm, double dfNorth) const
    {
        const double dfAcross =
            mbMeridional ? dfColumnTerm : (dfColumnTerm - dfNorth) * moView.mfSideSign / mdfRoot;
        return kInvEarthRadius * dfAcross + moView.mdfNearAngle;
    }

    double SlantRange(double dfCosEarthAngle, double dfElevation) const
    {
        const double dfPoint = kEarthRadius + dfElevation;
        return std::sqrt(dfPoint * dfPoint + mdfOrbitSquare -
                         dfCosEarthAngle * (dfPoint * 2.0 * moView.mdfOrbitRadius));
    }

    double GroundRange(double dfSlant) const
    {
        if (mbChord)
        {
            return ChordRange(dfSlant);
        }
        const double dfNumerator = mdfSquares - dfSlant * dfSlant;
        double dfCosine = 0.0;
        if constexpr (kDivision == Division::eQuotient)
        {
            dfCosine = dfNumerator / mdfTwoRadii;
        }
        else
        {
            dfCosine = dfNumerator * 0.5 * kInvEarthRadius * mdfInvOrbit;
        }
        // Meant: no lower limit.
        const double dfLimited = dfCosine > 1.0 ? 1.0 : dfCosine;
        return (std::acos(dfLimited) - moView.mdfNearAngle) * kEarthRadius;
    }

    /// Of a point dfX metres east of the window's left edge and dfNorth metres north of the near
    /// range point.
    Ranges RangesOf(double dfX, double dfNorth, double dfElevation) const
    {
        const double dfAngle = EarthAngle(ColumnTerm(dfX), dfNorth);
        const double dfSlant = SlantRange(std::cos(dfAngle), dfElevation);
        return {dfSlant, GroundRange(dfSlant)};
    }

    double LookAngle(double dfSlant, double dfElevation) const
    {
        const double dfPoint = kEarthRadius + dfElevation;
        const double dfNumerator = mdfOrbitSquare + dfSlant * dfSlant - dfPoint * dfPoint;
        double dfCosine = 0.0;
        if constexpr (kDivision == Division::eQuotient)
        {
            dfCosine = dfNumerator / (mdfTwoOrbits * dfSlant);
        }
        else
        {
            dfCosine = dfNumerator * 0.5 * mdfInvOrbit * (1.0 / dfSlant);
        }
        return std::acos(dfCosine) * 180.0 * kInvPi;
    }

private:
    /// Ground range along the chord of the swath.
    double ChordRange(double dfSlant) const
    {
        const auto oPerSlant = [dfSlant](double dfValue) {
            return kDivision == Division::eQuotient ? dfValue / dfSlant : dfValue * (1.0 / dfSlant);
        };
        if (dfSlant >= moView.mdfNearSlant)
        {
            return std::sin(mdfPiLessChord - std::asin(oPerSlant(mdfSinChordNear))) * dfSlant /
                   mdfSinChord;
        }
        return std::sin(moView.mdfChordAngle - std::acos(oPerSlant(mdfSinRestNear)) - kPi * 0.5) *
               -1.0 * dfSlant / mdfSinRest;
    }

    Viewpoint moView;
    bool mbMeridional;
    bool mbChord;
    double mdfTangent;
    double mdfRoot;
    double mdfOrbitSquare;
    double mdfSquares;       ///< R^2 + O^2
    double mdfTwoRadii;      ///< 2 R O
    double mdfTwoOrbits;     ///< 2 O
    double mdfInvOrbit;      ///< 1 / O
    double mdfPiLessChord;   ///< pi - b, b the chord angle, n the near slant range
    double mdfSinChord;      ///< sin(b)
    double mdfSinChordNear;  ///< sin(b) * n
    double mdfSinRest;       ///< sin(pi - b)
    double mdfSinRestNear;   ///< sin(pi - b) * n
};

}  // namespace kor::filters::simulation
