#include "processes/qrdfilters/findbyte.h"

#include <cstring>

namespace kor::filters
{

std::size_t FindByte(std::span<const unsigned char> oBytes, std::size_t nStart, unsigned char nByte)
{
    if (nStart >= oBytes.size())
    {
        return oBytes.size();
    }
    const void* pFound = std::memchr(&oBytes[nStart], nByte, oBytes.size() - nStart);
    return pFound == nullptr ? oBytes.size()
                             : static_cast<std::size_t>(static_cast<const unsigned char*>(pFound) -
                                                        oBytes.data());
}

}  // namespace kor::filters
