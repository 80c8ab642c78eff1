#include <limits>
#include <string>
#include <vector>

#include "examples/filterfile/filtertable.h"
#include "processes/qrdfilters/filterfefrost.h"
#include "processes/qrdfilters/filterfelee.h"
#include "processes/qrdfilters/filterffrost.h"
#include "processes/qrdfilters/filterfle.h"
#include "processes/qrdfilters/filtergamma.h"
#include "processes/qrdfilters/filterkuan.h"
#include "processes/qrdfilters/filtersartex.h"
#include "processes/qrdfilters/filtertouzi.h"

namespace kor::examples
{

namespace
{

using parallelio::FilterAlgorithm;
using tessel::RasterInfo;

constexpr double kMost = std::numeric_limits<double>::max();

double TakeLooks(Arguments& oArguments)
{
    return oArguments.TakeNumber("looks", 1.0, std::numeric_limits<double>::min(), kMost);
}

double TakeDamping(Arguments& oArguments)
{
    return oArguments.TakeNumber("damping", 1.0, 0.0, kMost);
}

PreparedFilter MakeFrost(Arguments& oArguments, const RasterInfo& /*oIn*/)
{
    filters::FilterFfrost oFilter;
    oFilter.SetDamp(TakeDamping(oArguments));
    oFilter.SetBGZero(TakeZeroBackground(oArguments));
    return {FilterAlgorithm(oFilter, TakeWindow(oArguments))};
}

PreparedFilter MakeEnhancedFrost(Arguments& oArguments, const RasterInfo& /*oIn*/)
{
    filters::FilterFefrost oFilter;
    oFilter.SetDamp(TakeDamping(oArguments));
    oFilter.SetNLOOK(TakeLooks(oArguments));
    oFilter.SetBGZero(TakeZeroBackground(oArguments));
    const filters::Window oWindow = TakeWindow(oArguments);
    // Without sizes it would weigh the pixels of half the window alone.
    oFilter.SetFilterSize(boost::optional<int>(static_cast<int>(oWindow.GetWidth())),
                          boost::optional<int>(static_cast<int>(oWindow.GetHeight())));
    return {FilterAlgorithm(oFilter, oWindow)};
}

PreparedFilter MakeLee(Arguments& oArguments, const RasterInfo& /*oIn*/)
{
    constexpr std::pair<std::string_view, const char*> kModels[] = {
        {"multiplicative", "MULT"}, {"additive", "ADDI"}, {"both", "BOTH"}};
    filters::FilterFle oFilter(TakeZeroBackground(oArguments));
    oFilter.SetNLook(TakeLooks(oArguments));
    oFilter.SetAddMean(oArguments.TakeNumber("addmean", 0.0, -kMost, kMost));
    oFilter.SetMulMean(
        oArguments.TakeNumber("mulmean", 1.0, std::numeric_limits<double>::min(), kMost));
    oFilter.SetNoise(oArguments.TakeChoice<const char*>("noise", "multiplicative", kModels));
    oFilter.SetNoiseVar(oArguments.TakeNumbers("noisevar"));
    const double dfThreshold = oArguments.TakeNumber("threshold", 0.0, -kMost, kMost);
    oFilter.SetThrVar(dfThreshold);
    PreparedFilter oPrepared = {FilterAlgorithm(oFilter, TakeWindow(oArguments))};
    oPrepared.mbNeedsMask = dfThreshold != 0.0;  // the enhanced path counts masked-in pixels alone
    return oPrepared;
}

PreparedFilter MakeEnhancedLee(Arguments& oArguments, const RasterInfo& /*oIn*/)
{
    filters::FilterFelee oFilter;
    oFilter.SetDamp(TakeDamping(oArguments));
    oFilter.SetNLook(TakeLooks(oArguments));
    oFilter.SetBGZero(TakeZeroBackground(oArguments));
    return {FilterAlgorithm(oFilter, TakeWindow(oArguments))};
}

PreparedFilter MakeKuan(Arguments& oArguments, const RasterInfo& /*oIn*/)
{
    filters::FilterKuan oFilter(TakeZeroBackground(oArguments));
    oFilter.SetLook(TakeLooks(oArguments));
    return {FilterAlgorithm(oFilter, TakeWindow(oArguments))};
}

PreparedFilter MakeGamma(Arguments& oArguments, const RasterInfo& /*oIn*/)
{
    filters::FilterGamma oFilter(TakeLooks(oArguments), filters::eGF_Intensity);
    oFilter.SetBGZero(TakeZeroBackground(oArguments));
    return {FilterAlgorithm(oFilter, TakeWindow(oArguments))};
}

PreparedFilter MakeTouzi(Arguments& oArguments, const RasterInfo& /*oIn*/)
{
    // Meant for amplitudes; what else there is, it converts by itself.
    constexpr std::pair<std::string_view, int> kValues[] = {
        {"amplitude", 0}, {"intensity", 1}, {"decibel", 2}};
    filters::FilterTouzi oFilter(TakeLooks(oArguments),
                                 oArguments.TakeNumber("contour", 0.5, 0.0, kMost), 0.5,
                                 oArguments.TakeNumber("gradient", 0.1, 0.0, kMost));
    oFilter.SetAmplit(oArguments.TakeChoice<int>("values", "intensity", kValues));
    oFilter.SetBGZero(TakeZeroBackground(oArguments));
    return {FilterAlgorithm(oFilter, TakeWindow(oArguments))};
}

PreparedFilter MakeTexture(Arguments& oArguments, const RasterInfo& oIn)
{
    if (oIn.mnChannels != 1)
    {
        throw UsageError("texture takes one channel; choose one by channels=");
    }
    std::vector<filters::SarTextureType> veTextures;
    for (const unsigned int nMeasure : oArguments.TakeRanges("measures", 4))
    {
        veTextures.push_back(static_cast<filters::SarTextureType>(nMeasure));
    }
    if (veTextures.empty())
    {
        veTextures = {filters::eSarIntensityVariation, filters::eSarAmplitudeVariation,
                      filters::eSarLogVariance, filters::eSarLogMeanRatio};
    }
    const filters::Window oWindow = TakeWindow(oArguments);
    filters::FilterSartex oFilter;
    oFilter.SetTextures(veTextures);
    oFilter.SetFilterSizeX(static_cast<unsigned int>(oWindow.GetWidth()));
    oFilter.SetFilterSizeY(static_cast<unsigned int>(oWindow.GetHeight()));
    PreparedFilter oPrepared = {FilterAlgorithm(oFilter, oWindow)};
    oPrepared.mnChannels = static_cast<std::uint32_t>(veTextures.size());
    return oPrepared;
}

}  // namespace

std::span<const FilterEntry> GetRadarFilters()
{
    static constexpr FilterEntry kFilters[] = {
        {"frost", "weights that fall with distance, faster where the image varies",
         "window=7          pixels, odd; 7x5 is 7 wide and 5 high\n"
         "damping=1         0 is the plain mean; more keeps edges, and speckle\n"
         "background=input  masked pixels: input (kept) or zero\n",
         MakeFrost},
        {"enhanced_frost", "mean, Frost or pixel, by the local variation",
         "window=7          pixels, odd; 7x5 is 7 wide and 5 high\n"
         "looks=1           of the image, above 0\n"
         "damping=1         0 or more\n"
         "background=input  masked pixels: input (kept) or zero\n",
         MakeEnhancedFrost},
        {"lee", "the mean, and a share of the pixel's deviation from it",
         "window=7          pixels, odd; 7x5 is 7 wide and 5 high\n"
         "noise=multiplicative, additive or both\n"
         "looks=1           of the image: its noise variance is 1 / looks\n"
         "noisevar=         the noise variance itself\n"
         "mulmean=1         mean of the multiplicative noise, above 0\n"
         "addmean=0         mean of the additive noise, with noise=both\n"
         "threshold=0       variance from which the enhanced path looks for edges, in windows of 7 "
         "or "
         "9\n"
         "                  pixels; 0 is the regular path\n"
         "background=input  masked pixels: input (kept) or zero\n",
         MakeLee},
        {"enhanced_lee", "mean, weighted pixel or pixel, by the local variation",
         "window=7          pixels, odd; 7x5 is 7 wide and 5 high\n"
         "looks=1           of the image, above 0\n"
         "damping=1         0 or more\n"
         "background=input  masked pixels: input (kept) or zero\n",
         MakeEnhancedLee},
        {"kuan", "weighted mean of pixel and window by a linear model",
         "window=7          pixels, odd; 7x5 is 7 wide and 5 high\n"
         "looks=1           of the image, above 0\n"
         "background=input  masked pixels: input (kept) or zero\n",
         MakeKuan},
        {"gamma", "the most probable value under gamma speckle and texture (MAP)",
         "window=7          pixels, odd; 7x5 is 7 wide and 5 high\n"
         "looks=1           of the image, above 0\n"
         "background=input  masked pixels: input (kept) or zero\n",
         MakeGamma},
        {"touzi", "means of areas that grow between lines and edges",
         "window=7          pixels, odd: the largest area that grows\n"
         "looks=1           of the image, above 0\n"
         "values=intensity  of the image: amplitude, intensity or decibel\n"
         "contour=0.5       ratio of means below which there is a line or an edge\n"
         "gradient=0.1      most change of the variation while an area grows\n"
         "background=input  masked pixels: input (kept) or zero\n",
         MakeTouzi},
        {"texture", "texture measures of one channel, one output channel each, 64R",
         "window=7          pixels, odd, from 3 to 101\n"
         "measures=1-4      1 intensity variation, 2 amplitude variation, 3 variance of the log,\n"
         "                  4 mean of the log over log of the mean\n",
         MakeTexture},
    };
    return kFilters;
}

}  // namespace kor::examples
