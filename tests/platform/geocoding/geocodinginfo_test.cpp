#include "platform/geocoding/geocodinginfo.h"

#include <gtest/gtest.h>

#include "tests/support/exceptions.h"

namespace kor::ogc::cs
{
namespace
{

struct Point
{
    double x = 0.0;
    double y = 0.0;
    bool operator==(const Point&) const = default;
};

Point ToMap(const GeocodingInfo& oInfo, double dfCol, double dfRow)
{
    Point oPoint;
    oInfo.RasterToMap(dfCol, dfRow, oPoint.x, oPoint.y);
    return oPoint;
}

Point ToRaster(const GeocodingInfo& oInfo, double dfX, double dfY)
{
    Point oPoint;
    oInfo.MapToRaster(dfX, dfY, oPoint.x, oPoint.y);
    return oPoint;
}

TEST(GeocodingInfo, DefaultIsAPixelGridWithRowsDownwards)
{
    const GeocodingInfo oInfo;
    EXPECT_EQ(oInfo.GetXOffset(), 0.0);
    EXPECT_EQ(oInfo.GetXPerCol(), 1.0);
    EXPECT_EQ(oInfo.GetYOffset(), 0.0);
    EXPECT_EQ(oInfo.GetYPerRow(), -1.0);
    EXPECT_EQ(oInfo.GetXPerRow(), 0.0);
    EXPECT_EQ(oInfo.GetYPerCol(), 0.0);
    EXPECT_EQ(oInfo.GetProjection(), "");
    EXPECT_EQ(ToMap(oInfo, 3.0, 4.0), (Point{3.0, -4.0}));
}

TEST(GeocodingInfo, FourTermsPlaceAnUprightImage)
{
    const GeocodingInfo oInfo(500000.0, 10.0, 5600000.0, -20.0);
    EXPECT_EQ(ToMap(oInfo, 2.5, 3.0), (Point{500025.0, 5599940.0}));
    EXPECT_EQ(ToRaster(oInfo, 500025.0, 5599940.0), (Point{2.5, 3.0}));
}

TEST(GeocodingInfo, SixTermsPlaceATurnedImage)
{
    // A quarter turn: columns run south, rows run west.
    const GeocodingInfo oInfo(GeocodingInfo::Transform{100.0, 0.0, -2.0, 50.0, -4.0, 0.0});
    EXPECT_EQ(ToMap(oInfo, 3.0, 5.0), (Point{90.0, 38.0}));
    EXPECT_EQ(ToRaster(oInfo, 90.0, 38.0), (Point{3.0, 5.0}));
}

// The general form would divide 3 * 0.1 * -0.1 by 0.1 * -0.1, which gives 3 and not the quotient.
TEST(GeocodingInfo, UprightImagesAreInvertedByOneDivision)
{
    const GeocodingInfo oInfo(0.0, 0.1, 0.0, -0.1);
    EXPECT_EQ(ToRaster(oInfo, 3 * 0.1, 0.2), (Point{3 * 0.1 / 0.1, -2.0}));
    EXPECT_NE(3 * 0.1 / 0.1, 3.0);
}

TEST(GeocodingInfo, OneVariableMayServeAsInputAndOutput)
{
    const GeocodingInfo oInfo(GeocodingInfo::Transform{1.0, 2.0, 3.0, 4.0, 5.0, 7.0});
    double dfX = 10.0;
    double dfY = 100.0;
    oInfo.RasterToMap(dfX, dfY, dfX, dfY);
    EXPECT_EQ((Point{dfX, dfY}), (Point{321.0, 754.0}));
    oInfo.MapToRaster(dfX, dfY, dfX, dfY);
    EXPECT_EQ((Point{dfX, dfY}), (Point{10.0, 100.0}));
}

TEST(GeocodingInfo, PixelWithoutAreaHasNoInverse)
{
    const GeocodingInfo oInfo(0.0, 0.0, 0.0, -1.0);
    EXPECT_EQ(test::MessageOf<DataException>([&] { ToRaster(oInfo, 1.0, 1.0); }),
              "The transform from raster to map has no inverse: a pixel has no area");
}

TEST(GeocodingInfo, ProjectionIsKeptAsItIs)
{
    GeocodingInfo oInfo;
    oInfo.SetProjection("LOCAL_CS[\"x\"]");
    EXPECT_EQ(oInfo.GetProjection(), "LOCAL_CS[\"x\"]");
    EXPECT_NE(oInfo, GeocodingInfo());
}

}  // namespace
}  // namespace kor::ogc::cs
