#pragma once

#include <cstdint>
#include <functional>
#include <optional>
#include <span>
#include <string>
#include <string_view>
#include <vector>

#include "basic/tessel/raster/raster.h"
#include "examples/filterfile/arguments.h"
#include "platform/datasources/irasterreader.h"
#include "processes/qrdfilters/parallelio/filteralgorithm.h"

namespace kor::examples
{

/// The image in its file, for filters that look at all of it before they begin.
struct SourceImage
{
    std::string moFile;
    std::vector<unsigned int> mvnChannels;  ///< in the order in which the filter sees them
};

/// What a filter can ask for that has to know the whole image before it works on blocks of it.
class IFirstLook
{
public:
    virtual ~IFirstLook() = default;
    virtual const SourceImage& GetImage() const = 0;
    /// The type that results are stored as.
    virtual tessel::DataType GetOutputType() const = 0;
    /// The image in tiles that are small enough to be read one by one.
    virtual datasources::IRasterReader& GetReader() = 0;
    /// Says which pixels are valid; null: all.
    virtual tessel::IMaskBuilder* GetMaskBuilder() = 0;
    /// Runs all blocks through the filter and drops the results.
    virtual void RunFilter() = 0;
};

/// A filter with its parameters, ready to run.
struct PreparedFilter
{
    parallelio::FilterAlgorithm moAlgorithm;
    /// Channels of the result; none: as many as the input has.
    std::optional<std::uint32_t> mnChannels = std::nullopt;
    /// What results are stored as unless the user says otherwise; none: the input's type.
    std::optional<tessel::DataType> moType = std::nullopt;
    /// True: there has to be a mask, if all pixels are valid.
    bool mbNeedsMask = false;
    /// True: what the input says about its channels does not hold for those of the result.
    bool mbNewChannels = false;
    /// Called before the first block.
    std::function<void(IFirstLook& oLook)> mfnLook = nullptr;
    /// What masked pixels become, where the output is to name it as its no-data value.
    std::optional<double> mdfNoData = std::nullopt;
};

/// A filter as filter_file knows it.
struct FilterEntry
{
    std::string_view moName;
    std::string_view moSummary;
    /// Its own parameters, one a line: "key=DEFAULT  meaning".
    std::string_view moParameters;
    /// oIn tells the channels that the filter will see, and their type.
    PreparedFilter (*mpfnMake)(Arguments& oArguments, const tessel::RasterInfo& oIn);
};

struct FilterGroup
{
    std::string_view moTitle;
    std::span<const FilterEntry> moFilters;
};

/// What filter_file can do. The groups' files hold one line for each filter.
std::span<const FilterGroup> GetFilterGroups();
/// Throws UsageError that lists the filters when there is none of this name.
const FilterEntry& FindFilter(std::string_view oName);

std::span<const FilterEntry> GetSpatialFilters();
std::span<const FilterEntry> GetRadarFilters();
std::span<const FilterEntry> GetTransformFilters();
std::span<const FilterEntry> GetStatisticsFilters();

/// Half of "window".
filters::Window TakeWindow(Arguments& oArguments, std::uint32_t nDefault = 7);
/// True where masked pixels become 0.
bool TakeZeroBackground(Arguments& oArguments);
/// Floating point as deep as the input: for results that are no image values.
tessel::DataType FloatFor(const tessel::RasterInfo& oIn);

}  // namespace kor::examples
