#pragma once

#include <cstdint>
#include <span>

namespace kor::datasources
{

/// The CRC-32 of ISO 3309 (polynomial 0x04C11DB7, reflected, begun with and inverted by all ones):
/// 0xCBF43926 for the nine bytes "123456789".
std::uint32_t Crc32(std::span<const unsigned char> oBytes);

}  // namespace kor::datasources
