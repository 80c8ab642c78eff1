#include "processes/qrdfilters/filterhom.h"

#include <algorithm>
#include <array>
#include <cstdint>
#include <limits>
#include <memory>
#include <mutex>
#include <numeric>
#include <span>
#include <type_traits>
#include <vector>

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

/// A sample as an index of the table; negative ones, and what no int can hold, become indices from
/// 2^31 on, outside of every table.
template <class TIn>
std::uint32_t IndexOf(TIn xIn)
{
    const auto x = static_cast<Arithmetic<TIn>>(xIn);
    if constexpr (std::is_floating_point_v<TIn>)
    {
        const TIn xHeld = x > TIn(-1) && x < TIn(2147483648.0) ? x : TIn(-1);
        return static_cast<std::uint32_t>(static_cast<int>(xHeld));
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

/// What is read where there are no channels: 0 in all types.
alignas(double) constexpr unsigned char kNoSample[sizeof(double)] = {};

using IndexRow = void (*)(const unsigned char*, std::size_t, std::span<std::uint32_t>);

constexpr std::size_t kBytes = 256;

/// A run of samples in memory, so many elements apart.
template <class TByte>
struct Run
{
    TByte* mpFirst;
    std::size_t mnStride;
    std::size_t mnCount;
};

/// The table with its values as they are stored.
class StoredTable
{
public:
    virtual ~StoredTable() = default;
    /// The value for each index to oOut.
    virtual void WriteByIndex(const std::uint32_t* pIndices,
                              const Run<unsigned char>& oOut) const = 0;
    /// The same for samples of one byte, for which the indices are known.
    virtual void WriteByBytes(const Run<const unsigned char>& oIn,
                              const Run<unsigned char>& oOut) const = 0;
};

template <class TOut>
class TableOf : public StoredTable
{
public:
    TableOf(std::span<const int> oTable, std::span<const std::uint32_t, kBytes> oIndicesOfBytes)
        : mvxValues(oTable.size() + 1, TOut(0))
    {
        std::transform(oTable.begin(), oTable.end(), mvxValues.begin(), StoredValue<TOut>);
        for (std::size_t i = 0; i < kBytes; ++i)
        {
            maxByBytes[i] = ValueAt(oIndicesOfBytes[i]);
        }
    }

    void WriteByIndex(const std::uint32_t* pIndices, const Run<unsigned char>& oOut) const override
    {
        TOut* const pOut = reinterpret_cast<TOut*>(oOut.mpFirst);
        for (std::size_t i = 0; i < oOut.mnCount; ++i)
        {
            pOut[i * oOut.mnStride] = ValueAt(pIndices[i]);
        }
    }

    void WriteByBytes(const Run<const unsigned char>& oIn,
                      const Run<unsigned char>& oOut) const override
    {
        TOut* const pOut = reinterpret_cast<TOut*>(oOut.mpFirst);
        if (oIn.mnStride == 1 && oOut.mnStride == 1)
        {
            std::transform(oIn.mpFirst, oIn.mpFirst + oIn.mnCount, pOut,
                           [this](unsigned char nByte) { return maxByBytes[nByte]; });
            return;
        }
        for (std::size_t i = 0; i < oIn.mnCount; ++i)
        {
            pOut[i * oOut.mnStride] = maxByBytes[oIn.mpFirst[i * oIn.mnStride]];
        }
    }

private:
    TOut ValueAt(std::uint32_t nIndex) const
    {
        return mvxValues[std::min<std::size_t>(nIndex, mvxValues.size() - 1)];
    }

    std::vector<TOut> mvxValues;  ///< the last one stands for all indices outside
    std::array<TOut, kBytes> maxByBytes;
};

using MakeTable = std::unique_ptr<StoredTable> (*)(std::span<const int>,
                                                   std::span<const std::uint32_t, kBytes>);

template <class TOut>
std::unique_ptr<StoredTable> MakeTableOf(std::span<const int> oTable,
                                         std::span<const std::uint32_t, kBytes> oIndicesOfBytes)
{
    return std::make_unique<TableOf<TOut>>(oTable, oIndicesOfBytes);
}

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
        std::call_once(moTableMade, [this] { MakeStoredTable(); });
        const std::size_t nStrideIn = ElementsPerPixel(*poRasterIn);
        const std::size_t nStrideOut = ElementsPerPixel(*poRasterOut);
        for (std::uint32_t y = 0; y < poRasterIn->mnHeight; ++y)
        {
            MapRow({nStrideIn != 0 ? poRasterIn->GetPixel(0, y) : kNoSample, nStrideIn,
                    poRasterIn->mnWidth},
                   {poRasterOut->GetPixel(0, y), nStrideOut, poRasterIn->mnWidth});
        }
    }

protected:
    TableProcessor(IndexRow pfnIndices, MakeTable pfnMakeTable, std::size_t nInBytes,
                   std::size_t nOutBytes)
        : mpfnIndices(pfnIndices),
          mpfnMakeTable(pfnMakeTable),
          mnInBytes(nInBytes),
          mnOutBytes(nOutBytes)
    {
    }

private:
    static std::size_t ElementsPerPixel(const Raster& oRaster)
    {
        return std::size_t{oRaster.mnChannels} * (oRaster.moDataType.mbComplex ? 2U : 1U);
    }

    void MakeStoredTable() const
    {
        std::array<std::uint32_t, kBytes> anIndices{};
        if (mnInBytes == 1)
        {
            std::array<unsigned char, kBytes> anBytes;
            std::iota(anBytes.begin(), anBytes.end(), static_cast<unsigned char>(0));
            mpfnIndices(anBytes.data(), 1, anIndices);
        }
        mpoTable = mpfnMakeTable(mvMeanMode, anIndices);
    }

    void MapRow(const Run<const unsigned char>& oIn, const Run<unsigned char>& oOut) const
    {
        if (mnInBytes == 1)
        {
            mpoTable->WriteByBytes(oIn, oOut);
            return;
        }
        std::array<std::uint32_t, 1024> anIndices;
        for (std::size_t x = 0; x < oIn.mnCount; x += anIndices.size())
        {
            const std::size_t nCount = std::min(anIndices.size(), oIn.mnCount - x);
            mpfnIndices(oIn.mpFirst + x * oIn.mnStride * mnInBytes, oIn.mnStride,
                        {anIndices.data(), nCount});
            mpoTable->WriteByIndex(anIndices.data(), {oOut.mpFirst + x * oOut.mnStride * mnOutBytes,
                                                      oOut.mnStride, nCount});
        }
    }

    IndexRow mpfnIndices;
    MakeTable mpfnMakeTable;
    std::size_t mnInBytes;
    std::size_t mnOutBytes;
    // Made with the first block, when the parameters are in.
    mutable std::once_flag moTableMade;
    mutable std::unique_ptr<StoredTable> mpoTable;
};

}  // namespace

template <class TIn, class TOut>
class FilterHOM::InnerProcessor : public TableProcessor
{
public:
    InnerProcessor()
        : TableProcessor(FindIndices<TIn>, MakeTableOf<TOut>, sizeof(TIn), sizeof(TOut))
    {
    }
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
