#include "platform/datasources/copysamples.h"

#include <gtest/gtest.h>

#include <vector>

namespace kor::datasources
{
namespace
{

// Samples 19 bytes apart to places 17 bytes apart: each byte arrives, and those between stay.
TEST(CopySamples, MovesWholeSamplesAndNothingBetween)
{
    for (const std::size_t nBytes : {1U, 2U, 4U, 8U, 16U})
    {
        std::vector<unsigned char> vnIn(3 * 19);
        for (std::size_t i = 0; i < vnIn.size(); ++i)
        {
            vnIn[i] = static_cast<unsigned char>(i + 1);
        }
        std::vector<unsigned char> vnOut(3 * 17, 0xA5);
        CopySamples(nBytes, 3, vnIn.data(), 19, vnOut.data(), 17);
        for (std::size_t i = 0; i < vnOut.size(); ++i)
        {
            const bool bSample = i % 17 < nBytes;
            EXPECT_EQ(vnOut[i], bSample ? i / 17 * 19 + i % 17 + 1 : 0xA5) << nBytes << " " << i;
        }
    }
}

TEST(CopySamples, NoSamplesTouchNothing)
{
    CopySamples(8, 0, nullptr, 8, nullptr, 8);
}

}  // namespace
}  // namespace kor::datasources
