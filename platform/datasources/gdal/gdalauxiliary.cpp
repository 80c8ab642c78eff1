#include "platform/datasources/gdal/gdalauxiliary.h"

#include <cpl_string.h>
#include <gdal_version.h>

#include <cmath>
#include <limits>

#include "platform/exception/exception.h"

namespace kor::datasources
{

namespace
{

constexpr const char* kSource = "platform/datasources/gdal/gdalauxiliary";

AuxiliaryData::Metadata ReadMetadata(GDALMajorObjectH hObject)
{
    AuxiliaryData::Metadata oMetadata;
    char** papszItems = GDALGetMetadata(hObject, nullptr);
    for (int i = 0; i < CSLCount(papszItems); ++i)
    {
        const std::string oItem = papszItems[i];
        const std::size_t nEqual = oItem.find('=');
        if (nEqual != std::string::npos)
        {
            oMetadata[oItem.substr(0, nEqual)] = oItem.substr(nEqual + 1);
        }
    }
    return oMetadata;
}

bool WriteMetadata(GDALMajorObjectH hObject, const AuxiliaryData::Metadata& oMetadata)
{
    if (ReadMetadata(hObject) == oMetadata)
    {
        return true;
    }
    CPLStringList oItems;
    for (const auto& [oKey, oValue] : oMetadata)
    {
        oItems.AddString((oKey + "=" + oValue).c_str());
    }
    return GDALSetMetadata(hObject, oItems.List(), nullptr) == CE_None;
}

/// A no-data value of an integer wider than a double holds, as the nearest double and back.
template <class T>
T NearestInteger(double dfValue)
{
    if (!(dfValue > static_cast<double>(std::numeric_limits<T>::min())))
    {
        return std::numeric_limits<T>::min();
    }
    // The largest value is one below a power of two, which is what it becomes as a double.
    return dfValue >= static_cast<double>(std::numeric_limits<T>::max())
               ? std::numeric_limits<T>::max()
               : static_cast<T>(dfValue);
}

std::optional<double> ReadNoData(GDALRasterBandH hBand)
{
    int bHas = FALSE;
    double dfValue = 0.0;
#if GDAL_VERSION_NUM >= GDAL_COMPUTE_VERSION(3, 5, 0)
    const GDALDataType eType = GDALGetRasterDataType(hBand);
    if (eType == GDT_Int64)
    {
        dfValue = static_cast<double>(GDALGetRasterNoDataValueAsInt64(hBand, &bHas));
    }
    else if (eType == GDT_UInt64)
    {
        dfValue = static_cast<double>(GDALGetRasterNoDataValueAsUInt64(hBand, &bHas));
    }
    else
#endif
    {
        dfValue = GDALGetRasterNoDataValue(hBand, &bHas);
    }
    return bHas != FALSE ? std::optional<double>(dfValue) : std::nullopt;
}

bool SetNoData(GDALRasterBandH hBand, double dfValue)
{
#if GDAL_VERSION_NUM >= GDAL_COMPUTE_VERSION(3, 5, 0)
    const GDALDataType eType = GDALGetRasterDataType(hBand);
    if (eType == GDT_Int64)
    {
        return GDALSetRasterNoDataValueAsInt64(hBand, NearestInteger<std::int64_t>(dfValue)) ==
               CE_None;
    }
    if (eType == GDT_UInt64)
    {
        return GDALSetRasterNoDataValueAsUInt64(hBand, NearestInteger<std::uint64_t>(dfValue)) ==
               CE_None;
    }
#endif
    return GDALSetRasterNoDataValue(hBand, dfValue) == CE_None;
}

/// A GeoTIFF has one no-data value for all its bands.
void RequireOneNoData(GDALDatasetH hDataset, const AuxiliaryData& oData, const std::string& oFile)
{
    if (!EQUAL(GDALGetDriverShortName(GDALGetDatasetDriver(hDataset)), "GTiff"))
    {
        return;
    }
    std::optional<double> dfFound;
    for (int nBand = 1; nBand <= GDALGetRasterCount(hDataset); ++nBand)
    {
        const auto itEntry = oData.GetChannels().find(static_cast<unsigned int>(nBand));
        const std::optional<double> dfNoData = itEntry != oData.GetChannels().end()
                                                   ? itEntry->second.mdfNoData
                                                   : ReadNoData(GDALGetRasterBand(hDataset, nBand));
        if (dfFound && dfNoData && !SameNoData(dfFound, dfNoData))
        {
            throw DataException(oFile + ": the format GTiff holds one no-data value for all " +
                                    "channels and not both " + std::to_string(*dfFound) + " and " +
                                    std::to_string(*dfNoData),
                                kSource, __PRETTY_FUNCTION__, __LINE__);
        }
        dfFound = dfFound ? dfFound : dfNoData;
    }
}

bool WriteChannel(GDALRasterBandH hBand, const AuxiliaryData::Channel& oChannel)
{
    if (GDALGetDescription(hBand) != oChannel.moDescription)
    {
        GDALSetDescription(hBand, oChannel.moDescription.c_str());
    }
    bool bDone = WriteMetadata(hBand, oChannel.moMetadata);
    if (bDone && !SameNoData(ReadNoData(hBand), oChannel.mdfNoData))
    {
        bDone = oChannel.mdfNoData ? SetNoData(hBand, *oChannel.mdfNoData)
                                   : GDALDeleteRasterNoDataValue(hBand) == CE_None;
    }
    return bDone;
}

}  // namespace

bool SameNoData(const std::optional<double>& dfOne, const std::optional<double>& dfOther)
{
    return dfOne == dfOther || (dfOne && dfOther && std::isnan(*dfOne) && std::isnan(*dfOther));
}

AuxiliaryData ReadAuxiliaryData(GDALDatasetH hDataset)
{
    AuxiliaryData oData;
    oData.SetFileMetadata(ReadMetadata(hDataset));
    for (int nBand = 1; nBand <= GDALGetRasterCount(hDataset); ++nBand)
    {
        GDALRasterBandH hBand = GDALGetRasterBand(hDataset, nBand);
        oData.SetChannel({GDALGetDescription(hBand), ReadMetadata(hBand), ReadNoData(hBand)},
                         static_cast<unsigned int>(nBand));
    }
    return oData;
}

bool WriteAuxiliaryData(GDALDatasetH hDataset, const AuxiliaryData& oData, const std::string& oFile)
{
    RequireOneNoData(hDataset, oData, oFile);
    bool bDone = true;
    for (const auto& [nChannel, oChannel] : oData.GetChannels())
    {
        bDone = bDone &&
                WriteChannel(GDALGetRasterBand(hDataset, static_cast<int>(nChannel)), oChannel);
    }
    return bDone && WriteMetadata(hDataset, oData.GetFileMetadata());
}

ogc::cs::GeocodingInfo ReadGeocoding(GDALDatasetH hDataset)
{
    ogc::cs::GeocodingInfo::Transform oTransform{};
    ogc::cs::GeocodingInfo oInfo;
    if (GDALGetGeoTransform(hDataset, oTransform.data()) == CE_None)
    {
        oInfo = ogc::cs::GeocodingInfo(oTransform);
    }
    const char* pszWkt = GDALGetProjectionRef(hDataset);
    oInfo.SetProjection(pszWkt == nullptr ? "" : pszWkt);
    return oInfo;
}

bool WriteGeocoding(GDALDatasetH hDataset, const ogc::cs::GeocodingInfo& oInfo)
{
    const ogc::cs::GeocodingInfo oNow = ReadGeocoding(hDataset);
    bool bDone = true;
    if (oNow.GetTransform() != oInfo.GetTransform())
    {
        ogc::cs::GeocodingInfo::Transform oTransform = oInfo.GetTransform();
        bDone = GDALSetGeoTransform(hDataset, oTransform.data()) == CE_None;
    }
    if (bDone && oNow.GetProjection() != oInfo.GetProjection())
    {
        bDone = GDALSetProjection(hDataset, oInfo.GetProjection().c_str()) == CE_None;
    }
    return bDone;
}

}  // namespace kor::datasources
