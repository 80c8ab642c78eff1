#include "processes/qrdfilters/mosaic/samplelist.h"

#include <gtest/gtest.h>

#include <cmath>
#include <vector>

#include "tests/support/blocks.h"

namespace kor::filters
{
namespace
{

using test::Image;
using test::RasterOf;

using Flags = std::vector<unsigned char>;

/// The means of the cells of a drawing of two rows.
template <class T>
std::unique_ptr<ISampleList> MeansOf(const Image<T>& oImage, const Flags& vTaken,
                                     std::uint32_t nChannels = 1)
{
    auto poList = MakeSampleList<T>();
    poList->AppendMeans(*RasterOf(oImage, {}, nChannels), 0, vTaken);
    return poList;
}

std::vector<double> SamplesOf(const ISampleList& oList)
{
    std::vector<double> vdfSamples;
    for (std::size_t i = 0; i < oList.GetCount(); ++i)
    {
        vdfSamples.push_back(oList.GetSample(i));
    }
    return vdfSamples;
}

TEST(SampleList, CutsTheMeansOfIntegers)
{
    // Sums 7 and 6, and of signed ones -7.
    EXPECT_EQ(SamplesOf(*MeansOf<std::uint8_t>({{1, 2, 1}, {3, 1, 2}}, {1, 1})),
              (std::vector<double>{1, 1}));
    EXPECT_EQ(SamplesOf(*MeansOf<std::int32_t>({{-1, -2}, {-3, -1}}, {1})),
              (std::vector<double>{-1}));
    EXPECT_EQ(SamplesOf(*MeansOf<char>({{-128, -128}, {-128, -127}}, {1})),
              (std::vector<double>{-127}));
}

TEST(SampleList, AddsSmallIntegersWithoutOverflow)
{
    EXPECT_EQ(SamplesOf(*MeansOf<std::uint8_t>({{255, 255}, {255, 255}}, {1})),
              (std::vector<double>{255}));
    EXPECT_EQ(
        SamplesOf(*MeansOf<std::uint32_t>({{4294967295U, 4294967295U}, {4294967295U, 0}}, {1})),
        (std::vector<double>{3221225471.0}));
}

// 4 * 2^62 is 0 in 64 bits, and 4 * (2^62 + 2^61) is 2^63.
TEST(SampleList, LetsSumsOf64BitsWrap)
{
    constexpr int64 kQuarter = int64{1} << 62;
    EXPECT_EQ(SamplesOf(*MeansOf<int64>({{kQuarter, kQuarter}, {kQuarter, kQuarter}}, {1})),
              (std::vector<double>{0}));
    constexpr uint64 kMore = (uint64{1} << 62) + (uint64{1} << 61);
    EXPECT_EQ(SamplesOf(*MeansOf<uint64>({{kMore, kMore}, {kMore, kMore}}, {1})),
              (std::vector<double>{0x1p61}));
}

// In single precision 2^24 + 1 + 1 + 1 stays 2^24, in this order only.
TEST(SampleList, AddsFloatsInTheirOwnTypeFromTheTopLeft)
{
    EXPECT_EQ(SamplesOf(*MeansOf<float>({{16777216, 1}, {1, 1}}, {1})),
              (std::vector<double>{4194304}));
    EXPECT_EQ(SamplesOf(*MeansOf<float>({{1, 1}, {1, 16777216}}, {1})),
              (std::vector<double>{4194305}));  // 3 + 2^24 is rounded to 2^24 + 4
    EXPECT_EQ(SamplesOf(*MeansOf<double>({{1, 2}, {3, 4}}, {1})), (std::vector<double>{2.5}));
}

TEST(SampleList, TakesTheFirstChannelOfTheCellsThatAreMarked)
{
    const Image<std::int16_t> oImage = {
        {4, 99, 8, 99, 12, 99},
        {4, 99, 8, 99, 12, 99},
    };
    EXPECT_EQ(SamplesOf(*MeansOf(oImage, {0, 1}, 2)), (std::vector<double>{10}));
}

TEST(SampleList, AppendsAnotherListBehindItsOwnSamples)
{
    const auto poList = MeansOf<double>({{5, 5}, {5, 5}}, {1});
    const auto poOther = poList->MakeEmpty();
    EXPECT_EQ(poOther->GetCount(), 0U);
    poOther->AppendMeans(*RasterOf(Image<double>{{3, 3}, {3, 3}}), 0, Flags{1});
    poList->Append(*poOther);
    EXPECT_EQ(SamplesOf(*poList), (std::vector<double>{5, 3}));
}

/// Which samples of a row are left when those equal to dfNoData are dropped.
template <class T>
Flags LeftOf(const Image<T>& oRow, double dfNoData)
{
    Flags vTaken(oRow.Columns(), 1);
    MakeSampleList<T>()->DropNoData(*RasterOf(oRow), 0, dfNoData, vTaken);
    return vTaken;
}

TEST(SampleList, DropsNoDataInTheTypeOfTheSample)
{
    EXPECT_EQ(LeftOf<std::uint8_t>({{0, 44, 255}}, 255), (Flags{1, 1, 0}));
    EXPECT_EQ(LeftOf<char>({{-1, 127}}, -1), (Flags{0, 1}));
    EXPECT_EQ(LeftOf<float>({{0.1F, 0.2F}}, 0.1), (Flags{0, 1}));
    EXPECT_EQ(LeftOf<double>({{0.1F, 0.1}}, 0.1), (Flags{1, 0}));
    EXPECT_EQ(LeftOf<int64>({{-9223372036854775807 - 1, 0}}, -0x1p63), (Flags{0, 1}));
    EXPECT_EQ(LeftOf<std::int16_t>({{3, 4, -3}}, 3.9), (Flags{0, 1, 1}));
}

// A plain cast of 300 would meet 44.
TEST(SampleList, DropsNothingForAValueThatTheTypeCannotHold)
{
    EXPECT_EQ(LeftOf<std::uint8_t>({{0, 44, 255}}, 300), (Flags{1, 1, 1}));
    EXPECT_EQ(LeftOf<std::uint8_t>({{0, 44, 255}}, -1), (Flags{1, 1, 1}));
    EXPECT_EQ(LeftOf<std::int32_t>({{0, -2147483647 - 1}}, std::nan("")), (Flags{1, 1}));
    EXPECT_EQ(LeftOf<uint64>({{0, ~uint64{0}}}, 0x1p64), (Flags{1, 1}));
    EXPECT_EQ(LeftOf<float>({{INFINITY, 3.4028234663852886e38F}}, 1e300), (Flags{1, 1}));
    EXPECT_EQ(LeftOf<float>({{INFINITY, -INFINITY}}, INFINITY), (Flags{0, 1}));
    EXPECT_EQ(LeftOf<float>({{std::nanf("")}}, std::nan("")), (Flags{1}));
}

TEST(SampleList, LeavesClearedMarksCleared)
{
    Flags vTaken = {0, 1};
    MakeSampleList<int>()->DropNoData(*RasterOf(Image<int>{{1, 1}}), 0, 5, vTaken);
    EXPECT_EQ(vTaken, (Flags{0, 1}));
}

TEST(SampleList, FindsTheRangeOfTheMarkedSamples)
{
    SampleRange oRange;
    EXPECT_TRUE(oRange.IsEmpty());
    const auto poRow = RasterOf(Image<float>{{-50, 7, std::nanf(""), 3, 90}});
    MakeSampleList<float>()->FindRange(*poRow, 0, Flags{0, 0, 1, 0, 0}, oRange);
    EXPECT_TRUE(oRange.IsEmpty());
    MakeSampleList<float>()->FindRange(*poRow, 0, Flags{0, 1, 1, 1, 0}, oRange);
    EXPECT_EQ(oRange.mdfLowest, 3);
    EXPECT_EQ(oRange.mdfHighest, 7);
    oRange.Widen(SampleRange());
    EXPECT_EQ(oRange.mdfHighest, 7);
}

TEST(SampleList, TellsSamplesApartThatAreEqualAsDouble)
{
    constexpr uint64 kLarge = uint64{1} << 61;
    auto poList = MeansOf<uint64>({{kLarge, kLarge}, {kLarge, kLarge}}, {1});
    const uint64 nNext = kLarge + 1;
    poList->AppendMeans(*RasterOf(Image<uint64>{{nNext, nNext}, {nNext, nNext}}), 0, Flags{1});
    EXPECT_EQ(poList->GetSample(0), poList->GetSample(1));
    EXPECT_TRUE(poList->Differ(0, 1));
    EXPECT_FALSE(poList->Differ(1, 1));
}

TEST(SampleList, RanksNotANumberBehindAllOthers)
{
    const float fNaN = std::nanf("");
    const auto poList = MakeSampleList<float>();
    for (const float x : {fNaN, 3.0F, INFINITY, fNaN, -2.0F})
    {
        poList->AppendMeans(*RasterOf(Image<float>{{x, x}, {x, x}}), 0, Flags{1});
    }
    EXPECT_EQ(poList->TakeRanked(1), 3);
    EXPECT_EQ(poList->TakeRanked(0), -2);
    EXPECT_EQ(poList->TakeRanked(2), INFINITY);
    EXPECT_TRUE(std::isnan(poList->TakeRanked(3)));
    EXPECT_EQ(poList->GetRange().mdfLowest, -2);
    EXPECT_EQ(poList->GetRange().mdfHighest, INFINITY);
}

}  // namespace
}  // namespace kor::filters
