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
        if constexpr (std::is_same_v<TSample, double>)
        {
            // The padding is written over by the next stretch of the row.
            const std::size_t nRow = std::size_t{moOut.mnWidth} * moOut.mnChannels;
            if (!mbMasked && !mbStreamed && oStatistics.mnFirst + oStatistics.GetPadded() <= nRow)
            {
                moFinish(oStatistics, {pOut, oStatistics.GetPadded()});
                return;
            }
        }
        mvdfResults.resize(std::max(mvdfResults.size(), oStatistics.GetPadded()));
        moFinish(oStatistics, {mvdfResults.data(), oStatistics.GetPadded()});
        const std::span<const double> vdfResults(mvdfResults.data(), oStatistics.mnSamples);
        if (!mbMasked)
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
            return;
        }
        WriteMasked(oStatistics, vdfResults, pOut);
    }

private:
    /// Well above the caches of a core.
    static constexpr std::uint64_t kStreamedBytes = std::uint64_t{16} << 20;

    void WriteMasked(const WindowStatistics& oStatistics, std::span<const double> vdfResults,
                     TSample* pOut)
    {
        const std::size_t nChannels = moIn.mnChannels;
        const std::size_t nPixels = oStatistics.mnSamples / nChannels;
        const TSample* pIn =
            moIn.GetPixelAs<const TSample>(0, oStatistics.mnRow) + oStatistics.mnFirst;
        mvComputed.resize(std::max(mvComputed.size(), nPixels));
        const std::span<unsigned char> oComputed(mvComputed.data(), nPixels);
        FindComputedPixels(mpoMaskIn, mpoMaskOut,
                           static_cast<std::int64_t>(oStatistics.mnFirst / nChannels),
                           oStatistics.mnRow, oComputed);
        if constexpr (std::is_same_v<TSample, double>)
        {
            const unsigned char* pComputed = oComputed.data();
            if (nChannels != 1)
            {
                mvComputedSamples.resize(std::max(mvComputedSamples.size(), vdfResults.size()));
                RepeatForChannels<unsigned char>(oComputed, nChannels, mvComputedSamples.data());
                pComputed = mvComputedSamples.data();
            }
            const std::span<double> vdfOut(pOut, vdfResults.size());
            mbBGZero ? kernels::ClearMasked(pComputed, vdfResults.data(), vdfOut)
                     : kernels::SelectValid(pComputed, vdfResults.data(), pIn, vdfOut);
            return;
        }
        StoreSamples(vdfResults, pOut);
        WriteBackground(oComputed, pIn, nChannels, mbBGZero, pOut);
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
