#include "processes/qrdfilters/mosaic/colourbalance.h"

#include <algorithm>
#include <cmath>
#include <vector>

#include "processes/qrdfilters/mosaic/ascending.h"

namespace kor::filters
{

namespace
{

/// The upper one of the two in the middle where the count is even.
double Median(std::vector<double>& vdfValues)
{
    const auto itMiddle = vdfValues.begin() + static_cast<std::ptrdiff_t>(vdfValues.size() / 2);
    std::nth_element(vdfValues.begin(), itMiddle, vdfValues.end(), Ascending());
    return *itMiddle;
}

/// The sample of a rank that is still a number of doubles; 0 outside the list.
double SampleAt(double dfRank, ISampleList& oSamples)
{
    const bool bInside = dfRank >= 0.0 && dfRank < static_cast<double>(oSamples.GetCount());
    return bInside ? oSamples.TakeRanked(static_cast<std::size_t>(dfRank)) : 0.0;
}

}  // namespace

BalanceLine LineOfPairs(const ISampleList& oIn, const ISampleList& oOut)
{
    const std::size_t nCount = oIn.GetCount();
    const auto nStep = std::max<std::size_t>(
        1, static_cast<std::size_t>(static_cast<double>(nCount) / std::sqrt(10000.0)));
    std::vector<double> vdfSlopes;
    std::vector<double> vdfIntercepts;
    for (std::size_t i = 0; i < nCount; i += nStep)
    {
        const double dfIn = oIn.GetSample(i);
        const double dfOut = oOut.GetSample(i);
        // Meant: the inner step is one longer, so that it does not meet the same samples.
        for (std::size_t j = 0; j < nCount; j += nStep + 1)
        {
            if (oIn.Differ(i, j))
            {
                const double dfSlope = (dfOut - oOut.GetSample(j)) / (dfIn - oIn.GetSample(j));
                vdfSlopes.push_back(dfSlope);
                vdfIntercepts.push_back(dfOut - dfIn * dfSlope);
            }
        }
    }
    return vdfSlopes.empty() ? BalanceLine()
                             : BalanceLine{Median(vdfSlopes), Median(vdfIntercepts)};
}

BalanceLine LineOfPercentiles(double dfLowShare, double dfHighShare, ISampleList& oIn,
                              ISampleList& oOut)
{
    if (oIn.GetCount() == 0)
    {
        return {};
    }
    const auto nIn = static_cast<double>(oIn.GetCount());
    const auto nOut = static_cast<double>(oOut.GetCount());
    const double dfBelow = std::trunc(nIn * dfLowShare);
    const double dfAbove = std::trunc(nOut * dfHighShare);
    const double dfLowIn = SampleAt(dfBelow, oIn);
    const double dfLowOut = SampleAt(dfBelow, oOut);
    const double dfHighIn = SampleAt(nIn - 1.0 - dfAbove, oIn);
    const double dfHighOut = SampleAt(nOut - 1.0 - dfAbove, oOut);
    const double dfGain = (dfHighOut - dfLowOut) / (dfHighIn - dfLowIn);
    return {dfGain, dfLowOut - dfGain * dfLowIn};
}

BalanceLine AdjustLine(const BalanceLine& oLine, double dfStretchFactor, double dfMiddle,
                       double dfOffsetShare, const SampleRange& oInside)
{
    const double g = oLine.mdfGain;
    const double o = oLine.mdfOffset;
    const double dfRange =
        oInside.IsEmpty() ? 0.0 : (g * oInside.mdfHighest + o) - (g * oInside.mdfLowest + o);
    return {dfStretchFactor * g,
            (1.0 - dfStretchFactor) * g * dfMiddle + o + dfRange * dfOffsetShare};
}

}  // namespace kor::filters
