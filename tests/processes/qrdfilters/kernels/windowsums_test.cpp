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

/// The validity of samples as kernels take it; an empty one stands for all valid.
std::vector<unsigned char> Packed(const std::vector<unsigned char>& vValid)
{
    std::vector<unsigned char> vBits((vValid.size() + 7) / 8 + 8);
    for (std::size_t i = 0; i < vValid.size(); ++i)
    {
        vBits[i / 8] =
            static_cast<unsigned char>(vBits[i / 8] | (vValid[i] != 0 ? 1U : 0U) << i % 8);
    }
    return vBits;
}

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
        for (const bool bMasked : {false, true})
        {
            const std::vector<double> vdfRow = RandomRow(nSamples);
            const std::vector<unsigned char> vValid = RandomBytes(nSamples);
            const std::vector<unsigned char> vBits = Packed(vValid);
            std::vector<double> vdfSums = RandomRow(PadRow(nSamples));
            std::vector<double> vdfSquares = RandomRow(PadRow(nSamples));
            std::vector<double> vdfExpectedSums(vdfSums.begin(), vdfSums.begin() + nSamples);
            std::vector<double> vdfExpectedSquares(vdfSquares.begin(),
                                                   vdfSquares.begin() + nSamples);
            for (std::size_t i = 0; i < nSamples; ++i)
            {
                const double x = bMasked && vValid[i] == 0 ? 0.0 : vdfRow[i];
                vdfExpectedSums[i] = vdfExpectedSums[i] + x;
                vdfExpectedSquares[i] = vdfExpectedSquares[i] + x * x;
            }
            const unsigned char* pValid = bMasked ? vBits.data() : nullptr;
            AddRow(vdfRow.data(), pValid, vdfSums.data(), nullptr, nSamples);
            ExpectSame(vdfSums, vdfExpectedSums);
            AddRow(vdfRow.data(), pValid, nullptr, vdfSquares.data(), nSamples);
            ExpectSame(vdfSquares, vdfExpectedSquares);
        }
    }
}

/// The rows of a batch, exactly as long as told, so that a read behind the end is seen by a
/// sanitizer.
struct RandomBatch
{
    RandomBatch(std::size_t nColumns, bool bMasked, Random& oRandom)
    {
        for (std::size_t r = 0; r < 2 * kBatchRows; ++r)
        {
            std::vector<double>& vdfRow = mvvdfRows.emplace_back(nColumns);
            std::vector<unsigned char>& vValid = mvvValid.emplace_back(nColumns, 1);
            for (std::size_t i = 0; i < nColumns; ++i)
            {
                vdfRow[i] = test::RandomSample<double>(Samples::Special, oRandom);
                vValid[i] = !bMasked || oRandom() % 2 == 0 ? 1 : 0;
            }
            mvvBits.push_back(Packed(vValid));
        }
        for (std::size_t r = 0; r < kBatchRows; ++r)
        {
            moRows.mapLeaving[r] = mvvdfRows[r].data();
            moRows.mapEntering[r] = mvvdfRows[kBatchRows + r].data();
            moRows.mapLeavingValid[r] = bMasked ? mvvBits[r].data() : nullptr;
            moRows.mapEnteringValid[r] = bMasked ? mvvBits[kBatchRows + r].data() : nullptr;
        }
    }

    double Sample(std::size_t nRow, std::size_t i) const
    {
        return mvvValid[nRow][i] != 0 ? mvvdfRows[nRow][i] : 0.0;
    }

    std::vector<std::vector<double>> mvvdfRows;
    std::vector<std::vector<unsigned char>> mvvValid;
    std::vector<std::vector<unsigned char>> mvvBits;
    BatchRows moRows{};
};

/// Sums of columns from nFirst on, moved down by a batch. Squares are rounded before they are
/// added: a fused multiply-add would show here.
void ExpectSlidColumns(const RandomBatch& oBatch, std::size_t nFirst, bool bSquared,
                       std::vector<double> vdfBefore, std::span<const double> oAfter,
                       std::span<const BatchColumn> oColumns)
{
    for (std::size_t i = 0; i < vdfBefore.size(); ++i)
    {
        for (std::size_t r = 0; r < kBatchRows; ++r)
        {
            const double dfLeaving = oBatch.Sample(r, nFirst + i);
            const double dfEntering = oBatch.Sample(kBatchRows + r, nFirst + i);
            vdfBefore[i] = vdfBefore[i] - (bSquared ? dfLeaving * dfLeaving : dfLeaving);
            vdfBefore[i] = vdfBefore[i] + (bSquared ? dfEntering * dfEntering : dfEntering);
            ASSERT_TRUE(SameSample(oColumns[i].madfRows[r], vdfBefore[i]));
        }
    }
    ExpectSame(oAfter, vdfBefore);
}

TEST_P(WindowSums, ColumnsSlideRowByRow)
{
    for (std::size_t nColumns = 0; nColumns <= kMostSamples; ++nColumns)
    {
        // Which terms are wanted: bit 0 the sums, bit 1 the squares.
        for (unsigned int nWanted = 1; nWanted <= 3; ++nWanted)
        {
            for (const bool bMasked : {false, true})
            {
                const std::size_t nFirst = nColumns % 3 * kRowPadding;
                const RandomBatch oBatch(nFirst + nColumns, bMasked, moRandom);
                std::vector<double> vdfSums = RandomRow(nColumns);
                std::vector<double> vdfSquares = RandomRow(nColumns);
                const std::vector<double> vdfSumsBefore = vdfSums;
                const std::vector<double> vdfSquaresBefore = vdfSquares;
                // One column more, so that both have an address when there are none.
                std::vector<BatchColumn> voSums(PadRow(nColumns) + 1);
                std::vector<BatchColumn> voSquares(PadRow(nColumns) + 1);
                vdfSums.resize(nColumns + 1);
                vdfSquares.resize(nColumns + 1);
                SlideColumns(
                    oBatch.moRows, nFirst, nColumns,
                    (nWanted & 1U) != 0 ? ColumnSums{vdfSums.data(), voSums.data()} : ColumnSums{},
                    (nWanted & 2U) != 0 ? ColumnSums{vdfSquares.data(), voSquares.data()}
                                        : ColumnSums{});
                if ((nWanted & 1U) != 0)
                {
                    ExpectSlidColumns(oBatch, nFirst, false, vdfSumsBefore, vdfSums, voSums);
                }
                if ((nWanted & 2U) != 0)
                {
                    ExpectSlidColumns(oBatch, nFirst, true, vdfSquaresBefore, vdfSquares,
                                      voSquares);
                }
            }
        }
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

/// One term's windows on their way, and what they have to become.
struct RandomTrack
{
    RandomTrack(std::vector<BatchColumn> voColumns, std::vector<BatchColumn> voSums,
                std::size_t nSamples)
        : mvoColumns(std::move(voColumns)),
          mvoSums(std::move(voSums)),
          mvoExpected(mvoSums),
          mvvdfRows(kBatchRows, std::vector<double>(nSamples + 1))
    {
        moTrack.mpoColumns = mvoColumns.data();
        moTrack.mpoSums = mvoSums.data();
        for (std::size_t r = 0; r < kBatchRows; ++r)
        {
            moTrack.mapRows[r] = mvvdfRows[r].data();
        }
    }

    void ExpectSlid(std::size_t nSpan, std::size_t nSamples)
    {
        const std::size_t nChannels = mvoSums.size();
        for (std::size_t i = 0; i < nSamples; ++i)
        {
            for (std::size_t r = 0; r < kBatchRows; ++r)
            {
                double& dfSum = mvoExpected[i % nChannels].madfRows[r];
                dfSum = dfSum - mvoColumns[i].madfRows[r];
                dfSum = dfSum + mvoColumns[i + nSpan].madfRows[r];
                ASSERT_TRUE(SameSample(mvvdfRows[r][i], dfSum)) << "row " << r << ", sample " << i;
            }
        }
        for (std::size_t c = 0; c < nChannels; ++c)
        {
            ExpectSame(mvoSums[c].madfRows, mvoExpected[c].madfRows);
        }
    }

    std::vector<BatchColumn> mvoColumns;
    std::vector<BatchColumn> mvoSums;
    std::vector<BatchColumn> mvoExpected;
    std::vector<std::vector<double>> mvvdfRows;
    WindowTrack moTrack{};
};

TEST_P(WindowSums, WindowsSlideAlongTheRows)
{
    for (std::size_t nSamples = 0; nSamples <= kMostSamples; ++nSamples)
    {
        const std::size_t nChannels = 1 + nSamples % 4;
        const std::size_t nSpan = nChannels * 3;
        // A stretch is a whole number of pixels, or the sums end in another order.
        const std::size_t nWhole = nSamples / nChannels * nChannels;
        for (const std::size_t nTracks : {1U, 2U})
        {
            std::vector<RandomTrack> voTracks;
            std::vector<WindowTrack> voGiven;
            voTracks.reserve(nTracks);
            for (std::size_t t = 0; t < nTracks; ++t)
            {
                voTracks.emplace_back(RandomColumns(nWhole + nSpan), RandomColumns(nChannels),
                                      nWhole);
                voGiven.push_back(voTracks.back().moTrack);
            }
            SlideWindows(voGiven, nSpan, nWhole, nChannels);
            for (RandomTrack& oTrack : voTracks)
            {
                oTrack.ExpectSlid(nSpan, nWhole);
            }
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

TEST_P(WindowSums, ValidityIsPackedIntoBits)
{
    for (std::size_t nSamples = 0; nSamples <= 200; ++nSamples)
    {
        std::vector<unsigned char> vValid = RandomBytes(nSamples);
        const std::vector<unsigned char> vExpected = Packed(vValid);
        for (unsigned char& nByte : vValid)
        {
            nByte = nByte != 0 && moRandom() % 2 == 0 ? 0x80 : nByte;
        }
        std::vector<unsigned char> vBits((nSamples + 7) / 8);
        PackValid(vValid.data(), nSamples, vBits.data());
        EXPECT_TRUE(std::equal(vBits.begin(), vBits.end(), vExpected.begin())) << nSamples;
    }
}

TEST_P(WindowSums, ValidSamplesOfAWindowAreCounted)
{
    for (std::size_t nSamples = 1; nSamples <= 3 * kMostSamples; ++nSamples)
    {
        const std::size_t nStep = 1 + nSamples % 4;
        const std::size_t nCount = 1 + nSamples % 20;
        const std::size_t nBytes = nSamples + (nCount - 1) * nStep;
        const std::vector<unsigned char> vValid = RandomBytes(nBytes + kCountPadding);
        std::vector<std::int32_t> vnScratch(nBytes + kCountPadding);
        std::vector<std::int32_t> vnCounts(nSamples + kCountPadding);
        CountValid(vValid.data(), nCount, nStep, vnScratch.data(), {vnCounts.data(), nSamples});
        for (std::size_t i = 0; i < nSamples; ++i)
        {
            std::int32_t nExpected = 0;
            for (std::size_t k = 0; k < nCount; ++k)
            {
                nExpected += vValid[i + k * nStep];
            }
            EXPECT_EQ(vnCounts[i], nExpected) << nSamples << ", " << i;
        }
    }
}

TEST_P(WindowSums, CountsSlideDownTheRows)
{
    std::vector<std::int32_t> vnCounts(kMostSamples);
    std::vector<std::int32_t> vnLeaving(kMostSamples);
    std::vector<std::int32_t> vnEntering(kMostSamples);
    std::iota(vnCounts.begin(), vnCounts.end(), 100000);
    std::iota(vnLeaving.begin(), vnLeaving.end(), 7);
    std::iota(vnEntering.rbegin(), vnEntering.rend(), 1);
    std::vector<double> vdfCounts(kMostSamples);
    LoadCounts(vnCounts.data(), vdfCounts);
    for (std::size_t i = 0; i < kMostSamples; ++i)
    {
        EXPECT_EQ(vdfCounts[i], 100000.0 + static_cast<double>(i));
    }
    SlideCounts(vnLeaving.data(), vnEntering.data(), vnCounts.data(), vdfCounts);
    for (std::size_t i = 0; i < kMostSamples; ++i)
    {
        const auto nExpected = static_cast<std::int32_t>(100000 + i - (7 + i) + kMostSamples - i);
        EXPECT_EQ(vnCounts[i], nExpected);
        EXPECT_EQ(vdfCounts[i], nExpected);
    }
    AddCounts(vnLeaving.data(), {vnCounts.data(), 3});
    EXPECT_EQ(vnCounts[2], static_cast<std::int32_t>(100002 - 9 + kMostSamples - 2 + 9));
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
