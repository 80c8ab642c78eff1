#include "processes/qrdfilters/kernels/convertrows.h"

#include <gtest/gtest.h>
#include <hwy/tests/hwy_gtest.h>

#include "basic/core/typedispatch/typelist.h"
#include "tests/support/conversionreference.h"

namespace kor::filters::kernels
{
namespace
{

class ConvertRows : public hwy::TestWithParamTarget
{
};

HWY_TARGET_INSTANTIATE_TEST_SUITE_P(ConvertRows);

template <class TIn, class TOut>
RowConversion Find()
{
    return FindRowConversion(typedispatch::ElementPosition<TIn>(),
                             typedispatch::ElementPosition<TOut>());
}

TEST_P(ConvertRows, GiveTheBitsOfTheRulesAroundEveryLimit)
{
    test::Random oRandom(1);
    const auto oCompare = [&]<class TIn, class TOut>()
    {
        const std::vector<TIn> vIn = test::ConversionSamples<TIn>(oRandom);
        std::vector<TOut> vOut(vIn.size());
        Find<TIn, TOut>()(vIn.data(), vOut.data(), vIn.size());
        for (std::size_t i = 0; i < vIn.size(); ++i)
        {
            const TOut xExpected = test::ReferenceSample<TIn, TOut>(vIn[i]);
            ASSERT_TRUE(test::SameSample(vOut[i], xExpected))
                << "from " << typedispatch::ElementPosition<TIn>() << " to "
                << typedispatch::ElementPosition<TOut>() << ", " << +vIn[i] << " gives " << +vOut[i]
                << " and not " << +xExpected;
        }
    };
    test::ForEachTypePair(oCompare);
}

// Up to three of the widest vectors of floats, so that every target meets every remainder.
TEST_P(ConvertRows, WriteAllSamplesOfARowAndNoneBehindIt)
{
    const auto oCompare = []<class TIn, class TOut>()
    {
        for (std::size_t nCount = 0; nCount <= 48; ++nCount)
        {
            const std::vector<TIn> vIn(nCount, TIn(3));
            std::vector<TOut> vOut(nCount + 64, TOut(7));
            std::vector<TOut> vExpected(nCount, TOut(3));
            vExpected.resize(nCount + 64, TOut(7));
            Find<TIn, TOut>()(vIn.data(), vOut.data(), nCount);
            ASSERT_EQ(vOut, vExpected) << nCount;
        }
    };
    test::ForEachTypePair(oCompare);
}

}  // namespace
}  // namespace kor::filters::kernels
