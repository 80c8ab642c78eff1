#pragma once

#include <cstddef>
#include <cstdint>
#include <functional>
#include <span>
#include <vector>

#include "basic/tessel/raster/raster.h"
#include "processes/qrdfilters/window.h"

namespace kor::filters
{

/// Selects the most frequent samples of the windows of a block, whose samples are of type T, one of
/// the ten element types. Samples are compared as doubles, by their exact values.
///
/// A value that occurs once in a window never wins: where all do, and for not a number, the pixel
/// keeps its own. Of values that occur equally often the pixel's own wins, or else the one that
/// comes first in row order; the sample that is given is the first of its value, which tells the
/// sign of a zero. May be used by several threads at once.
template <class T>
class ModeSelection
{
public:
    /// Takes the modes of samples of row y, from nFirst on; those of pixels that are not wanted
    /// mean nothing.
    using TakeModes =
        std::function<void(std::uint32_t y, std::size_t nFirst, std::span<const double> vdfModes)>;

    /// poValid: null, or 0 or 1 a pixel with the geometry of oIn. Where it is 0 at the first column
    /// of a window's row, the pixel's own sample stands for all samples of that row; it is asked
    /// nowhere else. bThinLine: a pixel in whose window of 3 x 3 the upper left sample fills three
    /// places or more keeps its own. The margins of oIn hold the window.
    ModeSelection(const tessel::Raster& oIn, const tessel::Raster* poValid, const Window& oWindow,
                  bool bThinLine);

    /// Selects the modes of rows nFirst to nEnd - 1. oWanted holds, row by row, 1 for each pixel
    /// that is wanted; empty, it stands for all.
    void SelectRows(std::uint32_t nFirst, std::uint32_t nEnd,
                    std::span<const unsigned char> oWanted, const TakeModes& oTake) const;

private:
    struct Band;

    void SplitPixels(std::uint32_t y, std::span<unsigned char> oVoted,
                     std::span<unsigned char> oAlone) const;
    template <class TRank>
    void SelectByVotes(const Band& oBand) const;
    void SelectAlone(const Band& oBand) const;
    template <class TLane>
    void LoadTile(std::int64_t y, std::size_t nFirst, std::size_t nReach,
                  std::span<TLane> oLanes) const;
    void Finish(const Band& oBand, std::uint32_t y, std::size_t nFirst,
                std::span<double> vdfModes) const;
    void FindModesAlone(const Band& oBand, std::uint32_t y, std::size_t nFirst,
                        std::span<double> vdfModes) const;
    double FindModeAlone(std::int64_t x, std::int64_t y, std::size_t c,
                         std::span<double> vdfWindow) const;

    const tessel::Raster& moIn;
    const tessel::Raster* mpoValid;
    Window moWindow;
    bool mbThinLine;
    std::vector<std::ptrdiff_t> mvnOffsets;  ///< of the window's samples from its centre
};

}  // namespace kor::filters
