#include "processes/qrdfilters/filterhomogeneity.h"

#include <gtest/gtest.h>

#include <cmath>
#include <limits>
#include <numeric>
#include <optional>
#include <string>

#include "platform/datasources/basicreader.h"
#include "platform/datasources/basicwriter.h"
#include "platform/exception/exception.h"
#include "processes/qrdfilters/sampleconversion.h"
#include "tests/support/conversionreference.h"
#include "tests/support/kordskfiles.h"
#include "tests/support/maskbuilders.h"
#include "tests/support/temporarydirectory.h"

namespace kor::filters
{
namespace
{

using namespace kor::test;
using tessel::Mask;
using tessel::Raster;

using Bytes = Image<std::uint8_t>;
using Floats = Image<float>;

/// A table in which each bin is its own level.
std::vector<int> LevelsOfBins()
{
    std::vector<int> vnTable(65536);
    std::iota(vnTable.begin(), vnTable.end(), 0);
    return vnTable;
}

/// A filter that sees the samples 0 to 65535 themselves as grey levels.
FilterHomogeneity FilterOfValues()
{
    FilterHomogeneity oFilter;
    oFilter.SetMinMax(0.0, 65535.0);
    oFilter.SetHist2Glev(LevelsOfBins());
    return oFilter;
}

/// The drawing, its outer rows and columns being the margins, filtered into samples of type TOut.
template <class TOut, class TIn>
Image<TOut> Filtered(const FilterHomogeneity& oFilter, const Image<TIn>& oImage, Margins oMargins,
                     Mask* poMask = nullptr)
{
    const auto poIn = RasterOf(oImage, oMargins);
    const auto poOut = BlankRaster(poIn->mnWidth, poIn->mnHeight, 1,
                                   typedispatch::RealDataType<TOut>(), Margins{1, 2});
    oFilter.Process(poIn.get(), poMask, poOut.get());
    return ImageOf<TOut>(*poOut);
}

TEST(FilterHomogeneity, AUniformWindowGivesOne)
{
    const Bytes oImage = {
        {7, 7, 7, 7},
        {7, 7, 7, 7},
        {7, 7, 7, 7},
        {7, 7, 7, 7},
    };
    EXPECT_EQ(Filtered<float>(FilterOfValues(), oImage, Margins{1, 1}), (Floats{{1, 1}, {1, 1}}));
    EXPECT_EQ(Filtered<short>(FilterOfValues(), oImage, Margins{1, 1}),
              (Image<short>{{1, 1}, {1, 1}}));
}

// The pairs of 3 by 3 pixels, by the column and row of their first pixel, each in the order east,
// south-east, south, south-west. 1 and 3 differ by 2, their similarity is 1 / 5.
TEST(FilterHomogeneity, IsTheMeanSimilarityOfNeighbours)
{
    const Bytes oImage = {
        {1, 1, 1},
        {1, 3, 1},
        {1, 1, 1},
    };
    const float f = 0.2F;
    const float fFirst = 1 + f + 1 + f + 1 + 1 + 1;           // rows of 3, 3 and 1 pairs
    const float fSecond = 1 + 1 + f + 1 + f + f + f + f + 1;  // rows of 4, 4 and 1 pairs
    EXPECT_EQ(Filtered<float>(FilterOfValues(), oImage, Margins{1, 1}),
              (Floats{{(fFirst + fSecond) / 16.0F}}));
}

// Without margins each pixel is p of its own pairs alone, and the last column has none.
TEST(FilterHomogeneity, TheLastColumnIsNeverTheFirstOfAPair)
{
    const Bytes oImage = {
        {5, 5, 8},
        {5, 6, 9},
    };
    // 5: 5-5, 5-6, 5-5. 5: 5-8, 5-9, 5-6, 5-5. 5: 5-6. 6: 6-9.
    const float fSeventeenth = static_cast<float>(1.0 / 17.0);
    const float fUpper = 0.1F + fSeventeenth + 0.5F + 1.0F;
    const Floats oResult = Filtered<float>(FilterOfValues(), oImage, Margins{});
    EXPECT_EQ(oResult.Samples()[0], (1.0F + 0.5F + 1.0F) / 3.0F);
    EXPECT_EQ(oResult.Samples()[1], fUpper / 4.0F);
    EXPECT_TRUE(std::isnan(oResult.Samples()[2]));
    EXPECT_EQ(oResult.Samples()[3], 0.5F);
    // Meant: what the upper row was rounded by stays in the column when it is subtracted again.
    EXPECT_EQ(oResult.Samples()[4], fUpper - 0.1F - fSeventeenth - 0.5F - 1.0F + 0.1F);
    EXPECT_TRUE(std::isnan(oResult.Samples()[5]));
    EXPECT_EQ(Filtered<std::uint8_t>(FilterOfValues(), oImage, Margins{}),
              (Bytes{{1, 0, 0}, {1, 0, 0}}));
}

TEST(FilterHomogeneity, AValidPixelWithoutAPairIsNotANumber)
{
    const Bytes oImage = {
        {1, 1, 1},
        {1, 1, 1},
        {1, 1, 1},
    };
    const auto poMask = MaskOf(
        {
            {0, 0, 0},
            {0, 1, 0},
            {0, 0, 0},
        },
        Margins{1, 1});
    EXPECT_TRUE(std::isnan(
        Filtered<float>(FilterOfValues(), oImage, Margins{1, 1}, poMask.get()).Samples()[0]));
    EXPECT_EQ(Filtered<int>(FilterOfValues(), oImage, Margins{1, 1}, poMask.get()),
              (Image<int>{{0}}));
    EXPECT_EQ(Filtered<int64>(FilterOfValues(), oImage, Margins{1, 1}, poMask.get()),
              (Image<int64>{{0}}));
}

// The 90 would make every pair unlike; its own pixel becomes 0.
TEST(FilterHomogeneity, LeavesMaskedPixelsOutOfAllPairs)
{
    const Bytes oImage = {
        {4, 4, 4, 4},
        {4, 90, 4, 4},
        {4, 4, 4, 4},
    };
    const auto poMask = MaskOf(
        {
            {1, 1, 1, 1},
            {1, 0, 1, 1},
            {1, 1, 1, 1},
        },
        Margins{1, 1});
    EXPECT_EQ(Filtered<float>(FilterOfValues(), oImage, Margins{1, 1}, poMask.get()),
              (Floats{{0, 1}}));
}

// 100 and -1 lie outside the range, and NaN outside every range: all are taken for level 0.
TEST(FilterHomogeneity, PixelsOutsideTheRangeHaveLevelZero)
{
    FilterHomogeneity oFilter;
    oFilter.SetMinMax(0.0, 10.0);
    std::vector<int> vnTable(65536, 3);
    vnTable[0] = 0;
    oFilter.SetHist2Glev(vnTable);
    // Levels 0 0 0 0 3 3; the last pixel has no pair.
    const Floats oResult = Filtered<float>(
        oFilter, Floats{{0.0F, 100.0F, std::nanf(""), -1.0F, 1.0F, 10.0F}}, Margins{});
    const std::vector<float>& vfResult = oResult.Samples();
    EXPECT_EQ(std::vector<float>(vfResult.begin(), vfResult.end() - 1),
              (std::vector<float>{1, 1, 1, 0.1F, 1}));
}

TEST(FilterHomogeneity, AnEmptyTableGivesLevelZeroEverywhere)
{
    EXPECT_EQ(Filtered<short>(FilterHomogeneity(), Bytes{{0, 200, 3}}, Margins{}),
              (Image<short>{{1, 1, 0}}));
}

TEST(FilterHomogeneity, TakesItsTableAnewForEachBlock)
{
    FilterHomogeneity oFilter = FilterOfValues();
    const Bytes oImage = {{1, 2, 3}};
    EXPECT_EQ(Filtered<float>(oFilter, oImage, Margins{}).Samples()[0], 0.5F);
    oFilter.SetHist2Glev(std::vector<int>(65536, 5));
    EXPECT_EQ(Filtered<float>(oFilter, oImage, Margins{}).Samples()[0], 1.0F);
    oFilter.SetHist2Glev(LevelsOfBins());
    oFilter.SetMinMax(0.0, 65535.0 / 2);
    EXPECT_EQ(Filtered<float>(oFilter, oImage, Margins{}).Samples()[0], 0.2F);
}

/// The whole filter, literally.
template <class TIn>
class ByDefinition
{
public:
    ByDefinition(const FilterHomogeneity& oFilter, const Raster& oIn, const Mask* poMask)
        : moFilter(oFilter),
          moIn(oIn),
          mpoMask(poMask),
          mnColumns(oIn.mnTotalWidth),
          mnRows(oIn.mnTotalHeight),
          mvfSim(oIn.mnTotalWidth),
          mvfCount(oIn.mnTotalWidth)
    {
        for (std::int64_t r = 0; r < mnRows; ++r)
        {
            for (std::int64_t c = 0; c < mnColumns; ++c)
            {
                mvfGrey.push_back(Valid(r, c) ? LevelOf(Sample(r, c)) : 0.0F);
            }
        }
    }

    /// Calls oWrite(i, k, value).
    template <class Write>
    void Run(const Write& oWrite)
    {
        const std::int64_t mx = moIn.mnMarginX;
        const std::int64_t my = moIn.mnMarginY;
        for (std::int64_t r = 0; r < 2 * mx; ++r)
        {
            TakeRow(r, 1.0F);
        }
        for (std::int64_t k = 0; k < moIn.mnHeight; ++k)
        {
            TakeRow(2 * my + k, 1.0F);
            float fSum = 0.0F;
            float fCount = 0.0F;
            for (std::int64_t c = 0; c < 2 * mx; ++c)
            {
                fSum += mvfSim[static_cast<std::size_t>(c)];
                fCount += mvfCount[static_cast<std::size_t>(c)];
            }
            for (std::int64_t i = 0; i < moIn.mnWidth; ++i)
            {
                fSum += mvfSim[static_cast<std::size_t>(i + 2 * mx)];
                fCount += mvfCount[static_cast<std::size_t>(i + 2 * mx)];
                oWrite(i, k, Valid(k + my, i + mx) ? fSum / fCount : 0.0F);
                fSum -= mvfSim[static_cast<std::size_t>(i)];
                fCount -= mvfCount[static_cast<std::size_t>(i)];
            }
            TakeRow(k, -1.0F);
        }
    }

private:
    bool Valid(std::int64_t r, std::int64_t c) const
    {
        return IsValid(mpoMask, c - moIn.mnMarginX, r - moIn.mnMarginY);
    }
    double Sample(std::int64_t r, std::int64_t c) const
    {
        return ReferenceSample<TIn, double>(
            *moIn.GetPixelAs<TIn>(c - moIn.mnMarginX, r - moIn.mnMarginY));
    }
    float LevelOf(double x) const
    {
        const double dfMin = moFilter.GetMin();
        const double dfRange = moFilter.GetMax() - dfMin;
        if (!(x >= dfMin && x <= moFilter.GetMax()))
        {
            return 0.0F;
        }
        const double dfBin =
            dfRange > -1e-9 && dfRange < 1e-9 ? x : (x - dfMin) * 65535.0 / dfRange;
        const std::vector<int>& vnTable = moFilter.GetHist2Glev();
        return dfBin > -1.0 && dfBin < static_cast<double>(vnTable.size())
                   ? static_cast<float>(vnTable[static_cast<std::size_t>(static_cast<int>(dfBin))])
                   : 0.0F;
    }
    void TakeRow(std::int64_t r, float fSign)
    {
        for (std::int64_t c = 0; c < mnColumns - 1; ++c)
        {
            TakePair(r, c, r, c + 1, fSign);
            TakePair(r, c, r + 1, c + 1, fSign);
            TakePair(r, c, r + 1, c, fSign);
            TakePair(r, c, r + 1, c - 1, fSign);
        }
    }
    void TakePair(std::int64_t r, std::int64_t c, std::int64_t nRow, std::int64_t nColumn,
                  float fSign)
    {
        const auto oInside = [&](std::int64_t y, std::int64_t x)
        { return y >= 0 && y < mnRows && x >= 0 && x < mnColumns && Valid(y, x); };
        if (!oInside(r, c) || !oInside(nRow, nColumn))
        {
            return;
        }
        const float d = mvfGrey[static_cast<std::size_t>(r * mnColumns + c)] -
                        mvfGrey[static_cast<std::size_t>(nRow * mnColumns + nColumn)];
        const float fSquare = d * d;
        const auto fSimilarity = static_cast<float>(1.0 / (fSquare + 1.0));
        float& fSum = mvfSim[static_cast<std::size_t>(c)];
        float& fCount = mvfCount[static_cast<std::size_t>(c)];
        fSum = fSign > 0.0F ? fSum + fSimilarity : fSum - fSimilarity;
        fCount = fSign > 0.0F ? fCount + 1.0F : fCount - 1.0F;
    }

    const FilterHomogeneity& moFilter;
    const Raster& moIn;
    const Mask* mpoMask;
    std::int64_t mnColumns;
    std::int64_t mnRows;
    std::vector<float> mvfSim;
    std::vector<float> mvfCount;
    std::vector<float> mvfGrey;
};

template <class TOut>
TOut StoredByDefinition(float fValue)
{
    if constexpr (std::is_floating_point_v<TOut>)
    {
        return fValue;
    }
    else
    {
        using Limits = std::numeric_limits<Arithmetic<TOut>>;
        const double dfValue = fValue + 0.5;
        return static_cast<TOut>(std::isnan(dfValue) ? Arithmetic<TOut>(0)
                                 : dfValue < static_cast<double>(Limits::min()) ? Limits::min()
                                 : dfValue >= static_cast<double>(Limits::max())
                                     ? Limits::max()
                                     : static_cast<Arithmetic<TOut>>(dfValue));
    }
}

template <class TIn, class TOut>
::testing::AssertionResult AgreesWithDefinition(const FilterHomogeneity& oFilter,
                                                std::uint32_t nWidth, std::uint32_t nHeight,
                                                Margins oMargins, Random& oRandom)
{
    const auto poIn = RandomRaster(nWidth, nHeight, 1, typedispatch::RealDataType<TIn>(), oMargins,
                                   Samples::Special, oRandom);
    const auto poMask = RandomMask(nWidth, nHeight, oMargins, 0.8, oRandom);
    for (Mask* const poEachMask : {static_cast<Mask*>(nullptr), poMask.get()})
    {
        const auto oType = typedispatch::RealDataType<TOut>();
        const auto poOut = BlankRaster(nWidth, nHeight, 1, oType, Margins{1, 3});
        const std::unique_ptr<Raster> poExpected =
            BlankRaster(nWidth, nHeight, 1, oType, Margins{1, 3});
        oFilter.Process(poIn.get(), poEachMask, poOut.get());
        ByDefinition<TIn>(oFilter, *poIn, poEachMask)
            .Run([&](std::int64_t x, std::int64_t y, float fValue)
                 { *poExpected->GetPixelAs<TOut>(x, y) = StoredByDefinition<TOut>(fValue); });
        const auto oResult = SameBits(*poOut, *poExpected);
        if (!oResult)
        {
            return oResult;
        }
    }
    return ::testing::AssertionSuccess();
}

/// Levels from 0 on over the whole range of TIn, or over -1000 to 1000, rising with the bin.
template <class TIn>
FilterHomogeneity FilterOfLevels(int nLevels)
{
    using Limits = std::numeric_limits<Arithmetic<TIn>>;
    std::vector<int> vnTable(65536);
    for (int i = 0; i < 65536; ++i)
    {
        vnTable[static_cast<std::size_t>(i)] = static_cast<int>(std::int64_t{i} * nLevels / 65536);
    }
    FilterHomogeneity oFilter;
    oFilter.SetHist2Glev(vnTable);
    oFilter.SetMinMax(std::is_floating_point_v<TIn> ? -900.0 : static_cast<double>(Limits::min()),
                      std::is_floating_point_v<TIn> ? 1000.0 : static_cast<double>(Limits::max()));
    return oFilter;
}

TEST(FilterHomogeneity, WorksOnAllPairsOfTypesByTheDefinition)
{
    Random oRandom(31);
    ForEachElementType(
        [&]<class TIn>()
        {
            const FilterHomogeneity oFilter = FilterOfLevels<TIn>(6);
            ForEachElementType(
                [&]<class TOut>()
                {
                    ASSERT_TRUE(
                        (AgreesWithDefinition<TIn, TOut>(oFilter, 21, 5, Margins{1, 1}, oRandom)))
                        << typedispatch::ElementPosition<TIn>() << ' '
                        << typedispatch::ElementPosition<TOut>();
                });
        });
}

// 4096 levels differ by 4095 at most, which is the last difference of the faster way.
TEST(FilterHomogeneity, GivesTheBitsOfTheDefinitionForEveryNumberOfLevels)
{
    Random oRandom(32);
    for (const int nLevels : {1, 2, 255, 4096, 4097, 65536, -70000, 2000000000})
    {
        const FilterHomogeneity oFilter = FilterOfLevels<unsigned short>(nLevels);
        EXPECT_TRUE(
            (AgreesWithDefinition<unsigned short, float>(oFilter, 70, 40, Margins{3, 3}, oRandom)))
            << nLevels;
    }
}

// Unequal margins, narrow blocks and windows larger than the block included.
TEST(FilterHomogeneity, GivesTheBitsOfTheDefinitionForEveryGeometry)
{
    Random oRandom(33);
    const FilterHomogeneity oFilter = FilterOfLevels<unsigned char>(9);
    for (const std::uint32_t nWidth : {1U, 2U, 17U, 40U})
    {
        for (const std::uint32_t nHeight : {1U, 2U, 7U, 8U, 9U, 25U})
        {
            for (const Margins oMargins :
                 {Margins{0, 0}, Margins{1, 1}, Margins{4, 4}, Margins{3, 1}, Margins{1, 3},
                  Margins{0, 2}, Margins{9, 0}})
            {
                ASSERT_TRUE((AgreesWithDefinition<unsigned char, float>(oFilter, nWidth, nHeight,
                                                                        oMargins, oRandom)))
                    << nWidth << " x " << nHeight << ", " << oMargins.x << ' ' << oMargins.y;
            }
        }
    }
}

// The value itself is the bin where the range is empty: 70000 lies behind the table.
TEST(FilterHomogeneity, StaysInsideTheTableWhereTheRangeIsEmpty)
{
    FilterHomogeneity oFilter;
    oFilter.SetHist2Glev(LevelsOfBins());
    oFilter.SetMinMax(70000.0, 70000.0);
    EXPECT_EQ(Filtered<short>(oFilter, Image<int>{{70000, 3, 70000}}, Margins{}),
              (Image<short>{{1, 1, 0}}));
    oFilter.SetMinMax(-5.0, -5.0);
    EXPECT_EQ(Filtered<short>(oFilter, Image<int>{{-5, 3, -5}}, Margins{}),
              (Image<short>{{1, 1, 0}}));
}

TEST(FilterHomogeneity, TakesBlocksWithoutPixels)
{
    const auto poOut = BlankRaster(0, 3, 1, tessel::eDT_8U, Margins{1, 1});
    FilterOfValues().Process(BlankRaster(0, 3, 1, tessel::eDT_8U).get(), nullptr, poOut.get());
    EXPECT_TRUE(SameBits(*poOut, *BlankRaster(0, 3, 1, tessel::eDT_8U, Margins{1, 1})));
    FilterOfValues().Process(BlankRaster(3, 0, 1, tessel::eDT_8U).get(), nullptr,
                             BlankRaster(3, 0, 1, tessel::eDT_8U).get());
}

/// An image of one channel in memory.
template <class T>
std::unique_ptr<MemoryDataset> DatasetOf(const Image<T>& oImage)
{
    auto poDataset = std::make_unique<MemoryDataset>(
        static_cast<std::uint32_t>(oImage.Columns()), static_cast<std::uint32_t>(oImage.Rows()),
        std::vector<tessel::DataType>{typedispatch::RealDataType<T>()});
    std::memcpy(poDataset->At(1, 0, 0), oImage.Samples().data(),
                oImage.Samples().size() * sizeof(T));
    return poDataset;
}

template <class T>
void Prepare(FilterHomogeneity& oFilter, const Image<T>& oImage,
             tessel::IMaskBuilder* poBuilder = nullptr)
{
    const auto poDataset = DatasetOf(oImage);
    datasources::BasicReader oReader(poDataset.get(), {1});
    oReader.SetTileSize(2, 1);
    oFilter.PrepareForGivenGreyLevel(&oReader, poBuilder, nullptr);
}

TEST(FilterHomogeneity, PreparesATableOfEquallyPopulatedLevels)
{
    FilterHomogeneity oFilter;
    oFilter.SetGrey(2);
    Prepare(oFilter, Floats{{-1.0F, 0.0F, 1.0F}, {1.0F, 9.0F, std::nanf("")}});
    EXPECT_EQ(oFilter.GetMin(), -1.0);
    EXPECT_EQ(oFilter.GetMax(), 9.0);
    EXPECT_EQ(oFilter.GetCount(), 6);  // not a number is counted, though in no bin
    const std::vector<int>& vnHistogram = oFilter.Get16Histogram();
    ASSERT_EQ(vnHistogram.size(), 65536U);
    EXPECT_EQ(vnHistogram[0], 1);
    EXPECT_EQ(vnHistogram[6553], 1);   // 65535 / 10
    EXPECT_EQ(vnHistogram[13107], 2);  // 65535 * 2 / 10
    EXPECT_EQ(vnHistogram[65535], 1);
    EXPECT_EQ(std::accumulate(vnHistogram.begin(), vnHistogram.end(), 0), 5);
    const std::vector<int>& vnTable = oFilter.GetHist2Glev();
    ASSERT_EQ(vnTable.size(), 65536U);
    // A share is three pixels, which the bin 13107 completes; no bin reaches the next six.
    EXPECT_EQ(vnTable[0], 0);
    EXPECT_EQ(vnTable[13107], 0);
    EXPECT_EQ(vnTable[13108], 1);
    EXPECT_EQ(vnTable[65535], 1);
}

TEST(FilterHomogeneity, PreparesByTheValueItselfWhereAllPixelsAreEqual)
{
    FilterHomogeneity oFilter;
    oFilter.SetGrey(1);
    Prepare(oFilter, Image<short>{{300, 300, 300}});
    EXPECT_EQ(oFilter.Get16Histogram()[300], 3);
    EXPECT_EQ(oFilter.GetHist2Glev()[300], 0);
    EXPECT_EQ(oFilter.GetHist2Glev()[301], 1);
    // A value without a bin is counted and dropped.
    Prepare(oFilter, Image<short>{{-300, -300}});
    EXPECT_EQ(oFilter.GetCount(), 2);
    EXPECT_EQ(oFilter.Get16Histogram(), std::vector<int>(65536, 0));
    Prepare(oFilter, Floats{{1e30F}});
    EXPECT_EQ(oFilter.GetCount(), 1);
    EXPECT_EQ(oFilter.Get16Histogram(), std::vector<int>(65536, 0));
}

TEST(FilterHomogeneity, WithFewerPixelsThanLevelsEachBinHasALevelOfItsOwn)
{
    FilterHomogeneity oFilter;
    oFilter.SetGrey(5);
    Prepare(oFilter, Bytes{{1, 2, 3, 4}});
    EXPECT_EQ(oFilter.GetHist2Glev(), LevelsOfBins());
}

TEST(FilterHomogeneity, PreparesWithTheValidPixelsAlone)
{
    FilterHomogeneity oFilter;
    AboveMaskBuilder oBuilder(9);
    oFilter.SetGrey(1);
    Prepare(oFilter, Bytes{{1, 10, 20, 2}, {40, 3, 4, 5}}, &oBuilder);
    EXPECT_EQ(oFilter.GetMin(), 10.0);
    EXPECT_EQ(oFilter.GetMax(), 40.0);
    EXPECT_EQ(oFilter.GetCount(), 3);
    EXPECT_EQ(oBuilder.mnCalls, 8);  // 4 tiles, 2 passes
}

TEST(FilterHomogeneity, PreparesAfreshEachTime)
{
    FilterHomogeneity oFilter;
    oFilter.SetGrey(3);
    Prepare(oFilter, Bytes{{0, 200, 7}});
    Prepare(oFilter, Bytes{{20, 30}});
    EXPECT_EQ(oFilter.GetMin(), 20.0);
    EXPECT_EQ(oFilter.GetMax(), 30.0);
    EXPECT_EQ(oFilter.GetCount(), 2);
    Prepare(oFilter, Image<double>{{-0.5, 30, 2}});
    EXPECT_EQ(oFilter.GetMin(), -0.5);
    EXPECT_EQ(oFilter.GetCount(), 3);
}

TEST(FilterHomogeneity, WritesTheGreyLevelOfEachPixel)
{
    const auto poFrom = DatasetOf(Bytes{{0, 10, 20}, {30, 40, 50}});
    MemoryDataset oTo(3, 2, {tessel::eDT_32R});
    datasources::BasicReader oReader(poFrom.get(), {1});
    datasources::BasicWriter oWriter(&oTo, {1});
    oReader.SetTileSize(2, 2);
    oReader.SetMargin(1, 1, datasources::eEM_Nearest);
    AboveMaskBuilder oBuilder(5);
    FilterHomogeneity oFilter;
    oFilter.SetGrey(2);
    oFilter.PrepareForGivenGreyLevel(&oReader, &oBuilder, &oWriter);
    // Five pixels in two shares of two: 10 and 20, then 30 and 40; 50 is left for a third level.
    const float afExpected[] = {0.0F, 0.0F, 0.0F, 1.0F, 1.0F, 2.0F};
    for (std::size_t i = 0; i < 6; ++i)
    {
        EXPECT_EQ(oTo.Sample<float>(1, i % 3, i / 3), afExpected[i]) << i;
    }
    EXPECT_EQ(oFilter.GetCount(), 5);
}

// The levels go to another channel of the file that is read.
TEST(FilterHomogeneity, ReadsAndWritesFiles)
{
    const TemporaryDirectory oFolder;
    const Kordsk poFile = NewKordsk(oFolder.File("image.kordsk"));
    poFile->CreateChannels({3, 3, 1, tessel::eDT_16U});
    poFile->CreateChannels({3, 3, 1, tessel::eDT_32R});
    datasources::BasicWriter(poFile.get(), {1})
        .WriteRaster(
            RasterOf(Image<unsigned short>{{500, 100, 100}, {500, 500, 900}, {500, 100, 900}})
                .get());
    datasources::BasicReader oReader(poFile.get(), {1});
    datasources::BasicWriter oWriter(poFile.get(), {2});
    oReader.SetTileSize(3, 2);
    FilterHomogeneity oFilter;
    oFilter.SetGrey(3);
    oFilter.PrepareForGivenGreyLevel(&oReader, nullptr, &oWriter);
    // Shares of three pixels: the 100s, four 500s, and the 900s that end with the pixels.
    EXPECT_EQ(ImageOf<float>(*ReadBlock(*poFile, {2}, {3, 3, 1, tessel::eDT_32R})),
              (Floats{{1, 0, 0}, {1, 1, 2}, {1, 0, 2}}));
}

TEST(FilterHomogeneity, IgnoresAWriterOfSeveralChannels)
{
    const auto poFrom = DatasetOf(Bytes{{0, 10}});
    MemoryDataset oTo(2, 1, {tessel::eDT_8U, tessel::eDT_8U});
    datasources::BasicReader oReader(poFrom.get(), {1});
    datasources::BasicWriter oWriter(&oTo, {1, 2});
    FilterHomogeneity oFilter;
    oFilter.SetGrey(2);
    oFilter.PrepareForGivenGreyLevel(&oReader, nullptr, &oWriter);
    EXPECT_EQ(oFilter.GetCount(), 2);
}

TEST(FilterHomogeneity, FiltersTheBlocksOfThePreparedImage)
{
    Random oRandom(34);
    MemoryDataset oFrom(40, 30, {tessel::eDT_32R});
    for (std::size_t i = 0; i < 1200; ++i)
    {
        oFrom.Sample<float>(1, i % 40, i / 40) = RandomSample<float>(Samples::Ordinary, oRandom);
    }
    datasources::BasicReader oReader(&oFrom, {1});
    FilterHomogeneity oFilter;
    oFilter.SetGrey(16);
    oFilter.PrepareForGivenGreyLevel(&oReader, nullptr, nullptr);
    oReader.SetMargin(2, 2, datasources::eEM_Mirror);
    const std::unique_ptr<Raster> poIn(oReader.GetRaster(0));
    const auto poOut = BlankRaster(40, 30, 1, tessel::eDT_32R);
    oFilter.Process(poIn.get(), nullptr, poOut.get());
    ByDefinition<float>(oFilter, *poIn, nullptr)
        .Run([&](std::int64_t x, std::int64_t y, float fValue)
             { ASSERT_EQ(*poOut->GetPixelAs<float>(x, y), fValue); });
}

TEST(FilterHomogeneity, ResetForgetsEverythingButTheLevels)
{
    FilterHomogeneity oFilter;
    EXPECT_TRUE(oFilter.GetHist2Glev().empty());
    oFilter.SetGrey(3);
    Prepare(oFilter, Bytes{{0, 200, 7}});
    oFilter.Reset();
    EXPECT_EQ(oFilter.GetCount(), 0);
    EXPECT_EQ(oFilter.GetMin(), std::numeric_limits<double>::max());
    EXPECT_EQ(oFilter.GetMax(), std::numeric_limits<double>::lowest());
    EXPECT_EQ(oFilter.Get16Histogram(), std::vector<int>(65536, 0));
    EXPECT_EQ(oFilter.GetHist2Glev(), std::vector<int>(65536, 0));
    Prepare(oFilter, Bytes{{0, 200, 7}});
    EXPECT_EQ(oFilter.GetCount(), 3);
}

/// Runs a call that has to throw, and checks what it says.
template <class Call>
void ExpectError(const std::string& oMessage, const Call& oCall)
{
    try
    {
        oCall();
        ADD_FAILURE() << "nothing was thrown";
    }
    catch (const Exception& oError)
    {
        EXPECT_EQ(oError.GetMessage(), oMessage);
        if (oMessage != "Invalid type requested.")
        {
            EXPECT_EQ(oError.GetFile(), "");
            EXPECT_EQ(oError.GetFunction(), "");
            EXPECT_EQ(oError.GetLine(), 0U);
        }
    }
}

TEST(FilterHomogeneity, TakesUpTo255Levels)
{
    FilterHomogeneity oFilter;
    oFilter.SetGrey(0);
    oFilter.SetGrey(255);
    for (const int nGrey : {-1, 256, std::numeric_limits<int>::min()})
    {
        ExpectError("Invalid grey level, must be in [0,255].", [&] { oFilter.SetGrey(nGrey); });
    }
}

TEST(FilterHomogeneity, PreparesNothingWithoutLevels)
{
    FilterHomogeneity oFilter;
    oFilter.PrepareForGivenGreyLevel(nullptr, nullptr, nullptr);
    EXPECT_TRUE(oFilter.GetHist2Glev().empty());
}

TEST(FilterHomogeneity, RefusesReadersAndWritersThatItCannotUse)
{
    FilterHomogeneity oFilter;
    oFilter.SetGrey(2);
    ExpectError("Invalid input reader",
                [&] { oFilter.PrepareForGivenGreyLevel(nullptr, nullptr, nullptr); });
    MemoryDataset oFrom(2, 1, {tessel::eDT_8U, tessel::eDT_8U, tessel::eDT_C32R});
    datasources::BasicReader oTwo(&oFrom, {1, 2});
    ExpectError("Input for homogeneity filter supports only 1 channel",
                [&] { oFilter.PrepareForGivenGreyLevel(&oTwo, nullptr, nullptr); });
    datasources::BasicReader oComplex(&oFrom, {3});
    ExpectError("Invalid type requested.",
                [&] { oFilter.PrepareForGivenGreyLevel(&oComplex, nullptr, nullptr); });
    datasources::BasicReader oReader(&oFrom, {1});
    MemoryDataset oTo(2, 1, {tessel::eDT_64R});
    datasources::BasicWriter oWriter(&oTo, {1});
    ExpectError("Invalid grey level writer",
                [&] { oFilter.PrepareForGivenGreyLevel(&oReader, nullptr, &oWriter); });
    EXPECT_EQ(oFilter.GetCount(), 2);
}

TEST(FilterHomogeneity, RefusesBlocksThatItCannotWorkOn)
{
    const FilterHomogeneity oFilter = FilterOfValues();
    const auto poOne = BlankRaster(8, 1, 1, tessel::eDT_8U);
    const auto poTwo = BlankRaster(8, 1, 2, tessel::eDT_8U);
    const auto poComplex = BlankRaster(8, 1, 1, tessel::eDT_C32R);
    ExpectError("Invalid input Raster", [&] { oFilter.Process(nullptr, nullptr, nullptr); });
    ExpectError("Invalid output raster", [&] { oFilter.Process(poTwo.get(), nullptr, nullptr); });
    ExpectError("Input for homogeneity filter supports only 1 channel",
                [&] { oFilter.Process(poTwo.get(), nullptr, poOne.get()); });
    ExpectError("Input and output must have the same number of channels",
                [&] { oFilter.Process(poOne.get(), nullptr, poTwo.get()); });
    ExpectError("Invalid type requested.",
                [&] { oFilter.Process(poOne.get(), nullptr, poComplex.get()); });
    ExpectError("Invalid type requested.",
                [&] { oFilter.Process(poComplex.get(), nullptr, poOne.get()); });
    EXPECT_EQ(*poOne->mpBuffer, 0xA5);
}

}  // namespace
}  // namespace kor::filters
