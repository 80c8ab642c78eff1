#include "processes/qrdfilters/kernels/greybins.h"

#include <gtest/gtest.h>
#include <hwy/tests/hwy_gtest.h>

#include <cmath>
#include <vector>

#include "tests/support/blocks.h"

namespace kor::filters::kernels
{
namespace
{

using test::Random;

class GreyBinRows : public hwy::TestWithParamTarget
{
};

HWY_TARGET_INSTANTIATE_TEST_SUITE_P(GreyBinRows);

std::vector<int> BinsOf(const GreyScale& oScale, const std::vector<double>& vdfSamples)
{
    std::vector<int> vnBins(vdfSamples.size(), 77);
    FindBins(oScale, vdfSamples, vnBins.data());
    return vnBins;
}

// Sixteen values, so that none of them is left for the end of the row.
TEST_P(GreyBinRows, CutValuesTowardsZeroAndRefuseOthers)
{
    const double dfNaN = std::nan("");
    const std::vector<double> vdfSamples = {-10.0, 10.0,    0.0,      10.001,   -10.001, -10.0001,
                                            dfNaN, 1e300,   -1e300,   9.9,      5.0,     -5.0,
                                            10.0,  -9.9999, HUGE_VAL, -HUGE_VAL};
    GreyScale oScale = {-10.0, 20.0, false, 65536.0};
    EXPECT_EQ(BinsOf(oScale, vdfSamples),
              (std::vector<int>{0, 65535, 32767, -1, -1, 0, -1, -1, -1, 65207, 49151, 16383, 65535,
                                0, -1, -1}));
    oScale.mdfLowest = -10.0;
    oScale.mdfHighest = 9.9;
    EXPECT_EQ(BinsOf(oScale, vdfSamples), (std::vector<int>{0, -1, 32767, -1, -1, -1, -1, -1, -1,
                                                            65207, 49151, 16383, -1, 0, -1, -1}));
    oScale.mbByValue = true;
    oScale.mdfEnd = 6.0;
    EXPECT_EQ(BinsOf(oScale, vdfSamples),
              (std::vector<int>{-1, -1, 0, -1, -1, -1, -1, -1, -1, -1, 5, -1, -1, -1, -1, -1}));
}

// Up to three of the widest vectors, so that every target meets every remainder.
TEST_P(GreyBinRows, RowsOfAnyLengthGoByTheDefinition)
{
    Random oRandom(71);
    for (std::size_t nSamples = 0; nSamples <= 24; ++nSamples)
    {
        std::vector<double> vdfSamples(nSamples);
        for (double& dfSample : vdfSamples)
        {
            dfSample = test::RandomSample<double>(test::Samples::Special, oRandom);
        }
        for (const bool bByValue : {false, true})
        {
            const GreyScale oScale = {-300.0, 700.0, bByValue, 65536.0, -300.0, 400.0};
            const std::vector<int> vnBins = BinsOf(oScale, vdfSamples);
            for (std::size_t i = 0; i < nSamples; ++i)
            {
                ASSERT_EQ(vnBins[i], FindBin(oScale, vdfSamples[i])) << vdfSamples[i];
            }
        }
    }
}

}  // namespace
}  // namespace kor::filters::kernels
