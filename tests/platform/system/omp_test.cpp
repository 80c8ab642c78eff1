#include "platform/system/omp.h"

#include <gtest/gtest.h>
#include <omp.h>

namespace kor
{
namespace
{

/// Three threads and no nested regions while a test runs, whatever the machine has.
class Omp : public ::testing::Test
{
protected:
    void SetUp() override
    {
        omp_set_num_threads(3);
        omp_set_max_active_levels(1);
    }
    void TearDown() override
    {
        omp_set_num_threads(mnThreads);
        omp_set_max_active_levels(mnLevels);
    }

private:
    int mnThreads = omp_get_max_threads();
    int mnLevels = omp_get_max_active_levels();
};

class OmpThreadCount : public Omp
{
};

class OmpNested : public Omp
{
};

/// Threads of a region of two inside a region of two.
int InnerTeam()
{
    int nInner = 0;
#pragma omp parallel num_threads(2)
    {
#pragma omp parallel num_threads(2)
        {
            if (omp_get_thread_num() == 0 && omp_get_ancestor_thread_num(1) == 0)
            {
                nInner = omp_get_num_threads();
            }
        }
    }
    return nInner;
}

TEST_F(OmpThreadCount, LimitsTheThreadsWhileItLives)
{
    EXPECT_EQ(OMPGetMaxThreads(), 3);
    {
        const OMPThreadCount oCount(2);
        EXPECT_EQ(OMPGetMaxThreads(), 2);
        int nTeam = 0;
#pragma omp parallel
        {
#pragma omp single
            nTeam = omp_get_num_threads();
        }
        EXPECT_EQ(nTeam, 2);
    }
    EXPECT_EQ(OMPGetMaxThreads(), 3);
}

TEST_F(OmpThreadCount, AsksForNoMoreThreadsThanThereWere)
{
    {
        const OMPThreadCount oCount(1000);
        EXPECT_EQ(OMPGetMaxThreads(), 3);
    }
    EXPECT_EQ(OMPGetMaxThreads(), 3);
}

TEST_F(OmpThreadCount, TakesACountBelowOneForOne)
{
    for (const int nCount : {0, -5})
    {
        const OMPThreadCount oCount(nCount);
        EXPECT_EQ(OMPGetMaxThreads(), 1);
    }
    EXPECT_EQ(OMPGetMaxThreads(), 3);
}

TEST_F(OmpThreadCount, RestoresStepByStep)
{
    const OMPThreadCount oOuter(2);
    {
        const OMPThreadCount oInner(1);
        EXPECT_EQ(OMPGetMaxThreads(), 1);
    }
    EXPECT_EQ(OMPGetMaxThreads(), 2);
}

TEST_F(OmpNested, GivesInnerRegionsThreadsWhileItLives)
{
    EXPECT_EQ(InnerTeam(), 1);
    {
        const OMPNested oNested(true);
        EXPECT_EQ(InnerTeam(), 2);
    }
    EXPECT_EQ(InnerTeam(), 1);
    EXPECT_EQ(omp_get_max_active_levels(), 1);
}

TEST_F(OmpNested, TakesThemAwayWhileItLives)
{
    omp_set_max_active_levels(2);
    EXPECT_EQ(InnerTeam(), 2);
    {
        const OMPNested oNested(false);
        EXPECT_EQ(InnerTeam(), 1);
    }
    EXPECT_EQ(InnerTeam(), 2);
    EXPECT_EQ(omp_get_max_active_levels(), 2);
}

TEST_F(OmpNested, KeepsANumberOfLevelsThatWasChosen)
{
    omp_set_max_active_levels(2);
    const OMPNested oNested(true);
    EXPECT_EQ(omp_get_max_active_levels(), 2);
}

}  // namespace
}  // namespace kor
