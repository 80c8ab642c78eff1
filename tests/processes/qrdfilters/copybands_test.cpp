#include <gtest/gtest.h>

#include <memory>
#include <string>
#include <vector>

#include "platform/datasources/basicreader.h"
#include "platform/datasources/basicwriter.h"
#include "platform/datasources/datasetmanager.h"
#include "platform/exception/exception.h"
#include "processes/qrdfilters/datacopy.h"
#include "tests/support/exceptions.h"
#include "tests/support/memorydataset.h"
#include "tests/support/temporarydirectory.h"

namespace kor::filters
{
namespace
{

using datasources::IRasterDataset;
using tessel::DataType;
using test::MemoryDataset;
using test::MessageOf;
using test::Random;
using test::TemporaryDirectory;

using Channels = std::vector<unsigned int>;

/// The channel nOne of oOne holds what channel nOther of oOther does, byte by byte.
void ExpectSameChannel(IRasterDataset& oOne, unsigned int nOne, IRasterDataset& oOther,
                       unsigned int nOther)
{
    ASSERT_EQ(oOne.GetChannelType(nOne), oOther.GetChannelType(nOther));
    ASSERT_EQ(oOne.GetWidth(), oOther.GetWidth());
    ASSERT_EQ(oOne.GetHeight(), oOther.GetHeight());
    const auto oRead = [](IRasterDataset& oDataset, unsigned int nChannel)
    {
        auto poRaster = test::BlankRaster(oDataset.GetWidth(), oDataset.GetHeight(), 1,
                                          oDataset.GetChannelType(nChannel));
        datasources::BasicReader(&oDataset, {nChannel}).ReadRaster(poRaster.get());
        return poRaster;
    };
    EXPECT_TRUE(test::SameBits(*oRead(oOne, nOne), *oRead(oOther, nOther)))
        << "channel " << nOne << " and channel " << nOther;
}

/// Channels 8U, C32R, 8U, 64R of random samples, with all that is said about them.
std::unique_ptr<MemoryDataset> MixedDataset()
{
    auto poDataset = std::make_unique<MemoryDataset>(
        21, 13,
        std::vector<DataType>{tessel::eDT_8U, tessel::eDT_C32R, tessel::eDT_8U, tessel::eDT_64R});
    Random oRandom(11);
    poDataset->FillRandom(oRandom);
    datasources::AuxiliaryData oData;
    oData.SetChannelDescription("red", 1);
    oData.SetChannelDescription("radar", 2);
    oData.SetChannelDescription("green", 3);
    oData.SetChanMetadata({{"unit", "metres"}}, 4);
    oData.SetChannelNoData(255, 3);
    oData.SetFileMetadata({{"sensor", "one"}, {"date", "2"}});
    poDataset->SetAuxiliaryData(oData);
    ogc::cs::GeocodingInfo oGeocoding({100, 2, 0.5, 200, 0.25, -3});
    oGeocoding.SetProjection("LOCAL_CS[\"grid\"]");
    poDataset->SetGeocodingInfo(oGeocoding);
    return poDataset;
}

/// What the channels of MixedDataset become: those of one type behind each other.
void ExpectMixedCopy(IRasterDataset& oCopy, MemoryDataset& oFrom)
{
    ASSERT_EQ(oCopy.GetChannelCount(), 4U);
    ExpectSameChannel(oCopy, 1, oFrom, 1);
    ExpectSameChannel(oCopy, 2, oFrom, 3);
    ExpectSameChannel(oCopy, 3, oFrom, 2);
    ExpectSameChannel(oCopy, 4, oFrom, 4);
    const datasources::AuxiliaryData oData = oCopy.GetAuxiliaryData();
    EXPECT_EQ(oData.GetChannelDescription(1), "red");
    EXPECT_EQ(oData.GetChannelDescription(2), "green");
    EXPECT_EQ(oData.GetChannelDescription(3), "radar");
    EXPECT_EQ(oData.GetChannelDescription(4), "");
    EXPECT_EQ(oData.GetChanMetadata(4), (datasources::AuxiliaryData::Metadata{{"unit", "metres"}}));
    EXPECT_EQ(oData.GetChannelNoData(2), 255.0);
    EXPECT_EQ(oData.GetChannelNoData(1), std::nullopt);
    EXPECT_EQ(oData.GetFileMetadata(),
              (datasources::AuxiliaryData::Metadata{{"date", "2"}, {"sensor", "one"}}));
    EXPECT_EQ(oCopy.GetGeocodingInfo(), oFrom.GetGeocodingInfo());
}

TEST(CopyChannels, GroupsChannelsByTypeAndCopiesAllOfThemForAnEmptyList)
{
    const auto poFrom = MixedDataset();
    MemoryDataset oTo;
    CopyChannels(*poFrom, oTo, {});
    ExpectMixedCopy(oTo, *poFrom);
}

TEST(CopyChannels, KeepsTheOrderOfTheListWithinAType)
{
    const auto poFrom = MixedDataset();
    MemoryDataset oTo;
    CopyChannels(*poFrom, oTo, {4, 3, 1, 3});
    ASSERT_EQ(oTo.GetChannelCount(), 4U);
    ExpectSameChannel(oTo, 1, *poFrom, 4);
    ExpectSameChannel(oTo, 2, *poFrom, 3);
    ExpectSameChannel(oTo, 3, *poFrom, 1);
    ExpectSameChannel(oTo, 4, *poFrom, 3);
    EXPECT_EQ(oTo.GetAuxiliaryData().GetChannelDescription(3), "red");
}

TEST(CopyChannels, AppendsBehindChannelsThatAreThere)
{
    const auto poFrom = MixedDataset();
    MemoryDataset oTo(21, 13, {tessel::eDT_16S});
    CopyChannels(*poFrom, oTo, {2});
    ASSERT_EQ(oTo.GetChannelCount(), 2U);
    ExpectSameChannel(oTo, 2, *poFrom, 2);
    EXPECT_EQ(oTo.GetAuxiliaryData().GetChannelDescription(2), "radar");
}

TEST(CopyChannels, RefusesAChannelThatDoesNotExistBeforeAnythingIsMade)
{
    MemoryDataset oFrom(2, 2, {tessel::eDT_8U});
    MemoryDataset oTo;
    EXPECT_ANY_THROW(CopyChannels(oFrom, oTo, {1, 2}));
    EXPECT_EQ(oTo.GetChannelCount(), 0U);
}

TEST(CopyChannels, PassesOnWhatReadingThrows)
{
    MemoryDataset oFrom(2, 2, {tessel::eDT_8U});
    oFrom.mbBroken = true;
    MemoryDataset oTo;
    EXPECT_EQ(MessageOf<Exception>([&] { CopyChannels(oFrom, oTo, {}); }), "memory: broken");
}

TEST(CopyChannels, RefusesBits)
{
    MemoryDataset oFrom(9, 2, {tessel::eDT_BIT});
    MemoryDataset oTo;
    EXPECT_EQ(MessageOf<Exception>([&] { CopyChannels(oFrom, oTo, {}); }),
              "Invalid type requested.");
}

std::unique_ptr<IRasterDataset> Open(const std::string& oFile)
{
    auto* poDataset =
        dynamic_cast<IRasterDataset*>(datasources::DatasetManager::GetInstance()->Open(oFile, 0));
    EXPECT_NE(poDataset, nullptr);
    return std::unique_ptr<IRasterDataset>(poDataset);
}

/// A KORDSK file with the channels of oFrom, in the same order.
void WriteFile(MemoryDataset& oFrom, const std::string& oFile)
{
    const std::unique_ptr<datasources::IDataset> poFile(
        datasources::DatasetManager::GetInstance()->NewDataset(oFile, "KORDSK", "TILE"));
    auto& oTo = dynamic_cast<IRasterDataset&>(*poFile);
    for (unsigned int nChannel = 1; nChannel <= oFrom.GetChannelCount(); ++nChannel)
    {
        const DataType oType = oFrom.GetChannelType(nChannel);
        oTo.CreateChannels({oFrom.GetWidth(), oFrom.GetHeight(), 1, oType});
        auto poRaster = test::BlankRaster(oFrom.GetWidth(), oFrom.GetHeight(), 1, oType);
        datasources::BasicReader(&oFrom, {nChannel}).ReadRaster(poRaster.get());
        datasources::BasicWriter(&oTo, {nChannel}).WriteRaster(poRaster.get());
    }
    oTo.SetAuxiliaryData(oFrom.GetAuxiliaryData());
    oTo.SetGeocodingInfo(oFrom.GetGeocodingInfo());
}

TEST(CopyBands, CopiesAllChannelsOfAFileWithWhatIsSaidAboutThem)
{
    const TemporaryDirectory oDirectory;
    const auto poFrom = MixedDataset();
    WriteFile(*poFrom, oDirectory.File("in.kor"));
    CopyBands(oDirectory.File("in.kor"), oDirectory.File("out.kor"), {});
    ExpectMixedCopy(*Open(oDirectory.File("out.kor")), *poFrom);
    EXPECT_EQ(oDirectory.Names(), (std::set<std::string>{"in.kor", "out.kor"}));
}

TEST(CopyBands, CopiesTheChannelsOfTheList)
{
    const TemporaryDirectory oDirectory;
    const auto poFrom = MixedDataset();
    WriteFile(*poFrom, oDirectory.File("in.kor"));
    CopyBands(oDirectory.File("in.kor"), oDirectory.File("out.kor"), {4, 1});
    const auto poTo = Open(oDirectory.File("out.kor"));
    ASSERT_EQ(poTo->GetChannelCount(), 2U);
    ExpectSameChannel(*poTo, 1, *poFrom, 4);
    ExpectSameChannel(*poTo, 2, *poFrom, 1);
}

TEST(CopyBands, LeavesAnExistingOutputUntouched)
{
    const TemporaryDirectory oDirectory;
    WriteFile(*MixedDataset(), oDirectory.File("in.kor"));
    const std::string oOutput = oDirectory.Write("out.kor", "somebody's letters");
    try
    {
        CopyBands(oDirectory.File("in.kor"), oOutput, {});
        FAIL() << "nothing was thrown";
    }
    catch (const FileException& oError)
    {
        EXPECT_EQ(oError.GetMessage(), "File already exists.\n");
        EXPECT_EQ(oError.GetFileName(), oOutput);
        EXPECT_EQ(oError.GetFile(), "");
        EXPECT_EQ(oError.GetFunction(), "");
        EXPECT_EQ(oError.GetLine(), 0U);
    }
    EXPECT_EQ(test::BytesOf(oOutput), "somebody's letters");
}

TEST(CopyBands, DoesNotCopyAFileOntoItself)
{
    const TemporaryDirectory oDirectory;
    const std::string oFile = oDirectory.File("in.kor");
    WriteFile(*MixedDataset(), oFile);
    const std::string oBytes = test::BytesOf(oFile);
    EXPECT_THROW(CopyBands(oFile, oFile, {}), FileException);
    EXPECT_EQ(test::BytesOf(oFile), oBytes);
}

TEST(CopyBands, OpensTheInputBeforeItLooksForTheOutput)
{
    const TemporaryDirectory oDirectory;
    const std::string oOutput = oDirectory.Write("out.kor", "letters");
    const std::string oMessage =
        MessageOf<FileException>([&] { CopyBands(oDirectory.File("missing.kor"), oOutput, {}); });
    EXPECT_NE(oMessage.find("missing.kor"), std::string::npos) << oMessage;
}

TEST(CopyBands, LeavesNoFileBehindWhereAChannelDoesNotExist)
{
    const TemporaryDirectory oDirectory;
    WriteFile(*MixedDataset(), oDirectory.File("in.kor"));
    EXPECT_THROW(CopyBands(oDirectory.File("in.kor"), oDirectory.File("out.kor"), {1, 5}),
                 IOException);
    EXPECT_EQ(oDirectory.Names(), (std::set<std::string>{"in.kor"}));
}

// The bytes are copied before the bits are refused.
TEST(CopyBands, LeavesNoFileBehindWhereCopyingFailsHalfway)
{
    const TemporaryDirectory oDirectory;
    MemoryDataset oFrom(9, 2, {tessel::eDT_8U, tessel::eDT_BIT});
    WriteFile(oFrom, oDirectory.File("in.kor"));
    EXPECT_EQ(MessageOf<Exception>(
                  [&] { CopyBands(oDirectory.File("in.kor"), oDirectory.File("out.kor"), {}); }),
              "Invalid type requested.");
    EXPECT_EQ(oDirectory.Names(), (std::set<std::string>{"in.kor"}));
}

TEST(CopyBands, LeavesNoFileBehindWhereTheInputIsNone)
{
    const TemporaryDirectory oDirectory;
    const std::string oInput = oDirectory.Write("in.txt", "no image at all");
    EXPECT_THROW(CopyBands(oInput, oDirectory.File("out.kor"), {}), Exception);
    EXPECT_EQ(oDirectory.Names(), (std::set<std::string>{"in.txt"}));
}

}  // namespace
}  // namespace kor::filters
