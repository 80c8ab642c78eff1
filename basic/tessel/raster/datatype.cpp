#include "basic/tessel/raster/datatype.h"

namespace kor::tessel
{

namespace
{

constexpr std::uint32_t kNoCode = 15;

std::uint32_t RealCode(const DataType& oType)
{
    if (oType.mnBits == 16)
    {
        return oType.mbSigned ? 3 : 2;
    }
    if (oType.mbFloat && !oType.mbSigned)
    {
        return kNoCode;
    }
    if (oType.mnBits == 32)
    {
        return oType.mbFloat ? 6 : (oType.mbSigned ? 5 : 4);
    }
    if (oType.mnBits == 64)
    {
        return oType.mbFloat ? 9 : (oType.mbSigned ? 8 : 7);
    }
    return kNoCode;
}

std::uint32_t ComplexCode(const DataType& oType)
{
    if (oType.mnBits == 16)
    {
        return oType.mbSigned ? 11 : 10;
    }
    if (!oType.mbSigned)
    {
        return kNoCode;
    }
    if (oType.mnBits == 32)
    {
        return oType.mbFloat ? 13 : 12;
    }
    return oType.mnBits == 64 && oType.mbFloat ? 14 : kNoCode;
}

std::uint32_t CodeOf(const DataType& oType)
{
    // Meant: for 8 bits the sign alone decides, a complex flag changes nothing.
    if (oType.mnBits == 8)
    {
        return oType.mbSigned ? 1 : 0;
    }
    return oType.mbComplex ? ComplexCode(oType) : RealCode(oType);
}

}  // namespace

NativeDataType::NativeDataType(const DataType& oType) : DataType(oType), mnCode(CodeOf(oType)) {}

}  // namespace kor::tessel
