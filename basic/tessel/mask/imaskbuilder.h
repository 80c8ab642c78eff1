#pragma once

#include "basic/tessel/mask/mask.h"
#include "basic/tessel/raster/raster.h"

namespace kor::tessel
{

/// Says which pixels of a block are valid.
class IMaskBuilder
{
public:
    virtual ~IMaskBuilder() = default;

    /// A mask with the geometry of oRaster, margins included. The caller deletes it.
    virtual Mask* BuildMask(const Raster& oRaster) const = 0;
};

}  // namespace kor::tessel
