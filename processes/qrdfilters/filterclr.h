#pragma once

#include <memory>
#include <utility>
#include <vector>

#include "basic/tessel/mask/imaskbuilder.h"
#include "processes/qrdfilters/iprocessor.h"
#include "processes/qrdfilters/typedfilter.h"

namespace kor::filters
{

namespace details
{

/// Parameters of FilterClr.
class ClrParams
{
public:
    virtual ~ClrParams() = default;

    /// The value that each channel gets, in sample values. Of too few values the last one counts
    /// for the channels that are left; none at all count as 0. Counts for processors made later,
    /// see FilterClr.
    void SetValues(const std::vector<double>& vdfValues) { mvdfValues = vdfValues; }

protected:
    std::vector<double> mvdfValues;
};

}  // namespace details

/// Clears a block: writes one constant a channel into all pixels, or into those of a mask.
///
///     out[c] = value[c]   in every pixel, or with a mask where its bit is set
///     out[c] = in[c]      where the mask has a cleared bit
/// Both are cut to the output's type without rounding: 3.9 becomes 3, 300.7 in 8 bits 255, -1 in an
/// unsigned type 0; not a number becomes 0 in an integer. Unlike in all other filters, integers of
/// 64 bits keep their sign.
///
/// Input    any of the ten real types. May be null: then the output is the input, and keeps its
///          samples where the mask is clear.
/// Output   any of the ten real types; same width, height and channels. Margins are not written.
/// Mask     may be null. It has the geometry of the input. Set bits are cleared to the constant,
///          others get the input: the reverse of what masks mean elsewhere.
/// Corners  values outside the range of a float, and infinities, become its greatest finite value;
///          floats are copied to floats as they are.
/// Errors   kor::Exception "poRasterOut is NULL", "Invalid type requested." (complex types,
///          eDT_BIT), all before anything is written; in hardened builds also for blocks whose
///          geometries do not match.
/// Threads  splits the rows among the threads of OpenMP. One object must not be called by two
///          threads at once unless it has worked on the same pair of types before.
/// State    the processor of the last pair of types is kept, and copies of the filter share it.
///          Values count when a processor is made.
class FilterClr : public details::ClrParams, private ProcessorCache<IProcessor>
{
public:
    template <class TIn, class TOut>
    class InnerProcessor;

    explicit FilterClr(std::vector<double> vdfValues);

    void Process(tessel::Raster* poRasterIn, tessel::Mask* poMask,
                 tessel::Raster* poRasterOut) const;
};

/// FilterClr as an algorithm, for the block driver and for loops over blocks of one's own.
///
///     FilterIODriver<CLRAlgorithm> oDriver;
///     oDriver.SetValues({0.0});
///     oDriver.SetMaskBuilder(&oBuilder);
///     oDriver.Run(&oReader, &oWriter);
///
/// Errors   kor::Exception "You have to Set the values before calling Process."; what FilterClr
///          throws.
/// Threads  one at a time. Copies share the filter.
class CLRAlgorithm
{
public:
    virtual ~CLRAlgorithm() = default;

    /// Makes a new filter with these values, see details::ClrParams::SetValues.
    void SetValues(std::vector<double> vdfValues);
    /// Says which pixels are cleared; borrowed. Null, as at first: all.
    void SetMaskBuilder(tessel::IMaskBuilder* poBuilder) { mpoMaskBuilder = poBuilder; }
    tessel::IMaskBuilder* GetMaskBuilder() const { return mpoMaskBuilder; }

    /// Clears a block by the builder's mask of its input. Without an input there is no mask.
    void ProcessBlock(tessel::Raster* poRasterIn, tessel::Raster* poRasterOut) const;
    /// The same by a mask of the caller's.
    void Process(tessel::Raster* poRasterIn, tessel::Mask* poMask,
                 tessel::Raster* poRasterOut) const;

private:
    std::shared_ptr<FilterClr> mpoFilter;
    tessel::IMaskBuilder* mpoMaskBuilder = nullptr;
};

}  // namespace kor::filters
