#pragma once

#include <cstdint>
#include <functional>

namespace kor::filters
{

inline constexpr std::uint32_t kBandStep = 4;

/// Calls oWork(nFirst, nEnd) for bands of rows that together are the rows 0 to nRows - 1, each
/// once. The bands run in parallel, divided among the threads in contiguous runs. None has more
/// than nMostRows rows, and there are as many as threads where there are rows enough.
///
/// The first exception that a band throws is kept until all threads are done and then passed on;
/// bands that have not begun by then are left out.
void ForEachRowBand(std::uint32_t nRows, std::uint32_t nMostRows,
                    const std::function<void(std::uint32_t nFirst, std::uint32_t nEnd)>& oWork);

}  // namespace kor::filters
