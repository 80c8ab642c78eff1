#include "examples/filterfile/terminal.h"

#include <unistd.h>

#include <atomic>
#include <csignal>
#include <cstdio>
#include <string>

namespace kor::examples
{

namespace
{

std::atomic<bool> bInterrupted = false;
static_assert(std::atomic<bool>::is_always_lock_free, "a signal handler sets it");

extern "C" void NoteInterrupt(int /*nSignal*/)
{
    bInterrupted = true;
}

}  // namespace

void CatchInterrupts()
{
    struct sigaction oAction = {};
    oAction.sa_handler = NoteInterrupt;
    oAction.sa_flags = static_cast<int>(SA_RESTART | SA_RESETHAND);
    sigaction(SIGINT, &oAction, nullptr);
    sigaction(SIGTERM, &oAction, nullptr);
}

bool IsInterrupted()
{
    return bInterrupted;
}

void EndIfInterrupted()
{
    if (IsInterrupted())
    {
        throw Interrupted();
    }
}

TerminalStatus::~TerminalStatus()
{
    if (mnShown >= 0)
    {
        std::fputs("\n", stderr);
    }
}

void TerminalStatus::SetProgress(float fFraction)
{
    const int nPercent = static_cast<int>(fFraction * 100.0F);
    if (nPercent == mnShown || isatty(STDERR_FILENO) == 0)
    {
        return;
    }
    mnShown = nPercent;
    constexpr int kWidth = 50;
    const std::string oBar(static_cast<std::size_t>(nPercent * kWidth / 100), '#');
    std::fprintf(stderr, "\r[%-*s] %3d %%", kWidth, oBar.c_str(), nPercent);
    std::fflush(stderr);
}

}  // namespace kor::examples
