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

/// Sums of kVectors neighbouring vectors by kKernels kernels.
template <class D, std::size_t kKernels, std::size_t kVectors>
struct GaussSums
{
    hn::Vec<D> aoSums[kKernels][kVectors];
};

/// Adds one pair after the other, and the middle at last: from +0.0 on, so that a first term of
/// -0.0 gives +0.0. oPair(n, k, v) is the sum of the samples k behind and before the ends,
/// oMiddle(n, v) the one in the middle.
template <std::size_t kVectors, std::size_t kKernels, class D, class Pair, class Middle>
HWY_INLINE GaussSums<D, kKernels, kVectors> AddMirrored(D oTag, const Weights<kKernels>& oWeights,
                                                        const Pair& oPair, const Middle& oMiddle)
{
    GaussSums<D, kKernels, kVectors> oSums;
    for (std::size_t n = 0; n < kKernels; ++n)
    {
        for (std::size_t v = 0; v < kVectors; ++v)
        {
            oSums.aoSums[n][v] = hn::Zero(oTag);
        }
    }
    for (std::size_t k = 0; k < oWeights.mnHalf; ++k)
    {
        for (std::size_t n = 0; n < kKernels; ++n)
        {
            const auto oWeight = oWeights.Get(oTag, n, k);
            for (std::size_t v = 0; v < kVectors; ++v)
            {
                oSums.aoSums[n][v] = hn::Add(oSums.aoSums[n][v], hn::Mul(oPair(n, k, v), oWeight));
            }
        }
    }
    for (std::size_t n = 0; n < kKernels; ++n)
    {
        const auto oWeight = oWeights.Get(oTag, n, oWeights.mnHalf);
        for (std::size_t v = 0; v < kVectors; ++v)
        {
            oSums.aoSums[n][v] = hn::Add(oSums.aoSums[n][v], hn::Mul(oWeight, oMiddle(n, v)));
        }
    }
    return oSums;
}

template <class D, std::size_t kKernels, std::size_t kVectors>
HWY_INLINE hn::Vec<D> Result(const GaussSums<D, kKernels, kVectors>& oSums, std::size_t v)
{
    return kKernels == 1 ? oSums.aoSums[0][v]
                         : hn::Abs(hn::Sub(oSums.aoSums[0][v], oSums.aoSums[kKernels - 1][v]));
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
        const std::size_t nLanes = hn::Lanes(oTag);
        const auto oPair = [&](std::size_t, std::size_t k, std::size_t v) HWY_ATTR
        {
            return hn::Add(hn::LoadU(oTag, apRows[k] + i + v * nLanes),
                           hn::LoadU(oTag, apRows[nLast - k] + i + v * nLanes));
        };
        const auto oMiddle = [&](std::size_t, std::size_t v) HWY_ATTR
        { return hn::LoadU(oTag, apRows[oWeights.mnHalf] + i + v * nLanes); };
        const auto oSums = AddMirrored<kVectors()>(oTag, oWeights, oPair, oMiddle);
        for (std::size_t n = 0; n < kKernels; ++n)
        {
            for (std::size_t v = 0; v < kVectors(); ++v)
            {
                hn::StoreU(oSums.aoSums[n][v], oTag, &adfColumns[n * nColumns + i + v * nLanes]);
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
        const std::size_t nLanes = hn::Lanes(oTag);
        const auto oPair = [&](std::size_t n, std::size_t k, std::size_t v) HWY_ATTR
        {
            const double* pColumns = &adfColumns[n * nColumns + i + v * nLanes];
            return hn::Add(hn::LoadU(oTag, pColumns + k * nStep),
                           hn::LoadU(oTag, pColumns + nLast - k * nStep));
        };
        const auto oMiddle = [&](std::size_t n, std::size_t v) HWY_ATTR
        {
            const double* pColumns = &adfColumns[n * nColumns + i + v * nLanes];
            return hn::LoadU(oTag, pColumns + oWeights.mnHalf * nStep);
        };
        const auto oSums = AddMirrored<kVectors()>(oTag, oWeights, oPair, oMiddle);
        for (std::size_t v = 0; v < kVectors(); ++v)
        {
            hn::StoreU(Result(oSums, v), oTag, &oOut[i + v * nLanes]);
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
    GaussSums<D, kKernels, 1> aoColumns[kLongestGaussKernel];
    for (std::size_t x = 0; x <= 2 * nHalf; ++x)
    {
        const auto oPair = [&](std::size_t, std::size_t k, std::size_t) HWY_ATTR
        { return hn::Add(oWindow.At(x, k), oWindow.At(x, 2 * nHalf - k)); };
        const auto oMiddle = [&](std::size_t, std::size_t) HWY_ATTR
        { return oWindow.At(x, nHalf); };
        aoColumns[x] = AddMirrored<1>(oTag, oWeights, oPair, oMiddle);
    }
    const auto oColumn = [&](std::size_t n, std::size_t x) HWY_ATTR
    { return aoColumns[x].aoSums[n][0]; };
    const auto oPair = [&](std::size_t n, std::size_t k, std::size_t) HWY_ATTR
    { return hn::Add(oColumn(n, k), oColumn(n, 2 * nHalf - k)); };
    const auto oMiddle = [&](std::size_t n, std::size_t) HWY_ATTR { return oColumn(n, nHalf); };
    return Result(AddMirrored<1>(oTag, oWeights, oPair, oMiddle), 0);
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
