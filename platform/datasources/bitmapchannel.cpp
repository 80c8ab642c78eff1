#include "platform/datasources/bitmapchannel.h"

#include "platform/exception/exception.h"

namespace kor::datasources
{

namespace
{

constexpr const char* kSource = "platform/datasources/bitmapchannel";

}  // namespace

BitmapChannel::BitmapChannel(IBitmapDataset* poDataset, unsigned int nBitmap)
    : mpoDataset(poDataset), mnBitmap(nBitmap)
{
    if (poDataset == nullptr)
    {
        throw DataException("poDataset is invalid pointer", kSource, __PRETTY_FUNCTION__, __LINE__);
    }
    if (nBitmap == 0 || nBitmap > poDataset->GetBitmapCount())
    {
        throw IOException(poDataset->GetFileName() + ": there is no bitmap " +
                              std::to_string(nBitmap) + "; the file has " +
                              std::to_string(poDataset->GetBitmapCount()) + ", numbered from 1",
                          kSource, __PRETTY_FUNCTION__, __LINE__);
    }
}

AuxiliaryData BitmapChannel::GetAuxiliaryData() const
{
    return mpoDataset->GetBitmapAuxiliaryData(mnBitmap);
}

void BitmapChannel::SetAuxiliaryData(const AuxiliaryData& oData)
{
    mpoDataset->SetBitmapAuxiliaryData(oData, mnBitmap);
}

const ogc::cs::GeocodingInfo& BitmapChannel::GetGeocodingInfo() const
{
    return mpoDataset->GetGeocodingInfo();
}

void BitmapChannel::SetGeocodingInfo(const ogc::cs::GeocodingInfo& oInfo)
{
    mpoDataset->SetGeocodingInfo(oInfo);
}

tessel::DataType BitmapChannel::GetChannelType(unsigned int /*nChannel*/) const
{
    return tessel::eDT_8U;
}

unsigned int BitmapChannel::CreateChannels(const tessel::RasterInfo& /*oInfo*/)
{
    throw DataException(GetFileName() + ": channels cannot be added to a bitmap", kSource,
                        __PRETTY_FUNCTION__, __LINE__);
}

std::unique_ptr<IChannelIO> BitmapChannel::OpenChannels(bool bWrite)
{
    return mpoDataset->OpenBitmap(mnBitmap, bWrite);
}

}  // namespace kor::datasources
