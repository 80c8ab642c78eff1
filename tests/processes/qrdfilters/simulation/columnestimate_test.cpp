#include "processes/qrdfilters/simulation/columnestimate.h"

#include <gtest/gtest.h>

#include <limits>
#include <random>
#include <vector>

namespace kor::filters::simulation
{
namespace
{

using Random = std::mt19937_64;

double Uniform(double dfLow, double dfHigh, Random& oRandom)
{
    return std::uniform_real_distribution<double>(dfLow, dfHigh)(oRandom);
}

Viewpoint ViewFrom(double dfAltitude, double dfLook)
{
    Viewpoint oView;
    SetOrbit(dfAltitude, kPi * dfLook / 180.0, oView);
    oView.mdfPixelX = 30.0;
    oView.mdfPixelY = 30.0;
    oView.mfSideSign = 1.0F;
    oView.mfWindowLeftX = 480000.0F;
    return oView;
}

/// A row of points, their columns as estimated and by the formula.
template <Division kDivision>
struct Row
{
    Row(const Viewpoint& oView, double dfAltitude, double dfHeading, double dfPixel, double dfNorth,
        double dfHighest, Random& oRandom)
    {
        constexpr std::size_t kPoints = 500;
        const Projection<kDivision> oProjection(oView, dfAltitude, dfHeading);
        RadarGrid oGrid;
        oGrid.mdfPerRange = 1.0 / dfPixel;
        oGrid.mdfNearRange = Uniform(-3000.0, 3000.0, oRandom);
        std::vector<double> vdfTerms;
        for (std::size_t k = 0; k < kPoints; ++k)
        {
            const double dfX = Uniform(0.0, 90000.0, oRandom);
            vdfTerms.push_back(oProjection.ColumnTerm(dfX));
            mvdfElevations.push_back(Uniform(-500.0, dfHighest, oRandom));
            const double dfGround =
                oProjection.RangesOf(dfX, dfNorth, mvdfElevations.back()).mdfGround;
            mvnColumns.push_back(
                Truncated((dfGround - oGrid.mdfNearRange) * oGrid.mdfPerRange + 1.0 + 0.5));
        }
        mvdfPlaces.resize(kPoints);
        mvdfMargins.resize(kPoints);
        const ColumnEstimate oEstimate(oView, oGrid, oProjection.AnglePerTerm());
        oEstimate.Find(vdfTerms, oProjection.IsMeridional() ? 0.0 : dfNorth, mvdfElevations,
                       mvdfPlaces, mvdfMargins);
        for (std::size_t k = 0; k < kPoints; ++k)
        {
            if (mvdfMargins[k] > 0.0)
            {
                ++mnCertain;
                EXPECT_EQ(static_cast<std::int64_t>(mvdfPlaces[k]), mvnColumns[k])
                    << mvdfPlaces[k] << ", margin " << mvdfMargins[k];
            }
        }
    }

    std::vector<double> mvdfElevations;
    std::vector<std::int64_t> mvnColumns;
    std::vector<double> mvdfPlaces;
    std::vector<double> mvdfMargins;
    std::size_t mnCertain = 0;
};

template <Division kDivision>
void ExpectCertainColumnsToBeRight()
{
    Random oRandom(1);
    std::size_t nCertain = 0;
    for (const double dfAltitude : {500.0, 12000.0, 785000.0, 800000.5, 3.6e7, 6e8})
    {
        // Down to a hundredth of a millimetre, where every point lies at a border.
        for (const double dfPixel : {1e-5, 1e-3, 0.1, 1.0, 30.0, 1e4})
        {
            for (const double dfHeading : {0.0, 1e-9, 13.0, 90.0, 179.9, 180.0, 290.0})
            {
                const Row<kDivision> oRow(ViewFrom(dfAltitude, Uniform(1.0, 50.0, oRandom)),
                                          dfAltitude, dfHeading, dfPixel,
                                          Uniform(-30000.0, 30000.0, oRandom), 9000.0, oRandom);
                nCertain += oRow.mnCertain;
            }
        }
    }
    EXPECT_GT(nCertain, 30000U);
}

TEST(ColumnEstimate, IsRightWhereItIsCertain)
{
    ExpectCertainColumnsToBeRight<Division::eQuotient>();
    ExpectCertainColumnsToBeRight<Division::eReciprocal>();
}

TEST(ColumnEstimate, IsCertainOfNearlyAllPointsOfAnOrdinaryView)
{
    Random oRandom(2);
    std::size_t nCertain = 0;
    for (int i = 0; i < 40; ++i)
    {
        nCertain += Row<Division::eQuotient>(ViewFrom(785000.0, 23.0), 785000.0, 13.0, 30.0, 500.0,
                                             4000.0, oRandom)
                        .mnCertain;
    }
    EXPECT_GE(nCertain, 20000U - 10U);
}

TEST(ColumnEstimate, IsNotCertainOfWhatIsNoPlaceOnTheEarth)
{
    const ColumnEstimate oEstimate(ViewFrom(785000.0, 23.0), {0.0, 1.0 / 30.0, 1.0 / 30.0}, 1e-7);
    constexpr double kNaN = std::numeric_limits<double>::quiet_NaN();
    constexpr double kInfinity = std::numeric_limits<double>::infinity();
    const std::vector<double> vdfTerms = {0, 0, 0, 0, kNaN, kInfinity, 1e7, -1e9};
    const std::vector<double> vdfElevations = {kNaN, kInfinity, -kInfinity, 2e5, 0, 0, 0, 0};
    std::vector<double> vdfPlaces(8);
    std::vector<double> vdfMargins(8);
    oEstimate.Find(vdfTerms, 0.0, vdfElevations, vdfPlaces, vdfMargins);
    for (std::size_t k = 0; k < 8; ++k)
    {
        EXPECT_FALSE(vdfMargins[k] > 0.0) << k;
    }
}

TEST(ColumnEstimate, IsUsedUpToAHundredEarthRadii)
{
    const auto oUsable = [](double dfAltitude) {
        return ColumnEstimate(ViewFrom(dfAltitude, 5.0), {0.0, 1.0}, 1e-7).IsUsable();
    };
    EXPECT_TRUE(oUsable(785000.0));
    EXPECT_TRUE(oUsable(98.0 * kEarthRadius));
    EXPECT_FALSE(oUsable(100.0 * kEarthRadius));
    EXPECT_FALSE(oUsable(-4e6));
}

}  // namespace
}  // namespace kor::filters::simulation
