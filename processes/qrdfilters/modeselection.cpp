#include "processes/qrdfilters/modeselection.h"

#include <algorithm>
#include <limits>
#include <type_traits>

#include "basic/core/typedispatch/typelist.h"
#include "processes/qrdfilters/findbyte.h"
#include "processes/qrdfilters/kernels/modevotes.h"
#include "processes/qrdfilters/sampleconversion.h"
#include "processes/qrdfilters/samplerows.h"

namespace kor::filters
{

namespace
{

using kernels::kLowestRank;
using kernels::kModePadding;

// Windows up to these areas have ranks of 8 and 16 bits, and along a row what is counted fits in a
// byte. Larger ones would take too much memory, and are counted one by one.
constexpr std::size_t kMostVotesOf8Bits = 127;
constexpr std::size_t kMostVotes = 4095;
constexpr std::size_t kMostVotesOfARow = 255;
// Samples of a row that are worked on together: what is known of them stays in the caches.
constexpr std::size_t kTileSamples = 256;

constexpr std::size_t Padded(std::size_t nSamples)
{
    return (nSamples + kModePadding - 1) / kModePadding * kModePadding;
}

std::size_t AreaOf(const Window& oWindow)
{
    return oWindow.GetWidth() * oWindow.GetHeight();
}

/// The type in which samples of type T are compared. Integers are equal where their bits are; those
/// of 64 bits are compared as the doubles that they become.
template <class T>
using Lane = std::conditional_t<
    std::is_floating_point_v<T>, T,
    std::conditional_t<
        sizeof(T) == 8, double,
        std::conditional_t<sizeof(T) == 4, std::uint32_t,
                           std::conditional_t<sizeof(T) == 2, std::uint16_t, std::uint8_t>>>>;

template <class T>
void LoadLanes(const T* pIn, std::span<Lane<T>> oLanes)
{
    if constexpr (std::is_integral_v<T> && sizeof(T) == 8)
    {
        LoadSamples<T>(pIn, oLanes);
    }
    else
    {
        std::copy_n(reinterpret_cast<const Lane<T>*>(pIn), oLanes.size(), oLanes.begin());
    }
}

/// Votes over a tile of columns, row by row of the block: each row of samples is ranked once, for
/// all windows that hold it, and takes part in those of the output rows around it.
template <class TLane, class TRank>
class Election
{
public:
    /// Fills a row of lanes: those of row y from GetReach() samples before the tile on.
    using LoadRow = std::function<void(std::int64_t y, std::span<TLane> oLanes)>;
    /// Takes the positions of the winners in their windows, for row y of the tile.
    using TakeWinners = std::function<void(std::int64_t y, const TRank* pIndex)>;

    Election(const Window& oWindow, std::size_t nStep, bool bThinLine)
        : mnHalfX(oWindow.mnHalfX),
          mnHalfY(oWindow.mnHalfY),
          mnWidth(oWindow.GetWidth()),
          mnHeight(oWindow.GetHeight()),
          mnStep(nStep),
          mbThinLine(bThinLine),
          mnPitch(Padded(std::max(kTileSamples, 4 * mnHalfX * nStep))),
          mnShifts(2 * mnWidth - 1),
          mnLaneRow(mnPitch + 2 * (mnWidth - 1) * nStep),
          mvLanes((2 * mnHeight - 1) * mnLaneRow),
          mvEqual((mnHeight + 1) * mnShifts * mnPitch),
          mvCounts((2 * mnHeight - 1) * mnWidth * mnPitch),
          mvRanks(AreaOf(oWindow) * mnPitch + mnWidth * nStep + kModePadding),
          mvBest(mnHeight * mnPitch),
          mvIndex(mnHeight * mnPitch)
    {
    }

    /// Samples of an output row that a tile holds.
    std::size_t GetSamples() const { return mnPitch - 2 * mnHalfX * mnStep; }
    /// Samples before the tile that its lanes begin with.
    std::size_t GetReach() const { return 3 * mnHalfX * mnStep; }

    void Run(std::uint32_t nFirst, std::uint32_t nEnd, const LoadRow& oLoad,
             const TakeWinners& oTake)
    {
        const auto nHalfY = static_cast<std::int64_t>(mnHalfY);
        mnFirstRow = std::int64_t{nFirst} - nHalfY;
        mnLastRow = std::int64_t{nEnd} - 1 + nHalfY;
        std::int64_t nLoaded = mnFirstRow;
        for (std::int64_t y = mnFirstRow; y <= mnLastRow; ++y)
        {
            for (; nLoaded <= std::min(y + 2 * nHalfY, mnLastRow); ++nLoaded)
            {
                oLoad(nLoaded, {LaneRow(nLoaded), mnLaneRow});
            }
            RankRow(y);
            for (std::size_t r = 0; r < mnHeight; ++r)
            {
                const std::int64_t nOut = y - static_cast<std::int64_t>(r) + nHalfY;
                if (nOut >= std::int64_t{nFirst} && nOut < std::int64_t{nEnd})
                {
                    VoteRow(nOut, r);
                }
            }
            if (const std::int64_t nDone = y - nHalfY; nDone >= std::int64_t{nFirst})
            {
                oTake(nDone, StateOf(mvIndex, nDone));
            }
        }
    }

private:
    TLane* LaneRow(std::int64_t y)
    {
        const auto nRow = static_cast<std::size_t>(y - mnFirstRow);
        return &mvLanes[nRow % (2 * mnHeight - 1) * mnLaneRow];
    }

    TRank* StateOf(std::vector<TRank>& vState, std::int64_t y) const
    {
        const auto nRow = static_cast<std::size_t>(y - mnFirstRow);
        return &vState[nRow % mnHeight * mnPitch];
    }

    /// Ranks the samples of row y. Rows that no window of the band holds together with it are left
    /// out: what was counted of them earlier enters sums that are not used, or leaves them again.
    void RankRow(std::int64_t y)
    {
        const auto nHalfY = static_cast<std::int64_t>(mnHalfY);
        const TLane* pSamples = LaneRow(y) + (mnWidth - 1) * mnStep;
        for (std::int64_t dy = -2 * nHalfY; dy <= 2 * nHalfY; ++dy)
        {
            if (y + dy < mnFirstRow || y + dy > mnLastRow)
            {
                continue;
            }
            // Whether a sample equals the centre of a window is asked of the rows that can hold it.
            const bool bCentre = dy >= -nHalfY && dy <= nHalfY;
            const std::size_t nSlot = bCentre ? static_cast<std::size_t>(dy + nHalfY) : mnHeight;
            std::uint8_t* pEqual = &mvEqual[nSlot * mnShifts * mnPitch];
            kernels::FindEqual(pSamples, LaneRow(y + dy), mnStep, mnPitch, mnShifts, pEqual,
                               mnPitch);
            const auto nRow = static_cast<std::size_t>(dy + 2 * nHalfY);
            kernels::CountAlongRow(pEqual, mnWidth, mnPitch, &mvCounts[nRow * mnWidth * mnPitch],
                                   mnPitch);
        }
        for (std::size_t a = 0; a < mnWidth; ++a)
        {
            const std::size_t nCentreShift = mnHalfX + mnWidth - 1 - a;
            kernels::RankDownColumn(&mvCounts[a * mnPitch], mnWidth * mnPitch,
                                    &mvEqual[nCentreShift * mnPitch], mnShifts * mnPitch, mnHeight,
                                    mnPitch, &mvRanks[a * mnPitch], mnWidth * mnPitch);
        }
    }

    /// The ranked row is row r of the windows of output row y.
    void VoteRow(std::int64_t y, std::size_t r)
    {
        TRank* const pBest = StateOf(mvBest, y);
        TRank* const pIndex = StateOf(mvIndex, y);
        if (r == 0)
        {
            const auto nCentre = static_cast<TRank>(mnHalfY * mnWidth + mnHalfX);
            std::fill_n(pIndex, mnPitch, nCentre);
            // A rank of 6 and more is that of a sample met three times, and none beats the highest.
            constexpr TRank kHighest = std::numeric_limits<TRank>::max();
            const std::size_t nSamples = mbThinLine ? mnPitch : 0;
            std::transform(mvRanks.begin(), mvRanks.begin() + static_cast<std::ptrdiff_t>(nSamples),
                           pBest, [](TRank n) { return n >= 6 ? kHighest : TRank(kLowestRank); });
            std::fill(pBest + nSamples, pBest + mnPitch, TRank(kLowestRank));
        }
        kernels::Vote(&mvRanks[r * mnWidth * mnPitch], mnPitch, mnStep, mnWidth, r * mnWidth,
                      Padded(GetSamples()), pBest, pIndex);
    }

    std::size_t mnHalfX;
    std::size_t mnHalfY;
    std::size_t mnWidth;
    std::size_t mnHeight;
    std::size_t mnStep;
    bool mbThinLine;
    std::size_t mnPitch;
    std::size_t mnShifts;
    std::size_t mnLaneRow;
    std::vector<TLane> mvLanes;
    std::vector<std::uint8_t> mvEqual;
    std::vector<std::uint8_t> mvCounts;
    std::vector<TRank> mvRanks;
    std::vector<TRank> mvBest;
    std::vector<TRank> mvIndex;
    std::int64_t mnFirstRow = 0;
    std::int64_t mnLastRow = 0;
};

}  // namespace

/// Rows that are selected together, and which of their pixels are wanted: those that are voted
/// for, and those that are counted alone because the mask changes their windows.
template <class T>
struct ModeSelection<T>::Band
{
    std::uint32_t mnFirst;
    std::uint32_t mnEnd;
    std::size_t mnWidth;
    const TakeModes& moTake;
    std::vector<unsigned char> mvVoted{};
    std::vector<unsigned char> mvAlone{};

    std::span<unsigned char> Row(std::vector<unsigned char>& vPixels, std::uint32_t y) const
    {
        return std::span(vPixels).subspan((y - mnFirst) * mnWidth, mnWidth);
    }
    bool IsVoted(std::size_t nFirstPixel, std::size_t nEndPixel) const
    {
        for (std::size_t nRow = 0; nRow < mvVoted.size(); nRow += mnWidth)
        {
            const std::size_t nEnd = nRow + nEndPixel;
            if (FindByte(std::span(mvVoted).first(nEnd), nRow + nFirstPixel, 1) != nEnd)
            {
                return true;
            }
        }
        return mvVoted.empty();
    }
};

template <class T>
ModeSelection<T>::ModeSelection(const tessel::Raster& oIn, const tessel::Raster* poValid,
                                const Window& oWindow, bool bThinLine)
    : moIn(oIn), mpoValid(poValid), moWindow(oWindow), mbThinLine(bThinLine)
{
    const auto nRow = static_cast<std::ptrdiff_t>(oIn.GetRowSamples());
    const auto nHalfX = static_cast<std::ptrdiff_t>(oWindow.mnHalfX);
    const auto nHalfY = static_cast<std::ptrdiff_t>(oWindow.mnHalfY);
    for (std::ptrdiff_t dy = -nHalfY; dy <= nHalfY; ++dy)
    {
        for (std::ptrdiff_t dx = -nHalfX; dx <= nHalfX; ++dx)
        {
            mvnOffsets.push_back(dy * nRow + dx * static_cast<std::ptrdiff_t>(oIn.mnChannels));
        }
    }
}

template <class T>
void ModeSelection<T>::SelectRows(std::uint32_t nFirst, std::uint32_t nEnd,
                                  std::span<const unsigned char> oWanted,
                                  const TakeModes& oTake) const
{
    Band oBand{nFirst, nEnd, moIn.mnWidth, oTake};
    oBand.mvVoted.assign(oWanted.begin(), oWanted.end());
    const std::size_t nPixels = std::size_t{nEnd - nFirst} * moIn.mnWidth;
    if (mpoValid != nullptr)
    {
        oBand.mvVoted.resize(nPixels, 1);
        oBand.mvAlone.resize(nPixels);
        for (std::uint32_t y = nFirst; y < nEnd; ++y)
        {
            SplitPixels(y, oBand.Row(oBand.mvVoted, y), oBand.Row(oBand.mvAlone, y));
        }
    }
    if (mvnOffsets.size() <= kMostVotesOf8Bits)
    {
        SelectByVotes<std::uint8_t>(oBand);
    }
    else if (mvnOffsets.size() <= kMostVotes && moWindow.GetWidth() <= kMostVotesOfARow)
    {
        SelectByVotes<std::uint16_t>(oBand);
    }
    else
    {
        oBand.mvAlone.assign(nPixels, 1);
        std::copy(oWanted.begin(), oWanted.end(), oBand.mvAlone.begin());
        SelectAlone(oBand);
    }
}

/// Moves the pixels of row y whose windows the mask changes from oVoted to oAlone.
template <class T>
void ModeSelection<T>::SplitPixels(std::uint32_t y, std::span<unsigned char> oVoted,
                                   std::span<unsigned char> oAlone) const
{
    std::copy(oVoted.begin(), oVoted.end(), oAlone.begin());
    const std::int64_t nHalfX = moWindow.mnHalfX;
    const std::int64_t nHalfY = moWindow.mnHalfY;
    for (std::int64_t r = y - nHalfY; r <= y + nHalfY; ++r)
    {
        const unsigned char* pValid = mpoValid->GetPixel(-nHalfX, r);
        for (std::size_t x = 0; x < oVoted.size(); ++x)
        {
            oVoted[x] &= pValid[x];
        }
    }
    for (std::size_t x = 0; x < oVoted.size(); ++x)
    {
        oAlone[x] ^= oVoted[x];
    }
}

template <class T>
template <class TRank>
void ModeSelection<T>::SelectByVotes(const Band& oBand) const
{
    Election<Lane<T>, TRank> oElection(moWindow, moIn.mnChannels, mbThinLine);
    const std::size_t nRow = std::size_t{moIn.mnWidth} * moIn.mnChannels;
    std::vector<double> vdfModes(oElection.GetSamples());
    for (std::size_t nFirst = 0; nFirst < nRow; nFirst += vdfModes.size())
    {
        const std::size_t nSamples = std::min(vdfModes.size(), nRow - nFirst);
        const std::span<double> vdfTile(vdfModes.data(), nSamples);
        const auto oLoad = [&](std::int64_t y, std::span<Lane<T>> oLanes)
        { LoadTile(y, nFirst, oElection.GetReach(), oLanes); };
        const auto oTake = [&](std::int64_t y, const TRank* pIndex)
        {
            const T* pIn = moIn.GetPixelAs<const T>(0, y) + nFirst;
            for (std::size_t i = 0; i < nSamples; ++i)
            {
                vdfTile[i] = ConvertSample<T, double>(pIn[mvnOffsets[pIndex[i]]]);
                ++pIn;
            }
            Finish(oBand, static_cast<std::uint32_t>(y), nFirst, vdfTile);
        };
        const std::size_t nLast = nFirst + nSamples - 1;
        if (oBand.IsVoted(nFirst / moIn.mnChannels, nLast / moIn.mnChannels + 1))
        {
            oElection.Run(oBand.mnFirst, oBand.mnEnd, oLoad, oTake);
            continue;
        }
        for (std::uint32_t y = oBand.mnFirst; y < oBand.mnEnd; ++y)
        {
            Finish(oBand, y, nFirst, vdfTile);
        }
    }
}

/// Loads the lanes of row y from nReach samples before sample nFirst on. Those beside the row and
/// its frame are in no window, and are 0.
template <class T>
template <class TLane>
void ModeSelection<T>::LoadTile(std::int64_t y, std::size_t nFirst, std::size_t nReach,
                                std::span<TLane> oLanes) const
{
    const std::int64_t nChannels = moIn.mnChannels;
    const std::int64_t nFrame = moWindow.mnHalfX * nChannels;
    const std::int64_t nStart =
        static_cast<std::int64_t>(nFirst) - static_cast<std::int64_t>(nReach);
    const std::int64_t nLeft = std::max(nStart, -nFrame);
    const std::int64_t nRight = std::min(nStart + static_cast<std::int64_t>(oLanes.size()),
                                         moIn.mnWidth * nChannels + nFrame);
    std::fill(oLanes.begin(), oLanes.end(), TLane(0));
    LoadLanes<T>(moIn.GetPixelAs<const T>(0, y) + nLeft,
                 oLanes.subspan(static_cast<std::size_t>(nLeft - nStart),
                                static_cast<std::size_t>(nRight - nLeft)));
}

/// Adds the modes that are counted alone to a stretch of row y, and hands it out.
template <class T>
void ModeSelection<T>::Finish(const Band& oBand, std::uint32_t y, std::size_t nFirst,
                              std::span<double> vdfModes) const
{
    FindModesAlone(oBand, y, nFirst, vdfModes);
    oBand.moTake(y, nFirst, vdfModes);
}

/// Selects the modes of pixels that are all counted alone.
template <class T>
void ModeSelection<T>::SelectAlone(const Band& oBand) const
{
    std::vector<double> vdfModes(std::size_t{moIn.mnWidth} * moIn.mnChannels);
    for (std::uint32_t y = oBand.mnFirst; y < oBand.mnEnd; ++y)
    {
        Finish(oBand, y, 0, vdfModes);
    }
}

/// Writes the modes of those samples from nFirst on whose pixels are counted alone.
template <class T>
void ModeSelection<T>::FindModesAlone(const Band& oBand, std::uint32_t y, std::size_t nFirst,
                                      std::span<double> vdfModes) const
{
    if (oBand.mvAlone.empty())
    {
        return;
    }
    const std::size_t nChannels = moIn.mnChannels;
    const std::size_t nEnd = nFirst + vdfModes.size();
    const auto oAlone =
        std::span(oBand.mvAlone)
            .subspan((y - oBand.mnFirst) * oBand.mnWidth, (nEnd - 1) / nChannels + 1);
    // Padded to whole vectors of the kernel.
    std::vector<double> vdfWindow((mvnOffsets.size() + 7) / 8 * 8,
                                  std::numeric_limits<double>::quiet_NaN());
    for (std::size_t x = FindByte(oAlone, nFirst / nChannels, 1); x < oAlone.size();
         x = FindByte(oAlone, x + 1, 1))
    {
        const std::size_t nLast = std::min((x + 1) * nChannels, nEnd);
        for (std::size_t i = std::max(x * nChannels, nFirst); i < nLast; ++i)
        {
            vdfModes[i - nFirst] =
                FindModeAlone(static_cast<std::int64_t>(x), y, i - x * nChannels, vdfWindow);
        }
    }
}

template <class T>
double ModeSelection<T>::FindModeAlone(std::int64_t x, std::int64_t y, std::size_t c,
                                       std::span<double> vdfWindow) const
{
    const std::int64_t nHalfX = moWindow.mnHalfX;
    const std::int64_t nHalfY = moWindow.mnHalfY;
    const double dfCentre = ConvertSample<T, double>(moIn.GetPixelAs<const T>(x, y)[c]);
    double* pWindow = vdfWindow.data();
    for (std::int64_t r = y - nHalfY; r <= y + nHalfY; ++r)
    {
        // Meant: the bit of the row's first column speaks for the whole row.
        // See MaskBitOfTheFirstColumnStandsForTheWholeWindowRow.
        if (mpoValid != nullptr && *mpoValid->GetPixel(x - nHalfX, r) == 0)
        {
            pWindow = std::fill_n(pWindow, moWindow.GetWidth(), dfCentre);
            continue;
        }
        const T* pIn = moIn.GetPixelAs<const T>(x - nHalfX, r) + c;
        for (std::size_t k = 0; k < moWindow.GetWidth(); ++k)
        {
            *pWindow++ = ConvertSample<T, double>(pIn[k * moIn.mnChannels]);
        }
    }
    std::size_t nFirstCount = 0;
    const std::size_t nArea = mvnOffsets.size();
    const std::size_t nMode = kernels::FindMode(vdfWindow, nArea, nArea / 2, nFirstCount);
    return mbThinLine && nFirstCount >= 3 ? dfCentre : vdfWindow[nMode];
}

template class ModeSelection<char>;
template class ModeSelection<unsigned char>;
template class ModeSelection<short>;
template class ModeSelection<unsigned short>;
template class ModeSelection<int>;
template class ModeSelection<unsigned int>;
template class ModeSelection<float>;
template class ModeSelection<double>;
template class ModeSelection<int64>;
template class ModeSelection<uint64>;

}  // namespace kor::filters
