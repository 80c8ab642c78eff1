#include "processes/qrdfilters/simulation/columnestimate.h"

#include <array>
#include <cmath>

namespace kor::filters::simulation
{

namespace
{

constexpr std::size_t kTerms = 11;
constexpr double kLargestAngleSquare = 0.36;  ///< of the earth central angle, radians
constexpr double kLargestHalf = 0.0625;       ///< of (1 - q) / 2
constexpr double kHighest = 1e5;              ///< metres
constexpr double kLastColumn = 1e6;
constexpr double kRounder = 6755399441055744.0;  ///< 1.5 * 2^52: a sum with it has no fraction

/// asin(s) = s * sum of C[n] * s^(2 n), C[n] = (2 n)! / (4^n (n!)^2 (2 n + 1)).
constexpr std::array<double, kTerms> ArcSineSeries()
{
    std::array<double, kTerms> adfSeries{};
    double dfBinomial = 1.0;  // (2 n)! / (4^n (n!)^2)
    for (std::size_t n = 0; n < kTerms; ++n)
    {
        adfSeries[n] = dfBinomial / (2.0 * static_cast<double>(n) + 1.0);
        dfBinomial *= (2.0 * static_cast<double>(n) + 1.0) / (2.0 * static_cast<double>(n) + 2.0);
    }
    return adfSeries;
}

constexpr std::array<double, kTerms> kArcSine = ArcSineSeries();

/// The series from its term n on, over s^(2 n). Unrolled by the compiler's templates, since g++
/// makes no vectors of a loop in a loop.
template <std::size_t n = 0>
inline double ArcSineRest(double dfSquare)
{
    if constexpr (n + 1 == kTerms)
    {
        return kArcSine[n];
    }
    else
    {
        return kArcSine[n] + dfSquare * ArcSineRest<n + 1>(dfSquare);
    }
}

/// 1 - cos(c) of c^2.
inline double CosineGap(double c2)
{
    return 0.5 * c2 *
           (1.0 -
            c2 * (1.0 / 12.0) *
                (1.0 - c2 * (1.0 / 30.0) *
                           (1.0 - c2 * (1.0 / 56.0) *
                                      (1.0 - c2 * (1.0 / 90.0) * (1.0 - c2 * (1.0 / 132.0))))));
}

}  // namespace

ColumnEstimate::ColumnEstimate(const Viewpoint& oView, const RadarGrid& oGrid,
                               double dfAnglePerTerm)
    : mdfOrbitRadius(oView.mdfOrbitRadius),
      mdfNearAngle(oView.mdfNearAngle),
      mdfAnglePerTerm(dfAnglePerTerm),
      mdfColumnsPerAngle(kEarthRadius * oGrid.mdfPerRange),
      mdfColumnShift(1.5 -
                     (oView.mdfNearAngle * kEarthRadius + oGrid.mdfNearRange) * oGrid.mdfPerRange),
      mdfUncertainty(1e-12 * std::fabs(mdfColumnsPerAngle) + 1e-9),
      // Beyond a hundred earth radii, squares of the orbit's radius swallow the rest of q.
      mbUsable(oView.mdfOrbitRadius > 0.5 * kEarthRadius &&
               oView.mdfOrbitRadius < 100.0 * kEarthRadius)
{
}

void ColumnEstimate::Find(std::span<const double> oTerms, double dfNorth,
                          std::span<const double> oElevations, std::span<double> oPlaces,
                          std::span<double> oMargins) const
{
    const double dfFirst = mdfNearAngle - dfNorth * mdfAnglePerTerm;
    const double dfPerAngle = mdfAnglePerTerm;
    const double dfLift = 1.0 / kEarthRadius - 1.0 / mdfOrbitRadius;
    const double dfBend = 1.0 / (2.0 * kEarthRadius * mdfOrbitRadius);
    const double dfScale = 2.0 * mdfColumnsPerAngle;
    const double dfShift = mdfColumnShift;
    const double dfUncertainty = mdfUncertainty;
    const double* const pdfTerms = oTerms.data();
    const double* const pdfElevations = oElevations.data();
    double* __restrict pdfPlaces = oPlaces.data();
    double* __restrict pdfMargins = oMargins.data();
    for (std::size_t k = 0; k < oElevations.size(); ++k)
    {
        const double c = pdfTerms[k] * dfPerAngle + dfFirst;
        const double z = pdfElevations[k];
        const double dfGap = CosineGap(c * c);
        const double dfHalf =
            0.5 * (dfGap - z * (dfLift - dfGap * kInvEarthRadius) + z * z * dfBend);
        const double dfSine = std::sqrt(dfHalf);
        const double dfPlace = dfSine * ArcSineRest(dfHalf) * dfScale + dfShift;
        // The integer next to it, by rounding.
        const double dfBorder = std::fabs(dfPlace - ((dfPlace + kRounder) - kRounder));
        pdfPlaces[k] = dfPlace;
        const bool bKnown = (c * c <= kLargestAngleSquare) & (dfHalf <= kLargestHalf) &
                            (std::fabs(z) <= kHighest) & (std::fabs(dfPlace) <= kLastColumn);
        // d(a) = d(q) / sin(a), and sin(a) is more than the sine of its half.
        pdfMargins[k] = dfBorder * (bKnown ? dfSine : 0.0) - dfUncertainty;
    }
}

}  // namespace kor::filters::simulation
