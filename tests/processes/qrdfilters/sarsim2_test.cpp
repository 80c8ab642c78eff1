#include "processes/qrdfilters/sarsim2.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>

#include "platform/datasources/basicwriter.h"
#include "platform/exception/exception.h"
#include "tests/support/exceptions.h"
#include "tests/support/radarscenes.h"

namespace kor::filters
{
namespace
{

using test::DemOf;
using test::Image;
using test::InputFor;
using test::MapReference;
using test::MemoryDataset;
using test::SimulationInput;

const auto kSeaLevel = [](std::uint32_t, std::uint32_t) { return 0; };

Sarsim2 MapSimulatorOf(const SimulationInput& oInput,
                       parallelio::IUpdateHandler* poHandler = nullptr)
{
    return Sarsim2({oInput.Dbiw.begin(), oInput.Dbiw.end()}, oInput.Escale, oInput.Alti,
                   oInput.Head, oInput.Minlook, oInput.NRPoint, oInput.Oversamp, poHandler);
}

/// The three images of a run, as large as the DEM.
template <class TOut, class TMark = unsigned char>
struct Maps
{
    explicit Maps(const MemoryDataset& oDem)
        : moImage(oDem.GetWidth(), oDem.GetHeight(), {typedispatch::RealDataType<TOut>()}),
          moLayover(oDem.GetWidth(), oDem.GetHeight(), {typedispatch::RealDataType<TMark>()}),
          moShadow(oDem.GetWidth(), oDem.GetHeight(), {typedispatch::RealDataType<TMark>()})
    {
    }

    void Fill(MemoryDataset& oDem, Sarsim2& oSimulator)
    {
        datasources::BasicReader oReader(&oDem, {1});
        datasources::BasicWriter oImageWriter(&moImage, {1});
        datasources::BasicWriter oLayoverWriter(&moLayover, {1});
        datasources::BasicWriter oShadowWriter(&moShadow, {1});
        oSimulator.Process(&oReader, &oImageWriter, &oLayoverWriter, &oShadowWriter);
    }

    MemoryDataset moImage;
    MemoryDataset moLayover;
    MemoryDataset moShadow;
};

template <class T>
Image<T> Picture(MemoryDataset& oDataset)
{
    std::vector<T> vSamples;
    for (std::size_t y = 0; y < oDataset.GetHeight(); ++y)
    {
        for (std::size_t x = 0; x < oDataset.GetWidth(); ++x)
        {
            vSamples.push_back(oDataset.Sample<T>(1, x, y));
        }
    }
    return Image<T>(oDataset.GetWidth(), std::move(vSamples));
}

template <class TOut>
Image<TOut> Simulated(MemoryDataset& oDem, const SimulationInput& oInput)
{
    Maps<TOut> oMaps(oDem);
    Sarsim2 oSimulator = MapSimulatorOf(oInput);
    oMaps.Fill(oDem, oSimulator);
    return Picture<TOut>(oMaps.moImage);
}

template <class T>
MapReference Reference(MemoryDataset& oDem, const SimulationInput& oInput)
{
    test::DemSamples oSamples;
    oSamples.mbBytes = sizeof(T) == 1;
    oSamples.mpfnStored = [](double dfElevation)
    { return ConvertSample<T, float>(ConvertSample<double, T>(dfElevation)); };
    const Image<T> oPicture = Picture<T>(oDem);
    for (const T nSample : oPicture.Samples())
    {
        oSamples.mvdfDouble.push_back(ConvertSample<T, double>(nSample));
        oSamples.mvfFloat.push_back(ConvertSample<T, float>(nSample));
    }
    return SimulateMap(oInput, oSamples);
}

/// Compares the window of a run with the plain transcription, bit by bit.
template <class T>
::testing::AssertionResult SameAsMapReference(MemoryDataset& oDem, const SimulationInput& oInput)
{
    Maps<double> oMaps(oDem);
    Sarsim2 oSimulator = MapSimulatorOf(oInput);
    oMaps.Fill(oDem, oSimulator);
    const MapReference oExpected = Reference<T>(oDem, oInput);
    std::size_t i = 0;
    for (int y = oInput.Dbiw[1]; y < oInput.Dbiw[1] + oInput.Dbiw[3]; ++y)
    {
        for (int x = oInput.Dbiw[0]; x < oInput.Dbiw[0] + oInput.Dbiw[2]; ++x, ++i)
        {
            const auto nX = static_cast<std::size_t>(x);
            const auto nY = static_cast<std::size_t>(y);
            const double dfActual = oMaps.moImage.Sample<double>(1, nX, nY);
            const int nLayover = oMaps.moLayover.Sample<unsigned char>(1, nX, nY);
            const int nShadow = oMaps.moShadow.Sample<unsigned char>(1, nX, nY);
            if (!test::SameSample(dfActual, oExpected.mvdfResults[i]) ||
                nLayover != oExpected.mvnLayover[i] || nShadow != oExpected.mvnShadow[i])
            {
                return ::testing::AssertionFailure()
                       << "pixel " << x << ", " << y << " is " << dfActual << ", layover "
                       << nLayover << ", shadow " << nShadow << " and not "
                       << oExpected.mvdfResults[i] << ", " << +oExpected.mvnLayover[i] << ", "
                       << +oExpected.mvnShadow[i];
            }
        }
    }
    return ::testing::AssertionSuccess();
}

/// Hills from 0 to 120 m, which all types hold.
template <class T>
MemoryDataset Hills(std::uint32_t nWidth, std::uint32_t nHeight, unsigned int nSeed)
{
    test::Random oRandom(nSeed);
    return DemOf<T>(nWidth, nHeight,
                    [&](std::uint32_t x, std::uint32_t y)
                    {
                        return 50.0 + 45.0 * std::sin(0.7 * x + 0.3 * y) +
                               0.01 * static_cast<double>(oRandom() % 2000);
                    });
}

TEST(Sarsim2, GivesTheBitsOfTheDefinitionForAllTypesAndHeadings)
{
    test::ForEachElementType(
        []<class T>()
        {
            MemoryDataset oDem = Hills<T>(17, 13, 1);
            SimulationInput oInput = InputFor(oDem);
            int nOversampling = 0;
            for (const double dfHeading :
                 {0.0, 1e-9, 13.0, 89.9, 90.0, 90.1, 135.0, 179.9, 180.0, 180.1, 225.0, 269.9,
                  270.0, 270.1, 300.0, 345.5, 359.9, 360.0})
            {
                oInput.Head = {dfHeading};
                oInput.Oversamp = {1 + nOversampling++ % 4};
                EXPECT_TRUE(SameAsMapReference<T>(oDem, oInput))
                    << sizeof(T) << " bytes, heading " << dfHeading;
            }
        });
}

template <class T>
void CompareRandomViews(test::Random& oRandom)
{
    const auto oUniform = [&](double dfLow, double dfHigh)
    { return std::uniform_real_distribution<double>(dfLow, dfHigh)(oRandom); };
    constexpr double kAltitudes[] = {800000.0, 800000.5, 785000.0, 693000.0, 12000.0, 3000.0};
    for (int i = 0; i < 20; ++i)
    {
        const auto nWidth = static_cast<std::uint32_t>(2 + oRandom() % 30);
        const auto nHeight = static_cast<std::uint32_t>(2 + oRandom() % 30);
        MemoryDataset oDem = Hills<T>(nWidth, nHeight, static_cast<unsigned int>(oRandom()));
        oDem.SetGeocodingInfo({oUniform(2e5, 8e5), oUniform(5, 60), 5e6, -oUniform(5, 60)});
        SimulationInput oInput = InputFor(oDem);
        oInput.Alti = {kAltitudes[oRandom() % std::size(kAltitudes)]};
        oInput.Head = {oUniform(0, 360)};
        oInput.Minlook = {oUniform(10, 50)};
        oInput.Oversamp = {1 + static_cast<int>(oRandom() % 4)};
        oInput.Escale = {oUniform(0.5, 3.0), oRandom() % 2 == 0 ? 0.0 : oUniform(-40, 40)};
        if (oRandom() % 2 == 0)
        {
            oInput.NRPoint = {oDem.GetGeocodingInfo().GetXOffset() - oUniform(0, 3000),
                              5e6 + oUniform(-3000, 3000)};
        }
        std::string oRefusal;
        try
        {
            EXPECT_TRUE(SameAsMapReference<T>(oDem, oInput)) << sizeof(T) << " bytes, run " << i;
        }
        catch (const Exception& oError)
        {
            oRefusal = oError.GetMessage();
        }
        // Nothing but images that no view can have.
        EXPECT_TRUE(oRefusal.empty() || oRefusal.find("a radar image of") != std::string::npos)
            << oRefusal;
    }
}

TEST(Sarsim2, GivesTheBitsOfTheDefinitionForRandomViews)
{
    test::Random oRandom(2);
    test::ForEachElementType([&]<class T>() { CompareRandomViews<T>(oRandom); });
}

TEST(Sarsim2, ReadsColumnsFromTheFirstAndWritesTheWindowInItsPlace)
{
    MemoryDataset oDem = Hills<float>(20, 18, 3);
    SimulationInput oInput = InputFor(oDem);
    oInput.Dbiw = {3, 5, 11, 9};
    for (const double dfHeading : {20.0, 200.0})
    {
        oInput.Head = {dfHeading};
        EXPECT_TRUE(SameAsMapReference<float>(oDem, oInput));
    }
    Maps<double> oMaps(oDem);
    Sarsim2 oSimulator = MapSimulatorOf(oInput);
    oMaps.Fill(oDem, oSimulator);
    for (std::size_t y = 0; y < 18; ++y)
    {
        for (std::size_t x = 0; x < 20; ++x)
        {
            const bool bInside = x >= 3 && x < 14 && y >= 5 && y < 14;
            if (!bInside)
            {
                EXPECT_EQ(oMaps.moImage.Sample<double>(1, x, y), 0.0) << x << ' ' << y;
            }
        }
    }
}

/// A plain of 10 x 8 pixels, one sub-sample a pixel: all counts are 1. Since eastings count from
/// the window, the grid's false easting shrinks distances by 0.6 %.
SimulationInput PlainInput(MemoryDataset& oDem)
{
    SimulationInput oInput = InputFor(oDem);
    oInput.Head = {0.0};
    oInput.Oversamp = {1};
    return oInput;
}

// Pixels look one column further than where they were counted: the last two columns fall on the
// last radar column and behind it. First and last row fall on the outermost lines.
TEST(Sarsim2, TakesTheCountAloneOnTheOutermostLinesAndColumns)
{
    MemoryDataset oDem = DemOf<std::int16_t>(10, 8, kSeaLevel);
    const Image<double> oExpected = {
        {1, 1, 1, 1, 1, 1, 1, 1, 1, 1},
        {1.5, 1.5, 1.5, 1.5, 1.5, 1.5, 1.5, 1.5, 1, 1},
        {1.5, 1.5, 1.5, 1.5, 1.5, 1.5, 1.5, 1.5, 1, 1},
        {1.5, 1.5, 1.5, 1.5, 1.5, 1.5, 1.5, 1.5, 1, 1},
        {1.5, 1.5, 1.5, 1.5, 1.5, 1.5, 1.5, 1.5, 1, 1},
        {1.5, 1.5, 1.5, 1.5, 1.5, 1.5, 1.5, 1.5, 1, 1},
        {1.5, 1.5, 1.5, 1.5, 1.5, 1.5, 1.5, 1.5, 1, 1},
        {1, 1, 1, 1, 1, 1, 1, 1, 1, 1},
    };
    const Image<double> oActual = Simulated<double>(oDem, PlainInput(oDem));
    for (std::size_t i = 0; i < 80; ++i)
    {
        // The four weights may miss 1 by a bit of single precision.
        EXPECT_NEAR(oActual.Samples()[i], oExpected.Samples()[i], 1e-6) << i;
    }
}

// Pixels twice as high as wide: pass two counts lines in pixels along x, so that row r of 8,
// counted from 1, looks at line 2 (8 - r) + 1 of 8.
TEST(Sarsim2, CountsLinesOfPassTwoInPixelsAlongX)
{
    MemoryDataset oDem = DemOf<std::int16_t>(10, 8, kSeaLevel);
    oDem.SetGeocodingInfo({480000.0, 30.0, 5000000.0, -60.0});
    const Image<int> oActual = Simulated<int>(oDem, PlainInput(oDem));
    const Image<int> oExpected = {
        {0, 0, 0, 0, 0, 0, 0, 0, 0, 0}, {0, 0, 0, 0, 0, 0, 0, 0, 0, 0},
        {0, 0, 0, 0, 0, 0, 0, 0, 0, 0}, {0, 0, 0, 0, 0, 0, 0, 0, 0, 0},
        {1, 1, 1, 1, 1, 1, 1, 1, 1, 1}, {1, 1, 1, 1, 1, 1, 1, 1, 1, 1},
        {1, 1, 1, 1, 1, 1, 1, 1, 1, 1}, {1, 1, 1, 1, 1, 1, 1, 1, 1, 1},
    };
    EXPECT_EQ(oActual, oExpected);
}

// Looking south at a heading of 90, a row is one metre further from the near range point and not
// one pixel: all rows look at nearly the same radar column, inside the image.
TEST(Sarsim2, RowsOfPassTwoLieOneMetreApart)
{
    MemoryDataset oDem = DemOf<std::int16_t>(8, 8, kSeaLevel);
    SimulationInput oInput = PlainInput(oDem);
    oInput.Head = {90.0};
    oInput.NRPoint = {480000.0, 5000000.0 - 2 * 30.0};
    const Image<double> oActual = Simulated<double>(oDem, oInput);
    EXPECT_TRUE(SameAsMapReference<std::int16_t>(oDem, oInput));
    // The near range point lies in row 2: the image begins at -60 m, that of row 0. Row r, counted
    // from 1, is looked for at r - 60 m, column 8 - (r / 30 + 1): 6.97 to 6.73 of 8.
    for (std::size_t y = 0; y < 8; ++y)
    {
        for (std::size_t x = 1; x < 7; ++x)
        {
            EXPECT_NEAR(oActual.Samples()[8 * y + x], 1.5, 1e-6) << x << ' ' << y;
        }
    }
}

TEST(Sarsim2, ThePlaceOnTheMapDoesNotCount)
{
    MemoryDataset oDem = Hills<float>(20, 20, 4);
    const SimulationInput oInput = InputFor(oDem);
    const Image<double> oBefore = Simulated<double>(oDem, oInput);
    oDem.SetGeocodingInfo({120000.0, 30.0, 7000000.0, -30.0});
    EXPECT_EQ(Simulated<double>(oDem, oInput), oBefore);
}

TEST(Sarsim2, HoldsPixelSizesInSinglePrecision)
{
    MemoryDataset oDem = Hills<float>(20, 20, 5);
    oDem.SetGeocodingInfo({480000.0, 30.1, 5000000.0, -29.9});
    const Image<double> oTenths = Simulated<double>(oDem, InputFor(oDem));
    EXPECT_TRUE(SameAsMapReference<float>(oDem, InputFor(oDem)));
    oDem.SetGeocodingInfo({480000.0, static_cast<double>(30.1F), 5000000.0, -double{29.9F}});
    EXPECT_EQ(Simulated<double>(oDem, InputFor(oDem)), oTenths);
}

// Pass one rounds scaled elevations to the DEM's type; pass two does not.
TEST(Sarsim2, ScaledElevationsAreRoundedInPassOneAlone)
{
    MemoryDataset oDem = DemOf<unsigned short>(
        12, 12, [](std::uint32_t x, std::uint32_t y) { return x % 3 + y % 2; });
    SimulationInput oInput = InputFor(oDem);
    oInput.Escale = {0.3, 10.0};
    EXPECT_TRUE(SameAsMapReference<unsigned short>(oDem, oInput));
    oInput.Escale = {-5.0, 0.0};  // below the type's range: clamped to 0
    EXPECT_TRUE(SameAsMapReference<unsigned short>(oDem, oInput));
}

template <class TOut>
TOut StoredAs(double dfResult)
{
    if constexpr (std::is_floating_point_v<TOut>)
    {
        return static_cast<TOut>(dfResult);
    }
    else
    {
        return static_cast<TOut>(static_cast<std::int64_t>(dfResult));
    }
}

TEST(Sarsim2, CutsResultsToTheOutputsWidthWithoutClamping)
{
    // Up to 20 x 20 sub-samples a pixel, beyond what 8 bits hold.
    MemoryDataset oDem = Hills<float>(8, 8, 6);
    SimulationInput oInput = InputFor(oDem);
    oInput.Oversamp = {20};
    const MapReference oExpected = Reference<float>(oDem, oInput);
    EXPECT_GT(*std::max_element(oExpected.mvdfResults.begin(), oExpected.mvdfResults.end()), 256.0);
    test::ForEachElementType(
        [&]<class TOut>()
        {
            const Image<TOut> oActual = Simulated<TOut>(oDem, oInput);
            for (std::size_t i = 0; i < 64; ++i)
            {
                EXPECT_EQ(oActual.Samples()[i], StoredAs<TOut>(oExpected.mvdfResults[i])) << i;
            }
        });
}

// All samples are 255 at 255 m, the highest of 8 bits, so that near range is theirs; all counts
// are 1, and the largest too: 1 becomes 255 sqrt(1), and where it is met again 255 sqrt(255).
TEST(Sarsim2, CompressesCountsOfAnEightBitDemAgainAtEachVisit)
{
    MemoryDataset oDem =
        DemOf<unsigned char>(8, 8, [](std::uint32_t, std::uint32_t) { return 255; });
    SimulationInput oInput = PlainInput(oDem);
    const Image<double> oActual = Simulated<double>(oDem, oInput);
    EXPECT_TRUE(SameAsMapReference<unsigned char>(oDem, oInput));
    // The first pixel on an inner line meets four counters of 1.
    EXPECT_NEAR(oActual.Samples()[8], 255.5, 1e-3);
    // Its right neighbour shares two of them, which are 4071 then, and lies 0.8 % of a pixel before
    // the next column.
    EXPECT_NEAR(oActual.Samples()[9], 255.5 + 0.008 * (4071 - 255), 2.0);
    // Other types keep the count.
    MemoryDataset oShorts =
        DemOf<std::int16_t>(8, 8, [](std::uint32_t, std::uint32_t) { return 0; });
    EXPECT_NEAR(Simulated<double>(oShorts, PlainInput(oShorts)).Samples()[9], 1.5, 1e-6);
}

// Some 40000 sub-samples in each pixel: as 16 bits with a sign, the largest count is negative.
TEST(Sarsim2, ALargestCountFrom32768OnGivesNoNumbersForEightBits)
{
    MemoryDataset oDem =
        DemOf<unsigned char>(2, 2, [](std::uint32_t, std::uint32_t) { return 255; });
    SimulationInput oInput = InputFor(oDem);
    oInput.Head = {0.0};
    oInput.Oversamp = {400};
    const Image<double> oActual = Simulated<double>(oDem, oInput);
    for (const double dfSample : oActual.Samples())
    {
        EXPECT_TRUE(std::isnan(dfSample)) << dfSample;
    }
    EXPECT_EQ(Simulated<short>(oDem, oInput), (Image<short>{{0, 0}, {0, 0}}));
    EXPECT_TRUE(SameAsMapReference<unsigned char>(oDem, oInput));
}

TEST(Sarsim2, MarksAreOneByteWhateverTheWriter)
{
    MemoryDataset oDem = DemOf<float>(
        30, 12, [](std::uint32_t x, std::uint32_t) { return x >= 10 && x < 14 ? 400.0 : 0.0; });
    SimulationInput oInput = InputFor(oDem);
    oInput.Minlook = {35.0};
    Maps<float> oBytes(oDem);
    Maps<float, std::uint32_t> oWords(oDem);
    Sarsim2 oSimulator = MapSimulatorOf(oInput);
    oBytes.Fill(oDem, oSimulator);
    oSimulator = MapSimulatorOf(oInput);
    oWords.Fill(oDem, oSimulator);
    const std::vector<unsigned char> vnLayover = Picture<unsigned char>(oBytes.moLayover).Samples();
    EXPECT_GT(std::count(vnLayover.begin(), vnLayover.end(), 1), 20);
    for (std::size_t i = 0; i < vnLayover.size(); ++i)
    {
        const std::uint32_t nWord = oWords.moLayover.Sample<std::uint32_t>(1, i % 30, i / 30);
        EXPECT_EQ(*reinterpret_cast<const unsigned char*>(&nWord), vnLayover[i]) << i;
        EXPECT_LE(nWord, 1U << 24) << i;
    }
    EXPECT_EQ(Picture<float>(oBytes.moImage), Picture<float>(oWords.moImage));
}

/// Keeps what it is told, and cancels at the nth question.
class Handler : public parallelio::IUpdateHandler
{
public:
    void Update(float fFraction) override { mvfFractions.push_back(fFraction); }
    bool IsCancelled() override
    {
        ++mnQuestions;
        return mnQuestions >= mnCancelFrom && mnQuestions < mnCancelTo;
    }

    std::vector<float> mvfFractions;
    int mnQuestions = 0;
    int mnCancelFrom = 1000;
    int mnCancelTo = 1000;
};

/// The rows of a run that were written.
std::vector<int> RowsWritten(Handler& oHandler, double dfHeading)
{
    MemoryDataset oDem = DemOf<std::int16_t>(6, 4, kSeaLevel);
    SimulationInput oInput = PlainInput(oDem);
    oInput.Head = {dfHeading};
    Maps<float> oMaps(oDem);
    for (std::size_t i = 0; i < 24; ++i)
    {
        oMaps.moImage.Sample<float>(1, i % 6, i / 6) = -1.0F;
    }
    Sarsim2 oSimulator = MapSimulatorOf(oInput, &oHandler);
    oMaps.Fill(oDem, oSimulator);
    std::vector<int> vnRows;
    for (int y = 0; y < 4; ++y)
    {
        if (oMaps.moImage.Sample<float>(1, 0, static_cast<std::size_t>(y)) != -1.0F)
        {
            vnRows.push_back(y);
        }
    }
    return vnRows;
}

TEST(Sarsim2, TellsItsProgressUpAndDownTheRows)
{
    const std::vector<float> vfExpected = {0.0F,
                                           0.2F,
                                           0.2F + 0.0F,
                                           0.2F + 0.4F * 1 / 4,
                                           0.2F + 0.4F * 2 / 4,
                                           0.2F + 0.4F * 3 / 4,
                                           0.6F,
                                           0.6F + 0.0F,
                                           0.6F + 0.4F * 1 / 4,
                                           0.6F + 0.4F * 2 / 4,
                                           0.6F + 0.4F * 3 / 4,
                                           1.0F};
    for (const double dfHeading : {0.0, 180.0})
    {
        Handler oHandler;
        EXPECT_EQ(RowsWritten(oHandler, dfHeading), (std::vector<int>{0, 1, 2, 3}));
        EXPECT_EQ(oHandler.mvfFractions, vfExpected) << dfHeading;
        EXPECT_EQ(oHandler.mnQuestions, 8);
    }
}

TEST(Sarsim2, ACancelledRunEndsWithoutAnErrorAndSaysThatItIsDone)
{
    Handler oBefore;
    oBefore.mnCancelFrom = 1;
    EXPECT_EQ(RowsWritten(oBefore, 0.0), std::vector<int>());
    EXPECT_EQ(oBefore.mvfFractions, (std::vector<float>{0.0F, 0.2F, 0.6F, 1.0F}));
    EXPECT_EQ(oBefore.mnQuestions, 2);

    Handler oInPassTwo;
    oInPassTwo.mnCancelFrom = 7;  // before the third row of pass two
    EXPECT_EQ(RowsWritten(oInPassTwo, 180.0), (std::vector<int>{2, 3}));
    EXPECT_EQ(oInPassTwo.mvfFractions.back(), 1.0F);
    EXPECT_EQ(oInPassTwo.mvfFractions.size(), 10U);

    Handler oOnce;  // asked again in pass two, it does not want to cancel any more
    oOnce.mnCancelFrom = 3;
    oOnce.mnCancelTo = 4;
    EXPECT_EQ(RowsWritten(oOnce, 0.0), (std::vector<int>{0, 1, 2, 3}));
    EXPECT_EQ(oOnce.mnQuestions, 7);
}

TEST(Sarsim2, RefusesNullPointersInTheirOrder)
{
    MemoryDataset oDem = DemOf<std::int16_t>(4, 4, kSeaLevel);
    datasources::BasicReader oReader(&oDem, {1});
    datasources::BasicWriter oWriter(&oDem, {1});
    const auto oMessage = [&](datasources::IRasterReader* poReader, datasources::IRasterWriter* po1,
                              datasources::IRasterWriter* po2, datasources::IRasterWriter* po3)
    {
        try
        {
            Sarsim2().Process(poReader, po1, po2, po3);
        }
        catch (const Exception& oError)
        {
            EXPECT_EQ(oError.GetFile(), "processes/qrdfilters/sarsim2");
            return oError.GetMessage();
        }
        return std::string();
    };
    EXPECT_EQ(oMessage(nullptr, nullptr, nullptr, nullptr), "poReader is invalid pointer");
    EXPECT_EQ(oMessage(&oReader, nullptr, nullptr, nullptr), "poRasterWriter is invalid pointer");
    EXPECT_EQ(oMessage(&oReader, &oWriter, nullptr, nullptr), "poLayoverWriter is invalid pointer");
    EXPECT_EQ(oMessage(&oReader, &oWriter, &oWriter, nullptr), "poShadowWriter is invalid pointer");
}

TEST(Sarsim2, RefusesComplexTypes)
{
    MemoryDataset oComplex(4, 4, {tessel::eDT_C32R});
    MemoryDataset oReal(4, 4, {tessel::eDT_32R});
    const auto oMessage = [&](MemoryDataset& oIn, MemoryDataset& oOut)
    {
        datasources::BasicReader oReader(&oIn, {1});
        datasources::BasicWriter oWriter(&oOut, {1});
        Sarsim2 oSimulator = MapSimulatorOf(InputFor(oReal));
        return test::MessageOf<Exception>(
            [&] { oSimulator.Process(&oReader, &oWriter, &oWriter, &oWriter); });
    };
    EXPECT_EQ(oMessage(oComplex, oReal), "Invalid type requested.");
    EXPECT_EQ(oMessage(oReal, oComplex), "Invalid type requested.");
}

TEST(Sarsim2, NamesTheListThatIsTooShortAndTakesALongerOneThen)
{
    MemoryDataset oDem = DemOf<std::int16_t>(4, 4, kSeaLevel);
    Maps<float> oMaps(oDem);
    const auto oMessage = [&](const auto& oBreak)
    {
        Sarsim2 oSimulator = MapSimulatorOf(InputFor(oDem));
        oBreak(oSimulator);
        return test::MessageOf<Exception>([&] { oMaps.Fill(oDem, oSimulator); });
    };
    using Lists = Sarsim2;
    EXPECT_EQ(oMessage(
                  [](Lists& o) {
                      o.SetDbiw({0, 0, 4});
                  }),
              "Dbiw holds 3 of the 4 values that are needed");
    EXPECT_EQ(oMessage([](Lists& o) { o.SetEscale({1.0}); }),
              "Escale holds 1 of the 2 values that are needed");
    EXPECT_EQ(oMessage([](Lists& o) { o.SetAlti({}); }),
              "Alti holds 0 of the 1 values that are needed");
    EXPECT_EQ(oMessage([](Lists& o) { o.SetHead({}); }),
              "Head holds 0 of the 1 values that are needed");
    EXPECT_EQ(oMessage([](Lists& o) { o.SetMinlook({}); }),
              "Minlook holds 0 of the 1 values that are needed");
    EXPECT_EQ(oMessage([](Lists& o) { o.SetOversamp({}); }),
              "Oversamp holds 0 of the 1 values that are needed");
    EXPECT_EQ(oMessage([](Lists& o) { o.SetNRPoint({1.0}); }),
              "NRPoint holds 1 of the 2 values that are needed");
    EXPECT_EQ(oMessage(
                  [](Lists& o) {
                      o.SetDbiw({0, 2, 4, 3});
                  }),
              "Dbiw asks for 4 x 3 pixels from row 2; the image has rows 0 to 3");

    Sarsim2 oSimulator = MapSimulatorOf(InputFor(oDem));
    oSimulator.SetHead({});
    EXPECT_THROW(oMaps.Fill(oDem, oSimulator), Exception);
    oSimulator.SetHead({13.0});
    oMaps.Fill(oDem, oSimulator);
}

TEST(Sarsim2, KeepsItsWorkerWithTheParametersItWasMadeWith)
{
    MemoryDataset oDem = Hills<float>(16, 16, 7);
    const SimulationInput oInput = InputFor(oDem);
    Sarsim2 oSimulator = MapSimulatorOf(oInput);
    Maps<double> oMaps(oDem);
    oMaps.Fill(oDem, oSimulator);
    const Image<double> oFirst = Picture<double>(oMaps.moImage);
    oSimulator.SetHead({200.0});
    // The same types: the old heading, and the offset that the first run put into Escale.
    oMaps.Fill(oDem, oSimulator);
    EXPECT_EQ(Picture<double>(oMaps.moImage), oFirst);
    for (std::size_t i = 0; i < 256; ++i)
    {
        oDem.Sample<float>(1, i % 16, i / 16) += 8.0F;
    }
    oMaps.Fill(oDem, oSimulator);
    EXPECT_NE(Picture<double>(oMaps.moImage), oFirst);
    // Another type of the output: the new heading.
    Maps<float> oFloats(oDem);
    oFloats.Fill(oDem, oSimulator);
    SimulationInput oTurned = oInput;
    oTurned.Head = {200.0};
    EXPECT_EQ(Picture<float>(oFloats.moImage), Simulated<float>(oDem, oTurned));
}

TEST(Sarsim2, StaysInItsTablesWhateverTheParameters)
{
    MemoryDataset oDem = Hills<std::int16_t>(2, 41, 8);
    SimulationInput oInput = InputFor(oDem);
    for (const double dfHeading : {0.0, 10.0, 90.0, 190.0, 300.0})
    {
        oInput.Head = {dfHeading};
        EXPECT_TRUE(SameAsMapReference<std::int16_t>(oDem, oInput)) << dfHeading;  // 41 lines of 32
    }
    // Peaks that fall in front of the image and pits that fall behind it.
    MemoryDataset oWild = DemOf<double>(12, 12,
                                        [](std::uint32_t x, std::uint32_t y)
                                        { return (x * 7 + y * 13) % 5 == 0 ? 30000.0 : -2e4 * x; });
    oInput = InputFor(oWild);
    oInput.Escale = {1.0, 1.0};
    EXPECT_TRUE(SameAsMapReference<double>(oWild, oInput));
    for (const int nOversampling : {0, -1, -7})
    {
        oInput.Oversamp = {nOversampling};
        const Image<double> oActual = Simulated<double>(oWild, oInput);
        for (const double dfSample : oActual.Samples())
        {
            EXPECT_TRUE(dfSample == 0.0 || dfSample == 0.5) << dfSample;
        }
    }
    MemoryDataset oNarrow = Hills<float>(6, 6, 9);
    oInput = InputFor(oNarrow);
    oInput.Dbiw = {0, 0, 9, 6};  // columns that the DEM has not
    Maps<float> oMaps(oNarrow);
    Sarsim2 oSimulator = MapSimulatorOf(oInput);
    oMaps.Fill(oNarrow, oSimulator);
}

// The very last of 513 x 513 sub-samples turns a counter from 65535 to 0, which replaces the
// largest count of -1.
TEST(Sarsim2, ALargestCountThatEndsAtZeroGivesInfinityAndZeroAsInteger)
{
    MemoryDataset oDem = DemOf<unsigned char>(2, 2, kSeaLevel);
    SimulationInput oInput = InputFor(oDem);
    oInput.Escale = {0.0, 0.0};
    oInput.Head = {90.0};
    oInput.Oversamp = {512};
    const Image<float> oRoots = Simulated<float>(oDem, oInput);
    const auto& vfRoots = oRoots.Samples();
    EXPECT_TRUE(std::any_of(vfRoots.begin(), vfRoots.end(), [](float f) { return std::isinf(f); }));
    EXPECT_EQ(Simulated<std::int64_t>(oDem, oInput), (Image<std::int64_t>{{0, 0}, {0, 0}}));
}

// Without cells there are no hits, and 0 is divided by the largest count of 0.
TEST(Sarsim2, ASingleColumnHasCountsOfZeroAndNoNumbersForEightBits)
{
    MemoryDataset oDem = DemOf<std::int16_t>(1, 3, kSeaLevel);
    SimulationInput oInput = InputFor(oDem);
    oInput.Head = {0.0};
    EXPECT_EQ(Simulated<double>(oDem, oInput), (Image<double>{{0}, {0}, {0}}));
    MemoryDataset oBytes = DemOf<unsigned char>(1, 3, kSeaLevel);
    const Image<float> oRoots = Simulated<float>(oBytes, oInput);
    for (const float fRoot : oRoots.Samples())
    {
        EXPECT_TRUE(std::isnan(fRoot)) << fRoot;
    }
    EXPECT_EQ(Simulated<unsigned char>(oBytes, oInput), (Image<unsigned char>{{0}, {0}, {0}}));
}

TEST(Sarsim2, RefusesImagesThatCannotBe)
{
    MemoryDataset oDem = DemOf<std::int16_t>(400, 400, kSeaLevel);
    Maps<float> oMaps(oDem);
    const auto oMessage = [&](const auto& oBreak)
    {
        SimulationInput oInput = InputFor(oDem);
        oBreak(oInput);
        Sarsim2 oSimulator = MapSimulatorOf(oInput);
        return test::MessageOf<Exception>([&] { oMaps.Fill(oDem, oSimulator); });
    };
    using In = SimulationInput;
    EXPECT_NE(oMessage([](In& o) { o.Oversamp = {2147483647}; }).find(" GiB of memory"),
              std::string::npos);
    const std::string oTooWide = oMessage([](In& o) { o.Dbiw = {0, 0, 2147483647, 1}; });
    EXPECT_EQ(oTooWide.find("A DEM window of 2147483647 columns needs "), 0U) << oTooWide;
    EXPECT_NE(oMessage([](In& o) { o.Minlook = {89.0}; }).find("a radar image of "),
              std::string::npos);
    EXPECT_NE(oMessage([](In& o) { o.Head = {std::nan("")}; }).find("nan lines"),
              std::string::npos);
    oDem.SetGeocodingInfo({0.0, 0.0, 0.0, -1.0});
    EXPECT_NE(oMessage([](In&) {}).find("a pixel has no area"), std::string::npos);
    // A peak of 2000 m falls 4.8 km nearer: 480 million pixels of a hundredth of a millimetre.
    oDem.SetGeocodingInfo({0.0, 1e-5, 0.0, -1e-5});
    oDem.Sample<std::int16_t>(1, 0, 0) = 2000;
    const std::string oTooLarge = oMessage([](In& o) { o.Head = {0.0}; });
    EXPECT_NE(oTooLarge.find("A radar image of "), std::string::npos) << oTooLarge;
    EXPECT_NE(oTooLarge.find(" GiB of memory; the machine has "), std::string::npos) << oTooLarge;
}

}  // namespace
}  // namespace kor::filters
