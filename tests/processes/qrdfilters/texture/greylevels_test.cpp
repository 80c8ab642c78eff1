#include "processes/qrdfilters/texture/greylevels.h"

#include <gtest/gtest.h>

#include <cmath>
#include <limits>
#include <numeric>

namespace kor::filters
{
namespace
{

using Table = std::vector<int>;

TEST(MakeGreyTable, GivesEachLevelItsShareOfThePixels)
{
    // Steps of 4 pixels: the level changes behind the bin that reaches 4, 8 and 12.
    EXPECT_EQ(MakeGreyTable(Table{2, 1, 1, 3, 0, 2, 3, 0}, 12, 3), (Table{0, 0, 0, 1, 1, 1, 2, 3}));
}

TEST(MakeGreyTable, AHeavyBinAdvancesTheLevelByOne)
{
    // The second bin holds all shares at once; the sum then stays above the targets that follow.
    EXPECT_EQ(MakeGreyTable(Table{0, 8, 0, 0, 0, 0}, 8, 4), (Table{0, 0, 1, 2, 3, 4}));
    EXPECT_EQ(MakeGreyTable(Table{1, 8, 0, 0, 1}, 10, 2), (Table{0, 0, 1, 1, 1}));
}

TEST(MakeGreyTable, GivesEveryBinALevelWithFewerPixelsThanLevels)
{
    EXPECT_EQ(MakeGreyTable(Table{0, 1, 0, 2, 0}, 3, 4), (Table{0, 1, 2, 3, 4}));
}

TEST(MakeGreyTable, CountsBeyondTheRangeOfInt)
{
    const int nMost = std::numeric_limits<int>::max();
    EXPECT_EQ(MakeGreyTable(Table{nMost, nMost, nMost}, nMost, 1), (Table{0, 1, 2}));
    EXPECT_EQ(MakeGreyTable(Table{nMost - 1, 0, 1, 0}, nMost, 1), (Table{0, 0, 0, 1}));
}

int BinOf(double dfMin, double dfMax, double x, std::size_t nBins = kGreyBins)
{
    return kernels::FindBin(ScaleOf(dfMin, dfMax, nBins), x);
}

TEST(GreyScale, CutsTheRangeInto65536Bins)
{
    EXPECT_EQ(BinOf(-10, 10, -10.0), 0);
    EXPECT_EQ(BinOf(-10, 10, 10.0), 65535);
    EXPECT_EQ(BinOf(-10, 10, 0.0), 32767);  // 32767.5, cut
    EXPECT_EQ(BinOf(-10, 10, 10.001), -1);
    EXPECT_EQ(BinOf(-10, 10, -10.001), -1);
    EXPECT_EQ(BinOf(-10, 10, -10.0001), 0);  // -0.3, cut towards zero
    EXPECT_EQ(BinOf(-10, 10, std::nan("")), -1);
    EXPECT_EQ(BinOf(-10, 10, 10.0, 10), -1);
}

TEST(GreyScale, IsTheValueWhereTheRangeIsAlmostZero)
{
    const double dfMax = 5.0 + 0.9e-9;
    EXPECT_EQ(BinOf(5, dfMax, 5.5), 5);
    EXPECT_EQ(BinOf(5, dfMax, 65535.9), 65535);
    EXPECT_EQ(BinOf(5, dfMax, 65536.0), -1);
    EXPECT_EQ(BinOf(5, dfMax, -1.0), -1);
    EXPECT_EQ(BinOf(5, dfMax, 1e300), -1);
    EXPECT_EQ(BinOf(0.0, 1.1e-9, 1.1e-9), 65535);
}

TEST(GreyLevels, AreZeroOutsideTheRangeAndTheTable)
{
    const GreyLevels oLevels(0.0, 65535.0, Table{7, -3, 9});
    const std::vector<double> vdfSamples = {0.0, 1.9, 2.0, 3.0, -0.5, std::nan("")};
    std::vector<float> vfLevels(6, -1.0F);
    oLevels.LookUpInRange(vdfSamples, vfLevels.data());
    EXPECT_EQ(vfLevels, (std::vector<float>{7, -3, 9, 0, 0, 0}));
    oLevels.LookUp(vdfSamples, vfLevels.data());
    EXPECT_EQ(vfLevels, (std::vector<float>{7, -3, 9, 0, 7, 0}));
    EXPECT_EQ(oLevels.GetSpan(), 12.0F);
    EXPECT_EQ(GreyLevels(0, 1, Table{5, 6}).GetSpan(), 6.0F);
    EXPECT_EQ(GreyLevels(0, 1, Table()).GetSpan(), 0.0F);
}

TEST(GreyLevels, LookUpRowsOfAnyLength)
{
    Table vnTable(kGreyBins);
    std::iota(vnTable.begin(), vnTable.end(), 0);
    const GreyLevels oLevels(0.0, 65535.0, vnTable);
    std::vector<double> vdfSamples(1300);
    std::iota(vdfSamples.begin(), vdfSamples.end(), 17.0);
    std::vector<float> vfLevels(1300);
    oLevels.LookUpInRange(vdfSamples, vfLevels.data());
    for (std::size_t i = 0; i < 1300; ++i)
    {
        ASSERT_EQ(vfLevels[i], static_cast<float>(i + 17));
    }
}

}  // namespace
}  // namespace kor::filters
