#pragma once

#include <span>

#include "processes/qrdfilters/slidingwindow.h"

namespace kor::filters::kernels
{

/// The mean of each window, or dfFailValue where the centre sample stands out from it. With Q, S, n
/// the sum of squares (the second), the sum of samples (the first) and the count, and s the centre:
/// m = S / n and d = s - m; s stands out if n is at least 2 and
/// d * d > 3 * (Q - m * n * m) / (n - 1), worked out from the left. The length of oResults is a
/// multiple of kRowPadding.
void NoiseRow(const WindowStatistics& oStatistics, double dfFailValue, std::span<double> oResults);

}  // namespace kor::filters::kernels
