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

/// The rows that leave and enter the windows of a batch, one pair a row.
struct BatchRows
{
    std::array<const double*, kBatchRows> mapLeaving;
    std::array<const double*, kBatchRows> mapEntering;
};

/// oSums[i] += pRow[i], or its square: a row enters the column sums.
void AddRow(const double* pRow, bool bSquared, std::span<double> oSums);

/// Moves oSums, the sums of the columns from nFirst on, down by a batch: for each row of it the
/// leaving sample, or its square, is subtracted and then the entering one added. Row r of
/// poBatch[i] receives sum i after row r. Writes PadRow(oSums.size()) columns of poBatch; reads
/// nothing behind the samples.
void SlideColumns(const BatchRows& oRows, std::size_t nFirst, bool bSquared,
                  std::span<double> oSums, BatchColumn* poBatch);

/// oWindows[i] = 0 + pColumns[i] + pColumns[i + nStep] + ... of nCount terms: each window's sum
/// from scratch. Reads PadRow(oWindows.size()) + (nCount - 1) * nStep columns, writes as many
/// windows.
void SumWindows(const double* pColumns, std::size_t nCount, std::size_t nStep,
                std::span<double> oWindows);

/// The same for one sample of all rows of a batch.
void SumBatchWindow(const BatchColumn* poBatch, std::size_t nCount, std::size_t nStep,
                    BatchColumn& oWindow);

/// Moves the window sums of a batch along the row by nSamples samples: at each, column poColumns[i]
/// is subtracted and then poColumns[i + nSpan] added. poSums holds the nChannels sums of the pixel
/// before and ends as those of the last one; apRows[r][i] receives row r of sum i.
void SlideWindows(const BatchColumn* poColumns, std::size_t nSpan, std::size_t nSamples,
                  std::size_t nChannels, BatchColumn* poSums,
                  const std::array<double*, kBatchRows>& apRows);

/// oOut[i] = pValid[i] != 0 ? pIn[i] : +0.0. pIn may be oOut.
void ClearMasked(const unsigned char* pValid, const double* pIn, std::span<double> oOut);

/// oOut[i] = pValid[i] != 0 ? pIn[i] : pElse[i].
void SelectValid(const unsigned char* pValid, const double* pIn, const double* pElse,
                 std::span<double> oOut);

/// Copies a row past the caches: for output that is much larger than they are.
void StreamRow(std::span<const double> oIn, double* pOut);

/// oAfter[i] = pBefore[i] + pEntering[i] - pLeaving[i]. pBefore may be oAfter.
void SlideCounts(const std::int32_t* pBefore, const unsigned char* pLeaving,
                 const unsigned char* pEntering, std::span<std::int32_t> oAfter);

/// oCounts[i] = pColumns[i] + ... + pColumns[i + nWindow - 1]. Reads and writes up to
/// PadRow(oCounts.size()) counts.
void SumCounts(const std::int32_t* pColumns, std::size_t nWindow, std::span<double> oCounts);

}  // namespace kor::filters::kernels
