#include "basic/tessel/raster/datatype.h"

#include <gtest/gtest.h>

#include "tests/support/blocks.h"

namespace kor::tessel
{
namespace
{

TEST(DataType, ComplexDiffersFromRealByTheLastFieldAlone)
{
    EXPECT_NE(eDT_C32R, eDT_32R);
    EXPECT_EQ(RealPartType(eDT_C32R), eDT_32R);
}

}  // namespace
}  // namespace kor::tessel
