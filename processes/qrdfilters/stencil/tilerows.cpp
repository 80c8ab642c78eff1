#include "processes/qrdfilters/stencil/tilerows.h"

#include <algorithm>
#include <limits>

#include "processes/qrdfilters/engine/channels.h"
#include "processes/qrdfilters/findbyte.h"
#include "processes/qrdfilters/kernels/prefetch.h"
#include "processes/qrdfilters/kernels/windowsums.h"

namespace kor::filters::stencil
{

namespace
{

// Rows that are fetched before they are wanted: enough for the latency of memory.
constexpr std::int64_t kRowsAhead = 2;

}  // namespace

TileRows::TileRows(const StencilBlock& oBlock, std::size_t nTilePixels)
    : moBlock(oBlock),
      mnChannels(oBlock.moIn.mnChannels),
      mnSlots(oBlock.moWindow.GetHeight() + oBlock.mnGroupRows - 1),
      mnLength((nTilePixels + oBlock.moWindow.GetWidth() - 1) * mnChannels),
      mbInPlace(oBlock.moTypes.mpfnLoad == nullptr &&
                (oBlock.mpoValid == nullptr || oBlock.meMasked == MaskedSamples::eMarked)),
      mvdfSamples(mbInPlace ? 0 : mnSlots * mnLength),
      mvpSamples(mnSlots),
      mvpWords(mnSlots)
{
    if (oBlock.mpoValid != nullptr)
    {
        mvBytes.resize(mnLength);
        if (oBlock.meMasked == MaskedSamples::eMarked)
        {
            mvnWords.resize(mnSlots * mnLength);
            mvnAllValid.assign(mnLength, std::numeric_limits<std::uint64_t>::max());
        }
    }
    moAround.mnStep = mnChannels;
    moAround.mnWidth = oBlock.moWindow.GetWidth();
    moAround.mnHeight = oBlock.moWindow.GetHeight();
}

void TileRows::StartTile(std::size_t x, std::size_t nPixels, std::uint32_t nRow)
{
    mnLeft = static_cast<std::int64_t>(x) - moBlock.moWindow.mnHalfX;
    mnPixels = nPixels + moBlock.moWindow.GetWidth() - 1;
    mnNext = std::int64_t{nRow} - moBlock.moWindow.mnHalfY;
    moAround.mnSamples = nPixels * mnChannels;
}

const kernels::StencilRows& TileRows::Around(std::uint32_t nRow, std::uint32_t nRows)
{
    const std::int64_t nHalf = moBlock.moWindow.mnHalfY;
    const std::int64_t nEnd = std::int64_t{nRow} + nRows + nHalf;
    for (; mnNext < nEnd; ++mnNext)
    {
        Load(mnNext);
    }
    mvpAround.clear();
    mvpValidAround.clear();
    bool bMasked = false;
    for (std::int64_t y = nRow - nHalf; y < nEnd; ++y)
    {
        const std::uint64_t* pWords = mvpWords[Slot(y)];
        bMasked = bMasked || pWords != nullptr;
        mvpAround.push_back(mvpSamples[Slot(y)]);
        mvpValidAround.push_back(pWords != nullptr ? pWords : mvnAllValid.data());
    }
    moAround.moSamples = mvpAround;
    moAround.moValid = {mvpValidAround.data(), bMasked ? mvpValidAround.size() : 0};
    return moAround;
}

void TileRows::Load(std::int64_t y)
{
    PrefetchSamplesOf(y + kRowsAhead);
    const unsigned char* pValid = moBlock.mpoValid != nullptr ? ValidSamples(y) : nullptr;
    LoadSamplesOf(y, pValid);
    Mark(y, pValid);
}

/// The next rows of a tile lie a whole row of the block apart, where the processor does not look.
void TileRows::PrefetchSamplesOf(std::int64_t y) const
{
    if (y >= std::int64_t{moBlock.moIn.mnHeight} + moBlock.moWindow.mnHalfY)
    {
        return;
    }
    const unsigned char* const pFirst = moBlock.moIn.GetPixel(mnLeft, y);
    const unsigned char* const pEnd =
        moBlock.moIn.GetPixel(mnLeft + static_cast<std::int64_t>(mnPixels), y);
    kernels::PrefetchBytes({pFirst, pEnd});
}

void TileRows::LoadSamplesOf(std::int64_t y, const unsigned char* pValid)
{
    const unsigned char* pIn = moBlock.moIn.GetPixel(mnLeft, y);
    const double* pSamples = reinterpret_cast<const double*>(pIn);
    if (!mbInPlace)
    {
        const std::span<double> vdfRow(&mvdfSamples[Slot(y) * mnLength], mnPixels * mnChannels);
        if (moBlock.moTypes.mpfnLoad != nullptr)
        {
            moBlock.moTypes.mpfnLoad(pIn, vdfRow);
            pSamples = vdfRow.data();
        }
        if (pValid != nullptr && moBlock.meMasked == MaskedSamples::eCleared)
        {
            kernels::ClearMasked(pValid, pSamples, vdfRow);
            pSamples = vdfRow.data();
        }
    }
    mvpSamples[Slot(y)] = pSamples;
}

const unsigned char* TileRows::ValidSamples(std::int64_t y)
{
    const std::span<const unsigned char> oPixels(moBlock.mpoValid->GetPixel(mnLeft, y), mnPixels);
    if (FindByte(oPixels, 0, 0) == mnPixels)
    {
        return nullptr;
    }
    if (mnChannels == 1)
    {
        return oPixels.data();
    }
    engine::RepeatForChannels(oPixels, mnChannels, mvBytes.data());
    return mvBytes.data();
}

void TileRows::Mark(std::int64_t y, const unsigned char* pValid)
{
    if (pValid == nullptr || moBlock.meMasked == MaskedSamples::eCleared)
    {
        mvpWords[Slot(y)] = nullptr;
        return;
    }
    std::uint64_t* pWords = &mvnWords[Slot(y) * mnLength];
    std::transform(pValid, pValid + mnPixels * mnChannels, pWords,
                   [](unsigned char nValid) { return std::uint64_t{0} - nValid; });
    mvpWords[Slot(y)] = pWords;
}

std::size_t TileRows::Slot(std::int64_t y) const
{
    return static_cast<std::size_t>(y + moBlock.moWindow.mnHalfY) % mnSlots;
}

}  // namespace kor::filters::stencil
