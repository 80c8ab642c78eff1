#pragma once

#include "platform/datasources/ibitmapdataset.h"
#include "platform/datasources/irasterdataset.h"

namespace kor::datasources
{

/// A bitmap as a dataset of one channel of eDT_8U, by which the readers and writers of channels
/// serve for bitmaps as well. Borrows the dataset.
class BitmapChannel : public IRasterDataset
{
public:
    /// Throws kor::DataException when poDataset is null, kor::IOException when there is no such
    /// bitmap.
    BitmapChannel(IBitmapDataset* poDataset, unsigned int nBitmap);

    std::string GetFileName() const override { return mpoDataset->GetFileName(); }
    AuxiliaryData GetAuxiliaryData() const override;
    void SetAuxiliaryData(const AuxiliaryData& oData) override;
    const ogc::cs::GeocodingInfo& GetGeocodingInfo() const override;
    void SetGeocodingInfo(const ogc::cs::GeocodingInfo& oInfo) override;
    void Flush() override { mpoDataset->Flush(); }

    unsigned int GetWidth() const override { return mpoDataset->GetBitmapWidth(); }
    unsigned int GetHeight() const override { return mpoDataset->GetBitmapHeight(); }
    unsigned int GetChannelCount() const override { return 1; }
    tessel::DataType GetChannelType(unsigned int nChannel) const override;
    /// Throws kor::DataException: a bitmap stays one.
    unsigned int CreateChannels(const tessel::RasterInfo& oInfo) override;
    std::unique_ptr<IChannelIO> OpenChannels(bool bWrite) override;

private:
    IBitmapDataset* mpoDataset;
    unsigned int mnBitmap;
};

}  // namespace kor::datasources
