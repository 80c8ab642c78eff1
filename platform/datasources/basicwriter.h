#pragma once

#include <vector>

#include "platform/datasources/channelset.h"
#include "platform/datasources/irasterwriter.h"

namespace kor::datasources
{

/// Writes channels of one type into a dataset, and reads them back.
///
/// An eDT_BIT raster is taken packed, the first pixel in the most significant bit, without gaps
/// between rows.
///
/// Errors   the constructor throws kor::DataException when the channels have different types or the
///          list is empty, kor::IOException when a channel does not exist or the dataset was opened
///          for reading.
/// Threads  one writer serves one thread at a time; several writers and readers over one dataset
///          may work at once, on different channels or blocks.
class BasicWriter : public IRasterWriter
{
public:
    /// oChannels: channel numbers from 1, in the order in which the rasters hold them. Borrows the
    /// dataset.
    BasicWriter(IRasterDataset* poDataset, const std::vector<unsigned int>& oChannels);

    unsigned int GetWidth() const override;
    unsigned int GetHeight() const override;
    unsigned int GetChannelCount() const override;
    tessel::DataType GetDataType() const override { return moType; }
    void ReadRaster(tessel::Raster* poRaster) override;
    void WriteRaster(const tessel::Raster* poRaster) override;
    const ogc::cs::GeocodingInfo& GetGeocodingInfo() const override;
    AuxiliaryData GetAuxiliaryData() const override;
    void SetAuxiliaryData(const AuxiliaryData& oData) override;
    void Flush() override;

private:
    ChannelSet moSet;
    tessel::DataType moType;
};

}  // namespace kor::datasources
