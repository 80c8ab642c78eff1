#pragma once

#include <limits>
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

/// Parameters of FilterARI, each a list of which fixed elements count; a missing one is 0. They
/// count for processors made later, see FilterARI.
class ARIParams
{
public:
    virtual ~ARIParams() = default;

    /// [0]: the constant.
    void SetConst(std::vector<float> vfConst) { mvfConst = std::move(vfConst); }
    /// [0]: result where the divisor is (almost) zero.
    void SetZeroDiv(std::vector<float> vfZeroDiv) { mvfZeroDiv = std::move(vfZeroDiv); }
    /// [0] and [1]: lowest and highest result; [2] and [3]: what these are scaled to.
    void SetRVal(std::vector<float> vfRVal) { mvfRVal = std::move(vfRVal); }
    /// [0]: 1 add, 2 subtract, 3 multiply, 4 divide, 5 and, 6 or.
    void SetOper(std::vector<unsigned int> vnOper) { mvnOper = std::move(vnOper); }
    /// [0]: 2 statistics run, 3 scale by the range values, others neither.
    void SetAutoScale(std::vector<unsigned int> vnScale) { mvnAutoScale = std::move(vnScale); }

protected:
    std::vector<float> mvfConst;
    std::vector<float> mvfZeroDiv;
    std::vector<float> mvfRVal;
    std::vector<unsigned int> mvnOper;
    std::vector<unsigned int> mvnAutoScale;
};

/// Extremes of the results seen so far.
class ARIStats
{
public:
    virtual ~ARIStats() = default;

    /// The greatest finite float as long as nothing was seen.
    float GetARIMin() const { return mfMin; }
    /// The lowest finite float as long as nothing was seen.
    float GetARIMax() const { return mfMax; }

protected:
    void SetARIStats(float fMin, float fMax) const
    {
        mfMin = fMin;
        mfMax = fMax;
    }

private:
    mutable float mfMin = std::numeric_limits<float>::max();
    mutable float mfMax = std::numeric_limits<float>::lowest();
};

}  // namespace details

/// Channel arithmetic: one expression over the first two channels, or over one and a constant c.
///
///     Oper   one channel   two or more channels
///      1     c + x0        x1 + x0 + c
///      2     x0 - c        x0 - x1 - c
///      3     c * x0        x1 * x0              without the constant, which is meant
///      4     x0 / c        x0 / x1              the same
///      5     c & x0        x1 & x0              bits of the integers that both are cut to
///      6     c | x0        x1 | x0
/// All is single precision, from left to right. A value that 32 bits cannot hold is cut to -2^31.
///
/// Input    any of the ten real types, or a complex one, which is seen as its magnitude. Channels
///          behind the second are ignored.
/// Output   any of the ten real types, same width and height; the results are stored by the
///          library's conversion rules, in the first channel. Margins are not written.
/// Scaling  AutoScale 2, the statistics run: the output is the input's first channel, converted,
///          while the extremes of the results are collected. AutoScale 3: with RVal {min, max, low,
///          high} results become (v - min) * factor + low, cut at low and high; factor is
///          (high - low) / (max - min), or 1 where max is not above min.
/// Mask     may be null. It has the geometry of the input. Where its bit is cleared the output
///          keeps what it holds.
/// Corners  a divisor from -1e-9f to 1e-9f gives ZeroDiv, which is not scaled and not counted. An
///          unknown operator evaluates nothing and reports nothing: all pixels get 0, or with
///          scaling the former pixel's result scaled once more.
/// Errors   kor::Exception "poRasterIn is invalid pointer", "poRasterOut is invalid pointer",
///          "Output cannot be complex for ARI", "Invalid type requested." (eDT_BIT), all before
///          anything is written; in hardened builds also for blocks whose geometries do not match.
/// Threads  works on the calling thread. One object must not be called by two threads at once.
/// State    the processor of the last pair of types is kept, and copies of the filter share it.
///          Parameters count when it is made; extremes add up over blocks as long as it lives.
class FilterARI : public details::ARIParams,
                  public details::ARIStats,
                  private ProcessorCache<IProcessor>
{
public:
    template <class TIn, class TOut>
    class InnerProcessor;

    void Process(tessel::Raster* poRasterIn, tessel::Mask* poMaskIn,
                 tessel::Raster* poRasterOut) const;
};

/// FilterARI as an algorithm, for the block driver and for loops over blocks of one's own. To scale
/// a whole image to 0 to 255, run it twice:
///
///     FilterIODriver<ARIAlgorithm> oDriver;
///     oDriver.SetValues({4}, {}, {0.0F}, {2}, {});
///     oDriver.Run(&oReader, nullptr);
///     oDriver.SetValues({4}, {}, {0.0F}, {3},
///                       {oDriver.GetMinVal(), oDriver.GetMaxVal(), 0.0F, 255.0F});
///     oDriver.Run(&oReader, &oWriter);
///
/// Masks    pixels that the builder masks keep what the output block holds. The driver uses the
///          memory of blocks again: let it preload them (SetPreloadOutput) when there is a builder.
/// Errors   kor::Exception "You have to Set the values before calling Process."; what FilterARI
///          throws.
/// Threads  one at a time. Copies share the filter.
class ARIAlgorithm
{
public:
    virtual ~ARIAlgorithm() = default;

    /// Makes a new filter with these values, see details::ARIParams. Its extremes start afresh.
    void SetValues(std::vector<unsigned int> vnOper, std::vector<float> vfConst,
                   std::vector<float> vfZeroDiv, std::vector<unsigned int> vnAutoScale,
                   std::vector<float> vfRVal);
    /// Says which pixels are evaluated; borrowed. Null, as at first: all.
    void SetMaskBuilder(tessel::IMaskBuilder* poBuilder) { mpoMaskBuilder = poBuilder; }
    tessel::IMaskBuilder* GetMaskBuilder() const { return mpoMaskBuilder; }

    /// Works on a block with the builder's mask of its input.
    void ProcessBlock(tessel::Raster* poRasterIn, tessel::Raster* poRasterOut) const;
    /// The same with a mask of the caller's.
    void Process(tessel::Raster* poRasterIn, tessel::Mask* poMaskIn,
                 tessel::Raster* poRasterOut) const;

    /// Extremes of the results since SetValues; those of details::ARIStats before it.
    float GetMinVal() const;
    float GetMaxVal() const;

private:
    std::shared_ptr<FilterARI> mpoFilter;
    tessel::IMaskBuilder* mpoMaskBuilder = nullptr;
};

}  // namespace kor::filters
