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
using test::Margins;
using test::RandomRaster;
using typedispatch::ComplexDataType;
using typedispatch::DualDispatch;
using typedispatch::RealDataType;

/// The elements of the whole buffer, margins included.
template <class T>
std::vector<T> Elements(const Raster& oRaster)
{
    const T* pFirst = reinterpret_cast<const T*>(oRaster.mpBuffer);
    return std::vector<T>(pFirst, pFirst + oRaster.mnBufferSize / sizeof(T));
}

template <class T>
std::unique_ptr<Raster> RasterOf(const std::vector<T>& vElements, std::uint32_t nChannels,
                                 const DataType& oType)
{
    const auto nWidth = static_cast<std::uint32_t>(vElements.size() * sizeof(T) /
                                                   (oType.GetSampleBytes() * nChannels));
    auto poRaster = BlankRaster(nWidth, 1, nChannels, oType);
    std::memcpy(poRaster->mpBuffer, vElements.data(), poRaster->mnBufferSize);
    return poRaster;
}

template <class T>
::testing::AssertionResult SameElements(const Raster& oRaster, const std::vector<T>& vExpected)
{
    const std::vector<T> vElements = Elements<T>(oRaster);
    for (std::size_t i = 0; i < vExpected.size(); ++i)
    {
        if (!test::SameSample(vElements.at(i), vExpected[i]))
        {
            return ::testing::AssertionFailure()
                   << "element " << i << " is " << +vElements[i] << " and not " << +vExpected[i];
        }
    }
    return ::testing::AssertionSuccess();
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

template <class TIn, class TOut, template <class, class> class Family>
void ExpectMadeByDispatch()
{
    const std::unique_ptr<IConvertTo> poMade(
        DualDispatch<Family>::Create(RealDataType<TIn>(), RealDataType<TOut>()));
    ASSERT_NE(poMade, nullptr);
    const std::vector<TIn> vIn = {TIn(3), TIn(4), TIn(5), TIn(6)};
    std::vector<TOut> vOut(4, TOut(9));
    std::vector<TOut> vExpected(4, TOut(9));
    (*poMade)(vIn.data(), vOut.data(), 2);
    Family<TIn, TOut>()(vIn.data(), vExpected.data(), 2);
    EXPECT_EQ(vOut, vExpected);
    EXPECT_NE(vOut, std::vector<TOut>(4, TOut(9)));
}

TEST(ConversionFamilies, AreMadeByDispatchForAllHundredPairs)
{
    test::ForEachTypePair(
        []<class TIn, class TOut>()
        {
            ExpectMadeByDispatch<TIn, TOut, ConvertTo>();
            ExpectMadeByDispatch<TIn, TOut, ConvertToComplex>();
            ExpectMadeByDispatch<TIn, TOut, ConvertToIntensity>();
        });
}

TEST(ConversionFamilies, DeriveFromTheirPlaceInTheDispatch)
{
    using Place = DualDispatch<ConvertTo>::FirstDataTypeHolder<int>::AssignSecondDataType<float>;
    EXPECT_TRUE((std::is_base_of_v<Place, ConvertTo<int, float>>));
    EXPECT_TRUE((std::is_base_of_v<IConvertTo, Place>));
}

TEST(ConvertRaster, ConvertsRealSamplesOfAllPairsWithMarginsAndChannels)
{
    test::Random oRandom(6);
    const auto oCompare = [&]<class TIn, class TOut>()
    {
        const auto poIn = RandomRaster(5, 4, 3, RealDataType<TIn>(), Margins{2, 1},
                                       test::Samples::Special, oRandom);
        const auto poOut = BlankRaster(5, 4, 3, RealDataType<TOut>(), Margins{2, 1});
        ConvertRaster(poIn.get(), poOut.get());
        std::vector<TOut> vExpected;
        for (const TIn x : Elements<TIn>(*poIn))
        {
            vExpected.push_back(test::ReferenceSample<TIn, TOut>(x));
        }
        ASSERT_TRUE(SameElements(*poOut, vExpected));
    };
    test::ForEachTypePair(oCompare);
}

TEST(ConvertRaster, ConvertsThePartsOfComplexSamplesOneByOne)
{
    test::Random oRandom(7);
    const auto oCompare = [&]<class TIn, class TOut>()
    {
        const auto poIn = RandomRaster(5, 2, 2, ComplexDataType<TIn>(), Margins{1, 2},
                                       test::Samples::Special, oRandom);
        const auto poOut = BlankRaster(5, 2, 2, ComplexDataType<TOut>(), Margins{1, 2});
        ConvertRaster(poIn.get(), poOut.get());
        std::vector<TOut> vExpected;
        for (const TIn x : Elements<TIn>(*poIn))
        {
            vExpected.push_back(test::ReferenceSample<TIn, TOut>(x));
        }
        ASSERT_EQ(vExpected.size(), 7U * 6U * 4U);
        ASSERT_TRUE(SameElements(*poOut, vExpected));
    };
    test::ForEachTypePair(oCompare);
}

TEST(ConvertRaster, MakesChannelsOfThePartsAndPartsOfTheChannels)
{
    const std::vector<short> vParts = {1, -2, 3, -4, 5, -6};
    const auto poComplex = RasterOf(vParts, 1, tessel::eDT_C16S);
    const auto poReal = BlankRaster(3, 1, 2, tessel::eDT_16S);
    ConvertRaster(poComplex.get(), poReal.get());
    EXPECT_TRUE(SameElements(*poReal, vParts));

    const auto poBack = BlankRaster(3, 1, 1, tessel::eDT_C16S);
    ConvertRaster(poReal.get(), poBack.get());
    EXPECT_TRUE(SameElements(*poBack, vParts));
}

TEST(ConvertRaster, ConvertsWhileItMakesChannelsOfParts)
{
    const auto poComplex = RasterOf<float>({2.5F, -2.5F, 300.0F, -0.2F}, 1, tessel::eDT_C32R);
    const auto poReal = BlankRaster(2, 1, 2, tessel::eDT_8U);
    ConvertRaster(poComplex.get(), poReal.get());
    EXPECT_TRUE(SameElements(*poReal, std::vector<unsigned char>{3, 0, 255, 0}));

    const auto poBack = BlankRaster(2, 1, 1, tessel::eDT_C64R);
    ConvertRaster(poReal.get(), poBack.get());
    EXPECT_TRUE(SameElements(*poBack, std::vector<double>{3, 0, 255, 0}));
}

TEST(ConvertRaster, MakesChannelsOfThePartsOfManyChannelsAndOfEveryType)
{
    test::Random oRandom(8);
    test::ForEachElementType(
        [&]<class T>()
        {
            const auto poComplex = RandomRaster(3, 2, 3, ComplexDataType<T>(), Margins{1, 1},
                                                test::Samples::Special, oRandom);
            const auto poReal = BlankRaster(3, 2, 6, RealDataType<T>(), Margins{1, 1});
            ConvertRaster(poComplex.get(), poReal.get());
            ASSERT_TRUE(SameElements(*poReal, Elements<T>(*poComplex)));
            const auto poBack = BlankRaster(3, 2, 3, ComplexDataType<T>(), Margins{1, 1});
            ConvertRaster(poReal.get(), poBack.get());
            ASSERT_TRUE(SameElements(*poBack, Elements<T>(*poComplex)));
        });
}

TEST(ConvertRaster, GivesTheIntensityOfComplexSamplesOfOneChannel)
{
    const auto poIn = RasterOf<float>({3, 4, 1, -2, 0.5F, 0}, 1, tessel::eDT_C32R);
    const auto poOut = BlankRaster(3, 1, 1, tessel::eDT_32R);
    ConvertRaster(poIn.get(), poOut.get());
    EXPECT_TRUE(SameElements(*poOut, std::vector<float>{25, 5, 0.25F}));
}

TEST(ConvertRaster, GivesTheIntensityForAllPairs)
{
    test::Random oRandom(9);
    const auto oCompare = [&]<class TIn, class TOut>()
    {
        const auto poIn = RandomRaster(9, 3, 1, ComplexDataType<TIn>(), Margins{1, 1},
                                       test::Samples::Special, oRandom);
        const auto poOut = BlankRaster(9, 3, 1, RealDataType<TOut>(), Margins{1, 1});
        ConvertRaster(poIn.get(), poOut.get());
        const std::vector<TIn> vParts = Elements<TIn>(*poIn);
        std::vector<TOut> vExpected;
        for (std::size_t k = 0; k < vParts.size(); k += 2)
        {
            vExpected.push_back(test::ReferenceIntensity<TIn, TOut>(vParts[k], vParts[k + 1]));
        }
        ASSERT_EQ(vExpected.size(), 11U * 5U);
        ASSERT_TRUE(SameElements(*poOut, vExpected));
    };
    test::ForEachTypePair(oCompare);
}

// The channels are not counted: of two pixels of three channels, the first two samples.
TEST(ConvertRaster, GivesTheIntensityOfAsManySamplesAsThereArePixels)
{
    const auto poIn = RasterOf<short>({1, 1, 2, 2, 3, 3, 4, 4, 5, 5, 6, 6}, 3, tessel::eDT_C16S);
    const auto poOut = BlankRaster(2, 1, 3, tessel::eDT_8U);
    ConvertRaster(poIn.get(), poOut.get());
    EXPECT_TRUE(SameElements(*poOut, std::vector<unsigned char>{2, 8, 0xA5, 0xA5, 0xA5, 0xA5}));
}

TEST(ConvertRaster, ClearsTheRealPartsOfAComplexOutputOfTheSameChannels)
{
    const auto poIn = RasterOf<int>({7, 8, 9}, 1, tessel::eDT_32S);
    const auto poOut = RasterOf<float>({1, 2, 3, 4, 5, 6}, 1, tessel::eDT_C32R);
    ConvertRaster(poIn.get(), poOut.get());
    EXPECT_TRUE(SameElements(*poOut, std::vector<float>{0, 2, 0, 4, 0, 6}));
}

// The channels are not counted here either: two pixels, two samples of the first pixel.
TEST(ConvertRaster, ClearsAsManyRealPartsAsThereArePixels)
{
    const auto poIn = BlankRaster(2, 1, 3, tessel::eDT_8U);
    const auto poOut =
        RasterOf<short>({1, 2, 3, 4, 5, 6, 7, 8, 9, 10, 11, 12}, 3, tessel::eDT_C16S);
    ConvertRaster(poIn.get(), poOut.get());
    EXPECT_TRUE(SameElements(*poOut, std::vector<short>{0, 2, 0, 4, 5, 6, 7, 8, 9, 10, 11, 12}));
}

TEST(ConvertRaster, ClearsRealPartsForAllPairsAndAllMargins)
{
    test::Random oRandom(10);
    const auto oCompare = [&]<class TIn, class TOut>()
    {
        const auto poIn = BlankRaster(3, 2, 1, RealDataType<TIn>(), Margins{1, 1});
        const auto poOut = RandomRaster(3, 2, 1, ComplexDataType<TOut>(), Margins{1, 1},
                                        test::Samples::Special, oRandom);
        std::vector<TOut> vExpected = Elements<TOut>(*poOut);
        for (std::size_t k = 0; k < vExpected.size(); k += 2)
        {
            vExpected[k] = TOut(0);
        }
        ConvertRaster(poIn.get(), poOut.get());
        ASSERT_TRUE(SameElements(*poOut, vExpected));
    };
    test::ForEachTypePair(oCompare);
}

TEST(ConvertRaster, CountsTheSamplesOfTheInput)
{
    const auto poIn = RasterOf<short>({1, 2, 3}, 1, tessel::eDT_16S);
    const auto poOut = BlankRaster(3, 1, 2, tessel::eDT_8U);
    ConvertRaster(poIn.get(), poOut.get());
    EXPECT_TRUE(SameElements(*poOut, std::vector<unsigned char>{1, 2, 3, 0xA5, 0xA5, 0xA5}));
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
            const std::vector<unsigned char> vKnown = Elements<unsigned char>(*poKnown);
            const std::vector<unsigned char> vOther = Elements<unsigned char>(*poOther);
            ExpectError(poOther.get(), poKnown, "Invalid type to dispatch.");
            ExpectError(poKnown, poOther.get(), "Invalid type to dispatch.");
            EXPECT_EQ(Elements<unsigned char>(*poKnown), vKnown);
            EXPECT_EQ(Elements<unsigned char>(*poOther), vOther);
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
