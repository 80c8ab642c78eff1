#include "processes/qrdfilters/filterhom.h"

#include <algorithm>
#include <array>
#include <cstdint>
#include <limits>
#include <span>
#include <type_traits>

#include "basic/core/typedispatch/typelist.h"
#include "platform/exception/exception.h"
#include "processes/qrdfilters/blockcontract.h"
#include "processes/qrdfilters/sampleconversion.h"

namespace kor::filters
{

using tessel::Mask;
using tessel::Raster;

namespace
{

constexpr const char* kSource = "processes/qrdfilters/filterhom";

constexpr std::uint32_t kOutside = std::numeric_limits<std::uint32_t>::max();

/// A sample as an index of the table; negative ones, and what no int can hold, lie outside of every
/// table.
template <class TIn>
std::uint32_t IndexOf(TIn xIn)
{
    const auto x = static_cast<Arithmetic<TIn>>(xIn);
    if constexpr (std::is_floating_point_v<TIn>)
    {
        const bool bHeld = x > TIn(-1) && x < TIn(2147483648.0);
        return bHeld ? static_cast<std::uint32_t>(x) : kOutside;
    }
    else
    {
        return static_cast<std::uint32_t>(static_cast<int>(x));
    }
}

/// value + 0.5, cut and clamped, in integers: the cut takes it back, or takes a negative one up
/// by 1.
template <class TOut>
TOut StoredValue(int nValue)
{
    using AOut = Arithmetic<TOut>;
    if constexpr (std::is_floating_point_v<AOut>)
    {
        return static_cast<AOut>(nValue);
    }
    else
    {
        const std::int64_t nCut = nValue < 0 ? std::int64_t{nValue} + 1 : nValue;
        using Limits = std::numeric_limits<AOut>;
        if constexpr (std::is_same_v<AOut, int64>)
        {
            return nCut;
        }
        constexpr std::uint64_t kHighest = Limits::max();
        constexpr auto kHighestInt = static_cast<std::int64_t>(
            std::min<std::uint64_t>(kHighest, std::numeric_limits<std::int64_t>::max()));
        return static_cast<TOut>(std::clamp(nCut, std::int64_t{Limits::min()}, kHighestInt));
    }
}

/// oIndices[i] from the samples at pIn, nStride elements apart.
template <class TIn>
void FindIndices(const unsigned char* pIn, std::size_t nStride, std::span<std::uint32_t> oIndices)
{
    const TIn* const pSamples = reinterpret_cast<const TIn*>(pIn);
    for (std::size_t i = 0; i < oIndices.size(); ++i)
    {
        oIndices[i] = IndexOf(pSamples[i * nStride]);
    }
}

/// The table's value for each index to pOut, nStride elements apart.
template <class TOut>
void WriteValues(std::span<const std::uint32_t> oIndices, std::span<const int> oTable,
                 unsigned char* pOut, std::size_t nStride)
{
    TOut* const pSamples = reinterpret_cast<TOut*>(pOut);
    for (std::size_t i = 0; i < oIndices.size(); ++i)
    {
        const std::size_t nIndex = oIndices[i];
        pSamples[i * nStride] = StoredValue<TOut>(nIndex < oTable.size() ? oTable[nIndex] : 0);
    }
}

/// What is read where there are no channels: 0 in all types.
alignas(double) constexpr unsigned char kNoSample[sizeof(double)] = {};

using IndexRow = void (*)(const unsigned char*, std::size_t, std::span<std::uint32_t>);
using ValueRow = void (*)(std::span<const std::uint32_t>, std::span<const int>, unsigned char*,
                          std::size_t);

/// All of a processor but the names of its types.
class TableProcessor : public IProcessor, public details::HOMParams
{
public:
    void Process(Raster* poRasterIn, Mask* /*poMaskIn*/, Raster* poRasterOut) const override
    {
        RequireSameSize(*poRasterIn, *poRasterOut, kSource);
        if (poRasterOut->mnChannels == 0)
        {
            return;
        }
        std::array<std::uint32_t, 1024> anIndices;
        const std::size_t nStrideIn = ElementsPerPixel(*poRasterIn);
        const std::size_t nStrideOut = ElementsPerPixel(*poRasterOut);
        for (std::uint32_t y = 0; y < poRasterIn->mnHeight; ++y)
        {
            for (std::size_t x = 0; x < poRasterIn->mnWidth; x += anIndices.size())
            {
                const std::size_t nCount = std::min(anIndices.size(), poRasterIn->mnWidth - x);
                const std::span<std::uint32_t> oIndices(anIndices.data(), nCount);
                const auto nX = static_cast<std::int64_t>(x);
                mpfnIndices(nStrideIn != 0 ? poRasterIn->GetPixel(nX, y) : kNoSample, nStrideIn,
                            oIndices);
                mpfnValues(oIndices, mvMeanMode, poRasterOut->GetPixel(nX, y), nStrideOut);
            }
        }
    }

protected:
    TableProcessor(IndexRow pfnIndices, ValueRow pfnValues)
        : mpfnIndices(pfnIndices), mpfnValues(pfnValues)
    {
    }

private:
    static std::size_t ElementsPerPixel(const Raster& oRaster)
    {
        return std::size_t{oRaster.mnChannels} * (oRaster.moDataType.mbComplex ? 2U : 1U);
    }

    IndexRow mpfnIndices;
    ValueRow mpfnValues;
};

}  // namespace

template <class TIn, class TOut>
class FilterHOM::InnerProcessor : public TableProcessor
{
public:
    InnerProcessor() : TableProcessor(FindIndices<TIn>, WriteValues<TOut>) {}
};

template <class TIn, class TOut>
IProcessor* FilterHOM::HOMCreationPolicy::Create()
{
    return new InnerProcessor<TIn, TOut>();
}

void FilterHOM::Process(Raster* poRasterIn, Mask* poMask, Raster* poRasterOut) const
{
    RequireRasters(poRasterIn, poRasterOut, kSource);

    using List = typedispatch::StandardTypeList;
    using Dispatcher = typedispatch::details::InputDispatchType<List, List, HOMCreationPolicy>;
    const IProcessor& oProcessor = SelectProcessor<details::HOMParams>(
        poRasterIn->moDataType, poRasterOut->moDataType, *this, Dispatcher::Dispatch);
    oProcessor.Process(poRasterIn, poMask, poRasterOut);
}

void HOMAlgorithm::SetValues(std::vector<int> oMeanMode)
{
    mpoFilter = std::make_shared<FilterHOM>();
    mpoFilter->SetMeanMode(std::move(oMeanMode));
}

void HOMAlgorithm::ProcessBlock(Raster* poRasterIn, Raster* poRasterOut) const
{
    if (mpoFilter == nullptr)
    {
        throw Exception("You have to Set the values before calling Process.", kSource,
                        __PRETTY_FUNCTION__, __LINE__);
    }
    mpoFilter->Process(poRasterIn, nullptr, poRasterOut);
}

}  // namespace kor::filters
