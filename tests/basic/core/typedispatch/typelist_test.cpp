#include "basic/core/typedispatch/typelist.h"

#include <gtest/gtest.h>

#include <type_traits>
#include <utility>

namespace kor::typedispatch
{
namespace
{

using tessel::DataType;

TEST(StandardTypeList, HoldsTheTenElementTypesInTheirOrder)
{
    using typeconv::priv::NullDataType;
    using typeconv::priv::TypeList;
    using Last = TypeList<double, TypeList<int64, TypeList<uint64, NullDataType>>>;
    using Middle = TypeList<int, TypeList<unsigned int, TypeList<float, Last>>>;
    using Shorts = TypeList<short, TypeList<unsigned short, Middle>>;
    using Expected = TypeList<char, TypeList<unsigned char, Shorts>>;
    EXPECT_TRUE((std::is_same_v<StandardTypeList, Expected>));
    EXPECT_EQ(kListLength<StandardTypeList>, 10U);
    EXPECT_EQ(kListLength<NullDataType>, 0U);
}

TEST(RealDataType, IsTheConstantOfTheElementType)
{
    EXPECT_EQ(RealDataType<char>(), tessel::eDT_8S);
    EXPECT_EQ(RealDataType<unsigned char>(), tessel::eDT_8U);
    EXPECT_EQ(RealDataType<short>(), tessel::eDT_16S);
    EXPECT_EQ(RealDataType<unsigned short>(), tessel::eDT_16U);
    EXPECT_EQ(RealDataType<int>(), tessel::eDT_32S);
    EXPECT_EQ(RealDataType<unsigned int>(), tessel::eDT_32U);
    EXPECT_EQ(RealDataType<float>(), tessel::eDT_32R);
    EXPECT_EQ(RealDataType<double>(), tessel::eDT_64R);
    EXPECT_EQ(RealDataType<int64>(), tessel::eDT_64S);
    EXPECT_EQ(RealDataType<uint64>(), tessel::eDT_64U);
}

TEST(ComplexDataType, ExistsForEachElementTypeWithAConstantOrWithout)
{
    EXPECT_EQ(ComplexDataType<char>(), DataType(8, true, false, 8, 0, true));
    EXPECT_EQ(ComplexDataType<unsigned char>(), DataType(8, false, false, 8, 0, true));
    EXPECT_EQ(ComplexDataType<short>(), tessel::eDT_C16S);
    EXPECT_EQ(ComplexDataType<unsigned short>(), tessel::eDT_C16U);
    EXPECT_EQ(ComplexDataType<int>(), tessel::eDT_C32S);
    EXPECT_EQ(ComplexDataType<unsigned int>(), tessel::eDT_C32U);
    EXPECT_EQ(ComplexDataType<float>(), tessel::eDT_C32R);
    EXPECT_EQ(ComplexDataType<double>(), tessel::eDT_C64R);
    EXPECT_EQ(ComplexDataType<int64>(), DataType(64, true, false, 64, 0, true));
    EXPECT_EQ(ComplexDataType<uint64>(), DataType(64, false, false, 64, 0, true));
}

TEST(FindDataType, CountsFromZeroInTheOrderOfTheList)
{
    EXPECT_EQ(FindDataType<StandardTypeList>(tessel::eDT_8S, false), 0U);
    EXPECT_EQ(FindDataType<StandardTypeList>(tessel::eDT_8U, false), 1U);
    EXPECT_EQ(FindDataType<StandardTypeList>(tessel::eDT_64R, false), 7U);
    EXPECT_EQ(FindDataType<StandardTypeList>(tessel::eDT_64S, false), 8U);
    EXPECT_EQ(FindDataType<StandardTypeList>(tessel::eDT_64U, false), 9U);
}

TEST(FindDataType, FindsComplexTypesWhenAskedTo)
{
    EXPECT_EQ(FindDataType<StandardTypeList>(tessel::eDT_C32R, true), 6U);
    EXPECT_EQ(FindDataType<StandardTypeList>(tessel::eDT_C32R, false), 10U);
    EXPECT_EQ(FindDataType<StandardTypeList>(tessel::eDT_32R, true), 6U);
}

TEST(FindDataType, GivesTheLengthForTypesOutsideTheList)
{
    EXPECT_EQ(FindDataType<StandardTypeList>(tessel::eDT_BIT, true), 10U);
    EXPECT_EQ(FindDataType<StandardTypeList>(DataType(), true), 10U);
    // Half a match is none: a float with another mantissa.
    EXPECT_EQ(FindDataType<StandardTypeList>(DataType(32, true, true, 24, 8, false), true), 10U);
}

TEST(ElementPosition, IsThatOfTheStandardList)
{
    EXPECT_EQ(ElementPosition<char>(), 0U);
    EXPECT_EQ(ElementPosition<double>(), 7U);
    EXPECT_EQ(ElementPosition<int64>(), 8U);
    EXPECT_EQ(ElementPosition<uint64>(), 9U);
}

TEST(VisitType, CallsForTheTypeAtThePositionOrForNone)
{
    const auto oSize = []<class T>() { return sizeof(T); };
    const auto oNone = [] { return std::size_t{99}; };
    EXPECT_EQ(VisitType<StandardTypeList>(2, oSize, oNone), 2U);
    EXPECT_EQ(VisitType<StandardTypeList>(9, oSize, oNone), 8U);
    EXPECT_EQ(VisitType<StandardTypeList>(10, oSize, oNone), 99U);
}

TEST(MakePairTable, HoldsAnEntryForEachPairOfTypes)
{
    using List = typeconv::priv::MakeTypeList<char, short, double>::Type;
    constexpr auto kTable =
        MakePairTable<List>([]<class T1, class T2>() { return std::pair(sizeof(T1), sizeof(T2)); });
    constexpr std::size_t kSizes[] = {1, 2, 8};
    ASSERT_EQ(kTable.size(), 3U);
    for (std::size_t i = 0; i < 3; ++i)
    {
        for (std::size_t k = 0; k < 3; ++k)
        {
            EXPECT_EQ(kTable[i][k], std::pair(kSizes[i], kSizes[k]));
        }
    }
}

}  // namespace
}  // namespace kor::typedispatch
