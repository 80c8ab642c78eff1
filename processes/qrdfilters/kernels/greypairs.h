#pragma once

#include <cstddef>

namespace kor::filters::kernels
{

/// Grey levels are read this many pixels to the left of a row, and to the right of it.
inline constexpr std::size_t kPairPadding = 1;

/// Levels whose differences are not above this may be compared in single precision: the square of
/// the difference plus 1 is an integer that float holds, and the division is rounded once whether
/// it is made in float or in double and narrowed.
inline constexpr float kExactDifference = 4095.0F;

/// A row of grey levels and the one below it. Pixels outside the block, kPairPadding of them on
/// both sides included, have a valid value of 0.
struct GreyRows
{
    const float* mpfGrey;
    const float* mpfValid;  ///< 1, or 0 where the pixel is in no pair
    const float* mpfGreyBelow;
    const float* mpfValidBelow;
};

/// Similarities of the pairs of each column, summed over rows, and how many pairs these are.
struct PairSums
{
    float* mpfSums;
    float* mpfCounts;
};

/// oTo = oFrom plus the pairs of a row for each of nColumns columns: those of its pixel with the
/// neighbours to the east, south-east, south and south-west, added in this order. oTo may be oFrom.
/// bExact: no difference of levels is above kExactDifference.
void AddPairs(const GreyRows& oEntering, bool bExact, std::size_t nColumns, const PairSums& oFrom,
              const PairSums& oTo);

/// The same, but first minus the pairs of another row, subtracted in that order.
void MovePairs(const GreyRows& oLeaving, const GreyRows& oEntering, bool bExact,
               std::size_t nColumns, const PairSums& oFrom, const PairSums& oTo);

/// Rows that SlidePairs works on together.
inline constexpr std::size_t kPairRows = 8;

/// For kPairRows rows, each by itself: the sums of nWindow columns, from column i on for pixel i,
/// kept by adding a column on the right and subtracting one on the left, from nothing at the start
/// of the row. aoRows[k] has nPixels + nWindow - 1 columns; aoWindows[k] gets the sums and counts
/// of nPixels windows.
void SlidePairs(const PairSums* aoRows, std::size_t nWindow, std::size_t nPixels,
                const PairSums* aoWindows);

/// pfOut[i] = pfSums[i] / pfCounts[i], or 0 where pfValid[i] is 0. pfOut may be one of the others.
void DividePairs(const float* pfSums, const float* pfCounts, const float* pfValid,
                 std::size_t nPixels, float* pfOut);

}  // namespace kor::filters::kernels
