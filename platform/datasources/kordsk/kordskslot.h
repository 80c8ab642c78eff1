#pragma once

#include <array>
#include <cstdint>
#include <optional>
#include <span>

namespace kor::datasources
{

inline constexpr std::size_t kSlotBytes = 512;
inline constexpr std::size_t kSlotCount = 2;
/// Planes and directories begin on multiples of this, the first one behind the slots.
inline constexpr std::uint64_t kBlockBytes = 4096;
inline constexpr std::uint32_t kKordskVersion = 1;

using SlotBytes = std::array<unsigned char, kSlotBytes>;

/// One of the two heads of a KORDSK file: where its directory lies.
///
///     0   8 bytes  "KORDSK", 0x1A, 0x0A
///     8   u32      version, 1
///     12  u32      0
///     16  u64      sequence: the valid slot with the higher one counts
///     24  u64      offset of the directory
///     32  u64      its length in bytes
///     40  u32      its CRC-32
///     44  u32      CRC-32 of the bytes 0 to 43
///     48           zeros up to byte 511
/// Numbers are little-endian.
struct KordskSlot
{
    std::uint32_t mnVersion = kKordskVersion;
    std::uint64_t mnSequence = 0;
    std::uint64_t mnOffset = 0;
    std::uint64_t mnLength = 0;
    std::uint32_t mnDirectoryCrc = 0;

    bool operator==(const KordskSlot&) const = default;
};

SlotBytes EncodeSlot(const KordskSlot& oSlot);

/// True when the bytes begin as a slot does; says nothing of the rest.
bool HasSlotMagic(std::span<const unsigned char> oBytes);

/// None unless the magic is there and the checksum holds. The version may be unknown.
std::optional<KordskSlot> DecodeSlot(const SlotBytes& oBytes);

}  // namespace kor::datasources
