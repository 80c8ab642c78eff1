#pragma once

#include <memory>
#include <vector>

#include "platform/datasources/channelset.h"
#include "platform/datasources/irasteraccess.h"

namespace kor::datasources
{

/// What readers and writers of a dataset's channels share: geometry, and what the file says besides
/// the pixels.
class ChannelAccess : public virtual IRasterAccess
{
public:
    unsigned int GetWidth() const override { return moSet.GetDataset().GetWidth(); }
    unsigned int GetHeight() const override { return moSet.GetDataset().GetHeight(); }
    unsigned int GetChannelCount() const override;
    const ogc::cs::GeocodingInfo& GetGeocodingInfo() const override;
    AuxiliaryData GetAuxiliaryData() const override { return moSet.GetAuxiliaryData(); }

protected:
    /// Over poOwned, or where that is null over poDataset, which is borrowed. Takes the file's
    /// tiles. Errors as of ChannelSet.
    ChannelAccess(std::unique_ptr<IDataset> poOwned, IDataset* poDataset,
                  const std::vector<unsigned int>& oChannels, bool bWrite);

    ChannelSet& GetSet() { return moSet; }
    const ChannelSet& GetSet() const { return moSet; }

private:
    std::unique_ptr<IDataset> mpoOwned;  ///< null where the dataset is the caller's
    ChannelSet moSet;
};

}  // namespace kor::datasources
