#include <memory>
#include <string>

#include "examples/filterfile/classvalues.h"
#include "examples/filterfile/filtertable.h"
#include "examples/filterfile/principalcomponents.h"

namespace kor::examples
{

namespace
{

using parallelio::FilterAlgorithm;
using tessel::RasterInfo;

/// A filter that is known only after the look at the image.
template <class Filter>
class LaterFilter
{
public:
    void Process(tessel::Raster* poIn, tessel::Mask* poMask, tessel::Raster* poOut) const
    {
        mpoFilter->Process(poIn, poMask, poOut);
    }
    void Set(Filter oFilter) const { *mpoFilter = std::move(oFilter); }

private:
    std::shared_ptr<Filter> mpoFilter = std::make_shared<Filter>();
};

PreparedFilter MakePca(Arguments& oArguments, const RasterInfo& oIn)
{
    const auto poComponents = std::make_shared<PrincipalComponents>(oArguments, oIn.mnChannels);
    const LaterFilter<filters::FilterPCA> oFilter;
    PreparedFilter oPrepared = {FilterAlgorithm(oFilter)};
    oPrepared.mnChannels = static_cast<std::uint32_t>(poComponents->GetCount());
    oPrepared.moType = tessel::eDT_32R;
    oPrepared.mbNewChannels = true;
    oPrepared.mfnLook = [=](IFirstLook& oLook)
    {
        poComponents->Analyse(oLook.GetImage(), oLook.GetOutputType());
        oFilter.Set(poComponents->GetFilter());
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
    const LaterFilter<filters::FilterHOM> oFilter;
    PreparedFilter oPrepared = {FilterAlgorithm(oFilter)};
    oPrepared.moType = tessel::eDT_32S;
    oPrepared.mbNewChannels = true;
    oPrepared.mfnLook = [oFilter, oValues = ClassValues(oArguments)](IFirstLook& oLook)
    {
        const SourceImage& oImage = oLook.GetImage();
        oFilter.Set(oValues.Find(oImage.moFile, oImage.mvnChannels[0]));
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
