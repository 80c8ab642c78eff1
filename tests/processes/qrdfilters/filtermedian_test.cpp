#include "processes/qrdfilters/filtermedian.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <string>
#include <vector>

#include "platform/exception/exception.h"
#include "platform/system/omp.h"
#include "processes/qrdfilters/sampleconversion.h"
#include "tests/support/blocks.h"

namespace kor::filters
{
namespace
{

using namespace kor::test;

/// The drawing, its outer rows and columns being the margins, filtered into samples of type TOut.
template <class TOut, class TIn>
Image<TOut> Filtered(const FilterMedian& oFilter, const Image<TIn>& oImage, Margins oMargins,
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
    return Filtered<TOut>(FilterMedian(), Image<TIn>{{xIn}}, Margins{}).Samples()[0];
}

TEST(FilterMedian, GivesTheMiddleSampleOfTheWindow)
{
    const Image<std::uint8_t> oImage = {
        {9, 1, 8, 0},
        {2, 7, 3, 0},
        {6, 4, 5, 0},
    };
    // 1 to 9; then 0 0 0 1 3 4 5 7 8.
    EXPECT_EQ(Filtered<std::uint8_t>(FilterMedian(), oImage, Margins{1, 1}),
              (Image<std::uint8_t>{{5, 3}}));
}

// The margins alone tell the window: 3 columns and 1 row here.
TEST(FilterMedian, TakesItsWindowFromTheMarginsOfEachAxis)
{
    const Image<short> oImage = {{10, 30, 20, -5, -7}};
    EXPECT_EQ(Filtered<short>(FilterMedian(), oImage, Margins{1, 0}), (Image<short>{{20, 20, -5}}));
    const Image<short> oColumn = {{10}, {30}, {20}, {-5}, {-7}};
    EXPECT_EQ(Filtered<short>(FilterMedian(), oColumn, Margins{0, 1}),
              (Image<short>{{20}, {20}, {-5}}));
    EXPECT_EQ(Filtered<short>(FilterMedian(), oColumn, Margins{0, 2}), (Image<short>{{10}}));
}

TEST(FilterMedian, CopiesTheInputWithoutMargins)
{
    const Image<float> oImage = {{1.5F, -2.25F}, {1e30F, 0.0F}};
    EXPECT_EQ(Filtered<float>(FilterMedian(), oImage, Margins{}), oImage);
}

TEST(FilterMedian, TreatsChannelsByThemselves)
{
    const Image<int> oImage = {{1, 100, 2, 300, 3, 200}};
    EXPECT_EQ(Filtered<int>(FilterMedian(), oImage, Margins{1, 0}, nullptr, nullptr, 2),
              (Image<int>{{2, 200}}));
}

// Border pixels have full windows: the margins supply the samples, nothing shrinks or is mirrored.
TEST(FilterMedian, CountsTheSamplesOfTheMargins)
{
    const Image<std::uint8_t> oImage = {
        {9, 9, 9},
        {9, 1, 9},
        {1, 1, 1},
    };
    EXPECT_EQ(Filtered<std::uint8_t>(FilterMedian(), oImage, Margins{1, 1}),
              (Image<std::uint8_t>{{9}}));
}

// Samples 1, 2, 3, 4 give 3.
TEST(FilterMedian, GivesTheUpperOfTwoMiddleSamples)
{
    const Image<std::uint8_t> oImage = {
        {9, 1, 9},
        {4, 2, 3},
        {9, 9, 9},
    };
    const auto poMask = MaskOf(
        {
            {0, 1, 0},
            {1, 1, 1},
            {0, 0, 0},
        },
        Margins{1, 1});
    EXPECT_EQ(Filtered<std::uint8_t>(FilterMedian(), oImage, Margins{1, 1}, poMask.get()),
              (Image<std::uint8_t>{{3}}));
}

TEST(FilterMedian, GivesAPixelWithoutValidNeighboursItsOwnValue)
{
    const Image<double> oImage = {
        {9, 9, 9},
        {9, 2.5, 9},
        {9, 9, 9},
    };
    const auto poMask = MaskOf(
        {
            {0, 0, 0},
            {0, 1, 0},
            {0, 0, 0},
        },
        Margins{1, 1});
    EXPECT_EQ(Filtered<double>(FilterMedian(), oImage, Margins{1, 1}, poMask.get()),
              (Image<double>{{2.5}}));
}

// The right pixel's window holds the two masked 90s: of 1 2 3 4 5 6 7 the middle is 4.
TEST(FilterMedian, LeavesMaskedPixelsOutOfEveryWindow)
{
    const Image<std::uint8_t> oImage = {
        {90, 90, 1, 2},
        {90, 3, 4, 90},
        {90, 5, 6, 7},
    };
    const auto poMask = MaskOf(
        {
            {1, 0, 1, 1},
            {1, 1, 1, 0},
            {1, 1, 1, 1},
        },
        Margins{1, 1});
    // The left window: 1 3 4 5 6 90 90 90.
    EXPECT_EQ(Filtered<std::uint8_t>(FilterMedian(), oImage, Margins{1, 1}, poMask.get()),
              (Image<std::uint8_t>{{6, 4}}));
}

TEST(FilterMedian, CopiesPixelsThatAreNotComputed)
{
    const Image<short> oImage = {{5, 300, -7, 20, 6}};
    const auto poMaskIn = MaskOf({{1, 0, 1, 1, 1}}, Margins{1, 0});
    const auto poMaskOut = MaskOf({{1, 1, 0}});
    // Computed: -7 and 20 in the window of the middle pixel.
    EXPECT_EQ(
        Filtered<short>(FilterMedian(), oImage, Margins{1, 0}, poMaskIn.get(), poMaskOut.get()),
        (Image<short>{{300, 20, 20}}));
    // Converted on the way: 300 is cut to 255 and -7 would be 0.
    EXPECT_EQ(Filtered<std::uint8_t>(FilterMedian(), oImage, Margins{1, 0}, poMaskIn.get(),
                                     poMaskOut.get()),
              (Image<std::uint8_t>{{255, 20, 20}}));
}

TEST(FilterMedian, WritesZeroForPixelsThatAreNotComputed)
{
    FilterMedian oFilter;
    oFilter.SetBGZero(true);
    const Image<short> oImage = {{5, 300, 1, -7, 2, 20, 6, 8, 9, 10}};
    const auto poMaskIn = MaskOf({{1, 0, 1, 1, 1}}, Margins{1, 0});
    const auto poMaskOut = MaskOf({{1, 1, 0}});
    EXPECT_EQ(Filtered<short>(oFilter, oImage, Margins{1, 0}, poMaskIn.get(), poMaskOut.get(), 2),
              (Image<short>{{0, 0, 6, 20, 0, 0}}));
}

// The middle pixel is not computed, yet it is the median of its left neighbour's window.
TEST(FilterMedian, CountsPixelsClearedInTheOutputMaskAlone)
{
    const Image<std::uint8_t> oImage = {{1, 9, 4, 0, 0}};
    const auto poMaskOut = MaskOf({{1, 0, 1}});
    EXPECT_EQ(
        Filtered<std::uint8_t>(FilterMedian(), oImage, Margins{1, 0}, nullptr, poMaskOut.get()),
        (Image<std::uint8_t>{{4, 4, 0}}));
}

TEST(FilterMedian, LeavesMaskedPixelsOfTheMarginsOut)
{
    const Image<std::uint8_t> oImage = {{90, 4, 7}};
    const auto poMask = MaskOf({{0, 1, 1}}, Margins{1, 0});
    EXPECT_EQ(Filtered<std::uint8_t>(FilterMedian(), oImage, Margins{1, 0}, poMask.get()),
              (Image<std::uint8_t>{{7}}));
}

TEST(FilterMedian, ReadsAnOutputMaskWithMarginsOfItsOwn)
{
    const Image<std::uint8_t> oImage = {{1, 9, 4, 0, 0}};
    const auto poMaskOut = MaskOf(
        {{0, 0, 0, 0, 0, 0, 0}, {0, 0, 1, 0, 1, 0, 0}, {0, 0, 0, 0, 0, 0, 0}}, Margins{2, 1});
    EXPECT_EQ(
        Filtered<std::uint8_t>(FilterMedian(), oImage, Margins{1, 0}, nullptr, poMaskOut.get()),
        (Image<std::uint8_t>{{4, 4, 0}}));
}

TEST(FilterMedian, RoundsAndCutsOnTheWayToIntegers)
{
    EXPECT_EQ(Through<unsigned char>(254.6F), 255);
    EXPECT_EQ(Through<unsigned char>(-0.4F), 0);
    EXPECT_EQ(Through<unsigned char>(300.0F), 255);
    EXPECT_EQ(Through<char>(2.5F), 3);
    EXPECT_EQ(Through<char>(-2.5F), -3);
    EXPECT_EQ(Through<char>(-200.0), -128);
    EXPECT_EQ(Through<short>(32767.4), 32767);
    EXPECT_EQ(Through<unsigned short>(-1), 0);
    EXPECT_EQ(Through<unsigned int>(4294967295.0), 4294967295U);
    EXPECT_EQ(Through<int>(-2147483648.4), -2147483647 - 1);
    EXPECT_EQ(Through<float>(0.1), 0.1F);
}

// In single precision 8388609 + 0.5 is 8388610 and 0.49999997 + 0.5 is 1.
TEST(FilterMedian, RoundsSinglePrecisionSamplesInDoublePrecision)
{
    EXPECT_EQ(Through<int>(8388609.0F), 8388609);
    EXPECT_EQ(Through<int>(0.49999997F), 0);
    EXPECT_EQ(Through<unsigned int>(16777215.0F), 16777215U);
    EXPECT_EQ(Through<int>(2147483520.0F), 2147483520);
}

TEST(FilterMedian, CutsOnTheWayTo64BitIntegers)
{
    EXPECT_EQ(Through<int64>(-5), 0);
    EXPECT_EQ(Through<int64>(int64{-5}), 0);
    EXPECT_EQ(Through<int64>(3.9), 3);
    EXPECT_EQ(Through<uint64>(3.9F), 3U);
    EXPECT_EQ(Through<uint64>(-1.0), 0U);
    EXPECT_EQ(Through<int64>(1e19), INT64_MAX);
    EXPECT_EQ(Through<uint64>(1e20), UINT64_MAX);
}

// 2^53 + 1 has no double of its own. Skipped pixels are converted directly and keep it.
TEST(FilterMedian, DropsTheLowBitsOf64BitIntegersThatItSelects)
{
    constexpr int64 kLarge = 9007199254740993;
    EXPECT_EQ(Through<int64>(kLarge), 9007199254740992);
    EXPECT_EQ(Through<uint64>(uint64{kLarge}), 9007199254740992U);
    EXPECT_EQ(Through<uint64>(UINT64_MAX), UINT64_MAX);
    const auto poMask = MaskOf({{0}});
    EXPECT_EQ(Filtered<int64>(FilterMedian(), Image<int64>{{kLarge}}, Margins{}, poMask.get()),
              (Image<int64>{{kLarge}}));
    EXPECT_EQ(Filtered<int64>(FilterMedian(), Image<int64>{{-5}}, Margins{}, poMask.get()),
              (Image<int64>{{-5}}));
}

TEST(FilterMedian, KeepsTheBackgroundFlagOfItsFirstBlock)
{
    FilterMedian oFilter;
    const auto poMask = MaskOf({{0}});
    const Image<std::uint8_t> oImage = {{7}};
    oFilter.SetBGZero(true);
    EXPECT_EQ(Filtered<std::uint8_t>(oFilter, oImage, Margins{}, poMask.get()).Samples()[0], 0);
    oFilter.SetBGZero(false);
    EXPECT_EQ(Filtered<std::uint8_t>(oFilter, oImage, Margins{}, poMask.get()).Samples()[0], 0);
    EXPECT_EQ(Filtered<short>(oFilter, oImage, Margins{}, poMask.get()).Samples()[0], 7);
    // Back at the first types a processor is made anew.
    EXPECT_EQ(Filtered<std::uint8_t>(oFilter, oImage, Margins{}, poMask.get()).Samples()[0], 7);
}

TEST(FilterMedian, SharesItsProcessorWithCopies)
{
    FilterMedian oFilter;
    const auto poMask = MaskOf({{0}});
    const Image<std::uint8_t> oImage = {{7}};
    oFilter.SetBGZero(true);
    EXPECT_EQ(Filtered<std::uint8_t>(oFilter, oImage, Margins{}, poMask.get()).Samples()[0], 0);
    FilterMedian oCopy(oFilter);
    oCopy.SetBGZero(false);
    EXPECT_EQ(Filtered<std::uint8_t>(oCopy, oImage, Margins{}, poMask.get()).Samples()[0], 0);
    FilterMedian oAssigned;
    oAssigned = oFilter;
    EXPECT_EQ(Filtered<std::uint8_t>(oAssigned, oImage, Margins{}, poMask.get()).Samples()[0], 0);
}

/// Checks that a call throws kor::Exception with this message from FilterMedian::Process.
void ExpectRefused(const FilterMedian& oFilter, tessel::Raster* poIn, tessel::Raster* poOut,
                   const std::string& oMessage)
{
    try
    {
        oFilter.Process(poIn, nullptr, poOut, nullptr);
        FAIL() << "threw nothing";
    }
    catch (const Exception& oException)
    {
        EXPECT_EQ(oException.GetMessage(), oMessage);
        EXPECT_EQ(oException.GetFile(), "processes/qrdfilters/filtermedian");
        EXPECT_NE(oException.GetFunction().find("kor::filters::FilterMedian::Process("),
                  std::string::npos)
            << oException.GetFunction();
        EXPECT_GT(oException.GetLine(), 0U);
    }
}

TEST(FilterMedian, RefusesRastersThatAreNotThere)
{
    const auto poReal = BlankRaster(1, 1, 1, tessel::eDT_8U);
    const auto poComplex = BlankRaster(1, 1, 1, tessel::eDT_C32R);
    ExpectRefused(FilterMedian(), nullptr, poReal.get(), "poRasterIn is invalid pointer");
    ExpectRefused(FilterMedian(), nullptr, nullptr, "poRasterIn is invalid pointer");
    ExpectRefused(FilterMedian(), nullptr, poComplex.get(), "poRasterIn is invalid pointer");
    ExpectRefused(FilterMedian(), poReal.get(), nullptr, "poRasterOut is invalid pointer");
}

TEST(FilterMedian, RefusesAComplexOutputAndKeepsItsProcessor)
{
    FilterMedian oFilter;
    oFilter.SetBGZero(true);
    const auto poMask = MaskOf({{0}});
    const Image<std::uint8_t> oImage = {{7}};
    Filtered<std::uint8_t>(oFilter, oImage, Margins{}, poMask.get());
    oFilter.SetBGZero(false);
    const auto poReal = BlankRaster(1, 1, 1, tessel::eDT_8U);
    const auto poComplex = BlankRaster(1, 1, 1, tessel::eDT_C32R);
    ExpectRefused(oFilter, poReal.get(), poComplex.get(), "Output cannot be complex");
    ExpectRefused(oFilter, poComplex.get(), poComplex.get(), "Output cannot be complex");
    EXPECT_EQ(Filtered<std::uint8_t>(oFilter, oImage, Margins{}, poMask.get()).Samples()[0], 0);
}

TEST(FilterMedian, RefusesTypesWithoutSamplesAndDropsItsProcessor)
{
    FilterMedian oFilter;
    oFilter.SetBGZero(true);
    const auto poMask = MaskOf({{0}});
    const Image<std::uint8_t> oImage = {{7}};
    Filtered<std::uint8_t>(oFilter, oImage, Margins{}, poMask.get());
    oFilter.SetBGZero(false);
    const auto poReal = BlankRaster(1, 1, 1, tessel::eDT_8U);
    const auto poBits = BlankRaster(1, 1, 1, tessel::eDT_BIT);
    for (const auto& [poIn, poOut] :
         {std::pair{poReal.get(), poBits.get()}, {poBits.get(), poReal.get()}})
    {
        try
        {
            oFilter.Process(poIn, nullptr, poOut, nullptr);
            FAIL() << "threw nothing";
        }
        catch (const Exception& oException)
        {
            EXPECT_EQ(oException.GetMessage(), "Invalid type requested.");
        }
    }
    EXPECT_EQ(poReal->mpBuffer[0], 0xA5);
    EXPECT_EQ(Filtered<std::uint8_t>(oFilter, oImage, Margins{}, poMask.get()).Samples()[0], 7);
}

TEST(FilterMedian, WorksOnTheMagnitudeOfAComplexInput)
{
    const auto poIn = BlankRaster(1, 1, 1, tessel::eDT_C16S, Margins{1, 0});
    const short anSamples[] = {3, 4, -60, 80, 0, -7};
    std::copy_n(anSamples, 6, reinterpret_cast<short*>(poIn->mpBuffer));
    const auto poOut = BlankRaster(1, 1, 1, tessel::eDT_8U);
    FilterMedian().Process(poIn.get(), nullptr, poOut.get(), nullptr);
    EXPECT_EQ(poOut->mpBuffer[0], 7);
}

// The interpreted raster is what the types are compared with: a 16-bit complex block is seen as
// 32-bit real, so that it shares its processor with a block of that type.
TEST(FilterMedian, ComparesTheTypeOfTheInterpretedRaster)
{
    FilterMedian oFilter;
    oFilter.SetBGZero(true);
    const auto poMask = MaskOf({{0}});
    EXPECT_EQ(Filtered<float>(oFilter, Image<float>{{7}}, Margins{}, poMask.get()).Samples()[0], 0);
    oFilter.SetBGZero(false);
    const auto poComplex = BlankRaster(1, 1, 1, tessel::eDT_C16U);
    const auto poOut = BlankRaster(1, 1, 1, tessel::eDT_32R);
    oFilter.Process(poComplex.get(), poMask.get(), poOut.get(), nullptr);
    EXPECT_EQ(*poOut->GetPixelAs<float>(0, 0), 0.0F);
}

// Under a leak checker this also shows that the interpreted raster is freed. The mask claims an
// extent that no byte raster can have, so that the work itself throws.
TEST(FilterMedian, CanBeUsedAfterItsWorkHasThrown)
{
    const auto poIn = BlankRaster(1, 1, 1, tessel::eDT_C16S);
    std::fill_n(poIn->mpBuffer, 4, static_cast<unsigned char>(0));
    const auto poOut = BlankRaster(1, 1, 1, tessel::eDT_8U);
    const auto poMask = MaskOf({{1}});
    poMask->mnMarginX = poMask->mnMarginY = 0x7FFFFFFF;
    const FilterMedian oFilter;
    EXPECT_THROW(oFilter.Process(poIn.get(), poMask.get(), poOut.get(), nullptr), Exception);
    EXPECT_EQ(poOut->mpBuffer[0], 0xA5);
    oFilter.Process(poIn.get(), nullptr, poOut.get(), nullptr);
    EXPECT_EQ(poOut->mpBuffer[0], 0);
}

TEST(FilterMedian, WritesNoMargins)
{
    const auto poIn = RasterOf(Image<std::uint8_t>{{1, 2, 3}}, Margins{1, 0});
    const auto poOut = BlankRaster(1, 1, 1, tessel::eDT_8U, Margins{1, 1});
    FilterMedian().Process(poIn.get(), nullptr, poOut.get(), nullptr);
    for (std::size_t i = 0; i < 9; ++i)
    {
        EXPECT_EQ(poOut->mpBuffer[i], i == 4 ? 2 : 0xA5) << i;
    }
}

TEST(FilterMedian, AcceptsBlocksWithoutPixels)
{
    for (const std::uint32_t nMargin : {0U, 1U, 5U})
    {
        const auto poNoRows = BlankRaster(4, 0, 1, tessel::eDT_32R, Margins{nMargin, nMargin});
        const auto poNoColumns = BlankRaster(0, 4, 1, tessel::eDT_32R, Margins{nMargin, nMargin});
        EXPECT_NO_THROW(FilterMedian().Process(poNoRows.get(), nullptr, poNoRows.get(), nullptr));
        EXPECT_NO_THROW(
            FilterMedian().Process(poNoColumns.get(), nullptr, poNoColumns.get(), nullptr));
    }
}

// ---- The definition, through double, beside all pairs of types.

/// The store of a double as the filter's description has it, written out once more.
template <class TOut>
TOut Stored(double d)
{
    using A = Arithmetic<TOut>;
    if constexpr (std::is_floating_point_v<A>)
    {
        return static_cast<A>(d);
    }
    else if constexpr (sizeof(A) == 8)
    {
        constexpr double kTop = std::is_signed_v<A> ? 0x1p63 : 0x1p64;
        return !(d > 0.0) ? A(0) : d >= kTop ? std::numeric_limits<A>::max() : static_cast<A>(d);
    }
    else
    {
        const double v = std::is_signed_v<A> && d < 0.0 ? d - 0.5 : d + 0.5;
        constexpr auto kHighest = static_cast<double>(std::numeric_limits<A>::max());
        constexpr auto kLowest = static_cast<double>(std::numeric_limits<A>::min());
        if (d != d)
        {
            return 0;
        }
        return static_cast<TOut>(v >= kHighest  ? std::numeric_limits<A>::max()
                                 : v <= kLowest ? std::numeric_limits<A>::min()
                                                : static_cast<A>(v));
    }
}

template <class TIn>
double Widened(TIn x)
{
    if constexpr (std::is_same_v<TIn, uint64>)
    {
        const auto nSigned = static_cast<int64>(x);
        return nSigned < 0 ? static_cast<double>(nSigned) + 0x1p64 : static_cast<double>(nSigned);
    }
    else
    {
        return static_cast<double>(static_cast<Arithmetic<TIn>>(x));
    }
}

template <class TIn>
std::vector<double> WindowSamples(const tessel::Raster& oIn, const tessel::Mask* poMaskIn,
                                  std::int64_t x, std::int64_t y, std::size_t c)
{
    const std::int64_t nHalfX = oIn.mnMarginX;
    const std::int64_t nHalfY = oIn.mnMarginY;
    std::vector<double> vdfWindow;
    for (std::int64_t r = y - nHalfY; r <= y + nHalfY; ++r)
    {
        for (std::int64_t k = x - nHalfX; k <= x + nHalfX; ++k)
        {
            if (IsValid(poMaskIn, k, r))
            {
                vdfWindow.push_back(Widened(oIn.GetPixelAs<TIn>(k, r)[c]));
            }
        }
    }
    return vdfWindow;
}

template <class TIn, class TOut>
void FilterByDefinition(const tessel::Raster& oIn, const tessel::Mask* poMaskIn,
                        const tessel::Mask* poMaskOut, bool bBGZero, const tessel::Raster& oOut)
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
                if (bComputed)
                {
                    auto vdfWindow = WindowSamples<TIn>(oIn, poMaskIn, x, y, c);
                    const auto itMiddle =
                        vdfWindow.begin() + static_cast<std::ptrdiff_t>(vdfWindow.size() / 2);
                    std::partial_sort(vdfWindow.begin(), itMiddle + 1, vdfWindow.end());
                    pOut[c] = Stored<TOut>(*itMiddle);
                }
                else
                {
                    pOut[c] = bBGZero ? TOut(0) : ConvertSample<TIn, TOut>(pIn[c]);
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

/// One block of a shape, with all four combinations of masks.
template <class TIn, class TOut>
void CompareWithDefinition(const Shape& oShape, double dfValid, Random& oRandom)
{
    const auto [nWidth, nHeight, nChannels, oMargins] = oShape;
    const auto poIn = RandomRaster(nWidth, nHeight, nChannels, typedispatch::RealDataType<TIn>(),
                                   oMargins, Samples::Ordinary, oRandom);
    const auto poMaskIn = RandomMask(nWidth, nHeight, oMargins, dfValid, oRandom);
    const auto poMaskOut = RandomMask(nWidth, nHeight, Margins{0, 3}, dfValid, oRandom);
    for (unsigned int nMasks = 0; nMasks < 4; ++nMasks)
    {
        tessel::Mask* const poUsedIn = (nMasks & 1U) != 0 ? poMaskIn.get() : nullptr;
        tessel::Mask* const poUsedOut = (nMasks & 2U) != 0 ? poMaskOut.get() : nullptr;
        const bool bBGZero = oRandom() % 2 == 0;
        FilterMedian oFilter;
        oFilter.SetBGZero(bBGZero);
        const auto oType = typedispatch::RealDataType<TOut>();
        const auto poActual = BlankRaster(nWidth, nHeight, nChannels, oType, Margins{2, 1});
        const auto poExpected = BlankRaster(nWidth, nHeight, nChannels, oType, Margins{2, 1});
        oFilter.Process(poIn.get(), poUsedIn, poActual.get(), poUsedOut);
        FilterByDefinition<TIn, TOut>(*poIn, poUsedIn, poUsedOut, bBGZero, *poExpected);
        ASSERT_TRUE(SameBits(*poActual, *poExpected))
            << nWidth << " x " << nHeight << " x " << nChannels << ", margins " << oMargins.x
            << " and " << oMargins.y << ", masks " << nMasks;
    }
}

TEST(FilterMedian, FollowsTheDefinitionForAllPairsOfTypes)
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
                    CompareWithDefinition<TIn, TOut>({9, 5, 2, {1, 1}}, 0.9, oRandom);
                    CompareWithDefinition<TIn, TOut>({7, 3, 1, {2, 1}}, 0.6, oRandom);
                    CompareWithDefinition<TIn, TOut>({300, 1, 2, {0, 0}}, 0.6, oRandom);
                });
        });
}

// Every window with a network, others, one row or column alone, and rows of every remainder.
TEST(FilterMedian, FollowsTheDefinitionForAllShapes)
{
    const OMPThreadCount oOne(1);
    Random oRandom(7);
    const auto oTest = [&]<class T>()
    {
        for (std::uint32_t nMarginX = 0; nMarginX <= 4; ++nMarginX)
        {
            for (std::uint32_t nMarginY = 0; nMarginY <= 4; ++nMarginY)
            {
                const auto nWidth = static_cast<std::uint32_t>(1 + oRandom() % 20);
                const auto nHeight = static_cast<std::uint32_t>(1 + oRandom() % 3);
                const auto nChannels = static_cast<std::uint32_t>(1 + oRandom() % 4);
                CompareWithDefinition<T, T>({nWidth, nHeight, nChannels, {nMarginX, nMarginY}},
                                            0.95, oRandom);
            }
        }
        for (std::uint32_t nWidth = 1; nWidth <= 70; nWidth += 3)
        {
            CompareWithDefinition<T, T>({nWidth, 1, 1, {1, 1}}, 0.99, oRandom);
        }
        CompareWithDefinition<T, T>({1, 70, 1, {2, 2}}, 0.98, oRandom);
        CompareWithDefinition<T, T>({67, 9, 1, {3, 3}}, 0.995, oRandom);
    };
    ForEachElementType(oTest);
}

TEST(FilterMedian, GivesTheSameRowsWithAnyNumberOfThreads)
{
    Random oRandom(8);
    const Margins oMargins{3, 3};
    const auto poIn =
        RandomRaster(75, 131, 1, tessel::eDT_32R, oMargins, Samples::Special, oRandom);
    const auto poMask = RandomMask(75, 131, oMargins, 0.999, oRandom);
    const auto poMany = BlankRaster(75, 131, 1, tessel::eDT_32R);
    FilterMedian().Process(poIn.get(), poMask.get(), poMany.get(), nullptr);
    const OMPThreadCount oOne(1);
    const auto poOne = BlankRaster(75, 43, 1, tessel::eDT_32R);
    FilterMedian().Process(poIn.get(), poMask.get(), poOne.get(), nullptr);
    EXPECT_TRUE(SameBits(*poMany, *poOne));
}

// Beside NaN any sample of the window will do, but it has to be one of them, at any size and beside
// masked pixels too.
TEST(FilterMedian, GivesOneOfTheSamplesBesideNaN)
{
    const OMPThreadCount oOne(1);
    Random oRandom(9);
    for (const Margins oMargins : {Margins{1, 1}, {2, 2}, {3, 3}, {4, 2}, {6, 6}})
    {
        const auto poIn =
            RandomRaster(37, 5, 2, tessel::eDT_64R, oMargins, Samples::Special, oRandom);
        const auto poMask = RandomMask(37, 5, oMargins, 0.97, oRandom);
        const auto poOut = BlankRaster(37, 5, 2, tessel::eDT_64R);
        FilterMedian().Process(poIn.get(), poMask.get(), poOut.get(), nullptr);
        for (std::int64_t i = 0; i < 37 * 5 * 2; ++i)
        {
            const std::int64_t x = i / 2 % 37;
            const std::int64_t y = i / 74;
            const auto c = static_cast<std::size_t>(i % 2);
            if (!IsValid(poMask.get(), x, y))
            {
                continue;
            }
            auto vdfWindow = WindowSamples<double>(*poIn, poMask.get(), x, y, c);
            const double dfOut = poOut->GetPixelAs<double>(x, y)[c];
            EXPECT_TRUE(std::any_of(vdfWindow.begin(), vdfWindow.end(),
                                    [&](double d) { return SameSample(d, dfOut); }))
                << dfOut << " at " << x << ", " << y;
            if (std::none_of(vdfWindow.begin(), vdfWindow.end(), [](double d) { return d != d; }))
            {
                std::sort(vdfWindow.begin(), vdfWindow.end());
                EXPECT_EQ(dfOut, vdfWindow[vdfWindow.size() / 2]) << x << ", " << y;
            }
        }
    }
}

}  // namespace
}  // namespace kor::filters
