#pragma once

#include <cstddef>
#include <span>

/// Projections of pixels on vectors, in single precision. Channels and outputs of a pixel stand
/// side by side. Lanes run over the outputs, so that each projection is summed in the order of the
/// channels on every target.
namespace kor::filters::kernels
{

/// Arrays with an element an output end on a multiple of this many; so many floats behind a row of
/// results may be overwritten.
inline constexpr std::size_t kOutputPadding = 8;

constexpr std::size_t PadOutputs(std::size_t nOutputs)
{
    return (nOutputs + kOutputPadding - 1) / kOutputPadding * kOutputPadding;
}

/// v[k] = sum over c of x[c] * weight[c][k], and what becomes of it. All arrays but the weights
/// have PadOutputs(mnOutputs) elements, and so has each of the mnChannels rows of weights.
struct Projection
{
    std::size_t mnChannels;
    std::size_t mnOutputs;
    const float* mpWeights;
    const float* mpScale;
    const float* mpMidPoint;
    float* mpLowest;   ///< goes down to v[k] where that is less
    float* mpHighest;  ///< goes up to v[k] where that is greater
};

/// oSamples[i] -= pMeans[i].
void SubtractMeans(const float* pMeans, std::span<float> oSamples);

/// pOut = v * scale + midpoint for nPixels pixels.
void ProjectPixels(const Projection& oProjection, const float* pPixels, std::size_t nPixels,
                   float* pOut);

}  // namespace kor::filters::kernels
