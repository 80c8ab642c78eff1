#pragma once

#include <array>
#include <cstddef>
#include <type_traits>

#include "basic/tessel/raster/datatype.h"

namespace kor::typedispatch
{

namespace typeconv::priv
{

/// End of a compile-time list of types.
struct NullDataType
{
};

/// Compile-time list of types, closed by NullDataType.
template <class HeadType, class TailList>
struct TypeList
{
    using Head = HeadType;
    using Tail = TailList;
};

template <class... Types>
struct MakeTypeList
{
    using Type = NullDataType;
};

template <class First, class... Rest>
struct MakeTypeList<First, Rest...>
{
    using Type = TypeList<First, typename MakeTypeList<Rest...>::Type>;
};

}  // namespace typeconv::priv

/// The ten element types, in the order in which every dispatch tries them.
using StandardTypeList =
    typeconv::priv::MakeTypeList<char, unsigned char, short, unsigned short, int, unsigned int,
                                 float, double, int64, uint64>::Type;

/// The data type of a real sample of element type T. Plain char is the signed 8-bit type, whatever
/// the platform's char is.
template <class T>
constexpr tessel::DataType RealDataType()
{
    constexpr auto nBits = static_cast<std::uint32_t>(sizeof(T) * 8);
    constexpr bool bFloat = std::is_floating_point_v<T>;
    static_assert(sizeof(T) <= 8, "T is no element type");
    constexpr bool bSigned = std::is_same_v<T, char> || std::is_signed_v<T>;
    if constexpr (bFloat)
    {
        return sizeof(T) == 4 ? tessel::eDT_32R : tessel::eDT_64R;
    }
    else
    {
        return tessel::DataType(nBits, bSigned, false, nBits, 0, false);
    }
}

/// The data type of a complex sample whose parts are of element type T. Not each has a constant.
template <class T>
constexpr tessel::DataType ComplexDataType()
{
    tessel::DataType oType = RealDataType<T>();
    oType.mbComplex = true;
    return oType;
}

/// Position of the first type of List whose real data type is oType, or with bExtendComplex its
/// complex one; the length of the list where there is none.
template <class List>
constexpr std::size_t FindDataType(const tessel::DataType& oType, bool bExtendComplex)
{
    if constexpr (std::is_same_v<List, typeconv::priv::NullDataType>)
    {
        return 0;
    }
    else
    {
        using Head = typename List::Head;
        if (oType == RealDataType<Head>() || (bExtendComplex && oType == ComplexDataType<Head>()))
        {
            return 0;
        }
        return 1 + FindDataType<typename List::Tail>(oType, bExtendComplex);
    }
}

/// Number of the types in List.
template <class List>
inline constexpr std::size_t kListLength = 1 + kListLength<typename List::Tail>;
template <>
inline constexpr std::size_t kListLength<typeconv::priv::NullDataType> = 0;

/// Calls oVisit<T>() on the type at position nIndex of List and returns what it returns, or
/// oNone() when the list ends before.
template <class List, class Visit, class None>
constexpr auto VisitType(std::size_t nIndex, const Visit& oVisit, const None& oNone)
    -> decltype(oNone())
{
    if constexpr (std::is_same_v<List, typeconv::priv::NullDataType>)
    {
        return oNone();
    }
    else
    {
        if (nIndex == 0)
        {
            return oVisit.template operator()<typename List::Head>();
        }
        return VisitType<typename List::Tail>(nIndex - 1, oVisit, oNone);
    }
}

/// Position of element type T in StandardTypeList.
template <class T>
constexpr std::size_t ElementPosition()
{
    constexpr std::size_t nPosition = FindDataType<StandardTypeList>(RealDataType<T>(), false);
    static_assert(nPosition < kListLength<StandardTypeList>, "T is no element type");
    return nPosition;
}

/// A table with oMake<T1, T2>() at [i][k] for the types at the positions i and k of List.
template <class List, class Make>
constexpr auto MakePairTable(const Make& oMake)
{
    using Head = typename List::Head;
    using Entry = decltype(oMake.template operator()<Head, Head>());
    constexpr std::size_t kLength = kListLength<List>;
    std::array<std::array<Entry, kLength>, kLength> aaoTable{};
    for (std::size_t i = 0; i < kLength * kLength; ++i)
    {
        Entry& oEntry = aaoTable[i / kLength][i % kLength];
        const auto oVisit = [&]<class T1>()
        {
            const auto oFill = [&]<class T2>() { oEntry = oMake.template operator()<T1, T2>(); };
            VisitType<List>(i % kLength, oFill, [] {});
        };
        VisitType<List>(i / kLength, oVisit, [] {});
    }
    return aaoTable;
}

}  // namespace kor::typedispatch
