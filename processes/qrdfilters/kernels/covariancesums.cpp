#include "processes/qrdfilters/kernels/covariancesums.h"

#include "processes/qrdfilters/kernels/targets.h"

#include <algorithm>
#include <array>
#include <utility>

#undef HWY_TARGET_INCLUDE
#define HWY_TARGET_INCLUDE "processes/qrdfilters/kernels/covariancesums.cpp"
#include <hwy/foreach_target.h>
#include <hwy/highway.h>

HWY_BEFORE_NAMESPACE();
namespace kor::filters::kernels::HWY_NAMESPACE
{

namespace hn = hwy::HWY_NAMESPACE;

using Doubles = hn::CappedTag<double, kPixelPadding>;
constexpr Doubles kTag;
constexpr std::size_t kLanes = hn::MaxLanes(kTag);

// Rows of products that grow together: enough to hide the time that an addition takes.
constexpr std::size_t kMostRows = 8;

/// One vector of some rows, from row 1 + nFirst on. With the first of them, the sums of the samples
/// grow as well.
struct Tile
{
    const double* pPixels;  ///< first channel of the tile's lanes
    const double* pRows;    ///< first channel of its rows
    std::size_t nPixels;
    std::size_t nChannels;
    double* pSums;      ///< row 0 at the tile's first lane
    double* pProducts;  ///< its first row
};

template <std::size_t kRows, bool kWithSamples>
void AddTile(const Tile& oTile)
{
    const std::size_t nRow = CovarianceRow(oTile.nChannels);
    hn::Vec<Doubles> aoProducts[kRows];
    for (std::size_t r = 0; r < kRows; ++r)
    {
        aoProducts[r] = hn::LoadU(kTag, oTile.pProducts + r * nRow);
    }
    auto oSamples = hn::LoadU(kTag, oTile.pSums);
    const double* pPixel = oTile.pPixels;
    const double* pRow = oTile.pRows;
    for (std::size_t p = 0; p < oTile.nPixels; ++p)
    {
        const auto oLanes = hn::LoadU(kTag, pPixel);
        if constexpr (kWithSamples)
        {
            oSamples = hn::Add(oSamples, oLanes);
        }
        for (std::size_t r = 0; r < kRows; ++r)
        {
            aoProducts[r] = hn::Add(aoProducts[r], hn::Mul(oLanes, hn::Set(kTag, pRow[r])));
        }
        pPixel += oTile.nChannels;
        pRow += oTile.nChannels;
    }
    if constexpr (kWithSamples)
    {
        hn::StoreU(oSamples, kTag, oTile.pSums);
    }
    for (std::size_t r = 0; r < kRows; ++r)
    {
        hn::StoreU(aoProducts[r], kTag, oTile.pProducts + r * nRow);
    }
}

using TileFunction = void (*)(const Tile&);

template <bool kWithSamples, std::size_t... kRows>
constexpr auto TileFunctions(std::index_sequence<kRows...>)
{
    return std::array<TileFunction, sizeof...(kRows)>{AddTile<1 + kRows, kWithSamples>...};
}

void AddPixels(const double* pPixels, std::size_t nPixels, std::size_t nChannels, double* pSums)
{
    static constexpr auto kWithSamples = TileFunctions<true>(std::make_index_sequence<kMostRows>());
    static constexpr auto kProductsAlone =
        TileFunctions<false>(std::make_index_sequence<kMostRows>());
    for (std::size_t i = 0; i < nChannels; i += kLanes)
    {
        for (std::size_t j = i; j < nChannels; j += kMostRows)
        {
            const auto& aoTiles = j == i ? kWithSamples : kProductsAlone;
            const std::size_t nRows = std::min(kMostRows, nChannels - j);
            aoTiles[nRows - 1]({pPixels + i, pPixels + j, nPixels, nChannels, pSums + i,
                                pSums + (1 + j) * CovarianceRow(nChannels) + i});
        }
    }
}

}  // namespace kor::filters::kernels::HWY_NAMESPACE
HWY_AFTER_NAMESPACE();

#if HWY_ONCE
namespace kor::filters::kernels
{

HWY_EXPORT(AddPixels);

void AddPixels(const double* pPixels, std::size_t nPixels, std::size_t nChannels, double* pSums)
{
    HWY_DYNAMIC_DISPATCH(AddPixels)(pPixels, nPixels, nChannels, pSums);
}

}  // namespace kor::filters::kernels
#endif
