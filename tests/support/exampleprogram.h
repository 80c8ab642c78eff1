#pragma once

#include <sys/wait.h>

#include <cstdlib>
#include <string>
#include <vector>

#include "tests/support/temporarydirectory.h"

namespace kor::test
{

/// Runs the program that a test of examples/ is about and gives its exit status, -1 when it did not
/// end by itself. What it says goes to the files "out" and "err" of oFolder.
inline int RunExample(const std::vector<std::string>& voArguments,
                      const TemporaryDirectory& oFolder)
{
    std::string oCommand = KOR_EXAMPLE;
    for (const std::string& oArgument : voArguments)
    {
        oCommand += " '" + oArgument + "'";
    }
    oCommand += " >'" + oFolder.File("out") + "' 2>'" + oFolder.File("err") + "'";
    const int nStatus = std::system(oCommand.c_str());
    return WIFEXITED(nStatus) ? WEXITSTATUS(nStatus) : -1;
}

}  // namespace kor::test
