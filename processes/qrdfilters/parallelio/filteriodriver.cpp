#include "processes/qrdfilters/parallelio/filteriodriver.h"

namespace kor::parallelio
{

namespace
{

/// The reader, or where there is none the writer: what tells the shape of the input.
const datasources::IRasterAccess& SourceOf(const datasources::IRasterReader* poReader,
                                           const datasources::IRasterWriter* poWriter)
{
    if (poReader != nullptr)
    {
        return *poReader;
    }
    return *poWriter;
}

/// The writer, or where there is none the reader: what tells the extent of the output.
const datasources::IRasterAccess& OutputOf(const datasources::IRasterReader* poReader,
                                           const datasources::IRasterWriter* poWriter)
{
    if (poWriter != nullptr)
    {
        return *poWriter;
    }
    return *poReader;
}

/// The record of a block of the output; without a writer it is shaped like what is read.
BlockRecord BlockAt(DefaultAccessPolicy& oPolicy, const tessel::RasterContext& oContext,
                    const tessel::RasterInfo& oInfo, bool bNoWriter, bool bKeepOutputMargins)
{
    BlockRecord oBlock;
    oBlock.moInputContext = oPolicy.GetReadContext(oContext, oInfo);
    oBlock.moInputInfo = oPolicy.GetReadInfo(oContext, oInfo);
    oBlock.moOutputInfo = bNoWriter ? oBlock.moInputInfo : oInfo;
    oBlock.moOutputContext = oBlock.moInputContext;
    if (!bKeepOutputMargins)
    {
        oBlock.moOutputContext.mnMarginX = 0;
        oBlock.moOutputContext.mnMarginY = 0;
    }
    return oBlock;
}

std::uint64_t PixelBytes(const datasources::IRasterAccess& oAccess)
{
    return (std::uint64_t{oAccess.GetChannelCount()} * oAccess.GetDataType().mnBits) >> 3;
}

}  // namespace

tessel::RasterContext DefaultAccessPolicy::GetReadContext(const tessel::RasterContext& oContext,
                                                          const tessel::RasterInfo& /*oInfo*/)
{
    return oContext;
}

tessel::RasterInfo DefaultAccessPolicy::GetReadInfo(const tessel::RasterContext& /*oContext*/,
                                                    const tessel::RasterInfo& oInfo)
{
    return tessel::RasterInfo(oInfo.mnWidth, oInfo.mnHeight, mnChannels, moDataType);
}

void DefaultAccessPolicy::Init(datasources::IRasterReader* poReader,
                               datasources::IRasterWriter* poWriter)
{
    const datasources::IRasterAccess& oSource = SourceOf(poReader, poWriter);
    moDataType = oSource.GetDataType();
    mnChannels = oSource.GetChannelCount();
}

unsigned int DefaultAccessPolicy::GetMaxPixels(unsigned int nMemory,
                                               datasources::IRasterReader* poReader,
                                               datasources::IRasterWriter* poWriter,
                                               unsigned int& nMaxPixels)
{
    std::uint64_t nBytes = 0;
    nBytes += poReader != nullptr ? PixelBytes(*poReader) : 0;
    nBytes += poWriter != nullptr ? PixelBytes(*poWriter) : 0;
    nMaxPixels = static_cast<unsigned int>(nMemory / (2 * std::max<std::uint64_t>(1, nBytes)));
    return nMaxPixels;
}

namespace details
{

std::vector<BlockRecord> CutIntoBlocks(DefaultAccessPolicy& oPolicy,
                                       datasources::IRasterReader* poReader,
                                       datasources::IRasterWriter* poWriter,
                                       std::uint64_t nMemoryBudget, bool bKeepOutputMargins)
{
    constexpr std::uint64_t kMostMemory = std::numeric_limits<std::uint32_t>::max();
    oPolicy.Init(poReader, poWriter);
    unsigned int nMaxPixels = 0;
    oPolicy.GetMaxPixels(static_cast<unsigned int>(std::min(nMemoryBudget, kMostMemory)), poReader,
                         poWriter, nMaxPixels);
    unsigned int nBlockWidth = 0;
    unsigned int nBlockHeight = 0;
    FindOptimalRasterSize(poReader, poWriter, nMaxPixels, nBlockWidth, nBlockHeight,
                          ProcessWindow());

    const datasources::IRasterAccess& oImage = OutputOf(poReader, poWriter);
    std::vector<BlockRecord> voBlocks;
    for (std::uint32_t y = 0; y < oImage.GetHeight();
         y += std::min(nBlockHeight, oImage.GetHeight() - y))
    {
        for (std::uint32_t x = 0; x < oImage.GetWidth();
             x += std::min(nBlockWidth, oImage.GetWidth() - x))
        {
            const tessel::RasterInfo oInfo(std::min(nBlockWidth, oImage.GetWidth() - x),
                                           std::min(nBlockHeight, oImage.GetHeight() - y),
                                           oImage.GetChannelCount(), oImage.GetDataType());
            const tessel::RasterContext oContext(poReader != nullptr ? poReader->GetMarginX() : 0,
                                                 poReader != nullptr ? poReader->GetMarginY() : 0,
                                                 x, y);
            voBlocks.push_back(
                BlockAt(oPolicy, oContext, oInfo, poWriter == nullptr, bKeepOutputMargins));
        }
    }
    return voBlocks;
}

}  // namespace details

}  // namespace kor::parallelio
