#include "platform/datasources/channelset.h"

#include "platform/datasources/blocktransfer.h"
#include "platform/datasources/datatypename.h"
#include "platform/datasources/guard.h"

namespace kor::datasources
{

namespace
{

constexpr const char* kSource = "platform/datasources/channelset";

IRasterDataset* RequireRasterDataset(IDataset* poDataset)
{
    if (poDataset == nullptr)
    {
        throw DataException("poDataset is invalid pointer", kSource, __PRETTY_FUNCTION__, __LINE__);
    }
    auto* poRasters = dynamic_cast<IRasterDataset*>(poDataset);
    if (poRasters == nullptr)
    {
        throw DataException(poDataset->GetFileName() + ": this dataset has no channels of pixels",
                            kSource, __PRETTY_FUNCTION__, __LINE__);
    }
    return poRasters;
}

}  // namespace

ChannelSet::ChannelSet(IDataset* poDataset, std::vector<unsigned int> oChannels, bool bWrite)
    : mpoDataset(RequireRasterDataset(poDataset)), mvnChannels(std::move(oChannels))
{
    if (mvnChannels.empty())
    {
        throw DataException(GetFileName() + ": oChannels is empty; one channel at least is needed",
                            kSource, __PRETTY_FUNCTION__, __LINE__);
    }
    for (const unsigned int nChannel : mvnChannels)
    {
        if (nChannel == 0 || nChannel > mpoDataset->GetChannelCount())
        {
            throw IOException(GetFileName() + ": there is no channel " + std::to_string(nChannel) +
                                  "; the file has " +
                                  std::to_string(mpoDataset->GetChannelCount()) +
                                  ", numbered from 1",
                              kSource, __PRETTY_FUNCTION__, __LINE__);
        }
    }
    mpoIO = Guarded(GetFileName(), [&] { return mpoDataset->OpenChannels(bWrite); });
}

tessel::DataType ChannelSet::GetCommonType() const
{
    const tessel::DataType oFirst = mpoDataset->GetChannelType(mvnChannels.front());
    for (const unsigned int nChannel : mvnChannels)
    {
        const tessel::DataType oType = mpoDataset->GetChannelType(nChannel);
        if (oType != oFirst)
        {
            throw DataException(GetFileName() + ": the channels have different types: channel " +
                                    std::to_string(mvnChannels.front()) + " has " +
                                    DataTypeName(oFirst) + ", channel " + std::to_string(nChannel) +
                                    " has " + DataTypeName(oType),
                                kSource, __PRETTY_FUNCTION__, __LINE__);
        }
    }
    return oFirst;
}

void ChannelSet::ReadRaster(tessel::Raster* poRaster, const tessel::DataType& oType,
                            int nEdgeMode) const
{
    RequireFittingRaster(poRaster, oType, static_cast<unsigned int>(mvnChannels.size()),
                         GetFileName());
    Guarded(GetFileName(),
            [&]
            {
                ReadBlock(*poRaster, {mpoDataset->GetWidth(), mpoDataset->GetHeight()}, nEdgeMode,
                          [&](const PixelWindow& oWindow, unsigned char* pSamples,
                              const SampleStrides& oStrides)
                          { mpoIO->Read(mvnChannels, oWindow, pSamples, oStrides); });
            });
}

AuxiliaryData ChannelSet::GetAuxiliaryData() const
{
    return Guarded(GetFileName(),
                   [&]
                   {
                       const AuxiliaryData oAll = mpoDataset->GetAuxiliaryData();
                       AuxiliaryData oOwn;
                       oOwn.SetFileMetadata(oAll.GetFileMetadata());
                       unsigned int nPlace = 0;
                       for (const unsigned int nChannel : mvnChannels)
                       {
                           ++nPlace;
                           const auto itEntry = oAll.GetChannels().find(nChannel);
                           if (itEntry != oAll.GetChannels().end())
                           {
                               oOwn.SetChannel(itEntry->second, nPlace);
                           }
                       }
                       return oOwn;
                   });
}

void ChannelSet::SetAuxiliaryData(const AuxiliaryData& oData)
{
    Guarded(GetFileName(),
            [&]
            {
                AuxiliaryData oOwn;
                oOwn.SetFileMetadata(oData.GetFileMetadata());
                for (const auto& [nPlace, oEntry] : oData.GetChannels())
                {
                    if (nPlace > mvnChannels.size())
                    {
                        throw IOException(GetFileName() +
                                              ": the auxiliary data have an entry for " +
                                              "channel " + std::to_string(nPlace) + " of " +
                                              std::to_string(mvnChannels.size()),
                                          kSource, __PRETTY_FUNCTION__, __LINE__);
                    }
                    oOwn.SetChannel(oEntry, mvnChannels[nPlace - 1]);
                }
                mpoDataset->SetAuxiliaryData(oOwn);
            });
}

}  // namespace kor::datasources
