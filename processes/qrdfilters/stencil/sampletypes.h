#pragma once

#include <cstddef>
#include <span>
#include <type_traits>

#include "processes/qrdfilters/background.h"
#include "processes/qrdfilters/samplerows.h"

namespace kor::filters::stencil
{

/// The two ends of a row: all that differs between the pairs of sample types.
struct SampleTypes
{
    /// Widens samples to double. Null: they are doubles, and are read where they lie.
    void (*mpfnLoad)(const unsigned char* pIn, std::span<double> vdfOut) = nullptr;
    /// Converts doubles to output samples. Null: they are doubles, and are written in place.
    void (*mpfnStore)(std::span<const double> vdfIn, unsigned char* pOut) = nullptr;
    /// Writes the background of a row's pixels from pixel x on, where oComputed is 0. pRowIn is the
    /// first pixel of the input's row, pOut pixel x of the output's. Null: it is 0.
    void (*mpfnBackground)(std::span<const unsigned char> oComputed, const unsigned char* pRowIn,
                           std::size_t x, std::size_t nChannels, unsigned char* pOut) = nullptr;
};

/// bBGZero: background is 0; else it keeps the input's samples, converted.
template <class TIn, class TOut>
SampleTypes SampleTypesOf(bool bBGZero)
{
    SampleTypes oTypes;
    if constexpr (!std::is_same_v<TIn, double>)
    {
        oTypes.mpfnLoad = [](const unsigned char* pIn, std::span<double> vdfOut)
        { LoadSamples(reinterpret_cast<const TIn*>(pIn), vdfOut); };
    }
    if constexpr (!std::is_same_v<TOut, double>)
    {
        oTypes.mpfnStore = [](std::span<const double> vdfIn, unsigned char* pOut)
        { StoreSamples(vdfIn, reinterpret_cast<TOut*>(pOut)); };
    }
    if (!bBGZero)
    {
        oTypes.mpfnBackground = [](std::span<const unsigned char> oComputed,
                                   const unsigned char* pRowIn, std::size_t x,
                                   std::size_t nChannels, unsigned char* pOut)
        {
            WriteBackground(oComputed, reinterpret_cast<const TIn*>(pRowIn) + x * nChannels,
                            nChannels, false, reinterpret_cast<TOut*>(pOut));
        };
    }
    return oTypes;
}

}  // namespace kor::filters::stencil
