#pragma once

namespace kor
{

/// The user's language for a message: a look-up in the gettext domain "kor". Returns pszText itself
/// where there is no translation. The caller does not free the result.
const char* _(const char* pszText);

}  // namespace kor
