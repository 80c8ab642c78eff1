#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <functional>
#include <limits>
#include <memory>
#include <vector>

#include "platform/exception/exception.h"
#include "processes/qrdfilters/datacopy.h"
#include "processes/qrdfilters/hardened.h"
#include "tests/support/conversionreference.h"
#include "tests/support/exceptions.h"
#include "tests/support/threads.h"

namespace kor::filters
{
namespace
{

using tessel::Mask;
using tessel::Raster;
using test::BlankRaster;
using test::Image;
using test::ImageOf;
using test::Margins;
using test::Random;
using test::RasterOf;
using test::SameBits;
using typedispatch::RealDataType;

using Bytes = Image<std::uint8_t>;
using Doubles = Image<double>;
using Floats = Image<float>;

/// Gives the same mask to every block.
class DrawnClip : public tessel::IMaskBuilder
{
public:
    explicit DrawnClip(const Image<int>& oImage, Margins oMargins = {})
        : moImage(oImage), moMargins(oMargins)
    {
    }
    Mask* BuildMask(const Raster& /*oRaster*/) const override
    {
        return test::MaskOf(moImage, moMargins).release();
    }

private:
    Image<int> moImage;
    Margins moMargins;
};

/// The output after oIn was written onto oOut by a copy of these parameters.
template <class TIn, class TOut>
Image<TOut> Written(ExtendedDataCopy& oCopy, const Image<TIn>& oIn, const Image<TOut>& oOut,
                    std::uint32_t nChannels = 1)
{
    const auto poOut = RasterOf(oOut, {}, nChannels);
    oCopy.SetProcessStage(ePS_Apply);
    oCopy.ProcessBlock(RasterOf(oIn, {}, nChannels).get(), poOut.get());
    return ImageOf<TOut>(*poOut);
}

/// Shows a block to the gather stage, all of it overlap or, without a mask, all of it valid.
template <class TIn, class TOut>
void Show(ExtendedDataCopy& oCopy, const Image<TIn>& oIn, const Image<TOut>& oOut, bool bOverlap)
{
    DrawnClip oClip(
        Image<int>(oIn.Columns(), std::vector<int>(oIn.Columns() * oIn.Rows(), bOverlap ? 0 : 1)));
    oCopy.SetClipBuilder(&oClip);
    oCopy.SetProcessStage(ePS_Gather);
    const auto poOut = RasterOf(oOut);
    oCopy.ProcessBlock(RasterOf(oIn).get(), poOut.get());
    EXPECT_TRUE(SameBits(*poOut, *RasterOf(oOut))) << "the gather stage wrote";
    oCopy.SetClipBuilder(nullptr);
}

// The four cells of the left half have the means 0, 1, 2, 4 and 10, 4, 4, 20.
const Doubles kOverlapIn = {
    {0, 0, 2, 2, 6, 900, 900, 900},
    {0, 0, 2, 2, 6, 900, 900, 900},
};
const Doubles kOverlapOut = {
    {12, 8, 0, 8, 32, -500, -500, -500},
    {12, 8, 0, 8, 32, -500, -500, -500},
};

ExtendedDataCopy Balanced(int nMode)
{
    ExtendedDataCopy oCopy;
    oCopy.SetBalanceMode(nMode);
    oCopy.SetSampleBand(100);
    oCopy.SetInputNoData(-9999);
    oCopy.SetOutputNoData(-9999);
    return oCopy;
}

TEST(ExtendedDataCopy, CopiesEverythingByDefault)
{
    ExtendedDataCopy oCopy;
    EXPECT_EQ(Written(oCopy, Floats{{1, 2.5F}, {-3, 300}}, Bytes{{9, 9}, {9, 9}}),
              (Bytes{{1, 3}, {0, 255}}));
}

TEST(ExtendedDataCopy, BeginsWithTheGatherStage)
{
    ExtendedDataCopy oCopy;
    const auto poOut = RasterOf(Bytes{{9, 9}, {9, 9}});
    oCopy.ProcessBlock(RasterOf(Bytes{{1, 2}, {3, 4}}).get(), poOut.get());
    EXPECT_EQ(ImageOf<std::uint8_t>(*poOut), (Bytes{{9, 9}, {9, 9}}));
}

TEST(ExtendedDataCopy, FeathersTheEdgeOfTheValidArea)
{
    ExtendedDataCopy oCopy;
    oCopy.SetBlendWidth(5);
    DrawnClip oClip({{1, 0, 0, 0, 0, 0, 0}});
    oCopy.SetClipBuilder(&oClip);
    // 4/5 of the new 100 and 1/5 of the old 10, then 3/5 and 2/5, and so on.
    EXPECT_EQ(Written(oCopy, Doubles{{100, 100, 100, 100, 100, 100, 100}},
                      Doubles{{10, 10, 10, 10, 10, 10, 10}}),
              (Doubles{{100, 82, 64, 46, 28, 10, 10}}));
}

TEST(ExtendedDataCopy, WritesOnlyTheValidAreaWithoutABlendWidth)
{
    for (const int nBlendWidth : {0, -3, 1})
    {
        ExtendedDataCopy oCopy;
        oCopy.SetBlendWidth(nBlendWidth);
        DrawnClip oClip({{0, 1, 0}});
        oCopy.SetClipBuilder(&oClip);
        EXPECT_EQ(Written(oCopy, Bytes{{1, 2, 3}}, Bytes{{7, 8, 9}}), (Bytes{{7, 2, 9}}))
            << nBlendWidth;
    }
}

TEST(ExtendedDataCopy, BlendsInSinglePrecision)
{
    ExtendedDataCopy oCopy;
    oCopy.SetBlendWidth(3);
    DrawnClip oClip({{1, 0}});
    oCopy.SetClipBuilder(&oClip);
    const float fBlended = (2.0F * 0.1F + 1.0F * 0.7F) / 3.0F;
    EXPECT_EQ(Written(oCopy, Doubles{{0.3, 0.1}}, Doubles{{0.0, 0.7}}),
              (Doubles{{0.3F, fBlended}}));
}

TEST(ExtendedDataCopy, FeathersAllChannelsOfAPixelAlike)
{
    ExtendedDataCopy oCopy;
    oCopy.SetBlendWidth(2);
    DrawnClip oClip({{1, 0, 0}});
    oCopy.SetClipBuilder(&oClip);
    EXPECT_EQ(Written(oCopy, Bytes{{10, 20, 30, 40, 50, 60}}, Bytes{{0, 0, 10, 60, 7, 8}}, 2),
              (Bytes{{10, 20, 20, 50, 7, 8}}));
}

TEST(ExtendedDataCopy, LeavesMarginsAlone)
{
    ExtendedDataCopy oCopy;
    oCopy.SetProcessStage(ePS_Apply);
    const auto poIn = RasterOf(Bytes{{1, 1, 1}, {1, 5, 1}, {1, 1, 1}}, Margins{1, 1});
    const auto poOut = RasterOf(Bytes{{7, 7, 7}}, Margins{1, 0});
    oCopy.ProcessBlock(poIn.get(), poOut.get());
    EXPECT_TRUE(SameBits(*poOut, *RasterOf(Bytes{{7, 5, 7}}, Margins{1, 0})));
}

TEST(ExtendedDataCopy, IsNeutralBeforeTheFirstBlock)
{
    ExtendedDataCopy oCopy;
    oCopy.SetFixedGain(true);
    oCopy.SetGain(9);
    oCopy.SetOffset(9);
    EXPECT_EQ(oCopy.GetGain(), 1);
    EXPECT_EQ(oCopy.GetOffset(), 0);
}

TEST(ExtendedDataCopy, IsNeutralWithoutAMode)
{
    for (const int nMode : {0, 4, -1})
    {
        ExtendedDataCopy oCopy = Balanced(nMode);
        Show(oCopy, kOverlapIn, kOverlapOut, true);
        EXPECT_EQ(oCopy.GetGain(), 1);
        EXPECT_EQ(oCopy.GetOffset(), 0);
    }
}

// Pairs of i = 0..3 with j = 0 and 2, slopes and intercepts:
// i 0: j 2: (10 - 4) / (0 - 2) = -3, 10. i 1: j 0: -6, 10; j 2: (4 - 4) / -1 = 0, 4.
// i 2: j 0: -3, 10. i 3: j 0: 10 / 4 = 2.5, 10; j 2: 16 / 2 = 8, -12.
// Number 3 of -6 -3 -3 0 2.5 8 and of -12 4 10 10 10 10.
TEST(ExtendedDataCopy, ModeOneTakesTheMedianOfPairwiseLines)
{
    ExtendedDataCopy oCopy = Balanced(1);
    Show(oCopy, kOverlapIn, kOverlapOut, true);
    EXPECT_EQ(oCopy.GetGain(), 0);
    EXPECT_EQ(oCopy.GetOffset(), 10);
}

// Sorted 0 1 2 4 and 4 4 10 20, one left out at each end: from 1 to 4 and from 2 to 10.
TEST(ExtendedDataCopy, ModeTwoMatchesPercentiles)
{
    ExtendedDataCopy oCopy = Balanced(2);
    oCopy.SetLowPercentile(0.25);
    oCopy.SetHighPercentile(0.25);
    Show(oCopy, kOverlapIn, kOverlapOut, true);
    EXPECT_EQ(oCopy.GetGain(), 6);
    EXPECT_EQ(oCopy.GetOffset(), -2);
    EXPECT_EQ(Written(oCopy, Doubles{{1, 2, 5}}, Doubles{{0, 0, 0}}), (Doubles{{4, 10, 28}}));
}

TEST(ExtendedDataCopy, ModeThreeBlanksTheOutput)
{
    ExtendedDataCopy oCopy = Balanced(3);
    Show(oCopy, kOverlapIn, kOverlapOut, true);
    EXPECT_EQ(oCopy.GetGain(), 0);
    EXPECT_EQ(oCopy.GetOffset(), 0);
    EXPECT_EQ(Written(oCopy, Doubles{{1, 2}}, Doubles{{7, 7}}), (Doubles{{0, 0}}));
}

TEST(ExtendedDataCopy, IsNeutralWithoutSamples)
{
    for (const int nMode : {1, 2})
    {
        ExtendedDataCopy oCopy = Balanced(nMode);
        Show(oCopy, kOverlapIn, kOverlapOut, false);
        EXPECT_EQ(oCopy.GetGain(), 1);
        EXPECT_EQ(oCopy.GetOffset(), 0);
    }
}

// Line (6, -2) from the overlap, whose inputs run from 0 to 4; the valid area from 10 to 30.
// Gain 0.5 * 6; offset 0.5 * 6 * 2 - 2 + ((6 * 30 - 2) - (6 * 10 - 2)) * 0.25 = 6 - 2 + 30.
TEST(ExtendedDataCopy, AdjustsTheLineOnceBeforeTheFirstWrittenBlock)
{
    ExtendedDataCopy oCopy = Balanced(2);
    oCopy.SetLowPercentile(0.25);
    oCopy.SetHighPercentile(0.25);
    oCopy.SetStretchFactor(0.5);
    oCopy.SetOffsetShare(0.25);
    Show(oCopy, kOverlapIn, kOverlapOut, true);
    Show(oCopy, Doubles{{30, 10, 99, 99}, {99, 99, 99, 99}}, Doubles{{0, 0, 0, 0}, {0, 0, 0, 0}},
         false);
    EXPECT_EQ(oCopy.GetGain(), 6);
    EXPECT_EQ(oCopy.GetOffset(), -2);
    for (int i = 0; i < 2; ++i)
    {
        EXPECT_EQ(Written(oCopy, Doubles{{5}}, Doubles{{0}}), (Doubles{{49}}));
        EXPECT_EQ(oCopy.GetGain(), 3);
        EXPECT_EQ(oCopy.GetOffset(), 34);
    }
}

// No samples: the middle is 1, and the range counts as 0. Offset 0.5 * 1 * 1 + 0 + 0.
TEST(ExtendedDataCopy, AdjustsWithoutSamplesAroundOne)
{
    ExtendedDataCopy oCopy;
    oCopy.SetStretchFactor(0.5);
    oCopy.SetOffsetShare(3);
    EXPECT_EQ(Written(oCopy, Doubles{{5}}, Doubles{{0}}), (Doubles{{3}}));
    EXPECT_EQ(oCopy.GetOffset(), 0.5);
}

TEST(ExtendedDataCopy, KeepsAFixedGainAsItIs)
{
    ExtendedDataCopy oCopy = Balanced(2);
    oCopy.SetFixedGain(true);
    oCopy.SetGain(2);
    oCopy.SetOffset(3);
    oCopy.SetStretchFactor(0.5);
    oCopy.SetOffsetShare(0.5);
    Show(oCopy, kOverlapIn, kOverlapOut, true);
    EXPECT_EQ(oCopy.GetGain(), 2);
    EXPECT_EQ(oCopy.GetOffset(), 3);
    EXPECT_EQ(Written(oCopy, Doubles{{5}}, Doubles{{0}}), (Doubles{{13}}));
    EXPECT_EQ(oCopy.GetGain(), 2);
}

TEST(ExtendedDataCopy, FindsTheGainOnce)
{
    ExtendedDataCopy oCopy = Balanced(2);
    Show(oCopy, kOverlapIn, kOverlapOut, true);
    EXPECT_EQ(oCopy.GetGain(), 4);  // from (0, 4) to (4, 20)
    Show(oCopy, kOverlapOut, kOverlapIn, true);
    EXPECT_EQ(oCopy.GetGain(), 4);
}

TEST(ExtendedDataCopy, ForgetsItsSamplesWhenTheTypesChange)
{
    ExtendedDataCopy oCopy = Balanced(2);
    Show(oCopy, kOverlapIn, kOverlapOut, true);
    EXPECT_EQ(Written(oCopy, Floats{{5}}, Doubles{{0}}), (Doubles{{5}}));
    EXPECT_EQ(oCopy.GetGain(), 1);
}

TEST(ExtendedDataCopy, TakesParametersWhenItsProcessorIsMade)
{
    ExtendedDataCopy oCopy;
    oCopy.SetFixedGain(true);
    oCopy.SetGain(2);
    EXPECT_EQ(Written(oCopy, Bytes{{5}}, Bytes{{0}}), (Bytes{{10}}));
    oCopy.SetGain(3);
    EXPECT_EQ(Written(oCopy, Bytes{{5}}, Bytes{{0}}), (Bytes{{10}}));
    EXPECT_EQ(Written(oCopy, Bytes{{5}}, Floats{{0}}), (Floats{{15}}));
}

// (15 - 10)^2 / (20 - 10) + 10; both ends of the knee stay as they are.
TEST(ExtendedDataCopy, BendsValuesOnTheKnee)
{
    ExtendedDataCopy oCopy;
    oCopy.SetKneeLow(10);
    oCopy.SetKneeStart(12);
    oCopy.SetKneeHigh(20);
    const Doubles oIn = {{11, 12, 15, 20, 25}};
    const Doubles oZeros = {{0, 0, 0, 0, 0}};
    EXPECT_EQ(Written(oCopy, oIn, oZeros), oIn);
    ExtendedDataCopy oBending;
    oBending.SetKneeLow(10);
    oBending.SetKneeStart(12);
    oBending.SetKneeHigh(20);
    oBending.SetUseKnee(true);
    EXPECT_EQ(Written(oBending, oIn, oZeros), (Doubles{{11, 12, 12.5, 20, 25}}));
}

TEST(ExtendedDataCopy, SkipsInputNoDataSampleBySample)
{
    ExtendedDataCopy oCopy;
    oCopy.SetInputNoData(7);
    oCopy.SetUseInputNoData(true);
    EXPECT_EQ(Written(oCopy, Bytes{{7, 1, 2, 7, 7, 7}}, Bytes{{9, 9, 9, 9, 9, 9}}, 2),
              (Bytes{{9, 1, 2, 9, 9, 9}}));
}

TEST(ExtendedDataCopy, CopiesInputNoDataWithoutTheFlag)
{
    ExtendedDataCopy oCopy;
    oCopy.SetInputNoData(7);
    oCopy.SetOutputNoData(7);
    EXPECT_EQ(Written(oCopy, Bytes{{7, 1}}, Bytes{{9, 9}}), (Bytes{{7, 1}}));
}

// 0.1 is another number as float, and both sides are narrowed. Not a number equals nothing.
TEST(ExtendedDataCopy, ComparesInputNoDataAsFloat)
{
    ExtendedDataCopy oCopy;
    oCopy.SetInputNoData(0.1);
    oCopy.SetUseInputNoData(true);
    EXPECT_EQ(Written(oCopy, Doubles{{0.1, 0.1F, 0.2}}, Doubles{{9, 9, 9}}),
              (Doubles{{9, 9, 0.2F}}));
    ExtendedDataCopy oNaN;
    oNaN.SetInputNoData(NAN);
    oNaN.SetUseInputNoData(true);
    oNaN.SetOutputNoData(NAN);
    oNaN.SetUseOutputNoData(true);
    EXPECT_EQ(Written(oNaN, Doubles{{NAN, 1}}, Bytes{{9, 9}}), (Bytes{{0, 1}}));
}

TEST(ExtendedDataCopy, DoesNotBlendWithOutputNoData)
{
    ExtendedDataCopy oCopy;
    oCopy.SetBlendWidth(2);
    oCopy.SetOutputNoData(0);
    oCopy.SetUseOutputNoData(true);
    DrawnClip oClip({{1, 0, 1, 0}});
    oCopy.SetClipBuilder(&oClip);
    EXPECT_EQ(Written(oCopy, Bytes{{50, 50, 50, 50}}, Bytes{{0, 0, 10, 10}}),
              (Bytes{{50, 0, 50, 30}}));
}

TEST(ExtendedDataCopy, MovesWrittenValuesOffTheOutputNoData)
{
    ExtendedDataCopy oCopy;
    oCopy.SetBlendWidth(2);
    oCopy.SetOutputNoData(10);
    oCopy.SetUseOutputNoData(true);
    DrawnClip oClip({{1, 1, 1, 0, 0}});
    oCopy.SetClipBuilder(&oClip);
    // The fourth is blended to 10, the fifth is not written.
    EXPECT_EQ(Written(oCopy, Doubles{{10, 10.25, 9, 12, 12}}, Doubles{{3, 3, 10, 8, 10}}),
              (Doubles{{11, 10.25, 9, 11, 10}}));
}

// The value is moved and converted again: 9.6 is stored as 10 and becomes 10.6, stored as 11.
TEST(ExtendedDataCopy, ComparesWithOutputNoDataAsItIsStored)
{
    ExtendedDataCopy oCopy;
    oCopy.SetOutputNoData(10);
    oCopy.SetUseOutputNoData(true);
    EXPECT_EQ(Written(oCopy, Doubles{{9.6, 10.4, 9.4, 10.5}}, Bytes{{0, 0, 0, 0}}),
              (Bytes{{11, 11, 9, 11}}));
}

// Meant: the value moves by 1 and no farther, whether that helps or not.
TEST(ExtendedDataCopy, MovesValuesByOneAlone)
{
    ExtendedDataCopy oHighest;
    oHighest.SetOutputNoData(255);
    oHighest.SetUseOutputNoData(true);
    EXPECT_EQ(Written(oHighest, Doubles{{300, 254.6}}, Bytes{{0, 0}}), (Bytes{{255, 255}}));
    ExtendedDataCopy oLowest;
    oLowest.SetOutputNoData(0);
    oLowest.SetUseOutputNoData(true);
    EXPECT_EQ(Written(oLowest, Doubles{{-3, -0.2, 0.2}}, Bytes{{9, 9, 9}}), (Bytes{{0, 1, 1}}));
    constexpr float kGreatest = std::numeric_limits<float>::max();
    ExtendedDataCopy oGreatest;
    oGreatest.SetOutputNoData(kGreatest);
    oGreatest.SetUseOutputNoData(true);
    EXPECT_EQ(Written(oGreatest, Floats{{kGreatest, 1}}, Floats{{0, 0}}), (Floats{{kGreatest, 1}}));
}

TEST(ExtendedDataCopy, RefusesComplexBlocksAndBits)
{
    const auto poReal = BlankRaster(2, 2, 1, tessel::eDT_32R);
    for (const tessel::DataType& oType : {tessel::eDT_C32R, tessel::eDT_BIT})
    {
        const auto poOther = BlankRaster(2, 2, 1, oType);
        ExtendedDataCopy oCopy;
        EXPECT_EQ(
            test::MessageOf<Exception>([&] { oCopy.ProcessBlock(poOther.get(), poReal.get()); }),
            "Invalid type requested.");
        EXPECT_EQ(
            test::MessageOf<Exception>([&] { oCopy.ProcessBlock(poReal.get(), poOther.get()); }),
            "Invalid type requested.");
    }
}

TEST(ExtendedDataCopy, TakesBlocksWithoutPixels)
{
    for (const auto eStage : {ePS_Gather, ePS_Apply})
    {
        ExtendedDataCopy oCopy;
        oCopy.SetProcessStage(eStage);
        oCopy.ProcessBlock(BlankRaster(0, 3, 1, tessel::eDT_8U).get(),
                           BlankRaster(0, 3, 1, tessel::eDT_8U).get());
        oCopy.ProcessBlock(BlankRaster(3, 0, 1, tessel::eDT_8U).get(),
                           BlankRaster(3, 0, 1, tessel::eDT_8U).get());
        EXPECT_EQ(oCopy.GetGain(), 1);
    }
}

TEST(ExtendedDataCopy, HardenedBuildsRefuseBlocksThatDoNotMatch)
{
    if (!kHardened)
    {
        GTEST_SKIP() << "these builds trust the caller";
    }
    ExtendedDataCopy oCopy;
    const auto poIn = BlankRaster(4, 4, 1, tessel::eDT_8U);
    EXPECT_THROW(oCopy.ProcessBlock(nullptr, poIn.get()), Exception);
    EXPECT_THROW(oCopy.ProcessBlock(poIn.get(), nullptr), Exception);
    EXPECT_THROW(oCopy.ProcessBlock(poIn.get(), BlankRaster(4, 3, 1, tessel::eDT_8U).get()),
                 Exception);
    DrawnClip oClip({{1, 1}});
    oCopy.SetClipBuilder(&oClip);
    EXPECT_THROW(oCopy.ProcessBlock(poIn.get(), poIn.get()), Exception);
}

/// Parameters that the definition below knows.
struct Settings
{
    int nBlendWidth = 0;
    int nSampleBand = 0;
    int nMode = 0;
    double dfInNoData = 0;
    double dfOutNoData = 0;
    bool bUseInNoData = false;
    bool bUseOutNoData = false;
    double dfLow = 0;
    double dfHigh = 0;
    double dfStretch = 1;
    double dfShare = 0;
    bool bUseKnee = false;
    double dfKneeHigh = 0;
    double dfKneeLow = 0;
    double dfKneeStart = 0;

    ExtendedDataCopy MakeCopy() const
    {
        ExtendedDataCopy oCopy;
        oCopy.SetBlendWidth(nBlendWidth);
        oCopy.SetSampleBand(nSampleBand);
        oCopy.SetBalanceMode(nMode);
        oCopy.SetInputNoData(dfInNoData);
        oCopy.SetOutputNoData(dfOutNoData);
        oCopy.SetUseInputNoData(bUseInNoData);
        oCopy.SetUseOutputNoData(bUseOutNoData);
        oCopy.SetLowPercentile(dfLow);
        oCopy.SetHighPercentile(dfHigh);
        oCopy.SetStretchFactor(dfStretch);
        oCopy.SetOffsetShare(dfShare);
        oCopy.SetUseKnee(bUseKnee);
        oCopy.SetKneeHigh(dfKneeHigh);
        oCopy.SetKneeLow(dfKneeLow);
        oCopy.SetKneeStart(dfKneeStart);
        return oCopy;
    }
};

Settings RandomSettings(Random& oRandom)
{
    const auto oUpTo = [&](unsigned int n) { return static_cast<int>(oRandom() % (n + 1)); };
    Settings oSettings;
    oSettings.nBlendWidth = oUpTo(4);
    oSettings.nSampleBand = oUpTo(3);
    oSettings.nMode = oUpTo(3);
    oSettings.dfInNoData = oUpTo(9);
    oSettings.dfOutNoData = oUpTo(9);
    oSettings.bUseInNoData = oUpTo(1) != 0;
    oSettings.bUseOutNoData = oUpTo(1) != 0;
    oSettings.dfLow = 0.1 * oUpTo(4);
    oSettings.dfHigh = 0.1 * oUpTo(4);
    oSettings.dfStretch = 0.25 * oUpTo(4);
    oSettings.dfShare = 0.1 * oUpTo(3);
    oSettings.bUseKnee = oUpTo(1) != 0;
    oSettings.dfKneeLow = oUpTo(3);
    oSettings.dfKneeStart = oUpTo(5);
    oSettings.dfKneeHigh = 6 + oUpTo(5);
    return oSettings;
}

double LoadDouble(const Raster& oRaster, std::int64_t x, std::int64_t y, std::uint32_t c)
{
    double dfSample = 0;
    using List = typedispatch::StandardTypeList;
    typedispatch::VisitType<List>(
        typedispatch::FindDataType<List>(oRaster.moDataType, false),
        [&]<class T>()
        { dfSample = test::ReferenceSample<T, double>(oRaster.GetPixelAs<T>(x, y)[c]); },
        [] {});
    return dfSample;
}

/// The samples of these tests are small numbers, which double and float hold exactly.
float LoadFloat(const Raster& oRaster, std::int64_t x, std::int64_t y, std::uint32_t c)
{
    return static_cast<float>(LoadDouble(oRaster, x, y, c));
}

void StoreFloat(float fSample, const Raster& oRaster, std::int64_t x, std::int64_t y,
                std::uint32_t c)
{
    using List = typedispatch::StandardTypeList;
    typedispatch::VisitType<List>(
        typedispatch::FindDataType<List>(oRaster.moDataType, false),
        [&]<class T>()
        { oRaster.GetPixelAs<T>(x, y)[c] = test::ReferenceSample<float, T>(fSample); },
        [] {});
}

/// Steps to the nearest valid pixel; far away where there is none. Masks that have one are the
/// business of these tests.
int StepsToValid(const Mask* poMask, const Raster& oBlock, std::int64_t x, std::int64_t y)
{
    std::int64_t nSteps = 1000;
    for (std::int64_t v = 0; v < oBlock.mnHeight; ++v)
    {
        for (std::int64_t u = 0; u < oBlock.mnWidth; ++u)
        {
            if (test::IsValid(poMask, u, v))
            {
                nSteps = std::min(nSteps, std::abs(x - u) + std::abs(y - v));
            }
        }
    }
    return static_cast<int>(nSteps);
}

/// Sorts numbers, of zeros the negative ones first.
void Sort(std::vector<double>& vdfValues)
{
    std::sort(vdfValues.begin(), vdfValues.end(),
              [](double a, double b)
              { return a < b || (a == b && std::signbit(a) > std::signbit(b)); });
}

/// The copy, told in plain loops on doubles.
class MosaicByDefinition
{
public:
    explicit MosaicByDefinition(const Settings& oSettings) : s(oSettings) {}

    void Gather(const Raster& oIn, const Mask* poMask, const Raster& oOut)
    {
        for (std::int64_t y = 0; y < std::int64_t{oIn.mnHeight} - 1; y += 2)
        {
            for (std::int64_t x = 0; x <= (std::int64_t{oIn.mnWidth} - 2) >> 1; ++x)
            {
                const int d = Distance(poMask, oIn, x, y);
                const double dfIn = LoadDouble(oIn, x, y, 0);
                if (d == 0)
                {
                    mdfLowest = std::min(mdfLowest, dfIn);
                    mdfHighest = std::max(mdfHighest, dfIn);
                }
                else if (d <= s.nSampleBand && dfIn != s.dfInNoData &&
                         LoadDouble(oOut, x, y, 0) != s.dfOutNoData)
                {
                    mvdfIn.push_back(Mean(oIn, x, y));
                    mvdfOut.push_back(Mean(oOut, x, y));
                }
            }
        }
    }

    void FindGain()
    {
        double g = s.nMode == 3 ? 0.0 : 1.0;
        double o = 0;
        const double dfMiddle = mvdfIn.empty() ? 1.0
                                               : (*std::min_element(mvdfIn.begin(), mvdfIn.end()) +
                                                  *std::max_element(mvdfIn.begin(), mvdfIn.end())) /
                                                     2;
        if (s.nMode == 1)
        {
            MedianLine(g, o);
        }
        if (s.nMode == 2 && !mvdfIn.empty())
        {
            PercentileLine(g, o);
        }
        const double dfRange =
            mdfLowest > mdfHighest ? 0 : (g * mdfHighest + o) - (g * mdfLowest + o);
        mdfGain = s.dfStretch * g;
        mdfOffset = (1 - s.dfStretch) * g * dfMiddle + o + dfRange * s.dfShare;
    }

    void Apply(const Raster& oIn, const Mask* poMask, const Raster& oOut) const
    {
        for (std::int64_t i = 0; i < std::int64_t{oIn.mnHeight} * oIn.mnWidth; ++i)
        {
            const std::int64_t x = i % oIn.mnWidth;
            const std::int64_t y = i / oIn.mnWidth;
            for (std::uint32_t c = 0; c < oIn.mnChannels; ++c)
            {
                ApplySample(oIn, oOut, x, y, c, Distance(poMask, oIn, x, y));
            }
        }
    }

    double mdfGain = 0;
    double mdfOffset = 0;

private:
    int Distance(const Mask* poMask, const Raster& oBlock, std::int64_t x, std::int64_t y) const
    {
        return test::IsValid(poMask, x, y) ? 0
               : s.nBlendWidth < 1         ? 1
                                           : StepsToValid(poMask, oBlock, x, y);
    }

    static double Mean(const Raster& oRaster, std::int64_t x, std::int64_t y)
    {
        const double dfSum = LoadDouble(oRaster, x, y, 0) + LoadDouble(oRaster, x + 1, y, 0) +
                             LoadDouble(oRaster, x, y + 1, 0) +
                             LoadDouble(oRaster, x + 1, y + 1, 0);
        return oRaster.moDataType.mbFloat ? dfSum * 0.25 : std::trunc(dfSum / 4);
    }

    void MedianLine(double& g, double& o) const
    {
        std::vector<double> vdfSlopes;
        std::vector<double> vdfIntercepts;
        for (std::size_t i = 0; i < mvdfIn.size(); ++i)
        {
            for (std::size_t j = 0; j < mvdfIn.size(); j += 2)
            {
                if (mvdfIn[i] != mvdfIn[j])
                {
                    vdfSlopes.push_back((mvdfOut[i] - mvdfOut[j]) / (mvdfIn[i] - mvdfIn[j]));
                    vdfIntercepts.push_back(mvdfOut[i] - mvdfIn[i] * vdfSlopes.back());
                }
            }
        }
        if (!vdfSlopes.empty())
        {
            Sort(vdfSlopes);
            Sort(vdfIntercepts);
            g = vdfSlopes[vdfSlopes.size() / 2];
            o = vdfIntercepts[vdfIntercepts.size() / 2];
        }
    }

    void PercentileLine(double& g, double& o)
    {
        Sort(mvdfIn);
        Sort(mvdfOut);
        const auto n = static_cast<double>(mvdfIn.size());
        const auto l = static_cast<std::size_t>(n * s.dfLow);
        const auto h = mvdfIn.size() - 1 - static_cast<std::size_t>(n * s.dfHigh);
        g = (mvdfOut[h] - mvdfOut[l]) / (mvdfIn[h] - mvdfIn[l]);
        o = mvdfOut[l] - g * mvdfIn[l];
    }

    void ApplySample(const Raster& oIn, const Raster& oOut, std::int64_t x, std::int64_t y,
                     std::uint32_t c, int d) const
    {
        const auto fOutNoData = static_cast<float>(s.dfOutNoData);
        const double v = LoadDouble(oIn, x, y, c);
        const float fOld = LoadFloat(oOut, x, y, c);
        if ((s.bUseInNoData && static_cast<float>(v) == static_cast<float>(s.dfInNoData)) ||
            (d != 0 && (d >= s.nBlendWidth || (s.bUseOutNoData && fOld == fOutNoData))))
        {
            return;
        }
        double t = v * mdfGain + mdfOffset;
        if (s.bUseKnee && t > s.dfKneeStart && t < s.dfKneeHigh)
        {
            t = (t - s.dfKneeLow) * (t - s.dfKneeLow) / (s.dfKneeHigh - s.dfKneeLow) + s.dfKneeLow;
        }
        auto f = static_cast<float>(t);
        if (d != 0)
        {
            f = (static_cast<float>(s.nBlendWidth - d) * f + static_cast<float>(d) * fOld) /
                static_cast<float>(s.nBlendWidth);
        }
        StoreFloat(f, oOut, x, y, c);
        if (s.bUseOutNoData && LoadFloat(oOut, x, y, c) == fOutNoData)
        {
            StoreFloat(f + 1.0F, oOut, x, y, c);
        }
    }

    Settings s;
    std::vector<double> mvdfIn;
    std::vector<double> mvdfOut;
    double mdfLowest = std::numeric_limits<double>::max();
    double mdfHighest = std::numeric_limits<double>::lowest();
};

/// A raster of whole numbers from 0 to 9, which often meet the "no data" of the settings.
std::unique_ptr<Raster> DigitsRaster(std::uint32_t nWidth, std::uint32_t nHeight,
                                     std::uint32_t nChannels, const tessel::DataType& oType,
                                     Margins oMargins, Random& oRandom)
{
    auto poRaster = BlankRaster(nWidth, nHeight, nChannels, oType, oMargins);
    for (std::int64_t y = -std::int64_t{oMargins.y}; y < nHeight + std::int64_t{oMargins.y}; ++y)
    {
        for (std::int64_t x = -std::int64_t{oMargins.x}; x < nWidth + std::int64_t{oMargins.x}; ++x)
        {
            for (std::uint32_t c = 0; c < nChannels; ++c)
            {
                StoreFloat(static_cast<float>(oRandom() % 10), *poRaster, x, y, c);
            }
        }
    }
    return poRaster;
}

/// Gives the mask that was set last, or none.
class SetClip : public tessel::IMaskBuilder
{
public:
    Mask* BuildMask(const Raster& /*oRaster*/) const override
    {
        const std::unique_ptr<Raster> poBytes(moMask->CreateRaster());
        return new Mask(*moMask, *moMask, poBytes->mpBuffer, false, false);
    }

    std::unique_ptr<Mask> moMask;
};

TEST(ExtendedDataCopy, DoesAsItsDefinitionOnAllPairsOfTypes)
{
    Random oRandom(2024);
    const auto oPair = [&]<class TIn, class TOut>()
    {
        for (int i = 0; i < 6; ++i)
        {
            const Settings oSettings = RandomSettings(oRandom);
            ExtendedDataCopy oCopy = oSettings.MakeCopy();
            MosaicByDefinition oDefinition(oSettings);
            const Margins oMargins{static_cast<std::uint32_t>(oRandom() % 3),
                                   static_cast<std::uint32_t>(oRandom() % 3)};
            const auto nChannels = static_cast<std::uint32_t>(1 + oRandom() % 3);
            const auto poIn =
                DigitsRaster(11, 7, nChannels, RealDataType<TIn>(), oMargins, oRandom);
            const auto poOut = DigitsRaster(11, 7, nChannels, RealDataType<TOut>(), {}, oRandom);
            const auto poExpected = BlankRaster(11, 7, nChannels, RealDataType<TOut>());
            std::memcpy(poExpected->mpBuffer, poOut->mpBuffer, poOut->mnBufferSize);
            SetClip oClip;
            oClip.moMask = test::RandomMask(11, 7, oMargins, 0.3, oRandom);
            oCopy.SetClipBuilder(&oClip);

            oCopy.SetProcessStage(ePS_Gather);
            oCopy.ProcessBlock(poIn.get(), poOut.get());
            oDefinition.Gather(*poIn, oClip.moMask.get(), *poExpected);
            ASSERT_TRUE(SameBits(*poOut, *poExpected));
            oCopy.SetProcessStage(ePS_Apply);
            oCopy.ProcessBlock(poIn.get(), poOut.get());
            oDefinition.FindGain();
            oDefinition.Apply(*poIn, oClip.moMask.get(), *poExpected);
            ASSERT_TRUE(test::SameSample(oCopy.GetGain(), oDefinition.mdfGain))
                << oCopy.GetGain() << " and not " << oDefinition.mdfGain;
            ASSERT_TRUE(test::SameSample(oCopy.GetOffset(), oDefinition.mdfOffset));
            ASSERT_TRUE(SameBits(*poOut, *poExpected));
        }
    };
    test::ForEachElementType(
        [&]<class TIn>() {
            test::ForEachElementType([&]<class TOut>() { oPair.template operator()<TIn, TOut>(); });
        });
}

// 1500 samples a row, more than are worked on together, and rows for several threads.
TEST(ExtendedDataCopy, WritesTheSameOnAnyNumberOfThreads)
{
    Random oRandom(77);
    Settings oSettings;
    oSettings.nBlendWidth = 3;
    oSettings.nSampleBand = 2;
    oSettings.nMode = 1;
    const auto poIn = DigitsRaster(500, 19, 3, tessel::eDT_16S, Margins{1, 1}, oRandom);
    const auto poOld = DigitsRaster(500, 19, 3, tessel::eDT_32R, {}, oRandom);
    SetClip oClip;
    oClip.moMask = test::RandomMask(500, 19, Margins{1, 1}, 0.2, oRandom);
    const auto oRun = [&](int nThreads)
    {
        const test::ThreadCount oThreads(nThreads);
        ExtendedDataCopy oCopy = oSettings.MakeCopy();
        oCopy.SetClipBuilder(&oClip);
        auto poOut = BlankRaster(500, 19, 3, tessel::eDT_32R);
        std::memcpy(poOut->mpBuffer, poOld->mpBuffer, poOld->mnBufferSize);
        oCopy.ProcessBlock(poIn.get(), poOut.get());
        oCopy.SetProcessStage(ePS_Apply);
        oCopy.ProcessBlock(poIn.get(), poOut.get());
        return poOut;
    };
    const auto poOne = oRun(1);
    EXPECT_FALSE(SameBits(*poOne, *poOld));
    for (const int nThreads : {2, 5})
    {
        EXPECT_TRUE(SameBits(*oRun(nThreads), *poOne)) << nThreads << " threads";
    }
}

}  // namespace
}  // namespace kor::filters
