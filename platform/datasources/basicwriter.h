#pragma once

#include <initializer_list>
#include <memory>
#include <vector>

#include "platform/datasources/channelaccess.h"
#include "platform/datasources/ibitmapdataset.h"
#include "platform/datasources/irasterwriter.h"

namespace kor::datasources
{

/// Writes channels of one type into a dataset, and reads them back.
///
/// An eDT_BIT raster is taken packed, the first pixel in the most significant bit, without gaps
/// between rows. A bitmap takes and gives rasters of eDT_8U: written, 0 or not 0, read, 0 or 1; its
/// auxiliary data are those of channel 1.
///
/// Errors   the constructors throw kor::DataException when the channels have different types or the
///          list is empty, kor::IOException when a channel or bitmap does not exist or the dataset
///          was opened for reading.
/// Threads  one writer serves one thread at a time; several writers and readers over one dataset
///          may work at once, on different channels or blocks.
class BasicWriter : public IRasterWriter, public ChannelAccess
{
public:
    /// oChannels: channel numbers from 1, in the order in which the rasters hold them. Borrows the
    /// dataset.
    BasicWriter(IRasterDataset* poDataset, const std::vector<unsigned int>& oChannels);
    /// The same for a list in braces, which would otherwise count as the number of a bitmap where
    /// the dataset is known to have both: BasicWriter(poKordsk, {1}).
    BasicWriter(IRasterDataset* poDataset, std::initializer_list<unsigned int> oChannels);
    /// nBitmap: number of the bitmap from 1. Borrows the dataset.
    BasicWriter(IBitmapDataset* poDataset, unsigned int nBitmap);

    tessel::DataType GetDataType() const override { return moType; }
    void ReadRaster(tessel::Raster* poRaster) override;
    void WriteRaster(const tessel::Raster* poRaster) override;
    void SetAuxiliaryData(const AuxiliaryData& oData) override;
    void Flush() override;

private:
    BasicWriter(std::unique_ptr<IDataset> poOwned, IDataset* poDataset,
                const std::vector<unsigned int>& oChannels);

    tessel::DataType moType;
};

}  // namespace kor::datasources
