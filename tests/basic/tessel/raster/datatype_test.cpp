#include "basic/tessel/raster/datatype.h"

#include <gtest/gtest.h>

#include <type_traits>

namespace kor::tessel
{
namespace
{

std::uint32_t CodeOf(const DataType& oType)
{
    return NativeDataType(oType).mnCode;
}

TEST(DataType, MadeByDefaultIsNoTypeAtAll)
{
    const DataType oType;
    EXPECT_EQ(oType, DataType(0, false, false, 0, 0, false));
}

TEST(DataType, ConstantsHoldTheirSixFields)
{
    EXPECT_EQ(eDT_BIT, DataType(1, false, false, 1, 0, false));
    EXPECT_EQ(eDT_8U, DataType(8, false, false, 8, 0, false));
    EXPECT_EQ(eDT_8S, DataType(8, true, false, 8, 0, false));
    EXPECT_EQ(eDT_16U, DataType(16, false, false, 16, 0, false));
    EXPECT_EQ(eDT_16S, DataType(16, true, false, 16, 0, false));
    EXPECT_EQ(eDT_32U, DataType(32, false, false, 32, 0, false));
    EXPECT_EQ(eDT_32S, DataType(32, true, false, 32, 0, false));
    EXPECT_EQ(eDT_32R, DataType(32, true, true, 23, 8, false));
    EXPECT_EQ(eDT_64U, DataType(64, false, false, 64, 0, false));
    EXPECT_EQ(eDT_64S, DataType(64, true, false, 64, 0, false));
    EXPECT_EQ(eDT_64R, DataType(64, true, true, 52, 11, false));
    EXPECT_EQ(eDT_C16U, DataType(16, false, false, 16, 0, true));
    EXPECT_EQ(eDT_C16S, DataType(16, true, false, 16, 0, true));
    EXPECT_EQ(eDT_C32U, DataType(32, false, false, 32, 0, true));
    EXPECT_EQ(eDT_C32S, DataType(32, true, false, 32, 0, true));
    EXPECT_EQ(eDT_C32R, DataType(32, true, true, 23, 8, true));
    EXPECT_EQ(eDT_C64R, DataType(64, true, true, 52, 11, true));
}

TEST(DataType, EachSingleFieldDecidesEquality)
{
    const DataType oType(32, true, true, 23, 8, false);
    EXPECT_NE(oType, DataType(64, true, true, 23, 8, false));
    EXPECT_NE(oType, DataType(32, false, true, 23, 8, false));
    EXPECT_NE(oType, DataType(32, true, false, 23, 8, false));
    EXPECT_NE(oType, DataType(32, true, true, 24, 8, false));
    EXPECT_NE(oType, DataType(32, true, true, 23, 9, false));
    EXPECT_NE(oType, DataType(32, true, true, 23, 8, true));
}

TEST(DataType, TypesOfOneBitCountDiffer)
{
    EXPECT_NE(eDT_32S, eDT_32U);
    EXPECT_NE(eDT_32R, eDT_32S);
}

TEST(DataType, ComplexDiffersFromRealByTheLastFieldAlone)
{
    EXPECT_NE(eDT_C32R, eDT_32R);
    DataType oType = eDT_C32R;
    oType.mbComplex = false;
    EXPECT_EQ(oType, eDT_32R);
}

TEST(DataType, SampleTakesWholeBytesAndTwicePartsWhereComplex)
{
    EXPECT_EQ(eDT_BIT.GetSampleBytes(), 1U);
    EXPECT_EQ(eDT_8S.GetSampleBytes(), 1U);
    EXPECT_EQ(eDT_16U.GetSampleBytes(), 2U);
    EXPECT_EQ(eDT_32R.GetSampleBytes(), 4U);
    EXPECT_EQ(eDT_64U.GetSampleBytes(), 8U);
    EXPECT_EQ(eDT_C16S.GetSampleBytes(), 4U);
    EXPECT_EQ(eDT_C64R.GetSampleBytes(), 16U);
}

TEST(RealPartType, IsTheRealTypeOfTheSameElement)
{
    EXPECT_EQ(RealPartType(eDT_C16U), eDT_16U);
    EXPECT_EQ(RealPartType(eDT_C16S), eDT_16S);
    EXPECT_EQ(RealPartType(eDT_C32U), eDT_32U);
    EXPECT_EQ(RealPartType(eDT_C32S), eDT_32S);
    EXPECT_EQ(RealPartType(eDT_C32R), eDT_32R);
    EXPECT_EQ(RealPartType(eDT_C64R), eDT_64R);
    EXPECT_EQ(RealPartType(DataType(8, true, false, 8, 0, true)), eDT_8S);
    EXPECT_EQ(RealPartType(DataType(64, true, false, 64, 0, true)), eDT_64S);
}

TEST(RealPartType, MakesMantissaAndExponentAnew)
{
    EXPECT_EQ(RealPartType(DataType(32, true, true, 7, 7, true)), eDT_32R);
    EXPECT_EQ(RealPartType(DataType(64, true, true, 7, 7, true)), eDT_64R);
    // Only signed floats of 32 and 64 bits have a mantissa of their own.
    EXPECT_EQ(RealPartType(DataType(32, false, true, 23, 8, true)),
              DataType(32, false, true, 32, 0, false));
    EXPECT_EQ(RealPartType(DataType(16, true, true, 10, 5, true)),
              DataType(16, true, true, 16, 0, false));
}

TEST(NativeDataType, KnowsTheCodesOfTheSeventeenTypes)
{
    EXPECT_EQ(CodeOf(eDT_8U), 0U);
    EXPECT_EQ(CodeOf(eDT_8S), 1U);
    EXPECT_EQ(CodeOf(eDT_16U), 2U);
    EXPECT_EQ(CodeOf(eDT_16S), 3U);
    EXPECT_EQ(CodeOf(eDT_32U), 4U);
    EXPECT_EQ(CodeOf(eDT_32S), 5U);
    EXPECT_EQ(CodeOf(eDT_32R), 6U);
    EXPECT_EQ(CodeOf(eDT_64U), 7U);
    EXPECT_EQ(CodeOf(eDT_64S), 8U);
    EXPECT_EQ(CodeOf(eDT_64R), 9U);
    EXPECT_EQ(CodeOf(eDT_C16U), 10U);
    EXPECT_EQ(CodeOf(eDT_C16S), 11U);
    EXPECT_EQ(CodeOf(eDT_C32S), 12U);
    EXPECT_EQ(CodeOf(eDT_C32R), 13U);
    EXPECT_EQ(CodeOf(eDT_C64R), 14U);
    EXPECT_EQ(CodeOf(eDT_BIT), 15U);
    EXPECT_EQ(CodeOf(eDT_C32U), 15U);
}

TEST(NativeDataType, LooksAtTheSignAloneForEightBits)
{
    EXPECT_EQ(CodeOf(DataType(8, false, false, 8, 0, true)), 0U);
    EXPECT_EQ(CodeOf(DataType(8, true, false, 8, 0, true)), 1U);
    EXPECT_EQ(CodeOf(DataType(8, true, true, 8, 0, false)), 1U);
}

TEST(NativeDataType, LooksAtTheSignAloneForSixteenBitsOfAPart)
{
    EXPECT_EQ(CodeOf(DataType(16, false, true, 10, 5, false)), 2U);
    EXPECT_EQ(CodeOf(DataType(16, true, true, 10, 5, false)), 3U);
    EXPECT_EQ(CodeOf(DataType(16, false, true, 10, 5, true)), 10U);
    EXPECT_EQ(CodeOf(DataType(16, true, true, 10, 5, true)), 11U);
}

TEST(NativeDataType, IgnoresMantissaAndExponent)
{
    EXPECT_EQ(CodeOf(DataType(32, true, true, 0, 0, false)), 6U);
    EXPECT_EQ(CodeOf(DataType(64, false, false, 1, 2, false)), 7U);
}

TEST(NativeDataType, HasNoCodeForTypesWithoutSamples)
{
    EXPECT_EQ(CodeOf(DataType()), 15U);
    EXPECT_EQ(CodeOf(DataType(1, false, false, 1, 0, true)), 15U);
    EXPECT_EQ(CodeOf(DataType(12, false, false, 12, 0, false)), 15U);
    EXPECT_EQ(CodeOf(DataType(128, true, true, 112, 15, false)), 15U);
    EXPECT_EQ(CodeOf(DataType(32, false, true, 23, 8, false)), 15U);  // unsigned floats
    EXPECT_EQ(CodeOf(DataType(64, false, true, 52, 11, false)), 15U);
    EXPECT_EQ(CodeOf(DataType(32, false, true, 23, 8, true)), 15U);
    EXPECT_EQ(CodeOf(DataType(64, true, false, 64, 0, true)), 15U);  // complex 64-bit integers
    EXPECT_EQ(CodeOf(DataType(64, false, false, 64, 0, true)), 15U);
}

TEST(NativeDataType, KeepsTheFieldsOfItsType)
{
    const NativeDataType oType(eDT_C32R);
    EXPECT_EQ(static_cast<const DataType&>(oType), eDT_C32R);
    EXPECT_TRUE(std::has_virtual_destructor_v<NativeDataType>);
    EXPECT_FALSE(std::is_polymorphic_v<DataType>);
}

}  // namespace
}  // namespace kor::tessel
