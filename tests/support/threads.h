#pragma once

#include <omp.h>

namespace kor::test
{

/// While it lives, parallel regions of this thread have nCount threads, even more than there are
/// processors.
class ThreadCount
{
public:
    explicit ThreadCount(int nCount) : mnFormerCount(omp_get_max_threads())
    {
        omp_set_num_threads(nCount);
    }
    ThreadCount(const ThreadCount&) = delete;
    ThreadCount& operator=(const ThreadCount&) = delete;
    ~ThreadCount() { omp_set_num_threads(mnFormerCount); }

private:
    int mnFormerCount;
};

}  // namespace kor::test
