#pragma once

#include <memory>
#include <vector>

#include "platform/datasources/ichannelio.h"
#include "platform/datasources/kordsk/kordskfile.h"

namespace kor::datasources
{

/// Windows of a KORDSK file's channels, or of one of its bitmaps, which is then channel 1.
class KordskChannelIO : public IChannelIO
{
public:
    /// nBitmap: number of the bitmap, 0 for the channels. poAccess: null for reading. The planes
    /// are those that the file has at this time.
    KordskChannelIO(std::shared_ptr<KordskFile> poFile, unsigned int nBitmap,
                    std::unique_ptr<KordskWriteAccess> poAccess);

    void Read(std::span<const unsigned int> oChannels, const PixelWindow& oWindow,
              unsigned char* pSamples, const SampleStrides& oStrides) override;
    void Write(std::span<const unsigned int> oChannels, const PixelWindow& oWindow,
               const unsigned char* pSamples, const SampleStrides& oStrides) override;

private:
    const KordskPlane& PlaneOf(unsigned int nChannel) const;
    template <class Visit>
    void ForEachPiece(std::span<const unsigned int> oChannels, const PixelWindow& oWindow,
                      const SampleStrides& oStrides, const Visit& oVisit) const;
    FileRows RowsInBuffer(const PlanePiece& oPiece);
    void ReadSamples(const KordskPlane& oPlane, const PlanePiece& oPiece, unsigned char* pSamples,
                     const SampleStrides& oStrides);
    void WriteSamples(const KordskPlane& oPlane, const PlanePiece& oPiece,
                      const unsigned char* pSamples, const SampleStrides& oStrides);
    void ReadBits(const PlanePiece& oPiece, unsigned char* pSamples, const SampleStrides& oStrides);
    void WriteBits(const PlanePiece& oPiece, const unsigned char* pSamples,
                   const SampleStrides& oStrides);

    std::shared_ptr<KordskFile> mpoFile;
    KordskFile::Snapshot mpoDirectory;
    unsigned int mnBitmap;
    std::unique_ptr<KordskWriteAccess> mpoAccess;
    std::vector<unsigned char> mvnRows;  ///< rows of one plane as the file has them
};

}  // namespace kor::datasources
