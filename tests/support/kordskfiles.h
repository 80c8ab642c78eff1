#pragma once

#include <memory>
#include <string>
#include <vector>

#include "platform/datasources/basicreader.h"
#include "platform/datasources/basicwriter.h"
#include "platform/datasources/datasetmanager.h"
#include "platform/datasources/kordsk/kordskdataset.h"
#include "tests/support/memorydataset.h"

/// KORDSK files for tests.
namespace kor::test
{

inline const std::vector<tessel::DataType> kAllTypes = {
    tessel::eDT_BIT,  tessel::eDT_8U,   tessel::eDT_8S,   tessel::eDT_16U,  tessel::eDT_16S,
    tessel::eDT_32U,  tessel::eDT_32S,  tessel::eDT_32R,  tessel::eDT_64U,  tessel::eDT_64S,
    tessel::eDT_64R,  tessel::eDT_C16U, tessel::eDT_C16S, tessel::eDT_C32U, tessel::eDT_C32S,
    tessel::eDT_C32R, tessel::eDT_C64R};

using Kordsk = std::unique_ptr<datasources::KordskDataset>;

inline Kordsk KordskOf(datasources::IDataset* poDataset)
{
    auto* poKordsk = dynamic_cast<datasources::KordskDataset*>(poDataset);
    EXPECT_NE(poKordsk, nullptr);
    return Kordsk(poKordsk);
}

inline Kordsk NewKordsk(const std::string& oFile, const std::string& oOptions = "")
{
    return KordskOf(
        datasources::DatasetManager::GetInstance()->NewDataset(oFile, "KORDSK", oOptions));
}

inline Kordsk OpenKordsk(const std::string& oFile, int nAccess = 0)
{
    return KordskOf(datasources::DatasetManager::GetInstance()->Open(oFile, nAccess));
}

/// A block of the given channels, margins of 0xA5 overwritten by what the reader puts there.
inline std::unique_ptr<tessel::Raster> ReadBlock(datasources::IDataset& oDataset,
                                                 const std::vector<unsigned int>& vnChannels,
                                                 const tessel::RasterInfo& oSize,
                                                 const tessel::RasterContext& oContext = {})
{
    datasources::BasicReader oReader(&oDataset, vnChannels);
    auto poRaster = BlankRaster(oSize.mnWidth, oSize.mnHeight, oReader.GetChannelCount(),
                                oReader.GetDataType(), {oContext.mnMarginX, oContext.mnMarginY});
    static_cast<tessel::RasterContext&>(*poRaster) = oContext;
    oReader.ReadRaster(poRaster.get());
    return poRaster;
}

/// Byte by byte, so that not-a-numbers have to be the same as well.
inline bool SameBytes(const tessel::Raster& oOne, const tessel::Raster& oOther)
{
    return oOne.mnBufferSize == oOther.mnBufferSize &&
           std::memcmp(oOne.mpBuffer, oOther.mpBuffer, oOne.mnBufferSize) == 0;
}

/// Copies all channels of a dataset in memory into a file without any, those of one type that stand
/// side by side by one call.
inline void CopyChannels(MemoryDataset& oFrom, datasources::KordskDataset& oTo)
{
    tessel::RasterInfo oInfo(oFrom.GetWidth(), oFrom.GetHeight(), 0, {});
    for (unsigned int nFirst = 1; nFirst <= oFrom.GetChannelCount(); nFirst += oInfo.mnChannels)
    {
        oInfo.moDataType = oFrom.GetChannelType(nFirst);
        std::vector<unsigned int> vnChannels;
        for (unsigned int c = nFirst; c <= oFrom.GetChannelCount(); ++c)
        {
            if (oFrom.GetChannelType(c) != oInfo.moDataType)
            {
                break;
            }
            vnChannels.push_back(c);
        }
        oInfo.mnChannels = static_cast<std::uint32_t>(vnChannels.size());
        EXPECT_EQ(oTo.CreateChannels(oInfo), nFirst);
        datasources::BasicWriter(&oTo, vnChannels)
            .WriteRaster(ReadBlock(oFrom, vnChannels, oInfo).get());
    }
}

}  // namespace kor::test
