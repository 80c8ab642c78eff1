#include "processes/qrdfilters/samplerows.h"

#include <gtest/gtest.h>

#include <vector>

#include "tests/support/conversionreference.h"

namespace kor::filters
{
namespace
{

constexpr auto kRows = typedispatch::MakePairTable<typedispatch::StandardTypeList>(
    []<class TIn, class TOut>() -> test::Row
    {
        return [](const void* pIn, void* pOut, std::size_t nCount) {
            ConvertSamples<TIn, TOut>(static_cast<const TIn*>(pIn), static_cast<TOut*>(pOut),
                                      nCount);
        };
    });

TEST(ConvertSamples, FollowsTheRulesForAllHundredPairsAndOddCounts)
{
    test::Random oRandom(5);
    const auto oCompare = [&](std::size_t nIn, std::size_t nOut)
    {
        const test::Elements oIn = test::ConversionSamples(nIn, oRandom);
        for (const std::size_t nCount :
             {std::size_t{1}, std::size_t{7}, std::size_t{33}, oIn.Size()})
        {
            ASSERT_TRUE(test::SameElements(
                test::Converted(kRows[nIn][nOut], oIn, nOut, nCount),
                test::Converted(test::ReferenceConversion(nIn, nOut), oIn, nOut, nCount)))
                << nCount << " from type " << nIn << " to type " << nOut;
        }
    };
    test::ForEachTypePair(oCompare);
}

TEST(ConvertSamples, MayOverlapWhereTheTypesAreEqual)
{
    std::vector<short> vSamples = {1, 2, 3, 4, 5};
    ConvertSamples<short, short>(vSamples.data(), vSamples.data() + 1, 4);
    EXPECT_EQ(vSamples, (std::vector<short>{1, 1, 2, 3, 4}));
}

TEST(ConvertSamples, TakesNullForNoSamples)
{
    ConvertSamples<short, short>(nullptr, nullptr, 0);
    ConvertSamples<double, unsigned char>(nullptr, nullptr, 0);
    ConvertSamples<int, double>(nullptr, nullptr, 0);
}

TEST(LoadSamples, WidensToDouble)
{
    const std::vector<char> vIn = {-128, 0, 127};
    std::vector<double> vdfOut(3);
    LoadSamples<char>(vIn.data(), vdfOut);
    EXPECT_EQ(vdfOut, (std::vector<double>{-128, 0, 127}));

    const std::vector<uint64> vnIn = {0, 18446744073709551615U};
    vdfOut.resize(2);
    LoadSamples<uint64>(vnIn.data(), vdfOut);
    EXPECT_EQ(vdfOut, (std::vector<double>{0, 18446744073709551616.0}));
}

TEST(StoreSamples, ConvertsFromDouble)
{
    const std::vector<double> vdfIn = {-0.7, 0.5, 254.5, 1000};
    std::vector<unsigned char> vOut(4);
    StoreSamples<unsigned char>(vdfIn, vOut.data());
    EXPECT_EQ(vOut, (std::vector<unsigned char>{0, 1, 255, 255}));

    std::vector<int64> vnOut(4);
    StoreSamples<int64>(vdfIn, vnOut.data());
    EXPECT_EQ(vnOut, (std::vector<int64>{0, 0, 254, 1000}));
}

}  // namespace
}  // namespace kor::filters
