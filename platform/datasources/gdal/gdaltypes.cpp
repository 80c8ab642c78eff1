#include "platform/datasources/gdal/gdaltypes.h"

#include <cpl_string.h>
#include <gdal_version.h>

namespace kor::datasources
{

namespace
{

struct TypePair
{
    GDALDataType meGdal;
    tessel::DataType moType;
};

constexpr TypePair kPairs[] = {
    {GDT_Byte, tessel::eDT_8U},       {GDT_UInt16, tessel::eDT_16U},
    {GDT_Int16, tessel::eDT_16S},     {GDT_UInt32, tessel::eDT_32U},
    {GDT_Int32, tessel::eDT_32S},     {GDT_Float32, tessel::eDT_32R},
    {GDT_Float64, tessel::eDT_64R},   {GDT_CInt16, tessel::eDT_C16S},
    {GDT_CInt32, tessel::eDT_C32S},   {GDT_CFloat32, tessel::eDT_C32R},
    {GDT_CFloat64, tessel::eDT_C64R},
#if GDAL_VERSION_NUM >= GDAL_COMPUTE_VERSION(3, 5, 0)
    {GDT_UInt64, tessel::eDT_64U},    {GDT_Int64, tessel::eDT_64S},
#endif
#if GDAL_VERSION_NUM >= GDAL_COMPUTE_VERSION(3, 7, 0)
    {GDT_Int8, tessel::eDT_8S},
#endif
};

constexpr bool kHasInt8 = GDAL_VERSION_NUM >= GDAL_COMPUTE_VERSION(3, 7, 0);

}  // namespace

std::optional<tessel::DataType> TypeOfBand(GDALRasterBandH hBand)
{
    const GDALDataType eGdal = GDALGetRasterDataType(hBand);
    if (!kHasInt8 && eGdal == GDT_Byte)
    {
        const char* pszPixelType = GDALGetMetadataItem(hBand, "PIXELTYPE", "IMAGE_STRUCTURE");
        if (pszPixelType != nullptr && EQUAL(pszPixelType, "SIGNEDBYTE"))
        {
            return tessel::eDT_8S;
        }
    }
    for (const TypePair& oPair : kPairs)
    {
        if (oPair.meGdal == eGdal)
        {
            return oPair.moType;
        }
    }
    return std::nullopt;
}

GDALDataType GdalTypeOf(const tessel::DataType& oType)
{
    if (NeedsSignedByteOption(oType))
    {
        return GDT_Byte;
    }
    for (const TypePair& oPair : kPairs)
    {
        if (oPair.moType == oType)
        {
            return oPair.meGdal;
        }
    }
    return GDT_Unknown;
}

bool NeedsSignedByteOption(const tessel::DataType& oType)
{
    return !kHasInt8 && oType == tessel::eDT_8S;
}

}  // namespace kor::datasources
