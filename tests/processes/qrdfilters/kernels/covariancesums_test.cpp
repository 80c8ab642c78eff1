#include "processes/qrdfilters/kernels/covariancesums.h"

#include <gtest/gtest.h>
#include <hwy/tests/hwy_gtest.h>

#include <vector>

#include "tests/support/blocks.h"

namespace kor::filters::kernels
{
namespace
{

using test::Random;
using test::Samples;

class CovarianceSums : public hwy::TestWithParamTarget
{
};

HWY_TARGET_INSTANTIATE_TEST_SUITE_P(CovarianceSums);

// Channels up to three of the widest vectors and more rows than one tile has. Samples behind the
// last pixel are there and count nowhere.
TEST_P(CovarianceSums, EachSumGrowsPixelByPixel)
{
    Random oRandom(3);
    for (std::size_t nChannels = 1; nChannels <= 24; ++nChannels)
    {
        const std::size_t nPixels = oRandom() % 20;
        const std::size_t nRow = CovarianceRow(nChannels);
        std::vector<double> vdfPixels(nPixels * nChannels + kPixelPadding);
        std::vector<double> vdfSums((nChannels + 1) * nRow);
        for (std::vector<double>* pvdf : {&vdfPixels, &vdfSums})
        {
            for (double& df : *pvdf)
            {
                df = test::RandomSample<double>(Samples::Special, oRandom);
            }
        }
        std::vector<double> vdfExpected = vdfSums;
        for (std::size_t p = 0; p < nPixels; ++p)
        {
            const double* const pPixel = &vdfPixels[p * nChannels];
            for (std::size_t i = 0; i < nChannels; ++i)
            {
                vdfExpected[i] += pPixel[i];
                for (std::size_t j = i; j < nChannels; ++j)
                {
                    vdfExpected[(1 + j) * nRow + i] += pPixel[i] * pPixel[j];
                }
            }
        }
        AddPixels(vdfPixels.data(), nPixels, nChannels, vdfSums.data());
        for (std::size_t i = 0; i < nChannels; ++i)
        {
            EXPECT_TRUE(test::SameSample(vdfSums[i], vdfExpected[i]));
            for (std::size_t j = i; j < nChannels; ++j)
            {
                const std::size_t k = (1 + j) * nRow + i;
                ASSERT_TRUE(test::SameSample(vdfSums[k], vdfExpected[k]))
                    << nChannels << " channels, " << i << " times " << j;
            }
        }
    }
}

}  // namespace
}  // namespace kor::filters::kernels
