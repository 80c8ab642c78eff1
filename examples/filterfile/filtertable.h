#pragma once

#include <cstdint>
#include <optional>
#include <span>
#include <string_view>

#include "basic/tessel/raster/raster.h"
#include "examples/filterfile/arguments.h"
#include "processes/qrdfilters/parallelio/filteralgorithm.h"

namespace kor::examples
{

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

/// Half of "window".
filters::Window TakeWindow(Arguments& oArguments, std::uint32_t nDefault = 7);
/// True where masked pixels become 0.
bool TakeZeroBackground(Arguments& oArguments);
/// Floating point as deep as the input: for results that are no image values.
tessel::DataType FloatFor(const tessel::RasterInfo& oIn);

}  // namespace kor::examples
