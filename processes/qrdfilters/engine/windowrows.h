#pragma once

#include <cstddef>
#include <cstdint>
#include <type_traits>

#include "basic/tessel/mask/mask.h"
#include "basic/tessel/raster/raster.h"
#include "processes/qrdfilters/engine/channels.h"
#include "processes/qrdfilters/engine/rowring.h"
#include "processes/qrdfilters/samplerows.h"
#include "processes/qrdfilters/slidingwindow.h"

namespace kor::filters::engine
{

/// The validity of the pixels in a row of windows, as bytes: one a pixel, and one a sample.
class ValidRows
{
public:
    ValidRows(const tessel::Mask& oMask, const Window& oWindow, std::size_t nPixels,
              std::size_t nChannels)
        : moMask(oMask),
          mnLeft(-std::int64_t{oWindow.mnHalfX}),
          mnPixels(nPixels),
          mnChannels(nChannels),
          moPixels(oWindow, nPixels),
          moSamples(oWindow, nChannels == 1 ? 0 : nPixels * nChannels)
    {
    }

    const unsigned char* Pixels(std::int64_t y)
    {
        return moPixels.Get(y,
                            [this](std::int64_t nRow, unsigned char* pRow) {
                                moMask.ExpandRow(mnLeft, nRow, {pRow, mnPixels});
                            });
    }

    const unsigned char* Samples(std::int64_t y)
    {
        if (mnChannels == 1)
        {
            return Pixels(y);
        }
        return moSamples.Get(
            y,
            [this](std::int64_t nRow, unsigned char* pRow) {
                RepeatForChannels<unsigned char>({Pixels(nRow), mnPixels}, mnChannels, pRow);
            });
    }

private:
    const tessel::Mask& moMask;
    std::int64_t mnLeft;
    std::size_t mnPixels;
    std::size_t mnChannels;
    RowRing<unsigned char> moPixels;
    RowRing<unsigned char> moSamples;
};

/// The rows that enter the sums: doubles, transformed, and +0.0 in the place of masked samples,
/// since the sums start at +0.0 and adding or subtracting +0.0 changes nothing.
template <class TSample>
class SummedRows
{
public:
    SummedRows(const tessel::Raster& oIn, ValidRows* poValid, const Window& oWindow,
               WindowTerm::Transform pfnTransform)
        : moIn(oIn),
          mpoValid(poValid),
          mnLeft(-std::int64_t{oWindow.mnHalfX}),
          mnSamples((oIn.mnWidth + oWindow.GetWidth() - 1) * oIn.mnChannels),
          mpfnTransform(pfnTransform),
          moRows(oWindow, IsAsItLies() ? 0 : mnSamples)
    {
    }

    WindowTerm::Transform GetTransform() const { return mpfnTransform; }

    /// Row y from the left end of the first window on.
    const double* Row(std::int64_t y)
    {
        if (IsAsItLies())
        {
            return moIn.GetPixelAs<const double>(mnLeft, y);
        }
        return moRows.Get(y,
                          [this](std::int64_t nRow, double* pRow) {
                              MakeRow(nRow, {pRow, mnSamples});
                          });
    }

private:
    bool IsAsItLies() const
    {
        return std::is_same_v<TSample, double> && mpoValid == nullptr && mpfnTransform == nullptr;
    }

    void MakeRow(std::int64_t y, std::span<double> vdfRow)
    {
        const auto* pIn = moIn.GetPixelAs<const TSample>(mnLeft, y);
        if constexpr (std::is_same_v<TSample, double>)
        {
            if (mpfnTransform == nullptr)
            {
                kernels::ClearMasked(mpoValid->Samples(y), pIn, vdfRow);
                return;
            }
        }
        LoadSamples(pIn, vdfRow);
        if (mpfnTransform != nullptr)
        {
            mpfnTransform(vdfRow);
        }
        if (mpoValid != nullptr)
        {
            kernels::ClearMasked(mpoValid->Samples(y), vdfRow.data(), vdfRow);
        }
    }

    const tessel::Raster& moIn;
    ValidRows* mpoValid;
    std::int64_t mnLeft;
    std::size_t mnSamples;
    WindowTerm::Transform mpfnTransform;
    RowRing<double> moRows;
};

}  // namespace kor::filters::engine
