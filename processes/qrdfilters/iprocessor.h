#pragma once

#include "basic/tessel/mask/mask.h"
#include "basic/tessel/raster/raster.h"

namespace kor::filters
{

/// Work on one pair of sample types: the door from untyped to typed code. One virtual call serves a
/// whole block.
class IProcessor
{
public:
    virtual ~IProcessor() = default;
    virtual void Process(tessel::Raster* poRasterIn, tessel::Mask* poMaskIn,
                         tessel::Raster* poRasterOut) const = 0;
};

/// The same for filters that take an output mask as well.
class IClipperProcessor
{
public:
    virtual ~IClipperProcessor() = default;
    virtual void Process(tessel::Raster* poRasterIn, tessel::Mask* poMaskIn,
                         tessel::Raster* poRasterOut, tessel::Mask* poMaskOut) const = 0;
};

/// The same for work that treats complex samples in a way of its own.
class IComplexProcessor
{
public:
    virtual void Process(tessel::Raster* poRasterIn, tessel::Mask* poMaskIn,
                         tessel::Raster* poRasterOut) const = 0;
    virtual void ProcessComplex(tessel::Raster* poRasterIn, tessel::Mask* poMaskIn,
                                tessel::Raster* poRasterOut) const = 0;
    virtual ~IComplexProcessor() = default;
};

}  // namespace kor::filters
