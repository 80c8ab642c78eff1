#include "platform/datasources/gdal/gdaldataset.h"

#include <fcntl.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <exception>
#include <filesystem>
#include <system_error>

#include "platform/datasources/datatypename.h"
#include "platform/datasources/gdal/gdalauxiliary.h"
#include "platform/datasources/gdal/gdalkept.h"
#include "platform/datasources/gdal/gdalrawfile.h"
#include "platform/datasources/gdal/gdaltypes.h"
#include "platform/exception/exception.h"

namespace kor::datasources
{

namespace
{

constexpr const char* kSource = "platform/datasources/gdal/gdaldataset";

/// Larger tiles are refused: GDAL takes the memory for one at once, on the word of the file.
constexpr std::int64_t kLargestTileBytes = std::int64_t{1} << 30;

/// Makes the file, empty, if it does not exist.
void TakeName(const std::string& oFile)
{
    const int nFile = open(oFile.c_str(), O_WRONLY | O_CREAT | O_EXCL | O_CLOEXEC, 0666);
    if (nFile < 0)
    {
        throw FileException(
            oFile + ": cannot make the file: " + std::generic_category().message(errno), oFile,
            kSource, __PRETTY_FUNCTION__, __LINE__);
    }
    close(nFile);
}

void RequireSaneTiles(GDALDatasetH hDataset, const std::string& oFile)
{
    for (int nBand = 1; nBand <= GDALGetRasterCount(hDataset); ++nBand)
    {
        GDALRasterBandH hBand = GDALGetRasterBand(hDataset, nBand);
        int nWidth = 0;
        int nHeight = 0;
        GDALGetBlockSize(hBand, &nWidth, &nHeight);
        const std::int64_t nSampleBytes = GDALGetDataTypeSizeBytes(GDALGetRasterDataType(hBand));
        if (nSampleBytes != 0 && std::int64_t{nWidth} * nHeight > kLargestTileBytes / nSampleBytes)
        {
            throw FileException(oFile + ": channel " + std::to_string(nBand) + " has tiles of " +
                                    std::to_string(nWidth) + " x " + std::to_string(nHeight) +
                                    " pixels, more than 1 GiB each",
                                oFile, kSource, __PRETTY_FUNCTION__, __LINE__);
        }
    }
}

std::string SizeText(unsigned int nWidth, unsigned int nHeight)
{
    return std::to_string(nWidth) + " x " + std::to_string(nHeight);
}

}  // namespace

GdalDataset::GdalDataset(const std::string& oFile, bool bUpdate)
    : moFile(oFile), mpoFile(GdalFile::Open(oFile, bUpdate))
{
    TakeLayout();
    mpoFile->Do("cannot look at the channels",
                [&](GDALDatasetH hDataset)
                {
                    RequireSaneTiles(hDataset, moFile);
                    RequireWholeRawFile(hDataset, moFile);
                    return true;
                });
}

GdalDataset::GdalDataset(const std::string& oFile, std::string oFormat,
                         std::vector<std::string> voOptions)
    : moFile(oFile), moFormat(std::move(oFormat)), mvoOptions(std::move(voOptions))
{
    TakeName(oFile);
}

GdalDataset::~GdalDataset()
{
    if (!mpoFile)
    {
        std::error_code oIgnored;
        std::filesystem::remove(moFile, oIgnored);
    }
}

void GdalDataset::TakeLayout()
{
    mpoFile->Do(
        "cannot look at the channels",
        [&](GDALDatasetH hDataset)
        {
            moLayout = LayoutOf(hDataset);
            mvoTypes.clear();
            for (int nBand = 1; nBand <= GDALGetRasterCount(hDataset); ++nBand)
            {
                mvoTypes.push_back(
                    TypeOfBand(GDALGetRasterBand(hDataset, nBand)).value_or(tessel::DataType()));
            }
            int nTileWidth = 1;
            int nTileHeight = 1;
            if (!mvoTypes.empty())
            {
                GDALGetBlockSize(GDALGetRasterBand(hDataset, 1), &nTileWidth, &nTileHeight);
            }
            mnTileWidth = static_cast<unsigned int>(
                std::clamp(nTileWidth, std::min(1, moLayout.mnWidth), moLayout.mnWidth));
            mnTileHeight = static_cast<unsigned int>(
                std::clamp(nTileHeight, std::min(1, moLayout.mnHeight), moLayout.mnHeight));
            return true;
        });
    TakeGeocoding();
}

void GdalDataset::RequireUpdate(const char* pszTask) const
{
    if (!mpoFile)
    {
        throw IOException(moFile + ": " + pszTask + ": the file has no channels yet", kSource,
                          __PRETTY_FUNCTION__, __LINE__);
    }
    if (!mpoFile->IsUpdate())
    {
        throw IOException(moFile + ": " + pszTask + ": the file was opened for reading", kSource,
                          __PRETTY_FUNCTION__, __LINE__);
    }
}

tessel::DataType GdalDataset::GetChannelType(unsigned int nChannel) const
{
    if (nChannel == 0 || nChannel > mvoTypes.size())
    {
        throw IOException(moFile + ": there is no channel " + std::to_string(nChannel) +
                              "; the file has " + std::to_string(mvoTypes.size()) +
                              ", numbered from 1",
                          kSource, __PRETTY_FUNCTION__, __LINE__);
    }
    return mvoTypes[nChannel - 1];
}

unsigned int GdalDataset::CreateChannels(const tessel::RasterInfo& oInfo)
{
    const unsigned int nFirst = GetChannelCount() + 1;
    if (mpoFile)
    {
        RequireUpdate("cannot add channels");
        RefuseMoreChannels(oInfo);
    }
    else
    {
        mpoFile = GdalFile::Create(moFile, moFormat, mvoOptions, oInfo);
    }
    TakeLayout();
    return nFirst;
}

void GdalDataset::RefuseMoreChannels(const tessel::RasterInfo& oInfo) const
{
    std::string oReason;
    if (oInfo.mnWidth != GetWidth() || oInfo.mnHeight != GetHeight())
    {
        oReason = "channels of " + SizeText(oInfo.mnWidth, oInfo.mnHeight) +
                  " pixels do not fit the image of " + SizeText(GetWidth(), GetHeight());
    }
    else if (!mvoTypes.empty() && oInfo.moDataType != mvoTypes.front())
    {
        oReason = "the format " + mpoFile->GetFormat() + " cannot hold channels of " +
                  DataTypeName(oInfo.moDataType) + " beside channels of " +
                  DataTypeName(mvoTypes.front());
    }
    else
    {
        oReason = "the format " + mpoFile->GetFormat() +
                  " cannot add channels to a file; make all of them by one call";
    }
    throw DataException(moFile + ": " + oReason, kSource, __PRETTY_FUNCTION__, __LINE__);
}

std::unique_ptr<IChannelIO> GdalDataset::OpenChannels(bool bWrite)
{
    if (bWrite)
    {
        RequireUpdate("cannot write pixels");
        RequireWritablePixels();
    }
    // A second handle on a file that is being changed would see old pixels, so all share the one.
    const bool bShared = mpoFile && mpoFile->IsUpdate();
    return std::make_unique<GdalChannelIO>(bShared ? mpoFile : GdalFile::Open(moFile, false),
                                           moLayout);
}

void GdalDataset::RequireWritablePixels() const
{
    std::string oReason;
    mpoFile->Do("cannot look at the channels",
                [&](GDALDatasetH hDataset)
                {
                    oReason = UnwritableRawFile(hDataset, moFile);
                    return true;
                });
    if (!oReason.empty())
    {
        throw DataException(moFile + ": " + oReason, kSource, __PRETTY_FUNCTION__, __LINE__);
    }
}

AuxiliaryData GdalDataset::GetAuxiliaryData() const
{
    AuxiliaryData oData;
    if (mpoFile)
    {
        mpoFile->Do("cannot read the metadata",
                    [&](GDALDatasetH hDataset)
                    {
                        oData = ReadAuxiliaryData(hDataset);
                        return true;
                    });
    }
    return oData;
}

void GdalDataset::SetAuxiliaryData(const AuxiliaryData& oData)
{
    RequireUpdate("cannot set the metadata");
    for (const auto& [nChannel, oChannel] : oData.GetChannels())
    {
        GetChannelType(nChannel);  // throws when there is no such channel
    }
    RequireKeepableTexts(oData, moFile);
    const auto oSet = [&](const AuxiliaryData& oValue)
    {
        mpoFile->Do("cannot set the metadata", [&](GDALDatasetH hDataset)
                    { return WriteAuxiliaryData(hDataset, oValue, moFile); });
    };
    const AuxiliaryData oBefore = GetAuxiliaryData();
    oSet(oData);
    RequireKept([&] { return NotKept(oData, oBefore, GetAuxiliaryData()); },
                [&] { oSet(oBefore); });
}

void GdalDataset::SetGeocodingInfo(const ogc::cs::GeocodingInfo& oInfo)
{
    RequireUpdate("cannot set the georeferencing");
    const auto oSet = [&](const ogc::cs::GeocodingInfo& oValue)
    {
        mpoFile->Do("cannot set the georeferencing",
                    [&](GDALDatasetH hDataset) { return WriteGeocoding(hDataset, oValue); });
        TakeGeocoding();
    };
    const ogc::cs::GeocodingInfo oBefore = moGeocoding;
    oSet(oInfo);
    RequireKept(
        [&]
        {
            TakeGeocoding();
            return NotKept(oInfo, oBefore, moGeocoding, GetWidth(), GetHeight());
        },
        [&] { oSet(oBefore); });
}

void GdalDataset::TakeGeocoding()
{
    mpoFile->Do("cannot read the georeferencing",
                [&](GDALDatasetH hDataset)
                {
                    moGeocoding = ReadGeocoding(hDataset);
                    return true;
                });
}

void GdalDataset::RequireKept(const std::function<std::string()>& oNotKept,
                              const std::function<void()>& oPutBack)
{
    if (mpoFile->GetFormat() == "GTiff")
    {
        return;  // holds all that GDAL takes for it
    }
    std::exception_ptr poError;
    try
    {
        mpoFile->Flush();  // what comes back shows once the file is opened anew
        const std::string oLost = oNotKept();
        if (oLost.empty())
        {
            return;
        }
        poError = std::make_exception_ptr(DataException(
            moFile + ": the format " + mpoFile->GetFormat() + " does not keep " + oLost, kSource,
            __PRETTY_FUNCTION__, __LINE__));
    }
    catch (const Exception&)
    {
        poError = std::current_exception();
    }
    try
    {
        oPutBack();
        mpoFile->Flush();
    }
    catch (const Exception&)
    {
        // The first error says more than one on the way back.
    }
    std::rethrow_exception(poError);
}

std::vector<GdalBitmap> GdalDataset::GetBitmaps() const
{
    std::vector<GdalBitmap> voBitmaps;
    if (mpoFile)
    {
        mpoFile->Do("cannot look at the bitmaps",
                    [&](GDALDatasetH hDataset)
                    {
                        voBitmaps = BitmapsOf(hDataset, moFile);
                        return true;
                    });
    }
    return voBitmaps;
}

GdalBitmap GdalDataset::GetBitmap(unsigned int nBitmap) const
{
    const std::vector<GdalBitmap> voBitmaps = GetBitmaps();
    if (nBitmap == 0 || nBitmap > voBitmaps.size())
    {
        throw IOException(moFile + ": there is no bitmap " + std::to_string(nBitmap) +
                              "; the file has " + std::to_string(voBitmaps.size()) +
                              ", numbered from 1",
                          kSource, __PRETTY_FUNCTION__, __LINE__);
    }
    return voBitmaps[nBitmap - 1];
}

unsigned int GdalDataset::GetBitmapCount() const
{
    return static_cast<unsigned int>(GetBitmaps().size());
}

unsigned int GdalDataset::CreateBitmap(unsigned int nWidth, unsigned int nHeight)
{
    RequireUpdate("cannot add a bitmap");
    if (nWidth != GetWidth() || nHeight != GetHeight())
    {
        throw DataException(moFile + ": a bitmap of " + SizeText(nWidth, nHeight) +
                                " pixels does not fit the image of " +
                                SizeText(GetWidth(), GetHeight()),
                            kSource, __PRETTY_FUNCTION__, __LINE__);
    }
    mpoFile->Do("cannot add a bitmap",
                [&](GDALDatasetH hDataset) { return AddMask(hDataset, moFile); });
    return GetBitmapCount();
}

AuxiliaryData GdalDataset::GetBitmapAuxiliaryData(unsigned int nBitmap) const
{
    const GdalBitmap oBitmap = GetBitmap(nBitmap);
    const AuxiliaryData oAll = GetAuxiliaryData();
    AuxiliaryData oData;
    oData.SetFileMetadata(oAll.GetFileMetadata());
    if (oBitmap.mnBand != 0)
    {
        oData.SetChannel(oAll.GetChannels().at(static_cast<unsigned int>(oBitmap.mnBand)), 1);
    }
    return oData;
}

void GdalDataset::SetBitmapAuxiliaryData(const AuxiliaryData& oData, unsigned int nBitmap)
{
    RequireUpdate("cannot set the metadata");
    const GdalBitmap oBitmap = GetBitmap(nBitmap);
    AuxiliaryData oAll;
    oAll.SetFileMetadata(oData.GetFileMetadata());
    const auto itEntry = oData.GetChannels().find(1);
    if (itEntry != oData.GetChannels().end())
    {
        if (oBitmap.mnBand != 0)
        {
            oAll.SetChannel(itEntry->second, static_cast<unsigned int>(oBitmap.mnBand));
        }
        else if (!itEntry->second.moDescription.empty() || !itEntry->second.moMetadata.empty() ||
                 itEntry->second.mdfNoData)
        {
            throw DataException(moFile + ": the mask of a file of the format " +
                                    mpoFile->GetFormat() +
                                    " has no description, no-data value or metadata of its own",
                                kSource, __PRETTY_FUNCTION__, __LINE__);
        }
    }
    SetAuxiliaryData(oAll);
}

std::unique_ptr<IChannelIO> GdalDataset::OpenBitmap(unsigned int nBitmap, bool bWrite)
{
    const GdalBitmap oBitmap = GetBitmap(nBitmap);
    if (bWrite)
    {
        RequireUpdate("cannot write a bitmap");
    }
    // The one handle serves all readers of bitmaps: mask builders make one for every block, and a
    // handle opened for it would have to unpack the mask from the start.
    return std::make_unique<GdalBitmapIO>(mpoFile, oBitmap);
}

void GdalDataset::Flush()
{
    if (mpoFile)
    {
        mpoFile->Flush();
    }
}

}  // namespace kor::datasources
