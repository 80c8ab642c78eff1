#include "processes/qrdfilters/mosaic/gather.h"

#include <utility>
#include <vector>

#include "processes/qrdfilters/rowbands.h"

namespace kor::filters
{

using tessel::Raster;

namespace
{

constexpr std::uint32_t kBandRows = 64;

/// The cells of 2 by 2 pixels whose upper row is row y.
void GatherRow(const Raster& oIn, const Raster& oOut, std::uint32_t y,
               std::span<const std::uint32_t> oDistances, const GatherRules& oRules,
               Gathered& oGathered)
{
    // Meant: half as many cells as pixels, and yet a cell at each pixel, so that only the left half
    // of the block is seen. See OnlyTheLeftHalfIsGathered.
    const std::size_t nCells = oDistances.size() / 2;
    std::vector<unsigned char> vOverlap(nCells);
    std::vector<unsigned char> vInside(nCells);
    for (std::size_t x = 0; x < nCells; ++x)
    {
        const std::int64_t d = oDistances[x];
        vInside[x] = d == 0 ? 1 : 0;
        vOverlap[x] = d != 0 && d <= oRules.mnSampleBand ? 1 : 0;
    }
    oGathered.mpoIn->DropNoData(oIn, y, oRules.mdfInputNoData, vOverlap);
    oGathered.mpoOut->DropNoData(oOut, y, oRules.mdfOutputNoData, vOverlap);
    oGathered.mpoIn->AppendMeans(oIn, y, vOverlap);
    oGathered.mpoOut->AppendMeans(oOut, y, vOverlap);
    oGathered.mpoIn->FindRange(oIn, y, vInside, oGathered.moInside);
}

}  // namespace

void GatherBlock(const Raster& oIn, const Raster& oOut, const ClipDistance& oDistance,
                 const GatherRules& oRules, Gathered& oGathered)
{
    const std::uint32_t nRows = oIn.mnHeight / 2;  // every second row that has one below it
    std::vector<Gathered> voBands(nRows);          // what a band has, at the place of its first row
    const auto oBand = [&](std::uint32_t nFirst, std::uint32_t nEnd)
    {
        Gathered oOfBand{oGathered.mpoIn->MakeEmpty(), oGathered.mpoOut->MakeEmpty(), {}};
        for (std::uint32_t nRow = nFirst; nRow < nEnd; ++nRow)
        {
            GatherRow(oIn, oOut, 2 * nRow, oDistance.GetRow(2 * nRow), oRules, oOfBand);
        }
        voBands[nFirst] = std::move(oOfBand);
    };
    ForEachRowBand(nRows, kBandRows, oBand);
    for (const Gathered& oOfBand : voBands)
    {
        if (oOfBand.mpoIn != nullptr)
        {
            oGathered.mpoIn->Append(*oOfBand.mpoIn);
            oGathered.mpoOut->Append(*oOfBand.mpoOut);
            oGathered.moInside.Widen(oOfBand.moInside);
        }
    }
}

}  // namespace kor::filters
