#include "platform/datasources/kordsk/kordskslot.h"

#include <algorithm>
#include <bit>
#include <cstring>

#include "platform/datasources/kordsk/crc32.h"

namespace kor::datasources
{

namespace
{

static_assert(std::endian::native == std::endian::little,
              "numbers and samples of a KORDSK file are little-endian and are moved as they lie");

// The two control bytes show when a transfer has taken the file for text.
constexpr std::array<unsigned char, 8> kMagic = {'K', 'O', 'R', 'D', 'S', 'K', 0x1A, 0x0A};

constexpr std::size_t kVersionAt = 8;
constexpr std::size_t kSequenceAt = 16;
constexpr std::size_t kOffsetAt = 24;
constexpr std::size_t kLengthAt = 32;
constexpr std::size_t kDirectoryCrcAt = 40;
constexpr std::size_t kCrcAt = 44;

template <class T>
void Put(SlotBytes& oBytes, std::size_t nAt, T nValue)
{
    std::memcpy(oBytes.data() + nAt, &nValue, sizeof(T));
}

template <class T>
void Get(const SlotBytes& oBytes, std::size_t nAt, T& nValue)
{
    std::memcpy(&nValue, oBytes.data() + nAt, sizeof(T));
}

}  // namespace

SlotBytes EncodeSlot(const KordskSlot& oSlot)
{
    SlotBytes oBytes{};
    std::copy(kMagic.begin(), kMagic.end(), oBytes.begin());
    Put(oBytes, kVersionAt, oSlot.mnVersion);
    Put(oBytes, kSequenceAt, oSlot.mnSequence);
    Put(oBytes, kOffsetAt, oSlot.mnOffset);
    Put(oBytes, kLengthAt, oSlot.mnLength);
    Put(oBytes, kDirectoryCrcAt, oSlot.mnDirectoryCrc);
    Put(oBytes, kCrcAt, Crc32(std::span(oBytes).first(kCrcAt)));
    return oBytes;
}

bool HasSlotMagic(std::span<const unsigned char> oBytes)
{
    return oBytes.size() >= kMagic.size() &&
           std::equal(kMagic.begin(), kMagic.end(), oBytes.begin());
}

std::optional<KordskSlot> DecodeSlot(const SlotBytes& oBytes)
{
    std::uint32_t nCrc = 0;
    Get(oBytes, kCrcAt, nCrc);
    if (!HasSlotMagic(oBytes) || nCrc != Crc32(std::span(oBytes).first(kCrcAt)))
    {
        return std::nullopt;
    }
    KordskSlot oSlot;
    Get(oBytes, kVersionAt, oSlot.mnVersion);
    Get(oBytes, kSequenceAt, oSlot.mnSequence);
    Get(oBytes, kOffsetAt, oSlot.mnOffset);
    Get(oBytes, kLengthAt, oSlot.mnLength);
    Get(oBytes, kDirectoryCrcAt, oSlot.mnDirectoryCrc);
    return oSlot;
}

}  // namespace kor::datasources
