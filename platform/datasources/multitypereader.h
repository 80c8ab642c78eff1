#pragma once

#include <vector>

#include "platform/datasources/channelaccess.h"
#include "platform/datasources/irasterreader.h"

namespace kor::datasources
{

/// Reads channels of any types, seen as one type.
///
/// Samples are converted by the library's own rules (integers clamp, floating point is rounded),
/// both parts of complex ones alike; eDT_BIT samples count as eDT_8U, 0 or 1. What the edge mode
/// adds outside the image is made of converted samples. GetChannelsInfo gives the type that the
/// channels are seen as; their own are with the dataset.
///
/// Errors   as those of BasicReader; kor::DataException when a complex channel is to be seen as a
///          real type or the reverse, or when oType is not one of the ten element types, real or
///          complex.
/// Threads  one reader serves one thread at a time.
class MultiTypeReader : public IRasterReader, public ChannelAccess
{
public:
    /// oChannels: channel numbers from 1, in the order in which the raster is to hold them. Borrows
    /// the dataset.
    MultiTypeReader(IDataset* poDataset, const std::vector<unsigned int>& oChannels,
                    const tessel::DataType& oType);

    tessel::DataType GetDataType() const override { return moType; }
    void ReadRaster(tessel::Raster* poRaster) override;

private:
    void ReadChannel(std::size_t nIndex, const PixelWindow& oWindow, unsigned char* pSamples,
                     const SampleStrides& oStrides);

    tessel::DataType moType;
    std::vector<unsigned char> mvnRows;       ///< samples as the file has them
    std::vector<unsigned char> mvnConverted;  ///< one row of them, converted
};

}  // namespace kor::datasources
