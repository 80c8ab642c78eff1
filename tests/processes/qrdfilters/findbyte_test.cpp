#include "processes/qrdfilters/findbyte.h"

#include <gtest/gtest.h>

#include <vector>

namespace kor::filters
{
namespace
{

TEST(FindByte, GivesTheFirstPlaceAtTheStartOrBehindIt)
{
    const std::vector<unsigned char> vBytes = {1, 0, 0, 1, 0};
    EXPECT_EQ(FindByte(vBytes, 0, 1), 0U);
    EXPECT_EQ(FindByte(vBytes, 0, 0), 1U);
    EXPECT_EQ(FindByte(vBytes, 1, 1), 3U);
    EXPECT_EQ(FindByte(vBytes, 3, 1), 3U);
    EXPECT_EQ(FindByte(vBytes, 4, 0), 4U);
}

TEST(FindByte, GivesTheSizeWhereThereIsNone)
{
    const std::vector<unsigned char> vBytes = {1, 0, 0};
    EXPECT_EQ(FindByte(vBytes, 0, 2), 3U);
    EXPECT_EQ(FindByte(vBytes, 1, 1), 3U);
    EXPECT_EQ(FindByte(vBytes, 3, 0), 3U);
    EXPECT_EQ(FindByte({}, 0, 0), 0U);
}

}  // namespace
}  // namespace kor::filters
