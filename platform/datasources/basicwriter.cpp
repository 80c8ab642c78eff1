#include "platform/datasources/basicwriter.h"

#include "platform/datasources/bitmapchannel.h"
#include "platform/datasources/blocktransfer.h"
#include "platform/datasources/guard.h"

namespace kor::datasources
{

BasicWriter::BasicWriter(std::unique_ptr<IDataset> poOwned, IDataset* poDataset,
                         const std::vector<unsigned int>& oChannels)
    : ChannelAccess(std::move(poOwned), poDataset, oChannels, true),
      moType(GetSet().GetCommonType())
{
}

BasicWriter::BasicWriter(IRasterDataset* poDataset, const std::vector<unsigned int>& oChannels)
    : BasicWriter(nullptr, poDataset, oChannels)
{
}

BasicWriter::BasicWriter(IRasterDataset* poDataset, std::initializer_list<unsigned int> oChannels)
    : BasicWriter(poDataset, std::vector<unsigned int>(oChannels))
{
}

BasicWriter::BasicWriter(IBitmapDataset* poDataset, unsigned int nBitmap)
    : BasicWriter(std::make_unique<BitmapChannel>(poDataset, nBitmap), nullptr, {1})
{
}

void BasicWriter::ReadRaster(tessel::Raster* poRaster)
{
    GetSet().ReadRaster(poRaster, moType, GetEdgeMode());
}

void BasicWriter::WriteRaster(const tessel::Raster* poRaster)
{
    RequireFittingRaster(poRaster, moType, GetChannelCount(), GetSet().GetFileName());
    Guarded(GetSet().GetFileName(),
            [&]
            {
                WriteBlock(*poRaster, {GetWidth(), GetHeight()},
                           [&](const PixelWindow& oWindow, const unsigned char* pSamples,
                               const SampleStrides& oStrides) {
                               GetSet().GetIO().Write(GetSet().GetChannels(), oWindow, pSamples,
                                                      oStrides);
                           });
            });
}

void BasicWriter::SetAuxiliaryData(const AuxiliaryData& oData)
{
    GetSet().SetAuxiliaryData(oData);
}

void BasicWriter::Flush()
{
    Guarded(GetSet().GetFileName(), [&] { GetSet().GetDataset().Flush(); });
}

}  // namespace kor::datasources
