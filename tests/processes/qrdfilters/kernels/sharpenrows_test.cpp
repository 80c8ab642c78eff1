#include "processes/qrdfilters/kernels/sharpenrows.h"

#include <gtest/gtest.h>
#include <hwy/tests/hwy_gtest.h>

#include <vector>

#include "processes/qrdfilters/kernels/laplacianrow.h"
#include "processes/qrdfilters/kernels/windowsums.h"
#include "tests/support/blocks.h"

namespace kor::filters::kernels
{
namespace
{

using test::Random;
using test::SameSample;
using test::Samples;

/// Each test runs once for every instruction set that this machine has.
class SharpenRows : public hwy::TestWithParamTarget
{
protected:
    std::vector<double> RandomRow(std::size_t nSamples)
    {
        std::vector<double> vdfRow(nSamples);
        for (double& dfSample : vdfRow)
        {
            dfSample = test::RandomSample<double>(
                moRandom() % 64 == 0 ? Samples::Special : Samples::Ordinary, moRandom);
        }
        return vdfRow;
    }

    void TestMoving(std::size_t nRows, std::size_t nPixels, std::size_t nStep, std::size_t nWidth,
                    std::size_t nHeight);

    Random moRandom{5};
};

HWY_TARGET_INSTANTIATE_TEST_SUITE_P(SharpenRows);

void SharpenRows::TestMoving(std::size_t nRows, std::size_t nPixels, std::size_t nStep,
                             std::size_t nWidth, std::size_t nHeight)
{
    MovingWindows oWindows;
    oWindows.mnRows = nRows;
    oWindows.mnPixels = nPixels;
    oWindows.mnStep = nStep;
    oWindows.mnWidth = nWidth;
    oWindows.mnHeight = nHeight;
    oWindows.mnPitch = nRows + nHeight - 1;
    // Exactly as long as told, so that a read behind the end is seen by a sanitizer.
    const std::vector<double> vdfColumns = RandomRow((nPixels + nWidth) * nStep * oWindows.mnPitch);
    std::vector<double> vdfSums = RandomRow((nPixels + 1) * nStep * nRows);
    std::vector<std::uint64_t> vnFresh(nPixels * nRows);
    for (std::uint64_t& nFresh : vnFresh)
    {
        nFresh = moRandom() % 16 == 0 ? ~std::uint64_t{0} : 0;
    }
    std::vector<double> vdfExpected = vdfSums;
    const auto oSample = [&](std::size_t i, std::size_t r)
    { return vdfColumns[i * oWindows.mnPitch + r]; };
    for (std::size_t i = nStep; i < (nPixels + 1) * nStep; ++i)
    {
        for (std::size_t r = 0; r < nRows; ++r)
        {
            const bool bFresh = vnFresh[(i / nStep - 1) * nRows + r] != 0;
            double dfSum = bFresh ? 0.0 : vdfExpected[(i - nStep) * nRows + r];
            for (std::size_t dy = 0; dy < nHeight; ++dy)
            {
                for (std::size_t dx = 0; dx < nWidth && bFresh; ++dx)
                {
                    dfSum += oSample(i + dx * nStep, r + dy);
                }
                dfSum = bFresh ? dfSum : dfSum - oSample(i - nStep, r + dy);
            }
            for (std::size_t dy = 0; dy < nHeight && !bFresh; ++dy)
            {
                dfSum += oSample(i + (nWidth - 1) * nStep, r + dy);
            }
            vdfExpected[i * nRows + r] = dfSum;
        }
    }
    oWindows.mpColumns = &vdfColumns[nStep * oWindows.mnPitch];
    oWindows.mpFresh = vnFresh.data();
    oWindows.mpSums = &vdfSums[nStep * nRows];
    MoveWindows(oWindows);
    for (std::size_t i = 0; i < vdfSums.size(); ++i)
    {
        ASSERT_TRUE(SameSample(vdfSums[i], vdfExpected[i]))
            << "row " << i % nRows << " of sample " << i / nRows << " is " << vdfSums[i]
            << " and not " << vdfExpected[i];
    }
}

TEST_P(SharpenRows, SumsMoveOnOrBeginAnew)
{
    for (const std::size_t nRows : {8U, 16U, 32U})
    {
        TestMoving(nRows, 1, 1, 3, 3);
        TestMoving(nRows, 20, 1, 3, 3);
        TestMoving(nRows, 9, 3, 5, 1);
        TestMoving(nRows, 13, 2, 1, 7);
        TestMoving(nRows, 5, 4, 1, 1);
    }
}

TEST_P(SharpenRows, ResultsAreTwiceThePixelMinusTheMean)
{
    for (std::size_t nSamples = 0; nSamples <= 24; ++nSamples)
    {
        const std::vector<double> vdfIn = RandomRow(nSamples);
        const std::vector<double> vdfCounts = RandomRow(nSamples);
        std::vector<double> vdfSums = RandomRow(nSamples);
        std::vector<double> vdfExpected(nSamples);
        for (std::size_t i = 0; i < nSamples; ++i)
        {
            vdfExpected[i] = vdfIn[i] * 2.0 - vdfSums[i] / vdfCounts[i];
        }
        SharpenRow(vdfIn.data(), vdfSums.data(), vdfCounts.data(), vdfSums);
        for (std::size_t i = 0; i < nSamples; ++i)
        {
            ASSERT_TRUE(SameSample(vdfSums[i], vdfExpected[i])) << i << " of " << nSamples;
        }
    }
}

TEST_P(SharpenRows, LaplacianKeepsAPixelAlone)
{
    constexpr std::size_t kSamples = 3 * kRowPadding;
    const std::vector<double> vdfCentres = RandomRow(kSamples);
    const std::vector<double> vdfSums = RandomRow(kSamples);
    std::vector<double> vdfCounts(kSamples);
    for (double& dfCount : vdfCounts)
    {
        dfCount = static_cast<double>(1 + moRandom() % 3);
    }
    std::vector<double> vdfOut(kSamples);
    LaplacianRow(vdfCentres.data(), vdfSums.data(), vdfCounts.data(), vdfOut);
    for (std::size_t i = 0; i < kSamples; ++i)
    {
        const double dfExpected =
            vdfCounts[i] == 1.0 ? vdfCentres[i] : vdfCentres[i] - vdfSums[i] / vdfCounts[i];
        EXPECT_TRUE(SameSample(vdfOut[i], dfExpected)) << i;
    }
}

}  // namespace
}  // namespace kor::filters::kernels
