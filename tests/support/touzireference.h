#pragma once

#include <algorithm>
#include <array>
#include <cmath>
#include <cstdint>
#include <limits>
#include <vector>

#include "basic/tessel/mask/mask.h"
#include "basic/tessel/raster/raster.h"
#include "processes/qrdfilters/sampleconversion.h"

namespace kor::test
{

/// The Touzi filter as it is defined, pixel by pixel, without any thought of speed.
class TouziReference
{
public:
    enum Case
    {
        SCATTERER,
        LINE,
        FLAT,
        EDGE,
        NEUTRAL
    };

    double dfLooks = 10.0;
    double dfContour = 0.5;
    double dfGradiant = 0.1;
    int nAmplit = 0;
    bool bBGZero = false;
    /// How often each case was met.
    std::array<int, 5> anCases{};

    template <class TIn, class TOut>
    void Process(const tessel::Raster& oIn, const tessel::Mask* poMask, const tessel::Raster& oOut)
    {
        Start(oIn);
        for (mnY = 0; mnY < static_cast<int>(oIn.mnHeight); ++mnY)
        {
            LoadWindow<TIn>(oIn);
            for (mnX = 0; mnX < mnWidth; ++mnX)
            {
                std::vector<double> vdfLine(static_cast<std::size_t>(mnChannels), 0.0);
                TOut* pOut = oOut.GetPixelAs<TOut>(mnX, mnY);
                if (!IsValidPixel(poMask))
                {
                    for (mnC = 0; mnC < mnChannels; ++mnC)
                    {
                        pOut[mnC] = bBGZero ? TOut(0) : Store<TOut>(At(0, 0));
                    }
                    continue;
                }
                FilterPixel(vdfLine);
                for (int c = 0; c < mnChannels; ++c)
                {
                    pOut[c] = Store<TOut>(vdfLine[static_cast<std::size_t>(c)]);
                }
            }
        }
    }

private:
    struct Variation
    {
        double mean = 0.0;
        double cv = 0.0;
    };

    struct Detection
    {
        double rmin = 1.0;
        double rdiff = 0.0;
        int dir = 0;
        double meanA = 0.0;
        double meanB = 0.0;
    };

    void Start(const tessel::Raster& oIn)
    {
        mnWidth = static_cast<int>(oIn.mnWidth);
        mnChannels = static_cast<int>(oIn.mnChannels);
        m = static_cast<int>(oIn.mnMarginX);
        mnMarginY = static_cast<int>(oIn.mnMarginY);
        dfCu = 0.523 / std::sqrt(dfLooks);
        dfCmax = static_cast<double>(static_cast<float>(std::sqrt(2.0 / dfLooks + 1.0) * 0.523));
        nStartSize = static_cast<int>(dfLooks) == 1 ? 5 : 3;
    }

    template <class TIn>
    void LoadWindow(const tessel::Raster& oIn)
    {
        mvdfWindow.clear();
        for (int r = mnY - mnMarginY; r <= mnY + mnMarginY; ++r)
        {
            for (int x = -m; x < mnWidth + m; ++x)
            {
                for (int c = 0; c < mnChannels; ++c)
                {
                    const double v =
                        filters::ConvertSample<TIn, double>(oIn.GetPixelAs<TIn>(x, r)[c]);
                    mvdfWindow.push_back(nAmplit == 1   ? std::sqrt(v)
                                         : nAmplit == 2 ? std::pow(10.0, v / 10)
                                                        : v);
                }
            }
        }
    }

    /// The sample at an offset from the centre.
    double At(int dy, int dx) const
    {
        const int nRow = dy + mnMarginY;
        const int nColumn = mnX + dx + m;
        if (nRow < 0 || nRow > 2 * mnMarginY || nColumn < 0 || nColumn >= mnWidth + 2 * m)
        {
            return 0.0;
        }
        return mvdfWindow[static_cast<std::size_t>(
            (nRow * (mnWidth + 2 * m) + nColumn) * mnChannels + mnC)];
    }

    bool IsValidPixel(const tessel::Mask* poMask) const
    {
        if (poMask == nullptr)
        {
            return true;
        }
        std::array<unsigned char, 1> anBit{};
        poMask->ExpandRow(mnX, mnY, anBit);
        return anBit[0] != 0;
    }

    void Add(float& fSum, int dy, int dx) const { fSum += static_cast<float>(At(dy, dx)); }

    template <class TOut>
    TOut Store(double x) const
    {
        if (nAmplit == 1)
        {
            x = x * x;
        }
        if (nAmplit == 2)
        {
            x = x > 0 ? 10 * std::log10(x * x) : 0.0;
        }
        if constexpr (std::is_floating_point_v<TOut>)
        {
            return static_cast<TOut>(x);
        }
        else
        {
            using A = filters::Arithmetic<TOut>;
            if (std::isnan(x))
            {
                return 0;
            }
            const double r = std::trunc(x + 0.5);
            if (r >= static_cast<double>(std::numeric_limits<A>::max()))
            {
                return static_cast<TOut>(std::numeric_limits<A>::max());
            }
            if (r <= static_cast<double>(std::numeric_limits<A>::min()))
            {
                return static_cast<TOut>(std::numeric_limits<A>::min());
            }
            return static_cast<TOut>(static_cast<A>(r));
        }
    }

    static Variation VariationOf(float S1, float S2, double n)
    {
        Variation o;
        o.mean = S1 / n;
        o.cv = o.mean == 0 ? 0.0 : std::sqrt(S2 / n - o.mean * o.mean) / o.mean;
        return o;
    }

    template <class IsInside>
    Variation VariationWhere(int size, double n, const IsInside& oIsInside) const
    {
        const int h = std::min((size - 1) / 2, m);
        float S1 = 0;
        float S2 = 0;
        for (int dy = -h; dy <= h; ++dy)
        {
            for (int dx = -h; dx <= h; ++dx)
            {
                if (oIsInside(dy, dx))
                {
                    Add(S1, dy, dx);
                    S2 += static_cast<float>(At(dy, dx) * At(dy, dx));
                }
            }
        }
        return VariationOf(S1, S2, n);
    }

    Variation WindowVariation(int size) const
    {
        return VariationWhere(size, size * size, [](int, int) { return true; });
    }

    static void Select(Detection& o, const std::array<double, 5>& r)
    {
        double best = 1.0;
        double worst = 0;
        for (int d = 1; d <= 4; ++d)
        {
            const double dfRatio = r[static_cast<std::size_t>(d)];
            if (dfRatio <= best)
            {
                o.dir = d;
                best = dfRatio;
            }
            if (worst <= dfRatio)
            {
                worst = dfRatio;
            }
        }
        o.rmin = best;
        o.rdiff = worst - best;
    }

    Detection DetectLine(int size) const
    {
        const int h = (size - 1) / 2;
        std::array<float, 5> L{};
        float fRows = 0;
        float fColumns = 0;
        std::array<float, 5> afBeside{};
        std::array<int, 5> anBeside{};
        for (int k = -h; k <= h; ++k)
        {
            Add(L[1], 0, k);
            Add(L[2], k, 0);
            Add(L[3], k, k);
            Add(L[4], k, -k);
        }
        for (int dy = -2; dy <= 2; ++dy)
        {
            for (int dx = -h; dx <= h; ++dx)
            {
                Add(fRows, dy, dx);
            }
        }
        for (int dy = -h; dy <= h; ++dy)
        {
            for (int dx = -2; dx <= 2; ++dx)
            {
                Add(fColumns, dy, dx);
            }
        }
        for (const std::size_t d : {std::size_t{3}, std::size_t{4}})
        {
            for (int dy = -h; dy <= h; ++dy)
            {
                for (const int nOffset : {1, -1, 2, -2})
                {
                    const int dx = (d == 3 ? dy : -dy) + nOffset;
                    if (-h <= dx && dx <= h)
                    {
                        Add(afBeside[d], dy, dx);
                        ++anBeside[d];
                    }
                }
            }
        }
        std::array<double, 5> N{};
        N[1] = (static_cast<double>(fRows) - static_cast<double>(L[1])) / (4.0 * size);
        N[2] = (static_cast<double>(fColumns) - static_cast<double>(L[2])) / (4.0 * size);
        N[3] = static_cast<double>(afBeside[3]) / anBeside[3];
        N[4] = static_cast<double>(afBeside[4]) / anBeside[4];
        std::array<double, 5> r{};
        for (std::size_t d = 1; d <= 4; ++d)
        {
            r[d] = (static_cast<double>(L[d]) / size) / N[d];
            if (r[d] > 1.0)
            {
                r[d] = 1.0 / r[d];
            }
            if (N[d] == 0)
            {
                r[d] = 0;
            }
        }
        Detection o;
        Select(o, r);
        o.meanA = static_cast<double>(L[static_cast<std::size_t>(o.dir)]) / size;
        return o;
    }

    Detection DetectEdge(int size) const
    {
        const int h = (size - 1) / 2;
        std::array<float, 5> A{};
        std::array<float, 5> B{};
        for (int dy = -h; dy <= h; ++dy)
        {
            for (int dx = -h; dx <= h; ++dx)
            {
                const std::array<int, 5> anSide = {0, dy, dx, dx - dy, dy + dx};
                for (std::size_t d = 1; d <= 4; ++d)
                {
                    if (anSide[d] < 0)
                    {
                        Add(A[d], dy, dx);
                    }
                    if (anSide[d] > 0)
                    {
                        Add(B[d], dy, dx);
                    }
                }
            }
        }
        std::array<double, 5> r{};
        for (std::size_t d = 1; d <= 4; ++d)
        {
            r[d] = static_cast<double>(A[d]) / static_cast<double>(B[d]);
            if (r[d] > 1.0)
            {
                r[d] = 1.0 / r[d];
            }
        }
        Detection o;
        Select(o, r);
        o.meanA = static_cast<double>(A[static_cast<std::size_t>(o.dir)]) / (size * h);
        o.meanB = static_cast<double>(B[static_cast<std::size_t>(o.dir)]) / (size * h);
        return o;
    }

    double LineEstimate(int size, int dir, double lineMean) const
    {
        const int h = (size - 1) / 2;
        float P = 0;
        float Q = 0;
        for (int dy = -h; dy <= h; ++dy)
        {
            for (int dx = -h; dx <= h; ++dx)
            {
                const std::array<bool, 5> abP = {false, dy == -1, dx == -1, dy == dx + 1,
                                                 dy + dx == 1};
                const std::array<bool, 5> abQ = {false, dy == 1, dx == 1, dy == dx - 1,
                                                 dy + dx == -1};
                if (abP[static_cast<std::size_t>(dir)])
                {
                    Add(P, dy, dx);
                }
                if (abQ[static_cast<std::size_t>(dir)])
                {
                    Add(Q, dy, dx);
                }
            }
        }
        const double p = static_cast<double>(P) / size;
        const double q = static_cast<double>(Q) / size;
        const double dfChosen = std::fabs(lineMean - p) <= std::fabs(lineMean - q) ? p : q;
        return (dfChosen + lineMean) * 0.5;
    }

    int EdgeSide(int size, const Detection& oEdge) const
    {
        const int h = (size - 1) / 2;
        float fSum = 0;
        for (int dy = -h; dy <= h; ++dy)
        {
            for (int dx = -h; dx <= h; ++dx)
            {
                const std::array<int, 5> anFromLine = {9, dy, dx, dy - dx, dy + dx};
                if (std::abs(anFromLine[static_cast<std::size_t>(oEdge.dir)]) <= 1)
                {
                    Add(fSum, dy, dx);
                }
            }
        }
        const double b = static_cast<double>(fSum) / (oEdge.dir <= 2 ? 3 * size : 3 * size - 2);
        return std::fabs(b - oEdge.meanB) < std::fabs(b - oEdge.meanA) ? 2 : 1;
    }

    Variation HalfWindowVariation(int size, int dir, int side) const
    {
        const int h = (size - 1) / 2;
        return VariationWhere(size, (h + 1) * size,
                              [&](int dy, int dx)
                              {
                                  if (dir == 0)
                                  {
                                      return false;
                                  }
                                  const std::array<int, 5> anSide = {0, dy, dx, dx - dy, dy + dx};
                                  const int n = anSide[static_cast<std::size_t>(dir)];
                                  return side == 1 ? n <= 0 : n >= 0;
                              });
    }

    double Blend(const Variation& o, double x) const
    {
        if (dfCu >= o.cv)
        {
            return o.mean;
        }
        const double k = 1 - dfCu * dfCu / (o.cv * o.cv);
        return (1 - k) * o.mean + k * x;
    }

    void FilterPixel(std::vector<double>& vdfLine)
    {
        for (mnC = 0; mnC < mnChannels; ++mnC)
        {
            double& dfOut = vdfLine[static_cast<std::size_t>(mnC)];
            const double x = At(0, 0);
            const Variation oFive = WindowVariation(5);
            if (oFive.cv >= dfCmax)
            {
                dfOut = Blend(oFive, x);
                ++anCases[SCATTERER];
                return;
            }
            if (IsLine(oFive, dfOut))
            {
                ++anCases[LINE];
                continue;
            }
            if (IsFlat(dfOut))
            {
                ++anCases[FLAT];
                continue;
            }
            const Detection oEdge = DetectEdge(5);
            const bool bEdge = dfContour >= oEdge.rmin;
            ++anCases[bEdge ? EDGE : NEUTRAL];
            dfOut = Blend(bEdge ? GrownEdge(oEdge) : GrownWindow(oEdge.rdiff), x);
        }
    }

    bool IsLine(const Variation& oFive, double& dfOut) const
    {
        Detection oLast = DetectLine(5);
        if (!(dfContour >= oLast.rmin && oFive.cv > dfCu - 0.04))
        {
            return false;
        }
        dfOut = LineEstimate(5, oLast.dir, oLast.meanA);
        for (const int size : {7, 9, 11})
        {
            const Detection o = DetectLine(size);
            if (o.rdiff < oLast.rdiff || o.dir != oLast.dir)
            {
                break;
            }
            dfOut = LineEstimate(size, o.dir, o.meanA);
            oLast = o;
        }
        return true;
    }

    bool IsFlat(double& dfOut) const
    {
        bool bFlat = false;
        for (int size = nStartSize; size <= 2 * m + 1; size += 2)
        {
            const Variation o = WindowVariation(size);
            if (!(dfCu >= o.cv))
            {
                break;
            }
            dfOut = o.mean;
            bFlat = true;
        }
        return bFlat;
    }

    Variation GrownEdge(Detection oKept) const
    {
        int nSize = 5;
        for (const int size : {7, 9, 11})
        {
            const Detection o = DetectEdge(size);
            if (o.rdiff < oKept.rdiff || o.dir != oKept.dir)
            {
                break;
            }
            oKept = o;
            nSize = size;
        }
        return HalfWindowVariation(nSize, oKept.dir, EdgeSide(nSize, oKept));
    }

    Variation GrownWindow(double rlast) const
    {
        Variation oLast = WindowVariation(nStartSize + 2);
        for (int size = nStartSize + 4; size <= 2 * m + 1; size += 2)
        {
            const double rdiff = DetectEdge(size).rdiff;
            const Variation o = WindowVariation(size);
            if (rdiff > rlast || !(dfGradiant > std::fabs(o.cv - oLast.cv)))
            {
                break;
            }
            oLast = o;
            rlast = rdiff;
        }
        return oLast;
    }

    int mnWidth = 0;
    int mnChannels = 0;
    int m = 0;  ///< the x margin, which serves both axes
    int mnMarginY = 0;
    double dfCu = 0.0;
    double dfCmax = 0.0;
    int nStartSize = 0;
    std::vector<double> mvdfWindow;
    int mnX = 0;
    int mnY = 0;
    int mnC = 0;
};

}  // namespace kor::test
