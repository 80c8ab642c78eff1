#include "processes/qrdfilters/stencil/tileoutput.h"

#include <algorithm>

#include "processes/qrdfilters/engine/channels.h"
#include "processes/qrdfilters/findbyte.h"
#include "processes/qrdfilters/kernels/windowsums.h"

namespace kor::filters::stencil
{

namespace
{

// Doubles that are written past the caches: well above those of a core.
constexpr std::uint64_t kStreamedBytes = std::uint64_t{16} << 20;

}  // namespace

TileOutput::TileOutput(const StencilBlock& oBlock, std::size_t nTilePixels)
    : moBlock(oBlock),
      mnChannels(oBlock.moIn.mnChannels),
      mnLength(nTilePixels * mnChannels),
      mbMasked(oBlock.mpoMaskIn != nullptr || oBlock.mpoMaskOut != nullptr),
      mbStreamed(oBlock.moTypes.mpfnStore == nullptr &&
                 oBlock.moOut.mnBufferSize >= kStreamedBytes),
      mbInPlace(oBlock.moTypes.mpfnStore == nullptr && !mbMasked &&
                (!mbStreamed || oBlock.mbCoreStreams)),
      mvdfResults(mbInPlace ? 0 : oBlock.mnGroupRows * mnLength),
      mvComputed(mbMasked ? oBlock.mnGroupRows * nTilePixels : 0)
{
}

void TileOutput::Start(std::size_t x, std::uint32_t y, std::size_t nPixels, std::uint32_t nRows)
{
    mnX = x;
    mnY = y;
    mnPixels = nPixels;
    mvpRows.resize(nRows);
    mvComputed.resize(mbMasked ? nRows * nPixels : 0);
    for (std::size_t j = 0; j < nRows; ++j)
    {
        mvpRows[j] = mbInPlace ? moBlock.moOut.GetPixelAs<double>(static_cast<std::int64_t>(x),
                                                                  static_cast<std::int64_t>(y + j))
                               : &mvdfResults[j * mnLength];
        if (mbMasked)
        {
            FindComputedPixels(moBlock.mpoMaskIn, moBlock.mpoMaskOut, static_cast<std::int64_t>(x),
                               static_cast<std::int64_t>(y + j),
                               {&mvComputed[j * nPixels], nPixels});
        }
    }
}

bool TileOutput::HasComputedPixels() const
{
    return !mbMasked || FindByte(mvComputed, 0, 1) != mvComputed.size();
}

StencilPlace TileOutput::Place() const
{
    return {static_cast<std::int64_t>(mnX), mnY, mvComputed, mbInPlace && mbStreamed};
}

void TileOutput::Finish()
{
    for (std::size_t j = 0; j < mvpRows.size() && !mbInPlace; ++j)
    {
        FinishRow(j);
    }
}

void TileOutput::FinishRow(std::size_t nRow)
{
    const auto x = static_cast<std::int64_t>(mnX);
    const auto y = static_cast<std::int64_t>(mnY + nRow);
    const std::span<double> vdfResults(mvpRows[nRow], mnPixels * mnChannels);
    unsigned char* pOut = moBlock.moOut.GetPixel(x, y);
    if (!mbMasked)
    {
        WriteRow(vdfResults, pOut);
        return;
    }
    const auto oComputed = std::span(mvComputed).subspan(nRow * mnPixels, mnPixels);
    if (moBlock.moTypes.mpfnBackground == nullptr)
    {
        // 0.0 is 0 in every type.
        kernels::ClearMasked(ComputedSamples(oComputed), vdfResults.data(), vdfResults);
        WriteRow(vdfResults, pOut);
    }
    else
    {
        WriteRow(vdfResults, pOut);
        moBlock.moTypes.mpfnBackground(oComputed, moBlock.moIn.GetPixel(0, y), mnX, mnChannels,
                                       pOut);
    }
}

void TileOutput::WriteRow(std::span<const double> vdfResults, unsigned char* pOut) const
{
    if (moBlock.moTypes.mpfnStore != nullptr)
    {
        moBlock.moTypes.mpfnStore(vdfResults, pOut);
        return;
    }
    auto* const pDoubles = reinterpret_cast<double*>(pOut);
    if (mbStreamed)
    {
        kernels::StreamRow(vdfResults, pDoubles);
    }
    else
    {
        std::copy(vdfResults.begin(), vdfResults.end(), pDoubles);
    }
}

const unsigned char* TileOutput::ComputedSamples(std::span<const unsigned char> oComputed)
{
    if (mnChannels == 1)
    {
        return oComputed.data();
    }
    mvComputedSamples.resize(mnLength);
    engine::RepeatForChannels(oComputed, mnChannels, mvComputedSamples.data());
    return mvComputedSamples.data();
}

}  // namespace kor::filters::stencil
