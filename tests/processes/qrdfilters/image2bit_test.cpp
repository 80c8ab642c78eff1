#include "processes/qrdfilters/image2bit.h"

#include <gtest/gtest.h>

#include <cmath>
#include <limits>
#include <optional>
#include <string>

#include "platform/exception/exception.h"
#include "processes/qrdfilters/hardened.h"
#include "processes/qrdfilters/parallelio/filteralgorithm.h"
#include "tests/support/conversionreference.h"
#include "tests/support/kordskfiles.h"
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

constexpr float kInfinity = std::numeric_limits<float>::infinity();

ImageToBit MakeFilter(const std::vector<float>& vfThresholds, bool bCompMode = true)
{
    ImageToBit oFilter;
    oFilter.SetThreshold(vfThresholds);
    oFilter.SetCompMode(bCompMode);
    return oFilter;
}

template <class TOut, class TIn>
Image<TOut> Filtered(const ImageToBit& oFilter, const Image<TIn>& oImage,
                     std::uint32_t nChannels = 1, Mask* poMask = nullptr)
{
    const auto poIn = RasterOf(oImage, {}, nChannels);
    const auto poOut = BlankRaster(poIn->mnWidth, poIn->mnHeight, nChannels,
                                   typedispatch::RealDataType<TOut>(), Margins{1, 2});
    oFilter.Process(poIn.get(), poMask, poOut.get());
    return ImageOf<TOut>(*poOut);
}

/// The flags of complex samples, drawn as real and imaginary parts side by side.
template <class T>
Bytes OfComplex(const ImageToBit& oFilter, const std::vector<T>& vParts)
{
    const auto nSamples = static_cast<std::uint32_t>(vParts.size() / 2);
    const auto poIn = BlankRaster(nSamples, 1, 1, typedispatch::ComplexDataType<T>());
    std::memcpy(poIn->mpBuffer, vParts.data(), vParts.size() * sizeof(T));
    const auto poOut = BlankRaster(nSamples, 1, 1, tessel::eDT_8U);
    oFilter.Process(poIn.get(), nullptr, poOut.get());
    return ImageOf<std::uint8_t>(*poOut);
}

TEST(ImageToBit, OneThresholdGivesOneBelowIt)
{
    EXPECT_EQ(Filtered<std::uint8_t>(MakeFilter({100}), Bytes{{99, 100, 101}}), (Bytes{{1, 0, 0}}));
    EXPECT_EQ(Filtered<std::uint8_t>(MakeFilter({100}, false), Bytes{{99, 100, 101}}),
              (Bytes{{0, 1, 1}}));
}

TEST(ImageToBit, TwoThresholdsGiveOneOutsideOrInside)
{
    const Bytes oImage = {{9, 10, 15, 20, 25}};
    EXPECT_EQ(Filtered<std::uint8_t>(MakeFilter({10, 20}), oImage), (Bytes{{1, 1, 0, 1, 1}}));
    EXPECT_EQ(Filtered<std::uint8_t>(MakeFilter({10, 20}, false), oImage),
              (Bytes{{0, 1, 1, 1, 0}}));
}

// Real and complex samples have opposite sides of one threshold, which is meant.
TEST(ImageToBit, OneThresholdGivesOneAboveItForComplexSamples)
{
    const std::vector<float> vfParts = {3.0F, 4.0F, 5.0F, std::sqrt(5.0F),
                                        0.0F, 1.0F};  // 25, 30, 1
    EXPECT_EQ(OfComplex(MakeFilter({25}), vfParts), (Bytes{{0, 1, 0}}));
    EXPECT_EQ(OfComplex(MakeFilter({25}, false), vfParts), (Bytes{{1, 0, 1}}));
    EXPECT_EQ(Filtered<std::uint8_t>(MakeFilter({25}), Floats{{25.0F, 30.0F, 1.0F}}),
              (Bytes{{0, 0, 1}}));
}

// The interval between two is open for complex samples and closed for real ones, which is meant.
TEST(ImageToBit, TwoThresholdsAreOpenInsideForComplexSamples)
{
    const std::vector<float> vfParts = {3.0F, 4.0F, 5.0F, 1.0F, 0.0F, std::sqrt(30.25F)};
    EXPECT_EQ(OfComplex(MakeFilter({25, 30.25F}, false), vfParts), (Bytes{{0, 1, 0}}));
    EXPECT_EQ(OfComplex(MakeFilter({25, 30.25F}, true), vfParts), (Bytes{{1, 0, 1}}));
    EXPECT_EQ(Filtered<std::uint8_t>(MakeFilter({25, 30.25F}, false), Floats{{25, 26, 30.25F}}),
              (Bytes{{1, 1, 1}}));
}

TEST(ImageToBit, IgnoresAThirdThreshold)
{
    EXPECT_EQ(Filtered<std::uint8_t>(MakeFilter({1, 2, 3}, false), Image<short>{{0, 1, 2, 3}}),
              (Bytes{{0, 1, 1, 0}}));
}

TEST(ImageToBit, TakesNoThresholdAsOneOfZero)
{
    EXPECT_EQ(Filtered<std::uint8_t>(ImageToBit(), Image<short>{{-1, 0, 1}}), (Bytes{{1, 0, 0}}));
    EXPECT_EQ(Filtered<std::uint8_t>(MakeFilter({}, false), Floats{{-1.0F, -0.0F, 1.0F}}),
              (Bytes{{0, 1, 1}}));
}

TEST(ImageToBit, MaskedPixelsAreZeroInEveryMode)
{
    const auto poMask = MaskOf({{0, 1, 0}});
    for (const bool bCompMode : {false, true})
    {
        EXPECT_EQ(Filtered<std::uint8_t>(MakeFilter({-1, 1}, bCompMode), Bytes{{0, 0, 9}}, 1,
                                         poMask.get()),
                  (Bytes{{0, static_cast<std::uint8_t>(bCompMode ? 0 : 1), 0}}));
    }
    EXPECT_EQ(Filtered<short>(MakeFilter({5}), Bytes{{1, 9, 1, 9, 1, 9}}, 2, poMask.get()),
              (Image<short>{{0, 0, 1, 0, 0, 0}}));
}

TEST(ImageToBit, WritesOnesOfTheOutputsType)
{
    const Bytes oImage = {{1, 9}};
    EXPECT_EQ(Filtered<float>(MakeFilter({5}), oImage), (Floats{{1.0F, 0.0F}}));
    EXPECT_EQ(Filtered<double>(MakeFilter({5}), oImage), (Image<double>{{1.0, 0.0}}));
    EXPECT_EQ(Filtered<int64>(MakeFilter({5}), oImage), (Image<int64>{{1, 0}}));
    EXPECT_EQ(Filtered<uint64>(MakeFilter({5}), oImage), (Image<uint64>{{1, 0}}));
    EXPECT_EQ(Filtered<char>(MakeFilter({5}), oImage), (Image<char>{{1, 0}}));
}

TEST(ImageToBit, ComparesInSinglePrecision)
{
    const Image<int> oImage = {{16777216, 16777217, 16777218}};
    EXPECT_EQ(Filtered<std::uint8_t>(MakeFilter({16777216.0F, 16777216.0F}, false), oImage),
              (Bytes{{1, 1, 0}}));
    EXPECT_EQ(Filtered<std::uint8_t>(MakeFilter({0.1F}, false), Image<double>{{0.1, 0.0999}}),
              (Bytes{{1, 0}}));
    // Up to 2^63 - 2^38 - 1 the nearest float is below 2^63.
    const int64 nLast = 9223372036854775807 - (int64{1} << 38) - 1;
    EXPECT_EQ(Filtered<std::uint8_t>(MakeFilter({0x1p63F}),
                                     Image<int64>{{nLast, nLast + 2, 9223372036854775807}}),
              (Bytes{{1, 0, 0}}));
}

TEST(ImageToBit, NotANumberIsOnNeitherSide)
{
    const float fNaN = std::nanf("");
    for (const bool bCompMode : {false, true})
    {
        EXPECT_EQ(Filtered<std::uint8_t>(MakeFilter({5}, bCompMode), Floats{{fNaN}}), (Bytes{{0}}));
        EXPECT_EQ(Filtered<std::uint8_t>(MakeFilter({5, 6}, bCompMode), Floats{{fNaN}}),
                  (Bytes{{0}}));
        EXPECT_EQ(Filtered<std::uint8_t>(MakeFilter({fNaN}, bCompMode), Bytes{{0, 255}}),
                  (Bytes{{0, 0}}));
        EXPECT_EQ(OfComplex<float>(MakeFilter({5}, bCompMode), {fNaN, 1.0F}), (Bytes{{0}}));
    }
    EXPECT_EQ(Filtered<std::uint8_t>(MakeFilter({5, fNaN}), Bytes{{5, 6}}), (Bytes{{1, 0}}));
}

// No value lies above infinity: its neighbour must not take its place.
TEST(ImageToBit, TakesInfiniteThresholds)
{
    const std::vector<float> vfParts = {kInfinity, 0.0F, 1.0F, 0.0F};
    EXPECT_EQ(OfComplex(MakeFilter({kInfinity}), vfParts), (Bytes{{0, 0}}));
    EXPECT_EQ(OfComplex(MakeFilter({kInfinity}, false), vfParts), (Bytes{{1, 1}}));
    EXPECT_EQ(OfComplex(MakeFilter({-kInfinity, kInfinity}, false), vfParts), (Bytes{{0, 1}}));
    EXPECT_EQ(Filtered<std::uint8_t>(MakeFilter({-kInfinity}), Floats{{-kInfinity, 1.0F}}),
              (Bytes{{0, 0}}));
    EXPECT_EQ(Filtered<std::uint8_t>(MakeFilter({kInfinity}), Bytes{{0, 255}}), (Bytes{{1, 1}}));
    EXPECT_EQ(Filtered<std::uint8_t>(MakeFilter({-kInfinity}), Bytes{{0, 255}}), (Bytes{{0, 0}}));
}

// 200 * 200 + 200 * 200 is 80000, in 16 bits 14464; as signed 16 bits 14464 as well.
TEST(ImageToBit, SquaresOfIntegersWrapInTheirType)
{
    EXPECT_EQ(OfComplex<short>(MakeFilter({14463}), {200, 200}), (Bytes{{1}}));
    EXPECT_EQ(OfComplex<short>(MakeFilter({14464}), {200, 200}), (Bytes{{0}}));
    // 182 * 182 + 1 is 33125: -32411 in signed 16 bits.
    EXPECT_EQ(OfComplex<short>(MakeFilter({0}), {182, 1}), (Bytes{{0}}));
    EXPECT_EQ(OfComplex<unsigned short>(MakeFilter({0}), {182, 1}), (Bytes{{1}}));
    EXPECT_EQ(OfComplex<int>(MakeFilter({0}), {65536, 0}), (Bytes{{0}}));
    EXPECT_EQ(OfComplex<int64>(MakeFilter({4e9F}), {65536, 0}), (Bytes{{1}}));
}

TEST(ImageToBit, SquaresOfDoublesAreNarrowedAfterwards)
{
    // In single precision the square alone would be infinite, or 1.
    EXPECT_EQ(OfComplex<double>(MakeFilter({1e38F, 1.2e38F}, false), {1e19, 3e18}), (Bytes{{1}}));
    EXPECT_EQ(OfComplex<float>(MakeFilter({3e38F}), {2e19F, 0.0F}), (Bytes{{1}}));
}

// Neither the types nor the parameters are looked at again, which is meant.
TEST(ImageToBit, KeepsItsFirstProcessor)
{
    ImageToBit oFilter = MakeFilter({10});
    EXPECT_EQ(Filtered<std::uint8_t>(oFilter, Bytes{{9, 11}}), (Bytes{{1, 0}}));
    oFilter.SetThreshold({100});
    oFilter.SetCompMode(false);
    EXPECT_EQ(Filtered<std::uint8_t>(oFilter, Bytes{{9, 11}}), (Bytes{{1, 0}}));
    const ImageToBit oCopy(oFilter);
    EXPECT_EQ(Filtered<std::uint8_t>(oCopy, Bytes{{9, 11}}), (Bytes{{1, 0}}));
    // Samples of another type are taken for those of the first one.
    if (!kHardened)
    {
        EXPECT_EQ(Filtered<std::uint8_t>(oFilter, Image<char>{{-1, 5}}), (Bytes{{0, 1}}));
    }
}

TEST(ImageToBit, HardenedBuildsRefuseASecondPairOfTypes)
{
    if (!kHardened)
    {
        GTEST_SKIP() << "these builds trust the caller";
    }
    const ImageToBit oFilter = MakeFilter({10});
    Filtered<std::uint8_t>(oFilter, Bytes{{9, 11}});
    EXPECT_THROW(Filtered<std::uint8_t>(oFilter, Image<char>{{9}}), Exception);
    EXPECT_THROW(Filtered<short>(oFilter, Bytes{{9}}), Exception);
}

/// One sample by the table of the filter; im is null for real samples.
template <class T>
bool IsSet(const std::vector<float>& vfThresholds, bool bCompMode, const T* pSample, bool bComplex)
{
    T xCompared = *pSample;
    if (bComplex)
    {
        constexpr std::size_t kType = typedispatch::ElementPosition<T>();
        ReferenceIntensity(kType, kType)(pSample, &xCompared, 1);
    }
    const float v = ReferenceSample<T, float>(xCompared);
    const float T0 = vfThresholds[0];
    if (vfThresholds.size() == 1)
    {
        return bComplex ? (bCompMode ? v > T0 : v <= T0) : (bCompMode ? v < T0 : v >= T0);
    }
    const float T1 = vfThresholds[1];
    if (bCompMode)
    {
        return v <= T0 || v >= T1;
    }
    return bComplex ? v > T0 && v < T1 : v >= T0 && v <= T1;
}

template <class TIn, class TOut>
void FilterByDefinition(const std::vector<float>& vfThresholds, bool bCompMode, const Raster& oIn,
                        const Mask* poMask, const Raster& oOut)
{
    const bool bComplex = oIn.moDataType.mbComplex;
    for (std::uint32_t y = 0; y < oIn.mnHeight; ++y)
    {
        for (std::uint32_t x = 0; x < oIn.mnWidth; ++x)
        {
            for (std::uint32_t c = 0; c < oIn.mnChannels; ++c)
            {
                const TIn* pIn = oIn.GetPixelAs<TIn>(x, y) + (bComplex ? 2 * c : c);
                oOut.GetPixelAs<TOut>(x, y)[c] = static_cast<TOut>(
                    IsValid(poMask, x, y) && IsSet(vfThresholds, bCompMode, pIn, bComplex) ? 1 : 0);
            }
        }
    }
}

template <class TIn, class TOut>
void ExpectDefinition(const std::vector<float>& vfThresholds, bool bCompMode, bool bComplex,
                      std::uint32_t nChannels, Random& oRandom)
{
    const std::uint32_t nWidth = nChannels == 2 ? 1 : 37;
    const std::uint32_t nHeight = nChannels == 3 ? 1 : 3;
    const auto poIn = RandomRaster(
        nWidth, nHeight, nChannels,
        bComplex ? typedispatch::ComplexDataType<TIn>() : typedispatch::RealDataType<TIn>(),
        Margins{2, 1}, Samples::Special, oRandom);
    const auto poMask = RandomMask(nWidth, nHeight, Margins{2, 1}, 0.6, oRandom);
    const ImageToBit oFilter = MakeFilter(vfThresholds, bCompMode);
    for (Mask* const poEachMask : {static_cast<Mask*>(nullptr), poMask.get()})
    {
        const auto oType = typedispatch::RealDataType<TOut>();
        const auto poOut = BlankRaster(nWidth, nHeight, nChannels, oType, Margins{1, 3});
        const auto poExpected = BlankRaster(nWidth, nHeight, nChannels, oType, Margins{1, 3});
        oFilter.Process(poIn.get(), poEachMask, poOut.get());
        FilterByDefinition<TIn, TOut>(vfThresholds, bCompMode, *poIn, poEachMask, *poExpected);
        ASSERT_TRUE(SameBits(*poOut, *poExpected))
            << nChannels << (bComplex ? " complex" : " real") << " channels of type "
            << typedispatch::ElementPosition<TIn>() << ", " << vfThresholds.size()
            << " thresholds from " << vfThresholds[0];
    }
}

TEST(ImageToBit, WorksOnAllPairsOfTypesByTheDefinition)
{
    Random oRandom(14);
    std::uint32_t nRound = 0;
    const auto oPair = [&]<class TIn, class TOut>()
    {
        for (const bool bComplex : {false, true})
        {
            for (const bool bCompMode : {false, true})
            {
                const std::vector<float> vfThresholds =
                    nRound % 3 == 0 ? std::vector<float>{40.0F} : std::vector<float>{-50.5F, 60.0F};
                ExpectDefinition<TIn, TOut>(vfThresholds, bCompMode, bComplex, ++nRound % 5 + 1,
                                            oRandom);
            }
        }
    };
    ForEachElementType(
        [&]<class TIn>()
        { ForEachElementType([&]<class TOut>() { oPair.template operator()<TIn, TOut>(); }); });
}

// Thresholds at, between and beyond the values of each type, and thresholds the wrong way round.
TEST(ImageToBit, TakesThresholdsOfAnyKindForEveryType)
{
    Random oRandom(15);
    const std::vector<std::vector<float>> vvfThresholds = {
        {-1e30F},        {1e30F},           {-0.0F},
        {127.0F},        {-128.0F},         {65535.0F},
        {0x1p31F},       {-0x1p63F},        {0x1p64F},
        {0.5F},          {20, 10},          {0, 0},
        {-1e30F, 5},     {5, 1e30F},        {1e30F, 2e30F},
        {-1e30F, 1e30F}, {1e30F, -1e30F},   {-0x1p31F, 0x1p31F},
        {kInfinity},     {std::nanf(""), 3}};
    for (const auto& vfThresholds : vvfThresholds)
    {
        for (const bool bCompMode : {false, true})
        {
            ForEachElementType(
                [&]<class TIn>() {
                    ExpectDefinition<TIn, unsigned char>(vfThresholds, bCompMode, false, 1,
                                                         oRandom);
                });
        }
    }
}

TEST(ImageToBit, TakesWideRowsAndManyChannels)
{
    Random oRandom(16);
    for (const auto& [nWidth, nChannels] :
         {std::pair(9001U, 1U), std::pair(3000U, 3U), std::pair(2U, 5000U), std::pair(3U, 0U)})
    {
        for (const bool bComplex : {false, true})
        {
            const auto oType = bComplex ? tessel::eDT_C64R : tessel::eDT_64R;
            const auto poIn =
                RandomRaster(nWidth, 2, nChannels, oType, {}, Samples::Special, oRandom);
            const auto poMask = RandomMask(nWidth, 2, {}, 0.6, oRandom);
            const auto poOut = BlankRaster(nWidth, 2, nChannels, tessel::eDT_16S);
            const auto poExpected = BlankRaster(nWidth, 2, nChannels, tessel::eDT_16S);
            MakeFilter({3.5F}).Process(poIn.get(), poMask.get(), poOut.get());
            FilterByDefinition<double, short>({3.5F}, true, *poIn, poMask.get(), *poExpected);
            EXPECT_TRUE(SameBits(*poOut, *poExpected)) << nWidth << ' ' << nChannels;
        }
    }
}

// Each pixel begins where the output's own channels put it; a masked one is 0 in all of them.
TEST(ImageToBit, LeavesFurtherChannelsOfTheOutputAloneButForMaskedPixels)
{
    const auto poMask = MaskOf({{1, 1, 0}});
    const auto oFiltered =
        [](const Bytes& oImage, std::uint32_t nIn, std::uint32_t nOut, Mask* poBy)
    {
        const auto poIn = RasterOf(oImage, {}, nIn);
        const auto poOut =
            RasterOf(Image<short>(3 * nOut, std::vector<short>(3 * nOut, 7)), {}, nOut);
        MakeFilter({5}).Process(poIn.get(), poBy, poOut.get());
        return ImageOf<short>(*poOut);
    };
    EXPECT_EQ(oFiltered(Bytes{{1, 9, 1}}, 1, 3, nullptr),
              (Image<short>{{1, 7, 7, 0, 7, 7, 1, 7, 7}}));
    EXPECT_EQ(oFiltered(Bytes{{1, 9, 1}}, 1, 3, poMask.get()),
              (Image<short>{{1, 7, 7, 0, 7, 7, 0, 0, 0}}));
    EXPECT_EQ(oFiltered(Bytes{{1, 9, 9, 1, 1, 1}}, 2, 3, poMask.get()),
              (Image<short>{{1, 0, 7, 0, 1, 7, 0, 0, 0}}));
    EXPECT_EQ(oFiltered(Bytes{{1, 9, 9, 1, 1, 1}}, 2, 1, poMask.get()), (Image<short>{{1, 0, 0}}));
}

// Complex samples as they lie in the file: no view of them comes between.
TEST(ImageToBit, FiltersFilesOfRealAndComplexSamples)
{
    const TemporaryDirectory oFolder;
    const Kordsk poFile = NewKordsk(oFolder.File("image.kordsk"));
    poFile->CreateChannels({2, 2, 1, tessel::eDT_16U});
    poFile->CreateChannels({2, 2, 1, tessel::eDT_C16S});
    poFile->CreateChannels({2, 2, 2, tessel::eDT_8U});
    const auto poComplex = BlankRaster(2, 2, 1, tessel::eDT_C16S);
    const short anParts[] = {3, 4, 0, 6, -5, 0, 4, 4};  // 25, 36, 25, 32
    std::memcpy(poComplex->mpBuffer, anParts, sizeof(anParts));
    datasources::BasicWriter(poFile.get(), {1})
        .WriteRaster(RasterOf(Image<unsigned short>{{25, 36}, {24, 500}}).get());
    datasources::BasicWriter(poFile.get(), {2}).WriteRaster(poComplex.get());
    for (const unsigned int nChannel : {1U, 2U})
    {
        datasources::BasicReader oReader(poFile.get(), {nChannel});
        datasources::BasicWriter oWriter(poFile.get(), {nChannel + 2});
        parallelio::FilterDriver oDriver(parallelio::FilterAlgorithm(MakeFilter({25})));
        oDriver.SetMemoryBudget(16);  // blocks of one row
        oDriver.Run(&oReader, &oWriter);
    }
    const tessel::RasterInfo oSize(2, 2, 1, tessel::eDT_8U);
    EXPECT_EQ(ImageOf<std::uint8_t>(*ReadBlock(*poFile, {3}, oSize)), (Bytes{{0, 0}, {1, 0}}));
    EXPECT_EQ(ImageOf<std::uint8_t>(*ReadBlock(*poFile, {4}, oSize)), (Bytes{{0, 1}, {0, 1}}));
}

/// The exception of a call.
std::optional<Exception> ErrorOf(Raster* poIn, Raster* poOut)
{
    try
    {
        ImageToBit().Process(poIn, nullptr, poOut);
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
    EXPECT_EQ(oError->GetFile(), "processes/qrdfilters/image2bit");
    EXPECT_NE(oError->GetFunction().find("ImageToBit::Process("), std::string::npos);
    EXPECT_NE(oError->GetLine(), 0U);
}

TEST(ImageToBit, RefusesWhatItCannotWorkOn)
{
    const auto poReal = BlankRaster(8, 1, 1, tessel::eDT_8U);
    const auto poComplex = BlankRaster(8, 1, 1, tessel::eDT_C32R);
    ExpectError(ErrorOf(nullptr, nullptr), "poRasterIn is invalid pointer");
    ExpectError(ErrorOf(poReal.get(), nullptr), "poRasterOut is invalid pointer");
    ExpectError(ErrorOf(poReal.get(), poComplex.get()), "Output cannot be complex");
    const auto oBits = ErrorOf(BlankRaster(8, 1, 1, tessel::eDT_BIT).get(), poReal.get());
    ASSERT_TRUE(oBits);
    EXPECT_EQ(oBits->GetMessage(), "Invalid type requested.");
    EXPECT_EQ(*poReal->mpBuffer, 0xA5);
}

}  // namespace
}  // namespace kor::filters
