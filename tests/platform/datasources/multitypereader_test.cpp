#include "platform/datasources/multitypereader.h"

#include <gtest/gtest.h>

#include "processes/qrdfilters/sampleconversion.h"
#include "tests/support/exceptions.h"
#include "tests/support/memorydataset.h"

namespace kor::datasources
{
namespace
{

using test::BlankRaster;
using test::Image;
using test::MemoryDataset;
using test::MessageOf;

TEST(MultiTypeReader, SeesChannelsOfAllTypesAsOne)
{
    MemoryDataset oDataset(2, 1, {tessel::eDT_8U, tessel::eDT_32R, tessel::eDT_BIT});
    oDataset.Sample<std::uint8_t>(1, 0, 0) = 200;
    oDataset.Sample<std::uint8_t>(1, 1, 0) = 7;
    oDataset.Sample<float>(2, 0, 0) = -2.5F;
    oDataset.Sample<float>(2, 1, 0) = 40000.0F;
    oDataset.Sample<std::uint8_t>(3, 1, 0) = 1;
    MultiTypeReader oReader(&oDataset, {2, 1, 3}, tessel::eDT_16S);

    EXPECT_EQ(oReader.GetDataType(), tessel::eDT_16S);
    EXPECT_EQ(oReader.GetChannelCount(), 3U);
    EXPECT_EQ(oReader.GetChannelsInfo()[0].moDataType, tessel::eDT_16S);
    const std::unique_ptr<tessel::Raster> poRaster(oReader.GetRaster(0));
    EXPECT_EQ(test::ImageOf<std::int16_t>(*poRaster),
              (Image<std::int16_t>{{-3, 200, 0, 32767, 7, 1}}));
}

TEST(MultiTypeReader, MarginsAreMadeOfConvertedSamples)
{
    MemoryDataset oDataset(2, 1, {tessel::eDT_16U});
    oDataset.Sample<std::uint16_t>(1, 0, 0) = 300;
    oDataset.Sample<std::uint16_t>(1, 1, 0) = 3;
    MultiTypeReader oReader(&oDataset, {1}, tessel::eDT_8U);
    oReader.SetMargin(2, 1, 1);
    const std::unique_ptr<tessel::Raster> poRaster(oReader.GetRaster(0));
    EXPECT_EQ(Image<std::uint8_t>(6, std::vector(poRaster->mpBuffer, poRaster->mpBuffer + 18)),
              (Image<std::uint8_t>{
                  {255, 3, 255, 3, 255, 3}, {255, 3, 255, 3, 255, 3}, {255, 3, 255, 3, 255, 3}}));
}

TEST(MultiTypeReader, PartsOfComplexSamplesAreConvertedAlike)
{
    MemoryDataset oDataset(1, 1, {tessel::eDT_C32R});
    const float afSample[] = {1.5F, -70000.0F};
    std::memcpy(oDataset.At(1, 0, 0), afSample, sizeof(afSample));
    MultiTypeReader oReader(&oDataset, {1}, tessel::eDT_C16S);
    const std::unique_ptr<tessel::Raster> poRaster(oReader.GetRaster(0));
    EXPECT_EQ(poRaster->GetPixelAs<std::int16_t>(0, 0)[0], 2);
    EXPECT_EQ(poRaster->GetPixelAs<std::int16_t>(0, 0)[1], -32768);
}

// Wide enough that a channel is read in several strips, and in one row a strip.
TEST(MultiTypeReader, LargeBlocksAreConvertedWhole)
{
    constexpr std::uint32_t kWidth = 70001;
    MemoryDataset oDataset(kWidth, 9, {tessel::eDT_16S, tessel::eDT_64R});
    test::Random oRandom(3);
    oDataset.FillRandom(oRandom);
    MultiTypeReader oReader(&oDataset, {1, 2}, tessel::eDT_32R);
    const std::unique_ptr<tessel::Raster> poRaster(oReader.GetRaster(0));
    for (std::uint32_t y = 0; y < 9; ++y)
    {
        for (std::uint32_t x = 0; x < kWidth; ++x)
        {
            const float* pPixel = poRaster->GetPixelAs<float>(x, y);
            ASSERT_EQ(pPixel[0], oDataset.Sample<std::int16_t>(1, x, y));
            ASSERT_TRUE(
                test::SameSample(pPixel[1], static_cast<float>(oDataset.Sample<double>(2, x, y))));
        }
    }
}

TEST(MultiTypeReader, EveryPairOfTypesIsConvertedByTheLibrarysRules)
{
    test::Random oRandom(4);
    test::ForEachElementType(
        [&]<class TIn>()
        {
            test::ForEachElementType(
                [&]<class TOut>()
                {
                    MemoryDataset oDataset(5, 3, {typedispatch::RealDataType<TIn>()});
                    oDataset.FillRandom(oRandom);
                    MultiTypeReader oReader(&oDataset, {1}, typedispatch::RealDataType<TOut>());
                    const std::unique_ptr<tessel::Raster> poRaster(oReader.GetRaster(0));
                    for (std::uint32_t i = 0; i < 15; ++i)
                    {
                        const TOut xExpected = filters::ConvertSample<TIn, TOut>(
                            oDataset.Sample<TIn>(1, i % 5, i / 5));
                        ASSERT_TRUE(
                            test::SameSample(*poRaster->GetPixelAs<TOut>(i % 5, i / 5), xExpected));
                    }
                });
        });
}

TEST(MultiTypeReader, TypesThatCannotBeSeenAreRefused)
{
    MemoryDataset oDataset(1, 1, {tessel::eDT_8U, tessel::eDT_C32R});
    EXPECT_EQ(MessageOf<DataException>(
                  [&] {
                      MultiTypeReader(&oDataset, {1, 2}, tessel::eDT_32R);
                  }),
              "memory: channel 2 has eDT_C32R and cannot be seen as eDT_32R");
    EXPECT_EQ(MessageOf<DataException>([&] { MultiTypeReader(&oDataset, {1}, tessel::eDT_C32R); }),
              "memory: channel 1 has eDT_8U and cannot be seen as eDT_C32R");
    EXPECT_EQ(MessageOf<DataException>([&] { MultiTypeReader(&oDataset, {1}, tessel::eDT_BIT); }),
              "memory: channels cannot be seen as eDT_BIT");
    EXPECT_EQ(
        MessageOf<DataException>([&] { MultiTypeReader(&oDataset, {1}, tessel::DataType()); }),
        "memory: channels cannot be seen as a type of 0 bits, unsigned");
}

TEST(MultiTypeReader, RasterHasToHaveTheTypeThatIsSeen)
{
    MemoryDataset oDataset(1, 1, {tessel::eDT_8U});
    MultiTypeReader oReader(&oDataset, {1}, tessel::eDT_32R);
    const auto poRaster = BlankRaster(1, 1, 1, tessel::eDT_8U);
    EXPECT_EQ(MessageOf<DataException>([&] { oReader.ReadRaster(poRaster.get()); }),
              "memory: the raster has samples of eDT_8U, its channels have eDT_32R");
}

TEST(MultiTypeReader, FailuresOfTheDatasetAreReported)
{
    MemoryDataset oDataset(1, 1, {tessel::eDT_8U});
    MultiTypeReader oReader(&oDataset, {1}, tessel::eDT_32R);
    oDataset.mbOutOfMemory = true;
    EXPECT_EQ(MessageOf<IOException>([&] { oReader.GetRaster(0); }), "memory: out of memory");
}

}  // namespace
}  // namespace kor::datasources
