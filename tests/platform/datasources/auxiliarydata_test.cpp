#include "platform/datasources/auxiliarydata.h"

#include <gtest/gtest.h>

#include "tests/support/exceptions.h"

namespace kor::datasources
{
namespace
{

TEST(AuxiliaryData, ChannelWithoutAnEntryReadsAsEmpty)
{
    const AuxiliaryData oData;
    EXPECT_EQ(oData.GetChannelDescription(7), "");
    EXPECT_TRUE(oData.GetChanMetadata(7).empty());
    EXPECT_EQ(oData.GetChannelNoData(7), std::nullopt);
    EXPECT_EQ(oData.GetChannelDescription(0), "");
    EXPECT_TRUE(oData.GetFileMetadata().empty());
}

TEST(AuxiliaryData, KeepsWhatIsSetForEachChannelAndTheFile)
{
    AuxiliaryData oData;
    oData.SetChannelDescription("backscatter", 2);
    oData.SetChanMetadata({{"unit", "dB"}}, 2);
    oData.SetChannelNoData(-9999.0, 1);
    oData.SetFileMetadata({{"sensor", "radar"}});

    EXPECT_EQ(oData.GetChannelDescription(2), "backscatter");
    EXPECT_EQ(oData.GetChannelDescription(1), "");
    EXPECT_EQ(oData.GetChanMetadata(2), (AuxiliaryData::Metadata{{"unit", "dB"}}));
    EXPECT_EQ(oData.GetChannelNoData(1), -9999.0);
    EXPECT_EQ(oData.GetChannelNoData(2), std::nullopt);
    EXPECT_EQ(oData.GetFileMetadata(), (AuxiliaryData::Metadata{{"sensor", "radar"}}));
    EXPECT_EQ(oData.GetChannels().size(), 2U);
}

TEST(AuxiliaryData, ChannelsAreNumberedFromOne)
{
    AuxiliaryData oData;
    EXPECT_EQ(test::MessageOf<DataException>([&] { oData.SetChannelDescription("x", 0); }),
              "nChannel is 0; channels are numbered from 1");
}

TEST(AuxiliaryData, NoDataValuesOfAllChannelsAreListedOnce)
{
    AuxiliaryData oData;
    EXPECT_TRUE(oData.GetNoDataValues().empty());
    oData.SetChannelNoData(-1.0, 3);
    oData.SetChannelNoData(7.0, 1);
    oData.SetChannelNoData(7.0, 2);
    oData.SetChannelDescription("without", 4);
    EXPECT_EQ(oData.GetNoDataValues(), (std::vector<double>{7.0, -1.0}));
}

}  // namespace
}  // namespace kor::datasources
