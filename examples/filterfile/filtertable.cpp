#include "examples/filterfile/filtertable.h"

#include <string>

#include "processes/qrdfilters/filteraverage.h"
#include "processes/qrdfilters/filtermedian.h"

namespace kor::examples
{

namespace
{

using parallelio::FilterAlgorithm;
using tessel::RasterInfo;

/// "background": what becomes of masked pixels. True where they become 0.
bool TakeZeroBackground(Arguments& oArguments)
{
    static constexpr std::pair<std::string_view, bool> kChoices[] = {{"input", false},
                                                                     {"zero", true}};
    return oArguments.TakeChoice<bool>("background", "input", kChoices);
}

filters::Window TakeWindow(Arguments& oArguments, std::uint32_t nDefault)
{
    const auto [nWidth, nHeight] = oArguments.TakeWindow("window", nDefault);
    return {nWidth / 2, nHeight / 2};
}

PreparedFilter MakeAverage(Arguments& oArguments, const RasterInfo& /*oIn*/)
{
    const filters::FilterAverage oFilter(TakeZeroBackground(oArguments));
    return {FilterAlgorithm(oFilter, TakeWindow(oArguments, 7))};
}

PreparedFilter MakeMedian(Arguments& oArguments, const RasterInfo& /*oIn*/)
{
    filters::FilterMedian oFilter;
    oFilter.SetBGZero(TakeZeroBackground(oArguments));
    return {FilterAlgorithm(oFilter, TakeWindow(oArguments, 3))};
}

constexpr FilterEntry kFilters[] = {
    {"average", "mean of the window",
     "window=7          pixels, odd; 7x5 is 7 wide and 5 high\n"
     "background=input  masked pixels: input (kept) or zero\n",
     MakeAverage},
    {"median", "median of the window",
     "window=3          pixels, odd; 7x5 is 7 wide and 5 high\n"
     "background=input  masked pixels: input (kept) or zero\n",
     MakeMedian},
};

}  // namespace

std::span<const FilterEntry> GetFilters()
{
    return kFilters;
}

const FilterEntry& FindFilter(std::string_view oName)
{
    std::string oNames;
    for (const FilterEntry& oFilter : kFilters)
    {
        if (oFilter.moName == oName)
        {
            return oFilter;
        }
        oNames.append(" ").append(oFilter.moName);
    }
    throw UsageError("there is no filter \"" + std::string(oName) + "\"; there are" + oNames);
}

}  // namespace kor::examples
