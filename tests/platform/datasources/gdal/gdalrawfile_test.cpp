#include "platform/datasources/gdal/gdalrawfile.h"

#include <gtest/gtest.h>

#include "tests/platform/datasources/gdal/gdalfiles.h"

namespace kor::datasources
{
namespace
{

using test::MessageOf;
using test::Random;
using test::SameBits;

class GdalRawFileTest : public test::GdalFilesTest
{
protected:
    /// Two pixels of three channels, the channels of a pixel side by side, made by another program.
    std::string WritePixelwise() const
    {
        moDirectory.Write("x.hdr",
                          "ENVI\nsamples = 2\nlines = 1\nbands = 3\nheader offset = 0\n"
                          "file type = ENVI Standard\ndata type = 1\ninterleave = bip\n"
                          "byte order = 0\n");
        return moDirectory.Write("x.img", "abcdef");
    }
};

TEST_F(GdalRawFileTest, NewFileIsAsLongAsItsSamples)
{
    for (const std::string oFormat : {"ENVI", "EHdr"})
    {
        const auto poDataset = New(File(oFormat), oFormat);
        poDataset->CreateChannels({83, 59, 2, tessel::eDT_16S});
        EXPECT_EQ(std::filesystem::file_size(File(oFormat)), 83U * 59U * 2U * 2U) << oFormat;
    }
}

// As long as it was never written it holds zeros, and one row at the top leaves them below.
TEST_F(GdalRawFileTest, FileWrittenInPartIsReadAsAWhole)
{
    for (const std::string oFormat : {"ENVI", "EHdr"})
    {
        {
            const auto poDataset = New(File(oFormat), oFormat);
            poDataset->CreateChannels({3, 4, 1, tessel::eDT_8U});
            BasicWriter oWriter(poDataset.get(), {1});
            const auto poRow = test::RasterOf(test::Image<std::uint8_t>{{7, 8, 9}});
            oWriter.WriteRaster(poRow.get());
            oWriter.Flush();
        }
        EXPECT_EQ(test::ImageOf<std::uint8_t>(*ReadFile(File(oFormat))),
                  (test::Image<std::uint8_t>{{7, 8, 9}, {0, 0, 0}, {0, 0, 0}, {0, 0, 0}}))
            << oFormat;
    }
}

TEST_F(GdalRawFileTest, FileThatIsCutOffIsRefused)
{
    Random oRandom(61);
    for (const std::string oFormat : {"ENVI", "EHdr"})
    {
        MakeFile(File(oFormat), oFormat, "", {10, 10, 2, tessel::eDT_16S}, oRandom);
        std::filesystem::resize_file(File(oFormat), 399);
        for (const bool bUpdate : {false, true})
        {
            EXPECT_EQ(MessageOf<FileException>([&] { Open(File(oFormat), bUpdate); }),
                      File(oFormat) +
                          ": the file is cut off: it has 399 bytes and its header tells of 400");
        }
    }
}

TEST_F(GdalRawFileTest, ChannelsSideBySideAreReadAndNotWritten)
{
    const std::string oFile = WritePixelwise();
    const std::string oRefusal =
        oFile +
        ": files of the format ENVI in which the channels of a pixel stand side by side "
        "(INTERLEAVE=BIP) cannot be written safely; those of BSQ and BIL can";
    EXPECT_EQ(std::string(reinterpret_cast<const char*>(ReadFile(oFile)->mpBuffer), 6), "abcdef");
    {
        const auto poDataset = Open(oFile, true);
        EXPECT_EQ(MessageOf<DataException>([&] { BasicWriter(poDataset.get(), {1}); }), oRefusal);
        AuxiliaryData oData;
        oData.SetChannelDescription("first", 1);
        poDataset->SetAuxiliaryData(oData);
    }
    EXPECT_EQ(Open(oFile, false)->GetAuxiliaryData().GetChannelDescription(1), "first");
    EXPECT_EQ(test::BytesOf(oFile), "abcdef");

    moDirectory.Clear();
    EXPECT_EQ(
        MessageOf<DataException>(
            [&] {
                New(oFile, "ENVI", "INTERLEAVE=BIP")->CreateChannels({2, 1, 3, tessel::eDT_8U});
            }),
        oRefusal);
    EXPECT_TRUE(moDirectory.Names().empty());
}

TEST_F(GdalRawFileTest, OneChannelIsWrittenWhateverTheLayoutIsCalled)
{
    Random oRandom(62);
    const auto poWritten =
        MakeFile(File("x.img"), "ENVI", "INTERLEAVE=BIP", {13, 11, 1, tessel::eDT_16S}, oRandom);
    EXPECT_TRUE(SameBits(*ReadFile(File("x.img")), *poWritten));
}

}  // namespace
}  // namespace kor::datasources
