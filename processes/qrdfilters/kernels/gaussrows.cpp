#include "processes/qrdfilters/kernels/gaussrows.h"

#include "processes/qrdfilters/kernels/targets.h"

#undef HWY_TARGET_INCLUDE
#define HWY_TARGET_INCLUDE "processes/qrdfilters/kernels/gaussrows.cpp"
#include "hwy/foreach_target.h"
#include "processes/qrdfilters/kernels/stencil-inl.h"

HWY_BEFORE_NAMESPACE();

namespace kor::filters::kernels::HWY_NAMESPACE
{

/// The weights of kKernels kernels.
template <std::size_t kKernels>
struct Weights
{
    explicit Weights(const GaussKernels& oKernels)
        : mnHalf(oKernels.moFirst.size() - 1),
          mapWeights{oKernels.moFirst.data(), oKernels.moSecond.data()}
    {
    }

    template <class D>
    HWY_INLINE hn::Vec<D> Get(D oTag, std::size_t nKernel, std::size_t k) const
    {
        return hn::Set(oTag, mapWeights[nKernel][k]);
    }

    std::size_t mnHalf;
    const double* mapWeights[2];
};

/// Adds one pair after the other, and the middle at last: from +0.0 on, so that a first term of
/// -0.0 gives +0.0. oPair(k) is the sum of the samples k before and behind the ends, oMiddle() the
/// one in the middle.
template <std::size_t kKernels, class D, class Pair, class Middle>
HWY_INLINE void AddMirrored(D oTag, const Weights<kKernels>& oWeights, const Pair& oPair,
                            const Middle& oMiddle, hn::Vec<D> (&aoSums)[kKernels])
{
    for (std::size_t n = 0; n < kKernels; ++n)
    {
        aoSums[n] = hn::Zero(oTag);
    }
    for (std::size_t k = 0; k < oWeights.mnHalf; ++k)
    {
        for (std::size_t n = 0; n < kKernels; ++n)
        {
            aoSums[n] = hn::Add(aoSums[n], hn::Mul(oPair(n, k), oWeights.Get(oTag, n, k)));
        }
    }
    for (std::size_t n = 0; n < kKernels; ++n)
    {
        const auto oWeight = oWeights.Get(oTag, n, oWeights.mnHalf);
        aoSums[n] = hn::Add(aoSums[n], hn::Mul(oWeight, oMiddle(n)));
    }
}

template <std::size_t kKernels, class D>
HWY_INLINE hn::Vec<D> Result(const hn::Vec<D> (&aoSums)[kKernels], D)
{
    return kKernels == 1 ? aoSums[0] : hn::Abs(hn::Sub(aoSums[0], aoSums[kKernels - 1]));
}

template <std::size_t kKernels>
void SumColumns(const StencilRows& oRows, const Weights<kKernels>& oWeights,
                std::span<double> adfColumns)
{
    const std::size_t nColumns = adfColumns.size() / kKernels;
    const std::size_t nLast = 2 * oWeights.mnHalf;
    const double* const* apRows = oRows.moSamples.data();
    const auto oVectors = [&](auto oTag, auto kVectors, std::size_t i) HWY_ATTR
    {
        for (std::size_t v = 0; v < kVectors(); ++v, i += hn::Lanes(oTag))
        {
            const auto oPair = [&](std::size_t, std::size_t k) HWY_ATTR {
                return hn::Add(hn::LoadU(oTag, apRows[k] + i),
                               hn::LoadU(oTag, apRows[nLast - k] + i));
            };
            const auto oMiddle = [&](std::size_t) HWY_ATTR
            { return hn::LoadU(oTag, apRows[oWeights.mnHalf] + i); };
            hn::Vec<decltype(oTag)> aoSums[kKernels];
            AddMirrored(oTag, oWeights, oPair, oMiddle, aoSums);
            for (std::size_t n = 0; n < kKernels; ++n)
            {
                hn::StoreU(aoSums[n], oTag, &adfColumns[n * nColumns + i]);
            }
        }
    };
    ForEachVector(nColumns, oVectors);
}

template <std::size_t kKernels>
void SumAcross(const StencilRows& oRows, const Weights<kKernels>& oWeights,
               std::span<const double> adfColumns, std::span<double> oOut)
{
    const std::size_t nColumns = adfColumns.size() / kKernels;
    const std::size_t nStep = oRows.mnStep;
    const std::size_t nLast = 2 * oWeights.mnHalf * nStep;
    const auto oVectors = [&](auto oTag, auto kVectors, std::size_t i) HWY_ATTR
    {
        for (std::size_t v = 0; v < kVectors(); ++v, i += hn::Lanes(oTag))
        {
            const auto oPair = [&](std::size_t n, std::size_t k) HWY_ATTR
            {
                const double* pColumns = &adfColumns[n * nColumns + i];
                return hn::Add(hn::LoadU(oTag, pColumns + k * nStep),
                               hn::LoadU(oTag, pColumns + nLast - k * nStep));
            };
            const auto oMiddle = [&](std::size_t n) HWY_ATTR
            { return hn::LoadU(oTag, &adfColumns[n * nColumns + i] + oWeights.mnHalf * nStep); };
            hn::Vec<decltype(oTag)> aoSums[kKernels];
            AddMirrored(oTag, oWeights, oPair, oMiddle, aoSums);
            hn::StoreU(Result(aoSums, oTag), oTag, &oOut[i]);
        }
    };
    ForEachVector(oOut.size(), oVectors);
}

/// The samples of one vector of windows, masked ones replaced by the centres.
template <class D>
struct MaskedWindow
{
    HWY_INLINE hn::Vec<D> At(std::size_t nColumn, std::size_t r) const
    {
        const std::size_t nPlace = mnFirst + nColumn * moRows.mnStep;
        const hn::RebindToUnsigned<D> oWordTag;
        const auto oValid = hn::LoadU(oWordTag, moRows.moValid[r] + nPlace);
        return hn::IfThenElse(hn::MaskFromVec(hn::BitCast(D(), oValid)),
                              hn::LoadU(D(), moRows.moSamples[r] + nPlace), moCentre);
    }

    const StencilRows& moRows;
    std::size_t mnFirst;
    hn::Vec<D> moCentre;
};

template <std::size_t kKernels, class D>
HWY_INLINE hn::Vec<D> SmoothWindow(D oTag, const MaskedWindow<D>& oWindow,
                                   const Weights<kKernels>& oWeights)
{
    const std::size_t nHalf = oWeights.mnHalf;
    hn::Vec<D> aoColumns[kLongestGaussKernel][kKernels];
    for (std::size_t x = 0; x <= 2 * nHalf; ++x)
    {
        const auto oPair = [&](std::size_t, std::size_t k) HWY_ATTR
        { return hn::Add(oWindow.At(x, k), oWindow.At(x, 2 * nHalf - k)); };
        const auto oMiddle = [&](std::size_t) HWY_ATTR { return oWindow.At(x, nHalf); };
        AddMirrored(oTag, oWeights, oPair, oMiddle, aoColumns[x]);
    }
    const auto oPair = [&](std::size_t n, std::size_t k) HWY_ATTR
    { return hn::Add(aoColumns[k][n], aoColumns[2 * nHalf - k][n]); };
    const auto oMiddle = [&](std::size_t n) HWY_ATTR { return aoColumns[nHalf][n]; };
    hn::Vec<D> aoSums[kKernels];
    AddMirrored(oTag, oWeights, oPair, oMiddle, aoSums);
    return Result(aoSums, oTag);
}

template <std::size_t kKernels>
void SmoothMaskedBy(const StencilRows& oRows, const Weights<kKernels>& oWeights, std::size_t nFirst,
                    std::span<double> oOut)
{
    const double* pCentres = oRows.moSamples[oWeights.mnHalf] + oRows.GetCentre();
    const auto oVectors = [&](auto oTag, auto kVectors, std::size_t i) HWY_ATTR
    {
        for (std::size_t v = 0; v < kVectors(); ++v, i += hn::Lanes(oTag))
        {
            const MaskedWindow<decltype(oTag)> oWindow{oRows, nFirst + i,
                                                       hn::LoadU(oTag, pCentres + nFirst + i)};
            hn::StoreU(SmoothWindow(oTag, oWindow, oWeights), oTag, &oOut[i]);
        }
    };
    ForEachVector(oOut.size(), oVectors);
}

void SmoothRow(const StencilRows& oRows, const GaussKernels& oKernels, std::span<double> adfColumns,
               std::span<double> oOut)
{
    if (oKernels.moSecond.empty())
    {
        const Weights<1> oWeights(oKernels);
        SumColumns(oRows, oWeights, adfColumns);
        SumAcross(oRows, oWeights, adfColumns, oOut);
    }
    else
    {
        const Weights<2> oWeights(oKernels);
        SumColumns(oRows, oWeights, adfColumns);
        SumAcross(oRows, oWeights, adfColumns, oOut);
    }
}

void SmoothMasked(const StencilRows& oRows, const GaussKernels& oKernels, std::size_t nFirst,
                  std::span<double> oOut)
{
    if (oKernels.moSecond.empty())
    {
        SmoothMaskedBy(oRows, Weights<1>(oKernels), nFirst, oOut);
    }
    else
    {
        SmoothMaskedBy(oRows, Weights<2>(oKernels), nFirst, oOut);
    }
}

}  // namespace kor::filters::kernels::HWY_NAMESPACE

HWY_AFTER_NAMESPACE();

#if HWY_ONCE

namespace kor::filters::kernels
{

HWY_EXPORT(SmoothRow);
HWY_EXPORT(SmoothMasked);

void SmoothRow(const StencilRows& oRows, const GaussKernels& oKernels, std::span<double> adfColumns,
               std::span<double> oOut)
{
    HWY_DYNAMIC_DISPATCH(SmoothRow)(oRows, oKernels, adfColumns, oOut);
}

void SmoothMasked(const StencilRows& oRows, const GaussKernels& oKernels, std::size_t nFirst,
                  std::span<double> oOut)
{
    HWY_DYNAMIC_DISPATCH(SmoothMasked)(oRows, oKernels, nFirst, oOut);
}

}  // namespace kor::filters::kernels

#endif
