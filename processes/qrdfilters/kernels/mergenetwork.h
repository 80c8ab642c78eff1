#pragma once

#include <array>
#include <cstddef>
#include <cstdint>

/// Merging and sorting networks, made at compile time: lists of compare-and-exchange steps that put
/// samples in order without a branch, so that each lane of a vector can sort samples of its own.
///
/// Source   K. E. Batcher, "Sorting networks and their applications", AFIPS Spring Joint Computer
///          Conference 32, 307-314, 1968, in the form for lists of any length of D. E. Knuth, "The
///          Art of Computer Programming" 3, 5.3.4. Steps whose results no one asks for are left
///          out, and of the others the half that no one asks for.
namespace kor::filters::kernels
{

/// One step: the smaller of the two samples goes to nLow, the greater one to nHigh, as far as
/// asked.
struct Exchange
{
    std::uint8_t nLow = 0;
    std::uint8_t nHigh = 0;
    bool bSmaller = true;
    bool bGreater = true;
};

inline constexpr std::size_t kMostPlaces = 64;
inline constexpr std::size_t kMostExchanges = 256;

/// Places of samples, in the order of the samples' ranks.
struct Places
{
    std::array<std::uint8_t, kMostPlaces> anPlace{};
    std::size_t nCount = 0;

    constexpr void Add(std::uint8_t nPlace) { anPlace[nCount++] = nPlace; }
    /// Every second place from nStart on.
    constexpr Places EverySecond(std::size_t nStart) const
    {
        Places oResult;
        for (std::size_t i = nStart; i < nCount; i += 2)
        {
            oResult.Add(anPlace[i]);
        }
        return oResult;
    }
    constexpr Places Range(std::size_t nStart, std::size_t nEnd) const
    {
        Places oResult;
        for (std::size_t i = nStart; i < nEnd; ++i)
        {
            oResult.Add(anPlace[i]);
        }
        return oResult;
    }
};

/// The steps in their order, and where the ranks that were asked for stand afterwards.
struct Network
{
    std::array<Exchange, kMostExchanges> aoExchanges{};
    std::size_t nExchanges = 0;
    Places oResult;

    constexpr void Add(std::uint8_t nLow, std::uint8_t nHigh)
    {
        aoExchanges[nExchanges++] = {nLow, nHigh, true, true};
    }
};

namespace details
{

/// Batcher's odd-even merge of two ordered lists of any length: merges the samples of even rank and
/// those of odd rank by themselves, then exchanges neighbours.
constexpr Places Merge(Network& oNetwork, const Places& oA, const Places& oB)
{
    if (oA.nCount == 0 || oB.nCount == 0)
    {
        return oA.nCount == 0 ? oB : oA;
    }
    Places oResult;
    if (oA.nCount == 1 && oB.nCount == 1)
    {
        oNetwork.Add(oA.anPlace[0], oB.anPlace[0]);
        oResult.Add(oA.anPlace[0]);
        oResult.Add(oB.anPlace[0]);
        return oResult;
    }
    const Places oEven = Merge(oNetwork, oA.EverySecond(0), oB.EverySecond(0));
    const Places oOdd = Merge(oNetwork, oA.EverySecond(1), oB.EverySecond(1));
    oResult.Add(oEven.anPlace[0]);
    for (std::size_t i = 0; i < oOdd.nCount || i + 1 < oEven.nCount; ++i)
    {
        if (i < oOdd.nCount && i + 1 < oEven.nCount)
        {
            oNetwork.Add(oOdd.anPlace[i], oEven.anPlace[i + 1]);
        }
        if (i < oOdd.nCount)
        {
            oResult.Add(oOdd.anPlace[i]);
        }
        if (i + 1 < oEven.nCount)
        {
            oResult.Add(oEven.anPlace[i + 1]);
        }
    }
    return oResult;
}

constexpr Places Sort(Network& oNetwork, const Places& oPlaces)
{
    if (oPlaces.nCount < 2)
    {
        return oPlaces;
    }
    const std::size_t nHalf = (oPlaces.nCount + 1) / 2;
    const Places oFirst = Sort(oNetwork, oPlaces.Range(0, nHalf));
    return Merge(oNetwork, oFirst, Sort(oNetwork, oPlaces.Range(nHalf, oPlaces.nCount)));
}

constexpr Places AllPlaces(std::size_t nCount)
{
    Places oPlaces;
    for (std::size_t i = 0; i < nCount; ++i)
    {
        oPlaces.Add(static_cast<std::uint8_t>(i));
    }
    return oPlaces;
}

/// Keeps of the network what the places in oNetwork.oResult depend on.
constexpr Network Pruned(const Network& oNetwork)
{
    std::array<bool, kMostPlaces> abAsked{};
    for (std::size_t i = 0; i < oNetwork.oResult.nCount; ++i)
    {
        abAsked[oNetwork.oResult.anPlace[i]] = true;
    }
    std::array<Exchange, kMostExchanges> aoKept{};
    std::size_t nKept = 0;
    for (std::size_t i = oNetwork.nExchanges; i-- > 0;)
    {
        Exchange oExchange = oNetwork.aoExchanges[i];
        oExchange.bSmaller = abAsked[oExchange.nLow];
        oExchange.bGreater = abAsked[oExchange.nHigh];
        if (oExchange.bSmaller || oExchange.bGreater)
        {
            abAsked[oExchange.nLow] = abAsked[oExchange.nHigh] = true;
            aoKept[nKept++] = oExchange;
        }
    }
    Network oPruned;
    oPruned.oResult = oNetwork.oResult;
    for (oPruned.nExchanges = 0; oPruned.nExchanges < nKept; ++oPruned.nExchanges)
    {
        oPruned.aoExchanges[oPruned.nExchanges] = aoKept[nKept - 1 - oPruned.nExchanges];
    }
    return oPruned;
}

}  // namespace details

/// Sorts the places 0 to nCount - 1.
constexpr Network SortNetwork(std::size_t nCount)
{
    Network oNetwork;
    oNetwork.oResult = details::Sort(oNetwork, details::AllPlaces(nCount));
    return oNetwork;
}

/// Merges the ordered places 0 to nA - 1 with the ordered nB places behind them and gives the ranks
/// nFirst to nEnd - 1 of their union.
constexpr Network MergeNetwork(std::size_t nA, std::size_t nB, std::size_t nFirst, std::size_t nEnd)
{
    Network oNetwork;
    const Places oPlaces = details::AllPlaces(nA + nB);
    const Places oMerged =
        details::Merge(oNetwork, oPlaces.Range(0, nA), oPlaces.Range(nA, nA + nB));
    oNetwork.oResult = oMerged.Range(nFirst, nEnd);
    return details::Pruned(oNetwork);
}

}  // namespace kor::filters::kernels
