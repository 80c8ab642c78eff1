#include "platform/system/omp.h"

#include <omp.h>

#include <algorithm>

namespace kor
{

int OMPGetMaxThreads()
{
    return omp_get_max_threads();
}

OMPThreadCount::OMPThreadCount(int nCount) : mnFormerCount(omp_get_max_threads())
{
    omp_set_num_threads(std::clamp(nCount, 1, mnFormerCount));
}

OMPThreadCount::~OMPThreadCount()
{
    omp_set_num_threads(mnFormerCount);
}

// The number of active levels is what omp_get_nested tells and omp_set_nested sets; some run-times
// print a warning when the latter is called.
OMPNested::OMPNested(bool bNested) : mnFormerLevels(omp_get_max_active_levels())
{
    if (!bNested)
    {
        omp_set_max_active_levels(1);
    }
    else if (mnFormerLevels <= 1)
    {
        omp_set_max_active_levels(omp_get_supported_active_levels());
    }
}

OMPNested::~OMPNested()
{
    omp_set_max_active_levels(mnFormerLevels);
}

}  // namespace kor
