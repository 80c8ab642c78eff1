#pragma once

#include <vector>

#include "basic/tessel/mask/imaskbuilder.h"

namespace kor::filters
{

/// Masks missing data: a pixel is valid when every sample of it is finite and equals none of the
/// nodata values. One not-a-number that enters the running sums of a window spoils all of the row
/// behind it, so data that may have them should be filtered with such a mask.
///
/// Input    a block of any of the ten real types, or a complex one, both of whose parts are looked
///          at. Samples are compared exactly, in their own type: a nodata value that the type
///          cannot hold matches nothing, but for float, where the value is narrowed (so that
///          -3.4028234663852886e38 and -3.4e38 as files name them are found).
/// Output   a mask of the block's geometry, margins included; the caller deletes it.
/// Errors   kor::DataException for a type without samples, such as eDT_BIT.
/// Threads  any number.
class ValidMaskBuilder : public tessel::IMaskBuilder
{
public:
    /// Nodata values for all channels; none leaves the test for finite samples alone.
    explicit ValidMaskBuilder(std::vector<double> vdfNoData = {});

    tessel::Mask* BuildMask(const tessel::Raster& oRaster) const override;

private:
    std::vector<double> mvdfNoData;
};

}  // namespace kor::filters
