#include "platform/system/memory.h"

#include <unistd.h>

#include <cstdio>

#include "platform/exception/exception.h"

namespace kor
{

namespace
{

std::string GibiBytes(double dfBytes)
{
    char acText[64];
    std::snprintf(acText, sizeof(acText), "%.4g GiB", dfBytes / (1024.0 * 1024.0 * 1024.0));
    return acText;
}

}  // namespace

double GetPhysicalMemory()
{
    return static_cast<double>(sysconf(_SC_PHYS_PAGES)) *
           static_cast<double>(sysconf(_SC_PAGESIZE));
}

void RequireMemory(double dfBytes, const std::string& oPurpose)
{
    const double dfPhysical = GetPhysicalMemory();
    if (!(dfBytes <= dfPhysical))
    {
        throw Exception(oPurpose + " needs " + GibiBytes(dfBytes) + " of memory; the machine has " +
                            GibiBytes(dfPhysical),
                        "platform/system/memory", __PRETTY_FUNCTION__, __LINE__);
    }
}

}  // namespace kor
