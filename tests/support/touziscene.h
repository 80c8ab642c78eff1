#pragma once

#include <gtest/gtest.h>

#include <algorithm>

#include "processes/qrdfilters/filtertouzi.h"
#include "tests/support/blocks.h"
#include "tests/support/touzireference.h"

/// Scenes in which the Touzi filter meets all its cases, and its comparison with the definition.
namespace kor::test
{

/// Speckle over flat areas, edges, lines and points, between 0 and 120.
inline void FillScene(tessel::Raster& oRaster, double dfNoise, Random& oRandom)
{
    std::uniform_real_distribution<double> oSpeckle(1.0 - dfNoise, 1.0 + dfNoise);
    const double dfSlope = static_cast<double>(oRandom() % 7) - 3.0;
    const auto oFill = [&]<class T>()
    {
        for (std::uint32_t y = 0; y < oRaster.mnTotalHeight; ++y)
        {
            for (std::uint32_t x = 0; x < oRaster.mnTotalWidth; ++x)
            {
                const int nAcross = static_cast<int>(dfSlope * y + 1.5 * x) % 29;
                const double dfBase = oRandom() % 150 == 0 ? 110.0
                                      : nAcross == 5       ? 60.0
                                      : nAcross > 15       ? 50.0
                                                           : 15.0;
                for (std::uint32_t c = 0; c < oRaster.mnChannels; ++c)
                {
                    T* pSamples = reinterpret_cast<T*>(oRaster.mpBuffer);
                    pSamples[(std::size_t{y} * oRaster.mnTotalWidth + x) * oRaster.mnChannels + c] =
                        static_cast<T>(std::min(120.0, dfBase * oSpeckle(oRandom)));
                }
            }
        }
    };
    using List = typedispatch::StandardTypeList;
    typedispatch::VisitType<List>(typedispatch::FindDataType<List>(oRaster.moDataType, false),
                                  oFill, [] {});
}

template <class TIn, class TOut>
void CompareWithDefinition(TouziReference& oReference, tessel::Raster& oIn, Random& oRandom)
{
    filters::FilterTouzi oFilter(oReference.dfLooks, oReference.dfContour, 0.5,
                                 oReference.dfGradiant);
    oFilter.SetAmplit(oReference.nAmplit);
    oFilter.SetBGZero(oReference.bBGZero);
    const auto poMask =
        RandomMask(oIn.mnWidth, oIn.mnHeight, Margins{oIn.mnMarginX, oIn.mnMarginY}, 0.9, oRandom);
    tessel::Mask* poMaskIn = oRandom() % 2 == 0 ? poMask.get() : nullptr;
    const tessel::DataType oType = typedispatch::RealDataType<TOut>();
    const auto poActual = BlankRaster(oIn.mnWidth, oIn.mnHeight, oIn.mnChannels, oType, {1, 2});
    const auto poExpected = BlankRaster(oIn.mnWidth, oIn.mnHeight, oIn.mnChannels, oType, {1, 2});
    oFilter.Process(&oIn, poMaskIn, poActual.get());
    oReference.Process<TIn, TOut>(oIn, poMaskIn, *poExpected);
    ASSERT_TRUE(SameBits(*poActual, *poExpected))
        << oIn.mnWidth << " x " << oIn.mnHeight << " x " << oIn.mnChannels << ", margins "
        << oIn.mnMarginX << " and " << oIn.mnMarginY << ", " << oReference.dfLooks << " looks";
}

inline TouziReference RandomReference(Random& oRandom)
{
    const double adfLooks[] = {0.02, 1.0, 1.9, 3.0, 10.0};
    const double adfContours[] = {0.0, 0.3, 0.5, 0.8, 1.5};
    const double adfGradiants[] = {0.0, 0.02, 0.1, 5.0};
    TouziReference oReference;
    oReference.dfLooks = adfLooks[oRandom() % 5];
    oReference.dfContour = adfContours[oRandom() % 5];
    oReference.dfGradiant = adfGradiants[oRandom() % 4];
    oReference.nAmplit = static_cast<int>(oRandom() % 4);
    oReference.bBGZero = oRandom() % 2 == 0;
    return oReference;
}

}  // namespace kor::test
