#include "platform/datasources/kordsk/kordskchannelio.h"

#include <algorithm>
#include <cstring>

#include "basic/tessel/mask/mask.h"
#include "platform/datasources/copysamples.h"

namespace kor::datasources
{

namespace
{

/// Samples that do not lie as the file has them are moved in strips of this many bytes, so that
/// they stay in the cache from one channel to the next.
constexpr std::size_t kStripBytes = 1 << 18;

/// Bits from bit nFirst of pBits on as bytes 0 or 1.
void ExpandBits(const unsigned char* pBits, std::size_t nFirst, std::size_t nCount,
                unsigned char* pSamples, std::size_t nStride)
{
    std::size_t i = 0;
    if (nStride == 1 && nFirst == 0)
    {
        for (; i + 8 <= nCount; i += 8)
        {
            std::memcpy(pSamples + i, &tessel::kMaskBitTable[std::size_t{pBits[i >> 3]} * 8], 8);
        }
    }
    for (; i < nCount; ++i)
    {
        const std::size_t nBit = nFirst + i;
        pSamples[i * nStride] = (pBits[nBit >> 3] >> (7 - (nBit & 7))) & 1U;
    }
}

/// The reverse; bits beside those that are written stay.
void PackBits(const unsigned char* pSamples, std::size_t nStride, std::size_t nCount,
              std::size_t nFirst, unsigned char* pBits)
{
    for (std::size_t i = 0; i < nCount; ++i)
    {
        const std::size_t nBit = nFirst + i;
        const auto nMask = static_cast<unsigned char>(128U >> (nBit & 7));
        unsigned char& nByte = pBits[nBit >> 3];
        nByte =
            static_cast<unsigned char>(pSamples[i * nStride] != 0 ? nByte | nMask : nByte & ~nMask);
    }
}

}  // namespace

KordskChannelIO::KordskChannelIO(std::shared_ptr<KordskFile> poFile, unsigned int nBitmap,
                                 std::unique_ptr<KordskWriteAccess> poAccess)
    : mpoFile(std::move(poFile)),
      mpoDirectory(mpoFile->GetSnapshot()),
      mnBitmap(nBitmap),
      mpoAccess(std::move(poAccess))
{
}

const KordskPlane& KordskChannelIO::PlaneOf(unsigned int nChannel) const
{
    return mnBitmap == 0 ? mpoDirectory->mvoChannels.at(nChannel - 1)
                         : mpoDirectory->mvoBitmaps.at(mnBitmap - 1);
}

/// Calls oVisit with each piece of the window in each channel, and where its samples are in memory.
template <class Visit>
void KordskChannelIO::ForEachPiece(std::span<const unsigned int> oChannels,
                                   const PixelWindow& oWindow, const SampleStrides& oStrides,
                                   const Visit& oVisit) const
{
    const tessel::DataType& oType = PlaneOf(oChannels[0]).moType;
    const std::size_t nRowBytes = oStrides.mnPixel * oWindow.mnWidth;
    const bool bAsInFile = oType != tessel::eDT_BIT && oStrides.mnPixel == oType.GetSampleBytes();
    const auto nStripRows = bAsInFile ? oWindow.mnHeight
                                      : static_cast<std::uint32_t>(std::clamp<std::size_t>(
                                            kStripBytes / nRowBytes, 1, oWindow.mnHeight));
    PixelWindow oStrip = oWindow;
    for (std::uint32_t nDone = 0; nDone < oWindow.mnHeight; nDone += oStrip.mnHeight)
    {
        oStrip.mnY = oWindow.mnY + nDone;
        oStrip.mnHeight = std::min(nStripRows, oWindow.mnHeight - nDone);
        for (std::size_t c = 0; c < oChannels.size(); ++c)
        {
            const KordskPlane& oPlane = PlaneOf(oChannels[c]);
            for (const PlanePiece& oPiece :
                 PiecesOf(oPlane, mpoDirectory->mnWidth, mpoDirectory->mnHeight, oStrip))
            {
                oVisit(oPlane, oPiece,
                       c * oStrides.mnChannel +
                           (oPiece.moWindow.mnX - oWindow.mnX) * oStrides.mnPixel +
                           (oPiece.moWindow.mnY - oWindow.mnY) * oStrides.mnLine);
            }
        }
    }
}

FileRows KordskChannelIO::RowsInBuffer(const PlanePiece& oPiece)
{
    const FileRows oRows{oPiece.mnOffset, oPiece.mnPitch, oPiece.mnRowBytes,
                         oPiece.moWindow.mnHeight};
    if (mvnRows.size() < oRows.mnBytes * oRows.mnCount)
    {
        mvnRows.resize(oRows.mnBytes * oRows.mnCount);
    }
    return oRows;
}

void KordskChannelIO::ReadSamples(const KordskPlane& oPlane, const PlanePiece& oPiece,
                                  unsigned char* pSamples, const SampleStrides& oStrides)
{
    const std::size_t nSampleBytes = oPlane.moType.GetSampleBytes();
    if (oStrides.mnPixel == nSampleBytes)
    {
        mpoFile->GetReadFile().ReadRows(
            {oPiece.mnOffset, oPiece.mnPitch, oPiece.mnRowBytes, oPiece.moWindow.mnHeight},
            pSamples, oStrides.mnLine);
        return;
    }
    const FileRows oRows = RowsInBuffer(oPiece);
    mpoFile->GetReadFile().ReadRows(oRows, mvnRows.data(), oRows.mnBytes);
    for (std::size_t y = 0; y < oRows.mnCount; ++y)
    {
        CopySamples(nSampleBytes, oPiece.moWindow.mnWidth, mvnRows.data() + y * oRows.mnBytes,
                    nSampleBytes, pSamples + y * oStrides.mnLine, oStrides.mnPixel);
    }
}

void KordskChannelIO::WriteSamples(const KordskPlane& oPlane, const PlanePiece& oPiece,
                                   const unsigned char* pSamples, const SampleStrides& oStrides)
{
    const std::size_t nSampleBytes = oPlane.moType.GetSampleBytes();
    if (oStrides.mnPixel == nSampleBytes)
    {
        mpoFile->GetWriteFile().WriteRows(
            {oPiece.mnOffset, oPiece.mnPitch, oPiece.mnRowBytes, oPiece.moWindow.mnHeight},
            pSamples, oStrides.mnLine);
        return;
    }
    const FileRows oRows = RowsInBuffer(oPiece);
    for (std::size_t y = 0; y < oRows.mnCount; ++y)
    {
        CopySamples(nSampleBytes, oPiece.moWindow.mnWidth, pSamples + y * oStrides.mnLine,
                    oStrides.mnPixel, mvnRows.data() + y * oRows.mnBytes, nSampleBytes);
    }
    mpoFile->GetWriteFile().WriteRows(oRows, mvnRows.data(), oRows.mnBytes);
}

void KordskChannelIO::ReadBits(const PlanePiece& oPiece, unsigned char* pSamples,
                               const SampleStrides& oStrides)
{
    const FileRows oRows = RowsInBuffer(oPiece);
    mpoFile->GetReadFile().ReadRows(oRows, mvnRows.data(), oRows.mnBytes);
    for (std::size_t y = 0; y < oRows.mnCount; ++y)
    {
        ExpandBits(mvnRows.data() + y * oRows.mnBytes, oPiece.mnFirstBit, oPiece.moWindow.mnWidth,
                   pSamples + y * oStrides.mnLine, oStrides.mnPixel);
    }
}

void KordskChannelIO::WriteBits(const PlanePiece& oPiece, const unsigned char* pSamples,
                                const SampleStrides& oStrides)
{
    const FileRows oRows = RowsInBuffer(oPiece);
    // Bytes at both ends may hold pixels beside the window, which another writer may be at.
    const std::lock_guard oLock(mpoFile->GetBitMutex());
    mpoFile->GetReadFile().ReadRows(oRows, mvnRows.data(), oRows.mnBytes);
    for (std::size_t y = 0; y < oRows.mnCount; ++y)
    {
        PackBits(pSamples + y * oStrides.mnLine, oStrides.mnPixel, oPiece.moWindow.mnWidth,
                 oPiece.mnFirstBit, mvnRows.data() + y * oRows.mnBytes);
    }
    mpoFile->GetWriteFile().WriteRows(oRows, mvnRows.data(), oRows.mnBytes);
}

void KordskChannelIO::Read(std::span<const unsigned int> oChannels, const PixelWindow& oWindow,
                           unsigned char* pSamples, const SampleStrides& oStrides)
{
    ForEachPiece(oChannels, oWindow, oStrides,
                 [&](const KordskPlane& oPlane, const PlanePiece& oPiece, std::size_t nPlace)
                 {
                     if (oPlane.moType == tessel::eDT_BIT)
                     {
                         ReadBits(oPiece, pSamples + nPlace, oStrides);
                     }
                     else
                     {
                         ReadSamples(oPlane, oPiece, pSamples + nPlace, oStrides);
                     }
                 });
}

void KordskChannelIO::Write(std::span<const unsigned int> oChannels, const PixelWindow& oWindow,
                            const unsigned char* pSamples, const SampleStrides& oStrides)
{
    ForEachPiece(oChannels, oWindow, oStrides,
                 [&](const KordskPlane& oPlane, const PlanePiece& oPiece, std::size_t nPlace)
                 {
                     if (oPlane.moType == tessel::eDT_BIT)
                     {
                         WriteBits(oPiece, pSamples + nPlace, oStrides);
                     }
                     else
                     {
                         WriteSamples(oPlane, oPiece, pSamples + nPlace, oStrides);
                     }
                 });
}

}  // namespace kor::datasources
