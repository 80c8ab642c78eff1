#include "processes/qrdfilters/sarsim1.h"

#include <gtest/gtest.h>

#include <cmath>
#include <numeric>

#include "platform/exception/exception.h"
#include "tests/support/exceptions.h"
#include "tests/support/kordskfiles.h"
#include "tests/support/radarscenes.h"
#include "tests/support/temporarydirectory.h"

namespace kor::filters
{
namespace
{

using test::DemOf;
using test::InputFor;
using test::MemoryDataset;
using test::RadarReference;
using test::SameAsReference;
using test::Simulated;
using test::SimulationInput;

const auto kFlat = [](std::uint32_t, std::uint32_t) { return 100; };
const auto kSeaLevel = [](std::uint32_t, std::uint32_t) { return 0; };

/// Hills steep enough for layover and shadow, with pixels of background among them.
MemoryDataset Hills(std::uint32_t nWidth, std::uint32_t nHeight, unsigned int nSeed)
{
    test::Random oRandom(nSeed);
    return DemOf<std::int16_t>(nWidth, nHeight,
                               [&](std::uint32_t x, std::uint32_t y)
                               {
                                   if (oRandom() % 40 == 0)
                                   {
                                       return -9999;
                                   }
                                   const double dfHill = 150.0 * std::sin(0.7 * x + 0.3 * y);
                                   return 400 + static_cast<int>(dfHill) +
                                          static_cast<int>(oRandom() % 20);
                               });
}

std::size_t Sum(const std::vector<std::uint16_t>& vnCounts)
{
    return std::accumulate(vnCounts.begin(), vnCounts.end(), std::size_t{0});
}

TEST(SarSim1, GivesTheBitsOfTheDefinitionForAllHeadings)
{
    MemoryDataset oDem = Hills(23, 17, 1);
    SimulationInput oInput = InputFor(oDem);
    for (const double dfHeading :
         {0.0, 1e-9, 13.0, 89.9, 90.0, 90.1, 135.0, 179.9, 180.0, 180.1, 180.0000000001, 225.0,
          269.9, 270.0, 270.1, 300.0, 345.5, 359.9, 360.0})
    {
        oInput.Head = {dfHeading};
        for (const int nOversampling : {1, 2, 3, 4})
        {
            oInput.Oversamp = {nOversampling};
            EXPECT_TRUE(SameAsReference<std::int16_t>(oDem, oInput))
                << "heading " << dfHeading << ", oversampling " << nOversampling;
        }
    }
}

TEST(SarSim1, GivesTheBitsOfTheDefinitionForRandomViews)
{
    test::Random oRandom(2);
    const auto oUniform = [&](double dfLow, double dfHigh)
    { return std::uniform_real_distribution<double>(dfLow, dfHigh)(oRandom); };
    constexpr double kAltitudes[] = {800000.0, 800000.5, 785000.0, 693000.0, 12000.0, 3000.0};
    for (int i = 0; i < 60; ++i)
    {
        const auto nWidth = static_cast<std::uint32_t>(2 + oRandom() % 40);
        const auto nHeight = static_cast<std::uint32_t>(2 + oRandom() % 40);
        MemoryDataset oDem = Hills(nWidth, nHeight, static_cast<unsigned int>(oRandom()));
        oDem.SetGeocodingInfo({oUniform(2e5, 8e5), oUniform(5, 60), 5e6, -oUniform(5, 60)});
        SimulationInput oInput = InputFor(oDem);
        oInput.Alti = {kAltitudes[oRandom() % std::size(kAltitudes)]};
        oInput.Head = {oUniform(0, 360)};
        oInput.Minlook = {oUniform(10, 50)};
        oInput.Oversamp = {1 + static_cast<int>(oRandom() % 4)};
        oInput.Outputxsz = {oUniform(5, 60), oUniform(5, 60)};
        oInput.Escale = {oRandom() % 4 == 0 ? 2.0 : 1.0, oRandom() % 2 == 0 ? 0.0 : -100.0};
        oInput.Flip = oRandom() % 2 == 0;
        EXPECT_TRUE(SameAsReference<std::int16_t>(oDem, oInput)) << "run " << i;
    }
}

TEST(SarSim1, ReadsWindowsAndOtherTypesAsTold)
{
    test::Random oRandom(3);
    MemoryDataset oBytes =
        DemOf<unsigned char>(20, 20, [&](std::uint32_t, std::uint32_t) { return oRandom() % 256; });
    SimulationInput oInput = InputFor(oBytes);
    oInput.Escale = {1.0, 0.0};
    EXPECT_TRUE(SameAsReference<unsigned char>(oBytes, oInput));

    MemoryDataset oFloats = DemOf<float>(
        20, 20, [&](std::uint32_t, std::uint32_t) { return 0.01 * (oRandom() % 20000); });
    oInput = InputFor(oFloats);
    oInput.Dbiw = {3, 5, 11, 9};  // columns 0 to 10 of the dataset; the offset moves the map alone
    EXPECT_TRUE(SameAsReference<float>(oFloats, oInput));
    oInput.Head = {190.0};
    EXPECT_TRUE(SameAsReference<float>(oFloats, oInput));
    oInput.Dbiw = {0, 0, 25, 20};  // wider than the dataset: samples of 0
    EXPECT_TRUE(SameAsReference<float>(oFloats, oInput));
}

TEST(SarSim1, CountsEverySubSampleOnce)
{
    MemoryDataset oDem = DemOf<std::int16_t>(5, 4, kFlat);
    SimulationInput oInput = InputFor(oDem);
    oInput.Head = {0.0};
    // 4 x 3 cells of 2 x 2 and the far edges: 9 columns of 7 sub-samples. All lie in the image.
    EXPECT_EQ(Sum(Simulated(oDem, oInput).mvnImage), 63U);
}

TEST(SarSim1, PutsTheNearRangePointToTheWindowsUpperLeftCorner)
{
    MemoryDataset oDem = DemOf<std::int16_t>(8, 8, kFlat);
    oDem.SetGeocodingInfo({480000.1, 30.0, 5000000.0, -20.0});
    SimulationInput oInput = InputFor(oDem);
    oInput.Dbiw = {2, 1, 6, 7};
    const RadarReference oOut = Simulated(oDem, oInput);
    // 480060.1 in single precision, and 5000000 - 20.
    EXPECT_EQ(oOut.mvdfNRPoint[0], 480060.09375);
    EXPECT_EQ(oOut.mvdfNRPoint[1], 4999980.0);
    oInput.NRPoint = {480000.0, 5000000.0};
    EXPECT_EQ(Simulated(oDem, oInput).mvdfNRPoint, oInput.NRPoint);
}

TEST(SarSim1, AnOffsetOfZeroBecomesTheLowestSampleButNotOfBytes)
{
    MemoryDataset oDem = DemOf<std::int16_t>(
        5, 5, [](std::uint32_t x, std::uint32_t y) { return x == 3 && y == 2 ? -40 : 7; });
    SimulationInput oInput = InputFor(oDem);
    EXPECT_EQ(Simulated(oDem, oInput).mvdfEscale, (std::vector<double>{1.0, -40.0}));
    oInput.Escale = {1.0, 3.0};
    EXPECT_EQ(Simulated(oDem, oInput).mvdfEscale, (std::vector<double>{1.0, 3.0}));
    MemoryDataset oBytes = DemOf<unsigned char>(5, 5, kFlat);
    EXPECT_EQ(Simulated(oBytes, InputFor(oBytes)).mvdfEscale, (std::vector<double>{1.0, 0.0}));
}

// Of four rows, the first and the third are sampled for the range of elevations, which takes scale
// and offset whole; the second may hold anything. Its samples take 2 and 5000: (5000 + 5000) * 2 is
// 20000, and so is (5000 - 27768) * 2 = -45536 in 16 bits.
TEST(SarSim1, ElevationsAreScaledByCutFactorsAndWrapAt16Bits)
{
    const auto oImageOf = [](int nSample)
    {
        MemoryDataset oDem = DemOf<std::int16_t>(6, 4,
                                                 [=](std::uint32_t, std::uint32_t y)
                                                 {
                                                     const int anRows[] = {11000, nSample, 0, 0};
                                                     return anRows[y];
                                                 });
        SimulationInput oInput = InputFor(oDem);
        oInput.Escale = {2.9, 5000.9};
        oInput.Head = {0.0};
        return Simulated(oDem, oInput).mvnImage;
    };
    EXPECT_EQ(oImageOf(5000), oImageOf(-27768));
    EXPECT_NE(oImageOf(5000), oImageOf(6000));
}

TEST(SarSim1, ASingleRowOrColumnHasNoCells)
{
    const std::pair<std::uint32_t, std::uint32_t> kSizes[] = {{1, 6}, {6, 1}, {1, 1}};
    for (const auto& [nWidth, nHeight] : kSizes)
    {
        MemoryDataset oDem = DemOf<std::int16_t>(nWidth, nHeight, kSeaLevel);
        for (const double dfHeading : {0.0, 180.0, 300.0})
        {
            SimulationInput oInput = InputFor(oDem);
            oInput.Head = {dfHeading};
            EXPECT_EQ(Sum(Simulated(oDem, oInput).mvnImage), 0U)
                << nWidth << " x " << nHeight << ", " << dfHeading;
        }
    }
}

/// A processed simulator over a plain.
SarSim1 Processed(const SimulationInput& oInput, MemoryDataset& oDem)
{
    datasources::BasicReader oReader(&oDem, {1});
    SarSim1 oSimulator = test::SimulatorOf(oInput);
    oSimulator.Process(oReader);
    return oSimulator;
}

double GroundRange(const SarSim1& oSimulator, float fAltitude, float fHeading, double dfX,
                   double dfY)
{
    double dfLook = 0.0;
    double dfRange = 0.0;
    oSimulator.range(fAltitude, fHeading, 0.0, dfX, dfY, &dfLook, &dfRange);
    return dfRange;
}

TEST(SarSim1, HeadingsAlongTheMeridianTakeTheArcFromWestToEast)
{
    MemoryDataset oDem = DemOf<std::int16_t>(50, 50, kFlat);
    SimulationInput oInput = InputFor(oDem);
    oInput.Head = {0.0};
    const SarSim1 oSimulator = Processed(oInput, oDem);
    for (const float fHeading : {0.0F, 180.0F, 360.0F})
    {
        EXPECT_EQ(GroundRange(oSimulator, 785000.0F, fHeading, 900.0, 0.0),
                  GroundRange(oSimulator, 785000.0F, fHeading, 900.0, -300.0))
            << fHeading;
    }
    for (const float fHeading : {0.25F, 179.75F, 180.25F, 359.75F, 90.0F, 270.0F})
    {
        EXPECT_NE(GroundRange(oSimulator, 785000.0F, fHeading, 900.0, 0.0),
                  GroundRange(oSimulator, 785000.0F, fHeading, 900.0, -300.0))
            << fHeading;
    }
    // On the sphere itself ground range is the distance, to the curvature of the grid.
    EXPECT_NEAR(GroundRange(oSimulator, 785000.0F, 0.0F, 900.0, 0.0), 900.0, 0.1);
    EXPECT_NEAR(GroundRange(oSimulator, 785000.0F, 90.0F, 900.0, -300.0), 300.0, 0.1);
}

/// A plain at 0 m with a quarter of background on the side that a heading sees first; one column
/// wider than the window of 40 x 40 pixels, since the scan looks at it.
MemoryDataset PlainBehindBackground(double dfHeading)
{
    return DemOf<std::int16_t>(41, 40,
                               [=](std::uint32_t x, std::uint32_t y)
                               {
                                   const bool bNear = dfHeading < 45.0 || dfHeading > 315.0 ? x < 10
                                                      : dfHeading < 225.0 ? x >= 30
                                                                          : y >= 30;
                                   return bNear ? -1 : 0;
                               });
}

// Background at near range leaves the first columns empty, or the last ones where columns are
// mirrored.
TEST(SarSim1, MirrorsColumnsBetweenTheQuartersAlone)
{
    const std::pair<double, bool> kHeadings[] = {{0.0, false},  {0.1, true},    {180.0, true},
                                                 {269.9, true}, {270.0, false}, {270.1, true},
                                                 {359.9, true}, {360.0, false}};
    for (const auto& [dfHeading, bMirrored] : kHeadings)
    {
        MemoryDataset oDem = PlainBehindBackground(dfHeading);
        SimulationInput oInput = InputFor(oDem);
        oInput.Dbiw = {0, 0, 40, 40};
        oInput.Oversamp = {1};
        oInput.Backelev = {-1.0};
        oInput.Head = {dfHeading};
        const RadarReference oOut = Simulated(oDem, oInput);
        int nFirst = 0;
        int nLast = 0;
        for (int y = 0; y < oOut.mnSarlin; ++y)
        {
            const auto itLine = oOut.mvnImage.begin() + y * oOut.mnSarpix;
            nFirst += std::accumulate(itLine, itLine + 6, 0);
            // The very last one also holds column 0 of another line.
            nLast += std::accumulate(itLine + oOut.mnSarpix - 6, itLine + oOut.mnSarpix - 1, 0);
        }
        EXPECT_GE(oOut.mnSarpix, 40) << dfHeading;
        EXPECT_EQ(nFirst == 0, !bMirrored) << dfHeading;
        EXPECT_EQ(nLast == 0, bMirrored) << dfHeading;
    }
}

// Column 0 of a mirrored line is the last counter of the buffer row before, which belongs to the
// line that was hit before; that of the first buffer row is lost.
TEST(SarSim1, ColumnZeroOfAMirroredLineBelongsToTheLineHitBefore)
{
    MemoryDataset oDem = DemOf<std::int16_t>(40, 40, kSeaLevel);
    SimulationInput oInput = InputFor(oDem);
    oInput.Oversamp = {1};
    oInput.Head = {180.0};
    const RadarReference oOut = Simulated(oDem, oInput);
    ASSERT_EQ(oOut.mnSarpix, 40);
    ASSERT_EQ(oOut.mnSarlin, 40);
    EXPECT_EQ(Sum(oOut.mvnImage), 1600U - 1U);
    // Rows run upwards, so line 40 is hit first: its last pixel is column 0 of line 39, and so on.
    for (std::size_t y = 0; y < 40; ++y)
    {
        EXPECT_EQ(oOut.mvnImage[40 * y + 39], y == 0 ? 0 : 1) << y;
    }
}

TEST(SarSim1, ExactlyEightHundredKilometresTakeTheChord)
{
    MemoryDataset oDem = DemOf<std::int16_t>(50, 50, kFlat);
    SimulationInput oInput = InputFor(oDem);
    oInput.Head = {0.0};
    oInput.Alti = {800000.0};
    const SarSim1 oChord = Processed(oInput, oDem);
    // The far end of the swath: 97000 m along the sphere from the near range point, which lies
    // 20030 m west of the central meridian.
    constexpr double R = 6370000.0;
    const double dfX = R * std::tan(std::atan(-20030.0 / R) + 97000.0 / R) + 20030.0;
    EXPECT_NEAR(GroundRange(oChord, 800000.0F, 0.0F, 0.0, 0.0), 0.0, 1e-3);
    EXPECT_NEAR(GroundRange(oChord, 800000.0F, 0.0F, dfX, 0.0), 2.0 * R * std::sin(48500.0 / R),
                1e-3);
    EXPECT_NEAR(GroundRange(oChord, 800000.5F, 0.0F, dfX, 0.0), 97000.0, 1e-3);
    EXPECT_TRUE(SameAsReference<std::int16_t>(oDem, oInput));
    oInput.Alti = {800000.5};
    EXPECT_TRUE(SameAsReference<std::int16_t>(oDem, oInput));
    // Nearer than the near range point: the other branch.
    oInput.Alti = {800000.0};
    oInput.NRPoint = {480600.0, 5000000.0};
    EXPECT_TRUE(SameAsReference<std::int16_t>(oDem, oInput));
}

TEST(SarSim1, LinesThatNothingHitStayZeroFlippedOrNot)
{
    // DEM rows every 30 m, lines every 10 m, one sub-sample a cell: two lines of three are empty.
    MemoryDataset oDem = DemOf<std::int16_t>(6, 6, kFlat);
    SimulationInput oInput = InputFor(oDem);
    oInput.Head = {0.0};
    oInput.Oversamp = {1};
    oInput.Outputxsz = {30.0, 10.0};
    for (const bool bFlip : {false, true})
    {
        oInput.Flip = bFlip;
        const RadarReference oOut = Simulated(oDem, oInput);
        ASSERT_EQ(oOut.mnSarlin, 16);
        for (int y = 0; y < oOut.mnSarlin; ++y)
        {
            const auto itLine = oOut.mvnImage.begin() + y * oOut.mnSarpix;
            const auto nHits = std::accumulate(itLine, itLine + oOut.mnSarpix, 0);
            EXPECT_EQ(nHits, y % 3 == 0 ? 6 : 0) << y;
        }
    }
}

TEST(SarSim1, FlipReversesTheLinesOfTheImageAlone)
{
    MemoryDataset oDem = Hills(20, 20, 5);
    SimulationInput oInput = InputFor(oDem);
    const RadarReference oPlain = Simulated(oDem, oInput);
    oInput.Flip = true;
    const RadarReference oFlipped = Simulated(oDem, oInput);
    ASSERT_NE(oPlain.mvnImage, oFlipped.mvnImage);
    for (int y = 0; y < oPlain.mnSarlin; ++y)
    {
        for (int x = 0; x < oPlain.mnSarpix; ++x)
        {
            const auto nLast = static_cast<std::size_t>(oPlain.mnSarlin - 1 - y);
            EXPECT_EQ(oFlipped.mvnImage[static_cast<std::size_t>(y * oPlain.mnSarpix + x)],
                      oPlain.mvnImage[nLast * static_cast<std::size_t>(oPlain.mnSarpix) +
                                      static_cast<std::size_t>(x)]);
        }
    }
    EXPECT_EQ(oFlipped.mvnLayover, oPlain.mvnLayover);
    EXPECT_EQ(oFlipped.mvnShadow, oPlain.mvnShadow);
}

TEST(SarSim1, ACounterWrapsAt65536)
{
    MemoryDataset oDem = DemOf<std::int16_t>(2, 2, kFlat);
    SimulationInput oInput = InputFor(oDem);
    oInput.Head = {0.0};
    oInput.Outputxsz = {1e6, 1e6};
    oInput.Oversamp = {300};
    const RadarReference oOut = Simulated(oDem, oInput);
    // 301 x 301 sub-samples in one pixel.
    EXPECT_EQ(oOut.mvnImage, (std::vector<std::uint16_t>{301 * 301 - 65536}));
}

TEST(SarSim1, UsesBufferRowsAgainBeyondTenThousandLines)
{
    MemoryDataset oDem = DemOf<std::int16_t>(2, 1001, kFlat);
    SimulationInput oInput = InputFor(oDem);
    oInput.Head = {0.0};
    oInput.Outputxsz = {300.0, 2.0};  // 30000 m of 2 m
    oInput.Oversamp = {15};
    const RadarReference oOut = Simulated(oDem, oInput);
    EXPECT_EQ(oOut.mnSarlin, 15001);
    EXPECT_TRUE(SameAsReference<std::int16_t>(oDem, oInput));
    // Rows run down the DEM and so from the last line on: the last 10000 lines are met first, and
    // all but the 5001 of them whose rows others took keep theirs.
    std::size_t nWritten = 0;
    for (int y = 0; y < oOut.mnSarlin; ++y)
    {
        const auto itLine = oOut.mvnImage.begin() + y * oOut.mnSarpix;
        nWritten += std::any_of(itLine, itLine + oOut.mnSarpix, [](int n) { return n != 0; });
    }
    EXPECT_EQ(nWritten, 10000U);
}

TEST(SarSim1, StaysInItsTablesBeyondAllTheirEnds)
{
    MemoryDataset oDem = Hills(2, 11, 6);
    SimulationInput oInput = InputFor(oDem);
    oInput.Outputxsz = {100.0, 0.004};  // 75001 lines and more, where 65536 can be looked up
    oInput.Oversamp = {40};
    for (const double dfHeading : {0.0, 10.0, 190.0, 100.0})
    {
        oInput.Head = {dfHeading};
        EXPECT_TRUE(SameAsReference<std::int16_t>(oDem, oInput)) << dfHeading;
    }
    oInput.Outputxsz = {30.0, 0.3};  // 1001 lines, where maxima are kept of 32
    oInput.Head = {10.0};
    EXPECT_TRUE(SameAsReference<std::int16_t>(oDem, oInput));
    oDem.SetGeocodingInfo({480000.0, 30.0, 5000000.0, -0.3});  // the maxima's lines as narrow
    oInput.moMap = oDem.GetGeocodingInfo();
    EXPECT_TRUE(SameAsReference<std::int16_t>(oDem, oInput));
}

TEST(SarSim1, DropsWhatFallsOutsideTheColumns)
{
    MemoryDataset oDem = Hills(30, 30, 7);
    SimulationInput oInput = InputFor(oDem);
    oInput.Escale = {1.0, -20000.0};  // wraps far below the sphere and above it
    EXPECT_TRUE(SameAsReference<std::int16_t>(oDem, oInput));
    oInput.Escale = {100.0, 0.0};
    EXPECT_TRUE(SameAsReference<std::int16_t>(oDem, oInput));
}

TEST(SarSim1, OversamplingOfZeroOrLessCountsNothing)
{
    MemoryDataset oDem = Hills(6, 6, 8);
    SimulationInput oInput = InputFor(oDem);
    for (const int nOversampling : {0, -1, -7})
    {
        oInput.Oversamp = {nOversampling};
        EXPECT_EQ(Sum(Simulated(oDem, oInput).mvnImage), 0U) << nOversampling;
    }
}

// The first row only fills the row before, unless its last sample is background.
TEST(SarSim1, ScansTheFirstRowToItselfWhenItsLastSampleIsBackground)
{
    MemoryDataset oDem = DemOf<std::int16_t>(4, 3, kFlat);
    SimulationInput oInput = InputFor(oDem);
    oInput.Head = {0.0};
    oInput.Oversamp = {1};
    oInput.Backelev = {-1.0};
    EXPECT_EQ(Sum(Simulated(oDem, oInput).mvnImage), 12U);
    oDem.Sample<std::int16_t>(1, 3, 0) = -1;
    // Two cells of one sub-sample, the third being skipped: they lie one line behind the last,
    // which is dropped. Their fourth neighbour in the second row now is a slope down to -1.
    EXPECT_EQ(Sum(Simulated(oDem, oInput).mvnImage), 12U);
    EXPECT_TRUE(SameAsReference<std::int16_t>(oDem, oInput));
}

// The sample tested stands to the right of the cell's first column, in both scan directions.
TEST(SarSim1, SkipsTheCellLeftOfABackgroundSample)
{
    MemoryDataset oDem = DemOf<std::int16_t>(4, 2, kSeaLevel);
    SimulationInput oInput = InputFor(oDem);
    oInput.Oversamp = {1};
    oInput.Backelev = {-1.0};
    oInput.Head = {0.0};
    // Rows run down: the second row is tested. Column 1 there is to the right of column 0.
    oDem.Sample<std::int16_t>(1, 1, 1) = -1;
    EXPECT_EQ(Sum(Simulated(oDem, oInput).mvnImage), 8U - 2U);
    EXPECT_TRUE(SameAsReference<std::int16_t>(oDem, oInput));
    // From right to left, the first cell's test reads the dataset's sample behind the window.
    MemoryDataset oWider = DemOf<std::int16_t>(5, 2, kFlat);
    oInput = InputFor(oWider);
    oInput.Escale = {1.0, -100.0};  // at 0 m, far from the image's ends
    oInput.Dbiw = {0, 0, 4, 2};
    oInput.Oversamp = {1};
    oInput.Backelev = {-1.0};
    oInput.Head = {135.0};
    const std::size_t nAll = Sum(Simulated(oWider, oInput).mvnImage);
    oWider.Sample<std::int16_t>(1, 4, 1) = -1;
    EXPECT_EQ(Sum(Simulated(oWider, oInput).mvnImage), nAll - 2U);
    EXPECT_TRUE(SameAsReference<std::int16_t>(oWider, oInput));
}

TEST(SarSim1, CopiesShareTheImageAndKeepItWhenTheOtherRunsAgain)
{
    MemoryDataset oDem = Hills(12, 12, 9);
    SarSim1 oFirst = Processed(InputFor(oDem), oDem);
    const SarSim1 oCopy = oFirst;
    const RadarReference oBefore = test::OutputOf(oFirst);
    oFirst.SetHead({200.0});
    datasources::BasicReader oReader(&oDem, {1});
    oFirst.Process(oReader);
    EXPECT_EQ(test::OutputOf(oCopy).mvnImage, oBefore.mvnImage);
    EXPECT_NE(test::OutputOf(oFirst).mvnImage, oBefore.mvnImage);
}

TEST(SarSim1, DescribesWhatItWrites)
{
    MemoryDataset oDem = Hills(12, 12, 10);
    const SarSim1 oSimulator = Processed(InputFor(oDem), oDem);
    const test::TemporaryDirectory oFolder;
    oSimulator.Output(oFolder.File("radar.kordsk"));
    const test::Kordsk poDataset = test::OpenKordsk(oFolder.File("radar.kordsk"));
    EXPECT_EQ(poDataset->GetAuxiliaryData().GetChannelDescription(1),
              "Simulated SAR image: range/azimuth projection");
    EXPECT_EQ(poDataset->GetBitmapAuxiliaryData(1).GetChannelDescription(1),
              "Layover Mask: range/azimuth projection");
    EXPECT_EQ(poDataset->GetBitmapAuxiliaryData(2).GetChannelDescription(1),
              "Shadow Mask: range/azimuth projection");
    EXPECT_EQ(poDataset->GetChannelType(1), tessel::eDT_16U);
    EXPECT_EQ(poDataset->GetBitmapCount(), 2U);
}

TEST(SarSim1, NamesTheListThatIsTooShort)
{
    MemoryDataset oDem = DemOf<std::int16_t>(4, 4, kFlat);
    datasources::BasicReader oReader(&oDem, {1});
    const auto oMessage = [&](const auto& oBreak)
    {
        SimulationInput oInput = InputFor(oDem);
        oBreak(oInput);
        return test::MessageOf<Exception>([&] { test::SimulatorOf(oInput).Process(oReader); });
    };
    using In = SimulationInput;
    EXPECT_EQ(oMessage(
                  [](In& o) {
                      o.Dbiw = {0, 0, 4};
                  }),
              "Dbiw holds 3 of the 4 values that are needed");
    EXPECT_EQ(oMessage([](In& o) { o.Escale = {}; }),
              "Escale holds 0 of the 2 values that are needed");
    EXPECT_EQ(oMessage([](In& o) { o.Backelev = {}; }),
              "Backelev holds 0 of the 1 values that are needed");
    EXPECT_EQ(oMessage([](In& o) { o.Outputxsz = {1.0}; }),
              "Outputxsz holds 1 of the 2 values that are needed");
    EXPECT_EQ(oMessage([](In& o) { o.Alti = {}; }), "Alti holds 0 of the 1 values that are needed");
    EXPECT_EQ(oMessage([](In& o) { o.Head = {}; }), "Head holds 0 of the 1 values that are needed");
    EXPECT_EQ(oMessage([](In& o) { o.Minlook = {}; }),
              "Minlook holds 0 of the 1 values that are needed");
    EXPECT_EQ(oMessage([](In& o) { o.Oversamp = {}; }),
              "Oversamp holds 0 of the 1 values that are needed");
    EXPECT_EQ(oMessage([](In& o) { o.NRPoint = {1.0}; }),
              "NRPoint holds 1 of the 2 values that are needed");
    EXPECT_EQ(oMessage(
                  [](In& o) {
                      o.Dbiw = {0, 2, 4, 3};
                  }),
              "Dbiw asks for 4 x 3 pixels from row 2; the image has rows 0 to 3");
    EXPECT_EQ(oMessage(
                  [](In& o) {
                      o.Dbiw = {0, 0, 0, 3};
                  }),
              "Dbiw asks for 0 x 3 pixels from row 0; a window holds one pixel at least");
}

TEST(SarSim1, RefusesImagesThatCannotBe)
{
    MemoryDataset oDem = DemOf<std::int16_t>(400, 400, kFlat);
    datasources::BasicReader oReader(&oDem, {1});
    const auto oMessage = [&](const auto& oBreak)
    {
        SimulationInput oInput = InputFor(oDem);
        oBreak(oInput);
        return test::MessageOf<Exception>([&] { test::SimulatorOf(oInput).Process(oReader); });
    };
    using In = SimulationInput;
    const std::string oTooLarge = oMessage([](In& o) { o.Outputxsz = {1e-3, 1e-3}; });
    EXPECT_NE(oTooLarge.find("A radar image of "), std::string::npos) << oTooLarge;
    EXPECT_NE(oTooLarge.find(" GiB of memory; the machine has "), std::string::npos) << oTooLarge;
    const std::string oOversampled = oMessage([](In& o) { o.Oversamp = {2147483647}; });
    EXPECT_NE(oOversampled.find(" GiB of memory"), std::string::npos) << oOversampled;
    const std::string oTooWide = oMessage([](In& o) { o.Dbiw = {0, 0, 2147483647, 1}; });
    EXPECT_EQ(oTooWide.find("A DEM window of 2147483647 columns needs "), 0U) << oTooWide;
    EXPECT_NE(oMessage([](In& o) { o.Minlook = {89.0}; }).find("a radar image of "),
              std::string::npos);
    EXPECT_NE(oMessage(
                  [](In& o) {
                      o.Outputxsz = {30.0, 0.0};
                  })
                  .find("inf lines"),
              std::string::npos);
    EXPECT_NE(oMessage([](In& o) { o.Head = {std::nan("")}; }).find("nan lines"),
              std::string::npos);
    EXPECT_EQ(oMessage([](In& o) { o.Backelev = {100.0}; }),
              "No elevation was found: all samples are background, 100.000000");
    EXPECT_EQ(test::MessageOf<Exception>([] { SarSim1().Output("nowhere"); }),
              "There is no image yet: Process has not run");
    EXPECT_EQ(SarSim1().GetSarlin(), 0);
    EXPECT_EQ(SarSim1().GetSarpix(), 0);
    const SarSim1 oSimulator = Processed(InputFor(oDem), oDem);
    EXPECT_EQ(test::MessageOf<Exception>([&] { oSimulator.Output(&oDem); }),
              "The dataset cannot hold the image: it needs channels and bitmaps");
    EXPECT_EQ(test::MessageOf<Exception>(
                  [&] { oSimulator.Output(static_cast<datasources::IDataset*>(nullptr)); }),
              "poDataset is invalid pointer");
}

TEST(SarSim1, APlainIsUniformWithoutLayoverAndShadow)
{
    MemoryDataset oDem = DemOf<std::int16_t>(60, 60, kSeaLevel);
    SimulationInput oInput = InputFor(oDem);
    oInput.Head = {0.0};
    oInput.Oversamp = {4};
    const RadarReference oOut = Simulated(oDem, oInput);
    EXPECT_EQ(std::count(oOut.mvnLayover.begin(), oOut.mvnLayover.end(), 1), 0);
    EXPECT_EQ(std::count(oOut.mvnShadow.begin(), oOut.mvnShadow.end(), 1), 0);
    ASSERT_EQ(oOut.mnSarpix, 60);
    ASSERT_EQ(oOut.mnSarlin, 60);
    for (int y = 1; y < 59; ++y)
    {
        for (int x = 1; x < 59; ++x)
        {
            // 4 x 4 sub-samples; the curvature moves one border of columns at most by one of them.
            const int nCount = oOut.mvnImage[static_cast<std::size_t>(y * 60 + x)];
            EXPECT_EQ(nCount % 4, 0) << x << ' ' << y;
            EXPECT_NEAR(nCount, 16, 4) << x << ' ' << y;
        }
    }
}

/// A ridge from north to south across a track to the north: walls of 10 pixels on either side, as
/// high as dfHeight at column nTop.
MemoryDataset Ridge(int nTop, int nHalfWidth, double dfHeight)
{
    return DemOf<std::int16_t>(
        200, 12,
        [=](std::uint32_t x, std::uint32_t)
        {
            const int nAway = std::abs(static_cast<int>(x) - nTop);
            return std::lround(std::max(0.0, dfHeight * (nHalfWidth - nAway) / nHalfWidth));
        });
}

/// Pixels of a mask on the middle line.
int CountOnMiddleLine(const std::vector<unsigned char>& vnMask, const RadarReference& oOut)
{
    const auto itLine = vnMask.begin() + (oOut.mnSarlin / 2) * oOut.mnSarpix;
    return static_cast<int>(std::count(itLine, itLine + oOut.mnSarpix, 1));
}

TEST(SarSim1, ARidgeSteeperThanTheLookAngleLiesOverTheGroundBeforeIt)
{
    // 600 m high over 2 pixels of 30 m: 84 degrees, steeper than the incidence of some 23 degrees.
    MemoryDataset oSteep = Ridge(100, 2, 600.0);
    SimulationInput oInput = InputFor(oSteep);
    oInput.Head = {0.0};
    oInput.Oversamp = {1};
    oInput.Minlook = {20.0};
    oInput.Escale = {1.0, 1e-9};  // an offset of almost 0, which is cut to 0
    const RadarReference oOut = Simulated(oSteep, oInput);
    // A point falls z / tan(incidence) nearer than its place; columns begin at what 600 m give, so
    // that the top falls into column 100. It and the slopes at 300 m, one pixel before it and one
    // behind, fall before the foot in column 98, which comes first.
    const double dfIncidence = std::asin((6370.0 + 785.0) / 6370.0 * std::sin(20.2 * M_PI / 180));
    const double dfShift = 600.0 / std::tan(dfIncidence) / 30.0;
    const auto itLine = oOut.mvnLayover.begin() + (oOut.mnSarlin / 2) * oOut.mnSarpix;
    std::vector<double> vdfMarked;
    for (int x = 0; x < oOut.mnSarpix; ++x)
    {
        if (itLine[x] != 0)
        {
            vdfMarked.push_back(x);
        }
    }
    ASSERT_EQ(vdfMarked.size(), 3U);
    EXPECT_NEAR(vdfMarked[0], 100.0, 1.0);
    EXPECT_NEAR(vdfMarked[1], 99.0 + 0.5 * dfShift, 1.5);
    EXPECT_NEAR(vdfMarked[2], 101.0 + 0.5 * dfShift, 1.5);

    // 100 m over 20 pixels: 9.5 degrees.
    MemoryDataset oGentle = Ridge(100, 20, 100.0);
    oInput = InputFor(oGentle);
    oInput.Head = {0.0};
    oInput.Escale = {1.0, 1e-9};
    const RadarReference oFlat = Simulated(oGentle, oInput);
    EXPECT_EQ(CountOnMiddleLine(oFlat.mvnLayover, oFlat), 0);
    EXPECT_EQ(CountOnMiddleLine(oFlat.mvnShadow, oFlat), 0);
}

TEST(SarSim1, ARidgeThrowsAShadowOfTheLengthThatTrigonometryTells)
{
    // From 4 km at a look angle of 60 degrees the sun, so to say, stands 30 degrees high.
    constexpr double kHeight = 300.0;
    MemoryDataset oDem = Ridge(60, 3, kHeight);
    SimulationInput oInput = InputFor(oDem);
    oInput.Head = {0.0};
    oInput.Oversamp = {1};
    oInput.Alti = {4000.0};
    oInput.Minlook = {60.0};
    oInput.Escale = {1.0, 1e-9};
    const RadarReference oOut = Simulated(oDem, oInput);
    // The top stands 4000 * tan(60) + 60 * 30 m from nadir; the ray over it meets the ground where
    // 4000 / (4000 - 300) of that lie behind: 8728 * 300 / 3700 = 708 m, of which all is in shadow
    // that is darker than the top. One DEM pixel is 30 m, so 23.6 pixels.
    const double dfTop = 4000.0 * std::tan(M_PI / 3.0) + 60.0 * 30.0;
    const double dfShadow = dfTop * kHeight / (4000.0 - kHeight) / 30.0;
    EXPECT_NEAR(dfShadow, 23.6, 0.1);
    EXPECT_NEAR(CountOnMiddleLine(oOut.mvnShadow, oOut), dfShadow, 2.0);
    // None of it before the ridge's top.
    const auto itLine = oOut.mvnShadow.begin() + (oOut.mnSarlin / 2) * oOut.mnSarpix;
    const auto nFirst = std::find(itLine, itLine + oOut.mnSarpix, 1) - itLine;
    EXPECT_GT(nFirst, 20);
}

}  // namespace
}  // namespace kor::filters
