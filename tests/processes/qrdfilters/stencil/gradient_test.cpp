#include "processes/qrdfilters/stencil/gradient.h"

#include <gtest/gtest.h>

#include <cmath>

#include "tests/support/filtercomparison.h"

namespace kor::filters::stencil
{
namespace
{

using namespace kor::test;

/// The definition, pixel by pixel.
void GradientByDefinition(const tessel::Raster& oIn, const tessel::Mask* poMaskIn,
                          const tessel::Raster& oOut, const tessel::Mask* poMaskOut,
                          const GradientParameters& oParameters)
{
    for (std::int64_t y = 0; y < oIn.mnHeight; ++y)
    {
        for (std::int64_t x = 0; x < oIn.mnWidth; ++x)
        {
            const bool bComputed = IsValid(poMaskIn, x, y) && IsValid(poMaskOut, x, y);
            for (std::size_t c = 0; c < oIn.mnChannels; ++c)
            {
                const double dfCentre = oIn.GetPixelAs<double>(x, y)[c];
                const auto oAt = [&](std::int64_t dx, std::int64_t dy)
                {
                    return IsValid(poMaskIn, x + dx, y + dy)
                               ? oIn.GetPixelAs<double>(x + dx, y + dy)[c]
                               : dfCentre;
                };
                const double w = oParameters.mdfCentreWeight;
                const double dfX = oAt(1, -1) - oAt(-1, -1) - w * oAt(-1, 0) + w * oAt(1, 0) -
                                   oAt(-1, 1) + oAt(1, 1);
                const double dfY = w * oAt(0, -1) + oAt(-1, -1) + oAt(1, -1) - oAt(-1, 1) -
                                   w * oAt(0, 1) - oAt(1, 1);
                const double dfGradient = std::sqrt(dfY * dfY + dfX * dfX) * oParameters.mdfFactor;
                const double dfBackground = oParameters.mbBGZero ? 0.0 : dfCentre;
                oOut.GetPixelAs<double>(x, y)[c] = bComputed ? dfGradient : dfBackground;
            }
        }
    }
}

TEST(FilterGradient, FollowsTheDefinitionForAllShapes)
{
    Random oRandom(1);
    for (const Margins oMargins : {Margins{1, 1}, {5, 2}})
    {
        const auto oCompare = [&](const Shape& oShape, double dfValid)
        {
            const GradientParameters oParameters{static_cast<double>(1 + oRandom() % 2),
                                                 oRandom() % 2 == 0 ? 1.0 : -0.3,
                                                 oRandom() % 2 == 0};
            const auto eSamples = oRandom() % 2 == 0 ? Samples::Ordinary : Samples::Special;
            CompareWithDefinition<double, double>(
                oShape, eSamples, dfValid, oRandom,
                [&](auto poIn, auto poMaskIn, auto poOut, auto poMaskOut)
                { FilterGradient(*poIn, poMaskIn, *poOut, poMaskOut, oParameters); },
                [&](auto poIn, auto poMaskIn, auto poOut, auto poMaskOut)
                { GradientByDefinition(*poIn, poMaskIn, *poOut, poMaskOut, oParameters); });
        };
        ForEachShape(oMargins, oCompare);
    }
}

// Blocks far above the caches are written past them, and have several tiles in a row.
TEST(FilterGradient, FollowsTheDefinitionForALargeBlock)
{
    Random oRandom(2);
    const GradientParameters oParameters{2.0, 1.0, false};
    const auto poIn =
        RandomRaster(16411, 131, 1, tessel::eDT_64R, {1, 1}, Samples::Ordinary, oRandom);
    const auto poMask = RandomMask(16411, 131, {1, 1}, 0.999, oRandom);
    const auto poActual = BlankRaster(16411, 131, 1, tessel::eDT_64R);
    const auto poExpected = BlankRaster(16411, 131, 1, tessel::eDT_64R);
    ASSERT_GT(poActual->mnBufferSize, 16U << 20);
    for (const tessel::Mask* poUsed : {static_cast<const tessel::Mask*>(nullptr),
                                       static_cast<const tessel::Mask*>(poMask.get())})
    {
        FilterGradient(*poIn, poUsed, *poActual, nullptr, oParameters);
        GradientByDefinition(*poIn, poUsed, *poExpected, nullptr, oParameters);
        EXPECT_TRUE(SameBits(*poActual, *poExpected));
    }
}

}  // namespace
}  // namespace kor::filters::stencil
