#include "processes/qrdfilters/touzirows.h"

#include <algorithm>
#include <cmath>

#include "processes/qrdfilters/kernels/windowsums.h"

namespace kor::filters
{

using kernels::PadRow;

void ToAmplitude(SampleDomain eDomain, std::span<double> vdfSamples)
{
    if (eDomain == SampleDomain::eIntensity)
    {
        for (double& x : vdfSamples)
        {
            x = std::sqrt(x);
        }
    }
    else if (eDomain == SampleDomain::eDecibel)
    {
        for (double& x : vdfSamples)
        {
            x = std::pow(10.0, x / 10.0);
        }
    }
}

void FromAmplitude(SampleDomain eDomain, std::span<double> vdfSamples)
{
    if (eDomain == SampleDomain::eIntensity)
    {
        for (double& x : vdfSamples)
        {
            x = x * x;
        }
    }
    else if (eDomain == SampleDomain::eDecibel)
    {
        for (double& x : vdfSamples)
        {
            x = x > 0.0 ? 10.0 * std::log10(x * x) : 0.0;
        }
    }
}

AmplitudeBand::AmplitudeBand(const tessel::Raster& oIn, SampleDomain eDomain, LoadRow pfnLoad,
                             std::uint32_t nReach)
    : moIn(oIn),
      meDomain(eDomain),
      mpfnLoad(pfnLoad),
      mnReach(nReach),
      mnAbove(std::min(nReach, oIn.mnMarginY)),
      mnNext(-mnAbove),
      mnPadded(PadRow(oIn.mnWidth)),
      mnPitch(mnPadded + 2 * std::size_t{nReach}),
      mvdfLoaded(std::size_t{oIn.mnTotalWidth} * oIn.mnChannels)
{
    const std::size_t nRows = (2 * static_cast<std::size_t>(mnAbove) + 1) * oIn.mnChannels;
    mvdfCentres.resize(nRows * mnPadded);
    mvfSamples.resize((nRows + 1) * mnPitch);
    mvfSquares.resize((nRows + 1) * mnPitch);
    const std::size_t nTable = 2 * std::size_t{nReach} + 1;
    mvpSamples.assign(nTable * oIn.mnChannels, &mvfSamples[nRows * mnPitch] + nReach);
    mvpSquares.assign(nTable * oIn.mnChannels, &mvfSquares[nRows * mnPitch] + nReach);
}

std::size_t AmplitudeBand::Slot(std::int64_t y, std::size_t c) const
{
    const auto nRow = static_cast<std::size_t>((y + mnAbove) % (2 * mnAbove + 1));
    return nRow * moIn.mnChannels + c;
}

void AmplitudeBand::MoveTo(std::uint32_t y)
{
    mnRow = y;
    for (; mnNext <= mnRow + mnAbove; ++mnNext)
    {
        Load(mnNext);
    }
    for (std::size_t c = 0; c < moIn.mnChannels; ++c)
    {
        for (std::int64_t r = -mnAbove; r <= mnAbove; ++r)
        {
            const std::size_t nPlace =
                Slot(mnRow + r, c) * mnPitch + static_cast<std::size_t>(mnReach);
            const auto nEntry = c * static_cast<std::size_t>(2 * mnReach + 1) +
                                static_cast<std::size_t>(r + mnReach);
            mvpSamples[nEntry] = &mvfSamples[nPlace];
            mvpSquares[nEntry] = &mvfSquares[nPlace];
        }
    }
}

void AmplitudeBand::Load(std::int64_t y)
{
    const std::int64_t nMargin = moIn.mnMarginX;
    mpfnLoad(moIn.GetPixel(-nMargin, y), mvdfLoaded);
    ToAmplitude(meDomain, mvdfLoaded);
    const std::size_t nChannels = moIn.mnChannels;
    for (std::size_t c = 0; c < nChannels; ++c)
    {
        const double* pLoaded = mvdfLoaded.data() + c;
        const std::size_t nLeft =
            Slot(y, c) * mnPitch + static_cast<std::size_t>(mnReach - nMargin);
        float* pSamples = &mvfSamples[nLeft];
        float* pSquares = &mvfSquares[nLeft];
        for (std::size_t i = 0; i < moIn.mnTotalWidth; ++i)
        {
            const double x = pLoaded[i * nChannels];
            pSamples[i] = static_cast<float>(x);
            pSquares[i] = static_cast<float>(x * x);
        }
        const double* pCentres = pLoaded + moIn.mnMarginX * nChannels;
        double* pRow = &mvdfCentres[Slot(y, c) * mnPadded];
        for (std::size_t i = 0; i < moIn.mnWidth; ++i)
        {
            pRow[i] = pCentres[i * nChannels];
        }
    }
}

std::span<const float* const> AmplitudeBand::GetSamples(std::size_t c) const
{
    const auto nTable = static_cast<std::size_t>(2 * mnReach + 1);
    return {&mvpSamples[c * nTable], nTable};
}

std::span<const float* const> AmplitudeBand::GetSquares(std::size_t c) const
{
    const auto nTable = static_cast<std::size_t>(2 * mnReach + 1);
    return {&mvpSquares[c * nTable], nTable};
}

std::span<const double> AmplitudeBand::GetCentres(std::size_t c) const
{
    return {&mvdfCentres[Slot(mnRow, c) * mnPadded], mnPadded};
}

}  // namespace kor::filters
