#include "processes/qrdfilters/parallelio/filteralgorithm.h"

#include <gtest/gtest.h>

#include <functional>
#include <limits>
#include <new>
#include <numeric>

#include "platform/datasources/basicreader.h"
#include "platform/datasources/basicwriter.h"
#include "platform/exception/exception.h"
#include "processes/qrdfilters/convertraster.h"
#include "processes/qrdfilters/filteraverage.h"
#include "processes/qrdfilters/filtermedian.h"
#include "tests/support/blocks.h"
#include "tests/support/memorydataset.h"

namespace kor::parallelio
{
namespace
{

using filters::FilterAverage;
using filters::FilterMedian;
using filters::Window;
using test::Image;
using test::ImageOf;
using test::MaskOf;
using test::MemoryDataset;
using test::RasterOf;

std::vector<unsigned int> AllChannels(const MemoryDataset& oDataset)
{
    std::vector<unsigned int> vnChannels(oDataset.GetChannelCount());
    std::iota(vnChannels.begin(), vnChannels.end(), 1U);
    return vnChannels;
}

/// Runs oAlgorithm over the whole of one dataset into another one.
void FilterDataset(FilterAlgorithm oAlgorithm, MemoryDataset& oIn, MemoryDataset& oOut,
                   std::uint64_t nBudget = 1 << 20)
{
    datasources::BasicReader oReader(&oIn, AllChannels(oIn));
    datasources::BasicWriter oWriter(&oOut, AllChannels(oOut));
    FilterDriver oDriver(std::move(oAlgorithm));
    oDriver.SetMemoryBudget(nBudget);
    oDriver.Run(&oReader, &oWriter);
}

/// The image of one channel with a margin made of its nearest pixels.
std::unique_ptr<tessel::Raster> WholeBlock(MemoryDataset& oDataset, Window oWindow)
{
    datasources::BasicReader oReader(&oDataset, AllChannels(oDataset));
    auto poBlock =
        test::BlankRaster(oDataset.GetWidth(), oDataset.GetHeight(), oDataset.GetChannelCount(),
                          oReader.GetDataType(), {oWindow.mnHalfX, oWindow.mnHalfY});
    oReader.ReadRaster(poBlock.get());
    return poBlock;
}

/// Hands on the block that the filter got, and notes it. Of any types, with two masks.
struct Probe
{
    void Process(tessel::Raster* poIn, tessel::Mask* poMaskIn, tessel::Raster* poOut,
                 tessel::Mask* poMaskOut) const
    {
        moOnBlock(poIn, poMaskIn, poOut, poMaskOut);
    }
    std::function<void(tessel::Raster*, tessel::Mask*, tessel::Raster*, tessel::Mask*)> moOnBlock;
};

/// A filter of doubles that adds a quarter; keeps its doubles if it is told to.
struct AddQuarter
{
    void Process(tessel::Raster* poIn, tessel::Mask* poMaskIn, tessel::Raster* poOut,
                 tessel::Mask* poMaskOut) const
    {
        ProcessBlock(poIn, poMaskIn, poOut, poMaskOut);
    }
    void ProcessBlock(tessel::Raster* poIn, tessel::Mask* /*poMaskIn*/, tessel::Raster* poOut,
                      tessel::Mask* /*poMaskOut*/) const
    {
        EXPECT_EQ(poIn->moDataType, tessel::eDT_64R);
        EXPECT_EQ(poOut->moDataType, tessel::eDT_64R);
        for (std::uint32_t y = 0; y < poOut->mnHeight; ++y)
        {
            for (std::uint32_t i = 0; i < poOut->mnWidth * poOut->mnChannels; ++i)
            {
                poOut->GetPixelAs<double>(0, y)[i] = poIn->GetPixelAs<double>(0, y)[i] + 0.25;
            }
        }
    }
    bool DoConvertBack() const { return mbConvertBack; }

    bool mbConvertBack = true;
};

/// Takes one mask alone.
struct OneMask
{
    void Process(tessel::Raster* poIn, tessel::Mask* poMask, tessel::Raster* poOut) const
    {
        poOut->mpBuffer[0] = poMask == nullptr ? poIn->mpBuffer[0] : 99;
    }
};

/// Makes the mask that it is given, whatever the block.
class FixedMask : public tessel::IMaskBuilder
{
public:
    explicit FixedMask(Image<int> oImage) : moImage(std::move(oImage)) {}
    tessel::Mask* BuildMask(const tessel::Raster& oRaster) const override
    {
        return MaskOf(moImage, {oRaster.mnMarginX, oRaster.mnMarginY}).release();
    }

private:
    Image<int> moImage;
};

TEST(FilterAlgorithm, ConvertsBlocksForAFilterOfDoublesThereAndBack)
{
    const auto poIn = RasterOf(Image<std::uint8_t>{{1, 2, 255}});
    const auto poOut = RasterOf(Image<float>{{0, 0, 0}});
    FilterAlgorithm(AddQuarter()).Process(poIn.get(), nullptr, poOut.get());
    EXPECT_EQ(ImageOf<float>(*poOut), (Image<float>{{1.25F, 2.25F, 255.25F}}));
}

TEST(FilterAlgorithm, ResultsAreRoundedByTheRulesOfTheLibrary)
{
    const auto poIn = RasterOf(Image<double>{{-3.0, 1.2, 1.3, 254.9}});
    const auto poOut = RasterOf(Image<std::uint8_t>{{9, 9, 9, 9}});
    FilterAlgorithm(AddQuarter()).Process(poIn.get(), nullptr, poOut.get());
    EXPECT_EQ(ImageOf<std::uint8_t>(*poOut), (Image<std::uint8_t>{{0, 1, 2, 255}}));
}

TEST(FilterAlgorithm, FilterThatKeepsItsDoublesNeedsAnOutputOfDoubles)
{
    const FilterAlgorithm oAlgorithm(AddQuarter{false});
    EXPECT_FALSE(oAlgorithm.DoConvertBack());
    const auto poIn = RasterOf(Image<std::uint8_t>{{1, 2}});
    const auto poDoubles = RasterOf(Image<double>{{0, 0}});
    oAlgorithm.Process(poIn.get(), nullptr, poDoubles.get());
    EXPECT_EQ(ImageOf<double>(*poDoubles), (Image<double>{{1.25, 2.25}}));

    const auto poBytes = RasterOf(Image<std::uint8_t>{{7, 7}});
    try
    {
        oAlgorithm.Process(poIn.get(), nullptr, poBytes.get());
        FAIL() << "bytes were taken";
    }
    catch (const Exception& oError)
    {
        EXPECT_EQ(oError.GetMessage(),
                  "The results of this filter stay doubles: the output has to be eDT_64R");
        EXPECT_EQ(oError.GetFile(), "processes/qrdfilters/parallelio/filteralgorithm");
    }
    EXPECT_EQ(ImageOf<std::uint8_t>(*poBytes), (Image<std::uint8_t>{{7, 7}}));
}

TEST(FilterAlgorithm, OtherFiltersGetTheBlocksAsTheyAre)
{
    const auto poIn = RasterOf(Image<std::int16_t>{{5}});
    const auto poOut = RasterOf(Image<float>{{0}});
    bool bCalled = false;
    const FilterAlgorithm oAlgorithm(Probe{[&](auto* poSeen, auto*, auto* poMade, auto*)
                                           {
                                               bCalled = true;
                                               EXPECT_EQ(poSeen, poIn.get());
                                               EXPECT_EQ(poMade, poOut.get());
                                           }});
    oAlgorithm.Process(poIn.get(), nullptr, poOut.get());
    EXPECT_TRUE(bCalled);
}

TEST(FilterAlgorithm, FilterWithOneMaskGetsThatOfTheInput)
{
    const auto poIn = RasterOf(Image<std::uint8_t>{{5}});
    const auto poOut = RasterOf(Image<std::uint8_t>{{0}});
    FilterAlgorithm oAlgorithm{OneMask()};
    FixedMask oBuilder({{1}});
    oAlgorithm.SetOutputMaskBuilder(&oBuilder);
    oAlgorithm.Process(poIn.get(), nullptr, poOut.get());
    EXPECT_EQ(poOut->mpBuffer[0], 5);
    const auto poMask = MaskOf({{1}});
    oAlgorithm.Process(poIn.get(), poMask.get(), poOut.get());
    EXPECT_EQ(poOut->mpBuffer[0], 99);
}

TEST(FilterAlgorithm, OutputMaskIsMadeOfTheInputBlock)
{
    const auto poIn = RasterOf(Image<std::uint8_t>{{1, 2, 3}, {4, 5, 6}, {7, 8, 9}}, {1, 0});
    const auto poOut = RasterOf(Image<std::uint8_t>{{0}, {0}, {0}});
    FixedMask oBuilder({{1, 1, 1}, {1, 0, 1}, {1, 1, 1}});
    FilterAlgorithm oAlgorithm{FilterAverage(true)};
    oAlgorithm.SetOutputMaskBuilder(&oBuilder);
    oAlgorithm.Process(poIn.get(), nullptr, poOut.get());
    EXPECT_EQ(ImageOf<std::uint8_t>(*poOut), (Image<std::uint8_t>{{2}, {0}, {8}}));
}

TEST(FilterAlgorithm, FilterOfDoublesSeesMagnitudesOrWhatIsAskedFor)
{
    auto poIn = test::BlankRaster(1, 1, 1, tessel::eDT_C16S);
    auto* pnParts = reinterpret_cast<std::int16_t*>(poIn->mpBuffer);
    pnParts[0] = 3;
    pnParts[1] = -4;
    const auto poOut = RasterOf(Image<double>{{0}});
    FilterAlgorithm oAlgorithm{AddQuarter()};
    oAlgorithm.Process(poIn.get(), nullptr, poOut.get());
    EXPECT_EQ(ImageOf<double>(*poOut), (Image<double>{{5.25}}));
    oAlgorithm.SetComplexInterpretation(tessel::eKIT_Intensity);
    oAlgorithm.Process(poIn.get(), nullptr, poOut.get());
    EXPECT_EQ(ImageOf<double>(*poOut), (Image<double>{{25.25}}));
}

TEST(FilterAlgorithm, OtherFiltersSeeComplexBlocksUnlessAskedOtherwise)
{
    const auto poIn = test::BlankRaster(1, 1, 1, tessel::eDT_C16S);
    const auto poOut = RasterOf(Image<double>{{0}});
    tessel::DataType oSeen;
    FilterAlgorithm oAlgorithm(
        Probe{[&](auto* poBlock, auto*, auto*, auto*) { oSeen = poBlock->moDataType; }});
    oAlgorithm.Process(poIn.get(), nullptr, poOut.get());
    EXPECT_EQ(oSeen, tessel::eDT_C16S);
    oAlgorithm.SetComplexInterpretation(tessel::eKIT_Imaginary);
    oAlgorithm.Process(poIn.get(), nullptr, poOut.get());
    EXPECT_EQ(oSeen, tessel::eDT_32R);
}

TEST(FilterAlgorithm, RefusesComplexOutputOfDoublesAndMissingBlocks)
{
    const auto poIn = RasterOf(Image<double>{{0}});
    const auto poOut = test::BlankRaster(1, 1, 1, tessel::eDT_C32R);
    const FilterAlgorithm oAlgorithm{AddQuarter()};
    const auto oMessage = [&](tessel::Raster* poFrom, tessel::Raster* poTo) -> std::string
    {
        try
        {
            oAlgorithm.Process(poFrom, nullptr, poTo);
        }
        catch (const Exception& oError)
        {
            return oError.GetMessage();
        }
        return "";
    };
    EXPECT_EQ(oMessage(poIn.get(), poOut.get()), "Output cannot be complex");
    EXPECT_EQ(oMessage(nullptr, poOut.get()), "poRasterIn is invalid pointer");
    EXPECT_EQ(oMessage(poIn.get(), nullptr), "poRasterOut is invalid pointer");
}

TEST(FilterAlgorithm, LackOfMemoryIsAnErrorThatTheDriverCarries)
{
    const auto poIn = RasterOf(Image<std::uint8_t>{{1, 2}, {3, 4}});
    const FilterAlgorithm oAlgorithm(
        Probe{[](auto*, auto*, auto*, auto*) { throw std::bad_alloc(); }});
    try
    {
        oAlgorithm.Process(poIn.get(), nullptr, poIn.get());
        FAIL() << "nothing was thrown";
    }
    catch (const Exception& oError)
    {
        EXPECT_EQ(oError.GetMessage(),
                  "There is no memory to filter a block of 2 x 2 pixels of 1 channels");
    }
}

// Integers: a new block's fresh sums change nothing, so the blocks' seams must not show.
TEST(FilterDriver, ImageInBlocksIsTheImageInOne)
{
    test::Random oRandom(11);
    for (const unsigned int nTile : {0U, 16U})
    {
        MemoryDataset oIn(53, 41, {tessel::eDT_16U, tessel::eDT_16U});
        oIn.mnTileWidth = nTile;
        oIn.mnTileHeight = nTile;
        oIn.FillRandom(oRandom);
        MemoryDataset oOut(53, 41, {tessel::eDT_32S, tessel::eDT_32S});
        oOut.mnTileWidth = nTile;
        oOut.mnTileHeight = nTile;
        const Window oWindow{3, 2};
        const auto poWhole = WholeBlock(oIn, oWindow);

        const auto poExpected = test::BlankRaster(53, 41, 2, tessel::eDT_32S);
        FilterMedian().Process(poWhole.get(), nullptr, poExpected.get(), nullptr);
        FilterDataset(FilterAlgorithm(FilterMedian(), oWindow), oIn, oOut, 4000);
        EXPECT_TRUE(test::SameBits(*WholeBlock(oOut, {}), *poExpected));

        const auto poDoubles = test::BlankRaster(53, 41, 2, tessel::eDT_64R, {3, 2});
        filters::ConvertRaster(poWhole.get(), poDoubles.get());
        const auto poMeans = test::BlankRaster(53, 41, 2, tessel::eDT_64R);
        FilterAverage().Process(poDoubles.get(), nullptr, poMeans.get(), nullptr);
        filters::ConvertRaster(poMeans.get(), poExpected.get());
        FilterDataset(FilterAlgorithm(FilterAverage(), oWindow), oIn, oOut, 20000);
        EXPECT_TRUE(test::SameBits(*WholeBlock(oOut, {}), *poExpected));
    }
}

TEST(FilterDriver, BlocksHaveTheWindowsMarginsWhateverTheReaderIsSetTo)
{
    MemoryDataset oIn(4, 4, {tessel::eDT_8U});
    datasources::BasicReader oReader(&oIn, {1});
    oReader.SetMargin(5, 6, 2);
    const auto oMargins = [&](const std::optional<Window>& oWindow)
    {
        std::pair<unsigned int, unsigned int> oSeen;
        FilterDriver oDriver(
            FilterAlgorithm(Probe{[&](auto* poBlock, auto*, auto* poMade, auto*)
                                  {
                                      oSeen = {poBlock->mnMarginX, poBlock->mnMarginY};
                                      EXPECT_EQ(poMade->mnMarginX, 0U);
                                  }},
                            oWindow));
        oDriver.Run(&oReader, nullptr);
        return oSeen;
    };
    EXPECT_EQ(oMargins(Window{1, 2}), (std::pair{1U, 2U}));
    EXPECT_EQ(oMargins(std::nullopt), (std::pair{5U, 6U}));
}

class MissingData : public ::testing::Test
{
protected:
    /// True when the filter's blocks come with a mask, whose middle pixel is cleared.
    bool IsMasked(MemoryDataset& oIn, bool bMasksMissingData = true)
    {
        bool bMasked = false;
        FilterAlgorithm oProbe(Probe{[&](auto*, auto* poMask, auto*, auto*)
                                     {
                                         bMasked = poMask != nullptr;
                                         EXPECT_EQ(test::IsValid(poMask, 1, 0), poMask == nullptr);
                                     }});
        oProbe.SetMasksMissingData(bMasksMissingData);
        datasources::BasicReader oReader(&oIn, AllChannels(oIn));
        FilterDriver oDriver(oProbe);
        oDriver.Run(&oReader, nullptr);
        return bMasked;
    }
};

TEST_F(MissingData, IsMaskedInFloatingPointImages)
{
    MemoryDataset oIn(3, 1, {tessel::eDT_32R});
    oIn.Sample<float>(1, 1, 0) = std::numeric_limits<float>::quiet_NaN();
    EXPECT_TRUE(IsMasked(oIn));
}

TEST_F(MissingData, IsMaskedWhereTheDatasetNamesIt)
{
    MemoryDataset oIn(3, 1, {tessel::eDT_8U, tessel::eDT_8U});
    EXPECT_FALSE(IsMasked(oIn));
    datasources::AuxiliaryData oData;
    oData.SetChannelNoData(7.0, 2);
    oIn.SetAuxiliaryData(oData);
    oIn.Sample<std::uint8_t>(2, 1, 0) = 7;
    EXPECT_TRUE(IsMasked(oIn));
}

TEST_F(MissingData, IsNotMaskedWhenThatIsOff)
{
    MemoryDataset oIn(3, 1, {tessel::eDT_32R});
    EXPECT_FALSE(IsMasked(oIn, false));
}

TEST_F(MissingData, GivesWayToTheCallersMask)
{
    MemoryDataset oIn(3, 1, {tessel::eDT_32R});
    for (const std::uint32_t x : {0U, 1U, 2U})
    {
        oIn.Sample<float>(1, x, 0) = static_cast<float>(x);
    }
    MemoryDataset oOut(3, 1, {tessel::eDT_32R});
    FixedMask oBuilder({{1, 1, 0}});
    FilterAlgorithm oAlgorithm(FilterAverage(true));
    oAlgorithm.SetMaskBuilder(&oBuilder);
    FilterDataset(oAlgorithm, oIn, oOut);
    EXPECT_EQ(ImageOf<float>(*WholeBlock(oOut, {})), (Image<float>{{0, 1, 0}}));
}

// One not-a-number would spoil the rest of its row and of the rows below.
TEST_F(MissingData, LeavesTheMeansAroundItWhole)
{
    MemoryDataset oIn(5, 3, {tessel::eDT_32R});
    oIn.Sample<float>(1, 1, 1) = std::numeric_limits<float>::quiet_NaN();
    oIn.Sample<float>(1, 4, 1) = 9.0F;
    MemoryDataset oOut(5, 3, {tessel::eDT_32R});
    FilterDataset(FilterAlgorithm(FilterAverage(false), Window{1, 1}), oIn, oOut);
    const float fNan = std::numeric_limits<float>::quiet_NaN();
    const auto poMade = WholeBlock(oOut, {});
    const auto poExpected =
        RasterOf(Image<float>{{0, 0, 0, 1, 2}, {0, fNan, 0, 1, 2}, {0, 0, 0, 1, 2}});
    EXPECT_TRUE(test::SameBits(*poMade, *poExpected));
}

/// What is in memory for the greatest block that a driver takes.
std::uint64_t GreatestBlockBytes(std::uint64_t nBudget, unsigned int nTile, Window oWindow)
{
    MemoryDataset oIn(200, 300, {tessel::eDT_16U});
    MemoryDataset oOut(200, 300, {tessel::eDT_16U});
    oIn.mnTileWidth = oIn.mnTileHeight = oOut.mnTileWidth = oOut.mnTileHeight = nTile;
    datasources::BasicReader oReader(&oIn, {1});
    datasources::BasicWriter oWriter(&oOut, {1});
    FilterDriver oDriver(FilterAlgorithm(AddQuarter(), oWindow));
    oDriver.SetMemoryBudget(nBudget);
    std::vector<BlockRecord> voBlocks;
    oDriver.BuildBlocks(voBlocks, &oReader, &oWriter);
    std::uint64_t nGreatest = 0;
    for (const BlockRecord& oBlock : voBlocks)
    {
        const auto& oInfo = oBlock.moInputInfo;
        const std::uint64_t nRead = std::uint64_t{oInfo.mnWidth + 2 * oWindow.mnHalfX} *
                                    (oInfo.mnHeight + 2 * oWindow.mnHalfY);
        const std::uint64_t nInner = std::uint64_t{oInfo.mnWidth} * oInfo.mnHeight;
        nGreatest = std::max(nGreatest, nRead * (2 * 2 + 8) + nInner * (2 * 2 + 8));
    }
    return nGreatest;
}

TEST(FilterAccessPolicy, BlocksWithMarginsAndWorkingCopiesStayWithinTheBudget)
{
    for (const unsigned int nTile : {0U, 32U})
    {
        for (const Window oWindow : {Window{0, 0}, Window{3, 3}, Window{10, 20}})
        {
            for (const std::uint64_t nBudget : {400000U, 700000U, 1500000U})
            {
                const std::uint64_t nBytes = GreatestBlockBytes(nBudget, nTile, oWindow);
                EXPECT_LE(nBytes, nBudget) << nTile << ' ' << oWindow.mnHalfY;
                EXPECT_GE(nBytes, nBudget / 5) << nTile << ' ' << oWindow.mnHalfY;
            }
        }
    }
}

TEST(FilterAccessPolicy, GoesOnWithRowsWhereTheBudgetHoldsNone)
{
    EXPECT_EQ(GreatestBlockBytes(100, 0, {3, 3}), 206U * 7 * 12 + 200 * 12);
}

}  // namespace
}  // namespace kor::parallelio
