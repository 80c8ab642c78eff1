#include "processes/qrdfilters/requireparameter.h"

#include "platform/exception/exception.h"

namespace kor::filters
{

void RequireParameter(bool bHolds, const char* pszName, const char* pszMessage,
                      const char* pszSource, const std::source_location& oWhere)
{
    if (!bHolds)
    {
        throw ParameterException(pszName, ParameterException::Type::eInvalidValue, "", "",
                                 pszMessage, pszSource, oWhere.function_name(), oWhere.line());
    }
}

}  // namespace kor::filters
