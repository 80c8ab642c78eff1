#include "processes/qrdfilters/filterfle.h"

#include <gtest/gtest.h>

#include <cmath>
#include <functional>

#include "tests/support/exceptions.h"
#include "tests/support/speckledefinitions.h"
#include "tests/support/windowfilters.h"

namespace kor::filters
{
namespace
{

using tessel::eDT_64R;
using test::Filtered;
using test::FilteredCentre;
using test::Image;
using test::Margins;

FilterFle Lee(const char* pszNoise, double dfNoiseVar, double dfThrVar = 0.0)
{
    FilterFle oFilter;
    oFilter.SetNoise(pszNoise);
    oFilter.SetNoiseVar({dfNoiseVar});
    oFilter.SetThrVar(dfThrVar);
    return oFilter;
}

/// mean = 1, var = 4, centre 3.
const Image<double> kRow = {{-1, 3, 1}};

// Additive: (3 - 1) * 4 / (4 + 12) + 1.
TEST(FilterFle, AdditiveNoise)
{
    EXPECT_EQ(FilteredCentre(Lee("ADDI", 12.0), kRow), 1.5);
}

// Multiplicative: k = 1 - 1 / 4 = 3 / 4, (3 - 1) * k + 1.
TEST(FilterFle, MultiplicativeNoise)
{
    EXPECT_EQ(FilteredCentre(Lee("MULT", 1.0), kRow), 2.5);
    // k = 1 - 8 / 4 is negative.
    EXPECT_EQ(FilteredCentre(Lee("MULT", 8.0), kRow), 1.0);
}

// A mean of 2 divides the noise variance by 4 and counts twice in the deviation:
// k = 1 - 1 / 4, (3 - 2) * k + 1.
TEST(FilterFle, MultiplicativeMean)
{
    FilterFle oFilter;
    oFilter.SetParameters("MULT", 0.0, 2.0, 0.0, {4.0}, true);
    EXPECT_EQ(FilteredCentre(oFilter, kRow), 1.75);
}

// a = 8, k = 8 / (16 + 4 + 12) = 1 / 4, (3 - 2 - 5) * k + 1.
TEST(FilterFle, BothNoises)
{
    FilterFle oFilter;
    oFilter.SetParameters("BOTH", 5.0, 2.0, 0.0, {12.0}, true);
    EXPECT_EQ(FilteredCentre(oFilter, kRow), 0.0);
}

TEST(FilterFle, FlatWindowGivesTheMeanButForZerosUnderTheMultiplicativeModel)
{
    EXPECT_EQ(FilteredCentre(Lee("MULT", 1.0), Image<double>{{5, 5, 5}}), 5.0);
    EXPECT_TRUE(std::isnan(FilteredCentre(Lee("MULT", 1.0), Image<double>{{0, 0, 0}})));
    EXPECT_EQ(FilteredCentre(Lee("ADDI", 1.0), Image<double>{{0, 0, 0}}), 0.0);
}

TEST(FilterFle, OneValidSampleIsKept)
{
    const auto poMask = test::MaskOf({{0, 1, 0}}, {1, 0});
    for (const char* pszNoise : {"ADDI", "MULT", "BOTH"})
    {
        EXPECT_EQ(FilteredCentre(Lee(pszNoise, 1.0), Image<double>{{7, 5, 9}}, poMask.get()), 5.0);
    }
}

TEST(FilterFle, NoiseModelIsReadInAnyCase)
{
    FilterFle oFilter = Lee("mult", 1.0);
    EXPECT_EQ(FilteredCentre(oFilter, kRow), 2.5);
    oFilter.SetNoise("aDDi");
    EXPECT_EQ(FilteredCentre(oFilter, kRow), 2.0 * (4.0 / 5.0) + 1.0);
}

TEST(FilterFle, UnknownNoiseModelIsRefusedAndLeavesNone)
{
    for (const char* pszNoise : {"MULTI", "", "mul", " ADDI", "both "})
    {
        FilterFle oFilter = Lee("ADDI", 12.0);
        std::string oUpper(pszNoise);
        for (char& nLetter : oUpper)
        {
            nLetter = static_cast<char>(std::toupper(nLetter));
        }
        try
        {
            oFilter.SetNoise(pszNoise);
            FAIL() << "nothing was thrown";
        }
        catch (const ParameterException& oException)
        {
            EXPECT_EQ(oException.GetParameterName(), "NOISE");
            EXPECT_EQ(oException.GetType(), ParameterException::Type::eInvalidValue);
            EXPECT_EQ(oException.GetFirstText(), oUpper);
            EXPECT_EQ(oException.GetSecondText(), "ADDI/MULT/BOTH");
            EXPECT_EQ(oException.GetMessage(), "");
            EXPECT_EQ(oException.GetFile(), "");
            EXPECT_EQ(oException.GetFunction(), "");
            EXPECT_EQ(oException.GetLine(), 0U);
        }
        const auto poIn = test::RasterOf(kRow, {1, 0});
        const auto poOut = test::RasterOf(Image<double>{{777}});
        oFilter.Process(poIn.get(), nullptr, poOut.get(), nullptr);
        EXPECT_EQ(test::ImageOf<double>(*poOut), (Image<double>{{777}}));
    }
}

// Not even background.
TEST(FilterFle, NothingIsWrittenWithoutANoiseModel)
{
    FilterFle oFilter;
    for (const double dfThreshold : {0.0, 1.0})
    {
        oFilter.SetThrVar(dfThreshold);
        const auto poIn = test::BlankRaster(2, 2, 1, eDT_64R, {3, 3});
        const auto poMask = test::MaskOf(Image<int>(8, std::vector<int>(64, 0)), {3, 3});
        const auto poOut = test::BlankRaster(2, 2, 1, eDT_64R);
        const auto poBefore = test::BlankRaster(2, 2, 1, eDT_64R);
        oFilter.Process(poIn.get(), poMask.get(), poOut.get(), nullptr);
        EXPECT_TRUE(test::SameBits(*poOut, *poBefore));
    }
}

TEST(FilterFle, MultiplicativeMeanMustBePositive)
{
    FilterFle oFilter = Lee("MULT", 1.0);
    for (const double dfMean : {0.0, -0.0, -2.0})
    {
        try
        {
            oFilter.SetMulMean(dfMean);
            FAIL() << "nothing was thrown";
        }
        catch (const Exception& oException)
        {
            EXPECT_EQ(oException.GetMessage(), "Multiplicative Mean must be greater than 0");
            EXPECT_EQ(oException.GetFile(), "");
            EXPECT_EQ(oException.GetFunction(), "");
            EXPECT_EQ(oException.GetLine(), 0U);
        }
    }
    EXPECT_EQ(FilteredCentre(oFilter, kRow), 2.5);
}

// Without a value: 1 for additive noise, else one over the looks.
TEST(FilterFle, NoiseVarianceHasADefaultOfEachModel)
{
    FilterFle oFilter;
    oFilter.SetNLook(4.0);
    oFilter.SetNoise("ADDI");
    oFilter.SetNoiseVar({});
    EXPECT_EQ(FilteredCentre(oFilter, kRow), 2.0 * (4.0 / 5.0) + 1.0);
    oFilter.SetNoise("MULT");
    oFilter.SetNoiseVar({});
    EXPECT_EQ(FilteredCentre(oFilter, kRow), 2.0 * (1.0 - 0.25 / 4.0) + 1.0);
    oFilter.SetNoise("BOTH");
    oFilter.SetNoiseVar({});
    EXPECT_EQ(FilteredCentre(oFilter, kRow), 2.0 * (4.0 / (4.0 + 4.0 + 0.25)) + 1.0);
}

// Only the first value counts, and what was set before the call.
TEST(FilterFle, NoiseVarianceIsTakenAsTheOtherParametersAreThen)
{
    FilterFle oFilter;
    oFilter.SetNoiseVar({12.0, 1e9});
    oFilter.SetNoise("ADDI");
    EXPECT_EQ(FilteredCentre(oFilter, kRow), 1.5);
    oFilter.SetNoise("MULT");
    oFilter.SetNoiseVar({1.0});
    oFilter.SetMulMean(2.0);
    // The variance was divided by 1: k = 3 / 4, (3 - 2) * k + 1.
    EXPECT_EQ(FilteredCentre(oFilter, kRow), 1.75);
    oFilter.SetNoiseVar({});
    oFilter.SetNLook(100.0);
    EXPECT_EQ(FilteredCentre(oFilter, kRow), 1.75);
}

TEST(FilterFle, SetParametersKeepsWhatCameBeforeAnError)
{
    FilterFle oFilter;
    oFilter.SetParameters("BOTH", 5.0, 2.0, 0.0, {12.0}, true);
    EXPECT_THROW(oFilter.SetParameters("ADDI", 9.0, 0.0, 1.0, {1.0}, false), Exception);
    // The additive mean is 9 now: (3 - 2 - 9) / 4 + 1; and background the input.
    EXPECT_EQ(FilteredCentre(oFilter, kRow), -1.0);
    const auto poMask = test::MaskOf({{1, 0, 1}}, {1, 0});
    EXPECT_EQ(FilteredCentre(oFilter, kRow, poMask.get()), 3.0);
    EXPECT_THROW(oFilter.SetParameters("NONE", 9.0, 4.0, 1.0, {1.0}, false), ParameterException);
    oFilter.SetNoise("BOTH");
    // a = 16, k = 16 / (64 + 4 + 12) = 1 / 5, (3 - 4 - 9) / 5 + 1.
    EXPECT_EQ(FilteredCentre(oFilter, kRow), -1.0);
}

TEST(FilterFle, BackgroundIsZeroAtFirst)
{
    const Image<double> oImage = {{4, 4, 7, 4, 5}};
    const auto poMask = test::MaskOf({{1, 1, 0, 1, 0}}, {1, 0});
    const auto poClip = test::MaskOf({{1, 1, 0}});
    FilterFle oFilter = Lee("MULT", 1.0);
    EXPECT_EQ(Filtered(oFilter, oImage, {1, 0}, poMask.get(), poClip.get()),
              (Image<double>{{4, 0, 0}}));
    oFilter.SetBGZero(false);
    EXPECT_EQ(Filtered(oFilter, oImage, {1, 0}, poMask.get(), poClip.get()),
              (Image<double>{{4, 7, 4}}));
    FilterFle oKeeping(false);
    oKeeping.SetNoise("MULT");
    oKeeping.SetNoiseVar({1.0});
    EXPECT_EQ(Filtered(oKeeping, oImage, {1, 0}, poMask.get(), poClip.get()),
              (Image<double>{{4, 7, 4}}));
}

TEST(FilterFle, RegularPathHalvesTheSizes)
{
    const Image<double> oImage = {{100, 2, 2, 2, 100}};
    FilterFle oFilter = Lee("MULT", 1.0);
    oFilter.SetFilterSize(2, 1);
    EXPECT_EQ(Filtered(oFilter, oImage, {2, 0}), (Image<double>{{2}}));
    oFilter.SetFilterSize(3, boost::none);
    EXPECT_NE(Filtered(oFilter, oImage, {2, 0}), (Image<double>{{2}}));
}

TEST(FilterFle, CallOperatorKeepsTheGeometry)
{
    test::ExpectCallOperatorKeepsTheGeometry(Lee("MULT", 1.0));
    FilterFle oEnhanced = Lee("MULT", 1.0, 5.0);
    const auto poIn = std::make_shared<tessel::Raster>(tessel::RasterInfo(1, 1, 1, eDT_64R),
                                                       tessel::RasterContext(3, 3, 8, 9));
    std::fill_n(reinterpret_cast<double*>(poIn->mpBuffer), 49, 4.0);
    // The enhanced path is chosen here too: without an input mask nothing counts.
    EXPECT_TRUE(std::isnan(test::ImageOf<double>(*oEnhanced(poIn, nullptr, nullptr)).Samples()[0]));
}

TEST(FilterFle, GivesTheBitsOfTheDefinition)
{
    test::ExpectTheBitsOfThePlainLoop<test::MomentTerms>(
        150,
        [](test::Random& oRandom)
        {
            constexpr const char* kNoises[] = {"ADDI", "MULT", "BOTH"};
            constexpr double kVariances[] = {1.0, 0.0, 0.25, 900.0, -3.0};
            const auto nModel = static_cast<int>(oRandom() % 3);
            const double dfAddMean = oRandom() % 2 == 0 ? 0.0 : 7.5;
            const double dfMulMean = oRandom() % 2 == 0 ? 1.0 : 1.25;
            const double dfGiven = kVariances[oRandom() % std::size(kVariances)];
            const double dfNoiseVar = nModel == 1 ? dfGiven / (dfMulMean * dfMulMean) : dfGiven;
            FilterFle oFilter;
            oFilter.SetParameters(kNoises[nModel], dfAddMean, dfMulMean, 0.0, {dfGiven}, true);
            return std::pair(oFilter,
                             [=](const auto& oSums, double x) {
                                 return test::Lee(test::MomentsOf(oSums), x, nModel + 1, dfAddMean,
                                                  dfMulMean, dfNoiseVar);
                             });
        });
}

/// The enhanced path, step by step as it is defined.
struct EnhancedDefinition
{
    int nModel;
    double dfAddMean;
    double dfMulMean;
    double dfNoiseVar;
    double dfThrVar;
    bool bBGZero;

    void Run(const tessel::Raster& oIn, const tessel::Mask* poMaskIn, int hx, tessel::Raster& oOut,
             const tessel::Mask* poMaskOut) const
    {
        const int S = 2 * hx + 1;
        std::vector<double> W(static_cast<std::size_t>(std::max(S * S, 81)), 0.0);
        double subSum[9] = {};
        double subSumSq[9] = {};
        double subMean[9] = {};
        double subVar[9] = {};
        const bool bEstimate = nModel != 2 && dfNoiseVar == 0.0;
        double v = dfNoiseVar;
        for (int y = 0; y < static_cast<int>(oIn.mnHeight); ++y)
        {
            for (int x = 0; x < static_cast<int>(oIn.mnWidth); ++x)
            {
                for (std::uint32_t c = 0; c < oIn.mnChannels; ++c)
                {
                    const double centre = oIn.GetPixelAs<double>(x, y)[c];
                    double& out = oOut.GetPixelAs<double>(x, y)[c];
                    if (!test::IsValid(poMaskIn, x, y) || !test::IsValid(poMaskOut, x, y))
                    {
                        out = bBGZero ? 0.0 : centre;
                        continue;
                    }
                    double S1 = 0.0;
                    double S2 = 0.0;
                    double n = 0.0;
                    std::size_t i = 0;
                    for (int dy = -hx; dy <= hx; ++dy)
                    {
                        for (int dx = -hx; dx <= hx; ++dx, ++i)
                        {
                            if (poMaskIn != nullptr && test::IsValid(poMaskIn, x + dx, y + dy))
                            {
                                W[i] = oIn.GetPixelAs<double>(x + dx, y + dy)[c];
                                S1 += W[i];
                                S2 += W[i] * W[i];
                                n += 1.0;
                            }
                        }
                    }
                    double mean = S1 / n;
                    if (mean > -1e-9 && mean < 1e-9)
                    {
                        out = 0.0;
                        continue;
                    }
                    if (n == 1.0)
                    {
                        out = centre;
                        continue;
                    }
                    double var = (S2 - n * mean * mean) / n - 1.0;
                    if (var > dfThrVar || bEstimate)
                    {
                        SumSubBlocks(W, S, subSum, subSumSq, subMean, subVar);
                        if (bEstimate)
                        {
                            v = (subVar[8] + subVar[7] + subVar[6] + subVar[5] + subVar[4]) / 5.0;
                        }
                        if (dfThrVar > var)
                        {
                            TakeTriangle(W, S, subMean, mean, var);
                        }
                    }
                    out = Result(centre, mean, var, v);
                }
            }
        }
    }

    static void SumSubBlocks(const std::vector<double>& W, int S, double* subSum, double* subSumSq,
                             double* subMean, double* subVar)
    {
        const std::size_t o7[] = {0, 2, 5, 18, 20, 23, 45, 47, 50};
        const std::size_t o9[] = {0, 3, 6, 27, 30, 33, 54, 57, 60};
        for (int t = 0; t < 9; ++t)
        {
            for (const std::size_t d : {0U, 1U, 2U, 9U, 10U, 11U, 18U, 19U, 20U})
            {
                const double w = W[(S == 7 ? o7 : o9)[t] + d];
                subSum[t] += w;
                subSumSq[t] += w * w;
            }
            subMean[t] = subSum[t] / 9.0;
            subVar[t] = (subSumSq[t] - subMean[t] * 9.0 * subMean[t]) * 0.125;
        }
    }

    static void TakeTriangle(const std::vector<double>& W, int S, const double* subMean,
                             double& mean, double& var)
    {
        const int dir =
            std::fabs(subMean[4] - subMean[0]) > std::fabs(subMean[4] - subMean[8]) ? 4 : 0;
        const int nh = (S / 2 + 1) * S;
        double T1 = 0.0;
        double T2 = 0.0;
        for (int r = 0; r < S; ++r)
        {
            const int first = dir == 0 ? 0 : S - r;
            const int last = dir == 0 ? S - r - 1 : std::max(S - 1, first);
            for (int column = first; column <= last; ++column)
            {
                const double w = W[static_cast<std::size_t>(r * S + column)];
                T1 += w;
                T2 += w * w;
            }
        }
        mean = T1 / nh;
        var = (T2 - nh * mean * mean) / (nh - 1.0);
    }

    double Result(double x, double mean, double var, double v) const
    {
        if (nModel == 2)
        {
            double k = 0.0;
            if (!(var > -1e-9 && var < 1e-9))
            {
                k = 1.0 - mean * v * mean / var;
                if (k < 0.0)
                {
                    k = 0.0;
                }
            }
            return (x - mean * dfMulMean) * k + mean;
        }
        if (nModel == 1)
        {
            return (x - mean) * (var / (var + v)) + mean;
        }
        const double q = mean * mean;
        const double a = dfMulMean * var;
        const double k = a / (q * (var / q) + a * dfMulMean + v);
        return (x - dfMulMean * mean - dfAddMean) * k + mean;
    }
};

std::unique_ptr<tessel::Mask> AllValid(std::uint32_t nWidth, std::uint32_t nHeight,
                                       Margins oMargins)
{
    test::Random oRandom(1);
    return test::RandomMask(nWidth, nHeight, oMargins, 1.0, oRandom);
}

/// One pixel in the middle of 7 x 7, all samples dfAround but the middle.
double EnhancedOf7(const FilterFle& oFilter, double dfAround, double dfCentre)
{
    std::vector<double> vdfSamples(49, dfAround);
    vdfSamples[24] = dfCentre;
    const auto poMask = AllValid(1, 1, {3, 3});
    return FilteredCentre(oFilter, Image<double>(7, vdfSamples), poMask.get());
}

// Samples of 2 with 51 in the middle: mean = (96 + 51) / 49 = 3, sum of squares 192 + 2601 = 2793,
// var = (2793 - 441) / 49 - 1 = 47. Multiplicative noise of 47 / 18: k = 1 - 9 * 47 / 18 / 47 =
// 1/2.
TEST(FilterFle, VarianceIsOverTheCountLessOne)
{
    EXPECT_DOUBLE_EQ(EnhancedOf7(Lee("MULT", 47.0 / 18.0, 100.0), 2.0, 51.0), 27.0);
    EXPECT_DOUBLE_EQ(EnhancedOf7(Lee("ADDI", 47.0, 100.0), 2.0, 51.0), 27.0);
    // Both: q * (var / q) + var + noise = 47 + 47 + 94.
    EXPECT_DOUBLE_EQ(EnhancedOf7(Lee("BOTH", 94.0, 100.0), 2.0, 51.0), 48.0 / 4.0 + 3.0);
}

// A negative threshold is not 0 either.
TEST(FilterFle, MarginAndThresholdChooseThePath)
{
    const auto oIsEnhanced = [](std::uint32_t nMargin, double dfThreshold)
    {
        const auto nSide = 2 * nMargin + 1;
        const Image<double> oImage(nSide, std::vector<double>(nSide * nSide, 4.0));
        // Without an input mask the enhanced path gives no number.
        return std::isnan(FilteredCentre(Lee("MULT", 1.0, dfThreshold), oImage));
    };
    EXPECT_TRUE(oIsEnhanced(3, 1.0));
    EXPECT_TRUE(oIsEnhanced(4, 1.0));
    EXPECT_TRUE(oIsEnhanced(3, -1.0));
    EXPECT_FALSE(oIsEnhanced(2, 1.0));
    EXPECT_FALSE(oIsEnhanced(5, 1.0));
    EXPECT_FALSE(oIsEnhanced(3, 0.0));
    EXPECT_FALSE(oIsEnhanced(4, 0.0));
}

TEST(FilterFle, SizePlaysNoPartInTheChoice)
{
    FilterFle oFilter = Lee("MULT", 1.0, 1.0);
    oFilter.SetFilterSize(7, 7);
    const Image<double> oImage(11, std::vector<double>(121, 4.0));
    EXPECT_EQ(FilteredCentre(oFilter, oImage), 4.0);
}

// A size of 1 is a window of 3: mean = (4 + 4 + 4) / 3, var = 0 - 1.
TEST(FilterFle, EnhancedPathTakesTheSizeAsHalfTheWindow)
{
    const auto poMask = AllValid(1, 1, {3, 3});
    std::vector<double> vdfSamples(49, 1000.0);
    for (const std::size_t i : {16U, 17U, 18U, 23U, 24U, 25U, 30U, 31U, 32U})
    {
        vdfSamples[i] = 4.0;
    }
    FilterFle oFilter = Lee("MULT", 1.0, 1.0);
    oFilter.SetFilterSize(1, 1);
    // k = 1 + 16, but the pixel is the mean.
    EXPECT_EQ(FilteredCentre(oFilter, Image<double>(7, vdfSamples), poMask.get()), 4.0);
    // A size on one axis alone leaves the other to the margin.
    oFilter.SetFilterSize(3, boost::none);
    EXPECT_NE(FilteredCentre(oFilter, Image<double>(7, vdfSamples), poMask.get()), 4.0);
}

TEST(FilterFle, EnhancedPathNeedsAnInputMask)
{
    const Image<double> oImage(8, std::vector<double>(64, 4.0));
    const auto poClip = test::MaskOf({{1, 0}, {1, 1}});
    for (const char* pszNoise : {"ADDI", "MULT", "BOTH"})
    {
        for (const double dfNoiseVar : {0.0, 1.0})
        {
            const Image<double> oOut =
                Filtered(Lee(pszNoise, dfNoiseVar, 1.0), oImage, {3, 3}, nullptr, poClip.get());
            EXPECT_TRUE(std::isnan(oOut.Samples()[0]));
            EXPECT_EQ(oOut.Samples()[1], 0.0);
            EXPECT_TRUE(std::isnan(oOut.Samples()[2]));
            EXPECT_TRUE(std::isnan(oOut.Samples()[3]));
        }
    }
}

TEST(FilterFle, EnhancedPathGivesZeroForAMeanNearZero)
{
    EXPECT_EQ(EnhancedOf7(Lee("ADDI", 2.0, 1.0), 0.0, 4.8e-8), 0.0);
    EXPECT_NE(EnhancedOf7(Lee("ADDI", 2.0, 1.0), 0.0, 5e-8), 0.0);
    // One valid sample is kept only where it is not so near to 0.
    std::vector<int> vnValid(49, 0);
    vnValid[24] = 1;
    const auto poMask = test::MaskOf(Image<int>(7, vnValid), {3, 3});
    std::vector<double> vdfSamples(49, 9.0);
    vdfSamples[24] = -5.0;
    EXPECT_EQ(FilteredCentre(Lee("ADDI", 1.0, 1.0), Image<double>(7, vdfSamples), poMask.get()),
              -5.0);
    vdfSamples[24] = 1e-10;
    EXPECT_EQ(FilteredCentre(Lee("ADDI", 1.0, 1.0), Image<double>(7, vdfSamples), poMask.get()),
              0.0);
}

// Samples of 2 with 51 in the middle, var = 47 above the threshold of 1, no noise variance given.
// Of the blocks 4 to 8 (first entries 20, 23, 45, 47, 50; then 0..2, 9..11, 18..20 on from there)
// the first four hold 20 to 22, 29 to 31, 38 to 40; 23 to 25, 32 to 34, 41 to 43; 45 to 47; 47, 48
// of the 49 entries, so 51 stands in block 5: its sum is 67, squares 2633,
// variance (2633 - 67^2 / 9) / 8; the others are flat or have 3, 2 and no entries of 2.
TEST(FilterFle, NoiseIsEstimatedFromTheLastFiveSubBlocks)
{
    const auto oVariance = [](double dfSum, double dfSquares)
    { return (dfSquares - dfSum * dfSum / 9.0) / 8.0; };
    const double v = (0.0 + oVariance(6.0, 12.0) + oVariance(4.0, 8.0) + oVariance(67.0, 2633.0) +
                      oVariance(18.0, 36.0)) /
                     5.0;
    EXPECT_NEAR(EnhancedOf7(Lee("ADDI", 0.0, 1.0), 2.0, 51.0), 48.0 * 47.0 / (47.0 + v) + 3.0,
                1e-12);
}

// The second pixel's noise is estimated from the sums of both, unless the first one is not
// computed.
TEST(FilterFle, SubBlockSumsGrowFromPixelToPixel)
{
    std::vector<double> vdfSamples(56, 2.0);
    vdfSamples[27] = 51.0;
    const Image<double> oImage(8, vdfSamples);
    const auto poMask = AllValid(2, 1, {3, 3});
    const auto poClip = test::MaskOf({{0, 1}});
    const FilterFle oFilter = Lee("ADDI", 0.0, 1.0);
    const Image<double> oBoth = Filtered(oFilter, oImage, {3, 3}, poMask.get());
    const Image<double> oAlone = Filtered(oFilter, oImage, {3, 3}, poMask.get(), poClip.get());
    EXPECT_NE(oAlone.Samples()[1], oBoth.Samples()[1]);
    // A block that begins with the second pixel begins new sums too.
    std::vector<double> vdfSecond(49, 2.0);
    vdfSecond[23] = 51.0;
    const auto poSecondMask = AllValid(1, 1, {3, 3});
    EXPECT_EQ(FilteredCentre(oFilter, Image<double>(7, vdfSecond), poSecondMask.get()),
              oAlone.Samples()[1]);
    // A call leaves nothing behind.
    EXPECT_EQ(Filtered(oFilter, oImage, {3, 3}, poMask.get()), oBoth);
}

// Both channels count alike, so that the second one's noise is that of the first one's sums
// doubled: blocks 4 to 7 have sums 36, 134, 12, 8 and squares 72, 5266, 24, 16.
TEST(FilterFle, SubBlockSumsGrowFromChannelToChannel)
{
    std::vector<double> vdfSamples(98, 2.0);
    vdfSamples[48] = 51.0;
    vdfSamples[49] = 51.0;
    const auto poMask = AllValid(1, 1, {3, 3});
    const Image<double> oOut = Filtered(Lee("ADDI", 0.0, 1.0), Image<double>(14, vdfSamples),
                                        {3, 3}, poMask.get(), nullptr, 2);
    const double v =
        ((72.0 - 144.0) + (5266.0 - 17956.0 / 9.0) + (24.0 - 16.0) + (16.0 - 64.0 / 9.0)) / 8.0 /
        5.0;
    EXPECT_NEAR(oOut.Samples()[1], 48.0 * 47.0 / (47.0 + v) + 3.0, 1e-12);
    EXPECT_EQ(oOut.Samples()[0], EnhancedOf7(Lee("ADDI", 0.0, 1.0), 2.0, 51.0));
}

// Samples of 2 with 83 in the middle of 9 x 9: mean = 243 / 81 = 3, var = (7209 - 729) / 81 - 1 =
// 79. The blocks are the nine squares of 3 x 3 pixels; of those that count only number 4, in the
// middle, is not flat: sum 99, squares 6921, variance (6921 - 1089) / 8 = 729.
TEST(FilterFle, SubBlocksOf9PixelsAreSquares)
{
    std::vector<double> vdfSamples(81, 2.0);
    vdfSamples[40] = 83.0;
    const auto poMask = AllValid(1, 1, {4, 4});
    EXPECT_DOUBLE_EQ(
        FilteredCentre(Lee("ADDI", 0.0, 1.0), Image<double>(9, vdfSamples), poMask.get()),
        80.0 * 79.0 / (79.0 + 729.0 / 5.0) + 3.0);
}

/// The noise that is estimated in 7 x 7 samples of 4 with 32 in the middle, which stands in block
/// 5: its sum is 64, squares 1152; blocks 6 and 7 have three and two entries of 4, 4 is flat.
double NoiseOfFours()
{
    return ((1152.0 - 4096.0 / 9.0) + (48.0 - 16.0) + (32.0 - 64.0 / 9.0)) / 8.0 / 5.0;
}

// All samples but the middle are 4, so that blocks 0 and 4 have one mean: the upper left triangle
// counts, 28 entries with the middle among them. mean = 140 / 28 = 5, var = (1456 - 700) / 27 = 28.
TEST(FilterFle, VarianceBelowTheThresholdTakesTheUpperLeftTriangle)
{
    EXPECT_DOUBLE_EQ(EnhancedOf7(Lee("ADDI", 0.0, 1000.0), 4.0, 32.0),
                     27.0 * 28.0 / (28.0 + NoiseOfFours()) + 5.0);
    // Nothing is estimated from a noise that is known, nor under the multiplicative model: mean
    // 32 / 7 and var = (1792 - 1024) / 49 - 1 of the whole window.
    const double dfVar = 719.0 / 49.0;
    EXPECT_DOUBLE_EQ(EnhancedOf7(Lee("ADDI", 1.0, 1000.0), 4.0, 32.0),
                     (32.0 - 32.0 / 7.0) * (dfVar / (dfVar + 1.0)) + 32.0 / 7.0);
    EXPECT_DOUBLE_EQ(EnhancedOf7(Lee("MULT", 0.0, 1000.0), 4.0, 32.0), 32.0);
}

// 85 in the first entry lifts the mean of block 0 to 13, farther from 4 than the 0 of block 8: the
// lower right triangle counts. Its 21 entries are 4, and 28 in entry 7 joins them for the row that
// has none; all is divided by 28. mean = 112 / 28 = 4, var = (1120 - 448) / 27.
TEST(FilterFle, VarianceBelowTheThresholdTakesTheLowerRightTriangle)
{
    std::vector<double> vdfSamples(49, 4.0);
    vdfSamples[0] = 85.0;
    vdfSamples[7] = 28.0;
    vdfSamples[24] = 32.0;
    const auto poMask = AllValid(1, 1, {3, 3});
    const double dfVar = 672.0 / 27.0;
    EXPECT_DOUBLE_EQ(
        FilteredCentre(Lee("ADDI", 0.0, 1000.0), Image<double>(7, vdfSamples), poMask.get()),
        28.0 * dfVar / (dfVar + NoiseOfFours()) + 4.0);
}

// Entry 20 of the second pixel's window is masked and still holds the 20 of the first one's. So
// both add 36 and 432 to block 4, and 18 and 36, 6 and 12, 4 and 8 to the next three. 47 samples of
// 2 and one of 20 count for mean = 114 / 48 and var = 588 / 48 - mean^2 - 1.
TEST(FilterFle, MaskedSampleLeavesTheOneBeforeInTheSubBlocks)
{
    std::vector<double> vdfSamples(56, 2.0);
    std::vector<int> vnValid(56, 1);
    vdfSamples[2 * 8 + 6] = 20.0;
    vdfSamples[2 * 8 + 7] = NAN;
    vnValid[2 * 8 + 7] = 0;
    const auto poMask = test::MaskOf(Image<int>(8, vnValid), {3, 3});
    const Image<double> oOut =
        Filtered(Lee("ADDI", 0.0, 1.0), Image<double>(8, vdfSamples), {3, 3}, poMask.get());
    const double v =
        ((864.0 - 576.0) + (72.0 - 144.0) + (24.0 - 16.0) + (16.0 - 64.0 / 9.0)) / 8.0 / 5.0;
    const double dfVar = 12.25 - 2.375 * 2.375 - 1.0;
    EXPECT_DOUBLE_EQ(oOut.Samples()[1], (2.0 - 2.375) * (dfVar / (dfVar + v)) + 2.375);
}

// 4 and 6: mean 5 and var = (52 - 50) / 2 - 1 = 0, where k is 0 and not 1 - 0 / 0.
TEST(FilterFle, MultiplicativeNoiseWithoutVarianceGivesTheMean)
{
    std::vector<double> vdfSamples(49, 1000.0);
    std::vector<int> vnValid(49, 0);
    vdfSamples[24] = 4.0;
    vdfSamples[48] = 6.0;
    vnValid[24] = 1;
    vnValid[48] = 1;
    const auto poMask = test::MaskOf(Image<int>(7, vnValid), {3, 3});
    EXPECT_EQ(FilteredCentre(Lee("MULT", 0.0, 1.0), Image<double>(7, vdfSamples), poMask.get()),
              5.0);
}

TEST(FilterFle, BackgroundOfTheEnhancedPathIsZeroOrTheInputInAllChannels)
{
    std::vector<double> vdfSamples(9 * 7 * 2, 4.0);
    for (std::size_t x = 0; x < 3; ++x)
    {
        vdfSamples[(3 * 9 + 3 + x) * 2] = 5.0;
    }
    const Image<double> oImage(18, vdfSamples);
    std::vector<int> vnValid(63, 1);
    vnValid[3 * 9 + 3] = 0;
    const auto poMask = test::MaskOf(Image<int>(9, vnValid), {3, 3});
    const auto poClip = test::MaskOf({{1, 0, 0}});
    FilterFle oFilter = Lee("MULT", 1.0, 1.0);
    EXPECT_EQ(Filtered(oFilter, oImage, {3, 3}, poMask.get(), poClip.get(), 2),
              (Image<double>{{0, 0, 0, 0, 0, 0}}));
    oFilter.SetBGZero(false);
    EXPECT_EQ(Filtered(oFilter, oImage, {3, 3}, poMask.get(), poClip.get(), 2),
              (Image<double>{{5, 4, 5, 4, 5, 4}}));
}

void ExpectMarginError(const FilterFle& oFilter, Margins oMargins, const char* pszMessage)
{
    const auto poIn = test::BlankRaster(1, 1, 1, eDT_64R, oMargins);
    const auto poOut = test::BlankRaster(1, 1, 1, eDT_64R);
    try
    {
        oFilter.ProcessEnhancedBlock(poIn.get(), nullptr, poOut.get(), nullptr);
        FAIL() << "nothing was thrown";
    }
    catch (const ParameterException& oException)
    {
        EXPECT_EQ(oException.GetMessage(), pszMessage);
        EXPECT_EQ(oException.GetParameterName(), "oRasterIn");
        EXPECT_EQ(oException.GetType(), ParameterException::Type::eInvalidValue);
        EXPECT_EQ(oException.GetFirstText(), "");
        EXPECT_EQ(oException.GetSecondText(), "");
        EXPECT_EQ(oException.GetFile(), "processes/qrdfilters/filterfle");
        EXPECT_NE(oException.GetFunction().find("ProcessEnhancedBlock"), std::string::npos);
        EXPECT_GT(oException.GetLine(), 0U);
    }
}

TEST(FilterFle, EnhancedPathRefusesAWindowWithoutNeighbours)
{
    constexpr const char* kMessage = "The Margin of the input raster is too small.";
    ExpectMarginError(Lee("MULT", 1.0), {0, 0}, kMessage);
    ExpectMarginError(Lee("MULT", 1.0), {3, 0}, kMessage);
    ExpectMarginError(Lee("MULT", 1.0), {0, 3}, kMessage);
    FilterFle oFilter = Lee("MULT", 1.0);
    oFilter.SetFilterSize(-3, -3);
    ExpectMarginError(oFilter, {3, 3}, kMessage);
}

TEST(FilterFle, EnhancedPathRefusesAWindowThatIsNotSquare)
{
    constexpr const char* kMessage = "The Margin of the input raster must be the same.";
    ExpectMarginError(Lee("MULT", 1.0), {3, 4}, kMessage);
    FilterFle oFilter = Lee("MULT", 1.0);
    oFilter.SetFilterSize(boost::none, 2);
    ExpectMarginError(oFilter, {3, 3}, kMessage);
}

TEST(FilterFle, EnhancedPathGivesTheBitsOfTheDefinition)
{
    test::Random oRandom(11);
    const auto oBelow = [&](std::uint32_t nEnd)
    { return static_cast<std::uint32_t>(oRandom() % nEnd); };
    constexpr const char* kNoises[] = {"ADDI", "MULT", "BOTH"};
    constexpr double kThresholds[] = {1.0, 30.0, 1500.0, -5.0, 1e6};
    for (unsigned int nCase = 0; nCase < 240; ++nCase)
    {
        const Margins oMargins{3 + nCase % 2, 3 + nCase % 2};
        const bool bSized = oBelow(3) == 0;
        const int hx =
            bSized ? 1 + static_cast<int>(oBelow(oMargins.x)) : static_cast<int>(oMargins.x);
        const std::uint32_t nWidth = 1 + oBelow(12);
        const std::uint32_t nHeight = 1 + oBelow(6);
        const auto poIn = test::BlankRaster(nWidth, nHeight, 1 + oBelow(4), eDT_64R, oMargins);
        test::FillWithSpeckle(*poIn, oRandom);
        const auto poMaskIn =
            test::RandomMask(nWidth, nHeight, oMargins, nCase % 3 == 0 ? 1.0 : 0.8, oRandom);
        const auto poMaskOut = test::RandomMask(nWidth, nHeight, {1, 0}, 0.8, oRandom);
        tessel::Mask* poIgnored = oBelow(10) != 0 ? poMaskIn.get() : nullptr;
        tessel::Mask* poClipped = oBelow(2) == 0 ? poMaskOut.get() : nullptr;

        EnhancedDefinition oDefinition{};
        oDefinition.nModel = 1 + static_cast<int>(oBelow(3));
        oDefinition.dfAddMean = oBelow(2) == 0 ? 0.0 : 2.5;
        oDefinition.dfMulMean = oBelow(2) == 0 ? 1.0 : 2.0;
        oDefinition.dfThrVar = kThresholds[oBelow(std::size(kThresholds))];
        oDefinition.bBGZero = oBelow(2) == 0;
        const double dfGiven = oBelow(2) == 0 ? 0.0 : 4.0;
        oDefinition.dfNoiseVar = oDefinition.nModel == 2
                                     ? dfGiven / (oDefinition.dfMulMean * oDefinition.dfMulMean)
                                     : dfGiven;
        FilterFle oFilter;
        oFilter.SetParameters(kNoises[oDefinition.nModel - 1], oDefinition.dfAddMean,
                              oDefinition.dfMulMean, oDefinition.dfThrVar, {dfGiven},
                              oDefinition.bBGZero);
        if (bSized)
        {
            oFilter.SetFilterSize(hx, hx);
        }
        const auto poActual = test::BlankRaster(nWidth, nHeight, poIn->mnChannels, eDT_64R, {1, 1});
        const auto poExpected =
            test::BlankRaster(nWidth, nHeight, poIn->mnChannels, eDT_64R, {1, 1});
        oFilter.Process(poIn.get(), poIgnored, poActual.get(), poClipped);
        oDefinition.Run(*poIn, poIgnored, hx, *poExpected, poClipped);
        ASSERT_TRUE(test::SameBits(*poActual, *poExpected)) << "case " << nCase;
    }
}

}  // namespace
}  // namespace kor::filters
