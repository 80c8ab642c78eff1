#pragma once

#include <algorithm>
#include <array>
#include <cstddef>
#include <vector>

#include "processes/qrdfilters/engine/windowrows.h"
#include "processes/qrdfilters/kernels/windowsums.h"

namespace kor::filters::engine
{

using kernels::BatchColumn;
using kernels::kBatchRows;
using kernels::PadRow;

/// How a row is cut: windows of nSamples pixels times channels, in stretches that keep the sums of
/// a batch in the first-level cache and are long beside a window.
struct Stretches
{
    Stretches(const tessel::Raster& oIn, const Window& oWindow)
        : mnChannels(oIn.mnChannels),
          mnSamples(std::size_t{oIn.mnWidth} * oIn.mnChannels),
          mnSpan(oWindow.GetWidth() * oIn.mnChannels),
          mnLongest(PadRow((std::max(kShortest, 4 * mnSpan) + mnChannels - 1) / mnChannels) *
                    mnChannels)
    {
    }

    /// Samples of the columns that the windows of a row cover.
    std::size_t GetColumns() const { return mnSamples - mnChannels + mnSpan; }

    static constexpr std::size_t kShortest = 128;

    std::size_t mnChannels;
    std::size_t mnSamples;  ///< of a row of windows
    std::size_t mnSpan;     ///< samples of a window's row
    std::size_t mnLongest;  ///< samples of a stretch, a multiple of the channels and the padding
};

/// The columns that a stretch moves down: whole bytes of validity, and so some columns more than
/// its windows have.
class ColumnStretch
{
public:
    ColumnStretch(const Stretches& oStretches, std::size_t nFirst, std::size_t nSamples)
        : mnFirst(nFirst == 0 ? 0 : EndOf(oStretches, nFirst)),
          mnCount(EndOf(oStretches, nFirst + nSamples) - mnFirst),
          mnPlace(mnFirst + oStretches.mnChannels - nFirst)
    {
    }

    std::size_t mnFirst;
    std::size_t mnCount;
    std::size_t
        mnPlace;  ///< of column mnFirst, where place i is the column that leaves at sample i

private:
    static std::size_t EndOf(const Stretches& oStretches, std::size_t nSamples)
    {
        return std::min(oStretches.GetColumns(),
                        PadRow(nSamples - oStretches.mnChannels + oStretches.mnSpan));
    }
};

/// The sums of one term. All stretches of a batch are taken in order from the left.
class TermSums
{
public:
    explicit TermSums(const Stretches& oStretches)
        : moStretches(oStretches),
          mvdfColumns(oStretches.GetColumns() + kernels::kRowPadding),
          mvoColumns(oStretches.mnLongest + oStretches.mnSpan + 2 * kernels::kRowPadding),
          mvoRunning(oStretches.mnChannels),
          mvdfRows(kBatchRows * oStretches.mnLongest)
    {
    }

    /// The sums of the columns.
    double* GetColumns() { return mvdfColumns.data(); }

    /// The windows of the first row, each from scratch.
    void SumFirstRow(std::size_t nFirst, std::size_t nSamples)
    {
        kernels::SumWindows(mvdfColumns.data() + nFirst,
                            moStretches.mnSpan / moStretches.mnChannels, moStretches.mnChannels,
                            {mvdfRows.data(), PadRow(nSamples)});
    }

    /// Where the columns of the next stretch go.
    kernels::ColumnSums OpenColumns(const ColumnStretch& oColumns)
    {
        if (oColumns.mnFirst != 0)
        {
            // What this stretch has in common with the one before.
            const auto itKept =
                mvoColumns.begin() + static_cast<std::ptrdiff_t>(moStretches.mnLongest);
            std::copy_n(itKept, oColumns.mnPlace, mvoColumns.begin());
        }
        return {&mvdfColumns[oColumns.mnFirst], &mvoColumns[oColumns.mnPlace]};
    }

    /// The way along the row from sample nFrom of the stretch on.
    kernels::WindowTrack OpenTrack(std::size_t nFrom)
    {
        kernels::WindowTrack oTrack{&mvoColumns[nFrom], mvoRunning.data(), {}};
        for (std::size_t r = 0; r < kBatchRows; ++r)
        {
            oTrack.mapRows[r] = &mvdfRows[r * moStretches.mnLongest + nFrom];
        }
        return oTrack;
    }

    /// The first pixel of each row of a batch, from scratch.
    void StartRows()
    {
        const std::size_t nChannels = moStretches.mnChannels;
        for (std::size_t c = 0; c < nChannels; ++c)
        {
            kernels::SumBatchWindow(&mvoColumns[nChannels + c], moStretches.mnSpan / nChannels,
                                    nChannels, mvoRunning[c]);
            for (std::size_t r = 0; r < kBatchRows; ++r)
            {
                mvdfRows[r * moStretches.mnLongest + c] = mvoRunning[c].madfRows[r];
            }
        }
    }

    /// The window sums of row r of the batch.
    const double* Row(std::size_t r) const { return &mvdfRows[r * moStretches.mnLongest]; }

private:
    const Stretches& moStretches;
    std::vector<double> mvdfColumns;
    /// The column that leaves the window of sample i is mvoColumns[i], the one that enters it
    /// mvoColumns[i + mnSpan].
    std::vector<BatchColumn> mvoColumns;
    std::vector<BatchColumn> mvoRunning;
    std::vector<double> mvdfRows;
};

/// The number of valid pixels of each window: integers, so that their order is free.
class WindowCounts
{
public:
    WindowCounts(const Stretches& oStretches, const Window& oWindow, ValidRows* poValid)
        : moWindow(oWindow),
          mpoValid(poValid),
          mnSamples(oStretches.mnSamples),
          mvdfCounts(oStretches.mnLongest,
                     static_cast<double>(oWindow.GetWidth() * oWindow.GetHeight()))
    {
        if (mpoValid != nullptr)
        {
            mvnCounts.resize(PadRow(mnSamples));
        }
    }

    /// Sums the windows of row 0 of the block.
    void SumFirstRow()
    {
        const std::int64_t nHalfY = moWindow.mnHalfY;
        for (std::int64_t y = -nHalfY; mpoValid != nullptr && y <= nHalfY; ++y)
        {
            kernels::AddCounts(mpoValid->Counts(y), {mvnCounts.data(), mnSamples});
        }
    }

    /// The counts of a stretch of row nRow; each stretch is asked for once in each row, from row 0
    /// on. They hold until the next call.
    const double* Row(std::int64_t nRow, std::size_t nFirst, std::size_t nSamples)
    {
        if (mpoValid == nullptr)
        {
            return mvdfCounts.data();
        }
        const std::span<double> vdfCounts(mvdfCounts.data(), PadRow(nSamples));
        if (nRow == 0)
        {
            kernels::LoadCounts(&mvnCounts[nFirst], vdfCounts);
        }
        else
        {
            kernels::SlideCounts(mpoValid->Counts(nRow - moWindow.mnHalfY - 1) + nFirst,
                                 mpoValid->Counts(nRow + moWindow.mnHalfY) + nFirst,
                                 &mvnCounts[nFirst], vdfCounts);
        }
        return mvdfCounts.data();
    }

private:
    Window moWindow;
    ValidRows* mpoValid;
    std::size_t mnSamples;
    std::vector<std::int32_t> mvnCounts;
    std::vector<double> mvdfCounts;
};

}  // namespace kor::filters::engine
