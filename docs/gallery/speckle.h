#pragma once

#include <cstdint>

#include "docs/gallery/greyimage.h"

namespace kor::gallery
{

/// A radar intensity image of known truth: fields of several grey levels with straight and slanted
/// edges, bright points, thin lines and a slow gradient; 256 x 256 pixels.
GreyImage SyntheticScene();
/// A field of the scene that is uniform.
Area UniformField();

/// Intensities under speckle: each sample times a gamma variable of mean 1 and nLooks looks.
GreyImage Speckled(const GreyImage& oTruth, int nLooks, std::uint64_t nSeed);

}  // namespace kor::gallery
