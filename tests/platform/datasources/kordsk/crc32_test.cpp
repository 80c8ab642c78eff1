#include "platform/datasources/kordsk/crc32.h"

#include <gtest/gtest.h>

#include <string>

namespace kor::datasources
{
namespace
{

std::uint32_t CrcOf(const std::string& oText)
{
    return Crc32({reinterpret_cast<const unsigned char*>(oText.data()), oText.size()});
}

TEST(Crc32, IsThatOfTheStandard)
{
    EXPECT_EQ(CrcOf(""), 0U);
    EXPECT_EQ(CrcOf("123456789"), 0xCBF43926U);
    EXPECT_EQ(CrcOf(std::string(32, '\0')), 0x190A55ADU);
    EXPECT_EQ(CrcOf(std::string(32, '\xFF')), 0xFF6CAB0BU);
}

}  // namespace
}  // namespace kor::datasources
