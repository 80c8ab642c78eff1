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

    const datasources::IRasterAccess* poImage = poWriter;
    if (poImage == nullptr)
    {
        poImage = poReader;
    }
    const std::uint32_t nWidth = poImage->GetWidth();
    const std::uint32_t nHeight = poImage->GetHeight();
    std::vector<BlockRecord> voBlocks;
    for (std::uint32_t y = 0, nRows = 0; y < nHeight; y += nRows)
    {
        nRows = std::min(nBlockHeight, nHeight - y);
        for (std::uint32_t x = 0, nColumns = 0; x < nWidth; x += nColumns)
        {
            nColumns = std::min(nBlockWidth, nWidth - x);
            const tessel::RasterContext oContext(poReader != nullptr ? poReader->GetMarginX() : 0,
                                                 poReader != nullptr ? poReader->GetMarginY() : 0,
                                                 x, y);
            BlockRecord oBlock;
            oBlock.moOutputInfo = tessel::RasterInfo(nColumns, nRows, poImage->GetChannelCount(),
                                                     poImage->GetDataType());
            oBlock.moInputContext = oPolicy.GetReadContext(oContext, oBlock.moOutputInfo);
            oBlock.moInputInfo = oPolicy.GetReadInfo(oContext, oBlock.moOutputInfo);
            if (poWriter == nullptr)
            {
                oBlock.moOutputInfo = oBlock.moInputInfo;
            }
            oBlock.moOutputContext = oBlock.moInputContext;
            if (!bKeepOutputMargins)
            {
                oBlock.moOutputContext.mnMarginX = 0;
                oBlock.moOutputContext.mnMarginY = 0;
            }
            voBlocks.push_back(oBlock);
        }
    }
    return voBlocks;
}

}  // namespace details

}  // namespace kor::parallelio
