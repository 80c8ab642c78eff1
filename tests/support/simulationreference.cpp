#include "tests/support/simulationreference.h"

#include <algorithm>
#include <cmath>
#include <limits>

namespace kor::test
{

namespace
{

constexpr double mdfPi = 3.14159265358979;
constexpr double mdfInvPi = 0.318309886183791;
constexpr double mdfInv180 = 1.0 / 180.0;
constexpr double R = 6370000.0;
constexpr double mdfInvEarthRadius = 1.5698587127158556e-07;

int Int(double x)
{
    return x > -2147483648.0 && x < 2147483648.0 ? static_cast<int>(x)
                                                 : std::numeric_limits<int>::min();
}

/// An array whose elements outside read 0 and are not written.
template <class T>
struct Guarded
{
    std::vector<T> mvValues;
    T mOutside{};

    T& operator[](long long i)
    {
        mOutside = T();
        return i >= 0 && i < static_cast<long long>(mvValues.size())
                   ? mvValues[static_cast<std::size_t>(i)]
                   : mOutside;
    }
};

struct Corners
{
    double x0, y0, x1, y1, xn, yn, xf, yf;
};

Corners CornersOf(double H, double xs, double ys)
{
    if (H >= 270)
        return {xs, ys, 0, 0, 0, ys, xs, 0};
    if (H < 90)
        return {0, ys, xs, 0, 0, 0, xs, ys};
    if (H < 180)
        return {0, 0, xs, ys, xs, 0, 0, ys};
    return {xs, 0, 0, ys, xs, ys, 0, 0};
}

void SetOrbit(double dfAlti, double minRad, ReferenceView& o)
{
    o.mdfOrbitRadius = R + dfAlti;
    const double O = o.mdfOrbitRadius;
    o.mdfNearAngle = mdfPi * 0.5 - minRad - std::acos(O * std::sin(minRad) / R);
    if (dfAlti == 800000.0)
    {
        o.mdfNearSlant = std::sin(o.mdfNearAngle) * R / std::sin(minRad);
        const double w = 97000.0 / R;
        const double f = std::sqrt(R * R + O * O - std::cos(w + o.mdfNearAngle) * (2.0 * O * R));
        const double dl = std::acos((f * f + O * O - R * R) / (f * 2.0 * O)) - minRad;
        o.mdfChordAngle =
            mdfPi - dl - std::asin(std::sin(dl) * o.mdfNearSlant / (std::sin(w * 0.5) * (R * 2.0)));
    }
}

struct Order
{
    int first, last, rowStep, firstCol, lastCol, colStep;
};

Order OrderOf(double H, const std::vector<int>& Dbiw)
{
    Order o{};
    o.rowStep = H < 180 ? 1 : -1;
    o.first = H < 180 ? Dbiw[1] + 1 : Dbiw[1] + Dbiw[3];
    o.last = H < 180 ? Dbiw[1] + Dbiw[3] : Dbiw[1] + 1;
    o.colStep = 90 < H && H < 270 ? -1 : 1;
    o.firstCol = o.colStep < 0 ? Dbiw[2] : 1;
    o.lastCol = o.colStep < 0 ? 1 : Dbiw[2];
    return o;
}

}  // namespace

void ReferenceRange(const ReferenceView& o, bool bProducts, double dfAlti, double dfHead, double z,
                    double X, double Y, double& dfLook, double& dfRange)
{
    const double O = o.mdfOrbitRadius;
    const double px = o.mdfPixelX;
    const double E = o.mfWindowLeftX + X - px - 500000.0;
    const double a1 = std::atan(mdfInvEarthRadius * E);
    const double a2 = std::atan((E - (X - o.mnNearCol * px)) * mdfInvEarthRadius);
    double d = 0;
    if (dfHead == 0.0 || dfHead == 360.0 || dfHead == 180.0)
    {
        d = o.mfSideSign * ((a1 - a2) * R);
    }
    else
    {
        const double t = std::tan((450.0 - dfHead) * mdfPi * mdfInv180);
        d = (t * ((a1 - a2) * R) - Y * 1.0) * o.mfSideSign / std::sqrt(t * t + 1.0);
    }
    const double c = mdfInvEarthRadius * d + o.mdfNearAngle;
    const double P = R + z;
    const double r = std::sqrt(P * P + O * O - std::cos(c) * (P * 2.0 * O));
    const double invO = 1.0 / O;
    if (dfAlti != 800000.0)
    {
        double q = bProducts ? (R * R + O * O - r * r) * 0.5 * mdfInvEarthRadius * invO
                             : (R * R + O * O - r * r) / (R * 2.0 * O);
        if (q > 1.0)
        {
            q = 1.0;
        }
        dfRange = (std::acos(q) - o.mdfNearAngle) * R;
    }
    else
    {
        const double n = o.mdfNearSlant;
        const double b = o.mdfChordAngle;
        if (r >= n)
        {
            const double x = bProducts ? std::sin(b) * n * (1.0 / r) : std::sin(b) * n / r;
            dfRange = std::sin(mdfPi - b - std::asin(x)) * r / std::sin(b);
        }
        else
        {
            const double s = std::sin(mdfPi - b);
            const double x = bProducts ? s * n * (1.0 / r) : s * n / r;
            dfRange = std::sin(b - std::acos(x) - mdfPi * 0.5) * -1.0 * r / s;
        }
    }
    const double x = bProducts ? (O * O + r * r - P * P) * 0.5 * invO * (1.0 / r)
                               : (O * O + r * r - P * P) / (O * 2.0 * r);
    dfLook = std::acos(x) * 180.0 * mdfInvPi;
}

RadarReference SimulateRadar(SimulationInput in, const std::vector<std::int16_t>& vnDem,
                             bool bBytes)
{
    const int W = in.Dbiw[2];
    const auto dem = [&](int row, int i) -> std::int16_t
    {
        return i < static_cast<int>(in.mnDemWidth)
                   ? vnDem[static_cast<std::size_t>(row) * in.mnDemWidth +
                           static_cast<std::size_t>(i)]
                   : std::int16_t{0};
    };
    ReferenceView view;
    float fMirror = 1.0F;
    view.mfSideSign = 1.0F;
    const double xPerCol = in.moMap.GetXPerCol(), xOffset = in.moMap.GetXOffset();
    const double yPerRow = in.moMap.GetYPerRow(), yOffset = in.moMap.GetYOffset();
    view.mdfPixelX = std::fabs(xPerCol);
    const double px = view.mdfPixelX;
    const double py = std::fabs(yPerRow);
    if (in.NRPoint.empty())
    {
        in.NRPoint.push_back(static_cast<float>(in.Dbiw[0] * xPerCol + xOffset));
        in.NRPoint.push_back(static_cast<float>(in.Dbiw[1] * yPerRow + yOffset));
    }
    view.mnNearCol = Int((in.NRPoint[0] - xOffset) / px + 0.5) - in.Dbiw[0];
    const int nearRow = Int((yOffset - in.NRPoint[1]) / py + 0.5) - in.Dbiw[1];
    view.mfWindowLeftX = static_cast<float>(in.Dbiw[0] * xPerCol + xOffset);
    const double H = in.Head[0];
    const double sinH = std::sin(mdfPi * H / 180.0), cosH = std::cos(mdfPi * H / 180.0);
    const double xs = (W - 1) * px, ys = (in.Dbiw[3] - 1) * py;
    const Corners k = CornersOf(H, xs, ys);
    const double tStart = k.x0 * sinH - k.y0 * cosH, tEnd = k.x1 * sinH - k.y1 * cosH;
    RadarReference out;
    out.mnSarlin = Int((tEnd - tStart) / in.Outputxsz[1] + 0.5) + 1;
    double zMin = 0, zMax = 0;
    if (bBytes)
    {
        zMin = static_cast<double>(static_cast<float>(in.Escale[0] * in.Escale[1]));
        zMax = static_cast<float>(in.Escale[0] * 255.0 + zMin);
    }
    else
    {
        int step = static_cast<int>(sqrtf(static_cast<float>(in.Dbiw[3])));
        step = step == 0 ? 1 : step;
        float vMax = -1e38F, vMin = 1e38F;
        for (int row = in.Dbiw[1]; row < in.Dbiw[1] + in.Dbiw[3]; row += step)
        {
            for (int i = 0; i < W; ++i)
            {
                const float v = dem(row, i);
                if (v > vMax && dem(row, i) != in.Backelev[0])
                    vMax = v;
                if (v < vMin && dem(row, i) != in.Backelev[0])
                    vMin = v;
            }
        }
        if (in.Escale[1] == 0.0)
            in.Escale[1] = static_cast<double>(vMin);
        zMin = static_cast<double>(static_cast<float>(in.Escale[0] * in.Escale[1]));
        zMax = static_cast<float>(static_cast<double>(vMax) * in.Escale[0] + zMin);
    }
    if ((0 < H && H < 270) || (270 < H && H < 360))
        fMirror = -1.0F;
    if (180 <= H && H < 360)
        view.mfSideSign = -1.0F;
    SetOrbit(in.Alti[0], mdfPi * in.Minlook[0] / 180.0, view);
    const auto range = [&](double z, double X, double Y, double& look, double& g)
    {
        ReferenceRange(view, false, static_cast<float>(in.Alti[0]), static_cast<float>(in.Head[0]),
                       z, X, Y, look, g);
    };
    double look = 0, nearRange = 0, farRange = 0;
    range(zMax, k.xn, nearRow * py - k.yn, look, nearRange);
    range(zMin, k.xf, nearRow * py - k.yf, look, farRange);
    out.mnSarpix = Int((farRange - nearRange) / in.Outputxsz[0] + 0.5) + 1;
    const int sarpix = out.mnSarpix, sarlin = out.mnSarlin;
    const long long N = static_cast<long long>(sarpix) * sarlin;

    Guarded<std::uint16_t> image{std::vector<std::uint16_t>(static_cast<std::size_t>(N))};
    Guarded<unsigned char> layover{std::vector<unsigned char>(static_cast<std::size_t>(N))};
    Guarded<unsigned char> shadow = layover;
    Guarded<float> maxLook{std::vector<float>(16 * static_cast<std::size_t>(W))};
    Guarded<float> maxRange = maxLook;
    for (int i = 0; i < 4 * W; ++i)
        maxRange[i] = static_cast<float>(nearRange);
    Guarded<int> lineOfSlot{std::vector<int>(10000)};
    Guarded<long long> lineOffset{std::vector<long long>(65536)};
    for (int i = 0; i < std::min(sarlin, 65536); ++i)
        lineOffset[i] = -1;

    const Order o = OrderOf(H, in.Dbiw);
    const double iv = 1.0 / in.Oversamp[0], invRow = 1.0 / o.rowStep, invCol = 1.0 / o.colStep;
    int nSub = in.Oversamp[0];
    int slot = 1;
    std::vector<float> prev(static_cast<std::size_t>(W));
    std::vector<std::int16_t> cur(static_cast<std::size_t>(W) + 1);
    for (int row = o.first; row != o.last + o.rowStep; row += o.rowStep)
    {
        int nSubCol = in.Oversamp[0];
        if (row == o.last)
            nSub = in.Oversamp[0] + 1;
        if (row != o.first)
            std::copy_n(cur.begin(), W, prev.begin());
        for (int i = 0; i <= W; ++i)
            cur[static_cast<std::size_t>(i)] = dem(row - 1, i);
        bool bExit = false;
        for (int i = 0; i < W; ++i)
        {
            std::int16_t& v = cur[static_cast<std::size_t>(i)];
            if (v != in.Backelev[0])
            {
                const auto sum =
                    static_cast<std::int16_t>(static_cast<std::int16_t>(Int(in.Escale[1])) + v);
                const auto scaled =
                    static_cast<std::int16_t>(sum * static_cast<std::int16_t>(Int(in.Escale[0])));
                if (i < static_cast<int>(in.mnDemWidth))
                    v = scaled;
                if (row == o.first)
                {
                    prev[static_cast<std::size_t>(i)] = static_cast<float>(scaled);
                    bExit = i == W - 1;
                }
            }
        }
        if (bExit)
            continue;
        for (int col = o.firstCol; col != o.lastCol; col += o.colStep)
        {
            if (col == o.lastCol - o.colStep)
                nSubCol = in.Oversamp[0] + 1;
            if (cur[static_cast<std::size_t>(col)] == in.Backelev[0])
                continue;
            const auto a = static_cast<std::size_t>(col - 1);
            const auto b = static_cast<std::size_t>(col + o.colStep - 1);
            const float p0 = prev[a], p1 = prev[b];
            const float c0 = static_cast<float>(cur[a]), c1 = static_cast<float>(cur[b]);
            const double dzc = static_cast<double>(p1 - p0) * invCol;
            const double dzr = static_cast<double>(c0 - p0) * invRow;
            const double dzcr = static_cast<double>(c1 + p0 - c0 - p1) * invCol * invRow;
            for (int j = 1; j <= nSub; ++j)
            {
                const double v = ((j - 1) * o.rowStep) * iv;
                const double yLocal = (row - in.Dbiw[1] - o.rowStep) + v;
                const double Yn = (nearRow - yLocal) * py;
                const double down = (yLocal - 1.0) * cosH;
                for (int i = 1; i <= nSubCol; ++i)
                {
                    const double u = ((i - 1) * o.colStep) * iv;
                    const double z = p0 + u * dzc + v * dzr + u * dzcr * v;
                    const double xLocal = u + (col - 1);
                    const double t = xLocal * sinH * px - down * py - tStart;
                    const double lineF = (1.0 / in.Outputxsz[1]) * t + 1.0;
                    double g = 0;
                    range(z, px * xLocal, Yn, look, g);
                    long long column = Int((g - nearRange) * (1.0 / in.Outputxsz[0]) + 1.0 + 0.5);
                    if (fMirror < 0)
                        column = sarpix - column;
                    const int line = Int(lineF + 0.5);
                    if (line < 1 || line > sarlin)
                        continue;
                    const long long maskLine =
                        py == in.Outputxsz[1] ? line : Int((1.0 / py) * t + 1.0 + 0.5);
                    if (lineOffset[line - 1] < 0)
                    {
                        lineOfSlot[slot - 1] = line;
                        lineOffset[line - 1] = static_cast<long long>(slot - 1) * sarpix;
                        slot = slot % std::min(sarlin, 10000) + 1;
                    }
                    ++image[lineOffset[line - 1] - 1 + column];
                    if (i == 1 && j == 1)
                    {
                        const long long bit =
                            static_cast<long long>(line - 1) * sarpix - 1 + column;
                        if (static_cast<double>(maxLook[maskLine - 1]) > look)
                            shadow[bit] = 1;
                        else
                            maxLook[maskLine - 1] = static_cast<float>(look);
                        if (static_cast<double>(maxRange[maskLine - 1]) - in.Outputxsz[0] * 0.5 >=
                            g)
                            layover[bit] = 1;
                        else if (g > static_cast<double>(maxRange[maskLine - 1]))
                            maxRange[maskLine - 1] = static_cast<float>(g);
                    }
                }
            }
        }
    }
    out.mvnImage.resize(static_cast<std::size_t>(N));
    for (int s = 0; s < sarlin; ++s)
    {
        const int line = lineOfSlot[s];
        const int y = in.Flip ? sarlin - line : line - 1;
        if (y >= 0 && y < sarlin)
            std::copy_n(image.mvValues.begin() + static_cast<long long>(s) * sarpix, sarpix,
                        out.mvnImage.begin() + static_cast<long long>(y) * sarpix);
    }
    out.mvnLayover = layover.mvValues;
    out.mvnShadow = shadow.mvValues;
    out.mvdfEscale = in.Escale;
    out.mvdfNRPoint = in.NRPoint;
    return out;
}

MapReference SimulateMap(SimulationInput in, const DemSamples& oDem)
{
    const int W = in.Dbiw[2];
    const auto at = [&](int row, int i)
    { return static_cast<std::size_t>(row) * in.mnDemWidth + static_cast<std::size_t>(i); };
    ReferenceView view;
    float fMirror = 1.0F;
    view.mfSideSign = 1.0F;
    const auto mfPixelX = static_cast<float>(std::fabs(in.moMap.GetXPerCol()));
    const auto mfPixelY = static_cast<float>(std::fabs(in.moMap.GetYPerRow()));
    const double px = mfPixelX, py = mfPixelY;
    view.mdfPixelX = px;
    if (in.NRPoint.empty())
    {
        in.NRPoint.resize(2);
        in.moMap.RasterToMap(in.Dbiw[0], in.Dbiw[1], in.NRPoint[0], in.NRPoint[1]);
    }
    double dfCol = 0, dfRow = 0;
    in.moMap.MapToRaster(in.NRPoint[0], in.NRPoint[1], dfCol, dfRow);
    view.mnNearCol = Int(dfCol + 0.5) - in.Dbiw[0];
    const int nearRow = Int(dfRow + 0.5) - in.Dbiw[1];
    const double H = in.Head[0];
    const double sinH = std::sin(mdfPi * H * mdfInv180), cosH = std::cos(mdfPi * H * mdfInv180);
    const double xs = (W - 1) * px, ys = (in.Dbiw[3] - 1) * py;
    const Corners k = CornersOf(H, xs, ys);
    const double tStart = k.x0 * sinH - k.y0 * cosH, tEnd = k.x1 * sinH - k.y1 * cosH;
    const int sarlin = Int((tEnd - tStart) / py + 0.5) + 1;
    double zMin = 0, zMax = 0;
    if (oDem.mbBytes)
    {
        zMin = static_cast<double>(static_cast<float>(in.Escale[0] * in.Escale[1]));
        zMax = static_cast<float>(in.Escale[0] * 255.0 + zMin);
    }
    else
    {
        int step = static_cast<int>(sqrtf(static_cast<float>(in.Dbiw[3])));
        step = step == 0 ? 1 : step;
        float vMax = oDem.mvfFloat[at(in.Dbiw[1], 0)], vMin = vMax;
        for (int row = in.Dbiw[1]; row < in.Dbiw[1] + in.Dbiw[3]; row += step)
        {
            for (int i = 0; i < W; ++i)
            {
                const float v = oDem.mvfFloat[at(row, i)];
                if (v > vMax)
                    vMax = v;
                if (v < vMin)
                    vMin = v;
            }
        }
        if (in.Escale[1] == 0.0)
            in.Escale[1] = static_cast<double>(vMin);
        zMin = static_cast<double>(static_cast<float>(in.Escale[0] * in.Escale[1]));
        zMax = static_cast<float>(static_cast<double>(vMax) * in.Escale[0] + zMin);
    }
    if ((0 < H && H < 270) || (270 < H && H < 360))
        fMirror = -1.0F;
    if (180 <= H && H < 360)
        view.mfSideSign = -1.0F;
    SetOrbit(in.Alti[0], mdfPi * in.Minlook[0] * mdfInv180, view);
    const auto range = [&](double z, double X, double Y, double& look, double& g)
    { ReferenceRange(view, true, in.Alti[0], in.Head[0], z, X, Y, look, g); };
    double look = 0, nearRange = 0, farRange = 0;
    range(zMax, k.xn, nearRow * py - k.yn, look, nearRange);
    range(zMin, k.xf, nearRow * py - k.yf, look, farRange);
    const int sarpix = Int((farRange - nearRange) / px + 0.5 + 1.0);
    const long long N = static_cast<long long>(sarpix) * sarlin;

    Guarded<std::uint16_t> image{std::vector<std::uint16_t>(static_cast<std::size_t>(2 * N))};
    Guarded<unsigned char> layover{std::vector<unsigned char>(static_cast<std::size_t>(N + 1))};
    Guarded<unsigned char> shadow = layover;
    Guarded<float> maxLook{std::vector<float>(16 * static_cast<std::size_t>(W))};
    Guarded<float> maxRange = maxLook;
    for (int i = 0; i < 4 * W; ++i)
        maxRange[i] = static_cast<float>(nearRange);
    const Order o = OrderOf(H, in.Dbiw);
    const double iv = 1.0 / in.Oversamp[0], invRow = 1.0 / o.rowStep, invCol = 1.0 / o.colStep;
    int nSub = in.Oversamp[0];
    std::int16_t nMaxCount = 0;
    std::vector<float> prev(static_cast<std::size_t>(W)), cur(static_cast<std::size_t>(W));
    for (int row = o.first; row != o.last + o.rowStep; row += o.rowStep)
    {
        int nSubCol = in.Oversamp[0];
        if (row == o.last)
            nSub = in.Oversamp[0] + 1;
        if (row != o.first)
            prev = cur;
        for (int i = 0; i < W; ++i)
        {
            const double x = (oDem.mvdfDouble[at(row - 1, i)] + in.Escale[1]) * in.Escale[0];
            cur[static_cast<std::size_t>(i)] = oDem.mpfnStored(x);
        }
        if (row == o.first)
        {
            prev = cur;
            continue;
        }
        for (int col = o.firstCol; col != o.lastCol; col += o.colStep)
        {
            if (col == o.lastCol - o.colStep)
                nSubCol = in.Oversamp[0] + 1;
            const auto a = static_cast<std::size_t>(col - 1);
            const auto b = static_cast<std::size_t>(col + o.colStep - 1);
            const float p0 = prev[a], p1 = prev[b], c0 = cur[a], c1 = cur[b];
            const double dzc = static_cast<double>(p1 - p0) * invCol;
            const double dzr = static_cast<double>(c0 - p0) * invRow;
            const double dzcr = static_cast<double>(c1 + p0 - c0 - p1) * invCol * invRow;
            for (int j = 1; j <= nSub; ++j)
            {
                const double v = ((j - 1) * o.rowStep) * iv;
                const double yLocal = (row - in.Dbiw[1] - o.rowStep) + v;
                const double Yn = (nearRow - yLocal) * py;
                const double down = (yLocal - 1.0) * cosH;
                for (int i = 1; i <= nSubCol; ++i)
                {
                    const double u = ((i - 1) * o.colStep) * iv;
                    const double z = p0 + u * dzc + v * dzr + u * dzcr * v;
                    const double xLocal = u + (col - 1);
                    const double t = xLocal * sinH * px - down * py - tStart;
                    const double lineF = (1.0 / py) * t + 1.0;
                    double g = 0;
                    range(z, px * xLocal, Yn, look, g);
                    long long column = Int((g - nearRange) * (1.0 / px) + 1.0 + 0.5);
                    if (fMirror < 0)
                        column = sarpix - column;
                    const int line = Int(lineF + 0.5);
                    if (line < 1 || line > sarlin)
                        continue;
                    const long long idx = static_cast<long long>(line - 1) * sarpix - 1 + column;
                    const int count = ++image[idx];
                    if (idx >= 0 && idx < 2 * N && count > nMaxCount)
                        nMaxCount = static_cast<std::int16_t>(count);
                    if (i == 1 && j == 1)
                    {
                        if (static_cast<double>(maxLook[line - 1]) > look)
                            shadow[idx] = 1;
                        else
                            maxLook[line - 1] = static_cast<float>(look);
                        if (static_cast<double>(maxRange[line - 1]) - px * 0.5 >= g)
                            layover[idx] = 1;
                        else if (g > static_cast<double>(maxRange[line - 1]))
                            maxRange[line - 1] = static_cast<float>(g);
                    }
                }
            }
        }
    }
    const float fInvMax = 1.0F / static_cast<float>(nMaxCount);
    MapReference out;
    const auto nPixels = static_cast<std::size_t>(W) * static_cast<std::size_t>(in.Dbiw[3]);
    out.mvdfResults.resize(nPixels);
    out.mvnLayover.resize(nPixels);
    out.mvnShadow.resize(nPixels);
    for (int row = o.first; row != o.last + o.rowStep; row += o.rowStep)
    {
        for (int col = o.firstCol; col != o.lastCol + o.colStep; col += o.colStep)
        {
            const double z = (oDem.mvdfDouble[at(row - 1, col - 1)] + in.Escale[1]) * in.Escale[0];
            const double lineF =
                ((col - 1.0) * sinH * px -
                 (static_cast<double>(row - in.Dbiw[1]) - 1.0) * cosH * py - tStart) *
                    (1.0 / px) +
                1.0;
            const double X = col * px;
            const double Y =
                py * nearRow - static_cast<double>(row) + static_cast<double>(in.Dbiw[1]);
            double g = 0;
            range(z, X, Y, look, g);
            double colF = (g - nearRange) * (1.0 / px) + 1.0;
            if (fMirror < 0)
                colF = static_cast<double>(sarpix) - colF;
            const int lineR = Int(lineF + 0.5), colR = Int(colF + 0.5);
            const int lineT = Int(lineF), colT = Int(colF);
            const long long base = (static_cast<long long>(lineT) - 1) * sarpix - 1 + colT;
            const auto squeeze = [&](std::uint16_t count)
            { return static_cast<double>(sqrtf(static_cast<float>(count) * fInvMax)) * 255.0; };
            double result = 0;
            if (2 <= colR && colR <= sarpix - 1 && 2 <= lineR && lineR <= sarlin - 1)
            {
                const float a = static_cast<float>(colF) - static_cast<float>(colT);
                const float b = static_cast<float>(lineF) - static_cast<float>(lineT);
                const long long places[] = {base, base + 1, base + sarpix, base + sarpix + 1};
                for (const long long place : places)
                {
                    if (oDem.mbBytes)
                    {
                        const double x = squeeze(image[place]);
                        image[place] =
                            static_cast<std::uint16_t>(std::isnan(x) ? 0 : static_cast<int>(x));
                    }
                }
                const float c0 = image[places[0]], c1 = image[places[1]];
                const float c2 = image[places[2]], c3 = image[places[3]];
                const float value = c1 * (a * (1 - b)) + c0 * ((1 - a) * (1 - b)) +
                                    c2 * (b * (1 - a)) + c3 * (b * a);
                result = static_cast<double>(value) + 0.5;
            }
            else
            {
                result = oDem.mbBytes ? squeeze(image[base]) : static_cast<double>(image[base]);
            }
            const std::size_t nOut =
                static_cast<std::size_t>(row - 1 - in.Dbiw[1]) * static_cast<std::size_t>(W) +
                static_cast<std::size_t>(col - 1);
            out.mvdfResults[nOut] = result;
            const long long mask = (static_cast<long long>(lineR) - 1) * sarpix - 1 + colR;
            out.mvnLayover[nOut] = layover[mask];
            out.mvnShadow[nOut] = shadow[mask];
        }
    }
    return out;
}

}  // namespace kor::test
