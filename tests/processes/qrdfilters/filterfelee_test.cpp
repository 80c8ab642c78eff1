#include "processes/qrdfilters/filterfelee.h"

#include <gtest/gtest.h>

#include <cmath>

#include "processes/qrdfilters/kernels/specklerows.h"
#include "tests/support/exceptions.h"
#include "tests/support/speckledefinitions.h"
#include "tests/support/windowfilters.h"

namespace kor::filters
{
namespace
{

using test::Filtered;
using test::FilteredCentre;
using test::Image;

FilterFelee EnhancedLee(double dfLooks, double dfDamp)
{
    FilterFelee oFilter;
    oFilter.SetNLook(dfLooks);
    oFilter.SetDamp(dfDamp);
    return oFilter;
}

// mean = 1, sd = 2, Ci = 2 between Cu = sqrt(2) and Cmax = sqrt(5).
const Image<double> kBetween = {{-1, 3, 1}};

TEST(FilterFelee, BlendsThePixelAndTheMeanBetween)
{
    const double e = std::exp(-((2.0 - 1.0 / std::sqrt(0.5)) * 1.5 / (std::sqrt(5.0) - 2.0)));
    EXPECT_DOUBLE_EQ(FilteredCentre(EnhancedLee(0.5, 1.5), kBetween), (1.0 - e) * 3.0 + e);
}

TEST(FilterFelee, NoDampingGivesTheMeanBetween)
{
    EXPECT_EQ(FilteredCentre(EnhancedLee(0.5, 0.0), kBetween), 1.0);
}

// mean = 10, Ci = 1 / 10.
TEST(FilterFelee, HomogeneousWindowGivesTheMean)
{
    EXPECT_EQ(FilteredCentre(EnhancedLee(1.0, 1.0), Image<double>{{9, 11, 10}}), 10.0);
    // Ci = Cu = 2 still is homogeneous.
    EXPECT_EQ(FilteredCentre(EnhancedLee(0.25, 1.0), kBetween), 1.0);
}

// Ci = sqrt(3) / 1 and Cmax = sqrt(2 / 1 + 1) are the same number.
TEST(FilterFelee, PointTargetIsKept)
{
    EXPECT_EQ(FilteredCentre(EnhancedLee(1.0, 1.0), Image<double>{{0, 3, 0}}), 3.0);
    EXPECT_EQ(FilteredCentre(EnhancedLee(2.0, 1.0), Image<double>{{0, 3, 0}}), 3.0);
}

TEST(FilterFelee, MeanOfZeroKeepsThePixel)
{
    EXPECT_EQ(FilteredCentre(EnhancedLee(1.0, 1.0), Image<double>{{1, -2, 1}}), -2.0);
}

TEST(FilterFelee, WindowOfZerosIsNotANumber)
{
    EXPECT_TRUE(std::isnan(FilteredCentre(EnhancedLee(1.0, 1.0), Image<double>{{0, 0, 0}})));
}

TEST(FilterFelee, OneValidSampleIsKept)
{
    const auto poMask = test::MaskOf({{0, 1, 0}}, {1, 0});
    EXPECT_EQ(FilteredCentre(EnhancedLee(1.0, 1.0), Image<double>{{7, 5, 9}}, poMask.get()), 5.0);
}

// 1 / sqrt(0) is infinite: everything is homogeneous.
TEST(FilterFelee, ZeroLooksAreAccepted)
{
    EXPECT_EQ(FilteredCentre(EnhancedLee(0.0, 1.0), Image<double>{{0, 3, 0}}), 1.0);
}

void ExpectUntracedMessage(const std::function<void()>& oAction, const char* pszMessage)
{
    try
    {
        oAction();
        FAIL() << "nothing was thrown";
    }
    catch (const Exception& oException)
    {
        EXPECT_EQ(oException.GetMessage(), pszMessage);
        EXPECT_EQ(oException.GetFile(), "");
        EXPECT_EQ(oException.GetFunction(), "");
        EXPECT_EQ(oException.GetLine(), 0U);
    }
}

TEST(FilterFelee, NegativeDampingIsRefused)
{
    FilterFelee oFilter = EnhancedLee(0.5, 0.0);
    ExpectUntracedMessage([&] { oFilter.SetDamp(-1e-300); },
                          "Damping factor must be a positive number");
    EXPECT_EQ(FilteredCentre(oFilter, kBetween), 1.0);
}

TEST(FilterFelee, NegativeLooksAreRefused)
{
    FilterFelee oFilter = EnhancedLee(0.5, 0.0);
    ExpectUntracedMessage([&] { oFilter.SetNLook(-1.0); },
                          "Number of looks must be a positive number");
    EXPECT_EQ(FilteredCentre(oFilter, kBetween), 1.0);
}

TEST(FilterFelee, BackgroundIsTheInputAtFirst)
{
    const Image<double> oImage = {{4, 4, 7, 4, 5}};
    const auto poMask = test::MaskOf({{1, 1, 0, 1, 0}}, {1, 0});
    const auto poClip = test::MaskOf({{1, 1, 0}});
    FilterFelee oFilter = EnhancedLee(1.0, 1.0);
    EXPECT_EQ(Filtered(oFilter, oImage, {1, 0}, poMask.get(), poClip.get()),
              (Image<double>{{4, 7, 4}}));
    oFilter.SetBGZero(true);
    EXPECT_EQ(Filtered(oFilter, oImage, {1, 0}, poMask.get(), poClip.get()),
              (Image<double>{{4, 0, 0}}));
}

TEST(FilterFelee, SizesCountOnlyTogetherAndAreHalved)
{
    const Image<double> oImage = {{100, 2, 2, 2, 100}};
    FilterFelee oFilter = EnhancedLee(1.0, 1.0);
    oFilter.SetFilterSize(2, 1);
    EXPECT_EQ(Filtered(oFilter, oImage, {2, 0}), (Image<double>{{2}}));
    oFilter.SetFilterSize(3, boost::none);
    EXPECT_NE(Filtered(oFilter, oImage, {2, 0}), (Image<double>{{2}}));
}

TEST(FilterFelee, CallOperatorKeepsTheGeometry)
{
    test::ExpectCallOperatorKeepsTheGeometry(EnhancedLee(1.0, 1.0));
}

/// The exponential function of the kernel, whose distance from the C library's is tested with it: a
/// window of mean 1 and variation 1 between 0 and 2, whose pixel is 0.
double ExpOfKernel(double x)
{
    const std::vector<double> vdfTwos(8, 2.0);
    const std::vector<double> vdfSquares(8, 3.0);
    const std::vector<double> vdfZeros(8, 0.0);
    std::vector<double> vdfOut(8);
    kernels::EnhancedLeeRow({vdfTwos.data(), vdfSquares.data(), vdfTwos.data(), vdfZeros.data()},
                            0.0, 2.0, -x, vdfOut);
    return vdfOut[0];
}

TEST(FilterFelee, GivesTheBitsOfTheDefinition)
{
    test::ExpectTheBitsOfThePlainLoop<test::MomentTerms>(
        120,
        [](test::Random& oRandom)
        {
            constexpr double kLooks[] = {1.0, 0.3, 4.0, 0.0, 1e-5};
            constexpr double kDamps[] = {1.0, 0.0, 0.1, 50.0};
            const double dfLooks = kLooks[oRandom() % std::size(kLooks)];
            const double dfDamp = kDamps[oRandom() % std::size(kDamps)];
            const double Cu = 1.0 / std::sqrt(dfLooks);
            const double Cmax = std::sqrt(2.0 / dfLooks + 1.0);
            return std::pair(EnhancedLee(dfLooks, dfDamp),
                             [=](const auto& oSums, double x) {
                                 return test::EnhancedLee(test::MomentsOf(oSums), x, Cu, Cmax,
                                                          dfDamp, ExpOfKernel);
                             });
        });
}

}  // namespace
}  // namespace kor::filters
