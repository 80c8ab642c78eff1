#include "examples/filterfile/classvalues.h"

#include <algorithm>
#include <limits>
#include <memory>
#include <stdexcept>

#include "examples/filterfile/names.h"
#include "platform/datasources/datasetmanager.h"
#include "platform/datasources/irasterdataset.h"

namespace kor::examples
{

namespace
{

using tessel::DataType;

constexpr int kMostInt = std::numeric_limits<int>::max();

/// The library gives a table of zeros for other pairs, without a word.
void RequireServedTypes(const DataType& oValues, const DataType& oClasses)
{
    constexpr DataType kServed[] = {tessel::eDT_8U, tessel::eDT_16U, tessel::eDT_16S,
                                    tessel::eDT_32R};
    const auto oServes = [&](const DataType& oType)
    { return std::find(std::begin(kServed), std::end(kServed), oType) != std::end(kServed); };
    if (!oServes(oValues) || !oServes(oClasses) ||
        (oValues == tessel::eDT_8U && oClasses == tessel::eDT_16U))
    {
        throw std::runtime_error("values of type " + TypeName(oValues) +
                                 " cannot be found in classes of type " + TypeName(oClasses) +
                                 "; both can be 8U, 16U, 16S or 32R, but classes not 16U with "
                                 "values of 8U");
    }
}

}  // namespace

ClassValues::ClassValues(Arguments& oArguments)
{
    constexpr std::pair<std::string_view, unsigned int> kModes[] = {{"mean", 0U}, {"mode", 1U}};
    mnValueChannel = static_cast<unsigned int>(oArguments.TakeInteger("values", 1, 1, kMostInt));
    mnMode = oArguments.TakeChoice<unsigned int>("find", "mean", kModes);
    mfThreshold = static_cast<float>(oArguments.TakeNumber("threshold", 0, 0, 1));
    mnDefault = oArguments.TakeInteger("default", 0, std::numeric_limits<int>::min(), kMostInt);
}

filters::FilterHOM ClassValues::Find(std::string oFile, unsigned int nClassChannel) const
{
    const std::unique_ptr<datasources::IDataset> poDataset(
        datasources::DatasetManager::GetInstance()->Open(oFile, 0));
    const auto& oImage = dynamic_cast<const datasources::IRasterDataset&>(*poDataset);
    if (mnValueChannel > oImage.GetChannelCount())
    {
        throw Arguments::Refusal("values", std::to_string(mnValueChannel),
                                 "numbers from 1 to " + std::to_string(oImage.GetChannelCount()));
    }
    RequireServedTypes(oImage.GetChannelType(mnValueChannel), oImage.GetChannelType(nClassChannel));
    filters::HOMStatistics oStatistics(oFile, {mnValueChannel}, {nClassChannel}, {}, {mnMode},
                                       {mfThreshold}, {mnDefault});
    oStatistics.GetRasterStats();
    filters::FilterHOM oFilter;
    oFilter.SetMeanMode(oStatistics.GetMeanMode());
    return oFilter;
}

}  // namespace kor::examples
