#include "platform/datasources/kordsk/kordskdataset.h"

#include <algorithm>

#include "platform/datasources/datatypename.h"
#include "platform/datasources/kordsk/kordskchannelio.h"
#include "platform/exception/exception.h"

namespace kor::datasources
{

namespace
{

constexpr const char* kSource = "platform/datasources/kordsk/kordskdataset";

/// Throws kor::DataException when planes of this kind cannot be appended to voPlanes.
void RequireFittingPlanes(const std::string& oFile, const KordskDirectory& oDirectory,
                          const std::vector<KordskPlane>& voPlanes, const tessel::RasterInfo& oInfo)
{
    const std::string oSize =
        std::to_string(oInfo.mnWidth) + " x " + std::to_string(oInfo.mnHeight) + " pixels";
    std::string oWrong;
    if (oInfo.mnWidth == 0 || oInfo.mnHeight == 0)
    {
        oWrong = "an image of " + oSize + " cannot be made";
    }
    else if (oDirectory.mnWidth != 0 &&
             (oInfo.mnWidth != oDirectory.mnWidth || oInfo.mnHeight != oDirectory.mnHeight))
    {
        oWrong = oSize + " do not fit the image of " + std::to_string(oDirectory.mnWidth) + " x " +
                 std::to_string(oDirectory.mnHeight);
    }
    else if (oInfo.mnChannels == 0 || oInfo.mnChannels > kMostPlanes - voPlanes.size())
    {
        oWrong = std::to_string(oInfo.mnChannels) + " cannot be added to the " +
                 std::to_string(voPlanes.size()) + " there are; a file holds up to " +
                 std::to_string(kMostPlanes);
    }
    else if (!IsSampleType(oInfo.moDataType))
    {
        oWrong = "there are no samples of " + DataTypeName(oInfo.moDataType);
    }
    else if (!PlaneBytes(oInfo.moDataType, oInfo.mnWidth, oInfo.mnHeight))
    {
        oWrong = oSize + " of " + DataTypeName(oInfo.moDataType) + " are larger than any file";
    }
    if (!oWrong.empty())
    {
        throw DataException(oFile + ": " + oWrong, kSource, __PRETTY_FUNCTION__, __LINE__);
    }
}

/// True when there are channels and all of them have tiles of the usual side.
bool HasTilesOnly(const KordskDirectory& oDirectory)
{
    const auto& voChannels = oDirectory.mvoChannels;
    return !voChannels.empty() &&
           std::all_of(voChannels.begin(), voChannels.end(),
                       [](const KordskPlane& oPlane) { return oPlane.mnTileWidth == kTileSide; });
}

}  // namespace

KordskDataset::KordskDataset(const std::string& oFile, bool bUpdate)
    : moFile(oFile),
      mpoFile(KordskFile::Open(oFile)),
      mpoAccess(bUpdate ? std::make_unique<KordskWriteAccess>(mpoFile, oFile) : nullptr)
{
}

KordskDataset::KordskDataset(std::shared_ptr<KordskFile> poFile, const std::string& oFile)
    : moFile(oFile),
      mpoFile(std::move(poFile)),
      mpoAccess(std::make_unique<KordskWriteAccess>(mpoFile, oFile))
{
}

KordskDataset::~KordskDataset() = default;

void KordskDataset::RequireUpdate(const char* pszTask) const
{
    if (!mpoAccess)
    {
        throw IOException(moFile + ": " + pszTask + ": the file was opened for reading", kSource,
                          __PRETTY_FUNCTION__, __LINE__);
    }
}

void KordskDataset::RequireBitmap(const KordskDirectory& oDirectory, unsigned int nBitmap) const
{
    if (nBitmap == 0 || nBitmap > oDirectory.mvoBitmaps.size())
    {
        throw IOException(moFile + ": there is no bitmap " + std::to_string(nBitmap) +
                              "; the file has " + std::to_string(oDirectory.mvoBitmaps.size()) +
                              ", numbered from 1",
                          kSource, __PRETTY_FUNCTION__, __LINE__);
    }
}

AuxiliaryData KordskDataset::GetAuxiliaryData() const
{
    const auto poDirectory = mpoFile->GetSnapshot();
    AuxiliaryData oData;
    oData.SetFileMetadata(poDirectory->moMetadata);
    unsigned int nChannel = 0;
    for (const KordskPlane& oPlane : poDirectory->mvoChannels)
    {
        oData.SetChannel(oPlane.moData, ++nChannel);
    }
    return oData;
}

void KordskDataset::SetAuxiliaryData(const AuxiliaryData& oData)
{
    RequireUpdate("cannot set the metadata");
    for (const auto& [nChannel, oChannel] : oData.GetChannels())
    {
        GetChannelType(nChannel);  // throws when there is no such channel
    }
    mpoFile->Change(
        [&](KordskDirectory& oDirectory)
        {
            oDirectory.moMetadata = oData.GetFileMetadata();
            for (const auto& [nChannel, oChannel] : oData.GetChannels())
            {
                oDirectory.mvoChannels.at(nChannel - 1).moData = oChannel;
            }
        });
}

const ogc::cs::GeocodingInfo& KordskDataset::GetGeocodingInfo() const
{
    return *mpoFile->GetSnapshot()->mpoGeocoding;
}

void KordskDataset::SetGeocodingInfo(const ogc::cs::GeocodingInfo& oInfo)
{
    RequireUpdate("cannot set the georeferencing");
    const auto poInfo = std::make_shared<const ogc::cs::GeocodingInfo>(oInfo);
    mpoFile->Change([&](KordskDirectory& oDirectory) { oDirectory.mpoGeocoding = poInfo; });
}

void KordskDataset::Flush()
{
    if (mpoAccess)
    {
        mpoFile->Sync();
    }
}

unsigned int KordskDataset::GetChannelCount() const
{
    return static_cast<unsigned int>(mpoFile->GetSnapshot()->mvoChannels.size());
}

tessel::DataType KordskDataset::GetChannelType(unsigned int nChannel) const
{
    const auto poDirectory = mpoFile->GetSnapshot();
    if (nChannel == 0 || nChannel > poDirectory->mvoChannels.size())
    {
        throw IOException(moFile + ": there is no channel " + std::to_string(nChannel) +
                              "; the file has " + std::to_string(poDirectory->mvoChannels.size()) +
                              ", numbered from 1",
                          kSource, __PRETTY_FUNCTION__, __LINE__);
    }
    return poDirectory->mvoChannels[nChannel - 1].moType;
}

unsigned int KordskDataset::AppendPlanes(std::vector<KordskPlane> KordskDirectory::*pvoPlanes,
                                         const tessel::RasterInfo& oInfo)
{
    std::size_t nBefore = 0;
    mpoFile->Change(
        [&](KordskDirectory& oDirectory)
        {
            std::vector<KordskPlane>& voPlanes = oDirectory.*pvoPlanes;
            RequireFittingPlanes(moFile, oDirectory, voPlanes, oInfo);
            nBefore = voPlanes.size();
            oDirectory.mnWidth = oInfo.mnWidth;
            oDirectory.mnHeight = oInfo.mnHeight;
            KordskPlane oPlane;
            oPlane.moType = oInfo.moDataType;
            oPlane.mnLength = *PlaneBytes(oInfo.moDataType, oInfo.mnWidth, oInfo.mnHeight);
            oPlane.mnTileWidth = oDirectory.mbTiled ? kTileSide : 0;
            oPlane.mnTileHeight = oPlane.mnTileWidth;
            voPlanes.resize(nBefore + oInfo.mnChannels, oPlane);
        });
    return static_cast<unsigned int>(nBefore + 1);
}

unsigned int KordskDataset::CreateChannels(const tessel::RasterInfo& oInfo)
{
    RequireUpdate("cannot add channels");
    return AppendPlanes(&KordskDirectory::mvoChannels, oInfo);
}

unsigned int KordskDataset::GetTileWidth() const
{
    const auto poDirectory = mpoFile->GetSnapshot();
    return HasTilesOnly(*poDirectory) ? std::min(poDirectory->mnWidth, kTileSide)
                                      : poDirectory->mnWidth;
}

unsigned int KordskDataset::GetTileHeight() const
{
    const auto poDirectory = mpoFile->GetSnapshot();
    return HasTilesOnly(*poDirectory) ? std::min(poDirectory->mnHeight, kTileSide)
                                      : poDirectory->mnHeight;
}

std::unique_ptr<IChannelIO> KordskDataset::OpenPlanes(unsigned int nBitmap, bool bWrite)
{
    return std::make_unique<KordskChannelIO>(
        mpoFile, nBitmap, bWrite ? std::make_unique<KordskWriteAccess>(mpoFile, moFile) : nullptr);
}

std::unique_ptr<IChannelIO> KordskDataset::OpenChannels(bool bWrite)
{
    if (bWrite)
    {
        RequireUpdate("cannot write pixels");
    }
    return OpenPlanes(0, bWrite);
}

unsigned int KordskDataset::GetBitmapCount() const
{
    return static_cast<unsigned int>(mpoFile->GetSnapshot()->mvoBitmaps.size());
}

unsigned int KordskDataset::CreateBitmap(unsigned int nWidth, unsigned int nHeight)
{
    RequireUpdate("cannot add a bitmap");
    return AppendPlanes(&KordskDirectory::mvoBitmaps, {nWidth, nHeight, 1, tessel::eDT_BIT});
}

AuxiliaryData KordskDataset::GetBitmapAuxiliaryData(unsigned int nBitmap) const
{
    const auto poDirectory = mpoFile->GetSnapshot();
    RequireBitmap(*poDirectory, nBitmap);
    AuxiliaryData oData;
    oData.SetFileMetadata(poDirectory->moMetadata);
    oData.SetChannel(poDirectory->mvoBitmaps[nBitmap - 1].moData, 1);
    return oData;
}

void KordskDataset::SetBitmapAuxiliaryData(const AuxiliaryData& oData, unsigned int nBitmap)
{
    RequireUpdate("cannot set the metadata");
    mpoFile->Change(
        [&](KordskDirectory& oDirectory)
        {
            RequireBitmap(oDirectory, nBitmap);
            oDirectory.moMetadata = oData.GetFileMetadata();
            const auto itEntry = oData.GetChannels().find(1);
            if (itEntry != oData.GetChannels().end())
            {
                oDirectory.mvoBitmaps[nBitmap - 1].moData = itEntry->second;
            }
        });
}

std::unique_ptr<IChannelIO> KordskDataset::OpenBitmap(unsigned int nBitmap, bool bWrite)
{
    RequireBitmap(*mpoFile->GetSnapshot(), nBitmap);
    if (bWrite)
    {
        RequireUpdate("cannot write a bitmap");
    }
    return OpenPlanes(nBitmap, bWrite);
}

}  // namespace kor::datasources
