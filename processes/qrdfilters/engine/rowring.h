#pragma once

#include <cstddef>
#include <cstdint>
#include <vector>

#include "processes/qrdfilters/kernels/windowsums.h"
#include "processes/qrdfilters/window.h"

namespace kor::filters::engine
{

/// The rows that a batch of windows touches, made when they are first asked for and then kept as
/// long as a window may still want them. Rows are asked for in ascending order, give or take those.
template <class T>
class RowRing
{
public:
    RowRing(const Window& oWindow, std::size_t nLength)
        : mnNext(-std::int64_t{oWindow.mnHalfY}),
          mnFirst(mnNext),
          mnRows(oWindow.GetHeight() + kernels::kBatchRows),
          mnLength(kernels::PadRow(nLength) + kernels::kCountPadding),
          mvValues(mnRows * mnLength)
    {
    }

    template <class MakeRow>
    const T* Get(std::int64_t y, const MakeRow& oMakeRow)
    {
        for (; mnNext <= y; ++mnNext)
        {
            oMakeRow(mnNext, Slot(mnNext));
        }
        return Slot(y);
    }

    /// The place of a row, for what makes it.
    T* Slot(std::int64_t y)
    {
        return &mvValues[static_cast<std::size_t>(y - mnFirst) % mnRows * mnLength];
    }

private:
    std::int64_t mnNext;
    std::int64_t mnFirst;
    std::size_t mnRows;
    std::size_t mnLength;
    std::vector<T> mvValues;
};

}  // namespace kor::filters::engine
