#include "platform/datasources/auxiliarydata.h"

#include <algorithm>

#include "platform/exception/exception.h"

namespace kor::datasources
{

AuxiliaryData::Channel AuxiliaryData::GetChannel(unsigned int nChannel) const
{
    const auto itChannel = moChannels.find(nChannel);
    return itChannel == moChannels.end() ? Channel() : itChannel->second;
}

AuxiliaryData::Channel& AuxiliaryData::EntryOf(unsigned int nChannel)
{
    if (nChannel == 0)
    {
        throw DataException("nChannel is 0; channels are numbered from 1",
                            "platform/datasources/auxiliarydata", __PRETTY_FUNCTION__, __LINE__);
    }
    return moChannels[nChannel];
}

std::string AuxiliaryData::GetChannelDescription(unsigned int nChannel) const
{
    return GetChannel(nChannel).moDescription;
}

void AuxiliaryData::SetChannelDescription(const std::string& oText, unsigned int nChannel)
{
    EntryOf(nChannel).moDescription = oText;
}

AuxiliaryData::Metadata AuxiliaryData::GetChanMetadata(unsigned int nChannel) const
{
    return GetChannel(nChannel).moMetadata;
}

void AuxiliaryData::SetChanMetadata(const Metadata& oMetadata, unsigned int nChannel)
{
    EntryOf(nChannel).moMetadata = oMetadata;
}

std::optional<double> AuxiliaryData::GetChannelNoData(unsigned int nChannel) const
{
    return GetChannel(nChannel).mdfNoData;
}

void AuxiliaryData::SetChannelNoData(std::optional<double> dfNoData, unsigned int nChannel)
{
    EntryOf(nChannel).mdfNoData = dfNoData;
}

void AuxiliaryData::SetChannel(const Channel& oChannel, unsigned int nChannel)
{
    EntryOf(nChannel) = oChannel;
}

std::vector<double> AuxiliaryData::GetNoDataValues() const
{
    std::vector<double> vdfValues;
    for (const auto& [nChannel, oChannel] : moChannels)
    {
        if (oChannel.mdfNoData &&
            std::find(vdfValues.begin(), vdfValues.end(), *oChannel.mdfNoData) == vdfValues.end())
        {
            vdfValues.push_back(*oChannel.mdfNoData);
        }
    }
    return vdfValues;
}

}  // namespace kor::datasources
