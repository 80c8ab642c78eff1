#pragma once

#include <cstddef>
#include <cstdint>
#include <vector>

namespace kor::filters
{

/// How often each 16-bit value was met. The counters lie in a hash table that grows with the number
/// of different values: an array of all values for each of 65536 classes would take 16 GiB.
class ValueCounts
{
public:
    struct Mode
    {
        std::uint32_t mnValue = 0;
        std::uint32_t mnCount = 0;
    };

    void Add(std::uint16_t nValue)
    {
        if (mvoSlots.empty())
        {
            Grow();
        }
        Mode* poSlot = FindSlot(nValue);
        if (poSlot->mnCount == 0)
        {
            poSlot = TakeSlot(nValue);
        }
        ++poSlot->mnCount;
    }

    /// The value met most often, the lowest of several; a count of 0 when there is none.
    Mode FindMode() const;
    std::size_t GetBytes() const { return mvoSlots.capacity() * sizeof(Mode); }

private:
    static constexpr int kFewestBits = 3;
    static constexpr int kMostBits = 16;  ///< a slot for each value: no two of them meet

    /// The slot that the value has, or a free one for it.
    Mode* FindSlot(std::uint16_t nValue)
    {
        // An odd factor, 2^16 times the golden ratio: it only permutes the 16-bit values.
        const std::uint32_t nMixed = (nValue * 40503U) & 0xFFFFU;
        const std::size_t nLast = mvoSlots.size() - 1;
        std::size_t i = nMixed >> (kMostBits - mnBits);
        while (mvoSlots[i].mnCount != 0 && mvoSlots[i].mnValue != nValue)
        {
            i = (i + 1) & nLast;
        }
        return &mvoSlots[i];
    }
    Mode* TakeSlot(std::uint16_t nValue);
    void Grow();

    std::vector<Mode> mvoSlots;  ///< free where the count is 0
    std::uint32_t mnTaken = 0;
    int mnBits = kFewestBits - 1;
};

}  // namespace kor::filters
