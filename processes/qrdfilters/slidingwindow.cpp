#include "processes/qrdfilters/slidingwindow.h"

#include <algorithm>
#include <optional>
#include <string>
#include <type_traits>
#include <vector>

#include "platform/exception/exception.h"
#include "processes/qrdfilters/background.h"
#include "processes/qrdfilters/hardened.h"
#include "processes/qrdfilters/kernels/windowsums.h"
#include "processes/qrdfilters/samplerows.h"

namespace kor::filters
{

namespace
{

using kernels::BatchColumn;
using kernels::kBatchRows;
using kernels::PadRow;

/// Repeats each entry for the channels of its pixel. The usual numbers of channels get loops of
/// their own, which are several times as fast.
template <std::size_t kChannels, class T>
void RepeatForChannels(std::span<const T> oPixels, T* pSamples)
{
    for (const T nPixel : oPixels)
    {
        for (std::size_t c = 0; c < kChannels; ++c)
        {
            *pSamples++ = nPixel;
        }
    }
}

template <class T>
void RepeatForChannels(std::span<const T> oPixels, std::size_t nChannels, T* pSamples)
{
    switch (nChannels)
    {
        case 2:
            return RepeatForChannels<2>(oPixels, pSamples);
        case 3:
            return RepeatForChannels<3>(oPixels, pSamples);
        case 4:
            return RepeatForChannels<4>(oPixels, pSamples);
        default:
            for (const T nPixel : oPixels)
            {
                pSamples = std::fill_n(pSamples, nChannels, nPixel);
            }
    }
}

/// The rows that a batch of windows touches, made when they are first asked for and then kept as
/// long as a window may still want them. Rows are asked for in ascending order, give or take those.
template <class T>
class RowRing
{
public:
    RowRing(const Window& oWindow, std::size_t nLength)
        : mnNext(-std::int64_t{oWindow.mnHalfY}),
          mnFirst(mnNext),
          mnRows(oWindow.GetHeight() + kBatchRows),
          mnLength(PadRow(nLength) + kernels::kRowPadding),
          mvValues(mnRows * mnLength)
    {
    }

    template <class MakeRow>
    const T* Get(std::int64_t y, const MakeRow& oMakeRow)
    {
        for (; mnNext <= y; ++mnNext)
        {
            oMakeRow(mnNext, Slot(mnNext));
        }
        return Slot(y);
    }

private:
    T* Slot(std::int64_t y)
    {
        return &mvValues[static_cast<std::size_t>(y - mnFirst) % mnRows * mnLength];
    }

    std::int64_t mnNext;
    std::int64_t mnFirst;
    std::size_t mnRows;
    std::size_t mnLength;
    std::vector<T> mvValues;
};

/// The validity of the pixels in a row of windows, as bytes: one a pixel, and one a sample.
class ValidRows
{
public:
    ValidRows(const tessel::Mask& oMask, const Window& oWindow, std::size_t nPixels,
              std::size_t nChannels)
        : moMask(oMask),
          mnLeft(-std::int64_t{oWindow.mnHalfX}),
          mnPixels(nPixels),
          mnChannels(nChannels),
          moPixels(oWindow, nPixels),
          moSamples(oWindow, nChannels == 1 ? 0 : nPixels * nChannels)
    {
    }

    const unsigned char* Pixels(std::int64_t y)
    {
        return moPixels.Get(y,
                            [this](std::int64_t nRow, unsigned char* pRow) {
                                moMask.ExpandRow(mnLeft, nRow, {pRow, mnPixels});
                            });
    }

    const unsigned char* Samples(std::int64_t y)
    {
        if (mnChannels == 1)
        {
            return Pixels(y);
        }
        return moSamples.Get(
            y,
            [this](std::int64_t nRow, unsigned char* pRow) {
                RepeatForChannels<unsigned char>({Pixels(nRow), mnPixels}, mnChannels, pRow);
            });
    }

private:
    const tessel::Mask& moMask;
    std::int64_t mnLeft;
    std::size_t mnPixels;
    std::size_t mnChannels;
    RowRing<unsigned char> moPixels;
    RowRing<unsigned char> moSamples;
};

/// The rows that enter the sums: doubles, transformed, and +0.0 in the place of masked samples,
/// since the sums start at +0.0 and adding or subtracting +0.0 changes nothing.
template <class TSample>
class SummedRows
{
public:
    SummedRows(const tessel::Raster& oIn, ValidRows* poValid, const Window& oWindow,
               WindowTerm::Transform pfnTransform)
        : moIn(oIn),
          mpoValid(poValid),
          mnLeft(-std::int64_t{oWindow.mnHalfX}),
          mnSamples((oIn.mnWidth + oWindow.GetWidth() - 1) * oIn.mnChannels),
          mpfnTransform(pfnTransform),
          moRows(oWindow, IsAsItLies() ? 0 : mnSamples)
    {
    }

    WindowTerm::Transform GetTransform() const { return mpfnTransform; }

    /// Row y from the left end of the first window on.
    const double* Row(std::int64_t y)
    {
        if (IsAsItLies())
        {
            return moIn.GetPixelAs<const double>(mnLeft, y);
        }
        return moRows.Get(y,
                          [this](std::int64_t nRow, double* pRow) {
                              MakeRow(nRow, {pRow, mnSamples});
                          });
    }

private:
    bool IsAsItLies() const
    {
        return std::is_same_v<TSample, double> && mpoValid == nullptr && mpfnTransform == nullptr;
    }

    void MakeRow(std::int64_t y, std::span<double> vdfRow)
    {
        const TSample* pIn = moIn.GetPixelAs<const TSample>(mnLeft, y);
        if constexpr (std::is_same_v<TSample, double>)
        {
            if (mpfnTransform == nullptr)
            {
                kernels::ClearMasked(mpoValid->Samples(y), pIn, vdfRow);
                return;
            }
        }
        LoadSamples(pIn, vdfRow);
        if (mpfnTransform != nullptr)
        {
            mpfnTransform(vdfRow);
        }
        if (mpoValid != nullptr)
        {
            kernels::ClearMasked(mpoValid->Samples(y), vdfRow.data(), vdfRow);
        }
    }

    const tessel::Raster& moIn;
    ValidRows* mpoValid;
    std::int64_t mnLeft;
    std::size_t mnSamples;
    WindowTerm::Transform mpfnTransform;
    RowRing<double> moRows;
};

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

/// One run of the engine over a block.
template <class TSample>
class WindowScan
{
public:
    WindowScan(const tessel::Raster& oIn, const tessel::Mask* poMaskIn, const Window& oWindow,
               std::span<const WindowTerm> oTerms, const VisitWindows& oVisit)
        : moIn(oIn),
          moWindow(oWindow),
          moVisit(oVisit),
          moStretches(oIn, oWindow),
          moValid(MakeValidRows(poMaskIn)),
          moCounts(moStretches, oWindow, GetValidRows()),
          mvdfCentres(moStretches.mnLongest)
    {
        for (const WindowTerm& oTerm : oTerms)
        {
            // Terms of the same samples share the rows.
            const auto itRows = std::find_if(
                mvoRows.begin(), mvoRows.end(),
                [&](const auto& oRows) { return oRows.GetTransform() == oTerm.mpfnTransform; });
            mvnRowsOfTerm.push_back(static_cast<std::size_t>(itRows - mvoRows.begin()));
            if (itRows == mvoRows.end())
            {
                mvoRows.emplace_back(oIn, GetValidRows(), oWindow, oTerm.mpfnTransform);
            }
            mvoSums.emplace_back(moStretches, oTerm.mbSquared);
        }
    }

    void Run()
    {
        ScanFirstRow();
        for (std::uint32_t y = 1; y < moIn.mnHeight; y += kBatchRows)
        {
            ScanBatch(y, std::min<std::size_t>(kBatchRows, moIn.mnHeight - y));
        }
    }

private:
    std::optional<ValidRows> MakeValidRows(const tessel::Mask* poMaskIn) const
    {
        if (poMaskIn == nullptr)
        {
            return std::nullopt;
        }
        return ValidRows(*poMaskIn, moWindow, moStretches.GetColumns() / moStretches.mnChannels,
                         moStretches.mnChannels);
    }

    ValidRows* GetValidRows() { return moValid ? &*moValid : nullptr; }

    void ScanFirstRow()
    {
        const std::int64_t nHalfY = moWindow.mnHalfY;
        for (std::size_t t = 0; t < mvoSums.size(); ++t)
        {
            for (std::int64_t y = -nHalfY; y <= nHalfY; ++y)
            {
                mvoSums[t].AddRow(mvoRows[mvnRowsOfTerm[t]].Row(y));
            }
        }
        moCounts.AddFirstRows();
        ForEachStretch(
            [this](std::size_t nFirst, std::size_t nSamples)
            {
                for (TermSums& oSums : mvoSums)
                {
                    oSums.SumFirstRow(nFirst, nSamples);
                }
                Visit(0, 0, nFirst, nSamples);
            });
    }

    void ScanBatch(std::uint32_t nFirstRow, std::size_t nRows)
    {
        std::vector<kernels::BatchRows> voRows;
        for (SummedRows<TSample>& oRows : mvoRows)
        {
            voRows.push_back(RowsOfBatch(oRows, nFirstRow, nRows));
        }
        for (std::size_t r = 0; r < nRows; ++r)
        {
            moCounts.SlideTo(static_cast<std::int64_t>(nFirstRow + r));
        }
        ForEachStretch(
            [&](std::size_t nFirst, std::size_t nSamples)
            {
                for (std::size_t t = 0; t < mvoSums.size(); ++t)
                {
                    mvoSums[t].SumBatch(voRows[mvnRowsOfTerm[t]], nFirst, nSamples);
                }
                for (std::size_t r = 0; r < nRows; ++r)
                {
                    Visit(static_cast<std::uint32_t>(nFirstRow + r), r, nFirst, nSamples);
                }
            });
    }

    /// The last batch of a block may be short: it repeats its last row, whose sums go unused, so
    /// that nothing is read outside the block.
    kernels::BatchRows RowsOfBatch(SummedRows<TSample>& oRows, std::uint32_t nFirstRow,
                                   std::size_t nRows)
    {
        kernels::BatchRows oBatch{};
        for (std::size_t r = 0; r < kBatchRows; ++r)
        {
            const auto y = static_cast<std::int64_t>(nFirstRow + std::min(r, nRows - 1));
            oBatch.mapEntering[r] = oRows.Row(y + moWindow.mnHalfY);
            oBatch.mapLeaving[r] = oRows.Row(y - moWindow.mnHalfY - 1);
        }
        return oBatch;
    }

    template <class Body>
    void ForEachStretch(const Body& oBody)
    {
        for (std::size_t nFirst = 0; nFirst < moStretches.mnSamples;
             nFirst += moStretches.mnLongest)
        {
            oBody(nFirst, std::min(moStretches.mnLongest, moStretches.mnSamples - nFirst));
        }
    }

    void Visit(std::uint32_t nRow, std::size_t r, std::size_t nFirst, std::size_t nSamples)
    {
        WindowStatistics oStatistics;
        oStatistics.mnRow = nRow;
        oStatistics.mnFirst = nFirst;
        oStatistics.mnSamples = nSamples;
        for (std::size_t t = 0; t < mvoSums.size(); ++t)
        {
            oStatistics.mapSums[t] = mvoSums[t].Row(r);
        }
        oStatistics.mpCounts = moCounts.Row(nRow, nFirst, nSamples);
        oStatistics.mpCentres = Centres(nRow, nFirst, nSamples);
        moVisit(oStatistics);
    }

    /// The samples as they lie where they are doubles and can be read up to the padding.
    const double* Centres(std::uint32_t nRow, std::size_t nFirst, std::size_t nSamples)
    {
        const TSample* pRow = moIn.GetPixelAs<const TSample>(0, nRow) + nFirst;
        if constexpr (std::is_same_v<TSample, double>)
        {
            if (nFirst + PadRow(nSamples) <= moStretches.mnSamples)
            {
                return pRow;
            }
        }
        LoadSamples(pRow, {mvdfCentres.data(), nSamples});
        return mvdfCentres.data();
    }

    const tessel::Raster& moIn;
    Window moWindow;
    const VisitWindows& moVisit;
    Stretches moStretches;
    std::optional<ValidRows> moValid;
    WindowCounts moCounts;
    std::vector<SummedRows<TSample>> mvoRows;
    std::vector<std::size_t> mvnRowsOfTerm;
    std::vector<TermSums> mvoSums;
    std::vector<double> mvdfCentres;
};

/// Puts the finished stretches where they belong: results, and background where a mask says so.
template <class TSample>
class OutputRows
{
public:
    OutputRows(const tessel::Raster& oIn, const tessel::Mask* poMaskIn, bool bBGZero,
               const FinishWindows& oFinish, tessel::Raster& oOut, const tessel::Mask* poMaskOut)
        : moIn(oIn),
          mpoMaskIn(poMaskIn),
          mbBGZero(bBGZero),
          moFinish(oFinish),
          moOut(oOut),
          mpoMaskOut(poMaskOut),
          mbMasked(poMaskIn != nullptr || poMaskOut != nullptr),
          mbStreamed(std::is_same_v<TSample, double> && oOut.mnBufferSize >= kStreamedBytes)
    {
    }

    void Write(const WindowStatistics& oStatistics)
    {
        TSample* pOut = moOut.GetPixelAs<TSample>(0, oStatistics.mnRow) + oStatistics.mnFirst;
        if constexpr (std::is_same_v<TSample, double>)
        {
            // The padding is written over by the next stretch of the row.
            const std::size_t nRow = std::size_t{moOut.mnWidth} * moOut.mnChannels;
            if (!mbMasked && !mbStreamed && oStatistics.mnFirst + oStatistics.GetPadded() <= nRow)
            {
                moFinish(oStatistics, {pOut, oStatistics.GetPadded()});
                return;
            }
        }
        mvdfResults.resize(std::max(mvdfResults.size(), oStatistics.GetPadded()));
        moFinish(oStatistics, {mvdfResults.data(), oStatistics.GetPadded()});
        const std::span<const double> vdfResults(mvdfResults.data(), oStatistics.mnSamples);
        if (!mbMasked)
        {
            if constexpr (std::is_same_v<TSample, double>)
            {
                if (mbStreamed)
                {
                    kernels::StreamRow(vdfResults, pOut);
                    return;
                }
            }
            StoreSamples(vdfResults, pOut);
            return;
        }
        WriteMasked(oStatistics, vdfResults, pOut);
    }

private:
    /// Well above the caches of a core.
    static constexpr std::uint64_t kStreamedBytes = std::uint64_t{16} << 20;

    void WriteMasked(const WindowStatistics& oStatistics, std::span<const double> vdfResults,
                     TSample* pOut)
    {
        const std::size_t nChannels = moIn.mnChannels;
        const std::size_t nPixels = oStatistics.mnSamples / nChannels;
        const TSample* pIn =
            moIn.GetPixelAs<const TSample>(0, oStatistics.mnRow) + oStatistics.mnFirst;
        mvComputed.resize(std::max(mvComputed.size(), nPixels));
        const std::span<unsigned char> oComputed(mvComputed.data(), nPixels);
        FindComputedPixels(mpoMaskIn, mpoMaskOut,
                           static_cast<std::int64_t>(oStatistics.mnFirst / nChannels),
                           oStatistics.mnRow, oComputed);
        if constexpr (std::is_same_v<TSample, double>)
        {
            const unsigned char* pComputed = oComputed.data();
            if (nChannels != 1)
            {
                mvComputedSamples.resize(std::max(mvComputedSamples.size(), vdfResults.size()));
                RepeatForChannels<unsigned char>(oComputed, nChannels, mvComputedSamples.data());
                pComputed = mvComputedSamples.data();
            }
            const std::span<double> vdfOut(pOut, vdfResults.size());
            mbBGZero ? kernels::ClearMasked(pComputed, vdfResults.data(), vdfOut)
                     : kernels::SelectValid(pComputed, vdfResults.data(), pIn, vdfOut);
            return;
        }
        StoreSamples(vdfResults, pOut);
        WriteBackground(oComputed, pIn, nChannels, mbBGZero, pOut);
    }

    const tessel::Raster& moIn;
    const tessel::Mask* mpoMaskIn;
    bool mbBGZero;
    const FinishWindows& moFinish;
    tessel::Raster& moOut;
    const tessel::Mask* mpoMaskOut;
    bool mbMasked;
    bool mbStreamed;
    std::vector<double> mvdfResults;
    std::vector<unsigned char> mvComputed;
    std::vector<unsigned char> mvComputedSamples;
};

}  // namespace

template <class TSample>
void ScanWindows(const tessel::Raster& oIn, const tessel::Mask* poMaskIn, const Window& oWindow,
                 std::span<const WindowTerm> oTerms, const VisitWindows& oVisit)
{
    if (oIn.mnWidth == 0 || oIn.mnHeight == 0 || oIn.mnChannels == 0)
    {
        return;
    }
    WindowScan<TSample>(oIn, poMaskIn, oWindow, oTerms, oVisit).Run();
}

template <class TSample>
void FilterWindowRows(const tessel::Raster& oIn, const tessel::Mask* poMaskIn,
                      const Window& oWindow, std::span<const WindowTerm> oTerms, bool bBGZero,
                      const FinishWindows& oFinish, tessel::Raster& oOut,
                      const tessel::Mask* poMaskOut)
{
    OutputRows<TSample> oRows(oIn, poMaskIn, bBGZero, oFinish, oOut, poMaskOut);
    ScanWindows<TSample>(oIn, poMaskIn, oWindow, oTerms,
                         [&oRows](const WindowStatistics& oStatistics)
                         { oRows.Write(oStatistics); });
}

template void ScanWindows<float>(const tessel::Raster&, const tessel::Mask*, const Window&,
                                 std::span<const WindowTerm>, const VisitWindows&);
template void ScanWindows<double>(const tessel::Raster&, const tessel::Mask*, const Window&,
                                  std::span<const WindowTerm>, const VisitWindows&);
template void FilterWindowRows<float>(const tessel::Raster&, const tessel::Mask*, const Window&,
                                      std::span<const WindowTerm>, bool, const FinishWindows&,
                                      tessel::Raster&, const tessel::Mask*);
template void FilterWindowRows<double>(const tessel::Raster&, const tessel::Mask*, const Window&,
                                       std::span<const WindowTerm>, bool, const FinishWindows&,
                                       tessel::Raster&, const tessel::Mask*);

}  // namespace kor::filters
