#include "host/support/printable.h"

#include <cstdio>

namespace ovhost
{

namespace
{

std::string escaped(unsigned char character)
{
    switch (character) {
    case '\n':
        return "\\n";
    case '\r':
        return "\\r";
    case '\t':
        return "\\t";
    default:
        break;
    }
    char code[5];
    std::snprintf(code, sizeof(code), "\\x%02x", character);
    return code;
}

/// Whether a control character beyond ASCII, U+0080 to U+009F, begins at `at`.
bool is_wide_control(std::string_view text, std::size_t at)
{
    return text[at] == '\xc2' && at + 1 < text.size() &&
           (static_cast<unsigned char>(text[at + 1]) & 0xe0) == 0x80;
}

} // namespace

std::string printable(std::string_view text)
{
    std::string result;
    for (std::size_t at = 0; at < text.size(); ++at) {
        const auto byte = static_cast<unsigned char>(text[at]);
        if (is_wide_control(text, at))
            result += "\\u00" + escaped(static_cast<unsigned char>(text[++at])).substr(2);
        else if (byte < 0x20 || byte == 0x7f)
            result += escaped(byte);
        else
            result += text[at];
    }
    return result;
}

} // namespace ovhost
