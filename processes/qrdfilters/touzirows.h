#pragma once

#include <cstddef>
#include <cstdint>
#include <span>
#include <vector>

#include "basic/tessel/raster/raster.h"

namespace kor::filters
{

/// What the samples of an image stand for.
enum class SampleDomain
{
    eAmplitude,
    eIntensity,
    eDecibel
};

/// Samples to amplitudes: sqrt(x) of intensity, 10^(x / 10) of decibel.
void ToAmplitude(SampleDomain eDomain, std::span<double> vdfSamples);
/// Amplitudes to samples: x * x, and 10 * log10(x * x) where x > 0, else 0.
void FromAmplitude(SampleDomain eDomain, std::span<double> vdfSamples);

/// Loads samples as doubles.
using LoadRow = void (*)(const void* pIn, std::span<double> vdfOut);

/// The amplitudes of a block in a band of rows that moves down, channel by channel. Whatever lies
/// outside the block and its margins, and outside the band, reads 0.
class AmplitudeBand
{
public:
    /// The band holds nReach rows above and below the one it stands at, or the margin if that is
    /// less, and nReach columns on either side.
    AmplitudeBand(const tessel::Raster& oIn, SampleDomain eDomain, LoadRow pfnLoad,
                  std::uint32_t nReach);

    /// Rows are visited one by one from 0.
    void MoveTo(std::uint32_t y);

    /// Rows -nReach to nReach of channel c, each at its pixel 0, as floats.
    std::span<const float* const> GetSamples(std::size_t c) const;
    /// Their squares, formed in double and rounded to float.
    std::span<const float* const> GetSquares(std::size_t c) const;
    /// The row in the middle. May be read up to a multiple of eight pixels.
    std::span<const double> GetCentres(std::size_t c) const;

private:
    void Load(std::int64_t y);
    std::size_t Slot(std::int64_t y, std::size_t c) const;

    const tessel::Raster& moIn;
    SampleDomain meDomain;
    LoadRow mpfnLoad;
    std::int64_t mnReach;
    std::int64_t mnAbove;  ///< rows of the band above the one it stands at
    std::int64_t mnNext;   ///< row that is loaded next
    std::size_t mnPadded;  ///< width, up to a multiple of eight
    std::size_t mnPitch;
    std::uint32_t mnRow = 0;
    std::vector<double> mvdfLoaded;
    std::vector<double> mvdfCentres;
    std::vector<float> mvfSamples;  ///< behind the rows, one of zeros
    std::vector<float> mvfSquares;
    std::vector<const float*> mvpSamples;
    std::vector<const float*> mvpSquares;
};

}  // namespace kor::filters
