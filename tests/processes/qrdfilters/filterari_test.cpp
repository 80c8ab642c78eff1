#include "processes/qrdfilters/filterari.h"

#include <gtest/gtest.h>

#include <cmath>
#include <limits>
#include <optional>
#include <string>

#include "platform/datasources/basicreader.h"
#include "platform/datasources/basicwriter.h"
#include "platform/exception/exception.h"
#include "processes/qrdfilters/hardened.h"
#include "processes/qrdfilters/parallelio/filteriodriver.h"
#include "tests/support/conversionreference.h"
#include "tests/support/kordskfiles.h"
#include "tests/support/maskbuilders.h"
#include "tests/support/temporarydirectory.h"

namespace kor::filters
{
namespace
{

using namespace kor::test;
using tessel::Mask;
using tessel::Raster;

using Bytes = Image<std::uint8_t>;
using Floats = Image<float>;

constexpr float kGreatest = std::numeric_limits<float>::max();
constexpr float kInfinity = std::numeric_limits<float>::infinity();

/// Parameters as a caller writes them.
struct Parameters
{
    std::vector<unsigned int> mvnOper;
    std::vector<float> mvfConst;
    std::vector<float> mvfZeroDiv;
    std::vector<unsigned int> mvnAutoScale;
    std::vector<float> mvfRVal;
};

FilterARI MakeFilter(const Parameters& oParameters)
{
    FilterARI oFilter;
    oFilter.SetOper(oParameters.mvnOper);
    oFilter.SetConst(oParameters.mvfConst);
    oFilter.SetZeroDiv(oParameters.mvfZeroDiv);
    oFilter.SetAutoScale(oParameters.mvnAutoScale);
    oFilter.SetRVal(oParameters.mvfRVal);
    return oFilter;
}

/// The drawing of nChannels channels, filtered into one of type TOut.
template <class TOut, class TIn>
Image<TOut> Filtered(const FilterARI& oFilter, const Image<TIn>& oImage,
                     std::uint32_t nChannels = 1, Mask* poMask = nullptr)
{
    const auto poIn = RasterOf(oImage, {}, nChannels);
    const auto poOut = BlankRaster(poIn->mnWidth, poIn->mnHeight, 1,
                                   typedispatch::RealDataType<TOut>(), Margins{1, 2});
    oFilter.Process(poIn.get(), poMask, poOut.get());
    return ImageOf<TOut>(*poOut);
}

TEST(FilterARI, CombinesOneChannelWithTheConstant)
{
    const Floats oImage = {{6.5F, -3.0F}};
    const auto oResult = [&](unsigned int nOper, float fConst) {
        return Filtered<float>(MakeFilter({{nOper}, {fConst}, {}, {}, {}}), oImage);
    };
    EXPECT_EQ(oResult(1, 2.0F), (Floats{{8.5F, -1.0F}}));
    EXPECT_EQ(oResult(2, 2.0F), (Floats{{4.5F, -5.0F}}));
    EXPECT_EQ(oResult(3, 2.0F), (Floats{{13.0F, -6.0F}}));
    EXPECT_EQ(oResult(4, 2.0F), (Floats{{3.25F, -1.5F}}));
    EXPECT_EQ(oResult(5, 3.9F), (Floats{{2.0F, 1.0F}}));  // 6 and 3; ...11101 and 3
    EXPECT_EQ(oResult(6, 3.9F), (Floats{{7.0F, -1.0F}}));
}

// The constant counts in sums and differences alone, which is meant.
TEST(FilterARI, CombinesTwoChannels)
{
    const Floats oImage = {{6.5F, 2.0F, -3.0F, 4.0F}};
    const auto oResult = [&](unsigned int nOper) {
        return Filtered<float>(MakeFilter({{nOper}, {100.0F}, {}, {}, {}}), oImage, 2);
    };
    EXPECT_EQ(oResult(1), (Floats{{108.5F, 101.0F}}));
    EXPECT_EQ(oResult(2), (Floats{{-95.5F, -107.0F}}));
    EXPECT_EQ(oResult(3), (Floats{{13.0F, -12.0F}}));
    EXPECT_EQ(oResult(4), (Floats{{3.25F, -0.75F}}));
    EXPECT_EQ(oResult(5), (Floats{{2.0F, 4.0F}}));  // ...11101 and 100 is 100
    EXPECT_EQ(oResult(6), (Floats{{6.0F, -3.0F}}));
}

TEST(FilterARI, IgnoresChannelsBehindTheSecond)
{
    EXPECT_EQ(
        Filtered<int>(MakeFilter({{2}, {0}, {}, {}, {}}), Bytes{{5, 2, 99, 98, 1, 7, 97, 96}}, 4),
        (Image<int>{{3, -6}}));
}

// 16777217 becomes 16777216 on the way in; 2^24 + 1 has no float either.
TEST(FilterARI, ComputesInSinglePrecision)
{
    EXPECT_EQ(Filtered<double>(MakeFilter({{1}, {1.0F}, {}, {}, {}}), Image<int>{{16777217}}),
              (Image<double>{{16777216.0}}));
    // (1e8 + 3) is 1e8 in float: added the other way round, the constant would survive.
    EXPECT_EQ(Filtered<double>(MakeFilter({{1}, {-1e8F}, {}, {}, {}}), Floats{{3.0F, 1e8F}}, 2),
              (Image<double>{{0.0}}));
}

TEST(FilterARI, CutsOperandsOfBitOperationsToInts)
{
    const int nSmallest = std::numeric_limits<int>::min();
    const auto oResult = [&](float fSample, float fConst) {
        return Filtered<int>(MakeFilter({{6}, {fConst}, {}, {}, {}}), Floats{{fSample}})
            .Samples()[0];
    };
    EXPECT_EQ(oResult(-2.9F, 0.0F), -2);
    EXPECT_EQ(oResult(2147483648.0F, 0.0F), nSmallest);
    EXPECT_EQ(oResult(-3e9F, 0.0F), nSmallest);
    EXPECT_EQ(oResult(kInfinity, 0.0F), nSmallest);
    EXPECT_EQ(oResult(std::nanf(""), 0.0F), nSmallest);
    EXPECT_EQ(oResult(0.0F, 1e20F), nSmallest);
    EXPECT_EQ(oResult(2147483520.0F, 0.0F), 2147483520);
}

TEST(FilterARI, DividesOutsideTheBandAroundZeroAlone)
{
    const float fSmall = std::nextafterf(1e-09F, 1.0F);
    const FilterARI oFilter = MakeFilter({{4}, {}, {-7.0F}, {}, {}});
    // 1e-9f is a little less than 1e-9, and the comparison is made in double.
    EXPECT_EQ(Filtered<float>(oFilter,
                              Floats{{1.0F, 0.0F, 1.0F, 1e-09F, 1.0F, -1e-09F, 1.0F, fSmall, 1.0F,
                                      -fSmall, 1.0F, -0.0F}},
                              2),
              (Floats{{-7.0F, -7.0F, -7.0F, 1.0F / fSmall, -1.0F / fSmall, -7.0F}}));
    EXPECT_EQ(oFilter.GetARIMin(), -1.0F / fSmall);
    EXPECT_EQ(oFilter.GetARIMax(), 1.0F / fSmall);
    const FilterARI oByConstant = MakeFilter({{4}, {0.5e-9F}, {3.0F}, {}, {}});
    EXPECT_EQ(Filtered<float>(oByConstant, Floats{{1.0F}}), (Floats{{3.0F}}));
    EXPECT_EQ(oByConstant.GetARIMin(), kGreatest);
    EXPECT_EQ(oByConstant.GetARIMax(), -kGreatest);
}

TEST(FilterARI, NeverScalesOrCountsADivisionByZero)
{
    const FilterARI oFilter = MakeFilter({{4}, {}, {500.0F}, {3}, {0.0F, 10.0F, 0.0F, 100.0F}});
    EXPECT_EQ(Filtered<float>(oFilter, Floats{{8.0F, 2.0F, 8.0F, 0.0F}}, 2),
              (Floats{{40.0F, 500.0F}}));
    EXPECT_EQ(oFilter.GetARIMin(), 4.0F);
    EXPECT_EQ(oFilter.GetARIMax(), 4.0F);
}

TEST(FilterARI, ScalesTheRangeOfTheResultsToThatOfTheOutput)
{
    const FilterARI oFilter = MakeFilter({{1}, {0.0F}, {}, {3}, {10.0F, 20.0F, 100.0F, 200.0F}});
    EXPECT_EQ(Filtered<float>(oFilter, Floats{{10.0F, 12.5F, 20.0F, 9.0F, 30.0F}}),
              (Floats{{100.0F, 125.0F, 200.0F, 100.0F, 200.0F}}));
    EXPECT_EQ(oFilter.GetARIMin(), 9.0F);
    EXPECT_EQ(oFilter.GetARIMax(), 30.0F);
}

TEST(FilterARI, ScalesByOneWhereTheRangeIsEmpty)
{
    for (const float fMax : {10.0F, 9.0F, std::nanf("")})
    {
        const FilterARI oFilter = MakeFilter({{1}, {0.0F}, {}, {3}, {10.0F, fMax, 100.0F, 200.0F}});
        EXPECT_EQ(Filtered<float>(oFilter, Floats{{10.0F, 12.5F}}), (Floats{{100.0F, 102.5F}}));
    }
}

// With the low limit above the high one, both are applied in turn.
TEST(FilterARI, AppliesTheLowLimitBeforeTheHighOne)
{
    const FilterARI oFilter = MakeFilter({{1}, {0.0F}, {}, {3}, {0.0F, 0.0F, 50.0F, 20.0F}});
    EXPECT_EQ(Filtered<float>(oFilter, Floats{{-80.0F, 0.0F, 90.0F}}),
              (Floats{{20.0F, 20.0F, 20.0F}}));
}

TEST(FilterARI, AStatisticsRunCopiesTheFirstChannelAndCollectsTheExtremes)
{
    const FilterARI oFilter = MakeFilter({{3}, {}, {}, {2}, {}});
    EXPECT_EQ(Filtered<std::uint8_t>(oFilter, Floats{{-3.0F, 4.0F, 2.5F, 4.0F, 300.0F, 2.0F}}, 2),
              (Bytes{{0, 3, 255}}));
    EXPECT_EQ(oFilter.GetARIMin(), -12.0F);
    EXPECT_EQ(oFilter.GetARIMax(), 600.0F);
    // Converted directly, not by way of float.
    EXPECT_EQ(Filtered<double>(MakeFilter({{1}, {}, {}, {2}, {}}), Image<int>{{16777217}}),
              (Image<double>{{16777217.0}}));
}

TEST(FilterARI, KeepsTheOutputOfMaskedPixels)
{
    const FilterARI oFilter = MakeFilter({{1}, {1.0F}, {}, {}, {}});
    const auto poIn = RasterOf(Bytes{{1, 250, 3}, {0, 5, 6}});
    const auto poOut = RasterOf(Bytes{{77, 78, 79}, {80, 81, 82}});
    oFilter.Process(poIn.get(), MaskOf({{1, 0, 1}, {0, 1, 0}}).get(), poOut.get());
    EXPECT_EQ(ImageOf<std::uint8_t>(*poOut), (Bytes{{2, 78, 4}, {80, 6, 82}}));
    EXPECT_EQ(oFilter.GetARIMin(), 2.0F);
    EXPECT_EQ(oFilter.GetARIMax(), 6.0F);
}

TEST(FilterARI, AnUnknownOperatorGivesZerosThatCount)
{
    const FilterARI oFilter = MakeFilter({{7}, {5.0F}, {}, {}, {}});
    EXPECT_EQ(Filtered<float>(oFilter, Floats{{3.0F, 4.0F}}), (Floats{{0.0F, 0.0F}}));
    EXPECT_EQ(oFilter.GetARIMin(), 0.0F);
    EXPECT_EQ(oFilter.GetARIMax(), 0.0F);
    const FilterARI oUnseen = MakeFilter({{0}, {}, {}, {}, {}});
    Filtered<float>(oUnseen, Floats{{3.0F}}, 1, MaskOf({{0}}).get());
    EXPECT_EQ(oUnseen.GetARIMin(), kGreatest);
}

// 0, then (0 - 0) * 2 + 1 = 1, then 3, then 7; the last pixel would be 15 but ends at 10.
TEST(FilterARI, AnUnknownOperatorScalesTheFormerResultAgain)
{
    const FilterARI oFilter = MakeFilter({{9}, {}, {}, {3}, {0.0F, 4.5F, 1.0F, 10.0F}});
    EXPECT_EQ(Filtered<float>(oFilter, Floats{{0, 0, 0}, {0, 0, 0}}, 1,
                              MaskOf({{1, 1, 0}, {1, 0, 1}}).get())
                  .Samples()[3],
              7.0F);
    EXPECT_EQ(oFilter.GetARIMin(), 0.0F);
    EXPECT_EQ(oFilter.GetARIMax(), 7.0F);
    EXPECT_EQ(Filtered<float>(oFilter, Floats{{0, 0, 0, 0}}), (Floats{{1, 3, 7, 10}}));
}

TEST(FilterARI, ReadsZeroWhereAParameterListIsTooShort)
{
    EXPECT_EQ(Filtered<float>(FilterARI(), Floats{{3.0F}}), (Floats{{0.0F}}));
    EXPECT_EQ(Filtered<float>(MakeFilter({{1}, {}, {}, {}, {}}), Floats{{3.0F}}), (Floats{{3.0F}}));
    EXPECT_EQ(Filtered<float>(MakeFilter({{4}, {}, {}, {}, {}}), Floats{{3.0F}}), (Floats{{0.0F}}));
    // From 0, factor 1, low and high 0.
    EXPECT_EQ(Filtered<float>(MakeFilter({{1}, {}, {}, {3}, {}}), Floats{{3.0F}}),
              (Floats{{0.0F}}));
    EXPECT_EQ(Filtered<float>(MakeFilter({{1}, {}, {}, {3}, {0.0F, 5.0F}}), Floats{{3.0F}}),
              (Floats{{0.0F}}));
}

TEST(FilterARI, StoresByTheRulesOfEveryConversion)
{
    const FilterARI oFilter = MakeFilter({{1}, {}, {}, {}, {}});
    const Floats oImage = {{2.5F, -2.5F, 254.6F, -0.7F, std::nanf(""), kInfinity}};
    EXPECT_EQ(Filtered<char>(oFilter, oImage), (Image<char>{{3, -3, 127, -1, 0, 127}}));
    EXPECT_EQ(Filtered<std::uint8_t>(oFilter, oImage), (Bytes{{3, 0, 255, 0, 0, 255}}));
    EXPECT_EQ(Filtered<int64>(oFilter, oImage),
              (Image<int64>{{2, 0, 254, 0, 0, std::numeric_limits<int64>::max()}}));
}

TEST(FilterARI, ExtremesAddUpOverBlocksAsLongAsTheTypesStay)
{
    FilterARI oFilter = MakeFilter({{1}, {}, {}, {}, {}});
    Filtered<float>(oFilter, Floats{{3.0F, 5.0F}});
    Filtered<float>(oFilter, Floats{{-2.0F, 4.0F}});
    EXPECT_EQ(oFilter.GetARIMin(), -2.0F);
    EXPECT_EQ(oFilter.GetARIMax(), 5.0F);
    oFilter.SetConst({100.0F});
    EXPECT_EQ(Filtered<float>(oFilter, Floats{{1.0F}}), (Floats{{1.0F}}));
    EXPECT_EQ(Filtered<double>(oFilter, Floats{{1.0F}}), (Image<double>{{101.0}}));
    EXPECT_EQ(oFilter.GetARIMin(), 101.0F);
    EXPECT_EQ(oFilter.GetARIMax(), 101.0F);
}

// Zeros of both signs are equal, so the first one stays, as in a loop over the pixels.
TEST(FilterARI, TheFirstOfZerosOfBothSignsIsTheExtreme)
{
    const auto oExtremes = [](const std::vector<float>& vfSamples)
    {
        const FilterARI oFilter = MakeFilter({{2}, {}, {}, {3}, {0.0F, 1.0F, 3.0F, 4.0F}});
        Filtered<float>(oFilter, Floats(vfSamples.size(), vfSamples));
        return std::make_pair(oFilter.GetARIMin(), oFilter.GetARIMax());
    };
    std::vector<float> vfSamples(48, -1.0F);
    vfSamples[17] = -0.0F;
    vfSamples[18] = 0.0F;
    EXPECT_TRUE(std::signbit(oExtremes(vfSamples).second));
    std::swap(vfSamples[17], vfSamples[18]);
    EXPECT_FALSE(std::signbit(oExtremes(vfSamples).second));
    for (float& fSample : vfSamples)
    {
        fSample = -fSample;
    }
    EXPECT_TRUE(std::signbit(oExtremes(vfSamples).first));
    EXPECT_EQ(oExtremes(vfSamples).first, 0.0F);
}

TEST(FilterARI, IgnoresValuesThatNoFiniteExtremeExceeds)
{
    const FilterARI oFilter = MakeFilter({{1}, {}, {}, {}, {}});
    Filtered<float>(oFilter, Floats{{std::nanf(""), kGreatest, -kGreatest}});
    EXPECT_EQ(oFilter.GetARIMin(), -kGreatest);
    EXPECT_EQ(oFilter.GetARIMax(), kGreatest);
    Filtered<float>(oFilter, Floats{{kInfinity, -kInfinity}});
    EXPECT_EQ(oFilter.GetARIMin(), -kInfinity);
    EXPECT_EQ(oFilter.GetARIMax(), kInfinity);
}

TEST(FilterARI, SeesComplexSamplesAsTheirMagnitude)
{
    const auto poIn = BlankRaster(2, 1, 1, tessel::eDT_C32R);
    const float afIn[] = {3.0F, 4.0F, 0.0F, -2.0F};
    std::memcpy(poIn->mpBuffer, afIn, sizeof(afIn));
    const auto poOut = BlankRaster(2, 1, 1, tessel::eDT_16S);
    MakeFilter({{1}, {1.0F}, {}, {}, {}}).Process(poIn.get(), nullptr, poOut.get());
    EXPECT_EQ(ImageOf<short>(*poOut), (Image<short>{{6, 3}}));
}

TEST(FilterARI, WritesTheFirstOfSeveralOutputChannels)
{
    const auto poIn = RasterOf(Bytes{{1, 2, 3, 4}}, {}, 2);
    const auto poOut = RasterOf(Image<short>{{7, 7, 7, 7, 7, 7}}, {}, 3);
    MakeFilter({{1}, {}, {}, {}, {}}).Process(poIn.get(), nullptr, poOut.get());
    EXPECT_EQ(ImageOf<short>(*poOut), (Image<short>{{3, 7, 7, 7, 7, 7}}));
}

/// The whole filter, literally: pixel by pixel.
template <class TIn, class TOut>
void FilterByDefinition(const Parameters& o, const Raster& oIn, const Mask* poMask,
                        const Raster& oOut, float& fMin, float& fMax)
{
    const bool bTwo = oIn.mnChannels != 1;
    const float c = o.mvfConst[0];
    float v = 0.0F;
    float fFactor = 1.0F;
    if (o.mvnAutoScale[0] == 3 && o.mvfRVal[1] - o.mvfRVal[0] > 0.0F)
    {
        fFactor = (o.mvfRVal[3] - o.mvfRVal[2]) / (o.mvfRVal[1] - o.mvfRVal[0]);
    }
    const auto oInt = [](float f) {
        return f >= -0x1p31F && f < 0x1p31F ? static_cast<int>(f) : std::numeric_limits<int>::min();
    };
    for (std::uint32_t y = 0; y < oIn.mnHeight; ++y)
    {
        for (std::uint32_t x = 0; x < oIn.mnWidth; ++x)
        {
            if (!IsValid(poMask, x, y))
            {
                continue;
            }
            const TIn* pIn = oIn.GetPixelAs<TIn>(x, y);
            const float x0 = ReferenceSample<TIn, float>(pIn[0]);
            const float x1 = bTwo ? ReferenceSample<TIn, float>(pIn[1]) : 0.0F;
            const double dfDivisor = bTwo ? x1 : c;
            bool bWithStats = true;
            switch (o.mvnOper[0])
            {
                case 1:
                    v = bTwo ? x1 + x0 + c : c + x0;
                    break;
                case 2:
                    v = bTwo ? x0 - x1 - c : x0 - c;
                    break;
                case 3:
                    v = bTwo ? x1 * x0 : c * x0;
                    break;
                case 4:
                    bWithStats = !(dfDivisor > -1e-09 && dfDivisor < 1e-09);
                    v = !bWithStats ? o.mvfZeroDiv[0] : bTwo ? x0 / x1 : x0 / c;
                    break;
                case 5:
                    v = static_cast<float>(oInt(bTwo ? x1 : c) & oInt(x0));
                    break;
                case 6:
                    v = static_cast<float>(oInt(bTwo ? x1 : c) | oInt(x0));
                    break;
                default:
                    break;
            }
            if (bWithStats)
            {
                fMax = v > fMax ? v : fMax;
                fMin = fMin > v ? v : fMin;
            }
            if (o.mvnAutoScale[0] == 3 && bWithStats)
            {
                v = (v - o.mvfRVal[0]) * fFactor + o.mvfRVal[2];
                v = o.mvfRVal[2] > v ? o.mvfRVal[2] : v;
                v = v > o.mvfRVal[3] ? o.mvfRVal[3] : v;
            }
            *oOut.GetPixelAs<TOut>(x, y) = o.mvnAutoScale[0] == 2
                                               ? ReferenceSample<TIn, TOut>(pIn[0])
                                               : ReferenceSample<float, TOut>(v);
        }
    }
}

template <class TIn, class TOut>
void ExpectDefinition(const Parameters& oParameters, std::uint32_t nWidth, std::uint32_t nHeight,
                      std::uint32_t nChannels, Random& oRandom)
{
    const FilterARI oFilter = MakeFilter(oParameters);
    float fMin = kGreatest;
    float fMax = -kGreatest;
    const auto poMask = RandomMask(nWidth, nHeight, Margins{2, 1}, 0.6, oRandom);
    for (Mask* const poEachMask : {static_cast<Mask*>(nullptr), poMask.get()})
    {
        const auto poIn =
            RandomRaster(nWidth, nHeight, nChannels, typedispatch::RealDataType<TIn>(),
                         Margins{2, 1}, Samples::Special, oRandom);
        const auto oType = typedispatch::RealDataType<TOut>();
        const auto poOut = BlankRaster(nWidth, nHeight, 1, oType, Margins{1, 3});
        const auto poExpected = BlankRaster(nWidth, nHeight, 1, oType, Margins{1, 3});
        oFilter.Process(poIn.get(), poEachMask, poOut.get());
        FilterByDefinition<TIn, TOut>(oParameters, *poIn, poEachMask, *poExpected, fMin, fMax);
        ASSERT_TRUE(SameBits(*poOut, *poExpected))
            << "operator " << oParameters.mvnOper[0] << ", scaling " << oParameters.mvnAutoScale[0]
            << ", " << nChannels << " channels of type " << typedispatch::ElementPosition<TIn>();
        ASSERT_TRUE(SameSample(oFilter.GetARIMin(), fMin)) << oFilter.GetARIMin() << ' ' << fMin;
        ASSERT_TRUE(SameSample(oFilter.GetARIMax(), fMax)) << oFilter.GetARIMax() << ' ' << fMax;
    }
}

// All operators and modes on one pair of types; the pairs are left to the next test.
TEST(FilterARI, GivesTheBitsOfTheDefinition)
{
    Random oRandom(12);
    for (unsigned int nOper = 0; nOper <= 7; ++nOper)
    {
        for (const unsigned int nScale : {1U, 2U, 3U})
        {
            for (const std::uint32_t nChannels : {1U, 2U, 3U, 4U, 7U})
            {
                const Parameters oParameters = {
                    {nOper}, {12.5F}, {-9.0F}, {nScale}, {-500.0F, 700.0F, 3.0F, 250.0F}};
                ExpectDefinition<float, float>(oParameters, 37, 5, nChannels, oRandom);
                ExpectDefinition<double, short>(oParameters, 1, 9, nChannels, oRandom);
                ExpectDefinition<float, float>(oParameters, 1056, 2, nChannels, oRandom);
                ExpectDefinition<unsigned char, float>(oParameters, 2100, 1, nChannels, oRandom);
            }
        }
    }
}

// Whole vectors of floats are worked on where they lie, in place as well.
TEST(FilterARI, WorksInPlace)
{
    Random oRandom(17);
    for (const std::uint32_t nWidth : {16U, 1024U, 1040U, 1050U})
    {
        const Parameters oParameters = {{2}, {2.5F}, {}, {3}, {-500.0F, 700.0F, 0.0F, 250.0F}};
        const FilterARI oFilter = MakeFilter(oParameters);
        const auto poRaster =
            RandomRaster(nWidth, 3, 1, tessel::eDT_32R, Margins{1, 1}, Samples::Special, oRandom);
        const auto poExpected = BlankRaster(nWidth, 3, 1, tessel::eDT_32R, Margins{1, 1});
        std::memcpy(poExpected->mpBuffer, poRaster->mpBuffer, poRaster->mnBufferSize);
        *poRaster->GetPixelAs<float>(3, 1) = 2.5F;  // a zero among the results
        float fMin = kGreatest;
        float fMax = -kGreatest;
        FilterByDefinition<float, float>(oParameters, *poRaster, nullptr, *poExpected, fMin, fMax);
        oFilter.Process(poRaster.get(), nullptr, poRaster.get());
        EXPECT_TRUE(SameBits(*poRaster, *poExpected)) << nWidth;
        EXPECT_TRUE(SameSample(oFilter.GetARIMin(), fMin));
        EXPECT_TRUE(SameSample(oFilter.GetARIMax(), fMax));
    }
}

TEST(FilterARI, WorksOnAllPairsOfTypesByTheDefinition)
{
    Random oRandom(13);
    unsigned int nRound = 0;
    const auto oPair = [&]<class TIn, class TOut>()
    {
        for (const unsigned int nScale : {1U, 2U, 3U})
        {
            ++nRound;
            const Parameters oParameters = {
                {nRound % 7}, {1.5F}, {-9.0F}, {nScale}, {-1e9F, 1e9F, -300.0F, 300.0F}};
            ExpectDefinition<TIn, TOut>(oParameters, 37, 3, nRound % 4 + 1, oRandom);
        }
    };
    ForEachElementType(
        [&]<class TIn>()
        { ForEachElementType([&]<class TOut>() { oPair.template operator()<TIn, TOut>(); }); });
}

TEST(FilterARI, TakesBlocksWithoutPixelsOrChannels)
{
    const FilterARI oFilter = MakeFilter({{1}, {2.5F}, {}, {}, {}});
    const auto poOut = BlankRaster(0, 3, 1, tessel::eDT_8U, Margins{1, 1});
    oFilter.Process(BlankRaster(0, 3, 1, tessel::eDT_8U).get(), nullptr, poOut.get());
    EXPECT_TRUE(SameBits(*poOut, *BlankRaster(0, 3, 1, tessel::eDT_8U, Margins{1, 1})));
    EXPECT_EQ(oFilter.GetARIMin(), kGreatest);
    // Channels that are not there read 0.
    const auto poNone = BlankRaster(2, 1, 0, tessel::eDT_8U);
    const auto poFloat = BlankRaster(2, 1, 1, tessel::eDT_32R);
    oFilter.Process(poNone.get(), nullptr, poFloat.get());
    EXPECT_EQ(ImageOf<float>(*poFloat), (Floats{{2.5F, 2.5F}}));
    oFilter.Process(poFloat.get(), nullptr, poNone.get());
}

/// The exception of a call.
std::optional<Exception> ErrorOf(Raster* poIn, Raster* poOut)
{
    try
    {
        FilterARI().Process(poIn, nullptr, poOut);
    }
    catch (const Exception& oError)
    {
        return oError;
    }
    return std::nullopt;
}

void ExpectError(const std::optional<Exception>& oError, const std::string& oMessage)
{
    ASSERT_TRUE(oError);
    EXPECT_EQ(oError->GetMessage(), oMessage);
    EXPECT_EQ(oError->GetFile(), "processes/qrdfilters/filterari");
    EXPECT_NE(oError->GetFunction().find("FilterARI::Process("), std::string::npos);
    EXPECT_NE(oError->GetLine(), 0U);
}

TEST(FilterARI, RefusesWhatItCannotWorkOn)
{
    const auto poReal = BlankRaster(8, 1, 1, tessel::eDT_8U);
    const auto poComplex = BlankRaster(8, 1, 1, tessel::eDT_C32R);
    ExpectError(ErrorOf(nullptr, nullptr), "poRasterIn is invalid pointer");
    ExpectError(ErrorOf(poReal.get(), nullptr), "poRasterOut is invalid pointer");
    ExpectError(ErrorOf(poReal.get(), poComplex.get()), "Output cannot be complex for ARI");
    const auto oBits = ErrorOf(BlankRaster(8, 1, 1, tessel::eDT_BIT).get(), poReal.get());
    ASSERT_TRUE(oBits);
    EXPECT_EQ(oBits->GetMessage(), "Invalid type requested.");
    EXPECT_EQ(*poReal->mpBuffer, 0xA5);
}

TEST(FilterARI, HardenedBuildsRefuseBlocksThatDoNotMatch)
{
    if (!kHardened)
    {
        GTEST_SKIP() << "these builds trust the caller";
    }
    EXPECT_TRUE(ErrorOf(BlankRaster(4, 4, 1, tessel::eDT_8U).get(),
                        BlankRaster(4, 3, 1, tessel::eDT_8U).get()));
}

TEST(ARIAlgorithm, AsksForValuesFirst)
{
    const auto poOut = BlankRaster(2, 1, 1, tessel::eDT_8U);
    AboveMaskBuilder oBuilder(0);
    ARIAlgorithm oAlgorithm;
    oAlgorithm.SetMaskBuilder(&oBuilder);
    EXPECT_EQ(oAlgorithm.GetMinVal(), kGreatest);
    EXPECT_EQ(oAlgorithm.GetMaxVal(), -kGreatest);
    try
    {
        oAlgorithm.ProcessBlock(poOut.get(), poOut.get());
        FAIL() << "nothing was thrown";
    }
    catch (const Exception& oError)
    {
        EXPECT_EQ(oError.GetMessage(), "You have to Set the values before calling Process.");
        EXPECT_EQ(oError.GetFile(), "processes/qrdfilters/filterari");
        EXPECT_NE(oError.GetFunction().find("ARIAlgorithm::ProcessBlock("), std::string::npos);
    }
    EXPECT_THROW(oAlgorithm.Process(poOut.get(), nullptr, poOut.get()), Exception);
    EXPECT_EQ(oBuilder.mnCalls, 0);
    oAlgorithm.SetValues({1}, {}, {}, {}, {});
    EXPECT_THROW(oAlgorithm.ProcessBlock(nullptr, poOut.get()), Exception);
    EXPECT_EQ(oBuilder.mnCalls, 0);
}

TEST(ARIAlgorithm, LeavesOutWhatItsBuilderMasks)
{
    const auto poIn = RasterOf(Bytes{{1, 9, 2, 8}});
    const auto poOut = RasterOf(Bytes{{0, 0, 0, 0}});
    AboveMaskBuilder oBuilder(5);
    ARIAlgorithm oAlgorithm;
    oAlgorithm.SetMaskBuilder(&oBuilder);
    oAlgorithm.SetValues({1}, {10}, {}, {}, {});
    oAlgorithm.ProcessBlock(poIn.get(), poOut.get());
    EXPECT_EQ(ImageOf<std::uint8_t>(*poOut), (Bytes{{0, 19, 0, 18}}));
    EXPECT_EQ(oAlgorithm.GetMinVal(), 18.0F);
    EXPECT_EQ(oAlgorithm.GetMaxVal(), 19.0F);
    oAlgorithm.SetValues({1}, {0}, {}, {}, {});
    EXPECT_EQ(oAlgorithm.GetMaxVal(), -kGreatest);
}

// Two runs of the driver, the first of which writes nothing: the differences -3 to 6 of two
// channels become 0 to 90.
TEST(ARIAlgorithm, ScalesAnImageByTwoRunsOfTheDriver)
{
    MemoryDataset oFrom(5, 2, {tessel::eDT_8U, tessel::eDT_8U});
    MemoryDataset oTo(5, 2, {tessel::eDT_8U});
    for (std::size_t i = 0; i < 10; ++i)
    {
        oFrom.Sample<std::uint8_t>(1, i % 5, i / 5) = static_cast<std::uint8_t>(i);
        oFrom.Sample<std::uint8_t>(2, i % 5, i / 5) = 3;
    }
    datasources::BasicReader oReader(&oFrom, {1, 2});
    datasources::BasicWriter oWriter(&oTo, {1});
    parallelio::FilterIODriver<ARIAlgorithm> oDriver;
    oDriver.SetMemoryBudget(32);  // strips of one row
    oDriver.SetValues({2}, {0.0F}, {}, {2}, {});
    oDriver.Run(&oReader, nullptr);
    EXPECT_EQ(oDriver.GetMinVal(), -3.0F);
    EXPECT_EQ(oDriver.GetMaxVal(), 6.0F);
    oDriver.SetValues({2}, {0.0F}, {}, {3},
                      {oDriver.GetMinVal(), oDriver.GetMaxVal(), 0.0F, 90.0F});
    oDriver.Run(&oReader, &oWriter);
    for (std::size_t i = 0; i < 10; ++i)
    {
        EXPECT_EQ(oTo.Sample<std::uint8_t>(1, i % 5, i / 5), 10 * i);
    }
}

// Blocks of one row, the memory of which is used again: only what was preloaded tells what the file
// holds.
TEST(ARIAlgorithm, KeepsWhatAFileHoldsWhereItsBuilderMasks)
{
    const TemporaryDirectory oFolder;
    const Kordsk poFile = NewKordsk(oFolder.File("image.kordsk"));
    poFile->CreateChannels({3, 4, 1, tessel::eDT_8U});
    poFile->CreateChannels({3, 4, 1, tessel::eDT_16S});
    datasources::BasicWriter(poFile.get(), {1})
        .WriteRaster(RasterOf(Bytes{{1, 9, 2}, {8, 3, 7}, {4, 5, 6}, {0, 0, 9}}).get());
    datasources::BasicWriter oWriter(poFile.get(), {2});
    oWriter.WriteRaster(
        RasterOf(Image<short>{{-1, -2, -3}, {-4, -5, -6}, {-7, -8, -9}, {-10, -11, -12}}).get());

    datasources::BasicReader oReader(poFile.get(), {1});
    AboveMaskBuilder oBuilder(5);
    parallelio::FilterIODriver<ARIAlgorithm> oDriver;
    oDriver.SetMemoryBudget(32);
    oDriver.SetMaskBuilder(&oBuilder);
    oDriver.SetPreloadOutput(true);
    oDriver.SetValues({3}, {100.0F}, {}, {}, {});
    oDriver.Run(&oReader, &oWriter);
    EXPECT_EQ(ImageOf<short>(*ReadBlock(*poFile, {2}, {3, 4, 1, tessel::eDT_16S})),
              (Image<short>{{-1, 900, -3}, {800, -5, 700}, {-7, -8, 600}, {-10, -11, 900}}));
    EXPECT_EQ(oDriver.GetMinVal(), 600.0F);
    EXPECT_EQ(oDriver.GetMaxVal(), 900.0F);
}

}  // namespace
}  // namespace kor::filters
