#include "processes/qrdfilters/rowbands.h"

#include <gtest/gtest.h>

#include <omp.h>

#include <atomic>
#include <stdexcept>
#include <string>
#include <vector>

#include "platform/system/omp.h"

namespace kor::filters
{
namespace
{

TEST(ForEachRowBand, VisitsEachRowOnceInBandsThatAreNotTooHigh)
{
    for (const std::uint32_t nRows : {0U, 1U, 3U, 4U, 5U, 8U, 9U, 63U, 64U, 127U, 128U, 129U, 513U})
    {
        std::vector<int> vVisits(nRows);
        ForEachRowBand(nRows, 64,
                       [&](std::uint32_t nFirst, std::uint32_t nEnd)
                       {
                           EXPECT_LT(nFirst, nEnd);
                           EXPECT_LE(nEnd - nFirst, 64U);
                           EXPECT_EQ(nFirst % kBandStep, 0U);
                           for (std::uint32_t y = nFirst; y < nEnd; ++y)
                           {
                               ++vVisits[y];
                           }
                       });
        EXPECT_EQ(vVisits, std::vector<int>(nRows, 1));
    }
}

TEST(ForEachRowBand, GivesEachThreadItsShare)
{
    if (OMPGetMaxThreads() < 2)
    {
        GTEST_SKIP() << "one thread alone";
    }
    const OMPThreadCount oTwo(2);
    std::vector<int> vThreads(16, -1);
    ForEachRowBand(16, 64,
                   [&](std::uint32_t nFirst, std::uint32_t nEnd)
                   {
                       EXPECT_EQ(nEnd - nFirst, 8U);
                       vThreads[nFirst] = omp_get_thread_num();
                   });
    EXPECT_EQ(vThreads[0], 0);
    EXPECT_EQ(vThreads[8], 1);
}

TEST(ForEachRowBand, PassesOnWhatABandThrows)
{
    std::atomic<int> nOthers = 0;
    const auto oWork = [&](std::uint32_t nFirst, std::uint32_t)
    {
        if (nFirst == 4)
        {
            throw std::runtime_error("band at 4");
        }
        ++nOthers;
    };
    try
    {
        ForEachRowBand(400, 4, oWork);
        FAIL() << "threw nothing";
    }
    catch (const std::runtime_error& oError)
    {
        EXPECT_EQ(std::string(oError.what()), "band at 4");
    }
    EXPECT_LT(nOthers, 100);
    EXPECT_GE(nOthers, 1);
}

}  // namespace
}  // namespace kor::filters
