#include "tests/support/conversionreference.h"

#include <cmath>
#include <cstdint>
#include <cstring>
#include <limits>
#include <sstream>
#include <type_traits>

namespace kor::test
{

namespace
{

using List = typedispatch::StandardTypeList;

/// What floating point is tested against on its way to an integer of 32 bits or less.
struct RoundingLimits
{
    double dfUpperFromFloat;
    double dfUpperFromDouble;
    double dfLower;
    std::int64_t nHighest;
    std::int64_t nLowest;
};

template <class TOut>
constexpr RoundingLimits kRoundingLimits{};
template <>
constexpr RoundingLimits kRoundingLimits<char>{127, 127, -128, 127, -128};
template <>
constexpr RoundingLimits kRoundingLimits<unsigned char>{255, 255, 0, 255, 0};
template <>
constexpr RoundingLimits kRoundingLimits<short>{32767, 32767, -32768, 32767, -32768};
template <>
constexpr RoundingLimits kRoundingLimits<unsigned short>{65535, 65535, 0, 65535, 0};
template <>
constexpr RoundingLimits kRoundingLimits<int>{2147483648.0, 2147483647.0, -2147483648.0, 2147483647,
                                              -2147483648LL};
template <>
constexpr RoundingLimits kRoundingLimits<unsigned int>{4294967296.0, 4294967295.0, 0, 4294967295LL,
                                                       0};

template <class TOut, class TIn>
TOut FromFloatingPoint(TIn x)
{
    if (std::isnan(x))
    {
        return 0;
    }
    if constexpr (std::is_same_v<TOut, int64>)
    {
        return x <= 0 ? 0 : x >= TIn(0x1p63) ? 9223372036854775807 : static_cast<int64>(x);
    }
    else if constexpr (std::is_same_v<TOut, uint64>)
    {
        if (x >= TIn(0x1p64))
        {
            return 0xFFFFFFFFFFFFFFFFU;
        }
        if (x >= TIn(0x1p63))
        {
            return static_cast<uint64>(static_cast<int64>(x - TIn(0x1p63))) | (uint64{1} << 63);
        }
        return x <= 0 ? 0 : static_cast<uint64>(static_cast<int64>(x));
    }
    else
    {
        constexpr const RoundingLimits& oLimits = kRoundingLimits<TOut>;
        const bool bUnsigned = oLimits.nLowest == 0;
        const TIn fHalf = bUnsigned || x >= 0 ? TIn(0.5) : TIn(-0.5);
        const TIn fRounded = x + fHalf;
        const double r = fRounded;
        const double dfUpper =
            sizeof(TIn) == 4 ? oLimits.dfUpperFromFloat : oLimits.dfUpperFromDouble;
        const std::int64_t nCut = r >= dfUpper           ? oLimits.nHighest
                                  : r <= oLimits.dfLower ? oLimits.nLowest
                                                         : static_cast<std::int64_t>(std::trunc(r));
        return static_cast<TOut>(nCut);
    }
}

/// The low bits of an integer.
template <class TOut>
TOut LowBits(std::uint64_t nBits)
{
    TOut nOut;
    const auto nLow = static_cast<std::make_unsigned_t<TOut>>(nBits);
    std::memcpy(&nOut, &nLow, sizeof(TOut));
    return nOut;
}

template <class TOut, class TIn>
TOut FromInteger(TIn x)
{
    if constexpr (std::is_same_v<TIn, uint64>)
    {
        const auto nHighest = static_cast<uint64>(typedispatch::RealDataType<TOut>().mbSigned
                                                      ? (uint64{1} << (sizeof(TOut) * 8 - 1)) - 1
                                                      : ~uint64{0} >> (64 - sizeof(TOut) * 8));
        return LowBits<TOut>(x > nHighest ? nHighest : x);
    }
    else if constexpr (sizeof(TOut) == 8)
    {
        const bool bLost = sizeof(TIn) < 8 && int64{x} < 0;
        return bLost ? TOut(0) : LowBits<TOut>(static_cast<uint64>(int64{x}));
    }
    else
    {
        constexpr const RoundingLimits& oLimits = kRoundingLimits<TOut>;
        const int64 nValue = x;
        if (nValue > oLimits.nHighest)
        {
            return static_cast<TOut>(oLimits.nHighest);
        }
        if (nValue < oLimits.nLowest && sizeof(TIn) < 8)
        {
            return static_cast<TOut>(oLimits.nLowest);
        }
        return LowBits<TOut>(static_cast<uint64>(nValue));
    }
}

template <class TIn, class TOut>
TOut SampleOf(TIn xIn)
{
    using Part = std::conditional_t<std::is_same_v<TIn, char>, signed char, TIn>;
    const auto x = static_cast<Part>(xIn);
    if constexpr (std::is_same_v<TIn, TOut>)
    {
        return xIn;
    }
    else if constexpr (std::is_floating_point_v<TOut>)
    {
        if constexpr (std::is_same_v<TIn, uint64>)
        {
            const auto fSigned = static_cast<TOut>(static_cast<int64>(x));
            return (x >> 63) != 0 ? fSigned + TOut(0x1p64) : fSigned;
        }
        return static_cast<TOut>(x);
    }
    else if constexpr (std::is_floating_point_v<TIn>)
    {
        return FromFloatingPoint<TOut>(x);
    }
    else
    {
        return FromInteger<TOut>(x);
    }
}

/// re * re + im * im, by the compiler's wrapping arithmetic for integers.
template <class TIn, class TOut>
TOut IntensityOf(TIn xRe, TIn xIm)
{
    using Part = std::conditional_t<std::is_same_v<TIn, char>, signed char, TIn>;
    using Sum = std::conditional_t<sizeof(TIn) < 4, int, Part>;
    const auto re = static_cast<Sum>(static_cast<Part>(xRe));
    const auto im = static_cast<Sum>(static_cast<Part>(xIm));
    if constexpr (std::is_integral_v<TIn>)
    {
        Sum nRe = 0;
        Sum nIm = 0;
        Sum nSum = 0;
        static_cast<void>(__builtin_mul_overflow(re, re, &nRe));
        static_cast<void>(__builtin_mul_overflow(im, im, &nIm));
        static_cast<void>(__builtin_add_overflow(nRe, nIm, &nSum));
        if constexpr (std::is_floating_point_v<TOut>)
        {
            return SampleOf<Sum, TOut>(nSum);
        }
        else
        {
            return LowBits<TOut>(static_cast<uint64>(nSum));
        }
    }
    else
    {
        const Sum fSum = re * re + im * im;
        if constexpr (std::is_floating_point_v<TOut>)
        {
            return static_cast<TOut>(fSum);
        }
        else if constexpr (std::is_same_v<TOut, uint64>)
        {
            return FromFloatingPoint<uint64>(fSum);
        }
        else
        {
            const bool bHeld = fSum < Sum(0x1p63);
            return LowBits<TOut>(bHeld ? static_cast<uint64>(fSum) : uint64{1} << 63);
        }
    }
}

/// Samples around every limit of a conversion, and as many random ones of all magnitudes.
template <class T>
std::vector<T> TypedSamples(Random& oRandom)
{
    std::vector<T> vSamples;
    constexpr double kLimits[] = {0,          1,      127,    128,    255,    256,        32767,
                                  32768,      65535,  65536,  0x1p23, 0x1p24, 0x1p31 - 1, 0x1p31,
                                  0x1p32 - 1, 0x1p32, 0x1p52, 0x1p53, 0x1p62, 0x1p63,     0x1p64};
    if constexpr (std::is_floating_point_v<T>)
    {
        using Limits = std::numeric_limits<T>;
        vSamples = {Limits::quiet_NaN(),
                    -Limits::quiet_NaN(),
                    Limits::infinity(),
                    -Limits::infinity(),
                    Limits::max(),
                    Limits::lowest(),
                    Limits::denorm_min(),
                    Limits::min(),
                    T(-0.2),
                    T(-0.7),
                    T(2.5),
                    T(-2.5)};
        for (const double dfLimit : kLimits)
        {
            for (const double dfStep : {-1.5, -1.0, -0.5, 0.0, 0.5, 1.0, 1.5})
            {
                for (const double dfSign : {-1.0, 1.0})
                {
                    const auto x = static_cast<T>(dfSign * (dfLimit + dfStep));
                    vSamples.insert(vSamples.end(), {std::nextafter(x, -Limits::infinity()), x,
                                                     std::nextafter(x, Limits::infinity())});
                }
            }
        }
        for (int i = 0; i < 500; ++i)
        {
            const double dfExponent = std::uniform_real_distribution<double>(-3, 66)(oRandom);
            vSamples.push_back(static_cast<T>(RandomSample<double>(Samples::Ordinary, oRandom) /
                                              1000 * std::exp2(dfExponent)));
        }
    }
    else
    {
        for (const double dfLimit : kLimits)
        {
            const uint64 nLimit = dfLimit == 0x1p64 ? 0 : static_cast<uint64>(dfLimit);
            for (const uint64 nStep : {uint64{0}, uint64{1}, ~uint64{0}})
            {
                vSamples.push_back(LowBits<T>(nLimit + nStep));
                vSamples.push_back(LowBits<T>(0 - nLimit + nStep));
            }
        }
        for (int i = 0; i < 500; ++i)
        {
            vSamples.push_back(LowBits<T>(oRandom() >> (oRandom() % 64)));
        }
    }
    return vSamples;
}

template <class TIn, class TOut, TOut (*pfnConvert)(TIn)>
void ConvertEach(const void* pIn, void* pOut, std::size_t nCount)
{
    for (std::size_t i = 0; i < nCount; ++i)
    {
        static_cast<TOut*>(pOut)[i] = pfnConvert(static_cast<const TIn*>(pIn)[i]);
    }
}

template <class TIn, class TOut, TOut (*pfnConvert)(TIn, TIn)>
void ConvertEachPair(const void* pIn, void* pOut, std::size_t nCount)
{
    const auto* pParts = static_cast<const TIn*>(pIn);
    for (std::size_t k = 0; k < nCount; ++k)
    {
        static_cast<TOut*>(pOut)[k] = pfnConvert(pParts[2 * k], pParts[2 * k + 1]);
    }
}

template <class T>
std::string FirstDifference(const void* pActual, const void* pExpected, std::size_t nCount)
{
    for (std::size_t i = 0; i < nCount; ++i)
    {
        const T xActual = static_cast<const T*>(pActual)[i];
        const T xExpected = static_cast<const T*>(pExpected)[i];
        if (!SameSample(xActual, xExpected))
        {
            std::ostringstream oText;
            oText.precision(17);
            oText << "element " << i << " is " << +xActual << " and not " << +xExpected;
            return oText.str();
        }
    }
    return "";
}

constexpr auto kConversions = typedispatch::MakePairTable<List>(
    []<class TIn, class TOut>() -> Row { return ConvertEach<TIn, TOut, SampleOf<TIn, TOut>>; });

constexpr auto kIntensities = typedispatch::MakePairTable<List>(
    []<class TIn, class TOut>() -> Row
    { return ConvertEachPair<TIn, TOut, IntensityOf<TIn, TOut>>; });

}  // namespace

tessel::DataType ElementType(std::size_t nType)
{
    return typedispatch::VisitType<List>(
        nType, []<class T>() { return typedispatch::RealDataType<T>(); },
        [] { return tessel::DataType(); });
}

tessel::DataType ComplexElementType(std::size_t nType)
{
    tessel::DataType oType = ElementType(nType);
    oType.mbComplex = true;
    return oType;
}

Elements ConversionSamples(std::size_t nType, Random& oRandom)
{
    const auto oMake = [&]<class T>()
    {
        const std::vector<T> vSamples = TypedSamples<T>(oRandom);
        Elements oElements(nType, vSamples.size());
        std::memcpy(oElements.Data(), vSamples.data(), vSamples.size() * sizeof(T));
        return oElements;
    };
    return typedispatch::VisitType<List>(nType, oMake, [] { return Elements(0, 0); });
}

Elements Converted(Row pfnRow, const Elements& oIn, std::size_t nOut, std::size_t nCount)
{
    Elements oOut(nOut, nCount);
    pfnRow(oIn.Data(), oOut.Data(), nCount);
    return oOut;
}

Row ReferenceConversion(std::size_t nIn, std::size_t nOut)
{
    return kConversions[nIn][nOut];
}

Row ReferenceIntensity(std::size_t nIn, std::size_t nOut)
{
    return kIntensities[nIn][nOut];
}

::testing::AssertionResult SameElements(const Elements& oActual, const Elements& oExpected)
{
    if (oActual.Type() != oExpected.Type() || oActual.Size() != oExpected.Size())
    {
        return ::testing::AssertionFailure() << "another type or number of elements";
    }
    const auto oCompare = [&]<class T>()
    { return FirstDifference<T>(oActual.Data(), oExpected.Data(), oActual.Size()); };
    const std::string oDifference = typedispatch::VisitType<List>(
        oActual.Type(), oCompare, [] { return std::string("an unknown type"); });
    return oDifference.empty() ? ::testing::AssertionSuccess()
                               : ::testing::AssertionFailure() << oDifference;
}

}  // namespace kor::test
