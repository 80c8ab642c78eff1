#include "processes/qrdfilters/kernels/windowsums.h"

#include <gtest/gtest.h>
#include <hwy/tests/hwy_gtest.h>

#include <numeric>
#include <vector>

#include "processes/qrdfilters/kernels/averagerow.h"
#include "tests/support/blocks.h"

namespace kor::filters::kernels
{
namespace
{

using test::Random;
using test::SameSample;
using test::Samples;

/// Each test runs once for every instruction set that this machine has.
class WindowSums : public hwy::TestWithParamTarget
{
protected:
    std::vector<double> RandomRow(std::size_t nSamples)
    {
        std::vector<double> vdfRow(nSamples);
        for (double& dfSample : vdfRow)
        {
            dfSample = test::RandomSample<double>(
                moRandom() % 8 == 0 ? Samples::Special : Samples::Ordinary, moRandom);
        }
        return vdfRow;
    }

    std::vector<unsigned char> RandomBytes(std::size_t nCount)
    {
        std::vector<unsigned char> vBytes(nCount);
        for (unsigned char& nByte : vBytes)
        {
            nByte = static_cast<unsigned char>(moRandom() % 2);
        }
        return vBytes;
    }

    std::vector<BatchColumn> RandomColumns(std::size_t nCount)
    {
        std::vector<BatchColumn> voColumns(nCount);
        for (BatchColumn& oColumn : voColumns)
        {
            const std::vector<double> vdfRow = RandomRow(kBatchRows);
            std::copy(vdfRow.begin(), vdfRow.end(), oColumn.madfRows.begin());
        }
        return voColumns;
    }

    Random moRandom{5};
};

HWY_TARGET_INSTANTIATE_TEST_SUITE_P(WindowSums);

void ExpectSame(std::span<const double> oActual, std::span<const double> oExpected)
{
    for (std::size_t i = 0; i < oExpected.size(); ++i)
    {
        ASSERT_TRUE(SameSample(oActual[i], oExpected[i]))
            << "sample " << i << " of " << oExpected.size() << " is " << oActual[i] << " and not "
            << oExpected[i];
    }
}

// Up to three of the widest vectors, so that every target meets every remainder.
constexpr std::size_t kMostSamples = 24;

TEST_P(WindowSums, RowsAreAddedToTheColumns)
{
    for (std::size_t nSamples = 0; nSamples <= kMostSamples; ++nSamples)
    {
        for (const bool bSquared : {false, true})
        {
            const std::vector<double> vdfRow = RandomRow(nSamples);
            std::vector<double> vdfSums = RandomRow(nSamples);
            std::vector<double> vdfExpected = vdfSums;
            for (std::size_t i = 0; i < nSamples; ++i)
            {
                const double dfTerm = bSquared ? vdfRow[i] * vdfRow[i] : vdfRow[i];
                vdfExpected[i] = vdfExpected[i] + dfTerm;
            }
            AddRow(vdfRow.data(), bSquared, vdfSums);
            ExpectSame(vdfSums, vdfExpected);
        }
    }
}

// Squares are rounded before they are added: a fused multiply-add would show here.
TEST_P(WindowSums, ColumnsSlideRowByRow)
{
    for (std::size_t nColumns = 1; nColumns <= kMostSamples; ++nColumns)
    {
        const bool bSquared = nColumns % 2 == 0;
        const std::size_t nFirst = nColumns % 3;
        // Exactly as long as told, so that a read behind the end is seen by a sanitizer.
        std::vector<std::vector<double>> vvdfRows;
        BatchRows oRows{};
        for (std::size_t r = 0; r < 2 * kBatchRows; ++r)
        {
            vvdfRows.push_back(RandomRow(nFirst + nColumns));
        }
        for (std::size_t r = 0; r < kBatchRows; ++r)
        {
            oRows.mapLeaving[r] = vvdfRows[r].data();
            oRows.mapEntering[r] = vvdfRows[kBatchRows + r].data();
        }
        std::vector<double> vdfSums = RandomRow(nColumns);
        std::vector<double> vdfExpected = vdfSums;
        std::vector<BatchColumn> voBatch(PadRow(nColumns));
        SlideColumns(oRows, nFirst, bSquared, vdfSums, voBatch.data());
        for (std::size_t i = 0; i < nColumns; ++i)
        {
            for (std::size_t r = 0; r < kBatchRows; ++r)
            {
                const double dfLeaving = vvdfRows[r][nFirst + i];
                const double dfEntering = vvdfRows[kBatchRows + r][nFirst + i];
                vdfExpected[i] = vdfExpected[i] - (bSquared ? dfLeaving * dfLeaving : dfLeaving);
                vdfExpected[i] = vdfExpected[i] + (bSquared ? dfEntering * dfEntering : dfEntering);
                ASSERT_TRUE(SameSample(voBatch[i].madfRows[r], vdfExpected[i]));
            }
        }
        ExpectSame(vdfSums, vdfExpected);
    }
}

TEST_P(WindowSums, WindowsAreSummedFromScratch)
{
    for (std::size_t nSamples = 1; nSamples <= kMostSamples; ++nSamples)
    {
        const std::size_t nCount = 1 + nSamples % 5;
        const std::size_t nStep = 1 + nSamples % 3;
        const std::vector<double> vdfColumns = RandomRow(PadRow(nSamples) + (nCount - 1) * nStep);
        std::vector<double> vdfWindows(PadRow(nSamples));
        std::vector<double> vdfExpected(nSamples);
        SumWindows(vdfColumns.data(), nCount, nStep, vdfWindows);
        for (std::size_t i = 0; i < nSamples; ++i)
        {
            double dfSum = 0.0;
            for (std::size_t k = 0; k < nCount; ++k)
            {
                dfSum = dfSum + vdfColumns[i + k * nStep];
            }
            vdfExpected[i] = dfSum;
        }
        ExpectSame(vdfWindows, vdfExpected);
    }
}

TEST_P(WindowSums, FirstWindowOfABatchIsSummedFromScratch)
{
    const std::vector<BatchColumn> voColumns = RandomColumns(30);
    BatchColumn oWindow{};
    SumBatchWindow(voColumns.data(), 7, 4, oWindow);
    BatchColumn oExpected{};
    for (std::size_t k = 0; k < 7; ++k)
    {
        for (std::size_t r = 0; r < kBatchRows; ++r)
        {
            oExpected.madfRows[r] = oExpected.madfRows[r] + voColumns[4 * k].madfRows[r];
        }
    }
    ExpectSame(oWindow.madfRows, oExpected.madfRows);
}

TEST_P(WindowSums, WindowsSlideAlongTheRows)
{
    for (std::size_t nSamples = 0; nSamples <= kMostSamples; ++nSamples)
    {
        const std::size_t nChannels = 1 + nSamples % 4;
        const std::size_t nSpan = nChannels * 3;
        const std::vector<BatchColumn> voColumns = RandomColumns(nSamples + nSpan);
        std::vector<BatchColumn> voSums = RandomColumns(nChannels);
        std::vector<BatchColumn> voExpected = voSums;
        std::vector<std::vector<double>> vvdfRows(kBatchRows, std::vector<double>(nSamples));
        std::array<double*, kBatchRows> apRows{};
        for (std::size_t r = 0; r < kBatchRows; ++r)
        {
            apRows[r] = vvdfRows[r].data();
        }
        // A stretch is a whole number of pixels, or the sums end in another order.
        const std::size_t nWhole = nSamples / nChannels * nChannels;
        SlideWindows(voColumns.data(), nSpan, nWhole, nChannels, voSums.data(), apRows);
        for (std::size_t i = 0; i < nWhole; ++i)
        {
            for (std::size_t r = 0; r < kBatchRows; ++r)
            {
                double& dfSum = voExpected[i % nChannels].madfRows[r];
                dfSum = dfSum - voColumns[i].madfRows[r];
                dfSum = dfSum + voColumns[i + nSpan].madfRows[r];
                ASSERT_TRUE(SameSample(vvdfRows[r][i], dfSum)) << "row " << r << ", sample " << i;
            }
        }
        for (std::size_t c = 0; c < nChannels; ++c)
        {
            ExpectSame(voSums[c].madfRows, voExpected[c].madfRows);
        }
    }
}

TEST_P(WindowSums, MaskedSamplesAreClearedOrReplaced)
{
    for (std::size_t nSamples = 0; nSamples <= kMostSamples; ++nSamples)
    {
        const std::vector<double> vdfIn = RandomRow(nSamples);
        const std::vector<double> vdfElse = RandomRow(nSamples);
        const std::vector<unsigned char> vValid = RandomBytes(nSamples);
        std::vector<double> vdfCleared(nSamples, 7.0);
        std::vector<double> vdfSelected(nSamples, 7.0);
        ClearMasked(vValid.data(), vdfIn.data(), vdfCleared);
        SelectValid(vValid.data(), vdfIn.data(), vdfElse.data(), vdfSelected);
        for (std::size_t i = 0; i < nSamples; ++i)
        {
            EXPECT_TRUE(SameSample(vdfCleared[i], vValid[i] != 0 ? vdfIn[i] : 0.0));
            EXPECT_TRUE(SameSample(vdfSelected[i], vValid[i] != 0 ? vdfIn[i] : vdfElse[i]));
        }
    }
}

TEST_P(WindowSums, RowsAreStreamedToAnyAddress)
{
    for (std::size_t nSamples = 0; nSamples <= 2 * kMostSamples; ++nSamples)
    {
        for (std::size_t nShift = 0; nShift < 8; ++nShift)
        {
            const std::vector<double> vdfIn = RandomRow(nSamples);
            std::vector<double> vdfOut(nShift + nSamples + 1, -1.0);
            StreamRow(vdfIn, vdfOut.data() + nShift);
            ExpectSame({vdfOut.data() + nShift, nSamples}, vdfIn);
            EXPECT_EQ(vdfOut.back(), -1.0);
        }
    }
}

TEST_P(WindowSums, CountsSlideAndAreSummed)
{
    for (std::size_t nColumns = 1; nColumns <= 3 * kMostSamples; ++nColumns)
    {
        const std::size_t nWindow = 1 + nColumns % 9;
        const std::vector<unsigned char> vLeaving = RandomBytes(nColumns);
        const std::vector<unsigned char> vEntering = RandomBytes(nColumns);
        std::vector<std::int32_t> vnBefore(nColumns);
        std::iota(vnBefore.begin(), vnBefore.end(), 1);
        std::vector<std::int32_t> vnAfter(PadRow(nColumns) + nWindow, 0);
        SlideCounts(vnBefore.data(), vLeaving.data(), vEntering.data(), {vnAfter.data(), nColumns});
        std::vector<double> vdfCounts(PadRow(nColumns));
        SumCounts(vnAfter.data(), nWindow, {vdfCounts.data(), nColumns});
        for (std::size_t i = 0; i < nColumns; ++i)
        {
            EXPECT_EQ(vnAfter[i], static_cast<int>(i) + 1 + vEntering[i] - vLeaving[i]);
            const auto itFirst = vnAfter.begin() + static_cast<std::ptrdiff_t>(i);
            EXPECT_EQ(vdfCounts[i],
                      std::accumulate(itFirst, itFirst + static_cast<std::ptrdiff_t>(nWindow), 0));
        }
    }
}

TEST_P(WindowSums, AverageIsTheSumOverTheCount)
{
    const std::vector<double> vdfSums = RandomRow(kMostSamples);
    const std::vector<double> vdfCounts = RandomRow(kMostSamples);
    std::vector<double> vdfMeans(kMostSamples);
    AverageRow(vdfSums.data(), vdfCounts.data(), vdfMeans);
    for (std::size_t i = 0; i < kMostSamples; ++i)
    {
        EXPECT_TRUE(SameSample(vdfMeans[i], vdfSums[i] / vdfCounts[i]));
    }
}

}  // namespace
}  // namespace kor::filters::kernels
