#include "platform/datasources/basicreader.h"

#include "platform/datasources/datasetmanager.h"
#include "platform/exception/exception.h"

namespace kor::datasources
{

namespace
{

std::unique_ptr<IDataset> OpenForReading(const std::string& oFile, int nFlag)
{
    if (nFlag != 0 && nFlag != 1)
    {
        throw DataException(oFile + ": nFlag is " + std::to_string(nFlag) + "; it can be 0 or 1",
                            "platform/datasources/basicreader", __PRETTY_FUNCTION__, __LINE__);
    }
    return std::unique_ptr<IDataset>(DatasetManager::GetInstance()->Open(oFile, 0));
}

}  // namespace

BasicReader::BasicReader(std::unique_ptr<IDataset> poOwned, IDataset* poDataset,
                         const std::vector<unsigned int>& oChannels)
    : mpoOwned(std::move(poOwned)),
      moSet(mpoOwned ? mpoOwned.get() : poDataset, oChannels, false),
      moType(moSet.GetCommonType())
{
    SetTileSize(moSet.GetDataset().GetTileWidth(), moSet.GetDataset().GetTileHeight());
}

BasicReader::BasicReader(IDataset* poDataset, const std::vector<unsigned int>& oChannels)
    : BasicReader(nullptr, poDataset, oChannels)
{
}

BasicReader::BasicReader(const std::string& oFile, const std::vector<unsigned int>& oChannels,
                         int nFlag)
    : BasicReader(OpenForReading(oFile, nFlag), nullptr, oChannels)
{
}

unsigned int BasicReader::GetWidth() const
{
    return moSet.GetDataset().GetWidth();
}

unsigned int BasicReader::GetHeight() const
{
    return moSet.GetDataset().GetHeight();
}

unsigned int BasicReader::GetChannelCount() const
{
    return static_cast<unsigned int>(moSet.GetChannels().size());
}

void BasicReader::ReadRaster(tessel::Raster* poRaster)
{
    moSet.ReadRaster(poRaster, moType, GetEdgeMode());
}

const ogc::cs::GeocodingInfo& BasicReader::GetGeocodingInfo() const
{
    return moSet.GetDataset().GetGeocodingInfo();
}

AuxiliaryData BasicReader::GetAuxiliaryData() const
{
    return moSet.GetAuxiliaryData();
}

}  // namespace kor::datasources
