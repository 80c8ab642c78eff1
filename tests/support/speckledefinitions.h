#pragma once

#include <cmath>

/// What the radar filters make of a window, step by step as they are defined: S2, S1 and n are the
/// sum of squares, the sum and the number of the valid samples of the window, x is the sample in
/// its middle.
namespace kor::test
{

struct Moments
{
    double S2;
    double S1;
    double n;
};

/// The moments of WindowSums<MomentTerms>.
template <class Sums>
Moments MomentsOf(const Sums& oSums)
{
    return {oSums.moValues[0], oSums.moValues[1], oSums.mdfCount};
}

inline double Kuan(const Moments& o, double x, double L)
{
    const auto [S2, S1, n] = o;
    if (n == 1.0)
    {
        return x;
    }
    const double mean = S1 / n;
    const double var = (S2 - mean * n * mean) / (n - 1.0);
    const double w = (L - mean * mean / var) / (L + 1.0);
    if (0.0 >= w)
    {
        return mean;
    }
    return (1.0 - w) * mean + w * x;
}

inline double Gamma(const Moments& o, double x, double L)
{
    const auto [S2, S1, n] = o;
    if (n == 1.0)
    {
        return x;
    }
    const double mean = S1 / n;
    const double var = (S2 - mean * n * mean) / (n - 1.0);
    const double q = mean * mean;
    const double v = L * var;
    if (q >= v)
    {
        return mean;
    }
    if (v >= q * 2.0)
    {
        return x;
    }
    const double a = (L + 1.0) * q / (v - q);
    const double b = a - L - 1.0;
    const double d = a * 4.0 * L * mean * x + b * q * b;
    double t = b * mean;
    if (d > 0.0)
    {
        t += std::sqrt(d);
    }
    return t / (a * 2.0);
}

/// oExp is the exponential function.
template <class Exp>
double EnhancedLee(const Moments& o, double x, double Cu, double Cmax, double dfDamp,
                   const Exp& oExp)
{
    const auto [S2, S1, n] = o;
    if (n == 1.0)
    {
        return x;
    }
    const double mean = S1 / n;
    const double sd = std::sqrt((S2 - mean * n * mean) / (n - 1.0));
    const double Ci = sd / mean;
    if (Cu >= Ci)
    {
        return mean;
    }
    if (Ci >= Cmax)
    {
        return x;
    }
    const double e = oExp(-((Ci - Cu) * dfDamp / (Cmax - Ci)));
    return (1.0 - e) * x + e * mean;
}

/// Models 1 additive, 2 multiplicative, 3 both.
inline double Lee(const Moments& o, double x, int nModel, double dfAddMean, double dfMulMean,
                  double dfNoiseVar)
{
    const auto [S2, S1, n] = o;
    if (n == 1.0)
    {
        return x;
    }
    const double mean = S1 / n;
    const double var = (S2 - mean * n * mean) / (n - 1.0);
    if (nModel == 1)
    {
        return (x - mean) * (var / (var + dfNoiseVar)) + mean;
    }
    if (nModel == 2)
    {
        double k = 1.0 - mean * dfNoiseVar * mean / var;
        if (0.0 > k)
        {
            k = 0.0;
        }
        return (x - mean * dfMulMean) * k + mean;
    }
    const double a = var * dfMulMean;
    const double k = a / (a * dfMulMean + var + dfNoiseVar);
    return (x - mean * dfMulMean - dfAddMean) * k + mean;
}

}  // namespace kor::test
