#include "platform/datasources/gdal/gdalerrors.h"

#include <cpl_conv.h>

namespace kor::datasources
{

namespace
{

constexpr const char* kJpegOption = "GDAL_ERROR_ON_LIBJPEG_WARNING";

}  // namespace

GdalErrors::GdalErrors()
{
    if (const char* pszFormer = CPLGetThreadLocalConfigOption(kJpegOption, nullptr))
    {
        moFormerJpegOption = pszFormer;
    }
    CPLSetThreadLocalConfigOption(kJpegOption, "TRUE");
    CPLPushErrorHandlerEx(&GdalErrors::Collect, this);
}

GdalErrors::~GdalErrors()
{
    CPLPopErrorHandler();
    CPLSetThreadLocalConfigOption(kJpegOption,
                                  moFormerJpegOption ? moFormerJpegOption->c_str() : nullptr);
}

void CPL_STDCALL GdalErrors::Collect(CPLErr eClass, CPLErrorNum /*nNumber*/, const char* pszText)
{
    auto* poErrors = static_cast<GdalErrors*>(CPLGetErrorHandlerUserData());
    if (eClass != CE_Warning && eClass != CE_Failure && eClass != CE_Fatal)
    {
        return;
    }
    poErrors->mbFailed = poErrors->mbFailed || eClass != CE_Warning;
    std::string& oText = eClass == CE_Warning ? poErrors->moFirstWarning : poErrors->moFirstError;
    if (oText.empty())
    {
        try
        {
            oText = pszText;
        }
        catch (const std::exception&)
        {
            // GDAL calls from C: nothing may be thrown here. The text is lost, mbFailed is not.
        }
    }
}

std::string GdalErrors::GetText() const
{
    if (!moFirstError.empty() || !moFirstWarning.empty())
    {
        return moFirstError.empty() ? moFirstWarning : moFirstError;
    }
    return "GDAL gives no reason";
}

}  // namespace kor::datasources
