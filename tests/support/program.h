#pragma once

#include <sys/wait.h>

#include <cstdlib>
#include <string>

#include "tests/support/temporarydirectory.h"

namespace kor::test
{

/// What a program left behind.
struct ProgramRun
{
    int mnStatus = -1;  ///< exit status; -1 when it did not exit by itself
    std::string moSaid;
    std::string moComplaint;
};

/// Runs one of the example programs with the words of oArguments, a line for the shell, in which
/// files have to be named in full.
inline ProgramRun RunExample(const std::string& oProgram, const std::string& oArguments)
{
    const TemporaryDirectory oFolder;
    const std::string oCommand = std::string(KOR_EXAMPLES_FOLDER) + "/" + oProgram + " " +
                                 oArguments + " >'" + oFolder.File("out") + "' 2>'" +
                                 oFolder.File("err") + "'";
    const int nStatus = std::system(oCommand.c_str());
    return {WIFEXITED(nStatus) ? WEXITSTATUS(nStatus) : -1, BytesOf(oFolder.File("out")),
            BytesOf(oFolder.File("err"))};
}

}  // namespace kor::test
