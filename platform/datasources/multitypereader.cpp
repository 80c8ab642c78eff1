#include "platform/datasources/multitypereader.h"

#include <algorithm>

#include "basic/core/typedispatch/typelist.h"
#include "platform/datasources/blocktransfer.h"
#include "platform/datasources/copysamples.h"
#include "platform/datasources/datatypename.h"
#include "platform/datasources/guard.h"
#include "processes/qrdfilters/samplerows.h"

namespace kor::datasources
{

namespace
{

using typedispatch::FindDataType;
using typedispatch::StandardTypeList;
using typedispatch::VisitType;

constexpr const char* kSource = "platform/datasources/multitypereader";
constexpr std::size_t kElementTypes = 10;
constexpr std::size_t kRowsBytes = 1 << 20;  ///< read at a time before they are converted

/// Place of the element type of oType, or of its parts, in the list of the ten.
std::size_t ElementIndex(const tessel::DataType& oType)
{
    return FindDataType<StandardTypeList>(oType == tessel::eDT_BIT ? tessel::eDT_8U : oType, true);
}

/// nCount elements (parts of complex samples counted one by one) from one element type to another.
void ConvertElements(const tessel::DataType& oIn, const unsigned char* pIn,
                     const tessel::DataType& oOut, unsigned char* pOut, std::size_t nCount)
{
    const auto oFromType = [&]<class TIn>()
    {
        const auto oToType = [&]<class TOut>()
        {
            filters::ConvertSamples(reinterpret_cast<const TIn*>(pIn),
                                    reinterpret_cast<TOut*>(pOut), nCount);
        };
        VisitType<StandardTypeList>(ElementIndex(oOut), oToType, [] {});
    };
    VisitType<StandardTypeList>(ElementIndex(oIn), oFromType, [] {});
}

}  // namespace

MultiTypeReader::MultiTypeReader(IDataset* poDataset, const std::vector<unsigned int>& oChannels,
                                 const tessel::DataType& oType)
    : ChannelAccess(nullptr, poDataset, oChannels, false), moType(oType)
{
    if (oType == tessel::eDT_BIT || ElementIndex(oType) == kElementTypes)
    {
        throw DataException(
            GetSet().GetFileName() + ": channels cannot be seen as " + DataTypeName(oType), kSource,
            __PRETTY_FUNCTION__, __LINE__);
    }
    for (const unsigned int nChannel : GetSet().GetChannels())
    {
        const tessel::DataType oOwn = GetSet().GetDataset().GetChannelType(nChannel);
        if (oOwn.mbComplex != oType.mbComplex || ElementIndex(oOwn) == kElementTypes)
        {
            throw DataException(GetSet().GetFileName() + ": channel " + std::to_string(nChannel) +
                                    " has " + DataTypeName(oOwn) + " and cannot be seen as " +
                                    DataTypeName(oType),
                                kSource, __PRETTY_FUNCTION__, __LINE__);
        }
    }
}

void MultiTypeReader::ReadRaster(tessel::Raster* poRaster)
{
    RequireFittingRaster(poRaster, moType, GetChannelCount(), GetSet().GetFileName());
    Guarded(GetSet().GetFileName(),
            [&]
            {
                ReadBlock(*poRaster, {GetWidth(), GetHeight()}, GetEdgeMode(),
                          [&](const PixelWindow& oWindow, unsigned char* pSamples,
                              const SampleStrides& oStrides)
                          {
                              for (std::size_t c = 0; c < GetSet().GetChannels().size(); ++c)
                              {
                                  ReadChannel(c, oWindow, pSamples + c * oStrides.mnChannel,
                                              oStrides);
                              }
                          });
            });
}

void MultiTypeReader::ReadChannel(std::size_t nIndex, const PixelWindow& oWindow,
                                  unsigned char* pSamples, const SampleStrides& oStrides)
{
    const auto oChannel = GetSet().GetChannels().subspan(nIndex, 1);
    const tessel::DataType oOwn = GetSet().GetDataset().GetChannelType(oChannel[0]);
    if (oOwn == moType)
    {
        GetSet().GetIO().Read(oChannel, oWindow, pSamples, oStrides);
        return;
    }
    const std::size_t nOwnBytes = oOwn.GetSampleBytes();
    const std::size_t nRowBytes = nOwnBytes * oWindow.mnWidth;
    const auto nRows = static_cast<std::uint32_t>(
        std::clamp<std::size_t>(kRowsBytes / nRowBytes, 1, oWindow.mnHeight));
    mvnRows.resize(nRowBytes * nRows);
    mvnConverted.resize(moType.GetSampleBytes() * oWindow.mnWidth);
    PixelWindow oStrip = oWindow;
    for (std::uint32_t nDone = 0; nDone < oWindow.mnHeight; nDone += oStrip.mnHeight)
    {
        oStrip.mnY = oWindow.mnY + nDone;
        oStrip.mnHeight = std::min(nRows, oWindow.mnHeight - nDone);
        GetSet().GetIO().Read(oChannel, oStrip, mvnRows.data(), {nOwnBytes, nOwnBytes, nRowBytes});
        for (std::uint32_t y = 0; y < oStrip.mnHeight; ++y)
        {
            ConvertElements(oOwn, mvnRows.data() + y * nRowBytes, moType, mvnConverted.data(),
                            std::size_t{oWindow.mnWidth} * (moType.mbComplex ? 2U : 1U));
            CopySamples(moType.GetSampleBytes(), oWindow.mnWidth, mvnConverted.data(),
                        moType.GetSampleBytes(), pSamples + (nDone + y) * oStrides.mnLine,
                        oStrides.mnPixel);
        }
    }
}

}  // namespace kor::datasources
