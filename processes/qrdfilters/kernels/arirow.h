#pragma once

#include <cstddef>
#include <span>

namespace kor::filters::kernels
{

/// An expression over two values a, b and a constant, all in single precision.
enum class AriOperation
{
    eSum,                 ///< b + a
    eSumPlusConstant,     ///< b + a + c
    eDifference,          ///< a - b
    eDifferenceConstant,  ///< a - b - c
    eProduct,             ///< b * a
    eQuotient,            ///< a / b; where b is (almost) zero it is told instead, and not counted
    eAnd,                 ///< bits of the integers that b and a are cut to
    eOr
};

/// What EvaluateRow needs besides the values.
struct AriRow
{
    AriOperation meOperation = AriOperation::eSum;
    float mfConstant = 0.0F;
    float mfZeroDivision = 0.0F;  ///< result where the divisor is (almost) zero, never scaled
    bool mbScales = false;        ///< results become (v - from) * factor + low, cut at low and high
    float mfFrom = 0.0F;
    float mfFactor = 1.0F;
    float mfLow = 0.0F;
    float mfHigh = 0.0F;
};

/// Extremes of the results that count, before they are scaled.
struct AriExtremes
{
    float mfMin;
    float mfMax;
};

/// Rows are padded to a multiple of this many values.
inline constexpr std::size_t kAriPadding = 16;

/// Greatest divisor that counts as zero, on both sides: the last float below 1e-9.
inline constexpr float kAlmostZero = 1e-09F;

/// The 32-bit integer that x is cut to; the smallest one where it holds no such value.
constexpr int CutToInt(float x)
{
    return x >= -2147483648.0F && x < 2147483648.0F ? static_cast<int>(x) : -2147483647 - 1;
}

/// Evaluates oOut.size() pairs, a multiple of kAriPadding, and widens oExtremes by the results, the
/// ends of which are told apart by < alone: a zero may have the other sign. oOut may be one of the
/// inputs.
void EvaluateRow(const AriRow& oRow, const float* pA, const float* pB, std::span<float> oOut,
                 AriExtremes& oExtremes);

}  // namespace kor::filters::kernels
