#pragma once

#include <cstddef>
#include <functional>
#include <vector>

#include "processes/qrdfilters/window.h"
#include "tests/support/blocks.h"

/// The sliding-window statistics as they are defined, one pixel after the other.
namespace kor::test
{

struct PlainSums
{
    double mdfSquares = 0.0;
    double mdfSum = 0.0;
    double mdfCount = 0.0;
    double mdfCentre = 0.0;
};

/// Filters blocks of doubles by a finishing function.
class PlainWindows
{
public:
    using Finish = std::function<double(const PlainSums& oSums)>;

    PlainWindows(const tessel::Raster& oIn, const tessel::Mask* poMaskIn,
                 const filters::Window& oWindow)
        : moIn(oIn),
          mpoMaskIn(poMaskIn),
          mnHalfX(oWindow.mnHalfX),
          mnHalfY(oWindow.mnHalfY),
          mvoColumns(oIn.mnChannels * (oIn.mnWidth + 2 * std::size_t{oWindow.mnHalfX}))
    {
    }

    void Filter(bool bBGZero, const Finish& oFinish, const tessel::Raster& oOut,
                const tessel::Mask* poMaskOut)
    {
        for (std::int64_t y = -mnHalfY; y <= mnHalfY; ++y)
        {
            ChangeColumns(y, 1.0);
        }
        for (std::int64_t y = 0; y < moIn.mnHeight; ++y)
        {
            if (y > 0)
            {
                ChangeColumns(y - mnHalfY - 1, -1.0);
                ChangeColumns(y + mnHalfY, 1.0);
            }
            for (std::size_t c = 0; c < moIn.mnChannels; ++c)
            {
                FilterRow(y, c, bBGZero, oFinish, oOut, poMaskOut);
            }
        }
    }

private:
    PlainSums& Column(std::int64_t x, std::size_t c)
    {
        return mvoColumns[static_cast<std::size_t>(x + mnHalfX) * moIn.mnChannels + c];
    }

    /// Adds (dfSign 1) or subtracts (-1) the valid samples of a row. To add a negated number is to
    /// subtract it, to the last bit.
    void ChangeColumns(std::int64_t y, double dfSign)
    {
        for (std::int64_t x = -mnHalfX; x < moIn.mnWidth + mnHalfX; ++x)
        {
            for (std::size_t c = 0; IsValid(mpoMaskIn, x, y) && c < moIn.mnChannels; ++c)
            {
                const double dfSample = moIn.GetPixelAs<double>(x, y)[c];
                Column(x, c).mdfSquares += dfSign * (dfSample * dfSample);
                Column(x, c).mdfSum += dfSign * dfSample;
                Column(x, c).mdfCount += dfSign;
            }
        }
    }

    static void Change(PlainSums& oSums, const PlainSums& oColumn, double dfSign)
    {
        oSums.mdfSquares += dfSign * oColumn.mdfSquares;
        oSums.mdfSum += dfSign * oColumn.mdfSum;
        oSums.mdfCount += dfSign * oColumn.mdfCount;
    }

    void FilterRow(std::int64_t y, std::size_t c, bool bBGZero, const Finish& oFinish,
                   const tessel::Raster& oOut, const tessel::Mask* poMaskOut)
    {
        PlainSums oSums;
        for (std::int64_t x = 0; x < moIn.mnWidth; ++x)
        {
            if (x == 0 || y == 0)
            {
                oSums = PlainSums();
                for (std::int64_t k = x - mnHalfX; k <= x + mnHalfX; ++k)
                {
                    Change(oSums, Column(k, c), 1.0);
                }
            }
            else
            {
                Change(oSums, Column(x - mnHalfX - 1, c), -1.0);
                Change(oSums, Column(x + mnHalfX, c), 1.0);
            }
            oSums.mdfCentre = moIn.GetPixelAs<double>(x, y)[c];
            const bool bComputed = IsValid(mpoMaskIn, x, y) && IsValid(poMaskOut, x, y);
            oOut.GetPixelAs<double>(x, y)[c] = bComputed ? oFinish(oSums)
                                               : bBGZero ? 0.0
                                                         : oSums.mdfCentre;
        }
    }

    const tessel::Raster& moIn;
    const tessel::Mask* mpoMaskIn;
    std::int64_t mnHalfX;
    std::int64_t mnHalfY;
    std::vector<PlainSums> mvoColumns;
};

/// A block of doubles of random size, some of them one row or one column, with random masks.
struct RandomBlock
{
    explicit RandomBlock(Random& oRandom)
        : mnWidth(oRandom() % 5 == 0 ? 1U : static_cast<std::uint32_t>(1 + oRandom() % 300)),
          mnHeight(oRandom() % 5 == 0 ? 1U : static_cast<std::uint32_t>(1 + oRandom() % 20)),
          mnChannels(static_cast<std::uint32_t>(1 + oRandom() % 4)),
          moMargins{static_cast<std::uint32_t>(oRandom() % 4),
                    static_cast<std::uint32_t>(oRandom() % 4)},
          mpoIn(RandomRaster(mnWidth, mnHeight, mnChannels, tessel::eDT_64R, moMargins,
                             oRandom() % 2 == 0 ? Samples::Ordinary : Samples::Special, oRandom)),
          mpoMaskIn(RandomMask(mnWidth, mnHeight, moMargins, 0.7, oRandom)),
          mpoMaskOut(RandomMask(mnWidth, mnHeight, {0, 2}, 0.7, oRandom))
    {
    }

    std::unique_ptr<tessel::Raster> Blank() const
    {
        return BlankRaster(mnWidth, mnHeight, mnChannels, tessel::eDT_64R, {1, 2});
    }
    /// Null, one of the two, or both, as the lowest bits of nMasks say.
    tessel::Mask* MaskIn(unsigned int nMasks) const
    {
        return (nMasks & 1U) != 0 ? mpoMaskIn.get() : nullptr;
    }
    tessel::Mask* MaskOut(unsigned int nMasks) const
    {
        return (nMasks & 2U) != 0 ? mpoMaskOut.get() : nullptr;
    }

    std::uint32_t mnWidth;
    std::uint32_t mnHeight;
    std::uint32_t mnChannels;
    Margins moMargins;
    std::unique_ptr<tessel::Raster> mpoIn;
    std::unique_ptr<tessel::Mask> mpoMaskIn;
    std::unique_ptr<tessel::Mask> mpoMaskOut;
};

}  // namespace kor::test
