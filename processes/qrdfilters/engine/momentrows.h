#pragma once

#include "processes/qrdfilters/kernels/specklerows.h"
#include "processes/qrdfilters/slidingwindow.h"

namespace kor::filters::engine
{

/// Filters doubles by count, sum and sum of squares of each window: oFinish takes MomentRows and a
/// span for the results.
template <class Finish>
void FilterByMoments(const tessel::Raster& oIn, const tessel::Mask* poMaskIn, const Window& oWindow,
                     bool bBGZero, const Finish& oFinish, tessel::Raster& oOut,
                     const tessel::Mask* poMaskOut)
{
    constexpr WindowTerm kTerms[] = {kSumTerm, kSumOfSquaresTerm};
    FilterWindowRows<double>(
        oIn, poMaskIn, oWindow, kTerms, bBGZero,
        [&oFinish](const WindowStatistics& oStatistics, std::span<double> vdfOut)
        {
            oFinish(kernels::MomentRows{oStatistics.mapSums[0], oStatistics.mapSums[1],
                                        oStatistics.mpCounts, oStatistics.mpCentres},
                    vdfOut);
        },
        oOut, poMaskOut);
}

}  // namespace kor::filters::engine
