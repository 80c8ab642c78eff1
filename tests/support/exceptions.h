#pragma once

#include <gtest/gtest.h>

#include <string>
#include <typeinfo>

#include "platform/exception/exception.h"

namespace kor::test
{

/// Runs an action that has to throw an ExceptionType or one of its kin, and returns its message.
template <class ExceptionType, class Action>
std::string MessageOf(const Action& oAction)
{
    try
    {
        oAction();
    }
    catch (const ExceptionType& oError)
    {
        return oError.what();
    }
    catch (const std::exception& oError)
    {
        ADD_FAILURE() << "another exception was thrown, " << typeid(oError).name() << ": "
                      << oError.what();
        return std::string();
    }
    ADD_FAILURE() << "nothing was thrown";
    return std::string();
}

}  // namespace kor::test
