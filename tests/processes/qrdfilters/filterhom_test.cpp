#include "processes/qrdfilters/filterhom.h"

#include <gtest/gtest.h>

#include <cmath>
#include <limits>
#include <string>
#include <vector>

#include "platform/exception/exception.h"
#include "processes/qrdfilters/hardened.h"
#include "processes/qrdfilters/sampleconversion.h"
#include "tests/support/blocks.h"
#include "tests/support/exceptions.h"

namespace kor::filters
{
namespace
{

using namespace kor::test;

FilterHOM FilterOf(std::vector<int> vnTable)
{
    FilterHOM oFilter;
    oFilter.SetMeanMode(std::move(vnTable));
    return oFilter;
}

template <class TOut, class TIn>
Image<TOut> Mapped(const FilterHOM& oFilter, const Image<TIn>& oImage, Margins oMargins = {})
{
    const auto poIn = RasterOf(oImage, oMargins);
    const auto poOut = BlankRaster(poIn->mnWidth, poIn->mnHeight, 1,
                                   typedispatch::RealDataType<TOut>(), Margins{1, 2});
    oFilter.Process(poIn.get(), nullptr, poOut.get());
    return ImageOf<TOut>(*poOut);
}

using U8 = std::uint8_t;

TEST(FilterHOM, PutsTheTablesValueInThePlaceOfEachSample)
{
    const Image<U8> oImage = {{9, 9, 9, 9}, {9, 0, 2, 9}, {9, 1, 1, 9}, {9, 9, 9, 9}};
    EXPECT_EQ(Mapped<short>(FilterOf({300, 7, -10000}), oImage, Margins{1, 1}),
              (Image<short>{{300, -9999}, {7, 7}}));
}

TEST(FilterHOM, CutsSamplesToIndices)
{
    const FilterHOM oFilter = FilterOf({5, 6, 7});
    EXPECT_EQ(Mapped<U8>(oFilter, Image<float>{{0.9F, 1.99F, 2.5F, -0.9F}}),
              (Image<U8>{{5, 6, 7, 5}}));
    EXPECT_EQ(Mapped<U8>(oFilter, Image<double>{{2.9999, -0.5}}), (Image<U8>{{7, 5}}));
    // The low 32 bits.
    EXPECT_EQ(Mapped<U8>(oFilter, Image<int64>{{4294967297, 2, -4294967295}}),
              (Image<U8>{{6, 7, 6}}));
}

TEST(FilterHOM, GivesZeroOutsideTheTable)
{
    const FilterHOM oFilter = FilterOf({5, 6, 7});
    constexpr float kNaN = std::numeric_limits<float>::quiet_NaN();
    EXPECT_EQ(Mapped<U8>(oFilter, Image<short>{{-1, 3, 2, -32768}}), (Image<U8>{{0, 0, 7, 0}}));
    EXPECT_EQ(Mapped<float>(oFilter, Image<float>{{-1, 3, kNaN, 1e20F, -1e20F, 2}}),
              (Image<float>{{0, 0, 0, 0, 0, 7}}));
    EXPECT_EQ(Mapped<U8>(oFilter, Image<unsigned int>{{4294967295U, 2147483648U, 1}}),
              (Image<U8>{{0, 0, 6}}));
    EXPECT_EQ(Mapped<U8>(FilterHOM(), Image<U8>{{0, 1}}), (Image<U8>{{0, 0}}));
}

// value + 0.5 is cut toward 0, which takes negative values up by 1, and clamped.
TEST(FilterHOM, AddsAHalfBeforeItCutsIntegers)
{
    const FilterHOM oFilter = FilterOf({-3, -1, 300, -70000, 2147483647});
    const Image<U8> oImage = {{0, 1, 2, 3, 4}};
    EXPECT_EQ(Mapped<U8>(oFilter, oImage), (Image<U8>{{0, 0, 255, 0, 255}}));
    EXPECT_EQ(Mapped<short>(oFilter, oImage), (Image<short>{{-2, 0, 300, -32768, 32767}}));
    EXPECT_EQ(Mapped<int>(oFilter, oImage), (Image<int>{{-2, 0, 300, -69999, 2147483647}}));
    EXPECT_EQ(Mapped<int64>(oFilter, oImage), (Image<int64>{{-2, 0, 300, -69999, 2147483647}}));
    EXPECT_EQ(Mapped<uint64>(oFilter, oImage), (Image<uint64>{{0, 0, 300, 0, 2147483647}}));
    EXPECT_EQ(Mapped<double>(oFilter, oImage), (Image<double>{{-3, -1, 300, -70000, 2147483647}}));
    EXPECT_EQ(Mapped<float>(oFilter, oImage), (Image<float>{{-3, -1, 300, -70000, 2147483648.0F}}));
}

TEST(FilterHOM, ReadsAndWritesTheFirstOfSeveralChannels)
{
    const auto poIn = RasterOf(Image<U8>{{0, 9, 1, 9, 2, 9}}, {}, 2);
    const auto poOut = BlankRaster(3, 1, 3, tessel::eDT_8U);
    FilterOf({5, 6, 7}).Process(poIn.get(), nullptr, poOut.get());
    EXPECT_EQ(ImageOf<U8>(*poOut), (Image<U8>{{5, 0xA5, 0xA5, 6, 0xA5, 0xA5, 7, 0xA5, 0xA5}}));
}

// A channel that is not there reads 0 and is not written.
TEST(FilterHOM, TakesBlocksWithoutPixelsOrChannels)
{
    const FilterHOM oFilter = FilterOf({5, 6, 7});
    const auto poNone = BlankRaster(3, 2, 0, tessel::eDT_64R);
    const auto poOut = BlankRaster(3, 2, 1, tessel::eDT_8U);
    oFilter.Process(poNone.get(), nullptr, poOut.get());
    EXPECT_EQ(ImageOf<U8>(*poOut), (Image<U8>{{5, 5, 5}, {5, 5, 5}}));
    oFilter.Process(poOut.get(), nullptr, poNone.get());
    const auto poNoPixels = BlankRaster(0, 2, 1, tessel::eDT_8U, Margins{1, 1});
    oFilter.Process(poNoPixels.get(), nullptr, poNoPixels.get());
    EXPECT_TRUE(SameBits(*poNoPixels, *BlankRaster(0, 2, 1, tessel::eDT_8U, Margins{1, 1})));
}

TEST(FilterHOM, TakesTheRealPartOfComplexSamples)
{
    const auto poIn = BlankRaster(2, 1, 1, tessel::eDT_C16S);
    const short anIn[] = {1, 9, 0, 9};
    std::copy_n(anIn, 4, poIn->GetPixelAs<short>(0, 0));
    const auto poOut = BlankRaster(2, 1, 1, tessel::eDT_C32R);
    std::fill_n(poOut->GetPixelAs<float>(0, 0), 4, -1.0F);
    FilterOf({5, 6}).Process(poIn.get(), nullptr, poOut.get());
    const float* const pOut = poOut->GetPixelAs<float>(0, 0);
    EXPECT_EQ((std::vector<float>(pOut, pOut + 4)), (std::vector<float>{6, -1, 5, -1}));
}

TEST(FilterHOM, DoesNotLookAtTheMask)
{
    const auto poIn = RasterOf(Image<U8>{{0, 1}});
    const auto poOut = BlankRaster(2, 1, 1, tessel::eDT_8U);
    const auto poMask = MaskOf({{0, 0}});
    FilterOf({5, 6}).Process(poIn.get(), poMask.get(), poOut.get());
    EXPECT_EQ(ImageOf<U8>(*poOut), (Image<U8>{{5, 6}}));
}

TEST(FilterHOM, KeepsTheTableOfItsFirstBlockAndSharesItWithCopies)
{
    FilterHOM oFilter = FilterOf({5});
    const Image<U8> oImage = {{0}};
    EXPECT_EQ(Mapped<U8>(oFilter, oImage), (Image<U8>{{5}}));
    oFilter.SetMeanMode({8});
    EXPECT_EQ(Mapped<U8>(oFilter, oImage), (Image<U8>{{5}}));
    const FilterHOM oCopy(oFilter);
    EXPECT_EQ(Mapped<U8>(oCopy, oImage), (Image<U8>{{5}}));
    EXPECT_EQ(Mapped<short>(oFilter, oImage), (Image<short>{{8}}));
    EXPECT_EQ(Mapped<U8>(oFilter, oImage), (Image<U8>{{8}}));
}

void ExpectRefused(tessel::Raster* poIn, tessel::Raster* poOut, const std::string& oMessage)
{
    try
    {
        FilterHOM().Process(poIn, nullptr, poOut);
        FAIL() << "threw nothing";
    }
    catch (const Exception& oException)
    {
        EXPECT_EQ(oException.GetMessage(), oMessage);
        EXPECT_EQ(oException.GetFile(), "processes/qrdfilters/filterhom");
        EXPECT_NE(oException.GetFunction().find("kor::filters::FilterHOM::Process("),
                  std::string::npos);
        EXPECT_GT(oException.GetLine(), 0U);
    }
}

TEST(FilterHOM, RefusesRastersThatAreNotThereAndBits)
{
    const auto poRaster = BlankRaster(1, 1, 1, tessel::eDT_8U);
    const auto poBits = BlankRaster(1, 1, 1, tessel::eDT_BIT);
    ExpectRefused(nullptr, nullptr, "poRasterIn is invalid pointer");
    ExpectRefused(poRaster.get(), nullptr, "poRasterOut is invalid pointer");
    const auto oMessage = [](tessel::Raster* poIn, tessel::Raster* poOut)
    { return MessageOf<Exception>([=] { FilterHOM().Process(poIn, nullptr, poOut); }); };
    EXPECT_EQ(oMessage(poBits.get(), poRaster.get()), "Invalid type to dispatch.");
    EXPECT_EQ(oMessage(poRaster.get(), poBits.get()), "Invalid type to dispatch.");
    EXPECT_EQ(poRaster->mpBuffer[0], 0xA5);
    if constexpr (kHardened)
    {
        const auto poLarger = BlankRaster(2, 3, 1, tessel::eDT_8U);
        EXPECT_EQ(oMessage(poLarger.get(), poRaster.get()),
                  "poRasterOut has 1 x 1 pixels, poRasterIn 2 x 3 pixels");
    }
}

TEST(HOMAlgorithm, RefusesBlocksBeforeItsValuesAreSet)
{
    const auto poRaster = BlankRaster(1, 1, 1, tessel::eDT_8U);
    try
    {
        HOMAlgorithm().ProcessBlock(poRaster.get(), poRaster.get());
        FAIL() << "threw nothing";
    }
    catch (const Exception& oException)
    {
        EXPECT_EQ(oException.GetMessage(), "You have to Set the values before calling Process.");
        EXPECT_EQ(oException.GetFile(), "processes/qrdfilters/filterhom");
        EXPECT_NE(oException.GetFunction().find("HOMAlgorithm::ProcessBlock("), std::string::npos);
        EXPECT_GT(oException.GetLine(), 0U);
    }
}

TEST(HOMAlgorithm, TakesNewValues)
{
    HOMAlgorithm oAlgorithm;
    const auto poIn = RasterOf(Image<U8>{{0, 1}});
    const auto poOut = BlankRaster(2, 1, 1, tessel::eDT_8U);
    oAlgorithm.SetValues({5, 6});
    const HOMAlgorithm oCopy = oAlgorithm;
    oAlgorithm.ProcessBlock(poIn.get(), poOut.get());
    EXPECT_EQ(ImageOf<U8>(*poOut), (Image<U8>{{5, 6}}));
    oAlgorithm.SetValues({7, 8});
    oAlgorithm.ProcessBlock(poIn.get(), poOut.get());
    EXPECT_EQ(ImageOf<U8>(*poOut), (Image<U8>{{7, 8}}));
    oCopy.ProcessBlock(poIn.get(), poOut.get());
    EXPECT_EQ(ImageOf<U8>(*poOut), (Image<U8>{{5, 6}}));
}

// ---- The definition beside all pairs of types.

template <class TIn>
int ValueOf(TIn xIn, const std::vector<int>& vnTable)
{
    const auto x = static_cast<Arithmetic<TIn>>(xIn);
    if constexpr (std::is_floating_point_v<TIn>)
    {
        const double df = std::trunc(double{x});
        return df >= 0 && df < static_cast<double>(vnTable.size())
                   ? vnTable[static_cast<std::size_t>(df)]
                   : 0;
    }
    else
    {
        const int nIndex = static_cast<int>(x);
        return nIndex >= 0 && static_cast<std::size_t>(nIndex) < vnTable.size()
                   ? vnTable[static_cast<std::size_t>(nIndex)]
                   : 0;
    }
}

template <class TOut>
TOut Stored(int nValue)
{
    using A = Arithmetic<TOut>;
    if constexpr (std::is_floating_point_v<A>)
    {
        return static_cast<A>(nValue);
    }
    else
    {
        const double df = std::trunc(nValue + 0.5);
        constexpr auto kLowest = static_cast<double>(std::numeric_limits<A>::min());
        constexpr auto kHighest = static_cast<double>(std::numeric_limits<A>::max());
        return static_cast<TOut>(df <= kLowest    ? std::numeric_limits<A>::min()
                                 : df >= kHighest ? std::numeric_limits<A>::max()
                                                  : static_cast<A>(df));
    }
}

/// Half of the samples become indices that the table has; all are mapped.
template <class TIn, class TOut>
void MapByDefinition(const std::vector<int>& vnTable, const tessel::Raster& oIn,
                     const tessel::Raster& oOut, Random& oRandom)
{
    for (std::int64_t y = 0; y < oIn.mnHeight; ++y)
    {
        for (std::int64_t x = 0; x < oIn.mnWidth; ++x)
        {
            TIn& xIn = *oIn.GetPixelAs<TIn>(x, y);
            xIn = x % 2 == 0 ? static_cast<TIn>(oRandom() % 250) : xIn;
            *oOut.GetPixelAs<TOut>(x, y) = Stored<TOut>(ValueOf(xIn, vnTable));
        }
    }
}

template <class TIn, class TOut>
void CompareWithDefinition(const std::vector<int>& vnTable, std::uint32_t nWidth,
                           std::uint32_t nChannels, Random& oRandom)
{
    const tessel::DataType oOutType = typedispatch::RealDataType<TOut>();
    const auto poIn = RandomRaster(nWidth, 3, nChannels, typedispatch::RealDataType<TIn>(),
                                   Margins{1, 2}, Samples::Special, oRandom);
    const auto poActual = BlankRaster(nWidth, 3, 2, oOutType, Margins{2, 1});
    const auto poExpected = BlankRaster(nWidth, 3, 2, oOutType, Margins{2, 1});
    MapByDefinition<TIn, TOut>(vnTable, *poIn, *poExpected, oRandom);
    FilterOf(vnTable).Process(poIn.get(), nullptr, poActual.get());
    ASSERT_TRUE(SameBits(*poActual, *poExpected));
}

TEST(FilterHOM, FollowsTheDefinitionForAllPairsOfTypes)
{
    Random oRandom(41);
    std::vector<int> vnTable(200);
    for (int& n : vnTable)
    {
        n = RandomSample<int>(Samples::Ordinary, oRandom) >> (oRandom() % 32);
    }
    ForEachElementType(
        [&]<class TIn>()
        {
            ForEachElementType(
                [&]<class TOut>()
                {
                    CompareWithDefinition<TIn, TOut>(vnTable, 37, 2, oRandom);
                    CompareWithDefinition<TIn, TOut>(vnTable, 1030, 1, oRandom);
                });
        });
}

}  // namespace
}  // namespace kor::filters
