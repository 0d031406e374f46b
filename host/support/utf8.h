#pragma once
// Well-formed UTF-8, for whoever checks or quotes a text.

#include <cstddef>
#include <string_view>

namespace ovhost
{

/// Length in bytes of the character at the front of the text; 0 when there is none: the text is
/// empty, or starts with a byte sequence that is cut short, longer than it need be, a surrogate or
/// beyond U+10FFFF.
[[nodiscard]] std::size_t utf8_character_length(std::string_view text);

[[nodiscard]] bool is_utf8(std::string_view text);

} // namespace ovhost
