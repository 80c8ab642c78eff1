#pragma once

#include <memory>
#include <string>

#include "platform/datasources/ibitmapdataset.h"
#include "platform/datasources/irasterdataset.h"
#include "platform/datasources/kordsk/kordskfile.h"

namespace kor::datasources
{

/// A KORDSK file: channels of all seventeen types of samples side by side, and bitmaps, all of one
/// size, with descriptions, no-data values, metadata of any bytes, and georeferencing.
///
/// Layout    one file, little-endian. Two slots (see KordskSlot) stand in front; behind them come
///           planes (KordskPlane) and directories (KordskDirectory) in any order, each on a
///           4096-byte boundary. The slot with the higher sequence whose own checksum and whose
///           directory's checksum hold is the one that counts. Planes take all of their room when
///           they are made, so that a full disk shows there and not while pixels are written.
/// Tiles     readers and writers of a file whose planes lie row after row take the whole image as
///           their tile, so that blocks are full-width strips, one transfer a block and channel;
///           those of a file all of whose channels are tiled take its tiles.
/// Changes   channels, descriptions and the rest are whole after a kill at any time: as they were
///           before the change or after it. Pixels are in the file when WriteRaster returns and on
///           the disk after Flush; blocks never written hold zeros.
/// Sharing   handles on one file in a process share its state: what one changes, all see, and each
///           opened for changing may change it. Of the processes, one at a time can have a file
///           open for changing; others get kor::FileException. Reading is always free; a reader in
///           another process sees the directory as it was when the file was opened there last.
/// Refused   on opening, with the reason (kor::FileException): a file in which neither slot counts,
///           an unknown version, key or type of samples, sizes that overflow or do not fit the
///           image, planes that lie outside the file, over one another, over the slots or the
///           directory, more than 65535 channels or bitmaps.
/// Threads   as told by IDataset; readers and writers work without a lock, those of bits share one.
class KordskDataset : public IRasterDataset, public IBitmapDataset
{
public:
    /// Opens a file.
    KordskDataset(const std::string& oFile, bool bUpdate);
    /// Takes over a file that was just made, for changing.
    KordskDataset(std::shared_ptr<KordskFile> poFile, const std::string& oFile);
    ~KordskDataset() override;

    std::string GetFileName() const override { return moFile; }
    AuxiliaryData GetAuxiliaryData() const override;
    void SetAuxiliaryData(const AuxiliaryData& oData) override;
    const ogc::cs::GeocodingInfo& GetGeocodingInfo() const override;
    void SetGeocodingInfo(const ogc::cs::GeocodingInfo& oInfo) override;
    void Flush() override;

    unsigned int GetWidth() const override { return mpoFile->GetSnapshot()->mnWidth; }
    unsigned int GetHeight() const override { return mpoFile->GetSnapshot()->mnHeight; }
    unsigned int GetChannelCount() const override;
    tessel::DataType GetChannelType(unsigned int nChannel) const override;
    unsigned int CreateChannels(const tessel::RasterInfo& oInfo) override;
    unsigned int GetTileWidth() const override;
    unsigned int GetTileHeight() const override;
    std::unique_ptr<IChannelIO> OpenChannels(bool bWrite) override;

    unsigned int GetBitmapWidth() const override { return GetWidth(); }
    unsigned int GetBitmapHeight() const override { return GetHeight(); }
    unsigned int GetBitmapCount() const override;
    unsigned int CreateBitmap(unsigned int nWidth, unsigned int nHeight) override;
    AuxiliaryData GetBitmapAuxiliaryData(unsigned int nBitmap) const override;
    void SetBitmapAuxiliaryData(const AuxiliaryData& oData, unsigned int nBitmap) override;
    std::unique_ptr<IChannelIO> OpenBitmap(unsigned int nBitmap, bool bWrite) override;

    /// All that the file holds, as it is now.
    KordskFile::Snapshot GetDirectory() const { return mpoFile->GetSnapshot(); }

private:
    void RequireUpdate(const char* pszTask) const;
    void RequireBitmap(const KordskDirectory& oDirectory, unsigned int nBitmap) const;
    unsigned int AppendPlanes(std::vector<KordskPlane> KordskDirectory::*pvoPlanes,
                              const tessel::RasterInfo& oInfo);
    std::unique_ptr<IChannelIO> OpenPlanes(unsigned int nBitmap, bool bWrite);

    std::string moFile;
    std::shared_ptr<KordskFile> mpoFile;
    std::unique_ptr<KordskWriteAccess> mpoAccess;  ///< null when it was opened for reading
};

}  // namespace kor::datasources
