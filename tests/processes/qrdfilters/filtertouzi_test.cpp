#include "processes/qrdfilters/filtertouzi.h"

#include <gtest/gtest.h>

#include <cmath>
#include <functional>
#include <string>
#include <vector>

#include "platform/exception/exception.h"
#include "tests/support/blocks.h"
#include "tests/support/touzireference.h"
#include "tests/support/touziscene.h"

namespace kor::filters
{
namespace
{

using namespace kor::test;
using tessel::eDT_32R;
using tessel::eDT_64R;
using tessel::eDT_8U;

using At = std::function<double(int dy, int dx)>;

/// One pixel of amplitudes with a margin of five, drawn by offsets from it.
template <class T = double>
std::unique_ptr<tessel::Raster> Drawn(const std::vector<At>& voChannels, int nMargin = 5)
{
    const auto nSide = static_cast<std::uint32_t>(nMargin);
    auto poRaster = BlankRaster(1, 1, static_cast<std::uint32_t>(voChannels.size()),
                                typedispatch::RealDataType<T>(), Margins{nSide, nSide});
    for (int dy = -nMargin; dy <= nMargin; ++dy)
    {
        for (int dx = -nMargin; dx <= nMargin; ++dx)
        {
            for (std::size_t c = 0; c < voChannels.size(); ++c)
            {
                poRaster->template GetPixelAs<T>(dx, dy)[c] = static_cast<T>(voChannels[c](dy, dx));
            }
        }
    }
    return poRaster;
}

/// A mask for one such pixel, which it clears.
std::unique_ptr<tessel::Mask> MaskedPixel()
{
    return MaskOf(Image<int>(11, std::vector<int>(121, 0)), Margins{5, 5});
}

template <class TOut = double>
std::vector<TOut> Filtered(const FilterTouzi& oFilter, tessel::Raster& oIn,
                           tessel::Mask* poMask = nullptr)
{
    const auto poOut = BlankRaster(oIn.mnWidth, oIn.mnHeight, oIn.mnChannels,
                                   typedispatch::RealDataType<TOut>(), Margins{1, 2});
    oFilter.Process(&oIn, poMask, poOut.get());
    return ImageOf<TOut>(*poOut).Samples();
}

double Touzi(const FilterTouzi& oFilter, const At& oAt, int nMargin = 5)
{
    return Filtered(oFilter, *Drawn({oAt}, nMargin))[0];
}

double Blend(double dfCu, double mean, double cv, double x)
{
    const double k = 1 - dfCu * dfCu / (cv * cv);
    return (1 - k) * mean + k * x;
}

TEST(FilterTouzi, ZerosStayZero)
{
    EXPECT_EQ(Touzi(FilterTouzi(), [](int, int) { return 0.0; }), 0.0);
}

// 121 pixels of 100 but one of 101 in a corner: flat up to the margin's window.
TEST(FilterTouzi, FlatAreaGivesTheMeanOfTheLargestWindow)
{
    const At oCorner = [](int dy, int dx) { return dy == -5 && dx == -5 ? 101.0 : 100.0; };
    EXPECT_EQ(Touzi(FilterTouzi(), oCorner), 12101.0 / 121.0);
    // Nine pixels wide is as far as the windows may grow here.
    EXPECT_EQ(Touzi(FilterTouzi(), oCorner, 4), 100.0);
}

// Beyond five pixels the samples alternate between 10 and 190, which is no longer flat.
TEST(FilterTouzi, FlatAreaStopsBeforeTheFirstWindowThatIsNotFlat)
{
    const At oRim = [](int dy, int dx)
    {
        const int nRing = std::max(std::abs(dy), std::abs(dx));
        return nRing == 2 && dy == 2 && dx == 2 ? 104.0
               : nRing <= 2                     ? 100.0
               : (dy + dx) % 2 == 0             ? 10.0
                                                : 190.0;
    };
    EXPECT_EQ(Touzi(FilterTouzi(), oRim), 2504.0 / 25.0);
}

// One bright pixel: mean 4, mean of squares 400.
TEST(FilterTouzi, StrongScattererIsBlendedWithItsMean)
{
    const At oPoint = [](int dy, int dx) { return dy == 0 && dx == 0 ? 100.0 : 0.0; };
    const double dfCu = 0.523 / std::sqrt(10.0);
    EXPECT_EQ(Touzi(FilterTouzi(), oPoint), Blend(dfCu, 4.0, std::sqrt(400.0 - 16.0) / 4.0, 100.0));
}

TEST(FilterTouzi, StrongScattererLeavesTheChannelsBehindItZero)
{
    const At oFlat = [](int, int) { return 7.0; };
    const At oPoint = [](int dy, int dx) { return dy == 0 && dx == 0 ? 100.0 : 0.0; };
    const std::vector<double> vdfOut =
        Filtered(FilterTouzi(), *Drawn({oFlat, oPoint, oFlat, oFlat}));
    EXPECT_EQ(vdfOut[0], 7.0);
    EXPECT_NE(vdfOut[1], 0.0);
    EXPECT_EQ(vdfOut[2], 0.0);
    EXPECT_EQ(vdfOut[3], 0.0);
}

// Of the 5 x 5 pixels five have 30 and the others 10: cv = 8 / 14, just below Cmax = 0.573.
double Line(int nAcross)
{
    return nAcross == 0 ? 30.0 : 10.0;
}

TEST(FilterTouzi, LineIsAveragedWithItsNeighbourLine)
{
    EXPECT_EQ(Touzi(FilterTouzi(), [](int dy, int) { return Line(dy); }), 20.0);
    EXPECT_EQ(Touzi(FilterTouzi(), [](int, int dx) { return Line(dx); }), 20.0);
}

// Ten pixels of 10 in the neighbour line are divided by the line's eleven.
TEST(FilterTouzi, NeighboursOfADiagonalLineAreDividedByItsWholeLength)
{
    const double dfExpected = (100.0 / 11.0 + 30.0) * 0.5;
    EXPECT_EQ(Touzi(FilterTouzi(), [](int dy, int dx) { return Line(dy - dx); }), dfExpected);
    EXPECT_EQ(Touzi(FilterTouzi(), [](int dy, int dx) { return Line(dy + dx); }), dfExpected);
}

TEST(FilterTouzi, LineStopsGrowingWhereItGetsLessClear)
{
    EXPECT_EQ(
        Touzi(FilterTouzi(), [](int dy, int dx) { return std::abs(dx) <= 2 ? Line(dy) : 10.0; }),
        20.0);
}

// Of two looks Cmax is 0.74. The line of 30 has 18 on one side; a tie takes the first.
TEST(FilterTouzi, LineTakesTheNeighbourLineThatIsMoreLikeIt)
{
    const FilterTouzi oFilter(2.0);
    for (const int nSide : {-1, 1})
    {
        EXPECT_EQ(Touzi(oFilter, [&](int dy, int) { return dy == nSide ? 18.0 : Line(dy); }), 24.0);
        EXPECT_EQ(Touzi(oFilter, [&](int, int dx) { return dx == nSide ? 18.0 : Line(dx); }), 24.0);
    }
    // 18 and 42 are as far from 30: the row above and the column to the left come first.
    const auto oTie = [](int n) { return n == -1 ? 18.0 : n == 1 ? 42.0 : n == 0 ? 30.0 : 1.0; };
    const FilterTouzi oWide(0.5, 0.7);
    EXPECT_EQ(Touzi(oWide, [&](int dy, int) { return oTie(dy); }), 24.0);
    EXPECT_EQ(Touzi(oWide, [&](int, int dx) { return oTie(dx); }), 24.0);
    EXPECT_EQ(Touzi(oWide, [&](int dy, int) { return oTie(-dy); }), 36.0);
}

TEST(FilterTouzi, LineDarkerThanItsNeighboursIsFoundToo)
{
    // 10 beside 30: ratio 1 / 3.
    EXPECT_EQ(Touzi(FilterTouzi(), [](int dy, int) { return 40.0 - Line(dy); }), 20.0);
}

TEST(FilterTouzi, EdgeGivesTheSideOfThePixel)
{
    const At oRight = [](int, int dx) { return dx >= 0 ? 30.0 : 10.0; };
    const At oLeft = [](int, int dx) { return dx > 0 ? 30.0 : 10.0; };
    const At oBelow = [](int dy, int) { return dy >= 0 ? 30.0 : 10.0; };
    const At oAbove = [](int dy, int) { return dy > 0 ? 30.0 : 10.0; };
    EXPECT_EQ(Touzi(FilterTouzi(), oRight), 30.0);
    EXPECT_EQ(Touzi(FilterTouzi(), oLeft), 10.0);
    EXPECT_EQ(Touzi(FilterTouzi(), oBelow), 30.0);
    EXPECT_EQ(Touzi(FilterTouzi(), oAbove), 10.0);
}

// The darker pixel of the edge has two of its own and two brighter ones beside its diagonal, which
// is a line of ratio 1 / 2 and not asked for here.
TEST(FilterTouzi, DiagonalEdgeGivesTheSideOfThePixel)
{
    const FilterTouzi oFilter(10.0, 0.45);
    for (const int nSign : {-1, 1})
    {
        const At oBright = [&](int dy, int dx) { return dx + nSign * dy >= 0 ? 30.0 : 10.0; };
        const At oDark = [&](int dy, int dx) { return dx + nSign * dy > 0 ? 30.0 : 10.0; };
        EXPECT_EQ(Touzi(oFilter, oBright), 30.0);
        EXPECT_EQ(Touzi(oFilter, oDark), 10.0);
    }
}

// The right side is 0: its ratio is infinite and turned into 0, which even a contour of 0 accepts.
TEST(FilterTouzi, EdgeAgainstZerosWins)
{
    const At oEdge = [](int, int dx) { return dx <= 0 ? 10.0 : 0.0; };
    EXPECT_EQ(Touzi(FilterTouzi(1.0, 0.0), oEdge), 10.0);
}

// Without lines and edges a line is neutral: 5 x 5 has mean 14 and cv 8 / 14.
TEST(FilterTouzi, ContourOfZeroLeavesNeitherLinesNorEdges)
{
    const double dfCu = 0.523 / std::sqrt(10.0);
    EXPECT_EQ(Touzi(FilterTouzi(10.0, 0.0, 0.5, 0.0), [](int dy, int) { return Line(dy); }),
              Blend(dfCu, 14.0, 8.0 / 14.0, 30.0));
}

double Chessboard(int dy, int dx)
{
    return (dy + dx) % 2 == 0 ? 15.0 : 5.0;
}

// 5 x 5 has 13 pixels of 15 and 12 of 5, 7 x 7 has 25 and 24, 11 x 11 has 61 and 60.
TEST(FilterTouzi, NeutralWindowGrowsWhileItChangesLittle)
{
    const double dfCu = 0.523 / std::sqrt(10.0);
    const auto oOfSize = [&](double n15, double n5)
    {
        const double n = n15 + n5;
        const double mean = (15.0 * n15 + 5.0 * n5) / n;
        const double cv = std::sqrt((225.0 * n15 + 25.0 * n5) / n - mean * mean) / mean;
        return Blend(dfCu, mean, cv, 15.0);
    };
    EXPECT_EQ(Touzi(FilterTouzi(10.0, 0.1, 0.5, 0.0), Chessboard), oOfSize(13, 12));
    EXPECT_EQ(Touzi(FilterTouzi(10.0, 0.1, 0.5, 0.1), Chessboard), oOfSize(61, 60));
    EXPECT_EQ(Touzi(FilterTouzi(10.0, 0.1, 0.5, 0.1), Chessboard, 3), oOfSize(25, 24));
}

// The chessboard's halves are alike in all directions. A brighter column at the rim of 7 x 7 makes
// them differ more than in 5 x 5, and that ends the growing whatever the variation does.
TEST(FilterTouzi, NeutralWindowStopsWhereItsEdgeGetsClearer)
{
    const double dfCu = 0.523 / std::sqrt(10.0);
    const double mean = 255.0 / 25.0;
    const double cv = std::sqrt((225.0 * 13.0 + 25.0 * 12.0) / 25.0 - mean * mean) / mean;
    const At oBrighter = [](int dy, int dx) { return Chessboard(dy, dx) + (dx == 3 ? 10.0 : 0.0); };
    EXPECT_EQ(Touzi(FilterTouzi(10.0, 0.0, 0.5, 1e9), oBrighter), Blend(dfCu, mean, cv, 15.0));
    EXPECT_NE(Touzi(FilterTouzi(10.0, 0.0, 0.5, 1e9), Chessboard), Blend(dfCu, mean, cv, 15.0));
}

// Of many looks even a flat area varies enough for a line: all four directions have the ratio 1,
// and the last one is a diagonal, whose ten neighbours are divided by eleven.
TEST(FilterTouzi, TieOfDirectionsGoesToTheLater)
{
    const At oFlat = [](int, int) { return 11.0; };
    EXPECT_EQ(Touzi(FilterTouzi(1000.0, 1.0), oFlat), 10.5);
}

// The edge threshold plays no part: neither a line nor an edge is found by it.
TEST(FilterTouzi, EdgeParameterIsReadByNothing)
{
    for (const double dfEdge : {0.0, 0.5, 1.0})
    {
        EXPECT_EQ(Touzi(FilterTouzi(10.0, 0.5, dfEdge),
                        [](int, int dx) { return dx >= 0 ? 30.0 : 10.0; }),
                  30.0);
    }
}

// Without margins all is 0 but the pixel, and the edge's ratios are 0 / 0: mean 4 and cv = sqrt(24)
// in 5 x 5, below Cu - 0.04 = 5.19.
TEST(FilterTouzi, RatiosThatAreNotNumbersMakeNoEdge)
{
    EXPECT_EQ(Touzi(
                  FilterTouzi(0.01, 0.5), [](int, int) { return 100.0; }, 0),
              4.0);
}

// A contour above 1 takes that for an edge all the same. It has no direction and so no pixels.
TEST(FilterTouzi, EdgeWithoutDirectionIsZero)
{
    EXPECT_EQ(Touzi(
                  FilterTouzi(0.01, 1.5), [](int, int) { return 100.0; }, 0),
              0.0);
}

TEST(FilterTouzi, IntensityIsFilteredAsAmplitude)
{
    FilterTouzi oFilter;
    oFilter.SetAmplit(1);
    // 900 and 100 are amplitudes of 30 and 10: the mean of both lines is 20.
    EXPECT_EQ(Touzi(oFilter, [](int dy, int) { return Line(dy) * Line(dy); }), 400.0);
}

// 20 dB come in as 10^2 and go out as 10 * log10(100^2): meant, though no inverse.
TEST(FilterTouzi, DecibelComesOutDoubled)
{
    FilterTouzi oFilter;
    oFilter.SetAmplit(2);
    EXPECT_EQ(Touzi(oFilter, [](int, int) { return 20.0; }), 40.0);
    // 10^-inf is 0, which has no logarithm.
    EXPECT_EQ(Touzi(oFilter, [](int, int) { return -INFINITY; }), 0.0);
}

TEST(FilterTouzi, MaskedPixelIsZeroOrKeptByWayOfTheAmplitude)
{
    const auto poMask = MaskedPixel();
    const auto poIn = Drawn({[](int, int) { return 20.0; }, [](int, int) { return 30.0; }});
    for (const int nAmplit : {0, 1, 2})
    {
        FilterTouzi oFilter;
        oFilter.SetAmplit(nAmplit);
        oFilter.SetBGZero(true);
        EXPECT_EQ(Filtered(oFilter, *poIn, poMask.get()), (std::vector<double>{0, 0}));
        FilterTouzi oKeep;
        oKeep.SetAmplit(nAmplit);
        const std::vector<double> vdfKept = Filtered(oKeep, *poIn, poMask.get());
        const double adfRoots[] = {std::sqrt(20.0), std::sqrt(30.0)};
        EXPECT_EQ(vdfKept[0], nAmplit == 0   ? 20.0
                              : nAmplit == 1 ? adfRoots[0] * adfRoots[0]
                                             : 40.0);
        EXPECT_EQ(vdfKept[1], nAmplit == 0   ? 30.0
                              : nAmplit == 1 ? adfRoots[1] * adfRoots[1]
                                             : 60.0);
    }
}

TEST(FilterTouzi, MaskedPixelsStillCountInTheWindowsOfOthers)
{
    const auto poIn = RasterOf(Image<double>(13, std::vector<double>(143, 4.0)), Margins{5, 5});
    *poIn->GetPixelAs<double>(1, 0) = 5.0;
    std::vector<int> vnValid(143, 1);
    vnValid[5 * 13 + 6] = 0;
    const auto poMask = MaskOf(Image<int>(13, vnValid), Margins{5, 5});
    EXPECT_EQ(Filtered(FilterTouzi(), *poIn, poMask.get()),
              (std::vector<double>{485.0 / 121.0, 5.0, 485.0 / 121.0}));
}

template <class TOut>
TOut Stored(double x)
{
    const auto poIn = Drawn({[&](int, int) { return x; }});
    const auto poMask = MaskedPixel();
    return Filtered<TOut>(FilterTouzi(), *poIn, poMask.get())[0];
}

TEST(FilterTouzi, IntegersTakeHalfMoreCutTowardsZeroAndClamped)
{
    EXPECT_EQ(Stored<int>(2.5), 3);
    EXPECT_EQ(Stored<int>(2.49), 2);
    EXPECT_EQ(Stored<int>(-2.7), -2);
    EXPECT_EQ(Stored<short>(-0.6), 0);
    EXPECT_EQ(Stored<int64>(-2.7), -2);
    EXPECT_EQ(Stored<int64>(2.5), 3);
    EXPECT_EQ(Stored<int64>(1e30), std::numeric_limits<int64>::max());
    EXPECT_EQ(Stored<int64>(-1e30), std::numeric_limits<int64>::min());
    EXPECT_EQ(Stored<int64>(9223372036854775808.0), std::numeric_limits<int64>::max());
    EXPECT_EQ(Stored<uint64>(2.5), 3U);
    EXPECT_EQ(Stored<uint64>(-1.0), 0U);
    EXPECT_EQ(Stored<uint64>(1e30), std::numeric_limits<uint64>::max());
    EXPECT_EQ(Stored<unsigned char>(254.5), 255);
    EXPECT_EQ(Stored<unsigned char>(1000.0), 255);
    EXPECT_EQ(Stored<unsigned char>(-3.0), 0);
    EXPECT_EQ(static_cast<signed char>(Stored<char>(-128.9)), -128);
    EXPECT_EQ(static_cast<signed char>(Stored<char>(-1000.0)), -128);
    EXPECT_EQ(static_cast<signed char>(Stored<char>(127.5)), 127);
    EXPECT_EQ(Stored<unsigned int>(4294967294.6), 4294967295U);
    EXPECT_EQ(Stored<unsigned int>(1e12), 4294967295U);
    EXPECT_EQ(Stored<int>(2147483646.6), 2147483647);
    EXPECT_EQ(Stored<int>(-1e12), std::numeric_limits<int>::min());
    EXPECT_EQ(Stored<int>(NAN), 0);
    EXPECT_EQ(Stored<uint64>(NAN), 0U);
    EXPECT_EQ(Stored<int>(INFINITY), 2147483647);
    EXPECT_EQ(Stored<float>(0.1), 0.1F);
    EXPECT_EQ(Stored<float>(1e300), std::numeric_limits<float>::infinity());
}

struct Fields : details::TouziParams
{
    using TouziParams::madfCu;
    using TouziParams::mbBGZero;
    using TouziParams::mdfCmax;
    using TouziParams::mdfCu;
    using TouziParams::mdfCuLine;
    using TouziParams::mdfCuMinor;
    using TouziParams::mdfLooks;
    using TouziParams::mnAmplit;
    using TouziParams::mnStartSize;
};

TEST(TouziParams, FirstWindowIsLargerForOneLook)
{
    Fields oFields;
    for (const double dfLooks : {1.0, 1.5, 1.99})
    {
        oFields.SetLooks(dfLooks);
        EXPECT_EQ(oFields.mnStartSize, 5) << dfLooks;
    }
    for (const double dfLooks : {0.0, 0.99, 2.0, 10.0, -1.0, 1e300, std::nan("")})
    {
        oFields.SetLooks(dfLooks);
        EXPECT_EQ(oFields.mnStartSize, 3) << dfLooks;
    }
}

TEST(TouziParams, LooksGiveTheVariationCoefficients)
{
    Fields oFields;
    EXPECT_EQ(oFields.mnAmplit, 0);
    EXPECT_FALSE(oFields.mbBGZero);
    oFields.SetLooks(4.0);
    EXPECT_EQ(oFields.mdfLooks, 4.0);
    EXPECT_EQ(oFields.mdfCu, 0.523 / 2.0);
    EXPECT_EQ(oFields.mdfCmax, static_cast<double>(static_cast<float>(std::sqrt(1.5) * 0.523)));
    EXPECT_EQ(oFields.mdfCuLine, 0.523 / 2.0 - 0.04);
    EXPECT_EQ(oFields.mdfCuMinor, 0.523 / 2.0 - 0.02);
    EXPECT_EQ(oFields.madfCu[0], oFields.mdfCu);
    EXPECT_EQ(oFields.madfCu[7], oFields.mdfCu);
}

// With a start size of 5 and margins of 1 there is no window to be flat in.
TEST(FilterTouzi, MarginsSmallerThanTheFirstWindowLeaveFlatAreasOut)
{
    // The nine pixels of 8 count as 25: mean 2.88, squares 23.04, cv 1.33 of Cmax 5.25.
    const At oEight = [](int, int) { return 8.0; };
    TouziReference oReference;
    oReference.dfLooks = 1.0;
    const auto poIn = Drawn({oEight}, 1);
    const auto poExpected = BlankRaster(1, 1, 1, eDT_64R);
    oReference.Process<double, double>(*poIn, nullptr, *poExpected);
    EXPECT_EQ(oReference.anCases[TouziReference::FLAT], 0);
    EXPECT_EQ(Filtered(FilterTouzi(1.0), *poIn), ImageOf<double>(*poExpected).Samples());
}

TEST(FilterTouzi, SettersCountOnlyUntilTheFirstBlockOfTheSameTypes)
{
    FilterTouzi oFilter;
    const auto poIn = Drawn({[](int, int) { return 20.0; }});
    const auto poMask = MaskedPixel();
    EXPECT_EQ(Filtered(oFilter, *poIn, poMask.get())[0], 20.0);
    oFilter.SetBGZero(true);
    oFilter.SetAmplit(2);
    oFilter.SetLooks(1.0);
    EXPECT_EQ(Filtered(oFilter, *poIn, poMask.get())[0], 20.0);
    EXPECT_EQ(Filtered<float>(oFilter, *poIn, poMask.get())[0], 0.0F);
    const FilterTouzi oCopy(oFilter);
    EXPECT_EQ(Filtered<float>(oCopy, *poIn)[0], 40.0F);
    EXPECT_EQ(Filtered(oCopy, *poIn, poMask.get())[0], 0.0);
}

TEST(FilterTouzi, SizesAreKeptForTheCaller)
{
    FilterTouzi oFilter;
    EXPECT_FALSE(oFilter.GetFilterSizeX());
    EXPECT_FALSE(oFilter.GetFilterSizeY());
    oFilter.SetFilterSize(11, 9);
    EXPECT_EQ(*oFilter.GetFilterSizeX(), 11);
    EXPECT_EQ(*oFilter.GetFilterSizeY(), 9);
    oFilter.SetFilterSize(boost::none, 7);
    EXPECT_FALSE(oFilter.GetFilterSizeX());
    EXPECT_EQ(*oFilter.GetFilterSizeY(), 7);
    // Filtering does not read them.
    EXPECT_EQ(Touzi(oFilter, [](int dy, int) { return Line(dy); }), 20.0);
}

TEST(FilterTouzi, ComplexInputIsSeenAsItsMagnitude)
{
    const auto poIn = BlankRaster(1, 1, 1, tessel::eDT_C32R, Margins{5, 5});
    auto* pParts = reinterpret_cast<float*>(poIn->mpBuffer);
    for (int i = 0; i < 121; ++i)
    {
        pParts[2 * i] = 3.0F;
        pParts[2 * i + 1] = -4.0F;
    }
    EXPECT_EQ(Filtered<float>(FilterTouzi(), *poIn), (std::vector<float>{5.0F}));
}

Exception Thrown(const std::function<void()>& oCall)
{
    try
    {
        oCall();
    }
    catch (const Exception& oException)
    {
        return oException;
    }
    ADD_FAILURE() << "nothing was thrown";
    return Exception("", "", "", 0);
}

TEST(FilterTouzi, RefusesWhatItCannotFilter)
{
    const FilterTouzi oFilter;
    const auto poReal = Drawn({[](int, int) { return 1.0; }});
    const auto poComplex = BlankRaster(1, 1, 1, tessel::eDT_C32R);
    const auto poBits = BlankRaster(8, 1, 1, tessel::eDT_BIT);
    const Exception oInput = Thrown([&] { oFilter.Process(nullptr, nullptr, nullptr); });
    EXPECT_EQ(oInput.GetMessage(), "poRasterIn is invalid pointer");
    EXPECT_EQ(oInput.GetFile(), "processes/qrdfilters/filtertouzi");
    EXPECT_NE(oInput.GetFunction().find("FilterTouzi::Process"), std::string::npos);
    const Exception oOutput = Thrown([&] { oFilter.Process(poReal.get(), nullptr, nullptr); });
    EXPECT_EQ(oOutput.GetMessage(), "poRasterOut is invalid pointer");
    const Exception oCannot =
        Thrown([&] { oFilter.Process(poReal.get(), nullptr, poComplex.get()); });
    EXPECT_EQ(oCannot.GetMessage(), "Output cannot be complex");
    const Exception oIn = Thrown([&] { oFilter.Process(poBits.get(), nullptr, poReal.get()); });
    EXPECT_EQ(oIn.GetMessage(), "Invalid type to dispatch.");
    EXPECT_EQ(oIn.GetLine(), 443U);
    const Exception oOut = Thrown([&] { oFilter.Process(poReal.get(), nullptr, poBits.get()); });
    EXPECT_EQ(oOut.GetMessage(), "Invalid type to dispatch.");
    EXPECT_EQ(oOut.GetLine(), 375U);
    EXPECT_EQ(Filtered(oFilter, *poReal)[0], 1.0);
}

TEST(FilterTouzi, RefusedOutputLeavesTheProcessorAsItWas)
{
    FilterTouzi oFilter;
    const auto poIn = Drawn({[](int, int) { return 20.0; }});
    const auto poMask = MaskedPixel();
    const auto poComplex = BlankRaster(1, 1, 1, tessel::eDT_C64R);
    EXPECT_EQ(Filtered(oFilter, *poIn, poMask.get())[0], 20.0);
    oFilter.SetBGZero(true);
    EXPECT_THROW(oFilter.Process(poIn.get(), nullptr, poComplex.get()), Exception);
    EXPECT_EQ(Filtered(oFilter, *poIn, poMask.get())[0], 20.0);
}

TEST(FilterTouzi, CallOperatorKeepsMarginsAndOffsets)
{
    auto poIn = std::make_shared<tessel::Raster>(tessel::RasterInfo(1, 1, 1, eDT_8U),
                                                 tessel::RasterContext(5, 5, 40, 50));
    std::fill_n(poIn->mpBuffer, 121, static_cast<unsigned char>(4));
    const std::shared_ptr<tessel::Mask> poClip = MaskOf({{0}});
    const auto poOut = FilterTouzi()(poIn, nullptr, poClip);
    EXPECT_EQ(poOut->mnMarginX, 5U);
    EXPECT_EQ(poOut->mnMarginY, 5U);
    EXPECT_EQ(poOut->mnOffsetX, 40U);
    EXPECT_EQ(poOut->mnOffsetY, 50U);
    EXPECT_EQ(ImageOf<unsigned char>(*poOut), (Image<unsigned char>{{4}}));
}

TEST(FilterTouzi, AcceptsAnEmptyBlock)
{
    const auto poIn = BlankRaster(0, 3, 1, eDT_32R, Margins{5, 5});
    EXPECT_TRUE(Filtered<float>(FilterTouzi(), *poIn).empty());
}

TEST(FilterTouzi, GivesTheBitsOfTheDefinition)
{
    Random oRandom(71);
    std::array<int, 5> anCases{};
    for (int i = 0; i < 400; ++i)
    {
        TouziReference oReference = RandomReference(oRandom);
        const auto nWidth = 1 + static_cast<std::uint32_t>(oRandom() % (i % 2 == 0 ? 50 : 5));
        const auto nHeight = 1 + static_cast<std::uint32_t>(oRandom() % 12);
        const auto nChannels = 1 + static_cast<std::uint32_t>(oRandom() % 4);
        const auto nMargin = static_cast<std::uint32_t>(i % 4 == 0 ? oRandom() % 8 : 5);
        const auto poIn = BlankRaster(nWidth, nHeight, nChannels, eDT_64R, {nMargin, nMargin});
        const double adfNoise[] = {0.02, 0.3, 0.7, 1.0};
        FillScene(*poIn, adfNoise[oRandom() % 4], oRandom);
        CompareWithDefinition<double, double>(oReference, *poIn, oRandom);
        for (std::size_t k = 0; k < anCases.size(); ++k)
        {
            anCases[k] += oReference.anCases[k];
        }
    }
    EXPECT_GT(anCases[TouziReference::SCATTERER], 500);
    EXPECT_GT(anCases[TouziReference::LINE], 500);
    EXPECT_GT(anCases[TouziReference::FLAT], 500);
    EXPECT_GT(anCases[TouziReference::EDGE], 500);
    EXPECT_GT(anCases[TouziReference::NEUTRAL], 500);
}

TEST(FilterTouzi, GivesTheBitsOfTheDefinitionOnSpecialSamples)
{
    Random oRandom(72);
    for (int i = 0; i < 60; ++i)
    {
        TouziReference oReference = RandomReference(oRandom);
        const auto nWidth = 1 + static_cast<std::uint32_t>(oRandom() % 30);
        const Margins oMargins{static_cast<std::uint32_t>(oRandom() % 7),
                               static_cast<std::uint32_t>(oRandom() % 7)};
        const auto poIn = RandomRaster(nWidth, 5, 1 + static_cast<std::uint32_t>(i % 2), eDT_64R,
                                       oMargins, Samples::Ordinary, oRandom);
        // Few enough special samples for windows without one.
        for (int k = 0; k < 5; ++k)
        {
            auto* pSamples = reinterpret_cast<double*>(poIn->mpBuffer);
            pSamples[oRandom() % (poIn->mnBufferSize / 8)] =
                RandomSample<double>(Samples::Special, oRandom);
        }
        CompareWithDefinition<double, double>(oReference, *poIn, oRandom);
    }
}

TEST(FilterTouzi, ServesAllHundredPairsOfTypes)
{
    Random oRandom(73);
    ForEachElementType(
        [&]<class TIn>()
        {
            ForEachElementType(
                [&]<class TOut>()
                {
                    TouziReference oReference;
                    oReference.nAmplit = static_cast<int>(oRandom() % 3);
                    const auto poIn =
                        BlankRaster(9, 3, 2, typedispatch::RealDataType<TIn>(), {5, 5});
                    FillScene(*poIn, 0.5, oRandom);
                    CompareWithDefinition<TIn, TOut>(oReference, *poIn, oRandom);
                });
        });
}

}  // namespace
}  // namespace kor::filters
