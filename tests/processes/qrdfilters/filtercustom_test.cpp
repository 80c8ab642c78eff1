#include "processes/qrdfilters/filtercustom.h"

#include <gtest/gtest.h>

#include <cmath>
#include <functional>
#include <limits>
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

FilterCustom CustomFilter(const std::vector<double>& vdfKernel, unsigned int nWidth,
                          unsigned int nHeight)
{
    FilterCustom oFilter;
    oFilter.SetKernel(vdfKernel, nWidth, nHeight);
    return oFilter;
}

/// The drawing, its outer rows and columns being the margins, filtered into samples of type TOut.
template <class TOut, class TIn>
Image<TOut> Filtered(const FilterCustom& oFilter, const Image<TIn>& oImage, Margins oMargins,
                     tessel::Mask* poMaskIn = nullptr, tessel::Mask* poMaskOut = nullptr,
                     std::uint32_t nChannels = 1)
{
    const auto poIn = RasterOf(oImage, oMargins, nChannels);
    const auto poOut =
        BlankRaster(poIn->mnWidth, poIn->mnHeight, nChannels, typedispatch::RealDataType<TOut>());
    oFilter.Process(poIn.get(), poMaskIn, poOut.get(), poMaskOut);
    return ImageOf<TOut>(*poOut);
}

TEST(FilterCustom, MultipliesByASingleWeightAndSaturates)
{
    FilterCustom oFilter = CustomFilter({2.0}, 1, 1);
    const Image<std::uint8_t> oImage = {{1, 100, 128, 255}};
    EXPECT_EQ(Filtered<std::uint8_t>(oFilter, oImage, {}),
              (Image<std::uint8_t>{{2, 200, 255, 255}}));
    FilterCustom oNormalised = CustomFilter({2.0}, 1, 1);
    oNormalised.ApplyWeight();
    EXPECT_EQ(Filtered<std::uint8_t>(oNormalised, oImage, {}),
              (Image<std::uint8_t>{{2, 200, 255, 255}}));
}

TEST(FilterCustom, IsABoxAverageAfterApplyWeight)
{
    FilterCustom oFilter = CustomFilter(std::vector<double>(9, 1.0), 3, 3);
    const Image<double> oImage = {{9, 0, 0, 0}, {0, 18, 0, 0}, {0, 0, 0, 90}};
    EXPECT_EQ(Filtered<double>(oFilter, oImage, {1, 1}), (Image<double>{{27, 108}}));
    oFilter = CustomFilter(std::vector<double>(9, 1.0), 3, 3);
    oFilter.ApplyWeight();
    constexpr double kNinth = 1.0 / 9.0;
    EXPECT_EQ(Filtered<double>(oFilter, oImage, {1, 1}),
              (Image<double>{{9 * kNinth + 18 * kNinth, 18 * kNinth + 90 * kNinth}}));
}

TEST(FilterCustom, NeedsNoMarginWhereTheKernelHasOnePixel)
{
    FilterCustom oFilter = CustomFilter({-1, 0, 1}, 3, 1);
    oFilter.ApplyWeight();
    const Image<short> oImage = {{1, 2, 4, 8, 16}, {5, 5, 4, 3, 2}};
    EXPECT_EQ(Filtered<short>(oFilter, oImage, {1, 0}), (Image<short>{{3, 6, 12}, {-1, -2, -2}}));
    const FilterCustom oColumn = CustomFilter({-1, 0, 1}, 1, 3);
    EXPECT_EQ(Filtered<short>(oColumn, Image<short>{{1}, {2}, {4}, {8}}, {0, 1}),
              (Image<short>{{3}, {6}}));
}

// The kernel is not mirrored: a single 1 in its last place copies the lower right neighbour.
TEST(FilterCustom, LastWeightMeetsTheLowerRightNeighbour)
{
    const Image<std::uint8_t> oImage = {
        {0, 0, 0, 0},
        {0, 1, 2, 0},
        {0, 7, 8, 9},
    };
    EXPECT_EQ(
        Filtered<std::uint8_t>(CustomFilter({0, 0, 0, 0, 0, 0, 0, 0, 1}, 3, 3), oImage, {1, 1}),
        (Image<std::uint8_t>{{8, 9}}));
    EXPECT_EQ(
        Filtered<std::uint8_t>(CustomFilter({0, 0, 0, 0, 0, 0, 1, 0, 0}, 3, 3), oImage, {1, 1}),
        (Image<std::uint8_t>{{0, 7}}));
}

// A width of 4 reaches one pixel to either side: the window has three columns, and the fourth
// weight meets the first sample of the second row. The weights behind the ninth are never read.
TEST(FilterCustom, LetsTheWeightsOfAnEvenKernelFallOutOfTheirRows)
{
    const Image<double> oImage = {{1, 2, 3}, {10, 20, 30}, {100, 200, 300}};
    const auto oWeightAt = [&](std::size_t k)
    {
        std::vector<double> vdfKernel(16, 0.0);
        vdfKernel[k] = 1.0;
        return Filtered<double>(CustomFilter(vdfKernel, 4, 4), oImage, {1, 1}).Samples()[0];
    };
    EXPECT_EQ(oWeightAt(2), 3.0);
    EXPECT_EQ(oWeightAt(3), 10.0);
    EXPECT_EQ(oWeightAt(8), 300.0);
    EXPECT_EQ(oWeightAt(9), 0.0);
    EXPECT_EQ(oWeightAt(15), 0.0);
    // 2 x 2: one weight is left.
    EXPECT_EQ(Filtered<double>(CustomFilter({3, 5, 7, 11}, 2, 2), Image<double>{{2}}, {}),
              (Image<double>{{6}}));
}

TEST(FilterCustom, IgnoresDeeperMargins)
{
    const Image<int> oImage = {
        {9, 9, 9, 9, 9}, {9, 1, 2, 3, 9}, {9, 4, 5, 6, 9}, {9, 7, 8, 9, 9}, {9, 9, 9, 9, 9},
    };
    EXPECT_EQ(Filtered<int>(CustomFilter(std::vector<double>(9, 1.0), 3, 3), oImage, {2, 2}),
              (Image<int>{{45}}));
}

TEST(FilterCustom, TreatsChannelsByThemselves)
{
    EXPECT_EQ(Filtered<int>(CustomFilter({1, 10, 100}, 3, 1), Image<int>{{1, 4, 2, 5, 3, 6}},
                            {1, 0}, nullptr, nullptr, 2),
              (Image<int>{{321, 654}}));
}

TEST(FilterCustom, CountsMaskedNeighboursAsZeroWithoutCompensation)
{
    const Image<int> oImage = {{1, 2, 3}, {4, 5, 6}, {7, 8, 9}};
    const FilterCustom oFilter = CustomFilter(std::vector<double>(9, 10.0), 3, 3);
    const auto poSome = MaskOf({{1, 0, 1}, {1, 1, 1}, {1, 1, 0}}, {1, 1});
    EXPECT_EQ(Filtered<int>(oFilter, oImage, {1, 1}, poSome.get()), (Image<int>{{340}}));
    const auto poAlone = MaskOf({{0, 0, 0}, {0, 1, 0}, {0, 0, 0}}, {1, 1});
    EXPECT_EQ(Filtered<int>(oFilter, oImage, {1, 1}, poAlone.get()), (Image<int>{{50}}));
}

// 0.0 times an infinite weight is no number: a masked sample is multiplied like any other.
TEST(FilterCustom, MultipliesTheZeroOfAMaskedNeighbour)
{
    const auto poMask = MaskOf({{0, 1, 1}}, {1, 0});
    constexpr double kInfinity = std::numeric_limits<double>::infinity();
    const double dfOut = Filtered<double>(CustomFilter({kInfinity, 1, 1}, 3, 1),
                                          Image<double>{{1, 2, 3}}, {1, 0}, poMask.get())
                             .Samples()[0];
    EXPECT_TRUE(std::isnan(dfOut));
}

TEST(FilterCustom, StoresByTheConversionRules)
{
    const auto oTimes = [](double dfWeight) { return CustomFilter({dfWeight}, 1, 1); };
    EXPECT_EQ(Filtered<float>(oTimes(-1.5), Image<float>{{3}}, {}), (Image<float>{{-4.5F}}));
    EXPECT_EQ(Filtered<std::uint8_t>(oTimes(-1.5), Image<float>{{3}}, {}),
              (Image<std::uint8_t>{{0}}));
    EXPECT_EQ(Filtered<short>(oTimes(-1.5), Image<float>{{3}}, {}), (Image<short>{{-5}}));
    EXPECT_EQ(Filtered<int64>(oTimes(1.5), Image<float>{{3}}, {}), (Image<int64>{{4}}));
    EXPECT_EQ(Filtered<int64>(oTimes(-1.5), Image<float>{{3}}, {}), (Image<int64>{{0}}));
}

TEST(FilterCustom, WritesBackgroundWhereNothingIsComputed)
{
    const Image<short> oImage = {{5, 300, -7, 20, 6}};
    const auto poMaskIn = MaskOf({{1, 0, 1, 1, 1}}, {1, 0});
    const auto poMaskOut = MaskOf({{1, 1, 0}});
    FilterCustom oFilter = CustomFilter({1, 1, 1}, 3, 1);
    EXPECT_EQ(Filtered<short>(oFilter, oImage, {1, 0}, poMaskIn.get(), poMaskOut.get()),
              (Image<short>{{300, 13, 20}}));
    // Converted on the way.
    EXPECT_EQ(Filtered<std::uint8_t>(oFilter, oImage, {1, 0}, poMaskIn.get(), poMaskOut.get()),
              (Image<std::uint8_t>{{255, 13, 20}}));
    oFilter = CustomFilter({1, 1, 1}, 3, 1);
    oFilter.SetBGZero(true);
    EXPECT_EQ(Filtered<short>(oFilter, oImage, {1, 0}, poMaskIn.get(), poMaskOut.get()),
              (Image<short>{{0, 13, 0}}));
}

TEST(FilterCustom, KeepsTheKernelOfItsFirstBlock)
{
    FilterCustom oFilter = CustomFilter({2.0}, 1, 1);
    const Image<int> oImage = {{7}};
    EXPECT_EQ(Filtered<int>(oFilter, oImage, {}), (Image<int>{{14}}));
    oFilter.SetKernel({3.0}, 1, 1);
    EXPECT_EQ(Filtered<int>(oFilter, oImage, {}), (Image<int>{{14}}));
    const FilterCustom oCopy(oFilter);
    EXPECT_EQ(Filtered<int>(oCopy, oImage, {}), (Image<int>{{14}}));
    EXPECT_EQ(Filtered<short>(oFilter, oImage, {}), (Image<short>{{21}}));
    EXPECT_EQ(Filtered<int>(oFilter, oImage, {}), (Image<int>{{21}}));
}

TEST(FilterCustom, KeepsTheBackgroundOfItsFirstBlock)
{
    FilterCustom oFilter = CustomFilter({2.0}, 1, 1);
    const Image<int> oImage = {{7, 8}};
    const auto poMask = MaskOf({{0, 1}});
    EXPECT_EQ(Filtered<int>(oFilter, oImage, {}, poMask.get()), (Image<int>{{7, 16}}));
    oFilter.SetBGZero(true);
    EXPECT_EQ(Filtered<int>(oFilter, oImage, {}, poMask.get()), (Image<int>{{7, 16}}));
    EXPECT_EQ(Filtered<short>(oFilter, oImage, {}, poMask.get()), (Image<short>{{0, 16}}));
}

void ExpectSizeRefused(const std::function<void()>& oAction)
{
    try
    {
        oAction();
        FAIL() << "nothing was thrown";
    }
    catch (const Exception& oException)
    {
        EXPECT_EQ(oException.GetMessage(), "The size of the kernel doesn't match the given sizes.");
        EXPECT_EQ(oException.GetFile(), "processes/qrdfilters/filtercustom");
        EXPECT_NE(oException.GetFunction().find("CustomParams::SetKernel("), std::string::npos);
        EXPECT_GT(oException.GetLine(), 0U);
    }
}

// The weights that were refused stay, beside the sizes of before.
TEST(FilterCustom, RefusesAKernelOfAnotherSizeAndKeepsItsWeights)
{
    FilterCustom oFilter = CustomFilter(std::vector<double>(9, 1.0), 3, 3);
    ExpectSizeRefused([&] { oFilter.SetKernel(std::vector<double>(8, 4.0), 3, 3); });
    oFilter.ApplyWeight();
    const Image<double> oImage = {{1, 2, 3}, {4, 5, 6}, {7, 8, 9}};
    ExpectSizeRefused([&] { Filtered<double>(oFilter, oImage, {1, 1}); });
    ExpectSizeRefused([&] { Filtered<double>(oFilter, oImage, {1, 1}); });
    // Eight weights of 4 are normalised to an eighth each: a ninth of 1 would give 5.625 - 5 more.
    FilterCustom oEight = CustomFilter(std::vector<double>(8, 0.0), 8, 1);
    ExpectSizeRefused([&] { oEight.SetKernel({1, 1, 1, 1, 1, 1, 1, 1}, 3, 3); });
    oEight.ApplyWeight();
    // The old sizes fit the new weights here: seven of eight eighths.
    EXPECT_EQ(Filtered<double>(oEight, Image<double>{{8, 8, 8, 8, 8, 8, 8}}, {3, 0}),
              (Image<double>{{7}}));
}

// In 32 bits the product of the sizes is 0.
TEST(FilterCustom, RefusesSizesWhoseProductOverflows)
{
    FilterCustom oFilter;
    ExpectSizeRefused([&] { oFilter.SetKernel({}, 65536, 65536); });
}

TEST(FilterCustom, AppliesWeightsInTheirOrder)
{
    // 1e16 + 1 + 1 is 1e16 when added from the left, and 1e16 + 2 from the right.
    FilterCustom oFilter = CustomFilter({1e16, 1, 1}, 3, 1);
    oFilter.ApplyWeight();
    EXPECT_EQ(Filtered<double>(oFilter, Image<double>{{0, 1, 0}}, {1, 0}),
              (Image<double>{{1 / 1e16}}));
    FilterCustom oEmpty;
    EXPECT_NO_THROW(oEmpty.ApplyWeight());
}

void ExpectMarginRefused(const FilterCustom& oFilter, Margins oMargins)
{
    const auto poIn = BlankRaster(2, 2, 1, tessel::eDT_8U, oMargins);
    const auto poOut = BlankRaster(2, 2, 1, tessel::eDT_16S);
    const auto poBefore = BlankRaster(2, 2, 1, tessel::eDT_16S);
    try
    {
        oFilter.Process(poIn.get(), nullptr, poOut.get(), nullptr);
        FAIL() << "nothing was thrown";
    }
    catch (const ParameterException& oException)
    {
        EXPECT_EQ(oException.GetMessage(), "The Margin of the input raster is too small");
        EXPECT_EQ(oException.GetParameterName(), "poRasterIn");
        EXPECT_EQ(oException.GetType(), ParameterException::Type::eInvalidValue);
        EXPECT_EQ(oException.GetFirstText(), "");
        EXPECT_EQ(oException.GetSecondText(), "");
        EXPECT_EQ(oException.GetFile(), "processes/qrdfilters/filtercustom");
        EXPECT_NE(oException.GetFunction().find("InnerProcessor"), std::string::npos);
        EXPECT_GT(oException.GetLine(), 0U);
    }
    EXPECT_TRUE(SameBits(*poOut, *poBefore));
}

TEST(FilterCustom, RefusesMarginsThatDoNotHoldTheKernel)
{
    ExpectMarginRefused(CustomFilter(std::vector<double>(15, 1.0), 5, 3), {1, 1});
    ExpectMarginRefused(CustomFilter(std::vector<double>(15, 1.0), 5, 3), {2, 0});
    ExpectMarginRefused(CustomFilter(std::vector<double>(15, 1.0), 3, 5), {2, 1});
}

TEST(FilterCustom, RefusesToWorkWithoutAKernel)
{
    ExpectMarginRefused(FilterCustom(), {9, 9});
    ExpectMarginRefused(CustomFilter({}, 0, 5), {9, 9});
}

// The processor was made before the margins were looked at, and it keeps the kernel of then: none.
TEST(FilterCustom, StaysWithoutAKernelForTheTypesThatItWasCalledWith)
{
    FilterCustom oFilter;
    ExpectMarginRefused(oFilter, {1, 1});
    oFilter.SetKernel({1.0}, 1, 1);
    ExpectMarginRefused(oFilter, {1, 1});
    EXPECT_EQ(Filtered<int>(oFilter, Image<int>{{7}}, {}), (Image<int>{{7}}));
}

TEST(FilterCustom, LooksAtTheSizeOfTheKernelBeforeTheMargins)
{
    FilterCustom oFilter = CustomFilter(std::vector<double>(9, 1.0), 3, 3);
    ExpectSizeRefused([&] { oFilter.SetKernel({1, 2}, 3, 3); });
    ExpectSizeRefused([&] { Filtered<int>(oFilter, Image<int>{{7}}, {}); });
    // A kernel whose size was refused is forgotten with the next one that fits.
    oFilter.SetKernel({3.0}, 1, 1);
    EXPECT_EQ(Filtered<int>(oFilter, Image<int>{{7}}, {}), (Image<int>{{21}}));
}

void ExpectRefused(tessel::Raster* poIn, tessel::Raster* poOut, const std::string& oMessage)
{
    try
    {
        CustomFilter({1}, 1, 1).Process(poIn, nullptr, poOut, nullptr);
        FAIL() << "nothing was thrown";
    }
    catch (const Exception& oException)
    {
        EXPECT_EQ(oException.GetMessage(), oMessage);
        EXPECT_EQ(oException.GetFile(), "processes/qrdfilters/filtercustom");
        EXPECT_NE(oException.GetFunction().find("FilterCustom::Process("), std::string::npos);
        EXPECT_GT(oException.GetLine(), 0U);
    }
}

TEST(FilterCustom, RefusesRastersThatItCannotUse)
{
    const auto poReal = BlankRaster(1, 1, 1, tessel::eDT_8U);
    const auto poComplex = BlankRaster(1, 1, 1, tessel::eDT_C32R);
    ExpectRefused(nullptr, poComplex.get(), "poRasterIn is invalid pointer");
    ExpectRefused(poReal.get(), nullptr, "poRasterOut is invalid pointer");
    ExpectRefused(poReal.get(), poComplex.get(), "Output cannot be complex");
    const auto poBits = BlankRaster(1, 1, 1, tessel::eDT_BIT);
    EXPECT_THROW(CustomFilter({1}, 1, 1).Process(poBits.get(), nullptr, poReal.get(), nullptr),
                 Exception);
}

TEST(FilterCustom, WorksOnTheMagnitudeOfAComplexInput)
{
    const auto poIn = BlankRaster(1, 1, 1, tessel::eDT_C16S, {1, 0});
    const short anSamples[] = {3, 4, -60, 80, 0, -7};
    std::copy_n(anSamples, 6, reinterpret_cast<short*>(poIn->mpBuffer));
    const auto poOut = BlankRaster(1, 1, 1, tessel::eDT_32S);
    CustomFilter({1, 1, 1}, 3, 1).Process(poIn.get(), nullptr, poOut.get(), nullptr);
    EXPECT_EQ(ImageOf<int>(*poOut), (Image<int>{{112}}));
}

TEST(FilterCustom, AcceptsBlocksWithoutPixels)
{
    const auto poNoRows = BlankRaster(4, 0, 1, tessel::eDT_32R, {1, 1});
    const auto poNoColumns = BlankRaster(0, 4, 1, tessel::eDT_32R, {1, 1});
    const FilterCustom oFilter = CustomFilter(std::vector<double>(9, 1.0), 3, 3);
    EXPECT_NO_THROW(oFilter.Process(poNoRows.get(), nullptr, poNoRows.get(), nullptr));
    EXPECT_NO_THROW(oFilter.Process(poNoColumns.get(), nullptr, poNoColumns.get(), nullptr));
}

TEST(FilterCustom, ChecksWhatTheCallerPromisesInHardenedBuilds)
{
    if (!kHardened)
    {
        GTEST_SKIP() << "other builds trust the caller";
    }
    const auto poIn = BlankRaster(3, 2, 1, tessel::eDT_8U);
    const auto poSmall = BlankRaster(3, 1, 1, tessel::eDT_8U);
    EXPECT_THROW(CustomFilter({1}, 1, 1).Process(poIn.get(), nullptr, poSmall.get(), nullptr),
                 Exception);
}

// ---- The definition.

struct Custom
{
    std::vector<double> mvdfKernel;
    unsigned int mnWidth;
    unsigned int mnHeight;
    bool mbBGZero;
};

template <class TIn>
double SumByDefinition(const tessel::Raster& oIn, const tessel::Mask* poMaskIn, std::int64_t x,
                       std::int64_t y, std::size_t c, const Custom& oCustom)
{
    const std::int64_t nHalfX = (oCustom.mnWidth - 1) / 2;
    const std::int64_t nHalfY = (oCustom.mnHeight - 1) / 2;
    double dfSum = 0.0;
    std::size_t k = 0;
    for (std::int64_t dy = -nHalfY; dy <= nHalfY; ++dy)
    {
        for (std::int64_t dx = -nHalfX; dx <= nHalfX; ++dx)
        {
            const double dfSample =
                IsValid(poMaskIn, x + dx, y + dy)
                    ? ConvertSample<TIn, double>(oIn.GetPixelAs<TIn>(x + dx, y + dy)[c])
                    : 0.0;
            dfSum += dfSample * oCustom.mvdfKernel[k++];
        }
    }
    return dfSum;
}

template <class TIn, class TOut>
void FilterByDefinition(const tessel::Raster& oIn, const tessel::Mask* poMaskIn,
                        const tessel::Raster& oOut, const tessel::Mask* poMaskOut,
                        const Custom& oCustom)
{
    for (std::int64_t y = 0; y < oIn.mnHeight; ++y)
    {
        for (std::int64_t x = 0; x < oIn.mnWidth; ++x)
        {
            const bool bComputed = IsValid(poMaskIn, x, y) && IsValid(poMaskOut, x, y);
            for (std::size_t c = 0; c < oIn.mnChannels; ++c)
            {
                TOut& oResult = oOut.GetPixelAs<TOut>(x, y)[c];
                if (bComputed)
                {
                    oResult = ConvertSample<double, TOut>(
                        SumByDefinition<TIn>(oIn, poMaskIn, x, y, c, oCustom));
                }
                else
                {
                    oResult = oCustom.mbBGZero
                                  ? TOut(0)
                                  : ConvertSample<TIn, TOut>(oIn.GetPixelAs<TIn>(x, y)[c]);
                }
            }
        }
    }
}

Custom RandomCustom(unsigned int nWidth, unsigned int nHeight, Random& oRandom)
{
    Custom oCustom{std::vector<double>(std::size_t{nWidth} * nHeight), nWidth, nHeight,
                   oRandom() % 2 == 0};
    for (double& dfWeight : oCustom.mvdfKernel)
    {
        dfWeight = std::uniform_real_distribution<double>(-0.5, 0.7)(oRandom);
    }
    return oCustom;
}

template <class TIn, class TOut>
void Compare(const Custom& oCustom, const Shape& oShape, double dfValid, Random& oRandom)
{
    FilterCustom oFilter = CustomFilter(oCustom.mvdfKernel, oCustom.mnWidth, oCustom.mnHeight);
    oFilter.SetBGZero(oCustom.mbBGZero);
    const auto eSamples = oRandom() % 4 == 0 ? Samples::Special : Samples::Ordinary;
    CompareWithDefinition<TIn, TOut>(
        oShape, eSamples, dfValid, oRandom,
        [&](auto poIn, auto poMaskIn, auto poOut, auto poMaskOut)
        { oFilter.Process(poIn, poMaskIn, poOut, poMaskOut); },
        [&](auto poIn, auto poMaskIn, auto poOut, auto poMaskOut)
        { FilterByDefinition<TIn, TOut>(*poIn, poMaskIn, *poOut, poMaskOut, oCustom); });
}

TEST(FilterCustom, FollowsTheDefinitionForAllPairsOfTypes)
{
    // Threads are counted elsewhere; with one a small block is not slowed by waking others.
    const OMPThreadCount oOne(1);
    Random oRandom(11);
    ForEachElementType(
        [&]<class TIn>()
        {
            ForEachElementType(
                [&]<class TOut>()
                {
                    const Custom oCustom = RandomCustom(3, 3, oRandom);
                    ForSomeShapes({1, 1}, [&](const Shape& oShape, double dfValid)
                                  { Compare<TIn, TOut>(oCustom, oShape, dfValid, oRandom); });
                });
        });
}

TEST(FilterCustom, FollowsTheDefinitionForAllShapes)
{
    const OMPThreadCount oOne(1);
    Random oRandom(12);
    const auto oCompareAll =
        [&]<class T>(unsigned int nWidth, unsigned int nHeight, Margins oMargins)
    {
        const Custom oCustom = RandomCustom(nWidth, nHeight, oRandom);
        ForEachShape(oMargins, [&](const Shape& oShape, double dfValid)
                     { Compare<T, T>(oCustom, oShape, dfValid, oRandom); });
    };
    oCompareAll.operator()<double>(1, 1, {0, 0});
    oCompareAll.operator()<double>(3, 3, {1, 2});
    oCompareAll.operator()<double>(7, 1, {3, 0});
    oCompareAll.operator()<unsigned short>(1, 5, {1, 2});
    oCompareAll.operator()<float>(9, 5, {4, 2});
    oCompareAll.operator()<double>(4, 6, {1, 2});
    oCompareAll.operator()<unsigned char>(2, 3, {0, 1});
}

TEST(FilterCustom, FollowsTheDefinitionAcrossBandsAndTiles)
{
    const OMPThreadCount oTwo(2);
    Random oRandom(13);
    Compare<float, float>(RandomCustom(5, 5, oRandom), {700, 11, 1, {2, 2}}, 0.99, oRandom);
    Compare<double, double>(RandomCustom(3, 3, oRandom), {3, 523, 1, {1, 1}}, 0.99, oRandom);
    Compare<int, double>(RandomCustom(41, 3, oRandom), {400, 9, 2, {20, 1}}, 0.999, oRandom);
}

}  // namespace
}  // namespace kor::filters
