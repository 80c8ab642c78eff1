#include "processes/qrdfilters/filterpca.h"

#include <algorithm>
#include <mutex>
#include <span>

#include "basic/core/typedispatch/extendtypedispatch.h"
#include "platform/exception/exception.h"
#include "processes/qrdfilters/blockcontract.h"
#include "processes/qrdfilters/kernels/projectpixels.h"
#include "processes/qrdfilters/samplerows.h"
#include "processes/qrdfilters/statistics/checkedvector.h"

namespace kor::filters
{

using tessel::Mask;
using tessel::Raster;

namespace
{

constexpr const char* kSource = "processes/qrdfilters/filterpca";

/// Least and greatest values by output channel, common to all filters. They start at 0, and so do
/// those of a block, which come in as a whole: a block needs the lock once.
class CommonExtremes
{
public:
    static CommonExtremes& Get()
    {
        static CommonExtremes oInstance;
        return oInstance;
    }

    void Append(std::size_t nOutputs)
    {
        const std::lock_guard oLock(moMutex);
        mvfLowest.resize(mvfLowest.size() + nOutputs, 0.0F);
        mvfHighest.resize(mvfHighest.size() + nOutputs, 0.0F);
    }
    void Include(std::span<const float> oLowest, std::span<const float> oHighest)
    {
        const std::lock_guard oLock(moMutex);
        for (std::size_t k = 0; k < std::min(oLowest.size(), mvfLowest.size()); ++k)
        {
            mvfLowest[k] = std::min(mvfLowest[k], oLowest[k]);
            mvfHighest[k] = std::max(mvfHighest[k], oHighest[k]);
        }
    }
    std::vector<float> GetLowest() const
    {
        const std::lock_guard oLock(moMutex);
        return mvfLowest;
    }
    std::vector<float> GetHighest() const
    {
        const std::lock_guard oLock(moMutex);
        return mvfHighest;
    }

private:
    mutable std::mutex moMutex;
    std::vector<float> mvfLowest;
    std::vector<float> mvfHighest;
};

/// Parameters in the form that the kernel takes, for blocks of given channels.
struct PaddedProjection
{
    PaddedProjection(std::size_t nChannels, std::size_t nOutputs)
        : mvfWeights(nChannels * kernels::PadOutputs(nOutputs)),
          mvfScale(kernels::PadOutputs(nOutputs)),
          mvfMidPoint(mvfScale.size()),
          mvfLowest(mvfScale.size()),
          mvfHighest(mvfScale.size()),
          moKernel{nChannels,          nOutputs,         mvfWeights.data(), mvfScale.data(),
                   mvfMidPoint.data(), mvfLowest.data(), mvfHighest.data()}
    {
    }
    PaddedProjection(const PaddedProjection&) = delete;
    PaddedProjection& operator=(const PaddedProjection&) = delete;

    std::vector<float> mvfWeights;
    std::vector<float> mvfScale;
    std::vector<float> mvfMidPoint;
    std::vector<float> mvfLowest;
    std::vector<float> mvfHighest;
    kernels::Projection moKernel;
};

/// All of a processor but the names of its types, which are positions in StandardTypeList here.
class ProjectionProcessor : public IProcessor, public details::PCAParams
{
public:
    void Process(Raster* poRasterIn, Mask* poMaskIn, Raster* poRasterOut) const override;

protected:
    ProjectionProcessor(std::size_t nIn, std::size_t nOut) : mnIn(nIn), mnOut(nOut) {}

private:
    void FillProjection(PaddedProjection& oProjection) const;

    std::size_t mnIn;
    std::size_t mnOut;
};

void ProjectionProcessor::FillProjection(PaddedProjection& oProjection) const
{
    const std::size_t nChannels = oProjection.moKernel.mnChannels;
    for (std::size_t k = 0; k < oProjection.moKernel.mnOutputs; ++k)
    {
        oProjection.mvfScale[k] = ElementOf(mvfScale, k);
        oProjection.mvfMidPoint[k] = ElementOf(mvfMidPoint, k);
        // Component 0 lies in front of the matrix: its index wraps, and so is outside as well.
        const std::size_t nFirst = (std::size_t{ElementOf(mvnEigen, k)} - 1) * nChannels;
        for (std::size_t c = 0; c < nChannels; ++c)
        {
            oProjection.mvfWeights[c * oProjection.mvfScale.size() + k] =
                ElementOf(mvfCovMat, nFirst + c);
        }
    }
}

void ProjectionProcessor::Process(Raster* poRasterIn, Mask* /*poMaskIn*/, Raster* poRasterOut) const
{
    RequireSameSize(*poRasterIn, *poRasterOut, kSource);
    const std::size_t nChannels = poRasterIn->mnChannels;
    const std::size_t nOutputs = poRasterOut->mnChannels;
    PaddedProjection oProjection(nChannels, nOutputs);
    FillProjection(oProjection);

    constexpr std::size_t kFloat = typedispatch::ElementPosition<float>();
    constexpr std::size_t kBufferSamples = 4096;  // stay in the first-level cache
    const std::size_t nMostPixels =
        std::max<std::size_t>(kBufferSamples / std::max<std::size_t>(nChannels + nOutputs, 1), 1);
    std::vector<float> vfMeans(nMostPixels * nChannels);
    for (std::size_t i = 0; i < vfMeans.size(); ++i)
    {
        vfMeans[i] = ElementOf(mvfMeans, i % nChannels);
    }
    std::vector<float> vfIn(vfMeans.size());
    std::vector<float> vfOut(nMostPixels * nOutputs + kernels::kOutputPadding);
    for (std::uint32_t y = 0; y < poRasterIn->mnHeight; ++y)
    {
        for (std::size_t x = 0; x < poRasterIn->mnWidth; x += nMostPixels)
        {
            const std::size_t nPixels = std::min(nMostPixels, poRasterIn->mnWidth - x);
            const auto nX = static_cast<std::int64_t>(x);
            details::ConvertRow(mnIn, kFloat, poRasterIn->GetPixel(nX, y), vfIn.data(),
                                nPixels * nChannels);
            kernels::SubtractMeans(vfMeans.data(), {vfIn.data(), nPixels * nChannels});
            kernels::ProjectPixels(oProjection.moKernel, vfIn.data(), nPixels, vfOut.data());
            details::ConvertRow(kFloat, mnOut, vfOut.data(), poRasterOut->GetPixel(nX, y),
                                nPixels * nOutputs);
        }
    }
    CommonExtremes::Get().Include({oProjection.mvfLowest.data(), nOutputs},
                                  {oProjection.mvfHighest.data(), nOutputs});
}

}  // namespace

template <class TIn, class TOut>
class FilterPCA::InnerProcessor : public ProjectionProcessor
{
public:
    InnerProcessor()
        : ProjectionProcessor(typedispatch::ElementPosition<TIn>(),
                              typedispatch::ElementPosition<TOut>())
    {
    }
};

FilterPCA::FilterPCA(const FilterPCA& oOther) : details::PCAParams(oOther), ProcessorCache() {}

FilterPCA& FilterPCA::operator=(const FilterPCA& oOther)
{
    if (this != &oOther)
    {
        details::PCAParams::operator=(oOther);
        mpoProcessor.reset();
    }
    return *this;
}

void FilterPCA::Process(Raster* poRasterIn, Mask* poMaskIn, Raster* poRasterOut) const
{
    RequireRasters(poRasterIn, poRasterOut, kSource);

    using Factory = typedispatch::Factory2Template<InnerProcessor, IProcessor>;
    bool bMade = false;
    const auto oMake = [&bMade](const tessel::DataType& oIn, const tessel::DataType& oOut)
    {
        IProcessor* const poMade = typedispatch::DispatchTypePair<Factory>(oIn, oOut, false);
        bMade = true;
        return poMade;
    };
    const IProcessor& oProcessor = SelectProcessor<details::PCAParams>(
        poRasterIn->moDataType, poRasterOut->moDataType, *this, oMake);
    if (bMade)
    {
        CommonExtremes::Get().Append(poRasterOut->mnChannels);
    }
    oProcessor.Process(poRasterIn, poMaskIn, poRasterOut);
}

void PCAAlgorithm::SetValues(std::vector<float> oCovMat, std::vector<float> oScale,
                             std::vector<unsigned int> oEigen, std::vector<float> oMidPoint,
                             std::vector<float> oMeans)
{
    mpoFilter = std::make_shared<FilterPCA>();
    mpoFilter->SetCovMat(std::move(oCovMat));
    mpoFilter->SetScale(std::move(oScale));
    mpoFilter->SetEigen(std::move(oEigen));
    mpoFilter->SetMidPoint(std::move(oMidPoint));
    mpoFilter->SetMeans(std::move(oMeans));
}

void PCAAlgorithm::ProcessBlock(Raster* poRasterIn, Raster* poRasterOut) const
{
    if (mpoFilter == nullptr)
    {
        throw Exception("You have to Set the values before calling Process.", kSource,
                        __PRETTY_FUNCTION__, __LINE__);
    }
    mpoFilter->Process(poRasterIn, nullptr, poRasterOut);
}

std::vector<float> PCAAlgorithm::GetMinVal() const
{
    return CommonExtremes::Get().GetLowest();
}

std::vector<float> PCAAlgorithm::GetMaxVal() const
{
    return CommonExtremes::Get().GetHighest();
}

}  // namespace kor::filters
