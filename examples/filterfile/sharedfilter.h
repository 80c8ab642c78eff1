#pragma once

#include <memory>
#include <utility>

#include "basic/tessel/mask/mask.h"
#include "basic/tessel/raster/raster.h"

namespace kor::examples
{

/// A filter for FilterAlgorithm that others hold as well: they may set it until the first block
/// comes, and ask it when the last one is done.
template <class Filter>
class SharedFilter
{
public:
    explicit SharedFilter(std::shared_ptr<const Filter> poFilter) : mpoFilter(std::move(poFilter))
    {
    }

    void Process(tessel::Raster* poRasterIn, tessel::Mask* poMask,
                 tessel::Raster* poRasterOut) const
    {
        mpoFilter->Process(poRasterIn, poMask, poRasterOut);
    }

private:
    std::shared_ptr<const Filter> mpoFilter;
};

}  // namespace kor::examples
