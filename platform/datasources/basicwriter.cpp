#include "platform/datasources/basicwriter.h"

#include "platform/datasources/blocktransfer.h"
#include "platform/datasources/guard.h"

namespace kor::datasources
{

BasicWriter::BasicWriter(IRasterDataset* poDataset, const std::vector<unsigned int>& oChannels)
    : moSet(poDataset, oChannels, true), moType(moSet.GetCommonType())
{
    SetTileSize(moSet.GetDataset().GetTileWidth(), moSet.GetDataset().GetTileHeight());
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
