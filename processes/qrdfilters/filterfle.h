#pragma once

#include <boost/optional.hpp>
#include <memory>
#include <string>
#include <vector>

#include "basic/tessel/mask/mask.h"
#include "basic/tessel/raster/raster.h"

namespace kor::filters
{

/// Lee filter with a noise model: the window mean plus a gain times the pixel's deviation from it.
///
///     additive         out = (x - mean) * var / (var + V) + mean
///     multiplicative   out = (x - mean * M) * k + mean,      k = max(0, 1 - mean^2 * V / var)
///     both             out = (x - mean * M - A) * k + mean,  k = M * var / (M^2 * var + var + V)
/// x is the centre sample, mean and var (over n - 1) those of the n valid samples of the window, V
/// the noise variance, A and M the noise means (additive, multiplicative).
///
/// The enhanced path runs when the x margin is 3 or 4 and the variance threshold is not 0. It takes
/// var over n, less 1, and where that is above the threshold it looks into nine sub-blocks of the
/// window: without a given V (unless the noise is multiplicative) their variances are the noise's,
/// and where var is below the threshold all the same, mean and var are those of one half of the
/// window, cut by a diagonal. It gives 0 where the mean is within 1e-9 of 0, and needs an input
/// mask: without one no sample counts, and all results are not a number.
///
/// Input    eDT_64R; channels are filtered one by one. The window is the set size, halved by
///          integer division (4 and 5 both give 5 pixels), or the margins while either size is
///          unset. The enhanced path takes a set size as half the window (4 gives 9 pixels), axis
///          by axis. The margins must hold the window.
/// Output   eDT_64R, same width, height and channels. Margins are not written. Without a noise
///          model nothing is written.
/// Masks    may be null. A bit cleared in the input mask takes the pixel out of every window. A bit
///          cleared in either mask makes it background: 0, or the input when BGZero is false.
/// Corners  one valid sample: out = x. Flat window: out = mean, but with the multiplicative model
///          not a number where the mean is 0 too.
/// Errors   setters: kor::Exception for a multiplicative mean of 0 or less, kor::ParameterException
///          for an unknown noise model. The enhanced path: kor::ParameterException for a window
///          without neighbours or not as wide as high. In hardened builds kor::Exception when the
///          window is larger than the margins.
/// Numbers  the sums of the sub-blocks grow from pixel to pixel, so that the enhanced path depends
///          on how an image is cut into blocks.
/// Threads  works on the calling thread; one object may serve many threads.
/// Source   J.-S. Lee, "Digital image enhancement and noise filtering by use of local statistics",
///          IEEE Trans. PAMI 2(2), 165-168, 1980. The enhanced path goes back to J.-S. Lee,
///          "Refined filtering of image noise using local statistics", Computer Graphics and Image
///          Processing 15(4), 380-389, 1981, with one pair of halves instead of four, sums that
///          grow, and sub-blocks at fixed places.
class FilterFle
{
public:
    /// The noise model must be set before use.
    explicit FilterFle(bool bBGZero = true);

    /// Mean of the additive noise, in units of the samples; 0 at first. Only for "BOTH".
    void SetAddMean(double dfAddMean);
    /// Mean of the multiplicative noise, dimensionless; 1 at first. 0 or less throws
    /// kor::Exception.
    void SetMulMean(double dfMulMean);
    /// Noise model: "ADDI", "MULT" or "BOTH", in letters of any case. Another text throws
    /// kor::ParameterException and leaves the filter without a model.
    void SetNoise(std::string oNoise);
    /// The first value is the noise variance: in squared units of the samples, but for "MULT" that
    /// of the noise factor, which is divided by the square of the multiplicative mean. Without a
    /// value it is 1 for "ADDI" and else 1 / looks. Model, multiplicative mean and looks count as
    /// they are at the call: set them first.
    void SetNoiseVar(const std::vector<double>& oNoiseVar);
    /// Variance threshold of the enhanced path, in squared units of the samples; 0, as at first,
    /// asks for the regular path.
    void SetThrVar(double dfThrVar);
    /// Number of looks, dimensionless; 1 at first. Only for a later SetNoiseVar without a value.
    void SetNLook(const double& dfNLook);
    /// Background is 0 (true) or a copy of the input (false).
    void SetBGZero(bool bBGZero);
    /// Window width and height in pixels; while either is empty the margins are the window.
    void SetFilterSize(boost::optional<int> nSizeX, boost::optional<int> nSizeY);
    /// All of it, in the order additive mean, background, multiplicative mean, model, variance,
    /// threshold; an exception leaves what was set before it.
    void SetParameters(std::string oNoise, double dfAddMean, double dfMulMean, double dfThrVar,
                       const std::vector<double>& oNoiseVar, bool bBGZero);

    void Process(tessel::Raster* poRasterIn, tessel::Mask* poMaskIn, tessel::Raster* poRasterOut,
                 tessel::Mask* poMaskOut) const;
    /// The same as Process.
    void ProcessBlock(tessel::Raster* poRasterIn, tessel::Mask* poMaskIn,
                      tessel::Raster* poRasterOut, tessel::Mask* poMaskOut) const;
    /// The path of the formulas above.
    void ProcessRegularBlock(tessel::Raster* poRasterIn, tessel::Mask* poMaskIn,
                             tessel::Raster* poRasterOut, tessel::Mask* poMaskOut) const;
    /// The path with sub-blocks.
    void ProcessEnhancedBlock(tessel::Raster* poRasterIn, tessel::Mask* poMaskIn,
                              tessel::Raster* poRasterOut, tessel::Mask* poMaskOut) const;

    /// Filters into a new raster of the input's type, size, margins and offsets; its margins hold
    /// nothing.
    std::shared_ptr<tessel::Raster> operator()(std::shared_ptr<tessel::Raster> poRasterIn,
                                               std::shared_ptr<tessel::Mask> poMaskIn,
                                               std::shared_ptr<tessel::Mask> poMaskOut) const;

private:
    int mnNoise = 0;  ///< 1 additive, 2 multiplicative, 3 both, 0 none
    double mdfAddMean = 0.0;
    double mdfMulMean = 1.0;
    double mdfThrVar = 0.0;
    double mdfNoiseVar = 0.0;
    bool mbBGZero;
    boost::optional<int> moFilterSizeX;
    boost::optional<int> moFilterSizeY;
    double mdfNLook = 1.0;
};

}  // namespace kor::filters
