#include "platform/datasources/kordsk/kordskslot.h"

#include <gtest/gtest.h>

#include <cstring>

namespace kor::datasources
{
namespace
{

const KordskSlot kSlot{1, 0x0102030405060708U, 4096, 77, 0xCBF43926U};

TEST(KordskSlot, LiesAsItIsTold)
{
    constexpr unsigned char kHead[] = {'K',  'O',  'R',  'D', 'S', 'K', 0x1A, 0x0A,  // magic
                                       1,    0,    0,    0,   0,   0,   0,    0,     // version
                                       8,    7,    6,    5,   4,   3,   2,    1,     // sequence
                                       0,    0x10, 0,    0,   0,   0,   0,    0,     // offset
                                       77,   0,    0,    0,   0,   0,   0,    0,     // length
                                       0x26, 0x39, 0xF4, 0xCB};                      // checksum
    const SlotBytes oBytes = EncodeSlot(kSlot);
    EXPECT_EQ(std::memcmp(oBytes.data(), kHead, sizeof(kHead)), 0);
    for (std::size_t i = 48; i < oBytes.size(); ++i)
    {
        EXPECT_EQ(oBytes[i], 0) << i;
    }
    EXPECT_EQ(DecodeSlot(oBytes), kSlot);
}

TEST(KordskSlot, EveryFlippedBitShows)
{
    for (std::size_t nBit = 0; nBit < 48 * 8; ++nBit)
    {
        SlotBytes oBytes = EncodeSlot(kSlot);
        oBytes[nBit >> 3] = static_cast<unsigned char>(oBytes[nBit >> 3] ^ (1U << (nBit & 7)));
        EXPECT_EQ(DecodeSlot(oBytes), std::nullopt) << nBit;
    }
    EXPECT_EQ(DecodeSlot(SlotBytes{}), std::nullopt);
}

TEST(KordskSlot, MagicIsTheFirstEightBytes)
{
    SlotBytes oBytes = EncodeSlot(kSlot);
    EXPECT_TRUE(HasSlotMagic(oBytes));
    EXPECT_FALSE(HasSlotMagic(std::span(oBytes).first(7)));
    oBytes[7] = 0x0D;
    EXPECT_FALSE(HasSlotMagic(oBytes));
}

}  // namespace
}  // namespace kor::datasources
