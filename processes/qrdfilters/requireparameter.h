#pragma once

#include <source_location>

namespace kor::filters
{

/// Throws kor::ParameterException of type eInvalidValue with this parameter name and message unless
/// bHolds. The exception carries the source path of the filter and the function and line of the
/// call.
void RequireParameter(bool bHolds, const char* pszName, const char* pszMessage,
                      const char* pszSource,
                      const std::source_location& oWhere = std::source_location::current());

}  // namespace kor::filters
