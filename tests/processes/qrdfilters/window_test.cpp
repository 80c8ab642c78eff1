#include "processes/qrdfilters/window.h"

#include <gtest/gtest.h>

#include "tests/support/blocks.h"

namespace kor::filters
{

bool operator==(const Window& oOne, const Window& oOther)
{
    return oOne.mnHalfX == oOther.mnHalfX && oOne.mnHalfY == oOther.mnHalfY;
}

void PrintTo(const Window& oWindow, std::ostream* poStream)
{
    *poStream << oWindow.mnHalfX << " and " << oWindow.mnHalfY;
}

namespace
{

class WindowTest : public ::testing::Test
{
protected:
    std::unique_ptr<tessel::Raster> mpoBlock = test::BlankRaster(1, 1, 1, tessel::eDT_8U, {7, 9});
};

TEST_F(WindowTest, ExtentIsAlwaysOdd)
{
    const Window oWindow{2, 0};
    EXPECT_EQ(oWindow.GetWidth(), 5U);
    EXPECT_EQ(oWindow.GetHeight(), 1U);
}

TEST_F(WindowTest, MarginsHoldTheWindow)
{
    EXPECT_EQ(WindowOfMargins(*mpoBlock), (Window{7, 9}));
}

TEST_F(WindowTest, SizesAreHalvedByIntegerDivision)
{
    EXPECT_EQ(WindowOfBothSizes(4, 5, *mpoBlock), (Window{2, 2}));
    EXPECT_EQ(WindowOfEachSize(1, 7, *mpoBlock), (Window{0, 3}));
}

TEST_F(WindowTest, NegativeSizesAreOnePixel)
{
    EXPECT_EQ(WindowOfBothSizes(-5, -1, *mpoBlock), (Window{0, 0}));
    EXPECT_EQ(WindowOfEachSize(-5, boost::none, *mpoBlock), (Window{0, 9}));
}

TEST_F(WindowTest, MissingSizeLeavesBothAxesOrItsOwnToTheMargins)
{
    EXPECT_EQ(WindowOfBothSizes(3, boost::none, *mpoBlock), (Window{7, 9}));
    EXPECT_EQ(WindowOfBothSizes(boost::none, 3, *mpoBlock), (Window{7, 9}));
    EXPECT_EQ(WindowOfEachSize(3, boost::none, *mpoBlock), (Window{1, 9}));
    EXPECT_EQ(WindowOfEachSize(boost::none, 3, *mpoBlock), (Window{7, 1}));
}

TEST_F(WindowTest, FitsWhereNoHalfSizeExceedsItsMargin)
{
    EXPECT_TRUE(FitsMargins({7, 9}, *mpoBlock));
    EXPECT_FALSE(FitsMargins({8, 9}, *mpoBlock));
    EXPECT_FALSE(FitsMargins({7, 10}, *mpoBlock));
}

}  // namespace
}  // namespace kor::filters
