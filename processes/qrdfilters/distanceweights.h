#pragma once

#include <cstddef>
#include <cstdint>
#include <span>
#include <vector>

#include "basic/tessel/mask/mask.h"
#include "basic/tessel/raster/raster.h"
#include "processes/qrdfilters/slidingwindow.h"
#include "processes/qrdfilters/stretchvalidity.h"
#include "processes/qrdfilters/window.h"

namespace kor::filters
{

/// Appends the distance of each pixel of a window from its centre, in row order.
void AppendDistances(const Window& oWindow, std::vector<double>& vdfDistances);

/// Which distance weights a sample of a window in which pixels are masked.
enum class MaskedDistances
{
    eShifted,  ///< valid pixel k, counted from 0, has entry k of the distances
    eInPlace   ///< each pixel of the window has its own entry
};

/// Where the weights come from.
enum class WeightExponential
{
    eLibrary,  ///< std::exp
    eVector    ///< several at once, at most 1 ulp off
};

/// Means of windows whose samples are weighted by exp(-(A * distance)), with a coefficient A for
/// each window:
///
///     mean = (0 + w * x + ...) / (0 + w + ...) over the valid pixels of the window in row order
///
/// A window has few distinct distances, 10 among the 49 pixels of 7 x 7, and so few exponentials.
/// The results are those of one exponential for each pixel, to the last bit.
class DistanceWeights
{
public:
    /// vdfDistances has an entry for each pixel of the window. The masks may be null.
    DistanceWeights(const tessel::Raster& oIn, const tessel::Mask* poMaskIn,
                    const tessel::Mask* poMaskOut, const Window& oWindow,
                    std::span<const double> vdfDistances, MaskedDistances eMasked,
                    WeightExponential eExponential);

    /// What becomes of each sample of a stretch: the weighted mean where mvdfWeighted is not 0,
    /// else the value of mvdfFixed.
    struct Row
    {
        std::vector<double> mvdfCoefficients;
        std::vector<double> mvdfFixed;
        std::vector<double> mvdfWeighted;
    };
    /// The row to be filled before Weigh, with room for that many samples.
    Row& GetRow(std::size_t nSamples);

    /// Makes the results of the row's samples. What background pixels get means nothing.
    void Weigh(const WindowStatistics& oStretch, std::span<double> vdfOut);

private:
    void SortDistances(std::span<const double> vdfDistances);
    void DropBackground(const WindowStatistics& oStretch);
    void ClearMasked(const WindowStatistics& oStretch);
    void WeighPart(const WindowStatistics& oStretch, std::size_t nFirst, std::size_t nSamples,
                   double* pOut);
    void FindTaken(std::size_t nFirst, std::size_t nSamples);
    void RaiseWeights(std::size_t nFirst, std::size_t nSamples);
    void FindMeans(std::size_t nFirst, std::size_t nSamples, double* pOut);
    void FindMeansInPlace(std::size_t nFirst, std::size_t nSamples, double* pOut);
    void FindShiftedMeans(std::size_t nFirst, std::size_t nSamples, double* pOut);
    double ShiftedMean(std::size_t nFirst, std::size_t i) const;

    const tessel::Raster& moIn;
    const tessel::Mask* mpoMaskIn;
    const tessel::Mask* mpoMaskOut;
    Window moWindow;
    std::size_t mnChannels;
    MaskedDistances meMasked;
    WeightExponential meExponential;

    std::vector<double> mvdfDistances;       ///< distinct ones, ascending
    std::vector<double> mvdfWeights;         ///< of each distance, for the samples of a part
    std::vector<std::uint32_t> mvnWeightOf;  ///< place in mvdfWeights of each pixel of the window

    // Of the stretch at hand.
    Row moRow;
    StretchValidity moValid;
    std::vector<unsigned char> mvComputed;
    std::vector<double> mvdfCleared;            ///< samples of the windows, masked ones +0.0
    std::vector<std::uint64_t> mvnClearedBits;  ///< no bit for the masked ones, else all
    // Of the part at hand, kWeightedSamples samples of it at the most.
    std::vector<const double*> mvpRows;  ///< of the windows
    std::vector<std::size_t> mvnTaken;   ///< samples that are weighted
    std::vector<double> mvdfTail;
};

}  // namespace kor::filters
