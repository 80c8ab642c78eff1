#pragma once

#include <cstddef>
#include <span>

namespace kor::filters::kernels
{

/// Integers from mnLowest to mnLowest + mnSpan, both included, modulo the size of the type: signed
/// samples count by their bits.
struct IntegerRange
{
    unsigned long long mnLowest = 0;
    unsigned long long mnSpan = 0;
    bool mbInverted = false;  ///< the others count instead
};

/// oFlags[i] = 1 where the integer at pSamples + i, of nBytes bytes (1, 2, 4 or 8), is in the
/// range, else 0.
void FlagIntegers(const void* pSamples, std::size_t nBytes, const IntegerRange& oRange,
                  std::span<unsigned char> oFlags);

/// Floats from one limit to the other, both included; or those outside, both included as well. Not
/// a number is neither in nor outside, and as a limit never reached.
struct FloatRange
{
    float mfLow = 0.0F;
    float mfHigh = 0.0F;
    bool mbOutside = false;

    bool Contains(float f) const
    {
        return mbOutside ? f <= mfLow || f >= mfHigh : f >= mfLow && f <= mfHigh;
    }
};

/// The same for floats.
void FlagFloats(const float* pSamples, const FloatRange& oRange, std::span<unsigned char> oFlags);

/// oOut[i] = re * re + im * im of the pair at position i of the element type at position nType of
/// StandardTypeList, computed in that type, in which integers wrap, and then seen as float.
void SquareMagnitudes(const void* pPairs, std::size_t nType, std::span<float> oOut);

}  // namespace kor::filters::kernels
