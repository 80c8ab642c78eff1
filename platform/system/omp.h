#pragma once

namespace kor
{

/// Number of threads that the next parallel region of this thread would get, at least 1.
int OMPGetMaxThreads();

/// While it lives, parallel regions of this thread have at most nCount threads: as many threads as
/// there is work. A count below 1 means 1. The former number comes back at the end.
class OMPThreadCount
{
public:
    explicit OMPThreadCount(int nCount);
    ~OMPThreadCount();
    OMPThreadCount(const OMPThreadCount&) = delete;
    OMPThreadCount& operator=(const OMPThreadCount&) = delete;

private:
    int mnFormerCount;
};

/// While it lives, a parallel region inside another one gets threads of its own (true) or runs on
/// the thread that meets it (false). The former setting comes back at the end.
class OMPNested
{
public:
    explicit OMPNested(bool bNested);
    ~OMPNested();
    OMPNested(const OMPNested&) = delete;
    OMPNested& operator=(const OMPNested&) = delete;

private:
    int mnFormerLevels;
};

}  // namespace kor
