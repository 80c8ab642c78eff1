#pragma once

#include <functional>
#include <string>

namespace kor::examples
{

/// Exit statuses.
inline constexpr int kFailed = 1;
inline constexpr int kMisused = 2;
inline constexpr int kInterrupted = 130;

/// What the main functions of programs that make a file share: runs oJob, which an interrupt may
/// end, and returns the exit status. What oJob throws is told on standard error in the name of the
/// program; when the user ended it, that oOut was not made.
int RunProgram(const std::string& oProgram, const std::string& oOut,
               const std::function<void()>& oJob);

}  // namespace kor::examples
