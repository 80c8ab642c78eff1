#include "processes/qrdfilters/filtermode.h"

#include <gtest/gtest.h>

#include <cmath>
#include <string>
#include <vector>

#include "platform/exception/exception.h"
#include "platform/system/omp.h"
#include "processes/qrdfilters/hardened.h"
#include "tests/support/conversionreference.h"
#include "tests/support/exceptions.h"
#include "tests/support/threads.h"

namespace kor::filters
{
namespace
{

using namespace kor::test;

/// The drawing, its outer rows and columns being the margins, filtered into samples of type TOut.
template <class TOut, class TIn>
Image<TOut> Filtered(const FilterMode& oFilter, const Image<TIn>& oImage, Margins oMargins,
                     tessel::Mask* poMaskIn = nullptr, tessel::Mask* poMaskOut = nullptr,
                     std::uint32_t nChannels = 1)
{
    const auto poIn = RasterOf(oImage, oMargins, nChannels);
    const auto poOut = BlankRaster(poIn->mnWidth, poIn->mnHeight, nChannels,
                                   typedispatch::RealDataType<TOut>(), Margins{1, 2});
    oFilter.Process(poIn.get(), poMaskIn, poOut.get(), poMaskOut);
    return ImageOf<TOut>(*poOut);
}

template <class TOut, class TIn>
TOut Through(TIn xIn)
{
    return Filtered<TOut>(FilterMode(), Image<TIn>{{xIn}}, Margins{}).Samples()[0];
}

/// The output of a block of one pixel.
template <class T>
T Mode(const Image<T>& oImage, Margins oMargins, const FilterMode& oFilter = {},
       tessel::Mask* poMaskIn = nullptr)
{
    const Image<T> oOut = Filtered<T>(oFilter, oImage, oMargins, poMaskIn);
    EXPECT_EQ(oOut.Samples().size(), 1U);
    return oOut.Samples().at(0);
}

TEST(FilterMode, GivesTheMostFrequentValueOfTheWindow)
{
    const Image<std::uint8_t> oImage = {
        {7, 1, 8, 1},
        {2, 7, 8, 0},
        {6, 7, 5, 1},
    };
    EXPECT_EQ(Filtered<std::uint8_t>(FilterMode(), oImage, {1, 1}), (Image<std::uint8_t>{{7, 1}}));
}

TEST(FilterMode, CopiesTheInputWithoutMargins)
{
    const Image<float> oImage = {{1.5F, -2.25F}, {1e30F, -0.0F}};
    const auto poIn = RasterOf(oImage);
    const auto poOut = BlankRaster(2, 2, 1, tessel::eDT_32R);
    FilterMode().Process(poIn.get(), nullptr, poOut.get(), nullptr);
    EXPECT_TRUE(SameBits(*poOut, *poIn));
}

TEST(FilterMode, GivesThePixelItsOwnValueWhereAllDiffer)
{
    EXPECT_EQ(Mode<short>({{1, 2, 3}, {4, 5, 6}, {7, 8, 9}}, {1, 1}), 5);
}

TEST(FilterMode, PrefersThePixelsOwnValueAmongEquallyFrequentOnes)
{
    EXPECT_EQ(Mode<short>({{1, 1, 2}, {2, 3, 3}, {4, 4, 5}}, {1, 1}), 3);
}

// 1, 2 and 4 occur twice, and the pixel's own 9 once.
TEST(FilterMode, PrefersTheFirstInRowOrderAmongOtherEquallyFrequentValues)
{
    EXPECT_EQ(Mode<short>({{8, 2, 1}, {1, 9, 4}, {4, 2, 5}}, {1, 1}), 2);
    EXPECT_EQ(Mode<short>({{8, 4, 1}, {1, 9, 2}, {4, 2, 5}}, {1, 1}), 4);
}

// The own value occurs twice, another one three times.
TEST(FilterMode, PrefersAMoreFrequentValueToThePixelsOwn)
{
    EXPECT_EQ(Mode<short>({{3, 1, 2}, {4, 3, 5}, {1, 6, 1}}, {1, 1}), 1);
    EXPECT_EQ(Mode<short>({{1, 1, 2}, {4, 3, 5}, {3, 6, 1}}, {1, 1}), 1);
}

TEST(FilterMode, FindsAPairAtTheVeryEndOfTheWindow)
{
    EXPECT_EQ(Mode<int>({{1, 2, 3}, {4, 5, 6}, {7, 8, 8}}, {1, 1}), 8);
}

TEST(FilterMode, TakesItsWindowFromTheMarginsOfEachAxis)
{
    const Image<short> oImage = {{1, 2, 1, 3, 3}};
    EXPECT_EQ(Filtered<short>(FilterMode(), oImage, {1, 0}), (Image<short>{{1, 1, 3}}));
    EXPECT_EQ(Filtered<short>(FilterMode(), oImage, {2, 0}), (Image<short>{{1}}));
    const Image<short> oColumn = {{1}, {2}, {1}, {3}, {3}};
    EXPECT_EQ(Filtered<short>(FilterMode(), oColumn, {0, 1}), (Image<short>{{1}, {1}, {3}}));
}

TEST(FilterMode, TreatsChannelsByThemselves)
{
    const Image<int> oImage = {{1, 100, 2, 300, 1, 300}};
    EXPECT_EQ(Filtered<int>(FilterMode(), oImage, {1, 0}, nullptr, nullptr, 2),
              (Image<int>{{1, 300}}));
}

TEST(FilterMode, LeavesNotANumberOutOfTheCount)
{
    const double dfNaN = NAN;
    EXPECT_EQ(Mode<double>({{dfNaN, dfNaN, 1}, {dfNaN, 2, 1}, {dfNaN, 3, 4}}, {1, 1}), 1);
    EXPECT_EQ(Mode<double>({{dfNaN, dfNaN, 1}, {dfNaN, 2, 7}, {dfNaN, 3, 4}}, {1, 1}), 2);
    EXPECT_EQ(Mode<double>({{5, 8, 1}, {5, dfNaN, 7}, {9, 3, 4}}, {1, 1}), 5);
    EXPECT_TRUE(std::isnan(Mode<double>({{5, 8, 1}, {6, dfNaN, dfNaN}, {9, 3, 4}}, {1, 1})));
    EXPECT_EQ(Through<short>(dfNaN), 0);
}

// Zeros of both signs are one value, and the first of them is given.
TEST(FilterMode, GivesTheFirstZeroOfTheWindow)
{
    const auto bNegative = [](const Image<double>& oImage)
    {
        const double dfMode = Mode<double>(oImage, {1, 1});
        EXPECT_EQ(dfMode, 0.0);
        return std::signbit(dfMode);
    };
    EXPECT_TRUE(bNegative({{1, -0.0, 2}, {3, 0.0, 4}, {5, 0.0, 6}}));
    EXPECT_FALSE(bNegative({{1, 0.0, 2}, {3, -0.0, 4}, {5, -0.0, 6}}));
    // The own zero alone keeps its sign.
    EXPECT_TRUE(bNegative({{1, 8, 2}, {3, -0.0, 4}, {5, 9, 6}}));
    EXPECT_TRUE(std::signbit(Mode<double>({{-0.0, 1, 1}, {2, 0.0, 2}, {3, 7, 3}}, {1, 1})));
}

TEST(FilterMode, CountsInfinitiesLikeOtherValues)
{
    EXPECT_EQ(Mode<float>({{-INFINITY, INFINITY, 1}, {2, 3, 4}, {5, INFINITY, 6}}, {1, 1}),
              INFINITY);
}

// 2^53 and 2^53 + 1 are one double, and three of the nine.
TEST(FilterMode, Compares64BitIntegersAsDoubles)
{
    constexpr int64 kLarge = 9007199254740992;
    EXPECT_EQ(Mode<int64>({{kLarge, 1, 1}, {kLarge + 1, 2, 3}, {kLarge + 1, 4, 5}}, {1, 1}),
              kLarge);
    constexpr uint64 kLargest = UINT64_MAX;
    EXPECT_EQ(Mode<uint64>({{kLargest, 1, 1}, {kLargest - 9, 2, 3}, {kLargest - 1, 4, 5}}, {1, 1}),
              kLargest);
}

// ---- Keep list

TEST(FilterMode, KeepsListedValuesAndStillCountsThem)
{
    FilterMode oFilter({5}, false);
    const Image<std::uint8_t> oImage = {
        {7, 7, 7, 5},
        {7, 5, 7, 5},
        {7, 5, 5, 5},
    };
    // The 5 stays; of the other window's values 5 occurs six times.
    EXPECT_EQ(Filtered<std::uint8_t>(oFilter, oImage, {1, 1}), (Image<std::uint8_t>{{5, 5}}));
    EXPECT_EQ(Filtered<std::uint8_t>(FilterMode(), oImage, {1, 1}), (Image<std::uint8_t>{{7, 5}}));
}

TEST(FilterMode, KeepsAnyOfSeveralValuesChannelByChannel)
{
    FilterMode oFilter;
    oFilter.SetKeepValues({5, -3.5F});
    const Image<float> oImage = {{1, 1, -3.5F, 5, 1, 1}};
    EXPECT_EQ(Filtered<float>(oFilter, oImage, {1, 0}, nullptr, nullptr, 2),
              (Image<float>{{-3.5F, 5}}));
    const Image<float> oOther = {{1, 1, -3.25F, 5, 1, 1}};
    EXPECT_EQ(Filtered<float>(oFilter, oOther, {1, 0}, nullptr, nullptr, 2),
              (Image<float>{{1, 5}}));
}

TEST(FilterMode, ComparesKeptValuesInSinglePrecision)
{
    const FilterMode oFilter({16777216.0F}, false);
    EXPECT_EQ(Mode<int>({{1, 16777217, 1}}, {1, 0}, oFilter), 16777217);
    EXPECT_EQ(Mode<int>({{1, 16777218, 1}}, {1, 0}, oFilter), 1);
    EXPECT_EQ(Mode<int64>({{1, 16777217, 1}}, {1, 0}, oFilter), 16777217);
    // 1 + 2^-30 is 1 in single precision.
    EXPECT_EQ(Mode<double>({{3, 1 + 0x1p-30, 3}}, {1, 0}, FilterMode({1}, false)), 1 + 0x1p-30);
}

TEST(FilterMode, KeepsWhatLiesWithinABillionthOfAListedValue)
{
    const FilterMode oFilter({0}, false);
    EXPECT_EQ(Mode<float>({{1, 0.9e-9F, 1}}, {1, 0}, oFilter), 0.9e-9F);
    EXPECT_EQ(Mode<float>({{1, -0.9e-9F, 1}}, {1, 0}, oFilter), -0.9e-9F);
    EXPECT_EQ(Mode<float>({{1, 1.1e-9F, 1}}, {1, 0}, oFilter), 1);
    EXPECT_EQ(Mode<float>({{1, -1.1e-9F, 1}}, {1, 0}, oFilter), 1);
}

TEST(FilterMode, KeepsNeitherNotANumberNorInfinities)
{
    const FilterMode oFilter({INFINITY, NAN}, false);
    EXPECT_EQ(Mode<double>({{1, NAN, 1}}, {1, 0}, oFilter), 1);
    EXPECT_EQ(Mode<double>({{1, INFINITY, 1}}, {1, 0}, oFilter), 1);
}

// By way of double the signed 64-bit type would lose negative values and the low bits.
TEST(FilterMode, ConvertsKeptValuesDirectly)
{
    EXPECT_EQ(Through<int64>(int64{-5}), 0);
    EXPECT_EQ(Filtered<int64>(FilterMode({-5}, false), Image<int64>{{-5}}, {}),
              (Image<int64>{{-5}}));
    constexpr int64 kLarge = 9007199254740993;
    EXPECT_EQ(Through<int64>(kLarge), kLarge - 1);
    EXPECT_EQ(Filtered<int64>(FilterMode({9007199254740992.0F}, false), Image<int64>{{kLarge}}, {}),
              (Image<int64>{{kLarge}}));
}

TEST(FilterMode, LooksAtTheMasksBeforeItKeeps)
{
    FilterMode oFilter({5}, false);
    oFilter.SetBGZero(true);
    const auto poMask = MaskOf({{0, 1}});
    EXPECT_EQ(Filtered<short>(oFilter, Image<short>{{5, 5}}, {}, poMask.get()),
              (Image<short>{{0, 5}}));
}

// ---- Thin lines

TEST(FilterMode, KeepsALineWhoseBackgroundFillsTheUpperLeftInThinLineMode)
{
    const Image<std::uint8_t> oImage = {{1, 1, 1}, {1, 9, 1}, {1, 1, 1}};
    EXPECT_EQ(Mode(oImage, {1, 1}, FilterMode({}, true)), 9);
    EXPECT_EQ(Mode(oImage, {1, 1}, FilterMode({}, false)), 1);
    // Three places are enough, however frequent another value is: here 2 fills five.
    EXPECT_EQ(Mode<std::uint8_t>({{1, 2, 2}, {1, 9, 2}, {1, 2, 2}}, {1, 1}, FilterMode({}, true)),
              9);
    // Two are not.
    EXPECT_EQ(Mode<std::uint8_t>({{1, 2, 2}, {1, 9, 2}, {2, 2, 3}}, {1, 1}, FilterMode({}, true)),
              2);
}

TEST(FilterMode, CountsTheUpperLeftSampleAloneInThinLineMode)
{
    // 2 fills six places, but the upper left one is another value.
    EXPECT_EQ(Mode<std::uint8_t>({{4, 2, 2}, {2, 9, 2}, {2, 2, 3}}, {1, 1}, FilterMode({}, true)),
              2);
    EXPECT_EQ(Mode<double>({{NAN, NAN, NAN}, {2, 9, 2}, {4, 5, 6}}, {1, 1}, FilterMode({}, true)),
              2);
}

TEST(FilterMode, TakesAWindowOfThreeByThreeInThinLineModeWhateverTheMargins)
{
    const Image<std::uint8_t> oImage = {
        {5, 5, 5, 5, 5, 5, 5}, {5, 5, 5, 5, 5, 5, 5}, {5, 5, 1, 2, 3, 5, 5}, {5, 5, 4, 9, 3, 5, 5},
        {5, 5, 6, 7, 8, 5, 5}, {5, 5, 5, 5, 5, 5, 5}, {5, 5, 5, 5, 5, 5, 5},
    };
    EXPECT_EQ(Mode(oImage, {3, 3}, FilterMode({}, true)), 3);
    EXPECT_EQ(Mode(oImage, {3, 3}, FilterMode({}, false)), 5);
}

TEST(FilterMode, RefusesThinLinesWithoutAMargin)
{
    const FilterMode oFilter({}, true);
    for (const Margins oMargins : {Margins{0, 1}, {1, 0}, {0, 0}, {0, 5}})
    {
        const auto poIn = BlankRaster(4, 4, 1, tessel::eDT_8U, oMargins);
        const auto poOut = BlankRaster(4, 4, 1, tessel::eDT_8U);
        std::fill_n(poIn->mpBuffer, poIn->mnBufferSize, static_cast<unsigned char>(1));
        try
        {
            oFilter.Process(poIn.get(), nullptr, poOut.get(), nullptr);
            FAIL() << "threw nothing";
        }
        catch (const ParameterException& oException)
        {
            EXPECT_EQ(oException.GetFirstText(), "Filter size must be 3x3");
            EXPECT_EQ(oException.GetType(), ParameterException::Type::eInvalidValue);
            EXPECT_EQ(oException.GetSecondText(), "");
            EXPECT_EQ(oException.GetParameterName(), "");
            EXPECT_EQ(oException.GetMessage(), "");
            EXPECT_EQ(oException.GetFile(), "");
            EXPECT_EQ(oException.GetFunction(), "");
            EXPECT_EQ(oException.GetLine(), 0U);
            EXPECT_STREQ(oException.what(), "Filter size must be 3x3");
        }
        EXPECT_TRUE(SameBits(*poOut, *BlankRaster(4, 4, 1, tessel::eDT_8U)));
    }
}

// ---- Masks

// The masked bits are those of the first column of the window of the pixel, and of its second row:
// 3 3 3 is replaced by 9 9 9, so that 9 fills three places and 1 only two.
TEST(FilterMode, MaskBitOfTheFirstColumnStandsForTheWholeWindowRow)
{
    const Image<short> oImage = {{1, 1, 2}, {3, 9, 3}, {4, 5, 6}};
    const auto poMask = MaskOf({{1, 1, 1}, {0, 1, 1}, {1, 1, 1}}, {1, 1});
    EXPECT_EQ(Mode(oImage, {1, 1}, {}, poMask.get()), 9);
    const Image<short> oBelow = {{1, 1, 2}, {3, 9, 4}, {5, 5, 5}};
    EXPECT_EQ(Mode(oBelow, {1, 1}), 5);
    const auto poBelow = MaskOf({{1, 1, 1}, {1, 1, 1}, {0, 1, 1}}, {1, 1});
    EXPECT_EQ(Mode(oBelow, {1, 1}, {}, poBelow.get()), 9);
}

TEST(FilterMode, ReadsMaskedSamplesOutsideTheFirstColumn)
{
    const Image<short> oImage = {{1, 2, 3}, {4, 9, 5}, {6, 7, 7}};
    const auto poMask = MaskOf({{1, 1, 1}, {1, 1, 1}, {1, 0, 0}}, {1, 1});
    EXPECT_EQ(Mode(oImage, {1, 1}, {}, poMask.get()), 7);
}

// The upper left place holds the pixel's own 9 then, and so do three of the nine.
TEST(FilterMode, CountsReplacedRowsInThinLineMode)
{
    const Image<short> oImage = {{1, 2, 3}, {4, 9, 4}, {4, 4, 7}};
    const auto poMask = MaskOf({{0, 1, 1}, {1, 1, 1}, {1, 1, 1}}, {1, 1});
    EXPECT_EQ(Mode(oImage, {1, 1}, FilterMode({}, true)), 4);
    EXPECT_EQ(Mode(oImage, {1, 1}, FilterMode({}, true), poMask.get()), 9);
}

TEST(FilterMode, CopiesPixelsThatAreNotComputed)
{
    const Image<short> oImage = {{20, 300, -7, 20, 20}};
    const auto poMaskIn = MaskOf({{1, 0, 1, 1, 1}}, {1, 0});
    const auto poMaskOut = MaskOf({{1, 1, 0}});
    // The middle pixel's only row begins with a masked column.
    EXPECT_EQ(Filtered<short>(FilterMode(), oImage, {1, 0}, poMaskIn.get(), poMaskOut.get()),
              (Image<short>{{300, -7, 20}}));
    // Converted on the way: 300 is cut to 255, and -7 becomes 0.
    EXPECT_EQ(Filtered<std::uint8_t>(FilterMode(), oImage, {1, 0}, poMaskIn.get(), poMaskOut.get()),
              (Image<std::uint8_t>{{255, 0, 20}}));
}

TEST(FilterMode, WritesZeroForPixelsThatAreNotComputed)
{
    FilterMode oFilter;
    oFilter.SetBGZero(true);
    const Image<short> oImage = {{5, 300, 1, -7, 2, 20, 2, 20, 9, 10}};
    const auto poMaskIn = MaskOf({{1, 0, 1, 1, 1}}, {1, 0});
    const auto poMaskOut = MaskOf({{1, 1, 0}});
    EXPECT_EQ(Filtered<short>(oFilter, oImage, {1, 0}, poMaskIn.get(), poMaskOut.get(), 2),
              (Image<short>{{0, 0, 2, 20, 0, 0}}));
}

TEST(FilterMode, CountsPixelsClearedInTheOutputMaskAlone)
{
    const Image<std::uint8_t> oImage = {{9, 8, 9, 9, 0}};
    const auto poMaskOut = MaskOf({{1, 0, 1}});
    EXPECT_EQ(Filtered<std::uint8_t>(FilterMode(), oImage, {1, 0}, nullptr, poMaskOut.get()),
              (Image<std::uint8_t>{{9, 9, 9}}));
}

TEST(FilterMode, ReadsAnOutputMaskWithMarginsOfItsOwn)
{
    const Image<std::uint8_t> oImage = {{9, 8, 9, 7, 9}};
    const auto poMaskOut =
        MaskOf({{0, 0, 0, 0, 0, 0, 0}, {0, 0, 1, 1, 0, 0, 0}, {0, 0, 0, 0, 0, 0, 0}}, {2, 1});
    EXPECT_EQ(Filtered<std::uint8_t>(FilterMode(), oImage, {1, 0}, nullptr, poMaskOut.get()),
              (Image<std::uint8_t>{{9, 9, 7}}));
}

// ---- Conversion

TEST(FilterMode, RoundsAndCutsOnTheWayToIntegers)
{
    EXPECT_EQ(Through<unsigned char>(254.6F), 255);
    EXPECT_EQ(Through<unsigned char>(-0.4F), 0);
    EXPECT_EQ(Through<char>(-2.5F), -3);
    EXPECT_EQ(Through<char>(-200.0), -128);
    EXPECT_EQ(Through<unsigned short>(-1), 0);
    EXPECT_EQ(Through<unsigned int>(4294967295.0), 4294967295U);
    // In single precision 8388609 + 0.5 is 8388610.
    EXPECT_EQ(Through<int>(8388609.0F), 8388609);
    EXPECT_EQ(Through<int64>(3.9), 3);
    EXPECT_EQ(Through<int64>(-5), 0);
    EXPECT_EQ(Through<uint64>(1e20), UINT64_MAX);
}

TEST(FilterMode, WritesNoMargins)
{
    const auto poIn = RasterOf(Image<std::uint8_t>{{2, 1, 2}}, {1, 0});
    const auto poOut = BlankRaster(1, 1, 1, tessel::eDT_8U, {1, 1});
    FilterMode().Process(poIn.get(), nullptr, poOut.get(), nullptr);
    for (std::size_t i = 0; i < 9; ++i)
    {
        EXPECT_EQ(poOut->mpBuffer[i], i == 4 ? 2 : 0xA5) << i;
    }
}

TEST(FilterMode, AcceptsBlocksWithoutPixels)
{
    for (const std::uint32_t nMargin : {0U, 1U, 7U})
    {
        const Margins oMargins{nMargin, nMargin};
        const auto poNoRows = BlankRaster(4, 0, 1, tessel::eDT_32R, oMargins);
        const auto poNoColumns = BlankRaster(0, 4, 1, tessel::eDT_32R, oMargins);
        EXPECT_NO_THROW(FilterMode().Process(poNoRows.get(), nullptr, poNoRows.get(), nullptr));
        EXPECT_NO_THROW(
            FilterMode().Process(poNoColumns.get(), nullptr, poNoColumns.get(), nullptr));
    }
}

// ---- State

TEST(FilterMode, KeepsTheParametersOfItsFirstBlock)
{
    FilterMode oFilter;
    const Image<std::uint8_t> oImage = {{1, 1, 1}, {1, 9, 1}, {1, 1, 1}};
    const auto poMask = MaskOf({{1, 1, 1}, {1, 0, 1}, {1, 1, 1}}, {1, 1});
    EXPECT_EQ(Mode(oImage, {1, 1}, oFilter), 1);
    oFilter.SetKeepValues({9});
    EXPECT_EQ(Mode(oImage, {1, 1}, oFilter), 1);
    oFilter.SetKeepValues({});
    oFilter.SetThinLine(true);
    EXPECT_EQ(Mode(oImage, {1, 1}, oFilter), 1);
    oFilter.SetBGZero(true);
    EXPECT_EQ(Mode(oImage, {1, 1}, oFilter, poMask.get()), 9);
    // For other types a processor is made with what was set since, and for the first ones anew.
    EXPECT_EQ(Filtered<short>(oFilter, oImage, {1, 1}).Samples()[0], 9);
    EXPECT_EQ(Filtered<short>(oFilter, oImage, {1, 1}, poMask.get()).Samples()[0], 0);
    EXPECT_EQ(Mode(oImage, {1, 1}, oFilter), 9);
    EXPECT_EQ(Mode(oImage, {1, 1}, oFilter, poMask.get()), 0);
}

TEST(FilterMode, SharesItsProcessorWithCopies)
{
    FilterMode oFilter({9}, false);
    const Image<std::uint8_t> oImage = {{1, 9, 1}};
    EXPECT_EQ(Mode(oImage, {1, 0}, oFilter), 9);
    FilterMode oCopy(oFilter);
    oCopy.SetKeepValues({});
    EXPECT_EQ(Mode(oImage, {1, 0}, oCopy), 9);
    FilterMode oAssigned;
    oAssigned = oFilter;
    oAssigned.SetKeepValues({});
    EXPECT_EQ(Mode(oImage, {1, 0}, oAssigned), 9);
    // The list itself is copied.
    EXPECT_EQ(Filtered<short>(oFilter, oImage, {1, 0}).Samples()[0], 9);
    EXPECT_EQ(Filtered<short>(oCopy, oImage, {1, 0}).Samples()[0], 1);
}

TEST(FilterMode, StaysUsableAfterThinLinesWereRefused)
{
    const FilterMode oFilter({}, true);
    const auto poIn = BlankRaster(1, 1, 1, tessel::eDT_8U);
    EXPECT_EQ(MessageOf<ParameterException>(
                  [&] { oFilter.Process(poIn.get(), nullptr, poIn.get(), nullptr); }),
              "Filter size must be 3x3");
    EXPECT_EQ(Mode<std::uint8_t>({{1, 1, 1}, {1, 9, 1}, {1, 1, 1}}, {1, 1}, oFilter), 9);
}

// ---- Errors

void ExpectRefused(tessel::Raster* poIn, tessel::Raster* poOut, const std::string& oMessage)
{
    try
    {
        FilterMode({}, true).Process(poIn, nullptr, poOut, nullptr);
        FAIL() << "threw nothing";
    }
    catch (const Exception& oException)
    {
        EXPECT_EQ(oException.GetMessage(), oMessage);
        EXPECT_EQ(oException.GetFile(), "processes/qrdfilters/filtermode");
        EXPECT_NE(oException.GetFunction().find("kor::filters::FilterMode::Process("),
                  std::string::npos)
            << oException.GetFunction();
        EXPECT_GT(oException.GetLine(), 0U);
    }
}

TEST(FilterMode, RefusesRastersThatAreNotThereAndComplexOutput)
{
    const auto poReal = BlankRaster(1, 1, 1, tessel::eDT_8U);
    const auto poComplex = BlankRaster(1, 1, 1, tessel::eDT_C32R);
    ExpectRefused(nullptr, poReal.get(), "poRasterIn is invalid pointer");
    ExpectRefused(nullptr, nullptr, "poRasterIn is invalid pointer");
    ExpectRefused(nullptr, poComplex.get(), "poRasterIn is invalid pointer");
    ExpectRefused(poReal.get(), nullptr, "poRasterOut is invalid pointer");
    ExpectRefused(poReal.get(), poComplex.get(), "Output cannot be complex");
    ExpectRefused(poComplex.get(), poComplex.get(), "Output cannot be complex");
}

// The processor of the first block is still there: what was set since does not count.
TEST(FilterMode, KeepsItsProcessorWhenComplexOutputIsRefused)
{
    FilterMode oFilter;
    const Image<std::uint8_t> oImage = {{1, 9, 1}};
    EXPECT_EQ(Mode(oImage, {1, 0}, oFilter), 1);
    oFilter.SetKeepValues({9});
    const auto poIn = RasterOf(oImage, {1, 0});
    const auto poComplex = BlankRaster(1, 1, 1, tessel::eDT_C32R);
    EXPECT_EQ(MessageOf<Exception>(
                  [&] { oFilter.Process(poIn.get(), nullptr, poComplex.get(), nullptr); }),
              "Output cannot be complex");
    EXPECT_EQ(Mode(oImage, {1, 0}, oFilter), 1);
}

TEST(FilterMode, RefusesTypesWithoutSamples)
{
    const auto poReal = BlankRaster(1, 1, 1, tessel::eDT_8U);
    const auto poBits = BlankRaster(1, 1, 1, tessel::eDT_BIT);
    for (const auto& [poIn, poOut] :
         {std::pair{poReal.get(), poBits.get()}, {poBits.get(), poReal.get()}})
    {
        EXPECT_EQ(MessageOf<Exception>([&, poFrom = poIn, poTo = poOut]
                                       { FilterMode().Process(poFrom, nullptr, poTo, nullptr); }),
                  "Invalid type requested.");
    }
    EXPECT_EQ(poReal->mpBuffer[0], 0xA5);
}

TEST(FilterMode, RefusesBlocksThatDoNotMatchInHardenedBuilds)
{
    if (!kHardened)
    {
        GTEST_SKIP() << "blocks are checked in hardened builds alone";
    }
    const auto poIn = BlankRaster(2, 2, 1, tessel::eDT_8U, {1, 1});
    const auto poOut = BlankRaster(2, 1, 1, tessel::eDT_8U);
    EXPECT_EQ(MessageOf<Exception>(
                  [&] { FilterMode().Process(poIn.get(), nullptr, poOut.get(), nullptr); }),
              "poRasterOut has 2 x 1 pixels, poRasterIn 2 x 2 pixels");
}

// Magnitudes 5 10 5.
TEST(FilterMode, WorksOnTheMagnitudeOfAComplexInput)
{
    const auto poIn = BlankRaster(1, 1, 1, tessel::eDT_C16S, {1, 0});
    const short anSamples[] = {3, 4, -6, 8, 0, -5};
    std::copy_n(anSamples, 6, reinterpret_cast<short*>(poIn->mpBuffer));
    const auto poOut = BlankRaster(1, 1, 1, tessel::eDT_8U);
    FilterMode().Process(poIn.get(), nullptr, poOut.get(), nullptr);
    EXPECT_EQ(poOut->mpBuffer[0], 5);
}

// ---- The definition, sample by sample

struct Settings
{
    std::vector<float> mvfKeepValues;
    bool mbThinLine = false;
    bool mbBGZero = false;
};

bool IsKept(float fCentre, const Settings& oSettings)
{
    for (const float k : oSettings.mvfKeepValues)
    {
        const float fDifference = fCentre - k;
        const double t = fDifference;
        if (-1e-9 < t && t < 1e-9)
        {
            return true;
        }
    }
    return false;
}

double ModeByDefinition(const std::vector<double>& vdfWindow, double dfCentre, bool bThinLine)
{
    const std::size_t nArea = vdfWindow.size();
    double dfMode = dfCentre;
    int nBest = 1;
    std::vector<int> vnCounts(nArea, 0);
    std::vector<int> vnFlags(nArea, 0);
    for (std::size_t i = 0; i + 1 < nArea; ++i)
    {
        if (vnFlags[i] != 0)
        {
            continue;
        }
        vnCounts[i] = 1;
        vnFlags[i] = 1;
        for (std::size_t j = i + 1; j < nArea; ++j)
        {
            if (vdfWindow[i] == vdfWindow[j] && vnFlags[j] == 0)
            {
                ++vnCounts[i];
                vnFlags[j] = 1;
            }
        }
        if (vnCounts[i] != 1)
        {
            if (vnCounts[i] > nBest)
            {
                dfMode = vdfWindow[i];
                nBest = vnCounts[i];
            }
            else if (vnCounts[i] == nBest && vdfWindow[i] == vdfWindow[nArea / 2])
            {
                dfMode = vdfWindow[i];
            }
        }
    }
    return bThinLine && nArea == 9 && vnCounts[0] >= 3 ? dfCentre : dfMode;
}

template <class TIn>
std::vector<double> WindowSamples(const tessel::Raster& oIn, const tessel::Mask* poMaskIn,
                                  std::int64_t x, std::int64_t y, std::size_t c, bool bThinLine)
{
    const std::int64_t nHalfX = bThinLine ? 1 : oIn.mnMarginX;
    const std::int64_t nHalfY = bThinLine ? 1 : oIn.mnMarginY;
    std::vector<double> vdfWindow;
    for (std::int64_t dy = -nHalfY; dy <= nHalfY; ++dy)
    {
        for (std::int64_t j = 0; j <= 2 * nHalfX; ++j)
        {
            const bool bRead = IsValid(poMaskIn, x - nHalfX, y + dy);
            const TIn* pIn =
                bRead ? oIn.GetPixelAs<TIn>(x - nHalfX + j, y + dy) : oIn.GetPixelAs<TIn>(x, y);
            vdfWindow.push_back(ReferenceSample<TIn, double>(pIn[c]));
        }
    }
    return vdfWindow;
}

template <class TIn, class TOut>
void FilterByDefinition(const tessel::Raster& oIn, const tessel::Mask* poMaskIn,
                        const tessel::Mask* poMaskOut, const Settings& oSettings,
                        const tessel::Raster& oOut)
{
    for (std::int64_t y = 0; y < oIn.mnHeight; ++y)
    {
        for (std::int64_t x = 0; x < oIn.mnWidth; ++x)
        {
            const bool bComputed = IsValid(poMaskIn, x, y) && IsValid(poMaskOut, x, y);
            const TIn* pIn = oIn.GetPixelAs<TIn>(x, y);
            TOut* pOut = oOut.GetPixelAs<TOut>(x, y);
            for (std::size_t c = 0; c < oIn.mnChannels; ++c)
            {
                if (!bComputed && oSettings.mbBGZero)
                {
                    pOut[c] = TOut(0);
                }
                else if (!bComputed || IsKept(ReferenceSample<TIn, float>(pIn[c]), oSettings))
                {
                    pOut[c] = ReferenceSample<TIn, TOut>(pIn[c]);
                }
                else
                {
                    const auto vdfWindow =
                        WindowSamples<TIn>(oIn, poMaskIn, x, y, c, oSettings.mbThinLine);
                    pOut[c] = ReferenceSample<double, TOut>(ModeByDefinition(
                        vdfWindow, ReferenceSample<TIn, double>(pIn[c]), oSettings.mbThinLine));
                }
            }
        }
    }
}

struct Shape
{
    std::uint32_t nWidth;
    std::uint32_t nHeight;
    std::uint32_t nChannels;
    Margins oMargins;
};

/// Few values, so that some are frequent, and those among them that are hard to compare.
template <class T>
std::unique_ptr<tessel::Raster> RasterOfFewValues(const Shape& oShape, std::size_t nValues,
                                                  Random& oRandom)
{
    std::vector<T> vValues = {T(0), T(5), std::numeric_limits<T>::max(),
                              std::numeric_limits<T>::lowest()};
    if constexpr (std::is_floating_point_v<T>)
    {
        vValues.insert(vValues.end(), {T(-0.0), T(NAN), T(INFINITY), T(-INFINITY)});
    }
    if constexpr (sizeof(T) == 8 && std::is_integral_v<T>)
    {
        vValues.insert(vValues.end(), {std::numeric_limits<T>::max() - 1, T(1) << 53,
                                       (T(1) << 53) + 1, (T(1) << 53) + 2});
    }
    while (vValues.size() < nValues)
    {
        vValues.push_back(RandomSample<T>(Samples::Special, oRandom));
    }
    auto poRaster = BlankRaster(oShape.nWidth, oShape.nHeight, oShape.nChannels,
                                typedispatch::RealDataType<T>(), oShape.oMargins);
    T* pSamples = reinterpret_cast<T*>(poRaster->mpBuffer);
    std::generate_n(pSamples, poRaster->mnBufferSize / sizeof(T),
                    [&] { return vValues[oRandom() % nValues % vValues.size()]; });
    return poRaster;
}

/// One block of a shape, with all four combinations of masks.
template <class TIn, class TOut>
void CompareWithDefinition(const Shape& oShape, bool bThinLine, double dfValid, Random& oRandom)
{
    const auto [nWidth, nHeight, nChannels, oMargins] = oShape;
    const auto poIn = RasterOfFewValues<TIn>(oShape, 2 + oRandom() % 12, oRandom);
    const auto poMaskIn = RandomMask(nWidth, nHeight, oMargins, dfValid, oRandom);
    const auto poMaskOut = RandomMask(nWidth, nHeight, Margins{0, 3}, dfValid, oRandom);
    for (unsigned int nMasks = 0; nMasks < 4; ++nMasks)
    {
        tessel::Mask* const poUsedIn = (nMasks & 1U) != 0 ? poMaskIn.get() : nullptr;
        tessel::Mask* const poUsedOut = (nMasks & 2U) != 0 ? poMaskOut.get() : nullptr;
        Settings oSettings{{}, bThinLine, oRandom() % 2 == 0};
        if (oRandom() % 2 == 0)
        {
            oSettings.mvfKeepValues = {5.0F, -1e30F};
        }
        FilterMode oFilter(oSettings.mvfKeepValues, bThinLine);
        oFilter.SetBGZero(oSettings.mbBGZero);
        const auto oType = typedispatch::RealDataType<TOut>();
        const auto poActual = BlankRaster(nWidth, nHeight, nChannels, oType, Margins{2, 1});
        const auto poExpected = BlankRaster(nWidth, nHeight, nChannels, oType, Margins{2, 1});
        oFilter.Process(poIn.get(), poUsedIn, poActual.get(), poUsedOut);
        FilterByDefinition<TIn, TOut>(*poIn, poUsedIn, poUsedOut, oSettings, *poExpected);
        ASSERT_TRUE(SameBits(*poActual, *poExpected))
            << nWidth << " x " << nHeight << " x " << nChannels << ", margins " << oMargins.x
            << " and " << oMargins.y << ", masks " << nMasks << ", thin " << bThinLine;
    }
}

TEST(FilterMode, FollowsTheDefinitionForAllPairsOfTypes)
{
    // Threads are counted elsewhere; with one a small block is not slowed by waking others.
    const OMPThreadCount oOne(1);
    Random oRandom(6);
    ForEachElementType(
        [&]<class TIn>()
        {
            ForEachElementType(
                [&]<class TOut>()
                {
                    CompareWithDefinition<TIn, TOut>({9, 5, 2, {1, 1}}, false, 0.9, oRandom);
                    CompareWithDefinition<TIn, TOut>({8, 4, 1, {1, 2}}, true, 0.9, oRandom);
                    CompareWithDefinition<TIn, TOut>({7, 3, 1, {2, 1}}, false, 0.6, oRandom);
                    CompareWithDefinition<TIn, TOut>({40, 1, 2, {0, 0}}, false, 0.6, oRandom);
                });
        });
}

// One row or column alone, all channels, windows that are wide or high, and rows of every
// remainder.
TEST(FilterMode, FollowsTheDefinitionForAllShapes)
{
    const OMPThreadCount oOne(1);
    Random oRandom(7);
    const auto oTest = [&]<class T>()
    {
        for (std::uint32_t nMargins = 0; nMargins < 16; ++nMargins)
        {
            const Margins oMargins{nMargins % 4, nMargins / 4};
            const auto nWidth = static_cast<std::uint32_t>(1 + oRandom() % 20);
            const auto nHeight = static_cast<std::uint32_t>(1 + oRandom() % 4);
            CompareWithDefinition<T, T>({nWidth, nHeight, 1 + nMargins % 4, oMargins}, false, 0.95,
                                        oRandom);
        }
        for (std::uint32_t nWidth = 1; nWidth <= 70; nWidth += 9)
        {
            CompareWithDefinition<T, T>({nWidth, 1, 1, {1, 1}}, nWidth % 2 == 0, 0.97, oRandom);
        }
        CompareWithDefinition<T, T>({1, 70, 1, {2, 1}}, false, 0.98, oRandom);
    };
    ForEachElementType(oTest);
}

// Several tiles of columns and bands of rows, whose edges fall inside a pixel of three channels.
TEST(FilterMode, FollowsTheDefinitionOnBlocksOfSeveralTiles)
{
    const OMPThreadCount oOne(1);
    Random oRandom(8);
    CompareWithDefinition<std::uint8_t, std::uint8_t>({543, 9, 1, {1, 1}}, false, 0.99, oRandom);
    CompareWithDefinition<std::uint8_t, std::uint8_t>({301, 5, 3, {1, 1}}, true, 0.99, oRandom);
    CompareWithDefinition<float, float>({189, 6, 3, {2, 2}}, false, 0.99, oRandom);
    CompareWithDefinition<short, float>({3, 131, 1, {1, 2}}, false, 0.99, oRandom);
}

// Ranks of 16 bits begin above an area of 127, and windows above 255 columns or an area of 4095 are
// counted one by one.
TEST(FilterMode, FollowsTheDefinitionForLargeWindows)
{
    const OMPThreadCount oOne(1);
    Random oRandom(9);
    for (const Margins oMargins : {Margins{5, 5},
                                   {63, 0},
                                   {0, 63},
                                   {64, 0},
                                   {0, 64},
                                   {6, 5},
                                   {127, 0},
                                   {128, 0},
                                   {0, 140},
                                   {32, 31}})
    {
        const bool bLarge = oMargins.x == 32;
        CompareWithDefinition<unsigned short, double>({bLarge ? 2U : 9U, 2, 1, oMargins}, false,
                                                      0.995, oRandom);
        CompareWithDefinition<double, double>({bLarge ? 1U : 3U, 2, 2, oMargins}, false, 0.995,
                                              oRandom);
    }
    // All samples equal: the highest counts that there are.
    const std::size_t nColumns = 255;
    const Image<double> oFlat(nColumns, std::vector<double>(nColumns * 15, 4.0));
    EXPECT_EQ(Mode(oFlat, {127, 7}), 4.0);
}

// Blocks without a pixel to compute, and such where all windows are changed by the mask.
TEST(FilterMode, FollowsTheDefinitionBesideMasksOfWholeRegions)
{
    const OMPThreadCount oOne(1);
    Random oRandom(10);
    CompareWithDefinition<float, float>({300, 5, 1, {2, 2}}, false, 0.0, oRandom);
    CompareWithDefinition<float, float>({300, 5, 1, {2, 2}}, false, 0.02, oRandom);
    CompareWithDefinition<float, float>({300, 5, 1, {2, 2}}, false, 0.4, oRandom);
    CompareWithDefinition<float, float>({300, 5, 1, {2, 2}}, false, 1.0, oRandom);
}

TEST(FilterMode, GivesTheSameRowsWithAnyNumberOfThreads)
{
    Random oRandom(11);
    const Margins oMargins{2, 2};
    const auto poIn = RasterOfFewValues<float>({75, 143, 1, oMargins}, 9, oRandom);
    const auto poMask = RandomMask(75, 143, oMargins, 0.98, oRandom);
    const auto poOne = BlankRaster(75, 143, 1, tessel::eDT_32R);
    {
        const OMPThreadCount oOne(1);
        FilterMode({5}, false).Process(poIn.get(), poMask.get(), poOne.get(), nullptr);
    }
    for (const int nThreads : {2, 3, 5})
    {
        const ThreadCount oMany(nThreads);
        const auto poMany = BlankRaster(75, 143, 1, tessel::eDT_32R);
        FilterMode({5}, false).Process(poIn.get(), poMask.get(), poMany.get(), nullptr);
        EXPECT_TRUE(SameBits(*poMany, *poOne)) << nThreads;
    }
}

}  // namespace
}  // namespace kor::filters
