#include "processes/qrdfilters/slidingwindow.h"

#include <algorithm>
#include <array>
#include <optional>
#include <type_traits>
#include <vector>

#include "basic/core/typedispatch/typelist.h"
#include "processes/qrdfilters/blockcontract.h"
#include "processes/qrdfilters/engine/outputrows.h"
#include "processes/qrdfilters/engine/windowrows.h"
#include "processes/qrdfilters/engine/windowsums.h"

namespace kor::filters
{

namespace
{

using engine::SummedRows;
using engine::TermSums;
using engine::ValidRows;
using kernels::kBatchRows;
using kernels::PadRow;

constexpr const char* kSource = "processes/qrdfilters/slidingwindow";

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
        mvoSums.reserve(oTerms.size());
        for (const WindowTerm& oTerm : oTerms)
        {
            Source& oSource = SourceOf(oTerm.mpfnTransform);
            std::size_t& nSums = oTerm.mbSquared ? oSource.mnSquares : oSource.mnSums;
            if (nSums == kNone)
            {
                nSums = mvoSums.size();
                mvoSums.emplace_back(moStretches);
            }
            mvnSumsOfTerm.push_back(nSums);
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
    static constexpr std::size_t kNone = kMostWindowTerms;

    /// Rows, and which sums they feed.
    struct Source
    {
        SummedRows<TSample> moRows;
        std::size_t mnSums = kNone;
        std::size_t mnSquares = kNone;
    };

    /// Terms of the same samples share the rows.
    Source& SourceOf(WindowTerm::Transform pfnTransform)
    {
        const auto itSource = std::find_if(mvoSources.begin(), mvoSources.end(),
                                           [pfnTransform](const Source& oSource) {
                                               return oSource.moRows.GetTransform() == pfnTransform;
                                           });
        if (itSource != mvoSources.end())
        {
            return *itSource;
        }
        return mvoSources.emplace_back(Source{{moIn, moWindow, pfnTransform}});
    }

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
        for (Source& oSource : mvoSources)
        {
            for (std::int64_t y = -nHalfY; y <= nHalfY; ++y)
            {
                kernels::AddRow(oSource.moRows.Row(y), moValid ? moValid->Bits(y) : nullptr,
                                ColumnsOf(oSource.mnSums), ColumnsOf(oSource.mnSquares),
                                moStretches.GetColumns());
            }
        }
        moCounts.SumFirstRow();
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

    double* ColumnsOf(std::size_t nSums)
    {
        return nSums == kNone ? nullptr : mvoSums[nSums].GetColumns();
    }

    void ScanBatch(std::uint32_t nFirstRow, std::size_t nRows)
    {
        std::vector<kernels::BatchRows> voRows;
        for (Source& oSource : mvoSources)
        {
            voRows.push_back(RowsOfBatch(oSource.moRows, nFirstRow, nRows));
        }
        ForEachStretch(
            [&](std::size_t nFirst, std::size_t nSamples)
            {
                SumBatch(voRows, nFirst, nSamples);
                for (std::size_t r = 0; r < nRows; ++r)
                {
                    Visit(static_cast<std::uint32_t>(nFirstRow + r), r, nFirst, nSamples);
                }
            });
    }

    /// The windows of a batch of rows.
    void SumBatch(const std::vector<kernels::BatchRows>& voRows, std::size_t nFirst,
                  std::size_t nSamples)
    {
        const engine::ColumnStretch oColumns(moStretches, nFirst, nSamples);
        const auto oOpen = [&](std::size_t nSums)
        { return nSums == kNone ? kernels::ColumnSums() : mvoSums[nSums].OpenColumns(oColumns); };
        for (std::size_t i = 0; i < voRows.size(); ++i)
        {
            kernels::SlideColumns(voRows[i], oColumns.mnFirst, oColumns.mnCount,
                                  oOpen(mvoSources[i].mnSums), oOpen(mvoSources[i].mnSquares));
        }
        const std::size_t nFrom = nFirst == 0 ? moStretches.mnChannels : 0;
        std::array<kernels::WindowTrack, kMostWindowTerms> aoTracks{};
        for (std::size_t t = 0; t < mvoSums.size(); ++t)
        {
            if (nFirst == 0)
            {
                mvoSums[t].StartRows();
            }
            aoTracks[t] = mvoSums[t].OpenTrack(nFrom);
        }
        kernels::SlideWindows({aoTracks.data(), mvoSums.size()}, moStretches.mnSpan,
                              nSamples - nFrom, moStretches.mnChannels);
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
            const std::int64_t nEntering = y + moWindow.mnHalfY;
            const std::int64_t nLeaving = y - moWindow.mnHalfY - 1;
            oBatch.mapEntering[r] = oRows.Row(nEntering);
            oBatch.mapLeaving[r] = oRows.Row(nLeaving);
            if (moValid)
            {
                oBatch.mapEnteringValid[r] = moValid->Bits(nEntering);
                oBatch.mapLeavingValid[r] = moValid->Bits(nLeaving);
            }
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
        for (std::size_t t = 0; t < mvnSumsOfTerm.size(); ++t)
        {
            oStatistics.mapSums[t] = mvoSums[mvnSumsOfTerm[t]].Row(r);
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
    engine::Stretches moStretches;
    std::optional<ValidRows> moValid;
    engine::WindowCounts moCounts;
    std::vector<Source> mvoSources;
    std::vector<TermSums> mvoSums;
    std::vector<std::size_t> mvnSumsOfTerm;
    std::vector<double> mvdfCentres;
};

}  // namespace

template <class TSample>
void ScanWindows(const tessel::Raster& oIn, const tessel::Mask* poMaskIn, const Window& oWindow,
                 std::span<const WindowTerm> oTerms, const VisitWindows& oVisit)
{
    RequireType(oIn, typedispatch::RealDataType<TSample>(), "poRasterIn", kSource);
    RequireWindowInside(oWindow, oIn, poMaskIn, kSource);
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
    RequireType(oOut, typedispatch::RealDataType<TSample>(), "poRasterOut", kSource);
    RequireMatchingBlocks(oIn, nullptr, oOut, poMaskOut, kSource);
    engine::OutputRows<TSample> oRows(oIn, poMaskIn, bBGZero, oFinish, oOut, poMaskOut);
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
