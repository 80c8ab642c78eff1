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
    : ChannelAccess(std::move(poOwned), poDataset, oChannels, false),
      moType(GetSet().GetCommonType())
{
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

void BasicReader::ReadRaster(tessel::Raster* poRaster)
{
    GetSet().ReadRaster(poRaster, moType, GetEdgeMode());
}

}  // namespace kor::datasources
