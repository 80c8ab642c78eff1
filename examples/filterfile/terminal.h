#pragma once

#include <stdexcept>

#include "processes/qrdfilters/parallelio/filteriodriver.h"

namespace kor::examples
{

/// From now on Ctrl-C and SIGTERM ask for an end, once; the second one ends the program at once.
void CatchInterrupts();
/// True when an end was asked for.
bool IsInterrupted();

/// Ends what is under way when that is so.
class Interrupted : public std::runtime_error
{
public:
    Interrupted() : std::runtime_error("interrupted") {}
};

/// Throws Interrupted when an end was asked for.
void EndIfInterrupted();

/// Shows the progress of a run on standard error where that is a terminal, and ends the run when it
/// is asked for.
class TerminalStatus : public parallelio::DefaultUpdateStrategy
{
public:
    ~TerminalStatus() override;
    bool IsCancelled() override { return IsInterrupted(); }
    void SetProgress(float fFraction) override;

private:
    int mnShown = -1;  ///< per cent
};

}  // namespace kor::examples
