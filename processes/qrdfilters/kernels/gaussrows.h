#pragma once

#include <span>

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

/// Each sample of the output row, with h = side / 2, K the kernel and s(x, y) the window's samples:
///
///     A(x) = sum over y < h of (s(x, y) + s(x, 2h - y)) * K(y), and + K(h) * s(x, h)
///     S    = sum over x < h of (A(x) + A(2h - x)) * K(x), and + K(h) * A(h)
/// Both sums go from +0.0 on. Gives S, or with two kernels |S - S'|. The window is as high as it is
/// wide, three pixels or more, and oRows has one output row.
///
/// The column sums A do not depend on the window that they serve, so that each is formed once:
/// adfColumns has room for mnSamples + (side - 1) * mnStep of them, or twice as many with two
/// kernels. oRows.moValid is not looked at.
void SmoothRow(const StencilRows& oRows, const GaussKernels& oKernels, std::span<double> adfColumns,
               std::span<double> oOut);

/// The same for the samples nFirst to nFirst + oOut.size() - 1 of the row, where samples masked in
/// oRows.moValid count as the window's centre. Every window has sums of its own.
void SmoothMasked(const StencilRows& oRows, const GaussKernels& oKernels, std::size_t nFirst,
                  std::span<double> oOut);

}  // namespace kor::filters::kernels
