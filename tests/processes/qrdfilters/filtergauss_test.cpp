#include "processes/qrdfilters/filtergauss.h"

#include <gtest/gtest.h>

#include <array>
#include <cmath>

#include "platform/exception/exception.h"
#include "tests/support/filtercomparison.h"
#include "tests/support/filtered.h"

namespace kor::filters
{
namespace
{

using namespace kor::test;

/// A block of one pixel whose margins hold windows of nSide, all samples dfBackground but the one
/// in column x and row y.
Image<double> SinglePixel(std::size_t nSide, std::size_t x, std::size_t y, double dfValue,
                          double dfBackground = 0.0)
{
    std::vector<double> vdfSamples(nSide * nSide, dfBackground);
    vdfSamples[y * nSide + x] = dfValue;
    return Image<double>(nSide, vdfSamples);
}

double FilteredPixel(const FilterGauss& oFilter, const Image<double>& oImage)
{
    const auto nMargin = static_cast<std::uint32_t>(oImage.Columns() / 2);
    return Filtered(oFilter, oImage, {nMargin, nMargin}).Samples()[0];
}

// e^-0.5 = 0.60653: the weights are 0.60653 / 2.21306 and 1 / 2.21306.
TEST(FilterGauss, HasThreeWeightsForAVarianceOfOne)
{
    const FilterGauss oFilter(1.0, 0.0);
    constexpr double kOuter = 0.2740686;
    constexpr double kMiddle = 0.4518628;
    EXPECT_NEAR(FilteredPixel(oFilter, SinglePixel(3, 1, 1, 1.0)), kMiddle * kMiddle, 1e-7);
    EXPECT_NEAR(FilteredPixel(oFilter, SinglePixel(3, 0, 1, 1.0)), kOuter * kMiddle, 1e-7);
    EXPECT_NEAR(FilteredPixel(oFilter, SinglePixel(3, 1, 2, 1.0)), kOuter * kMiddle, 1e-7);
    EXPECT_NEAR(FilteredPixel(oFilter, SinglePixel(3, 2, 0, 1.0)), kOuter * kOuter, 1e-7);
}

void ExpectSide(double dfSigmasq1, double dfSigmasq2, std::uint32_t nSide)
{
    const FilterGauss oFilter(dfSigmasq1, dfSigmasq2);
    const auto poOut = BlankRaster(1, 1, 1, tessel::eDT_64R);
    const std::uint32_t nHalf = nSide / 2;
    for (const Margins oMargins : {Margins{nHalf, nHalf}, {nHalf + 3, nHalf + 1}})
    {
        const auto poIn = BlankRaster(1, 1, 1, tessel::eDT_64R, oMargins);
        EXPECT_NO_THROW(oFilter.Process(poIn.get(), nullptr, poOut.get(), nullptr)) << dfSigmasq1;
    }
    for (const Margins oMargins : {Margins{nHalf - 1, nHalf}, {nHalf, nHalf - 1}})
    {
        const auto poIn = BlankRaster(1, 1, 1, tessel::eDT_64R, oMargins);
        EXPECT_THROW(oFilter.Process(poIn.get(), nullptr, poOut.get(), nullptr), ParameterException)
            << dfSigmasq1;
    }
}

TEST(FilterGauss, FollowsTheGreaterVarianceInItsSize)
{
    ExpectSide(1.0, 0.0, 3);
    ExpectSide(4.7, 0.0, 9);
    ExpectSide(32.0, 0.0, 65);
    ExpectSide(2.5, 6.9, 13);
    ExpectSide(6.9, 2.5, 13);
}

TEST(FilterGauss, KeepsAFlatImage)
{
    for (const double dfSigmasq : {1.0, 4.7, 32.0})
    {
        const std::size_t nSide = 2 * static_cast<std::size_t>(dfSigmasq) + 1;
        EXPECT_NEAR(FilteredPixel(FilterGauss(dfSigmasq, 0.0), SinglePixel(nSide, 0, 0, 7.5, 7.5)),
                    7.5, 1e-13);
    }
}

TEST(FilterGauss, IsZeroForTwoEqualVariances)
{
    EXPECT_EQ(FilteredPixel(FilterGauss(3.0, 3.0), SinglePixel(7, 2, 4, 1000.0, 3.0)), 0.0);
}

// Both kernels have seven weights; away from the middle the wider one is the greater.
TEST(FilterGauss, IsTheAbsoluteDifferenceOfTwoSmoothings)
{
    const FilterGauss oBand(1.0, 3.0);
    FilterGauss oWide(3.0, 0.0);
    const Image<double> oMiddle = SinglePixel(7, 3, 3, 100.0);
    const Image<double> oEdge = SinglePixel(7, 0, 3, 100.0);
    // exp(-k^2 / 2) for k = -3..3 sums to 2.505951, so the weight in the middle is 0.399050.
    EXPECT_NEAR(FilteredPixel(oBand, oMiddle),
                100.0 * 0.399050 * 0.399050 - FilteredPixel(oWide, oMiddle), 1e-4);
    EXPECT_NEAR(FilteredPixel(oBand, oEdge),
                FilteredPixel(oWide, oEdge) - 100.0 * 0.399050 * 0.011109 / 2.505951, 1e-4);
    EXPECT_GT(FilteredPixel(oBand, oEdge), 0.0);
}

// The right neighbour counts as the centre's 1, not as 1000: the result is that of a flat image.
TEST(FilterGauss, LetsAMaskedNeighbourCountAsTheCentre)
{
    const auto poMask = MaskOf({{1, 1, 1}, {1, 1, 0}, {1, 1, 1}}, {1, 1});
    const double dfOut =
        Filtered(FilterGauss(1.0, 0.0), SinglePixel(3, 2, 1, 1000.0, 1.0), {1, 1}, poMask.get())
            .Samples()[0];
    EXPECT_NEAR(dfOut, 1.0, 1e-15);
}

TEST(FilterGauss, WritesZeroWhereNothingIsComputed)
{
    FilterGauss oFilter(1.0, 0.0);
    oFilter.SetBGZero(true);
    const auto poMaskIn = MaskOf({{1, 1, 1, 1}, {1, 0, 1, 1}, {1, 1, 1, 1}}, {1, 1});
    const auto poMaskOut = MaskOf({{1, 0}});
    const Image<double> oImage = {{1, 2, 3, 4}, {5, 6, 7, 8}, {9, 10, 11, 12}};
    EXPECT_EQ(Filtered(oFilter, oImage, {1, 1}, poMaskIn.get(), poMaskOut.get()),
              (Image<double>{{0, 0}}));
    oFilter.SetBGZero(false);
    EXPECT_EQ(Filtered(oFilter, oImage, {1, 1}, poMaskIn.get(), poMaskOut.get()),
              (Image<double>{{6, 7}}));
}

// Pixel x of two channels gets sample x of its row twice, not its own samples 2x and 2x + 1.
TEST(FilterGauss, GivesSkippedPixelsSampleXOfTheRow)
{
    std::vector<double> vdfSamples(3 * 10, 0.0);
    for (std::size_t i = 0; i < 10; ++i)
    {
        vdfSamples[10 + i] = static_cast<double>(i);
    }
    const auto poMaskOut = MaskOf({{0, 0, 0}});
    // The first sample behind the margin is 2.
    EXPECT_EQ(Filtered(FilterGauss(1.0, 0.0), Image<double>(10, vdfSamples), {1, 1}, nullptr,
                       poMaskOut.get(), 2),
              (Image<double>{{2, 2, 3, 3, 4, 4}}));
}

TEST(FilterGauss, TakesNoNoticeOfSetSizes)
{
    FilterGauss oFilter(1.0, 0.0);
    const Image<double> oImage = SinglePixel(5, 2, 1, 10.0, 1.0);
    const double dfExpected = FilteredPixel(oFilter, oImage);
    oFilter.SetFilterSize(5, 5);
    EXPECT_EQ(FilteredPixel(oFilter, oImage), dfExpected);
    oFilter.SetFilterSize(boost::optional<int>(1), boost::none);
    EXPECT_EQ(FilteredPixel(oFilter, oImage), dfExpected);
}

TEST(FilterGauss, IsCopiedWithItsKernels)
{
    const FilterGauss oFilter(2.0, 4.0);
    const Image<double> oImage = SinglePixel(9, 5, 3, 10.0, 1.0);
    const FilterGauss oCopy(oFilter);
    FilterGauss oAssigned;
    oAssigned = oFilter;
    EXPECT_NE(FilteredPixel(oFilter, oImage), 0.0);
    EXPECT_EQ(FilteredPixel(oCopy, oImage), FilteredPixel(oFilter, oImage));
    EXPECT_EQ(FilteredPixel(oAssigned, oImage), FilteredPixel(oFilter, oImage));
}

void ExpectRefusedSigma(double dfSigmasq1, double dfSigmasq2, const std::string& oMessage)
{
    FilterGauss oFilter;
    try
    {
        oFilter.SetSigma(dfSigmasq1, dfSigmasq2);
        FAIL() << "nothing was thrown for " << dfSigmasq1 << " and " << dfSigmasq2;
    }
    catch (const ParameterException& oException)
    {
        EXPECT_EQ(oException.GetMessage(), oMessage);
        EXPECT_EQ(oException.GetType(), ParameterException::Type::eInvalidValue);
        EXPECT_EQ(oException.GetParameterName(), "");
        EXPECT_EQ(oException.GetFirstText(), "");
        EXPECT_EQ(oException.GetSecondText(), "");
        EXPECT_EQ(oException.GetFile(), "");
        EXPECT_EQ(oException.GetFunction(), "");
        EXPECT_EQ(oException.GetLine(), 0U);
    }
    EXPECT_THROW(FilterGauss(dfSigmasq1, dfSigmasq2), ParameterException);
}

TEST(FilterGauss, RefusesVariancesOutOfRange)
{
    const std::string kNeither = "Neither mdfSigmasq1 or mdfSigmasq2 is defined";
    const std::string kFirst = "mdfSigmasq1 must be in the range of 1.0 to 32.0";
    const std::string kSecond = "mdfSigmasq2 must be in the range of 1.0 to 32.0";
    ExpectRefusedSigma(0.0, 0.0, kNeither);
    ExpectRefusedSigma(1e-16, -1e-16, kNeither);
    ExpectRefusedSigma(0.5, 0.0, kFirst);
    ExpectRefusedSigma(32.0000001, 0.0, kFirst);
    ExpectRefusedSigma(-1.0, 2.0, kFirst);
    ExpectRefusedSigma(std::nan(""), 0.0, kFirst);
    ExpectRefusedSigma(0.5, 0.5, kFirst);
    ExpectRefusedSigma(2.0, 0.5, kSecond);
    ExpectRefusedSigma(2.0, 33.0, kSecond);
    ExpectRefusedSigma(2.0, std::nan(""), kSecond);
    ExpectRefusedSigma(0.0, 33.0, kSecond);
    const std::string kSecondAlone = "mdfSigmasq2 is defined but mdfSigmasq1 is not defined";
    ExpectRefusedSigma(0.0, 2.0, kSecondAlone);
    // A variance counts as defined from 2^-52 on, and is out of range then.
    ExpectRefusedSigma(0x1.fffffffffffffp-53, 0.0, kNeither);
    ExpectRefusedSigma(0x1p-52, 0.0, kFirst);
    ExpectRefusedSigma(-0x1p-52, 0.0, kFirst);
    ExpectRefusedSigma(2.0, 0x1p-52, kSecond);
    ExpectRefusedSigma(0x1.fffffffffffffp-53, 2.0, kSecondAlone);
}

TEST(FilterGauss, SmoothsWithOneKernelWhereTheSecondVarianceIsNotDefined)
{
    const Image<double> oImage = SinglePixel(5, 2, 1, 10.0, 1.0);
    const double dfExpected = FilteredPixel(FilterGauss(2.0, 0.0), oImage);
    EXPECT_GT(dfExpected, 1.0);
    EXPECT_EQ(FilteredPixel(FilterGauss(2.0, 0x1.fffffffffffffp-53), oImage), dfExpected);
    EXPECT_EQ(FilteredPixel(FilterGauss(2.0, -1e-17), oImage), dfExpected);
}

TEST(FilterGauss, KeepsItsKernelsWhenVariancesAreRefused)
{
    FilterGauss oFilter(1.0, 0.0);
    const Image<double> oImage = SinglePixel(3, 1, 1, 10.0, 1.0);
    const double dfExpected = FilteredPixel(oFilter, oImage);
    EXPECT_THROW(oFilter.SetSigma(4.0, 0.5), ParameterException);
    EXPECT_EQ(FilteredPixel(oFilter, oImage), dfExpected);
    // Both of them, where there were two.
    FilterGauss oBand(2.0, 1.0);
    const Image<double> oLarger = SinglePixel(5, 2, 2, 10.0, 1.0);
    const double dfBand = FilteredPixel(oBand, oLarger);
    EXPECT_NE(dfBand, FilteredPixel(FilterGauss(2.0, 0.0), oLarger));
    EXPECT_THROW(oBand.SetSigma(0.5, 0.0), ParameterException);
    EXPECT_EQ(FilteredPixel(oBand, oLarger), dfBand);
}

TEST(FilterGauss, KeepsVariancesThatWereRefused)
{
    struct OpenFilter : FilterGauss
    {
        using FilterGauss::ComputeKernel;
        using FilterGauss::FilterGauss;
    };
    OpenFilter oFilter(1.0, 0.0);
    EXPECT_NO_THROW(oFilter.ComputeKernel());
    EXPECT_THROW(oFilter.SetSigma(4.0, 0.5), ParameterException);
    EXPECT_THROW(oFilter.ComputeKernel(), ParameterException);
}

void ExpectRefused(const FilterGauss& oFilter, Margins oMargins, const std::string& oName,
                   const std::string& oMessage)
{
    const auto poIn = BlankRaster(3, 3, 1, tessel::eDT_64R, oMargins);
    const auto poOut = BlankRaster(3, 3, 1, tessel::eDT_64R);
    const auto poBefore = BlankRaster(3, 3, 1, tessel::eDT_64R);
    try
    {
        oFilter.Process(poIn.get(), nullptr, poOut.get(), nullptr);
        FAIL() << "nothing was thrown";
    }
    catch (const ParameterException& oException)
    {
        EXPECT_EQ(oException.GetMessage(), oMessage);
        EXPECT_EQ(oException.GetParameterName(), oName);
        EXPECT_EQ(oException.GetType(), ParameterException::Type::eInvalidValue);
        EXPECT_EQ(oException.GetFile(), "processes/qrdfilters/filtergauss");
        EXPECT_NE(oException.GetFunction().find("FilterGauss::ProcessBlock("), std::string::npos);
        EXPECT_GT(oException.GetLine(), 0U);
    }
    EXPECT_TRUE(SameBits(*poOut, *poBefore));
}

TEST(FilterGauss, RefusesToWorkWithoutVariances)
{
    ExpectRefused(FilterGauss(), {4, 4}, "mnFilterSize", "The filter size was not set");
    // A size that was set does not help.
    FilterGauss oFilter;
    oFilter.SetFilterSize(3, 3);
    ExpectRefused(oFilter, {0, 0}, "mnFilterSize", "The filter size was not set");
}

TEST(FilterGauss, RefusesMarginsThatDoNotHoldTheWindow)
{
    for (const Margins oMargins : {Margins{1, 2}, {2, 1}, {0, 0}})
    {
        ExpectRefused(FilterGauss(2.0, 0.0), oMargins, "oRasterIn",
                      "The Margin of the input raster is too small");
    }
}

// ---- The definition.

struct Gauss
{
    double mdfSigmasq1;
    double mdfSigmasq2;
    bool mbBGZero;
};

std::vector<double> KernelByDefinition(double dfSigmasq, std::size_t nSize)
{
    const std::size_t nHalf = nSize / 2;
    std::vector<double> vdfKernel(nSize);
    double dfSum = 0.0;
    for (std::size_t k = 0; k < nSize; ++k)
    {
        const double i = static_cast<double>(k) - static_cast<double>(nHalf);
        vdfKernel[k] =
            k <= nHalf ? std::exp(-(i * i / (2.0 * dfSigmasq))) : vdfKernel[nSize - 1 - k];
        dfSum += vdfKernel[k];
    }
    double dfTotal = 0.0;
    for (double& dfWeight : vdfKernel)
    {
        dfWeight = dfWeight / dfSum;
        dfTotal += dfWeight;
    }
    vdfKernel[nHalf] = 1.0 - dfTotal + vdfKernel[nHalf];
    return vdfKernel;
}

double SmoothedByDefinition(const tessel::Raster& oIn, const tessel::Mask* poMaskIn, std::int64_t x,
                            std::int64_t y, std::size_t c, const std::vector<double>& vdfKernel)
{
    const std::size_t nSize = vdfKernel.size();
    const auto nHalf = static_cast<std::int64_t>(nSize / 2);
    const double dfCentre = oIn.GetPixelAs<double>(x, y)[c];
    const auto oAt = [&](std::int64_t k, std::int64_t r)
    { return IsValid(poMaskIn, k, r) ? oIn.GetPixelAs<double>(k, r)[c] : dfCentre; };
    std::vector<double> vdfColumns(nSize, 0.0);
    for (std::size_t k = 0; k < nSize; ++k)
    {
        const std::int64_t nColumn = x + static_cast<std::int64_t>(k) - nHalf;
        for (std::int64_t j = 0; j < nHalf; ++j)
        {
            const std::int64_t r = nHalf - j;
            const double s = oAt(nColumn, y - r) + oAt(nColumn, y + r);
            vdfColumns[k] += s * vdfKernel[static_cast<std::size_t>(j)];
        }
        vdfColumns[k] += vdfKernel[nSize / 2] * oAt(nColumn, y);
    }
    double dfSum = 0.0;
    for (std::size_t k = 0; k < nSize / 2; ++k)
    {
        dfSum += (vdfColumns[k] + vdfColumns[nSize - 1 - k]) * vdfKernel[k];
    }
    return dfSum + vdfKernel[nSize / 2] * vdfColumns[nSize / 2];
}

void FilterByDefinition(const tessel::Raster& oIn, const tessel::Mask* poMaskIn,
                        const tessel::Raster& oOut, const tessel::Mask* poMaskOut,
                        const Gauss& oGauss)
{
    const std::size_t nSize =
        2 * static_cast<std::size_t>(std::max(oGauss.mdfSigmasq1, oGauss.mdfSigmasq2)) + 1;
    const bool bTwo = oGauss.mdfSigmasq2 != 0.0;
    const auto vdfFirst = KernelByDefinition(oGauss.mdfSigmasq1, nSize);
    const auto vdfSecond = KernelByDefinition(bTwo ? oGauss.mdfSigmasq2 : 1.0, nSize);
    for (std::int64_t y = 0; y < oIn.mnHeight; ++y)
    {
        for (std::int64_t x = 0; x < oIn.mnWidth; ++x)
        {
            const bool bComputed = IsValid(poMaskIn, x, y) && IsValid(poMaskOut, x, y);
            double* pOut = oOut.GetPixelAs<double>(x, y);
            for (std::size_t c = 0; c < oIn.mnChannels; ++c)
            {
                if (!bComputed)
                {
                    pOut[c] = oGauss.mbBGZero ? 0.0 : oIn.GetPixelAs<double>(0, y)[x];
                    continue;
                }
                pOut[c] = SmoothedByDefinition(oIn, poMaskIn, x, y, c, vdfFirst);
                if (bTwo)
                {
                    pOut[c] = std::fabs(pOut[c] -
                                        SmoothedByDefinition(oIn, poMaskIn, x, y, c, vdfSecond));
                }
            }
        }
    }
}

void Compare(const Gauss& oGauss, const Shape& oShape, double dfValid, Random& oRandom)
{
    FilterGauss oFilter(oGauss.mdfSigmasq1, oGauss.mdfSigmasq2);
    oFilter.SetBGZero(oGauss.mbBGZero);
    const auto eSamples = oRandom() % 2 == 0 ? Samples::Ordinary : Samples::Special;
    CompareWithDefinition<double, double>(
        oShape, eSamples, dfValid, oRandom,
        [&](auto poIn, auto poMaskIn, auto poOut, auto poMaskOut)
        { oFilter.Process(poIn, poMaskIn, poOut, poMaskOut); },
        [&](auto poIn, auto poMaskIn, auto poOut, auto poMaskOut)
        { FilterByDefinition(*poIn, poMaskIn, *poOut, poMaskOut, oGauss); });
}

TEST(FilterGauss, FollowsTheDefinitionForAllShapes)
{
    Random oRandom(3);
    for (const Gauss& oGauss : {Gauss{1.0, 0.0, false}, {2.3, 1.0, true}})
    {
        ForEachShape({2, 4}, [&](const Shape& oShape, double dfValid)
                     { Compare(oGauss, oShape, dfValid, oRandom); });
    }
}

// The tiles are 512 samples long, and four windows at least.
TEST(FilterGauss, FollowsTheDefinitionAcrossTilesAndForLargeWindows)
{
    Random oRandom(4);
    Compare({1.5, 0.0, false}, {1100, 4, 1, {1, 1}}, 0.999, oRandom);
    Compare({4.9, 2.0, false}, {700, 3, 3, {4, 4}}, 0.9995, oRandom);
    Compare({32.0, 9.0, false}, {40, 2, 1, {32, 33}}, 0.9999, oRandom);
}

// Terms that vanish leave zeros of both signs; sums begin at +0.0.
TEST(FilterGauss, BeginsItsSumsAtPositiveZero)
{
    const Image<double> oImage = {{-0.0, -0.0, -0.0}, {-0.0, -0.0, -0.0}, {-0.0, -0.0, -0.0}};
    EXPECT_FALSE(std::signbit(FilteredPixel(FilterGauss(1.0, 0.0), oImage)));
}

}  // namespace
}  // namespace kor::filters
