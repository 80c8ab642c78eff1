#pragma once

#include <functional>
#include <memory>
#include <string>
#include <vector>

#include "platform/datasources/gdal/gdalbitmaps.h"
#include "platform/datasources/gdal/gdalchannelio.h"
#include "platform/datasources/gdal/gdalfile.h"
#include "platform/datasources/ibitmapdataset.h"
#include "platform/datasources/irasterdataset.h"

namespace kor::datasources
{

/// A file behind GDAL.
class GdalDataset : public IRasterDataset, public IBitmapDataset
{
public:
    /// Opens a file.
    GdalDataset(const std::string& oFile, bool bUpdate);
    /// A file to be made of a format by its GDAL name: taken now, so that nobody else makes it,
    /// and made by CreateChannels.
    GdalDataset(const std::string& oFile, std::string oFormat, std::vector<std::string> voOptions);
    ~GdalDataset() override;

    std::string GetFileName() const override { return moFile; }
    AuxiliaryData GetAuxiliaryData() const override;
    void SetAuxiliaryData(const AuxiliaryData& oData) override;
    const ogc::cs::GeocodingInfo& GetGeocodingInfo() const override { return moGeocoding; }
    void SetGeocodingInfo(const ogc::cs::GeocodingInfo& oInfo) override;
    void Flush() override;

    unsigned int GetWidth() const override { return static_cast<unsigned int>(moLayout.mnWidth); }
    unsigned int GetHeight() const override { return static_cast<unsigned int>(moLayout.mnHeight); }
    unsigned int GetChannelCount() const override
    {
        return static_cast<unsigned int>(moLayout.mveTypes.size());
    }
    tessel::DataType GetChannelType(unsigned int nChannel) const override;
    unsigned int CreateChannels(const tessel::RasterInfo& oInfo) override;
    unsigned int GetTileWidth() const override { return mnTileWidth; }
    unsigned int GetTileHeight() const override { return mnTileHeight; }
    std::unique_ptr<IChannelIO> OpenChannels(bool bWrite) override;

    unsigned int GetBitmapWidth() const override { return GetWidth(); }
    unsigned int GetBitmapHeight() const override { return GetHeight(); }
    unsigned int GetBitmapCount() const override;
    unsigned int CreateBitmap(unsigned int nWidth, unsigned int nHeight) override;
    AuxiliaryData GetBitmapAuxiliaryData(unsigned int nBitmap) const override;
    void SetBitmapAuxiliaryData(const AuxiliaryData& oData, unsigned int nBitmap) override;
    std::unique_ptr<IChannelIO> OpenBitmap(unsigned int nBitmap, bool bWrite) override;

private:
    void TakeLayout();
    void TakeGeocoding();
    void RequireUpdate(const char* pszTask) const;
    void RequireWritablePixels() const;
    /// Throws kor::DataException, once oPutBack has run, when oNotKept names something that the
    /// file does not hold as it was just told to.
    void RequireKept(const std::function<std::string()>& oNotKept,
                     const std::function<void()>& oPutBack);
    std::vector<GdalBitmap> GetBitmaps() const;
    /// Throws kor::IOException when there is no such bitmap.
    GdalBitmap GetBitmap(unsigned int nBitmap) const;
    [[noreturn]] void RefuseMoreChannels(const tessel::RasterInfo& oInfo) const;

    std::string moFile;
    std::string moFormat;
    std::vector<std::string> mvoOptions;
    std::shared_ptr<GdalFile> mpoFile;  ///< null until the channels of a new file are made
    GdalLayout moLayout;
    std::vector<tessel::DataType> mvoTypes;
    unsigned int mnTileWidth = 0;
    unsigned int mnTileHeight = 0;
    ogc::cs::GeocodingInfo moGeocoding;
};

}  // namespace kor::datasources
