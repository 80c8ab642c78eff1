#pragma once

#include <gtest/gtest.h>

#include <boost/optional.hpp>
#include <memory>

#include "processes/qrdfilters/window.h"
#include "tests/support/blocks.h"
#include "tests/support/plainwindow.h"

/// What the tests of block filters on windows of doubles share.
namespace kor::test
{

/// The drawing filtered; its outer rows and columns are the margins.
template <class Filter>
Image<double> Filtered(const Filter& oFilter, const Image<double>& oImage, Margins oMargins,
                       tessel::Mask* poMaskIn = nullptr, tessel::Mask* poMaskOut = nullptr,
                       std::uint32_t nChannels = 1)
{
    const auto poIn = RasterOf(oImage, oMargins, nChannels);
    const auto poOut = BlankRaster(poIn->mnWidth, poIn->mnHeight, nChannels, tessel::eDT_64R);
    oFilter.Process(poIn.get(), poMaskIn, poOut.get(), poMaskOut);
    return ImageOf<double>(*poOut);
}

/// The one pixel in the middle of a drawing.
template <class Filter>
double FilteredCentre(const Filter& oFilter, const Image<double>& oWindow,
                      tessel::Mask* poMaskIn = nullptr)
{
    const Margins oMargins{static_cast<std::uint32_t>(oWindow.Columns() / 2),
                           static_cast<std::uint32_t>(oWindow.Rows() / 2)};
    const Image<double> oOut = Filtered(oFilter, oWindow, oMargins, poMaskIn);
    EXPECT_EQ(oOut.Samples().size(), 1U);
    return oOut.Samples().front();
}

/// A block of doubles, the masks and the window size that a filter gets with it.
struct WindowCase
{
    std::unique_ptr<tessel::Raster> mpoIn;
    std::unique_ptr<tessel::Mask> mpoMaskIn;   ///< null where the case has none
    std::unique_ptr<tessel::Mask> mpoMaskOut;  ///< the same
    boost::optional<int> mnSizeX;
    boost::optional<int> mnSizeY;
    filters::Window moWindow;  ///< what the sizes and margins come to
    bool mbBGZero = false;
    Margins moOutMargins;

    std::unique_ptr<tessel::Raster> BlankOutput() const
    {
        return BlankRaster(mpoIn->mnWidth, mpoIn->mnHeight, mpoIn->mnChannels, tessel::eDT_64R,
                           moOutMargins);
    }
};

/// Speckle, small whole numbers with flat windows among them, samples of both signs, or special
/// ones.
inline void FillWithSpeckle(tessel::Raster& oRaster, Random& oRandom)
{
    const auto nKind = oRandom() % 4;
    if (nKind >= 2)
    {
        FillRandom(oRaster, nKind == 2 ? Samples::Ordinary : Samples::Special, oRandom);
        return;
    }
    std::exponential_distribution<double> oSpeckle(1.0 / 40.0);
    auto* pSamples = reinterpret_cast<double*>(oRaster.mpBuffer);
    for (std::uint64_t i = 0; i < oRaster.mnBufferSize / sizeof(double); ++i)
    {
        pSamples[i] =
            nKind == 0 ? oSpeckle(oRandom) : static_cast<double>(oRandom() % 8 == 0 ? 3 : 2);
    }
}

/// Number nCase of a series in which all masks and sizes come together: blocks down to one row or
/// one column, margins as large as the window or larger, 1 to 4 channels.
inline WindowCase RandomWindowCase(unsigned int nCase, Random& oRandom)
{
    const auto oBelow = [&](std::uint32_t nEnd)
    { return static_cast<std::uint32_t>(oRandom() % nEnd); };
    WindowCase oCase;
    const std::uint32_t nWidth = nCase % 5 == 4 ? 1 : 1 + oBelow(nCase % 7 == 6 ? 400 : 40);
    const std::uint32_t nHeight = nCase % 6 == 5 ? 1 : 1 + oBelow(24);
    oCase.moWindow = {oBelow(4), oBelow(4)};
    Margins oMargins{oCase.moWindow.mnHalfX, oCase.moWindow.mnHalfY};
    const auto nSizes = nCase / 4 % 3;
    if (nSizes == 1)
    {
        // Even sizes act as the next odd ones.
        oCase.mnSizeX = static_cast<int>(2 * oMargins.x + oBelow(2));
        oCase.mnSizeY = static_cast<int>(2 * oMargins.y + oBelow(2));
        oMargins.x += oBelow(3);
        oMargins.y += oBelow(3);
    }
    else if (nSizes == 2)
    {
        (oBelow(2) == 0 ? oCase.mnSizeX : oCase.mnSizeY) = 1;
    }
    oCase.mpoIn = BlankRaster(nWidth, nHeight, 1 + oBelow(4), tessel::eDT_64R, oMargins);
    FillWithSpeckle(*oCase.mpoIn, oRandom);
    const double dfValid = oBelow(2) == 0 ? 0.9 : 0.3;
    oCase.moOutMargins = {oBelow(3), oBelow(3)};
    if (nCase % 2 == 1)
    {
        oCase.mpoMaskIn = RandomMask(nWidth, nHeight, oMargins, dfValid, oRandom);
    }
    if (nCase / 2 % 2 == 1)
    {
        oCase.mpoMaskOut = RandomMask(nWidth, nHeight, {oBelow(3), oBelow(3)}, dfValid, oRandom);
    }
    oCase.mbBGZero = oBelow(2) == 0;
    return oCase;
}

/// Runs a filter and its definition over many cases. oMake(random) gives a filter and the function
/// of (sums, centre) that finishes it, as a pair; both outputs have to agree bit by bit.
template <class Terms, class Make>
void ExpectTheBitsOfThePlainLoop(unsigned int nCases, const Make& oMake)
{
    Random oRandom(nCases);
    for (unsigned int nCase = 0; nCase < nCases; ++nCase)
    {
        const WindowCase oCase = RandomWindowCase(nCase, oRandom);
        auto [oFilter, oFinish] = oMake(oRandom);
        oFilter.SetBGZero(oCase.mbBGZero);
        oFilter.SetFilterSize(oCase.mnSizeX, oCase.mnSizeY);
        const auto poActual = oCase.BlankOutput();
        const auto poExpected = oCase.BlankOutput();
        oFilter.Process(oCase.mpoIn.get(), oCase.mpoMaskIn.get(), poActual.get(),
                        oCase.mpoMaskOut.get());
        FilterPlainly<double, Terms>(*oCase.mpoIn, oCase.mpoMaskIn.get(), oCase.moWindow,
                                     oCase.mbBGZero, oFinish, *poExpected, oCase.mpoMaskOut.get());
        ASSERT_TRUE(SameBits(*poActual, *poExpected)) << "case " << nCase;
    }
}

/// The number operator() of a filter has to give: type, size, margins and offsets of the input.
template <class Filter>
void ExpectCallOperatorKeepsTheGeometry(const Filter& oFilter)
{
    const auto poIn = std::make_shared<tessel::Raster>(tessel::RasterInfo(2, 1, 2, tessel::eDT_64R),
                                                       tessel::RasterContext(1, 2, 40, 50));
    std::fill_n(reinterpret_cast<double*>(poIn->mpBuffer), poIn->mnBufferSize / sizeof(double),
                4.0);
    const std::shared_ptr<tessel::Mask> poClip = MaskOf({{1, 0}});
    Filter oCopy(oFilter);
    oCopy.SetBGZero(true);
    const auto poOut = oCopy(poIn, nullptr, poClip);
    EXPECT_EQ(poOut->mnMarginX, 1U);
    EXPECT_EQ(poOut->mnMarginY, 2U);
    EXPECT_EQ(poOut->mnOffsetX, 40U);
    EXPECT_EQ(poOut->mnOffsetY, 50U);
    EXPECT_EQ(poOut->moDataType, tessel::eDT_64R);
    EXPECT_EQ(ImageOf<double>(*poOut), (Image<double>{{4, 4, 0, 0}}));
    EXPECT_EQ(poIn.use_count(), 1);
}

}  // namespace kor::test
