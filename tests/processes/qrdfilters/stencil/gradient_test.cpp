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
                          const kernels::GradientScale& oScale, bool bBGZero)
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
                const double w = oScale.mdfCentreWeight;
                const double dfX = oAt(1, -1) - oAt(-1, -1) - w * oAt(-1, 0) + w * oAt(1, 0) -
                                   oAt(-1, 1) + oAt(1, 1);
                const double dfY = w * oAt(0, -1) + oAt(-1, -1) + oAt(1, -1) - oAt(-1, 1) -
                                   w * oAt(0, 1) - oAt(1, 1);
                const double dfGradient = std::sqrt(dfY * dfY + dfX * dfX) * oScale.mdfFactor;
                const double dfBackground = bBGZero ? 0.0 : dfCentre;
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
            const kernels::GradientScale oScale{static_cast<double>(1 + oRandom() % 2),
                                                oRandom() % 2 == 0 ? 1.0 : -0.3};
            const bool bBGZero = oRandom() % 2 == 0;
            const auto eSamples = oRandom() % 2 == 0 ? Samples::Ordinary : Samples::Special;
            CompareWithDefinition<double, double>(
                oShape, eSamples, dfValid, oRandom,
                [&](auto poIn, auto poMaskIn, auto poOut, auto poMaskOut)
                { FilterGradient(*poIn, poMaskIn, *poOut, poMaskOut, oScale, bBGZero); },
                [&](auto poIn, auto poMaskIn, auto poOut, auto poMaskOut)
                { GradientByDefinition(*poIn, poMaskIn, *poOut, poMaskOut, oScale, bBGZero); });
        };
        ForEachShape(oMargins, oCompare);
    }
}

// Blocks far above the caches are written past them, and have several tiles in a row. Rows of a
// multiple of eight samples begin at equal places of a vector in memory.
TEST(FilterGradient, FollowsTheDefinitionForALargeBlock)
{
    Random oRandom(2);
    constexpr kernels::GradientScale kScale = {2.0, 1.0};
    for (const std::uint32_t nWidth : {16411U, 16416U})
    {
        const auto poIn =
            RandomRaster(nWidth, 131, 1, tessel::eDT_64R, {1, 1}, Samples::Ordinary, oRandom);
        const auto poMask = RandomMask(nWidth, 131, {1, 1}, 0.999, oRandom);
        const auto poActual = BlankRaster(nWidth, 131, 1, tessel::eDT_64R);
        const auto poExpected = BlankRaster(nWidth, 131, 1, tessel::eDT_64R);
        ASSERT_GT(poActual->mnBufferSize, 16U << 20);
        for (const tessel::Mask* poUsed : {static_cast<const tessel::Mask*>(nullptr),
                                           static_cast<const tessel::Mask*>(poMask.get())})
        {
            FilterGradient(*poIn, poUsed, *poActual, nullptr, kScale, false);
            GradientByDefinition(*poIn, poUsed, *poExpected, nullptr, kScale, false);
            EXPECT_TRUE(SameBits(*poActual, *poExpected));
        }
    }
}

}  // namespace
}  // namespace kor::filters::stencil
