#include "processes/qrdfilters/stencil/sharpband.h"

#include <algorithm>
#include <numeric>

#include "processes/qrdfilters/background.h"
#include "processes/qrdfilters/engine/channels.h"
#include "processes/qrdfilters/kernels/sharpenrows.h"
#include "processes/qrdfilters/kernels/windowsums.h"

namespace kor::filters::stencil
{

namespace
{

// With the columns of a band this fills the first cache.
constexpr std::size_t kTileSamples = 64;

std::size_t TilePixels(const SharpBlock& oBlock)
{
    const std::size_t nPixels = kTileSamples / oBlock.moIn.mnChannels;
    return std::min<std::size_t>(std::max(nPixels, 4 * oBlock.moWindow.GetWidth()),
                                 oBlock.moIn.mnWidth);
}

}  // namespace

SharpBand::SharpBand(const SharpBlock& oBlock, std::uint32_t nFirst, std::uint32_t nEnd)
    : moBlock(oBlock),
      mnFirst(nFirst),
      mnRows(nEnd - nFirst),
      mnPaddedRows(kernels::PadRow(mnRows)),
      mnChannels(oBlock.moIn.mnChannels),
      mnTilePixels(TilePixels(oBlock)),
      mnPitch(mnPaddedRows + oBlock.moWindow.GetHeight() - 1),
      mbMasked(oBlock.mpoMaskIn != nullptr || oBlock.mpoMaskOut != nullptr),
      // Rows behind the band's, which fill up a vector, stay 0.
      mvdfColumns((mnTilePixels + oBlock.moWindow.GetWidth()) * mnChannels * mnPitch),
      mvdfSums((mnTilePixels + 1) * mnChannels * mnPaddedRows),
      mvnFresh(mnTilePixels * mnPaddedRows),
      mvComputed(mnRows * (mnTilePixels + 1)),
      mvdfRow((mnTilePixels + oBlock.moWindow.GetWidth()) * mnChannels),
      mvdfCounts(mnTilePixels * mnChannels,
                 static_cast<double>(oBlock.moWindow.GetWidth() * oBlock.moWindow.GetHeight()))
{
    const std::size_t nColumns = mnTilePixels + oBlock.moWindow.GetWidth();
    mvSampleBytes.resize(nColumns * mnChannels);
    if (oBlock.mpoValid != nullptr)
    {
        mvnColumnCounts.resize(nColumns);
        mvdfPixelCounts.resize(mnTilePixels);
    }
}

void SharpBand::Sharpen()
{
    const std::size_t nWidth = moBlock.moIn.mnWidth;
    for (std::size_t x = 0; x < nWidth; x += mnTilePixels)
    {
        SharpenTile(x, std::min(mnTilePixels, nWidth - x));
    }
}

void SharpBand::SharpenTile(std::size_t x, std::size_t nPixels)
{
    LoadColumns(x, nPixels);
    FindFreshWindows(x, nPixels);
    MoveWindows(x, nPixels);
    if (moBlock.mpoValid != nullptr)
    {
        StartCounts(x, nPixels);
    }
    for (std::size_t r = 0; r < mnRows; ++r)
    {
        if (moBlock.mpoValid != nullptr)
        {
            CountRow(x, r, nPixels);
        }
        WriteRow(x, r, nPixels);
    }
}

/// From the pixel before the first window on, which the sums of a row's first pixel leave unused.
void SharpBand::LoadColumns(std::size_t x, std::size_t nPixels)
{
    const std::size_t nBefore = x == 0 ? 0 : 1;
    const std::int64_t nLeft = static_cast<std::int64_t>(x - nBefore) - moBlock.moWindow.mnHalfX;
    const std::size_t nColumns = nPixels + moBlock.moWindow.GetWidth() - 1 + nBefore;
    const std::size_t nSamples = nColumns * mnChannels;
    double* const pFirst = &mvdfColumns[(1 - nBefore) * mnChannels * mnPitch];
    for (std::size_t r = 0; r < mnRows + moBlock.moWindow.GetHeight() - 1; ++r)
    {
        const std::int64_t y =
            std::int64_t{mnFirst} - moBlock.moWindow.mnHalfY + static_cast<std::int64_t>(r);
        const double* pSamples = moBlock.moIn.GetPixelAs<const double>(nLeft, y);
        if (moBlock.mpoValid != nullptr)
        {
            // Sums begin at +0.0, and adding or subtracting +0.0 changes nothing.
            const unsigned char* pValid =
                ForSamples({moBlock.mpoValid->GetPixel(nLeft, y), nColumns});
            kernels::ClearMasked(pValid, pSamples, {mvdfRow.data(), nSamples});
            pSamples = mvdfRow.data();
        }
        for (std::size_t i = 0; i < nSamples; ++i)
        {
            pFirst[i * mnPitch + r] = pSamples[i];
        }
    }
}

unsigned char* SharpBand::Computed(std::size_t nRow)
{
    return &mvComputed[nRow * (mnTilePixels + 1) + 1];
}

/// The first window of a row, and those behind a background pixel.
void SharpBand::FindFreshWindows(std::size_t x, std::size_t nPixels)
{
    if (!mbMasked)
    {
        std::fill_n(mvnFresh.begin(), mnPaddedRows, x == 0 ? ~std::uint64_t{0} : 0);
        return;
    }
    for (std::size_t r = 0; r < mnRows; ++r)
    {
        unsigned char* pComputed = Computed(r);
        pComputed[-1] = x == 0 ? 0 : pComputed[mnTilePixels - 1];
        FindComputedPixels(moBlock.mpoMaskIn, moBlock.mpoMaskOut, static_cast<std::int64_t>(x),
                           static_cast<std::int64_t>(mnFirst + r), {pComputed, nPixels});
        for (std::size_t k = 0; k < nPixels; ++k)
        {
            const bool bFresh = pComputed[k] != 0 && (pComputed + k)[-1] == 0;
            mvnFresh[k * mnPaddedRows + r] = bFresh ? ~std::uint64_t{0} : 0;
        }
    }
}

void SharpBand::MoveWindows(std::size_t x, std::size_t nPixels)
{
    const std::size_t nHistory = mnChannels * mnPaddedRows;
    if (x != 0)
    {
        std::copy_n(&mvdfSums[mnTilePixels * nHistory], nHistory, mvdfSums.begin());
    }
    kernels::MovingWindows oWindows;
    oWindows.mpColumns = &mvdfColumns[mnChannels * mnPitch];
    oWindows.mnPitch = mnPitch;
    oWindows.mpFresh = mvnFresh.data();
    oWindows.mpSums = &mvdfSums[nHistory];
    oWindows.mnRows = mnPaddedRows;
    oWindows.mnPixels = nPixels;
    oWindows.mnStep = mnChannels;
    oWindows.mnWidth = moBlock.moWindow.GetWidth();
    oWindows.mnHeight = moBlock.moWindow.GetHeight();
    kernels::MoveWindows(oWindows);
}

/// The valid pixels of the columns in the windows of the first row.
void SharpBand::StartCounts(std::size_t x, std::size_t nPixels)
{
    const std::int64_t nHalf = moBlock.moWindow.mnHalfY;
    std::fill(mvnColumnCounts.begin(), mvnColumnCounts.end(), 0);
    for (std::int64_t y = mnFirst - nHalf; y <= mnFirst + nHalf; ++y)
    {
        const unsigned char* pValid = ValidFrom(x, y);
        for (std::size_t k = 0; k < nPixels + moBlock.moWindow.GetWidth() - 1; ++k)
        {
            mvnColumnCounts[k] += pValid[k];
        }
    }
}

const unsigned char* SharpBand::ValidFrom(std::size_t x, std::int64_t y) const
{
    return moBlock.mpoValid->GetPixel(static_cast<std::int64_t>(x) - moBlock.moWindow.mnHalfX, y);
}

/// Moves the counts of the columns down to the windows of row y.
void SharpBand::SlideCounts(std::size_t x, std::int64_t y, std::size_t nPixels)
{
    const std::int64_t nHalf = moBlock.moWindow.mnHalfY;
    const unsigned char* pLeaving = ValidFrom(x, y - nHalf - 1);
    const unsigned char* pEntering = ValidFrom(x, y + nHalf);
    for (std::size_t k = 0; k < nPixels + moBlock.moWindow.GetWidth() - 1; ++k)
    {
        mvnColumnCounts[k] += pEntering[k] - pLeaving[k];
    }
}

/// The valid pixels in the windows of a row, the rows being asked for from above.
void SharpBand::CountRow(std::size_t x, std::size_t nRow, std::size_t nPixels)
{
    if (nRow != 0)
    {
        SlideCounts(x, static_cast<std::int64_t>(mnFirst + nRow), nPixels);
    }
    const std::size_t nWidth = moBlock.moWindow.GetWidth();
    const auto pColumns = mvnColumnCounts.cbegin();
    std::int32_t nCount = std::accumulate(pColumns, pColumns + nWidth - 1, 0);
    for (std::size_t k = 0; k < nPixels; ++k)
    {
        nCount += mvnColumnCounts[k + nWidth - 1];
        mvdfPixelCounts[k] = nCount;
        nCount -= mvnColumnCounts[k];
    }
    engine::RepeatForChannels<double>({mvdfPixelCounts.data(), nPixels}, mnChannels,
                                      mvdfCounts.data());
}

void SharpBand::WriteRow(std::size_t x, std::size_t nRow, std::size_t nPixels)
{
    const auto nColumn = static_cast<std::int64_t>(x);
    const auto y = static_cast<std::int64_t>(mnFirst + nRow);
    const double* pIn = moBlock.moIn.GetPixelAs<const double>(nColumn, y);
    const std::span<double> vdfOut(moBlock.moOut.GetPixelAs<double>(nColumn, y),
                                   nPixels * mnChannels);
    const std::span<double> vdfRow(mvdfRow.data(), vdfOut.size());
    const double* pSums = &mvdfSums[mnChannels * mnPaddedRows + nRow];
    for (std::size_t i = 0; i < vdfRow.size(); ++i)
    {
        vdfRow[i] = pSums[i * mnPaddedRows];
    }
    kernels::SharpenRow(pIn, vdfRow.data(), mvdfCounts.data(), mbMasked ? vdfRow : vdfOut);
    if (mbMasked)
    {
        const unsigned char* pComputed = ForSamples({Computed(nRow), nPixels});
        moBlock.mbBGZero ? kernels::ClearMasked(pComputed, vdfRow.data(), vdfOut)
                         : kernels::SelectValid(pComputed, vdfRow.data(), pIn, vdfOut);
    }
}

const unsigned char* SharpBand::ForSamples(std::span<const unsigned char> oPixels)
{
    if (mnChannels == 1)
    {
        return oPixels.data();
    }
    engine::RepeatForChannels(oPixels, mnChannels, mvSampleBytes.data());
    return mvSampleBytes.data();
}

}  // namespace kor::filters::stencil
