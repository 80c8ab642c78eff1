#pragma once

#include "processes/qrdfilters/mosaic/samplelist.h"

namespace kor::filters
{

/// out = mdfGain * in + mdfOffset.
struct BalanceLine
{
    double mdfGain = 1.0;
    double mdfOffset = 0.0;
};

/// The line through pairs of samples: the medians of the slopes and of the intercepts that pairs
/// with different inputs have. Pairs are taken in steps that leave about ten thousand of them. Both
/// lists have the same length.
BalanceLine LineOfPairs(const ISampleList& oIn, const ISampleList& oOut);

/// The line that maps a low and a high sample of the input to those of the output. The low one has
/// the given share of the input's count below it, the high one the given share of the output's
/// count above it; these numbers hold for both lists. One outside a list reads as 0. Puts the lists
/// in another order.
BalanceLine LineOfPercentiles(double dfLowShare, double dfHighShare, ISampleList& oIn,
                              ISampleList& oOut);

/// The line with the given share of its gain: turned around dfMiddle, and then raised by a share of
/// the balanced range of oInside, which counts as 0 where it is empty.
BalanceLine AdjustLine(const BalanceLine& oLine, double dfStretchFactor, double dfMiddle,
                       double dfOffsetShare, const SampleRange& oInside);

}  // namespace kor::filters
