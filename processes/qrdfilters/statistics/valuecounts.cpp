#include "processes/qrdfilters/statistics/valuecounts.h"

namespace kor::filters
{

ValueCounts::Mode ValueCounts::FindMode() const
{
    Mode oBest;
    for (const Mode& oSlot : mvoSlots)
    {
        const bool bLower = oSlot.mnCount == oBest.mnCount && oSlot.mnValue < oBest.mnValue;
        if (oSlot.mnCount > oBest.mnCount || (bLower && oSlot.mnCount > 0))
        {
            oBest = oSlot;
        }
    }
    return oBest;
}

ValueCounts::Mode* ValueCounts::TakeSlot(std::uint16_t nValue)
{
    // A table of values that are looked for one after the other is quick up to three quarters.
    ++mnTaken;
    if (mnBits < kMostBits && mnTaken > mvoSlots.size() / 4 * 3)
    {
        Grow();
    }
    Mode* const poSlot = FindSlot(nValue);
    poSlot->mnValue = nValue;
    return poSlot;
}

void ValueCounts::Grow()
{
    ++mnBits;
    std::vector<Mode> voFormer(std::size_t{1} << mnBits);
    voFormer.swap(mvoSlots);
    for (const Mode& oSlot : voFormer)
    {
        if (oSlot.mnCount != 0)
        {
            *FindSlot(static_cast<std::uint16_t>(oSlot.mnValue)) = oSlot;
        }
    }
}

}  // namespace kor::filters
