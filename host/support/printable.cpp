#include "host/support/printable.h"

#include "host/support/utf8.h"

#include <algorithm>
#include <cstdint>
#include <cstdio>

namespace ovhost
{

namespace
{

struct Range {
    std::uint32_t first;
    std::uint32_t last;
};

/// Characters that a terminal acts on rather than shows. Those that turn the direction of writing
/// can make a name look like another one.
constexpr Range invisible[] = {
    {0x0000, 0x001f}, // control characters
    {0x007f, 0x009f}, //
    {0x061c, 0x061c}, // Arabic letter mark
    {0x200e, 0x200f}, // left-to-right and right-to-left marks
    {0x2028, 0x202e}, // ends of lines and paragraphs, embeddings and overrides of direction
    {0x2066, 0x2069}, // isolates of direction
};

/// Of a well-formed character.
std::uint32_t code_point(std::string_view character)
{
    const auto lead = static_cast<unsigned char>(character.front());
    if (character.size() == 1) {
        return lead;
    }
    std::uint32_t code = lead & (0xffU >> (character.size() + 1));
    for (const char next : character.substr(1)) {
        code = code << 6 | (static_cast<unsigned char>(next) & 0x3fU);
    }
    return code;
}

bool is_invisible(std::uint32_t code)
{
    return std::ranges::any_of(invisible, [code](const Range &range) {
        return range.first <= code && code <= range.last;
    });
}

std::string hexadecimal(const char *format, std::uint32_t code)
{
    char text[12];
    std::snprintf(text, sizeof(text), format, code);
    return text;
}

std::string byte_escape(std::uint32_t byte)
{
    return hexadecimal("\\x%02x", byte);
}

std::string escaped(std::uint32_t code)
{
    switch (code) {
    case '\n':
        return "\\n";
    case '\r':
        return "\\r";
    case '\t':
        return "\\t";
    default:
        return code < 0x80 ? byte_escape(code) : hexadecimal("\\u%04x", code);
    }
}

} // namespace

std::string printable(std::string_view text)
{
    std::string result;
    while (!text.empty()) {
        const std::size_t length = utf8_character_length(text);
        const std::string_view character = text.substr(0, std::max<std::size_t>(length, 1));
        const std::uint32_t code = code_point(character);
        if (length == 0) {
            result += byte_escape(code);
        } else {
            result += is_invisible(code) ? escaped(code) : std::string(character);
        }
        text.remove_prefix(character.size());
    }
    return result;
}

} // namespace ovhost
