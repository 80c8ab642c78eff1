#include "processes/qrdfilters/kernels/convertrows.h"

#include <gtest/gtest.h>
#include <hwy/tests/hwy_gtest.h>

#include "tests/support/conversionreference.h"

namespace kor::filters::kernels
{
namespace
{

class ConvertRows : public hwy::TestWithParamTarget
{
};

HWY_TARGET_INSTANTIATE_TEST_SUITE_P(ConvertRows);

TEST_P(ConvertRows, GiveTheBitsOfTheRulesAroundEveryLimit)
{
    test::Random oRandom(1);
    const auto oCompare = [&](std::size_t nIn, std::size_t nOut)
    {
        const test::Elements oIn = test::ConversionSamples(nIn, oRandom);
        EXPECT_TRUE(test::SameElements(
            test::Converted(FindRowConversion(nIn, nOut), oIn, nOut, oIn.Size()),
            test::Converted(test::ReferenceConversion(nIn, nOut), oIn, nOut, oIn.Size())))
            << "from type " << nIn << " to type " << nOut;
    };
    test::ForEachTypePair(oCompare);
}

// Up to three of the widest vectors of floats, so that every target meets every remainder.
TEST_P(ConvertRows, WriteAllSamplesOfARowAndNoneBehindIt)
{
    test::Random oRandom(2);
    const auto oCompare = [&](std::size_t nIn, std::size_t nOut)
    {
        const test::Elements oIn = test::ConversionSamples(nIn, oRandom);
        for (std::size_t nCount = 0; nCount <= 48; ++nCount)
        {
            test::Elements oActual(nOut, 48 + 64);
            test::Elements oExpected(nOut, 48 + 64);
            FindRowConversion(nIn, nOut)(oIn.Data(), oActual.Data(), nCount);
            test::ReferenceConversion(nIn, nOut)(oIn.Data(), oExpected.Data(), nCount);
            ASSERT_TRUE(test::SameElements(oActual, oExpected))
                << nCount << " from type " << nIn << " to type " << nOut;
        }
    };
    test::ForEachTypePair(oCompare);
}

}  // namespace
}  // namespace kor::filters::kernels
