#include "processes/qrdfilters/kernels/gradientrows.h"

#include "processes/qrdfilters/kernels/targets.h"

#undef HWY_TARGET_INCLUDE
#define HWY_TARGET_INCLUDE "processes/qrdfilters/kernels/gradientrows.cpp"
#include "hwy/foreach_target.h"
#include "processes/qrdfilters/kernels/stencil-inl.h"

HWY_BEFORE_NAMESPACE();

namespace kor::filters::kernels::HWY_NAMESPACE
{

/// The samples in the windows of one output row.
template <bool kMasked, class D>
struct Neighbours
{
    HWY_INLINE hn::Vec<D> Centre(std::size_t i) const
    {
        return hn::LoadU(D(), moRows.moSamples[mnRow + 1] + moRows.mnStep + i);
    }

    /// Column dx and row dy of the window; a masked sample takes the value of the centre.
    HWY_INLINE hn::Vec<D> At(std::size_t dx, std::size_t dy, std::size_t i) const
    {
        const std::size_t nPlace = i + dx * moRows.mnStep;
        const auto oSample = hn::LoadU(D(), moRows.moSamples[mnRow + dy] + nPlace);
        if constexpr (kMasked)
        {
            const hn::RebindToUnsigned<D> oWordTag;
            const auto oValid = hn::LoadU(oWordTag, moRows.moValid[mnRow + dy] + nPlace);
            return hn::IfThenElse(hn::MaskFromVec(hn::BitCast(D(), oValid)), oSample, Centre(i));
        }
        else
        {
            return oSample;
        }
    }

    const StencilRows& moRows;
    std::size_t mnRow;
};

template <bool kMasked, class D>
HWY_INLINE hn::Vec<D> Gradient(D oTag, const Neighbours<kMasked, D>& oWindow, std::size_t i,
                               double dfCentreWeight, double dfFactor)
{
    const auto oWeight = hn::Set(oTag, dfCentreWeight);
    const auto oNW = oWindow.At(0, 0, i);
    const auto oN = hn::Mul(oWeight, oWindow.At(1, 0, i));
    const auto oNE = oWindow.At(2, 0, i);
    const auto oW = hn::Mul(oWeight, oWindow.At(0, 1, i));
    const auto oE = hn::Mul(oWeight, oWindow.At(2, 1, i));
    const auto oSW = oWindow.At(0, 2, i);
    const auto oS = hn::Mul(oWeight, oWindow.At(1, 2, i));
    const auto oSE = oWindow.At(2, 2, i);
    const auto oX = hn::Add(hn::Sub(hn::Add(hn::Sub(hn::Sub(oNE, oNW), oW), oE), oSW), oSE);
    const auto oY = hn::Sub(hn::Sub(hn::Sub(hn::Add(hn::Add(oN, oNW), oNE), oSW), oS), oSE);
    const auto oMagnitude = hn::Sqrt(hn::Add(hn::Mul(oY, oY), hn::Mul(oX, oX)));
    return hn::Mul(oMagnitude, hn::Set(oTag, dfFactor));
}

template <bool kMasked>
HWY_INLINE void GradientsOf(const StencilRows& oRows, double dfCentreWeight, double dfFactor,
                            std::span<double* const> oOut)
{
    for (std::size_t j = 0; j < oOut.size(); ++j)
    {
        const auto oVectors = [&](auto oTag, auto kVectors, std::size_t i) HWY_ATTR
        {
            const Neighbours<kMasked, decltype(oTag)> oWindow{oRows, j};
            for (std::size_t v = 0; v < kVectors(); ++v, i += hn::Lanes(oTag))
            {
                hn::StoreU(Gradient(oTag, oWindow, i, dfCentreWeight, dfFactor), oTag, oOut[j] + i);
            }
        };
        ForEachVector(oRows.mnSamples, oVectors);
    }
}

void GradientRows(const StencilRows& oRows, double dfCentreWeight, double dfFactor,
                  std::span<double* const> oOut)
{
    if (oRows.moValid.empty())
    {
        GradientsOf<false>(oRows, dfCentreWeight, dfFactor, oOut);
    }
    else
    {
        GradientsOf<true>(oRows, dfCentreWeight, dfFactor, oOut);
    }
}

}  // namespace kor::filters::kernels::HWY_NAMESPACE

HWY_AFTER_NAMESPACE();

#if HWY_ONCE

namespace kor::filters::kernels
{

HWY_EXPORT(GradientRows);

void GradientRows(const StencilRows& oRows, double dfCentreWeight, double dfFactor,
                  std::span<double* const> oOut)
{
    HWY_DYNAMIC_DISPATCH(GradientRows)(oRows, dfCentreWeight, dfFactor, oOut);
}

}  // namespace kor::filters::kernels

#endif
