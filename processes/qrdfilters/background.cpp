#include "processes/qrdfilters/background.h"

#include <algorithm>
#include <array>
#include <cstring>

namespace kor::filters
{

namespace
{

/// Clears the pixels of the row that poMask masks.
void ClearClipped(const tessel::Mask& oMask, std::int64_t x, std::int64_t y,
                  std::span<unsigned char> oComputed)
{
    std::array<unsigned char, 256> anValid{};
    for (std::size_t nFirst = 0; nFirst < oComputed.size(); nFirst += anValid.size())
    {
        const auto oPart =
            oComputed.subspan(nFirst, std::min(anValid.size(), oComputed.size() - nFirst));
        oMask.ExpandRow(x + static_cast<std::int64_t>(nFirst), y, {anValid.data(), oPart.size()});
        for (std::size_t i = 0; i < oPart.size(); ++i)
        {
            oPart[i] &= anValid[i];
        }
    }
}

}  // namespace

void FindComputedPixels(const tessel::Mask* poMaskIn, const tessel::Mask* poMaskOut, std::int64_t x,
                        std::int64_t y, std::span<unsigned char> oComputed)
{
    const tessel::Mask* poFirst = poMaskIn != nullptr ? poMaskIn : poMaskOut;
    if (poFirst == nullptr)
    {
        std::fill(oComputed.begin(), oComputed.end(), static_cast<unsigned char>(1));
        return;
    }
    poFirst->ExpandRow(x, y, oComputed);
    if (poMaskIn != nullptr && poMaskOut != nullptr)
    {
        ClearClipped(*poMaskOut, x, y, oComputed);
    }
}

std::size_t FindByte(std::span<const unsigned char> oBytes, std::size_t nFirst,
                     unsigned char nValue)
{
    if (nFirst == oBytes.size())
    {
        return nFirst;
    }
    const void* pFound = std::memchr(&oBytes[nFirst], nValue, oBytes.size() - nFirst);
    return pFound == nullptr ? oBytes.size()
                             : static_cast<std::size_t>(static_cast<const unsigned char*>(pFound) -
                                                        oBytes.data());
}

}  // namespace kor::filters
