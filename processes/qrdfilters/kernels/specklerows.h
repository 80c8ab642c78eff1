#pragma once

#include <span>

/// Finishing functions of the speckle filters. Each pixel comes with the sums of its window: sum
/// and sum of squares of the n valid samples, from which mean = sum / n and
/// var = (squares - mean * n * mean) / (n - 1), and its own sample x. Products and quotients are
/// formed from the left. Where n is 1 the result is x. Lengths are multiples of kRowPadding.
namespace kor::filters::kernels
{

/// The window sums of a row of samples.
struct MomentRows
{
    const double* mpSums;
    const double* mpSquares;
    const double* mpCounts;
    const double* mpCentres;
};

/// The noise of a Lee filter.
struct LeeNoise
{
    double mdfAddMean;
    double mdfMulMean;
    double mdfVariance;
};

/// oOut[i] = (x - mean) * (var / (var + noise)) + mean.
void LeeAdditiveRow(const MomentRows& oRows, const LeeNoise& oNoise, std::span<double> oOut);

/// oOut[i] = (x - mean * mulMean) * k + mean, with k = 1 - mean * noise * mean / var, but 0 where
/// 0 > k.
void LeeMultiplicativeRow(const MomentRows& oRows, const LeeNoise& oNoise, std::span<double> oOut);

/// oOut[i] = (x - mean * mulMean - addMean) * k + mean, with a = var * mulMean and
/// k = a / (a * mulMean + var + noise).
void LeeMixedRow(const MomentRows& oRows, const LeeNoise& oNoise, std::span<double> oOut);

/// With Ci = sqrt(var) / mean: mean where dfLowest >= Ci, else x where Ci >= dfHighest, else
/// (1 - e) * x + e * mean with e = exp(-((Ci - dfLowest) * dfDamp / (dfHighest - Ci))).
void EnhancedLeeRow(const MomentRows& oRows, double dfLowest, double dfHighest, double dfDamp,
                    std::span<double> oOut);

/// With w = (looks - mean * mean / var) / (looks + 1): mean where 0 >= w, else
/// (1 - w) * mean + w * x.
void KuanRow(const MomentRows& oRows, double dfLooks, std::span<double> oOut);

/// With q = mean * mean and v = looks * var: mean where q >= v, else x where v >= q * 2, else the
/// root of the quadratic of the maximum a posteriori estimate:
/// a = (looks + 1) * q / (v - q), b = a - looks - 1, d = a * 4 * looks * mean * x + b * q * b,
/// (b * mean + sqrt(d)) / (a * 2), in which the square root is left out unless d > 0.
void GammaRow(const MomentRows& oRows, double dfLooks, std::span<double> oOut);

}  // namespace kor::filters::kernels
