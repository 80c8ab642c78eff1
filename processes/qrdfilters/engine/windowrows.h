#pragma once

#include <cstddef>
#include <cstdint>
#include <span>
#include <type_traits>
#include <vector>

#include "basic/tessel/mask/mask.h"
#include "basic/tessel/raster/raster.h"
#include "processes/qrdfilters/engine/channels.h"
#include "processes/qrdfilters/engine/rowring.h"
#include "processes/qrdfilters/samplerows.h"
#include "processes/qrdfilters/slidingwindow.h"

namespace kor::filters::engine
{

/// The validity of the samples in a row of windows, as bits, and how many samples of each channel
/// are valid in the row of each window.
class ValidRows
{
public:
    ValidRows(const tessel::Mask& oMask, const Window& oWindow, std::size_t nPixels,
              std::size_t nChannels)
        : moMask(oMask),
          moWindow(oWindow),
          mnChannels(nChannels),
          mnWindows((nPixels - oWindow.GetWidth() + 1) * nChannels),
          mvPixels(nPixels + kernels::kCountPadding),
          mvSamples(nPixels * nChannels + kernels::kCountPadding),
          mvnScratch(mvSamples.size()),
          moBits(oWindow, kernels::PadRow(nPixels * nChannels) / 8),
          moCounts(oWindow, mnWindows)
    {
    }

    const unsigned char* Bits(std::int64_t y)
    {
        return moBits.Get(y, [this](std::int64_t nRow, unsigned char* pBits)
                          { MakeRow(nRow, pBits, moCounts.Slot(nRow)); });
    }

    const std::int32_t* Counts(std::int64_t y)
    {
        Bits(y);
        return moCounts.Slot(y);
    }

private:
    void MakeRow(std::int64_t y, unsigned char* pBits, std::int32_t* pnCounts)
    {
        const std::span<unsigned char> oPixels(mvPixels.data(),
                                               mvPixels.size() - kernels::kCountPadding);
        moMask.ExpandRow(-std::int64_t{moWindow.mnHalfX}, y, oPixels);
        const unsigned char* pSamples = mvPixels.data();
        if (mnChannels != 1)
        {
            RepeatForChannels<unsigned char>(oPixels, mnChannels, mvSamples.data());
            pSamples = mvSamples.data();
        }
        kernels::PackValid(pSamples, oPixels.size() * mnChannels, pBits);
        kernels::CountValid(pSamples, moWindow.GetWidth(), mnChannels, mvnScratch.data(),
                            {pnCounts, mnWindows});
    }

    const tessel::Mask& moMask;
    Window moWindow;
    std::size_t mnChannels;
    std::size_t mnWindows;  ///< in a row, times the channels
    std::vector<unsigned char> mvPixels;
    std::vector<unsigned char> mvSamples;
    std::vector<std::int32_t> mvnScratch;
    RowRing<unsigned char> moBits;
    RowRing<std::int32_t> moCounts;
};

/// The rows that enter the sums: doubles, transformed. Masked samples are among them.
template <class TSample>
class SummedRows
{
public:
    SummedRows(const tessel::Raster& oIn, const Window& oWindow, WindowTerm::Transform pfnTransform)
        : moIn(oIn),
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
    bool IsAsItLies() const { return std::is_same_v<TSample, double> && mpfnTransform == nullptr; }

    void MakeRow(std::int64_t y, std::span<double> vdfRow)
    {
        LoadSamples(moIn.GetPixelAs<const TSample>(mnLeft, y), vdfRow);
        if (mpfnTransform != nullptr)
        {
            mpfnTransform(vdfRow);
        }
    }

    const tessel::Raster& moIn;
    std::int64_t mnLeft;
    std::size_t mnSamples;
    WindowTerm::Transform mpfnTransform;
    RowRing<double> moRows;
};

}  // namespace kor::filters::engine
