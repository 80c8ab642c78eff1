#include "processes/qrdfilters/blockcontract.h"

#include <gtest/gtest.h>

#include <string>

#include "platform/exception/exception.h"
#include "processes/qrdfilters/filteraverage.h"
#include "processes/qrdfilters/hardened.h"
#include "tests/support/blocks.h"

namespace kor::filters
{
namespace
{

using namespace kor::test;
using tessel::eDT_32R;
using tessel::eDT_64R;
using tessel::eDT_8U;

constexpr const char* kSource = "processes/qrdfilters/filterexample";

/// The message of what oCall throws; empty when it throws nothing, as in every build that trusts
/// callers.
template <class Call>
std::string MessageOf(const Call& oCall)
{
    try
    {
        oCall();
    }
    catch (const Exception& oException)
    {
        return oException.GetMessage();
    }
    return "";
}

std::string Mismatch(const tessel::Raster& oIn, const tessel::Mask* poMaskIn,
                     const tessel::Raster& oOut, const tessel::Mask* poMaskOut)
{
    return MessageOf([&] { RequireMatchingBlocks(oIn, poMaskIn, oOut, poMaskOut, kSource); });
}

std::string InHardenedBuilds(const std::string& oMessage)
{
    return kHardened ? oMessage : "";
}

TEST(RequireMatchingBlocks, LooksAtWhatFiltersRelyOn)
{
    Random oRandom(1);
    const auto poIn = BlankRaster(4, 3, 2, eDT_8U, Margins{1, 2});
    const auto poMaskIn = RandomMask(4, 3, Margins{1, 2}, 0.5, oRandom);
    const auto poMaskOut = RandomMask(4, 3, Margins{5, 0}, 0.5, oRandom);
    const auto poOut = BlankRaster(4, 3, 2, eDT_32R, Margins{3, 0});
    EXPECT_EQ(Mismatch(*poIn, poMaskIn.get(), *poOut, poMaskOut.get()), "");
    EXPECT_EQ(Mismatch(*poIn, nullptr, *poOut, nullptr), "");

    EXPECT_EQ(Mismatch(*poIn, nullptr, *BlankRaster(4, 2, 2, eDT_8U), nullptr),
              InHardenedBuilds("poRasterOut has 4 x 2 pixels, poRasterIn 4 x 3 pixels"));
    EXPECT_EQ(Mismatch(*poIn, nullptr, *BlankRaster(5, 3, 2, eDT_8U), nullptr),
              InHardenedBuilds("poRasterOut has 5 x 3 pixels, poRasterIn 4 x 3 pixels"));
    EXPECT_EQ(Mismatch(*poIn, nullptr, *BlankRaster(4, 3, 1, eDT_8U), nullptr),
              InHardenedBuilds("poRasterOut has 1 channels, poRasterIn 2"));
    EXPECT_EQ(Mismatch(*poIn, poMaskOut.get(), *poOut, nullptr),
              InHardenedBuilds("poMaskIn has 4 x 3 pixels with margins 5 and 0, poRasterIn 4 x 3 "
                               "pixels with margins 1 and 2"));
    const auto poNarrow = RandomMask(3, 3, Margins{1, 2}, 0.5, oRandom);
    EXPECT_EQ(Mismatch(*poIn, nullptr, *poOut, poNarrow.get()),
              InHardenedBuilds("poMaskOut has 3 x 3 pixels, poRasterIn 4 x 3 pixels"));
}

TEST(RequireType, NamesTheParameter)
{
    const auto poBlock = BlankRaster(1, 1, 1, eDT_32R);
    EXPECT_EQ(MessageOf([&] { RequireType(*poBlock, eDT_32R, "poRasterIn", kSource); }), "");
    EXPECT_EQ(MessageOf([&] { RequireType(*poBlock, eDT_64R, "poRasterIn", kSource); }),
              InHardenedBuilds(
                  "poRasterIn has samples of 32 bits of another type than the filter reads"));
}

TEST(RequireDoubleBlocks, LooksAtTypesAndAtWhatFiltersRelyOn)
{
    const auto poBlock = BlankRaster(2, 2, 1, eDT_64R);
    const auto poFloat = BlankRaster(2, 2, 1, eDT_32R);
    const auto poWide = BlankRaster(3, 2, 1, eDT_64R);
    const auto oMessage = [](const tessel::Raster& oIn, const tessel::Raster& oOut)
    { return MessageOf([&] { RequireDoubleBlocks(oIn, nullptr, oOut, nullptr, kSource); }); };
    EXPECT_EQ(oMessage(*poBlock, *poBlock), "");
    EXPECT_EQ(oMessage(*poFloat, *poBlock),
              InHardenedBuilds(
                  "poRasterIn has samples of 32 bits of another type than the filter reads"));
    EXPECT_EQ(oMessage(*poBlock, *poFloat),
              InHardenedBuilds(
                  "poRasterOut has samples of 32 bits of another type than the filter reads"));
    EXPECT_EQ(oMessage(*poBlock, *poWide),
              InHardenedBuilds("poRasterOut has 3 x 2 pixels, poRasterIn 2 x 2 pixels"));
}

TEST(RequireWindowInside, LooksAtTheMarginsOfBlockAndMask)
{
    Random oRandom(1);
    const auto poIn = BlankRaster(4, 3, 1, eDT_8U, Margins{1, 2});
    const auto poMask = RandomMask(4, 3, Margins{5, 1}, 0.5, oRandom);
    EXPECT_EQ(MessageOf([&] { RequireWindowInside({1, 1}, *poIn, poMask.get(), kSource); }), "");
    EXPECT_EQ(MessageOf([&] { RequireWindowInside({1, 2}, *poIn, nullptr, kSource); }), "");
    EXPECT_EQ(
        MessageOf(
            [&] {
                RequireWindowInside({2, 2}, *poIn, nullptr, kSource);
            }),
        InHardenedBuilds("The window of 5 x 5 pixels needs margins of 2 and 2, poRasterIn has "
                         "4 x 3 pixels with margins 1 and 2"));
    EXPECT_EQ(MessageOf(
                  [&] {
                      RequireWindowInside({1, 2}, *poIn, poMask.get(), kSource);
                  }),
              InHardenedBuilds("The window of 3 x 5 pixels needs margins of 1 and 2 around 4 x 3 "
                               "pixels, poMaskIn has 4 x 3 pixels with margins 5 and 1"));
}

// The window engine has no other test of its blocks; without this one it reads outside them.
TEST(WindowEngine, ChecksItsBlocksInHardenedBuilds)
{
    if (!kHardened)
    {
        GTEST_SKIP() << "other builds trust the caller";
    }
    FilterAverage oFilter;
    const auto poIn = BlankRaster(4, 3, 2, eDT_64R, Margins{1, 1});
    const auto poOut = BlankRaster(4, 3, 2, eDT_64R);
    oFilter.SetFilterSize(5, 5);
    EXPECT_THROW(oFilter.Process(poIn.get(), nullptr, poOut.get(), nullptr), Exception);
    oFilter.SetFilterSize(3, 3);
    EXPECT_NO_THROW(oFilter.Process(poIn.get(), nullptr, poOut.get(), nullptr));
    const auto poFloat = BlankRaster(4, 3, 2, eDT_32R, Margins{1, 1});
    EXPECT_THROW(oFilter.Process(poFloat.get(), nullptr, poOut.get(), nullptr), Exception);
    EXPECT_THROW(oFilter.Process(poIn.get(), nullptr, poFloat.get(), nullptr), Exception);
    const auto poSmall = BlankRaster(4, 2, 2, eDT_64R);
    EXPECT_THROW(oFilter.Process(poIn.get(), nullptr, poSmall.get(), nullptr), Exception);
}

}  // namespace
}  // namespace kor::filters
