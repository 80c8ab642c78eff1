#include "processes/qrdfilters/convertraster.h"

#include <gtest/gtest.h>

#include <array>
#include <memory>
#include <string>
#include <vector>

#include "platform/exception/exception.h"
#include "processes/qrdfilters/hardened.h"
#include "tests/support/conversionreference.h"

namespace kor::filters
{
namespace
{

using tessel::DataType;
using tessel::Raster;
using test::BlankRaster;
using test::ComplexElementType;
using test::ConversionSamples;
using test::Converted;
using test::Elements;
using test::ElementType;
using test::ForEachTypePair;
using test::kElementTypes;
using test::Margins;
using test::Random;
using test::RandomRaster;
using test::ReferenceConversion;
using test::ReferenceIntensity;
using test::SameElements;
using test::Samples;
using typedispatch::DualDispatch;

/// The samples of the whole buffer, margins included and parts one by one.
template <class T>
std::vector<T> AllSamples(const Raster& oRaster)
{
    const T* pFirst = reinterpret_cast<const T*>(oRaster.mpBuffer);
    return std::vector<T>(pFirst, pFirst + oRaster.mnBufferSize / sizeof(T));
}

/// The same of element type nType.
Elements ElementsOf(const Raster& oRaster, std::size_t nType)
{
    Elements oElements(nType, oRaster.mnBufferSize / ElementType(nType).GetSampleBytes());
    std::memcpy(oElements.Data(), oRaster.mpBuffer, oRaster.mnBufferSize);
    return oElements;
}

template <class T>
std::unique_ptr<Raster> FlatRaster(const std::vector<T>& vElements, std::uint32_t nChannels,
                                   const DataType& oType)
{
    const auto nWidth = static_cast<std::uint32_t>(vElements.size() * sizeof(T) /
                                                   (oType.GetSampleBytes() * nChannels));
    auto poRaster = BlankRaster(nWidth, 1, nChannels, oType);
    std::memcpy(poRaster->mpBuffer, vElements.data(), poRaster->mnBufferSize);
    return poRaster;
}

/// A conversion of each family that somebody outside makes without a dispatch.
TEST(ConvertTo, MayBeCalledByItself)
{
    const std::array<double, 4> adfIn = {2.5, -2.5, 127.4, 1000};
    std::array<char, 4> anOut{};
    ConvertTo<double, char>()(adfIn.data(), anOut.data(), 3);
    EXPECT_EQ(anOut, (std::array<char, 4>{3, -3, 127, 0}));
}

TEST(ConvertTo, CopiesEqualTypes)
{
    const std::array<unsigned short, 3> anIn = {1, 65535, 7};
    std::array<unsigned short, 3> anOut{};
    ConvertTo<unsigned short, unsigned short>()(anIn.data(), anOut.data(), 3);
    EXPECT_EQ(anOut, anIn);
}

TEST(ConvertToComplex, ClearsRealPartsAndReadsNoInput)
{
    std::array<float, 6> afOut = {1, 2, 3, 4, 5, 6};
    ConvertToComplex<int, float>()(nullptr, afOut.data(), 2);
    EXPECT_EQ(afOut, (std::array<float, 6>{0, 2, 0, 4, 5, 6}));
}

TEST(ConvertToIntensity, SumsTheSquaresOfEachPair)
{
    const std::array<short, 6> anIn = {3, -4, 100, 100, 1, 1};
    std::array<unsigned char, 3> anOut = {9, 9, 9};
    ConvertToIntensity<short, unsigned char>()(anIn.data(), anOut.data(), 2);
    EXPECT_EQ(anOut, (std::array<unsigned char, 3>{25, 32, 9}));  // 20000 - 78 * 256
}

/// What the family's conversion for a pair of types makes of pairs of random samples.
template <template <class, class> class Family>
Elements Made(std::size_t nIn, std::size_t nOut, const Elements& oIn, std::size_t nCount,
              std::size_t nElementsOut)
{
    const std::unique_ptr<IConvertTo> poMade(
        DualDispatch<Family>::Create(ElementType(nIn), ElementType(nOut)));
    Elements oOut(nOut, nElementsOut);
    (*poMade)(oIn.Data(), oOut.Data(), nCount);
    return oOut;
}

TEST(ConversionFamilies, AreMadeByDispatchForAllHundredPairs)
{
    Random oRandom(12);
    const auto oCompare = [&](std::size_t nIn, std::size_t nOut)
    {
        const Elements oIn = ConversionSamples(nIn, oRandom);
        const std::size_t nAll = oIn.Size();
        EXPECT_TRUE(SameElements(Made<ConvertTo>(nIn, nOut, oIn, nAll, nAll),
                                 Converted(ReferenceConversion(nIn, nOut), oIn, nOut, nAll)));
        EXPECT_TRUE(SameElements(Made<ConvertToIntensity>(nIn, nOut, oIn, nAll / 2, nAll / 2),
                                 Converted(ReferenceIntensity(nIn, nOut), oIn, nOut, nAll / 2)));
        Elements oCleared(nOut, 6);
        const std::size_t nBytes = ElementType(nOut).GetSampleBytes();
        std::memset(oCleared.Data(), 0, nBytes);
        std::memset(oCleared.Data() + 2 * nBytes, 0, nBytes);
        EXPECT_TRUE(SameElements(Made<ConvertToComplex>(nIn, nOut, oIn, 2, 6), oCleared));
    };
    ForEachTypePair(oCompare);
}

TEST(ConversionFamilies, DeriveFromTheirPlaceInTheDispatch)
{
    using Place = DualDispatch<ConvertTo>::FirstDataTypeHolder<int>::AssignSecondDataType<float>;
    EXPECT_TRUE((std::is_base_of_v<Place, ConvertTo<int, float>>));
    EXPECT_TRUE((std::is_base_of_v<IConvertTo, Place>));
}

TEST(ConvertRaster, ConvertsAllSamplesOfAllPairsOneByOne)
{
    Random oRandom(6);
    const auto oCompare = [&](std::size_t nIn, std::size_t nOut)
    {
        for (const bool bComplex : {false, true})
        {
            const DataType oTypeIn = bComplex ? ComplexElementType(nIn) : ElementType(nIn);
            const DataType oTypeOut = bComplex ? ComplexElementType(nOut) : ElementType(nOut);
            const auto poIn =
                RandomRaster(5, 4, 3, oTypeIn, Margins{2, 1}, Samples::Special, oRandom);
            const auto poOut = BlankRaster(5, 4, 3, oTypeOut, Margins{2, 1});
            ConvertRaster(poIn.get(), poOut.get());
            const Elements oIn = ElementsOf(*poIn, nIn);
            ASSERT_EQ(oIn.Size(), 9U * 6U * 3U * (bComplex ? 2U : 1U));
            EXPECT_TRUE(
                SameElements(ElementsOf(*poOut, nOut),
                             Converted(ReferenceConversion(nIn, nOut), oIn, nOut, oIn.Size())));
        }
    };
    ForEachTypePair(oCompare);
}

TEST(ConvertRaster, MakesChannelsOfThePartsAndPartsOfTheChannels)
{
    const std::vector<short> vParts = {1, -2, 3, -4, 5, -6};
    const auto poComplex = FlatRaster(vParts, 1, tessel::eDT_C16S);
    const auto poReal = BlankRaster(3, 1, 2, tessel::eDT_16S);
    ConvertRaster(poComplex.get(), poReal.get());
    EXPECT_EQ(AllSamples<short>(*poReal), vParts);

    const auto poBack = BlankRaster(3, 1, 1, tessel::eDT_C16S);
    ConvertRaster(poReal.get(), poBack.get());
    EXPECT_EQ(AllSamples<short>(*poBack), vParts);
}

TEST(ConvertRaster, ConvertsWhileItMakesChannelsOfParts)
{
    const auto poComplex = FlatRaster<float>({2.5F, -2.5F, 300.0F, -0.2F}, 1, tessel::eDT_C32R);
    const auto poReal = BlankRaster(2, 1, 2, tessel::eDT_8U);
    ConvertRaster(poComplex.get(), poReal.get());
    EXPECT_EQ(AllSamples<unsigned char>(*poReal), (std::vector<unsigned char>{3, 0, 255, 0}));

    const auto poBack = BlankRaster(2, 1, 1, tessel::eDT_C64R);
    ConvertRaster(poReal.get(), poBack.get());
    EXPECT_EQ(AllSamples<double>(*poBack), (std::vector<double>{3, 0, 255, 0}));
}

TEST(ConvertRaster, MakesChannelsOfThePartsOfManyChannelsAndOfEveryType)
{
    Random oRandom(8);
    for (std::size_t nType = 0; nType < kElementTypes; ++nType)
    {
        const auto poComplex = RandomRaster(3, 2, 3, ComplexElementType(nType), Margins{1, 1},
                                            Samples::Special, oRandom);
        const auto poReal = BlankRaster(3, 2, 6, ElementType(nType), Margins{1, 1});
        ConvertRaster(poComplex.get(), poReal.get());
        EXPECT_EQ(AllSamples<unsigned char>(*poReal), AllSamples<unsigned char>(*poComplex));
        const auto poBack = BlankRaster(3, 2, 3, ComplexElementType(nType), Margins{1, 1});
        ConvertRaster(poReal.get(), poBack.get());
        EXPECT_EQ(AllSamples<unsigned char>(*poBack), AllSamples<unsigned char>(*poComplex));
    }
}

TEST(ConvertRaster, GivesTheIntensityOfComplexSamplesOfOneChannel)
{
    const auto poIn = FlatRaster<float>({3, 4, 1, -2, 0.5F, 0}, 1, tessel::eDT_C32R);
    const auto poOut = BlankRaster(3, 1, 1, tessel::eDT_32R);
    ConvertRaster(poIn.get(), poOut.get());
    EXPECT_EQ(AllSamples<float>(*poOut), (std::vector<float>{25, 5, 0.25F}));
}

TEST(ConvertRaster, GivesTheIntensityForAllPairs)
{
    Random oRandom(9);
    const auto oCompare = [&](std::size_t nIn, std::size_t nOut)
    {
        const auto poIn = RandomRaster(9, 3, 1, ComplexElementType(nIn), Margins{1, 1},
                                       Samples::Special, oRandom);
        const auto poOut = BlankRaster(9, 3, 1, ElementType(nOut), Margins{1, 1});
        ConvertRaster(poIn.get(), poOut.get());
        EXPECT_TRUE(SameElements(
            ElementsOf(*poOut, nOut),
            Converted(ReferenceIntensity(nIn, nOut), ElementsOf(*poIn, nIn), nOut, 55)));
    };
    ForEachTypePair(oCompare);
}

// The channels are not counted: of two pixels of three channels, the first two samples.
TEST(ConvertRaster, GivesTheIntensityOfAsManySamplesAsThereArePixels)
{
    const auto poIn = FlatRaster<short>({1, 1, 2, 2, 3, 3, 4, 4, 5, 5, 6, 6}, 3, tessel::eDT_C16S);
    const auto poOut = BlankRaster(2, 1, 3, tessel::eDT_8U);
    ConvertRaster(poIn.get(), poOut.get());
    EXPECT_EQ(AllSamples<unsigned char>(*poOut),
              (std::vector<unsigned char>{2, 8, 0xA5, 0xA5, 0xA5, 0xA5}));
}

TEST(ConvertRaster, ClearsTheRealPartsOfAComplexOutputOfTheSameChannels)
{
    const auto poIn = FlatRaster<int>({7, 8, 9}, 1, tessel::eDT_32S);
    const auto poOut = FlatRaster<float>({1, 2, 3, 4, 5, 6}, 1, tessel::eDT_C32R);
    ConvertRaster(poIn.get(), poOut.get());
    EXPECT_EQ(AllSamples<float>(*poOut), (std::vector<float>{0, 2, 0, 4, 0, 6}));
}

// The channels are not counted here either: two pixels, two samples of the first pixel.
TEST(ConvertRaster, ClearsAsManyRealPartsAsThereArePixels)
{
    const auto poIn = BlankRaster(2, 1, 3, tessel::eDT_8U);
    const auto poOut =
        FlatRaster<short>({1, 2, 3, 4, 5, 6, 7, 8, 9, 10, 11, 12}, 3, tessel::eDT_C16S);
    ConvertRaster(poIn.get(), poOut.get());
    EXPECT_EQ(AllSamples<short>(*poOut),
              (std::vector<short>{0, 2, 0, 4, 5, 6, 7, 8, 9, 10, 11, 12}));
}

TEST(ConvertRaster, ClearsRealPartsForAllPairsAndAllMargins)
{
    const auto oCompare = [](std::size_t nIn, std::size_t nOut)
    {
        const auto poIn = BlankRaster(3, 2, 1, ElementType(nIn), Margins{1, 1});
        const auto poOut = BlankRaster(3, 2, 1, ComplexElementType(nOut), Margins{1, 1});
        ConvertRaster(poIn.get(), poOut.get());
        const std::size_t nBytes = ElementType(nOut).GetSampleBytes();
        for (std::size_t i = 0; i < poOut->mnBufferSize; ++i)
        {
            const bool bReal = i / nBytes % 2 == 0;
            ASSERT_EQ(poOut->mpBuffer[i], bReal ? 0 : 0xA5) << i << " of type " << nOut;
        }
    };
    ForEachTypePair(oCompare);
}

TEST(ConvertRaster, CountsTheSamplesOfTheInput)
{
    const auto poIn = FlatRaster<short>({1, 2, 3}, 1, tessel::eDT_16S);
    const auto poOut = BlankRaster(3, 1, 2, tessel::eDT_8U);
    ConvertRaster(poIn.get(), poOut.get());
    EXPECT_EQ(AllSamples<unsigned char>(*poOut),
              (std::vector<unsigned char>{1, 2, 3, 0xA5, 0xA5, 0xA5}));
}

TEST(ConvertRaster, DoesNothingWithEmptyBlocks)
{
    const auto poIn = BlankRaster(0, 3, 1, tessel::eDT_16S);
    const auto poOut = BlankRaster(0, 3, 1, tessel::eDT_64R);
    EXPECT_NO_THROW(ConvertRaster(poIn.get(), poOut.get()));
    const auto poComplex = BlankRaster(0, 3, 1, tessel::eDT_C16S);
    EXPECT_NO_THROW(ConvertRaster(poComplex.get(), poOut.get()));
    EXPECT_NO_THROW(ConvertRaster(poOut.get(), poComplex.get()));
}

void ExpectError(const Raster* poIn, Raster* poOut, const std::string& oMessage)
{
    try
    {
        ConvertRaster(poIn, poOut);
        ADD_FAILURE() << "the raster was converted";
    }
    catch (const Exception& oError)
    {
        EXPECT_EQ(oError.GetMessage(), oMessage);
        EXPECT_EQ(oError.GetFile(), "processes/qrdfilters/convertraster");
        EXPECT_EQ(oError.GetFunction(), "void ConvertRaster(const Raster*, Raster*)");
        EXPECT_GT(oError.GetLine(), 0U);
    }
}

TEST(ConvertRaster, RefusesTypesWithoutSamplesAndWritesNothing)
{
    const DataType aoTypes[] = {tessel::eDT_BIT, DataType(32, false, true, 23, 8, false),
                                DataType(1, false, false, 1, 0, true)};
    const auto poReal = BlankRaster(2, 2, 1, tessel::eDT_8U);
    const auto poComplex = BlankRaster(2, 2, 1, tessel::eDT_C16U);
    for (const DataType& oType : aoTypes)
    {
        const auto poOther = BlankRaster(2, 2, 1, oType);
        for (Raster* poKnown : {poReal.get(), poComplex.get()})
        {
            const std::vector<unsigned char> vKnown = AllSamples<unsigned char>(*poKnown);
            const std::vector<unsigned char> vOther = AllSamples<unsigned char>(*poOther);
            ExpectError(poOther.get(), poKnown, "Invalid type to dispatch.");
            ExpectError(poKnown, poOther.get(), "Invalid type to dispatch.");
            EXPECT_EQ(AllSamples<unsigned char>(*poKnown), vKnown);
            EXPECT_EQ(AllSamples<unsigned char>(*poOther), vOther);
        }
    }
}

TEST(ConvertRaster, ChecksWhatTheCallerPromisesInHardenedBuilds)
{
    if (!kHardened)
    {
        GTEST_SKIP() << "not a hardened build";
    }
    const auto poIn = BlankRaster(3, 2, 2, tessel::eDT_8U);
    const auto poNarrow = BlankRaster(2, 2, 2, tessel::eDT_8U);
    const auto poFewer = BlankRaster(3, 2, 1, tessel::eDT_8U);
    const auto poNone = BlankRaster(3, 2, 0, tessel::eDT_C16U);
    ExpectError(nullptr, poIn.get(), "poIn is invalid pointer");
    ExpectError(poIn.get(), nullptr, "poOut is invalid pointer");
    ExpectError(poIn.get(), poNarrow.get(),
                "poOut has 2 x 2 pixels of 2 channels, margins included, poIn has 3 x 2 pixels of "
                "2 channels, margins included");
    ExpectError(poIn.get(), poFewer.get(),
                "poOut has 3 x 2 pixels of 1 channels, margins included, poIn has 3 x 2 pixels of "
                "2 channels, margins included");
    ExpectError(poIn.get(), poNone.get(),
                "poOut has 3 x 2 pixels of 0 channels, margins included, poIn has 3 x 2 pixels of "
                "2 channels, margins included");
}

}  // namespace
}  // namespace kor::filters
