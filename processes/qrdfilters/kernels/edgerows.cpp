#include "processes/qrdfilters/kernels/edgerows.h"

#include "processes/qrdfilters/kernels/targets.h"

#undef HWY_TARGET_INCLUDE
#define HWY_TARGET_INCLUDE "processes/qrdfilters/kernels/edgerows.cpp"
#include "hwy/foreach_target.h"
#include "processes/qrdfilters/kernels/stencil-inl.h"

HWY_BEFORE_NAMESPACE();

namespace kor::filters::kernels::HWY_NAMESPACE
{

/// A masked sample adds +0.0: the sums start at +0.0 and no term is negative, so that this changes
/// nothing.
template <bool kMasked, class D, std::size_t kRows, std::size_t kVectors>
struct Differences
{
    struct Sample
    {
        hn::Vec<D> oValue;
        hn::Vec<D> oValid;
    };

    HWY_INLINE Sample Load(D oTag, std::size_t r, std::size_t i) const
    {
        const auto oValue = LoadForManyUses(oTag, moRows.moSamples[r] + i);
        if constexpr (kMasked)
        {
            const hn::RebindToUnsigned<D> oWordTag;
            return {oValue, hn::BitCast(oTag, hn::LoadU(oWordTag, moRows.moValid[r] + i))};
        }
        else
        {
            return {oValue, oValue};
        }
    }

    HWY_INLINE hn::Vec<D> Term(D, const Sample& oSample, std::size_t j, std::size_t v, std::size_t,
                               std::size_t) const
    {
        const auto oDifference = hn::Abs(hn::Sub(oSample.oValue, aoCentres[j][v]));
        return kMasked ? hn::And(oDifference, oSample.oValid) : oDifference;
    }

    const StencilRows& moRows;
    hn::Vec<D> aoCentres[kRows][kVectors];
};

struct Strength
{
    template <class D>
    HWY_INLINE hn::Vec<D> Of(D oTag, hn::Vec<D> oSum) const
    {
        const auto oBound = hn::Set(oTag, 1e-9);
        // False for not a number, which is kept.
        const auto oFlat = hn::And(hn::Gt(oSum, hn::Neg(oBound)), hn::Lt(oSum, oBound));
        const auto oMean = hn::Div(oSum, hn::Set(oTag, mdfDivisor));
        const auto oStrength = mdfFactor != 1.0 ? hn::Mul(oMean, hn::Set(oTag, mdfFactor)) : oMean;
        return hn::IfThenZeroElse(oFlat, oStrength);
    }

    double mdfDivisor;
    double mdfFactor;
};

template <bool kMasked, std::size_t kRows>
HWY_INLINE void MeanDifferences(const StencilRows& oRows, const Strength& oStrength,
                                double* const* apOut)
{
    const auto oVectors = [&](auto oTag, auto kVectors, std::size_t i) HWY_ATTR
    {
        Differences<kMasked, decltype(oTag), kRows, kVectors()> oTerms{oRows, {}};
        for (std::size_t j = 0; j < kRows; ++j)
        {
            const double* pCentres = oRows.moSamples[j + oRows.mnHeight / 2] + oRows.GetCentre();
            for (std::size_t v = 0; v < kVectors(); ++v)
            {
                oTerms.aoCentres[j][v] = hn::LoadU(oTag, pCentres + i + v * hn::Lanes(oTag));
            }
        }
        const auto oSums = SumTerms<kRows, kVectors()>(oTag, oRows, oTerms, i);
        StoreSums(oTag, oSums, oStrength, apOut, i);
    };
    ForEachVector(oRows.mnSamples, oVectors);
}

void MeanDifferenceRows(const StencilRows& oRows, double dfDivisor, double dfFactor,
                        std::span<double* const> oOut)
{
    const Strength oStrength{dfDivisor, dfFactor};
    const auto oWork = [&](auto kRows, const StencilRows& oPart, double* const* apOut) HWY_ATTR
    {
        if (oPart.moValid.empty())
        {
            MeanDifferences<false, kRows()>(oPart, oStrength, apOut);
        }
        else
        {
            MeanDifferences<true, kRows()>(oPart, oStrength, apOut);
        }
    };
    ForEachRowGroup(oRows, oOut, oWork);
}

}  // namespace kor::filters::kernels::HWY_NAMESPACE

HWY_AFTER_NAMESPACE();

#if HWY_ONCE

namespace kor::filters::kernels
{

HWY_EXPORT(MeanDifferenceRows);

void MeanDifferenceRows(const StencilRows& oRows, double dfDivisor, double dfFactor,
                        std::span<double* const> oOut)
{
    HWY_DYNAMIC_DISPATCH(MeanDifferenceRows)(oRows, dfDivisor, dfFactor, oOut);
}

}  // namespace kor::filters::kernels

#endif
