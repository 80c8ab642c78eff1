#include "processes/qrdfilters/background.h"

#include <array>
#include <functional>

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
    if (poMaskIn == nullptr || poMaskOut == nullptr)
    {
        return;
    }
    std::array<unsigned char, 512> anOut{};
    for (std::size_t i = 0; i < oComputed.size(); i += anOut.size())
    {
        const auto oPart = oComputed.subspan(i, std::min(anOut.size(), oComputed.size() - i));
        poMaskOut->ExpandRow(x + static_cast<std::int64_t>(i), y, {anOut.data(), oPart.size()});
        std::transform(oPart.begin(), oPart.end(), anOut.begin(), oPart.begin(), std::bit_and<>());
    }
}

}  // namespace kor::filters
