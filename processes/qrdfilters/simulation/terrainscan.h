#pragma once

#include <algorithm>
#include <span>
#include <vector>

#include "processes/qrdfilters/simulation/projection.h"
#include "processes/qrdfilters/simulation/rangecolumns.h"
#include "processes/qrdfilters/simulation/scanframe.h"

namespace kor::filters::simulation
{

/// First sub-sample of a cell: the one for which shadow and layover are told.
struct CellCorner
{
    std::int64_t mnLine = 0;  ///< from 1
    std::int64_t mnColumn = 0;
    double mdfAlong = 0.0;  ///< metres along the track
    double mdfLook = 0.0;   ///< degrees
    double mdfRange = 0.0;  ///< ground range, metres
};

/// Cuts the cells between two DEM rows into sub-samples and projects them to the radar image.
///
/// The sub-samples of some cells are projected together, row by row, and then handed on in their
/// order: cell by cell, in each from its first row to its last.
template <Division kDivision>
class TerrainScan
{
public:
    TerrainScan(const Projection<kDivision>& oProjection, const DemWindow& oWindow,
                const ScanOrder& oOrder, const ScanFrame& oFrame, const RadarGrid& oGrid,
                int nOversampling)
        : moProjection(oProjection),
          moOrder(oOrder),
          mnWindowY(oWindow.mnY),
          mdfCosHead(oFrame.mdfCosHead),
          moGrid(oGrid),
          moColumns(oProjection, oGrid),
          mnOversampling(nOversampling),
          mdfSubStep(1.0 / nOversampling),
          mnCells(oWindow.mnWidth - 1)
    {
        BuildColumns(oFrame.mdfSinHead);
    }

    /// Bytes that the tables of columns take, and a row of sub-samples of one cell.
    static double GetBytes(const DemWindow& oWindow, int nOversampling)
    {
        constexpr double kTables = 3.0;
        constexpr double kRows = 8.0;
        return (kTables * static_cast<double>(oWindow.mnWidth) + kRows) * sizeof(double) *
               std::max(nOversampling, 1);
    }

    /// The cells between the DEM row before and row nRow, whose elevations are oPrevious and
    /// oCurrent. Cells that oSkipped names (by the place of their column, from 0) are left out;
    /// empty: none. Calls oSink.Hit(nLine, nColumn) for each sub-sample whose line lies in the
    /// image, and behind the first of a cell oSink.Mark(CellCorner).
    template <class Sink>
    void ScanRow(std::int64_t nRow, std::span<const float> oPrevious,
                 std::span<const float> oCurrent, std::span<const unsigned char> oSkipped,
                 Sink& oSink)
    {
        const std::int64_t nSubRows = mnOversampling + (nRow == moOrder.mnLastRow ? 1 : 0);
        const std::int64_t nCellSamples =
            std::max<std::int64_t>(1, mnOversampling * std::max<std::int64_t>(1, nSubRows));
        const std::int64_t nTogether = std::clamp<std::int64_t>(kSamplesTogether / nCellSamples, 1,
                                                                std::max<std::int64_t>(1, mnCells));
        for (std::int64_t n = 0; n < mnCells;)
        {
            std::int64_t nEnd = n;
            while (nEnd < mnCells && nEnd - n < nTogether && !IsSkipped(nEnd, oSkipped))
            {
                ++nEnd;
            }
            if (nEnd > n)
            {
                moRun = {n, nEnd};
                ScanCells(nRow, nSubRows, oPrevious, oCurrent, oSink);
            }
            n = std::max(nEnd, n + 1);
        }
    }

private:
    static constexpr std::int64_t kSamplesTogether = 4096;

    /// Cells in scan order, the end not among them.
    struct CellRun
    {
        std::int64_t mnBegin = 0;
        std::int64_t mnEnd = 0;
    };

    /// A row of sub-samples.
    struct SubRow
    {
        double mdfOffset;  ///< from the DEM row before, in rows
        double mdfNorth;   ///< metres north of the near range point
        double mdfDown;    ///< share of the along-track coordinate, metres
        std::vector<double> mvdfElevations;
        std::vector<std::int64_t> mvnColumns;
        std::vector<std::int32_t> mvnLines;  ///< 0 outside the image
    };

    std::int64_t ColumnOf(std::int64_t nCell) const
    {
        return moOrder.mnFirstCol + nCell * moOrder.mnColStep;
    }
    bool IsSkipped(std::int64_t nCell, std::span<const unsigned char> oSkipped) const
    {
        return !oSkipped.empty() && oSkipped[static_cast<std::size_t>(ColumnOf(nCell) - 1)] != 0;
    }
    /// Sub-columns of a cell: the last one also has its far edge.
    std::int64_t SubColumns(std::int64_t nCell) const
    {
        return std::max<std::int64_t>(0, mnOversampling + (nCell == mnCells - 1 ? 1 : 0));
    }
    /// Place of a cell's first sub-column in the tables.
    std::size_t FirstSubColumn(std::int64_t nCell) const
    {
        return static_cast<std::size_t>(nCell * mnOversampling);
    }
    double SubOffset(std::int64_t i, std::int64_t nStep) const
    {
        return static_cast<double>(i * nStep) * mdfSubStep;
    }

    void BuildColumns(double dfSinHead)
    {
        const double dfPixelX = moProjection.GetView().mdfPixelX;
        const auto nPlaces =
            static_cast<std::size_t>(std::max<std::int64_t>(0, mnCells * mnOversampling + 1));
        mvdfOffsets.reserve(
            static_cast<std::size_t>(std::max<std::int64_t>(0, mnOversampling + 1)));
        mvdfAcross.reserve(nPlaces);
        moColumns.Reserve(nPlaces);
        for (std::int64_t i = 0; i <= mnOversampling; ++i)
        {
            mvdfOffsets.push_back(SubOffset(i, moOrder.mnColStep));
        }
        for (std::int64_t n = 0; n < mnCells; ++n)
        {
            for (std::int64_t i = 0; i < SubColumns(n); ++i)
            {
                const double dfLocal =
                    mvdfOffsets[static_cast<std::size_t>(i)] + static_cast<double>(ColumnOf(n) - 1);
                mvdfAcross.push_back(dfLocal * dfSinHead * dfPixelX);
                moColumns.Append(dfPixelX * dfLocal);
            }
        }
    }

    void StartSubRow(std::int64_t nRow, std::int64_t j, SubRow& oSubRow) const
    {
        const Viewpoint& oView = moProjection.GetView();
        oSubRow.mdfOffset = SubOffset(j, moOrder.mnRowStep);
        const double dfLocal =
            static_cast<double>(nRow - mnWindowY - moOrder.mnRowStep) + oSubRow.mdfOffset;
        oSubRow.mdfNorth = (static_cast<double>(oView.mnNearRow) - dfLocal) * oView.mdfPixelY;
        oSubRow.mdfDown = (dfLocal - 1.0) * mdfCosHead * oView.mdfPixelY;
    }

    template <class Sink>
    void ScanCells(std::int64_t nRow, std::int64_t nSubRows, std::span<const float> oPrevious,
                   std::span<const float> oCurrent, Sink& oSink)
    {
        // One cell alone may have any number of sub-samples; its rows then go one by one.
        const bool bOneCell = moRun.mnEnd - moRun.mnBegin == 1;
        const std::int64_t nBatch = bOneCell ? 1 : nSubRows;
        for (std::int64_t j = 0; j < nSubRows; j += nBatch)
        {
            mvoSubRows.resize(std::max(mvoSubRows.size(), static_cast<std::size_t>(nBatch)));
            for (std::int64_t k = 0; k < nBatch; ++k)
            {
                SubRow& oSubRow = mvoSubRows[static_cast<std::size_t>(k)];
                StartSubRow(nRow, j + k, oSubRow);
                Interpolate(oPrevious, oCurrent, oSubRow);
                FindLines(oSubRow);
                oSubRow.mvnColumns.resize(oSubRow.mvdfElevations.size());
                moColumns.Find(FirstSubColumn(moRun.mnBegin), oSubRow.mdfNorth,
                               oSubRow.mvdfElevations, oSubRow.mvnColumns);
            }
            HandOn(j == 0, nBatch, oSink);
        }
    }

    /// Elevations of a row of sub-samples, bilinear in each cell.
    void Interpolate(std::span<const float> oPrevious, std::span<const float> oCurrent,
                     SubRow& oSubRow) const
    {
        const double dfInvRow = 1.0 / static_cast<double>(moOrder.mnRowStep);
        const double dfInvCol = 1.0 / static_cast<double>(moOrder.mnColStep);
        const double v = oSubRow.mdfOffset;
        const std::size_t nFirst = FirstSubColumn(moRun.mnBegin);
        const std::int64_t nLast = moRun.mnEnd - 1;
        oSubRow.mvdfElevations.resize(FirstSubColumn(nLast) - nFirst +
                                      static_cast<std::size_t>(SubColumns(nLast)));
        for (std::int64_t n = moRun.mnBegin; n < moRun.mnEnd; ++n)
        {
            const auto nNear = static_cast<std::size_t>(ColumnOf(n) - 1);
            const auto nFar = static_cast<std::size_t>(ColumnOf(n) + moOrder.mnColStep - 1);
            const float p0 = oPrevious[nNear];
            const float p1 = oPrevious[nFar];
            const float c0 = oCurrent[nNear];
            const float c1 = oCurrent[nFar];
            // Differences in single precision.
            const double dfPerCol = static_cast<double>(p1 - p0) * dfInvCol;
            const double dfPerRow = static_cast<double>(c0 - p0) * dfInvRow;
            const double dfTwist = static_cast<double>(c1 + p0 - c0 - p1) * dfInvCol * dfInvRow;
            double* pElevations = oSubRow.mvdfElevations.data() + (FirstSubColumn(n) - nFirst);
            for (std::size_t i = 0; i < static_cast<std::size_t>(SubColumns(n)); ++i)
            {
                const double u = mvdfOffsets[i];
                pElevations[i] = p0 + u * dfPerCol + v * dfPerRow + u * dfTwist * v;
            }
        }
    }

    double Along(std::size_t nSubColumn, const SubRow& oSubRow) const
    {
        return mvdfAcross[nSubColumn] - oSubRow.mdfDown - moGrid.mdfStart;
    }

    void FindLines(SubRow& oSubRow) const
    {
        const double dfBehindLast = static_cast<double>(moGrid.mnLines) + 1.0;
        const std::size_t nFirst = FirstSubColumn(moRun.mnBegin);
        oSubRow.mvnLines.resize(oSubRow.mvdfElevations.size());
        for (std::size_t k = 0; k < oSubRow.mvnLines.size(); ++k)
        {
            const double dfLine = moGrid.mdfPerAzimuth * Along(nFirst + k, oSubRow) + 1.0 + 0.5;
            const bool bInside = dfLine >= 1.0 && dfLine < dfBehindLast;
            oSubRow.mvnLines[k] = bInside ? static_cast<std::int32_t>(dfLine) : 0;
        }
    }

    template <class Sink>
    void HandOn(bool bFirstRows, std::int64_t nSubRows, Sink& oSink)
    {
        const std::size_t nFirst = FirstSubColumn(moRun.mnBegin);
        for (std::int64_t n = moRun.mnBegin; n < moRun.mnEnd; ++n)
        {
            const std::size_t nCell = FirstSubColumn(n) - nFirst;
            const auto nSubColumns = static_cast<std::size_t>(SubColumns(n));
            for (std::int64_t j = 0; j < nSubRows; ++j)
            {
                const SubRow& oSubRow = mvoSubRows[static_cast<std::size_t>(j)];
                for (std::size_t k = nCell; k < nCell + nSubColumns; ++k)
                {
                    if (oSubRow.mvnLines[k] == 0)
                    {
                        continue;
                    }
                    oSink.Hit(oSubRow.mvnLines[k], oSubRow.mvnColumns[k]);
                    if (bFirstRows && j == 0 && k == nCell)
                    {
                        oSink.Mark(CornerAt(oSubRow, k));
                    }
                }
            }
        }
    }

    CellCorner CornerAt(const SubRow& oSubRow, std::size_t k) const
    {
        const std::size_t nPlace = FirstSubColumn(moRun.mnBegin) + k;
        const Ranges oRanges =
            moColumns.RangesOf(nPlace, oSubRow.mdfNorth, oSubRow.mvdfElevations[k]);
        return {oSubRow.mvnLines[k], oSubRow.mvnColumns[k], Along(nPlace, oSubRow),
                moProjection.LookAngle(oRanges.mdfSlant, oSubRow.mvdfElevations[k]),
                oRanges.mdfGround};
    }

    Projection<kDivision> moProjection;
    ScanOrder moOrder;
    std::int64_t mnWindowY;
    double mdfCosHead;
    RadarGrid moGrid;
    RangeColumns<kDivision> moColumns;
    std::int64_t mnOversampling;
    double mdfSubStep;
    std::int64_t mnCells;
    std::vector<double> mvdfOffsets;  ///< of sub-columns in a cell, in columns
    std::vector<double> mvdfAcross;   ///< a column's share of the along-track coordinate, metres
    CellRun moRun;
    std::vector<SubRow> mvoSubRows;
};

}  // namespace kor::filters::simulation
