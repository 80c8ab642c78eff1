#pragma once

#include <gtest/gtest.h>

#include <cstdint>

#include "tests/support/blocks.h"

/// Filters beside the plain loops that define them.
namespace kor::test
{

struct Shape
{
    std::uint32_t nWidth;
    std::uint32_t nHeight;
    std::uint32_t nChannels;
    Margins oMargins;
};

/// One random block of a shape, of TIn to TOut, under all four combinations of masks: oFilter and
/// oDefinition are called as Process is, and have to give the same bits and leave the output's
/// margins alone. A pixel is valid with probability dfValid.
template <class TIn, class TOut, class Filter, class Definition>
void CompareWithDefinition(const Shape& oShape, Samples eSamples, double dfValid, Random& oRandom,
                           const Filter& oFilter, const Definition& oDefinition)
{
    const auto [nWidth, nHeight, nChannels, oMargins] = oShape;
    const auto poIn = RandomRaster(nWidth, nHeight, nChannels, typedispatch::RealDataType<TIn>(),
                                   oMargins, eSamples, oRandom);
    const auto poMaskIn = RandomMask(nWidth, nHeight, oMargins, dfValid, oRandom);
    const auto poMaskOut = RandomMask(nWidth, nHeight, Margins{1, 3}, dfValid, oRandom);
    for (unsigned int nMasks = 0; nMasks < 4; ++nMasks)
    {
        tessel::Mask* const poUsedIn = (nMasks & 1U) != 0 ? poMaskIn.get() : nullptr;
        tessel::Mask* const poUsedOut = (nMasks & 2U) != 0 ? poMaskOut.get() : nullptr;
        const auto oType = typedispatch::RealDataType<TOut>();
        const auto poActual = BlankRaster(nWidth, nHeight, nChannels, oType, Margins{2, 1});
        const auto poExpected = BlankRaster(nWidth, nHeight, nChannels, oType, Margins{2, 1});
        oFilter(poIn.get(), poUsedIn, poActual.get(), poUsedOut);
        oDefinition(poIn.get(), poUsedIn, poExpected.get(), poUsedOut);
        ASSERT_TRUE(SameBits(*poActual, *poExpected))
            << nWidth << " x " << nHeight << " x " << nChannels << ", margins " << oMargins.x
            << " and " << oMargins.y << ", masks " << nMasks << ", types " << typeid(TIn).name()
            << " to " << typeid(TOut).name();
    }
}

/// Calls oVisit(oShape, dfValid) for blocks with the given margins: of one row, of one column,
/// shorter and longer than vectors and tiles, with one to four channels, under sparse and dense
/// masks.
template <class Visit>
void ForEachShape(Margins oMargins, const Visit& oVisit)
{
    for (std::uint32_t nWidth = 1; nWidth <= 37; nWidth += 4)
    {
        oVisit(Shape{nWidth, 1 + nWidth % 7, 1, oMargins}, 0.9);
    }
    for (std::uint32_t nChannels = 1; nChannels <= 4; ++nChannels)
    {
        oVisit(Shape{13, 9, nChannels, oMargins}, 0.6);
        oVisit(Shape{1, 6, nChannels, oMargins}, 0.95);
        oVisit(Shape{331, 5, nChannels, oMargins}, 0.998);
    }
}

/// The same with four calls in place of all, for long lists of types.
template <class Visit>
void ForSomeShapes(Margins oMargins, const Visit& oVisit)
{
    oVisit(Shape{9, 5, 2, oMargins}, 0.9);
    oVisit(Shape{21, 2, 1, oMargins}, 0.6);
    oVisit(Shape{1, 7, 3, oMargins}, 0.9);
    oVisit(Shape{70, 1, 4, oMargins}, 0.97);
}

}  // namespace kor::test
