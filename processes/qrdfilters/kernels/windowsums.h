#pragma once

#include <array>
#include <cstddef>
#include <cstdint>
#include <span>

/// Row kernels of the sliding-window statistics. Sums are doubles over flattened samples (pixel
/// times channels plus channel); rows are handled in batches, whose sums stand side by side for
/// each sample, so that the running sums of all rows of a batch move along the row together. Every
/// sum is built by the same additions in the same order on every target.
namespace kor::filters::kernels
{

/// Rows of a batch.
inline constexpr std::size_t kBatchRows = 8;
/// Buffers that kernels write end on a multiple of this many samples, or hold as many more.
inline constexpr std::size_t kRowPadding = 8;

constexpr std::size_t PadRow(std::size_t nSamples)
{
    return (nSamples + kRowPadding - 1) / kRowPadding * kRowPadding;
}

/// The sums of one sample in all rows of a batch.
struct alignas(64) BatchColumn
{
    std::array<double, kBatchRows> madfRows;
};

/// The rows that leave and enter the windows of a batch, one pair a row. Where pixels are masked,
/// each row comes with its validity: sample i counts as +0.0 where bit i % 8 of byte i / 8 is 0. As
/// the sums start at +0.0, adding or subtracting that changes nothing. Else those are all null.
struct BatchRows
{
    std::array<const double*, kBatchRows> mapLeaving;
    std::array<const double*, kBatchRows> mapEntering;
    std::array<const unsigned char*, kBatchRows> mapLeavingValid{};
    std::array<const unsigned char*, kBatchRows> mapEnteringValid{};
};

/// The column sums of one term, and where they go in each row of a batch. Both are null where the
/// term is not wanted.
struct ColumnSums
{
    double* mpSums = nullptr;
    BatchColumn* mpoBatch = nullptr;
};

/// A row enters the column sums: pSums[i] += pRow[i], pSquares[i] += pRow[i] * pRow[i]; either may
/// be null. pValid holds the validity as in BatchRows, or is null. pSums and pSquares can be read
/// and written up to PadRow(nCount).
void AddRow(const double* pRow, const unsigned char* pValid, double* pSums, double* pSquares,
            std::size_t nCount);

/// Moves the sums of nCount columns from nFirst on down by a batch: for each row of it the leaving
/// sample, or its square, is subtracted and then the entering one added. Row r of column nFirst + i
/// goes to mpoBatch[i]; PadRow(nCount) columns are written. Reads nothing behind the samples.
/// nFirst is a multiple of kRowPadding.
void SlideColumns(const BatchRows& oRows, std::size_t nFirst, std::size_t nCount,
                  const ColumnSums& oSums, const ColumnSums& oSquares);

/// oWindows[i] = 0 + pColumns[i] + pColumns[i + nStep] + ... of nCount terms: each window's sum
/// from scratch. Reads PadRow(oWindows.size()) + (nCount - 1) * nStep columns, writes as many
/// windows.
void SumWindows(const double* pColumns, std::size_t nCount, std::size_t nStep,
                std::span<double> oWindows);

/// The same for one sample of all rows of a batch.
void SumBatchWindow(const BatchColumn* poBatch, std::size_t nCount, std::size_t nStep,
                    BatchColumn& oWindow);

/// One term's windows on their way along a row: the columns of a batch, the sums of the pixel
/// before, one a channel, which end as those of the last pixel, and the rows that receive the sums.
struct WindowTrack
{
    const BatchColumn* mpoColumns;
    BatchColumn* mpoSums;
    std::array<double*, kBatchRows> mapRows;
};

/// Moves the window sums of one or two terms along the row by nSamples samples: at each, column
/// mpoColumns[i] is subtracted and then mpoColumns[i + nSpan] added. mapRows[r][i] receives row r
/// of sum i.
void SlideWindows(std::span<const WindowTrack> oTracks, std::size_t nSpan, std::size_t nSamples,
                  std::size_t nChannels);

/// oOut[i] = pValid[i] != 0 ? pIn[i] : +0.0. pIn may be oOut.
void ClearMasked(const unsigned char* pValid, const double* pIn, std::span<double> oOut);

/// oOut[i] = pValid[i] != 0 ? pIn[i] : pElse[i]. pIn may be oOut.
void SelectValid(const unsigned char* pValid, const double* pIn, const double* pElse,
                 std::span<double> oOut);

/// Copies a row past the caches: for output that is much larger than they are.
void StreamRow(std::span<const double> oIn, double* pOut);

/// Packs bytes 0 or not into bits, sample i into bit i % 8 of byte i / 8.
void PackValid(const unsigned char* pValid, std::size_t nSamples, unsigned char* pBits);

/// Integer counts may be read and written up to this many behind the last one.
inline constexpr std::size_t kCountPadding = 16;

/// oCounts[i] = pValid[i] + pValid[i + nStep] + ... of nCount bytes, each 0 or 1. pScratch holds a
/// count for each byte.
void CountValid(const unsigned char* pValid, std::size_t nCount, std::size_t nStep,
                std::int32_t* pScratch, std::span<std::int32_t> oCounts);

/// oCounts[i] += pRow[i].
void AddCounts(const std::int32_t* pRow, std::span<std::int32_t> oCounts);

/// pCounts[i] += pEntering[i] - pLeaving[i], and oCounts[i] is the same as a double. Lengths here
/// and below are multiples of kRowPadding.
void SlideCounts(const std::int32_t* pLeaving, const std::int32_t* pEntering, std::int32_t* pCounts,
                 std::span<double> oCounts);

/// oCounts[i] = pCounts[i].
void LoadCounts(const std::int32_t* pCounts, std::span<double> oCounts);

}  // namespace kor::filters::kernels
