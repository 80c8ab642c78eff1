#include "examples/filterfile/principalcomponents.h"

#include <cmath>
#include <limits>
#include <numeric>
#include <stdexcept>

#include "platform/ledger/report.h"

namespace kor::examples
{

PrincipalComponents::PrincipalComponents(Arguments& oArguments, std::size_t nChannels)
{
    const int nMost = static_cast<int>(nChannels);
    mvnComponents.resize(
        static_cast<std::size_t>(oArguments.TakeInteger("components", nMost, 1, nMost)));
    std::iota(mvnComponents.begin(), mvnComponents.end(), 1U);
    mfDeviations = static_cast<float>(oArguments.TakeNumber("deviations", 3.0, 0.01, 1000.0));
    TakeWindow(oArguments);
    mnBitmap = oArguments.TakeInteger("bitmap", 0, 1, std::numeric_limits<int>::max());
}

void PrincipalComponents::TakeWindow(Arguments& oArguments)
{
    const std::vector<double> vdfWindow = oArguments.TakeNumbers("window");
    for (const double df : vdfWindow)
    {
        const bool bPixels =
            df >= 0 && df <= std::numeric_limits<int>::max() / 2 && df == std::floor(df);
        if (vdfWindow.size() != 4 || !bPixels)
        {
            throw Arguments::Refusal("window", oArguments.TakeText("window", ""),
                                     "x,y,width,height in pixels");
        }
        mvnWindow.push_back(static_cast<unsigned int>(df));
    }
}

void PrincipalComponents::Analyse(const SourceImage& oImage, const tessel::DataType& oOut)
{
    const std::size_t n = oImage.mvnChannels.size();
    for (std::vector<float>* pvf :
         {&mvfMeans, &mvfDeviations, &mvfValues, &mvfValueDeviations, &mvfVariance})
    {
        pvf->resize(n);
    }
    mvfCovariance.resize(n * n);
    std::string oFile = oImage.moFile;
    moStatistics.emplace(oFile, mvnWindow, oImage.mvnChannels, mvnComponents, mvnComponents);
    moStatistics->SetSegMask(0, mnBitmap);
    moStatistics->GetRasterStats(mvfCovariance, mvfMeans, mvfDeviations);
    for (const float fMean : mvfMeans)
    {
        if (!std::isfinite(fMean))
        {
            throw std::runtime_error(oFile +
                                     ": the sample has no mean: it is empty, or not all of its "
                                     "values are finite");
        }
    }
    mvfVectors = mvfCovariance;
    moStatistics->ComputeEigen(static_cast<int>(n), mvfVectors, mvfValues);
    moStatistics->GetEigenStats(mvfValues, mvfValueDeviations, mvfVariance);
    ChooseScaling(oOut);
}

void PrincipalComponents::ChooseScaling(const tessel::DataType& oOut)
{
    const bool bWhole = !oOut.mbFloat;
    const float fHalf = (std::exp2(static_cast<float>(oOut.mnBits)) - 1.0F) / 2.0F;
    const float fMiddle = oOut.mbSigned ? -0.5F : fHalf;
    for (std::size_t k = 0; k < mvnComponents.size(); ++k)
    {
        const float fEnd = mfDeviations * mvfValueDeviations[k];
        const float fScale = fEnd > 0.0F ? fHalf / fEnd : 0.0F;
        mvfRange.push_back(bWhole ? mfDeviations : 0.0F);
        mvfMidPoint.push_back(bWhole ? fMiddle : 0.0F);
        mvfScale.push_back(bWhole ? fScale : 1.0F);
    }
}

filters::FilterPCA PrincipalComponents::GetFilter() const
{
    filters::FilterPCA oFilter;
    oFilter.SetCovMat(mvfVectors);
    oFilter.SetMeans(mvfMeans);
    oFilter.SetEigen(mvnComponents);
    oFilter.SetScale(mvfScale);
    oFilter.SetMidPoint(mvfMidPoint);
    return oFilter;
}

void PrincipalComponents::Print(const char* pszMode) const
{
    const filters::PCAAlgorithm oExtremes;
    moStatistics->GetPCAPrint(pszMode, mvfCovariance, mvfMeans, mvfMidPoint, mvfRange,
                              mvfDeviations, mvfVectors, mvfValues, mvfVariance, mvfValueDeviations,
                              mvfScale, oExtremes.GetMinVal(), oExtremes.GetMaxVal());
}

datasources::AuxiliaryData PrincipalComponents::Describe() const
{
    datasources::AuxiliaryData oData;
    for (const unsigned int nComponent : mvnComponents)
    {
        oData.SetChannelDescription(
            ledger::FormatString("Principal component %u, %.2f %% of the variance", nComponent,
                                 double{mvfVariance[nComponent - 1]}),
            nComponent);
    }
    return oData;
}

}  // namespace kor::examples
