#include "processes/qrdfilters/validmaskbuilder.h"

#include <algorithm>
#include <cmath>
#include <limits>
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

template <class TSample>
bool IsValid(TSample xSample, const std::vector<TSample>& vNoData)
{
    if constexpr (std::is_floating_point_v<TSample>)
    {
        if (!std::isfinite(xSample))
        {
            return false;
        }
    }
    return std::find(vNoData.begin(), vNoData.end(), xSample) == vNoData.end();
}

/// One byte a pixel, margins included.
template <class TSample>
std::vector<unsigned char> FindValidPixels(const tessel::Raster& oRaster,
                                           const std::vector<double>& vdfNoData)
{
    const std::vector<TSample> vNoData = SamplesOf<TSample>(vdfNoData);
    const std::size_t nPixels = std::size_t{oRaster.mnTotalWidth} * oRaster.mnTotalHeight;
    const std::size_t nSamples =
        std::size_t{oRaster.mnChannels} * (oRaster.moDataType.mbComplex ? 2U : 1U);
    const auto* pSample = reinterpret_cast<const TSample*>(oRaster.mpBuffer);
    std::vector<unsigned char> vValid(nPixels);
    for (unsigned char& nByte : vValid)
    {
        nByte = std::all_of(pSample, pSample + nSamples,
                            [&](TSample xSample) { return IsValid(xSample, vNoData); })
                    ? 1
                    : 0;
        pSample += nSamples;
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
