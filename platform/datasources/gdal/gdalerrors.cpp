#include "platform/datasources/gdal/gdalerrors.h"

#include <cpl_conv.h>

namespace kor::datasources
{

GdalOption::GdalOption(const char* pszName, const char* pszValue) : mpszName(pszName)
{
    if (const char* pszFormer = CPLGetThreadLocalConfigOption(pszName, nullptr))
    {
        moFormer = pszFormer;
    }
    CPLSetThreadLocalConfigOption(pszName, pszValue);
}

GdalOption::~GdalOption()
{
    CPLSetThreadLocalConfigOption(mpszName, moFormer ? moFormer->c_str() : nullptr);
}

GdalErrors::GdalErrors()
{
    CPLPushErrorHandlerEx(&GdalErrors::Collect, this);
}

GdalErrors::~GdalErrors()
{
    CPLPopErrorHandler();
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
