#include <algorithm>
#include <limits>
#include <string>
#include <vector>

#include "examples/filterfile/filtertable.h"
#include "platform/exception/exception.h"
#include "processes/qrdfilters/filteraverage.h"
#include "processes/qrdfilters/filtercustom.h"
#include "processes/qrdfilters/filteredge.h"
#include "processes/qrdfilters/filtergauss.h"
#include "processes/qrdfilters/filterlaplacian.h"
#include "processes/qrdfilters/filtermedian.h"
#include "processes/qrdfilters/filtermode.h"
#include "processes/qrdfilters/filternoise.h"
#include "processes/qrdfilters/filterprewitt.h"
#include "processes/qrdfilters/filtersharp.h"
#include "processes/qrdfilters/filtersobel.h"
#include "processes/qrdfilters/filterstddeviation.h"

namespace kor::examples
{

namespace
{

using filters::Window;
using parallelio::FilterAlgorithm;
using tessel::RasterInfo;

constexpr double kMost = std::numeric_limits<double>::max();
constexpr Window kThreeByThree = {1, 1};

double TakeFactor(Arguments& oArguments)
{
    return oArguments.TakeNumber("factor", 1.0, -kMost, kMost);
}

PreparedFilter MakeAverage(Arguments& oArguments, const RasterInfo& /*oIn*/)
{
    const filters::FilterAverage oFilter(TakeZeroBackground(oArguments));
    return {FilterAlgorithm(oFilter, TakeWindow(oArguments))};
}

PreparedFilter MakeMedian(Arguments& oArguments, const RasterInfo& /*oIn*/)
{
    filters::FilterMedian oFilter;
    oFilter.SetBGZero(TakeZeroBackground(oArguments));
    return {FilterAlgorithm(oFilter, TakeWindow(oArguments))};
}

PreparedFilter MakeMode(Arguments& oArguments, const RasterInfo& /*oIn*/)
{
    std::vector<float> vfKeep;
    for (const double dfValue : oArguments.TakeNumbers("keep"))
    {
        vfKeep.push_back(static_cast<float>(dfValue));
    }
    const bool bThinLine = oArguments.TakeFlag("thinline", false);
    filters::FilterMode oFilter(vfKeep, bThinLine);
    oFilter.SetBGZero(TakeZeroBackground(oArguments));
    return {FilterAlgorithm(oFilter, TakeWindow(oArguments, 3))};
}

PreparedFilter MakeGauss(Arguments& oArguments, const RasterInfo& oIn)
{
    constexpr double kHighest = 32.0;
    const double dfFirst = oArguments.TakeNumber("variance", 2.0, 1.0, kHighest);
    const double dfSecond = oArguments.TakeNumber("variance2", 0.0, 0.0, kHighest);
    filters::FilterGauss oFilter;
    try
    {
        oFilter.SetSigma(dfFirst, dfSecond);
    }
    catch (const ParameterException& oError)
    {
        throw UsageError(oError.what());
    }
    oFilter.SetBGZero(TakeZeroBackground(oArguments));
    const auto nHalf = static_cast<std::uint32_t>(std::max(dfFirst, dfSecond));
    PreparedFilter oPrepared = {FilterAlgorithm(oFilter, Window{nHalf, nHalf})};
    if (dfSecond != 0.0)
    {
        oPrepared.moType = FloatFor(oIn);
    }
    return oPrepared;
}

PreparedFilter MakeCustom(Arguments& oArguments, const RasterInfo& /*oIn*/)
{
    const auto [nWidth, nHeight] = oArguments.TakeWindow("size", 3);
    const std::vector<double> vdfKernel = oArguments.TakeNumbers("kernel");
    if (vdfKernel.size() != std::size_t{nWidth} * nHeight)
    {
        throw UsageError("kernel takes " + std::to_string(nWidth * nHeight) +
                         " numbers for size=" + std::to_string(nWidth) + "x" +
                         std::to_string(nHeight) + ", not " + std::to_string(vdfKernel.size()));
    }
    filters::FilterCustom oFilter;
    oFilter.SetKernel(vdfKernel, nWidth, nHeight);
    if (oArguments.TakeFlag("normalise", false))
    {
        oFilter.ApplyWeight();
    }
    oFilter.SetBGZero(TakeZeroBackground(oArguments));
    return {FilterAlgorithm(oFilter, Window{nWidth / 2, nHeight / 2})};
}

PreparedFilter MakeEdge(Arguments& oArguments, const RasterInfo& oIn)
{
    const filters::FilterEdge oFilter(TakeFactor(oArguments));
    PreparedFilter oPrepared = {FilterAlgorithm(oFilter, TakeWindow(oArguments, 3))};
    oPrepared.moType = FloatFor(oIn);
    return oPrepared;
}

template <class Filter>
PreparedFilter MakeGradient(Arguments& oArguments, const RasterInfo& oIn)
{
    Filter oFilter;
    oFilter.SetFactor(TakeFactor(oArguments));
    oFilter.SetBGZero(TakeZeroBackground(oArguments));
    PreparedFilter oPrepared = {FilterAlgorithm(oFilter, kThreeByThree)};
    oPrepared.moType = FloatFor(oIn);
    return oPrepared;
}

PreparedFilter MakeSharp(Arguments& oArguments, const RasterInfo& /*oIn*/)
{
    const Window oWindow = TakeWindow(oArguments, 3);
    if (oWindow.mnHalfX == 0 && oWindow.mnHalfY == 0)
    {
        throw UsageError("window=1 cannot be used; sharp takes more than one pixel");
    }
    filters::FilterSharp oFilter;
    oFilter.SetBGZero(TakeZeroBackground(oArguments));
    return {FilterAlgorithm(oFilter, oWindow)};
}

PreparedFilter MakeLaplacian(Arguments& oArguments, const RasterInfo& /*oIn*/)
{
    return {FilterAlgorithm(filters::FilterLaplacian(), TakeWindow(oArguments, 3))};
}

PreparedFilter MakeDeviation(Arguments& oArguments, const RasterInfo& oIn)
{
    PreparedFilter oPrepared = {
        FilterAlgorithm(filters::FilterStdDeviation(), TakeWindow(oArguments))};
    oPrepared.moType = FloatFor(oIn);
    return oPrepared;
}

PreparedFilter MakeNoise(Arguments& oArguments, const RasterInfo& /*oIn*/)
{
    filters::FilterNoise oFilter;
    oFilter.SetFailValue(oArguments.TakeNumber("fail", 0.0, -kMost, kMost));
    oFilter.SetBGZero(TakeZeroBackground(oArguments));
    return {FilterAlgorithm(oFilter, TakeWindow(oArguments))};
}

}  // namespace

std::span<const FilterEntry> GetSpatialFilters()
{
    static constexpr FilterEntry kFilters[] = {
        {"average", "mean of the window",
         "window=7          pixels, odd; 7x5 is 7 wide and 5 high\n"
         "background=input  masked pixels: input (kept) or zero\n",
         MakeAverage},
        {"median", "median of the window",
         "window=7          pixels, odd; 7x5 is 7 wide and 5 high\n"
         "background=input  masked pixels: input (kept) or zero\n",
         MakeMedian},
        {"mode", "most frequent value of the window, for class images",
         "window=3          pixels, odd; 7x5 is 7 wide and 5 high\n"
         "keep=             values that stay as they are, separated by commas\n"
         "thinline=no       yes: windows of 3 x 3 that keep thin lines\n"
         "background=input  masked pixels: input (kept) or zero\n",
         MakeMode},
        {"gauss", "weighted mean under a Gaussian, or the difference of two",
         "variance=2        sigma squared, in pixels squared, 1 to 32; its whole number is also "
         "the\n"
         "                  half size of the window\n"
         "variance2=0       of a second Gaussian, 1 to 32: the result is the absolute difference\n"
         "background=input  masked pixels: input (kept) or zero\n",
         MakeGauss},
        {"custom", "correlation with a kernel of your own",
         "size=3            of the kernel, odd; 5x3 is 5 wide and 3 high\n"
         "kernel=           its weights, row by row, separated by commas\n"
         "normalise=no      yes: the weights are divided by their sum\n"
         "background=input  masked pixels: input (kept) or zero\n",
         MakeCustom},
        {"edge", "mean absolute difference from the pixels around",
         "window=3          pixels, odd; 7x5 is 7 wide and 5 high\n"
         "factor=1          multiplier of the result\n",
         MakeEdge},
        {"sobel", "strength of the gradient by the kernels of Sobel",
         "factor=1          multiplier of the result\n"
         "background=input  masked pixels: input (kept) or zero\n",
         MakeGradient<filters::FilterSobel>},
        {"prewitt", "strength of the gradient by the kernels of Prewitt",
         "factor=1          multiplier of the result\n"
         "background=input  masked pixels: input (kept) or zero\n",
         MakeGradient<filters::FilterPrewitt>},
        {"sharp", "twice the pixel minus the mean of the window",
         "window=3          pixels, odd, more than one; 7x5 is 7 wide and 5 high\n"
         "background=input  masked pixels: input (kept) or zero\n",
         MakeSharp},
        {"laplacian", "the pixel minus the mean of the window, as 64R",
         "window=3          pixels, odd; 7x5 is 7 wide and 5 high\n", MakeLaplacian},
        {"deviation", "standard deviation of the window",
         "window=7          pixels, odd; 7x5 is 7 wide and 5 high\n", MakeDeviation},
        {"noise", "mean of the window, and a mark where the pixel stands out from it",
         "window=7          pixels, odd; 7x5 is 7 wide and 5 high\n"
         "fail=0            the mark, for pixels farther than 1.7 deviations from the mean\n"
         "background=input  masked pixels: input (kept) or zero\n",
         MakeNoise},
    };
    return kFilters;
}

}  // namespace kor::examples
