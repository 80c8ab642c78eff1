#pragma once

#include <vector>

#include "basic/tessel/mask/mask.h"
#include "basic/tessel/raster/raster.h"

namespace kor::filters
{

/// Texture measures of a radar image, all of the n valid samples x of the window. Any other value
/// is invalid.
enum SarTextureType
{
    eSarIntensityVariation = 1,  ///< n * sum(x^2) / sum(x)^2 - 1, for intensity (power)
    eSarAmplitudeVariation = 2,  ///< n * sum(x) / sum(sqrt(x))^2 - 1, for intensity (power)
    eSarLogVariance = 3,         ///< sum(ln(x)^2) / n - (sum(ln x) / n)^2, with ln 0 = -100
    eSarLogMeanRatio = 4         ///< sum(ln x) / n - ln(sum(x) / n), without a bound on ln 0
};

/// Texture of a radar image: one output channel for each measure of a list, in its order.
///
/// Input    eDT_64R, one channel. The window is that of the margins, whatever the sizes say.
/// Output   eDT_64R, same width and height, one channel a texture. Margins are not written.
/// Masks    may be null. A bit cleared in the input mask takes the pixel out of every window. A bit
///          cleared in either mask makes it background, which is 0 in all channels.
/// Corners  one valid sample: 0 for each texture, up to the rounding of running sums. All zeros:
///          the two variations are not a number. A 0 makes the log mean ratio infinite, and what
///          follows in its rows and columns not a number. Negative samples have no logarithm and no
///          root: not a number.
/// Errors   kor::Exception with the source path: margins smaller than a size; more than one input
///          channel; an output with another number of channels than the list has textures; an
///          invalid texture, at its turn, after the channels before it were written.
/// Numbers  logarithms are within 1 ulp of the C library's, and the same on every processor.
/// Threads  works on the calling thread; one object may serve many threads.
/// Source   C. J. Oliver, "Optimum texture estimators for SAR clutter", Journal of Physics D
/// 26(11),
///          1824-1835, 1993.
class FilterSartex
{
public:
    FilterSartex() = default;

    /// The textures to compute. Throws kor::Exception when one comes twice, and keeps the former
    /// list then.
    void SetTextures(const std::vector<SarTextureType>& oTextures);
    /// Window width in pixels that the margins have to hold: odd, from 3 to 101; 0 until it is set.
    /// Other values throw kor::Exception.
    void SetFilterSizeX(unsigned int nSizeX);
    /// The same for the height.
    void SetFilterSizeY(unsigned int nSizeY);
    /// Kept without a use: background is always 0.
    void SetBGZero(bool bBGZero);
    /// False: textures are not to be converted to the type of the image.
    bool DoConvertBack() const;

    void Process(tessel::Raster* poRasterIn, tessel::Mask* poMaskIn, tessel::Raster* poRasterOut,
                 tessel::Mask* poMaskOut) const;
    /// The same as Process.
    void ProcessBlock(tessel::Raster* poRasterIn, tessel::Mask* poMaskIn,
                      tessel::Raster* poRasterOut, tessel::Mask* poMaskOut) const;

private:
    std::vector<SarTextureType> moTextures;
    unsigned int mnFilterSizeX = 0;
    unsigned int mnFilterSizeY = 0;
    bool mbBGZero = false;
};

}  // namespace kor::filters
