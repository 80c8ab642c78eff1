#include <gtest/gtest.h>

#include <memory>
#include <string>

#include "platform/datasources/basicreader.h"
#include "platform/datasources/basicwriter.h"
#include "platform/datasources/datasetmanager.h"
#include "platform/datasources/gdal/gdaldriver.h"
#include "tests/support/blocks.h"
#include "tests/support/program.h"
#include "tests/support/temporarydirectory.h"

namespace kor::test
{
namespace
{

using datasources::DatasetManager;

class HomogeniseProgram : public ::testing::Test
{
protected:
    HomogeniseProgram() { datasources::RegisterGdalDriver(); }

    /// A file with the values in channel 1 and the classes in channel 2.
    template <class TValue, class TClass>
    std::string Write(const Image<TValue>& oValues, const Image<TClass>& oClasses) const
    {
        const std::unique_ptr<datasources::IDataset> poDataset(
            DatasetManager::GetInstance()->NewDataset(moFolder.File("in.kordsk"), "KORDSK", ""));
        auto& oImage = dynamic_cast<datasources::IRasterDataset&>(*poDataset);
        const auto poValues = RasterOf(oValues);
        const auto poClasses = RasterOf(oClasses);
        for (const tessel::Raster* poBlock : {poValues.get(), poClasses.get()})
        {
            const unsigned int nChannel = oImage.CreateChannels(*poBlock);
            datasources::BasicWriter(&oImage, {nChannel}).WriteRaster(poBlock);
        }
        return moFolder.File("in.kordsk");
    }
    ProgramRun Run(const std::string& oIn, const std::string& oWords) const
    {
        return RunExample("homogenise",
                          "'" + oIn + "' '" + moFolder.File("out.tif") + "' replace=yes " + oWords);
    }
    template <class T>
    Image<T> ReadResult() const
    {
        datasources::BasicReader oReader(moFolder.File("out.tif"), {1}, 0);
        const auto poRaster =
            BlankRaster(oReader.GetWidth(), oReader.GetHeight(), 1, oReader.GetDataType());
        oReader.ReadRaster(poRaster.get());
        return ImageOf<T>(*poRaster);
    }

    TemporaryDirectory moFolder;
};

// Class 1 holds 10, 11 and 30, class 7 holds 5 and 5: means 17 and 5.
TEST_F(HomogeniseProgram, GivesEachClassItsMeanOrMode)
{
    const std::string oIn =
        Write(Image<short>{{10, 11, 30}, {5, 5, 10}}, Image<std::uint8_t>{{1, 1, 1}, {7, 7, 9}});
    const ProgramRun oMean = Run(oIn, "");
    ASSERT_EQ(oMean.mnStatus, 0) << oMean.moComplaint;
    EXPECT_EQ(ReadResult<short>(), (Image<short>{{17, 17, 17}, {5, 5, 10}}));
    ASSERT_EQ(Run(oIn, "find=mode threshold=0.5 default=99 type=8U").mnStatus, 0);
    EXPECT_EQ(ReadResult<std::uint8_t>(), (Image<std::uint8_t>{{99, 99, 99}, {5, 5, 10}}));
    // The classes as values of themselves.
    ASSERT_EQ(Run(oIn, "values=2 classes=2").mnStatus, 0);
    EXPECT_EQ(ReadResult<std::uint8_t>(), (Image<std::uint8_t>{{1, 1, 1}, {7, 7, 9}}));
    EXPECT_EQ(moFolder.Names(), (std::set<std::string>{"in.kordsk", "out.tif"}));
}

TEST_F(HomogeniseProgram, RefusesWhatItCannotUseAndLeavesNoFile)
{
    const std::string oIn = Write(Image<std::uint8_t>{{1}}, Image<std::uint16_t>{{1}});
    const ProgramRun oTypes = Run(oIn, "");
    EXPECT_EQ(oTypes.mnStatus, 1);
    EXPECT_NE(oTypes.moComplaint.find("values of type 8U cannot be found in classes of type 16U"),
              std::string::npos)
        << oTypes.moComplaint;
    for (const char* pszWords :
         {"values=3", "values=2 classes=2 find=median", "values=2 classes=2 threshold=1.5",
          "values=2 classes=2 nonsense=1", "values=2 classes=2 type=64X"})
    {
        const ProgramRun oRun = Run(oIn, pszWords);
        EXPECT_EQ(oRun.mnStatus, 2) << pszWords;
        EXPECT_EQ(oRun.moComplaint.find("homogenise: "), 0U) << oRun.moComplaint;
    }
    EXPECT_EQ(Run(moFolder.File("nowhere"), "").mnStatus, 1);
    EXPECT_EQ(RunExample("homogenise", "").mnStatus, 2);
    EXPECT_EQ(moFolder.Names(), (std::set<std::string>{"in.kordsk"}));
}

}  // namespace
}  // namespace kor::test
