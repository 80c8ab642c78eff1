#pragma once

#include <memory>
#include <span>
#include <string>
#include <vector>

#include "platform/datasources/irasterdataset.h"

namespace kor::datasources
{

/// The channels that one reader or writer works on, with the channel I/O object of its own. They
/// exist; whether their types agree is the reader's business. Borrows the dataset.
class ChannelSet
{
public:
    /// Throws kor::DataException when poDataset is null or no raster dataset or when the list is
    /// empty, kor::IOException when a channel does not exist or the dataset cannot be written to.
    ChannelSet(IDataset* poDataset, std::vector<unsigned int> oChannels, bool bWrite);

    IRasterDataset& GetDataset() const { return *mpoDataset; }
    IChannelIO& GetIO() const { return *mpoIO; }
    std::span<const unsigned int> GetChannels() const { return mvnChannels; }
    std::string GetFileName() const { return mpoDataset->GetFileName(); }

    /// The type that all channels have. Throws kor::DataException when they differ.
    tessel::DataType GetCommonType() const;
    /// Fills a block of these channels, which all have oType. Errors as of
    /// IRasterAccess::ReadRaster.
    void ReadRaster(tessel::Raster* poRaster, const tessel::DataType& oType, int nEdgeMode) const;
    /// The dataset's data for these channels, numbered by their place in the list.
    AuxiliaryData GetAuxiliaryData() const;
    void SetAuxiliaryData(const AuxiliaryData& oData);

private:
    IRasterDataset* mpoDataset;
    std::vector<unsigned int> mvnChannels;
    std::unique_ptr<IChannelIO> mpoIO;
};

}  // namespace kor::datasources
