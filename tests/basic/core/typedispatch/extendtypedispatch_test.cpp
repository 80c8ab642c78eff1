#include "basic/core/typedispatch/extendtypedispatch.h"

#include <gtest/gtest.h>

#include <memory>
#include <string>
#include <vector>

#include "tests/support/conversionreference.h"

namespace kor::typedispatch
{
namespace
{

using tessel::DataType;
using typeconv::priv::MakeTypeList;
using typeconv::priv::NullDataType;
using Types = std::vector<DataType>;

class IProduct
{
public:
    virtual ~IProduct() = default;
    virtual Types GetTypes() const = 0;
};

template <class... T>
class Product : public IProduct
{
public:
    Types GetTypes() const override { return {RealDataType<T>()...}; }
};

template <class T1, class T2>
class Pair : public Product<T1, T2>
{
};

template <class T1>
class Single : public Product<T1>
{
};

struct FactoryOfThree
{
    using Interface = IProduct;
    template <class T1, class T2, class T3>
    static Interface* Create()
    {
        return new Product<T1, T2, T3>();
    }
};

using PairFactory = Factory2Template<Pair, IProduct>;

// Not inlined: else the compiler warns of the short vectors on which the dispatcher throws.
template <class Factory, int N, class ListA = StandardTypeList>
[[gnu::noinline]] Types Dispatched(const Types& oTypes, bool bExtendComplex)
{
    const std::unique_ptr<IProduct> poProduct(
        ExtendDispatchTypes<Factory, N, ListA, StandardTypeList, NullDataType>::Dispatch(
            oTypes, bExtendComplex));
    return poProduct->GetTypes();
}

template <class Dispatch>
void ExpectError(const Dispatch& oDispatch, const std::string& oMessage, unsigned int nLine,
                 const std::string& oPartOfFunction)
{
    try
    {
        oDispatch();
        ADD_FAILURE() << "a product was made";
    }
    catch (const Exception& oError)
    {
        EXPECT_EQ(oError.GetMessage(), oMessage);
        EXPECT_EQ(oError.GetFile(), "basic/core/typedispatch/extendtypedispatch");
        EXPECT_EQ(oError.GetLine(), nLine);
        EXPECT_NE(oError.GetFunction().find("ExtendDispatchTypes<"), std::string::npos)
            << oError.GetFunction();
        EXPECT_NE(oError.GetFunction().find(oPartOfFunction), std::string::npos)
            << oError.GetFunction();
        EXPECT_EQ(oError.GetFunction().find("lambda"), std::string::npos) << oError.GetFunction();
    }
}

constexpr const char* kTooFew = "Not enough type in the vector for the dispatcher you are using.";
constexpr const char* kInvalid = "Invalid type requested.";

TEST(ExtendDispatchTypes, MakesTheProductOfEachOfTheHundredPairs)
{
    test::ForEachTypePair(
        [](std::size_t nIn, std::size_t nOut)
        {
            const Types oTypes = {test::ElementType(nIn), test::ElementType(nOut)};
            EXPECT_EQ((Dispatched<PairFactory, 2>(oTypes, false)), oTypes);
        });
}

TEST(ExtendDispatchTypes, TakesComplexTypesForTheirPartsOnlyWhenExtended)
{
    const Types oComplex = {tessel::eDT_C32R, tessel::eDT_C16S};
    EXPECT_EQ((Dispatched<PairFactory, 2>(oComplex, true)),
              (Types{tessel::eDT_32R, tessel::eDT_16S}));
    EXPECT_EQ((Dispatched<PairFactory, 2>({tessel::eDT_C32R, tessel::eDT_64R}, true)),
              (Types{tessel::eDT_32R, tessel::eDT_64R}));
    EXPECT_EQ(
        (Dispatched<PairFactory, 2>({ComplexDataType<char>(), ComplexDataType<int64>()}, true)),
        (Types{tessel::eDT_8S, tessel::eDT_64S}));
    ExpectError(
        [&] {
            Dispatched<PairFactory, 2>({tessel::eDT_C32R, tessel::eDT_32R}, false);
        },
        kInvalid, 175, "int N = 1");
}

TEST(ExtendDispatchTypes, RefusesBitsInAnyPosition)
{
    for (const bool bExtendComplex : {false, true})
    {
        ExpectError(
            [&] {
                Dispatched<PairFactory, 2>({tessel::eDT_BIT, tessel::eDT_8U}, bExtendComplex);
            },
            kInvalid, 175, "int N = 1");
        ExpectError(
            [&] {
                Dispatched<PairFactory, 2>({tessel::eDT_8U, tessel::eDT_BIT}, bExtendComplex);
            },
            kInvalid, 175, "int N = 2");
    }
}

TEST(ExtendDispatchTypes, LooksAtTheLastElementFirst)
{
    ExpectError(
        [] {
            Dispatched<PairFactory, 2>({tessel::eDT_BIT, tessel::eDT_BIT}, true);
        },
        kInvalid, 175, "int N = 2");
}

TEST(ExtendDispatchTypes, WantsATypeForEachDimension)
{
    ExpectError([] { Dispatched<PairFactory, 2>({tessel::eDT_8U}, false); }, kTooFew, 114,
                "int N = 2");
    ExpectError([] { Dispatched<PairFactory, 2>({}, true); }, kTooFew, 114, "int N = 2");
}

TEST(ExtendDispatchTypes, MissesATypeOnAnotherLineWithTheLastTypeOfAList)
{
    using Last = MakeTypeList<uint64>::Type;
    ExpectError([] { Dispatched<PairFactory, 2, Last>({tessel::eDT_8U}, false); }, kTooFew, 163,
                "int N = 2");
}

TEST(ExtendDispatchTypes, IgnoresElementsBeyondItsDimensions)
{
    const Types oTypes = {tessel::eDT_8U, tessel::eDT_16S, tessel::eDT_BIT};
    EXPECT_EQ((Dispatched<PairFactory, 2>(oTypes, false)),
              (Types{tessel::eDT_8U, tessel::eDT_16S}));
}

TEST(ExtendDispatchTypes, TriesNoMoreThanTheListHolds)
{
    using List = MakeTypeList<float, double>::Type;
    EXPECT_EQ((Dispatched<PairFactory, 2, List>({tessel::eDT_8U, tessel::eDT_64R}, false)),
              (Types{tessel::eDT_8U, tessel::eDT_64R}));
    ExpectError(
        [] {
            Dispatched<PairFactory, 2, List>({tessel::eDT_8U, tessel::eDT_8U}, false);
        },
        kInvalid, 175, "int N = 2");
}

TEST(ExtendDispatchTypes, ServesOneDimensionAndThree)
{
    EXPECT_EQ((Dispatched<Factory1Template<Single, IProduct>, 1>({tessel::eDT_64U}, false)),
              (Types{tessel::eDT_64U}));

    using List = MakeTypeList<char, float>::Type;
    const Types oTypes = {tessel::eDT_32R, tessel::eDT_8S, tessel::eDT_32R};
    const std::unique_ptr<IProduct> poProduct(
        ExtendDispatchTypes<FactoryOfThree, 3, List, List, NullDataType>::Dispatch(oTypes, false));
    EXPECT_EQ(poProduct->GetTypes(), oTypes);
}

TEST(DispatchTypePair, TakesInputThenOutput)
{
    const std::unique_ptr<IProduct> poProduct(
        DispatchTypePair<PairFactory>(tessel::eDT_8U, tessel::eDT_C64R, true));
    EXPECT_EQ(poProduct->GetTypes(), (Types{tessel::eDT_8U, tessel::eDT_64R}));
}

}  // namespace
}  // namespace kor::typedispatch
