#pragma once

#include <memory>
#include <string>
#include <utility>
#include <vector>

#include "basic/core/typedispatch/typedispatch.h"
#include "basic/tessel/mask/mask.h"
#include "basic/tessel/raster/raster.h"
#include "processes/qrdfilters/iprocessor.h"
#include "processes/qrdfilters/typedfilter.h"

namespace kor::datasources
{
class IRasterReader;
}

/// Homogenises an image by classes: one value for all pixels of a class. First the statistics find
/// it, from a channel of values and a channel of classes; then the filter puts it in the place of
/// the classes.
///
///     HOMStatistics oStatistics(oFile, {1}, {2}, {}, {0}, {0.0F}, {0});
///     oStatistics.GetRasterStats();
///     oFilter.SetMeanMode(oStatistics.GetMeanMode());
///     oFilter.Process(&oClasses, nullptr, &oOut);
namespace kor::filters
{

/// Mean or mode of the values of each class, as a table by class.
///
///     mean   table[c] = int(sum / n + 0.5),  sum and quotient in float, the addition in double
///     mode   table[c] = the value met most often, the lowest of equal ones; the default value
///            where its share n[value] / n is below the threshold
/// over the n pixels of class c. A class without a pixel keeps 0.
///
/// Classes  the sample, as an index: floating point is cut, integers are taken as 16-bit unsigned
///          numbers. Values are themselves in the mean, and such indices in the mode.
/// Sizes    256 classes (values) for eDT_8U, 32767 for eDT_16S, 65536 for all other types. Indices
///          outside are left out; of a class inside, they count in n. Meant: the search for the
///          mode ends at the number of classes, not of values.
/// Types    values of eDT_32R, eDT_16U or eDT_16S with classes of eDT_8U, eDT_32R, eDT_16U or
///          eDT_16S, and values of eDT_8U with classes of eDT_8U, eDT_32R or eDT_16S. Meant: others
///          give a table of zeros without a message. Of several channels the first one counts.
/// Corners  the table is not cleared: each GetRasterStats appends its zeros, and its values go to
///          the entries at the front. A mean that no int can hold is the nearest int, one that is
///          not a number 0. A vector without its first element counts as 0 there.
/// Memory   in mode mode up to 22 bytes for each value that a class has, and 100 at least for a
///          class that the image has.
/// Errors   what opening and reading throw; kor::Exception when memory for the counters is short.
/// Threads  works on the calling thread. One object must not be called by two threads at once.
class HOMStatistics
{
public:
    /// oValues, oClasses: channel numbers from 1. oOthers is kept and not used. oCalcMode: 0 mean,
    /// 1 mode, any other value nothing. oThreshold: share from 0 to 1. oDefault: the value for
    /// classes whose mode is too weak. Of the last three the first element counts.
    HOMStatistics(std::string& oFile, std::vector<unsigned int> oValues,
                  std::vector<unsigned int> oClasses, std::vector<unsigned int> oOthers,
                  std::vector<unsigned int> oCalcMode, std::vector<float> oThreshold,
                  std::vector<int> oDefault);

    void GetRasterStats();
    std::vector<int> GetMeanMode() const { return mvMeanMode; }
    void SetMeanMode(std::vector<int> oMeanMode) { mvMeanMode = std::move(oMeanMode); }

private:
    void FillTable(datasources::IRasterReader& oValues, datasources::IRasterReader& oClasses);

    std::string moFileName;
    std::vector<unsigned int> mvValueChannels;
    std::vector<unsigned int> mvClassChannels;
    std::vector<unsigned int> mvOtherChannels;
    std::vector<unsigned int> mvCalcMode;
    std::vector<int> mvDefault;
    std::vector<float> mvThreshold;
    std::vector<int> mvMeanMode;
};

namespace details
{

/// Parameters of FilterHOM. They count for processors made later, see there.
class HOMParams
{
public:
    virtual ~HOMParams() = default;

    /// The table by class.
    void SetMeanMode(std::vector<int> oMeanMode) { mvMeanMode = std::move(oMeanMode); }

protected:
    std::vector<int> mvMeanMode;
};

}  // namespace details

/// Puts a value from a table in the place of each sample.
///
///     out = table[int(in)]
///
/// Input    any of the ten real types; the sample is cut to an int, of a wider integer type its low
///          32 bits. Of several channels, and of the parts of a complex sample, the first one
///          counts.
/// Output   any of the ten real types, same width and height. Floating point takes the value.
///          Integers take value + 0.5, cut, and clamped to the type's range; meant: -3 gives -2. Of
///          several channels the first one is written, of complex samples its real part. Margins
///          are not written.
/// Masks    poMask has no effect: every pixel is mapped.
/// Corners  an index outside the table, as of a negative sample, gives 0. Without channels the
///          input reads 0.
/// Errors   kor::Exception "poRasterIn is invalid pointer", "poRasterOut is invalid pointer",
///          "Invalid type to dispatch." (eDT_BIT), all before anything is written; in hardened
///          builds also for blocks of different sizes.
/// Threads  works on the calling thread. Two threads may call one object at once after it has
///          worked on the same pair of types.
/// State    the processor of the last pair of types is kept, with its table, and copies of the
///          filter share it: another table counts when the types change.
class FilterHOM : public details::HOMParams, private ProcessorCache<IProcessor>
{
public:
    template <class TIn, class TOut>
    class InnerProcessor;

    /// Makes the processors for the dispatch by type.
    struct HOMCreationPolicy
    {
        template <class TIn, class TOut>
        static IProcessor* Create();
    };

    void Process(tessel::Raster* poRasterIn, tessel::Mask* poMask,
                 tessel::Raster* poRasterOut) const;
};

/// FilterHOM as an algorithm for the block loop of a caller.
///
/// Errors   kor::Exception "You have to Set the values before calling Process."; those of
///          FilterHOM.
/// Threads  as of FilterHOM. Copies share the filter.
class HOMAlgorithm
{
public:
    /// Starts anew with this table.
    void SetValues(std::vector<int> oMeanMode);
    void ProcessBlock(tessel::Raster* poRasterIn, tessel::Raster* poRasterOut) const;

private:
    std::shared_ptr<FilterHOM> mpoFilter;
};

}  // namespace kor::filters
