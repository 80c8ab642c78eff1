#pragma once

#include <exception>
#include <new>
#include <string>
#include <utility>

#include "platform/exception/exception.h"

namespace kor::datasources
{

/// Runs oAction and turns every error that is not one of the library's own into kor::IOException
/// with the file's name: the block driver carries those alone from one thread to another.
template <class Action>
decltype(auto) Guarded(const std::string& oFile, Action&& oAction)
{
    constexpr const char* kSource = "platform/datasources/guard";
    try
    {
        return std::forward<Action>(oAction)();
    }
    catch (const Exception&)
    {
        throw;
    }
    catch (const std::bad_alloc&)
    {
        throw IOException(oFile + ": out of memory", kSource, __PRETTY_FUNCTION__, __LINE__);
    }
    catch (const std::exception& oError)
    {
        throw IOException(oFile + ": " + oError.what(), kSource, __PRETTY_FUNCTION__, __LINE__);
    }
}

}  // namespace kor::datasources
