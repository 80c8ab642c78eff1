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
};

/// What filter_file can do: one line here for each filter.
struct FilterEntry
{
    std::string_view moName;
    std::string_view moSummary;
    /// Its own parameters, one a line: "key=DEFAULT  meaning".
    std::string_view moParameters;
    /// oIn tells the channels that the filter will see, and their type.
    PreparedFilter (*mpfnMake)(Arguments& oArguments, const tessel::RasterInfo& oIn);
};

std::span<const FilterEntry> GetFilters();
/// Throws UsageError that lists the filters when there is none of this name.
const FilterEntry& FindFilter(std::string_view oName);

}  // namespace kor::examples
