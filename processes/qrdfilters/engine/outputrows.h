#pragma once

#include <algorithm>
#include <cstdint>
#include <type_traits>
#include <vector>

#include "processes/qrdfilters/background.h"
#include "processes/qrdfilters/engine/channels.h"
#include "processes/qrdfilters/kernels/windowsums.h"
#include "processes/qrdfilters/samplerows.h"
#include "processes/qrdfilters/slidingwindow.h"

namespace kor::filters::engine
{

/// Puts the finished stretches where they belong: results, and background where a mask says so.
template <class TSample>
class OutputRows
{
public:
    OutputRows(const tessel::Raster& oIn, const tessel::Mask* poMaskIn, bool bBGZero,
               const FinishWindows& oFinish, tessel::Raster& oOut, const tessel::Mask* poMaskOut)
        : moIn(oIn),
          mpoMaskIn(poMaskIn),
          mbBGZero(bBGZero),
          moFinish(oFinish),
          moOut(oOut),
          mpoMaskOut(poMaskOut),
          mbMasked(poMaskIn != nullptr || poMaskOut != nullptr),
          mbStreamed(std::is_same_v<TSample, double> && oOut.mnBufferSize >= kStreamedBytes)
    {
    }

    void Write(const WindowStatistics& oStatistics)
    {
        TSample* pOut = moOut.GetPixelAs<TSample>(0, oStatistics.mnRow) + oStatistics.mnFirst;
        const std::size_t nPadded = oStatistics.GetPadded();
        if constexpr (std::is_same_v<TSample, double>)
        {
            if (CanFinishInPlace(oStatistics))
            {
                moFinish(oStatistics, {pOut, nPadded});
                return;
            }
        }
        mvdfResults.resize(std::max(mvdfResults.size(), nPadded));
        moFinish(oStatistics, {mvdfResults.data(), nPadded});
        const std::span<double> vdfResults(mvdfResults.data(), oStatistics.mnSamples);
        mbMasked ? WriteMasked(oStatistics, vdfResults, pOut) : WriteAll(vdfResults, pOut);
    }

private:
    /// Well above the caches of a core.
    static constexpr std::uint64_t kStreamedBytes = std::uint64_t{16} << 20;

    /// True where the padding still lies in the row: the next stretch writes over it.
    bool CanFinishInPlace(const WindowStatistics& oStatistics) const
    {
        const std::size_t nRow = std::size_t{moOut.mnWidth} * moOut.mnChannels;
        return !mbMasked && !mbStreamed && oStatistics.mnFirst + oStatistics.GetPadded() <= nRow;
    }

    void WriteAll(std::span<const double> vdfResults, TSample* pOut) const
    {
        if constexpr (std::is_same_v<TSample, double>)
        {
            if (mbStreamed)
            {
                kernels::StreamRow(vdfResults, pOut);
                return;
            }
        }
        StoreSamples(vdfResults, pOut);
    }

    void WriteMasked(const WindowStatistics& oStatistics, std::span<double> vdfResults,
                     TSample* pOut)
    {
        const std::size_t nChannels = moIn.mnChannels;
        const TSample* pIn =
            moIn.GetPixelAs<const TSample>(0, oStatistics.mnRow) + oStatistics.mnFirst;
        mvComputed.resize(oStatistics.mnSamples / nChannels);
        FindComputedPixels(mpoMaskIn, mpoMaskOut,
                           static_cast<std::int64_t>(oStatistics.mnFirst / nChannels),
                           oStatistics.mnRow, mvComputed);
        if constexpr (std::is_same_v<TSample, double>)
        {
            const unsigned char* pComputed = ComputedSamples(nChannels);
            const std::span<double> vdfOut =
                mbStreamed ? vdfResults : std::span<double>(pOut, vdfResults.size());
            mbBGZero ? kernels::ClearMasked(pComputed, vdfResults.data(), vdfOut)
                     : kernels::SelectValid(pComputed, vdfResults.data(), pIn, vdfOut);
            if (mbStreamed)
            {
                kernels::StreamRow(vdfOut, pOut);
            }
        }
        else
        {
            StoreSamples(vdfResults, pOut);
            WriteBackground<TSample, TSample>(mvComputed, pIn, nChannels, mbBGZero, pOut);
        }
    }

    /// mvComputed for samples instead of pixels.
    const unsigned char* ComputedSamples(std::size_t nChannels)
    {
        if (nChannels == 1)
        {
            return mvComputed.data();
        }
        mvComputedSamples.resize(mvComputed.size() * nChannels);
        RepeatForChannels<unsigned char>(mvComputed, nChannels, mvComputedSamples.data());
        return mvComputedSamples.data();
    }

    const tessel::Raster& moIn;
    const tessel::Mask* mpoMaskIn;
    bool mbBGZero;
    const FinishWindows& moFinish;
    tessel::Raster& moOut;
    const tessel::Mask* mpoMaskOut;
    bool mbMasked;
    bool mbStreamed;
    std::vector<double> mvdfResults;
    std::vector<unsigned char> mvComputed;
    std::vector<unsigned char> mvComputedSamples;
};

}  // namespace kor::filters::engine
