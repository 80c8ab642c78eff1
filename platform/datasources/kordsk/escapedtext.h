#pragma once

#include <optional>
#include <string>
#include <string_view>

namespace kor::datasources
{

/// Any bytes as a piece of a key=value line: backslash, '=', control characters and bytes that are
/// no UTF-8 become \xHH, all else stays as it is.
std::string Escape(std::string_view oText);

/// The reverse; none where a backslash is not followed by an x and two hexadecimal digits.
std::optional<std::string> Unescape(std::string_view oText);

/// Length in bytes of the well-formed UTF-8 character at the beginning of oText; 0 where there is
/// none (a stray or missing byte, a longer form than needed, a surrogate, above U+10FFFF).
std::size_t Utf8Length(std::string_view oText);

}  // namespace kor::datasources
