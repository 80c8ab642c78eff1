#include "basic/core/typedispatch/typedispatch.h"

#include <gtest/gtest.h>

#include <memory>
#include <string>
#include <utility>

#include "tests/support/conversionreference.h"

namespace kor::typedispatch
{
namespace
{

using tessel::DataType;
using Pair = std::pair<DataType, DataType>;

struct PairPolicy
{
    template <class TIn, class TOut>
    static Pair Create()
    {
        return {RealDataType<TIn>(), RealDataType<TOut>()};
    }
};

using Dispatcher = details::InputDispatchType<StandardTypeList, StandardTypeList, PairPolicy>;

void ExpectError(const DataType& oIn, const DataType& oOut, unsigned int nLine,
                 const std::string& oClass)
{
    try
    {
        Dispatcher::Dispatch(oIn, oOut);
        ADD_FAILURE() << "a product was made";
    }
    catch (const Exception& oError)
    {
        EXPECT_EQ(oError.GetMessage(), "Invalid type to dispatch.");
        EXPECT_EQ(oError.GetFile(), "basic/core/typedispatch/typedispatch");
        EXPECT_EQ(oError.GetLine(), nLine);
        EXPECT_NE(oError.GetFunction().find(oClass + "<"), std::string::npos)
            << oError.GetFunction();
        EXPECT_EQ(oError.GetFunction().find("lambda"), std::string::npos) << oError.GetFunction();
    }
}

TEST(InputDispatchType, GivesTheProductOfThePolicyForEachPair)
{
    test::ForEachTypePair(
        [](std::size_t nIn, std::size_t nOut)
        {
            const Pair oPair(test::ElementType(nIn), test::ElementType(nOut));
            EXPECT_EQ(Dispatcher::Dispatch(oPair.first, oPair.second), oPair);
        });
}

TEST(InputDispatchType, AlwaysTakesComplexTypesForTheirParts)
{
    EXPECT_EQ(Dispatcher::Dispatch(tessel::eDT_C32R, tessel::eDT_C16U),
              Pair(tessel::eDT_32R, tessel::eDT_16U));
    EXPECT_EQ(Dispatcher::Dispatch(ComplexDataType<int64>(), ComplexDataType<unsigned char>()),
              Pair(tessel::eDT_64S, tessel::eDT_8U));
}

TEST(InputDispatchType, LooksAtTheInputFirst)
{
    ExpectError(tessel::eDT_BIT, tessel::eDT_8U, 443, "InputDispatchType");
    ExpectError(tessel::eDT_BIT, tessel::eDT_BIT, 443, "InputDispatchType");
    ExpectError(DataType(), tessel::eDT_8U, 443, "InputDispatchType");
}

TEST(OutputDispatchType, RefusesTypesOutsideItsList)
{
    ExpectError(tessel::eDT_8U, tessel::eDT_BIT, 375, "OutputDispatchType");
    ExpectError(tessel::eDT_C64R, DataType(), 375, "OutputDispatchType");
}

TEST(OutputDispatchType, MayBeCalledByItself)
{
    using Output = details::OutputDispatchType<short, StandardTypeList, PairPolicy>;
    EXPECT_EQ(Output::Dispatch(tessel::eDT_64S), Pair(tessel::eDT_16S, tessel::eDT_64S));
}

/// What an operation was called with: its two data types, the input and the count.
struct Record
{
    DataType oIn;
    DataType oOut;
    const void* pIn = nullptr;
    std::size_t nCount = 0;
};

int gnLiving = 0;

template <class T1, class T2>
class WriteRecord : public DualDispatch<WriteRecord>::template FirstDataTypeHolder<
                        T1>::template AssignSecondDataType<T2>
{
public:
    WriteRecord() { ++gnLiving; }
    ~WriteRecord() override { --gnLiving; }
    void operator()(const void* pIn, void* pOut, std::size_t nCount) override
    {
        *static_cast<Record*>(pOut) = {RealDataType<T1>(), RealDataType<T2>(), pIn, nCount};
    }
};

void ExpectRecord(const DataType& oIn, const DataType& oOut, const DataType& oExpectedIn,
                  const DataType& oExpectedOut)
{
    {
        const std::unique_ptr<IConvertTo> poOp(DualDispatch<WriteRecord>::Create(oIn, oOut));
        ASSERT_NE(poOp, nullptr);
        EXPECT_EQ(gnLiving, 1);
        Record oRecord;
        (*poOp)(&oIn, &oRecord, 42);
        EXPECT_EQ(oRecord.oIn, oExpectedIn);
        EXPECT_EQ(oRecord.oOut, oExpectedOut);
        EXPECT_EQ(oRecord.pIn, &oIn);
        EXPECT_EQ(oRecord.nCount, 42U);
    }
    EXPECT_EQ(gnLiving, 0);
}

TEST(DualDispatch, MakesTheOperationOfEachPairAndDeletesItWithItsHolder)
{
    test::ForEachTypePair(
        [](std::size_t nIn, std::size_t nOut)
        {
            const DataType oIn = test::ElementType(nIn);
            const DataType oOut = test::ElementType(nOut);
            ExpectRecord(oIn, oOut, oIn, oOut);
            ExpectRecord(test::ComplexElementType(nIn), oOut, oIn, oOut);
            ExpectRecord(oIn, test::ComplexElementType(nOut), oIn, oOut);
        });
}

TEST(DualDispatch, GivesNullForTypesWithoutElements)
{
    const DataType aoTypes[] = {
        tessel::eDT_BIT, DataType(), DataType(32, false, true, 23, 8, false),
        DataType(64, false, true, 52, 11, true), DataType(1, false, false, 1, 0, true)};
    for (const DataType& oType : aoTypes)
    {
        EXPECT_EQ(DualDispatch<WriteRecord>::Create(oType, tessel::eDT_8U), nullptr);
        EXPECT_EQ(DualDispatch<WriteRecord>::Create(tessel::eDT_8U, oType), nullptr);
    }
    EXPECT_EQ(gnLiving, 0);
}

// The code of a type is taken from bits, sign and kind alone.
TEST(DualDispatch, DoesNotLookAtMantissaAndExponent)
{
    ExpectRecord(DataType(32, true, true, 0, 0, false), DataType(64, false, false, 1, 2, false),
                 tessel::eDT_32R, tessel::eDT_64U);
}

}  // namespace
}  // namespace kor::typedispatch
