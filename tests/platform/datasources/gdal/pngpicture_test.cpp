#include <gtest/gtest.h>

#include "tests/platform/datasources/gdal/gdalfiles.h"

namespace kor::datasources
{
namespace
{

using test::Image;
using test::MessageOf;

using Bytes = Image<std::uint8_t>;

class WritePngTest : public test::GdalFilesTest
{
};

TEST_F(WritePngTest, GreyPictureHoldsTheInnerArea)
{
    const auto poRaster =
        test::RasterOf(Bytes{{9, 9, 9, 9}, {9, 1, 250, 9}, {9, 3, 4, 9}, {9, 9, 9, 9}}, {1, 1});
    WritePng(File("x.png"), *poRaster);
    EXPECT_EQ(test::ImageOf<std::uint8_t>(*ReadFile(File("x.png"))), (Bytes{{1, 250}, {3, 4}}));
    EXPECT_EQ(moDirectory.Names(), (std::set<std::string>{"x.png"}));
}

TEST_F(WritePngTest, ColourPictureHoldsThreeChannels)
{
    const auto poRaster = test::RasterOf(Bytes{{1, 2, 3, 4, 5, 6}}, {}, 3);
    WritePng(File("x.png"), *poRaster);
    const auto poBack = ReadFile(File("x.png"));
    EXPECT_EQ(poBack->mnChannels, 3U);
    EXPECT_TRUE(test::SameBits(*poBack, *poRaster));
}

TEST_F(WritePngTest, OlderPictureIsReplaced)
{
    WritePng(File("x.png"), *test::RasterOf(Bytes{{1, 2}}));
    WritePng(File("x.png"), *test::RasterOf(Bytes{{3}}));
    EXPECT_EQ(test::ImageOf<std::uint8_t>(*ReadFile(File("x.png"))), (Bytes{{3}}));
}

TEST_F(WritePngTest, OtherRastersAreRefused)
{
    const std::string oName = File("x.png");
    EXPECT_EQ(MessageOf<DataException>(
                  [&] { WritePng(oName, *test::BlankRaster(2, 2, 1, tessel::eDT_16U)); }),
              oName + ": a picture is made of samples of eDT_8U and not of eDT_16U");
    EXPECT_EQ(MessageOf<DataException>(
                  [&] { WritePng(oName, *test::BlankRaster(2, 2, 2, tessel::eDT_8U)); }),
              oName +
                  ": a picture cannot be made of 2 x 2 pixels of 2 channels; it has 1 channel "
                  "(grey) or 3 (red, green, blue)");
    EXPECT_THROW(WritePng(oName, *test::BlankRaster(0, 2, 1, tessel::eDT_8U)), DataException);
    EXPECT_TRUE(moDirectory.Names().empty());
}

TEST_F(WritePngTest, FailureLeavesNothingBehind)
{
    const auto poRaster = test::RasterOf(Bytes{{1}});
    EXPECT_THROW(WritePng(File("none/x.png"), *poRaster), FileException);
    std::filesystem::create_directory(File("taken.png"));
    EXPECT_EQ(MessageOf<FileException>([&] { WritePng(File("taken.png"), *poRaster); }),
              File("taken.png") + ": cannot write the picture: Is a directory");
    EXPECT_EQ(moDirectory.Names(), (std::set<std::string>{"taken.png"}));
}

TEST_F(WritePngTest, OlderPictureOutlivesAFullDisk)
{
    test::Random oRandom(1);
    const auto poRaster =
        test::RandomRaster(300, 300, 3, tessel::eDT_8U, {}, test::Samples::Ordinary, oRandom);
    WritePng(File("x.png"), *test::RasterOf(Bytes{{1, 2}}));
    {
        const test::FullDisk oFull(10000);
        EXPECT_THROW(WritePng(File("x.png"), *poRaster), FileException);
    }
    EXPECT_EQ(test::ImageOf<std::uint8_t>(*ReadFile(File("x.png"))), (Bytes{{1, 2}}));
    EXPECT_EQ(moDirectory.Names(), (std::set<std::string>{"x.png"}));
}

}  // namespace
}  // namespace kor::datasources
