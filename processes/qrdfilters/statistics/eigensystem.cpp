#include "processes/qrdfilters/statistics/eigensystem.h"

#include <algorithm>
#include <cmath>
#include <utility>
#include <vector>

#include "platform/exception/exception.h"

namespace kor::filters
{

namespace
{

constexpr int kMostIterations = 30;

/// A square matrix while it is reduced and diagonalised. Indices count from 0. Every sum starts at
/// 0 and goes up in its index; where loops are turned round, each sum still does.
class Eigensystem
{
public:
    Eigensystem(std::size_t nSize, std::span<float> oMatrix, std::span<float> oValues)
        : mn(nSize), moA(oMatrix), moD(oValues), mvfE(nSize)
    {
    }

    void Solve()
    {
        Reduce();
        AccumulateTransformations();
        TransposeMatrix();
        FindValues();
        SortDescending();
        std::transform(moA.begin(), moA.end(), moA.begin(), [](float f) { return f * -1.0F; });
    }

private:
    float* Row(std::size_t i) const { return &moA[i * mn]; }

    /// Householder: the matrix becomes tridiagonal, with mvfE beside the diagonal; its rows keep
    /// the transformations and moD their norms.
    void Reduce()
    {
        for (std::size_t i = mn - 1; i > 0; --i)
        {
            float* const pRow = Row(i);
            float fScale = 0.0F;
            for (std::size_t k = 0; k < i && i > 1; ++k)
            {
                fScale += std::fabs(pRow[k]);
            }
            moD[i] = 0.0F;
            if (fScale == 0.0F)
            {
                mvfE[i] = pRow[i - 1];
            }
            else
            {
                moD[i] = ReduceRow(i, fScale);
            }
        }
        moD[0] = 0.0F;
        mvfE[0] = 0.0F;
    }

    /// Clears row i left of the element beside the diagonal, by a reflection that is applied to the
    /// rows above. Gives half the square of its vector's length.
    float ReduceRow(std::size_t i, float fScale)
    {
        float* const pRow = Row(i);
        float h = 0.0F;
        for (std::size_t k = 0; k < i; ++k)
        {
            pRow[k] /= fScale;
            h += pRow[k] * pRow[k];
        }
        float f = pRow[i - 1];
        float g = f >= 0.0F ? -std::sqrt(h) : std::sqrt(h);
        mvfE[i] = fScale * g;
        h -= f * g;
        pRow[i - 1] = f - g;
        f = 0.0F;
        for (std::size_t j = 0; j < i; ++j)
        {
            Row(j)[i] = pRow[j] / h;
            g = 0.0F;
            for (std::size_t k = 0; k <= j; ++k)
            {
                g += Row(j)[k] * pRow[k];
            }
            for (std::size_t k = j + 1; k < i; ++k)
            {
                g += Row(k)[j] * pRow[k];
            }
            mvfE[j] = g / h;
            f += mvfE[j] * pRow[j];
        }
        const float hh = f / (h + h);
        for (std::size_t j = 0; j < i; ++j)
        {
            f = pRow[j];
            g = mvfE[j] - hh * f;
            mvfE[j] = g;
            for (std::size_t k = 0; k <= j; ++k)
            {
                Row(j)[k] -= f * mvfE[k] + g * pRow[k];
            }
        }
        return h;
    }

    /// Multiplies the reflections; the matrix becomes their product and moD the diagonal.
    void AccumulateTransformations()
    {
        std::vector<float> vfSums(mn);
        for (std::size_t i = 0; i < mn; ++i)
        {
            float* const pRow = Row(i);
            if (moD[i] != 0.0F)
            {
                std::fill(vfSums.begin(), vfSums.end(), 0.0F);
                for (std::size_t k = 0; k < i; ++k)
                {
                    for (std::size_t j = 0; j < i; ++j)
                    {
                        vfSums[j] += pRow[k] * Row(k)[j];
                    }
                }
                for (std::size_t k = 0; k < i; ++k)
                {
                    for (std::size_t j = 0; j < i; ++j)
                    {
                        Row(k)[j] -= vfSums[j] * Row(k)[i];
                    }
                }
            }
            moD[i] = pRow[i];
            pRow[i] = 1.0F;
            for (std::size_t j = 0; j < i; ++j)
            {
                Row(j)[i] = 0.0F;
                pRow[j] = 0.0F;
            }
        }
    }

    /// From here on the vectors are rows: each rotation then works on two runs of memory.
    void TransposeMatrix()
    {
        for (std::size_t i = 0; i < mn; ++i)
        {
            for (std::size_t j = 0; j < i; ++j)
            {
                std::swap(Row(i)[j], Row(j)[i]);
            }
        }
    }

    /// QL: rotations make the tridiagonal matrix diagonal, value by value.
    void FindValues()
    {
        std::rotate(mvfE.begin(), mvfE.begin() + 1, mvfE.end());  // element 0 is 0
        for (std::size_t l = 0; l < mn; ++l)
        {
            int nIterations = 0;
            for (std::size_t m = FindSplit(l); m != l; m = FindSplit(l))
            {
                if (nIterations == kMostIterations)
                {
                    throw DataException("Too many iteration in eigen vector calculation.", "", "",
                                        0);
                }
                ++nIterations;
                Sweep(l, m);
            }
        }
    }

    /// The first row from l on whose element beside the diagonal is nothing beside the diagonal.
    std::size_t FindSplit(std::size_t l) const
    {
        for (std::size_t m = l; m + 1 < mn; ++m)
        {
            const float dd = std::fabs(moD[m]) + std::fabs(moD[m + 1]);
            if (std::fabs(mvfE[m]) + dd == dd)
            {
                return m;
            }
        }
        return mn - 1;
    }

    /// One step of QL on rows l to m with its shift.
    void Sweep(std::size_t l, std::size_t m)
    {
        float g = (moD[l + 1] - moD[l]) / (2.0F * mvfE[l]);
        float r = std::sqrt(g * g + 1.0F);
        g = moD[m] - moD[l] + mvfE[l] / (g + (g >= 0.0F ? r : -r));
        float s = 1.0F;
        float c = 1.0F;
        float p = 0.0F;
        for (std::size_t i = m; i-- > l;)
        {
            const float f = s * mvfE[i];
            const float b = c * mvfE[i];
            if (std::fabs(f) >= std::fabs(g))
            {
                c = g / f;
                r = std::sqrt(c * c + 1.0F);
                mvfE[i + 1] = f * r;
                s = 1.0F / r;
                c = c * s;
            }
            else
            {
                s = f / g;
                r = std::sqrt(s * s + 1.0F);
                mvfE[i + 1] = g * r;
                c = 1.0F / r;
                s = s * c;
            }
            g = moD[i + 1] - p;
            r = (moD[i] - g) * s + 2.0F * c * b;
            p = s * r;
            moD[i + 1] = g + p;
            g = c * r - b;
            Rotate(Row(i), Row(i + 1), s, c);
        }
        moD[l] = moD[l] - p;
        mvfE[l] = g;
        mvfE[m] = 0.0F;
    }

    void Rotate(float* __restrict pFirst, float* __restrict pSecond, float s, float c) const
    {
        for (std::size_t k = 0; k < mn; ++k)
        {
            const float f = pSecond[k];
            pSecond[k] = s * pFirst[k] + c * f;
            pFirst[k] = c * pFirst[k] - s * f;
        }
    }

    void SortDescending()
    {
        for (std::size_t i = 0; i + 1 < mn; ++i)
        {
            std::size_t nGreatest = i;
            for (std::size_t j = i + 1; j < mn; ++j)
            {
                if (std::fabs(moD[j]) >= std::fabs(moD[nGreatest]))
                {
                    nGreatest = j;
                }
            }
            if (nGreatest != i)
            {
                std::swap(moD[i], moD[nGreatest]);
                std::swap_ranges(Row(i), Row(i) + mn, Row(nGreatest));
            }
        }
    }

    std::size_t mn;
    std::span<float> moA;
    std::span<float> moD;
    std::vector<float> mvfE;
};

}  // namespace

void SolveEigensystem(std::size_t nSize, std::span<float> oMatrix, std::span<float> oValues)
{
    if (nSize > 0)
    {
        Eigensystem(nSize, oMatrix, oValues).Solve();
    }
}

}  // namespace kor::filters
