#include "processes/qrdfilters/cutsample.h"

#include <gtest/gtest.h>

#include <cmath>
#include <limits>

namespace kor::filters
{
namespace
{

constexpr double kInfinity = std::numeric_limits<double>::infinity();
constexpr float kGreatest = std::numeric_limits<float>::max();

TEST(CutSample, CutsFloatingPointTowardsZeroWithinTheRange)
{
    EXPECT_EQ((CutSample<double, unsigned char>(300.7)), 255);
    EXPECT_EQ((CutSample<double, unsigned char>(254.9)), 254);
    EXPECT_EQ((CutSample<double, unsigned char>(3.9)), 3);
    EXPECT_EQ((CutSample<double, unsigned char>(-0.5)), 0);
    EXPECT_EQ((CutSample<double, unsigned char>(-1.0)), 0);
    EXPECT_EQ((CutSample<double, char>(-128.9)), -128);
    EXPECT_EQ((CutSample<double, char>(-3.9)), -3);
    EXPECT_EQ((CutSample<float, short>(40000.0F)), 32767);
    EXPECT_EQ((CutSample<float, int>(2147483648.0F)), 2147483647);
    EXPECT_EQ((CutSample<float, int>(-2147483648.0F)), -2147483647 - 1);
    EXPECT_EQ((CutSample<double, unsigned int>(4294967294.9)), 4294967294U);
}

// Unlike ConvertSample, which loses negative values on the way to 64 bits.
TEST(CutSample, KeepsTheSignOfWideIntegers)
{
    EXPECT_EQ((CutSample<double, int64>(-3.9)), -3);
    EXPECT_EQ((CutSample<double, int64>(-kInfinity)), std::numeric_limits<int64>::min());
    EXPECT_EQ((CutSample<double, int64>(9223372036854775808.0)), std::numeric_limits<int64>::max());
    EXPECT_EQ((CutSample<double, uint64>(18446744073709551616.0)),
              std::numeric_limits<uint64>::max());
    EXPECT_EQ((CutSample<float, uint64>(9223372036854775808.0F)), 9223372036854775808U);
    EXPECT_EQ((CutSample<short, int64>(-5)), -5);
    EXPECT_EQ((CutSample<int64, char>(-129)), -128);
    EXPECT_EQ((CutSample<int64, unsigned char>(-1)), 0);
}

TEST(CutSample, ClampsIntegersWithoutRoundingThem)
{
    EXPECT_EQ((CutSample<char, unsigned int>(-1)), 0U);
    EXPECT_EQ((CutSample<unsigned char, char>(static_cast<unsigned char>(200))), 127);
    EXPECT_EQ((CutSample<uint64, int64>(9223372036854775809U)), 9223372036854775807);
    EXPECT_EQ((CutSample<int64, uint64>(-1)), 0U);
    EXPECT_EQ((CutSample<int64, uint64>(9007199254740993)), 9007199254740993U);
    EXPECT_EQ((CutSample<uint64, double>(18446744073709551615U)), 18446744073709551616.0);
}

TEST(CutSample, EndsAtTheGreatestFiniteFloat)
{
    EXPECT_EQ((CutSample<double, float>(kInfinity)), kGreatest);
    EXPECT_EQ((CutSample<double, float>(-kInfinity)), -kGreatest);
    EXPECT_EQ((CutSample<double, float>(1e39)), kGreatest);
    EXPECT_EQ((CutSample<double, float>(0.1)), 0.1F);
    EXPECT_EQ((CutSample<float, float>(static_cast<float>(kInfinity))),
              static_cast<float>(kInfinity));
    EXPECT_EQ((CutSample<float, double>(static_cast<float>(kInfinity))), kInfinity);
}

TEST(CutSample, GivesZeroForNotANumber)
{
    EXPECT_EQ((CutSample<double, unsigned char>(std::nan(""))), 0);
    EXPECT_EQ((CutSample<float, int64>(std::nanf(""))), 0);
    EXPECT_TRUE(std::isnan(CutSample<double, float>(std::nan(""))));
    EXPECT_TRUE(std::isnan(CutSample<float, double>(std::nanf(""))));
}

}  // namespace
}  // namespace kor::filters
