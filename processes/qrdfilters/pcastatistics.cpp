#include <algorithm>
#include <cmath>
#include <cstring>
#include <memory>
#include <span>
#include <utility>
#include <vector>

#include "basic/core/typedispatch/extendtypedispatch.h"
#include "platform/datasources/basicreader.h"
#include "platform/datasources/bitmapmaskbuilder.h"
#include "platform/datasources/datasetmanager.h"
#include "platform/exception/exception.h"
#include "processes/qrdfilters/filteringmaskbuilder.h"
#include "processes/qrdfilters/filterpca.h"
#include "processes/qrdfilters/findbyte.h"
#include "processes/qrdfilters/kernels/covariancesums.h"
#include "processes/qrdfilters/samplerows.h"
#include "processes/qrdfilters/statistics/checkedvector.h"
#include "processes/qrdfilters/statistics/eigensystem.h"

namespace kor::filters
{

using tessel::Mask;
using tessel::Raster;

namespace
{

constexpr const char* kSource = "processes/qrdfilters/filterpca";

/// Sums of samples and products, fed with runs of pixels of any type.
class CovarianceSums
{
public:
    /// nType: position of the samples' element type in StandardTypeList. Starts from sums in the
    /// order of IStatsProcessor.
    CovarianceSums(std::size_t nType, std::size_t nChannels, const std::vector<double>& vdfSums,
                   const std::vector<double>& vdfProducts)
        : mnType(nType),
          mnChannels(nChannels),
          mnRow(kernels::CovarianceRow(nChannels)),
          mnMostPixels(
              std::max(kFewestPixels, kBufferSamples / std::max<std::size_t>(nChannels, 1))),
          mvdfSums((nChannels + 1) * mnRow),
          mvdfPixels(mnMostPixels * nChannels + kernels::kPixelPadding)
    {
        std::size_t k = 0;
        for (std::size_t i = 0; i < nChannels; ++i)
        {
            mvdfSums[i] = ElementOf(vdfSums, i);
            for (std::size_t j = i; j < nChannels; ++j)
            {
                mvdfSums[(1 + j) * mnRow + i] = ElementOf(vdfProducts, k++);
            }
        }
    }

    /// Adds nPixels pixels that lie one behind the other.
    void Add(const unsigned char* pPixels, std::size_t nPixelBytes, std::size_t nPixels)
    {
        while (nPixels > 0)
        {
            const std::size_t nTaken = std::min(nPixels, mnMostPixels - mnHeld);
            details::ConvertRow(mnType, typedispatch::ElementPosition<double>(), pPixels,
                                &mvdfPixels[mnHeld * mnChannels], nTaken * mnChannels);
            mnHeld += nTaken;
            pPixels += nTaken * nPixelBytes;
            nPixels -= nTaken;
            if (mnHeld == mnMostPixels)
            {
                AddHeld();
            }
        }
    }

    /// The sums after the last pixel.
    void Finish(std::vector<double>& vdfSums, std::vector<double>& vdfProducts)
    {
        AddHeld();
        std::size_t k = 0;
        for (std::size_t i = 0; i < mnChannels; ++i)
        {
            SetElement(vdfSums, i, mvdfSums[i]);
            for (std::size_t j = i; j < mnChannels; ++j)
            {
                SetElement(vdfProducts, k++, mvdfSums[(1 + j) * mnRow + i]);
            }
        }
    }

private:
    // As many doubles as stay in the first-level cache beside the sums of a tile; with very many
    // channels pixels enough that loading the sums is worth it.
    static constexpr std::size_t kBufferSamples = 2048;
    static constexpr std::size_t kFewestPixels = 16;

    void AddHeld()
    {
        kernels::AddPixels(mvdfPixels.data(), mnHeld, mnChannels, mvdfSums.data());
        mnHeld = 0;
    }

    std::size_t mnType;
    std::size_t mnChannels;
    std::size_t mnRow;
    std::size_t mnMostPixels;
    std::vector<double> mvdfSums;    ///< as AddPixels has them
    std::vector<double> mvdfPixels;  ///< waiting to be added
    std::size_t mnHeld = 0;
};

/// Adds a block. Returns the number of pixels that were added.
std::size_t AddBlock(const Raster& oRaster, const Mask* poMask, CovarianceSums& oSums)
{
    const std::size_t nWidth = oRaster.mnWidth;
    const std::size_t nPixelBytes = oRaster.mnChannels * oRaster.moDataType.GetSampleBytes();
    std::vector<unsigned char> vValid(nWidth, 1);
    std::size_t nAdded = 0;
    for (std::uint32_t y = 0; y < oRaster.mnHeight; ++y)
    {
        if (poMask != nullptr)
        {
            poMask->ExpandRow(0, y, vValid);
        }
        std::size_t nEnd = 0;
        for (std::size_t x = FindByte(vValid, 0, 1); x < nWidth; x = FindByte(vValid, nEnd, 1))
        {
            nEnd = FindByte(vValid, x, 0);
            oSums.Add(oRaster.GetPixel(static_cast<std::int64_t>(x), y), nPixelBytes, nEnd - x);
            nAdded += nEnd - x;
        }
    }
    return nAdded;
}

/// Blocks of some whole rows hold the pixels in the order of blocks of more: where a tile is as
/// wide as the image, no more of it has to be in memory than this.
void LimitTiles(datasources::IRasterReader& oReader)
{
    constexpr std::uint64_t kMostBytes = 1U << 24;
    const std::uint64_t nRowBytes = std::uint64_t{oReader.GetWidth()} * oReader.GetChannelCount() *
                                    oReader.GetDataType().GetSampleBytes();
    if (oReader.GetTileWidth() == oReader.GetWidth() &&
        nRowBytes * oReader.GetTileHeight() > kMostBytes)
    {
        const std::uint64_t nRows = std::max<std::uint64_t>(kMostBytes / nRowBytes, 1);
        oReader.SetTileSize(oReader.GetWidth(), static_cast<unsigned int>(nRows));
    }
}

void WriteMeans(const std::vector<double>& vdfSums, double dfCount, std::vector<float>& vfMeans)
{
    for (std::size_t i = 0; i < vdfSums.size(); ++i)
    {
        SetElement(vfMeans, i, static_cast<float>(vdfSums[i] / dfCount));
    }
}

void WriteCovariance(const std::vector<double>& vdfSums, const std::vector<double>& vdfProducts,
                     double dfCount, std::vector<float>& vfCovariance,
                     std::vector<float>& vfDeviations)
{
    const std::size_t nInputs = vdfSums.size();
    std::size_t k = 0;
    for (std::size_t i = 0; i < nInputs; ++i)
    {
        for (std::size_t j = i; j < nInputs; ++j)
        {
            const double dfMeans = (vdfSums[j] / dfCount) * (vdfSums[i] / dfCount);
            const auto fCovariance = static_cast<float>(vdfProducts[k++] / dfCount - dfMeans);
            SetElement(vfCovariance, i * nInputs + j, fCovariance);
            SetElement(vfCovariance, j * nInputs + i, fCovariance);
            if (i == j)
            {
                const double dfVariance = fCovariance;
                SetElement(vfDeviations, i,
                           static_cast<float>(dfVariance > 0.0 ? std::sqrt(dfVariance) : 0.0));
            }
        }
    }
}

}  // namespace

template <class T>
class PCAStatistics::InnerStatsProcessor : public IStatsProcessor
{
public:
    void Process(Raster* poRaster, Mask* poMask, std::vector<double>& vdfSums,
                 std::vector<double>& vdfProducts, long& nCount) const override
    {
        CovarianceSums oSums(typedispatch::ElementPosition<T>(), poRaster->mnChannels, vdfSums,
                             vdfProducts);
        nCount += static_cast<long>(AddBlock(*poRaster, poMask, oSums));
        oSums.Finish(vdfSums, vdfProducts);
    }
};

PCAStatistics::PCAStatistics(std::string& oFile, std::vector<unsigned int> oWindow,
                             std::vector<unsigned int> oInputs, std::vector<unsigned int> oOutputs,
                             std::vector<unsigned int> oEigens)
    : moFileName(oFile),
      mvnWindow(std::move(oWindow)),
      mvnInputs(std::move(oInputs)),
      mvnOutputs(std::move(oOutputs)),
      mvnEigens(std::move(oEigens)),
      mnInputs(static_cast<int>(mvnInputs.size())),
      mnOutputs(static_cast<int>(mvnOutputs.size()))
{
}

void PCAStatistics::SetSegMask(int nSignature, int nBitmap)
{
    mnSignature = nSignature;
    mnBitmap = nBitmap;
}

PCAStatistics::IStatsProcessor* PCAStatistics::MakeStatsProcessor(const tessel::DataType& oType)
{
    using Factory = typedispatch::Factory1Template<InnerStatsProcessor, IStatsProcessor>;
    using List = typedispatch::StandardTypeList;
    using End = typedispatch::typeconv::priv::NullDataType;
    return typedispatch::ExtendDispatchTypes<Factory, 1, List, List, End>::Dispatch({oType}, false);
}

std::unique_ptr<tessel::IMaskBuilder> PCAStatistics::MakeSelector(
    datasources::IBitmapDataset* poBitmaps) const
{
    if (mnBitmap != 0)
    {
        return std::make_unique<datasources::BitmapMaskBuilder>(
            poBitmaps, static_cast<unsigned int>(mnBitmap), false);
    }
    if (mvnWindow.size() == 4)
    {
        return std::make_unique<FilteringMaskBuilder>(
            std::vector<int>(mvnWindow.begin(), mvnWindow.end()), std::vector<float>(),
            std::vector<float>());
    }
    return nullptr;
}

void PCAStatistics::GetRasterStats(std::vector<float>& oCovariance, std::vector<float>& oMeans,
                                   std::vector<float>& oDeviations)
{
    const std::unique_ptr<datasources::IDataset> poDataset(
        datasources::DatasetManager::GetInstance()->Open(moFileName, 0));
    datasources::BasicReader oReader(poDataset.get(), mvnInputs);
    auto* const poBitmaps = dynamic_cast<datasources::IBitmapDataset*>(poDataset.get());
    if (mnBitmap != 0 && poBitmaps == nullptr)
    {
        throw Exception("This dataset doesn't support bitmap segment", kSource, __PRETTY_FUNCTION__,
                        __LINE__);
    }
    const std::unique_ptr<tessel::IMaskBuilder> poSelector = MakeSelector(poBitmaps);

    mnSampleSize = 0;
    const auto nInputs = static_cast<std::size_t>(mnInputs);
    std::vector<double> vdfSums(nInputs);
    std::vector<double> vdfProducts(nInputs * (nInputs + 1) / 2);
    const std::unique_ptr<IStatsProcessor> poProcessor(MakeStatsProcessor(oReader.GetDataType()));
    LimitTiles(oReader);
    const datasources::RasterIterator itEnd = oReader.End();
    for (datasources::RasterIterator it = oReader.Begin(); it != itEnd; ++it)
    {
        const std::unique_ptr<Raster> poRaster(*it);
        const std::unique_ptr<Mask> poMask(poSelector ? poSelector->BuildMask(*poRaster) : nullptr);
        poProcessor->Process(poRaster.get(), poMask.get(), vdfSums, vdfProducts, mnSampleSize);
    }
    const auto dfCount = static_cast<double>(mnSampleSize);
    WriteMeans(vdfSums, dfCount, oMeans);
    WriteCovariance(vdfSums, vdfProducts, dfCount, oCovariance, oDeviations);
}

void PCAStatistics::ComputeEigen(int n, std::vector<float>& oMatrix,
                                 std::vector<float>& oEigenvalues)
{
    const auto nSize = static_cast<std::size_t>(std::max(n, 0));
    std::vector<float> vfMatrix(nSize * nSize);
    std::copy_n(oMatrix.begin(), std::min(oMatrix.size(), vfMatrix.size()), vfMatrix.begin());
    std::vector<float> vfValues(nSize);
    SolveEigensystem(nSize, vfMatrix, vfValues);
    std::copy_n(vfMatrix.begin(), std::min(oMatrix.size(), vfMatrix.size()), oMatrix.begin());
    std::copy_n(vfValues.begin(), std::min(oEigenvalues.size(), nSize), oEigenvalues.begin());
}

void PCAStatistics::GetEigenStats(std::vector<float> oEigenvalues, std::vector<float>& oDeviations,
                                  std::vector<float>& oVariance)
{
    float fTotal = 0.0F;
    for (const float fValue : oEigenvalues)
    {
        fTotal += std::fabs(fValue);
    }
    for (std::size_t i = 0; i < oEigenvalues.size(); ++i)
    {
        SetElement(oDeviations, i, std::sqrt(std::fabs(oEigenvalues[i])));
        SetElement(oVariance, i, oEigenvalues[i] / fTotal * 100.0F);
    }
}

}  // namespace kor::filters
