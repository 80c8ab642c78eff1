#include "processes/qrdfilters/kernels/convertrows.h"

#include <algorithm>
#include <cstdint>
#include <cstring>
#include <limits>
#include <type_traits>

#include "basic/core/typedispatch/typelist.h"
#include "processes/qrdfilters/sampleconversion.h"

#undef HWY_TARGET_INCLUDE
#define HWY_TARGET_INCLUDE "processes/qrdfilters/kernels/convertrows.cpp"
#include <hwy/foreach_target.h>
#include <hwy/highway.h>

HWY_BEFORE_NAMESPACE();
namespace kor::filters::kernels
{
namespace HWY_NAMESPACE
{

namespace hn = hwy::HWY_NAMESPACE;

/// RoundAndClamp without its cut: rounded samples within the limits of TOut, 0 for not a number.
/// The upper limit of a 32-bit integer is a power of two in float, one more than the integer holds.
template <class TOut, class D>
HWY_INLINE hn::Vec<D> RoundWithinLimits(D oTag, hn::Vec<D> oX)
{
    using T = hn::TFromD<D>;
    using Out = std::numeric_limits<TOut>;
    const auto oHighest = hn::Set(oTag, static_cast<T>(Out::max()));
    const auto oHalf = hn::Set(oTag, T(0.5));
    if constexpr (std::is_unsigned_v<TOut>)
    {
        const auto oRounded = hn::Add(oX, oHalf);
        const auto oPositive = hn::Gt(oRounded, hn::Zero(oTag));  // never true of not a number
        return hn::Min(hn::IfThenElseZero(oPositive, oRounded), oHighest);
    }
    else
    {
        const auto oNumber = hn::IfThenElseZero(hn::Eq(oX, oX), oX);
        const auto oRounded = hn::Add(oNumber, hn::CopySignToAbs(oHalf, oNumber));
        const auto oLowest = hn::Set(oTag, static_cast<T>(Out::min()));
        return hn::Min(hn::Max(oRounded, oLowest), oHighest);
    }
}

/// Cuts samples from 0 to 2^32 - 1; from float 2^32 gives 2^32 - 1.
template <class D>
HWY_INLINE hn::Vec<hn::Rebind<std::uint32_t, D>> CutToUnsigned32(D oTag, hn::Vec<D> oX)
{
    const hn::Rebind<std::uint32_t, D> oOutTag;
    if constexpr (std::is_same_v<hn::TFromD<D>, double>)
    {
        // The low bits of 2^52 + n, for an integer n below 2^52, are n.
        const auto oShifted = hn::Add(hn::Trunc(oX), hn::Set(oTag, 4503599627370496.0));
        return hn::TruncateTo(oOutTag, hn::BitCast(hn::RebindToUnsigned<D>(), oShifted));
    }
    else
    {
        // The upper half of the range passes through the signed cut, which ends at 2^31 - 1.
        const hn::RebindToSigned<D> oSigned;
        const auto oHalfRange = hn::Set(oTag, 2147483648.0F);
        const auto oUpper = hn::Ge(oX, oHalfRange);
        const auto oCut =
            hn::ConvertTo(oSigned, hn::Sub(oX, hn::IfThenElseZero(oUpper, oHalfRange)));
        const auto oTopBit = hn::Set(oOutTag, 0x80000000U);
        return hn::Xor(hn::BitCast(oOutTag, oCut),
                       hn::IfThenElseZero(hn::RebindMask(oOutTag, oUpper), oTopBit));
    }
}

/// Cuts samples within the limits of TOut.
template <class TOut, class D>
HWY_INLINE hn::Vec<hn::Rebind<TOut, D>> Cut(D oTag, hn::Vec<D> oX)
{
    if constexpr (std::is_same_v<TOut, std::uint32_t>)
    {
        return CutToUnsigned32(oTag, oX);
    }
    else
    {
        const hn::Rebind<std::int32_t, D> oInt32Tag;
        hn::Vec<decltype(oInt32Tag)> oInt32;
        if constexpr (std::is_same_v<hn::TFromD<D>, double>)
        {
            oInt32 = hn::DemoteTo(oInt32Tag, oX);
        }
        else
        {
            oInt32 = hn::ConvertTo(oInt32Tag, oX);
        }
        if constexpr (sizeof(TOut) == 4)
        {
            return oInt32;
        }
        else
        {
            return hn::DemoteTo(hn::Rebind<TOut, D>(), oInt32);
        }
    }
}

/// Floating point to an integer of 32 bits or less. Gives back how many samples it converted: all,
/// or none where there are fewer than a vector holds.
template <class TIn, class TOut>
HWY_INLINE std::size_t RoundSamples(const TIn* pIn, TOut* pOut, std::size_t nCount)
{
    const hn::ScalableTag<TIn> oTag;
    const std::size_t nLanes = hn::Lanes(oTag);
    if (nCount < nLanes)
    {
        return 0;
    }
    // The last vector ends with the row, and so repeats samples of the one before.
    for (std::size_t i = 0; i < nCount; i += nLanes)
    {
        const std::size_t nFirst = std::min(i, nCount - nLanes);
        const auto oRounded = RoundWithinLimits<TOut>(oTag, hn::LoadU(oTag, pIn + nFirst));
        hn::StoreU(Cut<TOut>(oTag, oRounded), hn::Rebind<TOut, decltype(oTag)>(), pOut + nFirst);
    }
    return nCount;
}

// The targets without vectors cut doubles near -2^31 to -2^31.
constexpr bool kVectors = HWY_TARGET != HWY_SCALAR && HWY_TARGET != HWY_EMU128;

template <class TIn, class TOut>
constexpr bool kRounds = kVectors&& std::is_floating_point_v<TIn>&& std::is_integral_v<TOut> &&
                         sizeof(TOut) <= 4;

template <class TIn, class TOut>
void ConvertRow(const void* pIn, void* pOut, std::size_t nCount)
{
    const auto* pFrom = static_cast<const Arithmetic<TIn>*>(pIn);
    auto* pTo = static_cast<Arithmetic<TOut>*>(pOut);
    std::size_t i = 0;
    if constexpr (kRounds<TIn, TOut>)
    {
        i = RoundSamples(pFrom, pTo, nCount);
    }
    // The compiler makes vectors of the target of what is left.
    for (; i < nCount; ++i)
    {
        pTo[i] = ConvertSample<Arithmetic<TIn>, Arithmetic<TOut>>(pFrom[i]);
    }
}

template <class T>
void CopyRow(const void* pIn, void* pOut, std::size_t nCount)
{
    if (nCount != 0)
    {
        std::memmove(pOut, pIn, nCount * sizeof(T));
    }
}

struct RowMaker
{
    template <class TIn, class TOut>
    constexpr RowConversion operator()() const
    {
        if constexpr (std::is_same_v<TIn, TOut>)
        {
            return CopyRow<TIn>;
        }
        else
        {
            return ConvertRow<TIn, TOut>;
        }
    }
};

RowConversion FindRow(std::size_t nIn, std::size_t nOut)
{
    static constexpr auto kRows =
        typedispatch::MakePairTable<typedispatch::StandardTypeList>(RowMaker());
    return kRows[nIn][nOut];
}

}  // namespace HWY_NAMESPACE
}  // namespace kor::filters::kernels
HWY_AFTER_NAMESPACE();

#if HWY_ONCE
namespace kor::filters::kernels
{

HWY_EXPORT(FindRow);

RowConversion FindRowConversion(std::size_t nIn, std::size_t nOut)
{
    return HWY_DYNAMIC_DISPATCH(FindRow)(nIn, nOut);
}

}  // namespace kor::filters::kernels
#endif
