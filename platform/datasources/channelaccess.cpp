#include "platform/datasources/channelaccess.h"

#include <utility>

namespace kor::datasources
{

ChannelAccess::ChannelAccess(std::unique_ptr<IDataset> poOwned, IDataset* poDataset,
                             const std::vector<unsigned int>& oChannels, bool bWrite)
    : mpoOwned(std::move(poOwned)), moSet(mpoOwned ? mpoOwned.get() : poDataset, oChannels, bWrite)
{
    IRasterAccess::SetTileSize(moSet.GetDataset().GetTileWidth(),
                               moSet.GetDataset().GetTileHeight());
}

unsigned int ChannelAccess::GetChannelCount() const
{
    return static_cast<unsigned int>(moSet.GetChannels().size());
}

const ogc::cs::GeocodingInfo& ChannelAccess::GetGeocodingInfo() const
{
    return moSet.GetDataset().GetGeocodingInfo();
}

}  // namespace kor::datasources
