#include "processes/qrdfilters/filterclr.h"

#include <gtest/gtest.h>

#include <cmath>
#include <limits>
#include <optional>
#include <string>

#include "platform/datasources/basicreader.h"
#include "platform/datasources/basicwriter.h"
#include "platform/exception/exception.h"
#include "processes/qrdfilters/parallelio/filteriodriver.h"
#include "processes/qrdfilters/sampleconversion.h"
#include "tests/support/maskbuilders.h"
#include "tests/support/memorydataset.h"
#include "tests/support/threads.h"

namespace kor::filters
{
namespace
{

using namespace kor::test;
using tessel::Mask;
using tessel::Raster;

using Bytes = Image<std::uint8_t>;

/// A drawing of nChannels channels after it was cleared in place.
template <class T>
Image<T> Cleared(const std::vector<double>& vdfValues, const Image<T>& oImage,
                 std::uint32_t nChannels = 1, Mask* poMask = nullptr)
{
    const auto poRaster = RasterOf(oImage, {}, nChannels);
    FilterClr(vdfValues).Process(nullptr, poMask, poRaster.get());
    return ImageOf<T>(*poRaster);
}

/// A drawing filtered into samples of type TOut.
template <class TOut, class TIn>
Image<TOut> Filtered(const std::vector<double>& vdfValues, const Image<TIn>& oImage,
                     const Image<int>& oMask)
{
    const auto poIn = RasterOf(oImage);
    const auto poOut = BlankRaster(poIn->mnWidth, poIn->mnHeight, 1,
                                   typedispatch::RealDataType<TOut>(), Margins{1, 2});
    FilterClr(vdfValues).Process(poIn.get(), MaskOf(oMask).get(), poOut.get());
    return ImageOf<TOut>(*poOut);
}

TEST(FilterClr, WithoutValuesGivesZeros)
{
    EXPECT_EQ(Cleared({}, Image<float>{{1.5F, 2.5F}, {3.5F, 4.5F}}),
              (Image<float>{{0.0F, 0.0F}, {0.0F, 0.0F}}));
}

TEST(FilterClr, OneValueCountsForAllChannels)
{
    EXPECT_EQ(Cleared({5}, Image<short>{{1, 2, 3, 4, 5, 6}}, 3),
              (Image<short>{{5, 5, 5, 5, 5, 5}}));
}

TEST(FilterClr, TheLastOfTooFewValuesRepeats)
{
    EXPECT_EQ(Cleared({1, 2}, Bytes{{9, 9, 9, 9, 9, 9, 9, 9}}, 4),
              (Bytes{{1, 2, 2, 2, 1, 2, 2, 2}}));
}

TEST(FilterClr, ValuesBehindTheLastChannelAreIgnored)
{
    EXPECT_EQ(Cleared({1, 2, 3}, Bytes{{9, 9, 9, 9}}, 2), (Bytes{{1, 2, 1, 2}}));
}

TEST(FilterClr, CutsValuesWithoutRounding)
{
    EXPECT_EQ(Cleared({300.7, 3.9, -1, 255, std::nan("")}, Bytes{{9, 9, 9, 9, 9}}, 5),
              (Bytes{{255, 3, 0, 255, 0}}));
    EXPECT_EQ(Cleared({-3.9, -128.9, 127.5}, Image<char>{{9, 9, 9}}, 3),
              (Image<char>{{-3, -128, 127}}));
    EXPECT_EQ(Cleared({1e300, -1e300, 0.1}, Image<float>{{9, 9, 9}}, 3),
              (Image<float>{{std::numeric_limits<float>::max(),
                             std::numeric_limits<float>::lowest(), 0.1F}}));
    EXPECT_EQ(Cleared({-7.9, 1e30}, Image<int64>{{9, 9}}, 2),
              (Image<int64>{{-7, std::numeric_limits<int64>::max()}}));
}

// Bytes of 1 repeated make 257: a row of equal bytes is filled at once, others are copied.
TEST(FilterClr, FillsAlikeWhereAllBytesAreEqual)
{
    EXPECT_EQ(Cleared({257, 257}, Image<short>{{9, 9, 9, 9}}, 2),
              (Image<short>{{257, 257, 257, 257}}));
    EXPECT_EQ(Cleared({257, 256}, Image<short>{{9, 9, 9, 9}}, 2),
              (Image<short>{{257, 256, 257, 256}}));
}

// The reverse of what masks mean in other filters: the set bits are those that are cleared.
TEST(FilterClr, ClearsWhereTheMaskIsSetAndCopiesTheRest)
{
    EXPECT_EQ(Filtered<std::uint8_t>({7}, Bytes{{1, 2, 3}, {4, 5, 6}}, {{1, 0, 1}, {0, 0, 1}}),
              (Bytes{{7, 2, 7}, {4, 5, 7}}));
}

TEST(FilterClr, CutsTheInputsSamplesByTheSameRule)
{
    EXPECT_EQ(
        Filtered<std::uint8_t>({7}, Image<float>{{2.9F, -4.5F, 300.0F, 1.0F}}, {{0, 0, 0, 1}}),
        (Bytes{{2, 0, 255, 7}}));
    EXPECT_EQ(Filtered<int64>({7}, Image<short>{{-5, 5}}, {{0, 0}}), (Image<int64>{{-5, 5}}));
    EXPECT_EQ(Filtered<char>({7}, Image<int64>{{-1, -1000, 1000}}, {{0, 0, 0}}),
              (Image<char>{{-1, -128, 127}}));
    EXPECT_EQ(Filtered<uint64>({7}, Image<int64>{{9007199254740993, -1}}, {{0, 0}}),
              (Image<uint64>{{9007199254740993U, 0U}}));
}

TEST(FilterClr, WithoutInputKeepsTheOutputWhereTheMaskIsClear)
{
    const auto poMask = MaskOf({{1, 0, 1}});
    EXPECT_EQ(Cleared({7, 8}, Bytes{{1, 2, 3, 4, 5, 6}}, 2, poMask.get()),
              (Bytes{{7, 8, 3, 4, 7, 8}}));
}

TEST(FilterClr, LeavesMarginsAlone)
{
    const auto poRaster = RasterOf(
        Bytes{
            {1, 1, 1, 1},
            {1, 5, 6, 1},
            {1, 1, 1, 1},
        },
        Margins{1, 1});
    FilterClr({0.0}).Process(nullptr, nullptr, poRaster.get());
    EXPECT_TRUE(SameBits(*poRaster, *RasterOf(
                                        Bytes{
                                            {1, 1, 1, 1},
                                            {1, 0, 0, 1},
                                            {1, 1, 1, 1},
                                        },
                                        Margins{1, 1})));
}

TEST(FilterClr, KeepsTheValuesThatItsProcessorWasMadeWith)
{
    const auto poBytes = BlankRaster(2, 1, 1, tessel::eDT_8U);
    const auto poShorts = BlankRaster(2, 1, 1, tessel::eDT_16S);
    FilterClr oFilter({1});
    oFilter.Process(nullptr, nullptr, poBytes.get());
    oFilter.SetValues({2});
    oFilter.Process(nullptr, nullptr, poBytes.get());
    EXPECT_EQ(ImageOf<std::uint8_t>(*poBytes), (Bytes{{1, 1}}));
    oFilter.Process(nullptr, nullptr, poShorts.get());
    EXPECT_EQ(ImageOf<short>(*poShorts), (Image<short>{{2, 2}}));
}

TEST(FilterClr, FillsBlocksOfAnyWidthAndPixelSize)
{
    for (const std::uint32_t nChannels : {1U, 3U, 5U, 600U})
    {
        for (const std::uint32_t nWidth : {1U, 2U, 511U, 700U})
        {
            std::vector<double> vdfValues(nChannels);
            for (std::uint32_t c = 0; c < nChannels; ++c)
            {
                vdfValues[c] = 3 * c - 100.0;
            }
            const auto poRaster = BlankRaster(nWidth, 2, nChannels, tessel::eDT_64R, Margins{1, 1});
            const auto poExpected =
                BlankRaster(nWidth, 2, nChannels, tessel::eDT_64R, Margins{1, 1});
            for (std::uint32_t i = 0; i < 2 * nWidth; ++i)
            {
                std::copy(vdfValues.begin(), vdfValues.end(),
                          poExpected->GetPixelAs<double>(i % nWidth, i / nWidth));
            }
            FilterClr(vdfValues).Process(nullptr, nullptr, poRaster.get());
            ASSERT_TRUE(SameBits(*poRaster, *poExpected)) << nChannels << ' ' << nWidth;
        }
    }
}

/// The rule of the filter for one sample, written plainly.
template <class TIn, class TOut>
TOut CutByDefinition(TIn x)
{
    if constexpr (std::is_same_v<TIn, TOut>)
    {
        return x;
    }
    else if constexpr (std::is_floating_point_v<TOut>)
    {
        if constexpr (std::is_same_v<TIn, double>)
        {
            constexpr double kLimit = 3.4028234663852886e+38;
            return static_cast<TOut>(x < -kLimit ? -kLimit : x >= kLimit ? kLimit : x);
        }
        else if constexpr (std::is_same_v<TIn, uint64>)
        {
            const auto nSigned = static_cast<int64>(x);
            const TOut fSigned = static_cast<TOut>(nSigned);
            return nSigned < 0 ? fSigned + TOut(18446744073709551616.0) : fSigned;
        }
        else
        {
            return static_cast<TOut>(static_cast<Arithmetic<TIn>>(x));
        }
    }
    else
    {
        // 80 bits hold all samples and all limits.
        using Limits = std::numeric_limits<Arithmetic<TOut>>;
        static_assert(std::numeric_limits<long double>::digits >= 64);
        const auto dfX = static_cast<long double>(static_cast<Arithmetic<TIn>>(x));
        return std::isnan(dfX)                                 ? TOut(0)
               : dfX < static_cast<long double>(Limits::min()) ? static_cast<TOut>(Limits::min())
               : dfX >= static_cast<long double>(Limits::max())
                   ? static_cast<TOut>(Limits::max())
                   : static_cast<TOut>(static_cast<Arithmetic<TOut>>(dfX));
    }
}

template <class TIn, class TOut>
void ClearByDefinition(const std::vector<double>& vdfValues, const Raster& oIn, const Mask* poMask,
                       const Raster& oOut)
{
    const std::size_t nValues = vdfValues.size();
    for (std::uint32_t y = 0; y < oOut.mnHeight; ++y)
    {
        for (std::uint32_t x = 0; x < oOut.mnWidth; ++x)
        {
            for (std::uint32_t c = 0; c < oOut.mnChannels; ++c)
            {
                const double dfValue =
                    nValues == 0 ? 0.0 : vdfValues[c < nValues ? c : nValues - 1];
                oOut.GetPixelAs<TOut>(x, y)[c] =
                    IsValid(poMask, x, y)
                        ? CutByDefinition<double, TOut>(dfValue)
                        : CutByDefinition<TIn, TOut>(oIn.GetPixelAs<TIn>(x, y)[c]);
            }
        }
    }
}

TEST(FilterClr, WorksOnAllPairsOfTypesByTheDefinition)
{
    Random oRandom(42);
    const std::vector<double> vdfValues = {-300.75, 1e12, std::nan("")};
    const auto oPair = [&]<class TIn, class TOut>()
    {
        const FilterClr oFilter(vdfValues);
        for (std::uint32_t nChannels = 1; nChannels <= 4; ++nChannels)
        {
            const std::uint32_t nWidth = nChannels == 2 ? 1 : 37;
            const std::uint32_t nHeight = nChannels == 3 ? 1 : 7;
            const auto poIn =
                RandomRaster(nWidth, nHeight, nChannels, typedispatch::RealDataType<TIn>(),
                             Margins{2, 1}, Samples::Special, oRandom);
            const auto poMask = RandomMask(nWidth, nHeight, Margins{2, 1}, 0.4, oRandom);
            for (Mask* const poEachMask : {static_cast<Mask*>(nullptr), poMask.get()})
            {
                const auto oType = typedispatch::RealDataType<TOut>();
                const auto poOut = BlankRaster(nWidth, nHeight, nChannels, oType, Margins{1, 3});
                const auto poExpected =
                    BlankRaster(nWidth, nHeight, nChannels, oType, Margins{1, 3});
                oFilter.Process(poIn.get(), poEachMask, poOut.get());
                ClearByDefinition<TIn, TOut>(vdfValues, *poIn, poEachMask, *poExpected);
                ASSERT_TRUE(SameBits(*poOut, *poExpected)) << nChannels << " channels";
            }
        }
    };
    ForEachElementType(
        [&]<class TIn>()
        { ForEachElementType([&]<class TOut>() { oPair.template operator()<TIn, TOut>(); }); });
}

TEST(FilterClr, GivesTheSameOnAnyNumberOfThreads)
{
    Random oRandom(4);
    const auto poIn =
        RandomRaster(13, 301, 2, tessel::eDT_16U, Margins{1, 0}, Samples::Ordinary, oRandom);
    const auto poMask = RandomMask(13, 301, Margins{1, 0}, 0.5, oRandom);
    const auto poExpected = BlankRaster(13, 301, 2, tessel::eDT_8U);
    ClearByDefinition<unsigned short, unsigned char>({3, 4}, *poIn, poMask.get(), *poExpected);
    for (const int nThreads : {1, 2, 5})
    {
        const ThreadCount oThreads(nThreads);
        const auto poOut = BlankRaster(13, 301, 2, tessel::eDT_8U);
        FilterClr({3, 4}).Process(poIn.get(), poMask.get(), poOut.get());
        EXPECT_TRUE(SameBits(*poOut, *poExpected)) << nThreads << " threads";
    }
}

TEST(FilterClr, TakesBlocksWithoutPixelsOrChannels)
{
    const auto poOut = BlankRaster(0, 3, 1, tessel::eDT_8U, Margins{1, 1});
    FilterClr({1}).Process(nullptr, nullptr, poOut.get());
    EXPECT_TRUE(SameBits(*poOut, *BlankRaster(0, 3, 1, tessel::eDT_8U, Margins{1, 1})));
    FilterClr({1}).Process(nullptr, nullptr, BlankRaster(3, 3, 0, tessel::eDT_64R).get());
    FilterClr({1, 2}).Process(nullptr, MaskOf({{1, 0, 1}}).get(),
                              BlankRaster(3, 1, 0, tessel::eDT_32S).get());
}

/// The exception of a call.
std::optional<Exception> ErrorOf(Raster* poIn, Raster* poOut)
{
    try
    {
        FilterClr({1}).Process(poIn, nullptr, poOut);
    }
    catch (const Exception& oError)
    {
        return oError;
    }
    return std::nullopt;
}

TEST(FilterClr, RefusesANullOutput)
{
    const auto oError = ErrorOf(nullptr, nullptr);
    ASSERT_TRUE(oError);
    EXPECT_EQ(oError->GetMessage(), "poRasterOut is NULL");
    EXPECT_EQ(oError->GetFile(), "processes/qrdfilters/filterclr");
    EXPECT_NE(oError->GetFunction().find("FilterClr::Process("), std::string::npos);
    EXPECT_NE(oError->GetLine(), 0U);
}

TEST(FilterClr, RefusesTypesThatItHasNoProcessorFor)
{
    for (const tessel::DataType& oType : {tessel::eDT_C32R, tessel::eDT_BIT})
    {
        const auto poOut = BlankRaster(8, 1, 1, oType);
        const auto oError = ErrorOf(nullptr, poOut.get());
        ASSERT_TRUE(oError);
        EXPECT_EQ(oError->GetMessage(), "Invalid type requested.");
        EXPECT_EQ(*poOut->mpBuffer, 0xA5);
    }
}

TEST(CLRAlgorithm, AsksForValuesFirst)
{
    const auto poOut = BlankRaster(2, 1, 1, tessel::eDT_8U);
    AboveMaskBuilder oBuilder(0);
    CLRAlgorithm oAlgorithm;
    oAlgorithm.SetMaskBuilder(&oBuilder);
    try
    {
        oAlgorithm.ProcessBlock(poOut.get(), poOut.get());
        FAIL() << "nothing was thrown";
    }
    catch (const Exception& oError)
    {
        EXPECT_EQ(oError.GetMessage(), "You have to Set the values before calling Process.");
        EXPECT_EQ(oError.GetFile(), "processes/qrdfilters/filterclr");
        EXPECT_NE(oError.GetFunction().find("CLRAlgorithm::ProcessBlock("), std::string::npos);
    }
    EXPECT_THROW(oAlgorithm.Process(poOut.get(), nullptr, poOut.get()), Exception);
    EXPECT_EQ(oBuilder.mnCalls, 0);
}

TEST(CLRAlgorithm, ClearsByTheMaskOfItsBuilder)
{
    const auto poIn = RasterOf(Bytes{{1, 9, 2}});
    const auto poOut = BlankRaster(3, 1, 1, tessel::eDT_8U);
    AboveMaskBuilder oBuilder(5);
    CLRAlgorithm oAlgorithm;
    oAlgorithm.SetValues({7});
    oAlgorithm.ProcessBlock(poIn.get(), poOut.get());
    EXPECT_EQ(ImageOf<std::uint8_t>(*poOut), (Bytes{{7, 7, 7}}));
    oAlgorithm.SetMaskBuilder(&oBuilder);
    oAlgorithm.ProcessBlock(poIn.get(), poOut.get());
    EXPECT_EQ(ImageOf<std::uint8_t>(*poOut), (Bytes{{1, 7, 2}}));
    // Without an input there is nothing to make a mask of.
    oAlgorithm.ProcessBlock(nullptr, poOut.get());
    EXPECT_EQ(ImageOf<std::uint8_t>(*poOut), (Bytes{{7, 7, 7}}));
    EXPECT_EQ(oBuilder.mnCalls, 1);
}

TEST(CLRAlgorithm, TakesNewValuesByANewFilterAndSharesItWithCopies)
{
    const auto poOut = BlankRaster(2, 1, 1, tessel::eDT_8U);
    CLRAlgorithm oAlgorithm;
    oAlgorithm.SetValues({1});
    oAlgorithm.ProcessBlock(nullptr, poOut.get());
    const CLRAlgorithm oCopy(oAlgorithm);
    oAlgorithm.SetValues({2});
    oAlgorithm.ProcessBlock(nullptr, poOut.get());
    EXPECT_EQ(ImageOf<std::uint8_t>(*poOut), (Bytes{{2, 2}}));
    oCopy.ProcessBlock(nullptr, poOut.get());
    EXPECT_EQ(ImageOf<std::uint8_t>(*poOut), (Bytes{{1, 1}}));
}

TEST(CLRAlgorithm, RunsOverAnImageByTheDriver)
{
    MemoryDataset oFrom(5, 4, {tessel::eDT_8U});
    MemoryDataset oTo(5, 4, {tessel::eDT_16S});
    for (std::size_t i = 0; i < 20; ++i)
    {
        oFrom.Sample<std::uint8_t>(1, i % 5, i / 5) = static_cast<std::uint8_t>(i);
    }
    datasources::BasicReader oReader(&oFrom, {1});
    datasources::BasicWriter oWriter(&oTo, {1});
    AboveMaskBuilder oBuilder(9);
    parallelio::FilterIODriver<CLRAlgorithm> oDriver;
    oDriver.SetValues({-1});
    oDriver.SetMaskBuilder(&oBuilder);
    oDriver.SetMemoryBudget(32);  // strips of one row
    oDriver.Run(&oReader, &oWriter);
    for (std::size_t i = 0; i < 20; ++i)
    {
        EXPECT_EQ(oTo.Sample<short>(1, i % 5, i / 5), i > 9 ? -1 : static_cast<short>(i));
    }
    EXPECT_EQ(oBuilder.mnCalls, 4);
}

}  // namespace
}  // namespace kor::filters
