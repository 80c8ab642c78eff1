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

OMPNested::OMPNested(bool bNested)
    : mnFormerNested(omp_get_nested()), mnFormerLevels(omp_get_max_active_levels())
{
    omp_set_nested(bNested ? 1 : 0);
}

OMPNested::~OMPNested()
{
    omp_set_nested(mnFormerNested);
    omp_set_max_active_levels(mnFormerLevels);
}

}  // namespace kor
