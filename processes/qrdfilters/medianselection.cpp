#include "processes/qrdfilters/medianselection.h"

#include <algorithm>
#include <type_traits>
#include <vector>

#include "basic/core/typedispatch/typelist.h"
#include "processes/qrdfilters/findbyte.h"
#include "processes/qrdfilters/kernels/median.h"
#include "processes/qrdfilters/sampleconversion.h"
#include "processes/qrdfilters/validwindows.h"

namespace kor::filters
{

namespace
{

/// The upper median of the samples, which are reordered.
template <class A>
A UpperMedian(A* pFirst, A* pEnd)
{
    A* const pMiddle = pFirst + (pEnd - pFirst) / 2;
    if constexpr (std::is_floating_point_v<A>)
    {
        // Less-than is no order beside a NaN, and nth_element would then run out of the samples.
        if (std::any_of(pFirst, pEnd, [](A x) { return x != x; }))
        {
            const auto oNaNLast = [](A a, A b) { return a < b || (a == a && b != b); };
            std::nth_element(pFirst, pMiddle, pEnd, oNaNLast);
            return *pMiddle;
        }
    }
    std::nth_element(pFirst, pMiddle, pEnd);
    return *pMiddle;
}

}  // namespace

template <class T>
MedianSelection<T>::MedianSelection(const tessel::Raster& oIn, const tessel::Raster* poValid)
    : moIn(oIn),
      mpoValid(poValid),
      mnWindowWidth(2 * std::size_t{oIn.mnMarginX} + 1),
      mnWindowHeight(2 * std::size_t{oIn.mnMarginY} + 1)
{
}

template <class T>
void MedianSelection<T>::SelectRows(std::uint32_t nFirst, std::uint32_t nEnd,
                                    std::span<const unsigned char> oComputed, T* pOut,
                                    std::size_t nOutPitch) const
{
    const bool bNetwork =
        mnWindowWidth == mnWindowHeight && kernels::HasMedianNetwork(mnWindowWidth);
    if (bNetwork)
    {
        SelectByNetwork(nFirst, nEnd, pOut, nOutPitch);
        if (mpoValid == nullptr)
        {
            return;
        }
    }
    std::vector<unsigned char> vWanted(moIn.mnWidth);
    std::vector<T> vGather(mnWindowWidth * mnWindowHeight * moIn.mnChannels);
    for (std::uint32_t y = nFirst; y < nEnd; ++y)
    {
        const std::size_t nRow = y - nFirst;
        std::fill(vWanted.begin(), vWanted.end(), static_cast<unsigned char>(1));
        if (!oComputed.empty())
        {
            std::copy_n(oComputed.data() + nRow * moIn.mnWidth, moIn.mnWidth, vWanted.begin());
        }
        if (bNetwork)
        {
            DropWholeWindows(y, vWanted);
        }
        SelectPixels(y, vWanted, vGather, pOut + nRow * nOutPitch);
    }
}

/// Clears the pixels of row y in whose windows no pixel is masked: the network has served them.
template <class T>
void MedianSelection<T>::DropWholeWindows(std::uint32_t y, std::span<unsigned char> oWanted) const
{
    std::vector<unsigned char> vWhole(oWanted.size());
    FindWholeWindows(*mpoValid, moIn.mnMarginX, moIn.mnMarginY, 0, y, vWhole);
    std::transform(oWanted.begin(), oWanted.end(), vWhole.begin(), oWanted.begin(),
                   [](unsigned char nWanted, unsigned char nWhole)
                   { return static_cast<unsigned char>(nWanted & ~nWhole); });
}

template <class T>
void MedianSelection<T>::SelectByNetwork(std::uint32_t nFirst, std::uint32_t nEnd, T* pOut,
                                         std::size_t nOutPitch) const
{
    kernels::MedianBlock<Arithmetic<T>> oBlock;
    oBlock.pIn = moIn.GetPixelAs<const Arithmetic<T>>(-std::int64_t{moIn.mnMarginX},
                                                      nFirst - std::int64_t{moIn.mnMarginY});
    oBlock.nInPitch = moIn.GetRowSamples();
    oBlock.nStep = moIn.mnChannels;
    oBlock.pOut = reinterpret_cast<Arithmetic<T>*>(pOut);
    oBlock.nOutPitch = nOutPitch;
    oBlock.nSamples = RowSamples();
    oBlock.nRows = nEnd - nFirst;
    kernels::SelectMedians(mnWindowWidth, oBlock);
}

template <class T>
void MedianSelection<T>::SelectPixels(std::uint32_t y, std::span<const unsigned char> oWanted,
                                      std::span<T> oGather, T* pOut) const
{
    using A = Arithmetic<T>;
    const std::size_t nArea = mnWindowWidth * mnWindowHeight;
    for (std::size_t x = FindByte(oWanted, 0, 1); x < oWanted.size();
         x = FindByte(oWanted, x + 1, 1))
    {
        const std::size_t nCount = Gather(x, y, oGather);
        for (std::size_t c = 0; c < moIn.mnChannels; ++c)
        {
            A* const pSamples = reinterpret_cast<A*>(oGather.data()) + c * nArea;
            pOut[x * moIn.mnChannels + c] =
                static_cast<T>(UpperMedian(pSamples, pSamples + nCount));
        }
    }
}

/// Collects the valid samples of a window, those of each channel together with room for a whole
/// window, and returns how many there are.
template <class T>
std::size_t MedianSelection<T>::Gather(std::size_t x, std::uint32_t y, std::span<T> oGather) const
{
    const std::size_t nChannels = moIn.mnChannels;
    const std::size_t nArea = mnWindowWidth * mnWindowHeight;
    const std::int64_t nLeft = static_cast<std::int64_t>(x) - moIn.mnMarginX;
    const std::int64_t nTop = std::int64_t{y} - moIn.mnMarginY;
    std::size_t nCount = 0;
    for (std::size_t r = 0; r < mnWindowHeight; ++r)
    {
        const std::int64_t nRow = nTop + static_cast<std::int64_t>(r);
        const T* pSample = moIn.GetPixelAs<T>(nLeft, nRow);
        const unsigned char* pValid =
            mpoValid != nullptr ? mpoValid->GetPixel(nLeft, nRow) : nullptr;
        for (std::size_t k = 0; k < mnWindowWidth; ++k, pSample += nChannels)
        {
            if (pValid != nullptr && pValid[k] == 0)
            {
                continue;
            }
            for (std::size_t c = 0; c < nChannels; ++c)
            {
                oGather[c * nArea + nCount] = pSample[c];
            }
            ++nCount;
        }
    }
    return nCount;
}

template class MedianSelection<char>;
template class MedianSelection<unsigned char>;
template class MedianSelection<short>;
template class MedianSelection<unsigned short>;
template class MedianSelection<int>;
template class MedianSelection<unsigned int>;
template class MedianSelection<float>;
template class MedianSelection<double>;
template class MedianSelection<int64>;
template class MedianSelection<uint64>;

}  // namespace kor::filters
