#include "examples/filterfile/program.h"

#include <gtest/gtest.h>

#include <stdexcept>

#include "examples/filterfile/arguments.h"

namespace kor::examples
{
namespace
{

/// Exit status and standard error.
std::pair<int, std::string> RunJob(const std::function<void()>& oJob)
{
    testing::internal::CaptureStderr();
    const int nStatus = RunProgram("sharpen", "out.tif", oJob);
    return {nStatus, testing::internal::GetCapturedStderr()};
}

TEST(RunProgram, JobThatEndsWellIsSilent)
{
    bool bRan = false;
    EXPECT_EQ(RunJob([&] { bRan = true; }), (std::pair<int, std::string>(0, "")));
    EXPECT_TRUE(bRan);
}

TEST(RunProgram, ErrorsAreToldInTheNameOfTheProgram)
{
    EXPECT_EQ(RunJob([] { throw std::runtime_error("the disk is full"); }),
              (std::pair<int, std::string>(1, "sharpen: the disk is full\n")));
    EXPECT_EQ(RunJob([] { throw UsageError("there is no channel 7"); }),
              (std::pair<int, std::string>(2, "sharpen: there is no channel 7\n")));
}

}  // namespace
}  // namespace kor::examples
