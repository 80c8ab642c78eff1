#pragma once

#include <cstddef>

/// Sums of samples and of their products, for means and covariances. Pixels of nChannels doubles
/// lie one behind the other. Lanes run over the sums and never over pixels, so that each sum grows
/// pixel by pixel, by one multiplication and one addition, on every target.
namespace kor::filters::kernels
{

/// Doubles behind the last pixel that are read as well and do not count.
inline constexpr std::size_t kPixelPadding = 8;

/// The sums lie in nChannels + 1 rows of this many doubles: row 0 is the sums of the samples, and
/// element i of row 1 + j, i up to j, the sum of the products x[i] * x[j]. Elements that stand for
/// no sum may hold anything.
constexpr std::size_t CovarianceRow(std::size_t nChannels)
{
    return (nChannels + kPixelPadding - 1) / kPixelPadding * kPixelPadding;
}

/// Adds nPixels pixels to pSums.
void AddPixels(const double* pPixels, std::size_t nPixels, std::size_t nChannels, double* pSums);

}  // namespace kor::filters::kernels
