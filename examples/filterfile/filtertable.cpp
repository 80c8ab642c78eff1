#include "examples/filterfile/filtertable.h"

#include <string>

namespace kor::examples
{

std::span<const FilterGroup> GetFilterGroups()
{
    static const FilterGroup kGroups[] = {
        {"Spatial filters", GetSpatialFilters()},
        {"Radar filters", GetRadarFilters()},
        {"Transforms", GetTransformFilters()},
        {"Transforms by the statistics of the image", GetStatisticsFilters()},
    };
    return kGroups;
}

const FilterEntry& FindFilter(std::string_view oName)
{
    std::string oNames;
    for (const FilterGroup& oGroup : GetFilterGroups())
    {
        for (const FilterEntry& oFilter : oGroup.moFilters)
        {
            if (oFilter.moName == oName)
            {
                return oFilter;
            }
            oNames.append(" ").append(oFilter.moName);
        }
    }
    throw UsageError("there is no filter \"" + std::string(oName) + "\"; there are" + oNames);
}

filters::Window TakeWindow(Arguments& oArguments, std::uint32_t nDefault)
{
    const auto [nWidth, nHeight] = oArguments.TakeWindow("window", nDefault);
    return {nWidth / 2, nHeight / 2};
}

bool TakeZeroBackground(Arguments& oArguments)
{
    static constexpr std::pair<std::string_view, bool> kChoices[] = {{"input", false},
                                                                     {"zero", true}};
    return oArguments.TakeChoice<bool>("background", "input", kChoices);
}

tessel::DataType FloatFor(const tessel::RasterInfo& oIn)
{
    return oIn.moDataType.mnBits > 16 && oIn.moDataType != tessel::eDT_32R ? tessel::eDT_64R
                                                                           : tessel::eDT_32R;
}

}  // namespace kor::examples
