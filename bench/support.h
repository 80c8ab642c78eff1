#pragma once

#include <algorithm>
#include <cstdint>
#include <memory>
#include <random>

#include "basic/core/typedispatch/typelist.h"
#include "basic/tessel/raster/raster.h"

/// Blocks for benchmarks.
namespace kor::bench
{

struct Margins
{
    std::uint32_t x = 0;
    std::uint32_t y = 0;
};

struct Size
{
    std::uint32_t nWidth = 0;
    std::uint32_t nHeight = 0;

    std::int64_t Pixels() const { return std::int64_t{nWidth} * nHeight; }
};

inline constexpr Size kBlock = {2048, 2048};
inline constexpr std::uint64_t kSeed = 20240229;

/// A raster of samples of type T; its memory is written once, so that no page is new to the system.
template <class T>
std::unique_ptr<tessel::Raster> MakeRaster(Size oSize, Margins oMargins,
                                           std::uint32_t nChannels = 1)
{
    auto poRaster = std::make_unique<tessel::Raster>(
        tessel::RasterInfo(oSize.nWidth, oSize.nHeight, nChannels, typedispatch::RealDataType<T>()),
        tessel::RasterContext(oMargins.x, oMargins.y, 0, 0));
    std::fill_n(poRaster->mpBuffer, poRaster->mnBufferSize, static_cast<unsigned char>(0));
    return poRaster;
}

/// Intensity of one-look speckle with a mean of 40, cut to the range of T. Margins are filled too.
template <class T>
std::unique_ptr<tessel::Raster> SpeckleRaster(Size oSize, Margins oMargins, std::uint64_t nSeed,
                                              std::uint32_t nChannels = 1)
{
    auto poRaster = MakeRaster<T>(oSize, oMargins, nChannels);
    std::mt19937_64 oRandom(nSeed);
    std::exponential_distribution<double> oSpeckle(1.0 / 40.0);
    T* pSamples = reinterpret_cast<T*>(poRaster->mpBuffer);
    const double dfHighest = static_cast<double>(std::numeric_limits<T>::max());
    std::generate_n(pSamples, poRaster->mnBufferSize / sizeof(T),
                    [&] { return static_cast<T>(std::min(oSpeckle(oRandom), dfHighest)); });
    return poRaster;
}

}  // namespace kor::bench
