#include "platform/datasources/kordsk/crc32.h"

#include <array>

namespace kor::datasources
{

namespace
{

constexpr std::uint32_t kReflectedPolynomial = 0xEDB88320U;

constexpr std::array<std::uint32_t, 256> MakeTable()
{
    std::array<std::uint32_t, 256> anTable{};
    for (std::uint32_t i = 0; i < anTable.size(); ++i)
    {
        std::uint32_t nRest = i;
        for (int nBit = 0; nBit < 8; ++nBit)
        {
            nRest = (nRest >> 1) ^ ((nRest & 1U) != 0 ? kReflectedPolynomial : 0U);
        }
        anTable[i] = nRest;
    }
    return anTable;
}

constexpr std::array<std::uint32_t, 256> kTable = MakeTable();

}  // namespace

std::uint32_t Crc32(std::span<const unsigned char> oBytes)
{
    std::uint32_t nCrc = 0xFFFFFFFFU;
    for (const unsigned char nByte : oBytes)
    {
        nCrc = (nCrc >> 8) ^ kTable[(nCrc ^ nByte) & 0xFFU];
    }
    return ~nCrc;
}

}  // namespace kor::datasources
