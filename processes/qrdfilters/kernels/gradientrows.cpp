#include "processes/qrdfilters/kernels/gradientrows.h"

#include <algorithm>
#include <cstdint>

#include "processes/qrdfilters/kernels/targets.h"

#undef HWY_TARGET_INCLUDE
#define HWY_TARGET_INCLUDE "processes/qrdfilters/kernels/gradientrows.cpp"
#include "hwy/foreach_target.h"
#include "processes/qrdfilters/kernels/stencil-inl.h"

HWY_BEFORE_NAMESPACE();

namespace kor::filters::kernels::HWY_NAMESPACE
{

/// The eight neighbours of a vector of samples.
template <class D>
struct Neighbours
{
    hn::Vec<D> moNW, moN, moNE, moW, moE, moSW, moS, moSE;
};

template <class D>
HWY_INLINE hn::Vec<D> Gradient(D oTag, const Neighbours<D>& o, const GradientScale& oScale)
{
    const auto oWeight = hn::Set(oTag, oScale.mdfCentreWeight);
    const auto oN = hn::Mul(oWeight, o.moN);
    const auto oW = hn::Mul(oWeight, o.moW);
    const auto oE = hn::Mul(oWeight, o.moE);
    const auto oS = hn::Mul(oWeight, o.moS);
    const auto oX =
        hn::Add(hn::Sub(hn::Add(hn::Sub(hn::Sub(o.moNE, o.moNW), oW), oE), o.moSW), o.moSE);
    const auto oY =
        hn::Sub(hn::Sub(hn::Sub(hn::Add(hn::Add(oN, o.moNW), o.moNE), o.moSW), oS), o.moSE);
    const auto oMagnitude = hn::Sqrt(hn::Add(hn::Mul(oY, oY), hn::Mul(oX, oX)));
    return hn::Mul(oMagnitude, hn::Set(oTag, oScale.mdfFactor));
}

struct StoreAnywhere
{
    template <class D>
    HWY_INLINE void operator()(D oTag, hn::Vec<D> oResults, double* pOut) const
    {
        hn::StoreU(oResults, oTag, pOut);
    }
};

/// Past the caches, to whole vectors.
struct StoreStreamed
{
    template <class D>
    HWY_INLINE void operator()(D oTag, hn::Vec<D> oResults, double* pOut) const
    {
        hn::Stream(oResults, oTag, pOut);
    }
};

/// Sample i of kRows output rows, whose windows share rows. All samples are valid.
template <std::size_t kRows, class D, class Store>
HWY_INLINE void GradientsAt(D oTag, const StencilRows& oRows, const GradientScale& oScale,
                            double* const* apOut, std::size_t i, const Store& oStore)
{
    hn::Vec<D> aoLeft[kRows + 2];
    hn::Vec<D> aoMiddle[kRows + 2];
    hn::Vec<D> aoRight[kRows + 2];
    for (std::size_t r = 0; r < kRows + 2; ++r)
    {
        const double* pSamples = oRows.moSamples[r] + i;
        aoLeft[r] = hn::LoadU(oTag, pSamples);
        aoMiddle[r] = hn::LoadU(oTag, pSamples + oRows.mnStep);
        aoRight[r] = hn::LoadU(oTag, pSamples + 2 * oRows.mnStep);
    }
    for (std::size_t j = 0; j < kRows; ++j)
    {
        const Neighbours<D> oNeighbours = {aoLeft[j],       aoMiddle[j],    aoRight[j],
                                           aoLeft[j + 1],   aoRight[j + 1], aoLeft[j + 2],
                                           aoMiddle[j + 2], aoRight[j + 2]};
        oStore(oTag, Gradient(oTag, oNeighbours, oScale), apOut[j] + i);
    }
}

/// Samples in front of the first whole vector in memory, or nSamples where there is none.
HWY_INLINE std::size_t SamplesBeforeVector(const double* pOut, std::size_t nSamples)
{
    const std::size_t nBytes = hn::Lanes(hn::ScalableTag<double>()) * sizeof(double);
    const std::size_t nBehind = reinterpret_cast<std::uintptr_t>(pOut) % nBytes;
    const std::size_t nBefore = (nBytes - nBehind) % nBytes / sizeof(double);
    return std::min(nBefore, nSamples);
}

/// The rows begin at equal places of a vector in memory.
template <std::size_t kRows>
HWY_INLINE void StreamGradients(const StencilRows& oRows, const GradientScale& oScale,
                                double* const* apOut)
{
    const hn::ScalableTag<double> oTag;
    const std::size_t nLanes = hn::Lanes(oTag);
    const std::size_t nSamples = oRows.mnSamples;
    const hn::CappedTag<double, 1> oOne;
    std::size_t i = 0;
    for (; i < SamplesBeforeVector(apOut[0], nSamples); ++i)
    {
        GradientsAt<kRows>(oOne, oRows, oScale, apOut, i, StoreAnywhere());
    }
    for (; i + nLanes <= nSamples; i += nLanes)
    {
        GradientsAt<kRows>(oTag, oRows, oScale, apOut, i, StoreStreamed());
    }
    for (; i < nSamples; ++i)
    {
        GradientsAt<kRows>(oOne, oRows, oScale, apOut, i, StoreAnywhere());
    }
}

template <std::size_t kRows>
HWY_INLINE void StoreGradients(const StencilRows& oRows, const GradientScale& oScale,
                               double* const* apOut)
{
    ForEachVector<1>(oRows.mnSamples, [&](auto oTag, auto, std::size_t i) HWY_ATTR
                     { GradientsAt<kRows>(oTag, oRows, oScale, apOut, i, StoreAnywhere()); });
}

/// The samples in the windows of one output row; a masked sample takes the value of the centre.
template <class D>
struct MaskedWindow
{
    HWY_INLINE hn::Vec<D> At(std::size_t dx, std::size_t dy) const
    {
        const std::size_t nPlace = mnFirst + dx * moRows.mnStep;
        const hn::RebindToUnsigned<D> oWordTag;
        const auto oValid = hn::LoadU(oWordTag, moRows.moValid[dy] + nPlace);
        return hn::IfThenElse(hn::MaskFromVec(hn::BitCast(D(), oValid)),
                              hn::LoadU(D(), moRows.moSamples[dy] + nPlace), moCentre);
    }

    const StencilRows& moRows;
    std::size_t mnFirst;
    hn::Vec<D> moCentre;
};

HWY_INLINE void MaskedGradients(const StencilRows& oRows, const GradientScale& oScale, double* pOut)
{
    const auto oVectors = [&](auto oTag, auto, std::size_t i) HWY_ATTR
    {
        using D = decltype(oTag);
        const MaskedWindow<D> oWindow{oRows, i,
                                      hn::LoadU(oTag, oRows.moSamples[1] + oRows.mnStep + i)};
        const Neighbours<D> oNeighbours = {oWindow.At(0, 0), oWindow.At(1, 0), oWindow.At(2, 0),
                                           oWindow.At(0, 1), oWindow.At(2, 1), oWindow.At(0, 2),
                                           oWindow.At(1, 2), oWindow.At(2, 2)};
        hn::StoreU(Gradient(oTag, oNeighbours, oScale), oTag, pOut + i);
    };
    ForEachVector<1>(oRows.mnSamples, oVectors);
}

HWY_INLINE bool AreAlignedAlike(std::span<double* const> oOut)
{
    return std::all_of(
        oOut.begin(), oOut.end(),
        [&](const double* pRow)
        { return SamplesBeforeVector(pRow, SIZE_MAX) == SamplesBeforeVector(oOut[0], SIZE_MAX); });
}

void GradientRows(const StencilRows& oRows, const GradientScale& oScale,
                  std::span<double* const> oOut, bool bStreamed)
{
    const auto oOfRows = [&](auto kRows, const StencilRows& oPart, double* const* apOut) HWY_ATTR
    {
        if (!oPart.moValid.empty())
        {
            for (std::size_t j = 0; j < kRows(); ++j)
            {
                StencilRows oRow = oPart;
                oRow.moSamples = oPart.moSamples.subspan(j, 3);
                oRow.moValid = oPart.moValid.subspan(j, 3);
                MaskedGradients(oRow, oScale, apOut[j]);
            }
        }
        else if (!bStreamed)
        {
            StoreGradients<kRows()>(oPart, oScale, apOut);
        }
        else if (AreAlignedAlike({apOut, kRows()}))
        {
            StreamGradients<kRows()>(oPart, oScale, apOut);
        }
        else
        {
            for (std::size_t j = 0; j < kRows(); ++j)
            {
                StencilRows oRow = oPart;
                oRow.moSamples = oPart.moSamples.subspan(j, 3);
                StreamGradients<1>(oRow, oScale, apOut + j);
            }
        }
    };
    ForEachRowGroup(oRows, oOut, oOfRows);
}

}  // namespace kor::filters::kernels::HWY_NAMESPACE

HWY_AFTER_NAMESPACE();

#if HWY_ONCE

namespace kor::filters::kernels
{

HWY_EXPORT(GradientRows);

void GradientRows(const StencilRows& oRows, const GradientScale& oScale,
                  std::span<double* const> oOut, bool bStreamed)
{
    HWY_DYNAMIC_DISPATCH(GradientRows)(oRows, oScale, oOut, bStreamed);
}

}  // namespace kor::filters::kernels

#endif
