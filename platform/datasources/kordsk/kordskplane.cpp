#include "platform/datasources/kordsk/kordskplane.h"

#include <algorithm>
#include <limits>

#include "platform/datasources/kordsk/kordskslot.h"

namespace kor::datasources
{

namespace
{

constexpr tessel::DataType kSampleTypes[] = {
    tessel::eDT_BIT,  tessel::eDT_8U,   tessel::eDT_8S,   tessel::eDT_16U,  tessel::eDT_16S,
    tessel::eDT_32U,  tessel::eDT_32S,  tessel::eDT_32R,  tessel::eDT_64U,  tessel::eDT_64S,
    tessel::eDT_64R,  tessel::eDT_C16U, tessel::eDT_C16S, tessel::eDT_C32U, tessel::eDT_C32S,
    tessel::eDT_C32R, tessel::eDT_C64R};

/// Bytes in front of sample x of a row; of bits, whole bytes.
std::uint64_t BytesBefore(const tessel::DataType& oType, std::uint32_t x)
{
    return oType == tessel::eDT_BIT ? x >> 3 : std::uint64_t{x} * oType.GetSampleBytes();
}

/// The part of oWindow in the tile whose corner is (nTileX, nTileY).
PlanePiece PieceIn(const KordskPlane& oPlane, std::uint32_t nWidth, const PixelWindow& oTile,
                   const PixelWindow& oWindow)
{
    const tessel::DataType& oType = oPlane.moType;
    const std::uint32_t nX = std::max(oTile.mnX, oWindow.mnX);
    const std::uint32_t nY = std::max(oTile.mnY, oWindow.mnY);
    PlanePiece oPiece;
    oPiece.moWindow = {nX, nY,
                       std::min(oTile.mnX + oTile.mnWidth, oWindow.mnX + oWindow.mnWidth) - nX,
                       std::min(oTile.mnY + oTile.mnHeight, oWindow.mnY + oWindow.mnHeight) - nY};
    const std::uint32_t nColumn = nX - oTile.mnX;
    oPiece.mnFirstBit = oType == tessel::eDT_BIT ? nColumn & 7U : 0U;
    oPiece.mnPitch = RowBytes(oType, oTile.mnWidth);
    oPiece.mnRowBytes = RowBytes(oType, oPiece.mnFirstBit + oPiece.moWindow.mnWidth);
    oPiece.mnOffset = oPlane.mnOffset + oTile.mnY * RowBytes(oType, nWidth) +
                      BytesBefore(oType, oTile.mnX) * oTile.mnHeight +
                      (nY - oTile.mnY) * oPiece.mnPitch + BytesBefore(oType, nColumn);
    return oPiece;
}

}  // namespace

bool IsSampleType(const tessel::DataType& oType)
{
    return std::find(std::begin(kSampleTypes), std::end(kSampleTypes), oType) !=
           std::end(kSampleTypes);
}

std::uint64_t RowBytes(const tessel::DataType& oType, std::uint32_t nWidth)
{
    return oType == tessel::eDT_BIT ? (std::uint64_t{nWidth} + 7) >> 3
                                    : std::uint64_t{nWidth} * oType.GetSampleBytes();
}

std::optional<std::uint64_t> PlaneBytes(const tessel::DataType& oType, std::uint32_t nWidth,
                                        std::uint32_t nHeight)
{
    constexpr std::uint64_t kLargest = std::numeric_limits<std::int64_t>::max();
    const std::uint64_t nRowBytes = RowBytes(oType, nWidth);
    if (nRowBytes != 0 && nHeight > kLargest / nRowBytes)
    {
        return std::nullopt;
    }
    return nRowBytes * nHeight;
}

std::vector<PlanePiece> PiecesOf(const KordskPlane& oPlane, std::uint32_t nWidth,
                                 std::uint32_t nHeight, const PixelWindow& oWindow)
{
    const std::uint64_t nTileWidth = oPlane.mnTileWidth == 0 ? nWidth : oPlane.mnTileWidth;
    const std::uint64_t nTileHeight = oPlane.mnTileHeight == 0 ? nHeight : oPlane.mnTileHeight;
    const std::uint64_t nEndX = std::uint64_t{oWindow.mnX} + oWindow.mnWidth;
    const std::uint64_t nEndY = std::uint64_t{oWindow.mnY} + oWindow.mnHeight;
    std::vector<PlanePiece> voPieces;
    for (std::uint64_t y = oWindow.mnY / nTileHeight * nTileHeight; y < nEndY; y += nTileHeight)
    {
        for (std::uint64_t x = oWindow.mnX / nTileWidth * nTileWidth; x < nEndX; x += nTileWidth)
        {
            const PixelWindow oTile{static_cast<std::uint32_t>(x), static_cast<std::uint32_t>(y),
                                    static_cast<std::uint32_t>(std::min(nTileWidth, nWidth - x)),
                                    static_cast<std::uint32_t>(std::min(nTileHeight, nHeight - y))};
            voPieces.push_back(PieceIn(oPlane, nWidth, oTile, oWindow));
        }
    }
    return voPieces;
}

std::uint64_t WholeBlocks(std::uint64_t nBytes)
{
    return (nBytes + kBlockBytes - 1) / kBlockBytes * kBlockBytes;
}

std::uint64_t FindGap(std::vector<FileExtent> voUsed, std::uint64_t nBytes)
{
    std::sort(voUsed.begin(), voUsed.end(),
              [](const FileExtent& oOne, const FileExtent& oOther)
              { return oOne.mnOffset < oOther.mnOffset; });
    std::uint64_t nPlace = kBlockBytes;
    for (const FileExtent& oUsed : voUsed)
    {
        if (oUsed.mnOffset >= nPlace && oUsed.mnOffset - nPlace >= nBytes)
        {
            break;
        }
        nPlace = std::max(nPlace, WholeBlocks(oUsed.mnOffset + oUsed.mnLength));
    }
    return nPlace;
}

}  // namespace kor::datasources
