#include "processes/qrdfilters/datacopy.h"

#include <gtest/gtest.h>

#include <memory>
#include <optional>
#include <string>

#include "platform/datasources/basicreader.h"
#include "platform/datasources/basicwriter.h"
#include "platform/exception/exception.h"
#include "processes/qrdfilters/hardened.h"
#include "processes/qrdfilters/parallelio/filteriodriver.h"
#include "processes/qrdfilters/validmaskbuilder.h"
#include "tests/support/conversionreference.h"
#include "tests/support/exceptions.h"
#include "tests/support/memorydataset.h"
#include "tests/support/threads.h"

namespace kor::filters
{
namespace
{

using tessel::DataType;
using tessel::Mask;
using tessel::Raster;
using test::BlankRaster;
using test::Image;
using test::ImageOf;
using test::Margins;
using test::MaskOf;
using test::Random;
using test::RandomRaster;
using test::RasterOf;
using test::SameBits;
using typedispatch::ComplexDataType;
using typedispatch::RealDataType;

using Bytes = Image<std::uint8_t>;

/// The exception that a copy throws.
std::optional<Exception> ErrorOf(Raster* poIn, Raster* poOut)
{
    try
    {
        QRDDataCopy().Process(poIn, nullptr, poOut);
    }
    catch (const Exception& oError)
    {
        return oError;
    }
    return std::nullopt;
}

void ExpectError(const std::optional<Exception>& oError, const std::string& oMessage,
                 unsigned int nLine)
{
    ASSERT_TRUE(oError);
    EXPECT_EQ(oError->GetMessage(), oMessage);
    EXPECT_EQ(oError->GetFile(), "processes/qrdfilters/datacopy");
    EXPECT_NE(oError->GetFunction().find("QRDDataCopy::Process("), std::string::npos);
    EXPECT_EQ(oError->GetLine(), nLine);
}

TEST(QRDDataCopy, ReportsANullInputBeforeTheOutput)
{
    ExpectError(ErrorOf(nullptr, nullptr), "poRasterIn is invalid pointer", 35);
}

TEST(QRDDataCopy, ReportsANullOutput)
{
    const auto poIn = BlankRaster(1, 1, 1, tessel::eDT_8U);
    ExpectError(ErrorOf(poIn.get(), nullptr), "poRasterOut is invalid pointer", 39);
}

TEST(QRDDataCopy, RefusesComplexBesideReal)
{
    const char* const pszMessage = "Cannot copy from/to complex type to/from normal types.";
    const auto poComplex = BlankRaster(1, 1, 1, tessel::eDT_C32R);
    const auto poReal = BlankRaster(1, 1, 1, tessel::eDT_32R);
    ExpectError(ErrorOf(poComplex.get(), poReal.get()), pszMessage, 44);
    ExpectError(ErrorOf(poReal.get(), poComplex.get()), pszMessage, 44);
}

TEST(QRDDataCopy, RefusesBitsAndLeavesTheOutputAlone)
{
    const auto poBits = BlankRaster(8, 1, 1, tessel::eDT_BIT);
    const auto poOut = BlankRaster(8, 1, 1, tessel::eDT_8U);
    const auto oError = ErrorOf(poBits.get(), poOut.get());
    ASSERT_TRUE(oError);
    EXPECT_EQ(oError->GetMessage(), "Invalid type requested.");
    EXPECT_TRUE(SameBits(*poOut, *BlankRaster(8, 1, 1, tessel::eDT_8U)));
}

TEST(QRDDataCopy, MaskedPixelsBecomeZeroInAllChannels)
{
    const auto poIn = RasterOf(Image<std::int16_t>{{1, 2, 3, 4, 5, 6}}, {}, 2);
    const auto poOut = RasterOf(Image<float>{{9, 9, 9, 9, 9, 9}}, {}, 2);
    QRDDataCopy().Process(poIn.get(), MaskOf({{1, 0, 1}}).get(), poOut.get());
    EXPECT_EQ(ImageOf<float>(*poOut), (Image<float>{{1, 2, 0, 0, 5, 6}}));
}

TEST(QRDDataCopy, MaskedPixelsStayWhereTheOutputIsKept)
{
    const auto poIn = RasterOf(Image<std::int16_t>{{1, 2, 3, 4, 5, 6}}, {}, 2);
    const auto poOut = RasterOf(Image<float>{{9, 9, 9, 8, 9, 9}}, {}, 2);
    QRDDataCopy oCopy;
    oCopy.SetKeepOutput(true);
    oCopy.Process(poIn.get(), MaskOf({{1, 0, 1}}).get(), poOut.get());
    EXPECT_EQ(ImageOf<float>(*poOut), (Image<float>{{1, 2, 9, 8, 5, 6}}));
}

// Another filter would keep the value that its processor was made with.
TEST(QRDDataCopy, TakesItsParameterAnewForEachBlock)
{
    const auto poIn = RasterOf(Bytes{{1, 2}});
    const auto poOut = RasterOf(Bytes{{7, 7}});
    const auto poMask = MaskOf({{1, 0}});
    QRDDataCopy oCopy;
    oCopy.SetKeepOutput(true);
    oCopy.Process(poIn.get(), poMask.get(), poOut.get());
    EXPECT_EQ(ImageOf<std::uint8_t>(*poOut), (Bytes{{1, 7}}));
    oCopy.SetKeepOutput(false);
    oCopy.Process(poIn.get(), poMask.get(), poOut.get());
    EXPECT_EQ(ImageOf<std::uint8_t>(*poOut), (Bytes{{1, 0}}));
}

TEST(QRDDataCopy, ClampsAndRoundsLikeEveryConversion)
{
    const auto poIn = RasterOf(Image<float>{{-1.0F, 2.5F, 254.6F, 300.0F, std::nanf("")}});
    const auto poOut = BlankRaster(5, 1, 1, tessel::eDT_8U);
    QRDDataCopy().Process(poIn.get(), nullptr, poOut.get());
    EXPECT_EQ(ImageOf<std::uint8_t>(*poOut), (Bytes{{0, 3, 255, 255, 0}}));
}

TEST(QRDDataCopy, ConvertsBothPartsOfComplexSamples)
{
    const auto poIn = BlankRaster(2, 1, 1, tessel::eDT_C32R);
    const float afIn[] = {1.5F, -2.5F, 40000.0F, -40000.0F};
    std::memcpy(poIn->mpBuffer, afIn, sizeof(afIn));
    const auto poOut = BlankRaster(2, 1, 1, tessel::eDT_C16S);
    QRDDataCopy().Process(poIn.get(), nullptr, poOut.get());
    const auto* pnOut = poOut->GetPixelAs<std::int16_t>(0, 0);
    EXPECT_EQ(std::vector<int>(pnOut, pnOut + 4), (std::vector<int>{2, -3, 32767, -32768}));
}

TEST(QRDDataCopy, LeavesMarginsAlone)
{
    const auto poIn = RasterOf(
        Bytes{
            {1, 1, 1},
            {1, 5, 1},
            {1, 1, 1},
        },
        Margins{1, 1});
    const auto poOut = RasterOf(
        Bytes{
            {7, 7, 7, 7, 7},
            {7, 7, 7, 7, 7},
            {7, 7, 7, 7, 7},
        },
        Margins{2, 1});
    QRDDataCopy().Process(poIn.get(), nullptr, poOut.get());
    const auto poExpected = RasterOf(
        Bytes{
            {7, 7, 7, 7, 7},
            {7, 7, 5, 7, 7},
            {7, 7, 7, 7, 7},
        },
        Margins{2, 1});
    EXPECT_TRUE(SameBits(*poOut, *poExpected));
}

/// The definition: sample by sample, part by part.
template <class TIn, class TOut>
void CopyByDefinition(const Raster& oIn, const Mask* poMask, bool bKeepOutput, Raster& oOut)
{
    const std::uint32_t nElements = oIn.mnChannels * (oIn.moDataType.mbComplex ? 2U : 1U);
    for (std::uint32_t y = 0; y < oIn.mnHeight; ++y)
    {
        for (std::uint32_t x = 0; x < oIn.mnWidth; ++x)
        {
            const bool bValid = test::IsValid(poMask, x, y);
            for (std::uint32_t c = 0; c < nElements && (bValid || !bKeepOutput); ++c)
            {
                oOut.GetPixelAs<TOut>(x, y)[c] =
                    bValid ? test::ReferenceSample<TIn, TOut>(oIn.GetPixelAs<TIn>(x, y)[c])
                           : TOut(0);
            }
        }
    }
}

// One object serves all pairs of types, each with and without a mask, real and complex.
TEST(QRDDataCopy, CopiesAllPairsOfTypesByTheDefinition)
{
    Random oRandom(18);
    const QRDDataCopy oZeroing;
    QRDDataCopy oKeeping;
    oKeeping.SetKeepOutput(true);
    const auto oPair = [&]<class TIn, class TOut>()
    {
        for (const bool bComplex : {false, true})
        {
            const DataType oTypeIn = bComplex ? ComplexDataType<TIn>() : RealDataType<TIn>();
            const DataType oTypeOut = bComplex ? ComplexDataType<TOut>() : RealDataType<TOut>();
            const auto poIn =
                RandomRaster(37, 7, 3, oTypeIn, Margins{2, 1}, test::Samples::Special, oRandom);
            const auto poMask = test::RandomMask(37, 7, Margins{2, 1}, 0.6, oRandom);
            for (Mask* const poEachMask : {static_cast<Mask*>(nullptr), poMask.get()})
            {
                for (const bool bKeep : {false, true})
                {
                    const auto poOut = BlankRaster(37, 7, 3, oTypeOut, Margins{1, 3});
                    (bKeep ? oKeeping : oZeroing).Process(poIn.get(), poEachMask, poOut.get());
                    const auto poExpected = BlankRaster(37, 7, 3, oTypeOut, Margins{1, 3});
                    CopyByDefinition<TIn, TOut>(*poIn, poEachMask, bKeep, *poExpected);
                    ASSERT_TRUE(SameBits(*poOut, *poExpected));
                }
            }
        }
    };
    test::ForEachElementType(
        [&]<class TIn>() {
            test::ForEachElementType([&]<class TOut>() { oPair.template operator()<TIn, TOut>(); });
        });
}

TEST(QRDDataCopy, CopiesTheSameOnAnyNumberOfThreads)
{
    Random oRandom(4);
    const auto poIn =
        RandomRaster(13, 301, 2, tessel::eDT_16U, Margins{1, 0}, test::Samples::Ordinary, oRandom);
    const auto poMask = test::RandomMask(13, 301, Margins{1, 0}, 0.5, oRandom);
    const auto poExpected = BlankRaster(13, 301, 2, tessel::eDT_8U);
    CopyByDefinition<unsigned short, unsigned char>(*poIn, poMask.get(), false, *poExpected);
    for (const int nThreads : {1, 2, 5})
    {
        const test::ThreadCount oThreads(nThreads);
        const auto poOut = BlankRaster(13, 301, 2, tessel::eDT_8U);
        QRDDataCopy().Process(poIn.get(), poMask.get(), poOut.get());
        EXPECT_TRUE(SameBits(*poOut, *poExpected)) << nThreads << " threads";
    }
}

TEST(QRDDataCopy, CopiesBlocksWithoutPixels)
{
    const auto poOut = BlankRaster(0, 3, 1, tessel::eDT_8U, Margins{1, 1});
    QRDDataCopy().Process(BlankRaster(0, 3, 1, tessel::eDT_16U).get(), nullptr, poOut.get());
    QRDDataCopy().Process(BlankRaster(3, 0, 1, tessel::eDT_16U).get(), nullptr,
                          BlankRaster(3, 0, 1, tessel::eDT_8U).get());
    EXPECT_TRUE(SameBits(*poOut, *BlankRaster(0, 3, 1, tessel::eDT_8U, Margins{1, 1})));
}

TEST(QRDDataCopy, HardenedBuildsRefuseBlocksThatDoNotMatch)
{
    if (!kHardened)
    {
        GTEST_SKIP() << "these builds trust the caller";
    }
    const auto poIn = BlankRaster(4, 4, 1, tessel::eDT_8U);
    EXPECT_TRUE(ErrorOf(poIn.get(), BlankRaster(4, 3, 1, tessel::eDT_8U).get()));
    EXPECT_TRUE(ErrorOf(poIn.get(), BlankRaster(4, 4, 2, tessel::eDT_8U).get()));
}

/// A dataset of 16-bit channels with the samples 100 * channel + 10 * y + x, and -1 at (1, 0) of
/// the first channel.
std::unique_ptr<test::MemoryDataset> NumberedDataset()
{
    auto poDataset =
        std::make_unique<test::MemoryDataset>(4, 3, std::vector<DataType>(2, tessel::eDT_16S));
    for (unsigned int nChannel = 1; nChannel <= 2; ++nChannel)
    {
        for (std::size_t i = 0; i < 12; ++i)
        {
            poDataset->Sample<std::int16_t>(nChannel, i % 4, i / 4) =
                static_cast<std::int16_t>(100 * nChannel + 10 * (i / 4) + i % 4);
        }
    }
    poDataset->Sample<std::int16_t>(1, 1, 0) = -1;
    return poDataset;
}

using CopyDriver = parallelio::FilterIODriver<QRDDataCopyAlgorithm>;

TEST(QRDDataCopyAlgorithm, CopiesAnImageByTheDriver)
{
    const auto poFrom = NumberedDataset();
    test::MemoryDataset oTo(4, 3, std::vector<DataType>(2, tessel::eDT_32R));
    datasources::BasicReader oReader(poFrom.get(), {1, 2});
    datasources::BasicWriter oWriter(&oTo, {1, 2});
    CopyDriver oDriver;
    oDriver.SetMemoryBudget(64);  // 12 bytes a pixel, two stages: strips of one row
    EXPECT_EQ(oDriver.GetMaskBuilder(), nullptr);
    oDriver.Run(&oReader, &oWriter);
    EXPECT_EQ(oTo.Sample<float>(1, 0, 0), 100.0F);
    EXPECT_EQ(oTo.Sample<float>(1, 1, 0), -1.0F);
    EXPECT_EQ(oTo.Sample<float>(2, 3, 2), 223.0F);
}

TEST(QRDDataCopyAlgorithm, MasksEachBlockByItsBuilder)
{
    const auto poFrom = NumberedDataset();
    test::MemoryDataset oTo(4, 3, std::vector<DataType>(2, tessel::eDT_16S));
    datasources::BasicReader oReader(poFrom.get(), {1, 2});
    datasources::BasicWriter oWriter(&oTo, {1, 2});
    ValidMaskBuilder oBuilder({-1.0});
    CopyDriver oDriver;
    oDriver.SetMaskBuilder(&oBuilder);
    oDriver.Run(&oReader, &oWriter);
    EXPECT_EQ(oTo.Sample<std::int16_t>(1, 0, 0), 100);
    EXPECT_EQ(oTo.Sample<std::int16_t>(1, 1, 0), 0);
    EXPECT_EQ(oTo.Sample<std::int16_t>(2, 1, 0), 0);
    EXPECT_EQ(oTo.Sample<std::int16_t>(2, 1, 1), 211);
}

TEST(QRDDataCopyAlgorithm, KeepsWhatTheFileHoldsWhereItIsLoadedFirst)
{
    const auto poFrom = NumberedDataset();
    const auto poTo = NumberedDataset();
    poTo->Sample<std::int16_t>(2, 1, 0) = 77;
    poTo->Sample<std::int16_t>(2, 2, 0) = 77;
    datasources::BasicReader oReader(poFrom.get(), {1, 2});
    datasources::BasicWriter oWriter(poTo.get(), {1, 2});
    ValidMaskBuilder oBuilder({-1.0});
    CopyDriver oDriver;
    oDriver.SetMaskBuilder(&oBuilder);
    oDriver.SetKeepOutput(true);
    oDriver.SetPreloadOutput(true);
    oDriver.Run(&oReader, &oWriter);
    EXPECT_EQ(poTo->Sample<std::int16_t>(2, 1, 0), 77);
    EXPECT_EQ(poTo->Sample<std::int16_t>(2, 2, 0), 202);
}

}  // namespace
}  // namespace kor::filters
