#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <vector>

#include "basic/tessel/raster/datatype.h"
#include "platform/datasources/auxiliarydata.h"
#include "platform/datasources/ichannelio.h"

namespace kor::datasources
{

/// Side of the tiles of the option "TILE", in pixels; a multiple of 8, so that rows of bits in
/// tiles fill whole bytes but for the last tile.
inline constexpr std::uint32_t kTileSide = 256;

/// One channel or bitmap in a KORDSK file. A bitmap is a plane of eDT_BIT.
///
/// Samples lie as in memory, the real part of a complex one first; rows of bits begin on a byte,
/// the first pixel in the most significant bit, the rest of the last byte 0. Band-sequential planes
/// hold row after row. Tiled ones hold tile after tile in row order, each row after row; tiles at
/// the right and lower edge are cut off, so that both layouts take the same bytes.
struct KordskPlane
{
    tessel::DataType moType;
    std::uint64_t mnOffset = 0;     ///< in the file; 0 as long as it has no place
    std::uint64_t mnLength = 0;     ///< bytes
    std::uint32_t mnTileWidth = 0;  ///< pixels; 0: band-sequential
    std::uint32_t mnTileHeight = 0;
    AuxiliaryData::Channel moData;

    bool operator==(const KordskPlane&) const = default;
};

/// A piece of a file.
struct FileExtent
{
    std::uint64_t mnOffset = 0;
    std::uint64_t mnLength = 0;
};

/// Part of a window that lies in one tile (of a band-sequential plane: all of it), with the place
/// of its rows in the file.
struct PlanePiece
{
    PixelWindow moWindow;          ///< in the image
    std::uint64_t mnOffset = 0;    ///< of the byte in the file that holds its first pixel
    std::uint64_t mnPitch = 0;     ///< bytes in the file from one of its rows to the next
    std::uint64_t mnRowBytes = 0;  ///< bytes that hold one of its rows
    std::uint32_t mnFirstBit = 0;  ///< planes of bits: which bit of the first byte, from the left
};

/// True for the seventeen types of samples that there are.
bool IsSampleType(const tessel::DataType& oType);

/// Bytes of a row of nWidth samples.
std::uint64_t RowBytes(const tessel::DataType& oType, std::uint32_t nWidth);

/// Bytes of a plane; none when they are 2^63 or more.
std::optional<std::uint64_t> PlaneBytes(const tessel::DataType& oType, std::uint32_t nWidth,
                                        std::uint32_t nHeight);

/// The pieces of a window, in the order in which they lie in the file. oWindow lies in the image of
/// nWidth x nHeight pixels and is not empty.
std::vector<PlanePiece> PiecesOf(const KordskPlane& oPlane, std::uint32_t nWidth,
                                 std::uint32_t nHeight, const PixelWindow& oWindow);

/// nBytes, rounded up to whole blocks of a file; below 2^63 + 4096.
std::uint64_t WholeBlocks(std::uint64_t nBytes);

/// The lowest place behind the slots where nBytes meet none of the extents, on a block's boundary.
std::uint64_t FindGap(std::vector<FileExtent> voUsed, std::uint64_t nBytes);

}  // namespace kor::datasources
