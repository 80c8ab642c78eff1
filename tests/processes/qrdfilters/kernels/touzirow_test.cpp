#include "processes/qrdfilters/kernels/touzirow.h"

#include <gtest/gtest.h>
#include <hwy/tests/hwy_gtest.h>

#include <vector>

#include "tests/support/touziscene.h"

namespace kor::filters::kernels
{
namespace
{

using namespace kor::test;

/// Each test runs once for every instruction set that this machine has.
class TouziRow : public hwy::TestWithParamTarget
{
protected:
    Random moRandom{81};
};

HWY_TARGET_INSTANTIATE_TEST_SUITE_P(TouziRow);

// Through the filter, which loads the rows. Widths around those of the vectors.
TEST_P(TouziRow, GivesTheBitsOfTheDefinition)
{
    for (std::uint32_t nWidth = 1; nWidth <= 40; ++nWidth)
    {
        TouziReference oReference = RandomReference(moRandom);
        const auto poIn = BlankRaster(nWidth, 4, 1, tessel::eDT_64R, {5, 5});
        FillScene(*poIn, static_cast<double>(nWidth % 10) / 10.0, moRandom);
        CompareWithDefinition<double, double>(oReference, *poIn, moRandom);
    }
}

TEST_P(TouziRow, TellsStrongScatterersAndLeavesTheUnwantedZero)
{
    // 8 pixels, all rows alike; squares of 1 and 10000.
    std::vector<float> vfSamples(8 + 2 * kTouziReach, 1.0F);
    vfSamples[kTouziReach + 6] = 100.0F;
    std::vector<float> vfSquares(vfSamples);
    vfSquares[kTouziReach + 6] = 10000.0F;
    const std::vector<const float*> vpSamples(2 * kTouziReach + 1, &vfSamples[kTouziReach]);
    const std::vector<const float*> vpSquares(2 * kTouziReach + 1, &vfSquares[kTouziReach]);
    const std::vector<double> vdfCentres = {1, 1, 1, 1, 1, 1, 100, 1};
    std::vector<unsigned char> vWanted = {1, 0, 1, 1, 1, 1, 0, 1};
    std::vector<double> vdfResults(8, -1.0);
    FilterTouziRow({vpSamples, vpSquares, kTouziReach, vdfCentres.data()},
                   {0.3, 0.9, 0.26, 0.0, 0.1, 3, 5}, vWanted, vdfResults);
    // The window of 5 pixels meets the bright column from pixel 4 on; pixel 3 grows from flat 3 x 3
    // to flat 5 x 5 and no farther.
    EXPECT_EQ(vWanted, (std::vector<unsigned char>{1, 0, 1, 1, 0, 0, 0, 0}));
    EXPECT_EQ(vdfResults[0], 1.0);
    EXPECT_EQ(vdfResults[1], 0.0);
    EXPECT_EQ(vdfResults[3], 1.0);
    EXPECT_NE(vdfResults[5], 0.0);
    EXPECT_EQ(vdfResults[6], 0.0);
}

}  // namespace
}  // namespace kor::filters::kernels
