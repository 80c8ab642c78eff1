#include "processes/qrdfilters/sampleconversion.h"

#include <gtest/gtest.h>

#include <cmath>
#include <limits>
#include <type_traits>

#include "tests/support/conversionreference.h"

namespace kor::filters
{
namespace
{

using uchar = unsigned char;
using ushort = unsigned short;
using uint = unsigned int;

constexpr int64 kMin64 = std::numeric_limits<int64>::min();
constexpr int64 kMax64 = 9223372036854775807;
constexpr uint64 kAllBits = 18446744073709551615U;
constexpr double kNaN = std::numeric_limits<double>::quiet_NaN();
constexpr double kInfinity = std::numeric_limits<double>::infinity();

/// Converts to TOut; plain char results are given as the signed type that they stand for.
template <class TOut, class TIn>
Arithmetic<TOut> To(TIn x)
{
    return static_cast<Arithmetic<TOut>>(ConvertSample<TIn, TOut>(x));
}

char Char(int n)
{
    return static_cast<char>(n);
}

TEST(ConvertSample, KeepsSamplesOfTheSameType)
{
    EXPECT_EQ(To<char>(Char(-128)), -128);
    EXPECT_EQ(To<int64>(kMin64), kMin64);
    EXPECT_EQ(To<uint64>(kAllBits), kAllBits);
    EXPECT_EQ(To<float>(-2.75F), -2.75F);
    EXPECT_TRUE(std::isnan(To<double>(kNaN)));
    EXPECT_TRUE(std::signbit(To<double>(-0.0)));
}

TEST(ConvertSample, LosesNegativeValuesOnTheWayToUnsignedTypesAsWideOrWider)
{
    EXPECT_EQ(To<uchar>(Char(-1)), 0);
    EXPECT_EQ(To<uchar>(Char(127)), 127);
    EXPECT_EQ(To<ushort>(Char(-128)), 0);
    EXPECT_EQ(To<ushort>(Char(127)), 127);
    EXPECT_EQ(To<uint>(Char(-1)), 0U);
    EXPECT_EQ(To<uint>(Char(127)), 127U);
    EXPECT_EQ(To<ushort>(short{-1}), 0);
    EXPECT_EQ(To<ushort>(short{32767}), 32767);
    EXPECT_EQ(To<uint>(short{-32768}), 0U);
    EXPECT_EQ(To<uint>(short{32767}), 32767U);
    EXPECT_EQ(To<uint>(-1), 0U);
    EXPECT_EQ(To<uint>(2147483647), 2147483647U);
}

TEST(ConvertSample, WidensSignedIntegers)
{
    EXPECT_EQ(To<short>(Char(-128)), -128);
    EXPECT_EQ(To<int>(Char(-128)), -128);
    EXPECT_EQ(To<int>(short{-32768}), -32768);
    EXPECT_EQ(To<int>(short{32767}), 32767);
}

TEST(ConvertSample, WidensUnsignedIntegers)
{
    EXPECT_EQ(To<short>(uchar{255}), 255);
    EXPECT_EQ(To<ushort>(uchar{255}), 255);
    EXPECT_EQ(To<int>(uchar{255}), 255);
    EXPECT_EQ(To<uint>(uchar{255}), 255U);
    EXPECT_EQ(To<int>(ushort{65535}), 65535);
    EXPECT_EQ(To<uint>(ushort{65535}), 65535U);
}

TEST(ConvertSample, ClampsSignedIntegersAtBothEndsOfANarrowerType)
{
    EXPECT_EQ(To<char>(short{127}), 127);
    EXPECT_EQ(To<char>(short{128}), 127);
    EXPECT_EQ(To<char>(short{-128}), -128);
    EXPECT_EQ(To<char>(short{-129}), -128);
    EXPECT_EQ(To<char>(2147483647), 127);
    EXPECT_EQ(To<char>(-2147483647), -128);
    EXPECT_EQ(To<uchar>(short{255}), 255);
    EXPECT_EQ(To<uchar>(short{256}), 255);
    EXPECT_EQ(To<uchar>(short{-1}), 0);
    EXPECT_EQ(To<uchar>(256), 255);
    EXPECT_EQ(To<uchar>(-1), 0);
    EXPECT_EQ(To<short>(32768), 32767);
    EXPECT_EQ(To<short>(-32768), -32768);
    EXPECT_EQ(To<short>(-32769), -32768);
    EXPECT_EQ(To<ushort>(65536), 65535);
    EXPECT_EQ(To<ushort>(65535), 65535);
    EXPECT_EQ(To<ushort>(-1), 0);
}

TEST(ConvertSample, ClampsUnsignedIntegersAtTheUpperEnd)
{
    EXPECT_EQ(To<char>(uchar{200}), 127);
    EXPECT_EQ(To<char>(uchar{126}), 126);
    EXPECT_EQ(To<char>(ushort{128}), 127);
    EXPECT_EQ(To<char>(uint{4294967295}), 127);
    EXPECT_EQ(To<uchar>(ushort{256}), 255);
    EXPECT_EQ(To<uchar>(ushort{254}), 254);
    EXPECT_EQ(To<uchar>(uint{4294967295}), 255);
    EXPECT_EQ(To<short>(ushort{32768}), 32767);
    EXPECT_EQ(To<short>(ushort{32766}), 32766);
    EXPECT_EQ(To<short>(uint{32768}), 32767);
    EXPECT_EQ(To<ushort>(uint{65536}), 65535);
    EXPECT_EQ(To<ushort>(uint{65534}), 65534);
    EXPECT_EQ(To<int>(uint{2147483648}), 2147483647);
    EXPECT_EQ(To<int>(uint{2147483646}), 2147483646);
}

TEST(ConvertSample, TakesIntegersToFloatingPointByOrdinaryConversion)
{
    EXPECT_EQ(To<float>(Char(-128)), -128.0F);
    EXPECT_EQ(To<double>(uchar{255}), 255.0);
    EXPECT_EQ(To<float>(short{-32768}), -32768.0F);
    EXPECT_EQ(To<double>(ushort{65535}), 65535.0);
    EXPECT_EQ(To<float>(16777217), 16777216.0F);  // 2^24 + 1, a tie, to even
    EXPECT_EQ(To<double>(-2147483647 - 1), -2147483648.0);
    EXPECT_EQ(To<float>(uint{4294967295}), 4294967296.0F);
    EXPECT_EQ(To<double>(uint{4294967295}), 4294967295.0);
    EXPECT_EQ(To<double>(int64{-9007199254740993}), -9007199254740992.0);  // 2^53 + 1
    EXPECT_EQ(To<float>(kMin64), -9223372036854775808.0F);
}

TEST(ConvertSample, TakesUnsigned64BitIntegersThroughTheSignedType)
{
    EXPECT_EQ(To<double>(uint64{5}), 5.0);
    EXPECT_EQ(To<double>(uint64{1} << 63), 9223372036854775808.0);
    EXPECT_EQ(To<float>(uint64{1} << 63), 9223372036854775808.0F);
    EXPECT_EQ(To<double>(kAllBits), 18446744073709551616.0);
    EXPECT_EQ(To<float>(kAllBits), 18446744073709551616.0F);
    // 2^64 - 2^62 + 2^10 + 1 is rounded down to a tie with its sign bit read as a sign, and then to
    // even; rounded once it would go up.
    EXPECT_EQ(To<double>(uint64{13835058055282164737U}), 13835058055282163712.0);
}

TEST(ConvertSample, TakesFloatingPointToFloatingPointByRoundingToNearest)
{
    EXPECT_EQ(To<double>(0.1F), 0.100000001490116119384765625);
    EXPECT_EQ(To<float>(16777217.0), 16777216.0F);
    EXPECT_EQ(To<float>(16777219.0), 16777220.0F);
    EXPECT_EQ(To<float>(1e300), std::numeric_limits<float>::infinity());
    EXPECT_EQ(To<float>(-1e-300), 0.0F);
    EXPECT_TRUE(std::isnan(To<float>(kNaN)));
}

TEST(ConvertSample, LosesNegativeValuesOnTheWayToBoth64BitTypes)
{
    EXPECT_EQ(To<int64>(Char(-5)), 0);
    EXPECT_EQ(To<int64>(short{-5}), 0);
    EXPECT_EQ(To<int64>(-5), 0);
    EXPECT_EQ(To<uint64>(Char(-5)), 0U);
    EXPECT_EQ(To<uint64>(short{-5}), 0U);
    EXPECT_EQ(To<uint64>(-5), 0U);
    EXPECT_EQ(To<int64>(Char(5)), 5);
    EXPECT_EQ(To<int64>(2147483647), 2147483647);
    EXPECT_EQ(To<uint64>(2147483647), 2147483647U);
    EXPECT_EQ(To<int64>(uchar{255}), 255);
    EXPECT_EQ(To<uint64>(uchar{255}), 255U);
    EXPECT_EQ(To<int64>(ushort{65535}), 65535);
    EXPECT_EQ(To<uint64>(ushort{65535}), 65535U);
    EXPECT_EQ(To<int64>(uint{4294967295}), 4294967295);
    EXPECT_EQ(To<uint64>(uint{4294967295}), 4294967295U);
}

TEST(ConvertSample, ClampsSigned64BitIntegersAtTheUpperEndAlone)
{
    EXPECT_EQ(To<char>(int64{128}), 127);
    EXPECT_EQ(To<char>(int64{-1}), -1);
    EXPECT_EQ(To<char>(int64{-129}), 127);  // low bits 0x7F
    EXPECT_EQ(To<char>(kMin64), 0);
    EXPECT_EQ(To<uchar>(int64{256}), 255);
    EXPECT_EQ(To<uchar>(int64{-1}), 255);
    EXPECT_EQ(To<uchar>(int64{-256}), 0);
    EXPECT_EQ(To<short>(int64{32768}), 32767);
    EXPECT_EQ(To<short>(int64{-1}), -1);
    EXPECT_EQ(To<short>(int64{-32769}), 32767);
    EXPECT_EQ(To<ushort>(int64{65536}), 65535);
    EXPECT_EQ(To<ushort>(int64{-1}), 65535);
    EXPECT_EQ(To<int>(int64{2147483648}), 2147483647);
    EXPECT_EQ(To<int>(int64{-1}), -1);
    EXPECT_EQ(To<int>(int64{-2147483649}), 2147483647);
    EXPECT_EQ(To<uint>(int64{4294967296}), 4294967295U);
    EXPECT_EQ(To<uint>(int64{-1}), 4294967295U);
    EXPECT_EQ(To<uint64>(int64{-1}), kAllBits);
    EXPECT_EQ(To<uint64>(kMin64), uint64{1} << 63);
}

TEST(ConvertSample, ClampsUnsigned64BitIntegersAtTheUpperEnd)
{
    EXPECT_EQ(To<int64>(uint64{1} << 63), kMax64);
    EXPECT_EQ(To<int64>(uint64{42}), 42);
    EXPECT_EQ(To<char>(kAllBits), 127);
    EXPECT_EQ(To<char>(uint64{126}), 126);
    EXPECT_EQ(To<uchar>(kAllBits), 255);
    EXPECT_EQ(To<uchar>(uint64{254}), 254);
    EXPECT_EQ(To<short>(kAllBits), 32767);
    EXPECT_EQ(To<ushort>(kAllBits), 65535);
    EXPECT_EQ(To<int>(kAllBits), 2147483647);
    EXPECT_EQ(To<uint>(kAllBits), 4294967295U);
    EXPECT_EQ(To<uint>(uint64{4294967294}), 4294967294U);
}

TEST(ConvertSample, RoundsHalfAwayFromZeroForSignedTargets)
{
    EXPECT_EQ(To<char>(2.5F), 3);
    EXPECT_EQ(To<char>(-2.5F), -3);
    EXPECT_EQ(To<char>(2.4999F), 2);
    EXPECT_EQ(To<char>(127.4F), 127);
    EXPECT_EQ(To<char>(126.5), 127);
    EXPECT_EQ(To<char>(1e30), 127);
    EXPECT_EQ(To<char>(-128.4), -128);
    EXPECT_EQ(To<char>(-128.6), -128);
    EXPECT_EQ(To<char>(-127.5), -128);
    EXPECT_EQ(To<char>(-1e30F), -128);
    EXPECT_EQ(To<short>(0.5F), 1);
    EXPECT_EQ(To<short>(-0.5F), -1);
    EXPECT_EQ(To<short>(-0.0), 0);
    EXPECT_EQ(To<short>(32766.5), 32767);
    EXPECT_EQ(To<short>(40000.0F), 32767);
    EXPECT_EQ(To<short>(-32768.5), -32768);
    EXPECT_EQ(To<int>(-1.5), -2);
    EXPECT_EQ(To<int>(1.5F), 2);
}

TEST(ConvertSample, AddsOneHalfForUnsignedTargetsAndCuts)
{
    EXPECT_EQ(To<uchar>(-0.2F), 0);  // 0.3, cut
    EXPECT_EQ(To<uchar>(-0.7F), 0);  // at most 0
    EXPECT_EQ(To<uchar>(0.5), 1);
    EXPECT_EQ(To<uchar>(0.49), 0);
    EXPECT_EQ(To<uchar>(254.4), 254);
    EXPECT_EQ(To<uchar>(254.5), 255);
    EXPECT_EQ(To<uchar>(1e30F), 255);
    EXPECT_EQ(To<uchar>(-1e30F), 0);
    EXPECT_EQ(To<ushort>(65534.4), 65534);
    EXPECT_EQ(To<ushort>(65534.5), 65535);
    EXPECT_EQ(To<ushort>(65536.0F), 65535);
    EXPECT_EQ(To<ushort>(-1.0F), 0);
    EXPECT_EQ(To<uint>(1.5), 2U);
    EXPECT_EQ(To<uint>(-1.5), 0U);
}

// x + 0.5 in the source's own precision, in which it may be rounded up: to 1 here, to 2^23 + 2.
TEST(ConvertSample, RoundsInThePrecisionOfTheSource)
{
    EXPECT_EQ(To<int>(0.49999997F), 1);
    EXPECT_EQ(To<int>(double{0.49999997F}), 0);
    EXPECT_EQ(To<uint>(0.49999999999999994), 1U);
    EXPECT_EQ(To<int>(8388609.0F), 8388610);
    EXPECT_EQ(To<int>(8388609.0), 8388609);
}

TEST(ConvertSample, TestsFloatsAgainstAPowerOfTwoAndDoublesAgainstTheInteger)
{
    EXPECT_EQ(To<int>(2147483520.0F), 2147483520);  // the largest float below 2^31
    EXPECT_EQ(To<int>(2147483648.0F), 2147483647);
    EXPECT_EQ(To<int>(-2147483648.0F), -2147483647 - 1);
    EXPECT_EQ(To<int>(-2147483904.0F), -2147483647 - 1);
    EXPECT_EQ(To<int>(2147483646.4), 2147483646);
    EXPECT_EQ(To<int>(2147483646.5), 2147483647);
    EXPECT_EQ(To<int>(2147483647.4), 2147483647);
    EXPECT_EQ(To<int>(-2147483648.4), -2147483647 - 1);
    EXPECT_EQ(To<int>(-2147483646.5), -2147483647);
    EXPECT_EQ(To<uint>(4294967040.0F), 4294967040U);  // the largest float below 2^32
    EXPECT_EQ(To<uint>(4294967296.0F), 4294967295U);
    EXPECT_EQ(To<uint>(2147483648.0F), 2147483648U);
    EXPECT_EQ(To<uint>(4294967294.4), 4294967294U);
    EXPECT_EQ(To<uint>(4294967294.5), 4294967295U);
    EXPECT_EQ(To<uint>(1e20), 4294967295U);
}

TEST(ConvertSample, CutsFloatingPointWithoutRoundingFor64BitTargets)
{
    EXPECT_EQ(To<int64>(3.9), 3);
    EXPECT_EQ(To<int64>(-3.9), 0);
    EXPECT_EQ(To<int64>(0.9F), 0);
    EXPECT_EQ(To<int64>(9223372036854774784.0), 9223372036854774784);  // 2^63 - 1024
    EXPECT_EQ(To<int64>(9223372036854775808.0), kMax64);
    EXPECT_EQ(To<int64>(9223372036854775808.0F), kMax64);
    EXPECT_EQ(To<int64>(kInfinity), kMax64);
    EXPECT_EQ(To<int64>(-kInfinity), 0);
    EXPECT_EQ(To<uint64>(3.9F), 3U);
    EXPECT_EQ(To<uint64>(-3.9F), 0U);
    EXPECT_EQ(To<uint64>(9223372036854775808.0), uint64{1} << 63);
    EXPECT_EQ(To<uint64>(9223372036854777856.0), (uint64{1} << 63) + 2048);
    EXPECT_EQ(To<uint64>(18446744073709549568.0), kAllBits - 2047);
    EXPECT_EQ(To<uint64>(18446744073709551616.0), kAllBits);
    EXPECT_EQ(To<uint64>(18446744073709551616.0F), kAllBits);
    EXPECT_EQ(To<uint64>(-kInfinity), 0U);
}

TEST(ConvertSample, TakesNotANumberForZeroInEveryInteger)
{
    test::ForEachElementType(
        []<class TOut>()
        {
            if constexpr (std::is_integral_v<TOut>)
            {
                EXPECT_EQ(+To<TOut>(kNaN), 0);
                EXPECT_EQ(+To<TOut>(-std::numeric_limits<float>::quiet_NaN()), 0);
            }
        });
}

constexpr auto kConversions = typedispatch::MakePairTable<typedispatch::StandardTypeList>(
    []<class TIn, class TOut>() -> test::Row
    {
        return [](const void* pIn, void* pOut, std::size_t nCount)
        {
            for (std::size_t i = 0; i < nCount; ++i)
            {
                static_cast<TOut*>(pOut)[i] =
                    ConvertSample<TIn, TOut>(static_cast<const TIn*>(pIn)[i]);
            }
        };
    });

TEST(ConvertSample, FollowsItsRulesForAllHundredPairs)
{
    test::Random oRandom(3);
    const auto oCompare = [&](std::size_t nIn, std::size_t nOut)
    {
        const test::Elements oIn = test::ConversionSamples(nIn, oRandom);
        EXPECT_TRUE(test::SameElements(
            test::Converted(kConversions[nIn][nOut], oIn, nOut, oIn.Size()),
            test::Converted(test::ReferenceConversion(nIn, nOut), oIn, nOut, oIn.Size())))
            << "from type " << nIn << " to type " << nOut;
    };
    test::ForEachTypePair(oCompare);
}

TEST(ConvertSample, MayBeComputedByTheCompiler)
{
    static_assert(ConvertSample<double, unsigned char>(254.5) == 255);
    static_assert(ConvertSample<int64, short>(-1) == -1);
}

/// re * re + im * im as TOut.
template <class TOut, class TIn>
Arithmetic<TOut> Intensity(TIn re, TIn im)
{
    return static_cast<Arithmetic<TOut>>(IntensitySample<TIn, TOut>(re, im));
}

TEST(IntensitySample, IsTheSumOfSquares)
{
    EXPECT_EQ(Intensity<int>(Char(3), Char(-4)), 25);
    EXPECT_EQ(Intensity<double>(3.0, 4.0), 25.0);
    EXPECT_EQ(Intensity<float>(1.5F, 2.0F), 6.25F);
    EXPECT_EQ(Intensity<float>(short{-300}, short{400}), 250000.0F);
    EXPECT_EQ(Intensity<uint64>(uint64{3}, uint64{4}), 25U);
}

TEST(IntensitySample, LosesTheHighBitsInANarrowerType)
{
    EXPECT_EQ(Intensity<uchar>(uchar{20}, uchar{10}), 244);  // 500 - 256
    EXPECT_EQ(Intensity<char>(Char(-128), Char(-128)), 0);   // 32768
    EXPECT_EQ(Intensity<char>(Char(10), Char(10)), -56);     // 200
    EXPECT_EQ(Intensity<short>(200, 0), -25536);             // 40000
}

TEST(IntensitySample, WrapsInTheTypeOfTheProduct)
{
    // 65535^2 = 4294836225 in 32 bits with a sign, from 16-bit samples without one.
    EXPECT_EQ(Intensity<double>(ushort{65535}, ushort{0}), -131071.0);
    EXPECT_EQ(Intensity<int64>(ushort{65535}, ushort{0}), -131071);
    EXPECT_EQ(Intensity<uint64>(ushort{65535}, ushort{0}), kAllBits - 131070);
    EXPECT_EQ(Intensity<int>(short{-32768}, short{-32768}), -2147483647 - 1);
    EXPECT_EQ(Intensity<double>(65536, 1), 1.0);
    EXPECT_EQ(Intensity<double>(uint{65535}, uint{0}), 4294836225.0);
    EXPECT_EQ(Intensity<double>(uint{65536}, uint{2}), 4.0);
    EXPECT_EQ(Intensity<double>(int64{4294967296}, int64{3}), 9.0);
    EXPECT_EQ(Intensity<double>(int64{3037000500}, int64{0}), -9223372036709301616.0);
    EXPECT_EQ(Intensity<double>(uint64{3037000500}, uint64{0}), 9223372037000250000.0);
}

TEST(IntensitySample, CutsFloatingPointTowardZero)
{
    EXPECT_EQ(Intensity<int>(1.5, 1.2), 3);  // 3.69
    EXPECT_EQ(Intensity<uint64>(1.5F, 1.2F), 3U);
    EXPECT_EQ(Intensity<uchar>(20.0, 10.5), 254);  // 510.25, cut, without its high bits
}

TEST(IntensitySample, CutsFloatingPointOutsideAnIntegerThrough64BitsWithASign)
{
    EXPECT_EQ(Intensity<int>(60000.0, 0.0), -694967296);  // 3600000000
    EXPECT_EQ(Intensity<int64>(1e10, 0.0), kMin64);       // 1e20
    EXPECT_EQ(Intensity<int64>(kNaN, 0.0), kMin64);
    EXPECT_EQ(Intensity<int64>(3037000499.0, 0.0), 9223372030926248960);
    EXPECT_EQ(Intensity<int>(1e10, 0.0), 0);
    EXPECT_EQ(Intensity<uchar>(kInfinity, 0.0), 0);
    EXPECT_EQ(Intensity<uint64>(1e10, 0.0), kAllBits);
    EXPECT_EQ(Intensity<uint64>(kNaN, 0.0), 0U);
    EXPECT_EQ(Intensity<uint64>(4e9, 0.0), 16000000000000000000U);
}

TEST(IntensitySample, IsComputedInThePrecisionOfItsParts)
{
    EXPECT_EQ(Intensity<double>(4097.0F, 0.0F), 16785408.0);  // 16785409 needs 25 bits
    EXPECT_EQ(Intensity<double>(4097.0, 0.0), 16785409.0);
    EXPECT_EQ(Intensity<double>(1e30F, 0.0F), kInfinity);
}

constexpr auto kIntensities = typedispatch::MakePairTable<typedispatch::StandardTypeList>(
    []<class TIn, class TOut>() -> test::Row
    {
        return [](const void* pIn, void* pOut, std::size_t nCount)
        {
            const auto* pParts = static_cast<const TIn*>(pIn);
            for (std::size_t k = 0; k < nCount; ++k)
            {
                static_cast<TOut*>(pOut)[k] =
                    IntensitySample<TIn, TOut>(pParts[2 * k], pParts[2 * k + 1]);
            }
        };
    });

TEST(IntensitySample, FollowsItsRulesForAllHundredPairs)
{
    test::Random oRandom(4);
    const auto oCompare = [&](std::size_t nIn, std::size_t nOut)
    {
        const test::Elements oIn = test::ConversionSamples(nIn, oRandom);
        const std::size_t nPairs = oIn.Size() / 2;
        EXPECT_TRUE(test::SameElements(
            test::Converted(kIntensities[nIn][nOut], oIn, nOut, nPairs),
            test::Converted(test::ReferenceIntensity(nIn, nOut), oIn, nOut, nPairs)))
            << "from type " << nIn << " to type " << nOut;
    };
    test::ForEachTypePair(oCompare);
}

}  // namespace
}  // namespace kor::filters
