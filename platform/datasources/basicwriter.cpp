#include "platform/datasources/basicwriter.h"

#include "platform/datasources/bitmapchannel.h"
#include "platform/datasources/blocktransfer.h"
#include "platform/datasources/guard.h"

namespace kor::datasources
{

BasicWriter::BasicWriter(std::unique_ptr<IRasterDataset> poOwned, IRasterDataset* poDataset,
                         const std::vector<unsigned int>& oChannels)
    : mpoOwned(std::move(poOwned)),
      moSet(mpoOwned ? mpoOwned.get() : poDataset, oChannels, true),
      moType(moSet.GetCommonType())
{
    SetTileSize(moSet.GetDataset().GetTileWidth(), moSet.GetDataset().GetTileHeight());
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

unsigned int BasicWriter::GetWidth() const
{
    return moSet.GetDataset().GetWidth();
}

unsigned int BasicWriter::GetHeight() const
{
    return moSet.GetDataset().GetHeight();
}

unsigned int BasicWriter::GetChannelCount() const
{
    return static_cast<unsigned int>(moSet.GetChannels().size());
}

void BasicWriter::ReadRaster(tessel::Raster* poRaster)
{
    moSet.ReadRaster(poRaster, moType, GetEdgeMode());
}

void BasicWriter::WriteRaster(const tessel::Raster* poRaster)
{
    RequireFittingRaster(poRaster, moType, GetChannelCount(), moSet.GetFileName());
    Guarded(moSet.GetFileName(),
            [&]
            {
                WriteBlock(
                    *poRaster, {GetWidth(), GetHeight()},
                    [&](const PixelWindow& oWindow, const unsigned char* pSamples,
                        const SampleStrides& oStrides)
                    { moSet.GetIO().Write(moSet.GetChannels(), oWindow, pSamples, oStrides); });
            });
}

const ogc::cs::GeocodingInfo& BasicWriter::GetGeocodingInfo() const
{
    return moSet.GetDataset().GetGeocodingInfo();
}

AuxiliaryData BasicWriter::GetAuxiliaryData() const
{
    return moSet.GetAuxiliaryData();
}

void BasicWriter::SetAuxiliaryData(const AuxiliaryData& oData)
{
    moSet.SetAuxiliaryData(oData);
}

void BasicWriter::Flush()
{
    Guarded(moSet.GetFileName(), [&] { moSet.GetDataset().Flush(); });
}

}  // namespace kor::datasources
