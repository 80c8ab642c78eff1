#pragma once

#include <cpl_error.h>

#include <optional>
#include <string>

namespace kor::datasources
{

/// Sets one of GDAL's options on this thread while it lives.
class GdalOption
{
public:
    /// pszName stays valid: a text of the program.
    GdalOption(const char* pszName, const char* pszValue);
    ~GdalOption();
    GdalOption(const GdalOption&) = delete;
    GdalOption& operator=(const GdalOption&) = delete;

private:
    const char* mpszName;
    std::optional<std::string> moFormer;
};

/// While it lives, what GDAL reports on this thread is collected here and not printed, and damage
/// that its JPEG library would pass over is an error. Such objects may nest.
class GdalErrors
{
public:
    GdalErrors();
    ~GdalErrors();
    GdalErrors(const GdalErrors&) = delete;
    GdalErrors& operator=(const GdalErrors&) = delete;

    /// True when an error was reported, whatever GDAL's call returned: a call may go on after one.
    bool Failed() const { return mbFailed; }
    /// The first error, or the first warning where there was none.
    std::string GetText() const;

private:
    static void CPL_STDCALL Collect(CPLErr eClass, CPLErrorNum nNumber, const char* pszText);

    GdalOption moJpegOption{"GDAL_ERROR_ON_LIBJPEG_WARNING", "TRUE"};
    bool mbFailed = false;
    std::string moFirstError;
    std::string moFirstWarning;
};

}  // namespace kor::datasources
