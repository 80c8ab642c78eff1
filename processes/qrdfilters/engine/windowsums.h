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

/// The sums of one term. All stretches of a batch are taken in order from the left.
class TermSums
{
public:
    TermSums(const Stretches& oStretches, bool bSquared)
        : moStretches(oStretches),
          mbSquared(bSquared),
          mvdfColumns(oStretches.GetColumns() + kernels::kRowPadding),
          mvoColumns(oStretches.mnLongest + oStretches.mnSpan + kernels::kRowPadding),
          mvoRunning(oStretches.mnChannels),
          mvdfRows(kBatchRows * oStretches.mnLongest)
    {
    }

    void AddRow(const double* pRow)
    {
        kernels::AddRow(pRow, mbSquared, {mvdfColumns.data(), moStretches.GetColumns()});
    }

    /// The windows of the first row, each from scratch.
    void SumFirstRow(std::size_t nFirst, std::size_t nSamples)
    {
        kernels::SumWindows(mvdfColumns.data() + nFirst,
                            moStretches.mnSpan / moStretches.mnChannels, moStretches.mnChannels,
                            {mvdfRows.data(), PadRow(nSamples)});
    }

    /// The windows of a batch of rows.
    void SumBatch(const kernels::BatchRows& oRows, std::size_t nFirst, std::size_t nSamples)
    {
        // The column that leaves the window of sample i is mvoColumns[i], the one that enters it
        // mvoColumns[i + nSpan].
        const std::size_t nSpan = moStretches.mnSpan;
        if (nFirst == 0)
        {
            const std::size_t nChannels = moStretches.mnChannels;
            SlideColumns(oRows, 0, nSamples - nChannels + nSpan, nChannels);
            StartRows();
            SlideWindows(nChannels, nSamples - nChannels);
        }
        else
        {
            std::copy_n(mvoColumns.begin() + static_cast<std::ptrdiff_t>(moStretches.mnLongest),
                        nSpan, mvoColumns.begin());
            SlideColumns(oRows, nFirst - moStretches.mnChannels + nSpan, nSamples, nSpan);
            SlideWindows(0, nSamples);
        }
    }

    /// The window sums of row r of the batch.
    const double* Row(std::size_t r) const { return &mvdfRows[r * moStretches.mnLongest]; }

private:
    void SlideColumns(const kernels::BatchRows& oRows, std::size_t nFirst, std::size_t nCount,
                      std::size_t nPlace)
    {
        kernels::SlideColumns(oRows, nFirst, mbSquared, {&mvdfColumns[nFirst], nCount},
                              &mvoColumns[nPlace]);
    }

    /// The first pixel of each row, from scratch.
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

    void SlideWindows(std::size_t nFrom, std::size_t nCount)
    {
        std::array<double*, kBatchRows> apRows{};
        for (std::size_t r = 0; r < kBatchRows; ++r)
        {
            apRows[r] = &mvdfRows[r * moStretches.mnLongest + nFrom];
        }
        kernels::SlideWindows(&mvoColumns[nFrom], moStretches.mnSpan, nCount,
                              moStretches.mnChannels, mvoRunning.data(), apRows);
    }

    const Stretches& moStretches;
    bool mbSquared;
    std::vector<double> mvdfColumns;
    std::vector<BatchColumn> mvoColumns;
    std::vector<BatchColumn> mvoRunning;
    std::vector<double> mvdfRows;
};

/// The number of valid pixels of each window: integers, so that their order is free.
class WindowCounts
{
public:
    WindowCounts(const Stretches& oStretches, const Window& oWindow, ValidRows* poValid)
        : moStretches(oStretches),
          moWindow(oWindow),
          mpoValid(poValid),
          mnColumns(oStretches.GetColumns() / oStretches.mnChannels),
          mnRow(PadRow(mnColumns) + kernels::kRowPadding),
          mvdfCounts(oStretches.mnLongest,
                     static_cast<double>(oWindow.GetWidth() * oWindow.GetHeight()))
    {
        if (mpoValid != nullptr)
        {
            mvnColumns.resize(kBatchRows * mnRow);
            mvdfPixels.resize(oStretches.mnLongest / oStretches.mnChannels);
        }
    }

    /// Moves the columns to row 0 of the block.
    void AddFirstRows()
    {
        if (mpoValid == nullptr)
        {
            return;
        }
        const std::vector<unsigned char> vNone(mnColumns);
        const std::int64_t nHalfY = moWindow.mnHalfY;
        for (std::int64_t y = -nHalfY; y <= nHalfY; ++y)
        {
            kernels::SlideCounts(Columns(0), vNone.data(), mpoValid->Pixels(y),
                                 {Columns(0), mnColumns});
        }
    }

    /// Moves the columns from row nRow - 1 to row nRow of the block.
    void SlideTo(std::int64_t nRow)
    {
        if (mpoValid == nullptr)
        {
            return;
        }
        kernels::SlideCounts(Columns(nRow - 1), mpoValid->Pixels(nRow - moWindow.mnHalfY - 1),
                             mpoValid->Pixels(nRow + moWindow.mnHalfY), {Columns(nRow), mnColumns});
    }

    /// The counts of a stretch of row nRow, which is among the last kBatchRows rows; they hold
    /// until the next call.
    const double* Row(std::int64_t nRow, std::size_t nFirst, std::size_t nSamples)
    {
        if (mpoValid == nullptr)
        {
            return mvdfCounts.data();
        }
        const std::size_t nChannels = moStretches.mnChannels;
        const std::size_t nPixels = nSamples / nChannels;
        kernels::SumCounts(Columns(nRow) + nFirst / nChannels, moWindow.GetWidth(),
                           {mvdfPixels.data(), nPixels});
        if (nChannels == 1)
        {
            return mvdfPixels.data();
        }
        RepeatForChannels<double>({mvdfPixels.data(), nPixels}, nChannels, mvdfCounts.data());
        return mvdfCounts.data();
    }

private:
    std::int32_t* Columns(std::int64_t nRow)
    {
        return &mvnColumns[static_cast<std::size_t>(nRow) % kBatchRows * mnRow];
    }

    const Stretches& moStretches;
    Window moWindow;
    ValidRows* mpoValid;
    std::size_t mnColumns;
    std::size_t mnRow;
    std::vector<std::int32_t> mvnColumns;
    std::vector<double> mvdfPixels;
    std::vector<double> mvdfCounts;
};

}  // namespace kor::filters::engine
