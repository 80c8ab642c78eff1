#include "processes/qrdfilters/kernels/projectpixels.h"

#include <gtest/gtest.h>
#include <hwy/tests/hwy_gtest.h>

#include <vector>

#include "tests/support/blocks.h"

namespace kor::filters::kernels
{
namespace
{

using test::Random;
using test::SameSample;
using test::Samples;

class ProjectPixelsTest : public hwy::TestWithParamTarget
{
protected:
    std::vector<float> RandomFloats(std::size_t nCount)
    {
        std::vector<float> vf(nCount);
        for (float& f : vf)
        {
            f = test::RandomSample<float>(
                moRandom() % 4 == 0 ? Samples::Special : Samples::Ordinary, moRandom);
        }
        return vf;
    }

    Random moRandom{4};
};

HWY_TARGET_INSTANTIATE_TEST_SUITE_P(ProjectPixelsTest);

// Outputs up to three of the widest vectors, pixels of every remainder, and room behind the results
// that is just as long as told.
TEST_P(ProjectPixelsTest, SumsInTheOrderOfTheChannels)
{
    for (std::size_t nOutputs = 1; nOutputs <= 24; ++nOutputs)
    {
        const std::size_t nChannels = nOutputs % 7;
        const std::size_t nPixels = moRandom() % 14;
        const std::size_t nRow = PadOutputs(nOutputs);
        const std::vector<float> vfPixels = RandomFloats(nPixels * nChannels);
        const std::vector<float> vfWeights = RandomFloats(nChannels * nRow);
        const std::vector<float> vfScale = RandomFloats(nRow);
        const std::vector<float> vfMidPoint = RandomFloats(nRow);
        std::vector<float> vfLowest(nRow, -1.0F);
        std::vector<float> vfHighest(nRow, 1.0F);
        std::vector<float> vfLow = vfLowest;
        std::vector<float> vfHigh = vfHighest;
        std::vector<float> vfOut(nPixels * nOutputs + kOutputPadding);
        ProjectPixels({nChannels, nOutputs, vfWeights.data(), vfScale.data(), vfMidPoint.data(),
                       vfLowest.data(), vfHighest.data()},
                      vfPixels.data(), nPixels, vfOut.data());
        for (std::size_t i = 0; i < nPixels * nOutputs; ++i)
        {
            const std::size_t k = i % nOutputs;
            float v = 0.0F;
            for (std::size_t c = 0; c < nChannels; ++c)
            {
                v = v + vfPixels[i / nOutputs * nChannels + c] * vfWeights[c * nRow + k];
            }
            vfLow[k] = vfLow[k] > v ? v : vfLow[k];
            vfHigh[k] = v > vfHigh[k] ? v : vfHigh[k];
            ASSERT_TRUE(SameSample(vfOut[i], v * vfScale[k] + vfMidPoint[k]))
                << nOutputs << " outputs, sample " << i;
        }
        for (std::size_t k = 0; k < nOutputs; ++k)
        {
            EXPECT_TRUE(SameSample(vfLowest[k], vfLow[k])) << nOutputs << " outputs, " << k;
            EXPECT_TRUE(SameSample(vfHighest[k], vfHigh[k])) << nOutputs << " outputs, " << k;
        }
    }
}

TEST_P(ProjectPixelsTest, MeansAreTakenOff)
{
    for (std::size_t nSamples = 0; nSamples <= 40; ++nSamples)
    {
        const std::vector<float> vfMeans = RandomFloats(nSamples);
        const std::vector<float> vfIn = RandomFloats(nSamples);
        std::vector<float> vfOut = vfIn;
        SubtractMeans(vfMeans.data(), vfOut);
        for (std::size_t i = 0; i < nSamples; ++i)
        {
            EXPECT_TRUE(SameSample(vfOut[i], vfIn[i] - vfMeans[i])) << i << " of " << nSamples;
        }
    }
}

}  // namespace
}  // namespace kor::filters::kernels
