#pragma once

#include "docs/gallery/greyimage.h"

namespace kor::gallery
{

/// Equivalent number of looks of an area that should be uniform: mean^2 / variance of intensities.
double EquivalentLooks(const GreyImage& oImage, const Area& oArea);

/// Mean of the image over the mean of the reference: 1 where the mean is preserved.
double MeanRatio(const GreyImage& oImage, const GreyImage& oReference);

/// Peak signal-to-noise ratio in decibel; the peak is the greatest sample of the truth.
double PeakSignalToNoise(const GreyImage& oImage, const GreyImage& oTruth);

/// How much of the edges of the truth is left: the correlation of the two images after a Laplacian
/// of 3 x 3 pixels, 1 for the truth itself. Source: F. Sattar, L. Floreby, G. Salomonsson,
/// B. Lovstrom, "Image enhancement based on a nonlinear multiscale method", IEEE Trans. Image
/// Processing 6(6), 888-895, 1997.
double EdgeCorrelation(const GreyImage& oImage, const GreyImage& oTruth);

/// Where no truth is known: sum of the absolute differences of neighbours across and down, over
/// that of the unfiltered image.
double GradientRatio(const GreyImage& oImage, const GreyImage& oReference);

}  // namespace kor::gallery
