#include "processes/qrdfilters/slidingwindow.h"

#include <algorithm>
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
    engine::Stretches moStretches;
    std::optional<ValidRows> moValid;
    engine::WindowCounts moCounts;
    std::vector<SummedRows<TSample>> mvoRows;
    std::vector<std::size_t> mvnRowsOfTerm;
    std::vector<TermSums> mvoSums;
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
