#pragma once

#include <array>
#include <cstddef>
#include <cstdint>
#include <vector>

#include "basic/tessel/raster/raster.h"
#include "processes/qrdfilters/kernels/specklerows.h"

namespace kor::filters::engine
{

/// The noise models of the Lee filter; any other number is none.
enum LeeModel : int
{
    eLM_Additive = 1,
    eLM_Multiplicative = 2,
    eLM_Both = 3
};

/// The enhanced path of the Lee filter: a square window, sample by sample, with nine sub-blocks.
/// One object filters one block from its first sample to its last, since the window and the sums of
/// the sub-blocks live on from sample to sample.
class SubBlockLee
{
public:
    /// poValid holds a byte a pixel, 0 masked; null means that no pixel counts.
    SubBlockLee(LeeModel eModel, const kernels::LeeNoise& oNoise, double dfThreshold, int nHalf,
                const tessel::Raster& oIn, const tessel::Raster* poValid);

    /// The result for channel c of pixel (x, y).
    double Filter(std::int64_t x, std::int64_t y, std::size_t c);

private:
    static constexpr std::size_t kBlocks = 9;
    static constexpr std::size_t kLeastWindow = 81;

    /// Mean and variance, of the window or of a part of it.
    struct Moments
    {
        double mdfMean;
        double mdfVariance;
    };

    void LoadWindow(std::int64_t x, std::int64_t y, std::size_t c);
    void LookIntoSubBlocks(Moments& oMoments);
    void GrowSubBlocks();
    Moments MomentsOfTriangle() const;
    double Finish(double dfCentre, const Moments& oMoments) const;

    LeeModel meModel;
    kernels::LeeNoise moNoise;
    double mdfThreshold;
    bool mbEstimate;  ///< the noise variance comes from the image
    std::int64_t mnHalf;
    std::size_t mnSide;
    const tessel::Raster& moIn;
    const tessel::Raster* mpoValid;
    std::vector<double> mvdfWindow;
    double mdfSum = 0.0;
    double mdfSumOfSquares = 0.0;
    double mdfCount = 0.0;
    std::array<double, kBlocks> madfBlockSums{};
    std::array<double, kBlocks> madfBlockSquares{};
    std::array<double, kBlocks> madfBlockMeans{};
    std::array<double, kBlocks> madfBlockVariances{};
};

}  // namespace kor::filters::engine
