#include "processes/qrdfilters/statistics/eigensystem.h"

#include <gtest/gtest.h>

#include <cmath>
#include <limits>
#include <vector>

#include "tests/support/blocks.h"
#include "tests/support/exceptions.h"

namespace kor::filters
{
namespace
{

using test::Random;

struct Solution
{
    std::vector<float> vfVectors;
    std::vector<float> vfValues;
};

Solution Solve(std::vector<float> vfMatrix, std::size_t nSize)
{
    Solution oSolution{std::move(vfMatrix), std::vector<float>(nSize)};
    SolveEigensystem(nSize, oSolution.vfVectors, oSolution.vfValues);
    return oSolution;
}

using Floats = std::vector<float>;

TEST(SolveEigensystem, GivesTheVectorMinusOneToASingleValue)
{
    EXPECT_EQ(Solve({6.25F}, 1).vfValues, (Floats{6.25F}));
    EXPECT_EQ(Solve({6.25F}, 1).vfVectors, (Floats{-1}));
    EXPECT_EQ(Solve({}, 0).vfValues, Floats());
}

TEST(SolveEigensystem, SortsByAbsoluteValueAndTurnsTheSign)
{
    const Solution oSolution = Solve({1, 0, 0, 0, -3, 0, 0, 0, 2}, 3);
    EXPECT_EQ(oSolution.vfValues, (Floats{-3, 2, 1}));
    EXPECT_EQ(oSolution.vfVectors, (Floats{0, -1, 0, 0, 0, -1, -1, 0, 0}));
}

TEST(SolveEigensystem, PutsTheLaterOfEqualValuesFirst)
{
    EXPECT_EQ(Solve({2, 0, 0, -2}, 2).vfValues, (Floats{-2, 2}));
    EXPECT_EQ(Solve({2, 0, 0, -2}, 2).vfVectors, (Floats{0, -1, -1, 0}));
    EXPECT_EQ(Solve({2, 0, 0, 2}, 2).vfVectors, (Floats{0, -1, -1, 0}));
    EXPECT_EQ(Solve({5, 0, 0, 0, 5, 0, 0, 0, 5}, 3).vfVectors,
              (Floats{0, 0, -1, -1, 0, 0, 0, -1, 0}));
}

// One rotation by 45 degrees, c = s = sqrt(0.5): columns (c, -s) of value 1 and (s, c) of value 3.
TEST(SolveEigensystem, KeepsTheSignOfTheMethod)
{
    const Solution oSolution = Solve({2, 1, 1, 2}, 2);
    EXPECT_NEAR(oSolution.vfValues[0], 3.0F, 1e-6F);
    EXPECT_NEAR(oSolution.vfValues[1], 1.0F, 1e-6F);
    const float fHalf = std::sqrt(0.5F);
    const Floats vfExpected = {-fHalf, -fHalf, -fHalf, fHalf};
    for (std::size_t i = 0; i < 4; ++i)
    {
        EXPECT_NEAR(oSolution.vfVectors[i], vfExpected[i], 1e-6F) << i;
    }
}

TEST(SolveEigensystem, GivesUpOnWhatIsNotANumber)
{
    constexpr float kNaN = std::numeric_limits<float>::quiet_NaN();
    try
    {
        Solve({kNaN, kNaN, kNaN, kNaN}, 2);
        FAIL() << "threw nothing";
    }
    catch (const DataException& oError)
    {
        EXPECT_EQ(oError.GetMessage(), "Too many iteration in eigen vector calculation.");
        EXPECT_EQ(oError.GetFile() + oError.GetFunction(), "");
        EXPECT_EQ(oError.GetLine(), 0U);
    }
}

/// The covariance of random channels that depend on each other, or a matrix of lower rank.
Floats RandomCovariance(std::size_t nSize, std::size_t nRank, Random& oRandom)
{
    std::vector<double> vdfRoot(nSize * nRank);
    for (double& df : vdfRoot)
    {
        df = std::normal_distribution<double>(0, 30)(oRandom);
    }
    Floats vfMatrix(nSize * nSize);
    for (std::size_t i = 0; i < nSize * nSize; ++i)
    {
        double dfSum = 0;
        for (std::size_t k = 0; k < nRank; ++k)
        {
            dfSum += vdfRoot[i / nSize * nRank + k] * vdfRoot[i % nSize * nRank + k];
        }
        vfMatrix[i] = static_cast<float>(dfSum);
    }
    return vfMatrix;
}

// ---- The method, loop by loop, on arrays that count from 1.

class PlainEigensystem
{
public:
    PlainEigensystem(const Floats& vfMatrix, std::size_t nSize)
        : n(static_cast<int>(nSize)), a(nSize + 1, Floats(nSize + 1)), d(nSize + 1), e(nSize + 1)
    {
        for (std::size_t i = 0; i < nSize * nSize; ++i)
        {
            a[1 + i / nSize][1 + i % nSize] = vfMatrix[i];
        }
    }

    Solution Solve()
    {
        Tridiagonalise();
        Accumulate();
        Diagonalise();
        Sort();
        Solution oSolution;
        for (int k = 1; k <= n; ++k)
        {
            oSolution.vfValues.push_back(d[At(k)]);
            for (int j = 1; j <= n; ++j)
            {
                oSolution.vfVectors.push_back(a[At(j)][At(k)] * -1.0F);
            }
        }
        return oSolution;
    }

private:
    static std::size_t At(int i) { return static_cast<std::size_t>(i); }
    float& A(int i, int j) { return a[At(i)][At(j)]; }
    float& D(int i) { return d[At(i)]; }
    float& E(int i) { return e[At(i)]; }

    void Tridiagonalise()
    {
        for (int i = n; i >= 2; --i)
        {
            const int l = i - 1;
            float h = 0, scale = 0;
            for (int k = 1; l > 1 && k <= l; ++k)
                scale += std::fabs(A(i, k));
            if (scale == 0)
            {
                E(i) = A(i, l);
                D(i) = h;
                continue;
            }
            for (int k = 1; k <= l; ++k)
            {
                A(i, k) /= scale;
                h += A(i, k) * A(i, k);
            }
            float f = A(i, l);
            float g = f >= 0 ? -std::sqrt(h) : std::sqrt(h);
            E(i) = scale * g;
            h = h - f * g;
            A(i, l) = f - g;
            f = 0;
            for (int j = 1; j <= l; ++j)
            {
                A(j, i) = A(i, j) / h;
                g = 0;
                for (int k = 1; k <= j; ++k)
                    g += A(j, k) * A(i, k);
                for (int k = j + 1; k <= l; ++k)
                    g += A(k, j) * A(i, k);
                E(j) = g / h;
                f += E(j) * A(i, j);
            }
            const float hh = f / (h + h);
            for (int j = 1; j <= l; ++j)
            {
                f = A(i, j);
                g = E(j) - hh * f;
                E(j) = g;
                for (int k = 1; k <= j; ++k)
                    A(j, k) -= f * E(k) + g * A(i, k);
            }
            D(i) = h;
        }
        D(1) = 0;
        E(1) = 0;
    }

    void Accumulate()
    {
        for (int i = 1; i <= n; ++i)
        {
            const int l = i - 1;
            for (int j = 1; D(i) != 0 && j <= l; ++j)
            {
                float g = 0;
                for (int k = 1; k <= l; ++k)
                    g += A(i, k) * A(k, j);
                for (int k = 1; k <= l; ++k)
                    A(k, j) -= g * A(k, i);
            }
            D(i) = A(i, i);
            A(i, i) = 1;
            for (int j = 1; j <= l; ++j)
                A(j, i) = A(i, j) = 0;
        }
    }

    void Diagonalise()
    {
        for (int i = 2; i <= n; ++i)
            E(i - 1) = E(i);
        E(n) = 0;
        for (int l = 1; l <= n; ++l)
        {
            for (int iter = 0;; ++iter)
            {
                int m = l;
                for (; m < n; ++m)
                {
                    const float dd = std::fabs(D(m)) + std::fabs(D(m + 1));
                    if (std::fabs(E(m)) + dd == dd)
                        break;
                }
                if (m == l)
                    break;
                ASSERT_LT(iter, 30);
                float g = (D(l + 1) - D(l)) / (2.0F * E(l));
                float r = std::sqrt(g * g + 1.0F);
                g = D(m) - D(l) + E(l) / (g + (g >= 0 ? r : -r));
                float s = 1, c = 1, p = 0;
                for (int i = m - 1; i >= l; --i)
                {
                    const float f = s * E(i), b = c * E(i);
                    if (std::fabs(f) >= std::fabs(g))
                    {
                        c = g / f;
                        r = std::sqrt(c * c + 1.0F);
                        E(i + 1) = f * r;
                        s = 1.0F / r;
                        c = c * s;
                    }
                    else
                    {
                        s = f / g;
                        r = std::sqrt(s * s + 1.0F);
                        E(i + 1) = g * r;
                        c = 1.0F / r;
                        s = s * c;
                    }
                    g = D(i + 1) - p;
                    r = (D(i) - g) * s + 2.0F * c * b;
                    p = s * r;
                    D(i + 1) = g + p;
                    g = c * r - b;
                    for (int k = 1; k <= n; ++k)
                    {
                        const float z = A(k, i + 1);
                        A(k, i + 1) = s * A(k, i) + c * z;
                        A(k, i) = c * A(k, i) - s * z;
                    }
                }
                D(l) = D(l) - p;
                E(l) = g;
                E(m) = 0;
            }
        }
    }

    void Sort()
    {
        for (int i = 1; i < n; ++i)
        {
            int k = i;
            float p = D(i);
            for (int j = i + 1; j <= n; ++j)
            {
                if (std::fabs(D(j)) >= std::fabs(p))
                    p = D(k = j);
            }
            if (k == i)
                continue;
            D(k) = D(i);
            D(i) = p;
            for (int j = 1; j <= n; ++j)
                std::swap(A(j, i), A(j, k));
        }
    }

    int n;
    std::vector<Floats> a;
    Floats d, e;
};

TEST(SolveEigensystem, GivesTheBitsOfThePlainMethod)
{
    Random oRandom(1);
    for (std::size_t nSize = 1; nSize <= 40; ++nSize)
    {
        const Floats vfMatrix = RandomCovariance(nSize, 1 + oRandom() % (nSize + 2), oRandom);
        const Solution oActual = Solve(vfMatrix, nSize);
        const Solution oExpected = PlainEigensystem(vfMatrix, nSize).Solve();
        for (std::size_t i = 0; i < nSize * nSize; ++i)
        {
            ASSERT_TRUE(test::SameSample(oActual.vfVectors[i], oExpected.vfVectors[i]))
                << nSize << ": " << i;
        }
        for (std::size_t i = 0; i < nSize; ++i)
        {
            ASSERT_TRUE(test::SameSample(oActual.vfValues[i], oExpected.vfValues[i]))
                << nSize << ": " << i;
        }
    }
}

// |A v - value v| and |v . w| within some roundings of single precision.
TEST(SolveEigensystem, GivesOrthogonalVectorsThatTheMatrixOnlyStretches)
{
    Random oRandom(2);
    for (const std::size_t nSize : {2U, 3U, 7U, 20U, 64U})
    {
        const Floats vfMatrix = RandomCovariance(nSize, nSize + 5, oRandom);
        const Solution oSolution = Solve(vfMatrix, nSize);
        const double dfRoundings = 2.0 * static_cast<double>(nSize) * 0x1p-23;
        const double dfNorm = std::fabs(oSolution.vfValues[0]);
        for (std::size_t k = 0; k < nSize; ++k)
        {
            const float* const pVector = &oSolution.vfVectors[k * nSize];
            for (std::size_t i = 0; i < nSize; ++i)
            {
                double dfProduct = 0;
                double dfDot = 0;
                for (std::size_t j = 0; j < nSize; ++j)
                {
                    dfProduct += double{vfMatrix[i * nSize + j]} * pVector[j];
                    dfDot += double{oSolution.vfVectors[i * nSize + j]} * pVector[j];
                }
                EXPECT_NEAR(dfProduct, double{oSolution.vfValues[k]} * pVector[i],
                            dfRoundings * dfNorm);
                EXPECT_NEAR(dfDot, i == k ? 1.0 : 0.0, dfRoundings);
            }
            EXPECT_LE(std::fabs(oSolution.vfValues[k]),
                      std::fabs(oSolution.vfValues[k == 0 ? 0 : k - 1]));
        }
    }
}

}  // namespace
}  // namespace kor::filters
