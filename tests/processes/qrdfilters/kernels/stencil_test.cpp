#include "processes/qrdfilters/kernels/stencil.h"

#include <gtest/gtest.h>
#include <hwy/tests/hwy_gtest.h>

#include <cmath>
#include <numeric>
#include <vector>

#include "processes/qrdfilters/kernels/correlaterows.h"
#include "processes/qrdfilters/kernels/edgerows.h"
#include "processes/qrdfilters/kernels/gaussrows.h"
#include "processes/qrdfilters/kernels/gradientrows.h"
#include "tests/support/blocks.h"

namespace kor::filters::kernels
{
namespace
{

using test::Random;
using test::SameSample;
using test::Samples;

struct Window
{
    std::size_t nWidth;
    std::size_t nHeight;
};

/// Random rows around some output rows, each exactly as long as a kernel may read, so that a read
/// behind its end is seen by a sanitizer.
class Rows
{
public:
    Rows(std::size_t nRows, std::size_t nSamples, std::size_t nStep, Window oWindow, bool bMasked,
         Random& oRandom)
        : mvdfResults(nRows, std::vector<double>(nSamples, -7.0))
    {
        const std::size_t nLength = nSamples + (oWindow.nWidth - 1) * nStep;
        moRows.mnSamples = nSamples;
        moRows.mnStep = nStep;
        moRows.mnWidth = oWindow.nWidth;
        moRows.mnHeight = oWindow.nHeight;
        const auto eSamples = oRandom() % 4 == 0 ? Samples::Special : Samples::Ordinary;
        for (std::size_t r = 0; r < nRows + oWindow.nHeight - 1; ++r)
        {
            std::vector<double>& vdfRow = mvdfSamples.emplace_back(nLength);
            std::vector<std::uint64_t>& vnRow = mvnValid.emplace_back(nLength);
            for (std::size_t i = 0; i < nLength; ++i)
            {
                vdfRow[i] = test::RandomSample<double>(eSamples, oRandom);
                vnRow[i] = oRandom() % 4 == 0 ? 0 : ~std::uint64_t{0};
            }
        }
        for (std::size_t r = 0; r < mvdfSamples.size(); ++r)
        {
            mvpSamples.push_back(mvdfSamples[r].data());
            mvpValid.push_back(mvnValid[r].data());
        }
        moRows.moSamples = mvpSamples;
        if (bMasked)
        {
            moRows.moValid = mvpValid;
        }
        for (std::vector<double>& vdfRow : mvdfResults)
        {
            mvpResults.push_back(vdfRow.data());
        }
    }

    const StencilRows& Get() const { return moRows; }
    std::span<double* const> Results() const { return mvpResults; }

    double Sample(std::size_t i, std::size_t j, std::size_t dx, std::size_t dy) const
    {
        return mvdfSamples[j + dy][i + dx * moRows.mnStep];
    }
    double Centre(std::size_t i, std::size_t j) const
    {
        return Sample(i, j, moRows.mnWidth / 2, moRows.mnHeight / 2);
    }
    bool Valid(std::size_t i, std::size_t j, std::size_t dx, std::size_t dy) const
    {
        return moRows.moValid.empty() || mvnValid[j + dy][i + dx * moRows.mnStep] != 0;
    }

    /// Compares each result with oDefinition(i, j).
    template <class Definition>
    void ExpectResults(const Definition& oDefinition) const
    {
        for (std::size_t j = 0; j < mvdfResults.size(); ++j)
        {
            for (std::size_t i = 0; i < moRows.mnSamples; ++i)
            {
                const double dfExpected = oDefinition(i, j);
                ASSERT_TRUE(SameSample(mvdfResults[j][i], dfExpected))
                    << "sample " << i << " of " << moRows.mnSamples << " in row " << j << " of "
                    << mvdfResults.size() << " is " << mvdfResults[j][i] << " and not "
                    << dfExpected;
            }
        }
    }

private:
    std::vector<std::vector<double>> mvdfSamples;
    std::vector<std::vector<std::uint64_t>> mvnValid;
    std::vector<std::vector<double>> mvdfResults;
    std::vector<const double*> mvpSamples;
    std::vector<const std::uint64_t*> mvpValid;
    std::vector<double*> mvpResults;
    StencilRows moRows;
};

/// Each test runs once for every instruction set that this machine has.
class StencilKernels : public hwy::TestWithParamTarget
{
protected:
    /// Calls oTest with rows up to nine of the widest vectors long, so that every target meets
    /// every remainder of the four that are worked on together, and with one to nine rows.
    template <class Test>
    void ForEachCase(std::span<const Window> oWindows, bool bMasked, const Test& oTest)
    {
        for (const Window oWindow : oWindows)
        {
            for (std::size_t nSamples = 1; nSamples <= 72; ++nSamples)
            {
                const std::size_t nRows = 1 + moRandom() % 9;
                const std::size_t nStep = 1 + moRandom() % 4;
                oTest(Rows(nRows, nSamples, nStep, oWindow, bMasked, moRandom));
            }
        }
    }

    Random moRandom{5};
};

HWY_TARGET_INSTANTIATE_TEST_SUITE_P(StencilKernels);

constexpr Window kWindows[] = {{1, 1}, {3, 3}, {5, 5}, {9, 9}, {1, 7}, {7, 1}, {3, 5}};

TEST_P(StencilKernels, CorrelationAddsInTheOrderOfTheKernel)
{
    const auto oTest = [this](const Rows& oRows)
    {
        const std::size_t nWidth = oRows.Get().mnWidth;
        const std::size_t nHeight = oRows.Get().mnHeight;
        std::vector<double> vdfKernel(nWidth * nHeight);
        for (double& dfWeight : vdfKernel)
        {
            dfWeight = test::RandomSample<double>(Samples::Ordinary, moRandom);
        }
        CorrelateRows(oRows.Get(), vdfKernel, oRows.Results());
        oRows.ExpectResults(
            [&](std::size_t i, std::size_t j)
            {
                double dfSum = 0.0;
                for (std::size_t k = 0; k < vdfKernel.size(); ++k)
                {
                    dfSum = dfSum + oRows.Sample(i, j, k % nWidth, k / nWidth) * vdfKernel[k];
                }
                return dfSum;
            });
    };
    ForEachCase(kWindows, false, oTest);
}

double MeanDifference(const Rows& oRows, std::size_t i, std::size_t j, double dfDivisor,
                      double dfFactor)
{
    double dfSum = 0.0;
    for (std::size_t dy = 0; dy < oRows.Get().mnHeight; ++dy)
    {
        for (std::size_t dx = 0; dx < oRows.Get().mnWidth; ++dx)
        {
            if (oRows.Valid(i, j, dx, dy))
            {
                dfSum += std::fabs(oRows.Sample(i, j, dx, dy) - oRows.Centre(i, j));
            }
        }
    }
    if (dfSum > -1e-9 && dfSum < 1e-9)
    {
        return 0.0;
    }
    return dfFactor != 1.0 ? dfSum / dfDivisor * dfFactor : dfSum / dfDivisor;
}

TEST_P(StencilKernels, EdgesAreMeanDifferencesOfValidSamples)
{
    for (const bool bMasked : {false, true})
    {
        for (const double dfFactor : {1.0, -2.5})
        {
            const auto oTest = [&](const Rows& oRows)
            {
                MeanDifferenceRows(oRows.Get(), 7.0, dfFactor, oRows.Results());
                oRows.ExpectResults([&](std::size_t i, std::size_t j)
                                    { return MeanDifference(oRows, i, j, 7.0, dfFactor); });
            };
            ForEachCase(kWindows, bMasked, oTest);
        }
    }
}

// A sum of 1e-9 exactly is no longer flat.
TEST_P(StencilKernels, DifferencesBelowTheBoundAreFlat)
{
    const std::vector<double> vdfSamples = {0.0, 0.0, 0.99e-9, 0.0, 1e-9, 0.0};
    const double* const pSamples = vdfSamples.data();
    std::vector<double> vdfResults(4);
    double* const pResults = vdfResults.data();
    StencilRows oRows;
    oRows.moSamples = {&pSamples, 1};
    oRows.mnSamples = 4;
    oRows.mnStep = 1;
    oRows.mnWidth = 3;
    oRows.mnHeight = 1;
    MeanDifferenceRows(oRows, 2.0, 1.0, {&pResults, 1});
    EXPECT_EQ(vdfResults[0], 0.0);
    EXPECT_EQ(vdfResults[1], 0.99e-9);
    EXPECT_EQ(vdfResults[2], (0.99e-9 + 1e-9) / 2.0);
    EXPECT_EQ(vdfResults[3], 1e-9);
}

/// Compares oRows.Results() with the gradients of the windows.
void ExpectGradients(const Rows& oRows, const GradientScale& oScale)
{
    const double w = oScale.mdfCentreWeight;
    oRows.ExpectResults(
        [&](std::size_t i, std::size_t j)
        {
            const auto oAt = [&](std::size_t dx, std::size_t dy)
            { return oRows.Valid(i, j, dx, dy) ? oRows.Sample(i, j, dx, dy) : oRows.Centre(i, j); };
            const double dfX =
                oAt(2, 0) - oAt(0, 0) - w * oAt(0, 1) + w * oAt(2, 1) - oAt(0, 2) + oAt(2, 2);
            const double dfY =
                w * oAt(1, 0) + oAt(0, 0) + oAt(2, 0) - oAt(0, 2) - w * oAt(1, 2) - oAt(2, 2);
            return std::sqrt(dfY * dfY + dfX * dfX) * oScale.mdfFactor;
        });
}

constexpr Window kThreeByThree[] = {{3, 3}};

TEST_P(StencilKernels, GradientsAreAddedFromTheLeft)
{
    for (const bool bMasked : {false, true})
    {
        const GradientScale oScale = {bMasked ? 1.0 : 2.0, 0.7};
        const auto oTest = [&](const Rows& oRows)
        {
            GradientRows(oRows.Get(), oScale, oRows.Results(), false);
            ExpectGradients(oRows, oScale);
        };
        ForEachCase(kThreeByThree, bMasked, oTest);
    }
}

// Rows that begin at equal places of a vector in memory and rows that don't, each at all places.
TEST_P(StencilKernels, StreamedGradientsAreTheSame)
{
    constexpr GradientScale kScale = {2.0, 0.7};
    std::size_t nPlace = 0;
    for (const std::size_t nRowDoubles : {80U, 73U})
    {
        const auto oTest = [&](const Rows& oRows)
        {
            const std::size_t nRows = oRows.Results().size();
            std::vector<double> vdfBlock(8 + nRows * nRowDoubles, -7.0);
            std::vector<double*> vpRows;
            for (std::size_t j = 0; j < nRows; ++j)
            {
                vpRows.push_back(&vdfBlock[nPlace % 8 + j * nRowDoubles]);
            }
            GradientRows(oRows.Get(), kScale, vpRows, true);
            for (std::size_t j = 0; j < nRows; ++j)
            {
                const std::size_t nSamples = oRows.Get().mnSamples;
                std::copy_n(vpRows[j], nSamples, oRows.Results()[j]);
                EXPECT_EQ(vpRows[j][nSamples], -7.0) << "written behind the row";
            }
            ExpectGradients(oRows, kScale);
            ++nPlace;
        };
        ForEachCase(kThreeByThree, false, oTest);
    }
}

double Smoothed(const Rows& oRows, std::size_t i, std::size_t j, std::span<const double> oKernel)
{
    const std::size_t nHalf = oKernel.size() - 1;
    const auto oAt = [&](std::size_t dx, std::size_t dy)
    { return oRows.Valid(i, j, dx, dy) ? oRows.Sample(i, j, dx, dy) : oRows.Centre(i, j); };
    std::vector<double> vdfColumns(2 * nHalf + 1, 0.0);
    for (std::size_t x = 0; x <= 2 * nHalf; ++x)
    {
        for (std::size_t y = 0; y < nHalf; ++y)
        {
            vdfColumns[x] += (oAt(x, y) + oAt(x, 2 * nHalf - y)) * oKernel[y];
        }
        vdfColumns[x] += oKernel[nHalf] * oAt(x, nHalf);
    }
    double dfSum = 0.0;
    for (std::size_t x = 0; x < nHalf; ++x)
    {
        dfSum += (vdfColumns[x] + vdfColumns[2 * nHalf - x]) * oKernel[x];
    }
    return dfSum + oKernel[nHalf] * vdfColumns[nHalf];
}

TEST_P(StencilKernels, SmoothingAddsMirroredSamplesFirst)
{
    constexpr Window kSquares[] = {{3, 3}, {5, 5}, {11, 11}};
    const std::vector<double> vdfFirst = {0.3, -0.1, 0.2, 0.25, 0.01, 0.7};
    const std::vector<double> vdfSecond = {0.5, 0.15, 0.6, -0.3, 0.2, 0.1};
    std::vector<double> vdfColumns;
    for (unsigned int nCase = 0; nCase < 4; ++nCase)
    {
        const bool bMasked = (nCase & 1U) != 0;
        const bool bTwo = (nCase & 2U) != 0;
        for (const Window oWindow : kSquares)
        {
            // Up to three vectors, and rows whose column sums are formed in several parts.
            std::vector<std::size_t> vnLengths(24);
            std::iota(vnLengths.begin(), vnLengths.end(), 1);
            vnLengths.insert(vnLengths.end(), {512, 513, 1100});
            for (const std::size_t nSamples : vnLengths)
            {
                const std::size_t nRows = bMasked ? 1 : 1 + moRandom() % 6;
                const Rows oRows(nRows, nSamples, 1 + moRandom() % 4, oWindow, bMasked, moRandom);
                const std::size_t nWeights = oWindow.nWidth / 2 + 1;
                GaussKernels oKernels{{vdfFirst.data(), nWeights}, {}};
                if (bTwo)
                {
                    oKernels.moSecond = {vdfSecond.data(), nWeights};
                }
                const StencilRows& oGiven = oRows.Get();
                const std::span<double> vdfOut(oRows.Results()[0], nSamples);
                if (bMasked)
                {
                    // In two parts, as runs of a row are.
                    const std::size_t nPart = nSamples / 3;
                    SmoothMasked(oGiven, oKernels, 0, vdfOut.first(nPart));
                    SmoothMasked(oGiven, oKernels, nPart, vdfOut.subspan(nPart));
                }
                else
                {
                    SmoothRows(oGiven, oKernels, vdfColumns, oRows.Results(), nSamples % 2 == 0);
                }
                oRows.ExpectResults(
                    [&](std::size_t i, std::size_t j)
                    {
                        const double dfFirst = Smoothed(oRows, i, j, oKernels.moFirst);
                        return bTwo ? std::fabs(dfFirst - Smoothed(oRows, i, j, oKernels.moSecond))
                                    : dfFirst;
                    });
            }
        }
    }
}

}  // namespace
}  // namespace kor::filters::kernels
