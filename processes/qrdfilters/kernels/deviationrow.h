#pragma once

#include <span>

#include "processes/qrdfilters/slidingwindow.h"

namespace kor::filters::kernels
{

/// The sample standard deviation of each window, of which the first sum is that of the samples and
/// the second that of their squares; a sample alone in its window is given as it is. With Q, S, n
/// the squares, the sum and the count: m = S / n, then sqrt((Q - m * n * m) / (n - 1)), in this
/// order. The length of oDeviations is a multiple of kRowPadding.
void DeviationRow(const WindowStatistics& oStatistics, std::span<double> oDeviations);

}  // namespace kor::filters::kernels
