#include <array>
#include <limits>
#include <memory>
#include <string>
#include <vector>

#include "examples/filterfile/filtertable.h"
#include "examples/filterfile/sharedfilter.h"
#include "processes/qrdfilters/filterari.h"
#include "processes/qrdfilters/filterclr.h"
#include "processes/qrdfilters/filterhomogeneity.h"
#include "processes/qrdfilters/image2bit.h"

namespace kor::examples
{

namespace
{

using parallelio::FilterAlgorithm;
using tessel::Mask;
using tessel::Raster;
using tessel::RasterInfo;

constexpr double kMost = std::numeric_limits<float>::max();

/// "LOW,HIGH", the first below the second; empty without the key.
std::vector<float> TakeLimits(Arguments& oArguments, const std::string& oKey)
{
    const std::vector<double> vdfLimits = oArguments.TakeNumbers(oKey);
    if (!oArguments.Has(oKey))
    {
        return {};
    }
    if (vdfLimits.size() != 2 || !(vdfLimits[0] < vdfLimits[1]) || vdfLimits[0] < -kMost ||
        vdfLimits[1] > kMost)
    {
        throw Arguments::Refusal(oKey, oArguments.TakeText(oKey, ""),
                                 "two numbers, the lower one first, such as 0,255");
    }
    return {static_cast<float>(vdfLimits[0]), static_cast<float>(vdfLimits[1])};
}

/// Channel arithmetic with a value for the pixels that it leaves as they are.
class Arithmetic
{
public:
    Arithmetic(unsigned int nOperator, float fConstant, float fZeroDivision, double dfFill)
        : mnOperator(nOperator),
          mfConstant(fConstant),
          mfZeroDivision(fZeroDivision),
          moFill({dfFill})
    {
        Set(kPlain, {});
    }

    /// From now on results are only looked at.
    void CollectRange()
    {
        Set(kStatistics, {});
        mbDropsResults = true;
    }
    std::vector<float> GetRange() const
    {
        return {moArithmetic.GetMinVal(), moArithmetic.GetMaxVal()};
    }
    /// From now on results are scaled from one range to another.
    void Scale(std::vector<float> vfRange, const std::vector<float>& vfTo)
    {
        vfRange.insert(vfRange.end(), vfTo.begin(), vfTo.end());
        Set(kScaled, vfRange);
        mbDropsResults = false;
    }

    void Process(Raster* poRasterIn, Mask* poMask, Raster* poRasterOut) const
    {
        if (mbDropsResults)
        {
            Raster oDropped({poRasterIn->mnWidth, poRasterIn->mnHeight, 1, tessel::eDT_8U}, {});
            moArithmetic.Process(poRasterIn, poMask, &oDropped);
            return;
        }
        if (poMask != nullptr)
        {
            moFill.Process(nullptr, nullptr, poRasterOut);
        }
        moArithmetic.Process(poRasterIn, poMask, poRasterOut);
    }

private:
    static constexpr unsigned int kPlain = 0;
    static constexpr unsigned int kStatistics = 2;
    static constexpr unsigned int kScaled = 3;

    void Set(unsigned int nMode, std::vector<float> vfRange)
    {
        moArithmetic.SetValues({mnOperator}, {mfConstant}, {mfZeroDivision}, {nMode},
                               std::move(vfRange));
    }

    unsigned int mnOperator;
    float mfConstant;
    float mfZeroDivision;
    filters::FilterClr moFill;
    filters::ARIAlgorithm moArithmetic;
    bool mbDropsResults = false;
};

PreparedFilter MakeArithmetic(Arguments& oArguments, const RasterInfo& oIn)
{
    constexpr std::pair<std::string_view, unsigned int> kOperators[] = {
        {"add", 1}, {"subtract", 2}, {"multiply", 3}, {"divide", 4}, {"and", 5}, {"or", 6}};
    constexpr unsigned int kAnd = 5;
    if (oIn.mnChannels > 2)
    {
        throw UsageError("arithmetic takes one or two channels; choose them by channels=");
    }
    const auto nOperator = oArguments.TakeChoice<unsigned int>("operator", "", kOperators);
    const double dfConstant = oArguments.TakeNumber("constant", 0.0, -kMost, kMost);
    const double dfZeroDivision = oArguments.TakeNumber("zerodiv", 0.0, -kMost, kMost);
    const double dfFill = oArguments.TakeNumber("fill", 0.0, -kMost, kMost);
    const std::vector<float> vfScale = TakeLimits(oArguments, "scale");
    const std::vector<float> vfRange = TakeLimits(oArguments, "range");

    const auto poArithmetic = std::make_shared<Arithmetic>(
        nOperator, static_cast<float>(dfConstant), static_cast<float>(dfZeroDivision), dfFill);
    PreparedFilter oPrepared = {FilterAlgorithm(SharedFilter<Arithmetic>(poArithmetic))};
    oPrepared.mnChannels = 1;
    oPrepared.mbNewChannels = true;
    if (oArguments.Has("fill"))
    {
        oPrepared.mdfNoData = dfFill;
    }
    if (nOperator < kAnd || !vfScale.empty())
    {
        oPrepared.moType = tessel::eDT_32R;
    }
    if (vfScale.empty() && !vfRange.empty())
    {
        throw UsageError("range= says what is scaled; it needs scale=");
    }
    if (!vfRange.empty())
    {
        poArithmetic->Scale(vfRange, vfScale);
    }
    else if (!vfScale.empty())
    {
        oPrepared.mfnLook = [poArithmetic, vfScale](IFirstLook& oLook)
        {
            poArithmetic->CollectRange();
            oLook.RunFilter();
            poArithmetic->Scale(poArithmetic->GetRange(), vfScale);
        };
    }
    return oPrepared;
}

/// Clears what the mask leaves out, and keeps what is valid.
class ClearMasked
{
public:
    explicit ClearMasked(std::vector<double> vdfValues) : moClear(std::move(vdfValues)) {}

    void Process(Raster* poRasterIn, Mask* poMask, Raster* poRasterOut) const
    {
        const std::size_t nPixels =
            std::size_t{poRasterIn->mnTotalWidth} * poRasterIn->mnTotalHeight;
        std::vector<unsigned char> vMasked(nPixels);
        if (poMask != nullptr)
        {
            const std::unique_ptr<Raster> poValid(poMask->CreateRaster());
            for (std::size_t i = 0; i < nPixels; ++i)
            {
                vMasked[i] = poValid->mpBuffer[i] == 0 ? 1 : 0;
            }
        }
        Mask oMasked(*poRasterIn, *poRasterIn, vMasked.data(), false, false);
        moClear.Process(poRasterIn, &oMasked, poRasterOut);
    }

private:
    filters::FilterClr moClear;
};

PreparedFilter MakeClear(Arguments& oArguments, const RasterInfo& oIn)
{
    constexpr std::pair<std::string_view, bool> kPlaces[] = {{"valid", false}, {"masked", true}};
    const std::vector<double> vdfValues = oArguments.TakeNumbers("values");
    if (vdfValues.size() > oIn.mnChannels)
    {
        throw UsageError("values= has " + std::to_string(vdfValues.size()) + " numbers for " +
                         std::to_string(oIn.mnChannels) + " channels");
    }
    if (oArguments.TakeChoice<bool>("where", "valid", kPlaces))
    {
        return {FilterAlgorithm(ClearMasked(vdfValues))};
    }
    return {FilterAlgorithm(filters::FilterClr(vdfValues))};
}

PreparedFilter MakeHomogeneity(Arguments& oArguments, const RasterInfo& oIn)
{
    if (oIn.mnChannels != 1)
    {
        throw UsageError("homogeneity takes one channel; choose one by channels=");
    }
    const filters::Window oWindow = TakeWindow(oArguments);
    if (oWindow.mnHalfX != oWindow.mnHalfY)
    {
        throw Arguments::Refusal("window", oArguments.TakeText("window", ""),
                                 "one number: the window is square");
    }
    const auto poFilter = std::make_shared<filters::FilterHomogeneity>();
    poFilter->SetGrey(oArguments.TakeInteger("levels", 64, 1, 255));
    PreparedFilter oPrepared = {
        FilterAlgorithm(SharedFilter<filters::FilterHomogeneity>(poFilter), oWindow)};
    oPrepared.moType = tessel::eDT_32R;
    oPrepared.mbNewChannels = true;
    oPrepared.mfnLook = [poFilter](IFirstLook& oLook)
    {
        if (oLook.GetReader().GetDataType().mbComplex)
        {
            throw UsageError("homogeneity takes real samples, no complex ones");
        }
        poFilter->PrepareForGivenGreyLevel(&oLook.GetReader(), oLook.GetMaskBuilder(), nullptr);
    };
    return oPrepared;
}

PreparedFilter MakeThreshold(Arguments& oArguments, const RasterInfo& /*oIn*/)
{
    constexpr std::pair<std::string_view, bool> kSidesOfOne[] = {{"below", true}, {"above", false}};
    constexpr std::pair<std::string_view, bool> kSidesOfTwo[] = {{"outside", true},
                                                                 {"inside", false}};
    std::vector<float> vfThresholds;
    for (const double dfThreshold : oArguments.TakeNumbers("thresholds"))
    {
        vfThresholds.push_back(static_cast<float>(dfThreshold));
    }
    if (vfThresholds.empty() || vfThresholds.size() > 2)
    {
        throw UsageError("threshold needs thresholds=: one number, or two separated by a comma");
    }
    filters::ImageToBit oFilter;
    oFilter.SetThreshold(vfThresholds);
    oFilter.SetCompMode(vfThresholds.size() == 1
                            ? oArguments.TakeChoice<bool>("ones", "above", kSidesOfOne)
                            : oArguments.TakeChoice<bool>("ones", "inside", kSidesOfTwo));
    PreparedFilter oPrepared = {FilterAlgorithm(oFilter)};
    oPrepared.moType = tessel::eDT_8U;
    oPrepared.mbNewChannels = true;
    return oPrepared;
}

}  // namespace

std::span<const FilterEntry> GetTransformFilters()
{
    static constexpr FilterEntry kFilters[] = {
        {"arithmetic", "two channels, or one and a constant, combined into one, 32R",
         "operator=         add, subtract, multiply, divide, and, or: of the two channels given "
         "by\n"
         "                  channels=, or of one and the constant\n"
         "constant=0        of two channels only added to the sum or subtracted from the\n"
         "                  difference\n"
         "zerodiv=0         result where the divisor is (almost) zero; it is not scaled\n"
         "scale=            LOW,HIGH: the results are scaled to this range, such as 0,255\n"
         "range=            MIN,MAX: of the results, what is scaled; else all that there is,\n"
         "                  for which the image is read twice\n"
         "fill=             value of masked pixels, which the output then names as its no-data\n"
         "                  value; else 0\n",
         MakeArithmetic},
        {"clear", "a constant in all pixels, or only where a mask is set or not",
         "values=0          of the channels, separated by commas; the last one counts for the "
         "rest\n"
         "where=valid       pixels that become the constant: valid (all without a mask) or "
         "masked;\n"
         "                  the others keep their values\n",
         MakeClear},
        {"homogeneity", "likeness of neighbours in the window, 0 to 1, 32R",
         "window=7          pixels, odd, square\n"
         "levels=64         grey levels that the image's values are divided into, 1 to 255; for\n"
         "                  them the image is read twice before\n",
         MakeHomogeneity},
        {"threshold", "1 or 0 by one threshold or two, 8U",
         "thresholds=       one number, or two separated by a comma\n"
         "ones=             which samples become 1. One threshold: above (where it counts itself,\n"
         "                  as without this) or below. Two: inside (as without this) or outside,\n"
         "                  where both count themselves. Masked pixels are always 0\n",
         MakeThreshold},
    };
    return kFilters;
}

}  // namespace kor::examples
