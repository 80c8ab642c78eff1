#pragma once

#include "basic/tessel/raster/raster.h"

namespace kor::tessel
{

/// The real quantity that a complex sample is seen as.
enum KORInterpretationTypes : int
{
    eKIT_Magnitude = 0,   ///< sqrt(re^2 + im^2)
    eKIT_Intensity = 1,   ///< re^2 + im^2
    eKIT_Phase = 2,       ///< atan2(im, re), radians
    eKIT_Real = 3,        ///< re
    eKIT_Imaginary = 4,   ///< im
    eKIT_IntensityDb = 5  ///< 10 log10(re^2 + im^2), decibel; minus infinity for 0
};

/// Makes real rasters of complex ones.
class ComplexInterpretation
{
public:
    /// A new real raster of the geometry of poRaster, margins and their contents included: eDT_64R
    /// for 32-bit and wider integer parts and for eDT_C64R, else eDT_32R. All is computed in
    /// double. The caller deletes the result. Throws kor::DataException when poRaster is null, is
    /// not complex or has parts of no known type, or when eType is none of the enumerators.
    Raster* InterpretRaster(const Raster* poRaster, KORInterpretationTypes eType) const;
};

}  // namespace kor::tessel
