#include "docs/gallery/speckle.h"

#include <cmath>
#include <random>

namespace kor::gallery
{

namespace
{

constexpr std::uint32_t kSide = 256;

double GroundAt(std::uint32_t x, std::uint32_t y)
{
    if (y < 128)
    {
        // Four upright fields, the first of which is the uniform one, with an oblique edge through
        // the last two.
        constexpr double kFields[] = {40.0, 160.0, 80.0, 20.0};
        return x >= 128 && x + y > 288 ? 120.0 : kFields[x / 64];
    }
    return 20.0 + 100.0 * x / kSide;  // a slow gradient
}

bool IsBright(std::uint32_t x, std::uint32_t y)
{
    const bool bPoint = y > 220 && x % 32 == 16 && y % 16 == 8;
    const bool bLine = y > 140 && y < 210 && (x == 40 || x == 80 || x == 81 || x + y == 330);
    return bPoint || bLine;
}

/// A gamma variable of nLooks looks as the mean of exponential ones: the same on every system,
/// which the distributions of the standard library are not.
double GammaOf(int nLooks, std::mt19937_64& oRandom)
{
    double dfSum = 0.0;
    for (int i = 0; i < nLooks; ++i)
    {
        const double dfUniform = (static_cast<double>(oRandom() >> 11) + 0.5) * 0x1.0p-53;
        dfSum -= std::log(dfUniform);
    }
    return dfSum / nLooks;
}

}  // namespace

GreyImage SyntheticScene()
{
    GreyImage oScene{kSide, kSide, {}};
    for (std::uint32_t y = 0; y < kSide; ++y)
    {
        for (std::uint32_t x = 0; x < kSide; ++x)
        {
            oScene.mvdfSamples.push_back(IsBright(x, y) ? 300.0 : GroundAt(x, y));
        }
    }
    return oScene;
}

Area UniformField()
{
    return {8, 8, 48, 112};
}

GreyImage Speckled(const GreyImage& oTruth, int nLooks, std::uint64_t nSeed)
{
    std::mt19937_64 oRandom(nSeed);
    GreyImage oImage = oTruth;
    for (double& dfSample : oImage.mvdfSamples)
    {
        dfSample *= GammaOf(nLooks, oRandom);
    }
    return oImage;
}

}  // namespace kor::gallery
