#include "processes/qrdfilters/parallelio/filteralgorithm.h"

#include <algorithm>
#include <limits>
#include <new>
#include <string>
#include <vector>

#include "platform/exception/exception.h"
#include "processes/qrdfilters/convertraster.h"
#include "processes/qrdfilters/typedfilter.h"
#include "processes/qrdfilters/validmaskbuilder.h"

namespace kor::parallelio
{

using tessel::Raster;
using tessel::RasterInfo;

namespace
{

constexpr const char* kSource = "processes/qrdfilters/parallelio/filteralgorithm";

/// A block seen as another one, which is made where it has to be and lives as long as this object.
class BlockView
{
public:
    explicit BlockView(Raster* poRaster) : mpoRaster(poRaster) {}

    void Replace(std::unique_ptr<Raster> poRaster)
    {
        mpoMade = std::move(poRaster);
        mpoRaster = mpoMade.get();
    }
    Raster* Get() const { return mpoRaster; }

private:
    std::unique_ptr<Raster> mpoMade;
    Raster* mpoRaster;
};

void RequireDoubles(const Raster& oOut)
{
    if (oOut.moDataType != tessel::eDT_64R)
    {
        throw Exception("The results of this filter stay doubles: the output has to be eDT_64R",
                        kSource, __PRETTY_FUNCTION__, __LINE__);
    }
}

/// What is in memory for a block of these pixels: two blocks of input with their margins, two of
/// output, and the working copies of one.
std::uint64_t BlockBytes(const datasources::IRasterAccess* poReader,
                         const datasources::IRasterAccess* poWriter, std::uint64_t nWorkBytes,
                         const filters::Window& oWindow, std::uint64_t nWidth,
                         std::uint64_t nHeight)
{
    const auto oPixelBytes = [](const datasources::IRasterAccess* poAccess) -> std::uint64_t
    {
        return poAccess == nullptr ? 0
                                   : std::uint64_t{poAccess->GetChannelCount()} *
                                         poAccess->GetDataType().GetSampleBytes();
    };
    const std::uint64_t nRead = (nWidth + 2 * std::uint64_t{oWindow.mnHalfX}) *
                                (nHeight + 2 * std::uint64_t{oWindow.mnHalfY});
    return nRead * (2 * oPixelBytes(poReader) + nWorkBytes) +
           nWidth * nHeight * 2 * oPixelBytes(poWriter);
}

}  // namespace

std::unique_ptr<Raster> FilterAlgorithm::Scratch::DoublesLike(const Raster& oRaster)
{
    const std::size_t nSamples =
        std::size_t{oRaster.mnTotalWidth} * oRaster.mnTotalHeight * oRaster.mnChannels;
    if (nSamples * sizeof(double) > std::numeric_limits<std::uint32_t>::max())
    {
        throw DataException("A block of " + std::to_string(nSamples) +
                                " samples is too large to be converted to doubles: it would take "
                                "4 GiB or more",
                            kSource, __PRETTY_FUNCTION__, __LINE__);
    }
    if (mpSamples == nullptr || nSamples > mnSamples)
    {
        mpSamples.reset();
        mnSamples = 0;
        mpSamples.reset(new double[nSamples]);
        mnSamples = nSamples;
    }
    return std::make_unique<Raster>(
        RasterInfo(oRaster.mnWidth, oRaster.mnHeight, oRaster.mnChannels, tessel::eDT_64R),
        tessel::RasterContext(oRaster), reinterpret_cast<unsigned char*>(mpSamples.get()), false);
}

const tessel::IMaskBuilder* FilterAlgorithm::GetMaskBuilder() const
{
    return mpoMaskBuilder != nullptr ? mpoMaskBuilder : mpoMissingData.get();
}

void FilterAlgorithm::LookForMissingData(const datasources::IRasterAccess& oReader)
{
    mpoMissingData.reset();
    std::vector<double> vdfNoData = oReader.GetAuxiliaryData().GetNoDataValues();
    if (mbMasksMissingData && (oReader.GetDataType().mbFloat || !vdfNoData.empty()))
    {
        mpoMissingData = std::make_shared<filters::ValidMaskBuilder>(std::move(vdfNoData));
    }
}

std::uint64_t FilterAlgorithm::GetWorkBytes(const RasterInfo& oIn, const RasterInfo& oOut) const
{
    const std::uint64_t nDoublesIn = std::uint64_t{oIn.mnChannels} * sizeof(double);
    const std::uint64_t nDoublesOut = std::uint64_t{oOut.mnChannels} * sizeof(double);
    const bool bMasks = GetMaskBuilder() != nullptr || mpoOutputBuilder != nullptr;
    std::uint64_t nBytes = bMasks ? 1 : 0;  // two bits, and the rows they are made of
    if (oIn.moDataType.mbComplex)
    {
        nBytes += nDoublesIn;  // the real block that it is seen as, at most of doubles
    }
    if (mbOfDoubles)
    {
        nBytes += oIn.moDataType == tessel::eDT_64R ? 0 : nDoublesIn;
        nBytes += oOut.moDataType == tessel::eDT_64R ? 0 : nDoublesOut;
    }
    return nBytes;
}

void FilterAlgorithm::Process(Raster* poRasterIn, tessel::Mask* poMaskIn, Raster* poRasterOut) const
{
    filters::RequireRasters(poRasterIn, poRasterOut, kSource);
    try
    {
        FilterBlock(poRasterIn, poMaskIn, poRasterOut);
    }
    catch (const std::bad_alloc&)  // the driver carries errors of the library alone
    {
        throw Exception("There is no memory to filter a block of " +
                            std::to_string(poRasterIn->mnWidth) + " x " +
                            std::to_string(poRasterIn->mnHeight) + " pixels of " +
                            std::to_string(poRasterIn->mnChannels) + " channels",
                        kSource, __PRETTY_FUNCTION__, __LINE__);
    }
}

void FilterAlgorithm::FilterBlock(Raster* poIn, tessel::Mask* poMaskIn, Raster* poOut) const
{
    const std::unique_ptr<tessel::Mask> poMaskOut(
        mpoOutputBuilder != nullptr ? mpoOutputBuilder->BuildMask(*poIn) : nullptr);
    BlockView oIn(poIn);
    if (poIn->moDataType.mbComplex && (mbOfDoubles || meComplex))
    {
        oIn.Replace(std::unique_ptr<Raster>(tessel::ComplexInterpretation().InterpretRaster(
            poIn, meComplex.value_or(tessel::eKIT_Magnitude))));
    }
    if (!mbOfDoubles)
    {
        mfnFilter(oIn.Get(), poMaskIn, poOut, poMaskOut.get());
        return;
    }

    filters::RequireRealOutput(*poOut, kSource);
    if (!mbConvertsBack)
    {
        RequireDoubles(*poOut);
    }
    if (oIn.Get()->moDataType != tessel::eDT_64R)
    {
        auto poDoubles = mpoScratchIn->DoublesLike(*oIn.Get());
        filters::ConvertRaster(oIn.Get(), poDoubles.get());
        oIn.Replace(std::move(poDoubles));
    }
    if (poOut->moDataType == tessel::eDT_64R)
    {
        mfnFilter(oIn.Get(), poMaskIn, poOut, poMaskOut.get());
        return;
    }
    const auto poDoubles = mpoScratchOut->DoublesLike(*poOut);
    mfnFilter(oIn.Get(), poMaskIn, poDoubles.get(), poMaskOut.get());
    filters::ConvertRaster(poDoubles.get(), poOut);
}

tessel::RasterContext FilterAccessPolicy::GetReadContext(const tessel::RasterContext& oContext,
                                                         const RasterInfo& /*oInfo*/)
{
    if (!moWindow)
    {
        return oContext;
    }
    return {moWindow->mnHalfX, moWindow->mnHalfY, oContext.mnOffsetX, oContext.mnOffsetY};
}

unsigned int FilterAccessPolicy::GetMaxPixels(unsigned int nMemory,
                                              datasources::IRasterReader* poReader,
                                              datasources::IRasterWriter* poWriter,
                                              unsigned int& nMaxPixels)
{
    const filters::Window oMargins = moWindow.value_or(
        poReader != nullptr ? filters::Window{poReader->GetMarginX(), poReader->GetMarginY()}
                            : filters::Window());
    DefaultAccessPolicy::GetMaxPixels(nMemory, poReader, poWriter, nMaxPixels);
    // What fits depends on the shape of the block, by its margins: try, and come down from above.
    while (nMaxPixels > 1)
    {
        unsigned int nWidth = 0;
        unsigned int nHeight = 0;
        FindOptimalRasterSize(poReader, poWriter, nMaxPixels, nWidth, nHeight, ProcessWindow());
        const std::uint64_t nBytes =
            BlockBytes(poReader, poWriter, mnWorkBytes, oMargins, nWidth, nHeight);
        if (nBytes <= nMemory)
        {
            break;
        }
        const std::uint64_t nFewer = std::uint64_t{nMaxPixels} * nMemory / nBytes;
        nMaxPixels = static_cast<unsigned int>(std::min<std::uint64_t>(nFewer, nMaxPixels - 1));
    }
    nMaxPixels = std::max(nMaxPixels, 1U);
    return nMaxPixels;
}

}  // namespace kor::parallelio
