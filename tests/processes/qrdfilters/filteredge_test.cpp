#include "processes/qrdfilters/filteredge.h"

#include <gtest/gtest.h>

#include <cmath>
#include <string>

#include "platform/exception/exception.h"
#include "platform/system/omp.h"
#include "processes/qrdfilters/hardened.h"
#include "processes/qrdfilters/sampleconversion.h"
#include "tests/support/filtercomparison.h"

namespace kor::filters
{
namespace
{

using namespace kor::test;

/// The drawing, its outer rows and columns being the margins, filtered into samples of type TOut.
template <class TOut, class TIn>
Image<TOut> Filtered(const FilterEdge& oFilter, const Image<TIn>& oImage, Margins oMargins,
                     tessel::Mask* poMaskIn = nullptr, tessel::Mask* poMaskOut = nullptr,
                     std::uint32_t nChannels = 1)
{
    const auto poIn = RasterOf(oImage, oMargins, nChannels);
    const auto poOut =
        BlankRaster(poIn->mnWidth, poIn->mnHeight, nChannels, typedispatch::RealDataType<TOut>());
    oFilter.Process(poIn.get(), poMaskIn, poOut.get(), poMaskOut);
    return ImageOf<TOut>(*poOut);
}

const Image<std::uint8_t> kSinglePixel = {
    {0, 0, 0, 0, 0}, {0, 0, 0, 0, 0}, {0, 0, 90, 0, 0}, {0, 0, 0, 0, 0}, {0, 0, 0, 0, 0},
};

TEST(FilterEdge, IsZeroOnAFlatImage)
{
    const Image<short> oImage = {{7, 7, 7, 7}, {7, 7, 7, 7}, {7, 7, 7, 7}};
    EXPECT_EQ(Filtered<short>(FilterEdge(), oImage, {1, 1}), (Image<short>{{0, 0}}));
}

TEST(FilterEdge, IsTheMeanDifferenceToTheOtherPixels)
{
    EXPECT_EQ(Filtered<double>(FilterEdge(), kSinglePixel, {1, 1}),
              (Image<double>{{11.25, 11.25, 11.25}, {11.25, 90, 11.25}, {11.25, 11.25, 11.25}}));
}

TEST(FilterEdge, TakesItsWindowFromTheMarginsOfEachAxis)
{
    // Differences 2 and 4 to the left and right, 4 and 1.
    EXPECT_EQ(Filtered<double>(FilterEdge(), Image<int>{{1, 3, 7, 8}}, {1, 0}),
              (Image<double>{{3, 2.5}}));
    EXPECT_EQ(Filtered<double>(FilterEdge(), Image<int>{{1}, {3}, {7}, {8}}, {0, 1}),
              (Image<double>{{3}, {2.5}}));
}

TEST(FilterEdge, IsZeroWithoutMargins)
{
    EXPECT_EQ(Filtered<float>(FilterEdge(5.0), Image<float>{{1, -3e30F}}, {}),
              (Image<float>{{0, 0}}));
}

TEST(FilterEdge, MultipliesByTheFactor)
{
    const Image<int> oImage = {{1, 3, 7, 8}};
    EXPECT_EQ(Filtered<double>(FilterEdge(2.0), oImage, {1, 0}), (Image<double>{{6, 5}}));
    EXPECT_EQ(Filtered<double>(FilterEdge(-0.5), oImage, {1, 0}), (Image<double>{{-1.5, -1.25}}));
    FilterEdge oFilter;
    oFilter.SetFactor(3.0);
    EXPECT_EQ(Filtered<double>(oFilter, oImage, {1, 0}), (Image<double>{{9, 7.5}}));
}

// Even times infinity a sum below 1e-9 stays 0; from 1e-9 on it counts.
TEST(FilterEdge, IsZeroForDifferencesBelowTheBound)
{
    const FilterEdge oFilter(std::numeric_limits<double>::infinity());
    EXPECT_EQ(Filtered<double>(oFilter, Image<double>{{0, 0, 0.99e-9}}, {1, 0}),
              (Image<double>{{0}}));
    EXPECT_EQ(Filtered<double>(FilterEdge(), Image<double>{{0, 0, 1e-9}}, {1, 0}),
              (Image<double>{{0.5e-9}}));
}

TEST(FilterEdge, StoresByTheConversionRules)
{
    const auto oStored = [](double dfFactor)
    {
        return Filtered<std::uint8_t>(FilterEdge(dfFactor), Image<double>{{0, 1, 1}}, {1, 0})
            .Samples()[0];
    };
    EXPECT_EQ(oStored(2 * 11.25), 11);
    EXPECT_EQ(oStored(2 * 11.5), 12);
    EXPECT_EQ(oStored(2 * 256.0), 255);
    EXPECT_EQ(oStored(-2.0), 0);
}

TEST(FilterEdge, TreatsChannelsByThemselves)
{
    EXPECT_EQ(
        Filtered<double>(FilterEdge(), Image<int>{{1, 7, 3, 7, 7, 7}}, {1, 0}, nullptr, nullptr, 2),
        (Image<double>{{3, 0}}));
}

// The input is never carried over.
TEST(FilterEdge, WritesZeroWhereNothingIsComputed)
{
    const auto poMaskIn = MaskOf({{1, 0, 1, 1, 1}}, {1, 0});
    const auto poMaskOut = MaskOf({{1, 1, 0}});
    EXPECT_EQ(Filtered<int>(FilterEdge(), Image<int>{{1, 50, 3, 7, 8}}, {1, 0}, poMaskIn.get(),
                            poMaskOut.get()),
              (Image<int>{{0, 2, 0}}));
}

// The masked 5 is no zero: it adds neither |5 - 3| nor |0 - 3|, and the divisor stays 2.
TEST(FilterEdge, IsWeakerBesideMaskedNeighbours)
{
    const auto poMask = MaskOf({{0, 1, 1}}, {1, 0});
    EXPECT_EQ(Filtered<double>(FilterEdge(), Image<int>{{5, 3, 9}}, {1, 0}), (Image<double>{{4}}));
    EXPECT_EQ(Filtered<double>(FilterEdge(), Image<int>{{5, 3, 9}}, {1, 0}, poMask.get()),
              (Image<double>{{3}}));
    const auto poAlone = MaskOf({{0, 1, 0}}, {1, 0});
    EXPECT_EQ(Filtered<double>(FilterEdge(), Image<int>{{5, 3, 9}}, {1, 0}, poAlone.get()),
              (Image<double>{{0}}));
}

TEST(FilterEdge, PassesOnWhatIsNoNumber)
{
    const double dfNaN = std::nan("");
    const Image<double> oImage = {{1, 2, dfNaN, 4, 5}};
    const auto vdfOut = Filtered<double>(FilterEdge(), oImage, {1, 0}).Samples();
    EXPECT_TRUE(std::isnan(vdfOut[0]) && std::isnan(vdfOut[1]) && std::isnan(vdfOut[2]));
    EXPECT_EQ(Filtered<int>(FilterEdge(), oImage, {1, 0}), (Image<int>{{0, 0, 0}}));
    const auto poMask = MaskOf({{1, 1, 0, 1, 1}}, {1, 0});
    EXPECT_EQ(Filtered<double>(FilterEdge(), oImage, {1, 0}, poMask.get()),
              (Image<double>{{0.5, 0, 0.5}}));
}

// 2^53 + 1 has no double of its own.
TEST(FilterEdge, DropsTheLowBitsOf64BitIntegers)
{
    constexpr int64 kLarge = 9007199254740992;
    EXPECT_EQ(Filtered<double>(FilterEdge(), Image<int64>{{kLarge + 1, kLarge, kLarge}}, {1, 0}),
              (Image<double>{{0}}));
}

TEST(FilterEdge, KeepsTheFactorOfItsFirstBlock)
{
    FilterEdge oFilter(2.0);
    const Image<int> oImage = {{0, 0, 10}};
    EXPECT_EQ(Filtered<int>(oFilter, oImage, {1, 0}), (Image<int>{{10}}));
    oFilter.SetFactor(4.0);
    EXPECT_EQ(Filtered<int>(oFilter, oImage, {1, 0}), (Image<int>{{10}}));
    const FilterEdge oCopy(oFilter);
    EXPECT_EQ(Filtered<int>(oCopy, oImage, {1, 0}), (Image<int>{{10}}));
    EXPECT_EQ(Filtered<short>(oFilter, oImage, {1, 0}), (Image<short>{{20}}));
}

void ExpectRefused(tessel::Raster* poIn, tessel::Raster* poOut, const std::string& oMessage)
{
    try
    {
        FilterEdge().Process(poIn, nullptr, poOut, nullptr);
        FAIL() << "nothing was thrown";
    }
    catch (const Exception& oException)
    {
        EXPECT_EQ(oException.GetMessage(), oMessage);
        EXPECT_EQ(oException.GetFile(), "processes/qrdfilters/filteredge");
        EXPECT_NE(oException.GetFunction().find("FilterEdge::Process("), std::string::npos);
        EXPECT_GT(oException.GetLine(), 0U);
    }
}

TEST(FilterEdge, RefusesRastersThatItCannotUse)
{
    const auto poReal = BlankRaster(1, 1, 1, tessel::eDT_8U);
    const auto poComplex = BlankRaster(1, 1, 1, tessel::eDT_C32R);
    ExpectRefused(nullptr, poComplex.get(), "poRasterIn is invalid pointer");
    ExpectRefused(poReal.get(), nullptr, "poRasterOut is invalid pointer");
    ExpectRefused(poReal.get(), poComplex.get(), "Output cannot be complex");
    const auto poBits = BlankRaster(1, 1, 1, tessel::eDT_BIT);
    EXPECT_THROW(FilterEdge().Process(poBits.get(), nullptr, poReal.get(), nullptr), Exception);
}

TEST(FilterEdge, WorksOnTheMagnitudeOfAComplexInput)
{
    const auto poIn = BlankRaster(1, 1, 1, tessel::eDT_C16S, {1, 0});
    const short anSamples[] = {3, 4, -60, 80, 0, -7};
    std::copy_n(anSamples, 6, reinterpret_cast<short*>(poIn->mpBuffer));
    const auto poOut = BlankRaster(1, 1, 1, tessel::eDT_32S);
    FilterEdge().Process(poIn.get(), nullptr, poOut.get(), nullptr);
    EXPECT_EQ(ImageOf<int>(*poOut), (Image<int>{{94}}));
}

TEST(FilterEdge, AcceptsBlocksWithoutPixels)
{
    const auto poNoRows = BlankRaster(4, 0, 1, tessel::eDT_32R, {1, 1});
    const auto poNoColumns = BlankRaster(0, 4, 1, tessel::eDT_32R, {1, 1});
    EXPECT_NO_THROW(FilterEdge().Process(poNoRows.get(), nullptr, poNoRows.get(), nullptr));
    EXPECT_NO_THROW(FilterEdge().Process(poNoColumns.get(), nullptr, poNoColumns.get(), nullptr));
}

TEST(FilterEdge, ChecksWhatTheCallerPromisesInHardenedBuilds)
{
    if (!kHardened)
    {
        GTEST_SKIP() << "other builds trust the caller";
    }
    const auto poIn = BlankRaster(3, 2, 1, tessel::eDT_8U);
    const auto poSmall = BlankRaster(3, 1, 1, tessel::eDT_8U);
    EXPECT_THROW(FilterEdge().Process(poIn.get(), nullptr, poSmall.get(), nullptr), Exception);
}

// ---- The definition.

template <class TIn>
double StrengthByDefinition(const tessel::Raster& oIn, const tessel::Mask* poMaskIn, std::int64_t x,
                            std::int64_t y, std::size_t c, double dfFactor)
{
    const std::int64_t nHalfX = oIn.mnMarginX;
    const std::int64_t nHalfY = oIn.mnMarginY;
    const double dfCentre = ConvertSample<TIn, double>(oIn.GetPixelAs<TIn>(x, y)[c]);
    double dfSum = 0.0;
    for (std::int64_t dy = -nHalfY; dy <= nHalfY; ++dy)
    {
        for (std::int64_t dx = -nHalfX; dx <= nHalfX; ++dx)
        {
            if (IsValid(poMaskIn, x + dx, y + dy))
            {
                dfSum += std::fabs(
                    ConvertSample<TIn, double>(oIn.GetPixelAs<TIn>(x + dx, y + dy)[c]) - dfCentre);
            }
        }
    }
    if (dfSum > -1e-9 && dfSum < 1e-9)
    {
        return 0.0;
    }
    const double dfStrength = dfSum / static_cast<double>((2 * nHalfX + 1) * (2 * nHalfY + 1) - 1);
    return dfFactor != 1.0 ? dfStrength * dfFactor : dfStrength;
}

template <class TIn, class TOut>
void Compare(double dfFactor, const Shape& oShape, double dfValid, Random& oRandom)
{
    const FilterEdge oFilter(dfFactor);
    const auto eSamples = oRandom() % 4 == 0 ? Samples::Special : Samples::Ordinary;
    CompareWithDefinition<TIn, TOut>(
        oShape, eSamples, dfValid, oRandom,
        [&](auto poIn, auto poMaskIn, auto poOut, auto poMaskOut)
        { oFilter.Process(poIn, poMaskIn, poOut, poMaskOut); },
        [&](auto poIn, auto poMaskIn, auto poOut, auto poMaskOut)
        {
            for (std::int64_t i = 0; i < std::int64_t{poIn->mnWidth} * poIn->mnHeight; ++i)
            {
                const std::int64_t x = i % poIn->mnWidth;
                const std::int64_t y = i / poIn->mnWidth;
                const bool bComputed = IsValid(poMaskIn, x, y) && IsValid(poMaskOut, x, y);
                for (std::size_t c = 0; c < poIn->mnChannels; ++c)
                {
                    poOut->template GetPixelAs<TOut>(x, y)[c] =
                        bComputed ? ConvertSample<double, TOut>(StrengthByDefinition<TIn>(
                                        *poIn, poMaskIn, x, y, c, dfFactor))
                                  : TOut(0);
                }
            }
        });
}

TEST(FilterEdge, FollowsTheDefinitionForAllPairsOfTypes)
{
    // Threads are counted elsewhere; with one a small block is not slowed by waking others.
    const OMPThreadCount oOne(1);
    Random oRandom(21);
    ForEachElementType(
        [&]<class TIn>()
        {
            ForEachElementType(
                [&]<class TOut>()
                {
                    const double dfFactor = oRandom() % 2 == 0 ? 1.0 : 0.4;
                    ForSomeShapes({1, 1}, [&](const Shape& oShape, double dfValid)
                                  { Compare<TIn, TOut>(dfFactor, oShape, dfValid, oRandom); });
                });
        });
}

TEST(FilterEdge, FollowsTheDefinitionForAllShapes)
{
    const OMPThreadCount oOne(1);
    Random oRandom(22);
    for (const Margins oMargins : {Margins{0, 0}, {1, 1}, {3, 0}, {0, 2}, {4, 3}})
    {
        ForEachShape(oMargins, [&](const Shape& oShape, double dfValid)
                     { Compare<double, double>(1.0, oShape, dfValid, oRandom); });
        ForEachShape(oMargins, [&](const Shape& oShape, double dfValid)
                     { Compare<unsigned char, float>(3.3, oShape, dfValid, oRandom); });
    }
}

TEST(FilterEdge, FollowsTheDefinitionAcrossBandsAndTiles)
{
    const OMPThreadCount oTwo(2);
    Random oRandom(23);
    Compare<float, float>(1.0, {700, 11, 1, {2, 2}}, 0.99, oRandom);
    Compare<double, double>(2.0, {3, 523, 1, {1, 1}}, 0.99, oRandom);
    Compare<int, double>(1.0, {400, 9, 2, {20, 1}}, 0.999, oRandom);
}

}  // namespace
}  // namespace kor::filters
