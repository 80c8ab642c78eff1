#include "examples/filterfile/stripreader.h"

#include <algorithm>
#include <cstdint>

namespace kor::examples
{

namespace
{

// Larger strips read no faster.
constexpr std::uint64_t kEnoughBytes = std::uint64_t{16} << 20;

}  // namespace

StripReader::StripReader(datasources::IRasterReader& oReader, std::uint64_t nMaxBytes)
    : moReader(oReader)
{
    const std::uint64_t nRowBytes = std::uint64_t{oReader.GetWidth()} * oReader.GetChannelCount() *
                                    oReader.GetDataType().GetSampleBytes();
    const std::uint64_t nRows =
        std::min(nMaxBytes, kEnoughBytes) / std::max<std::uint64_t>(nRowBytes, 1);
    // Whole rows of the file's own tiles, so that none is read twice.
    const std::uint64_t nTileRows = oReader.GetTileHeight();
    const std::uint64_t nWhole = nRows >= nTileRows ? nRows / nTileRows * nTileRows : nRows;
    SetTileSize(oReader.GetWidth(), static_cast<unsigned int>(std::clamp<std::uint64_t>(
                                        nWhole, 1, std::max(oReader.GetHeight(), 1U))));
}

void StripReader::ReadRaster(tessel::Raster* poRaster)
{
    EndIfInterrupted();
    moReader.ReadRaster(poRaster);
    moStatus.SetProgress(static_cast<float>(poRaster->mnOffsetY + poRaster->mnHeight) /
                         static_cast<float>(GetHeight()));
}

}  // namespace kor::examples
