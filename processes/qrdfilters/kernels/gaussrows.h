#pragma once

#include <span>
#include <vector>

#include "processes/qrdfilters/kernels/stencil.h"

namespace kor::filters::kernels
{

inline constexpr std::size_t kLongestGaussKernel = 65;

/// The weights of one or two symmetric kernels of the window's side up to their middle: the other
/// half mirrors it. moSecond is empty where there is one kernel.
struct GaussKernels
{
    std::span<const double> moFirst;
    std::span<const double> moSecond;
};

/// Each sample of each output row, with h = side / 2, K the kernel and s(x, y) the window's
/// samples:
///
///     A(x) = sum over y < h of (s(x, y) + s(x, 2h - y)) * K(y), and + K(h) * s(x, h)
///     S    = sum over x < h of (A(x) + A(2h - x)) * K(x), and + K(h) * A(h)
/// Both sums go from +0.0 on. Gives S, or with two kernels |S - S'|. The window is as high as it is
/// wide, three pixels or more.
///
/// The column sums A do not depend on the window that they serve, so that each is formed once:
/// vdfColumns is memory for them, of any size at first. oRows.moValid is not looked at.
/// bStreamed: the results are written past the caches.
void SmoothRows(const StencilRows& oRows, const GaussKernels& oKernels,
                std::vector<double>& vdfColumns, std::span<double* const> oOut, bool bStreamed);

/// The same for the samples nFirst to nFirst + oOut.size() - 1 of one output row, where samples
/// masked in oRows.moValid count as the window's centre. Every window has sums of its own.
void SmoothMasked(const StencilRows& oRows, const GaussKernels& oKernels, std::size_t nFirst,
                  std::span<double> oOut);

}  // namespace kor::filters::kernels
