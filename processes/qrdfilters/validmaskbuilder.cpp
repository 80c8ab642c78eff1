#include "processes/qrdfilters/validmaskbuilder.h"

#include <algorithm>
#include <cmath>
#include <cstdint>
#include <functional>
#include <limits>
#include <numeric>
#include <span>
#include <type_traits>
#include <utility>

#include "basic/core/typedispatch/typelist.h"
#include "platform/exception/exception.h"
#include "processes/qrdfilters/sampleconversion.h"

namespace kor::filters
{

namespace
{

/// The nodata values as samples, those left out that no sample can equal.
template <class TSample>
std::vector<TSample> SamplesOf(const std::vector<double>& vdfNoData)
{
    std::vector<TSample> vSamples;
    for (const double dfNoData : vdfNoData)
    {
        if constexpr (std::is_floating_point_v<TSample>)
        {
            vSamples.push_back(static_cast<TSample>(dfNoData));
        }
        else
        {
            // 2^63 and 2^64 are exact in double where the largest integers are not.
            const double dfEnd = std::ldexp(1.0, std::numeric_limits<TSample>::digits);
            const double dfLowest = static_cast<double>(std::numeric_limits<TSample>::min());
            if (dfNoData >= dfLowest && dfNoData < dfEnd && dfNoData == std::trunc(dfNoData))
            {
                vSamples.push_back(static_cast<TSample>(dfNoData));
            }
        }
    }
    return vSamples;
}

/// 1 for a sample that is finite and no nodata value, else 0. The loops are plain so that compilers
/// make vectors of them.
template <class TSample>
void MarkValidSamples(const TSample* __restrict pSamples, const std::vector<TSample>& vNoData,
                      std::span<unsigned char> oValid)
{
    unsigned char* __restrict pValid = oValid.data();
    for (std::size_t i = 0; i < oValid.size(); ++i)
    {
        if constexpr (std::is_floating_point_v<TSample>)
        {
            pValid[i] = std::abs(pSamples[i]) <= std::numeric_limits<TSample>::max();
        }
        else
        {
            pValid[i] = 1;
        }
    }
    for (const TSample xNoData : vNoData)
    {
        for (std::size_t i = 0; i < oValid.size(); ++i)
        {
            pValid[i] &= static_cast<unsigned char>(pSamples[i] != xNoData);
        }
    }
}

/// One byte a pixel, margins included. A pixel is valid when all its samples are.
template <class TSample>
std::vector<unsigned char> FindValidPixels(const tessel::Raster& oRaster,
                                           const std::vector<double>& vdfNoData)
{
    constexpr std::size_t kPixelsAtOnce = 1024;
    const std::vector<TSample> vNoData = SamplesOf<TSample>(vdfNoData);
    const std::size_t nPixels = std::size_t{oRaster.mnTotalWidth} * oRaster.mnTotalHeight;
    const std::size_t nSamples =
        std::size_t{oRaster.mnChannels} * (oRaster.moDataType.mbComplex ? 2U : 1U);
    const auto* pSamples = reinterpret_cast<const TSample*>(oRaster.mpBuffer);
    std::vector<unsigned char> vValid(nPixels);
    std::vector<unsigned char> vSamples(std::min(kPixelsAtOnce, nPixels) * nSamples);
    for (std::size_t nFirst = 0; nFirst < nPixels; nFirst += kPixelsAtOnce)
    {
        const std::span oPixels =
            std::span(vValid).subspan(nFirst, std::min(kPixelsAtOnce, nPixels - nFirst));
        if (nSamples == 1)
        {
            MarkValidSamples(pSamples + nFirst, vNoData, oPixels);
            continue;
        }
        const std::span oSamples(vSamples.data(), oPixels.size() * nSamples);
        MarkValidSamples(pSamples + nFirst * nSamples, vNoData, oSamples);
        for (std::size_t i = 0; i < oPixels.size(); ++i)
        {
            const auto oPixel = oSamples.subspan(i * nSamples, nSamples);
            oPixels[i] = std::accumulate(oPixel.begin(), oPixel.end(), std::uint8_t{1},
                                         std::bit_and<std::uint8_t>());
        }
    }
    return vValid;
}

}  // namespace

ValidMaskBuilder::ValidMaskBuilder(std::vector<double> vdfNoData) : mvdfNoData(std::move(vdfNoData))
{
}

tessel::Mask* ValidMaskBuilder::BuildMask(const tessel::Raster& oRaster) const
{
    using List = typedispatch::StandardTypeList;
    std::vector<unsigned char> vValid;
    const std::size_t nType = typedispatch::FindDataType<List>(oRaster.moDataType, true);
    typedispatch::VisitType<List>(
        nType, [&]<class T>() { vValid = FindValidPixels<Arithmetic<T>>(oRaster, mvdfNoData); },
        []
        {
            throw DataException("A raster of this data type has no samples that could be valid",
                                "processes/qrdfilters/validmaskbuilder",
                                "Mask* ValidMaskBuilder::BuildMask(const Raster&) const", __LINE__);
        });
    // A block without pixels still has a mask; the constructor wants an address.
    vValid.reserve(1);
    return new tessel::Mask(oRaster, oRaster, vValid.data(), false, false);
}

}  // namespace kor::filters
