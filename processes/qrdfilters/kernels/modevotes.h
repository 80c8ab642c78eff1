#pragma once

#include <cstddef>
#include <cstdint>
#include <span>

/// The most frequent sample of each window, by counting equal samples.
///
/// A sample's rank in a window is twice the number of samples there that equal it, and one more
/// where it equals the window's centre. The highest rank wins, and of equal ranks the first in row
/// order; the centre itself starts with kLowestRank, so that nothing that occurs once beats it.
///
/// How often a sample is met in each of the windows that hold it follows from the comparisons with
/// its neighbourhood alone, so that all ranks of a row of samples come from sums of planes of
/// bytes: plane k of a row holds for each sample whether it equals the one k steps further. Planes
/// are nPitch entries apart, and all lengths are multiples of kModePadding.
namespace kor::filters::kernels
{

inline constexpr std::size_t kModePadding = 64;
inline constexpr unsigned int kLowestRank = 3;

/// pEqual[k * nPitch + i] = pSamples[i] == pOthers[i + k * nStep] ? 1 : 0, for nPlanes planes.
/// Exists for std::uint8_t, std::uint16_t, std::uint32_t, float and double.
template <class T>
void FindEqual(const T* pSamples, const T* pOthers, std::size_t nStep, std::size_t nSamples,
               std::size_t nPlanes, std::uint8_t* pEqual, std::size_t nPitch);

/// Of the 2 * nWindow - 1 planes of a row: plane a of pCounts is the sum of the nWindow planes that
/// begin with plane nWindow - 1 - a, what a sample in column a of a window meets there. Sums wrap.
void CountAlongRow(const std::uint8_t* pEqual, std::size_t nWindow, std::size_t nSamples,
                   std::uint8_t* pCounts, std::size_t nPitch);

/// Of 2 * nWindow - 1 planes of counts, nCountsPitch apart, one a row of the neighbourhood:
/// pRanks[r * nRanksPitch + i] is twice the sum of the nWindow counts that begin with plane
/// nWindow - 1 - r, and then plane nWindow - 1 - r of the nWindow planes pCentre, which are
/// nCentrePitch apart, is added. Sums wrap. Exists for std::uint8_t and std::uint16_t.
template <class TRank>
void RankDownColumn(const std::uint8_t* pCounts, std::size_t nCountsPitch,
                    const std::uint8_t* pCentre, std::size_t nCentrePitch, std::size_t nWindow,
                    std::size_t nSamples, TRank* pRanks, std::size_t nRanksPitch);

/// Lets the samples of one window row take part, from the left: where rank
/// pRanks[a * nPitch + i + a * nStep] is above pBest[i] it takes its place, and pIndex[i] becomes
/// nFirst + a.
template <class TRank>
void Vote(const TRank* pRanks, std::size_t nPitch, std::size_t nStep, std::size_t nWindow,
          std::size_t nFirst, std::size_t nSamples, TRank* pBest, TRank* pIndex);

/// What one window votes for: the position of its winner. nCentre is the position of the centre.
/// oWindow is padded with NaN from nArea on to a multiple of 8. The number of samples that equal
/// the first one is left in nFirstCount.
std::size_t FindMode(std::span<const double> oWindow, std::size_t nArea, std::size_t nCentre,
                     std::size_t& nFirstCount);

}  // namespace kor::filters::kernels
