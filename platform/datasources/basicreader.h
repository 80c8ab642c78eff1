#pragma once

#include <memory>
#include <string>
#include <vector>

#include "platform/datasources/channelaccess.h"
#include "platform/datasources/irasterreader.h"

namespace kor::datasources
{

/// Reads channels of one type from a dataset, in their own type.
///
/// Tiles are the file's own ones until SetTileSize. An eDT_BIT raster is filled packed, the first
/// pixel in the most significant bit, without gaps between rows; the bits behind its last pixel are
/// not told.
///
/// Errors   the constructors throw kor::DataException when the channels have different types, when
///          the list is empty or the dataset has no channels of pixels at all, and kor::IOException
///          (kor::FileException for the file itself) when a channel does not exist or the file
///          cannot be opened.
/// Threads  one reader serves one thread at a time; several readers over one dataset may work at
///          once.
class BasicReader : public IRasterReader, public ChannelAccess
{
public:
    /// oChannels: channel numbers from 1, in the order in which the raster is to hold them. Borrows
    /// the dataset.
    BasicReader(IDataset* poDataset, const std::vector<unsigned int>& oChannels);
    /// Opens the file itself, for reading, whether nFlag is 0 or 1; kor::DataException for others.
    BasicReader(const std::string& oFile, const std::vector<unsigned int>& oChannels, int nFlag);

    tessel::DataType GetDataType() const override { return moType; }
    void ReadRaster(tessel::Raster* poRaster) override;

protected:
    /// Over poOwned, or where that is null over poDataset.
    BasicReader(std::unique_ptr<IDataset> poOwned, IDataset* poDataset,
                const std::vector<unsigned int>& oChannels);

private:
    tessel::DataType moType;
};

}  // namespace kor::datasources
