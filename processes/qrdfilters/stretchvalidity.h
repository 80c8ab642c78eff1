#pragma once

#include <cstddef>
#include <cstdint>
#include <vector>

#include "basic/tessel/mask/mask.h"
#include "processes/qrdfilters/window.h"

namespace kor::filters
{

/// Which pixels are valid in the windows around a stretch of pixels of one row.
class StretchValidity
{
public:
    /// Without a mask all pixels are valid.
    StretchValidity(const tessel::Mask* poMask, const Window& oWindow);

    /// Moves to the nPixels pixels from (x, y) to the right.
    void MoveTo(std::int64_t x, std::int64_t y, std::size_t nPixels);

    /// True when no pixel of any window is masked; the other questions are not asked then.
    bool IsAllValid() const { return mbAllValid; }
    /// True when no pixel of the window around pixel i of the stretch is masked.
    bool IsWhole(std::size_t i) const { return mvWhole[i] != 0; }
    /// Row r of the windows as bytes 1 or 0, from the left end of the first window.
    const unsigned char* GetRow(std::size_t r) const { return &mvValid[r * mnPitch]; }
    std::size_t GetRowPixels() const { return mnPitch; }

private:
    const tessel::Mask* mpoMask;
    Window moWindow;
    bool mbAllValid = true;
    std::size_t mnPitch = 0;
    std::vector<unsigned char> mvValid;
    std::vector<unsigned char> mvWhole;
};

}  // namespace kor::filters
