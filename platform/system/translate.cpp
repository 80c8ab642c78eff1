#include "platform/system/translate.h"

#include <libintl.h>

namespace kor
{

const char* _(const char* pszText)
{
    return dgettext("kor", pszText);
}

}  // namespace kor
