#include "processes/qrdfilters/filtertouzi.h"

#include <algorithm>
#include <cmath>
#include <limits>
#include <span>
#include <vector>

#include "basic/core/typedispatch/typedispatch.h"
#include "processes/qrdfilters/background.h"
#include "processes/qrdfilters/blockcontract.h"
#include "processes/qrdfilters/kernels/touzirow.h"
#include "processes/qrdfilters/sampleconversion.h"
#include "processes/qrdfilters/samplerows.h"
#include "processes/qrdfilters/touzirows.h"

namespace kor::filters
{

namespace
{

constexpr const char* kSource = "processes/qrdfilters/filtertouzi";

// sqrt(4 / pi - 1), the variation coefficient of one-look amplitude speckle, to three digits.
constexpr double kSpeckleCv = 0.523;

template <class TIn>
void LoadTouziRow(const void* pIn, std::span<double> vdfOut)
{
    LoadSamples<TIn>(static_cast<const TIn*>(pIn), vdfOut);
}

/// x + 0.5, cut towards zero and clamped.
template <class TOut>
TOut CutSample(double x)
{
    using Limits = std::numeric_limits<Arithmetic<TOut>>;
    // As doubles the upper limits of the 64-bit types are powers of two, one more than they hold.
    constexpr auto kHighest = static_cast<double>(Limits::max());
    constexpr auto kLowest = static_cast<double>(Limits::min());
    const double r = x + 0.5;
    if (r != r)
    {
        return 0;
    }
    if (r >= kHighest)
    {
        return static_cast<TOut>(Limits::max());
    }
    return static_cast<TOut>(static_cast<Arithmetic<TOut>>(std::max(r, kLowest)));
}

/// The filter's own way of storing, which is not that of the other filters.
template <class TOut>
void StoreTouziRow(std::span<const double> vdfIn, void* pOut)
{
    auto* pSamples = static_cast<TOut*>(pOut);
    if constexpr (std::is_floating_point_v<TOut>)
    {
        StoreSamples<TOut>(vdfIn, pSamples);
    }
    else
    {
        std::transform(vdfIn.begin(), vdfIn.end(), pSamples, CutSample<TOut>);
    }
}

using StoreRow = void (*)(std::span<const double> vdfIn, void* pOut);

/// All that a block needs and that does not depend on its sample types.
struct TouziBlock
{
    kernels::TouziThresholds moThresholds;
    SampleDomain meDomain;
    bool mbBGZero;
    LoadRow mpfnLoad;
    StoreRow mpfnStore;
};

SampleDomain DomainOf(int nAmplit)
{
    return nAmplit == 1   ? SampleDomain::eIntensity
           : nAmplit == 2 ? SampleDomain::eDecibel
                          : SampleDomain::eAmplitude;
}

/// Masked pixels keep their value.
void CopyCentres(const AmplitudeBand& oBand, std::span<const unsigned char> oComputed,
                 std::span<double> vdfLine)
{
    const std::size_t nChannels = vdfLine.size() / oComputed.size();
    for (std::size_t c = 0; c < nChannels; ++c)
    {
        const std::span<const double> vdfCentres = oBand.GetCentres(c);
        for (std::size_t x = 0; x < oComputed.size(); ++x)
        {
            if (oComputed[x] == 0)
            {
                vdfLine[x * nChannels + c] = vdfCentres[x];
            }
        }
    }
}

/// Filters the row that the band stands at, amplitudes to amplitudes.
void FilterRow(const AmplitudeBand& oBand, const kernels::TouziThresholds& oThresholds,
               std::span<const unsigned char> oComputed, std::span<double> vdfLine)
{
    const std::size_t nChannels = vdfLine.size() / oComputed.size();
    std::vector<double> vdfResults(oBand.GetCentres(0).size());
    std::vector<unsigned char> vWanted(vdfResults.size());
    std::copy(oComputed.begin(), oComputed.end(), vWanted.begin());
    for (std::size_t c = 0; c < nChannels; ++c)
    {
        const std::span<const float* const> oSamples = oBand.GetSamples(c);
        // Meant: behind a strong scatterer the other channels of the pixel stay 0, since it is no
        // longer wanted. See StrongScattererLeavesTheChannelsBehindItZero.
        kernels::FilterTouziRow({oSamples, oBand.GetSquares(c),
                                 static_cast<int>(oSamples.size() / 2), oBand.GetCentres(c).data()},
                                oThresholds, vWanted, vdfResults);
        for (std::size_t x = 0; x < oComputed.size(); ++x)
        {
            vdfLine[x * nChannels + c] = vdfResults[x];
        }
    }
}

void FilterBlock(const tessel::Raster& oIn, const tessel::Mask* poMask, const tessel::Raster& oOut,
                 const TouziBlock& oBlock)
{
    if (oIn.mnWidth == 0 || oIn.mnChannels == 0)
    {
        return;
    }
    constexpr std::uint32_t kReach = kernels::kTouziReach;
    AmplitudeBand oBand(oIn, oBlock.meDomain, oBlock.mpfnLoad, std::max(oIn.mnMarginX, kReach));
    std::vector<unsigned char> vComputed(oIn.mnWidth);
    std::vector<double> vdfLine(std::size_t{oIn.mnWidth} * oIn.mnChannels);
    for (std::uint32_t y = 0; y < oIn.mnHeight; ++y)
    {
        oBand.MoveTo(y);
        FindComputedPixels(poMask, nullptr, 0, y, vComputed);
        FilterRow(oBand, oBlock.moThresholds, vComputed, vdfLine);
        if (!oBlock.mbBGZero)
        {
            CopyCentres(oBand, vComputed, vdfLine);
        }
        FromAmplitude(oBlock.meDomain, vdfLine);
        oBlock.mpfnStore(vdfLine, oOut.GetPixel(0, y));
    }
}

}  // namespace

void details::TouziParams::SetLooks(double dfLooks)
{
    mdfLooks = dfLooks;
    mnStartSize = dfLooks >= 1.0 && dfLooks < 2.0 ? 5 : 3;
    mdfCu = kSpeckleCv / std::sqrt(dfLooks);
    mdfCmax = static_cast<float>(std::sqrt(2.0 / dfLooks + 1.0) * kSpeckleCv);
    mdfCuLine = mdfCu - 0.04;
    mdfCuMinor = mdfCu - 0.02;
    madfCu.fill(mdfCu);
}

template <class TIn, class TOut>
class FilterTouzi::InnerProcessor : public IProcessor, public details::TouziParams
{
public:
    void Process(tessel::Raster* poRasterIn, tessel::Mask* poMask,
                 tessel::Raster* poRasterOut) const override
    {
        RequireMatchingBlocks(*poRasterIn, poMask, *poRasterOut, nullptr, kSource);
        FilterBlock(*poRasterIn, poMask, *poRasterOut,
                    {{mdfCu, mdfCmax, mdfCuLine, mdfContour, mdfGradiant, mnStartSize,
                      static_cast<int>(poRasterIn->mnMarginX)},
                     DomainOf(mnAmplit),
                     mbBGZero,
                     LoadTouziRow<TIn>,
                     StoreTouziRow<TOut>});
    }
};

struct FilterTouzi::TouziCreationPolicy
{
    template <class TIn, class TOut>
    static IProcessor* Create()
    {
        return new InnerProcessor<TIn, TOut>();
    }
};

FilterTouzi::FilterTouzi(double dfLooks, double dfContour, double dfEdge, double dfGradiant)
{
    SetLooks(dfLooks);
    SetContour(dfContour);
    SetEdge(dfEdge);
    SetGradiant(dfGradiant);
}

void FilterTouzi::SetFilterSize(boost::optional<int> nSizeX, boost::optional<int> nSizeY)
{
    moFilterSizeX = nSizeX;
    moFilterSizeY = nSizeY;
}

void FilterTouzi::SetFilterSize(int nSizeX, int nSizeY)
{
    moFilterSizeX = nSizeX;
    moFilterSizeY = nSizeY;
}

void FilterTouzi::Process(tessel::Raster* poRasterIn, tessel::Mask* poMask,
                          tessel::Raster* poRasterOut) const
{
    RequireRasters(poRasterIn, poRasterOut, kSource);
    RequireRealOutput(*poRasterOut, kSource);

    const RealInput oInput(poRasterIn);
    using List = typedispatch::StandardTypeList;
    using Dispatcher = typedispatch::details::InputDispatchType<List, List, TouziCreationPolicy>;
    const IProcessor& oProcessor = SelectProcessor<details::TouziParams>(
        oInput.Get()->moDataType, poRasterOut->moDataType, *this, Dispatcher::Dispatch);
    oProcessor.Process(oInput.Get(), poMask, poRasterOut);
}

std::shared_ptr<tessel::Raster> FilterTouzi::operator()(
    std::shared_ptr<tessel::Raster> poRasterIn, std::shared_ptr<tessel::Mask> poMaskIn,
    std::shared_ptr<tessel::Mask> /*poMaskOut*/) const
{
    auto poRasterOut = std::make_shared<tessel::Raster>(*poRasterIn, *poRasterIn);
    Process(poRasterIn.get(), poMaskIn.get(), poRasterOut.get());
    return poRasterOut;
}

}  // namespace kor::filters
