#include "processes/qrdfilters/filtersartex.h"

#include <gtest/gtest.h>

#include <cmath>

#include "processes/qrdfilters/kernels/texturerows.h"
#include "tests/support/exceptions.h"
#include "tests/support/windowfilters.h"

namespace kor::filters
{
namespace
{

using tessel::eDT_64R;
using test::Image;
using test::Margins;
using test::MessageOf;

const std::vector<SarTextureType> kAllTextures = {eSarIntensityVariation, eSarAmplitudeVariation,
                                                  eSarLogVariance, eSarLogMeanRatio};

FilterSartex Textures(const std::vector<SarTextureType>& oTextures)
{
    FilterSartex oFilter;
    oFilter.SetTextures(oTextures);
    return oFilter;
}

/// The textures of a drawing whose outer rows and columns are the margins.
Image<double> TexturesOf(const FilterSartex& oFilter, std::size_t nTextures,
                         const Image<double>& oImage, Margins oMargins,
                         tessel::Mask* poMaskIn = nullptr, tessel::Mask* poMaskOut = nullptr)
{
    const auto poIn = test::RasterOf(oImage, oMargins);
    const auto poOut = test::BlankRaster(poIn->mnWidth, poIn->mnHeight,
                                         static_cast<std::uint32_t>(nTextures), eDT_64R);
    oFilter.Process(poIn.get(), poMaskIn, poOut.get(), poMaskOut);
    return test::ImageOf<double>(*poOut);
}

// S1 = 14, S2 = 1 + 16 + 81 = 98, R = 1 + 2 + 3 = 6.
const Image<double> kRow = {{1, 4, 9}};

TEST(FilterSartex, IntensityVariation)
{
    EXPECT_EQ(TexturesOf(Textures({eSarIntensityVariation}), 1, kRow, {1, 0}),
              (Image<double>{{3.0 * 98.0 / 196.0 - 1.0}}));
}

TEST(FilterSartex, AmplitudeVariation)
{
    EXPECT_EQ(TexturesOf(Textures({eSarAmplitudeVariation}), 1, kRow, {1, 0}),
              (Image<double>{{3.0 * 14.0 / 36.0 - 1.0}}));
}

// Logarithms 0, l and -l with l = ln 2: their mean is 0 and that of their squares 2 / 3 l^2.
TEST(FilterSartex, LogVariance)
{
    const Image<double> oOut =
        TexturesOf(Textures({eSarLogVariance}), 1, Image<double>{{2, 1, 0.5}}, {1, 0});
    EXPECT_DOUBLE_EQ(oOut.Samples()[0], 2.0 / 3.0 * std::log(2.0) * std::log(2.0));
}

// (0 + ln 4 + ln 9) / 3 - ln(14 / 3).
TEST(FilterSartex, LogMeanRatio)
{
    const Image<double> oOut = TexturesOf(Textures({eSarLogMeanRatio}), 1, kRow, {1, 0});
    EXPECT_DOUBLE_EQ(oOut.Samples()[0], std::log(36.0) / 3.0 - std::log(14.0 / 3.0));
}

// Two of three samples count with -100: 20000 / 3 - (200 / 3)^2.
TEST(FilterSartex, ZeroCountsAsMinusHundredInTheLogVariance)
{
    const Image<double> oOut =
        TexturesOf(Textures({eSarLogVariance}), 1, Image<double>{{0, 1, -0.0}}, {1, 0});
    EXPECT_EQ(oOut.Samples()[0], 20000.0 / 3.0 - (-200.0 / 3.0) * (-200.0 / 3.0));
}

TEST(FilterSartex, ZeroMakesTheLogMeanRatioInfinite)
{
    const Image<double> oOut =
        TexturesOf(Textures({eSarLogMeanRatio}), 1, Image<double>{{0, 1, 2}}, {1, 0});
    EXPECT_EQ(oOut.Samples()[0], -INFINITY);
}

// Minus infinity less minus infinity: when the zero leaves its column no number is left, and none
// in the windows that build on it.
TEST(FilterSartex, ZeroSpoilsTheLogMeanRatioOfTheRowsBelow)
{
    const Image<double> oOut =
        TexturesOf(Textures({eSarLogMeanRatio}), 1, Image<double>{{0, 1}, {1, 1}, {1, 1}}, {0, 0});
    EXPECT_EQ(oOut.Samples()[1], 0.0);
    for (const std::size_t i : {0U, 2U, 3U, 4U, 5U})
    {
        EXPECT_TRUE(std::isnan(oOut.Samples()[i])) << i;
    }
}

TEST(FilterSartex, OneValidSampleGivesZero)
{
    const auto poMask = test::MaskOf({{0, 1, 0}}, {1, 0});
    EXPECT_EQ(TexturesOf(Textures(kAllTextures), 4, Image<double>{{2, 9, 7}}, {1, 0}, poMask.get()),
              (Image<double>{{0, 0, 0, 0}}));
}

TEST(FilterSartex, VariationOfZerosIsNotANumber)
{
    const Image<double> oOut =
        TexturesOf(Textures({eSarIntensityVariation, eSarAmplitudeVariation}), 2,
                   Image<double>{{0, 0, 0}}, {1, 0});
    EXPECT_TRUE(std::isnan(oOut.Samples()[0]));
    EXPECT_TRUE(std::isnan(oOut.Samples()[1]));
}

TEST(FilterSartex, ListGivesTheOrderOfTheChannels)
{
    const Image<double> oFirst = TexturesOf(Textures({eSarIntensityVariation}), 1, kRow, {1, 0});
    const Image<double> oSecond = TexturesOf(Textures({eSarLogMeanRatio}), 1, kRow, {1, 0});
    EXPECT_EQ(TexturesOf(Textures({eSarLogMeanRatio, eSarIntensityVariation}), 2, kRow, {1, 0}),
              (Image<double>{{oSecond.Samples()[0], oFirst.Samples()[0]}}));
}

TEST(FilterSartex, BackgroundIsZeroWhateverTheFlag)
{
    const Image<double> oImage = {{4, 4, 7, 4, 5}};
    const auto poMask = test::MaskOf({{1, 1, 0, 1, 0}}, {1, 0});
    const auto poClip = test::MaskOf({{0, 1, 1}});
    FilterSartex oFilter = Textures({eSarLogVariance, eSarAmplitudeVariation});
    oFilter.SetBGZero(false);
    EXPECT_EQ(TexturesOf(oFilter, 2, oImage, {1, 0}, poMask.get(), poClip.get()),
              (Image<double>{{0, 0, 0, 0, 0, 0}}));
}

// The window is 7 by 7 and not 5 by 5: n = 49 with a 1 at the edge and in the middle.
TEST(FilterSartex, MarginsAreTheWindowWhateverTheSize)
{
    std::vector<double> vdfSamples(49, 0.0);
    vdfSamples[0] = 1.0;
    vdfSamples[24] = 1.0;
    FilterSartex oFilter = Textures({eSarIntensityVariation});
    oFilter.SetFilterSizeX(5);
    oFilter.SetFilterSizeY(5);
    EXPECT_EQ(TexturesOf(oFilter, 1, Image<double>(7, vdfSamples), {3, 3}),
              (Image<double>{{49.0 * 2.0 / 4.0 - 1.0}}));
}

TEST(FilterSartex, EmptyListWantsAnOutputWithoutChannels)
{
    const auto poIn = test::RasterOf(kRow, {1, 0});
    const auto poNone = test::BlankRaster(1, 1, 0, eDT_64R);
    EXPECT_NO_THROW(FilterSartex().Process(poIn.get(), nullptr, poNone.get(), nullptr));
    const auto poOne = test::BlankRaster(1, 1, 1, eDT_64R);
    EXPECT_EQ(MessageOf<Exception>(
                  [&] { FilterSartex().Process(poIn.get(), nullptr, poOne.get(), nullptr); }),
              "The number of output channels don't match the number of requested textures");
}

TEST(FilterSartex, NothingIsConvertedBack)
{
    EXPECT_FALSE(FilterSartex().DoConvertBack());
}

/// The exception of an action has the source of this filter in it.
template <class Action>
void ExpectTraced(const Action& oAction, const char* pszMessage, const char* pszFunction)
{
    try
    {
        oAction();
        FAIL() << "nothing was thrown";
    }
    catch (const Exception& oException)
    {
        EXPECT_EQ(oException.GetMessage(), pszMessage);
        EXPECT_EQ(oException.GetFile(), "processes/qrdfilters/filtersartex");
        EXPECT_NE(oException.GetFunction().find(pszFunction), std::string::npos)
            << oException.GetFunction();
        EXPECT_GT(oException.GetLine(), 0U);
    }
}

TEST(FilterSartex, TextureThatComesTwiceIsRefused)
{
    FilterSartex oFilter = Textures({eSarIntensityVariation});
    ExpectTraced(
        [&] {
            oFilter.SetTextures({eSarLogVariance, eSarLogMeanRatio, eSarLogVariance});
        },
        "Duplicate texture in the list of requested textures.", "SetTextures");
    EXPECT_EQ(TexturesOf(oFilter, 1, kRow, {1, 0}), (Image<double>{{0.5}}));
}

TEST(FilterSartex, SizesAreOddFrom3To101)
{
    FilterSartex oFilter;
    for (const unsigned int nSize : {0U, 1U, 2U, 4U, 100U, 102U, 103U, 0xFFFFFFFFU})
    {
        constexpr const char* kMessage =
            "the filter size must be odd numbers and must be at least 3 and maximum 101. \n";
        ExpectTraced([&] { oFilter.SetFilterSizeX(nSize); }, kMessage, "SetFilterSizeX");
        ExpectTraced([&] { oFilter.SetFilterSizeY(nSize); }, kMessage, "SetFilterSizeY");
    }
    for (const unsigned int nSize : {3U, 5U, 99U, 101U})
    {
        EXPECT_NO_THROW(oFilter.SetFilterSizeX(nSize));
        EXPECT_NO_THROW(oFilter.SetFilterSizeY(nSize));
    }
}

TEST(FilterSartex, MarginsBelowTheSizeAreRefused)
{
    constexpr const char* kMessage =
        "The margins in the input raster are too small according to the requested filter size.";
    const auto poOut = test::BlankRaster(1, 1, 1, eDT_64R);
    FilterSartex oWide = Textures({eSarLogVariance});
    oWide.SetFilterSizeX(5);
    FilterSartex oHigh = Textures({eSarLogVariance});
    oHigh.SetFilterSizeY(5);
    const auto poLow = test::BlankRaster(1, 1, 1, eDT_64R, {2, 1});
    const auto poNarrow = test::BlankRaster(1, 1, 1, eDT_64R, {1, 2});
    ExpectTraced([&] { oWide.Process(poNarrow.get(), nullptr, poOut.get(), nullptr); }, kMessage,
                 "ProcessBlock");
    ExpectTraced([&] { oHigh.Process(poLow.get(), nullptr, poOut.get(), nullptr); }, kMessage,
                 "ProcessBlock");
    EXPECT_NO_THROW(oWide.Process(poLow.get(), nullptr, poOut.get(), nullptr));
    EXPECT_NO_THROW(oHigh.Process(poNarrow.get(), nullptr, poOut.get(), nullptr));
}

TEST(FilterSartex, SeveralInputChannelsAreRefused)
{
    const auto poIn = test::BlankRaster(1, 1, 2, eDT_64R);
    const auto poOut = test::BlankRaster(1, 1, 1, eDT_64R);
    ExpectTraced(
        [&] { Textures({eSarLogVariance}).Process(poIn.get(), nullptr, poOut.get(), nullptr); },
        "The input raster should have only 1 channel to process Sartex", "ProcessBlock");
}

TEST(FilterSartex, MarginsAreLookedAtBeforeTheChannelsOfInputAndOutput)
{
    const auto poNarrow = test::BlankRaster(1, 1, 2, eDT_64R);
    const auto poWide = test::BlankRaster(1, 1, 2, eDT_64R, {1, 1});
    const auto poOut = test::BlankRaster(1, 1, 3, eDT_64R);
    FilterSartex oFilter = Textures({static_cast<SarTextureType>(9)});
    oFilter.SetFilterSizeX(3);
    ExpectTraced([&] { oFilter.Process(poNarrow.get(), nullptr, poOut.get(), nullptr); },
                 "The margins in the input raster are too small according to the requested filter "
                 "size.",
                 "ProcessBlock");
    ExpectTraced([&] { oFilter.Process(poWide.get(), nullptr, poOut.get(), nullptr); },
                 "The input raster should have only 1 channel to process Sartex", "ProcessBlock");
    const auto poOne = test::BlankRaster(1, 1, 1, eDT_64R, {1, 1});
    ExpectTraced([&] { oFilter.Process(poOne.get(), nullptr, poOut.get(), nullptr); },
                 "The number of output channels don't match the number of requested textures",
                 "ProcessBlock");
}

TEST(FilterSartex, UnknownTextureIsRefusedAtItsTurn)
{
    const auto poIn = test::RasterOf(kRow, {1, 0});
    const auto poOut = test::RasterOf(Image<double>{{-7, -7, -7}}, {}, 3);
    const FilterSartex oFilter =
        Textures({eSarIntensityVariation, static_cast<SarTextureType>(5), eSarLogVariance});
    ExpectTraced([&] { oFilter.Process(poIn.get(), nullptr, poOut.get(), nullptr); },
                 "Invalid Texture", "ProcessBlock");
    EXPECT_EQ(test::ImageOf<double>(*poOut), (Image<double>{{0.5, -7, -7}}));
}

/// Logarithms of the kernel, whose distance from the C library's is tested with it.
double LogOfKernel(double x)
{
    kernels::LogRow({&x, 1});
    return x;
}

double BoundedLog(double x)
{
    return x == 0.0 ? -100.0 : LogOfKernel(x);
}

struct RootTerms
{
    static std::array<double, 2> Of(double x) { return {x, std::sqrt(x)}; }
};

struct BoundedLogTerms
{
    static std::array<double, 2> Of(double x)
    {
        return {BoundedLog(x) * BoundedLog(x), BoundedLog(x)};
    }
};

struct LogTerms
{
    static std::array<double, 2> Of(double x) { return {x, LogOfKernel(x)}; }
};

double Variation(double dfPowers, double dfRoots, double n)
{
    return n * dfPowers / (dfRoots * dfRoots) - 1.0;
}

double LogVariance(double Q, double L, double n)
{
    return Q / n - (L / n) * (L / n);
}

double LogMeanRatio(double S1, double L, double n)
{
    return L / n - LogOfKernel(S1 / n);
}

template <class Terms>
void ExpectTextureByDefinition(SarTextureType eTexture, double (*pfnFinish)(double, double, double))
{
    test::Random oRandom(eTexture);
    for (unsigned int nCase = 0; nCase < 40; ++nCase)
    {
        const test::WindowCase oCase = test::RandomWindowCase(nCase, oRandom);
        tessel::Raster& oIn = *oCase.mpoIn;
        // The same samples as one channel, side by side.
        const tessel::Raster oBand(
            tessel::RasterInfo(oIn.mnTotalWidth * oIn.mnChannels - 2 * oIn.mnMarginX, oIn.mnHeight,
                               1, eDT_64R),
            oIn, oIn.mpBuffer, false);
        const auto oMask = test::RandomMask(oBand.mnWidth, oBand.mnHeight,
                                            {oBand.mnMarginX, oBand.mnMarginY}, 0.8, oRandom);
        const auto oClip = test::RandomMask(oBand.mnWidth, oBand.mnHeight, {1, 0}, 0.8, oRandom);
        tessel::Mask* poMaskIn = nCase % 2 == 0 ? oMask.get() : nullptr;
        tessel::Mask* poMaskOut = nCase / 2 % 2 == 0 ? oClip.get() : nullptr;
        const auto poActual =
            test::BlankRaster(oBand.mnWidth, oBand.mnHeight, 1, eDT_64R, oCase.moOutMargins);
        const auto poExpected =
            test::BlankRaster(oBand.mnWidth, oBand.mnHeight, 1, eDT_64R, oCase.moOutMargins);
        tessel::Raster oInput(oBand, oBand, oBand.mpBuffer, false);
        Textures({eTexture}).Process(&oInput, poMaskIn, poActual.get(), poMaskOut);
        test::FilterPlainly<double, Terms>(
            oBand, poMaskIn, {oBand.mnMarginX, oBand.mnMarginY}, true,
            [pfnFinish](const auto& oSums, double)
            { return pfnFinish(oSums.moValues[0], oSums.moValues[1], oSums.mdfCount); },
            *poExpected, poMaskOut);
        ASSERT_TRUE(test::SameBits(*poActual, *poExpected)) << "case " << nCase;
    }
}

TEST(FilterSartex, GivesTheBitsOfTheDefinition)
{
    ExpectTextureByDefinition<test::MomentTerms>(eSarIntensityVariation, Variation);
    ExpectTextureByDefinition<RootTerms>(eSarAmplitudeVariation, Variation);
    ExpectTextureByDefinition<BoundedLogTerms>(eSarLogVariance, LogVariance);
    ExpectTextureByDefinition<LogTerms>(eSarLogMeanRatio, LogMeanRatio);
}

}  // namespace
}  // namespace kor::filters
