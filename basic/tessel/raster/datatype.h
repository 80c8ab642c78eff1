#pragma once

#include <cstddef>
#include <cstdint>

namespace kor
{

using int64 = std::int64_t;
using uint64 = std::uint64_t;

}  // namespace kor

namespace kor::tessel
{

/// Description of one sample: a plain value. All fields zero stands for no type at all.
struct DataType
{
    std::uint32_t mnBits = 0;          ///< bits of one real sample, or of one part of a complex one
    bool mbSigned = false;             ///< true for signed integers and for floating point
    bool mbFloat = false;              ///< true for floating point
    std::uint32_t mnMantissaBits = 0;  ///< mnBits for integers, 23 or 52 for floating point
    std::uint32_t mnExponentBits = 0;  ///< 0 for integers, 8 or 11 for floating point
    bool mbComplex = false;            ///< true when a sample is a pair (real part, imaginary part)

    constexpr DataType() = default;
    constexpr DataType(std::uint32_t nBits, bool bSigned, bool bFloat, std::uint32_t nMantissaBits,
                       std::uint32_t nExponentBits, bool bComplex)
        : mnBits(nBits),
          mbSigned(bSigned),
          mbFloat(bFloat),
          mnMantissaBits(nMantissaBits),
          mnExponentBits(nExponentBits),
          mbComplex(bComplex)
    {
    }

    /// Equal when all six fields are.
    constexpr bool operator==(const DataType&) const = default;

    /// Bytes of one stored sample, both parts of a complex one. A bit takes a byte.
    constexpr std::size_t GetSampleBytes() const
    {
        return static_cast<std::size_t>((mnBits + 7U) >> 3) * (mbComplex ? 2U : 1U);
    }
};

inline constexpr DataType eDT_BIT(1, false, false, 1, 0, false);
inline constexpr DataType eDT_8U(8, false, false, 8, 0, false);
inline constexpr DataType eDT_8S(8, true, false, 8, 0, false);
inline constexpr DataType eDT_16U(16, false, false, 16, 0, false);
inline constexpr DataType eDT_16S(16, true, false, 16, 0, false);
inline constexpr DataType eDT_32U(32, false, false, 32, 0, false);
inline constexpr DataType eDT_32S(32, true, false, 32, 0, false);
inline constexpr DataType eDT_32R(32, true, true, 23, 8, false);
inline constexpr DataType eDT_64U(64, false, false, 64, 0, false);
inline constexpr DataType eDT_64S(64, true, false, 64, 0, false);
inline constexpr DataType eDT_64R(64, true, true, 52, 11, false);
inline constexpr DataType eDT_C16U(16, false, false, 16, 0, true);
inline constexpr DataType eDT_C16S(16, true, false, 16, 0, true);
inline constexpr DataType eDT_C32U(32, false, false, 32, 0, true);
inline constexpr DataType eDT_C32S(32, true, false, 32, 0, true);
inline constexpr DataType eDT_C32R(32, true, true, 23, 8, true);
inline constexpr DataType eDT_C64R(64, true, true, 52, 11, true);

/// The type of the parts of oType: same bits, signedness and kind, not complex, with mantissa and
/// exponent made anew (23 and 8, or 52 and 11, for signed floats of 32 or 64 bits).
constexpr DataType RealPartType(const DataType& oType)
{
    DataType oPart(oType.mnBits, oType.mbSigned, oType.mbFloat, oType.mnBits, 0, false);
    if (oType.mbSigned && oType.mbFloat && oType.mnBits == 32)
    {
        oPart = eDT_32R;
    }
    if (oType.mbSigned && oType.mbFloat && oType.mnBits == 64)
    {
        oPart = eDT_64R;
    }
    return oPart;
}

/// A data type with the small code that switch statements use:
/// 0 8U, 1 8S, 2 16U, 3 16S, 4 32U, 5 32S, 6 32R, 7 64U, 8 64S, 9 64R,
/// 10 C16U, 11 C16S, 12 C32S, 13 C32R, 14 C64R, 15 everything else.
class NativeDataType : public DataType
{
public:
    explicit NativeDataType(const DataType& oType);
    virtual ~NativeDataType() = default;

    std::uint32_t mnCode;
};

}  // namespace kor::tessel
