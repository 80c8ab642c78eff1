#include "platform/datasources/kordsk/kordskdriver.h"

#include <gtest/gtest.h>

#include "tests/support/exceptions.h"
#include "tests/support/kordskfiles.h"
#include "tests/support/temporarydirectory.h"

namespace kor::datasources
{
namespace
{

using test::MessageOf;
using test::NewKordsk;

class KordskDriverTest : public ::testing::Test
{
protected:
    test::TemporaryDirectory moDirectory;
    const std::string moFile = moDirectory.File("image.kdk");
    const std::unique_ptr<IDatasetDriver> mpoDriver = MakeKordskDriver();
};

TEST_F(KordskDriverTest, OptionsChooseTheLayout)
{
    int nFile = 0;
    for (const auto& [pszOptions, bTiled] : {std::pair("", false), std::pair(" ", false),
                                             std::pair("BAND", false), std::pair(" TILE ", true)})
    {
        const auto poKordsk = NewKordsk(moDirectory.File(std::to_string(++nFile)), pszOptions);
        poKordsk->CreateChannels({2, 2, 1, tessel::eDT_8U});
        EXPECT_EQ(poKordsk->GetDirectory()->mvoChannels[0].mnTileWidth != 0, bTiled) << pszOptions;
    }
}

TEST_F(KordskDriverTest, OtherOptionsAreRefusedAndLeaveNoFile)
{
    for (const char* pszOptions : {"band", "TILED=YES", "BAND TILE"})
    {
        EXPECT_EQ(
            MessageOf<DataException>([&] { NewKordsk(moFile, pszOptions); }),
            moFile + ": the options are \"" + pszOptions + "\"; a KORDSK file takes BAND or TILE");
    }
    EXPECT_TRUE(moDirectory.Names().empty());
}

TEST_F(KordskDriverTest, FileIsKnownByEitherSlot)
{
    NewKordsk(moFile);
    EXPECT_TRUE(mpoDriver->Recognizes(moFile));
    std::string oBytes = test::BytesOf(moFile);
    EXPECT_TRUE(mpoDriver->Recognizes(moDirectory.Write("short", oBytes.substr(0, 8))));
    oBytes[0] = 'X';
    EXPECT_FALSE(mpoDriver->Recognizes(moDirectory.Write("other", oBytes)));
    std::copy_n("KORDSK\x1A\n", 8, oBytes.begin() + 512);
    EXPECT_TRUE(mpoDriver->Recognizes(moDirectory.Write("second", oBytes)));
    EXPECT_FALSE(mpoDriver->Recognizes(moDirectory.Write("empty", "")));
    EXPECT_FALSE(mpoDriver->Recognizes(moDirectory.File("none")));
}

TEST_F(KordskDriverTest, FileWithoutChannelsCanBeOpened)
{
    NewKordsk(moFile);
    const auto poKordsk = test::OpenKordsk(moFile);
    EXPECT_EQ(poKordsk->GetWidth(), 0U);
    EXPECT_EQ(poKordsk->GetTileWidth(), 0U);
    EXPECT_EQ(poKordsk->GetChannelCount(), 0U);
    EXPECT_EQ(poKordsk->GetBitmapCount(), 0U);
    EXPECT_EQ(poKordsk->GetGeocodingInfo(), ogc::cs::GeocodingInfo());
}

TEST_F(KordskDriverTest, FileThatCannotBeMadeIsAnError)
{
    const std::string oFile = moDirectory.File("no/such/directory");
    EXPECT_EQ(MessageOf<FileException>([&] { NewKordsk(oFile); }),
              oFile + ": cannot make the file: No such file or directory");
}

}  // namespace
}  // namespace kor::datasources
