#include "examples/filterfile/program.h"

#include <iostream>

#include "examples/filterfile/arguments.h"
#include "examples/filterfile/terminal.h"

namespace kor::examples
{

int RunProgram(const std::string& oProgram, const std::string& oOut,
               const std::function<void()>& oJob)
{
    try
    {
        CatchInterrupts();
        oJob();
        return 0;
    }
    catch (const UsageError& oError)
    {
        std::cerr << oProgram << ": " << oError.what() << '\n';
        return kMisused;
    }
    catch (const std::exception& oError)
    {
        if (IsInterrupted())  // whatever became of that on its way here
        {
            std::cerr << oProgram << ": interrupted; " << oOut << " was not made\n";
            return kInterrupted;
        }
        std::cerr << oProgram << ": " << oError.what() << '\n';
        return kFailed;
    }
}

}  // namespace kor::examples
