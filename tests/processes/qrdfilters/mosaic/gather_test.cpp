#include "processes/qrdfilters/mosaic/gather.h"

#include <gtest/gtest.h>

#include <vector>

#include "tests/support/blocks.h"
#include "tests/support/threads.h"

namespace kor::filters
{
namespace
{

using test::BlankRaster;
using test::Image;
using test::Margins;
using test::RasterOf;

/// What a block of floats has, with the input as output; mask bits are drawn.
std::vector<double> GatheredOf(const Image<float>& oIn, const Image<int>& oMask,
                               const GatherRules& oRules, SampleRange* poInside = nullptr)
{
    const auto poIn = RasterOf(oIn);
    const auto poMask = test::MaskOf(oMask);
    Gathered oGathered{MakeSampleList<float>(), MakeSampleList<float>(), {}};
    GatherBlock(*poIn, *poIn, ClipDistance(*poIn, poMask.get(), true), oRules, oGathered);
    EXPECT_EQ(oGathered.mpoOut->GetCount(), oGathered.mpoIn->GetCount());
    if (poInside != nullptr)
    {
        *poInside = oGathered.moInside;
    }
    std::vector<double> vdfSamples;
    for (std::size_t i = 0; i < oGathered.mpoIn->GetCount(); ++i)
    {
        vdfSamples.push_back(oGathered.mpoIn->GetSample(i));
    }
    return vdfSamples;
}

constexpr GatherRules kAll{1000, -1.0, -1.0};

Image<int> NothingValid(std::size_t nColumns, std::size_t nRows)
{
    return Image<int>(nColumns, std::vector<int>(nColumns * nRows));
}

// Rows 0 and 2 and the columns 0, 1 and 2 of six: each mean is the sample plus 5.5.
TEST(Gather, OnlyTheLeftHalfIsGathered)
{
    const Image<float> oIn = {
        {0, 1, 2, 3, 4, 5},       {10, 11, 12, 13, 14, 15}, {20, 21, 22, 23, 24, 25},
        {30, 31, 32, 33, 34, 35}, {40, 41, 42, 43, 44, 45},
    };
    EXPECT_EQ(GatheredOf(oIn, NothingValid(6, 5), kAll),
              (std::vector<double>{5.5, 6.5, 7.5, 25.5, 26.5, 27.5}));
}

TEST(Gather, OddWidthsGiveHalfOfThePixelsBelow)
{
    EXPECT_EQ(GatheredOf({{0, 4, 8}, {0, 4, 8}}, NothingValid(3, 2), kAll),
              (std::vector<double>{2}));
    EXPECT_EQ(GatheredOf({{0, 4, 8, 12, 16}, {0, 4, 8, 12, 16}}, NothingValid(5, 2), kAll),
              (std::vector<double>{2, 6}));
}

TEST(Gather, BlocksOfOneRowOrColumnHaveNoCells)
{
    EXPECT_TRUE(GatheredOf({{1, 2, 3, 4}}, NothingValid(4, 1), kAll).empty());
    EXPECT_TRUE(GatheredOf({{1}, {2}, {3}}, NothingValid(1, 3), kAll).empty());
}

TEST(Gather, NothingIsGatheredBeyondTheSampleBand)
{
    const Image<float> oIn = {{1, 2, 3, 4, 5, 6, 7, 8}, {1, 2, 3, 4, 5, 6, 7, 8}};
    const Image<int> oMask = {{1, 0, 0, 0, 0, 0, 0, 0}, {1, 0, 0, 0, 0, 0, 0, 0}};
    EXPECT_EQ(GatheredOf(oIn, oMask, {2, -1, -1}), (std::vector<double>{2.5, 3.5}));
    EXPECT_TRUE(GatheredOf(oIn, oMask, {0, -1, -1}).empty());
    EXPECT_TRUE(GatheredOf(oIn, oMask, {-5, -1, -1}).empty());
}

// Of a cell the top left sample alone is compared: the second cell has the value on its right.
TEST(Gather, CellsThatBeginWithNoDataAreLeftOut)
{
    const Image<float> oIn = {{1, 2, 7, 3, 4, 4}, {1, 2, 7, 3, 4, 4}};
    EXPECT_EQ(GatheredOf(oIn, NothingValid(6, 2), {99, 7, -1}), (std::vector<double>{1.5, 4.5}));
    EXPECT_EQ(GatheredOf(oIn, NothingValid(6, 2), {99, -1, 7}), (std::vector<double>{1.5, 4.5}));
}

// "No data" counts inside the valid area; what lies in odd rows or on the right does not.
TEST(Gather, TheRangeIsThatOfTheValidSamplesThatAreSeen)
{
    const Image<float> oIn = {{5, 2, 9, 50}, {90, 90, 90, 90}, {7, 8, 60, 60}, {-9, -9, -9, -9}};
    const Image<int> oMask = {{1, 1, 1, 1}, {1, 1, 1, 1}, {1, 0, 1, 1}, {1, 1, 1, 1}};
    SampleRange oInside;
    EXPECT_EQ(GatheredOf(oIn, oMask, {1, 2, 2}, &oInside).size(), 1U);
    EXPECT_EQ(oInside.mdfLowest, 2);
    EXPECT_EQ(oInside.mdfHighest, 7);
}

TEST(Gather, SamplesComeInTheOrderOfTheRowsOnAnyNumberOfThreads)
{
    test::Random oRandom(9);
    constexpr Margins kMargins{2, 1};
    const auto poIn =
        test::RandomRaster(9, 301, 2, tessel::eDT_16U, kMargins, test::Samples::Ordinary, oRandom);
    const auto poOut =
        test::RandomRaster(9, 301, 2, tessel::eDT_64R, {}, test::Samples::Ordinary, oRandom);
    const auto poMask = test::RandomMask(9, 301, kMargins, 0.3, oRandom);
    const ClipDistance oDistance(*poIn, poMask.get(), true);
    const auto oGather = [&](int nThreads)
    {
        const test::ThreadCount oThreads(nThreads);
        Gathered oGathered{MakeSampleList<unsigned short>(), MakeSampleList<double>(), {}};
        GatherBlock(*poIn, *poOut, oDistance, kAll, oGathered);
        GatherBlock(*poIn, *poOut, oDistance, kAll, oGathered);
        return oGathered;
    };
    const Gathered oOne = oGather(1);
    ASSERT_GT(oOne.mpoIn->GetCount(), 500U);
    for (const int nThreads : {2, 3, 7})
    {
        const Gathered oMany = oGather(nThreads);
        ASSERT_EQ(oMany.mpoIn->GetCount(), oOne.mpoIn->GetCount());
        for (std::size_t i = 0; i < oOne.mpoIn->GetCount(); ++i)
        {
            ASSERT_EQ(oMany.mpoIn->GetSample(i), oOne.mpoIn->GetSample(i)) << i;
            ASSERT_EQ(oMany.mpoOut->GetSample(i), oOne.mpoOut->GetSample(i)) << i;
        }
        EXPECT_EQ(oMany.moInside.mdfLowest, oOne.moInside.mdfLowest);
        EXPECT_EQ(oMany.moInside.mdfHighest, oOne.moInside.mdfHighest);
    }
}

}  // namespace
}  // namespace kor::filters
