#include "processes/qrdfilters/addaveragefilter.h"

#include <gtest/gtest.h>

#include "basic/tessel/mask/mask.h"
#include "platform/exception/exception.h"
#include "tests/support/blocks.h"
#include "tests/support/exceptions.h"

namespace kor::filters
{
namespace
{

using tessel::Mask;
using tessel::Raster;
using test::Image;
using RasterPointer = std::shared_ptr<Raster>;
using MaskPointer = std::shared_ptr<Mask>;

constexpr tessel::DataType kUnspecified;

/// A network with a raster and two masks that are null.
struct Network
{
    explicit Network(const RasterPointer& poRaster)
        : mnRaster(moProcessor.AddValue(poRaster)),
          mnMaskIn(moProcessor.AddValue(MaskPointer())),
          mnMaskOut(moProcessor.AddValue(MaskPointer()))
    {
    }

    std::uint64_t Add(int nSizeX, int nSizeY, const tessel::DataType& oIn,
                      const tessel::DataType& oOut, bool bBGZero = true)
    {
        return AddAverageFilter(moProcessor, mnRaster, mnMaskIn, mnMaskOut, nSizeX, nSizeY, bBGZero,
                                oIn, oOut);
    }
    RasterPointer Result(std::uint64_t nId)
    {
        return boost::any_cast<RasterPointer>(moProcessor.Evaluate(nId));
    }

    GenericProcessor moProcessor;
    std::uint64_t mnRaster;
    std::uint64_t mnMaskIn;
    std::uint64_t mnMaskOut;
};

template <class T>
RasterPointer SharedRaster(const Image<T>& oImage)
{
    return test::RasterOf(oImage, {1, 1});
}

template <class T>
Image<T> Picture()
{
    return {{1, 2, 3, 4}, {5, 6, 7, 8}, {9, 10, 11, 30}};
}

TEST(AddAverageFilter, TakesOneNodeForDoubles)
{
    Network oNetwork(SharedRaster(Picture<double>()));
    const auto nLast = oNetwork.Add(3, 3, tessel::eDT_64R, kUnspecified);
    EXPECT_EQ(oNetwork.moProcessor.GetNodeCount(), 4U);
    EXPECT_EQ(nLast, 3U);
    EXPECT_EQ(
        oNetwork.moProcessor.GetNode(nLast).moInputs,
        (std::vector<std::uint64_t>{oNetwork.mnRaster, oNetwork.mnMaskIn, oNetwork.mnMaskOut}));
    EXPECT_EQ(test::ImageOf<double>(*oNetwork.Result(nLast)), (Image<double>{{6, 9}}));
}

TEST(AddAverageFilter, ConvertsToDoubleAndBack)
{
    Network oNetwork(SharedRaster(Picture<unsigned char>()));
    const auto nLast = oNetwork.Add(3, 3, tessel::eDT_8U, kUnspecified);
    EXPECT_EQ(oNetwork.moProcessor.GetNodeCount(), 6U);
    EXPECT_EQ(oNetwork.moProcessor.GetNode(nLast - 2).moDescription, "Convert to double");
    EXPECT_EQ(oNetwork.moProcessor.GetNode(nLast - 1).moDescription, "Average filter [3, 3]");
    EXPECT_EQ(oNetwork.moProcessor.GetNode(nLast).moDescription, "Convert from double");
    EXPECT_EQ(test::ImageOf<unsigned char>(*oNetwork.Result(nLast)),
              (Image<unsigned char>{{6, 9}}));
}

TEST(AddAverageFilter, LeavesDoublesWhereTheyAreWanted)
{
    Network oNetwork(SharedRaster(Picture<unsigned short>()));
    const auto nLast = oNetwork.Add(3, 1, tessel::eDT_16U, tessel::eDT_64R);
    EXPECT_EQ(oNetwork.moProcessor.GetNodeCount(), 5U);
    EXPECT_EQ(test::ImageOf<double>(*oNetwork.Result(nLast)), (Image<double>{{6, 7}}));
}

TEST(AddAverageFilter, DescribesItsWindow)
{
    Network oNetwork(nullptr);
    const auto nLast = oNetwork.Add(5, 7, tessel::eDT_64R, kUnspecified);
    EXPECT_EQ(oNetwork.moProcessor.GetNode(nLast).moDescription, "Average filter [5, 7]");
}

TEST(AddAverageFilter, PassesTheMasksAndTheBackground)
{
    Network oNetwork(SharedRaster(Picture<double>()));
    const auto oMask = [&](const Image<int>& oImage) {
        return oNetwork.moProcessor.AddValue(MaskPointer(test::MaskOf(oImage, {1, 1})));
    };
    oNetwork.mnMaskIn = oMask({{1, 1, 1, 1}, {1, 0, 1, 1}, {1, 1, 1, 1}});
    EXPECT_EQ(
        test::ImageOf<double>(*oNetwork.Result(oNetwork.Add(3, 3, tessel::eDT_64R, kUnspecified))),
        (Image<double>{{0, 75.0 / 8.0}}));
    EXPECT_EQ(test::ImageOf<double>(
                  *oNetwork.Result(oNetwork.Add(3, 3, tessel::eDT_64R, kUnspecified, false))),
              (Image<double>{{6, 75.0 / 8.0}}));
}

// The output mask takes nothing out of the windows.
TEST(AddAverageFilter, TheOutputMaskMakesBackgroundAlone)
{
    Network oNetwork(SharedRaster(Picture<unsigned char>()));
    oNetwork.mnMaskOut = oNetwork.moProcessor.AddValue(
        MaskPointer(test::MaskOf({{1, 1, 1, 1}, {1, 0, 1, 1}, {1, 1, 1, 1}}, {1, 1})));
    EXPECT_EQ(test::ImageOf<unsigned char>(
                  *oNetwork.Result(oNetwork.Add(3, 3, tessel::eDT_8U, kUnspecified))),
              (Image<unsigned char>{{0, 9}}));
}

TEST(AddAverageFilter, RefusesARasterInPlaceOfAMask)
{
    Network oNetwork(SharedRaster(Picture<double>()));
    const auto oMessage = [&]
    {
        const auto nLast = oNetwork.Add(3, 3, tessel::eDT_64R, kUnspecified);
        return test::MessageOf<Exception>([&] { oNetwork.Result(nLast); });
    };
    oNetwork.mnMaskIn = oNetwork.mnRaster;
    std::string oText = oMessage();
    EXPECT_EQ(oText.rfind("Could not cast \"", 0), 0U) << oText;
    EXPECT_NE(oText.find("\" for parameter 2.  Note that boost::any requires asking  for the"),
              std::string::npos)
        << oText;
    oNetwork.mnMaskOut = oNetwork.mnRaster;
    oText = oMessage();
    EXPECT_NE(oText.find("\" for parameter 3."), std::string::npos) << oText;
}

TEST(AddAverageFilter, RunsSeveralFiltersOnOneRasterSideBySide)
{
    const test::Image<float> oImage = {{1, 2, 3, 4}, {5, 6, 7, 8}, {9, 10, 11, 30}};
    Network oNetwork(SharedRaster(oImage));
    const auto nSquare = oNetwork.Add(3, 3, tessel::eDT_32R, kUnspecified);
    const auto nRow = oNetwork.Add(3, 1, tessel::eDT_32R, kUnspecified);
    EXPECT_EQ(test::ImageOf<float>(*oNetwork.Result(nSquare)), (Image<float>{{6, 9}}));
    EXPECT_EQ(test::ImageOf<float>(*oNetwork.Result(nRow)), (Image<float>{{6, 7}}));
}

TEST(ConvertRasterTo, KeepsMarginsAndOffsetsAndTakesNull)
{
    const RasterPointer poIn = SharedRaster(Picture<short>());
    poIn->mnOffsetX = 11;
    poIn->mnOffsetY = 12;
    const RasterPointer poOut = ConvertRasterTo<double, 0>()(poIn);
    EXPECT_EQ(poOut->moDataType, tessel::eDT_64R);
    EXPECT_EQ(poOut->mnMarginX, 1U);
    EXPECT_EQ(poOut->mnMarginY, 1U);
    EXPECT_EQ(poOut->mnOffsetX, 11U);
    EXPECT_EQ(poOut->mnOffsetY, 12U);
    EXPECT_EQ(*poOut->GetPixelAs<double>(2, 1), 30.0);
    EXPECT_EQ(*poOut->GetPixelAs<double>(-1, -1), 1.0);
    EXPECT_EQ((ConvertRasterTo<double, 0>()(nullptr)), nullptr);
}

TEST(ConvertRasterToType, TakesItsTargetWhenItIsMadeAndRefusesNull)
{
    const RasterPointer poIn = SharedRaster(Image<double>{{0, 0, 0}, {0, 1e9, 0}, {0, 0, 0}});
    const RasterPointer poOut = ConvertRasterToType(tessel::eDT_16S)(poIn);
    EXPECT_EQ(test::ImageOf<short>(*poOut), (Image<short>{{32767}}));
    EXPECT_EQ(test::MessageOf<Exception>([] { ConvertRasterToType(tessel::eDT_8U)(nullptr); }),
              "poIn is invalid pointer");
}

}  // namespace
}  // namespace kor::filters
