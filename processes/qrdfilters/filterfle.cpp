#include "processes/qrdfilters/filterfle.h"

#include <algorithm>
#include <cctype>
#include <source_location>
#include <utility>

#include "platform/exception/exception.h"
#include "platform/system/translate.h"
#include "processes/qrdfilters/background.h"
#include "processes/qrdfilters/blockcontract.h"
#include "processes/qrdfilters/engine/momentrows.h"
#include "processes/qrdfilters/engine/subblocklee.h"

namespace kor::filters
{

namespace
{

constexpr const char* kSource = "processes/qrdfilters/filterfle";

using engine::LeeModel;

void RequireMargins(bool bHolds, const char* pszMessage,
                    const std::source_location& oWhere = std::source_location::current())
{
    if (!bHolds)
    {
        throw ParameterException("oRasterIn", ParameterException::Type::eInvalidValue, "", "",
                                 pszMessage, kSource, oWhere.function_name(), oWhere.line());
    }
}

/// The set size itself, not halved. Meant. See EnhancedPathTakesTheSizeAsHalfTheWindow.
int HalfOf(const WindowSize& nSize, std::uint32_t nMargin)
{
    return nSize.value_or(static_cast<int>(nMargin));
}

using FinishLee = void (*)(const kernels::MomentRows& oRows, const kernels::LeeNoise& oNoise,
                           std::span<double> vdfOut);

/// Null for a number that is no model.
FinishLee FinishOf(int nModel)
{
    switch (nModel)
    {
        case LeeModel::eLM_Additive:
            return kernels::LeeAdditiveRow;
        case LeeModel::eLM_Multiplicative:
            return kernels::LeeMultiplicativeRow;
        case LeeModel::eLM_Both:
            return kernels::LeeMixedRow;
        default:
            return nullptr;
    }
}

}  // namespace

FilterFle::FilterFle(bool bBGZero) : mbBGZero(bBGZero) {}

void FilterFle::SetAddMean(double dfAddMean)
{
    mdfAddMean = dfAddMean;
}

void FilterFle::SetMulMean(double dfMulMean)
{
    if (dfMulMean <= 0.0)
    {
        throw Exception(_("Multiplicative Mean must be greater than 0"), "", "", 0);
    }
    mdfMulMean = dfMulMean;
}

void FilterFle::SetNoise(std::string oNoise)
{
    std::transform(oNoise.begin(), oNoise.end(), oNoise.begin(),
                   [](unsigned char nLetter) { return static_cast<char>(std::toupper(nLetter)); });
    mnNoise = 0;
    constexpr std::pair<const char*, LeeModel> kModels[] = {
        {"ADDI", LeeModel::eLM_Additive},
        {"MULT", LeeModel::eLM_Multiplicative},
        {"BOTH", LeeModel::eLM_Both},
    };
    const auto* poModel = std::find_if(std::begin(kModels), std::end(kModels),
                                       [&](const auto& oModel) { return oNoise == oModel.first; });
    if (poModel == std::end(kModels))
    {
        throw ParameterException("NOISE", ParameterException::Type::eInvalidValue,
                                 std::move(oNoise), "ADDI/MULT/BOTH", "", "", "", 0);
    }
    mnNoise = poModel->second;
}

void FilterFle::SetNoiseVar(const std::vector<double>& oNoiseVar)
{
    if (!oNoiseVar.empty())
    {
        const bool bMultiplicative = mnNoise == LeeModel::eLM_Multiplicative;
        mdfNoiseVar =
            bMultiplicative ? oNoiseVar.front() / (mdfMulMean * mdfMulMean) : oNoiseVar.front();
    }
    else
    {
        mdfNoiseVar = mnNoise == LeeModel::eLM_Additive ? 1.0 : 1.0 / mdfNLook;
    }
}

void FilterFle::SetThrVar(double dfThrVar)
{
    mdfThrVar = dfThrVar;
}

void FilterFle::SetNLook(const double& dfNLook)
{
    mdfNLook = dfNLook;
}

void FilterFle::SetBGZero(bool bBGZero)
{
    mbBGZero = bBGZero;
}

void FilterFle::SetFilterSize(boost::optional<int> nSizeX, boost::optional<int> nSizeY)
{
    moFilterSizeX = nSizeX;
    moFilterSizeY = nSizeY;
}

void FilterFle::SetParameters(std::string oNoise, double dfAddMean, double dfMulMean,
                              double dfThrVar, const std::vector<double>& oNoiseVar, bool bBGZero)
{
    SetAddMean(dfAddMean);
    SetBGZero(bBGZero);
    SetMulMean(dfMulMean);
    SetNoise(std::move(oNoise));
    SetNoiseVar(oNoiseVar);
    SetThrVar(dfThrVar);
}

void FilterFle::Process(tessel::Raster* poRasterIn, tessel::Mask* poMaskIn,
                        tessel::Raster* poRasterOut, tessel::Mask* poMaskOut) const
{
    ProcessBlock(poRasterIn, poMaskIn, poRasterOut, poMaskOut);
}

void FilterFle::ProcessBlock(tessel::Raster* poRasterIn, tessel::Mask* poMaskIn,
                             tessel::Raster* poRasterOut, tessel::Mask* poMaskOut) const
{
    // The margin tells, even where a filter size is set.
    const std::uint32_t nMargin = poRasterIn->mnMarginX;
    if ((nMargin == 3 || nMargin == 4) && mdfThrVar != 0.0)
    {
        ProcessEnhancedBlock(poRasterIn, poMaskIn, poRasterOut, poMaskOut);
    }
    else
    {
        ProcessRegularBlock(poRasterIn, poMaskIn, poRasterOut, poMaskOut);
    }
}

void FilterFle::ProcessRegularBlock(tessel::Raster* poRasterIn, tessel::Mask* poMaskIn,
                                    tessel::Raster* poRasterOut, tessel::Mask* poMaskOut) const
{
    const FinishLee pfnFinish = FinishOf(mnNoise);
    if (pfnFinish == nullptr)
    {
        return;
    }
    const kernels::LeeNoise oNoise{mdfAddMean, mdfMulMean, mdfNoiseVar};
    engine::FilterByMoments(
        *poRasterIn, poMaskIn, WindowOfBothSizes(moFilterSizeX, moFilterSizeY, *poRasterIn),
        mbBGZero,
        [&](const kernels::MomentRows& oRows, std::span<double> vdfOut)
        { pfnFinish(oRows, oNoise, vdfOut); },
        *poRasterOut, poMaskOut);
}

void FilterFle::ProcessEnhancedBlock(tessel::Raster* poRasterIn, tessel::Mask* poMaskIn,
                                     tessel::Raster* poRasterOut, tessel::Mask* poMaskOut) const
{
    const int nHalfX = HalfOf(moFilterSizeX, poRasterIn->mnMarginX);
    const int nHalfY = HalfOf(moFilterSizeY, poRasterIn->mnMarginY);
    RequireMargins(nHalfX >= 1 && nHalfY >= 1, "The Margin of the input raster is too small.");
    RequireMargins(nHalfX == nHalfY, "The Margin of the input raster must be the same.");
    const auto nHalf = static_cast<std::uint32_t>(nHalfX);
    RequireType(*poRasterIn, tessel::eDT_64R, "poRasterIn", kSource);
    RequireType(*poRasterOut, tessel::eDT_64R, "poRasterOut", kSource);
    RequireMatchingBlocks(*poRasterIn, nullptr, *poRasterOut, poMaskOut, kSource);
    RequireWindowInside({nHalf, nHalf}, *poRasterIn, poMaskIn, kSource);
    if (FinishOf(mnNoise) == nullptr)
    {
        return;
    }

    const std::unique_ptr<tessel::Raster> poValid(poMaskIn ? poMaskIn->CreateRaster() : nullptr);
    engine::SubBlockLee oFilter(static_cast<LeeModel>(mnNoise),
                                {mdfAddMean, mdfMulMean, mdfNoiseVar}, mdfThrVar, nHalfX,
                                *poRasterIn, poValid.get());
    const std::size_t nChannels = poRasterIn->mnChannels;
    std::vector<unsigned char> vComputed(poRasterIn->mnWidth);
    for (std::uint32_t y = 0; y < poRasterIn->mnHeight; ++y)
    {
        double* pOut = poRasterOut->GetPixelAs<double>(0, y);
        FindComputedPixels(poMaskIn, poMaskOut, 0, y, vComputed);
        for (std::size_t i = 0; i < vComputed.size() * nChannels; ++i)
        {
            const std::size_t x = i / nChannels;
            if (vComputed[x] != 0)
            {
                pOut[i] = oFilter.Filter(static_cast<std::int64_t>(x), y, i % nChannels);
            }
        }
        WriteBackground(vComputed, poRasterIn->GetPixelAs<const double>(0, y), nChannels, mbBGZero,
                        pOut);
    }
}

std::shared_ptr<tessel::Raster> FilterFle::operator()(std::shared_ptr<tessel::Raster> poRasterIn,
                                                      std::shared_ptr<tessel::Mask> poMaskIn,
                                                      std::shared_ptr<tessel::Mask> poMaskOut) const
{
    auto poRasterOut = std::make_shared<tessel::Raster>(*poRasterIn, *poRasterIn);
    ProcessBlock(poRasterIn.get(), poMaskIn.get(), poRasterOut.get(), poMaskOut.get());
    return poRasterOut;
}

}  // namespace kor::filters
