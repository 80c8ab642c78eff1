#include <gtest/gtest.h>

#include <filesystem>

#include "platform/datasources/basicreader.h"
#include "platform/datasources/gdal/gdaldriver.h"
#include "tests/support/blocks.h"
#include "tests/support/program.h"
#include "tests/support/temporarydirectory.h"

namespace kor::test
{
namespace
{

class Network : public ::testing::Test
{
protected:
    void SetUp() override
    {
        datasources::RegisterGdalDriver();
        moIn = moFolder.Write("in.asc",
                              "ncols 3\nnrows 3\nxllcorner 0\nyllcorner 0\ncellsize 1\n"
                              "1 2 3\n4 5 6\n7 8 90\n");
    }

    TemporaryDirectory moFolder;
    std::string moIn;
};

// The edge is repeated: the mean of the lower right 3 x 3 is (5 + 6 + 6 + 8 + 8 + 90 * 4) / 9.
TEST_F(Network, WritesTheDifferenceOfTwoAverages)
{
    const ProgramRun oRun =
        RunExample("network", moIn + " " + moFolder.File("out.tif") + " small=1 large=3");
    ASSERT_EQ(oRun.mnStatus, 0) << oRun.moComplaint;
    datasources::BasicReader oReader(moFolder.File("out.tif"), {1}, 0);
    EXPECT_EQ(oReader.GetDataType(), tessel::eDT_32R);
    const auto poOut = BlankRaster(3, 3, 1, tessel::eDT_32R);
    oReader.ReadRaster(poOut.get());
    const Image<float> oOut = ImageOf<float>(*poOut);
    EXPECT_FLOAT_EQ(oOut.Samples()[0], 1.0F - 21.0F / 9.0F);
    EXPECT_FLOAT_EQ(oOut.Samples()[4], 5.0F - 126.0F / 9.0F);
    EXPECT_FLOAT_EQ(oOut.Samples()[8], 90.0F - (5 + 6 + 6 + 8 + 90 + 90 + 8 + 90 + 90) / 9.0F);
    EXPECT_NE(oRun.moSaid.find("Average filter [1, 1]"), std::string::npos) << oRun.moSaid;
    EXPECT_NE(oRun.moSaid.find("Average filter [3, 3]"), std::string::npos) << oRun.moSaid;
}

TEST_F(Network, SaysWhatIsWrongInOneLine)
{
    const std::string oOut = moFolder.File("out.tif");
    EXPECT_EQ(RunExample("network", moIn).mnStatus, 2);
    const ProgramRun oEven = RunExample("network", moIn + " " + oOut + " small=4");
    EXPECT_EQ(oEven.mnStatus, 2);
    EXPECT_NE(oEven.moComplaint.find("odd"), std::string::npos) << oEven.moComplaint;
    const ProgramRun oMissing = RunExample("network", oOut + ".not " + oOut);
    EXPECT_EQ(oMissing.mnStatus, 1);
    EXPECT_NE(oMissing.moComplaint.find(oOut + ".not"), std::string::npos);
    EXPECT_EQ(oMissing.moComplaint.find('\n'), oMissing.moComplaint.size() - 1);
    EXPECT_FALSE(std::filesystem::exists(oOut));
}

}  // namespace
}  // namespace kor::test
