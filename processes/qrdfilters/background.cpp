#include "processes/qrdfilters/background.h"

#include <functional>
#include <vector>

namespace kor::filters
{

void FindComputedPixels(const tessel::Mask* poMaskIn, const tessel::Mask* poMaskOut, std::int64_t x,
                        std::int64_t y, std::span<unsigned char> oComputed)
{
    if (poMaskIn == nullptr && poMaskOut == nullptr)
    {
        std::fill(oComputed.begin(), oComputed.end(), static_cast<unsigned char>(1));
        return;
    }
    (poMaskIn != nullptr ? poMaskIn : poMaskOut)->ExpandRow(x, y, oComputed);
    if (poMaskIn != nullptr && poMaskOut != nullptr)
    {
        std::vector<unsigned char> vOut(oComputed.size());
        poMaskOut->ExpandRow(x, y, vOut);
        std::transform(oComputed.begin(), oComputed.end(), vOut.begin(), oComputed.begin(),
                       std::bit_and<>());
    }
}

}  // namespace kor::filters
