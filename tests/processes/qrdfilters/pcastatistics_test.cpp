#include <gtest/gtest.h>

#include <cmath>
#include <string>
#include <vector>

#include "platform/exception/exception.h"
#include "platform/ledger/report.h"
#include "processes/qrdfilters/filterpca.h"
#include "processes/qrdfilters/sampleconversion.h"
#include "tests/support/blocks.h"
#include "tests/support/exceptions.h"
#include "tests/support/kordskfiles.h"
#include "tests/support/memoryfiles.h"
#include "tests/support/temporarydirectory.h"

namespace kor::filters
{
namespace
{

using namespace kor::test;
using Floats = std::vector<float>;
using Numbers = std::vector<unsigned int>;

struct RasterStats
{
    Floats vfCovariance;
    Floats vfMeans;
    Floats vfDeviations;
};

RasterStats StatsOf(PCAStatistics& oStatistics, std::size_t nInputs)
{
    RasterStats oStats{Floats(nInputs * nInputs), Floats(nInputs), Floats(nInputs)};
    oStatistics.GetRasterStats(oStats.vfCovariance, oStats.vfMeans, oStats.vfDeviations);
    return oStats;
}

PCAStatistics Statistics(std::string oFile, const Numbers& vnWindow, const Numbers& vnInputs)
{
    return PCAStatistics(oFile, vnWindow, vnInputs, {}, {});
}

/// What the report says about the sample.
std::string SampleSize(const PCAStatistics& oStatistics)
{
    ledger::IReportSink* const poFormer = ledger::Report::SetSink(nullptr);
    ::testing::internal::CaptureStdout();
    oStatistics.GetPCAPrint("SHORT", {}, {}, {}, {}, {}, {}, {}, {}, {}, {}, {}, {});
    const std::string oText = ::testing::internal::GetCapturedStdout();
    ledger::Report::SetSink(poFormer);
    const std::size_t nSize = oText.find(" Sample Size      : ");
    return oText.substr(nSize, oText.find('\n', nSize) - nSize);
}

class PcaStatistics : public ::testing::Test
{
protected:
    /// Channel 1 is 1 2 / 3 4, channel 2 is 2 0 / 4 6, channel 3 is 7 everywhere; bitmap 1 is
    /// 0 1 / 0 1.
    PcaStatistics()
    {
        const Kordsk poKordsk = NewKordsk(moFile);
        poKordsk->CreateChannels({2, 2, 3, tessel::eDT_8U});
        datasources::BasicWriter(poKordsk.get(), {1, 2, 3})
            .WriteRaster(
                RasterOf(Image<std::uint8_t>{{1, 2, 7, 2, 0, 7}, {3, 4, 7, 4, 6, 7}}, {}, 3).get());
        poKordsk->CreateBitmap(2, 2);
        datasources::BasicWriter(static_cast<datasources::IBitmapDataset*>(poKordsk.get()), 1U)
            .WriteRaster(RasterOf(Image<std::uint8_t>{{0, 1}, {0, 1}}).get());
    }

    TemporaryDirectory moFolder;
    std::string moFile = moFolder.File("scene.kordsk");
};

// Means 10 / 4 and 12 / 4; squares 30 / 4 - 6.25 and 56 / 4 - 9; product 38 / 4 - 7.5.
TEST_F(PcaStatistics, DividesByTheNumberOfPixels)
{
    PCAStatistics oStatistics = Statistics(moFile, {}, {1, 2});
    const RasterStats oStats = StatsOf(oStatistics, 2);
    EXPECT_EQ(oStats.vfMeans, (Floats{2.5F, 3.0F}));
    EXPECT_EQ(oStats.vfCovariance, (Floats{1.25F, 2.0F, 2.0F, 5.0F}));
    EXPECT_EQ(oStats.vfDeviations, (Floats{std::sqrt(1.25F), std::sqrt(5.0F)}));
    EXPECT_EQ(SampleSize(oStatistics), " Sample Size      :                4");
}

TEST_F(PcaStatistics, TakesChannelsInTheOrderGiven)
{
    PCAStatistics oStatistics = Statistics(moFile, {}, {2, 3, 1});
    const RasterStats oStats = StatsOf(oStatistics, 3);
    EXPECT_EQ(oStats.vfMeans, (Floats{3.0F, 7.0F, 2.5F}));
    EXPECT_EQ(oStats.vfCovariance, (Floats{5, 0, 2, 0, 0, 0, 2, 0, 1.25F}));
}

TEST_F(PcaStatistics, GivesAConstantChannelNoDeviation)
{
    PCAStatistics oStatistics = Statistics(moFile, {}, {3});
    const RasterStats oStats = StatsOf(oStatistics, 1);
    EXPECT_EQ(oStats.vfCovariance, (Floats{0}));
    EXPECT_EQ(oStats.vfDeviations, (Floats{0}));
}

// The lower row: 3 4 and 4 6.
TEST_F(PcaStatistics, SamplesAWindow)
{
    PCAStatistics oStatistics = Statistics(moFile, {0, 1, 2, 5}, {1, 2});
    EXPECT_EQ(StatsOf(oStatistics, 2).vfMeans, (Floats{3.5F, 5.0F}));
    EXPECT_EQ(SampleSize(oStatistics), " Sample Size      :                2");
    // With another number of elements it does not count.
    PCAStatistics oAll = Statistics(moFile, {0, 1, 2}, {1, 2});
    EXPECT_EQ(StatsOf(oAll, 2).vfMeans, (Floats{2.5F, 3.0F}));
}

// The right column, whatever the window says: 2 4 and 0 6.
TEST_F(PcaStatistics, SamplesABitmapRatherThanAWindow)
{
    PCAStatistics oStatistics = Statistics(moFile, {0, 1, 2, 1}, {1, 2});
    oStatistics.SetSegMask(9, 1);
    EXPECT_EQ(StatsOf(oStatistics, 2).vfMeans, (Floats{3.0F, 3.0F}));
    EXPECT_EQ(SampleSize(oStatistics), " Sample Size      :                2");
}

TEST_F(PcaStatistics, SamplesTheWindowBesideASignature)
{
    PCAStatistics oStatistics = Statistics(moFile, {0, 1, 2, 1}, {1, 2});
    oStatistics.SetSegMask(9, 0);
    EXPECT_EQ(StatsOf(oStatistics, 2).vfMeans, (Floats{3.5F, 5.0F}));
}

TEST_F(PcaStatistics, StartsAnewWithEachCallAndAfterACopy)
{
    PCAStatistics oStatistics = Statistics(moFile, {}, {1, 2});
    StatsOf(oStatistics, 2);
    PCAStatistics oCopy = oStatistics;
    EXPECT_EQ(SampleSize(oCopy), " Sample Size      :                4");
    EXPECT_EQ(StatsOf(oCopy, 2).vfMeans, (Floats{2.5F, 3.0F}));
    EXPECT_EQ(SampleSize(oCopy), " Sample Size      :                4");
}

TEST_F(PcaStatistics, GivesNoNumbersForAnEmptySample)
{
    PCAStatistics oStatistics = Statistics(moFile, {9, 9, 1, 1}, {1, 2});
    const RasterStats oStats = StatsOf(oStatistics, 2);
    EXPECT_TRUE(std::isnan(oStats.vfMeans[0]) && std::isnan(oStats.vfCovariance[1]));
    EXPECT_EQ(oStats.vfDeviations, (Floats{0, 0}));
    EXPECT_EQ(SampleSize(oStatistics), " Sample Size      :                0");
}

TEST_F(PcaStatistics, WritesNothingBehindVectorsThatAreTooShort)
{
    PCAStatistics oStatistics = Statistics(moFile, {}, {1, 2});
    Floats vfCovariance(3), vfMeans(1), vfDeviations;
    oStatistics.GetRasterStats(vfCovariance, vfMeans, vfDeviations);
    EXPECT_EQ(vfCovariance, (Floats{1.25F, 2.0F, 2.0F}));
    EXPECT_EQ(vfMeans, (Floats{2.5F}));
    Floats vfMatrix = {4};
    Floats vfValues;
    oStatistics.ComputeEigen(2, vfMatrix, vfValues);  // 4 0 / 0 0
    EXPECT_EQ(vfMatrix, (Floats{-1}));
    oStatistics.ComputeEigen(-1, vfMatrix, vfValues);
    EXPECT_EQ(vfMatrix, (Floats{-1}));
    oStatistics.GetEigenStats({4, 1}, vfDeviations, vfMeans);
    EXPECT_EQ(vfMeans, (Floats{80}));
}

TEST_F(PcaStatistics, GivesEigenvectorsByRows)
{
    Floats vfMatrix = {1, 0, 0, -3};
    Floats vfValues(2);
    Statistics(moFile, {}, {1, 2}).ComputeEigen(2, vfMatrix, vfValues);
    EXPECT_EQ(vfValues, (Floats{-3, 1}));
    EXPECT_EQ(vfMatrix, (Floats{0, -1, -1, 0}));
}

TEST_F(PcaStatistics, GivesDeviationAndShareOfEigenvalues)
{
    Floats vfDeviations(3);
    Floats vfVariance(3);
    Statistics(moFile, {}, {1}).GetEigenStats({-9, 4, 3}, vfDeviations, vfVariance);
    EXPECT_EQ(vfDeviations, (Floats{3, 2, std::sqrt(3.0F)}));
    EXPECT_EQ(vfVariance, (Floats{-56.25F, 25.0F, 18.75F}));
}

TEST_F(PcaStatistics, RefusesABitmapOfADatasetWithoutBitmaps)
{
    const std::string oFile = MemoryFileDriver::Write(
        moFolder,
        [] { return std::make_unique<MemoryDataset>(2, 1, std::vector{tessel::eDT_8U}); });
    PCAStatistics oStatistics = Statistics(oFile, {}, {1});
    oStatistics.SetSegMask(0, 1);
    try
    {
        StatsOf(oStatistics, 1);
        FAIL() << "threw nothing";
    }
    catch (const Exception& oError)
    {
        EXPECT_EQ(oError.GetMessage(), "This dataset doesn't support bitmap segment");
        EXPECT_EQ(oError.GetFile(), "processes/qrdfilters/filterpca");
        EXPECT_NE(oError.GetFunction().find("PCAStatistics::GetRasterStats("), std::string::npos);
    }
}

TEST_F(PcaStatistics, RefusesWhatItCannotRead)
{
    const auto oMessage = [&](const std::string& oFile, const Numbers& vnInputs, int nBitmap)
    {
        PCAStatistics oStatistics = Statistics(oFile, {}, vnInputs);
        oStatistics.SetSegMask(0, nBitmap);
        return MessageOf<Exception>([&] { StatsOf(oStatistics, vnInputs.size()); });
    };
    const std::string oComplex = moFolder.File("complex.kordsk");
    NewKordsk(oComplex)->CreateChannels({2, 2, 1, tessel::eDT_C32R});
    EXPECT_EQ(oMessage(oComplex, {1}, 0), "Invalid type requested.");
    EXPECT_NE(oMessage(moFile, {4}, 0), "");
    EXPECT_NE(oMessage(moFile, {1}, 2), "");
    EXPECT_NE(oMessage(moFile, {1}, -1), "");
    EXPECT_NE(oMessage(moFolder.File("nowhere"), {1}, 0), "");
}

// The pixels inside the margins are (1, 10), (2, 20) and (3, 30); the mask leaves the second out,
// and what the sums hold already stays.
TEST(PcaStatsProcessor, AddsTheValidPixelsInsideTheMargins)
{
    const Image<short> oImage = {
        {9, 9, 9, 9, 9, 9, 9, 9, 9, 9},
        {9, 9, 1, 10, 2, 20, 3, 30, 9, 9},
        {9, 9, 9, 9, 9, 9, 9, 9, 9, 9},
    };
    const auto poRaster = RasterOf(oImage, Margins{1, 1}, 2);
    const auto poMask = MaskOf({{1, 1, 1, 1, 1}, {1, 1, 0, 1, 1}, {1, 1, 1, 1, 1}}, Margins{1, 1});
    const std::unique_ptr<PCAStatistics::IStatsProcessor> poProcessor(
        PCAStatistics::MakeStatsProcessor(poRaster->moDataType));
    std::vector<double> vdfSums = {100, 200};
    std::vector<double> vdfProducts = {1000, 2000, 3000};
    long nCount = 5;
    poProcessor->Process(poRaster.get(), poMask.get(), vdfSums, vdfProducts, nCount);
    EXPECT_EQ(vdfSums, (std::vector<double>{104, 240}));
    EXPECT_EQ(vdfProducts, (std::vector<double>{1010, 2100, 4000}));
    EXPECT_EQ(nCount, 7);
    poProcessor->Process(poRaster.get(), nullptr, vdfSums, vdfProducts, nCount);
    EXPECT_EQ(vdfSums, (std::vector<double>{110, 300}));
    EXPECT_EQ(nCount, 10);
}

TEST(PcaStatsProcessor, CountsPixelsWithoutChannels)
{
    const auto poRaster = BlankRaster(70, 50, 0, tessel::eDT_8U);
    const std::unique_ptr<PCAStatistics::IStatsProcessor> poProcessor(
        PCAStatistics::MakeStatsProcessor(poRaster->moDataType));
    std::vector<double> vdfSums;
    std::vector<double> vdfProducts;
    long nCount = 1;
    poProcessor->Process(poRaster.get(), nullptr, vdfSums, vdfProducts, nCount);
    EXPECT_EQ(nCount, 3501);
    EXPECT_TRUE(vdfSums.empty() && vdfProducts.empty());
}

TEST(PcaStatsProcessor, ServesTheTenRealTypesAlone)
{
    EXPECT_EQ(
        MessageOf<Exception>([] { delete PCAStatistics::MakeStatsProcessor(tessel::eDT_C16S); }),
        "Invalid type requested.");
}

// ---- The definition.

template <class T>
double Widened(T x)
{
    return ConvertSample<T, double>(x);
}

/// Adds the pixels of a tile that the bitmap selects, as loops over the definition.
struct PlainSums
{
    explicit PlainSums(std::size_t nInputs)
        : vdfSums(nInputs), vdfProducts(nInputs * (nInputs + 1) / 2)
    {
    }

    template <class T>
    void AddPixel(const T* pPixel)
    {
        std::size_t k = 0;
        for (std::size_t i = 0; i < vdfSums.size(); ++i)
        {
            vdfSums[i] += Widened(pPixel[i]);
            for (std::size_t j = i; j < vdfSums.size(); ++j)
            {
                vdfProducts[k++] += Widened(pPixel[i]) * Widened(pPixel[j]);
            }
        }
        dfCount += 1;
    }

    void ExpectSame(const RasterStats& oStats) const
    {
        const std::size_t n = vdfSums.size();
        std::size_t k = 0;
        for (std::size_t i = 0; i < n; ++i)
        {
            EXPECT_TRUE(SameSample(oStats.vfMeans[i], static_cast<float>(vdfSums[i] / dfCount)));
            for (std::size_t j = i; j < n; ++j)
            {
                const double dfMeanI = vdfSums[i] / dfCount;
                const double dfMeanJ = vdfSums[j] / dfCount;
                const auto fExpected =
                    static_cast<float>(vdfProducts[k++] / dfCount - dfMeanJ * dfMeanI);
                EXPECT_TRUE(SameSample(oStats.vfCovariance[i * n + j], fExpected));
                EXPECT_TRUE(SameSample(oStats.vfCovariance[j * n + i], fExpected));
            }
            const double dfVariance = oStats.vfCovariance[i * n + i];
            EXPECT_EQ(oStats.vfDeviations[i],
                      static_cast<float>(dfVariance > 0 ? std::sqrt(dfVariance) : 0.0));
        }
    }

    std::vector<double> vdfSums;
    std::vector<double> vdfProducts;
    double dfCount = 0;
};

// All types from a file, with a bitmap and without; many channels take several tiles of sums.
TEST_F(PcaStatistics, FollowsTheDefinitionForAllTypes)
{
    Random oRandom(11);
    const auto oTest = [&]<class T>()
    {
        const tessel::DataType oType = typedispatch::RealDataType<T>();
        const std::uint32_t nChannels = 1 + static_cast<std::uint32_t>(oRandom() % 19);
        const auto poBlock = RandomRaster(67, 41, nChannels, oType, {}, Samples::Ordinary, oRandom);
        const std::string oFile = moFolder.File("type" + std::to_string(oRandom()));
        const Kordsk poKordsk = NewKordsk(oFile);
        poKordsk->CreateChannels(*poBlock);
        Numbers vnInputs(nChannels);
        std::iota(vnInputs.begin(), vnInputs.end(), 1U);
        datasources::BasicWriter(poKordsk.get(), vnInputs).WriteRaster(poBlock.get());
        const auto poMask = RandomMask(67, 41, {}, 0.7, oRandom);
        const std::unique_ptr<tessel::Raster> poBits(poMask->CreateRaster());
        poKordsk->CreateBitmap(67, 41);
        datasources::BasicWriter(static_cast<datasources::IBitmapDataset*>(poKordsk.get()), 1U)
            .WriteRaster(poBits.get());
        for (const int nBitmap : {0, 1})
        {
            PlainSums oPlain(nChannels);
            for (std::int64_t i = 0; i < 67 * 41; ++i)
            {
                if (nBitmap == 0 || IsValid(poMask.get(), i % 67, i / 67))
                {
                    oPlain.AddPixel(poBlock->GetPixelAs<T>(i % 67, i / 67));
                }
            }
            PCAStatistics oStatistics = Statistics(oFile, {}, vnInputs);
            oStatistics.SetSegMask(0, nBitmap);
            oPlain.ExpectSame(StatsOf(oStatistics, nChannels));
        }
    };
    ForEachElementType(oTest);
}

// A dataset of tiles is summed tile by tile, and a double of the wrong order has other last bits.
TEST_F(PcaStatistics, SumsTileByTile)
{
    Random oRandom(12);
    const auto poBlock = RandomRaster(50, 30, 3, tessel::eDT_64R, {}, Samples::Ordinary, oRandom);
    const auto oMake = [&]
    {
        auto poDataset = std::make_unique<MemoryDataset>(50, 30, std::vector(3, tessel::eDT_64R));
        for (std::size_t i = 0; i < 50 * 30 * 3; ++i)
        {
            poDataset->Sample<double>(static_cast<unsigned int>(1 + i % 3), i / 3 % 50, i / 150) =
                reinterpret_cast<const double*>(poBlock->mpBuffer)[i];
        }
        poDataset->mnTileWidth = 16;
        poDataset->mnTileHeight = 8;
        return poDataset;
    };
    PlainSums oPlain(3);
    for (std::uint32_t nTileY = 0; nTileY < 30; nTileY += 8)
    {
        for (std::uint32_t nTileX = 0; nTileX < 50; nTileX += 16)
        {
            for (std::uint32_t y = nTileY; y < std::min(30U, nTileY + 8); ++y)
            {
                for (std::uint32_t x = nTileX; x < std::min(50U, nTileX + 16); ++x)
                {
                    oPlain.AddPixel(poBlock->GetPixelAs<double>(x, y));
                }
            }
        }
    }
    PCAStatistics oStatistics = Statistics(MemoryFileDriver::Write(moFolder, oMake), {}, {1, 2, 3});
    oPlain.ExpectSame(StatsOf(oStatistics, 3));
}

// An image of more than one strip: 24 MiB of doubles in rows of 1 MiB.
TEST_F(PcaStatistics, SumsLargeImagesInTheOrderOfTheirRows)
{
    Random oRandom(13);
    constexpr std::uint32_t kWidth = 1U << 17;
    const auto poBlock =
        RandomRaster(kWidth, 24, 1, tessel::eDT_64R, {}, Samples::Ordinary, oRandom);
    const std::string oFile = moFolder.File("large.kordsk");
    {
        const Kordsk poKordsk = NewKordsk(oFile);
        poKordsk->CreateChannels(*poBlock);
        datasources::BasicWriter(poKordsk.get(), {1}).WriteRaster(poBlock.get());
    }
    PlainSums oPlain(1);
    for (std::size_t i = 0; i < std::size_t{kWidth} * 24; ++i)
    {
        oPlain.AddPixel(reinterpret_cast<const double*>(poBlock->mpBuffer) + i);
    }
    PCAStatistics oStatistics = Statistics(oFile, {}, {1});
    oPlain.ExpectSame(StatsOf(oStatistics, 1));
}

}  // namespace
}  // namespace kor::filters
