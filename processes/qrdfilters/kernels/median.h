#pragma once

#include <cstddef>
#include <cstdint>

/// Medians of square windows by networks of minima and maxima, in the samples' own type.
namespace kor::filters::kernels
{

/// True when SelectMedians knows windows of nSide x nSide samples.
constexpr bool HasMedianNetwork(std::size_t nSide)
{
    return nSide == 3 || nSide == 5 || nSide == 7;
}

/// Rows of samples to read and to write. Output sample i of row y is the median of the samples
/// pIn[(y + r) * nInPitch + i + k * nStep] for r and k from 0 to the window's side - 1: pIn is the
/// upper left sample of the first window, and nStep the number of channels.
template <class T>
struct MedianBlock
{
    const T* pIn;
    std::size_t nInPitch;
    std::size_t nStep;  ///< not above nSamples
    T* pOut;
    std::size_t nOutPitch;
    std::size_t nSamples;  ///< of an output row
    std::size_t nRows;     ///< of the output
};

/// Writes the medians of windows of nSide x nSide samples, a side that HasMedianNetwork knows. Only
/// samples of windows are read. Exists for std::int8_t to std::uint64_t, float and double; a window
/// that holds a NaN gives one of its samples, which one depends on the window alone.
template <class T>
void SelectMedians(std::size_t nSide, const MedianBlock<T>& oBlock);

}  // namespace kor::filters::kernels
