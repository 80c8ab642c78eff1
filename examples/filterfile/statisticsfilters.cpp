#include <memory>
#include <string>

#include "examples/filterfile/classvalues.h"
#include "examples/filterfile/filtertable.h"
#include "examples/filterfile/principalcomponents.h"
#include "examples/filterfile/sharedfilter.h"

namespace kor::examples
{

namespace
{

using parallelio::FilterAlgorithm;
using tessel::RasterInfo;

PreparedFilter MakePca(Arguments& oArguments, const RasterInfo& oIn)
{
    const auto poComponents = std::make_shared<PrincipalComponents>(oArguments, oIn.mnChannels);
    const auto poFilter = std::make_shared<filters::FilterPCA>();
    PreparedFilter oPrepared = {FilterAlgorithm(SharedFilter<filters::FilterPCA>(poFilter))};
    oPrepared.mnChannels = static_cast<std::uint32_t>(poComponents->GetCount());
    oPrepared.moType = tessel::eDT_32R;
    oPrepared.mbNewChannels = true;
    oPrepared.mfnLook = [=](IFirstLook& oLook)
    {
        poComponents->Analyse(oLook.GetImage(), oLook.GetOutputType());
        *poFilter = poComponents->GetFilter();
    };
    return oPrepared;
}

PreparedFilter MakeHomogenise(Arguments& oArguments, const RasterInfo& oIn)
{
    if (oIn.mnChannels != 1)
    {
        throw UsageError("homogenise takes one channel, of classes, such as channels=2; not " +
                         std::to_string(oIn.mnChannels));
    }
    const auto poFilter = std::make_shared<filters::FilterHOM>();
    PreparedFilter oPrepared = {FilterAlgorithm(SharedFilter<filters::FilterHOM>(poFilter))};
    oPrepared.moType = tessel::eDT_32S;
    oPrepared.mbNewChannels = true;
    oPrepared.mfnLook = [poFilter, oValues = ClassValues(oArguments)](IFirstLook& oLook)
    {
        const SourceImage& oImage = oLook.GetImage();
        *poFilter = oValues.Find(oImage.moFile, oImage.mvnChannels[0]);
    };
    return oPrepared;
}

}  // namespace

std::span<const FilterEntry> GetStatisticsFilters()
{
    static const FilterEntry kFilters[] = {
        {"pca", "principal components of all channels; pixels that masks leave out as well",
         PrincipalComponents::kParameters, MakePca},
        {"homogenise", "one value for each class: the mean or mode of another channel in it",
         ClassValues::kParameters, MakeHomogenise},
    };
    return kFilters;
}

}  // namespace kor::examples
