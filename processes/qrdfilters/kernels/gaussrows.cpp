#include "processes/qrdfilters/kernels/gaussrows.h"

#include <algorithm>
#include <array>

#include "processes/qrdfilters/kernels/targets.h"
#include "processes/qrdfilters/kernels/windowsums.h"

#undef HWY_TARGET_INCLUDE
#define HWY_TARGET_INCLUDE "processes/qrdfilters/kernels/gaussrows.cpp"
#include "hwy/foreach_target.h"
#include "processes/qrdfilters/kernels/stencil-inl.h"

HWY_BEFORE_NAMESPACE();

namespace kor::filters::kernels::HWY_NAMESPACE
{

// Output rows that ForEachRowGroup gives at once, at most.
constexpr std::size_t kRowsTogether = 4;
// Samples of a row whose column sums stay in the first cache.
constexpr std::size_t kSamplesTogether = 512;

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
        HWY_UNROLL(8)
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
            HWY_UNROLL(8)
            for (std::size_t v = 0; v < kVectors; ++v)
            {
                oSums.aoSums[n][v] = hn::Add(oSums.aoSums[n][v], hn::Mul(oPair(n, k, v), oWeight));
            }
        }
    }
    for (std::size_t n = 0; n < kKernels; ++n)
    {
        const auto oWeight = oWeights.Get(oTag, n, oWeights.mnHalf);
        HWY_UNROLL(8)
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

/// Column sums of kRows output rows, kernel by kernel in each. The rows of their windows move
/// through registers, so that each is loaded once from above and once from below. Loops over them
/// are unrolled by order: else the compiler keeps them in memory.
template <std::size_t kRows, std::size_t kKernels>
void SumColumns(const StencilRows& oRows, const Weights<kKernels>& oWeights, double* pColumns)
{
    const std::size_t nColumns = oRows.mnSamples + (oRows.mnWidth - 1) * oRows.mnStep;
    const std::size_t nLast = 2 * oWeights.mnHalf;
    const double* const* apRows = oRows.moSamples.data();
    const auto oVectors = [&](auto oTag, auto, std::size_t i) HWY_ATTR
    {
        using D = decltype(oTag);
        hn::Vec<D> aoAbove[kRows];
        hn::Vec<D> aoBelow[kRows];
        GaussSums<D, kKernels, kRows> oSums;
        HWY_UNROLL(8)
        for (std::size_t j = 0; j < kRows; ++j)
        {
            aoAbove[j] = hn::LoadU(oTag, apRows[j] + i);
            aoBelow[j] = hn::LoadU(oTag, apRows[nLast + j] + i);
            for (std::size_t n = 0; n < kKernels; ++n)
            {
                oSums.aoSums[n][j] = hn::Zero(oTag);
            }
        }
        for (std::size_t k = 0; k < oWeights.mnHalf; ++k)
        {
            HWY_UNROLL(8)
            for (std::size_t j = 0; j < kRows; ++j)
            {
                const auto oPair = hn::Add(aoAbove[j], aoBelow[j]);
                for (std::size_t n = 0; n < kKernels; ++n)
                {
                    oSums.aoSums[n][j] =
                        hn::Add(oSums.aoSums[n][j], hn::Mul(oPair, oWeights.Get(oTag, n, k)));
                }
            }
            HWY_UNROLL(8)
            for (std::size_t j = 1; j < kRows; ++j)
            {
                aoAbove[j - 1] = aoAbove[j];
                aoBelow[kRows - j] = aoBelow[kRows - j - 1];
            }
            aoAbove[kRows - 1] = hn::LoadU(oTag, apRows[k + kRows] + i);
            aoBelow[0] = hn::LoadU(oTag, apRows[nLast - k - 1] + i);
        }
        HWY_UNROLL(8)
        for (std::size_t j = 0; j < kRows; ++j)
        {
            for (std::size_t n = 0; n < kKernels; ++n)
            {
                const auto oMiddle = hn::Mul(oWeights.Get(oTag, n, oWeights.mnHalf), aoAbove[j]);
                hn::StoreU(hn::Add(oSums.aoSums[n][j], oMiddle), oTag,
                           pColumns + (j * kKernels + n) * nColumns + i);
            }
        }
    };
    ForEachVector<1>(nColumns, oVectors);
}

template <std::size_t kKernels>
void SumAcross(const StencilRows& oRows, const Weights<kKernels>& oWeights, const double* pSums,
               double* pOut)
{
    const std::size_t nColumns = oRows.mnSamples + (oRows.mnWidth - 1) * oRows.mnStep;
    const std::size_t nStep = oRows.mnStep;
    const std::size_t nLast = 2 * oWeights.mnHalf * nStep;
    const auto oVectors = [&](auto oTag, auto kVectors, std::size_t i) HWY_ATTR
    {
        const std::size_t nLanes = hn::Lanes(oTag);
        const auto oPair = [&](std::size_t n, std::size_t k, std::size_t v) HWY_ATTR
        {
            const double* pColumns = pSums + n * nColumns + i + v * nLanes;
            return hn::Add(hn::LoadU(oTag, pColumns + k * nStep),
                           hn::LoadU(oTag, pColumns + nLast - k * nStep));
        };
        const auto oMiddle = [&](std::size_t n, std::size_t v) HWY_ATTR
        {
            const double* pColumns = pSums + n * nColumns + i + v * nLanes;
            return hn::LoadU(oTag, pColumns + oWeights.mnHalf * nStep);
        };
        const auto oSums = AddMirrored<kVectors()>(oTag, oWeights, oPair, oMiddle);
        for (std::size_t v = 0; v < kVectors(); ++v)
        {
            hn::StoreU(Result(oSums, v), oTag, pOut + i + v * nLanes);
        }
    };
    ForEachVector(oRows.mnSamples, oVectors);
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

/// oRows from sample nFirst on, nSamples of it.
class StencilPart
{
public:
    StencilPart(const StencilRows& oRows, std::size_t nFirst, std::size_t nSamples) : moRows(oRows)
    {
        std::transform(oRows.moSamples.begin(), oRows.moSamples.end(), mapRows.begin(),
                       [nFirst](const double* pRow) { return pRow + nFirst; });
        moRows.moSamples = std::span(mapRows).first(oRows.moSamples.size());
        moRows.mnSamples = nSamples;
    }
    StencilPart(const StencilPart&) = delete;
    StencilPart& operator=(const StencilPart&) = delete;

    const StencilRows& Get() const { return moRows; }

private:
    std::array<const double*, kLongestGaussKernel + kRowsTogether - 1> mapRows;
    StencilRows moRows;
};

template <std::size_t kRows, std::size_t kKernels>
void SmoothPart(const StencilRows& oRows, const Weights<kKernels>& oWeights, double* pColumns,
                double* const* apOut, std::size_t nFirst, bool bStreamed)
{
    const std::size_t nColumns = oRows.mnSamples + (oRows.mnWidth - 1) * oRows.mnStep;
    SumColumns<kRows>(oRows, oWeights, pColumns);
    for (std::size_t j = 0; j < kRows; ++j)
    {
        const double* pSums = pColumns + j * kKernels * nColumns;
        if (bStreamed)
        {
            std::array<double, kSamplesTogether> adfResults;
            SumAcross(oRows, oWeights, pSums, adfResults.data());
            StreamRow({adfResults.data(), oRows.mnSamples}, apOut[j] + nFirst);
        }
        else
        {
            SumAcross(oRows, oWeights, pSums, apOut[j] + nFirst);
        }
    }
}

/// A part after the other, so that column sums stay in the first cache.
template <std::size_t kKernels>
void SmoothRowsBy(const StencilRows& oRows, const Weights<kKernels>& oWeights, double* pColumns,
                  std::span<double* const> oOut, bool bStreamed)
{
    const auto oOfRows = [&](auto kRows, const StencilRows& oTogether, double* const* apOut)
    {
        for (std::size_t i = 0; i < oRows.mnSamples; i += kSamplesTogether)
        {
            const StencilPart oPart(oTogether, i, std::min(kSamplesTogether, oRows.mnSamples - i));
            SmoothPart<kRows()>(oPart.Get(), oWeights, pColumns, apOut, i, bStreamed);
        }
    };
    ForEachRowGroup(oRows, oOut, oOfRows);
}

void SmoothRows(const StencilRows& oRows, const GaussKernels& oKernels,
                std::vector<double>& vdfColumns, std::span<double* const> oOut, bool bStreamed)
{
    const std::size_t nColumns = kSamplesTogether + (oRows.mnWidth - 1) * oRows.mnStep;
    const bool bOneKernel = oKernels.moSecond.empty();
    vdfColumns.resize(std::max(vdfColumns.size(), kRowsTogether * (bOneKernel ? 1 : 2) * nColumns));
    if (bOneKernel)
    {
        SmoothRowsBy(oRows, Weights<1>(oKernels), vdfColumns.data(), oOut, bStreamed);
    }
    else
    {
        SmoothRowsBy(oRows, Weights<2>(oKernels), vdfColumns.data(), oOut, bStreamed);
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

HWY_EXPORT(SmoothRows);
HWY_EXPORT(SmoothMasked);

void SmoothRows(const StencilRows& oRows, const GaussKernels& oKernels,
                std::vector<double>& vdfColumns, std::span<double* const> oOut, bool bStreamed)
{
    HWY_DYNAMIC_DISPATCH(SmoothRows)(oRows, oKernels, vdfColumns, oOut, bStreamed);
}

void SmoothMasked(const StencilRows& oRows, const GaussKernels& oKernels, std::size_t nFirst,
                  std::span<double> oOut)
{
    HWY_DYNAMIC_DISPATCH(SmoothMasked)(oRows, oKernels, nFirst, oOut);
}

}  // namespace kor::filters::kernels

#endif
